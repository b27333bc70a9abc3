// Starting a level: qe.StartLevel called from a main host gives a fresh level host the
// vocabulary, its init script and the game's quest.lua, and returns what quest.StartLevel
// returns; failures of the script side are reported and give 0.
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "quest/LuaThreadManager.h"
#include "quest/ObjectScripts.h"
#include "quest/QuestBinding.h"
#include "support/TestSupport.h"

using namespace qe;
using ox::lua::CLua;

namespace {

// Writes down every argument, runs the init script and answers 7.
const char* kRecordingQuest = R"(
    quest = quest or {}
    local function text(v) if type(v) == 'userdata' and v.c_str then return v.c_str() end return tostring(v) end
    function quest.StartLevel(window, level, a, settings, b, c, d)
        got = table.concat({text(window), text(level.GetId()), text(a), text(settings), text(b), text(c),
                            tostring(d), tostring(ox.lua.CLua ~= nil)}, ' ')
        __g_InitScript()
        return 7
    end)";

struct StartLevelTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::MessageCapture boxes;
    CLua main {"test_main", false};
    CLua level {"qe_level", false};

    void SetUp() override
    {
        BindFramework(main);
        main.BeginBinding();
        main.Bind(BindQuestClasses());
        main.EndBinding();
    }
    std::string Eval(CLua& lua, const std::string& expression)
    {
        return oxtest::RunChunk(lua.GetLuaState(), "return " + expression);
    }
    // qe.StartLevel from the main host, with an init script that counts its runs.
    std::string Start()
    {
        return Eval(main, "qe.StartLevel(ox.lua.CLua.GetLua('qe_level'), nil, lvl, 'level1', nil, "
                          "std.string('inits = (inits or 0) + 1'), 'Title', 'mode', true)");
    }
    std::string LuaErrors() const
    {
        std::string text;
        for (const auto& box : boxes.Boxes())
            if (box.caption == "Lua Error")
                text += box.text + "\n";
        return text;
    }
};

} // namespace

TEST_F(StartLevelTest, BindsRunsTheInitScriptAndPassesTheArgumentsThrough)
{
    dir.Write("scripts/game_engine/quest.lua", kRecordingQuest);
    ASSERT_TRUE(main.Run("lvl = qe.CLevel() lvl.SetId('L')"));
    EXPECT_EQ(Eval(level, "qe"), "nil") << "a fresh host";

    EXPECT_EQ(Start(), "7");
    EXPECT_EQ(Eval(level, "got"), "nil L level1 nil Title mode true true");
    EXPECT_EQ(Eval(level, "inits"), "1");
    EXPECT_EQ(Eval(level, "type(qe.CLevel)"), "table");
    // A level started again in the same host: the vocabulary is bound again, the script reloaded.
    EXPECT_EQ(Start(), "7");
    EXPECT_EQ(Eval(level, "inits"), "2") << "the init script runs once a start";
    EXPECT_TRUE(LuaErrors().empty()) << LuaErrors();
}

TEST_F(StartLevelTest, AFailingQuestStartLevelIsReportedAndGivesZero)
{
    ASSERT_TRUE(main.Run("lvl = qe.CLevel()"));
    // No quest.lua at all: quest.StartLevel is missing.
    EXPECT_EQ(Start(), "0");
    EXPECT_NE(LuaErrors().find("quest.StartLevel"), std::string::npos) << LuaErrors();

    for (const char* body : {"error('the level is broken')", "return 'seven'", "return nil"}) {
        SCOPED_TRACE(body);
        dir.Write("scripts/game_engine/quest.lua",
                  std::string("quest = quest or {} function quest.StartLevel() ") + body + " end");
        size_t before = boxes.Boxes().size();
        EXPECT_EQ(Start(), "0");
        EXPECT_GT(boxes.Boxes().size(), before) << "reported";
    }
    EXPECT_NE(LuaErrors().find("the level is broken"), std::string::npos) << LuaErrors();
    // Without a host nothing runs, and the data check says so.
    EXPECT_EQ(StartLevel(nullptr, nullptr, nullptr, "", nullptr, "", u"", "", false), 0);
}

// The level's own script side starts an object's click script: it is compiled into the level
// host under its generated name and started there as a thread.
TEST_F(StartLevelTest, AnObjectScriptRunsInTheLevelHostThroughItsGeneratedFunction)
{
    dir.Write("scripts/game_engine/quest.lua", R"(
        quest = quest or {}
        function quest.SetScriptObject(o) end
        function pre_click_event() end
        function post_click_event() end
        function wrone_item_click() end
        function CreateScript(name, o) started = name.c_str() _G[name.c_str()](o) end
        function quest.StartLevel(window, level)
            qe.g_LuaThreadManager.Instance().SetLua(ox.lua.CLua.GetLua('qe_level'))
            local key = level.FindObjectById('key', false, false)
            qe.RunObjectScript(qe.CBaseSceneObject.ScriptMouseClick, key, true, true)
            qe.RunObjectScript(99, key, true, true)
            qe.RunObjectScript(qe.CBaseSceneObject.ScriptMouseClick, nil, true, true)
            return 1
        end)");
    GetObjectScripts().Clear();
    ASSERT_TRUE(main.Run(R"(
        lvl = qe.CLevel()
        local scene = qe.CScene()
        lvl.InsertScene(qe.CScenePtrT(scene), nil)
        local key = qe.CImageObject()
        key.SetId('key')
        key.SetLuaScript(std.string('clicked = self.GetId().c_str()'), qe.CBaseSceneObject.ScriptMouseClick)
        scene.InsertObject(qe.CBaseSceneObjectPtrT(key), nil))"));
    oxtest::LogCapture log;
    EXPECT_EQ(Start(), "1");
    EXPECT_EQ(Eval(level, "started"), "__object_script_0");
    EXPECT_EQ(Eval(level, "clicked"), "key");
    EXPECT_TRUE(log.Contains("kind >= 0 && kind < CBaseSceneObject::ScriptCount"));
    EXPECT_TRUE(log.Contains("object != nullptr"));
    EXPECT_TRUE(LuaErrors().empty()) << LuaErrors();
    // The script side ends the level: the cache lets the key go.
    ASSERT_TRUE(main.Run("qe.CSceneWidget.ClearScriptCache()"));
    EXPECT_EQ(GetObjectScripts().CachedObjects(), 0u);
    g_LuaThreadManager::Instance().Clear();
}
