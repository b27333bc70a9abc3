#include "core/TimeManager.h"
#include "support/TestSupport.h"

using namespace ox::core;

namespace {

// A manager on a fake clock, settled so that the next update steps by what the test adds.
struct Clocked {
    oxtest::FakeClock clock;
    CTimeManager manager{clock.Source()};
    Clocked() { Frame(1000); }
    void Frame(double ms)
    {
        clock.Advance(ms);
        manager.Update();
    }
};

} // namespace

TEST(TimeManager, FrameStepIsCappedButManagerTimeIsNot)
{
    Clocked t;
    unsigned app = t.manager.GetAppTime();
    int time = t.manager.GetTime();
    t.Frame(16);
    EXPECT_EQ(t.manager.GetAppTime(), app + 16);
    EXPECT_EQ(t.manager.GetFrameDelta(), 16);
    t.Frame(5000);
    EXPECT_EQ(t.manager.GetAppTime(), app + 116);
    EXPECT_EQ(t.manager.GetTime(), time + 5016);
    EXPECT_EQ(g_FrameTime, static_cast<uint32_t>(t.manager.GetTime()));
}

TEST(TimeManager, PauseStrikesOutTheTimeSpent)
{
    Clocked t;
    int time = t.manager.GetTime();
    unsigned app = t.manager.GetAppTime();
    t.manager.Pause(true);
    t.Frame(20);
    EXPECT_EQ(t.manager.GetAppTime(), app) << "a paused root does not advance";
    t.clock.Advance(10000);
    t.manager.Pause(false);
    t.Frame(16);
    EXPECT_EQ(t.manager.GetFrameDelta(), 16) << "the next delta is one frame's";
    EXPECT_EQ(t.manager.GetTime(), time + 20 + 16) << "updates while paused still count, the gap does not";
    EXPECT_EQ(t.manager.GetAppTime(), app + 16);
}

TEST(TimeManager, SpeedsMultiplyAndPausesNest)
{
    Clocked t;
    CGroupTimer* group = t.manager.AttachGroupTimer("fast", nullptr);
    group->SetK(2);
    CTimer* timer = group->AttachTimer();
    timer->SetK(3);
    CTimer* reverse = t.manager.AttachTimer(nullptr);
    reverse->SetTime(1000);
    reverse->SetK(-1);

    t.Frame(10);
    EXPECT_EQ(group->GetTime(), 20u);
    EXPECT_EQ(timer->GetTime(), 60u);
    EXPECT_EQ(reverse->GetTime(), 990u);

    group->Pause(true);
    group->Pause(true);
    group->Pause(false);
    t.Frame(10);
    EXPECT_EQ(timer->GetTime(), 60u) << "a paused group stops its children";
    EXPECT_EQ(timer->GetFrameDelta(), 0);
    group->Pause(false);
    group->Pause(false); // at 0: does nothing
    EXPECT_FALSE(group->IsPaused());
    t.Frame(10);
    EXPECT_EQ(timer->GetTime(), 120u);

    EXPECT_CONTRACT_FAILURE(timer->SetK(0.5f), "fabs(_k - (float((int)_k))) < 0.001");
    EXPECT_EQ(timer->GetK(), 0);
}

TEST(TimeManager, LookupsCloneAndRemoval)
{
    Clocked t;
    CGroupTimer* named = t.manager.AttachGroupTimer("level", nullptr);
    CGroupTimer* child = named->AttachGroupTimer("scene");
    named->AttachGroupTimer("");
    EXPECT_EQ(t.manager.GetTimer("level"), named);
    EXPECT_EQ(t.manager.GetTimer(""), nullptr);
    EXPECT_EQ(named->GetChildGroupTimer("scene"), child);
    EXPECT_EQ(named->GetChildGroupTimer(""), nullptr) << "even though a child has an empty id";
    EXPECT_EQ(t.manager.GetRoot()->GetChildGroupTimer("scene"), nullptr) << "no recursion";

    CGroupTimer* anonymous = t.manager.AttachGroupTimer("", nullptr);
    anonymous->SetK(2);
    anonymous->AttachTimer()->SetTime(77);
    anonymous->AttachGroupTimer("")->AttachTimer();
    CGroupTimer* copy = anonymous->Clone(nullptr);
    EXPECT_EQ(copy->GetParent(), t.manager.GetRoot());
    EXPECT_EQ(copy->GetK(), 2);
    ASSERT_EQ(copy->GetChildTimers().size(), 1u);
    EXPECT_EQ((*copy->GetChildTimers().begin())->GetTime(), 77u);
    EXPECT_EQ(copy->GetChildGroups().size(), 1u);
    EXPECT_CONTRACT_FAILURE(named->Clone(nullptr), "m_Id.empty() && \"Timer with non-empty Id is not copyable!\"");

    {
        CTimerWrapper wrapper(child->AttachTimer());
        CTimer* inner = wrapper.Get();
        EXPECT_TRUE(t.manager.IsKnown(inner));
        wrapper = child->AttachTimer(); // the old timer is destroyed
        EXPECT_FALSE(t.manager.IsKnown(inner));
    }
    CTimer* grandchild = child->AttachTimer();
    named->Destroy();
    EXPECT_FALSE(t.manager.IsKnown(child));
    EXPECT_FALSE(t.manager.IsKnown(grandchild));
    EXPECT_EQ(t.manager.GetTimer("level"), nullptr);
    t.manager.RemoveGroupTimer(named); // unknown: nothing happens
    t.Frame(10);
}

TEST(TimeManager, TheTestClockStepsByItsFixedStepWhateverTheRealClockDoes)
{
    Clocked t;
    const unsigned app = t.manager.GetAppTime();
    t.manager.SetFixedStep(20);
    EXPECT_EQ(t.manager.GetTime(), 0) << "the test clock starts over from 0";
    t.Frame(0);
    t.Frame(5000);
    t.Frame(3);
    EXPECT_EQ(t.manager.GetTime(), 60);
    EXPECT_EQ(t.manager.GetAppTime(), app + 60);
    EXPECT_EQ(t.manager.GetFrameDelta(), 20);
    EXPECT_EQ(g_FrameTime, 60u);
    t.manager.Pause(true);
    t.Frame(40);
    t.manager.Pause(false);
    EXPECT_EQ(t.manager.GetAppTime(), app + 60) << "a paused root stands still on the test clock too";
    t.Frame(7);
    EXPECT_EQ(t.manager.GetAppTime(), app + 80);
    // Back on the real clock the next step is the real time since the last update.
    t.manager.SetFixedStep(0);
    t.Frame(16);
    EXPECT_EQ(t.manager.GetFrameDelta(), 16);
    EXPECT_EQ(t.manager.GetTime(), 116);
}

TEST(TimeManager, TheTestClockIsReadFromTheEnvironment)
{
    {
        oxtest::ScopedEnv env("OX_TEST_CLOCK", "25");
        EXPECT_EQ(CTimeManager::FixedStepFromEnvironment(), 25);
    }
    for (const char* bad : {"0", "fast", "20ms", "101", "-5"}) {
        oxtest::ScopedEnv env("OX_TEST_CLOCK", bad);
        EXPECT_EQ(CTimeManager::FixedStepFromEnvironment(), 0) << bad;
    }
    oxtest::ScopedEnv env("OX_TEST_CLOCK", "");
    EXPECT_EQ(CTimeManager::FixedStepFromEnvironment(), 0);
}
