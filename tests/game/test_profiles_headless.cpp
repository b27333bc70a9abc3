// The demo game headless across two runs: the player of the last session goes on where they
// left the level, whose state went into their save file when the game closed.
#include "game/App.h"
#include "gui/Window.h"
#include "DemoChild.h"
#include "support/TestSupport.h"

#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <thread>

namespace fs = std::filesystem;

namespace {

// Runs the game on a copy of the demo until `text` is in its output, then closes it as a
// desktop would. Gives the output.
std::string RunUntil(const fs::path& game, const fs::path& data, const std::string& text)
{
    fs::remove(game / "k17_stdout.txt");
    pid_t pid = fork();
    if (pid == 0) {
        if (chdir(game.c_str()) != 0)
            _exit(101);
        setenv("XDG_DATA_HOME", data.c_str(), 1);
        setenv("SDL_VIDEODRIVER", "offscreen", 1);
        setenv("ALSOFT_DRIVERS", "null", 1);
        execl(OX_K17_PATH, "k17", static_cast<char*>(nullptr));
        _exit(102);
    }
    std::string output;
    for (int i = 0; i < 300 && output.find(text) == std::string::npos; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        output = oxtest::ReadFile(game / "k17_stdout.txt");
    }
    kill(pid, SIGTERM);
    for (int i = 0; i < 200 && waitpid(pid, nullptr, WNOHANG) != pid; ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    kill(pid, SIGKILL);
    waitpid(pid, nullptr, 0);
    return oxtest::ReadFile(game / "k17_stdout.txt");
}

} // namespace

TEST(DemoProfiles, ARestartContinuesWhereThePlayerLeft)
{
    oxtest::TempDir dir;
    const fs::path game = dir / "demo";
    const fs::path data = dir / "xdg";
    const fs::path saves = data / "Lanternfold" / "Lantern Demo" / "saves";
    fs::copy(OX_DEMO_GAME, game, fs::copy_options::recursive);

    EXPECT_NE(RunUntil(game, data, "nobody plays").find("Lantern Demo: nobody plays yet"), std::string::npos);

    std::ofstream(saves / "saves.xml") << "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
                                          "<Profiles current_profile_name=\"Ann\"><profile name=\"Ann\" guid=\"a1\"/></Profiles>\n";
    std::string first = RunUntil(game, data, "Ann starts level1");
    EXPECT_NE(first.find("Lantern Demo: Ann starts level1"), std::string::npos) << first;
    EXPECT_NE(first.find("Lantern Demo: Ann's level saved"), std::string::npos) << first;
    EXPECT_NE(oxtest::ReadFile(saves / "a1.sav").find("<level id=\"level1\""), std::string::npos);
    EXPECT_NE(oxtest::ReadFile(saves / "saves.xml").find("step=\"level1\""), std::string::npos);

    std::string second = RunUntil(game, data, "where they left");
    EXPECT_NE(second.find("Lantern Demo: Ann goes on where they left level1"), std::string::npos) << second;
}

namespace {

// The game in this process: P opens the chooser over the first window, a new player comes,
// the records open over it and close, Play closes the chooser, F ends the level. Exit codes
// above 0 say where it went wrong.
int PlayThePlayers()
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
    frames(3);
    loading->OnKeyDown('P', 0, 0, false);
    frames(1);
    ox::gui::CBaseWindow* chooser = loading->GetChildWindow();
    if (!chooser || !oxtest::PressWidget(chooser, "new_profile"))
        return 11;
    if (!chooser->GetWidget("players", true) || chooser->GetWidget("players", true)->GetSize().X < 300)
        return 12;
    if (!oxtest::PressWidget(chooser, "show_records") || !oxtest::PressWidget(chooser->GetChildWindow(), "close_records"))
        return 13;
    frames(1);
    if (chooser->GetChildWindow() || !oxtest::PressWidget(chooser, "play"))
        return 14;
    frames(1);
    // The chooser is gone (the main menu may have come over the first window meanwhile).
    if (app.GetTopWindow()->GetId() == "profiles")
        return 15;
    loading->OnKeyDown('F', 0, 0, false);
    frames(1);
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

} // namespace

TEST(DemoProfiles, ChooserAndRecordsWindowsTakeClicks)
{
    oxtest::DemoChild demo;
    const oxtest::TempDir& dir = demo.dir;
    const int result = demo.Run(&PlayThePlayers);
    const std::string output = demo.Output();
    ASSERT_EQ(result, 0) << output;
    size_t at = 0;
    for (const char* line : {"the players' chooser opens", "Player 1 starts level1", "the records open",
                             "level1 finished by Player 1", "the records open", "Player 1's level saved"}) {
        at = output.find(line, at);
        ASSERT_NE(at, std::string::npos) << "missing: " << line << "\n" << output;
    }
    const fs::path saves = dir / "xdg" / "Lanternfold" / "Lantern Demo" / "saves";
    EXPECT_NE(oxtest::ReadFile(saves / "records.xml").find("name=\"Player 1\""), std::string::npos);
}
