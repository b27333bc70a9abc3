// The engine's Lua host: listing by id, running text, loading scripts from the game folder,
// reload, the garbage step and calls from native code into Lua.
#include "lua/Lua.h"

#include "lua/LuaBinding.h"
#include "lua/mluabind/StdBinding.h"
#include "lua/LuaTestHost.h"
#include "misc/GamePack.h"
#include "misc/PackWriter.h"
#include "support/TestSupport.h"

#include <algorithm>
#include <chrono>
#include <thread>

using ox::lua::CallLuaFunction;
using ox::lua::CLua;

namespace {

struct Lamp {
    // The power of every lamp that was destroyed.
    static inline std::vector<int> Finalised;
    int Power = 0;
    Lamp() = default;
    explicit Lamp(int power) : Power(power) {}
    Lamp(const Lamp&) = default;
    ~Lamp() { Finalised.push_back(Power); }
    int GetPower() const { return Power; }
};

struct Unbound {};

// Returned by value: lives on the native side while its Lua copy is being made.
struct Probe {
    static inline int Alive = 0;
    Probe() { ++Alive; }
    Probe(const Probe&) { ++Alive; }
    ~Probe() { --Alive; }
};

struct LuaHostTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::LogCapture log;
    oxtest::MessageCapture boxes;

    static void BindBasics(CLua& lua)
    {
        lua.BeginBinding();
        lua.Bind(mluabind::BindStdStrings());
        lua.Bind(mluabind::Namespace("ox").Merge(ox::lua::BindFileWatcher()).Merge(ox::lua::BindLuaClasses()));
        lua.Bind(mluabind::Namespace("game")
                     .AddClass(mluabind::Class<Lamp>("Lamp")
                                   .Constructor<>()
                                   .Constructor<int>()
                                   .Member("Power", &Lamp::Power)
                                   .Method("GetPower", &Lamp::GetPower))
                     .AddClass(mluabind::Class<Probe>("Probe"))
                     .AddFunction(mluabind::Function("Twice", [](int x) { return 2 * x; }))
                     .AddFunction(mluabind::Function("MakeProbe", [] { return Probe(); })));
        lua.EndBinding();
    }
    static std::string Eval(CLua& lua, const std::string& code) { return oxtest::RunChunk(lua.GetLuaState(), code); }

    std::vector<std::string> BoxTexts(const char* caption) const
    {
        std::vector<std::string> texts;
        for (const auto& box : boxes.Boxes())
            if (box.caption == caption)
                texts.push_back(box.text);
        return texts;
    }
    bool LogHas(const std::string& entry) const
    {
        for (const std::string& line : log.Entries())
            if (line.find(entry) != std::string::npos)
                return true;
        return false;
    }
};

} // namespace

TEST_F(LuaHostTest, HostsAreListedByTheirId)
{
    {
        CLua main("test_main", false);
        CLua anonymous("", false);
        EXPECT_EQ(CLua::GetLua("test_main"), &main);
        EXPECT_EQ(CLua::GetLua(""), nullptr);
        EXPECT_EQ(CLua::GetLua("no such host"), nullptr);
        {
            oxtest::AssertCapture asserts;
            CLua twin("test_main", false);
            EXPECT_TRUE(asserts.Has("f==m_Luas.end()"));
        }
        EXPECT_EQ(CLua::GetLua("test_main"), &main) << "the second host with one id leaves the first listed";

        // Every host has the standard libraries and LuaFileSystem.
        EXPECT_EQ(Eval(anonymous, "return type(lfs.currentdir) .. type(string.rep) .. type(io.open) .. type(os.time) "
                                  ".. type(debug.traceback) .. type(package.loaded) .. type(coroutine.wrap)"),
                  "functionfunctionfunctionfunctionfunctiontablefunction");

        // Scripts see the same registry, and may make hosts of their own.
        BindBasics(main);
        EXPECT_EQ(Eval(main, "return ox.lua.CLua.GetLua('test_main').GetId().c_str()"), "test_main");
        EXPECT_EQ(Eval(main, "return ox.lua.CLua.GetLua('no such host') == nil"), "true");
        EXPECT_EQ(Eval(main, "level = ox.lua.CLua('test_level', false) return level.Run(std.string('x = 1'))"), "true");
        ASSERT_NE(CLua::GetLua("test_level"), nullptr);
        EXPECT_EQ(Eval(*CLua::GetLua("test_level"), "return x"), "1");
        EXPECT_EQ(Eval(main, "level = nil collectgarbage() collectgarbage()"), "nil");
        EXPECT_EQ(CLua::GetLua("test_level"), nullptr);
    }
    EXPECT_EQ(CLua::GetLua("test_main"), nullptr);
}

TEST_F(LuaHostTest, GarbageStepRunsOncePerPeriodOnListedHostsOnly)
{
    CLua listed("test_gc", false);
    CLua anonymous("", false);
    BindBasics(listed);
    BindBasics(anonymous);
    // Finalised lamps show which state collected its garbage. The automatic collector is off.
    auto garbage = [](int power) {
        return "collectgarbage('stop') for i = 1, 200 do game.Lamp(" + std::to_string(power) + ") end";
    };
    ASSERT_EQ(Eval(listed, garbage(1)), "nil");
    ASSERT_EQ(Eval(anonymous, garbage(2)), "nil");
    Lamp::Finalised.clear();
    // A host that a script made and dropped: the step finalises it while going through the list.
    ASSERT_EQ(Eval(listed, "ox.lua.CLua('test_gc_dropped', false)"), "nil");
    ASSERT_NE(CLua::GetLua("test_gc_dropped"), nullptr);

    uint32_t now = CLua::GetLastGCTime() + CLua::GCPeriod;
    CLua::StepGarbageCollector(now);
    EXPECT_EQ(CLua::GetLastGCTime(), now - CLua::GCPeriod) << "the period must be exceeded";
    for (int i = 0; i < 200 && (Lamp::Finalised.empty() || CLua::GetLua("test_gc_dropped")); ++i) {
        now += CLua::GCPeriod + 1;
        CLua::StepGarbageCollector(now);
        EXPECT_EQ(CLua::GetLastGCTime(), now);
    }
    EXPECT_NE(std::count(Lamp::Finalised.begin(), Lamp::Finalised.end(), 1), 0);
    EXPECT_EQ(std::count(Lamp::Finalised.begin(), Lamp::Finalised.end(), 2), 0);
    EXPECT_EQ(CLua::GetLua("test_gc_dropped"), nullptr);
}

TEST_F(LuaHostTest, RunReportsFailuresAndKeepsTheStack)
{
    CLua lua("", false);
    lua_State* L = lua.GetLuaState();
    EXPECT_TRUE(lua.Run("return 1, 2, 3"));
    EXPECT_EQ(lua_gettop(L), 0);

    EXPECT_FALSE(lua.Run("x = = 1"));
    ASSERT_EQ(BoxTexts("Lua Error").size(), 1u);
    EXPECT_EQ(BoxTexts("Lua Error")[0].rfind("[string \"x = = 1\"]:1:", 0), 0u) << BoxTexts("Lua Error")[0];
    EXPECT_TRUE(LogHas("lua|3|[string \"x = = 1\"]:1:"));

    EXPECT_FALSE(lua.Run("error('boom')"));
    EXPECT_NE(BoxTexts("Lua Error").back().find("boom"), std::string::npos);
    EXPECT_FALSE(lua.Run("error({})"));
    EXPECT_EQ(BoxTexts("Lua Error").back(), "(error object is a table value)");
    EXPECT_EQ(lua_gettop(L), 0);

    // The wide form runs the same text.
    EXPECT_TRUE(lua.Run(ox::wstring(u"w = '\u0416'")));
    EXPECT_EQ(Eval(lua, "return w"), "\xD0\x96");

    // Compiled chunks are refused without running.
    size_t shown = boxes.Boxes().size();
    EXPECT_FALSE(lua.Run(std::string("\x1bLua\x51\x00", 6)));
    EXPECT_EQ(boxes.Boxes().size(), shown);
    EXPECT_TRUE(LogHas("precompiled"));
}

TEST_F(LuaHostTest, ErrorsInsideCoroutines)
{
    CLua lua("", false);
    BindBasics(lua);
    // A Lua error ends the coroutine and comes back from resume.
    EXPECT_TRUE(lua.Run("co = coroutine.create(function() error('inside') end) ok, msg = coroutine.resume(co)"));
    EXPECT_EQ(Eval(lua, "return tostring(ok)"), "false");
    EXPECT_NE(Eval(lua, "return msg").find(":1: inside"), std::string::npos);
    // A bound call that can't be matched is reported and the coroutine goes on.
    EXPECT_TRUE(lua.Run("co = coroutine.wrap(function() a = game.Twice('x') coroutine.yield() b = game.Twice(4) end) "
                        "co() co()"));
    EXPECT_EQ(Eval(lua, "return tostring(a) .. ' ' .. tostring(b)"), "nil 8");
    ASSERT_EQ(BoxTexts("Lua Error").size(), 1u);
    EXPECT_EQ(BoxTexts("Lua Error")[0].rfind("Can't match function to call game.Twice", 0), 0u);
    // An error raised inside a coroutine that native code resumes through a call.
    EXPECT_TRUE(lua.Run("function Step() local c = coroutine.create(function() error('deep') end) "
                        "local ok, m = coroutine.resume(c) error(m, 0) end"));
    CallLuaFunction(&lua, "Step");
    EXPECT_NE(BoxTexts("Lua Error").back().find("deep"), std::string::npos);
    EXPECT_EQ(lua_gettop(lua.GetLuaState()), 0);
}

TEST_F(LuaHostTest, ScriptsCantGiveAUserdataAFailingFinaliser)
{
    // Each way a script could reach the finaliser of a userdata, then garbage for it. A
    // finaliser that raised while a bound call allocates would jump over that call's
    // native objects.
    const char* attacks[] = {
        "local p = newproxy(true) getmetatable(p).__gc = fail",
        "getmetatable(game.Lamp()).__gc = fail",
        "__MLUABIND_LUAOPERATORCLOSURESSTORAGE['game.Lamp'].__gc = fail",
        "debug.getmetatable(game.Lamp()).__gc = fail",
        "debug.setmetatable(game.Lamp(), {__gc = fail})",
        "getmetatable(io.stdout).__gc = fail io.tmpfile()",
        "io.stdout.__index.__gc = fail io.tmpfile()",
        "getmetatable(io.stdout).__index.__gc = fail io.tmpfile()",
        "debug.getregistry()['FILE*'].__gc = fail io.tmpfile()",
        "debug.setfenv(io.tmpfile(), setmetatable({}, {__index = fail}))",
        "local env = debug.getfenv(io.open) env.__close = nil setmetatable(env, {__index = fail}) io.tmpfile()",
        "local _, dir = lfs.dir('.') getmetatable(dir).__gc = fail lfs.dir('.')",
        "debug.getupvalue(debug.setmetatable, 1)(game.Lamp(), {__gc = fail})",
    };
    Probe::Alive = 0;
    {
        CLua lua("", false);
        BindBasics(lua);
        ASSERT_TRUE(lua.Run("failures = 0 function fail() failures = failures + 1 error('finaliser fails') end"));
        for (const char* attack : attacks) {
            lua.Run(std::string("pcall(function() ") + attack + " end)");
            EXPECT_TRUE(lua.Run("for i = 1, 3000 do game.MakeProbe() end collectgarbage()")) << attack;
        }
        EXPECT_EQ(Eval(lua, "return failures"), "0");
        EXPECT_EQ(Eval(lua, "local f = io.tmpfile() f:write('kept') f:seek('set') return f:read('*a')"), "kept");
        // Writes to a protected metatable are reported, and change nothing.
        EXPECT_EQ(BoxTexts("Lua Error").front(),
                  "MetaOperatorNewIndex: error - the metatable of game.Lamp is read-only ('__gc' can't be set).\n");
        EXPECT_EQ(Eval(lua, "return __MLUABIND_LUAOPERATORCLOSURESSTORAGE['game.Lamp'] == getmetatable(game.Lamp())"),
                  "true");
        Lamp::Finalised.clear();
        EXPECT_EQ(Eval(lua, "game.Lamp(7) collectgarbage() collectgarbage()"), "nil");
        EXPECT_EQ(std::count(Lamp::Finalised.begin(), Lamp::Finalised.end(), 7), 1) << "the real finaliser stays";
    }
    EXPECT_EQ(Probe::Alive, 0) << "every native object of every call was destroyed";
}

TEST_F(LuaHostTest, ScriptsLoadChunksAsTextOnlyAndNoNativeLibraries)
{
    // Every way a script loads a chunk refuses a precompiled one (the undump trusts its
    // input), naming it; text loads as before, a first line of '#' skipped.
    CLua lua("", false);
    dir.Write("text.lua", "#!/usr/bin/lua\nreturn 'text'");
    ASSERT_TRUE(lua.Run("package.path = './?.lua' code = string.dump(function() return 'compiled' end) "
                        "local f = io.open('compiled.lua', 'wb') f:write(code) f:close() "
                        "function pieces(text) local i = 0 return function() i = i + 1 "
                        "return i == 1 and text:sub(1, 1) or i == 2 and text:sub(2) or nil end end"));
    const char* refusals[][2] = {
        {"loadstring(code)", "(string)"},
        {"loadstring(code, '=named')", "named"},
        {"load(pieces(code))", "(load)"},
        {"loadfile('compiled.lua')", "compiled.lua"},
        {"pcall(dofile, 'compiled.lua')", "compiled.lua"},
        {"pcall(require, 'compiled')", "error loading module 'compiled' from file './compiled.lua':\n\t./compiled.lua"},
    };
    for (auto [call, name] : refusals)
        EXPECT_EQ(Eval(lua, std::string("local _, message = ") + call + " return tostring(message)"),
                  std::string(name) + ": a precompiled Lua chunk is refused, scripts are loaded as text only");
    EXPECT_TRUE(LogHas("lua|3|compiled.lua: a precompiled Lua chunk is refused"));
    EXPECT_EQ(Eval(lua, "return loadstring('return 1')() .. load(pieces('return 2'))() .. loadfile('text.lua')() .. "
                        "dofile('text.lua') .. require('text')"),
              "12texttexttext");
    EXPECT_EQ(Eval(lua, "return select(2, loadstring('x = = 1', '=line')) .. "
                        "select(2, loadfile('missing.lua'))"),
              "line:1: unexpected symbol near '='cannot open missing.lua: No such file or directory");
    EXPECT_EQ(Eval(lua, "return select(2, pcall(require, 'missing'))"),
              "module 'missing' not found:\n\tno field package.preload['missing']\n\tno file './missing.lua'");

    // No native library loads: a module found only as one is not found at all.
    dir.Write("native.so", "not a library");
    EXPECT_EQ(Eval(lua, "return tostring(package.loadlib) .. tostring(package.cpath) .. #package.loaders"), "nilnil2");
    EXPECT_EQ(Eval(lua, "package.cpath = './?.so' package.path = '' return select(2, pcall(require, 'native'))"),
              "module 'native' not found:\n\tno field package.preload['native']");
}

TEST_F(LuaHostTest, DebugLibraryKeepsOffNativeFrames)
{
    CLua lua("", false);
    // The locals of a native frame (here one that calls back and then returns its first
    // argument) can't be read or written; those of Lua functions can.
    lua_State* L = lua.GetLuaState();
    lua_pushcfunction(L, [](lua_State* state) {
        lua_call(state, 0, 0);
        return 1;
    });
    lua_setglobal(L, "callBack");
    for (std::string access : {"getlocal(2, 1)", "setlocal(2, 1, 'changed')"})
        EXPECT_NE(Eval(lua, "return select(2, pcall(callBack, 'kept', function() debug." + access + " end))")
                      .find("debug." + access.substr(0, 8) + ": not for the frame of a native function"),
                  std::string::npos);
    EXPECT_EQ(Eval(lua, "return select(2, pcall(callBack, 'kept', function() end))"), "kept");
    EXPECT_EQ(Eval(lua, "local x = 1 local function f() debug.setlocal(2, 1, 5) end f() "
                        "return x .. select(2, debug.getlocal(1, 1))"),
              "55");
    EXPECT_EQ(Eval(lua, "local co = coroutine.create(function(a) coroutine.yield() end) coroutine.resume(co, 'arg') "
                        "return select(2, debug.getlocal(co, 1, 1)) .. tostring(pcall(debug.getlocal, co, 0, 1))"),
              "argfalse");
    // Hooks only on lines and counts: a call or return hook would fire around native calls.
    EXPECT_NE(Eval(lua, "return select(2, pcall(debug.sethook, print, 'c'))").find("debug.sethook"), std::string::npos);
    EXPECT_EQ(Eval(lua, "local n = 0 debug.sethook(function() n = n + 1 end, '', 1) for i = 1, 10 do end "
                        "debug.sethook() return n > 10"),
              "true");
    EXPECT_EQ(Eval(lua, "return tostring(debug.debug)"), "nil");
}

TEST_F(LuaHostTest, CallLuaFunctionPushesEachArgumentKind)
{
    CLua lua("", false);
    BindBasics(lua);
    ASSERT_TRUE(lua.Run("function describe(...) local out = {} for i = 1, select('#', ...) do "
                        "local v = select(i, ...) out[i] = type(v) == 'userdata' and __get_typeex(v) or "
                        "type(v) .. ':' .. tostring(v) end return table.concat(out, ',') end"));
    Lamp lamp(3);
    const Lamp* constLamp = &lamp;
    Lamp* noLamp = nullptr;
    EXPECT_EQ(CallLuaFunction<std::string>(&lua, "describe", 7, 2.5, true, "text", std::string("s"), ox::wstring(u"w"),
                                           u"\u0416", lamp, &lamp, constLamp),
              "number:7,number:2.5,boolean:true,string:text,std.string owned,std.wstring owned,string:\xD0\x96,"
              "game.Lamp owned,game.Lamp,game.Lamp const");
    EXPECT_EQ(CallLuaFunction<std::string>(&lua, "describe", noLamp, 'c', 5u), "nil:nil,string:c,number:5");
    EXPECT_EQ(CallLuaFunction<std::string>(&lua, "describe"), "");

    // A value was copied; a pointer reaches the native object.
    ASSERT_TRUE(lua.Run("function brighten(copy, same) copy.Power = 100 same.Power = same.Power + 1 end"));
    CallLuaFunction(&lua, "brighten", lamp, &lamp);
    EXPECT_EQ(lamp.Power, 4);

    // A class without registration is reported; nil keeps its slot.
    EXPECT_EQ(CallLuaFunction<std::string>(&lua, "describe", Unbound {}, 5), "nil:nil,number:5");
    ASSERT_EQ(BoxTexts("Lua Error").size(), 1u);
    EXPECT_EQ(BoxTexts("Lua Error")[0].rfind("CreateCustomLuaVariable<ByVal> can't find GenericClass for ", 0), 0u);
    EXPECT_EQ(lua_gettop(lua.GetLuaState()), 0);
}

TEST_F(LuaHostTest, CallLuaFunctionResultsAndReports)
{
    CLua lua("", false);
    BindBasics(lua);
    ASSERT_TRUE(lua.Run("quest = { inner = { deep = function(a, b) return a * b end } } "
                        "function text() return 'words' end function none() end function yes() return true end "
                        "function fails() error('it broke') end function half(x) return x / 2 end "
                        "lampobj = game.Lamp(9) function lamp() return lampobj end notatable = 5"));
    EXPECT_EQ(CallLuaFunction<int>(&lua, "quest.inner.deep", 6, 7), 42);
    EXPECT_DOUBLE_EQ(CallLuaFunction<double>(&lua, "half", 5), 2.5);
    EXPECT_TRUE(CallLuaFunction<bool>(&lua, "yes"));
    EXPECT_EQ(CallLuaFunction<std::string>(&lua, "text"), "words");
    Lamp* found = CallLuaFunction<Lamp*>(&lua, "lamp");
    ASSERT_NE(found, nullptr);
    EXPECT_EQ(found->Power, 9);
    EXPECT_EQ(CallLuaFunction<Lamp*>(&lua, "none"), nullptr) << "nil is a null pointer";
    // Through a full userdata: the object's method.
    EXPECT_EQ(CallLuaFunction<int>(&lua, "lampobj.GetPower"), 9);
    EXPECT_TRUE(BoxTexts("Lua Error").empty());

    const std::string notFound = "CallLuaFunction: error - can't find function ";
    EXPECT_EQ(CallLuaFunction<int>(&lua, "missing"), 0);
    EXPECT_EQ(BoxTexts("Lua Error").back(), notFound + "missing.");
    CallLuaFunction(&lua, "quest.OnClose");
    EXPECT_EQ(BoxTexts("Lua Error").back(), notFound + "quest.OnClose.");
    CallLuaFunction(&lua, "notatable.field");
    EXPECT_EQ(BoxTexts("Lua Error").back(), notFound + "notatable.field.");
    CallLuaFunction(&lua, "nothing.at.all");
    EXPECT_EQ(BoxTexts("Lua Error").back(), notFound + "nothing.at.all.");

    const std::string badResult = "CallLuaFunction: return value can't be converted to desired type.";
    EXPECT_EQ(CallLuaFunction<int>(&lua, "text"), 0);
    EXPECT_EQ(BoxTexts("Lua Error").back(), badResult);
    EXPECT_FALSE(CallLuaFunction<bool>(&lua, "none"));
    EXPECT_EQ(BoxTexts("Lua Error").back(), badResult);

    EXPECT_EQ(CallLuaFunction<int>(&lua, "fails"), 0);
    EXPECT_NE(BoxTexts("Lua Error").back().find("it broke"), std::string::npos);
    EXPECT_TRUE(LogHas("lua|3|CallLuaFunction: return value can't be converted to desired type."));
    EXPECT_EQ(lua_gettop(lua.GetLuaState()), 0);

    // A bare binding host raises its reports as Lua errors instead; outside any Lua call
    // that leaves a log line.
    oxtest::LuaTestHost recorder;
    EXPECT_EQ(CallLuaFunction<int>(recorder, "missing"), 0);
    EXPECT_EQ(recorder.LastReport(), notFound + "missing.");
}

TEST_F(LuaHostTest, LoadScriptRunsPackFilesAndReportsBadOnes)
{
    dir.Write("scripts/a.lua", "runs = (runs or '') .. 'a'");
    dir.Write("scripts/a.lua.bak", "runs = (runs or '') .. 'b'");
    dir.Write("scripts/notes.txt", "runs = (runs or '') .. 'X'");
    dir.Write("scripts/sub/c.lua", "runs = (runs or '') .. 'c'");
    dir.Write("scripts/bad.lua", "this is not lua");
    dir.Write("scripts/fails.lua", "error('at run time')");
    dir.Write("scripts/bom.lua", "\xEF\xBB\xBF" "bom = true");
    dir.Write("compiled.lua", std::string("\x1bLua\x51\x00\x01\x04", 8));

    CLua lua("", true);
    lua.LoadScript("scripts/a.lua");
    lua.LoadScript("scripts/a.lua");
    EXPECT_EQ(Eval(lua, "return runs"), "aa") << "loading twice runs twice";
    EXPECT_EQ(lua.GetFileWatcher()->GetWatchCount(), 1u);

    lua.LoadScript("scripts/bad.lua");
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_EQ(boxes.Boxes()[0].text, "failed to load lua file: scripts/bad.lua (LUA_ERRSYNTAX)");
    EXPECT_TRUE(LogHas("assertion failed \"res == 0\""));
    EXPECT_TRUE(LogHas("lua|3|[string \"scripts/bad.lua\"]:1:"));

    lua.LoadScript("scripts/fails.lua");
    ASSERT_EQ(BoxTexts("Lua Error").size(), 1u);
    EXPECT_NE(BoxTexts("Lua Error")[0].find("at run time"), std::string::npos);

    lua.LoadScript("scripts/missing.lua");
    EXPECT_TRUE(LogHas("assertion failed \"g_GamePack::Instance().Access(_script)\""));
    lua.LoadScript("compiled.lua");
    EXPECT_TRUE(LogHas("compiled.lua: a precompiled Lua chunk is refused"));
    lua.LoadScript("scripts/bom.lua");
    EXPECT_EQ(Eval(lua, "return bom"), "true");
    // Every script is watched, also those that failed.
    EXPECT_EQ(lua.GetFileWatcher()->GetWatchCount(), 6u);
    EXPECT_EQ(lua_gettop(lua.GetLuaState()), 0);
}

TEST_F(LuaHostTest, LoadLuaScriptsTakesOnlyTheFolderItself)
{
    dir.Write("scripts/a.lua", "runs = (runs or '') .. 'a'");
    dir.Write("scripts/a.lua.bak", "runs = (runs or '') .. 'b'");
    dir.Write("scripts/notes.txt", "runs = (runs or '') .. 'X'");
    dir.Write("scripts/sub/c.lua", "runs = (runs or '') .. 'c'");
    CLua lua("", false);
    lua.LoadLuaScripts("scripts/");
    EXPECT_EQ(Eval(lua, "return runs"), "ab");
    // The folder is a plain prefix: without its '/' every file in it lies behind one.
    lua.LoadLuaScripts("scripts");
    EXPECT_EQ(Eval(lua, "return runs"), "ab");
    EXPECT_TRUE(LogHas("LoadLuaScripts(\"scripts\"): 3 files in the folder are not loaded"));

    // A pack lists the sub-folders' files too; they are skipped.
    ox::misc::CPackWriter writer;
    for (const char* path : {"scripts/a.lua", "scripts/a.lua.bak", "scripts/notes.txt", "scripts/sub/c.lua",
                             "scriptsmore/d.lua", "scripts_extra.lua", "other/e.lua"})
        ASSERT_TRUE(writer.AddData(path, "x = 1"));
    std::string image;
    ASSERT_TRUE(writer.Build(image));
    std::vector<uint32_t> aligned((image.size() + 3) / 4);
    std::memcpy(aligned.data(), image.data(), image.size());
    ox::misc::CGamePack pack(aligned.data(), image.size(), ox::misc::GamePackConfig {"", "game.pack", ""});
    ASSERT_TRUE(pack.HasPack()) << pack.PackError();
    std::vector<std::string> expected {"scripts/a.lua", "scripts/a.lua.bak"};
    EXPECT_EQ(ox::lua::ListLuaScripts(pack, "scripts/"), expected);
    EXPECT_EQ(ox::lua::ListLuaScripts(pack, "scripts"), std::vector<std::string> {"scripts_extra.lua"});
}

TEST_F(LuaHostTest, ChangedScriptsRunAgain)
{
    oxtest::fs::path script = dir.Write("scripts/r.lua", "loads = (loads or 0) + 1 version = 1");
    CLua lua("", true);
    lua.GetFileWatcher()->SetPollInterval(std::chrono::milliseconds(20));
    lua.LoadScript("scripts/r.lua");
    lua.CheckFileChanges();
    EXPECT_EQ(Eval(lua, "return loads"), "1");

    // The new text arrives in one step, with a time clearly apart from the old one.
    std::this_thread::sleep_for(std::chrono::milliseconds(60));
    oxtest::fs::path next = dir.Write("scripts/r.lua.new", "loads = (loads or 0) + 1 version = 2");
    oxtest::fs::last_write_time(next, oxtest::fs::file_time_type::clock::now() + std::chrono::seconds(5));
    oxtest::fs::rename(next, script);
    for (int i = 0; i < 300 && Eval(lua, "return loads") == "1"; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
        lua.CheckFileChanges();
    }
    EXPECT_EQ(Eval(lua, "return loads .. ' ' .. version"), "2 2") << "the same state runs the new text";
    EXPECT_FALSE(lua.GetFileWatcher()->IsFilesChanged());
    EXPECT_EQ(lua.GetFileWatcher()->GetWatchCount(), 1u);
}
