#pragma once
// Script names of the game shell: the table "k17" with profiles, options and records and
// their singletons, k17.misc, and the global __QEBindGame, which gives another Lua state the
// part of the vocabulary a level's scripts use.
#include "lua/mluabind/Binding.h"

namespace ox::lua {
class CLua;
}

namespace k17 {

// "k17": CProfile (with the step and level-state constants, also on k17 itself),
// CProfileManager, CGameOptions (with the difficulty constants), ScreenMode, RecordInfo,
// CRecordTable with CRecordTable.RecordsIteratorT, g_ProfileManager.Instance,
// g_GameOptions.Instance, g_RecordTable.Instance, CAchievements with g_Achievements.Instance,
// CharToInt, misc.CreateGUIDString and misc.ExecuteFile.
mluabind::Namespace BindGameClasses();

// The global __QEBindGame(lua). Run in declaration mode on the main state.
mluabind::Namespace BindGameGlobals();

// What __QEBindGame binds into `lua`: the profile classes and manager, the options' free
// functions k17.GetDificultyLevel, SetDificultyLevel, GetSoundVolume and GetMusicVolume (the
// volumes as integers), k17.CGameOptions with its constants only, the achievements, and
// k17.misc.RenderBorderedClip and k17.misc.GetString. A state that has the
// classes already keeps them; one without the std strings gets them.
void BindGameInto(ox::lua::CLua* lua);

} // namespace k17
