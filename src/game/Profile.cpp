#include "game/Profile.h"

#include "diag/Log.h"
#include "game/GameOptions.h"
#include "game/PlayerFiles.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "misc/sys/Path.h"

#include <uuid/uuid.h>

#include <cstdio>

namespace k17 {

using namespace ox;

namespace {

constexpr const char16_t* kSavesFile = u"saves.xml";

// The lower-case partner of a letter of the Latin, Greek and Cyrillic alphabets; any other
// unit stays as it is.
wchar FoldCase(wchar c)
{
    if ((c >= u'A' && c <= u'Z') || (c >= 0xC0 && c <= 0xDE && c != 0xD7) || (c >= 0x391 && c <= 0x3AB && c != 0x3A2) ||
        (c >= 0x410 && c <= 0x42F))
        return static_cast<wchar>(c + 0x20);
    if (c >= 0x400 && c <= 0x40F)
        return static_cast<wchar>(c + 0x50);
    // Latin Extended-A pairs upper/lower on even/odd units, but for its two odd stretches.
    bool oddPairs = (c >= 0x139 && c <= 0x148) || (c >= 0x179 && c <= 0x17E);
    if (c >= 0x100 && c <= 0x17F && c != 0x130 && c != 0x131 && c != 0x138 && c != 0x149 && c != 0x178 && c != 0x17F)
        return (c % 2 == (oddPairs ? 1 : 0)) ? static_cast<wchar>(c + 1) : c;
    return c;
}

// A GUID read from a file names a save file in the saves folder: it may hold letters, digits,
// '-', '_' and braces only, so that it cannot point anywhere else.
bool IsUsableGuid(const std::string& guid)
{
    if (guid.empty() || guid.size() > 64)
        return false;
    for (char c : guid)
        if (!((c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '-' || c == '_' ||
              c == '{' || c == '}'))
            return false;
    return true;
}

} // namespace

std::string CreateGUIDString()
{
    uuid_t id;
    uuid_generate(id);
    auto word = [&id](int from, int bytes) {
        unsigned value = 0;
        for (int i = 0; i < bytes; ++i)
            value = value << 8 | id[from + i];
        return value;
    };
    char text[80];
    int length = snprintf(text, sizeof text, "%x%x%x", word(0, 4), word(4, 2), word(6, 2));
    for (int i = 8; i < 16; ++i)
        length += snprintf(text + length, sizeof text - length, "%x", static_cast<unsigned>(id[i]));
    return text;
}

// --- CProfile ----------------------------------------------------------------------------

CProfile::CProfile(const wstring& name, const wstring* folder)
    : m_Name(name), m_GUID(CreateGUIDString()), m_Folder(folder)
{
}

wstring CProfile::GetSaveFileName() const
{
    return misc::sys::AppendPath(m_Folder ? *m_Folder : wstring(), misc::Utf8ToWide(m_GUID + ".sav"));
}

// --- CProfileManager ---------------------------------------------------------------------

void CProfileManager::SetSavesFolder(const wstring& folder)
{
    m_SavesFolder = folder;
    MakeSavesFolder(folder);
}

wstring CProfileManager::GetSavesFile() const { return misc::sys::AppendPath(m_SavesFolder, kSavesFile); }

CProfile* CProfileManager::CreateProfile(const wstring& name, bool makeCurrent)
{
    m_Profiles.emplace_back(name, &m_SavesFolder);
    if (makeCurrent)
        SetCurrentProfile(EnumProfiles() - 1);
    return &m_Profiles.back();
}

void CProfileManager::DeleteProfile(const wstring& name)
{
    for (auto it = m_Profiles.begin(); it != m_Profiles.end(); ++it) {
        if (it->GetName() != name)
            continue;
        if (m_CurrentProfile == &*it)
            m_CurrentProfile = nullptr;
        m_Profiles.erase(it);
        return;
    }
}

void CProfileManager::Rename(const wstring& oldName, const wstring& newName)
{
    if (CProfile* profile = GetProfile(oldName))
        profile->SetName(newName);
}

CProfile* CProfileManager::GetProfile(unsigned index)
{
    if (index >= m_Profiles.size())
        return nullptr;
    auto it = m_Profiles.begin();
    std::advance(it, index);
    return &*it;
}

CProfile* CProfileManager::GetProfile(const wstring& name)
{
    for (CProfile& profile : m_Profiles)
        if (profile.GetName() == name)
            return &profile;
    return nullptr;
}

void CProfileManager::SetCurrentProfile(unsigned index) { MakeCurrent(GetProfile(index)); }

void CProfileManager::SetCurrentProfile(const wstring& name) { MakeCurrent(GetProfile(name)); }

void CProfileManager::MakeCurrent(CProfile* profile)
{
    if (!profile)
        return;
    m_CurrentProfile = profile;
    if (m_Options)
        m_Options->SetCurrentProfile(profile->GetGUID());
}

bool CProfileManager::CompareWithoutCase(const wstring& first, const wstring& second)
{
    if (first.size() != second.size())
        return false;
    for (size_t i = 0; i < first.size(); ++i)
        if (FoldCase(first[i]) != FoldCase(second[i]))
            return false;
    return true;
}

bool CProfileManager::Save() const
{
    misc::CXmlWriter writer(true);
    {
        misc::CXmlElement root(writer, "Profiles");
        // Twice: the name, which the reader takes, then the GUID.
        root.Attr("current_profile_name", m_CurrentProfile ? m_CurrentProfile->GetName() : wstring());
        root.Attr("current_profile_name", m_CurrentProfile ? misc::EscapeXml(m_CurrentProfile->GetGUID()).c_str() : "");
        for (const CProfile& p : m_Profiles) {
            misc::CXmlElement node(root, "profile");
            node.Attr("name", p.m_Name);
            node.Attr("guid", misc::EscapeXml(p.m_GUID).c_str());
            node.Attr("game_guid", misc::EscapeXml(p.m_GameGUID).c_str());
            node.Attr("step", misc::EscapeXml(p.m_Step).c_str());
            node.Attr("points_count", misc::ToXmlValue(p.m_PointsCount));
            node.Attr("hints_count", misc::ToXmlValue(p.m_HintsCount));
            node.Attr("thermometer_points", misc::ToXmlValue(p.m_ThermometerPoints));
            node.Attr("alpha_thermometer_points", misc::ToXmlValue(p.m_AlphaThermometerPoints));
            node.Attr("step_type", misc::ToXmlValue(p.m_StepType));
            node.Attr("level_state", misc::ToXmlValue(p.m_LevelState));
            node.Attr("hints_use_count", misc::ToXmlValue(p.m_HintsUseCount));
            node.Attr("hints_use_flag", misc::ToXmlValue(p.m_HintsUseFlag));
        }
    }
    return WritePlayerFile(writer, GetSavesFile());
}

void CProfileManager::Load()
{
    m_Profiles.clear();
    m_CurrentProfile = nullptr;
    const wstring file = GetSavesFile();
    core::CSettings settings;
    if (!ReadPlayerFile(settings, file, "Profiles"))
        return;
    const CAttributeReader reader(file);
    const core::CSettingsGroup& root = settings.GetChild("Profiles");
    for (const core::SettingsGroupPtrT& node : root.GetChildren())
        if (node->GetId() == "profile")
            LoadProfile(reader, *node);
    reader.WarnUnknown(root, {"current_profile_name"});
    wstring current;
    reader.Read(root, "current_profile_name", current);
    SetCurrentProfile(current);
    if (!current.empty() && !m_CurrentProfile)
        reader.Problem("the current profile is not in the list: no profile is current");
}

void CProfileManager::LoadProfile(const CAttributeReader& reader, const core::CSettingsGroup& node)
{
    reader.WarnUnknown(node, {"name", "guid", "game_guid", "step", "points_count", "hints_count", "thermometer_points",
                              "alpha_thermometer_points", "step_type", "level_state", "hints_use_count", "hints_use_flag"});
    wstring name;
    reader.Read(node, "name", name);
    if (name.empty()) {
        reader.Problem("a profile without a name is left out");
        return;
    }
    // Names are the key of the list: a second profile of a name keeps its progress under a
    // name of its own.
    if (GetProfile(name)) {
        wstring unique;
        for (int n = 2; unique.empty() || GetProfile(unique); ++n)
            unique = name + misc::Utf8ToWide(" (" + std::to_string(n) + ")");
        reader.Problem(("two profiles are named \"" + misc::WideToUtf8(name) + "\": the second is renamed \"" +
                        misc::WideToUtf8(unique) + "\"").c_str());
        name = unique;
    }
    CProfile& p = *CreateProfile(name, false);
    std::string guid;
    if (reader.Read(node, "guid", guid) && !guid.empty()) {
        bool taken = false;
        for (const CProfile& other : m_Profiles)
            taken = taken || (&other != &p && other.m_GUID == guid);
        if (!IsUsableGuid(guid) || taken)
            reader.Problem(("profile \"" + misc::WideToUtf8(name) + "\" has an unusable or repeated guid; it gets a new one")
                               .c_str());
        else
            p.m_GUID = guid;
    }
    std::string step;
    if (reader.Read(node, "step", step) && !step.empty())
        p.m_Step = step;
    reader.Read(node, "game_guid", p.m_GameGUID);
    reader.Read(node, "points_count", p.m_PointsCount);
    reader.Read(node, "hints_count", p.m_HintsCount);
    reader.Read(node, "thermometer_points", p.m_ThermometerPoints);
    reader.Read(node, "alpha_thermometer_points", p.m_AlphaThermometerPoints);
    reader.Read(node, "step_type", p.m_StepType);
    reader.Read(node, "level_state", p.m_LevelState);
    reader.Read(node, "hints_use_count", p.m_HintsUseCount);
    reader.Read(node, "hints_use_flag", p.m_HintsUseFlag);
}

CProfileManager& g_ProfileManager::Instance()
{
    static auto* manager = new CProfileManager(&g_GameOptions::Instance());
    return *manager;
}

} // namespace k17
