#pragma once

#include "gui/BaseWindow.h"
#include "gui/Widget.h"
#include "support/TestSupport.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

namespace oxtest {

// The demo game played in a child process: a copy of the demo folder with the user's data
// folder beside it, headless video and audio, a time limit so a loop that never ends cannot
// hang the tests. What the game printed stays in the copy.
struct DemoChild {
    TempDir dir;
    std::filesystem::path game = dir / "demo";

    DemoChild()
    {
        std::filesystem::copy(OX_DEMO_GAME, game, std::filesystem::copy_options::recursive);
        std::filesystem::create_directories(dir / "xdg");
    }

    // Runs `play` in a child started in the game's folder; its exit code (99: out of time,
    // 101: no game folder), or -1 when it died of a signal.
    int Run(int (*play)(), unsigned seconds = 60)
    {
        const pid_t pid = fork();
        if (pid == 0) {
            signal(SIGALRM, [](int) {
                fflush(stdout);
                _exit(99);
            });
            alarm(seconds);
            setenv("XDG_DATA_HOME", (dir / "xdg").c_str(), 1);
            setenv("SDL_VIDEODRIVER", "offscreen", 1);
            setenv("ALSOFT_DRIVERS", "null", 1);
            if (chdir(game.c_str()) != 0)
                _exit(101);
            const int result = play();
            fflush(stdout);
            _exit(result);
        }
        int status = 0;
        if (pid < 0 || waitpid(pid, &status, 0) != pid)
            return -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

    std::string Output() const { return ReadFile(game / "k17_stdout.txt"); }
    std::string Errors() const { return ReadFile(game / "k17_stderr.txt"); }
};

// A left click on the widget `id` of `window`, handed to it as the widget manager would; false
// when there is no such widget or it has no size to be clicked.
inline bool PressWidget(ox::gui::CBaseWindow* window, const char* id)
{
    ox::gui::CWidget* widget = window ? window->GetWidget(id, true) : nullptr;
    if (!widget || widget->GetSize().X <= 0 || widget->GetSize().Y <= 0)
        return false;
    widget->OnMouseDown({1, 1}, ox::gui::LeftButton, 0, false);
    widget->OnMouseUp({1, 1}, ox::gui::LeftButton, 0, false);
    return true;
}

} // namespace oxtest
