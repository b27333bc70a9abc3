// Conversions between Lua values and native objects: variables, class parameters, type
// names and the wide conversion rings.
#include "lua/mluabind/impl/Params.h"

#include "diag/Assert.h"
#include "misc/Unicode.h"

#include <cxxabi.h>

#include <cstdlib>
#include <cstring>

namespace mluabind::i {

LuaCustomVariable* CreateVariable(CHost& host, lua_State* L, GenericClass* cls, void* object, bool owned, bool is_const)
{
    auto* variable = static_cast<LuaCustomVariable*>(lua_newuserdata(L, sizeof(LuaCustomVariable)));
    variable->Object = object;
    variable->Class = cls;
    variable->IsOwned = owned ? 1 : 0;
    variable->IsConst = is_const ? 1 : 0;
    variable->Tag = kVariableTag;
    variable->MethodReads = 0;
    lua_rawgeti(L, LUA_REGISTRYINDEX, cls->m_MetatableRef);
    if (!lua_setmetatable(L, -2))
        host.Report("can't set metatable!\n");
    return variable;
}

std::string TypeName(const std::type_info& type)
{
    int status = 0;
    char* demangled = abi::__cxa_demangle(type.name(), nullptr, nullptr, &status);
    std::string name = status == 0 && demangled ? demangled : type.name();
    std::free(demangled);
    return name;
}

int MatchClassParam(CHost& host, lua_State* L, int index, bool allow_implicit, const std::type_info& type,
                    bool mutable_ref, bool pointer)
{
    if (pointer && lua_type(L, index) == LUA_TNIL)
        return 2;
    if (LuaCustomVariable* variable = ToVariable(L, index)) {
        // A const object can't bind to T& or T*; a collected one binds to nothing.
        if (variable->Object && !(mutable_ref && variable->IsConst)) {
            if (variable->Class->IsType(type))
                return 1;
            if (variable->Class->CanUpcast(type))
                return 2;
        }
    }
    if (!allow_implicit)
        return NoMatch;
    GenericClass* cls = host.FindClass(type);
    if (!cls) {
        host.Report("ParameterMatcherForClasses::MatchParam: panic - can't find generic class for '%s'.",
                    TypeName(type).c_str());
        return NoMatch;
    }
    return cls->FindImplicitConstructor(host, L, index) ? 3 : NoMatch;
}

bool ExtractClassParam(CHost& host, lua_State* L, int index, const std::type_info& type, bool mutable_ref,
                       bool pointer, void*& out)
{
    if (pointer && lua_type(L, index) == LUA_TNIL) {
        out = nullptr;
        return true;
    }
    int score = MatchClassParam(host, L, index, true, type, mutable_ref, pointer);
    if (score >= NoMatch) {
        host.Report("PM::ExtractParam: panic - MLuaBind internal error: trying to extract an unconvertable parameter!");
        return false;
    }
    if (score == 3) {
        GenericClass* cls = host.FindClass(type);
        if (!cls) {
            host.Report("PM::ExtractParam: panic - can't find generic class for '%s'.", TypeName(type).c_str());
            return false;
        }
        out = cls->ConstructObjectFrom(host, L, index);
        return out != nullptr;
    }
    LuaCustomVariable* variable = ToVariable(L, index);
    if (!variable) {
        host.Report("PM::ExtractParam: panic - CPP object is not a userdata!\n");
        return false;
    }
    out = variable->Class->Upcast(host, type, variable->Object);
    if (!out) {
        host.Report("PM::ExtractParam: panic - MLuaBind internal error: trying to extract an unconvertable parameter!");
        return false;
    }
    return true;
}

void AppendClassName(CHost& host, std::string& text, const std::type_info& type, bool is_const, char suffix)
{
    if (is_const)
        text += "const ";
    GenericClass* cls = host.FindClass(type);
    text += cls ? cls->FullName : std::string("unknown type");
    if (suffix)
        text += suffix;
}

namespace {

constexpr int RingSize = 8;
constexpr size_t RingBufferSize = WideRingCapacity;
// The text converter takes pieces whose UTF-8 stays within its limit: up to three bytes a unit.
constexpr size_t NarrowPieceSize = ox::misc::kMaxConvertLength / 3;

char16_t g_WideRing[RingSize][RingBufferSize];
// Narrow results have no length limit: each slot holds its text.
std::string g_NarrowRing[RingSize];
int g_WideNext = 0;
int g_NarrowNext = 0;

} // namespace

const char16_t* NarrowToWideRing(const char* text, size_t length)
{
    if (!text)
        return nullptr;
    OX_ASSERT(length < RingBufferSize);
    if (length >= RingBufferSize)
        length = RingBufferSize - 1;
    char16_t* buffer = g_WideRing[g_WideNext];
    g_WideNext = (g_WideNext + 1) % RingSize;
    // Plain ASCII widens in place; anything else goes through the codec.
    size_t count = 0;
    while (count < length && static_cast<unsigned char>(text[count]) < 0x80) {
        buffer[count] = static_cast<unsigned char>(text[count]);
        ++count;
    }
    if (count < length) {
        ox::wstring wide = ox::misc::ConvertToWide(std::string_view(text, length));
        count = std::min(wide.size(), RingBufferSize - 1);
        std::memcpy(buffer, wide.data(), count * sizeof(char16_t));
    }
    buffer[count] = 0;
    return buffer;
}

void ReportLongWideText(CHost& host, size_t length)
{
    host.Report("PM::ExtractParam: error - a text of %zu bytes is too long for a wide parameter (at most %zu).\n",
                length, WideRingCapacity - 1);
}

const char* WideToNarrowRing(const char16_t* text)
{
    if (!text)
        return nullptr;
    std::string& slot = g_NarrowRing[g_NarrowNext];
    g_NarrowNext = (g_NarrowNext + 1) % RingSize;
    // Plain ASCII narrows into the slot's own buffer; anything else goes through the codec.
    slot.clear();
    size_t ascii = 0;
    while (text[ascii] && text[ascii] < 0x80)
        slot.push_back(static_cast<char>(text[ascii++]));
    if (!text[ascii])
        return slot.c_str();
    std::string narrow;
    std::u16string_view rest(text, ox::misc::WideLength(text));
    while (!rest.empty()) {
        size_t count = std::min(rest.size(), NarrowPieceSize);
        // A pair of surrogates stays in one piece.
        if (count < rest.size() && rest[count - 1] >= 0xD800 && rest[count - 1] <= 0xDBFF)
            --count;
        narrow += ox::misc::ConvertToNarrow(rest.substr(0, count));
        rest.remove_prefix(count);
    }
    slot = std::move(narrow);
    return slot.c_str();
}

int PushPointer(CHost& host, lua_State* L, GenericClass* cls, const std::type_info& type, void* object, bool is_const)
{
    if (!object) {
        lua_pushnil(L);
        return 1;
    }
    if (!cls) {
        host.Report("CreateCustomLuaVariable<ByPtr> can't find GenericClass for %s!\n", TypeName(type).c_str());
        return 0;
    }
    CreateVariable(host, L, cls, object, false, is_const);
    return 1;
}

void ReportNoClassByVal(CHost& host, const std::type_info& type)
{
    host.Report("CreateCustomLuaVariable<ByVal> can't find GenericClass for %s!\n", TypeName(type).c_str());
}

} // namespace mluabind::i
