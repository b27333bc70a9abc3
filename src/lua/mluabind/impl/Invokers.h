#pragma once
// Generated call classes: one per bound signature. Each method kind has a static match
// function (its ParamList), a static signature function and the virtual Call.
#include "lua/mluabind/impl/Params.h"

#include <functional>
#include <tuple>
#include <type_traits>
#include <utility>

namespace mluabind::i {

template <class... A>
struct TypeList {};

// A native callable applied to an object of the bound class T: a member function (of T or
// a base) or a free function whose first parameter is the object.
template <class T, class F>
struct Bound;

#define MLUABIND_MEMBER_BOUND(CV, NOEXCEPT, IS_CONST)                                                   \
    template <class T, class R, class C, class... A>                                                    \
    struct Bound<T, R (C::*)(A...) CV NOEXCEPT> {                                                       \
        using Fn = R (C::*)(A...) CV NOEXCEPT;                                                          \
        using Result = R;                                                                               \
        using Args = ParamList<A...>;                                                                   \
        static constexpr bool IsConst = IS_CONST;                                                       \
        template <class Tuple, size_t... I>                                                             \
        static R Invoke(Fn fn, void* object, Tuple& storage, std::index_sequence<I...>)                 \
        {                                                                                               \
            CV C* target = static_cast<CV C*>(static_cast<T*>(object));                                 \
            return (target->*fn)(Param<A>::Get(std::get<I>(storage))...);                               \
        }                                                                                               \
    };
MLUABIND_MEMBER_BOUND(, , false)
MLUABIND_MEMBER_BOUND(const, , true)
MLUABIND_MEMBER_BOUND(, noexcept, false)
MLUABIND_MEMBER_BOUND(const, noexcept, true)
#undef MLUABIND_MEMBER_BOUND

template <class S>
struct SelfParam {
    static constexpr bool IsPointer = std::is_pointer_v<S>;
    using Pointee = std::conditional_t<IsPointer, std::remove_pointer_t<S>, std::remove_reference_t<S>>;
    static constexpr bool IsConst = std::is_const_v<Pointee>;
    using C = std::remove_cv_t<Pointee>;
    static_assert(std::is_class_v<C> && (IsPointer || std::is_lvalue_reference_v<S>),
                  "the first parameter of a function used as a method must be the object by reference or pointer");
    template <class T>
    static S From(void* object)
    {
        C* target = static_cast<C*>(static_cast<T*>(object));
        if constexpr (IsPointer)
            return target;
        else
            return *target;
    }
};

#define MLUABIND_FREE_BOUND(NOEXCEPT)                                                                   \
    template <class T, class R, class S, class... A>                                                    \
    struct Bound<T, R (*)(S, A...) NOEXCEPT> {                                                          \
        using Fn = R (*)(S, A...) NOEXCEPT;                                                             \
        using Result = R;                                                                               \
        using Args = ParamList<A...>;                                                                   \
        static constexpr bool IsConst = SelfParam<S>::IsConst;                                          \
        template <class Tuple, size_t... I>                                                             \
        static R Invoke(Fn fn, void* object, Tuple& storage, std::index_sequence<I...>)                 \
        {                                                                                               \
            return fn(SelfParam<S>::template From<T>(object), Param<A>::Get(std::get<I>(storage))...);  \
        }                                                                                               \
    };
MLUABIND_FREE_BOUND()
MLUABIND_FREE_BOUND(noexcept)
#undef MLUABIND_FREE_BOUND

// A captureless lambda decays to its function pointer.
template <class F>
auto ToPointer(F f)
{
    if constexpr (std::is_member_function_pointer_v<F> || std::is_pointer_v<F>)
        return f;
    else
        return +f;
}

// Runs a native call and pushes its result; gives the number of results.
template <class R, class Call>
int CallAndPush(CHost& host, lua_State* L, Call&& call)
{
    if constexpr (std::is_void_v<R>) {
        call();
        return 0;
    } else {
        return PushResult<R>(host, L, call());
    }
}

// A method: member function or free function with the object first.
template <class T, class F>
class MethodClass : public GenericMethod {
public:
    using B = Bound<T, F>;

    MethodClass(const char* name, F fn, GenericMethodPolicy* policy, bool self_first) : m_Fn(fn)
    {
        Name = name;
        IsConst = B::IsConst;
        SelfFirst = self_first;
        MatchFunction = &B::Args::Match;
        SignatureFunction = &B::Args::Signature;
        Policy = policy;
        Typed = B::Args::Typed;
    }

    int Call(CHost& host, lua_State* L, LuaCustomVariable& self) override
    {
        typename B::Args::Storage storage;
        if (!B::Args::Extract(host, L, 1, storage))
            return 0;
        return Run(host, L, self, storage);
    }

    int TryCall(CHost& host, lua_State* L, LuaCustomVariable& self) override
    {
        if constexpr (B::Args::Taken) {
            typename B::Args::Storage storage;
            if (B::Args::Take(L, 1, storage) >= NoMatch)
                return TakeFailed;
            return Run(host, L, self, storage);
        } else {
            return GenericMethod::TryCall(host, L, self);
        }
    }

private:
    int Run(CHost& host, lua_State* L, LuaCustomVariable& self, typename B::Args::Storage& storage)
    {
        constexpr size_t count = std::tuple_size_v<typename B::Args::Storage>;
        return CallAndPush<typename B::Result>(host, L, [&]() -> decltype(auto) {
            return B::Invoke(m_Fn, self.Object, storage, std::make_index_sequence<count>());
        });
    }

    F m_Fn;
};

template <class F>
struct FreeFunction;

#define MLUABIND_FUNCTION(NOEXCEPT)                                                                     \
    template <class R, class... A>                                                                      \
    struct FreeFunction<R (*)(A...) NOEXCEPT> {                                                         \
        using Fn = R (*)(A...) NOEXCEPT;                                                                \
        using Result = R;                                                                               \
        using Args = ParamList<A...>;                                                                   \
        template <class Tuple, size_t... I>                                                             \
        static R Invoke(Fn fn, Tuple& storage, std::index_sequence<I...>)                               \
        {                                                                                               \
            return fn(Param<A>::Get(std::get<I>(storage))...);                                          \
        }                                                                                               \
    };
MLUABIND_FUNCTION()
MLUABIND_FUNCTION(noexcept)
#undef MLUABIND_FUNCTION

template <class F>
class FunctionClass : public GenericFunction {
public:
    using B = FreeFunction<F>;

    FunctionClass(const char* name, F fn, GenericMethodPolicy* policy) : m_Fn(fn)
    {
        LuaName = name;
        FullName = name;
        MatchFunction = &B::Args::Match;
        SignatureFunction = &B::Args::Signature;
        Policy = policy;
    }

    int Call(CHost& host, lua_State* L) override
    {
        typename B::Args::Storage storage;
        if (!B::Args::Extract(host, L, 1, storage))
            return 0;
        return Run(host, L, storage);
    }

    int TryCall(CHost& host, lua_State* L) override
    {
        if constexpr (B::Args::Taken) {
            typename B::Args::Storage storage;
            if (B::Args::Take(L, 1, storage) >= NoMatch)
                return TakeFailed;
            return Run(host, L, storage);
        } else {
            return GenericFunction::TryCall(host, L);
        }
    }

private:
    int Run(CHost& host, lua_State* L, typename B::Args::Storage& storage)
    {
        constexpr size_t count = std::tuple_size_v<typename B::Args::Storage>;
        return CallAndPush<typename B::Result>(host, L, [&]() -> decltype(auto) {
            return B::Invoke(m_Fn, storage, std::make_index_sequence<count>());
        });
    }

    F m_Fn;
};

template <class T, class... A>
struct ConstructorOf {
    using Args = ParamList<A...>;

    static void* Create(CHost& host, lua_State* L, int start)
    {
        typename Args::Storage storage;
        if (!Args::Extract(host, L, start, storage))
            return nullptr;
        return Build(storage, std::index_sequence_for<A...>());
    }

    template <size_t... I>
    static void* Build(typename Args::Storage& storage, std::index_sequence<I...>)
    {
        (void)storage;
        return new T(Param<A>::Get(std::get<I>(storage))...);
    }

    static constexpr bool IsExplicit()
    {
        if constexpr (sizeof...(A) == 1)
            return !std::is_convertible_v<A..., T>;
        else
            return false;
    }
};

// Reports a member assignment that can't happen; see Dispatch.cpp for the texts.
void ReportMemberConst(CHost& host);
void ReportMemberNoAssign(CHost& host);
void ReportMemberConvert(CHost& host);
void ReportPropertyNoSetter(CHost& host);
void ReportPropertyConst(CHost& host);
void ReportPropertyConvert(CHost& host, lua_State* L, int index);

// A data member, read by reference and assigned in place.
template <class T, class M>
class MemberClass : public GenericMember {
public:
    MemberClass(const char* name, M T::*member) : m_Member(member) { Name = name; }

    int Get(CHost& host, lua_State* L, LuaCustomVariable& self) override
    {
        return PushMemberValue<M>(host, L, static_cast<T*>(self.Object)->*m_Member, self.IsConst != 0);
    }

    void Set(CHost& host, lua_State* L, LuaCustomVariable& self, int index) override
    {
        if constexpr (std::is_const_v<M>) {
            (void)L, (void)self, (void)index;
            ReportMemberConst(host);
        } else if constexpr (!std::is_copy_assignable_v<M>) {
            (void)L, (void)self, (void)index;
            ReportMemberNoAssign(host);
        } else {
            using P = std::conditional_t<std::is_class_v<M>, const M&, M>;
            if (Param<P>::Match(host, L, index, true) >= NoMatch) {
                ReportMemberConvert(host);
                return;
            }
            size_t depth = host.TemporariesDepth();
            typename Param<P>::Storage storage;
            if (Param<P>::Extract(host, L, index, storage))
                static_cast<T*>(self.Object)->*m_Member = Param<P>::Get(storage);
            host.ReleaseTemporaries(depth);
        }
    }

private:
    M T::*m_Member;
};

// Type of the value a setter takes, from its signature.
template <class T, class F>
struct SetterArg;
template <class T, class R, class C, class A>
struct SetterArg<T, R (C::*)(A)> {
    using Type = A;
};
template <class T, class R, class C, class A>
struct SetterArg<T, R (C::*)(A) noexcept> {
    using Type = A;
};
template <class T, class R, class S, class A>
struct SetterArg<T, R (*)(S, A)> {
    using Type = A;
};
template <class T, class R, class S, class A>
struct SetterArg<T, R (*)(S, A) noexcept> {
    using Type = A;
};

// A property by getter and optional setter.
template <class T, class G, class S>
class PropertyClass : public GenericMember {
public:
    PropertyClass(const char* name, G getter, S setter) : m_Getter(getter), m_Setter(setter) { Name = name; }

    int Get(CHost& host, lua_State* L, LuaCustomVariable& self) override
    {
        using B = Bound<T, G>;
        static_assert(B::Args::Count == 0, "a getter takes no parameters");
        std::tuple<> none;
        return CallAndPush<typename B::Result>(host, L, [&]() -> decltype(auto) {
            return B::Invoke(m_Getter, self.Object, none, std::index_sequence<>());
        });
    }

    void Set(CHost& host, lua_State* L, LuaCustomVariable& self, int index) override
    {
        if constexpr (std::is_same_v<S, std::nullptr_t>) {
            (void)L, (void)self, (void)index;
            ReportPropertyNoSetter(host);
        } else {
            if (!m_Setter) {
                ReportPropertyNoSetter(host);
                return;
            }
            if (self.IsConst) {
                ReportPropertyConst(host);
                return;
            }
            using A = typename SetterArg<T, S>::Type;
            if (Param<A>::Match(host, L, index, true) >= NoMatch) {
                ReportPropertyConvert(host, L, index);
                return;
            }
            size_t depth = host.TemporariesDepth();
            std::tuple<typename Param<A>::Storage> storage;
            if (Param<A>::Extract(host, L, index, std::get<0>(storage))) {
                using B = Bound<T, S>;
                B::Invoke(m_Setter, self.Object, storage, std::index_sequence<0>());
            }
            host.ReleaseTemporaries(depth);
        }
    }

private:
    G m_Getter;
    S m_Setter;
};

// One constant value: numbers, booleans, text, or a pointer to an object of a bound class.
template <class V>
class ConstantClass : public GenericConstant {
public:
    ConstantClass(const char* name, V value) : m_Value(value)
    {
        LuaName = name;
        FullName = name;
    }
    void Push(CHost& host, lua_State* L) override
    {
        if constexpr (std::is_pointer_v<V> && std::is_class_v<std::remove_cv_t<std::remove_pointer_t<V>>>) {
            using C = std::remove_cv_t<std::remove_pointer_t<V>>;
            if (!PushPointer(host, L, ClassOf<C>(host), typeid(C), const_cast<C*>(m_Value),
                             std::is_const_v<std::remove_pointer_t<V>>))
                lua_pushnil(L);
        } else {
            PushResult<const V&>(host, L, m_Value);
        }
    }

private:
    V m_Value;
};

template <>
class ConstantClass<std::string> : public GenericConstant {
public:
    ConstantClass(const char* name, std::string value) : m_Value(std::move(value))
    {
        LuaName = name;
        FullName = name;
    }
    void Push(CHost&, lua_State* L) override { lua_pushlstring(L, m_Value.data(), m_Value.size()); }

private:
    std::string m_Value;
};

} // namespace mluabind::i
