// The demo's level played from start to end in the real game, headless: scripted clicks reach
// the level's scene widgets through the platform adapter, the application and the widget
// manager; the level's Lua rules find nine things, take the key into the box, put it on the
// pointer, open the chest with it, look into the close-up and close it, answer wrong clicks and
// show hints; the level window closes when all is found.
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "gui/WidgetManager.h"
#include "gui/Window.h"
#include "lua/Lua.h"
#include "quest/GameCursor.h"
#include "quest/QuestServices.h"
#include "DemoChild.h"
#include "support/TestSupport.h"

#include <csignal>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <thread>

namespace fs = std::filesystem;
using namespace ox;

namespace {

struct Step {
    int x, y;    // canvas position
    bool click;  // else only a move
};

// The play-through on the canvas: the game window covers it from (0, 0).
const Step kSteps[] = {
    {150, 530, false}, {150, 530, true}, // the coin, its hint first
    {300, 470, true},  {620, 380, true}, {90, 330, true}, // feather, apple, leaf
    {720, 545, true},                    // the key goes into the box
    {500, 100, true},                    // the sky: a wrong click
    {915, 400, true},                    // into the shed
    {200, 218, true},  {420, 218, true}, {560, 530, true}, // bottle, candle, shell
    {820, 500, true},                    // the chest is locked
    {917, 683, true},                    // the key from the box onto the pointer
    {820, 500, true},                    // the key opens the chest
    {820, 500, true},                    // the close-up opens
    {422, 310, true},                    // the ring's hole: nothing
    {422, 296, true},  {602, 300, true}, // ring (its band) and gem in the close-up
    {723, 177, true},                    // its close mark
    {512, 290, true},                    // "all found": the level window closes
};

misc::IntVector ClientPoint(core::CApplication& app, int x, int y)
{
    const gui::CWidgetManager& manager = app.GetWidgetManager();
    const misc::FloatRect& rect = manager.GetActiveRect();
    return {static_cast<int>(rect.X + static_cast<float>(x) * manager.GetScale().X),
            static_cast<int>(rect.Y + static_cast<float>(y) * manager.GetScale().Y)};
}

void Push(Uint32 type, misc::IntVector at)
{
    SDL_Event event {};
    event.type = type;
    if (type == SDL_MOUSEMOTION) {
        event.motion.x = at.X;
        event.motion.y = at.Y;
    } else {
        event.button.button = SDL_BUTTON_LEFT;
        event.button.state = type == SDL_MOUSEBUTTONDOWN ? SDL_PRESSED : SDL_RELEASED;
        event.button.clicks = 1;
        event.button.x = at.X;
        event.button.y = at.Y;
    }
    SDL_PushEvent(&event);
}

void PushStep(core::CApplication& app, int x, int y, bool click)
{
    const misc::IntVector at = ClientPoint(app, x, y);
    Push(SDL_MOUSEMOTION, at);
    if (click) {
        Push(SDL_MOUSEBUTTONDOWN, at);
        Push(SDL_MOUSEBUTTONUP, at);
    }
}

// The game in this process. The level window is modal: it runs its own frames from the click
// that opens it, so the level's input comes from a thread, a step every few frames. Exit codes
// above 0 say where it went wrong.
int PlayTheLevel()
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
    auto frame = [&] {
        adapter->PumpMessages();
        app.Update();
        app.Draw();
    };
    // The level starts with a click script of its own (the lamp flickers): clicks wait for it.
    for (int i = 0; i < 500; ++i) {
        frame();
        lua::CLua* level = qe::GetLevelLua();
        if (i > 3 && level && !lua::CallLuaFunction<bool>(level, "IsClikThread"))
            break;
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    // Play in the main menu, once it is over the first window.
    for (int i = 0; i < 100 && app.GetTopWindow()->GetId() != "main_menu"; ++i)
        frame();
    gui::CBaseWindow* menu = app.GetTopWindow();
    gui::CWidget* play = menu->GetId() == "main_menu" ? menu->GetWidget("play", true) : nullptr;
    if (!play)
        return 12;
    misc::FloatVector centre = play->GetAbsPos(false) + misc::FloatVector(play->GetSize().X / 2, play->GetSize().Y / 2);
    for (gui::CBaseWindow* window = menu; window; window = window->GetParentWindow())
        centre += window->GetOffset();
    std::thread player([&app] {
        std::this_thread::sleep_for(std::chrono::milliseconds(600));
        for (const Step& step : kSteps) {
            PushStep(app, step.x, step.y, step.click);
            std::this_thread::sleep_for(std::chrono::milliseconds(step.click ? 200 : 300));
        }
    });
    PushStep(app, static_cast<int>(centre.X), static_cast<int>(centre.Y), true);
    for (int i = 0; i < 3; ++i)
        frame(); // the level window runs its frames inside one of these
    player.join();
    for (int i = 0; i < 3; ++i)
        frame();
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

} // namespace

TEST(LevelPlaythrough, TheDemoLevelIsPlayedToItsEndWithTheMouse)
{
    oxtest::DemoChild demo;
    const int result = demo.Run(&PlayTheLevel);
    const std::string output = demo.Output();
    const std::string errors = demo.Errors();
    ASSERT_EQ(result, 0) << output << errors;

    size_t at = 0;
    for (const char* line :
         {"Lantern Demo: the scene garden", "Lantern Demo: found coin (1/9), hint \"Coin\"",
          "Lantern Demo: found leaf (4/9)", "Lantern Demo: the key goes into the box (1 in it)",
          "Lantern Demo: nothing there at 500,100", "Lantern Demo: the scene shed", "Lantern Demo: found shell (7/9)",
          "Lantern Demo: the chest is locked", "Lantern Demo: nothing there at 820,500",
          "Lantern Demo: the key is on the pointer", "Lantern Demo: the key opens the chest",
          "Lantern Demo: the close-up chest_inside opens", "Lantern Demo: nothing there at 422,310",
          "Lantern Demo: found ring (8/9)", "Lantern Demo: found gem (9/9)",
          "Lantern Demo: the level is complete", "Lantern Demo: the close-up chest_inside closes",
          "Lantern Demo: the level window closes", "Menu: the level's window closed with 1", "Menu: \"main_menu\" opens"}) {
        const size_t found = output.find(line, at);
        ASSERT_NE(found, std::string::npos) << "missing after offset " << at << ": " << line << "\n" << output;
        at = found + 1;
    }
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << errors;
}

TEST(LevelPlaythrough, TheLevelsPicturesRegenerateByteForByte)
{
    if (system("command -v convert >/dev/null 2>&1") != 0)
        GTEST_SKIP() << "ImageMagick's convert draws the level's pictures; it is not installed";
    oxtest::TempDir out;
    const std::string command = std::string("sh '") + OX_DEMO_GAME + "/make-level-art.sh' '" + out.Path().string() +
                                "' >'" + (out / "log.txt").string() + "' 2>&1";
    ASSERT_EQ(WEXITSTATUS(system(command.c_str())), 0) << oxtest::ReadFile(out / "log.txt");
    const fs::path kept = fs::path(OX_DEMO_GAME) / "textures" / "level";
    int pictures = 0;
    for (const auto& entry : fs::directory_iterator(kept)) {
        const fs::path made = out / "textures" / "level" / entry.path().filename();
        EXPECT_TRUE(fs::exists(made) && oxtest::ReadFile(made) == oxtest::ReadFile(entry.path()))
            << entry.path() << " differs from what games/demo/make-level-art.sh makes";
        ++pictures;
    }
    EXPECT_EQ(pictures, 15);
}
