// The template a new game starts from runs in the real game executable: its main script's Init
// and Run are called, and Run reads the template's one string.
#include "support/TestSupport.h"

#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <thread>

namespace fs = std::filesystem;

TEST(TemplateGame, StartsAndRunsItsMainScript)
{
    oxtest::TempDir dir;
    const fs::path game = dir / "game";
    fs::copy(fs::path(OX_DEMO_GAME) / ".." / "template", game, fs::copy_options::recursive);
    fs::create_directories(dir / "xdg");
    const pid_t pid = fork();
    if (pid == 0) {
        if (chdir(game.c_str()) != 0)
            _exit(101);
        setenv("XDG_DATA_HOME", (dir / "xdg").c_str(), 1);
        setenv("SDL_VIDEODRIVER", "offscreen", 1);
        setenv("ALSOFT_DRIVERS", "null", 1);
        execl(OX_K17_PATH, "k17", static_cast<char*>(nullptr));
        _exit(102);
    }
    std::string output;
    for (int i = 0; i < 300 && output.find("Run: My Game is loaded") == std::string::npos; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        output = oxtest::ReadFile(game / "k17_stdout.txt");
    }
    kill(pid, SIGTERM);
    int status = 0;
    waitpid(pid, &status, 0);
    EXPECT_NE(output.find("Init: the game starts\nRun: My Game is loaded"), std::string::npos) << output;
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
}
