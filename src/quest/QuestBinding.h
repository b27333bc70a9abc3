#pragma once
// Script names of the quest tree and its scene objects. Run in declaration mode and bind the
// result: it is the table "qe". Classes are bound bases first, with their pointer classes
// (qe.CBaseSceneObjectPtrT, ...), the walks over their lists and their constants.
#include "lua/mluabind/Binding.h"
#include "misc/WideChar.h"

#include <functional>
#include <string>

namespace ox::core {
class CSettings;
}
namespace ox::gui {
class CWindow;
}
namespace ox::lua {
class CLua;
}

namespace qe {

class CLevel;

// "qe": CTreeNode, CBaseSceneObject, CSceneGroup, CSceneObject, CObject, CAreaPoint,
// CImageObject, CClipObject, CArea, CQuest, CLevel, CScene; the objects box (CObjectsBox,
// BoxItem), the scene widget, the objects box widget and the game cursor (CSceneWidget,
// CObjectsBoxWidget, CCursor); their pointer classes (CBaseSceneObjectPtrT, ...); the list walks
// CQuest.LevelIteratorT, CLevel.SceneIteratorT, CArea.PointIteratorT,
// CSceneGroup.GroupChildIteratorT (which also walks a scene's lists) and
// CObjectsBox.ObjectsListIteratorT; the singletons g_Cursor, g_LuaThreadManager and g_QuestData
// and CSceneWidget.ClearScriptCache; the functions GetClipTime, Clip_GetObjectById, TryAlpha,
// StartLevel, RunObjectScript, OnClose, LoadSceneChild_, FindObjectInventCondition,
// FindObjectCursorInventState, StringFormat (a text or one to three numbers) and ReplaceDollarByS.
mluabind::Namespace BindQuestClasses();

// The framework's vocabulary, which the quest classes build on (ox.lua.BindOX). Binds in
// declaration mode on its own.
void BindFramework(mluabind::CHost& host);

// The points the click road hands to scripts (ox.misc.IntVector, FloatVector with X and Y),
// for a host whose framework vocabulary lacks them.
void BindMissingGeometry(mluabind::CHost& host);

// What a level's host gets beside "qe" from StartLevel (the game gives its mini-games'
// vocabulary); none by default.
void SetLevelBinder(std::function<void(ox::lua::CLua&)> binder);

// Starts a level in its Lua host (the one listed as qe_level): binds the framework's
// vocabulary when the host lacks it, then "qe" and what the level binder adds; defines the global __g_InitScript as a
// function with `initScript` as its body; loads scripts/game_engine/quest.lua; and returns
// what quest.StartLevel(window, level, a, settings, b, c, d) returns. `a` to `d` belong to
// the game's scripts and are only passed on. A failure is reported by the host; a
// quest.StartLevel that fails or returns no number gives 0.
int StartLevel(ox::lua::CLua* lua, ox::gui::CWindow* window, CLevel* level, const std::string& a,
               const ox::core::CSettings* settings, const std::string& initScript, const ox::wstring& b,
               const std::string& c, bool d);

} // namespace qe
