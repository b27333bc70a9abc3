#pragma once
// Achievements: their definitions from properties/achievements.xml (through the game pack)
// and each profile's progress in <guid>.ach in the saves folder. An achievement completes
// when its progress reaches its maximum: its score joins the profile's total and it takes
// the next place in the order of completion.
#include "misc/WideChar.h"

#include <map>
#include <string>
#include <vector>

namespace ox::core {
class CSettingsGroup;
}

namespace k17 {

struct AchievementSettings {
    int MaxProgress = 1;
    int ShowProgressStep = 1;
    int Score = 0;
    std::string Image;
    ox::wstring Title;
    ox::wstring Description;
};

struct AchievementProgress {
    int Progress = 0;
    int Completion = 0;  // 0 while incomplete, then the place in the order of completion from 1
};

using AchievementsSettingsT = std::map<std::string, AchievementSettings>;

// One profile's record.
struct ProfileAchievements {
    int Score = 0;
    std::map<std::string, AchievementProgress> m_AchievementsProgress;

    // Adds to the progress of `id`, capped at its maximum; reaching it adds the score and
    // fixes the place. The result is the achievement's Completion (0 while incomplete). An
    // id the settings do not know is logged and gives 0.
    int AddProgress(const AchievementsSettingsT& settings, const std::string& id, int amount);
};

class CAchievements {
public:
    CAchievements() = default;
    CAchievements(const CAchievements&) = delete;
    CAchievements& operator=(const CAchievements&) = delete;

    // Reads the definitions through the game pack. A missing or malformed file, or a bad
    // entry, is logged; the entries that could be read stay.
    void LoadSettings(const std::string& path = "properties/achievements.xml");
    void LoadSettings(const ox::core::CSettingsGroup& root, const std::string& name);
    // Where the .ach files are; empty (the default): the profile manager's saves folder.
    void SetFolder(const ox::wstring& folder) { m_Folder = folder; }

    const AchievementsSettingsT& GetSettings() const { return m_AchievementsSettings; }
    // The ids in the order of the file.
    const std::vector<std::string>& GetIds() const { return m_Ids; }
    const AchievementSettings* FindSettings(const std::string& id) const;

    // The record of a profile, read from <guid>.ach at first use.
    ProfileAchievements& GetProfileAchievements(const std::string& guid);
    // Adds progress for a profile and writes its file when anything changed.
    int AddProgress(const std::string& guid, const std::string& id, int amount);
    // Writes <guid>.ach of every profile met so far; false if one could not be written.
    bool Save() const;
    bool Save(const std::string& guid) const;
    ox::wstring GetFileName(const std::string& guid) const;

    // For scripts: the same on the current profile (none: nothing happens, 0).
    int AddProgressToCurrent(const std::string& id, int amount);
    int GetProgress(const std::string& id);
    int GetCompletion(const std::string& id);
    int GetScore();
    int GetCount() const { return static_cast<int>(m_Ids.size()); }
    std::string GetId(int index) const;
    int GetMaxProgress(const std::string& id) const;
    int GetShowProgressStep(const std::string& id) const;
    ox::wstring GetTitle(const std::string& id) const;
    ox::wstring GetDescription(const std::string& id) const;
    std::string GetImage(const std::string& id) const;

private:
    ProfileAchievements* Current();
    const AchievementProgress* CurrentProgress(const std::string& id);
    void ReadProgress(ProfileAchievements& record, const std::string& guid) const;

    AchievementsSettingsT m_AchievementsSettings;
    std::vector<std::string> m_Ids;
    std::map<std::string, ProfileAchievements> m_ProfilesAchievements;
    ox::wstring m_Folder;
};

// The store of the game: the definitions of the game pack, the profile manager's saves folder.
struct g_Achievements {
    static CAchievements& Instance();
};

} // namespace k17
