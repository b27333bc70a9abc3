#include "quest/QuestBinding.h"

#include "graphics/Renderer.h"
#include "core/ScriptVocabulary.h"
#include "core/Settings.h"
#include "core/TimeManager.h"
#include "diag/Assert.h"
#include "gui/GuiBinding.h"
#include "gui/Window.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/mluabind/StdBinding.h"
#include "misc/animation/ClipObjects.h"
#include "quest/AlphaImageWidget.h"
#include "quest/Area.h"
#include "quest/Effects.h"
#include "quest/ClipObject.h"
#include "quest/ImageObject.h"
#include "quest/GameCursor.h"
#include "quest/LuaThreadManager.h"
#include "quest/ObjectScripts.h"
#include "quest/QuestData.h"
#include "quest/PixelTest.h"
#include "quest/Quest.h"
#include "quest/ObjectsBox.h"
#include "quest/SceneGroup.h"
#include "quest/SceneWidget.h"
#include "misc/Unicode.h"
#include "sound/SoundBinding.h"

#include <algorithm>

namespace qe {

namespace {

using mluabind::Class;
using B = CBaseSceneObject;

mluabind::i::CCl<CBaseSceneObject>& BaseSceneObjectClass()
{
    return Class<B>("CBaseSceneObject")
        .BaseClass<CTreeNode>()
        .Method("GetPos", &B::GetPos)
        .Method("GetSize", &B::GetSize)
        .Method("GetAngle", &B::GetAngle)
        .Method("GetColor", &B::GetColor)
        .Method("GetId", &B::GetId)
        .Method("GetIdRef", [](const B& o) { return o.GetIdRef(); })
        .Method("GetHint", &B::GetHint)
        .Method("SetPos", &B::SetPos)
        .Method("SetSize", &B::SetSize)
        .Method("SetAngle", &B::SetAngle)
        .Method("SetColor", &B::SetColor)
        .Method("SetId", &B::SetId)
        .Method("SetHint", &B::SetHint)
        .Method("Update", &B::Update)
        .Method("Draw", &B::Draw)
        .Method("DrawGame", &B::DrawGame)
        .Method("DoDrawForEditor", &B::DoDrawForEditor)
        .Method("GetPoly", &B::GetPoly)
        .Method("GetType", &B::GetType)
        .Method("GetParentGroup", &B::GetParentGroup)
        .Method("SetParentGroup", &B::SetParentGroup)
        .Method("IsParentGroupVisible", &B::IsParentGroupVisible)
        .Method("RaiseFlag", &B::RaiseFlag)
        .Method("ClearFlag", &B::ClearFlag)
        .Method("ReadFlag", &B::ReadFlag)
        .Method("GetFlags", &B::GetFlags)
        .Method("SetFlags", &B::SetFlags)
        .Method("RaiseObjectFlag", &B::RaiseObjectFlag)
        .Method("ClearObjectFlag", &B::ClearObjectFlag)
        .Method("ReadObjectFlag", &B::ReadObjectFlag)
        .Method("GetObjectFlags", &B::GetObjectFlags)
        .Method("SetObjectFlags", &B::SetObjectFlags)
        .Method("GetLuaScript", [](const B& o, int kind) { return o.GetLuaScript(kind); })
        .Method("SetLuaScript", &B::SetLuaScript)
        .Method("Clone", &B::Clone)
        .Constant("FlagSelected", B::FlagSelected)
        .Constant("FlagNoDrag", B::FlagNoDrag)
        .Constant("FlagInvisible", B::FlagInvisible)
        .Constant("FlagExpanded", B::FlagExpanded)
        .Constant("ScriptMouseClick", B::ScriptMouseClick)
        .Constant("ScriptMouseEnter", B::ScriptMouseEnter)
        .Constant("ScriptMouseLeave", B::ScriptMouseLeave)
        .Constant("ScriptInventoryClick", B::ScriptInventoryClick)
        .Constant("ScriptCount", B::ScriptCount)
        .Constant("ObjectFlagDisable", B::ObjectFlagDisable)
        .Constant("ObjectFlagHidden", B::ObjectFlagHidden)
        .Constant("ObjectFlagRemoved", B::ObjectFlagRemoved)
        .Constant("ObjectFlagDoNotNeed", B::ObjectFlagDoNotNeed)
        .Constant("ObjectCanAlwaysTake", B::ObjectCanAlwaysTake)
        .Constant("ObjectType", B::ObjectType)
        .Constant("GroupType", B::GroupType);
}

mluabind::Namespace SceneObjectClasses()
{
    mluabind::Namespace ns;
    ns.AddClass(Class<CSceneGroup>("CSceneGroup")
                    .BaseClass<B>()
                    .Constructor<>()
                    .Method("InsertChild", &CSceneGroup::InsertChild)
                    .Method("RemoveChild", &CSceneGroup::RemoveChild)
                    .Method("EnumChilds", &CSceneGroup::EnumChilds)
                    .Method("GetChilds", &CSceneGroup::GetChilds)
                    .Method("GetStateById", &CSceneGroup::GetStateById)
                    .Method("FindState", &CSceneGroup::FindState)
                    .Method("IsCurrent", &CSceneGroup::IsCurrent)
                    .Method("GetFirstVisibleState", &CSceneGroup::GetFirstVisibleState)
                    .Method("SetCurrent", &CSceneGroup::SetCurrent)
                    .Method("SetCurrentByNumber", &CSceneGroup::SetCurrentByNumber));
    ns.AddClass(Class<CSceneObject>("CSceneObject")
                    .BaseClass<B>()
                    .Method("GetSound", [](const CSceneObject& o) { return o.GetSound(); })
                    .Method("SetSound", &CSceneObject::SetSound));
    // SetPos of two numbers hides the base's, so both forms stand here.
    ns.AddClass(Class<CObject>("CObject")
                    .BaseClass<CSceneObject>()
                    .Method("SetPos", static_cast<void (CObject::*)(const FloatVector&)>(&CObject::SetPos))
                    .Method("SetPos", static_cast<void (CObject::*)(float, float)>(&CObject::SetPos)));
    ns.AddClass(Class<CAreaPoint>("CAreaPoint")
                    .Constructor<>()
                    .Method("GetPos", &CAreaPoint::GetPos)
                    .Method("SetPos", &CAreaPoint::SetPos));
    ns.AddClass(Class<CImageObject>("CImageObject")
                    .BaseClass<CObject>()
                    .Constructor<>()
                    .Method("SetTextureId", &CImageObject::SetTextureId)
                    .Method("PlayFromStart", &CImageObject::PlayFromStart)
                    .Method("GetTotalTime", &CImageObject::GetTotalTime));
    ns.AddClass(Class<CClipObject>("CClipObject")
                    .BaseClass<CObject>()
                    .Constructor<>()
                    .Method("SetClipId", &CClipObject::SetClipId)
                    .Method("GetClipTime", &CClipObject::GetClipTime)
                    .Method("Play", &CClipObject::Play)
                    .Method("Stop", &CClipObject::Stop)
                    .Method("Pause", &CClipObject::Pause)
                    .Method("DisableSounds", &CClipObject::DisableSounds)
                    .Method("UseAlpha", &CClipObject::UseAlpha)
                    .Method("IsUsingAlpha", &CClipObject::IsUsingAlpha));
    ns.AddClass(Class<CArea>("CArea")
                    .BaseClass<CSceneObject>()
                    .Constructor<>()
                    .Method("PointIsNearToContour", &CArea::PointIsNearToContour)
                    .Method("UpdatePosition", &CArea::UpdatePosition)
                    .Method("InsertPoint", &CArea::InsertPoint)
                    .Method("RemovePoint", &CArea::RemovePoint)
                    .Method("EnumPoints", &CArea::EnumPoints)
                    .Method("GetPoints", &CArea::GetPoints));
    return ns;
}

mluabind::Namespace TreeClasses()
{
    mluabind::Namespace ns;
    ns.AddClass(Class<CQuest>("CQuest")
                    .BaseClass<CTreeNode>()
                    .Constructor<>()
                    .Method("EnumLevels", &CQuest::EnumLevels)
                    .Method("GetLevels", &CQuest::GetLevels)
                    .Method("GetLevelById", &CQuest::GetLevelById)
                    .Method("InsertLevel", &CQuest::InsertLevel)
                    .Method("RemoveLevel", &CQuest::RemoveLevel)
                    .Method("Load", &CQuest::Load)
                    .Method("Save", &CQuest::Save));
    ns.AddClass(Class<CLevel>("CLevel")
                    .BaseClass<CTreeNode>()
                    .Constructor<>()
                    .Method("GetId", [](const CLevel& l) { return l.GetId(); })
                    .Method("SetId", &CLevel::SetId)
                    .Method("EnumScenes", &CLevel::EnumScenes)
                    .Method("GetScenes", &CLevel::GetScenes)
                    .Method("GetSceneById", &CLevel::GetSceneById)
                    .Method("InsertScene", &CLevel::InsertScene)
                    .Method("RemoveScene", &CLevel::RemoveScene)
                    .Method("GetSound", [](const CLevel& l, int index) { return l.GetSound(index); })
                    .Method("SetSound", &CLevel::SetSound)
                    .Method("GetLuaScript", [](const CLevel& l, int index) { return l.GetLuaScript(index); })
                    .Method("SetLuaScript", &CLevel::SetLuaScript)
                    .Method("RunLevelScript", &CLevel::RunLevelScript)
                    .Method("RunStartLevelScript", &CLevel::RunStartLevelScript)
                    .Method("GetShowChildSceneAreas", &CLevel::GetShowChildSceneAreas)
                    .Method("SetShowChildSceneAreas", &CLevel::SetShowChildSceneAreas)
                    .Method("UpdateHint", &CLevel::UpdateHint)
                    .Method("UpdateFocusedObject", &CLevel::UpdateFocusedObject)
                    .Method("FindObjectById", &CLevel::FindObjectById)
                    .Method("RemoveObject", &CLevel::RemoveObject)
                    .Method("ClearObjectsList", &CLevel::ClearObjectsList)
                    .Method("Clone", &CLevel::Clone)
                    .Method("UpdateLinks", &CLevel::UpdateLinks)
                    .Constant("ScriptLevel", CLevel::ScriptLevel)
                    .Constant("ScriptStart", CLevel::ScriptStart)
                    .Constant("ScriptCount", CLevel::ScriptCount)
                    .Constant("SoundMovingToABox", CLevel::SoundMovingToABox)
                    .Constant("SoundOpenScene", CLevel::SoundOpenScene));
    ns.AddClass(Class<CScene>("CScene")
                    .BaseClass<CTreeNode>()
                    .Constructor<>()
                    .Method("Draw", &CScene::Draw)
                    .Method("DrawInEditor", &CScene::DrawInEditor)
                    .Method("DrawGame", &CScene::DrawGame)
                    .Method("Update", &CScene::Update)
                    .Method("GetOffset", &CScene::GetOffset)
                    .Method("SetOffset", &CScene::SetOffset)
                    .Method("GetId", [](const CScene& s) { return s.GetId(); })
                    .Method("SetId", &CScene::SetId)
                    .Method("GetSize", &CScene::GetSize)
                    .Method("SetSize", &CScene::SetSize)
                    .Method("ReadFlag", &CScene::ReadFlag)
                    .Method("RaiseFlag", &CScene::RaiseFlag)
                    .Method("ClearFlag", &CScene::ClearFlag)
                    .Method("GetFlags", &CScene::GetFlags)
                    .Method("SetFlags", &CScene::SetFlags)
                    .Method("GetScript", [](const CScene& s) { return s.GetScript(); })
                    .Method("SetScript", &CScene::SetScript)
                    .Method("RunSceneScript", &CScene::RunSceneScript)
                    .Method("GetParentLevel", &CScene::GetParentLevel)
                    .Method("SetParentLevel", &CScene::SetParentLevel)
                    .Method("EnumObjects", &CScene::EnumObjects)
                    .Method("GetObjects", &CScene::GetObjects)
                    .Method("InsertObject", &CScene::InsertObject)
                    .Method("RemoveObject", &CScene::RemoveObject)
                    .Method("EnumAreas", &CScene::EnumAreas)
                    .Method("GetAreas", &CScene::GetAreas)
                    .Method("InsertArea", &CScene::InsertArea)
                    .Method("RemoveArea", &CScene::RemoveArea)
                    .Method("EnumChilds", &CScene::EnumChilds)
                    .Method("GetChilds", &CScene::GetChilds)
                    .Method("UpdateTotalChildList", &CScene::UpdateTotalChildList)
                    .Method("IsContentObject", &CScene::IsContentObject)
                    .Method("IsContentArea", &CScene::IsContentArea)
                    .Constant("FlagMainScene", CScene::FlagMainScene)
                    .Constant("FlagSceneInNewWindow", CScene::FlagSceneInNewWindow));
    return ns;
}

// The pointer classes and the walks over the lists. A scene's lists and a group's states
// are one list type: CSceneGroup.GroupChildIteratorT walks both.
mluabind::Namespace PointersAndWalks()
{
    mluabind::Namespace ns;
    ns.AddClass(mluabind::IntrusivePtrClass<CAreaPoint>("CAreaPointPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CBaseSceneObject>("CBaseSceneObjectPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CLevel>("CLevelPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CSceneGroup>("CSceneGroupPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CSceneObject>("CSceneObjectPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CScene>("CScenePtrT"));
    ns.AddClass(mluabind::GenericIteratorClass<CQuest::LevelsListT>("CQuest.LevelIteratorT"));
    ns.AddClass(mluabind::GenericIteratorClass<CLevel::ScenesListT>("CLevel.SceneIteratorT"));
    ns.AddClass(mluabind::GenericIteratorClass<CArea::PointsListT>("CArea.PointIteratorT"));
    ns.AddClass(mluabind::GenericIteratorClass<CSceneGroup::ChildsListT>("CSceneGroup.GroupChildIteratorT"));
    return ns;
}

mluabind::Namespace Singletons()
{
    mluabind::Namespace ns;
    using M = CLuaThreadManager;
    ns.AddClass(Class<M>("CLuaThreadManager")
                    .Method("SetLua", &M::SetLua)
                    .Method("SetTimer", &M::SetTimer)
                    .Method("GetElapsedTime", &M::GetElapsedTime)
                    .Method("Clear", &M::Clear)
                    .Method("Error", &M::Error));
    ns.AddFunction(mluabind::Function("g_LuaThreadManager.Instance", &g_LuaThreadManager::Instance));
    ns.AddClass(Class<CQuestData>("CQuestData").Method("Load", &CQuestData::Load).Method("CreateLevel", &CQuestData::CreateLevel));
    ns.AddFunction(mluabind::Function("g_QuestData.Instance", &g_QuestData::Instance));
    ns.AddFunction(mluabind::Function("CSceneWidget.ClearScriptCache", &CSceneWidget::ClearScriptCache));
    return ns;
}

mluabind::Namespace InventoryClasses()
{
    mluabind::Namespace ns;
    using Box = CObjectsBox;
    ns.AddClass(Class<Box>("CObjectsBox")
                    .Constructor<>()
                    .Method("Clear", &Box::Clear)
                    .Method("EnumObjects", &Box::EnumObjects)
                    .Method("GetObjects", &Box::GetObjects)
                    .Method("GetObject", &Box::GetObject)
                    .Method("FindObjectInBox", &Box::FindObjectInBox)
                    .Method("InsertObject", &Box::InsertObject)
                    .Method("RemoveObject", &Box::RemoveObject)
                    .Method("SetItemNextState", &Box::SetItemNextState)
                    .Method("SetItemStateById", &Box::SetItemStateById));
    ns.AddClass(Class<BoxItem>("BoxItem").Member("Item", &BoxItem::Item).Member("InventState", &BoxItem::InventState));
    ns.AddClass(mluabind::IntrusivePtrClass<Box>("CObjectsBoxPtrT"));
    ns.AddClass(mluabind::GenericIteratorClass<Box::ObjectsListT>("CObjectsBox.ObjectsListIteratorT"));
    ns.AddFunction(mluabind::Function("FindObjectInventCondition", &FindObjectInventCondition));
    ns.AddFunction(mluabind::Function("FindObjectCursorInventState", &FindObjectCursorInventState));
    return ns;
}

mluabind::Namespace WidgetClasses()
{
    mluabind::Namespace ns;
    using W = CSceneWidget;
    ns.AddClass(Class<W>("CSceneWidget")
                    .BaseClass<ox::gui::CWidget>()
                    .Constructor<>()
                    .Method("SetScene", &W::SetScene)
                    .Method("GetScene", &W::GetScene)
                    .Method("GetSceneId", &W::GetSceneId)
                    .Method("CloseChildScenes", &W::CloseChildScenes)
                    .Method("CloseChildSceneById", &W::CloseChildSceneById)
                    .Method("RunMouseCickScript", &W::RunMouseCickScript)
                    .Method("RunIventoryClickScript", &W::RunIventoryClickScript)
                    .Method("OnMouseDown", &W::OnMouseDown)
                    .Method("OnMouseUp", &W::OnMouseUp)
                    .Method("SetInitPos", &W::SetInitPos)
                    .Method("GetInitPos", &W::GetInitPos)
                    .Method("SetWorldInitPos", &W::SetWorldInitPos)
                    .Method("GetWorldInitPos", &W::GetWorldInitPos)
                    .Method("SetCloseButtonText", &W::SetCloseButtonText)
                    .Method("UpdateCloseButtonPos", &W::UpdateCloseButtonPos)
                    .Method("IsDead", &W::IsDead)
                    .Method("DisableCloseButton", &W::DisableCloseButton)
                    .Method("GetCloseButton", &W::GetCloseButton));
    ns.AddClass(Class<CObjectsBoxWidget>("CObjectsBoxWidget").BaseClass<ox::gui::CLuaWidget>().Constructor<>());
    ns.AddClass(mluabind::IntrusivePtrClass<W>("CSceneWidgetPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CObjectsBoxWidget>("CObjectsBoxWidgetPtrT"));
    return ns;
}

// The effects list with its alpha effect, and the image that takes the mouse on its opaque
// pixels.
mluabind::Namespace EffectClasses()
{
    mluabind::Namespace ns;
    ns.AddClass(Class<CBaseEffect>("CBaseEffect").Constructor<>().Method("Update", &CBaseEffect::Update));
    ns.AddClass(Class<CAlphaEffect>("CAlphaEffect")
                    .BaseClass<CBaseEffect>()
                    .Constructor<BaseSceneObjectPtrT, bool, bool, float, const ox::core::CGroupTimer*>());
    ns.AddClass(mluabind::IntrusivePtrClass<CBaseEffect>("CBaseEffectPtrT"));
    ns.AddClass(mluabind::IntrusivePtrClass<CAlphaEffect>("CAlphaEffectPtrT"));
    ns.AddClass(Class<CEffectsList>("CEffectsList")
                    .Method("AddEffect", &CEffectsList::AddEffect)
                    .Method("Update", &CEffectsList::Update)
                    .Method("Clear", &CEffectsList::Clear));
    ns.AddFunction(mluabind::Function("g_EffectsList.Instance", &g_EffectsList::Instance));
    ns.AddClass(Class<CAlphaImageWidget>("CAlphaImageWidget").BaseClass<ox::gui::CImageWidget>().Constructor<>());
    ns.AddClass(mluabind::IntrusivePtrClass<CAlphaImageWidget>("CAlphaImageWidgetPtrT"));
    return ns;
}

mluabind::Namespace CursorClass()
{
    mluabind::Namespace ns;
    using C = CCursor;
    ns.AddClass(Class<C>("CCursor")
                    .Method("SetCursorObject", &C::SetCursorObject)
                    .Method("GetCursorObject", &C::GetCursorObject)
                    .Method("ClearCursor", &C::ClearCursor)
                    .Method("Draw", &C::Draw)
                    .Method("SetWorkAreaSize", &C::SetWorkAreaSize)
                    .Method("SetWorkAreaOffset", &C::SetWorkAreaOffset)
                    .Method("SetIsDrag", &C::SetIsDrag)
                    .Method("GetIsDrag", &C::GetIsDrag)
                    .Method("SetShowHints", &C::SetShowHints)
                    .Method("GetShowHints", &C::GetShowHints)
                    .Method("SetDisableHints", &C::SetDisableHints)
                    .Method("GetDisableHints", &C::GetDisableHints)
                    .Method("SetHintOffset", &C::SetHintOffset)
                    .Method("GetHintOffset", &C::GetHintOffset)
                    .Method("SetHintText", &C::SetHintText)
                    .Method("GetHintText", &C::GetHintText)
                    .Method("SetHintFont", static_cast<void (C::*)(const std::string&)>(&C::SetHintFont))
                    .Method("SetObjectWidth", &C::SetObjectWidth)
                    .Method("SetCursorObjectScale", &C::SetCursorObjectScale)
                    .Method("SetObjectOffset", &C::SetObjectOffset)
                    .Method("SetPreObject", &C::SetPreObject)
                    .Method("SetPreObjectOffset", &C::SetPreObjectOffset));
    ns.AddClass(mluabind::IntrusivePtrClass<C>("CCursorPtrT"));
    ns.AddFunction(mluabind::Function("g_Cursor.Instance", &g_Cursor::Instance));
    return ns;
}

// Texts for scripts: a format of the wide formatter with one text or up to three numbers,
// into a buffer of 1,023 characters.
template <class... Args>
ox::wstring Format(const ox::wstring& format, Args... args)
{
    ox::wchar buffer[1024];
    ox::misc::StringFormat(buffer, 1024, format.c_str(), args...);
    return buffer;
}

mluabind::Namespace TextFunctions()
{
    mluabind::Namespace ns;
    ns.AddFunction(mluabind::Function("StringFormat", [](const ox::wstring& f, const ox::wstring& text) {
        return Format(f, text.c_str());
    }));
    ns.AddFunction(mluabind::Function("StringFormat", [](const ox::wstring& f, int a) { return Format(f, a); }));
    ns.AddFunction(mluabind::Function("StringFormat", [](const ox::wstring& f, int a, int b) { return Format(f, a, b); }));
    ns.AddFunction(mluabind::Function("StringFormat", [](const ox::wstring& f, int a, int b, int c) {
        return Format(f, a, b, c);
    }));
    ns.AddFunction(mluabind::Function("ReplaceDollarByS", [](ox::wstring text) {
        std::replace(text.begin(), text.end(), u'$', u'S');
        return text;
    }));
    return ns;
}

// quest.OnClose of a host, as the application asks it when the game closes.
bool OnClose(ox::lua::CLua* lua)
{
    OX_CHECK_DATA(lua != nullptr, false);
    return ox::lua::CallLuaFunction<bool>(lua, "quest.OnClose");
}

// An object's script of a kind, run as a scene widget runs it; scripts reach it while no
// widget shows the scene.
void RunObjectScript(int kind, CBaseSceneObject* object, bool withEvents, bool isClick)
{
    OX_CHECK_DATA(object != nullptr);
    OX_CHECK_DATA(kind >= 0 && kind < CBaseSceneObject::ScriptCount);
    GetObjectScripts().Run(kind, *object, withEvents, isClick);
}

} // namespace

mluabind::Namespace BindQuestClasses()
{
    mluabind::Namespace ns("qe");
    ns.AddClass(Class<CTreeNode>("CTreeNode"));
    ns.AddClass(BaseSceneObjectClass());
    ns.Merge(SceneObjectClasses()).Merge(TreeClasses()).Merge(PointersAndWalks()).Merge(Singletons());
    ns.Merge(InventoryClasses()).Merge(WidgetClasses()).Merge(CursorClass()).Merge(TextFunctions());
    ns.Merge(EffectClasses());
    ns.AddFunction(mluabind::Function("OnClose", &OnClose));
    ns.AddFunction(mluabind::Function("LoadSceneChild_", &LoadSceneChild_));
    ns.AddFunction(mluabind::Function("GetClipTime", &GetClipTime));
    ns.AddFunction(mluabind::Function("Clip_GetObjectById", &Clip_GetObjectById));
    ns.AddFunction(mluabind::Function("TryAlpha", &TryAlpha));
    ns.AddFunction(mluabind::Function("StartLevel", &StartLevel));
    ns.AddFunction(mluabind::Function("RunObjectScript", &RunObjectScript));
    return ns;
}

void BindFramework(mluabind::CHost& host)
{
    ox::core::BindOX(host);
}

void BindMissingGeometry(mluabind::CHost& host)
{
    if (host.FindClass(typeid(ox::misc::IntVector)))
        return;
    auto vector = [](auto tag, const char* name) {
        using V = decltype(tag);
        using T = decltype(V::X);
        return &Class<V>(name).template Constructor<>().template Constructor<T, T>().Member("X", &V::X).Member("Y", &V::Y);
    };
    host.BeginBinding();
    mluabind::Namespace misc("ox.misc");
    misc.AddClass(*vector(ox::misc::IntVector(), "IntVector"));
    misc.AddClass(*vector(ox::misc::FloatVector(), "FloatVector"));
    host.Bind(misc);
    host.EndBinding();
}

namespace {
std::function<void(ox::lua::CLua&)>& LevelBinder()
{
    static std::function<void(ox::lua::CLua&)> binder;
    return binder;
}
} // namespace

void SetLevelBinder(std::function<void(ox::lua::CLua&)> binder) { LevelBinder() = std::move(binder); }

int StartLevel(ox::lua::CLua* lua, ox::gui::CWindow* window, CLevel* level, const std::string& a,
               const ox::core::CSettings* settings, const std::string& initScript, const ox::wstring& b,
               const std::string& c, bool d)
{
    OX_CHECK_DATA(lua != nullptr, 0);
    // Quest classes derive from framework classes, which must be known first.
    if (!lua->FindClass(typeid(ox::lua::CLua)))
        BindFramework(*lua);
    BindMissingGeometry(*lua);
    lua->BeginBinding();
    lua->Bind(BindQuestClasses());
    lua->EndBinding();
    if (LevelBinder())
        LevelBinder()(*lua);
    lua->Run("__g_InitScript = function () " + initScript + " end");
    lua->LoadScript("scripts/game_engine/quest.lua");
    return ox::lua::CallLuaFunction<int>(lua, "quest.StartLevel", window, level, a, settings, b, c, d);
}

} // namespace qe
