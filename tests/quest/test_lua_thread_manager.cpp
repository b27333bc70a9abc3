// The script threads: the native anchor (host, clock, frame pass, error reports) driving the
// demo's scheduler, scripts/game_engine/quest.lua.
#include "core/TimeManager.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"
#include "quest/LuaThreadManager.h"
#include "quest/QuestBinding.h"
#include "support/TestSupport.h"

#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

using namespace qe;
using ox::lua::CLua;

namespace {

std::string ReadDemoScheduler()
{
    std::ifstream file(std::string(OX_DEMO_GAME) + "/scripts/game_engine/quest.lua");
    std::stringstream text;
    text << file.rdbuf();
    return text.str();
}

void BindAll(CLua& lua)
{
    BindFramework(lua);
    lua.BeginBinding();
    lua.Bind(BindQuestClasses());
    lua.EndBinding();
}

std::string Eval(CLua& lua, const std::string& expression)
{
    return oxtest::RunChunk(lua.GetLuaState(), "return " + expression);
}

struct ThreadManager : ::testing::Test {
    oxtest::FakeClock clock;
    ox::core::CTimeManager time {clock.Source()};
    ox::core::CGroupTimer* group = time.AttachGroupTimer("level", nullptr);
    oxtest::MessageCapture boxes;
    CLuaThreadManager& manager = g_LuaThreadManager::Instance();
    CLua lua {"test_threads", false};

    void SetUp() override
    {
        BindAll(lua);
        ASSERT_TRUE(lua.Run(ReadDemoScheduler()));
        ASSERT_TRUE(lua.Run("qe.g_LuaThreadManager.Instance().SetLua(ox.lua.CLua.GetLua('test_threads'))"));
        manager.SetTimer(group);
        manager.m_SilentErrors = false;
    }
    void TearDown() override
    {
        manager.Clear();
        manager.SetTimer(nullptr);
    }
    // One frame of `ms` milliseconds: the clock, then the scheduler.
    void Frame(double ms = 20)
    {
        clock.Advance(ms);
        time.Update();
        manager.ManageThreads();
    }
};

} // namespace

TEST_F(ThreadManager, ClockAndHostFollowTheScriptSide)
{
    manager.SetTimer(nullptr);
    EXPECT_EQ(manager.GetElapsedTime(), 0.0f);
    manager.SetTimer(group);
    group->SetTime(1234);
    EXPECT_EQ(Eval(lua, "qe.g_LuaThreadManager.Instance().GetElapsedTime()"), "1234");
    EXPECT_EQ(manager.GetLua(), &lua);

    // A second host replaces the first without a call into it; Clear stops the calls.
    CLua second("test_threads_2", false);
    ASSERT_TRUE(lua.Run("calls = 0 function ManageThreads() calls = calls + 1 end"));
    manager.SetLua(second);
    EXPECT_EQ(Eval(lua, "calls"), "0");
    manager.SetLua(lua);
    manager.ManageThreads();
    EXPECT_EQ(Eval(lua, "calls"), "1");
    manager.Clear();
    manager.ManageThreads();
    EXPECT_EQ(Eval(lua, "calls"), "1");
    EXPECT_EQ(manager.GetTimer(), group) << "Clear leaves the clock";
}

TEST_F(ThreadManager, ThreadsResumeOncePerFrameOnTheLevelClockAndPauseWithIt)
{
    ASSERT_TRUE(lua.Run(R"(
        ticks, woke = 0, nil
        function ticker(self) while true do ticks = ticks + 1 wait(0) end end
        function sleeper(self) wait(100) woke = true end
        CreateScript(std.string('ticker'), nil)
        CreateScript('sleeper', nil)
    )"));
    EXPECT_EQ(Eval(lua, "ticks"), "1") << "CreateScript starts the thread at once";
    for (int i = 0; i < 4; ++i)
        Frame();
    EXPECT_EQ(Eval(lua, "ticks"), "5");
    EXPECT_EQ(Eval(lua, "woke"), "nil") << manager.GetElapsedTime() << " ms of 100";
    group->Pause(true);
    const float paused = manager.GetElapsedTime();
    for (int i = 0; i < 10; ++i)
        Frame();
    EXPECT_EQ(manager.GetElapsedTime(), paused);
    EXPECT_EQ(Eval(lua, "woke"), "nil") << "the paused clock holds the wait";
    EXPECT_EQ(Eval(lua, "ticks"), "15") << "the scheduler still runs every frame";
    group->Pause(false);
    for (int i = 0; i < 20 && Eval(lua, "woke") == "nil"; ++i)
        Frame();
    EXPECT_EQ(Eval(lua, "woke"), "true");
    EXPECT_GE(manager.GetElapsedTime(), 100.0f) << "woken by the first pass at its wake time";
    EXPECT_LT(manager.GetElapsedTime(), 120.0f);
    EXPECT_EQ(Eval(lua, "quest.ThreadCount()"), "1") << "the finished thread is dropped";
}

TEST_F(ThreadManager, AnErrorInOneThreadIsReportedAndTheOthersRun)
{
    ASSERT_TRUE(lua.Run(R"(
        ticks = 0
        function ticker(self) while true do ticks = ticks + 1 wait(0) end end
        function broken(self) wait(0) error('the lamp is broken') end
        CreateScript('ticker', nil)
        CreateScript('broken', nil)
        CreateScript('no_such_script', nil)
    )"));
    Frame();
    Frame();
    EXPECT_EQ(Eval(lua, "ticks"), "3");
    EXPECT_EQ(Eval(lua, "quest.ThreadCount()"), "1");
    ASSERT_EQ(boxes.Boxes().size(), 2u);
    EXPECT_EQ(boxes.Boxes()[0].caption, "Lua Error!");
    EXPECT_NE(boxes.Boxes()[0].text.find("no_such_script"), std::string::npos);
    EXPECT_NE(boxes.Boxes()[1].text.find("script thread broken"), std::string::npos);
    EXPECT_NE(boxes.Boxes()[1].text.find("the lamp is broken"), std::string::npos);

    manager.m_SilentErrors = true;
    manager.Error("quiet");
    EXPECT_EQ(boxes.Boxes().size(), 2u);
}

TEST_F(ThreadManager, AClickThreadIsKnownWhileItLives)
{
    ASSERT_TRUE(lua.Run(R"(
        function click(self) wait(50) end
        quest.SetScriptObject(qe.CImageObject())
        CreateScript('click', nil)
        function other(self) wait(1000) end
        CreateScript('other', nil)
    )"));
    EXPECT_EQ(Eval(lua, "IsClikThread()"), "true");
    Frame(30);
    EXPECT_EQ(Eval(lua, "IsClikThread()"), "true");
    while (manager.GetElapsedTime() < 50)
        Frame(30);
    Frame(30);
    EXPECT_EQ(Eval(lua, "IsClikThread()"), "false") << "the other thread is no click thread";
}

TEST(ThreadManagerHost, AHostThatWentAwayIsForgotten)
{
    oxtest::LogCapture log;
    CLuaThreadManager manager;
    {
        CLua gone("test_threads_gone", false);
        manager.SetLua(gone);
    }
    manager.ManageThreads();
    EXPECT_EQ(manager.GetLua(), nullptr);
    EXPECT_TRUE(log.Contains("test_threads_gone"));
}
