// The demo's videos in the real game, headless: make-videos.sh makes them in a copy of the
// demo; the intro plays after loading and a click skips it to the main menu; the lamp's glow
// (a translucent video with an alpha track) plays in the level's window.
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "gui/Window.h"
#include "lua/Lua.h"
#include "DemoChild.h"

#include <chrono>
#include <thread>

namespace {

using namespace ox;

int PlayTheIntro()
{
    k17::CApp app;
    app.ReadGameFolder();
    if (!app.Init())
        return 10;
    setvbuf(stdout, nullptr, _IONBF, 0);  // what was printed stays if the game dies
    gui::BaseWindowPtrT loading = app.CreateLoadWindow();
    app.SetMainWindow(loading);
    auto* adapter = dynamic_cast<core::CStandaloneApplicationSdl*>(app.GetSystemIntegration());
    if (!adapter)
        return 11;
    auto frame = [&] {
        adapter->PumpMessages();
        app.Update();
        app.Draw();
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    };
    auto on = [&](const char* id) { return app.GetTopWindow() && app.GetTopWindow()->GetId() == id; };
    auto waitFor = [&](const char* id) {
        for (int i = 0; i < 1000 && !on(id); ++i)
            frame();
        return on(id);
    };
    if (!waitFor("intro"))
        return 12;
    for (int i = 0; i < 10; ++i)
        frame();
    app.GetTopWindow()->OnMouseDown({500, 400}, gui::LeftButton, 0, false);
    if (!waitFor("main_menu"))
        return 13;
    // The level's window, opened without its modal loop: the glow starts at its first update.
    lua::CLua::GetLua("main")->Run("Menu.Open(g_Application.GetMainWindow(), 'game')");
    for (int i = 0; i < 10; ++i)
        frame();
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

} // namespace

TEST(DemoVideos, TheIntroPlaysBeforeTheMenuAndTheLampGlowsInTheLevelWindow)
{
    oxtest::DemoChild demo;
    const std::string make = std::string("sh '") + OX_DEMO_GAME + "/make-videos.sh' '" + OX_TOOLS_DIR + "' '" +
                             demo.game.string() + "'";
    ASSERT_EQ(WEXITSTATUS(system(make.c_str())), 0);
    const int result = demo.Run(&PlayTheIntro);
    const std::string output = demo.Output();
    ASSERT_EQ(result, 0) << output << demo.Errors();
    size_t at = 0;
    for (const char* line : {"Intro: plays video/intro.ogv, 512x384, 3000 ms", "Intro: skipped by a click at ",
                             "Menu: \"main_menu\" opens",
                             "Lamp glow: video/lamp.ogv plays with its alpha track, 2000 ms a pass"}) {
        const size_t found = output.find(line, at);
        ASSERT_NE(found, std::string::npos) << "missing after offset " << at << ": " << line << "\n" << output;
        at = found + 1;
    }
    EXPECT_EQ(demo.Errors().find("Lua Error"), std::string::npos) << demo.Errors();
}
