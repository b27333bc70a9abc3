// The player's files survive a process killed at any moment: a child saves profiles, options
// and records in a loop and is killed with SIGKILL at random times; after each kill every file
// parses and holds one whole generation of content, the old or the new one.
#include "core/Settings.h"
#include "game/GameOptions.h"
#include "game/Profile.h"
#include "game/RecordTable.h"
#include "misc/Unicode.h"
#include "support/TestSupport.h"

#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <random>
#include <set>
#include <thread>

using namespace k17;

namespace {

constexpr int kProfiles = 150;
constexpr int kPlayers = 20;

struct Files {
    explicit Files(const ox::wstring& folder)
    {
        options.SetTarget({});
        profiles.SetSavesFolder(folder);
        options.SetFolder(folder);
        records.SetFolder(folder);
    }

    // Every number in every file is `generation`.
    void Save(int generation)
    {
        while (profiles.EnumProfiles() < kProfiles)
            profiles.CreateProfile(u"player " + ox::misc::Utf8ToWide(std::to_string(profiles.EnumProfiles())), false);
        for (unsigned i = 0; i < profiles.EnumProfiles(); ++i)
            profiles.GetProfile(i)->SetPointsCount(generation);
        profiles.Save();
        for (int i = 0; i < kPlayers; ++i) {
            options.SetCurrentProfile("guid" + std::to_string(i));
            options.SetBrightness(static_cast<float>(generation));
            options.UpdateLocalSettings();
        }
        options.Save();
        records.Clear();
        CProfile player(u"p", nullptr);
        for (int i = 0; i < 10; ++i) {
            player.SetGameGUID("game" + std::to_string(i));
            records.AddRecord(player, generation);
        }
        records.Save();
    }

    CGameOptions options;
    CProfileManager profiles;
    CRecordTable records;
};

// The generations found in the file's numbers, or "unparsed".
std::set<int> Generations(const oxtest::TempDir& dir, const char* file)
{
    std::string bytes = oxtest::ReadFile(dir / file);
    ox::core::CSettings settings;
    if (bytes.empty() || !settings.LoadXmlFromMemory(bytes.data(), bytes.size(), file))
        return {-1};
    std::set<int> found;
    std::function<void(const ox::core::CSettingsGroup&)> walk = [&](const ox::core::CSettingsGroup& group) {
        for (const char* name : {"points_count", "score"})
            if (group.IsValue(name))
                found.insert(std::stoi(group.GetValue(name)));
        if (group.IsValue("id") && group.GetValue("id") == "brightness")
            found.insert(std::stoi(group.GetValue("value")));
        for (const auto& child : group.GetChildren())
            walk(*child);
    };
    walk(settings);
    return found;
}

} // namespace

TEST(SaveKill, EveryFileHoldsOneWholeGenerationAfterSigkill)
{
    oxtest::TempDir dir;
    oxtest::LogCapture log;
    const ox::wstring folder = ox::misc::Utf8ToWide(dir.Path().string());
    Files(folder).Save(0);
    std::mt19937 random(1234);
    int interrupted = 0;
    for (int round = 1; round <= 40; ++round) {
        pid_t child = fork();
        ASSERT_GE(child, 0);
        if (child == 0) {
            Files files(folder);
            for (int generation = round * 1000;; ++generation)
                files.Save(generation);
        }
        std::this_thread::sleep_for(std::chrono::microseconds(random() % 30000));
        kill(child, SIGKILL);
        int status = 0;
        waitpid(child, &status, 0);
        ASSERT_TRUE(WIFSIGNALED(status));
        for (const char* file : {"saves.xml", "options.xml", "records.xml"}) {
            std::set<int> found = Generations(dir, file);
            ASSERT_EQ(found.size(), 1u) << file << " after round " << round;
            EXPECT_GE(*found.begin(), 0) << file << " does not parse after round " << round;
            interrupted += std::filesystem::exists(dir / (std::string(file) + ".tmp"));
        }
    }
    // The kills landed in the middle of writes, not only between them.
    EXPECT_GT(interrupted, 0);
}
