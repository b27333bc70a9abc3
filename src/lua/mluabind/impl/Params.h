#pragma once
// Parameter matching, extraction and result conversion by native type.
//
// Param<P> for a declared parameter type P gives:
//   Match(host, L, index, allow_implicit)  the score of the Lua value at `index`
//   Storage / Extract(host, L, index, storage)  the native value (false: reported failure)
//   Get(storage)  the argument as P
//   AppendName(host, text)  the type's name in signatures
// and, for values whose score depends on the Lua type alone (numbers, bool, text):
//   Typed = true
//   Take(L, index, storage)  the score, and the native value when it is usable, in one step
// PushResult<R>(host, L, value) pushes a result of declared type R.
#include "lua/mluabind/impl/Declarations.h"

#include <concepts>
#include <string>
#include <tuple>
#include <type_traits>
#include <typeinfo>
#include <utility>

namespace mluabind::i {

// --- helpers implemented in Convert.cpp ---

// The bound variable of the full userdata at `index`, or null when it isn't one of ours.
inline LuaCustomVariable* UserdataVariable(lua_State* L, int index)
{
    if (lua_objlen(L, index) != sizeof(LuaCustomVariable))
        return nullptr;
    auto* variable = static_cast<LuaCustomVariable*>(lua_touserdata(L, index));
    return variable->Tag == kVariableTag ? variable : nullptr;
}

// The bound variable at `index`, or null for anything that isn't one of ours.
inline LuaCustomVariable* ToVariable(lua_State* L, int index)
{
    return lua_type(L, index) == LUA_TUSERDATA ? UserdataVariable(L, index) : nullptr;
}

// Pushes a new variable with the class's metatable.
LuaCustomVariable* CreateVariable(CHost& host, lua_State* L, GenericClass* cls, void* object, bool owned, bool is_const);
// Readable native type name.
std::string TypeName(const std::type_info& type);
// Score of a class parameter for anything but the exact-class fast path.
int MatchClassParam(CHost& host, lua_State* L, int index, bool allow_implicit, const std::type_info& type,
                    bool mutable_ref, bool pointer);
// Extraction of a class parameter beyond the fast path; false after a report.
bool ExtractClassParam(CHost& host, lua_State* L, int index, const std::type_info& type, bool mutable_ref,
                       bool pointer, void*& out);
// "const X&", "X*", "unknown type", ...
void AppendClassName(CHost& host, std::string& text, const std::type_info& type, bool is_const, char suffix);
// The conversion rings: each result stays valid for the next seven conversions of its kind.
// A text to widen must be shorter than WideRingCapacity bytes; a narrowed one has any length.
constexpr size_t WideRingCapacity = 512;
const char16_t* NarrowToWideRing(const char* text, size_t length);
void ReportLongWideText(CHost& host, size_t length);
const char* WideToNarrowRing(const char16_t* text);
// Pushes a variable for a native pointer (null gives nil); reports an unknown class.
int PushPointer(CHost& host, lua_State* L, GenericClass* cls, const std::type_info& type, void* object, bool is_const);
void ReportNoClassByVal(CHost& host, const std::type_info& type);

// The registered class of T in this host, cached until the registry changes.
template <class T>
GenericClass* ClassOf(CHost& host)
{
    static uint64_t stamp = 0;
    static GenericClass* cls = nullptr;
    if (stamp != host.GetStamp()) {
        cls = host.FindClass(typeid(T));
        stamp = host.GetStamp();
    }
    return cls;
}

template <class P>
using Bare = std::remove_cv_t<std::remove_reference_t<P>>;

template <class T>
concept NumberType = (std::is_arithmetic_v<T> && !std::is_same_v<T, bool> && !std::is_same_v<T, char>) || std::is_enum_v<T>;

template <class T>
constexpr const char* NumberName()
{
    if constexpr (std::is_enum_v<T>) return "int";
    else if constexpr (std::is_same_v<T, int>) return "int";
    else if constexpr (std::is_same_v<T, unsigned>) return "unsigned";
    else if constexpr (std::is_same_v<T, short>) return "short";
    else if constexpr (std::is_same_v<T, unsigned short>) return "unsigned short";
    else if constexpr (std::is_same_v<T, long>) return "long";
    else if constexpr (std::is_same_v<T, unsigned long>) return "unsigned long";
    else if constexpr (std::is_same_v<T, long long>) return "long long";
    else if constexpr (std::is_same_v<T, unsigned long long>) return "unsigned long long";
    else if constexpr (std::is_same_v<T, float>) return "float";
    else if constexpr (std::is_same_v<T, double>) return "double";
    else if constexpr (std::is_same_v<T, long double>) return "long double";
    else if constexpr (std::is_same_v<T, char16_t>) return "wchar_t";
    else if constexpr (std::is_same_v<T, signed char>) return "signed char";
    else if constexpr (std::is_same_v<T, unsigned char>) return "unsigned char";
    else return "number";
}

// A Lua number to a native number; out-of-range and NaN values don't reach a cast.
template <class T>
T NumberFromLua(lua_Number value)
{
    if constexpr (std::is_floating_point_v<T>) {
        return static_cast<T>(value);
    } else {
        if (!(value > -9.2e18 && value < 9.2e18))
            value = 0;
        long long whole = static_cast<long long>(value);
        if constexpr (std::is_enum_v<T>)
            return static_cast<T>(static_cast<std::underlying_type_t<T>>(whole));
        else
            return static_cast<T>(whole);
    }
}

template <class P>
struct Param;

// Numbers (and enumerations), by value or by const reference.
template <class P>
    requires NumberType<Bare<P>> && (!std::is_reference_v<P> || std::is_const_v<std::remove_reference_t<P>>)
struct Param<P> {
    using T = Bare<P>;
    using Storage = T;
    static int Match(CHost&, lua_State* L, int index, bool)
    {
        int type = lua_type(L, index);
        return type == LUA_TNUMBER ? 1 : type == LUA_TBOOLEAN ? 2 : NoMatch;
    }
    static bool Extract(CHost&, lua_State* L, int index, Storage& out)
    {
        if (lua_type(L, index) == LUA_TBOOLEAN)
            out = static_cast<T>(lua_toboolean(L, index) ? 1 : 0);
        else
            out = NumberFromLua<T>(lua_tonumber(L, index));
        return true;
    }
    static constexpr bool Typed = true;
    static int Take(lua_State* L, int index, Storage& out)
    {
        int type = lua_type(L, index);
        if (type == LUA_TNUMBER) {
            out = NumberFromLua<T>(lua_tonumber(L, index));
            return 1;
        }
        if (type == LUA_TBOOLEAN) {
            out = static_cast<T>(lua_toboolean(L, index) ? 1 : 0);
            return 2;
        }
        return NoMatch;
    }
    static const T& Get(const Storage& s) { return s; }
    static void AppendName(CHost&, std::string& text) { text += NumberName<T>(); }
};

template <class P>
    requires std::is_same_v<Bare<P>, bool> && (!std::is_reference_v<P> || std::is_const_v<std::remove_reference_t<P>>)
struct Param<P> {
    using Storage = bool;
    static int Match(CHost&, lua_State* L, int index, bool)
    {
        int type = lua_type(L, index);
        return type == LUA_TBOOLEAN ? 1 : type == LUA_TNUMBER ? 2 : NoMatch;
    }
    static bool Extract(CHost&, lua_State* L, int index, Storage& out)
    {
        out = lua_type(L, index) == LUA_TNUMBER ? lua_tonumber(L, index) != 0 : lua_toboolean(L, index) != 0;
        return true;
    }
    static constexpr bool Typed = true;
    static int Take(lua_State* L, int index, Storage& out)
    {
        int type = lua_type(L, index);
        if (type == LUA_TBOOLEAN) {
            out = lua_toboolean(L, index) != 0;
            return 1;
        }
        if (type == LUA_TNUMBER) {
            out = lua_tonumber(L, index) != 0;
            return 2;
        }
        return NoMatch;
    }
    static bool Get(Storage s) { return s; }
    static void AppendName(CHost&, std::string& text) { text += "bool"; }
};

template <class P>
    requires std::is_same_v<Bare<P>, char> && (!std::is_reference_v<P> || std::is_const_v<std::remove_reference_t<P>>)
struct Param<P> {
    using Storage = char;
    static int Match(CHost&, lua_State* L, int index, bool)
    {
        return lua_type(L, index) == LUA_TSTRING && lua_objlen(L, index) == 1 ? 1 : NoMatch;
    }
    static bool Extract(CHost&, lua_State* L, int index, Storage& out)
    {
        const char* text = lua_tostring(L, index);
        out = text ? text[0] : 0;
        return true;
    }
    static char Get(Storage s) { return s; }
    static void AppendName(CHost&, std::string& text) { text += "char"; }
};

template <>
struct Param<const char*> {
    using Storage = const char*;
    static int Match(CHost&, lua_State* L, int index, bool)
    {
        int type = lua_type(L, index);
        return type == LUA_TSTRING || type == LUA_TNIL ? 1 : NoMatch;
    }
    static bool Extract(CHost&, lua_State* L, int index, Storage& out)
    {
        out = lua_type(L, index) == LUA_TSTRING ? lua_tostring(L, index) : nullptr;
        return true;
    }
    static constexpr bool Typed = true;
    static int Take(lua_State* L, int index, Storage& out)
    {
        int type = lua_type(L, index);
        out = type == LUA_TSTRING ? lua_tostring(L, index) : nullptr;
        return type == LUA_TSTRING || type == LUA_TNIL ? 1 : NoMatch;
    }
    static const char* Get(Storage s) { return s; }
    static void AppendName(CHost&, std::string& text) { text += "const char*"; }
};

template <>
struct Param<const char16_t*> {
    using Storage = const char16_t*;
    static int Match(CHost&, lua_State* L, int index, bool)
    {
        int type = lua_type(L, index);
        return type == LUA_TSTRING || type == LUA_TNIL ? 2 : NoMatch;
    }
    static bool Extract(CHost& host, lua_State* L, int index, Storage& out)
    {
        if (lua_type(L, index) != LUA_TSTRING) {
            out = nullptr;
            return true;
        }
        size_t length = 0;
        const char* text = lua_tolstring(L, index, &length);
        if (length >= WideRingCapacity) {
            ReportLongWideText(host, length);
            return false;
        }
        out = NarrowToWideRing(text, length);
        return true;
    }
    static const char16_t* Get(Storage s) { return s; }
    static void AppendName(CHost&, std::string& text) { text += "const wchar_t*"; }
    static constexpr bool Typed = true;
};

// Bound classes: by value, by reference, by pointer, const or not.
template <class P>
    requires std::is_class_v<Bare<std::remove_pointer_t<std::remove_reference_t<P>>>>
struct Param<P> {
    static constexpr bool IsPointer = std::is_pointer_v<std::remove_reference_t<P>>;
    using Pointee = std::conditional_t<IsPointer, std::remove_pointer_t<std::remove_cvref_t<P>>, std::remove_reference_t<P>>;
    using T = std::remove_cv_t<Pointee>;
    // A T& or T* parameter can't take a const object.
    static constexpr bool IsMutable = (IsPointer || std::is_lvalue_reference_v<P>) && !std::is_const_v<Pointee>;
    static constexpr bool IsConst = std::is_const_v<Pointee> || (!IsPointer && !std::is_reference_v<P> && std::is_const_v<P>);
    using Storage = T*;

    static int Match(CHost& host, lua_State* L, int index, bool allow_implicit)
    {
        if (LuaCustomVariable* variable = ToVariable(L, index)) {
            if (variable->Object && variable->Class->m_Type == &typeid(T) && !(IsMutable && variable->IsConst))
                return 1;
        }
        return MatchClassParam(host, L, index, allow_implicit, typeid(T), IsMutable, IsPointer);
    }
    static bool Extract(CHost& host, lua_State* L, int index, Storage& out)
    {
        if (LuaCustomVariable* variable = ToVariable(L, index)) {
            if (variable->Object && variable->Class->m_Type == &typeid(T) && !(IsMutable && variable->IsConst)) {
                out = static_cast<T*>(variable->Object);
                return true;
            }
        }
        void* object = nullptr;
        if (!ExtractClassParam(host, L, index, typeid(T), IsMutable, IsPointer, object))
            return false;
        out = static_cast<T*>(object);
        return true;
    }
    static P Get(Storage s)
    {
        if constexpr (IsPointer)
            return s;
        else
            return *s;
    }
    static void AppendName(CHost& host, std::string& text)
    {
        AppendClassName(host, text, typeid(T), IsConst, IsPointer ? '*' : std::is_reference_v<P> ? '&' : 0);
    }
};

// --- whole parameter lists ---

template <class P>
concept TypedParam = requires { requires Param<P>::Typed; };

template <class P>
concept TakenParam = TypedParam<P> && requires(lua_State* L, typename Param<P>::Storage& out) {
    { Param<P>::Take(L, 1, out) } -> std::same_as<int>;
};

template <class... A>
struct ParamList {
    static constexpr int Count = sizeof...(A);
    // Every score depends on the Lua types of the values alone.
    static constexpr bool Typed = (TypedParam<A> && ...);
    // Every value is scored and converted in one step, without side effects.
    static constexpr bool Taken = (TakenParam<A> && ...);

    // Scores multiply; a candidate that can't be used stops the walk.
    static int Match(CHost& host, lua_State* L, int start, int count, bool allow_implicit)
    {
        int available = lua_gettop(L) - start + 1;
        if constexpr (Count == 0) {
            (void)host;
            (void)count;
            (void)allow_implicit;
            return available <= 0 ? 1 : NoMatch;
        } else {
            if (count == 0) {
                if (available != Count)
                    return NoMatch;
            } else if (available < count || count < Count) {
                return NoMatch;
            }
            int score = 1;
            int index = start;
            bool fits = ((score *= Param<A>::Match(host, L, index++, allow_implicit), score < NoMatch) && ...);
            return fits ? score : NoMatch;
        }
    }

    static std::string Signature(CHost& host)
    {
        std::string text;
        if constexpr (Count > 0) {
            bool first = true;
            (
                [&] {
                    if (!first)
                        text += ", ";
                    first = false;
                    Param<A>::AppendName(host, text);
                }(),
                ...);
        }
        (void)host;
        return text;
    }

    using Storage = std::tuple<typename Param<A>::Storage...>;

    // Match and Extract in one pass, for Taken lists: exactly Count values from `start`.
    static int Take(lua_State* L, int start, Storage& storage)
    {
        static_assert(Taken);
        if (lua_gettop(L) - start + 1 != Count)
            return NoMatch;
        return TakeFrom(L, start, storage, std::index_sequence_for<A...>());
    }

    template <size_t... I>
    static int TakeFrom(lua_State* L, int start, Storage& storage, std::index_sequence<I...>)
    {
        (void)L, (void)start, (void)storage;
        int score = 1;
        bool fits = ((score *= Param<A>::Take(L, start + static_cast<int>(I), std::get<I>(storage)), score < NoMatch) && ...);
        return fits ? score : NoMatch;
    }

    // Extracts from the last parameter to the first.
    static bool Extract(CHost& host, lua_State* L, int start, Storage& storage)
    {
        return ExtractFrom<Count>(host, L, start, storage);
    }

    template <int N>
    static bool ExtractFrom(CHost& host, lua_State* L, int start, Storage& storage)
    {
        if constexpr (N == 0) {
            (void)host;
            (void)L;
            (void)start;
            (void)storage;
            return true;
        } else {
            using P = std::tuple_element_t<N - 1, std::tuple<A...>>;
            if (!Param<P>::Extract(host, L, start + N - 1, std::get<N - 1>(storage)))
                return false;
            return ExtractFrom<N - 1>(host, L, start, storage);
        }
    }
};

// --- results ---

template <class R>
int PushResult(CHost& host, lua_State* L, R&& value)
{
    using T = Bare<R>;
    if constexpr (NumberType<T>) {
        lua_pushnumber(L, static_cast<lua_Number>(value));
        return 1;
    } else if constexpr (std::is_same_v<T, bool>) {
        lua_pushboolean(L, value ? 1 : 0);
        return 1;
    } else if constexpr (std::is_same_v<T, char>) {
        char text = value;
        lua_pushlstring(L, &text, 1);
        return 1;
    } else if constexpr (std::is_same_v<T, const char*> || std::is_same_v<T, char*>) {
        lua_pushstring(L, value);
        return 1;
    } else if constexpr (std::is_same_v<T, const char16_t*> || std::is_same_v<T, char16_t*>) {
        lua_pushstring(L, WideToNarrowRing(value));
        return 1;
    } else if constexpr (std::is_pointer_v<T>) {
        using Pointee = std::remove_pointer_t<T>;
        using C = std::remove_cv_t<Pointee>;
        static_assert(std::is_class_v<C>, "unsupported pointer result");
        return PushPointer(host, L, ClassOf<C>(host), typeid(C), const_cast<C*>(value), std::is_const_v<Pointee>);
    } else if constexpr (std::is_lvalue_reference_v<R>) {
        using Referee = std::remove_reference_t<R>;
        static_assert(std::is_class_v<T>, "unsupported reference result");
        return PushPointer(host, L, ClassOf<T>(host), typeid(T), const_cast<T*>(&value), std::is_const_v<Referee>);
    } else {
        static_assert(std::is_class_v<T>, "unsupported result type");
        static_assert(std::is_copy_constructible_v<T> || std::is_move_constructible_v<T>, "a result by value must be copyable");
        GenericClass* cls = ClassOf<T>(host);
        if (!cls) {
            ReportNoClassByVal(host, typeid(T));
            return 0;
        }
        CreateVariable(host, L, cls, new T(std::forward<R>(value)), true, false);
        return 1;
    }
}

// The value of a data member as a script sees it: numbers and text by value, objects by
// reference into the owner.
template <class M>
int PushMemberValue(CHost& host, lua_State* L, M& member, bool owner_const)
{
    using T = std::remove_cv_t<M>;
    if constexpr (std::is_class_v<T>) {
        return PushPointer(host, L, ClassOf<T>(host), typeid(T), const_cast<T*>(&member), owner_const || std::is_const_v<M>);
    } else if constexpr (std::is_pointer_v<T> && std::is_class_v<std::remove_cv_t<std::remove_pointer_t<T>>>) {
        using C = std::remove_cv_t<std::remove_pointer_t<T>>;
        return PushPointer(host, L, ClassOf<C>(host), typeid(C), const_cast<C*>(member),
                           std::is_const_v<std::remove_pointer_t<T>>);
    } else {
        return PushResult<const T&>(host, L, member);
    }
}

} // namespace mluabind::i
