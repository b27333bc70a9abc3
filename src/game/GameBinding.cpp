#include "game/GameBinding.h"

#include "diag/Assert.h"
#include "game/Achievements.h"
#include "game/FontViewerWindow.h"
#include "game/GameOptions.h"
#include "game/Profile.h"
#include "game/RecordTable.h"
#include "game/WindowEffects.h"
#include "game/ScriptHelpers.h"
#include "graphics/Renderer.h"
#include "misc/animation/Clip.h"
#include "lua/Lua.h"
#include "lua/mluabind/StdBinding.h"

namespace k17 {

using mluabind::Class;

namespace {

struct NamedValue {
    const char* name;
    int value;
};

constexpr NamedValue kProfileConstants[] = {
    {"GameStepTypeLevel", GameStepTypeLevel},         {"GameStepTypeComics", GameStepTypeComics},
    {"LevelStateTypeNew", LevelStateTypeNew},         {"LevelStateTypeInGame", LevelStateTypeInGame},
    {"LevelStateTypeFinished", LevelStateTypeFinished},
};

constexpr NamedValue kDifficultyConstants[] = {
    {"DificultyLevelNoirmal", CGameOptions::DificultyLevelNoirmal},
    {"DificultyLevelHard", CGameOptions::DificultyLevelHard},
};

template <class C, size_t N>
C& WithConstants(C& cls, const NamedValue (&values)[N])
{
    for (const NamedValue& v : values)
        cls.Constant(v.name, v.value);
    return cls;
}

mluabind::i::GenericClass& ProfileClass()
{
    using P = CProfile;
    auto& cls = Class<P>("CProfile")
                    .Method("GetName", &P::GetName)
                    .Method("SetName", &P::SetName)
                    .Method("GetGUID", &P::GetGUID)
                    .Method("GetGameGUID", &P::GetGameGUID)
                    .Method("SetGameGUID", &P::SetGameGUID)
                    .Method("GetStep", &P::GetStep)
                    .Method("SetStep", &P::SetStep)
                    .Method("GetStepType", &P::GetStepType)
                    .Method("SetStepType", &P::SetStepType)
                    .Method("GetPointsCount", &P::GetPointsCount)
                    .Method("SetPointsCount", &P::SetPointsCount)
                    .Method("GetHintsCount", &P::GetHintsCount)
                    .Method("SetHintsCount", &P::SetHintsCount)
                    .Method("GetThermometerPoints", &P::GetThermometerPoints)
                    .Method("SetThermometerPoints", &P::SetThermometerPoints)
                    .Method("GetAlphaThermometerPoints", &P::GetAlphaThermometerPoints)
                    .Method("SetAlphaThermometerPoints", &P::SetAlphaThermometerPoints)
                    .Method("GetLevelState", &P::GetLevelState)
                    .Method("SetLevelState", &P::SetLevelState)
                    .Method("GetHintsUseCount", &P::GetHintsUseCount)
                    .Method("SetHintsUseCount", &P::SetHintsUseCount)
                    .Method("GetHintsUseFlag", &P::GetHintsUseFlag)
                    .Method("SetHintsUseFlag", &P::SetHintsUseFlag)
                    .Method("GetSaveFileName", &P::GetSaveFileName);
    return WithConstants(cls, kProfileConstants);
}

mluabind::i::GenericClass& ProfileManagerClass()
{
    using M = CProfileManager;
    using ox::wstring;
    return Class<M>("CProfileManager")
        .Method("GetSavesFolder", &M::GetSavesFolder)
        .Method("CreateProfile", &M::CreateProfile)
        .Method("DeleteProfile", &M::DeleteProfile)
        .Method("Rename", &M::Rename)
        .Method("GetCurrentProfile", &M::GetCurrentProfile)
        .Method("GetProfile", static_cast<CProfile* (M::*)(unsigned)>(&M::GetProfile))
        .Method("GetProfile", static_cast<CProfile* (M::*)(const wstring&)>(&M::GetProfile))
        .Method("EnumProfiles", &M::EnumProfiles)
        .Method("SetCurrentProfile", static_cast<void (M::*)(unsigned)>(&M::SetCurrentProfile))
        .Method("SetCurrentProfile", static_cast<void (M::*)(const wstring&)>(&M::SetCurrentProfile))
        .Method("CompareWithoutCase",
                [](const M&, const wstring& a, const wstring& b) { return M::CompareWithoutCase(a, b); })
        .Method("Save", &M::Save);
}

// The profile classes and the manager's singleton: in the main state and in a level's.
mluabind::Namespace ProfileNames()
{
    mluabind::Namespace ns;
    ns.AddClass(ProfileClass());
    ns.AddClass(ProfileManagerClass());
    ns.AddFunction(mluabind::Function("g_ProfileManager.Instance", &g_ProfileManager::Instance));
    for (const NamedValue& v : kProfileConstants)
        ns.AddConstant(mluabind::Constant(v.name, v.value));
    return ns;
}

mluabind::i::GenericClass& GameOptionsClass()
{
    using O = CGameOptions;
    auto& cls = Class<O>("CGameOptions")
                    .Method("ApplyOptionsChanges", &O::ApplyOptionsChanges)
                    .Method("ApplyMusicChanges", &O::ApplyMusicChanges)
                    .Method("RestoreOptions", &O::RestoreOptions)
                    .Method("RestoreResolution", &O::RestoreResolution)
                    .Method("UpdateLocalSettings", &O::UpdateLocalSettings)
                    .Method("Save", &O::Save)
                    .Method("GetFullScreenMode", &O::GetFullScreenMode)
                    .Method("SetFullScreenMode", &O::SetFullScreenMode)
                    .Method("GetScreenMode", &O::GetScreenMode)
                    .Method("SetScreenMode", &O::SetScreenMode)
                    .Method("GetBrightness", &O::GetBrightness)
                    .Method("SetBrightness", &O::SetBrightness)
                    .Method("GetSoundVolume", &O::GetSoundVolume)
                    .Method("SetSoundVolume", &O::SetSoundVolume)
                    .Method("GetMusicVolume", &O::GetMusicVolume)
                    .Method("SetMusicVolume", &O::SetMusicVolume)
                    .Method("GetVoiceVolume", &O::GetVoiceVolume)
                    .Method("SetVoiceVolume", &O::SetVoiceVolume)
                    .Method("GetDificultyLevel", &O::GetDificultyLevel)
                    .Method("SetDificultyLevel", &O::SetDificultyLevel);
    return WithConstants(cls, kDifficultyConstants);
}

mluabind::Namespace OptionsAndRecords()
{
    mluabind::Namespace ns;
    ns.AddClass(Class<ScreenMode>("ScreenMode")
                    .Constructor<>()
                    .Member("Width", &ScreenMode::Width)
                    .Member("Height", &ScreenMode::Height)
                    .Member("Bpp32", &ScreenMode::Bpp32)
                    .Member("FullScreen", &ScreenMode::FullScreen));
    ns.AddClass(GameOptionsClass());
    ns.AddFunction(mluabind::Function("g_GameOptions.Instance", &g_GameOptions::Instance));
    ns.AddClass(Class<RecordInfo>("RecordInfo").Member("Name", &RecordInfo::Name).Member("Score", &RecordInfo::Score));
    using R = CRecordTable;
    ns.AddClass(Class<R>("CRecordTable")
                    .Method("AddRecord", &R::AddRecord)
                    .Method("Clear", &R::Clear)
                    .Method("GetLastRecordPos", &R::GetLastRecordPos)
                    .Method("GetRecords", &R::GetRecords)
                    .Method("Save", &R::Save));
    ns.AddClass(mluabind::GenericIteratorClass<R::RecordsT>("CRecordTable.RecordsIteratorT"));
    ns.AddFunction(mluabind::Function("g_RecordTable.Instance", &g_RecordTable::Instance));
    return ns;
}

// The options as a level's scripts see them: plain functions, volumes as integers.
int GetDificultyLevel() { return g_GameOptions::Instance().GetDificultyLevel(); }
void SetDificultyLevel(int level) { g_GameOptions::Instance().SetDificultyLevel(level); }
int GetSoundVolume() { return static_cast<int>(g_GameOptions::Instance().GetSoundVolume()); }
int GetMusicVolume() { return static_cast<int>(g_GameOptions::Instance().GetMusicVolume()); }

mluabind::Namespace LevelOptionNames()
{
    mluabind::Namespace ns;
    ns.AddFunction(mluabind::Function("GetDificultyLevel", &GetDificultyLevel));
    ns.AddFunction(mluabind::Function("SetDificultyLevel", &SetDificultyLevel));
    ns.AddFunction(mluabind::Function("GetSoundVolume", &GetSoundVolume));
    ns.AddFunction(mluabind::Function("GetMusicVolume", &GetMusicVolume));
    return ns;
}

// The one-shot effects scripts put on widgets.
mluabind::Namespace EffectNames()
{
    mluabind::Namespace ns;
    ns.AddFunction(mluabind::Function("AddEffectToWidget", &AddEffectToWidget));
    ns.AddFunction(mluabind::Function("AddRemoveEffectToWidget", &AddRemoveEffectToWidget));
    return ns;
}

// The achievements of the current profile, and their definitions for a window to show.
mluabind::Namespace AchievementNames()
{
    using A = CAchievements;
    mluabind::Namespace ns;
    ns.AddClass(Class<A>("CAchievements")
                    .Method("AddProgress", &A::AddProgressToCurrent)
                    .Method("GetProgress", &A::GetProgress)
                    .Method("GetCompletion", &A::GetCompletion)
                    .Method("GetScore", &A::GetScore)
                    .Method("GetCount", &A::GetCount)
                    .Method("GetId", &A::GetId)
                    .Method("GetMaxProgress", &A::GetMaxProgress)
                    .Method("GetShowProgressStep", &A::GetShowProgressStep)
                    .Method("GetTitle", &A::GetTitle)
                    .Method("GetDescription", &A::GetDescription)
                    .Method("GetImage", &A::GetImage)
                    .Method("Save", static_cast<bool (A::*)() const>(&A::Save)));
    ns.AddFunction(mluabind::Function("g_Achievements.Instance", &g_Achievements::Instance));
    return ns;
}

} // namespace

mluabind::Namespace BindGameClasses()
{
    mluabind::Namespace ns("k17");
    ns.Merge(ProfileNames()).Merge(OptionsAndRecords());
    ns.Merge(EffectNames());
    ns.Merge(AchievementNames());
    ns.AddFunction(mluabind::Function("CharToInt", &CharToInt));
    ns.AddFunction(mluabind::Function("misc.CreateGUIDString", &CreateGUIDString));
    ns.AddFunction(mluabind::Function("misc.ExecuteFile", &ExecuteFile));
    BindFontViewer(ns);
    return ns;
}

mluabind::Namespace BindGameGlobals()
{
    mluabind::Namespace ns;
    ns.AddFunction(mluabind::Function("__QEBindGame", &BindGameInto));
    return ns;
}

void BindGameInto(ox::lua::CLua* lua)
{
    OX_CHECK_DATA(lua != nullptr);
    lua->BeginBinding();
    // Names and GUIDs travel as std strings.
    if (!lua->FindClass(typeid(ox::wstring)))
        lua->Bind(mluabind::BindStdStrings());
    mluabind::Namespace ns("k17");
    if (!lua->FindClass(typeid(CProfile)))
        ns.Merge(ProfileNames());
    if (!lua->FindClass(typeid(CGameOptions)))
        ns.AddClass(WithConstants(Class<CGameOptions>("CGameOptions"), kDifficultyConstants));
    ns.Merge(LevelOptionNames());
    ns.Merge(EffectNames());
    // The level's rules award achievements.
    if (!lua->FindClass(typeid(CAchievements)))
        ns.Merge(AchievementNames());
    ns.AddFunction(mluabind::Function("misc.RenderBorderedClip", &RenderBorderedClip));
    ns.AddFunction(mluabind::Function("misc.GetString", &GetString));
    lua->Bind(ns);
    lua->EndBinding();
}

} // namespace k17
