// The demo game headless across two runs: the player of the last session goes on where they
// left the level, whose state went into their save file when the game closed.
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
