#pragma once
// Player profiles: a name, a permanent GUID that names the player's save file and options,
// and the position in the story. The manager keeps the list in saves.xml in the saves folder
// and knows the current profile.
#include "misc/WideChar.h"

#include <list>
#include <string>

namespace ox::core {
class CSettingsGroup;
}

namespace k17 {

class CAttributeReader;
class CGameOptions;

enum GameStepType { GameStepTypeLevel = 0, GameStepTypeComics = 1 };
enum LevelStateType { LevelStateTypeNew = 0, LevelStateTypeInGame = 1, LevelStateTypeFinished = 2 };

// A fresh random GUID as text: its Data1, Data2, Data3 and the eight bytes of Data4, each in
// hexadecimal without padding, one after the other.
std::string CreateGUIDString();

class CProfile {
public:
    static constexpr int GameStepTypeLevel = k17::GameStepTypeLevel;
    static constexpr int GameStepTypeComics = k17::GameStepTypeComics;
    static constexpr int LevelStateTypeNew = k17::LevelStateTypeNew;
    static constexpr int LevelStateTypeInGame = k17::LevelStateTypeInGame;
    static constexpr int LevelStateTypeFinished = k17::LevelStateTypeFinished;

    // A new profile with a fresh GUID; `folder` is where its save file lives.
    CProfile(const ox::wstring& name, const ox::wstring* folder);

    const ox::wstring& GetName() const { return m_Name; }
    void SetName(const ox::wstring& name) { m_Name = name; }
    const std::string& GetGUID() const { return m_GUID; }
    const std::string& GetGameGUID() const { return m_GameGUID; }
    void SetGameGUID(const std::string& guid) { m_GameGUID = guid; }
    const std::string& GetStep() const { return m_Step; }
    void SetStep(const std::string& step) { m_Step = step; }
    int GetStepType() const { return m_StepType; }
    void SetStepType(int type) { m_StepType = type; }
    int GetPointsCount() const { return m_PointsCount; }
    void SetPointsCount(int count) { m_PointsCount = count; }
    int GetHintsCount() const { return m_HintsCount; }
    void SetHintsCount(int count) { m_HintsCount = count; }
    int GetThermometerPoints() const { return m_ThermometerPoints; }
    void SetThermometerPoints(int points) { m_ThermometerPoints = points; }
    int GetAlphaThermometerPoints() const { return m_AlphaThermometerPoints; }
    void SetAlphaThermometerPoints(int points) { m_AlphaThermometerPoints = points; }
    int GetLevelState() const { return m_LevelState; }
    void SetLevelState(int state) { m_LevelState = state; }
    int GetHintsUseCount() const { return m_HintsUseCount; }
    void SetHintsUseCount(int count) { m_HintsUseCount = count; }
    int GetHintsUseFlag() const { return m_HintsUseFlag; }
    void SetHintsUseFlag(int flag) { m_HintsUseFlag = flag; }

    // The saves folder joined with the GUID and ".sav".
    ox::wstring GetSaveFileName() const;

private:
    friend class CProfileManager;

    ox::wstring m_Name;
    std::string m_GUID;
    std::string m_GameGUID;
    std::string m_Step;
    int m_StepType = -1;
    int m_PointsCount = 0;
    int m_HintsCount = 0;
    int m_ThermometerPoints = 0;
    int m_AlphaThermometerPoints = 0;
    int m_LevelState = LevelStateTypeNew;
    int m_HintsUseCount = 0;
    int m_HintsUseFlag = 0;
    // The manager's folder, which outlives its profiles.
    const ox::wstring* m_Folder;
};

class CProfileManager {
public:
    // `options` is told the GUID of each new current profile; null: nobody is.
    explicit CProfileManager(CGameOptions* options = nullptr) : m_Options(options) {}
    CProfileManager(const CProfileManager&) = delete;
    CProfileManager& operator=(const CProfileManager&) = delete;

    // Creates the folder if it does not exist.
    void SetSavesFolder(const ox::wstring& folder);
    const ox::wstring& GetSavesFolder() const { return m_SavesFolder; }

    // Appends a profile with a fresh GUID; with `makeCurrent` it becomes the current one.
    CProfile* CreateProfile(const ox::wstring& name, bool makeCurrent);
    // The save file stays on disk. Deleting the current profile leaves none current.
    void DeleteProfile(const ox::wstring& name);
    void Rename(const ox::wstring& oldName, const ox::wstring& newName);

    CProfile* GetCurrentProfile() const { return m_CurrentProfile; }
    // Null past the end or for a name not in the list (names compare exactly).
    CProfile* GetProfile(unsigned index);
    CProfile* GetProfile(const ox::wstring& name);
    unsigned EnumProfiles() const { return static_cast<unsigned>(m_Profiles.size()); }
    // A profile that is not found changes nothing.
    void SetCurrentProfile(unsigned index);
    void SetCurrentProfile(const ox::wstring& name);

    // Letter case ignored, by one fixed table (Latin, Greek, Cyrillic).
    static bool CompareWithoutCase(const ox::wstring& first, const ox::wstring& second);

    // Writes saves.xml; false (logged, shown once) when it cannot be written.
    bool Save() const;
    // Reads saves.xml from the disk into an empty list. A missing file leaves no profiles;
    // a damaged one gives what can be read.
    void Load();

    ox::wstring GetSavesFile() const;

private:
    void MakeCurrent(CProfile* profile);
    void LoadProfile(const CAttributeReader& reader, const ox::core::CSettingsGroup& node);

    std::list<CProfile> m_Profiles;
    CProfile* m_CurrentProfile = nullptr;
    ox::wstring m_SavesFolder;
    CGameOptions* m_Options;
};

// The process's profile manager, told of the process's options.
struct g_ProfileManager {
    static CProfileManager& Instance();
};

} // namespace k17
