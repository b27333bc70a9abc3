// The demo's achievements in the real game, headless, over two runs: in the first a player
// finds the coin through the level's rules; in the second, after a restart, the player still has
// the achievement, another player has none, and the main menu's window shows it.
#include "DemoChild.h"
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "gui/Window.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "quest/QuestServices.h"
#include "support/TestSupport.h"

#include <fstream>

using namespace ox;

namespace {

// What a run does once the main menu is up: a chunk in the level's state, then one in the
// main state; what they give goes to the file `g_Out`.
std::string g_Level, g_Main, g_Out;

// Runs the game until its main menu is up, makes Ann the current player, runs the chunks and
// writes what they give. Exit codes above 0 say where it went wrong.
int RunGame()
{
    k17::CApp app;
    app.ReadGameFolder();
    if (!app.Init())
        return 10;
    gui::BaseWindowPtrT loading = app.CreateLoadWindow();
    app.SetMainWindow(loading);
    auto* adapter = dynamic_cast<core::CStandaloneApplicationSdl*>(app.GetSystemIntegration());
    if (!adapter)
        return 11;
    auto inMenu = [&app] { return app.GetTopWindow() && app.GetTopWindow()->GetId() == "main_menu"; };
    for (int i = 0; i < 300 && !inMenu(); ++i) {
        adapter->PumpMessages();
        app.Update();
        app.Draw();
    }
    lua::CLua* levelLua = qe::GetLevelLua();
    lua::CLua* mainLua = lua::CLua::GetLua("main");
    if (!levelLua || !mainLua || !inMenu())
        return 12;
    const char* ann = "local pm = k17.g_ProfileManager.Instance() if not pm.GetProfile('Ann') then"
                      " pm.CreateProfile('Ann', true) end pm.SetCurrentProfile('Ann') pm.Save() return 'ok'";
    std::ofstream(g_Out) << oxtest::RunChunk(mainLua->GetLuaState(), ann) << " "
                         << oxtest::RunChunk(levelLua->GetLuaState(), g_Level) << " "
                         << oxtest::RunChunk(mainLua->GetLuaState(), g_Main);
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

} // namespace

TEST(DemoAchievements, EarnedInTheLevelKeptOverARestartShownFromTheMenu)
{
    oxtest::DemoChild demo;
    g_Out = (demo.dir / "result.txt").string();
    auto run = [&](const std::string& level, const std::string& main) {
        g_Level = level;
        g_Main = main;
        EXPECT_EQ(demo.Run(&RunGame), 0) << demo.Output() << demo.Errors();
        return oxtest::ReadFile(g_Out);
    };
    // The coin found by the level's own rule.
    EXPECT_EQ(run("find(level_rules.level.FindObjectById('coin', true, false)) return 'found'",
                  "local a = k17.g_Achievements.Instance() return a.GetCompletion('first_find') .. a.GetProgress('sharp_eyes')"),
              "ok found 11");
    EXPECT_NE(demo.Output().find("Lantern Demo: achievement first_find earned, number 1"), std::string::npos);

    // A new run: Ann keeps it, Bob has nothing, and the main menu's Achievements opens the
    // window with Ann's.
    EXPECT_EQ(run("return k17.g_Achievements.Instance().GetScore()",
                  "local pm, a = k17.g_ProfileManager.Instance(), k17.g_Achievements.Instance()"
                  " pm.CreateProfile('Bob', true) local bob = a.GetScore() .. a.GetCompletion('first_find')"
                  " pm.SetCurrentProfile('Ann')"
                  " local menu = g_Application.GetTopWindow()"
                  " MainMenu.OnChildAction(menu, 'pressed', menu.GetWidget('achievements', true))"
                  " local w = g_Application.GetTopWindow()"
                  " local function t(id) return ox.gui.CLabelWidget.Cast(w.GetWidget(id, true)).GetText().c_str() end"
                  " return bob .. '|' .. t('ach1_title') .. '|' .. t('ach1_state') .. '|' .. t('ach2_state') .. '|' .. t('ach_score')"),
              "ok 10 00|First find: Find one thing in the garden|Earned, number 1|0 of 9|Score: 10");
    EXPECT_EQ(demo.Errors().find("Lua Error"), std::string::npos) << demo.Errors();
}
