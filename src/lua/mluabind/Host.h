#pragma once
// The binding host: one registry of bound classes, functions and constants per Lua state.
//
// Error model. Lua is C and unwinds with longjmp, so no C++ exception and no lua_error may
// pass through a C++ frame with live objects. Every entry point from Lua runs its body
// inside a guarded call frame; a failure is reported through the virtual ReportError.
// The default ReportError keeps the first message of the running call; once the body and
// its objects are gone, the entry point raises it with lua_error as its last statement.
// An override (the game's host, tests) may simply record the text: the failed call then
// returns no values and the script gets nil.
#include <lua.hpp>

#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <typeindex>
#include <typeinfo>
#include <utility>
#include <vector>

namespace mluabind {

class CHost;
class Namespace;

namespace i {
class GenericClass;
class GenericFunction;
class GenericConstant;
struct CallFrame;
struct DeclarationArena;
} // namespace i

// The body of every bound userdata. An owned object is deleted by the class's __gc.
struct LuaCustomVariable {
    void* Object;
    i::GenericClass* Class;
    uint8_t IsOwned;
    uint8_t IsConst;
    uint16_t Tag;             // marks the userdata as one of ours
    uint8_t MethodReads = 0;  // how often methods were read from it (see Dispatch.cpp)
};

constexpr uint16_t kVariableTag = 0x6d6c;

class CHost {
public:
    // Attaches to a Lua state. With `owns_state` the host closes it first thing in its
    // destructor; otherwise the owner must close the state before the host goes (the __gc
    // functions of bound objects need the classes).
    explicit CHost(lua_State* state, bool owns_state = false);
    virtual ~CHost();
    CHost(const CHost&) = delete;
    CHost& operator=(const CHost&) = delete;

    // Reports a failure of the binding layer; see the error model above.
    virtual void ReportError(const char* format, ...) __attribute__((format(printf, 2, 3)));

    lua_State* GetLuaState() const { return L; }
    // The host attached to a Lua state (or to the main state of a coroutine), or null.
    static CHost* FromState(lua_State* state);

    // Declaration mode: builders allocate from this host's arena between the two calls.
    void BeginBinding();
    void EndBinding();
    static CHost* GetCurrentBindingHost() { return m_CurrentBindingHost; }
    // Memory for one declaration; `destroy` runs in place when the host is destroyed.
    void* AllocateDeclaration(size_t size, void (*destroy)(void*));

    // Publishes every class, function and constant of the namespace into the globals.
    void Bind(const Namespace& ns);

    // Hides the metatable at `index` behind a read-only face: getmetatable gives the face,
    // which reads through to the metatable and reports every write (naming `name`). So no
    // script can give a userdata a finaliser of its own, which could raise a Lua error in
    // the middle of a bound call. Leaves the face on the stack.
    void ProtectMetatable(int index, const char* name);

    i::GenericClass* FindClass(const std::type_info& type) const;
    i::GenericClass* FindClassByName(const std::string& name) const;
    const std::vector<i::GenericFunction*>* FindFunctions(const std::string& name) const;

    // Which host a Lua callback belongs to: native code brackets each entry into Lua.
    static void PushCurrentHost(CHost* host);
    static void PopCurrentHost();
    static CHost* GetCurrentHost();

    // --- used by the binding layer itself ---

    // Formats without a length limit and hands the text to ReportError.
    void Report(const char* format, ...) __attribute__((format(printf, 2, 3)));
    // Objects built implicitly for the call in progress.
    size_t TemporariesDepth() const { return m_Temporaries.size(); }
    void AddTemporary(void* object, void (*destroy)(void*)) { m_Temporaries.emplace_back(object, destroy); }
    void ReleaseTemporaries(size_t depth);
    // Changes whenever the class registry of any host changes; caches compare it.
    uint64_t GetStamp() const { return m_Stamp; }
    i::CallFrame* GetFrame() const { return m_Frame; }
    void SetFrame(i::CallFrame* frame) { m_Frame = frame; }

protected:
    lua_State* L;

private:
    void ExportClass(i::GenericClass* cls, int table, const char* name);
    void ExportFunction(i::GenericFunction* function, int table, const char* name);
    void ExportConstant(i::GenericConstant* constant, int table, const char* name);
    template <class Item, class Fn>
    void ExportDotted(Item* item, int table, const char* name, Fn&& leaf);
    void CreateMetatable(i::GenericClass* cls);
    void RegisterHostFunctions();

    std::map<std::type_index, i::GenericClass*> m_ClassesByType;
    std::map<std::string, i::GenericClass*> m_ClassesByName;
    std::map<std::string, std::vector<i::GenericFunction*>> m_FunctionsByName;
    std::vector<std::pair<void*, void (*)(void*)>> m_Temporaries;
    i::DeclarationArena* m_DeclarationArena;
    bool m_OwnsState;
    uint64_t m_Stamp;
    i::CallFrame* m_Frame = nullptr;

    static CHost* m_CurrentBindingHost;
};

} // namespace mluabind
