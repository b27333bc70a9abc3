// Object scripts: the generated function text, the cache under the object or its group, the
// calls into the scheduler, and a fragment that does not compile.
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"
#include "quest/ImageObject.h"
#include "quest/LuaThreadManager.h"
#include "quest/ObjectScripts.h"
#include "quest/QuestBinding.h"
#include "quest/SceneGroup.h"
#include "support/TestSupport.h"

#include <fstream>
#include <sstream>

using namespace qe;
using ox::lua::CLua;
using B = CBaseSceneObject;

namespace {

struct ObjectScripts : ::testing::Test {
    oxtest::MessageCapture boxes;
    oxtest::LogCapture log;
    CLua level {"qe_level", false};
    CObjectScripts scripts;
    ImageObjectPtrT key {new CImageObject()};
    SceneGroupPtrT drawer {new CSceneGroup()};
    ImageObjectPtrT open {new CImageObject()};
    ImageObjectPtrT closed {new CImageObject()};

    void SetUp() override
    {
        BindFramework(level);
        level.BeginBinding();
        level.Bind(BindQuestClasses());
        level.EndBinding();
        std::ifstream file(std::string(OX_DEMO_GAME) + "/scripts/game_engine/quest.lua");
        std::stringstream text;
        text << file.rdbuf();
        ASSERT_TRUE(level.Run(text.str()));
        // Every call into the scheduler is written down, then passed on.
        ASSERT_TRUE(level.Run(R"(
            calls = {}
            local create, object = CreateScript, quest.SetScriptObject
            function CreateScript(name, o) table.insert(calls, name.c_str() .. '(' .. o.GetId().c_str() .. ')') create(name, o) end
            function quest.SetScriptObject(o) table.insert(calls, 'object(' .. o.GetId().c_str() .. ')') object(o) end
            function pre_click_event() table.insert(calls, 'pre') end
            function post_click_event() table.insert(calls, 'post') end
            function wrone_item_click() table.insert(calls, 'wrong') end
            function empty_script_function(self) table.insert(calls, 'empty') end
        )"));
        g_LuaThreadManager::Instance().SetLua(level);
        key->SetId("key");
        drawer->SetId("drawer");
        open->SetId("open");
        closed->SetId("closed");
        drawer->InsertChild(open, nullptr);
        drawer->InsertChild(closed, open.get());
    }
    void TearDown() override { g_LuaThreadManager::Instance().Clear(); }
    std::string Calls()
    {
        std::string all = oxtest::RunChunk(level.GetLuaState(), "return table.concat(calls, ' ')");
        level.Run("calls = {}");
        return all;
    }
};

} // namespace

TEST_F(ObjectScripts, TheGeneratedTextIsExact)
{
    EXPECT_EQ(CObjectScripts::MakeFunctionText("__object_script_0", "take(self) return", true, true),
              "function __object_script_0(self)\npre_click_event()\ntake(self) return\nwrone_item_click()\n"
              "post_click_event()\nend");
    EXPECT_EQ(CObjectScripts::MakeFunctionText("__object_script_1", "glow()", false, false),
              "function __object_script_1(self)\nglow()\nend");
    EXPECT_EQ(CObjectScripts::MakeFunctionText("f", "x()", true, false), "function f(self)\npre_click_event()\nx()\npost_click_event()\nend");
}

TEST_F(ObjectScripts, ClicksRunAsThreadsCompiledOnceUnderTheObjectOrItsGroup)
{
    key->SetLuaScript("table.insert(calls, 'took ' .. self.GetId().c_str()) do return end", B::ScriptMouseClick);
    scripts.Run(B::ScriptMouseClick, *key, true, true);
    EXPECT_EQ(Calls(), "object(key) __object_script_0(key) pre took key");
    EXPECT_EQ(scripts.CachedName(key.get(), B::ScriptMouseClick), "__object_script_0");

    // A state without a script of its own runs its group's, cached once under the group.
    drawer->SetLuaScript("table.insert(calls, 'drawer')", B::ScriptMouseClick);
    scripts.Run(B::ScriptMouseClick, *open, true, true);
    scripts.Run(B::ScriptMouseClick, *closed, true, true);
    EXPECT_EQ(Calls(), "object(drawer) __object_script_1(drawer) pre drawer wrong post "
                       "object(drawer) __object_script_1(drawer) pre drawer wrong post");
    EXPECT_EQ(scripts.CachedObjects(), 2u);

    // Mouse-enter without a script does nothing; a click without one runs the empty function.
    scripts.Run(B::ScriptMouseEnter, *key, false, false);
    EXPECT_EQ(Calls(), "");
    drawer->SetLuaScript("", B::ScriptMouseClick);
    ImageObjectPtrT bare(new CImageObject());
    bare->SetId("bare");
    scripts.Run(B::ScriptMouseClick, *bare, true, true);
    EXPECT_EQ(Calls(), "object(bare) empty_script_function(bare) empty");

    // A disabled group silences its states.
    drawer->RaiseObjectFlag(B::ObjectFlagDisable);
    scripts.Run(B::ScriptMouseClick, *open, true, true);
    EXPECT_EQ(Calls(), "");

    // After clearing, numbering starts again from 0.
    scripts.Clear();
    key->SetLuaScript("table.insert(calls, 'enter')", B::ScriptMouseEnter);
    scripts.Run(B::ScriptMouseEnter, *key, false, false);
    EXPECT_EQ(Calls(), "__object_script_0(key) enter");
}

TEST_F(ObjectScripts, AFragmentThatDoesNotCompileIsReportedAndTheGameGoesOn)
{
    key->SetLuaScript("this is not lua", B::ScriptMouseClick);
    scripts.Run(B::ScriptMouseClick, *key, true, true);
    EXPECT_EQ(scripts.CachedName(key.get(), B::ScriptMouseClick), "__object_script_0") << "cached all the same";
    ASSERT_EQ(boxes.Boxes().size(), 2u);
    EXPECT_NE(boxes.Boxes()[0].text.find("__object_script_0"), std::string::npos) << boxes.Boxes()[0].text;
    EXPECT_TRUE(log.Contains("Script 0 of 'key' does not compile (__object_script_0)"));
    EXPECT_NE(boxes.Boxes()[1].text.find("no script function __object_script_0"), std::string::npos);
    scripts.Run(B::ScriptMouseClick, *key, true, true);
    EXPECT_EQ(boxes.Boxes().size(), 3u) << "compiled once; the missing function is reported each time";
}
