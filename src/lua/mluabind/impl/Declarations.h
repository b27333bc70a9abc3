#pragma once
// The declaration objects of the registry: classes, their methods, members, constants,
// constructors and conversion adapters, free functions and policies. All of them live in
// the declaration arena of their host and are destroyed in place with it.
#include "lua/mluabind/Host.h"

#include <cstring>
#include <map>
#include <string>
#include <typeindex>
#include <vector>

namespace mluabind::i {

// A score: lower is better; NoMatch means the candidate can't be used.
constexpr int NoMatch = 1000000;

// Results of TryCall besides a result count: the values don't fit; or the signature can't
// be scored and converted in one step, so the caller goes the long way.
constexpr int TakeFailed = -1;
constexpr int NotTaken = -2;

// Score of a parameter list of a generated signature from stack index `start` on.
using MatchFn = int (*)(CHost& host, lua_State* L, int start, int count, bool allow_implicit);
// The parameter type names of a signature joined by ", ".
using SignatureFn = std::string (*)(CHost& host);

// One running call of an entry point from Lua (see the error model in Host.h).
struct CallFrame {
    CallFrame* Previous = nullptr;
    bool Raise = false;  // the default ReportError asks to raise Message
    std::string Message;
};

class DeclaratedClass {
public:
    virtual ~DeclaratedClass() = default;
    std::string LuaName;  // the short name
    std::string FullName; // dotted from the outermost namespace
};

class GenericMethodPolicy {
public:
    virtual ~GenericMethodPolicy() = default;
    virtual void BeforeCall(CHost& host, lua_State* L, LuaCustomVariable* self);
    virtual int AfterCall(CHost& host, lua_State* L, LuaCustomVariable* self, int result_count);
    // Appends a further policy; they run in order after this one.
    GenericMethodPolicy* Add(GenericMethodPolicy* next)
    {
        m_Further.push_back(next);
        return this;
    }
    void RunBefore(CHost& host, lua_State* L, LuaCustomVariable* self);
    int RunAfter(CHost& host, lua_State* L, LuaCustomVariable* self, int result_count);

private:
    std::vector<GenericMethodPolicy*> m_Further;
};

// Moves ownership across a call: 0 = self, n > 0 = argument n (both before the call),
// -1 = the single result (after the call).
class AdoptPolicy : public GenericMethodPolicy {
public:
    explicit AdoptPolicy(int index) : m_Index(index) {}
    void BeforeCall(CHost& host, lua_State* L, LuaCustomVariable* self) override;
    int AfterCall(CHost& host, lua_State* L, LuaCustomVariable* self, int result_count) override;

private:
    int m_Index;
};

class GenericMethod {
public:
    virtual ~GenericMethod() = default;
    // Extracts the arguments from index 1 on, runs the native code on `self` and pushes the
    // result; gives the number of results.
    virtual int Call(CHost& host, lua_State* L, LuaCustomVariable& self) = 0;
    // Scores the values from index 1 on and, when they fit, converts them and calls in the
    // same pass (no policy, no operator); gives TakeFailed or NotTaken otherwise.
    virtual int TryCall(CHost& host, lua_State* L, LuaCustomVariable& self);

    bool IsConst = false;
    bool SelfFirst = false; // operators: the object is the first value on the stack
    bool Typed = false;     // its score depends on the Lua types of the values alone
    std::string Name;
    MatchFn MatchFunction = nullptr;
    SignatureFn SignatureFunction = nullptr;
    GenericMethodPolicy* Policy = nullptr;
};

class GenericFunction : public DeclaratedClass {
public:
    virtual int Call(CHost& host, lua_State* L) = 0;
    // As GenericMethod::TryCall.
    virtual int TryCall(CHost& host, lua_State* L);

    MatchFn MatchFunction = nullptr;
    SignatureFn SignatureFunction = nullptr;
    GenericMethodPolicy* Policy = nullptr;
};

class GenericConstant : public DeclaratedClass {
public:
    virtual void Push(CHost& host, lua_State* L) = 0;
};

struct ConstructorDescription {
    const std::type_info* Type = nullptr;
    MatchFn MatchFunction = nullptr;
    SignatureFn SignatureFunction = nullptr;
    // Builds the object with `new` from the values at `start` on; null when an argument
    // could not be extracted (already reported).
    void* (*CreateFunction)(CHost& host, lua_State* L, int start) = nullptr;
    GenericMethodPolicy* Policy = nullptr;
    bool IsExplicit = false;
    int ParameterCount = 0;
};

class GenericMember {
public:
    virtual ~GenericMember() = default;
    virtual int Get(CHost& host, lua_State* L, LuaCustomVariable& self) = 0;
    virtual void Set(CHost& host, lua_State* L, LuaCustomVariable& self, int index) = 0;
    std::string Name;
};

class ClassConvertAdapter {
public:
    virtual ~ClassConvertAdapter() = default;
    virtual const std::type_info& GetTargetType() const = 0;
    virtual GenericClass* GetTargetGenericClass(CHost& host) = 0;
    virtual void* Upcast(void* object) = 0;
    virtual bool CanDowncast() const = 0;
    virtual void* Downcast(void* object) = 0;
    virtual bool IsInheritance() const = 0;
};

// A one-way conversion, as from an intrusive pointer to its object.
class ClassUpCastConvertAdapter : public ClassConvertAdapter {
public:
    ClassUpCastConvertAdapter(const std::type_info& target, void* (*convert)(void*))
        : m_Target(&target), m_Convert(convert)
    {
    }
    const std::type_info& GetTargetType() const override { return *m_Target; }
    GenericClass* GetTargetGenericClass(CHost& host) override;
    void* Upcast(void* object) override { return m_Convert(object); }
    bool CanDowncast() const override { return false; }
    void* Downcast(void*) override { return nullptr; }
    bool IsInheritance() const override { return false; }

private:
    const std::type_info* m_Target;
    GenericClass* m_TargetClass = nullptr;
    uint64_t m_TargetStamp = 0;
    void* (*m_Convert)(void*);
};

// Real inheritance: converts both ways.
class ClassInheritanceConvertAdapter : public ClassUpCastConvertAdapter {
public:
    ClassInheritanceConvertAdapter(const std::type_info& target, void* (*up)(void*), void* (*down)(void*))
        : ClassUpCastConvertAdapter(target, up), m_Down(down)
    {
    }
    bool CanDowncast() const override { return true; }
    void* Downcast(void* object) override { return m_Down(object); }
    bool IsInheritance() const override { return true; }

private:
    void* (*m_Down)(void*);
};

// Compares names the way the method table is sorted.
struct NameLess {
    bool operator()(const std::pair<const char*, GenericMethod*>& a, const char* b) const { return std::strcmp(a.first, b) < 0; }
    bool operator()(const char* a, const std::pair<const char*, GenericMethod*>& b) const { return std::strcmp(a, b.first) < 0; }
};

class GenericClass;

// The overloads of one name in one class, at a stable address for resolutions.
struct MethodRun {
    GenericClass* Owner = nullptr;
    const std::pair<const char*, GenericMethod*>* Begin = nullptr;
    size_t Count = 0;
    // Every overload is Typed: the Lua types of the values (and the object's const) decide
    // the choice, which is kept for the last such key.
    bool Typed = false;
    mutable uint64_t ChosenFor = 0;
    mutable size_t Chosen = 0;
};

// What a name read from an object of a class stands for: the first method found in the
// class or through its adapters, else a member or constant. Made at the first read of the
// name and kept at a stable address, since method closures hold it; made again in place
// when the host's registry has changed since.
struct Resolution {
    enum Kind : uint8_t { Nothing, Method, Member, Constant };

    GenericClass* Class = nullptr; // the class of the objects it serves
    std::string Name;
    uint64_t Stamp = 0;
    Kind What = Nothing;
    GenericClass* Owner = nullptr; // the class that declares what was found
    const MethodRun* Run = nullptr;
    GenericMember* FoundMember = nullptr;
    GenericConstant* FoundConstant = nullptr;
    // Adapters from Class to Owner, in the order they convert; empty when Owner is Class.
    std::vector<ClassConvertAdapter*> Path;

    // The object pointer of `Class` converted to `Owner`; null stays null.
    void* Convert(void* object) const
    {
        for (ClassConvertAdapter* adapter : Path) {
            if (!object)
                break;
            object = adapter->Upcast(object);
        }
        return object;
    }
};

class GenericClass : public DeclaratedClass {
public:
    using MethodEntry = std::pair<const char*, GenericMethod*>;

    std::map<std::type_index, ClassConvertAdapter*> m_Adapters;
    const std::type_info* m_Type = nullptr;
    lua_CFunction m_GCFunction = nullptr;
    std::vector<MethodEntry> m_Methods; // sorted by name, overloads in declaration order
    std::vector<ConstructorDescription*> m_Constructors;
    std::vector<std::pair<const char*, GenericMember*>> m_Members;
    std::vector<std::pair<const char*, GenericConstant*>> m_Constants;
    std::vector<std::pair<int, GenericMethod*>> m_Operators; // sorted by index
    std::map<std::type_index, std::vector<GenericClass*>> m_UpcastPaths;

    // Deletes an object of this class (null for a class that can't be deleted).
    void (*m_Destroy)(void*) = nullptr;
    // The native type name as the compiler spells it.
    std::string m_NativeName;
    // The instance metatable in the Lua registry, made when the class is published.
    int m_MetatableRef = LUA_NOREF;

    void AddMethod(GenericMethod* method);
    void AddOperator(int index, GenericMethod* method);

    // The run of overloads of a name, or an empty run.
    std::pair<const MethodEntry*, const MethodEntry*> FindMethodRun(const char* name) const;
    // The same run as a stable object (refreshed in place when methods were added).
    const MethodRun* FindRun(const char* name);
    std::pair<const std::pair<int, GenericMethod*>*, const std::pair<int, GenericMethod*>*> FindOperatorRun(int index) const;
    GenericMember* FindOwnMember(const char* name) const;
    GenericConstant* FindOwnConstant(const char* name) const;

    bool IsType(const std::type_info& type) const { return m_Type == &type || *m_Type == type; }
    bool CanUpcast(const std::type_info& type) const;
    void* Upcast(CHost& host, const std::type_info& type, void* object);
    void* CastTo(CHost& host, const std::type_info& type, void* object);
    void ComputeUpcastPaths(CHost& host);
    // Builds an object of this class implicitly from the value at `index`; null if no
    // constructor can do it (reported).
    void* ConstructObjectFrom(CHost& host, lua_State* L, int index);
    // The first constructor that can build this class implicitly from the value at
    // `index`, or null.
    ConstructorDescription* FindImplicitConstructor(CHost& host, lua_State* L, int index) const;
    // What `name` stands for on objects of this class, current with the host's registry;
    // null for a name that never stood for anything.
    Resolution* Resolve(CHost& host, const char* name);
    // Brings a resolution of this class up to date with the host's registry.
    void Refresh(CHost& host, Resolution& resolution);

private:
    std::map<std::string, MethodRun, std::less<>> m_Runs;
    std::map<std::string, Resolution, std::less<>> m_Resolutions;
    size_t m_RunsBuiltFor = 0;
};

} // namespace mluabind::i
