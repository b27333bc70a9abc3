// The demo's mini-game headless: M opens it over the first window, two clicks light the three
// lamps, and the window reads the game's result when the game ends.
#include "DemoChild.h"
#include "game/App.h"
#include "gui/Window.h"
#include "support/TestSupport.h"

#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace {

int PlayTheLamps()
{
    k17::CApp app;
    app.ReadGameFolder();
    if (!app.Init())
        return 10;
    ox::gui::BaseWindowPtrT loading = app.CreateLoadWindow();
    app.SetMainWindow(loading);
    auto frames = [&](int count) {
        for (int i = 0; i < count; ++i) {
            app.Update();
            app.Draw();
        }
    };
    frames(2);
    loading->OnKeyDown('M', 0, 0, false);
    frames(1);
    ox::gui::CBaseWindow* game = loading->GetChildWindow();
    if (!game || game->GetId() != "minigame")
        return 11;
    if (!oxtest::PressWidget(game, "lamp1") || !oxtest::PressWidget(game, "lamp3"))
        return 12;
    frames(2);
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

} // namespace

TEST(DemoMiniGame, TwoClicksLightTheLampsAndTheWindowReadsTheResult)
{
    oxtest::TempDir dir;
    const fs::path game = dir / "demo";
    fs::copy(OX_DEMO_GAME, game, fs::copy_options::recursive);
    fs::create_directories(dir / "xdg");
    const pid_t pid = fork();
    if (pid == 0) {
        alarm(60);
        setenv("XDG_DATA_HOME", (dir / "xdg").c_str(), 1);
        setenv("SDL_VIDEODRIVER", "offscreen", 1);
        setenv("ALSOFT_DRIVERS", "null", 1);
        if (chdir(game.c_str()) != 0)
            _exit(101);
        const int result = PlayTheLamps();
        fflush(stdout);
        _exit(result);
    }
    int status = 0;
    ASSERT_EQ(waitpid(pid, &status, 0), pid);
    const std::string output = oxtest::ReadFile(game / "k17_stdout.txt");
    const std::string errors = oxtest::ReadFile(game / "k17_stderr.txt");
    ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status << "\n" << output << errors;
    EXPECT_NE(output.find("the lamps burn after 2 moves"), std::string::npos) << output << errors;
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << errors;
}
