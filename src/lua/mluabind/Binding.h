#pragma once
// The declaration interface. Between BeginBinding and EndBinding on a host, binders build
// classes, functions and constants, gather them in namespaces and hand them to Bind:
//
//   host.BeginBinding();
//   host.Bind(Namespace("ox").Merge(Namespace("gui")
//       .AddClass(Class<CWidget>("CWidget").BaseClass<CBaseWidget>()
//           .Constructor<>()
//           .Method("SetFlags", &CWidget::SetFlags)
//           .Constant("FlagHidden", CWidget::FlagHidden))));
//   host.EndBinding();
//
// A base class must be published before the classes that derive from it. Scripts call
// methods with a dot: obj.Method(a, b).
#include "lua/mluabind/impl/Invokers.h"

#include <cstddef>
#include <new>
#include <string>
#include <type_traits>
#include <vector>

namespace mluabind {

// Operator indices of Class::Operator, in the order of their Lua events.
enum OperatorIndex : int {
    OpAdd = 0,
    OpSub = 1,
    OpMul = 2,
    OpDiv = 3,
    OpMod = 4,
    OpUnm = 5,
    OpEq = 6,
    OpLt = 7,
    OpLe = 8,
    OpToString = 9,
    OpConcat = 10,
    OpCall = 11,
};

namespace i {

// Memory for a declaration from the host in declaration mode.
void* AllocateForDeclaration(size_t size, void (*destroy)(void*));
const char* OperatorEventName(int index);

template <class X>
void DestroyInPlace(void* object)
{
    static_cast<X*>(object)->~X();
}

template <class X, class... Args>
X* NewDeclaration(Args&&... args)
{
    static_assert(alignof(X) <= 16, "declarations are aligned to 16 bytes");
    return new (AllocateForDeclaration(sizeof(X), &DestroyInPlace<X>)) X(std::forward<Args>(args)...);
}

template <class T>
void DeleteObject(void* object)
{
    delete static_cast<T*>(object);
}

// __gc of the class: deletes the object when Lua owns it.
template <class T>
int CollectVariable(lua_State* L)
{
    LuaCustomVariable* variable = ToVariable(L, 1);
    if (variable && variable->IsOwned && variable->Object) {
        void* object = variable->Object;
        variable->Object = nullptr;
        variable->IsOwned = 0;
        delete static_cast<T*>(object);
    }
    return 0;
}

template <class T, class U, class F>
class FunctionUpCastAdapter : public ClassUpCastConvertAdapter {
public:
    explicit FunctionUpCastAdapter(F convert) : ClassUpCastConvertAdapter(typeid(U), nullptr), m_Function(convert) {}
    void* Upcast(void* object) override
    {
        return const_cast<std::remove_cv_t<U>*>(m_Function(*static_cast<T*>(object)));
    }

private:
    F m_Function;
};

// One bound class; the builder operations return the class for chaining.
template <class T>
class CCl : public GenericClass {
public:
    explicit CCl(const char* name)
    {
        LuaName = name;
        FullName = name;
        m_Type = &typeid(T);
        m_NativeName = TypeName(typeid(T));
        if constexpr (std::is_destructible_v<T>) {
            m_GCFunction = &CollectVariable<T>;
            m_Destroy = &DeleteObject<T>;
        } else {
            m_GCFunction = [](lua_State*) { return 0; };
        }
    }

    template <class... A>
    CCl& Constructor(GenericMethodPolicy* policy = nullptr)
    {
        static_assert(std::is_constructible_v<T, A...>, "no such constructor");
        using C = ConstructorOf<T, A...>;
        auto* description = NewDeclaration<ConstructorDescription>();
        description->Type = &typeid(T);
        description->MatchFunction = &C::Args::Match;
        description->SignatureFunction = &C::Args::Signature;
        description->CreateFunction = &C::Create;
        description->Policy = policy;
        description->IsExplicit = C::IsExplicit();
        description->ParameterCount = sizeof...(A);
        m_Constructors.push_back(description);
        return *this;
    }

    // A member function of T or of a base, or a function whose first parameter is the
    // object (T&, const T&, T*, const T*), or a lambda without captures of that form.
    template <class F>
    CCl& Method(const char* name, F function, GenericMethodPolicy* policy = nullptr)
    {
        auto pointer = ToPointer(function);
        AddMethod(NewDeclaration<MethodClass<T, decltype(pointer)>>(name, pointer, policy, false));
        return *this;
    }

    template <class C, class M>
    CCl& Member(const char* name, M C::*member)
    {
        static_assert(std::is_base_of_v<C, T>, "the member must belong to the class or a base");
        M T::*own = member;
        auto* declaration = NewDeclaration<MemberClass<T, M>>(name, own);
        m_Members.emplace_back(declaration->Name.c_str(), declaration);
        return *this;
    }

    template <class G, class S = std::nullptr_t>
    CCl& Property(const char* name, G getter, S setter = nullptr)
    {
        auto get = ToPointer(getter);
        if constexpr (std::is_same_v<S, std::nullptr_t>) {
            auto* declaration = NewDeclaration<PropertyClass<T, decltype(get), std::nullptr_t>>(name, get, nullptr);
            m_Members.emplace_back(declaration->Name.c_str(), declaration);
        } else {
            auto set = ToPointer(setter);
            auto* declaration = NewDeclaration<PropertyClass<T, decltype(get), decltype(set)>>(name, get, set);
            m_Members.emplace_back(declaration->Name.c_str(), declaration);
        }
        return *this;
    }

    template <class V>
    CCl& Constant(const char* name, V value)
    {
        GenericConstant* constant;
        if constexpr (std::is_convertible_v<V, const char*>)
            constant = NewDeclaration<ConstantClass<std::string>>(name, std::string(value ? value : ""));
        else
            constant = NewDeclaration<ConstantClass<V>>(name, value);
        m_Constants.emplace_back(constant->LuaName.c_str(), constant);
        return *this;
    }

    // An operator event: a member function or a function with the object first; for a
    // binary operator the other operand is its one parameter.
    template <class F>
    CCl& Operator(int index, F function, GenericMethodPolicy* policy = nullptr)
    {
        auto pointer = ToPointer(function);
        AddOperator(index, NewDeclaration<MethodClass<T, decltype(pointer)>>(OperatorEventName(index), pointer, policy, true));
        return *this;
    }

    template <class B>
    CCl& BaseClass()
    {
        static_assert(std::is_base_of_v<B, T> && !std::is_same_v<B, T>, "not a base class");
        void* (*up)(void*) = [](void* object) -> void* { return static_cast<B*>(static_cast<T*>(object)); };
        void* (*down)(void*) = [](void* object) -> void* {
            if constexpr (std::is_polymorphic_v<B>)
                return dynamic_cast<T*>(static_cast<B*>(object));
            else
                return static_cast<T*>(static_cast<B*>(object));
        };
        m_Adapters[std::type_index(typeid(B))] = NewDeclaration<ClassInheritanceConvertAdapter>(typeid(B), up, down);
        return *this;
    }

    // A one-way conversion to U, given by a function (or lambda without captures) that
    // takes the object by reference and returns a U*.
    template <class U, class F>
    CCl& ConvertsTo(F convert)
    {
        auto pointer = ToPointer(convert);
        m_Adapters[std::type_index(typeid(U))] = NewDeclaration<FunctionUpCastAdapter<T, U, decltype(pointer)>>(pointer);
        return *this;
    }
};

} // namespace i

// Makes ownership move across a call: 0 = the object itself, n > 0 = argument n (both
// before the call), -1 = the single result after it.
inline i::GenericMethodPolicy* Adopt(int index) { return i::NewDeclaration<i::AdoptPolicy>(index); }

template <class T>
i::CCl<T>& Class(const char* name)
{
    return *i::NewDeclaration<i::CCl<T>>(name);
}

template <class F>
i::GenericFunction& Function(const char* name, F function, i::GenericMethodPolicy* policy = nullptr)
{
    auto pointer = i::ToPointer(function);
    return *i::NewDeclaration<i::FunctionClass<decltype(pointer)>>(name, pointer, policy);
}

template <class V>
i::GenericConstant& Constant(const char* name, V value)
{
    if constexpr (std::is_convertible_v<V, const char*>)
        return *i::NewDeclaration<i::ConstantClass<std::string>>(name, std::string(value ? value : ""));
    else
        return *i::NewDeclaration<i::ConstantClass<V>>(name, value);
}

// A list of classes, functions and constants under a dotted prefix.
class Namespace {
public:
    explicit Namespace(const char* name = "") : m_Name(name) {}

    Namespace& AddClass(i::GenericClass& cls)
    {
        Prefix(cls);
        m_Classes.push_back(&cls);
        return *this;
    }
    Namespace& AddFunction(i::GenericFunction& function)
    {
        Prefix(function);
        m_Functions.push_back(&function);
        return *this;
    }
    Namespace& AddConstant(i::GenericConstant& constant)
    {
        Prefix(constant);
        m_Constants.push_back(&constant);
        return *this;
    }
    // Takes every item of an inner namespace, which is left empty.
    Namespace& Merge(Namespace& inner)
    {
        for (i::GenericClass* cls : inner.m_Classes)
            AddClass(*cls);
        for (i::GenericFunction* function : inner.m_Functions)
            AddFunction(*function);
        for (i::GenericConstant* constant : inner.m_Constants)
            AddConstant(*constant);
        inner.m_Classes.clear();
        inner.m_Functions.clear();
        inner.m_Constants.clear();
        return *this;
    }
    Namespace& Merge(Namespace&& inner) { return Merge(inner); }

    const std::vector<i::GenericClass*>& Classes() const { return m_Classes; }
    const std::vector<i::GenericFunction*>& Functions() const { return m_Functions; }
    const std::vector<i::GenericConstant*>& Constants() const { return m_Constants; }

private:
    void Prefix(i::DeclaratedClass& item)
    {
        if (!m_Name.empty())
            item.FullName = m_Name + "." + item.FullName;
    }

    std::string m_Name;
    std::vector<i::GenericClass*> m_Classes;
    std::vector<i::GenericFunction*> m_Functions;
    std::vector<i::GenericConstant*> m_Constants;
};

// --- values for native code that calls into Lua ---

namespace i {
template <class T>
using ValueParam = std::conditional_t<std::is_class_v<T>, const T&, T>;

inline int AbsoluteIndex(lua_State* L, int index)
{
    return index < 0 && index > LUA_REGISTRYINDEX ? lua_gettop(L) + index + 1 : index;
}
} // namespace i

// Pushes an argument the way a bound function pushes its result: an object of a bound
// class as an owned copy, a pointer as a non-owning variable (nil for null). Gives the
// number of values pushed (0 after a report).
template <class T>
int PushValue(CHost& host, lua_State* L, const T& value)
{
    if constexpr (std::is_class_v<T>)
        return i::PushResult<T>(host, L, T(value));
    else
        return i::PushResult<const T&>(host, L, value);
}

// The score of the value at `index` as a T; i::NoMatch when it can't be converted.
template <class T>
int MatchValue(CHost& host, lua_State* L, int index)
{
    return i::Param<i::ValueParam<T>>::Match(host, L, i::AbsoluteIndex(L, index), true);
}

// Reads the value at `index` as a T (after MatchValue said it can). Text stays valid while
// the Lua value is on the stack.
template <class T>
bool ExtractValue(CHost& host, lua_State* L, int index, T& out)
{
    using P = i::ValueParam<T>;
    size_t depth = host.TemporariesDepth();
    typename i::Param<P>::Storage storage;
    bool extracted = i::Param<P>::Extract(host, L, i::AbsoluteIndex(L, index), storage);
    if (extracted)
        out = i::Param<P>::Get(storage);
    host.ReleaseTemporaries(depth);
    return extracted;
}

} // namespace mluabind
