#include "game/Achievements.h"

#include "core/Settings.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "game/PlayerFiles.h"
#include "game/Profile.h"
#include "misc/StringTable.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "misc/sys/Path.h"

#include <algorithm>

namespace k17 {

using namespace ox;

int ProfileAchievements::AddProgress(const AchievementsSettingsT& settings, const std::string& id, int amount)
{
    auto setting = settings.find(id);
    auto progress = m_AchievementsProgress.find(id);
    OX_CHECK_DATA(setting != settings.end() && progress != m_AchievementsProgress.end(), 0);
    AchievementProgress& mine = progress->second;
    const int max = setting->second.MaxProgress;
    if (mine.Progress >= max)
        return mine.Completion;
    mine.Progress = std::min(mine.Progress + std::max(amount, 0), max);
    if (mine.Progress == max) {
        Score += setting->second.Score;
        int completed = 0;
        for (const auto& [other, state] : m_AchievementsProgress)
            completed += state.Completion != 0;
        mine.Completion = completed + 1;
    }
    return mine.Completion;
}

void CAchievements::LoadSettings(const std::string& path)
{
    core::CSettings settings;
    if (!settings.LoadXml(path))
        OX_LOG("data", diag::LogError, "%s cannot be read: no achievements", path.c_str());
    LoadSettings(settings, path);
}

void CAchievements::LoadSettings(const core::CSettingsGroup& settings, const std::string& name)
{
    const core::CSettingsGroup& root = settings.GetChild("Achievements");
    const CAttributeReader reader(misc::Utf8ToWide(name));
    if (settings.GetChildRef("Achievements") == nullptr && !settings.GetChildren().empty())
        reader.Problem("the root element is not Achievements");
    const misc::CStringTable& strings = misc::CStringTable::Instance();
    for (const core::SettingsGroupPtrT& node : root.GetChildren()) {
        bool complete = node->GetId() == "ach";
        for (const char* attribute : {"id", "score", "image", "title", "description"})
            complete = complete && node->IsValue(attribute);
        if (!complete) {
            reader.Problem("an entry is not <ach> with id, score, image, title and description: left out");
            continue;
        }
        AchievementSettings entry;
        reader.Read(*node, "max_progress", entry.MaxProgress);
        reader.Read(*node, "show_progress_step", entry.ShowProgressStep);
        reader.Read(*node, "score", entry.Score);
        reader.Read(*node, "image", entry.Image);
        entry.Title = strings.FormatByStringsID(node->GetValue("title"));
        entry.Description = strings.FormatByStringsID(node->GetValue("description"));
        const std::string id = node->GetValue("id");
        if (entry.MaxProgress < 1) {
            reader.Problem("max_progress below 1: taken as 1");
            entry.MaxProgress = 1;
        }
        if (!m_AchievementsSettings.emplace(id, entry).second) {
            reader.Problem(("achievement " + id + " is defined twice: the first stays").c_str());
            continue;
        }
        m_Ids.push_back(id);
    }
}

const AchievementSettings* CAchievements::FindSettings(const std::string& id) const
{
    auto found = m_AchievementsSettings.find(id);
    return found == m_AchievementsSettings.end() ? nullptr : &found->second;
}

wstring CAchievements::GetFileName(const std::string& guid) const
{
    const wstring& folder = m_Folder.empty() ? g_ProfileManager::Instance().GetSavesFolder() : m_Folder;
    return folder.empty() ? wstring() : misc::sys::AppendPath(folder, misc::Utf8ToWide(guid + ".ach"));
}

ProfileAchievements& CAchievements::GetProfileAchievements(const std::string& guid)
{
    auto found = m_ProfilesAchievements.find(guid);
    if (found != m_ProfilesAchievements.end())
        return found->second;
    ProfileAchievements& record = m_ProfilesAchievements[guid];
    for (const auto& [id, settings] : m_AchievementsSettings)
        record.m_AchievementsProgress[id] = AchievementProgress();
    ReadProgress(record, guid);
    return record;
}

void CAchievements::ReadProgress(ProfileAchievements& record, const std::string& guid) const
{
    const wstring file = GetFileName(guid);
    core::CSettings settings;
    if (file.empty() || !ReadPlayerFile(settings, file, "Achievements"))
        return;
    const CAttributeReader reader(file);
    const core::CSettingsGroup& root = settings.GetChild("Achievements");
    reader.Read(root, "score", record.Score);
    for (const core::SettingsGroupPtrT& node : root.GetChildren()) {
        auto progress = record.m_AchievementsProgress.find(node->GetValue("id"));
        if (node->GetId() != "ach" || progress == record.m_AchievementsProgress.end()) {
            reader.Problem(("no known achievement " + node->GetValue("id") + ": its progress is left out").c_str());
            continue;
        }
        reader.Read(*node, "progress", progress->second.Progress);
        reader.Read(*node, "completion", progress->second.Completion);
        const int max = m_AchievementsSettings.at(progress->first).MaxProgress;
        if (progress->second.Progress < 0 || progress->second.Progress > max) {
            reader.Problem(("progress of " + progress->first + " out of range: clamped").c_str());
            progress->second.Progress = std::clamp(progress->second.Progress, 0, max);
        }
    }
}

int CAchievements::AddProgress(const std::string& guid, const std::string& id, int amount)
{
    ProfileAchievements& record = GetProfileAchievements(guid);
    const int score = record.Score;
    auto progress = record.m_AchievementsProgress.find(id);
    const int before = progress == record.m_AchievementsProgress.end() ? 0 : progress->second.Progress;
    const int completion = record.AddProgress(m_AchievementsSettings, id, amount);
    if (progress != record.m_AchievementsProgress.end() && (progress->second.Progress != before || record.Score != score))
        Save(guid);
    return completion;
}

bool CAchievements::Save(const std::string& guid) const
{
    auto found = m_ProfilesAchievements.find(guid);
    if (found == m_ProfilesAchievements.end())
        return true;
    const wstring file = GetFileName(guid);
    OX_CHECK_DATA(!file.empty(), false);
    misc::CXmlWriter writer(true);
    {
        misc::CXmlElement root(writer, "Achievements");
        root.Attr("score", misc::ToXmlValue(found->second.Score));
        for (const auto& [id, progress] : found->second.m_AchievementsProgress) {
            misc::CXmlElement node(root, "ach");
            node.Attr("id", misc::EscapeXml(id).c_str());
            node.Attr("progress", misc::ToXmlValue(progress.Progress));
            node.Attr("completion", misc::ToXmlValue(progress.Completion));
        }
    }
    return WritePlayerFile(writer, file);
}

bool CAchievements::Save() const
{
    bool all = true;
    for (const auto& [guid, record] : m_ProfilesAchievements)
        all = Save(guid) && all;
    return all;
}

ProfileAchievements* CAchievements::Current()
{
    const CProfile* profile = g_ProfileManager::Instance().GetCurrentProfile();
    return profile ? &GetProfileAchievements(profile->GetGUID()) : nullptr;
}

int CAchievements::AddProgressToCurrent(const std::string& id, int amount)
{
    const CProfile* profile = g_ProfileManager::Instance().GetCurrentProfile();
    OX_CHECK_DATA(profile != nullptr, 0);
    return AddProgress(profile->GetGUID(), id, amount);
}

const AchievementProgress* CAchievements::CurrentProgress(const std::string& id)
{
    ProfileAchievements* record = Current();
    if (!record)
        return nullptr;
    auto found = record->m_AchievementsProgress.find(id);
    return found == record->m_AchievementsProgress.end() ? nullptr : &found->second;
}

int CAchievements::GetProgress(const std::string& id)
{
    const AchievementProgress* progress = CurrentProgress(id);
    return progress ? progress->Progress : 0;
}

int CAchievements::GetCompletion(const std::string& id)
{
    const AchievementProgress* progress = CurrentProgress(id);
    return progress ? progress->Completion : 0;
}

int CAchievements::GetScore()
{
    ProfileAchievements* record = Current();
    return record ? record->Score : 0;
}

std::string CAchievements::GetId(int index) const
{
    OX_CHECK_DATA(index >= 0 && index < GetCount(), std::string());
    return m_Ids[static_cast<size_t>(index)];
}

int CAchievements::GetMaxProgress(const std::string& id) const
{
    const AchievementSettings* settings = FindSettings(id);
    return settings ? settings->MaxProgress : 0;
}

int CAchievements::GetShowProgressStep(const std::string& id) const
{
    const AchievementSettings* settings = FindSettings(id);
    return settings ? settings->ShowProgressStep : 0;
}

wstring CAchievements::GetTitle(const std::string& id) const
{
    const AchievementSettings* settings = FindSettings(id);
    return settings ? settings->Title : wstring();
}

wstring CAchievements::GetDescription(const std::string& id) const
{
    const AchievementSettings* settings = FindSettings(id);
    return settings ? settings->Description : wstring();
}

std::string CAchievements::GetImage(const std::string& id) const
{
    const AchievementSettings* settings = FindSettings(id);
    return settings ? settings->Image : std::string();
}

CAchievements& g_Achievements::Instance()
{
    static auto* store = [] {
        auto* made = new CAchievements();
        made->LoadSettings();
        return made;
    }();
    return *store;
}

} // namespace k17
