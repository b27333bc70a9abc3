// Achievements: the rules of progress and completion, the per-profile files across a restart
// and a profile switch, and damaged definitions or progress files.
#include "core/Settings.h"
#include "game/Achievements.h"
#include "misc/Unicode.h"
#include "support/TestSupport.h"

using namespace k17;

namespace {

constexpr const char* kDefinitions = R"(<?xml version="1.0"?>
<Achievements>
  <ach id="finder" score="10" image="a" title="t1" description="d1" max_progress="3"/>
  <ach id="lamp" score="5" image="b" title="t2" description="d2"/>
  <ach id="quick" score="20" image="c" title="t3" description="d3" max_progress="2" show_progress_step="2"/>
</Achievements>)";

struct AchievementsTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::LogCapture log;

    // A store as a fresh start of the game makes it.
    std::unique_ptr<CAchievements> Start(const std::string& definitions = kDefinitions)
    {
        auto store = std::make_unique<CAchievements>();
        ox::core::CSettings settings;
        settings.LoadXmlFromMemory(definitions.data(), definitions.size(), "achievements.xml");
        store->LoadSettings(settings, "achievements.xml");
        store->SetFolder(ox::misc::Utf8ToWide(dir.Path().string()));
        return store;
    }
};

TEST_F(AchievementsTest, ProgressCapsCompletesOnceAndNumbersTheCompletions)
{
    auto store = Start();
    EXPECT_EQ(store->GetIds(), (std::vector<std::string> {"finder", "lamp", "quick"}));
    EXPECT_EQ(store->FindSettings("quick")->ShowProgressStep, 2);
    EXPECT_EQ(store->FindSettings("lamp")->MaxProgress, 1);
    EXPECT_EQ(store->AddProgress("g", "finder", 1), 0);
    // The second completed in time takes place 1, though later in the file.
    EXPECT_EQ(store->AddProgress("g", "quick", 7), 1);
    ProfileAchievements& record = store->GetProfileAchievements("g");
    EXPECT_EQ(record.m_AchievementsProgress["quick"].Progress, 2);
    EXPECT_EQ(record.Score, 20);
    EXPECT_EQ(store->AddProgress("g", "quick", 1), 1);
    EXPECT_EQ(record.Score, 20);
    EXPECT_EQ(store->AddProgress("g", "lamp", 1), 2);
    EXPECT_EQ(store->AddProgress("g", "finder", 5), 3);
    EXPECT_EQ(record.Score, 35);
    // An id the definitions do not know: a log line, nothing changes.
    EXPECT_EQ(store->AddProgress("g", "ghost", 1), 0);
    EXPECT_TRUE(log.Contains("data"));
    EXPECT_EQ(record.Score, 35);
}

TEST_F(AchievementsTest, ProgressSurvivesARestartAndStaysWithItsProfile)
{
    {
        auto store = Start();
        store->AddProgress("ann", "finder", 2);
        store->AddProgress("ann", "lamp", 1);
        store->AddProgress("bob", "quick", 2);
    }
    auto store = Start();
    const ProfileAchievements& ann = store->GetProfileAchievements("ann");
    EXPECT_EQ(ann.Score, 5);
    EXPECT_EQ(ann.m_AchievementsProgress.at("finder").Progress, 2);
    EXPECT_EQ(ann.m_AchievementsProgress.at("lamp").Completion, 1);
    EXPECT_EQ(ann.m_AchievementsProgress.at("quick").Progress, 0);
    const ProfileAchievements& bob = store->GetProfileAchievements("bob");
    EXPECT_EQ(bob.Score, 20);
    EXPECT_EQ(bob.m_AchievementsProgress.at("finder").Progress, 0);
    // Ann's next completion follows on from her earlier one.
    EXPECT_EQ(store->AddProgress("ann", "finder", 1), 2);
    EXPECT_EQ(store->GetProfileAchievements("carl").Score, 0);
    EXPECT_FALSE(std::filesystem::exists(dir / "carl.ach"));
}

TEST_F(AchievementsTest, DamagedDataKeepsWhatIsKnown)
{
    // A progress file naming an achievement no longer defined, and an out-of-range value.
    dir.Write("ann.ach", R"(<?xml version="1.0"?><Achievements score="15"><ach id="gone" progress="1" completion="1"/>)"
                         R"(<ach id="finder" progress="9" completion="0"/><ach id="lamp" progress="1" completion="1"/>)"
                         R"(</Achievements>)");
    auto store = Start();
    const ProfileAchievements& ann = store->GetProfileAchievements("ann");
    EXPECT_EQ(ann.m_AchievementsProgress.count("gone"), 0u);
    EXPECT_EQ(ann.m_AchievementsProgress.at("finder").Progress, 3);
    EXPECT_EQ(ann.m_AchievementsProgress.at("lamp").Completion, 1);
    EXPECT_TRUE(log.Contains("gone"));

    // A file cut short: what was read stays, and a copy is kept.
    dir.Write("bob.ach", R"(<?xml version="1.0"?><Achievements score="5"><ach id="lamp" progress="1" completion="1"/><ach id=)");
    EXPECT_EQ(store->GetProfileAchievements("bob").m_AchievementsProgress.at("lamp").Progress, 1);
    EXPECT_TRUE(std::filesystem::exists(dir / "bob.ach.broken"));

    // Definitions with a duplicate, an entry missing its title and a stranger element.
    auto partial = Start(R"(<?xml version="1.0"?><Achievements><ach id="a" score="1" image="" title="t" description="d"/>)"
                         R"(<ach id="a" score="9" image="" title="t" description="d"/>)"
                         R"(<ach id="b" score="1" image="" description="d"/><trophy id="c"/></Achievements>)");
    EXPECT_EQ(partial->GetIds(), std::vector<std::string> {"a"});
    EXPECT_EQ(partial->FindSettings("a")->Score, 1);
    EXPECT_TRUE(log.Contains("defined twice"));
    // No file at all: no achievements, and the game goes on.
    CAchievements none;
    none.LoadSettings("properties/achievements.xml");
    EXPECT_EQ(none.GetCount(), 0);
}

} // namespace
