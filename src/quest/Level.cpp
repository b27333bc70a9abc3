#include "quest/Level.h"

#include "diag/Assert.h"
#include "lua/Lua.h"
#include "quest/QuestServices.h"
#include "quest/SceneGroup.h"
#include "quest/TreeEdit.h"

#include <algorithm>

namespace qe {

namespace {

const std::string& Slot(const std::string* slots, int count, int index)
{
    static const std::string none;
    return index >= 0 && index < count ? slots[index] : none;
}

// The first state with this id in a group, at any depth.
CBaseSceneObject* FindState(const CSceneGroup& group, const std::string& id)
{
    for (const BaseSceneObjectPtrT& state : group.Childs()) {
        if (state->GetIdRef() == id)
            return state.get();
        if (state->GetType() == CBaseSceneObject::GroupType)
            if (CBaseSceneObject* found = FindState(static_cast<const CSceneGroup&>(*state), id))
                return found;
    }
    return nullptr;
}

} // namespace

CLevel::~CLevel()
{
    if (const auto& clear = GetQuestServices().clearEffects)
        clear();
}

void CLevel::InsertScene(ScenePtrT scene, const CScene* after)
{
    OX_CHECK_DATA(scene);
    scene->SetParentLevel(this);
    InsertBehind(m_Scenes, std::move(scene), after);
}

void CLevel::RemoveScene(CScene& scene) { RemoveEvery(m_Scenes, scene); }

const std::string& CLevel::GetLuaScript(int index) const { return Slot(m_Scripts, ScriptCount, index); }

void CLevel::SetLuaScript(const std::string& script, int index)
{
    if (index >= 0 && index < ScriptCount)
        m_Scripts[index] = script;
}

const std::string& CLevel::GetSound(int index) const { return Slot(m_Sounds, SoundCount, index); }

void CLevel::SetSound(const std::string& sound, int index)
{
    if (index >= 0 && index < SoundCount)
        m_Sounds[index] = sound;
}

CScene* CLevel::GetSceneById(const std::string& id) const
{
    for (const ScenePtrT& scene : m_Scenes)
        if (scene->GetId() == id)
            return scene.get();
    return nullptr;
}

void CLevel::UpdateLinks()
{
    for (const ScenePtrT& scene : m_Scenes)
        scene->SetParentLevel(this);
}

CBaseSceneObject* CLevel::FindObjectById(const std::string& id, bool inGroups, bool withRemoved) const
{
    for (const ScenePtrT& scene : m_Scenes) {
        for (const BaseSceneObjectPtrT& object : scene->Objects()) {
            if (!withRemoved && object->ReadObjectFlag(CBaseSceneObject::ObjectFlagRemoved))
                continue;
            if (object->GetIdRef() == id)
                return object.get();
            if (inGroups && object->GetType() == CBaseSceneObject::GroupType)
                if (CBaseSceneObject* found = FindState(static_cast<const CSceneGroup&>(*object), id))
                    return found;
        }
        for (const BaseSceneObjectPtrT& area : scene->Areas())
            if (area->GetIdRef() == id)
                return area.get();
    }
    return nullptr;
}

void CLevel::RemoveObject(const std::string& id)
{
    CScene* owner = nullptr;
    BaseSceneObjectPtrT found;
    for (const ScenePtrT& scene : m_Scenes)
        for (const BaseSceneObjectPtrT& object : scene->Objects())
            if (object->GetIdRef() == id) {
                owner = scene.get();
                found = object;
            }
    if (!found)
        return;
    if (m_FocusedObject && m_FocusedObject->IsWithin(found.get())) {
        m_FocusedObject.reset();
        RefreshHint(nullptr);
    }
    owner->RemoveObject(*found);
    owner->UpdateTotalChildList();
}

void CLevel::UpdateFocusedObject(CBaseSceneObject* object)
{
    if (object == m_FocusedObject.get())
        return;
    const auto& runScript = GetQuestServices().runMouseScript;
    if (m_FocusedObject && runScript)
        runScript(*m_FocusedObject, CBaseSceneObject::ScriptMouseLeave);
    ox::lua::CLua* lua = GetLevelLua();
    if (object) {
        if (runScript)
            runScript(*object, CBaseSceneObject::ScriptMouseEnter);
        const CBaseSceneObject* cursorOwner = object->GetParentGroup() ? object->GetParentGroup() : object;
        if (lua)
            ox::lua::CallLuaFunction(lua, "cursor_lua_widget.SetGameCursor", cursorOwner->GetIdRef());
    } else if (m_FocusedObject && lua) {
        ox::lua::CallLuaFunction(lua, "cursor_lua_widget.DropGameCursor");
    }
    RefreshHint(object);
    m_FocusedObject = object;
}

void CLevel::UpdateHint(CBaseSceneObject* object)
{
    if (object && object == m_FocusedObject.get())
        RefreshHint(object);
}

void CLevel::RefreshHint(const CBaseSceneObject* object) const
{
    const auto& setHint = GetQuestServices().setHintText;
    if (!setHint)
        return;
    std::string hint = object ? object->GetHint() : std::string();
    if (object && hint.empty() && object->GetParentGroup())
        hint = object->GetParentGroup()->GetHint();
    setHint(hint);
}

void CLevel::RunScript(const std::string& script)
{
    if (script.empty() || !DefineLevelFunction("quest.on_box_take", "", script))
        return;
    ox::lua::CallLuaFunction(GetLevelLua(), "quest.on_box_take");
}

void CLevel::RunLevelScript() { RunScript(m_Scripts[ScriptLevel]); }

void CLevel::RunStartLevelScript() { RunScript(m_Scripts[ScriptStart]); }

LevelPtrT CLevel::Clone() const
{
    LevelPtrT clone(new CLevel());
    clone->m_Id = m_Id;
    std::copy(std::begin(m_Sounds), std::end(m_Sounds), std::begin(clone->m_Sounds));
    std::copy(std::begin(m_Scripts), std::end(m_Scripts), std::begin(clone->m_Scripts));
    clone->m_ShowChildSceneAreas = m_ShowChildSceneAreas;
    for (const ScenePtrT& scene : m_Scenes) {
        ScenePtrT copy = scene->Clone();
        copy->SetParentLevel(clone.get());
        clone->m_Scenes.push_back(std::move(copy));
    }
    return clone;
}

} // namespace qe
