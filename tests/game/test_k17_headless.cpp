// Runs the real game executable headless on a copy of the demo game.
#include "support/TestSupport.h"

#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <thread>

namespace fs = std::filesystem;

namespace {

struct GameRun {
    oxtest::TempDir dir;
    fs::path game;
    fs::path data;
    fs::path logFile;
    pid_t pid = -1;

    GameRun()
    {
        game = dir / "demo";
        data = dir / "xdg";
        logFile = data / "Lanternfold" / "Lantern Demo" / "log.oxlog";
        fs::copy(OX_DEMO_GAME, game, fs::copy_options::recursive);
        // What an earlier `make run` printed must not pass for this run's output.
        fs::remove(game / "k17_stdout.txt");
        fs::remove(game / "k17_stderr.txt");
        fs::create_directories(data);
    }

    void Start(const char* videoDriver = "offscreen")
    {
        pid = fork();
        if (pid == 0) {
            if (chdir(game.c_str()) != 0)
                _exit(101);
            setenv("XDG_DATA_HOME", data.c_str(), 1);
            setenv("SDL_VIDEODRIVER", videoDriver, 1);
            setenv("ALSOFT_DRIVERS", "null", 1);
            execl(OX_K17_PATH, "k17", static_cast<char*>(nullptr));
            _exit(102);
        }
    }

    // The exit status, or -1 if the game did not end within the time.
    int WaitExit(std::chrono::milliseconds limit)
    {
        auto end = std::chrono::steady_clock::now() + limit;
        while (std::chrono::steady_clock::now() < end) {
            int status = 0;
            if (waitpid(pid, &status, WNOHANG) == pid) {
                pid = -1;
                return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return -1;
    }

    std::string Log() const { return oxtest::ReadFile(logFile); }
    std::string Output() const { return oxtest::ReadFile(game / "k17_stdout.txt"); }

    // Waits until the game's standard output holds `text`.
    bool WaitForOutput(const std::string& text, std::chrono::milliseconds limit) const
    {
        auto end = std::chrono::steady_clock::now() + limit;
        while (std::chrono::steady_clock::now() < end) {
            if (Output().find(text) != std::string::npos)
                return true;
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return false;
    }

    ~GameRun()
    {
        if (pid > 0) {
            kill(pid, SIGKILL);
            waitpid(pid, nullptr, 0);
        }
    }
};

bool LogHasInOrder(const std::string& log, std::initializer_list<const char*> lines)
{
    size_t at = 0;
    for (const char* line : lines) {
        at = log.find(line, at);
        if (at == std::string::npos)
            return false;
    }
    return true;
}

} // namespace

TEST(GameHeadless, RunsFramesAndClosesOnSigterm)
{
    GameRun run;
    run.Start();
    // Let it start and run frames, then ask it to close as a desktop would.
    for (int i = 0; i < 100 && run.Log().find("change screen mode complete") == std::string::npos; ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    std::this_thread::sleep_for(std::chrono::milliseconds(300));
    ASSERT_EQ(run.WaitExit(std::chrono::milliseconds(0)), -1) << "the game ended by itself:\n" << run.Log();
    // scripts/main.lua ran and its Init was called once the window was up.
    EXPECT_TRUE(run.WaitForOutput("Lantern Demo Init: Lua 5.1 in host 'main', lfs present", std::chrono::seconds(5)))
        << run.Output();
    // Once loaded, level1 starts in its own host: the init script, then the level's start
    // script, which clicks the lamp; the lamp's click script runs as a script thread of the
    // level host and waits on the level clock.
    EXPECT_TRUE(run.WaitForOutput("Lantern Demo: the lamp flickered 3 times on the level clock", std::chrono::seconds(5)))
        << run.Output();
    EXPECT_TRUE(LogHasInOrder(run.Output(), {"Lantern Demo: the init script runs",
                                             "Lantern Demo: level level1 starts in host qe_level",
                                             "Lantern Demo: the level starts", "Lantern Demo: the lamp click script runs",
                                             "Lantern Demo: qe.StartLevel gave 1"}))
        << run.Output();
    // The engine tour asks the engine's own services: a declared texture's size, a font's
    // measure, the audio manager's group volume.
    EXPECT_TRUE(run.WaitForOutput("the disc is 96 px wide", std::chrono::seconds(5))) << run.Output();
    EXPECT_TRUE(LogHasInOrder(run.Output(), {"Lantern Demo tour: ", " px in the font small, show_fps ",
                                             ", music at volume "}))
        << run.Output();

    // Editing the main script while the game runs runs it again in the same state: what
    // Init stored is still there.
    fs::path script = run.game / "scripts" / "main.lua";
    fs::path edited = run.game / "scripts" / "main.lua.edited";
    {
        std::ofstream out(edited, std::ios::binary);
        out << oxtest::ReadFile(script) << "\nprint(\"Lantern Demo reloaded in host \" .. tostring(lantern.host))\n";
    }
    fs::last_write_time(edited, fs::file_time_type::clock::now() + std::chrono::seconds(5));
    fs::rename(edited, script);
    EXPECT_TRUE(run.WaitForOutput("Lantern Demo reloaded in host main", std::chrono::seconds(5)))
        << run.Output() << run.Log();

    {
        GameRun second;
        second.game = run.game;
        second.data = run.data;
        second.Start();
        EXPECT_EQ(second.WaitExit(std::chrono::seconds(10)), 0) << "a second instance ends quietly";
    }

    kill(run.pid, SIGTERM);
    EXPECT_EQ(run.WaitExit(std::chrono::seconds(10)), 0);
    std::string log = run.Log();
    EXPECT_TRUE(LogHasInOrder(log, {"[app][1]: app created", "[app][1]: app init...", "[app][1]: app init complete...",
                                    "[app][1]: app destroyed"}))
        << log;
    EXPECT_NE(run.Output().find("Lantern Demo quest.OnClose: the lantern goes out"), std::string::npos)
        << run.Output();
    std::string errors = oxtest::ReadFile(run.game / "k17_stderr.txt");
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << errors;
    EXPECT_EQ(log.find("[font]"), std::string::npos) << "the demo's fonts load:\n" << log;
    EXPECT_EQ(log.find("assertion failed"), std::string::npos) << log;
    // The script threads run once per frame: the first builds the level from the quest data.
    EXPECT_TRUE(run.Output().find("Lantern Demo: level1 built from the quest data: 3 scenes, 19 objects") !=
                std::string::npos) << run.Output() << log;
    EXPECT_NE(log.find("[quest][1]: Quest data: properties/quest.xml compiled"), std::string::npos) << log;
    // The declared textures are known, and none of them failed to load.
    EXPECT_NE(log.find("[texman][0]: Texture information created in"), std::string::npos) << log;
    EXPECT_EQ(log.find("[texman][3]"), std::string::npos) << log;
    // The clip declarations are read at start.
    EXPECT_NE(log.find("[anim][1]: Clips loaded"), std::string::npos) << log;
    EXPECT_EQ(log.find("[anim][3]"), std::string::npos) << "the demo's clip loads whole:\n" << log;
    EXPECT_EQ(log.find("[anim][2]"), std::string::npos) << log;
    // The sounds are declared and the music plays (on OpenAL's null output), without a problem.
    EXPECT_NE(run.Output().find("Lantern Demo Run: music plays"), std::string::npos) << run.Output();
    EXPECT_EQ(log.find("[sound][2]"), std::string::npos) << log;
    EXPECT_EQ(log.find("[sound][3]"), std::string::npos) << log;
    EXPECT_TRUE(fs::exists(run.game / "k17_stdout.txt"));
    EXPECT_TRUE(fs::exists(run.game / "k17_stderr.txt"));
}

TEST(GameHeadless, NoDisplayIsAClearErrorAndANonZeroExit)
{
    GameRun run;
    fs::path errors = run.dir / "stderr.txt";
    pid_t pid = fork();
    if (pid == 0) {
        freopen(errors.c_str(), "w", stderr);
        if (chdir(run.game.c_str()) != 0)
            _exit(101);
        setenv("XDG_DATA_HOME", run.data.c_str(), 1);
        setenv("SDL_VIDEODRIVER", "no-such-driver", 1);
        execl(OX_K17_PATH, "k17", static_cast<char*>(nullptr));
        _exit(102);
    }
    run.pid = pid;
    EXPECT_EQ(run.WaitExit(std::chrono::seconds(10)), 1);
    EXPECT_NE(oxtest::ReadFile(errors).find("Cannot open a display"), std::string::npos);
}

TEST(GameHeadless, DataFolderIsTheUsersAloneWithAndWithoutProduct)
{
    for (bool withProduct : {true, false}) {
        SCOPED_TRACE(withProduct ? "with product" : "without product");
        GameRun run;
        if (!withProduct) {
            std::string settings = oxtest::ReadFile(run.game / "game.xml");
            const std::string product = " product=\"Lantern Demo\"";
            ASSERT_NE(settings.find(product), std::string::npos);
            settings.erase(settings.find(product), product.size());
            std::ofstream(run.game / "game.xml", std::ios::binary) << settings;
            run.logFile = run.data / "Lanternfold" / "log.oxlog";
        }
        // Another application's files beside the game's folder.
        std::ofstream(run.data / "other.txt") << "";
        fs::create_directories(run.data / "OtherApp");
        chmod((run.data / "other.txt").c_str(), 0600);
        chmod((run.data / "OtherApp").c_str(), 0700);

        const mode_t mask = umask(022);
        run.Start();
        umask(mask);
        // Init runs once the window is up.
        ASSERT_TRUE(run.WaitForOutput("Lantern Demo Init", std::chrono::seconds(10)));
        kill(run.pid, SIGTERM);
        ASSERT_EQ(run.WaitExit(std::chrono::seconds(10)), 0) << run.Log();

        struct stat info {};
        stat((run.data / "other.txt").c_str(), &info);
        EXPECT_EQ(info.st_mode & 07777, 0600u);
        stat((run.data / "OtherApp").c_str(), &info);
        EXPECT_EQ(info.st_mode & 07777, 0700u);
        const fs::path own = run.data / "Lanternfold";
        ASSERT_TRUE(fs::is_directory(own / (withProduct ? "Lantern Demo/saves" : "saves")));
        std::vector<fs::path> entries {own};
        for (const auto& entry : fs::recursive_directory_iterator(own))
            entries.push_back(entry.path());
        for (const fs::path& entry : entries) {
            stat(entry.c_str(), &info);
            EXPECT_EQ(info.st_mode & 022, 0u) << entry;
            EXPECT_EQ(info.st_mode & 0600, 0600u) << entry;
        }
    }
}
