// The demo's start as a player meets it: from the game object's creation in the game folder to
// its first drawn frame (the load window); then the demo's level made from the quest data, and
// the level started as the demo's script does it (made, given a Lua host of its own, its
// scripts loaded and begun). Each run is a fresh process (a child), as each start of the game
// is; the child measures and reports through a pipe. Targets: 300 ms to the first frame, 50 ms
// a level.
// Headless: SDL's offscreen video and OpenAL's null output, a user folder of its own.
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "lua/Lua.h"
#include "quest/Level.h"
#include "quest/QuestData.h"

#include <benchmark/benchmark.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <ctime>
#include <cstdlib>
#include <filesystem>
#include <string>

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

namespace {

struct StartTimes {
    double firstFrameMs = -1;
    double firstFrameCpuMs = -1; // the process's processor time by then, all threads

    double levelMs = -1;
    double levelStartedMs = -1;
};

double Since(Clock::time_point start)
{
    return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

// On a busy machine the wall time says little: the processor time says what the start cost.
double ProcessCpuMs()
{
    timespec now {};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) * 1000.0 + static_cast<double>(now.tv_nsec) / 1e6;
}

// In the child: the game in the demo's folder to its first frame, then level1 made.
StartTimes StartTheDemo()
{
    StartTimes times;
    const Clock::time_point start = Clock::now();
    const double cpuStart = ProcessCpuMs();
    k17::CApp app;
    app.ReadGameFolder();
    if (!app.Init())
        return times;
    ox::gui::BaseWindowPtrT loading = app.CreateLoadWindow();
    app.SetMainWindow(loading);
    auto* adapter = dynamic_cast<ox::core::CStandaloneApplicationSdl*>(app.GetSystemIntegration());
    if (adapter)
        adapter->PumpMessages();
    app.Update();
    app.Draw();
    times.firstFrameMs = Since(start);
    times.firstFrameCpuMs = ProcessCpuMs() - cpuStart;
    const Clock::time_point made = Clock::now();
    qe::LevelPtrT level(qe::g_QuestData::Instance().CreateLevel("level1"));
    if (level)
        times.levelMs = Since(made);
    level.reset();
    // The script starts its level once: what the loading started is let go first.
    ox::lua::CLua* lua = ox::lua::CLua::GetLua("main");
    if (lua && lua->Run(std::string("lantern.level = nil"))) {
        const Clock::time_point started = Clock::now();
        ox::lua::CallLuaFunction(lua, "StartLevel");
        if (lua->Run(std::string("assert(lantern.level)")))
            times.levelStartedMs = Since(started);
    }
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return times;
}

// A copy of the demo (the game writes its output files into its folder) and a user folder,
// removed at the end.
struct Folders {
    fs::path root = fs::temp_directory_path() / ("bench_startup_" + std::to_string(getpid()));
    fs::path game = root / "demo";
    fs::path home = root / "xdg";
    Folders()
    {
        fs::create_directories(home);
        fs::copy(OX_DEMO_GAME, game, fs::copy_options::recursive);
    }
    ~Folders()
    {
        std::error_code ignored;
        fs::remove_all(root, ignored);
    }
};

// One start in a child process.
StartTimes MeasureOneStart()
{
    static const Folders folders;
    int channel[2];
    if (pipe(channel) != 0)
        return {};
    const pid_t pid = fork();
    if (pid == 0) {
        close(channel[0]);
        setenv("XDG_DATA_HOME", folders.home.c_str(), 1);
        setenv("SDL_VIDEODRIVER", "offscreen", 1);
        setenv("ALSOFT_DRIVERS", "null", 1);
        StartTimes times;
        if (chdir(folders.game.c_str()) == 0)
            times = StartTheDemo();
        const ssize_t written = write(channel[1], &times, sizeof(times));
        _exit(written == sizeof(times) ? 0 : 1);
    }
    close(channel[1]);
    StartTimes times;
    if (pid < 0 || read(channel[0], &times, sizeof(times)) != sizeof(times))
        times = {};
    close(channel[0]);
    int status = 0;
    if (pid > 0)
        waitpid(pid, &status, 0);
    return times;
}

// Runs starts and reports one of their figures as the iteration's time.
template <double StartTimes::*Figure>
void ReportStarts(benchmark::State& state, double targetMs)
{
    double cpuMs = 0;
    for (auto _ : state) {
        const StartTimes times = MeasureOneStart();
        const double ms = times.*Figure;
        cpuMs += times.firstFrameCpuMs;
        if (ms < 0) {
            state.SkipWithError("the demo did not start");
            break;
        }
        state.SetIterationTime(ms / 1000.0);
    }
    state.counters["target_ms"] = targetMs;
    if (Figure == &StartTimes::firstFrameMs && state.iterations() > 0)
        state.counters["cpu_ms"] = cpuMs / static_cast<double>(state.iterations());
}

void BM_DemoStartToFirstFrame(benchmark::State& state)
{
    ReportStarts<&StartTimes::firstFrameMs>(state, 300);
}

void BM_DemoLevelCreated(benchmark::State& state)
{
    ReportStarts<&StartTimes::levelMs>(state, 50);
}

void BM_DemoLevelStartedByItsScript(benchmark::State& state)
{
    ReportStarts<&StartTimes::levelStartedMs>(state, 50);
}

} // namespace

BENCHMARK(BM_DemoStartToFirstFrame)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(5);
BENCHMARK(BM_DemoLevelCreated)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(5);
BENCHMARK(BM_DemoLevelStartedByItsScript)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(5);

BENCHMARK_MAIN();
