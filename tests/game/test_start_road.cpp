// The road from the start-up pictures to the scripts' Run, on a clock the test moves: the
// pictures in their order with their fades, then the loading, then Run exactly once.
#include "core/TextureManager.h"
#include "game/Branch.h"
#include "game/GameClock.h"
#include "game/LoadWindow.h"
#include "misc/Unicode.h"
#include "misc/imagelib/ImageLib.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <gtest/gtest.h>

#include <sys/wait.h>

namespace fs = std::filesystem;
using namespace ox;

namespace {

void WriteJpeg(const fs::path& path, uint32_t width, uint32_t height)
{
    fs::create_directories(path.parent_path());
    std::vector<uint32_t> pixels(size_t(width) * height, 0xFF808080u);
    ASSERT_TRUE(misc::imagelib::CompressJpegFile(path.c_str(), pixels.data(), width, height, 90));
}

struct StartRoad : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::RecordingBackend* backend = nullptr;
    std::unique_ptr<graphics::CRenderer> renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    int now = 0;
    core::AppState state = core::Created;
    int loads = 0, runs = 0;

    StartRoad() { k17::SetGameClock([this] { return now; }); }
    ~StartRoad() override
    {
        k17::SetGameClock(nullptr);
        core::CTextureManager::Instance().RemoveUnusedSurfaces();
    }

    boost::intrusive_ptr<k17::CLoadWindow> MakeWindow()
    {
        k17::CLoadWindow::Road road {[this] { return state; },
                                     [this] {
                                         ++loads;
                                         state = core::Running;
                                     },
                                     [this] { ++runs; }, misc::Utf8ToWide(dir.Path().string())};
        boost::intrusive_ptr<k17::CLoadWindow> window(new k17::CLoadWindow(std::move(road)));
        oxtest::ScopedCwd cwd(dir.Path());
        window->Load(core::CSettingsGroup::Empty(), core::CSettingsGroup::Empty());
        return window;
    }
    uint32_t Alpha(k17::CBranch& branch) { return static_cast<uint32_t>(branch.GetImage().GetColor().Alpha); }
};

} // namespace

TEST_F(StartRoad, PicturesInOrderWithFadesThenLoadThenRunOnce)
{
    WriteJpeg(dir / "fsdata/splash1.jpg", 64, 32);
    WriteJpeg(dir / "fsdata/splash2.jpg", 16, 16);
    WriteJpeg(dir / "branch/logo1.jpg", 2, 2); // a slot left out
    WriteJpeg(dir / "branch/logo3.jpg", 2048, 384);
    auto window = MakeWindow();
    k17::CBranch& branch = *window->GetBranch();
    ASSERT_EQ(branch.GetItems().size(), 3u);
    EXPECT_EQ(branch.GetItems()[0].m_Texture->GetWidth(), 16); // splash2 comes first
    EXPECT_EQ(branch.GetItems()[1].m_Texture->GetWidth(), 64);
    EXPECT_EQ(branch.GetItems()[2].m_Texture->GetWidth(), 2048);
    EXPECT_EQ(window->GetColor().Alpha, 0);

    // A small picture is scaled up to the canvas, keeping its proportions, centred.
    gui::CImageWidget& image = branch.GetImage();
    EXPECT_EQ(image.GetSize(), misc::FloatVector(768, 768));
    EXPECT_EQ(image.GetOffset(), misc::FloatVector(128, 0));

    const std::vector<std::pair<int, uint32_t>> fades {{0, 0}, {500, 128}, {1000, 255}, {2000, 255}, {3500, 128}};
    for (auto [time, alpha] : fades) {
        now = time;
        window->Update();
        EXPECT_EQ(Alpha(branch), alpha) << "at " << time;
    }
    now = 4000;
    window->Update();
    EXPECT_EQ(image.GetSize(), misc::FloatVector(1024, 512));
    EXPECT_EQ(image.GetOffset(), misc::FloatVector(0, 128));
    now = 8000;
    window->Update();
    // A wide picture is scaled down.
    EXPECT_EQ(image.GetSize(), misc::FloatVector(1024, 192));
    EXPECT_EQ(loads, 0);
    EXPECT_EQ(runs, 0);
    now = 11999;
    window->Update();
    EXPECT_EQ(loads, 0);

    now = 12000; // the last picture ends: the next update finds the list empty
    window->Update();
    window->Update();
    EXPECT_TRUE(branch.IsDone());
    EXPECT_EQ(loads, 1);
    EXPECT_EQ(runs, 1);
    EXPECT_EQ(window->GetColor().Alpha, 255);
    for (int i = 0; i < 5; ++i)
        window->Update();
    EXPECT_EQ(loads, 1);
    EXPECT_EQ(runs, 1);
}

TEST_F(StartRoad, WithoutPicturesLoadingStartsAtTheFirstUpdate)
{
    WriteJpeg(dir / "branch/logo2.jpg", 1, 1);
    fs::create_directories(dir / "fsdata");
    dir.Write("fsdata/splash1.jpg", "not a picture");
    auto window = MakeWindow();
    EXPECT_TRUE(window->GetBranch()->GetItems().empty());
    window->Update();
    EXPECT_TRUE(window->GetBranch()->IsDone());
    EXPECT_EQ(loads, 1);
    EXPECT_EQ(runs, 1);
}

TEST_F(StartRoad, TheDemoRunFolderGetsItsPicturesFromOurScript)
{
    const fs::path out = dir / "run";
    const std::string command = std::string("sh '") + OX_DEMO_GAME + "/stage-run.sh' '" + OX_TOOLS_DIR + "' '" +
                                out.string() + "' > '" + (dir / "log.txt").string() + "' 2>&1";
    ASSERT_EQ(WEXITSTATUS(system(command.c_str())), 0) << oxtest::ReadFile(dir / "log.txt");
    // The game's files are packed (tests/game/test_demo_shipping.cpp starts them).
    EXPECT_TRUE(fs::exists(out / "game.pack"));
    // What the branch makes of that folder: the two splash screens, then the logo.
    oxtest::ScopedCwd cwd(out);
    k17::CBranch branch(misc::Utf8ToWide(out.string()));
    ASSERT_EQ(branch.GetItems().size(), 3u);
    EXPECT_EQ(branch.GetItems()[0].m_Texture->GetWidth(), 1024);
    EXPECT_EQ(branch.GetItems()[1].m_Texture->GetWidth(), 800);
    EXPECT_EQ(branch.GetItems()[2].m_Texture->GetWidth(), 512);
}
