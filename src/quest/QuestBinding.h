#pragma once
// Script names of the quest tree and its scene objects. Run in declaration mode and bind the
// result: it is the table "qe". Classes are bound bases first, with their pointer classes
// (qe.CBaseSceneObjectPtrT, ...), the walks over their lists and their constants.
#include "lua/mluabind/Binding.h"

namespace qe {

// "qe": CTreeNode, CBaseSceneObject, CSceneGroup, CSceneObject, CObject, CAreaPoint,
// CImageObject, CClipObject, CArea, CQuest, CLevel, CScene; CAreaPointPtrT,
// CBaseSceneObjectPtrT, CLevelPtrT, CSceneGroupPtrT, CScenePtrT; the list walks
// CQuest.LevelIteratorT, CLevel.SceneIteratorT, CArea.PointIteratorT and
// CSceneGroup.GroupChildIteratorT (which also walks a scene's lists); the functions
// GetClipTime, Clip_GetObjectById and TryAlpha.
mluabind::Namespace BindQuestClasses();

} // namespace qe
