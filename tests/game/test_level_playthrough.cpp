// The demo's levels played from start to end in the real game, headless: scripted clicks reach
// the level's scene widgets through the platform adapter, the application and the widget
// manager; the levels' Lua rules list what each scene hides, find it with sparkles, take a thing
// into the box, put it on the pointer, open a group with it, look into close-ups and close them,
// answer wrong clicks, show hints and a hint that recharges; the level window closes when all is
// found, and the menu's Play goes on with the next level.
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

#include <atomic>
#include <chrono>
#include <initializer_list>
#include <span>
#include <thread>

namespace fs = std::filesystem;
using namespace ox;

namespace {

struct Step {
    int x, y;    // canvas position
    bool click;  // else only a move
};

// The play-throughs on the canvas: the game window covers it from (0, 0).
const Step kLevel1[] = {
    {725, 632, true},                    // the hint: the coin sparkles
    {725, 632, true},                    // recharging: the button takes no click
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

const Step kLevel2[] = {
    {725, 632, true},                    // a new level's hint is charged: the fish sparkles
    {260, 500, true},  {610, 545, true}, {120, 470, true}, // fish, boot, lily on the bridge
    {700, 420, true},                    // the crank goes into the box
    {900, 370, true},                    // into the mill
    {180, 510, true},  {560, 200, true}, {940, 250, true}, // sack, hammer, bell
    {700, 520, true},                    // the trapdoor is locked
    {917, 683, true},                    // the crank from the box onto the pointer
    {700, 520, true},                    // the crank opens the trapdoor
    {700, 520, true},                    // down into the cellar
    {300, 420, true},  {520, 180, true}, // jar, clock
    {800, 510, true},                    // the crate's close-up opens
    {422, 300, true},  {602, 310, true}, // map and compass in it
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

// The game in this process, playing one level a round: Play in the main menu, then the
// round's steps. The level window is modal: it runs its own frames from the click that opens
// it, so the input comes from a thread, a step every few frames. Exit codes above 0 say where
// it went wrong.
int PlayRounds(std::initializer_list<std::span<const Step>> rounds)
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
    // A used hint charges again in half a second of the level's clock: after the second press
    // (the level's clock runs no faster than the real one), well before the end.
    if (!qe::GetLevelLua() || !qe::GetLevelLua()->Run(std::string("level_rules.recharge_time = 500")))
        return 13;
    // Play in the main menu, once it is over the first window; it comes back to the same place
    // when a level is over.
    for (int i = 0; i < 100 && app.GetTopWindow()->GetId() != "main_menu"; ++i)
        frame();
    gui::CBaseWindow* menu = app.GetTopWindow();
    gui::CWidget* play = menu->GetId() == "main_menu" ? menu->GetWidget("play", true) : nullptr;
    if (!play)
        return 12;
    misc::FloatVector centre = play->GetAbsPos(false) + misc::FloatVector(play->GetSize().X / 2, play->GetSize().Y / 2);
    for (gui::CBaseWindow* window = menu; window; window = window->GetParentWindow())
        centre += window->GetOffset();
    std::atomic<bool> done {false};
    std::thread player([&app, &done, &rounds, centre] {
        for (std::span<const Step> round : rounds) {
            PushStep(app, static_cast<int>(centre.X), static_cast<int>(centre.Y), true);
            std::this_thread::sleep_for(std::chrono::milliseconds(600));
            for (const Step& step : round) {
                PushStep(app, step.x, step.y, step.click);
                std::this_thread::sleep_for(std::chrono::milliseconds(step.click ? 200 : 300));
            }
            // The main menu fades in again.
            std::this_thread::sleep_for(std::chrono::milliseconds(600));
        }
        done = true;
    });
    while (!done)
        frame(); // a level window runs its frames inside one of these
    player.join();
    for (int i = 0; i < 3; ++i)
        frame();
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

int PlayLevel1() { return PlayRounds({kLevel1}); }
int PlayBothLevels() { return PlayRounds({kLevel1, kLevel2}); }
int PlayLevel2() { return PlayRounds({kLevel2}); }

// Each line is in the output, in this order; the offset behind the last.
size_t ExpectInOrder(const std::string& output, std::initializer_list<const char*> lines, size_t at = 0)
{
    for (const char* line : lines) {
        const size_t found = output.find(line, at);
        EXPECT_NE(found, std::string::npos) << "missing after offset " << at << ": " << line << "\n" << output;
        if (found == std::string::npos)
            return std::string::npos;
        at = found + 1;
    }
    return at;
}

const std::initializer_list<const char*> kLevel2Lines {
    "Lantern Demo: the scene bridge", "Lantern Demo: to find in bridge: fish, boot, lily",
    "Lantern Demo: the hint shows the fish", "Lantern Demo: found fish (1/10), hint \"Fish\"",
    "Lantern Demo: found lily (3/10)", "Lantern Demo: the crank goes into the box (1 in it)",
    "Lantern Demo: the scene mill", "Lantern Demo: to find in mill: sack, hammer, bell",
    "Lantern Demo: found bell (6/10)", "Lantern Demo: the hatch is locked",
    "Lantern Demo: the crank is on the pointer", "Lantern Demo: the crank opens the hatch",
    "Lantern Demo: the scene cellar", "Lantern Demo: to find in cellar: jar, clock",
    "Lantern Demo: found clock (8/10)", "Lantern Demo: the close-up crate_inside opens",
    "Lantern Demo: to find in crate_inside: map, compass", "Lantern Demo: found compass (10/10)",
    "Lantern Demo: the level is complete", "Lantern Demo: the close-up crate_inside closes",
    "Lantern Demo: the level window closes", "Menu: the level's window closed with 1",
    "Lantern Demo: level2 is over; the quest is complete", "Lantern Demo: level1 built from the quest data"};

const std::initializer_list<const char*> kLevel1Lines {
    "Lantern Demo: the scene garden", "Lantern Demo: to find in garden: coin, feather, apple, leaf",
    "Lantern Demo: the hint shows the coin", "Lantern Demo: found coin (1/9), hint \"Coin\"",
    "Lantern Demo: to find in garden: feather, apple, leaf", "Lantern Demo: found leaf (4/9)",
    "Lantern Demo: to find in garden: nothing", "Lantern Demo: the key goes into the box (1 in it)",
    "Lantern Demo: nothing there at 500,100", "Lantern Demo: the scene shed",
    "Lantern Demo: to find in shed: bottle, candle, shell", "Lantern Demo: found shell (7/9)",
    "Lantern Demo: the chest is locked", "Lantern Demo: nothing there at 820,500",
    "Lantern Demo: the key is on the pointer", "Lantern Demo: the key opens the chest",
    "Lantern Demo: the close-up chest_inside opens", "Lantern Demo: to find in chest_inside: ring, gem",
    "Lantern Demo: nothing there at 422,310", "Lantern Demo: found ring (8/9)", "Lantern Demo: found gem (9/9)",
    "Lantern Demo: the level is complete", "Lantern Demo: the close-up chest_inside closes",
    "Lantern Demo: to find in shed: nothing", "Lantern Demo: the level window closes",
    "Menu: the level's window closed with 1", "Lantern Demo: level1 is over; level2 comes next",
    "Lantern Demo: level2 built from the quest data: 4 scenes, 21 objects",
    "Lantern Demo: level level2 starts in host qe_level", "Lantern Demo: the mill by the river",
    "Menu: \"main_menu\" opens"};

} // namespace

TEST(LevelPlaythrough, TheDemoLevelIsPlayedToItsEndWithTheMouse)
{
    oxtest::DemoChild demo;
    const int result = demo.Run(&PlayLevel1);
    const std::string output = demo.Output();
    const std::string errors = demo.Errors();
    ASSERT_EQ(result, 0) << output << errors;
    ExpectInOrder(output, kLevel1Lines);
    // The second press found the hint recharging: one hint only.
    const size_t hint = output.find("the hint shows the coin");
    EXPECT_EQ(output.find("the hint shows", hint + 1), std::string::npos) << output;
    // It charged again while the level went on.
    const size_t charged = output.find("Lantern Demo: the hint is charged again", hint);
    EXPECT_LT(charged, output.find("Lantern Demo: the level is complete")) << output << errors;
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << errors;
}

TEST(LevelPlaythrough, PlayGoesOnWithTheSecondLevelAndItIsPlayedToItsEnd)
{
    oxtest::DemoChild demo;
    const int result = demo.Run(&PlayBothLevels, 90);
    const std::string output = demo.Output();
    const std::string errors = demo.Errors();
    ASSERT_EQ(result, 0) << output << errors;
    const size_t level2 = ExpectInOrder(output, kLevel1Lines);
    ASSERT_NE(level2, std::string::npos);
    ExpectInOrder(output, kLevel2Lines, level2);
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << errors;
}

TEST(LevelPlaythrough, APlayerWhoFinishedTheFirstLevelPlaysTheSecond)
{
    oxtest::DemoChild demo;
    const fs::path saves = demo.dir / "xdg" / "Lanternfold" / "Lantern Demo" / "saves";
    demo.dir.Write("xdg/Lanternfold/Lantern Demo/saves/saves.xml",
                   "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
                   "<Profiles current_profile_name=\"Ann\" >\n"
                   "<profile name=\"Ann\" guid=\"a1\" game_guid=\"g1\" step=\"level1\" points_count=\"0\" "
                   "hints_count=\"0\" thermometer_points=\"0\" alpha_thermometer_points=\"0\" step_type=\"0\" "
                   "level_state=\"2\" hints_use_count=\"0\" hints_use_flag=\"0\" />\n"
                   "</Profiles>\n");
    const int result = demo.Run(&PlayLevel2);
    const std::string output = demo.Output();
    ASSERT_EQ(result, 0) << output << demo.Errors();
    const size_t played = ExpectInOrder(output, {"Lantern Demo: level2 built from the quest data",
                                                 "Lantern Demo: Ann starts level2", "Menu: pressed play"});
    ASSERT_NE(played, std::string::npos);
    ExpectInOrder(output, kLevel2Lines, played);
    // The level's end enters Ann's score into the records, and the quest starts over: the next
    // start builds level1.
    ExpectInOrder(output, {"Lantern Demo: level2 finished by Ann with "}, played);
    EXPECT_NE(oxtest::ReadFile(saves / "records.xml").find("name=\"Ann\""), std::string::npos);
    EXPECT_NE(oxtest::ReadFile(saves / "saves.xml").find("step=\"level1\""), std::string::npos);
}

TEST(LevelPlaythrough, TheLevelsPicturesRegenerateByteForByte)
{
    if (system("command -v convert >/dev/null 2>&1") != 0)
        GTEST_SKIP() << "ImageMagick's convert draws the level's pictures; it is not installed";
    oxtest::TempDir out;
    const std::string command = std::string("sh '") + OX_DEMO_GAME + "/make-level-art.sh' '" + out.Path().string() +
                                "' >'" + (out / "log.txt").string() + "' 2>&1";
    ASSERT_EQ(WEXITSTATUS(system(command.c_str())), 0) << oxtest::ReadFile(out / "log.txt");
    int pictures = 0;
    for (const char* level : {"level", "level2"}) {
        const fs::path kept = fs::path(OX_DEMO_GAME) / "textures" / level;
        for (const auto& entry : fs::directory_iterator(kept)) {
            const fs::path made = out / "textures" / level / entry.path().filename();
            EXPECT_TRUE(fs::exists(made) && oxtest::ReadFile(made) == oxtest::ReadFile(entry.path()))
                << entry.path() << " differs from what games/demo/make-level-art.sh makes";
            ++pictures;
        }
    }
    EXPECT_EQ(pictures, 15 + 18);
}
