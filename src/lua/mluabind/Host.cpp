// The binding host: registry, declaration arena, publication into Lua, the host stack.
#include "lua/mluabind/Host.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "lua/mluabind/Binding.h"
#include "lua/mluabind/impl/Dispatch.h"
#include "misc/Unicode.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace mluabind {

namespace {

// Changes with every registry change of any host, and differs between hosts.
uint64_t g_StampCounter = 0;

// Key of the host in the Lua registry.
char g_HostKey;

constexpr const char* kTagKey = "__MLUABIND_LUANAMESPACEDESCRIPTIONTAG";
constexpr const char* kMetatableStorage = "__MLUABIND_LUAOPERATORCLOSURESSTORAGE";

// Which host a Lua callback belongs to; native code pushes around each entry into Lua.
struct CurrentHostStack {
    static constexpr int MaxSize = 32;
    CHost* Items[MaxSize] = {};
    int Top = -1;

    bool Empty() const { return Top < 0; }
    void Push(CHost* host)
    {
        OX_ASSERT(Top>=-1 && Top<MaxSize-1);
        if (Top < MaxSize - 1)
            Items[++Top] = host;
    }
    void Pop()
    {
        OX_ASSERT(Top>-1);
        if (Top > -1)
            --Top;
    }
    CHost* Last() const
    {
        OX_ASSERT(!Empty());
        return Empty() ? nullptr : Items[Top];
    }
};
CurrentHostStack g_CurrentHosts;

int AtPanic(lua_State* L)
{
    const char* text = lua_tostring(L, -1);
    fprintf(stderr, "PANIC: unprotected error in call to Lua API (%s)\n", text ? text : "?");
    return 0;
}

} // namespace

CHost* CHost::m_CurrentBindingHost = nullptr;

// Declarations come from chunks of 32,768 bytes and are destroyed in place, last first.
struct i::DeclarationArena {
    static constexpr size_t ChunkSize = 32768;
    static constexpr size_t MaxDeclaration = 32764;

    std::vector<char*> Chunks;
    size_t Used = ChunkSize;
    std::vector<std::pair<void*, void (*)(void*)>> Objects;

    void* Allocate(size_t size, void (*destroy)(void*))
    {
        OX_ASSERT(size <= MaxDeclaration);
        size = (size + 15) & ~size_t(15);
        void* memory;
        if (size > ChunkSize) {
            // Too big for a chunk: it gets one of its own.
            Chunks.push_back(static_cast<char*>(std::aligned_alloc(16, size)));
            memory = Chunks.back();
        } else {
            if (Used + size > ChunkSize) {
                Chunks.push_back(static_cast<char*>(std::aligned_alloc(16, ChunkSize)));
                Used = 0;
            }
            memory = Chunks.back() + Used;
            Used += size;
        }
        if (destroy)
            Objects.emplace_back(memory, destroy);
        return memory;
    }

    ~DeclarationArena()
    {
        for (auto it = Objects.rbegin(); it != Objects.rend(); ++it)
            it->second(it->first);
        for (char* chunk : Chunks)
            std::free(chunk);
    }
};

CHost::CHost(lua_State* state, bool owns_state)
    : L(state), m_DeclarationArena(new i::DeclarationArena), m_OwnsState(owns_state), m_Stamp(++g_StampCounter)
{
    m_Temporaries.reserve(16);
    lua_atpanic(L, &AtPanic);
    lua_pushlightuserdata(L, &g_HostKey);
    lua_pushlightuserdata(L, this);
    lua_rawset(L, LUA_REGISTRYINDEX);
    RegisterHostFunctions();
}

CHost::~CHost()
{
    if (m_OwnsState && L)
        lua_close(L);
    L = nullptr;
    ReleaseTemporaries(0);
    if (m_CurrentBindingHost == this)
        m_CurrentBindingHost = nullptr;
    delete m_DeclarationArena;
}

CHost* CHost::FromState(lua_State* state)
{
    lua_pushlightuserdata(state, &g_HostKey);
    lua_rawget(state, LUA_REGISTRYINDEX);
    auto* host = static_cast<CHost*>(lua_touserdata(state, -1));
    lua_pop(state, 1);
    return host;
}

void CHost::ReportError(const char* format, ...)
{
    char buffer[4096];
    va_list args;
    va_start(args, format);
    vsnprintf(buffer, sizeof(buffer), format, args);
    va_end(args);
    if (m_Frame) {
        if (!m_Frame->Raise) {
            m_Frame->Raise = true;
            m_Frame->Message = buffer;
        }
    } else {
        // No Lua call to unwind into: the failure can only be logged.
        OX_LOG("lua", ox::diag::LogError, "%s", buffer);
    }
}

void CHost::Report(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    std::string text = ox::misc::VFormat(format, args);
    va_end(args);
    ReportError("%s", text.c_str());
}

void CHost::ReleaseTemporaries(size_t depth)
{
    while (m_Temporaries.size() > depth) {
        auto [object, destroy] = m_Temporaries.back();
        m_Temporaries.pop_back();
        destroy(object);
    }
}

void CHost::BeginBinding()
{
    OX_ASSERT(m_CurrentBindingHost == 0);
    m_CurrentBindingHost = this;
    PushCurrentHost(this);
}

void CHost::EndBinding()
{
    OX_ASSERT(m_CurrentBindingHost == this);
    m_CurrentBindingHost = nullptr;
    PopCurrentHost();
}

void* CHost::AllocateDeclaration(size_t size, void (*destroy)(void*))
{
    void* ptr = m_DeclarationArena->Allocate(size, destroy);
    OX_ASSERT(ptr != 0);
    return ptr;
}

void* i::AllocateForDeclaration(size_t size, void (*destroy)(void*))
{
    CHost* host = CHost::GetCurrentBindingHost();
    OX_ASSERT(CHost::GetCurrentBindingHost() != 0);
    if (host)
        return host->AllocateDeclaration(size, destroy);
    // Declared outside declaration mode: kept for the whole run.
    static DeclarationArena* orphans = new DeclarationArena;
    return orphans->Allocate(size, nullptr);
}

void CHost::PushCurrentHost(CHost* host) { g_CurrentHosts.Push(host); }

void CHost::PopCurrentHost() { g_CurrentHosts.Pop(); }

CHost* CHost::GetCurrentHost() { return g_CurrentHosts.Last(); }

i::GenericClass* CHost::FindClass(const std::type_info& type) const
{
    auto it = m_ClassesByType.find(std::type_index(type));
    return it == m_ClassesByType.end() ? nullptr : it->second;
}

i::GenericClass* CHost::FindClassByName(const std::string& name) const
{
    auto it = m_ClassesByName.find(name);
    return it == m_ClassesByName.end() ? nullptr : it->second;
}

const std::vector<i::GenericFunction*>* CHost::FindFunctions(const std::string& name) const
{
    auto it = m_FunctionsByName.find(name);
    return it == m_FunctionsByName.end() ? nullptr : &it->second;
}

// --- publication ---

void CHost::Bind(const Namespace& ns)
{
    int top = lua_gettop(L);
    lua_checkstack(L, 64);
    for (i::GenericClass* cls : ns.Classes())
        ExportClass(cls, LUA_GLOBALSINDEX, cls->FullName.c_str());
    for (i::GenericFunction* function : ns.Functions())
        ExportFunction(function, LUA_GLOBALSINDEX, function->FullName.c_str());
    for (i::GenericConstant* constant : ns.Constants())
        ExportConstant(constant, LUA_GLOBALSINDEX, constant->FullName.c_str());
    lua_settop(L, top);
}

// Walks a dotted name down nested tables (made where missing) and calls `leaf` with the
// innermost table and the last segment.
template <class Item, class Fn>
void CHost::ExportDotted(Item* item, int table, const char* name, Fn&& leaf)
{
    if (table < 0 && table > LUA_REGISTRYINDEX)
        table = lua_gettop(L) + table + 1;
    const char* dot = std::strchr(name, '.');
    lua_checkstack(L, 16);
    if (!dot) {
        leaf(item, table, name);
        return;
    }
    lua_pushlstring(L, name, dot - name);
    lua_rawget(L, table);
    if (!lua_istable(L, -1)) {
        lua_pop(L, 1);
        lua_newtable(L);
    }
    int inner = lua_gettop(L);
    ExportDotted(item, inner, dot + 1, leaf);
    lua_pushlstring(L, name, dot - name);
    lua_pushvalue(L, inner);
    lua_rawset(L, table);
    lua_settop(L, inner - 1);
}

namespace {

// Stores the constants of a class, then those of its bases, into the table on top.
void CopyConstants(CHost& host, lua_State* L, i::GenericClass* cls, int table, int depth)
{
    if (depth > 32)
        return;
    for (auto& [name, constant] : cls->m_Constants) {
        lua_pushstring(L, name);
        constant->Push(host, L);
        lua_rawset(L, table);
    }
    for (auto& [type, adapter] : cls->m_Adapters) {
        if (!adapter->IsInheritance())
            continue;
        if (i::GenericClass* base = adapter->GetTargetGenericClass(host))
            CopyConstants(host, L, base, table, depth + 1);
    }
}

} // namespace

void CHost::CreateMetatable(i::GenericClass* cls)
{
    lua_newtable(L);
    int mt = lua_gettop(L);
    lua_pushcfunction(L, cls->m_GCFunction);
    lua_setfield(L, mt, "__gc");
    lua_pushlightuserdata(L, this);
    lua_newtable(L); // what names stand for, filled as scripts read them
    lua_pushcclosure(L, &i::MetaOperatorIndex, 2);
    lua_setfield(L, mt, "__index");
    lua_pushlightuserdata(L, this);
    lua_pushcclosure(L, &i::MetaOperatorNewIndex, 1);
    lua_setfield(L, mt, "__newindex");
    for (auto& [index, method] : cls->m_Operators) {
        lua_pushlightuserdata(L, this);
        lua_pushnumber(L, index);
        lua_pushcclosure(L, &i::LuaOperatorCallProxieFunction, 2);
        lua_setfield(L, mt, i::OperatorEventName(index));
    }
    ProtectMetatable(mt, cls->FullName.c_str());
    int face = lua_gettop(L);
    // Script-visible storage by full name: the face, as getmetatable gives it.
    lua_pushstring(L, kMetatableStorage);
    lua_rawget(L, LUA_GLOBALSINDEX);
    if (!lua_istable(L, -1)) {
        lua_pop(L, 1);
        lua_newtable(L);
        lua_pushstring(L, kMetatableStorage);
        lua_pushvalue(L, -2);
        lua_rawset(L, LUA_GLOBALSINDEX);
    }
    lua_pushstring(L, cls->FullName.c_str());
    lua_pushvalue(L, face);
    lua_rawset(L, -3);
    lua_settop(L, mt);
    if (cls->m_MetatableRef != LUA_NOREF)
        luaL_unref(L, LUA_REGISTRYINDEX, cls->m_MetatableRef);
    cls->m_MetatableRef = luaL_ref(L, LUA_REGISTRYINDEX);
}

void CHost::ProtectMetatable(int index, const char* name)
{
    if (index < 0 && index > LUA_REGISTRYINDEX)
        index = lua_gettop(L) + index + 1;
    lua_checkstack(L, 8);
    lua_newtable(L);
    lua_createtable(L, 0, 3);
    lua_pushvalue(L, index);
    lua_setfield(L, -2, "__index");
    lua_pushlightuserdata(L, this);
    lua_pushstring(L, name);
    lua_pushcclosure(L, &i::MetaOperatorReadOnly, 2);
    lua_setfield(L, -2, "__newindex");
    lua_pushboolean(L, 0);
    lua_setfield(L, -2, "__metatable");
    lua_setmetatable(L, -2);
    lua_pushvalue(L, -1);
    lua_setfield(L, index, "__metatable");
}

void CHost::ExportClass(i::GenericClass* cls, int table, const char* name)
{
    ExportDotted(cls, table, name, [this](i::GenericClass* c, int parent, const char* short_name) {
        m_ClassesByType[std::type_index(*c->m_Type)] = c;
        m_Stamp = ++g_StampCounter;
        c->ComputeUpcastPaths(*this);
        m_ClassesByName[c->FullName] = c;
        CreateMetatable(c);
        if (!*short_name)
            return;
        lua_pushstring(L, short_name);
        lua_rawget(L, parent);
        if (!lua_istable(L, -1)) {
            lua_pop(L, 1);
            lua_newtable(L);
        }
        int t = lua_gettop(L);
        lua_pushstring(L, kTagKey);
        lua_pushstring(L, c->FullName.c_str());
        lua_rawset(L, t);
        if (!lua_getmetatable(L, t))
            lua_newtable(L);
        if (!c->m_Constructors.empty()) {
            lua_pushlightuserdata(L, this);
            lua_pushlightuserdata(L, c);
            lua_pushcclosure(L, &i::ConstructorCallDispatcher, 2);
        } else {
            lua_pushnil(L);
        }
        lua_setfield(L, -2, "__call");
        lua_setmetatable(L, t);
        CopyConstants(*this, L, c, t, 0);
        lua_pushstring(L, short_name);
        lua_pushvalue(L, t);
        lua_rawset(L, parent);
        lua_settop(L, t - 1);
    });
}

void CHost::ExportFunction(i::GenericFunction* function, int table, const char* name)
{
    ExportDotted(function, table, name, [this](i::GenericFunction* f, int parent, const char* short_name) {
        // An overload with the same parameter types replaces the earlier one, so that
        // binding a vocabulary again doesn't make every call ambiguous.
        std::vector<i::GenericFunction*>& overloads = m_FunctionsByName[f->FullName];
        auto same = std::find_if(overloads.begin(), overloads.end(),
                                 [this, f](i::GenericFunction* g) {
                                     return g == f || (g->MatchFunction == f->MatchFunction &&
                                                       g->SignatureFunction(*this) == f->SignatureFunction(*this));
                                 });
        if (same != overloads.end())
            *same = f;
        else
            overloads.push_back(f);
        lua_pushstring(L, short_name);
        lua_pushlightuserdata(L, this);
        lua_pushstring(L, f->FullName.c_str());
        lua_pushlightuserdata(L, &overloads);
        lua_pushcclosure(L, &i::LuaGlobalFunctionDispatcher, 3);
        lua_rawset(L, parent);
    });
}

void CHost::ExportConstant(i::GenericConstant* constant, int table, const char* name)
{
    ExportDotted(constant, table, name, [this](i::GenericConstant* k, int parent, const char* short_name) {
        lua_pushstring(L, short_name);
        k->Push(*this, L);
        lua_rawset(L, parent);
    });
}

void CHost::RegisterHostFunctions()
{
    static const std::pair<const char*, lua_CFunction> functions[] = {
        {"__cast", &i::LuaCast},
        {"__cast_unsafe", &i::LuaCastUnsafe},
        {"__const", &i::LuaConst},
        {"__get_type", &i::LuaGetType},
        {"__get_typeex", &i::LuaGetTypeEx},
        {"__get_rtti_type", &i::LuaGetRttiType},
    };
    for (auto& [name, function] : functions) {
        lua_pushstring(L, name);
        lua_pushlightuserdata(L, this);
        lua_pushcclosure(L, function, 1);
        lua_rawset(L, LUA_GLOBALSINDEX);
    }
}

} // namespace mluabind
