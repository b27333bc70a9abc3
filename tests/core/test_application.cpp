#include "core/Application.h"
#include "core/TimeManager.h"
#include "misc/sys/Path.h"
#include "support/FakePlatform.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <sys/stat.h>

using namespace ox::core;
using ox::graphics::Resolution;

namespace fs = std::filesystem;
using oxtest::FakePlatform;
using Mode = FakePlatform::Mode;

namespace {

struct AppFixture : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    std::unique_ptr<CApplication> app;
    FakePlatform* platform = nullptr; // owned by the application

    void SetUp() override
    {
        // The time manager is process-wide: start from a running clock whatever ran before.
        while (GetTimeManager().GetRoot()->IsPaused())
            GetTimeManager().Pause(false);
        dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Quest\" version=\"123\"/>");
        app = std::make_unique<CApplication>();
        auto owned = std::make_unique<FakePlatform>();
        platform = owned.get();
        app->SetSystemIntegration(std::move(owned));
        ASSERT_TRUE(app->Init());
        app->GetRenderer()->SetSourceResolution(1024, 768);
    }
    void Send(uint32_t message, uint32_t wParam) { platform->Dispatch(message, wParam); }
};

// Sets the file-creation mask for its lifetime.
struct ScopedUmask {
    mode_t previous;
    explicit ScopedUmask(mode_t mask) : previous(umask(mask)) {}
    ~ScopedUmask() { umask(previous); }
};

unsigned FileMode(const fs::path& path)
{
    struct stat info {};
    lstat(path.c_str(), &info);
    return info.st_mode & 07777;
}

} // namespace

TEST_F(AppFixture, GameXmlDefaultsTitleAndDataFolder)
{
    EXPECT_EQ(oxtest::Narrow(app->GetCompany()), "Tarnwick Loom");
    EXPECT_EQ(oxtest::Narrow(app->GetWindowTitle()), "Quest 1.23");
    EXPECT_EQ(oxtest::Narrow(app->GetAppDataFolder()), (dir / "data" / "Tarnwick Loom" / "Quest").string());
    EXPECT_TRUE(std::filesystem::exists(dir / "data" / "Tarnwick Loom" / "Quest" / "log.oxlog"));
}

TEST_F(AppFixture, ChangeScreenModeArithmetic)
{
    app->GetRenderer()->SetAvailableResolutions(
        {{800, 600, false}, {1280, 1024, true}, {1920, 1080, true}, {1600, 900, true}});

    // 0 x 0: the desktop size, 32 bits and full screen, whatever was asked.
    EXPECT_TRUE(app->ChangeScreenMode(false, false, 0, 0));
    EXPECT_EQ(platform->modes.back(), Mode(true, true, 1920u, 1080u));

    // Only a 16-bit mode of that size: the depth flips, not the size.
    app->ChangeScreenMode(true, true, 800, 600);
    EXPECT_EQ(platform->modes.back(), Mode(true, false, 800u, 600u));

    // No such mode at all: the last one of the list.
    app->ChangeScreenMode(true, true, 640, 480);
    EXPECT_EQ(platform->modes.back(), Mode(true, true, 1600u, 900u));

    // A window that fits keeps the request but is brought to the source aspect.
    app->ChangeScreenMode(false, true, 1024, 768);
    EXPECT_EQ(platform->modes.back(), Mode(false, true, 1024u, 768u));
    app->ChangeScreenMode(false, true, 1200, 768);
    EXPECT_EQ(platform->modes.back(), Mode(false, true, 1024u, 768u)) << "too wide: narrowed";

    // Bigger than the work area: shrink by the frame and 15 pixels, then fit the aspect.
    app->ChangeScreenMode(false, true, 2048, 1536);
    unsigned height = 1040 - 30 - 15;                                        // 995
    unsigned width = static_cast<unsigned>(1920 - 10 - 15);                  // 1895, too wide
    width = static_cast<unsigned>(width * (1024.0f / 768.0f) / (float(width) / float(height)));
    EXPECT_EQ(platform->modes.back(), Mode(false, true, width, height));
    EXPECT_FALSE(ox::core::GetTimeManager().GetRoot()->IsPaused()) << "time runs again";
}

TEST_F(AppFixture, ActivityAndMediaPausing)
{
    std::vector<std::string> media;
    app->GetMediaPauseHooks().audio = [&](bool pause) { media.push_back(pause ? "audio pause" : "audio resume"); };
    app->GetMediaPauseHooks().video = [&](bool pause) { media.push_back(pause ? "video pause" : "video resume"); };

    Send(WM_ACTIVATEAPP, 0);
    EXPECT_FALSE(app->IsActive());
    EXPECT_TRUE(app->IsMediaPaused());
    EXPECT_TRUE(GetTimeManager().GetRoot()->IsPaused());
    // Minimised while already paused: the audio is not touched again.
    Send(WM_SIZE, SIZE_MINIMIZED);
    EXPECT_EQ(media, (std::vector<std::string>{"audio pause", "video pause"}));
    Send(WM_ACTIVATEAPP, 1);
    EXPECT_FALSE(app->IsActive()) << "still minimised";
    Send(WM_SIZE, SIZE_RESTORED);
    EXPECT_TRUE(app->IsActive());
    EXPECT_FALSE(app->IsMediaPaused());
    EXPECT_FALSE(GetTimeManager().GetRoot()->IsPaused());
    EXPECT_EQ(media.back(), "audio resume");
    EXPECT_EQ(std::count(media.begin(), media.end(), "video resume"), 0)
        << "the size message resumed the media before activity did; the video stays paused";
    EXPECT_EQ(platform->defaults, 4) << "every message reaches the default handling";

    Send(WM_CLOSE, 0);
    EXPECT_EQ(platform->stops, 1);
}

TEST_F(AppFixture, TheAudioPausesWithTheApplicationByDefault)
{
    ox::sound::CAudioManager& audio = app->GetAudioManager();
    EXPECT_FALSE(audio.IsPaused());
    Send(WM_ACTIVATEAPP, 0);
    EXPECT_TRUE(audio.IsPaused());
    Send(WM_SIZE, SIZE_MINIMIZED);
    Send(WM_ACTIVATEAPP, 1);
    EXPECT_TRUE(audio.IsPaused());
    Send(WM_SIZE, SIZE_RESTORED);
    EXPECT_FALSE(audio.IsPaused());
}

TEST_F(AppFixture, FrameLimiterAndShutdown)
{
    app->LimitFPS(50);
    EXPECT_TRUE(app->GetFrameLimiter().HasThread());
    EXPECT_EQ(app->GetFrameLimiter().GetInterval(), 20u);
    app->Update(); // waits for one tick
    app->LimitFPS(0);
    EXPECT_FALSE(app->GetFrameLimiter().HasThread());
    app->Update(); // does not wait

    app->Shutdown();
    EXPECT_FALSE(app->IsShutdownDone()) << "only a request until the end of the update";
    app->Update();
    EXPECT_TRUE(app->IsShutdownDone());
    app->DoShutdown();
    EXPECT_EQ(platform->shutdowns, 1) << "a second shutdown does nothing";
    EXPECT_EQ(app->GetState(), ShuttingDown);
}

TEST_F(AppFixture, SecondInstanceInitFailsQuietly)
{
    platform->singleInstance = false;
    oxtest::MessageCapture boxes;
    EXPECT_FALSE(app->Init());
    EXPECT_TRUE(boxes.Boxes().empty());
}

TEST_F(AppFixture, DrawBracketsTheFrameAndCoversTheBars)
{
    auto owned = std::make_unique<oxtest::RecordingBackend>();
    oxtest::RecordingBackend* backend = owned.get();
    app->GetRenderer()->SetBackend(std::move(owned));
    app->GetRenderer()->InitWindow(true, true, 1920, 1080);
    backend->ClearRecord();
    app->Draw();
    ASSERT_EQ(backend->calls.front(), "BeginScene");
    ASSERT_EQ(backend->draws.size(), 1u);
    const auto& v = backend->draws[0].vertices;
    ASSERT_EQ(v.size(), 12u);
    // Pillar bars of 240 window pixels on both sides, opaque black.
    EXPECT_FLOAT_EQ(v[0].x, -0.5f);
    EXPECT_FLOAT_EQ(v[1].x, 239.5f);
    EXPECT_FLOAT_EQ(v[2].y, 1079.5f);
    EXPECT_FLOAT_EQ(v[6].x, 1679.5f);
    EXPECT_FLOAT_EQ(v[7].x, 1919.5f);
    EXPECT_EQ(v[0].diffuse, 0xFF000000u);
    EXPECT_EQ(backend->calls.back(), "ReleaseEventQuery");
    EXPECT_EQ(backend->Calls("Present").size(), 1u);

    // A canvas that fills the window has no bars; a minimised application draws nothing.
    app->GetRenderer()->InitWindow(true, true, 1024, 768);
    backend->ClearRecord();
    app->Draw();
    EXPECT_TRUE(backend->draws.empty());
    Send(WM_SIZE, SIZE_MINIMIZED);
    backend->ClearRecord();
    app->Draw();
    EXPECT_TRUE(backend->calls.empty());
}

TEST(AppDataFolder, FirstStartOpensOnlyTheGamesOwnFolderToItsUser)
{
    struct Case {
        const char* settings;
        const char* own; // the folder the game may change, under the base; empty: none
    };
    const Case cases[] = {
        {"company=\"Tarnwick\" product=\"Quest\"", "Tarnwick"},
        {"company=\"Tarnwick\"", "Tarnwick"},
        {"company=\"\" product=\"Quest\"", "Quest"},
        {"company=\"\"", ""},
        {"company=\"..\" product=\"Quest\"", ""},
    };
    ScopedUmask mask(022);
    for (const Case& c : cases) {
        SCOPED_TRACE(c.settings);
        oxtest::TempDir dir;
        oxtest::ScopedCwd cwd(dir.Path());
        const fs::path base = dir / "share" / "data";
        oxtest::ScopedEnv xdg("XDG_DATA_HOME", base.c_str());
        // Another application's files beside the game's, and the base itself, stay as they are.
        dir.Write("share/data/other.txt", "");
        dir.Write("share/data/OtherApp/secret", "");
        dir.Write("share/Quest/kept", "");
        chmod(base.c_str(), 0700);
        chmod((base / "other.txt").c_str(), 0600);
        chmod((base / "OtherApp").c_str(), 0700);
        chmod((base / "OtherApp/secret").c_str(), 0600);
        chmod((dir / "share/Quest/kept").c_str(), 0600);
        dir.Write("game.xml", std::string("<?xml version=\"1.0\"?><settings ") + c.settings + "/>");
        {
            CApplication app;
            EXPECT_TRUE(fs::is_directory(ox::misc::sys::NativePath(app.GetAppDataFolder())));
        }
        EXPECT_EQ(FileMode(base), 0700u);
        EXPECT_EQ(FileMode(base / "other.txt"), 0600u);
        EXPECT_EQ(FileMode(base / "OtherApp"), 0700u);
        EXPECT_EQ(FileMode(base / "OtherApp/secret"), 0600u);
        EXPECT_EQ(FileMode(dir / "share/Quest/kept"), 0600u);
        if (!*c.own)
            continue;
        // What the game made is its user's alone to write.
        const fs::path own = base / c.own;
        EXPECT_EQ(FileMode(own) & 0700, 0700u);
        EXPECT_EQ(FileMode(own) & 022, 0u);
        for (const auto& entry : fs::recursive_directory_iterator(own))
            EXPECT_EQ(FileMode(entry.path()) & 022, 0u) << entry.path();
    }
}

TEST_F(AppFixture, FullScreenCanvasFollowsTheRealWindowAndTheDesktop)
{
    ox::graphics::CRenderer& renderer = *app->GetRenderer();
    renderer.SetAvailableResolutions({{1920, 1080, true}, {1280, 1024, true}, {1024, 768, true}});
    app->SetCursorClip(true, {0, 0, 1024, 768});

    // A full-screen 1024 x 768 covers the 1920 x 1080 desktop: pillar bars, and input
    // (here the cursor clip) mapped onto the canvas as it is drawn.
    app->ChangeScreenMode(true, true, 1024, 768);
    EXPECT_EQ(platform->modes.back(), Mode(true, true, 1024u, 768u));
    EXPECT_EQ(renderer.GetWidth(), 1920u);
    EXPECT_EQ(renderer.GetHeight(), 1080u);
    EXPECT_EQ(renderer.GetActiveRect(), ox::misc::FloatRect(240, 0, 1440, 1080));
    EXPECT_FLOAT_EQ(renderer.GetScale().X, 1.40625f);
    EXPECT_EQ(platform->cursorClip, ox::misc::IntRect(240, 0, 1440, 1080));

    // The desktop changes its mode: the next frame takes the new desktop.
    platform->ChangeDesktop(1280, 1024);
    app->Draw();
    EXPECT_EQ(platform->modes.back(), Mode(true, true, 1280u, 1024u));
    EXPECT_EQ(renderer.GetWidth(), 1280u);
    EXPECT_EQ(renderer.GetActiveRect(), ox::misc::FloatRect(0, 32, 1280, 960));
    EXPECT_EQ(platform->handled.back().result, 1u) << "the display change is answered by the application";

    // In a window the same change fits the window again, at its size.
    app->ChangeScreenMode(false, true, 1024, 768);
    const size_t changes = platform->modes.size();
    platform->ChangeDesktop(1920, 1080);
    app->Draw();
    ASSERT_EQ(platform->modes.size(), changes + 1);
    EXPECT_EQ(platform->modes.back(), Mode(false, true, 1024u, 768u));
    app->Draw();
    EXPECT_EQ(platform->modes.size(), changes + 1) << "once";
}

TEST_F(AppFixture, ReplayKeyIsSwallowed)
{
    int toggles = 0;
    app->SetReplayKey([&] { ++toggles; });
    oxtest::SendKey(*platform, SDL_SCANCODE_P, KMOD_LCTRL | KMOD_LALT);
    EXPECT_EQ(toggles, 1);
    auto key = std::find_if(platform->handled.begin(), platform->handled.end(),
                            [](const SystemEvent& e) { return e.message == WM_KEYDOWN && e.wParam == 'P'; });
    ASSERT_NE(key, platform->handled.end());
    EXPECT_EQ(key->result, 1u);
    EXPECT_EQ(platform->defaults, static_cast<int>(platform->handled.size()) - 1)
        << "everything but the replay key reaches the default handling";

    oxtest::SendKey(*platform, SDL_SCANCODE_P, KMOD_LCTRL);
    oxtest::SendKey(*platform, SDL_SCANCODE_O, KMOD_LCTRL | KMOD_LALT);
    EXPECT_EQ(toggles, 1) << "Ctrl+P and Ctrl+Alt+O are ordinary keys";
}

TEST(AppPlatform, AdapterIsReleasedOnlyAfterTheApplication)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    oxtest::ScopedEnv xdg("XDG_DATA_HOME", (dir / "data").c_str());
    int shutdownsWhenReleased = -1;
    {
        CApplication app;
        auto owned = std::make_unique<FakePlatform>();
        owned->onDestroyed = [&](const FakePlatform& p) { shutdownsWhenReleased = p.shutdowns; };
        app.SetSystemIntegration(std::move(owned));
        ASSERT_TRUE(app.Init());
        EXPECT_EQ(shutdownsWhenReleased, -1);
    }
    EXPECT_EQ(shutdownsWhenReleased, 1) << "shut down by the application's end, then released";
}
