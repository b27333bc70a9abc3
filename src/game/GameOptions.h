#pragma once
// What the options window edits: per player (by profile GUID) the volumes, the brightness
// and the difficulty; per machine the screen mode. The class keeps a committed copy that
// only Save moves on, so a window can try changes and take them back.
#include "misc/WideChar.h"

#include <cstdint>
#include <functional>
#include <map>
#include <string>

namespace ox::core {
class CSettingsGroup;
}

namespace k17 {

// The screen: width and height of the window, the depth flag passed on to the application
// unchanged, and full screen.
struct ScreenMode {
    int Width = 1024;
    int Height = 768;
    uint8_t Bpp32 = 0;
    bool FullScreen = false;
};

// One player's options.
struct ProfileOptions {
    int m_DificultyLevel = 0;
    std::string m_Guid;
    float m_SoundVolume = 100.0f;
    float m_MusicVolume = 100.0f;
    float m_VoiceVolume = 100.0f;
    float m_Brightness = 50.0f;
};

// What the options act on; by default the application's screen and the audio manager.
struct OptionsTarget {
    std::function<bool(bool fullscreen, bool bpp32, unsigned width, unsigned height)> changeScreenMode;
    // Whether the screen is full screen now.
    std::function<bool()> isFullScreen;
    std::function<void(const char* group, float volume)> setGroupVolume;
};

class CGameOptions {
public:
    static constexpr int DificultyLevelNoirmal = 0;
    static constexpr int DificultyLevelHard = 1;

    // Defaults from the application's Constants (default_options), acting on the application
    // and the audio manager; both can be replaced.
    CGameOptions();
    CGameOptions(const CGameOptions&) = delete;
    CGameOptions& operator=(const CGameOptions&) = delete;

    // Reads the group default_options of `constants`; an option it lacks keeps the built-in
    // default (full volumes, brightness 50, normal difficulty, a window).
    void SetDefaults(const ox::core::CSettingsGroup& constants);
    void SetTarget(OptionsTarget target) { m_Target = std::move(target); }

    // The screen mode through the application; the full-screen flag then follows what the
    // application reports. The application's result.
    bool ApplyOptionsChanges();
    // The volumes to the groups music, sound and voice.
    void ApplyMusicChanges();
    void RestoreOptions();
    void RestoreResolution();
    // The current set goes into the map under its GUID, if the map knows it.
    void UpdateLocalSettings();
    // Writes options.xml and commits the current values; false when it cannot be written.
    bool Save();

    bool GetFullScreenMode() const { return m_ScreenMode.FullScreen; }
    void SetFullScreenMode(bool value) { m_ScreenMode.FullScreen = value; }
    ScreenMode GetScreenMode() const { return m_ScreenMode; }
    void SetScreenMode(const ScreenMode& mode) { m_ScreenMode = mode; }
    float GetBrightness() const { return m_Current.m_Brightness; }
    void SetBrightness(float value) { m_Current.m_Brightness = value; }
    float GetSoundVolume() const { return m_Current.m_SoundVolume; }
    void SetSoundVolume(float value) { m_Current.m_SoundVolume = value; }
    float GetMusicVolume() const { return m_Current.m_MusicVolume; }
    void SetMusicVolume(float value) { m_Current.m_MusicVolume = value; }
    float GetVoiceVolume() const { return m_Current.m_VoiceVolume; }
    void SetVoiceVolume(float value) { m_Current.m_VoiceVolume = value; }
    int GetDificultyLevel() const { return m_Current.m_DificultyLevel; }
    void SetDificultyLevel(int value) { m_Current.m_DificultyLevel = value; }

    // Creates the folder if it does not exist.
    void SetFolder(const ox::wstring& folder);
    // Reads options.xml from the disk; a missing or damaged file leaves the defaults.
    void Load();
    // Takes the options of the player with this GUID (the defaults for a new one) as the
    // current and committed sets, and applies them.
    void SetCurrentProfile(const std::string& guid);

    const ProfileOptions& GetDefaults() const { return m_Defaults; }
    ox::wstring GetOptionsFile() const;

private:
    ProfileOptions DefaultsFor(const std::string& guid) const;

    std::map<std::string, ProfileOptions> m_Profiles;
    ProfileOptions m_Current;
    ScreenMode m_ScreenMode;
    ProfileOptions m_Committed;
    ScreenMode m_CommittedScreenMode;
    ox::wstring m_Folder;
    ProfileOptions m_Defaults;
    bool m_DefaultFullScreen = false;
    OptionsTarget m_Target;
};

struct g_GameOptions {
    static CGameOptions& Instance();
};

} // namespace k17
