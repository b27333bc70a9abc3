// Cost of a call through the binding layer against a hand-written Lua C function. Each
// benchmark iteration runs a Lua loop of kCalls calls.
//
// Aims, as medians of one run (--benchmark_repetitions=5; the machine may be shared, so
// compare CPU times of the same run): BM_BoundMemberCall at most 1.0 times
// BM_RawCApiMemberCall, BM_BoundOverloadedCall at most 1.2 times it, BM_BoundConstructor at
// most 2 times BM_RawCApiConstructor, BM_BoundPropertyGet at most 1.0 times
// BM_RawCApiPropertyGet.
#include "lua/mluabind/mluabind.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

constexpr int kCalls = 1000;

struct Counter {
    double Total = 0;
    double Add(double value) { return Total += value; }
    double Add(bool value) { return Total += value ? 1 : 0; }
    double Add(const char* text) { return Total += text ? 1 : 0; }
    double GetTotal() const { return Total; }
};

// --- hand-written binding ---

int RawAdd(lua_State* L)
{
    auto* counter = *static_cast<Counter**>(luaL_checkudata(L, 1, "RawCounter"));
    lua_pushnumber(L, counter->Add(static_cast<double>(luaL_checknumber(L, 2))));
    return 1;
}

int RawCollect(lua_State* L)
{
    delete *static_cast<Counter**>(luaL_checkudata(L, 1, "RawCounter"));
    return 0;
}

Counter* CheckRawProps(lua_State* L) { return *static_cast<Counter**>(luaL_checkudata(L, 1, "RawProps")); }

// A hand-written __index with a property: the getter by name, else the method table.
int RawPropsIndex(lua_State* L)
{
    Counter* counter = CheckRawProps(L);
    const char* key = luaL_checkstring(L, 2);
    if (std::strcmp(key, "Total") == 0) {
        lua_pushnumber(L, counter->GetTotal());
        return 1;
    }
    lua_getfield(L, lua_upvalueindex(1), key);
    return 1;
}

int RawPropsCollect(lua_State* L)
{
    delete CheckRawProps(L);
    return 0;
}

// A hand-written constructor: the object, its userdata and the shared metatable.
int RawNew(lua_State* L)
{
    auto** slot = static_cast<Counter**>(lua_newuserdata(L, sizeof(Counter*)));
    *slot = new Counter;
    luaL_getmetatable(L, "RawProps");
    lua_setmetatable(L, -2);
    return 1;
}

void RegisterRaw(lua_State* L)
{
    luaL_newmetatable(L, "RawProps");
    lua_newtable(L);
    lua_pushcclosure(L, &RawPropsIndex, 1);
    lua_setfield(L, -2, "__index");
    lua_pushcfunction(L, &RawPropsCollect);
    lua_setfield(L, -2, "__gc");
    lua_pop(L, 1);
    lua_newtable(L);
    lua_pushcfunction(L, &RawNew);
    lua_setfield(L, -2, "Counter");
    lua_setglobal(L, "rawbench");
    luaL_dostring(L, "rawprops = rawbench.Counter()");

    luaL_newmetatable(L, "RawCounter");
    lua_newtable(L);
    lua_pushcfunction(L, &RawAdd);
    lua_setfield(L, -2, "Add");
    lua_setfield(L, -2, "__index");
    lua_pushcfunction(L, &RawCollect);
    lua_setfield(L, -2, "__gc");
    lua_pop(L, 1);
    auto** slot = static_cast<Counter**>(lua_newuserdata(L, sizeof(Counter*)));
    *slot = new Counter;
    luaL_getmetatable(L, "RawCounter");
    lua_setmetatable(L, -2);
    lua_setglobal(L, "raw");
}

// --- bound through mluabind ---

class BenchHost : public mluabind::CHost {
public:
    BenchHost() : CHost(NewState(), true)
    {
        using namespace mluabind;
        BeginBinding();
        Bind(Namespace("bench")
                 .AddClass(Class<Counter>("Counter")
                               .Constructor<>()
                               .Method("Add", static_cast<double (Counter::*)(double)>(&Counter::Add))
                               .Method("AddAny", static_cast<double (Counter::*)(const char*)>(&Counter::Add))
                               .Method("AddAny", static_cast<double (Counter::*)(bool)>(&Counter::Add))
                               .Method("AddAny", static_cast<double (Counter::*)(double)>(&Counter::Add))
                               .Property("Total", &Counter::GetTotal))
                 .AddFunction(Function("Shared", [] {
                     static Counter shared;
                     return &shared;
                 })));
        EndBinding();
        RegisterRaw(L);
        // `called` has had methods read, so Lua reads its method closures from its own cache.
        Run("bound = bench.Counter() called = bench.Counter() for i = 1, 8 do called.Add(0) end");
    }

    void ReportError(const char* format, ...) override __attribute__((format(printf, 2, 3)))
    {
        va_list args;
        va_start(args, format);
        vfprintf(stderr, format, args);
        va_end(args);
        std::abort();
    }

    // Compiles `function(n) <body> end` into a global named `name`.
    void Define(const char* name, const char* body)
    {
        char code[512];
        snprintf(code, sizeof(code), "function %s(n) for i = 1, n do %s end end", name, body);
        Run(code);
    }

    void Call(const char* name)
    {
        lua_getglobal(L, name);
        lua_pushnumber(L, kCalls);
        if (lua_pcall(L, 1, 0, 0) != 0) {
            fprintf(stderr, "%s\n", lua_tostring(L, -1));
            std::abort();
        }
    }

private:
    void Run(const char* code)
    {
        if (luaL_dostring(L, code) != 0) {
            fprintf(stderr, "%s\n", lua_tostring(L, -1));
            std::abort();
        }
    }

    static lua_State* NewState()
    {
        lua_State* state = luaL_newstate();
        luaL_openlibs(state);
        return state;
    }
};

void RunLoop(benchmark::State& state, const char* body)
{
    BenchHost host;
    host.Define("loop", body);
    for (auto _ : state)
        host.Call("loop");
    state.SetItemsProcessed(state.iterations() * kCalls);
}

void BM_RawCApiMemberCall(benchmark::State& state) { RunLoop(state, "raw:Add(1)"); }
void BM_BoundMemberCall(benchmark::State& state) { RunLoop(state, "bound.Add(1)"); }
void BM_BoundOverloadedCall(benchmark::State& state) { RunLoop(state, "bound.AddAny(1)"); }
void BM_RawCApiConstructor(benchmark::State& state) { RunLoop(state, "local c = rawbench.Counter()"); }
void BM_BoundConstructor(benchmark::State& state) { RunLoop(state, "local c = bench.Counter()"); }
void BM_RawCApiPropertyGet(benchmark::State& state) { RunLoop(state, "local t = rawprops.Total"); }
void BM_BoundPropertyGet(benchmark::State& state) { RunLoop(state, "local t = bound.Total"); }
void BM_BoundPropertyGetOnCalledObject(benchmark::State& state) { RunLoop(state, "local t = called.Total"); }
// A new variable for every call, as `Instance().Method()` makes one: the first read of a
// method on an object.
void BM_BoundFreshObjectCall(benchmark::State& state) { RunLoop(state, "bench.Shared().Add(1)"); }
void BM_BoundFreshObjectTwoCalls(benchmark::State& state) { RunLoop(state, "local o = bench.Shared() o.Add(1) o.Add(1)"); }

BENCHMARK(BM_RawCApiMemberCall);
BENCHMARK(BM_BoundMemberCall);
BENCHMARK(BM_BoundOverloadedCall);
BENCHMARK(BM_RawCApiConstructor);
BENCHMARK(BM_BoundConstructor);
BENCHMARK(BM_RawCApiPropertyGet);
BENCHMARK(BM_BoundPropertyGet);
BENCHMARK(BM_BoundPropertyGetOnCalledObject);
BENCHMARK(BM_BoundFreshObjectCall);
BENCHMARK(BM_BoundFreshObjectTwoCalls);

} // namespace

BENCHMARK_MAIN();
