#include "core/Application.h"
#include "core/TimeManager.h"
#include "misc/sys/Path.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <sys/stat.h>

using namespace ox::core;
using ox::graphics::Resolution;
namespace fs = std::filesystem;

namespace {

// A platform that records what the application asks of it.
struct FakeAdapter : CSystemIntegration {
    SystemEvent event;
    unsigned desktopWidth = 1920, desktopHeight = 1080;
    IntRect workArea {0, 0, 1920, 1040};
    int frameWidth = 10, frameHeight = 30;
    int shutdowns = 0, defaults = 0, stops = 0;
    bool singleInstance = true;
    std::vector<std::tuple<bool, bool, unsigned, unsigned>> modes;
    IntRect client;

    bool Init() override { return true; }
    void Run() override {}
    void Stop() override { ++stops; }
    void Shutdown() override { ++shutdowns; }
    bool CheckSingleInstance() override { return singleInstance; }
    void RunNested() override {}
    void StopNested() override {}
    bool SetScreenMode(bool fullscreen, bool bpp32, unsigned width, unsigned height) override
    {
        modes.emplace_back(fullscreen, bpp32, width, height);
        client = {0, 0, static_cast<int>(width), static_cast<int>(height)};
        return true;
    }
    bool GetDesktopResolution(unsigned* w, unsigned* h) override
    {
        *w = desktopWidth;
        *h = desktopHeight;
        return true;
    }
    SystemEvent* GetCurrentEvent() override { return &event; }
    void DefaultProcess() override { ++defaults; }
    IntRect GetClientRect() override { return client; }
    void AdjustRect(IntRect& r) override
    {
        r.Width += frameWidth;
        r.Height += frameHeight;
    }
    IntRect GetWorkArea() override { return workArea; }
    void ScreenToClient(IntPoint&) override {}
    void ClientToScreen(IntPoint&) override {}
    void SetCursorPos(IntPoint) override {}
    IntPoint GetCursorPos() override { return {}; }
    void SetCursorType(unsigned, bool) override {}
    unsigned GetCursorType() override { return 0; }
    void ShowCursor(bool) override {}
    bool IsCursorVisible() override { return true; }
    void ClipCursor(const IntRect*) override {}
    void SetClient(IPlatformClient*) override {}
    void SetIdentity(const std::string&, const std::string&, const std::string&) override {}
};

struct AppFixture : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    FakeAdapter adapter;
    std::unique_ptr<CApplication> app;

    void SetUp() override
    {
        // The time manager is process-wide: start from a running clock whatever ran before.
        while (GetTimeManager().GetRoot()->IsPaused())
            GetTimeManager().Pause(false);
        dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Quest\" version=\"123\"/>");
        app = std::make_unique<CApplication>();
        app->SetSystemIntegration(&adapter);
        ASSERT_TRUE(app->Init());
        app->GetRenderer()->SetSourceResolution(1024, 768);
    }
    void Send(uint32_t message, uint32_t wParam)
    {
        adapter.event.message = message;
        adapter.event.wParam = wParam;
        app->ProcessEvent();
    }
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
    EXPECT_EQ(adapter.modes.back(), std::make_tuple(true, true, 1920u, 1080u));

    // Only a 16-bit mode of that size: the depth flips, not the size.
    app->ChangeScreenMode(true, true, 800, 600);
    EXPECT_EQ(adapter.modes.back(), std::make_tuple(true, false, 800u, 600u));

    // No such mode at all: the last one of the list.
    app->ChangeScreenMode(true, true, 640, 480);
    EXPECT_EQ(adapter.modes.back(), std::make_tuple(true, true, 1600u, 900u));

    // A window that fits keeps the request but is brought to the source aspect.
    app->ChangeScreenMode(false, true, 1024, 768);
    EXPECT_EQ(adapter.modes.back(), std::make_tuple(false, true, 1024u, 768u));
    app->ChangeScreenMode(false, true, 1200, 768);
    EXPECT_EQ(adapter.modes.back(), std::make_tuple(false, true, 1024u, 768u)) << "too wide: narrowed";

    // Bigger than the work area: shrink by the frame and 15 pixels, then fit the aspect.
    app->ChangeScreenMode(false, true, 2048, 1536);
    unsigned height = 1040 - 30 - 15;                                        // 995
    unsigned width = static_cast<unsigned>(1920 - 10 - 15);                  // 1895, too wide
    width = static_cast<unsigned>(width * (1024.0f / 768.0f) / (float(width) / float(height)));
    EXPECT_EQ(adapter.modes.back(), std::make_tuple(false, true, width, height));
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
    EXPECT_EQ(adapter.defaults, 4) << "every message reaches the default handling";

    Send(WM_CLOSE, 0);
    EXPECT_EQ(adapter.stops, 1);
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
    EXPECT_EQ(adapter.shutdowns, 1) << "a second shutdown does nothing";
    EXPECT_EQ(app->GetState(), ShuttingDown);
}

TEST_F(AppFixture, SecondInstanceInitFailsQuietly)
{
    adapter.singleInstance = false;
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
