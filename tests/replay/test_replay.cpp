// Recording and playback on a fake clock: live input through the fake platform and the
// application is recorded, written, read back and fed to the same window, which sees the
// same events in the same order; the file's bytes, refused files, the feeding times, the
// cursor following the recording and Ctrl+Alt+P.
#include "core/Application.h"
#include "core/ScriptVocabulary.h"
#include "core/TimeManager.h"
#include "gui/GuiTestSupport.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "replay/Replay.h"
#include "support/FakePlatform.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace ox::replay;
using ox::core::CApplication;
using oxtest::FakePlatform;
using oxtest::NotingWindow;
using oxtest::ProbeWidget;

namespace {

using Journal = std::vector<std::string>;
Journal Take() { return std::exchange(ProbeWidget::Journal(), {}); }

struct ReplayTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    oxtest::FakeClock clock;
    CRecord record {clock.Ticks()};
    CPlayback playback {clock.Ticks()};
    std::unique_ptr<CApplication> app;
    FakePlatform* platform = nullptr; // owned by the application
    boost::intrusive_ptr<NotingWindow> window;

    void SetUp() override
    {
        while (ox::core::GetTimeManager().GetRoot()->IsPaused())
            ox::core::GetTimeManager().Pause(false);
        dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Replay\"/>");
        app = std::make_unique<CApplication>();
        auto owned = std::make_unique<FakePlatform>();
        platform = owned.get();
        app->SetSystemIntegration(std::move(owned));
        ASSERT_TRUE(app->Init());
        app->GetRenderer()->SetSourceResolution(1024, 768);
        app->ChangeScreenMode(false, true, 1024, 768);
        window = oxtest::LoadWindow(R"(<window id="main" width="1024" height="768" moveable="false"/>)");
        app->SetMainWindow(window);
        app->Update();
        app->GetWidgetManager().SetInputListener(&record);
        Take();
    }
    void TearDown() override
    {
        app->GetWidgetManager().SetInputListener(&CRecord::Instance());
        if (CPlayback::Instance().IsPlaying())
            CPlayback::Instance().Stop();
    }

    // Plays the loaded events, the clock moving `step` ms a frame, until the list is used up.
    void PlayAll(int step)
    {
        playback.Start();
        for (int frame = 0; frame < 1000 && playback.IsPlaying(); ++frame) {
            clock.Advance(step);
            playback.Update(app->GetWidgetManager());
        }
    }
    std::string Bytes(const ox::wstring& name) { return oxtest::ReadFile(dir / oxtest::Narrow(name)); }
};

std::string Image(uint32_t size, uint32_t count, std::vector<ReplayEvent> events)
{
    std::string bytes(8 + events.size() * 16, '\0');
    std::memcpy(bytes.data(), &size, 4);
    std::memcpy(bytes.data() + 4, &count, 4);
    if (!events.empty())
        std::memcpy(bytes.data() + 8, events.data(), events.size() * 16);
    return bytes;
}

bool Load(CPlayback& playback, const std::string& bytes)
{
    return playback.LoadImage(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size());
}

} // namespace

TEST_F(ReplayTest, RecordedLiveInputPlaysBackToTheSameEventsInOrder)
{
    oxtest::SendClick(*platform, 150, 120); // before Start: not recorded
    Take();
    record.Start();
    oxtest::SendClick(*platform, 150, 120);
    clock.Advance(10);
    oxtest::SendKey(*platform, SDL_SCANCODE_A, KMOD_SHIFT);
    oxtest::SendText(*platform, "é");
    clock.Advance(25);
    oxtest::SendClick(*platform, 300, 200, SDL_BUTTON_RIGHT);
    oxtest::SendClick(*platform, 300, 200, SDL_BUTTON_LEFT, 2);
    oxtest::SendMove(*platform, 40, 60);
    record.Stop();
    const Journal live = Take();
    ASSERT_GE(live.size(), 8u);
    ASSERT_TRUE(record.SaveEvents(u"input.rec"));

    const std::string bytes = Bytes(u"input.rec");
    ASSERT_EQ(bytes.size(), 8 + 16 * record.GetEvents().size());
    EXPECT_EQ(bytes.substr(0, 4), std::string("\x10\0\0\0", 4));
    ASSERT_TRUE(playback.LoadEvents(u"input.rec"));
    ASSERT_EQ(playback.GetEvents().size(), record.GetEvents().size());
    EXPECT_EQ(playback.GetEvents().front().Time, 0u);
    EXPECT_EQ(playback.GetEvents().back().Time, 35u);
    EXPECT_EQ(playback.GetEvents().back().Kind(), KindMouseMove);

    // An event at exactly t waits for the next frame: at 0 nothing, at 1 the first click.
    playback.Start();
    playback.Update(app->GetWidgetManager());
    EXPECT_EQ(Take(), Journal {});
    clock.Advance(1);
    playback.Update(app->GetWidgetManager());
    EXPECT_EQ(Take(), (Journal {"down 150,120 0", "up"}));
    clock.Advance(9);
    playback.Update(app->GetWidgetManager());
    EXPECT_EQ(Take(), Journal {}) << "the key at 10 waits";
    playback.Stop();

    PlayAll(5);
    EXPECT_EQ(Take(), live);
    EXPECT_FALSE(playback.IsPlaying());
    EXPECT_EQ(platform->mouse.X, 40) << "the visible cursor follows the recording";
    EXPECT_EQ(platform->mouse.Y, 60);
}

TEST_F(ReplayTest, TheFileIsHeaderThenSixteenByteEventsAndBadFilesAreRefused)
{
    record.Start();
    clock.Advance(7);
    record.OnMouseDown({-3, 700}, ox::gui::RightButton, 2);
    record.OnKeyUp(10001, 5, 0x1E0001);
    record.Stop();
    ASSERT_TRUE(record.SaveEvents(u"two.rec"));
    const char expected[] = "\x10\0\0\0\x02\0\0\0"
                            "\x07\0\0\0\x20\0\x01\0\xFD\xFF\xBC\x02\0\0\0\0"
                            "\x07\0\0\0\x56\0\x11\x27\x01\0\x1E\0\0\0\0\0";
    EXPECT_EQ(Bytes(u"two.rec"), std::string(expected, sizeof(expected) - 1));

    ASSERT_TRUE(playback.LoadEvents(u"two.rec"));
    oxtest::MessageCapture boxes;
    oxtest::LogCapture log;
    EXPECT_FALSE(playback.LoadEvents(u"missing.rec"));
    EXPECT_EQ(playback.GetEvents().size(), 2u) << "a file that cannot be opened keeps the events";

    const std::vector<ReplayEvent> events = record.GetEvents();
    EXPECT_FALSE(Load(playback, Image(20, 2, events)));
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_EQ(boxes.Boxes()[0].caption, "Ошибка");
    EXPECT_TRUE(playback.GetEvents().empty());
    EXPECT_FALSE(Load(playback, Image(16, 3, events))) << "a count past the end";
    std::vector<ReplayEvent> backwards = events;
    backwards[1].Time = 6;
    EXPECT_FALSE(Load(playback, Image(16, 2, backwards)));
    std::vector<ReplayEvent> unknown = events;
    unknown[0].KindAndKeys = 0x0C;
    EXPECT_FALSE(Load(playback, Image(16, 2, unknown)));
    EXPECT_FALSE(Load(playback, std::string("\x10\0", 2)));
    EXPECT_TRUE(playback.GetEvents().empty());
    EXPECT_EQ(boxes.Boxes().size(), 2u) << "the box is for another event size (or no header) only";
    EXPECT_TRUE(log.Contains("goes back in time"));

    // An empty list stops in the first update.
    ASSERT_TRUE(Load(playback, Image(16, 0, {})));
    playback.Start();
    playback.Update(app->GetWidgetManager());
    EXPECT_FALSE(playback.IsPlaying());
}

TEST_F(ReplayTest, StartTwiceAndSavingNothingAreContractFailures)
{
    record.Start();
    EXPECT_CONTRACT_FAILURE(record.Start(), "!m_IsRecording");
    EXPECT_CONTRACT_FAILURE(record.SaveEvents(u"x.rec"), "!m_IsRecording");
    record.Stop();
    EXPECT_CONTRACT_FAILURE(record.SaveEvents(u"x.rec"), "!m_Events.empty()");
    playback.Start();
    EXPECT_CONTRACT_FAILURE(playback.Start(), "!m_IsPlaying");
    playback.Stop();
    EXPECT_CONTRACT_FAILURE(playback.Stop(), "m_IsPlaying");
}

// Ctrl+Alt+P plays the file "replay" of the working folder in place of live input, and stops it.
TEST_F(ReplayTest, CtrlAltPStartsAndStopsThePlaybackOfTheReplayFile)
{
    record.Start();
    record.OnMouseDown({5, 6}, ox::gui::LeftButton, 0);
    clock.Advance(100000);
    record.OnMouseUp({5, 6}, ox::gui::LeftButton, 0);
    record.Stop();
    ASSERT_TRUE(record.SaveEvents(u"replay"));
    CPlayback& global = CPlayback::Instance();
    ASSERT_FALSE(global.IsPlaying());
    oxtest::SendKey(*platform, SDL_SCANCODE_P, KMOD_CTRL | KMOD_ALT);
    EXPECT_TRUE(global.IsPlaying());
    EXPECT_EQ(global.GetEvents().size(), 2u);
    Take();
    oxtest::SendClick(*platform, 150, 120);
    EXPECT_EQ(Take(), Journal {}) << "live input is ignored while playing";
    oxtest::SendKey(*platform, SDL_SCANCODE_P, KMOD_CTRL | KMOD_ALT);
    EXPECT_FALSE(global.IsPlaying());
    oxtest::SendClick(*platform, 150, 120);
    EXPECT_EQ(Take(), (Journal {"down 150,120 0", "up"}));
}

// The check file: one playback notes a moment each 100 ms and at the end; the next playback of
// the same recording matches it; a changed state is reported at the moment it first shows, and
// a file of another recording is refused.
TEST_F(ReplayTest, ACheckFileFromOnePlaybackReportsTheFirstDifferenceOfAnother)
{
    record.Start();
    for (int i = 0; i < 6; ++i) {
        clock.Advance(60);
        oxtest::SendClick(*platform, 100 + 10 * i, 120);
    }
    record.Stop();
    ASSERT_TRUE(record.SaveEvents(u"input.rec"));
    ASSERT_TRUE(playback.LoadEvents(u"input.rec"));
    const auto count = static_cast<uint32_t>(playback.GetEvents().size());
    const uint32_t events = playback.GetEventsHash();
    Take();

    int moment = 0, changeFrom = 1000;
    // The game's state: what its window saw since the last moment, and a change when told.
    auto probes = [&] {
        return CheckProbes {[](ox::graphics::CRenderer*) { return 7u; },
                            [&] { return static_cast<uint32_t>(Take().size()) + (++moment >= changeFrom ? 100 : 0); }};
    };
    auto play = [&](CReplayCheck& check) {
        moment = 0;
        playback.SetCheck(&check);
        playback.Start();
        for (int frame = 0; frame < 100 && playback.IsPlaying(); ++frame) {
            clock.Advance(20);
            playback.Update(app->GetWidgetManager());
            playback.Draw(*app->GetRenderer());
        }
        playback.SetCheck(nullptr);
    };
    CReplayCheck check("Replay Test", probes());
    check.BeginWrite(100, count, events, u"input.check");
    play(check);
    const std::vector<CheckMoment> written = check.GetMoments();
    ASSERT_EQ(written.size(), 5u) << check.Text();
    EXPECT_EQ(written[1].Time, 100u);
    EXPECT_EQ(written.back().Time, 380u) << "the last events, at 360 ms, are fed at 380";

    oxtest::LogCapture log;
    ASSERT_TRUE(check.BeginCheck(u"input.check", count, events));
    play(check);
    EXPECT_EQ(check.GetMoments(), written);
    EXPECT_EQ(check.GetFirstDifference(), "");
    EXPECT_TRUE(log.Contains("replay check passed: 5 moments match"));

    changeFrom = 3;
    ASSERT_TRUE(check.BeginCheck(u"input.check", count, events));
    play(check);
    EXPECT_EQ(check.GetFirstDifference().substr(0, 50), "moment 3 at 200 ms: the level state differs (00000");
    EXPECT_EQ(check.GetDifferences(), 3);
    EXPECT_TRUE(log.Contains("replay check: first difference at moment 3 at 200 ms"));

    EXPECT_FALSE(check.BeginCheck(u"input.check", count - 1, events)) << "another recording";
    EXPECT_FALSE(check.BeginCheckText("oxreplaycheck 1\ngame Other\nevents 1 0\nstep 100\n", 1, 0));
    EXPECT_TRUE(check.BeginCheckText("oxreplaycheck 1\ngame Replay Test\nevents 1 0\nstep 100\n", 1, 0));
    EXPECT_FALSE(check.BeginCheckText("oxreplaycheck 1\ngame Replay Test\nevents 1 0\nstep 100\n20 x\n", 1, 0));
    EXPECT_EQ(check.GetMode(), CReplayCheck::Idle);
}

// The marks in the top-left corner, drawn by the application over the frame while active:
// a red square while recording, a green triangle while playing.
TEST_F(ReplayTest, TheMarksShowOnlyWhileRecordingOrPlaying)
{
    auto owned = std::make_unique<oxtest::RecordingBackend>();
    oxtest::RecordingBackend* backend = owned.get();
    app->GetRenderer()->SetBackend(std::move(owned));
    app->GetRenderer()->InitWindow(false, true, 1024, 768);
    window->AddFlags(ox::gui::FlagHidden);
    auto drawn = [&] {
        backend->ClearRecord();
        app->Draw();
        std::vector<std::pair<uint32_t, float>> marks; // colour and right edge of each
        for (const auto& draw : backend->draws)
            for (const auto& v : draw.vertices)
                if (marks.empty() || marks.back().first != v.diffuse)
                    marks.emplace_back(v.diffuse, v.x);
                else
                    marks.back().second = std::max(marks.back().second, v.x);
        return marks;
    };
    EXPECT_TRUE(drawn().empty());
    CRecord::Instance().Start();
    EXPECT_EQ(drawn(), (std::vector<std::pair<uint32_t, float>> {{0xFFFF0000u, 49.5f}}));
    CRecord::Instance().Stop();
    CPlayback& global = CPlayback::Instance();
    ASSERT_TRUE(Load(global, Image(16, 0, {})));
    global.Start();
    EXPECT_EQ(drawn(), (std::vector<std::pair<uint32_t, float>> {{0xFF00FF00u, 39.5f}}));
    global.Stop();
    EXPECT_TRUE(drawn().empty());
}

// A script records and saves through the bound names; the file it writes plays back.
TEST_F(ReplayTest, ScriptsRecordAndSaveThroughTheirNames)
{
    ox::lua::CLua lua {"replay", false};
    ox::core::BindOX(lua);
    const std::string code = R"(
        local record = ox.replay.g_Record.Instance()
        record.Start()
        local recording = record.IsRecording()
        record.Stop()
        return tostring(recording) .. " " .. tostring(record.SaveEvents("script.rec")) .. " " ..
               tostring(ox.replay.g_Playback.Instance().LoadEvents("script.rec")) .. " " ..
               tostring(ox.replay.g_Playback.Instance().IsPlaying()))";
    CRecord::Instance().OnMouseMove({1, 2}, 0); // not recording: nothing
    app->GetWidgetManager().SetInputListener(&CRecord::Instance());
    const size_t before = CRecord::Instance().GetEvents().size();
    ASSERT_EQ(oxtest::RunChunk(lua.GetLuaState(), "ox.replay.g_Record.Instance().Start()"), "nil");
    oxtest::SendClick(*platform, 150, 120);
    EXPECT_EQ(CRecord::Instance().GetEvents().size(), before + 3) << "move, down and up";
    CRecord::Instance().Stop();
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), code), "true true true false");
    EXPECT_EQ(CPlayback::Instance().GetEvents().size(), before + 3);
}
