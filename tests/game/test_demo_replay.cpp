// The demo's recorded play-through: games/demo/replay is what the steps below make (this test
// makes it again and compares; OX_WRITE_DEMO_REPLAY=1 rewrites it), and played back in the
// real game, headless, in place of live input, it plays the level from the main menu to its end.
// On the test clock every run of it draws the same frames, which its check file holds.
#include "core/TimeManager.h"
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "gui/Window.h"
#include "lua/Lua.h"
#include "quest/QuestServices.h"
#include "misc/Unicode.h"
#include "replay/Replay.h"
#include "DemoChild.h"
#include "support/TestSupport.h"

#include <fstream>
#include <sstream>

namespace fs = std::filesystem;
using namespace ox;

namespace {

struct Step {
    int x, y;   // canvas position
    bool click; // else only a move
};

// The main menu's Play on the canvas, once the menu has come in.
const misc::IntVector kPlay {512, 112};
// Events are recorded in the main window's coordinates: the first window stands here.
const misc::IntVector kMainOrigin {40, 430};

// The level, as tests/game/test_level_playthrough.cpp plays it with the mouse.
const Step kSteps[] = {
    {150, 530, false}, {150, 530, true}, {300, 470, true}, {620, 380, true}, {90, 330, true},
    {720, 545, true},  {500, 100, true}, {915, 400, true}, {200, 218, true}, {420, 218, true},
    {560, 530, true},  {820, 500, true}, {917, 683, true}, {820, 500, true}, {820, 500, true},
    {422, 310, true},  {422, 296, true}, {602, 300, true}, {723, 177, true}, {512, 290, true},
};

// The recording, made on a clock of our own: Play at 100 ms, the level's steps from 1.5 s on.
bool MakeRecording(const fs::path& path)
{
    oxtest::FakeClock clock;
    replay::CRecord record(clock.Ticks());
    record.Start();
    auto at = [&](misc::IntVector canvas, bool click) {
        const misc::IntVector pos(canvas.X - kMainOrigin.X, canvas.Y - kMainOrigin.Y);
        record.OnMouseMove(pos, 0);
        if (click) {
            record.OnMouseDown(pos, gui::LeftButton, 0);
            record.OnMouseUp(pos, gui::LeftButton, 0);
        }
    };
    clock.Set(100);
    at(kPlay, true);
    clock.Set(1500);
    for (const Step& step : kSteps) {
        at({step.x, step.y}, step.click);
        clock.Advance(step.click ? 400 : 300);
    }
    record.Stop();
    return record.SaveEvents(misc::Utf8ToWide(path.string()).c_str());
}

// The game in this process on the test clock, as fast as it goes: to the main menu, then the
// file "replay" by the replay key's action, checked against "replay.check" or writing it.
// Prints the check's result. Exit codes above 0 say where it went wrong.
int PlayTheRecording()
{
    core::GetTimeManager().SetFixedStep(20);
    k17::CApp app;
    app.ReadGameFolder();
    if (!app.Init())
        return 10;
    app.LimitFPS(0);
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
    // The main menu, come to rest, with no click script of the level running.
    misc::FloatVector centre, last {-1, -1};
    for (int i = 0, still = 0; i < 1000 && still < 10; ++i) {
        frame();
        gui::CBaseWindow* menu = app.GetTopWindow();
        gui::CWidget* play = menu && menu->GetId() == "main_menu" ? menu->GetWidget("play", true) : nullptr;
        lua::CLua* level = qe::GetLevelLua();
        if (!play || (level && lua::CallLuaFunction<bool>(level, "IsClikThread")))
            continue;
        centre = play->GetAbsPos(false) + misc::FloatVector(play->GetSize().X / 2, play->GetSize().Y / 2);
        for (gui::CBaseWindow* window = menu; window; window = window->GetParentWindow())
            centre += window->GetOffset();
        still = centre == last ? still + 1 : 0;
        last = centre;
    }
    if (!(centre == last)) {
        printf("no main menu at rest\n");
        return 12;
    }
    const misc::IntVector origin = app.GetMainWindow()->AdaptPos({0, 0});
    if (static_cast<int>(centre.X) != kPlay.X || static_cast<int>(centre.Y) != kPlay.Y ||
        origin.X != -kMainOrigin.X || origin.Y != -kMainOrigin.Y) {
        printf("Play is at %g,%g now, the first window at %d,%d: change kPlay or kMainOrigin and rewrite the "
               "recording\n", centre.X, centre.Y, -origin.X, -origin.Y);
        return 13;
    }
    replay::ToggleReplayFile();
    for (int i = 0; i < 4000 && replay::CPlayback::Instance().IsPlaying(); ++i)
        frame(); // the level window runs its frames inside one of these
    for (int i = 0; i < 20; ++i)
        frame();
    const replay::CReplayCheck* check = replay::CPlayback::Instance().GetCheck();
    if (!check)
        return 14;
    const std::string& difference = check->GetFirstDifference();
    printf("replay check: %s, %zu moments, first difference: %s\n",
           check->GetMode() == replay::CReplayCheck::Checking ? "checked" : "written", check->GetMoments().size(),
           difference.empty() ? "none" : difference.c_str());
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

// "moment <n> at <t> ms" of the first moment of a check file with a level's state in it.
std::string FirstLevelMoment(const std::string& check)
{
    std::istringstream in(check);
    std::string line, frame, state;
    for (int header = 0; header < 4; ++header)
        std::getline(in, line);
    uint32_t time = 0;
    for (int n = 1; in >> time >> frame >> state; ++n)
        if (state != "00000000")
            return "moment " + std::to_string(n) + " at " + std::to_string(time) + " ms";
    return {};
}

// The line the last run printed about its check.
std::string CheckLine(const std::string& output)
{
    const size_t at = output.rfind("replay check: ");
    return at == std::string::npos ? std::string() : output.substr(at, output.find('\n', at) - at);
}

} // namespace

TEST(DemoReplay, TheRecordingIsWhatThePlayThroughsStepsMake)
{
    const fs::path kept = fs::path(OX_DEMO_GAME) / "replay";
    if (getenv("OX_WRITE_DEMO_REPLAY")) {
        ASSERT_TRUE(MakeRecording(kept));
    }
    oxtest::TempDir dir;
    ASSERT_TRUE(MakeRecording(dir / "replay"));
    EXPECT_EQ(oxtest::ReadFile(dir / "replay"), oxtest::ReadFile(kept))
        << "games/demo/replay differs from what this test makes: run it with OX_WRITE_DEMO_REPLAY=1";
}

TEST(DemoReplay, ThePlayThroughEndsTheLevelTheSameEveryRunAndAChangedLevelReportsItsFirstDifference)
{
    oxtest::DemoChild demo;
    fs::remove(demo.game / "replay.check");
    const int result = demo.Run(&PlayTheRecording, 90);
    const std::string output = demo.Output();
    const std::string errors = demo.Errors();
    ASSERT_EQ(result, 0) << output << errors;
    size_t at = 0;
    for (const char* line :
         {"Lantern Demo: the scene garden", "Lantern Demo: found coin (1/9)", "Lantern Demo: the key opens the chest",
          "Lantern Demo: found gem (9/9)", "Lantern Demo: the level is complete",
          "Lantern Demo: the level window closes", "Menu: \"main_menu\" opens"}) {
        const size_t found = output.find(line, at);
        ASSERT_NE(found, std::string::npos) << "missing after offset " << at << ": " << line << "\n" << output;
        at = found + 1;
    }
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << errors;
    // The first playback wrote the check file of the recording, a moment a second.
    const std::string check = oxtest::ReadFile(demo.game / "replay.check");
    EXPECT_EQ(check.rfind("oxreplaycheck 1\ngame Lantern Demo\nevents ", 0), 0u) << check;
    EXPECT_EQ(CheckLine(output), "replay check: written, 11 moments, first difference: none") << check;
    // On the test clock a second run draws the same frames at the same moments. Each run starts
    // as the recording did, before any player: the level's end made one and moved them on.
    const auto withoutPlayers = [&demo] {
        fs::remove_all(demo.dir / "xdg");
        fs::create_directories(demo.dir / "xdg");
    };
    withoutPlayers();
    ASSERT_EQ(demo.Run(&PlayTheRecording, 90), 0) << demo.Output() << demo.Errors();
    EXPECT_EQ(CheckLine(demo.Output()), "replay check: checked, 11 moments, first difference: none") << check;

    // One object's hint changed in the level's data: the first moment that shows the level
    // reports its state, though the frame is the same.
    const fs::path quest = demo.game / "properties" / "quest.xml";
    std::string data = oxtest::ReadFile(quest);
    const std::string shell = "id=\"shell\" object_flags=\"0\" hint=\"$307\"";
    const size_t found = data.find(shell);
    ASSERT_NE(found, std::string::npos) << "the demo's shell has another hint now: change this test";
    data.replace(found, shell.size(), "id=\"shell\" object_flags=\"0\" hint=\"$306\"");
    std::ofstream(quest, std::ios::binary | std::ios::trunc) << data;
    const std::string first = FirstLevelMoment(check);
    ASSERT_FALSE(first.empty()) << "no moment shows the level:\n" << check;
    withoutPlayers();
    ASSERT_EQ(demo.Run(&PlayTheRecording, 90), 0) << demo.Output() << demo.Errors();
    EXPECT_EQ(CheckLine(demo.Output()).rfind("replay check: checked, 11 moments, first difference: " + first +
                                             ": the level state differs (", 0), 0u)
        << CheckLine(demo.Output()) << "\n" << check;
}
