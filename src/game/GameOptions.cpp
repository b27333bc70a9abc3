#include "game/GameOptions.h"

#include "core/Application.h"
#include "diag/Log.h"
#include "game/PlayerFiles.h"
#include "misc/XmlWriter.h"
#include "misc/sys/Path.h"
#include "sound/AudioManager.h"

namespace k17 {

using namespace ox;

namespace {

constexpr const char16_t* kOptionsFile = u"options.xml";

// The id and the field of each player's option, in the order the file lists them.
struct VolumeOption {
    const char* id;
    float ProfileOptions::*field;
};
constexpr VolumeOption kFloatOptions[] = {
    {"sound_volume", &ProfileOptions::m_SoundVolume},
    {"music_volume", &ProfileOptions::m_MusicVolume},
    {"voice_volume", &ProfileOptions::m_VoiceVolume},
    {"brightness", &ProfileOptions::m_Brightness},
};

bool IsVolume(const char* id) { return std::string(id) != "brightness"; }

OptionsTarget ApplicationTarget()
{
    OptionsTarget target;
    target.changeScreenMode = [](bool fullscreen, bool bpp32, unsigned width, unsigned height) {
        return core::g_Application && core::g_Application->ChangeScreenMode(fullscreen, bpp32, width, height);
    };
    target.isFullScreen = [] { return core::g_Application && core::g_Application->GetRenderer()->IsFullscreen(); };
    target.setGroupVolume = [](const char* group, float volume) {
        sound::CAudioManager::Instance().SetGroupVolume(group, volume);
    };
    return target;
}

// Reads the options of one set from the <option id value> children of `group`.
void ReadOptions(const CAttributeReader& reader, const core::CSettingsGroup& group, ProfileOptions& options)
{
    for (const VolumeOption& option : kFloatOptions) {
        const core::CSettingsGroup& node = group.GetChildByAttribute("option", "id", option.id);
        if (IsVolume(option.id))
            reader.Read(node, "value", options.*option.field, 0.0f, 100.0f);
        else
            reader.Read(node, "value", options.*option.field);
    }
    int level = options.m_DificultyLevel;
    if (reader.Read(group.GetChildByAttribute("option", "id", "dificulty_level"), "value", level)) {
        if (level == CGameOptions::DificultyLevelNoirmal || level == CGameOptions::DificultyLevelHard)
            options.m_DificultyLevel = level;
        else
            reader.Problem("dificulty_level is neither 0 nor 1; the default stays");
    }
}

void WriteOption(misc::CXmlElement& parent, const char* id, const char* value)
{
    misc::CXmlElement option(parent, "option");
    option.Attr("id", id);
    option.Attr("value", value);
}

} // namespace

CGameOptions::CGameOptions() : m_Target(ApplicationTarget())
{
    SetDefaults(core::g_Application ? core::g_Application->GetSettings().GetChild("Constants")
                                    : core::CSettingsGroup::Empty());
}

void CGameOptions::SetDefaults(const core::CSettingsGroup& constants)
{
    const core::CSettingsGroup& group = constants.GetChild("default_options");
    if (&group == &core::CSettingsGroup::Empty())
        OX_LOG("data", diag::LogWarning, "Constants has no default_options: the options start from built-in defaults");
    const CAttributeReader reader(u"properties/constants.xml");
    m_Defaults = ProfileOptions();
    ReadOptions(reader, group, m_Defaults);
    m_DefaultFullScreen = false;
    reader.Read(group.GetChildByAttribute("option", "id", "full_screen"), "value", m_DefaultFullScreen);
    m_Current = m_Committed = m_Defaults;
    m_ScreenMode = m_CommittedScreenMode = ScreenMode();
    m_ScreenMode.FullScreen = m_CommittedScreenMode.FullScreen = m_DefaultFullScreen;
}

ProfileOptions CGameOptions::DefaultsFor(const std::string& guid) const
{
    ProfileOptions options = m_Defaults;
    options.m_Guid = guid;
    return options;
}

bool CGameOptions::ApplyOptionsChanges()
{
    const ScreenMode& mode = m_ScreenMode;
    bool changed = false;
    if (m_Target.changeScreenMode)
        changed = mode.FullScreen ? m_Target.changeScreenMode(true, mode.Bpp32 != 0, 0, 0)
                                  : m_Target.changeScreenMode(false, mode.Bpp32 != 0, static_cast<unsigned>(mode.Width),
                                                              static_cast<unsigned>(mode.Height));
    if (m_Target.isFullScreen)
        m_ScreenMode.FullScreen = m_Target.isFullScreen();
    return changed;
}

void CGameOptions::ApplyMusicChanges()
{
    if (!m_Target.setGroupVolume)
        return;
    m_Target.setGroupVolume("music", m_Current.m_MusicVolume);
    m_Target.setGroupVolume("sound", m_Current.m_SoundVolume);
    m_Target.setGroupVolume("voice", m_Current.m_VoiceVolume);
}

void CGameOptions::RestoreOptions()
{
    m_Current = m_Committed;
    m_ScreenMode = m_CommittedScreenMode;
    ApplyOptionsChanges();
}

void CGameOptions::RestoreResolution()
{
    m_ScreenMode = m_CommittedScreenMode;
    ApplyOptionsChanges();
}

void CGameOptions::UpdateLocalSettings()
{
    if (m_Current.m_Guid.empty())
        return;
    auto it = m_Profiles.find(m_Current.m_Guid);
    if (it != m_Profiles.end())
        it->second = m_Current;
}

bool CGameOptions::Save()
{
    misc::CXmlWriter writer(true);
    {
        misc::CXmlElement root(writer, "Options");
        {
            misc::CXmlElement common(root, "Common_Options");
            WriteOption(common, "full_screen", misc::ToXmlValue(m_ScreenMode.FullScreen));
        }
        misc::CXmlElement profiles(root, "Profiles_Options");
        for (const auto& [guid, options] : m_Profiles) {
            misc::CXmlElement node(profiles, "profile_options");
            node.Attr("guid", misc::EscapeXml(guid).c_str());
            for (const VolumeOption& option : kFloatOptions)
                WriteOption(node, option.id, misc::ToXmlValue(options.*option.field));
            WriteOption(node, "dificulty_level", misc::ToXmlValue(options.m_DificultyLevel));
        }
    }
    bool saved = WritePlayerFile(writer, GetOptionsFile());
    m_Committed = m_Current;
    m_CommittedScreenMode = m_ScreenMode;
    return saved;
}

void CGameOptions::SetFolder(const wstring& folder)
{
    m_Folder = folder;
    MakeSavesFolder(folder);
}

wstring CGameOptions::GetOptionsFile() const { return misc::sys::AppendPath(m_Folder, kOptionsFile); }

void CGameOptions::Load()
{
    m_Profiles.clear();
    const wstring file = GetOptionsFile();
    core::CSettings settings;
    if (ReadPlayerFile(settings, file, "Options")) {
        const CAttributeReader reader(file);
        const core::CSettingsGroup& root = settings.GetChild("Options");
        for (const core::SettingsGroupPtrT& node : root.GetChild("Profiles_Options").GetChildren()) {
            std::string guid;
            if (node->GetId() != "profile_options")
                continue;
            if (!reader.Read(*node, "guid", guid) || guid.empty()) {
                reader.Problem("profile_options without a guid is left out");
                continue;
            }
            reader.WarnUnknown(*node, {"guid"});
            ProfileOptions options = DefaultsFor(guid);
            ReadOptions(reader, *node, options);
            m_Profiles[guid] = options;
        }
        const core::CSettingsGroup& common = root.GetChild("Common_Options");
        reader.Read(common.GetChildByAttribute("option", "id", "full_screen"), "value", m_ScreenMode.FullScreen);
    }
    m_CommittedScreenMode = m_ScreenMode;
}

void CGameOptions::SetCurrentProfile(const std::string& guid)
{
    auto it = m_Profiles.find(guid);
    if (it == m_Profiles.end())
        it = m_Profiles.emplace(guid, DefaultsFor(guid)).first;
    m_Current = m_Committed = it->second;
    ApplyOptionsChanges();
    ApplyMusicChanges();
}

CGameOptions& g_GameOptions::Instance()
{
    static auto* options = new CGameOptions();
    return *options;
}

} // namespace k17
