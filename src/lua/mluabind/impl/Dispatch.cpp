// Call dispatch: the metamethods of bound objects, the dispatchers of methods, operators,
// constructors and free functions, and the host-wide script functions.
#include "lua/mluabind/impl/Dispatch.h"

#include "lua/mluabind/Binding.h"

#include <algorithm>
#include <exception>
#include <string>

namespace mluabind::i {

namespace {

using Body = int (*)(CHost& host, lua_State* L);

// Runs a body inside a call frame. Gives -1 when the frame's message was pushed and must
// be raised; every C++ object of the call is gone by then.
template <Body body>
__attribute__((noinline)) int Guarded(lua_State* L) noexcept
{
    CHost* host = static_cast<CHost*>(lua_touserdata(L, lua_upvalueindex(1)));
    CallFrame frame;
    frame.Previous = host->GetFrame();
    host->SetFrame(&frame);
    int results;
    try {
        try {
            results = body(*host, L);
        } catch (const std::exception& e) {
            results = 0;
            host->Report("mluabind: error - native exception in a bound call: %s\n", e.what());
        } catch (...) {
            results = 0;
            host->Report("mluabind: error - native exception in a bound call: %s\n", "unknown");
        }
    } catch (...) {
        // The report itself failed; nothing may escape into Lua.
        results = 0;
    }
    host->SetFrame(frame.Previous);
    if (frame.Raise) {
        lua_pushlstring(L, frame.Message.data(), frame.Message.size());
        return -1;
    }
    return results;
}

// The C function Lua sees: raising is its last statement, in a frame without objects.
template <Body body>
int Entry(lua_State* L)
{
    int results = Guarded<body>(L);
    if (results < 0)
        return lua_error(L);
    return results;
}

struct TemporariesScope {
    explicit TemporariesScope(CHost& host) : Host(host), Depth(host.TemporariesDepth()) {}
    ~TemporariesScope()
    {
        if (Host.TemporariesDepth() > Depth)
            Host.ReleaseTemporaries(Depth);
    }
    TemporariesScope(const TemporariesScope&) = delete;
    TemporariesScope& operator=(const TemporariesScope&) = delete;
    CHost& Host;
    size_t Depth;
};

constexpr int MaxMethodCandidates = 50;
constexpr int MaxFunctionCandidates = 20;
constexpr int MaxSearchDepth = 32;

const char* Cause(int best) { return best == NoMatch ? "no one can be used" : "ambiguity"; }

void ReportForeign(CHost& host, const char* where)
{
    host.Report("%s: error - the value is not an object of a bound class.\n", where);
}

void ReportNull(CHost& host, const char* where, const GenericClass* cls)
{
    host.Report("%s: error - the object of %s is null or was collected.\n", where, cls->FullName.c_str());
}

// Keeps the candidates of the lowest score: a better one restarts the list, an equal one
// joins it while there is room.
template <class T>
void KeepBest(T* candidate, int score, T** candidates, int limit, int& found, int& best)
{
    if (score < best) {
        best = score;
        found = 0;
        candidates[found++] = candidate;
    } else if (score == best && found < limit - 1) {
        candidates[found++] = candidate;
    }
}

int MatchMethod(CHost& host, lua_State* L, GenericMethod* method, const LuaCustomVariable& view,
                const LuaCustomVariable* self)
{
    if (view.IsConst && !method->IsConst)
        return NoMatch;
    int factor = !view.IsConst && method->IsConst ? 2 : 1;
    if (method->SelfFirst && ToVariable(L, 1) != self)
        return NoMatch;
    int score = method->MatchFunction(host, L, method->SelfFirst ? 2 : 1, 0, true);
    return score >= NoMatch ? NoMatch : score * factor;
}

int InvokeMethod(CHost& host, lua_State* L, GenericMethod* method, LuaCustomVariable& view, LuaCustomVariable* self)
{
    if (host.GetFrame()->Raise)
        return 0; // matching reported: the call unwinds without running
    if (method->SelfFirst)
        lua_remove(L, 1);
    TemporariesScope scope(host);
    if (method->Policy)
        method->Policy->RunBefore(host, L, self);
    int results = method->Call(host, L, view);
    if (method->Policy)
        results = method->Policy->RunAfter(host, L, self, results);
    return results;
}

// The Lua types of the values on the stack and the const of the object, as a key for the
// choice among typed overloads; 0 when there are too many values for a key.
uint64_t TypeKey(lua_State* L, bool is_const)
{
    int top = lua_gettop(L);
    if (top > 14)
        return 0;
    uint64_t key = uint64_t{1} << 63 | uint64_t{is_const} << 62 | uint64_t(top) << 56;
    for (int index = 1; index <= top; ++index)
        key |= uint64_t(lua_type(L, index) + 1) << (4 * (index - 1));
    return key;
}

// Picks the overload with the lowest score among a run of methods or operators; runs it
// when it is the only one, else reports the candidates and the arguments. With a typed
// run of a class, the choice is kept for the next call with the same key.
template <class Entry>
int MethodCallDispatcher(CHost& host, lua_State* L, LuaCustomVariable& view, LuaCustomVariable* self,
                         const Entry* run, size_t count, const char* name, const MethodRun* typed = nullptr)
{
    GenericMethod* candidates[MaxMethodCandidates];
    int found = 0;
    int best = NoMatch;
    uint64_t key = 0;
    if (count == 1) {
        // The common case: one overload, scored and converted in one pass where it can be.
        GenericMethod* method = run[0].second;
        int results = NotTaken;
        if (!method->Policy && !method->SelfFirst && !(view.IsConst && !method->IsConst))
            results = method->TryCall(host, L, view);
        if (results >= 0)
            return results;
        if (results == NotTaken) {
            best = MatchMethod(host, L, method, view, self);
            if (best < NoMatch)
                return InvokeMethod(host, L, method, view, self);
        }
        candidates[found++] = method;
        count = 0;
    } else if (typed && typed->Typed) {
        key = TypeKey(L, view.IsConst != 0);
        if (key && key == typed->ChosenFor)
            return InvokeMethod(host, L, run[typed->Chosen].second, view, self);
    }
    for (size_t k = 0; k < count; ++k) {
        GenericMethod* method = run[k].second;
        KeepBest(method, MatchMethod(host, L, method, view, self), candidates, MaxMethodCandidates, found, best);
    }
    if (best != NoMatch && found == 1) {
        if (key) {
            typed->Chosen = static_cast<size_t>(std::find_if(run, run + count, [&](const Entry& entry) {
                                                    return entry.second == candidates[0];
                                                }) - run);
            typed->ChosenFor = key;
        }
        return InvokeMethod(host, L, candidates[0], view, self);
    }

    std::string lines;
    for (int k = 0; k < found; ++k) {
        lines += candidates[k]->Name;
        lines += "(";
        lines += candidates[k]->SignatureFunction(host);
        lines += ")";
        if (candidates[k]->IsConst)
            lines += " const";
        lines += "\n";
    }
    host.Report("Can't match method to call '%s.%s%s', candidates are:\n%sParameters are:\n%sCaused by: %s.\n",
                view.Class->FullName.c_str(), name, view.IsConst ? " const" : "", lines.c_str(),
                DescribeParameters(L, 1).c_str(), Cause(best));
    return 0;
}

bool SetMember(CHost& host, lua_State* L, GenericClass* cls, LuaCustomVariable& view, const char* name, int depth)
{
    if (GenericMember* member = cls->FindOwnMember(name)) {
        if (!view.Object)
            ReportNull(host, "MetaOperatorNewIndex", cls);
        else
            member->Set(host, L, view, lua_gettop(L));
        return true;
    }
    if (depth >= MaxSearchDepth)
        return false;
    for (auto& [type, adapter] : cls->m_Adapters) {
        GenericClass* target = adapter->GetTargetGenericClass(host);
        if (!target)
            continue;
        LuaCustomVariable base{view.Object ? adapter->Upcast(view.Object) : nullptr, target, 0, view.IsConst, kVariableTag};
        if (SetMember(host, L, target, base, name, depth + 1))
            return true;
    }
    return false;
}

// Key of the object in its own method cache (see PushMethodCache); no script can make a
// light userdata of this address.
char g_CachedObjectKey;

// The resolution of the name at index 2 for the variable: from the class's table of names
// (upvalue 2 of __index) when it is current, else made and entered there; null for an
// unknown name.
Resolution* ResolveName(CHost& host, lua_State* L, LuaCustomVariable& self)
{
    int names = lua_upvalueindex(2);
    lua_pushvalue(L, 2);
    lua_rawget(L, names); // stays on the stack: results go on top of it
    auto* known = static_cast<Resolution*>(lua_touserdata(L, -1));
    if (known && known->Class == self.Class && known->Stamp == host.GetStamp())
        return known;
    Resolution* resolution = self.Class->Resolve(host, lua_tostring(L, 2));
    if (resolution && lua_istable(L, names)) {
        lua_pushvalue(L, 2);
        lua_pushlightuserdata(L, resolution);
        lua_rawset(L, names);
    }
    return resolution;
}

// Gives the object at `object` a metatable of its own, a copy of its class's whose __index
// is the cache at `cache`. Misses in the cache fall through to the class's __index, which
// finds the object in the cache.
void ReadThroughCache(lua_State* L, int object, int cache)
{
    if (!lua_getmetatable(L, object))
        return;
    int mt = lua_gettop(L);
    lua_getfield(L, mt, "__index");
    bool own_already = lua_istable(L, -1); // __index called directly by a script
    lua_settop(L, own_already ? cache : mt);
    if (own_already)
        return;
    lua_pushvalue(L, mt);
    lua_setmetatable(L, cache);
    lua_createtable(L, 0, 8);
    int own = lua_gettop(L);
    lua_pushnil(L);
    while (lua_next(L, mt)) {
        lua_pushvalue(L, -2);
        lua_insert(L, -2);
        lua_rawset(L, own);
    }
    lua_pushvalue(L, cache);
    lua_setfield(L, own, "__index");
    lua_setmetatable(L, object);
    lua_settop(L, cache);
}

// Method reads after which an object reads its method closures through a metatable of its
// own; before, they come from its environment by a short native call.
constexpr uint8_t ReadsBeforeOwnMetatable = 4;

// Pushes the method cache of the object at `object`: a table of method closures by name, in
// the object's environment. It is made at the first method read; after a few more, Lua
// reads it without a native call (ReadThroughCache), so objects read a few times, as the
// result of `Instance()`, don't pay for a metatable. `cache` is the cache when __index was
// entered for a miss in it, else 0.
void PushMethodCache(lua_State* L, LuaCustomVariable& self, int object, int cache)
{
    if (cache) {
        lua_pushvalue(L, cache);
        return;
    }
    if (self.MethodReads > 0) {
        lua_getfenv(L, object);
        if (self.MethodReads >= ReadsBeforeOwnMetatable)
            ReadThroughCache(L, object, lua_gettop(L));
        else
            ++self.MethodReads;
        return;
    }
    self.MethodReads = 1;
    lua_createtable(L, 0, 2);
    lua_pushlightuserdata(L, &g_CachedObjectKey);
    lua_pushvalue(L, object);
    lua_rawset(L, -3);
    lua_pushvalue(L, -1);
    lua_setfenv(L, object);
}

// Pushes the closure of a method for the object at `object`, the one made before for the
// name at index 2 if there is one. The closure holds the object itself, so it can outlive
// every other reference.
void PushMethod(CHost& host, lua_State* L, Resolution& found, LuaCustomVariable& self, int object, int cache)
{
    PushMethodCache(L, self, object, cache);
    int table = lua_gettop(L);
    lua_pushvalue(L, 2);
    lua_rawget(L, table);
    if (lua_iscfunction(L, -1))
        return;
    lua_pop(L, 1);
    lua_pushlightuserdata(L, &host);
    lua_pushvalue(L, object);
    lua_pushlightuserdata(L, &found);
    lua_pushcclosure(L, &LuaMethodCallProxieFunction, 3);
    lua_pushvalue(L, 2);
    lua_pushvalue(L, -2);
    lua_rawset(L, table);
}

int IndexBody(CHost& host, lua_State* L)
{
    if (lua_type(L, 2) != LUA_TSTRING) {
        host.Report("MetaOperatorIndex: panic - currently supports only string indexes.\n");
        return 0;
    }
    int object = 1;
    int cache = 0;
    int type = lua_type(L, 1);
    if (type == LUA_TTABLE) {
        // A miss in an object's method cache: the object is in the cache.
        cache = 1;
        lua_pushlightuserdata(L, &g_CachedObjectKey);
        lua_rawget(L, cache);
        object = lua_gettop(L);
        type = lua_type(L, object);
    }
    LuaCustomVariable* self = type == LUA_TUSERDATA ? UserdataVariable(L, object) : nullptr;
    if (!self) {
        ReportForeign(host, "MetaOperatorIndex");
        return 0;
    }
    Resolution* found = ResolveName(host, L, *self);
    switch (found ? found->What : Resolution::Nothing) {
    case Resolution::Method:
        PushMethod(host, L, *found, *self, object, cache);
        return 1;
    case Resolution::Member: {
        void* object = found->Convert(self->Object);
        if (!object) {
            ReportNull(host, "MetaOperatorIndex", found->Owner);
            return 0;
        }
        LuaCustomVariable view{object, found->Owner, 0, self->IsConst, kVariableTag};
        return found->FoundMember->Get(host, L, view);
    }
    case Resolution::Constant:
        found->FoundConstant->Push(host, L);
        return 1;
    case Resolution::Nothing:
        break;
    }
    host.Report("MetaOperatorIndex: error - unknown symbol %s.\n", lua_tostring(L, 2));
    return 0;
}

int NewIndexBody(CHost& host, lua_State* L)
{
    if (lua_type(L, 2) != LUA_TSTRING) {
        host.Report("MetaOperatorNewIndex: panic - currently supports only string indexes.\n");
        return 0;
    }
    LuaCustomVariable* self = ToVariable(L, 1);
    if (!self) {
        ReportForeign(host, "MetaOperatorNewIndex");
        return 0;
    }
    const char* name = lua_tostring(L, 2);
    if (self->IsConst) {
        host.Report("MetaOperatorNewIndex: can't assign a value to a member '%s' of a const object.\n", name);
        return 0;
    }
    if (!SetMember(host, L, self->Class, *self, name, 0))
        host.Report("MetaOperatorIndex: error - unknown symbol %s.\n", name);
    return 0;
}

int ReadOnlyBody(CHost& host, lua_State* L)
{
    const char* name = lua_tostring(L, lua_upvalueindex(2));
    const char* key = lua_type(L, 2) == LUA_TSTRING ? lua_tostring(L, 2) : luaL_typename(L, 2);
    host.Report("MetaOperatorNewIndex: error - the metatable of %s is read-only ('%s' can't be set).\n",
                name ? name : "?", key);
    return 0;
}

int MethodCallBody(CHost& host, lua_State* L)
{
    auto* self = static_cast<LuaCustomVariable*>(lua_touserdata(L, lua_upvalueindex(2)));
    auto* found = static_cast<Resolution*>(lua_touserdata(L, lua_upvalueindex(3)));
    if (found->Stamp != host.GetStamp())
        found->Class->Refresh(host, *found);
    if (found->What != Resolution::Method || found->Run->Count == 0) {
        host.Report("GenericClass::LuaMethodCallProxieFunction: panic - can't find GenericMethod %s!\n", found->Name.c_str());
        return 0;
    }
    void* object = found->Convert(self->Object);
    if (!object) {
        ReportNull(host, "GenericClass::LuaMethodCallProxieFunction", found->Owner);
        return 0;
    }
    const MethodRun* run = found->Run;
    LuaCustomVariable view{object, found->Owner, 0, self->IsConst, kVariableTag};
    return MethodCallDispatcher(host, L, view, self, run->Begin, run->Count, run->Begin->first, run);
}

bool HasOperator(const LuaCustomVariable* variable, int index)
{
    if (!variable)
        return false;
    auto [begin, end] = variable->Class->FindOperatorRun(index);
    return begin != end;
}

int OperatorBody(CHost& host, lua_State* L)
{
    int index = static_cast<int>(lua_tonumber(L, lua_upvalueindex(2)));
    LuaCustomVariable* self = ToVariable(L, 1);
    if (!HasOperator(self, index)) {
        self = ToVariable(L, 2);
        if (!HasOperator(self, index)) {
            host.Report("GenericClass::LuaOperatorCallProxieFunction: panic - can't find a variable to call operator handler for '%s'",
                        OperatorEventName(index));
            return 0;
        }
    }
    if (index == OpUnm)
        lua_pop(L, 1); // Lua passes the operand twice
    if (!self->Object) {
        ReportNull(host, "GenericClass::LuaOperatorCallProxieFunction", self->Class);
        return 0;
    }
    auto [begin, end] = self->Class->FindOperatorRun(index);
    LuaCustomVariable view = *self;
    return MethodCallDispatcher(host, L, view, self, begin, static_cast<size_t>(end - begin), OperatorEventName(index));
}

int ConstructorBody(CHost& host, lua_State* L)
{
    auto* cls = static_cast<GenericClass*>(lua_touserdata(L, lua_upvalueindex(2)));
    if (!cls) {
        host.Report("CustomClass::Constructor panic - can't find GenericClass!\n");
        return 0;
    }
    lua_remove(L, 1); // the class table
    ConstructorDescription* candidates[MaxMethodCandidates];
    int found = 0;
    int best = NoMatch;
    for (ConstructorDescription* constructor : cls->m_Constructors) {
        KeepBest(constructor, constructor->MatchFunction(host, L, 1, 0, true), candidates, MaxMethodCandidates, found, best);
    }
    if (best != NoMatch && found == 1) {
        if (host.GetFrame()->Raise)
            return 0;
        ConstructorDescription* constructor = candidates[0];
        TemporariesScope scope(host);
        if (constructor->Policy)
            constructor->Policy->RunBefore(host, L, nullptr);
        void* object = constructor->CreateFunction(host, L, 1);
        if (!object)
            return 0;
        LuaCustomVariable* variable = CreateVariable(host, L, cls, object, true, false);
        int results = 1;
        if (constructor->Policy)
            results = constructor->Policy->RunAfter(host, L, variable, results);
        return results;
    }
    std::string lines;
    for (int k = 0; k < found; ++k)
        lines += cls->FullName + "(" + candidates[k]->SignatureFunction(host) + ")\n";
    host.Report("Can't match constructor to create %s, candidates are:\n%sParameters are:\n%sCaused by: %s.",
                cls->FullName.c_str(), lines.c_str(), DescribeParameters(L, 1).c_str(), Cause(best));
    return 0;
}

int FunctionBody(CHost& host, lua_State* L)
{
    const char* name = lua_tostring(L, lua_upvalueindex(2));
    auto* overloads = static_cast<std::vector<GenericFunction*>*>(lua_touserdata(L, lua_upvalueindex(3)));
    if (!overloads || overloads->empty()) {
        host.Report("LuaGlobalFunctionDispatcher: panic - can't find GenericFunction %s!\n", name ? name : "");
        return 0;
    }
    if (overloads->size() == 1 && !overloads->front()->Policy) {
        int results = overloads->front()->TryCall(host, L);
        if (results >= 0)
            return results;
    }
    GenericFunction* candidates[MaxFunctionCandidates];
    int found = 0;
    int best = NoMatch;
    for (GenericFunction* function : *overloads) {
        KeepBest(function, function->MatchFunction(host, L, 1, 0, true), candidates, MaxFunctionCandidates, found, best);
    }
    if (best != NoMatch && found == 1) {
        if (host.GetFrame()->Raise)
            return 0;
        GenericFunction* function = candidates[0];
        TemporariesScope scope(host);
        if (function->Policy)
            function->Policy->RunBefore(host, L, nullptr);
        int results = function->Call(host, L);
        if (function->Policy)
            results = function->Policy->RunAfter(host, L, nullptr, results);
        return results;
    }
    std::string lines;
    for (int k = 0; k < found; ++k)
        lines += candidates[k]->FullName + "(" + candidates[k]->SignatureFunction(host) + ")\n";
    host.Report("Can't match function to call %s, candidates are:\n%sParameters are:\n%sCaused by: %s.\n",
                name ? name : "", lines.c_str(), DescribeParameters(L, 1).c_str(), Cause(best));
    return 0;
}

// The full class name a cast aims at: a name, or a class table with its tag.
bool TargetName(lua_State* L, int index, std::string& name)
{
    if (lua_type(L, index) == LUA_TSTRING) {
        name = lua_tostring(L, index);
        return true;
    }
    if (lua_type(L, index) == LUA_TTABLE) {
        lua_pushstring(L, "__MLUABIND_LUANAMESPACEDESCRIPTIONTAG");
        lua_rawget(L, index);
        bool found = lua_type(L, -1) == LUA_TSTRING;
        if (found)
            name = lua_tostring(L, -1);
        lua_pop(L, 1);
        return found;
    }
    return false;
}

int CastBody(CHost& host, lua_State* L)
{
    if (lua_gettop(L) < 2) {
        host.Report("LuaCast: missings parameters");
        return 0;
    }
    std::string name;
    if (!TargetName(L, 2, name)) {
        host.Report("LuaCast: can't retreive target type name");
        return 0;
    }
    GenericClass* target = host.FindClassByName(name);
    if (!target) {
        host.Report("LuaCast: can't target generic class for %s", name.c_str());
        return 0;
    }
    LuaCustomVariable* source = ToVariable(L, 1);
    void* object = source && source->Object ? source->Class->CastTo(host, *target->m_Type, source->Object) : nullptr;
    if (!object) {
        lua_pushnil(L);
        return 1;
    }
    CreateVariable(host, L, target, object, false, source->IsConst != 0);
    return 1;
}

int CastUnsafeBody(CHost& host, lua_State* L)
{
    if (lua_gettop(L) < 2) {
        host.Report("LuaCastUnsafe: missings parameters");
        return 0;
    }
    std::string name;
    if (!TargetName(L, 2, name)) {
        host.Report("LuaCastUnsafe: can't retreive target type name");
        return 0;
    }
    GenericClass* target = host.FindClassByName(name);
    LuaCustomVariable* source = ToVariable(L, 1);
    if (!target || (!source && lua_type(L, 1) != LUA_TLIGHTUSERDATA)) {
        lua_pushnil(L);
        return 1;
    }
    void* object = source ? source->Object : lua_touserdata(L, 1);
    CreateVariable(host, L, target, object, false, source && source->IsConst);
    return 1;
}

int ConstBody(CHost&, lua_State* L)
{
    if (LuaCustomVariable* variable = ToVariable(L, 1))
        variable->IsConst = lua_isnone(L, 2) || lua_toboolean(L, 2) ? 1 : 0;
    lua_settop(L, 1);
    return 1;
}

// Type names for scripts; `extended` adds " const" and " owned", `native` gives the
// native type name of a bound object.
int TypeBody(lua_State* L, bool extended, bool native)
{
    if (lua_gettop(L) == 0) {
        lua_pushstring(L, lua_typename(L, LUA_TNONE));
        return 1;
    }
    if (LuaCustomVariable* variable = ToVariable(L, 1)) {
        std::string text = native ? variable->Class->m_NativeName : variable->Class->FullName;
        if (extended) {
            if (variable->IsConst)
                text += " const";
            if (variable->IsOwned)
                text += " owned";
        }
        lua_pushlstring(L, text.data(), text.size());
        return 1;
    }
    if (lua_type(L, 1) == LUA_TLIGHTUSERDATA)
        lua_pushstring(L, "raw pointer");
    else
        lua_pushstring(L, lua_typename(L, lua_type(L, 1)));
    return 1;
}

int GetTypeBody(CHost&, lua_State* L) { return TypeBody(L, false, false); }
int GetTypeExBody(CHost&, lua_State* L) { return TypeBody(L, true, false); }
int GetRttiTypeBody(CHost&, lua_State* L) { return TypeBody(L, false, true); }

} // namespace

int MetaOperatorIndex(lua_State* L) { return Entry<&IndexBody>(L); }
int MetaOperatorNewIndex(lua_State* L) { return Entry<&NewIndexBody>(L); }
int MetaOperatorReadOnly(lua_State* L) { return Entry<&ReadOnlyBody>(L); }
int LuaMethodCallProxieFunction(lua_State* L) { return Entry<&MethodCallBody>(L); }
int LuaOperatorCallProxieFunction(lua_State* L) { return Entry<&OperatorBody>(L); }
int ConstructorCallDispatcher(lua_State* L) { return Entry<&ConstructorBody>(L); }
int LuaGlobalFunctionDispatcher(lua_State* L) { return Entry<&FunctionBody>(L); }
int LuaCast(lua_State* L) { return Entry<&CastBody>(L); }
int LuaCastUnsafe(lua_State* L) { return Entry<&CastUnsafeBody>(L); }
int LuaConst(lua_State* L) { return Entry<&ConstBody>(L); }
int LuaGetType(lua_State* L) { return Entry<&GetTypeBody>(L); }
int LuaGetTypeEx(lua_State* L) { return Entry<&GetTypeExBody>(L); }
int LuaGetRttiType(lua_State* L) { return Entry<&GetRttiTypeBody>(L); }

std::string DescribeParameters(lua_State* L, int from)
{
    int top = lua_gettop(L);
    if (top < from)
        return "None\n";
    std::string text;
    for (int index = from; index <= top; ++index) {
        text += "* ";
        switch (lua_type(L, index)) {
        case LUA_TNIL: text += "lua type: nil"; break;
        case LUA_TBOOLEAN: text += "boolean"; break;
        case LUA_TLIGHTUSERDATA: text += "raw pointer"; break;
        case LUA_TNUMBER: text += "number"; break;
        case LUA_TSTRING: text += "string"; break;
        case LUA_TTABLE: text += "table"; break;
        case LUA_TUSERDATA:
            if (LuaCustomVariable* variable = ToVariable(L, index)) {
                text += "custom class: ";
                if (variable->IsConst)
                    text += "const ";
                text += variable->Class->FullName;
            } else {
                text += "unknown";
            }
            break;
        default: text += "unknown"; break;
        }
        text += "\n";
    }
    return text;
}

void ReportMemberConst(CHost& host) { host.Report("MemberClass::PerformNewIndexOperator: can't assign to a const variable.\n"); }
void ReportMemberNoAssign(CHost& host)
{
    host.Report("MemberClass::PerformNewIndexOperator: left value has no assign operator.\n");
}
void ReportMemberConvert(CHost& host)
{
    host.Report("MemberClass::PerformNewIndexOperator: can't convert a variable to assign.\n");
}
void ReportPropertyNoSetter(CHost& host)
{
    host.Report("FreePropertyClass::PerformNewIndexOperator: can't assign - no setter available.\n");
}
void ReportPropertyConst(CHost& host)
{
    host.Report("FreePropertyClass::PerformNewIndexOperator: can't change property at const object.\n");
}
void ReportPropertyConvert(CHost& host, lua_State* L, int index)
{
    host.Report("FreePropertyClass::PerformNewIndexOperator: can't convert params to call setter.\nParameters are:\n%s",
                DescribeParameters(L, index).c_str());
}

const char* OperatorEventName(int index)
{
    static const char* const names[] = {"__add", "__sub", "__mul", "__div", "__mod", "__unm",
                                        "__eq", "__lt", "__le", "__tostring", "__concat", "__call"};
    return index >= 0 && index < 12 ? names[index] : "__unknown";
}

} // namespace mluabind::i
