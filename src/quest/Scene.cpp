#include "quest/Scene.h"

#include "diag/Assert.h"
#include "graphics/Renderer.h"
#include "lua/Lua.h"
#include "quest/Level.h"
#include "quest/QuestServices.h"
#include "quest/SceneGroup.h"
#include "quest/TreeEdit.h"

namespace qe {

using ox::graphics::CRenderer;

namespace {

void AppendClickable(CScene::ObjectsListT& out, const BaseSceneObjectPtrT& object)
{
    if (object->GetType() != CBaseSceneObject::GroupType) {
        out.push_back(object);
        return;
    }
    for (const BaseSceneObjectPtrT& state : static_cast<const CSceneGroup&>(*object).Childs())
        AppendClickable(out, state);
}

CBaseSceneObject* LastWithId(const CScene::ObjectsListT& list, const std::string& id)
{
    for (auto it = list.rbegin(); it != list.rend(); ++it)
        if ((*it)->GetIdRef() == id)
            return it->get();
    return nullptr;
}

} // namespace

void CScene::RemoveObject(CBaseSceneObject& object) { RemoveEvery(m_Objects, object); }

void CScene::InsertObject(BaseSceneObjectPtrT object, const CBaseSceneObject* after)
{
    OX_CHECK_DATA(object);
    InsertBehind(m_Objects, std::move(object), after);
}

void CScene::RemoveArea(CBaseSceneObject& area) { RemoveEvery(m_Areas, area); }

void CScene::InsertArea(BaseSceneObjectPtrT area, const CBaseSceneObject* after)
{
    OX_CHECK_DATA(area);
    InsertBehind(m_Areas, std::move(area), after);
}

void CScene::UpdateTotalChildList()
{
    m_Childs.clear();
    for (const BaseSceneObjectPtrT& object : m_Objects)
        AppendClickable(m_Childs, object);
}

CBaseSceneObject* CScene::IsContentObject(const std::string& id) const { return LastWithId(m_Objects, id); }

CBaseSceneObject* CScene::IsContentArea(const std::string& id) const { return LastWithId(m_Areas, id); }

void CScene::RunSceneScript()
{
    if (m_Script.empty() || !DefineLevelFunction("quest.on_show_scene", "_current_scene", m_Script))
        return;
    ox::lua::CallLuaFunction(GetLevelLua(), "quest.on_show_scene", this);
}

void CScene::Update()
{
    for (auto it = m_Objects.rbegin(); it != m_Objects.rend(); ++it)
        (*it)->Update();
}

void CScene::UpdateGame()
{
    for (auto it = m_Objects.rbegin(); it != m_Objects.rend(); ++it)
        if (!(*it)->ReadObjectFlag(CBaseSceneObject::ObjectFlagRemoved))
            (*it)->Update();
}

void CScene::DrawGame(CRenderer* renderer)
{
    renderer->PushState();
    for (auto it = m_Objects.rbegin(); it != m_Objects.rend(); ++it) {
        CBaseSceneObject& object = **it;
        const bool hidden = object.ReadObjectFlag(CBaseSceneObject::ObjectFlagHidden);
        if (object.ReadObjectFlag(CBaseSceneObject::ObjectFlagRemoved) ||
            (hidden && object.GetAlpha() <= CBaseSceneObject::kNoFade))
            continue;
        object.DrawGame(renderer);
    }
    if (m_ParentLevel && m_ParentLevel->GetShowChildSceneAreas())
        for (auto it = m_Areas.rbegin(); it != m_Areas.rend(); ++it)
            (*it)->Draw(renderer);
    renderer->PopState();
}

void CScene::Draw(CRenderer* renderer)
{
    renderer->PushState();
    for (auto it = m_Objects.rbegin(); it != m_Objects.rend(); ++it)
        (*it)->DoDrawForEditor(renderer);
    renderer->PopState();
}

void CScene::DrawInEditor(CRenderer* renderer)
{
    renderer->PushState();
    renderer->ApplyMatrix(ox::misc::MatrixTranslation(m_Offset.X, m_Offset.Y));
    renderer->RenderRect({0, 0, m_Size.X, m_Size.Y}, Color(0xFFFFFFFFu));
    Draw(renderer);
    for (auto it = m_Areas.rbegin(); it != m_Areas.rend(); ++it) {
        // An area draws its points where they are; this undoes the move to its position.
        const FloatVector pos = (*it)->GetPos();
        renderer->PushState();
        renderer->ApplyMatrix(ox::misc::MatrixTranslation(-pos.X, -pos.Y));
        (*it)->DoDrawForEditor(renderer);
        renderer->PopState();
    }
    renderer->PopState();
}

CBaseSceneObject* CScene::GetObjectAt(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const
{
    for (const BaseSceneObjectPtrT& object : m_Childs)
        if (object->CanTakeClick() && object->IsContains(point, masks))
            return object.get();
    for (const BaseSceneObjectPtrT& area : m_Areas)
        if (!area->ReadObjectFlag(CBaseSceneObject::ObjectFlagDisable) && area->IsContains(point, masks))
            return area.get();
    return nullptr;
}

ScenePtrT CScene::Clone() const
{
    ScenePtrT clone(new CScene());
    clone->m_Id = m_Id;
    clone->m_Size = m_Size;
    clone->m_Offset = m_Offset;
    clone->m_Flags = m_Flags;
    clone->m_Script = m_Script;
    clone->m_ParentLevel = m_ParentLevel;
    for (const BaseSceneObjectPtrT& area : m_Areas)
        if (BaseSceneObjectPtrT copy = area->Clone())
            clone->m_Areas.push_back(std::move(copy));
    for (const BaseSceneObjectPtrT& object : m_Objects)
        if (BaseSceneObjectPtrT copy = object->Clone())
            clone->m_Objects.push_back(std::move(copy));
    clone->UpdateTotalChildList();
    return clone;
}

} // namespace qe
