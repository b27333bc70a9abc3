#include "quest/ObjectsBox.h"

#include "quest/SceneGroup.h"

#include <algorithm>

namespace qe {

namespace {

CSceneGroup* AsGroup(CBaseSceneObject* object)
{
    return object && object->GetType() == CBaseSceneObject::GroupType ? static_cast<CSceneGroup*>(object) : nullptr;
}

CSceneObject* AsState(CBaseSceneObject* object)
{
    return object && object->GetType() == CBaseSceneObject::ObjectType ? static_cast<CSceneObject*>(object) : nullptr;
}

} // namespace

CBaseSceneObject* FindReservedState(CBaseSceneObject* object, const char* first, const char* second)
{
    CSceneGroup* group = AsGroup(object);
    if (!group)
        return object;
    CBaseSceneObject *byFirst = nullptr, *bySecond = nullptr, *visible = nullptr;
    for (const BaseSceneObjectPtrT& state : group->Childs()) {
        const std::string& id = state->GetIdRef();
        if (!byFirst && id == first)
            byFirst = state.get();
        else if (!bySecond && id == second)
            bySecond = state.get();
        if (!visible && !state->ReadObjectFlag(CBaseSceneObject::ObjectFlagHidden))
            visible = state.get();
    }
    if (byFirst || bySecond || visible)
        return byFirst ? byFirst : bySecond ? bySecond : visible;
    return group->Childs().empty() ? nullptr : group->Childs().front().get();
}

CSceneObject* FindObjectInventCondition(CBaseSceneObject* object)
{
    return AsState(FindReservedState(object, kInventoryState, kCursorState));
}

CSceneObject* FindObjectCursorInventState(CBaseSceneObject* object)
{
    CSceneGroup* group = AsGroup(object);
    return group ? AsState(group->GetStateById(kCursorState)) : nullptr;
}

BoxItem* CObjectsBox::GetObject(unsigned index)
{
    if (index >= m_Objects.size())
        return nullptr;
    return &*std::next(m_Objects.begin(), index);
}

bool CObjectsBox::FindObjectInBox(const std::string& id) const
{
    return std::any_of(m_Objects.begin(), m_Objects.end(),
                       [&](const BoxItem& item) { return item.Item && item.Item->GetIdRef() == id; });
}

void CObjectsBox::InsertObject(BaseSceneObjectPtrT object, const CBaseSceneObject* after)
{
    BoxItem item {object, FindObjectInventCondition(object.get())};
    auto it = std::find_if(m_Objects.begin(), m_Objects.end(),
                           [&](const BoxItem& held) { return after && held.Item.get() == after; });
    if (it == m_Objects.end())
        m_Objects.push_front(std::move(item));
    else
        m_Objects.insert(std::next(it), std::move(item));
}

void CObjectsBox::RemoveObject(const std::string& id)
{
    m_Objects.remove_if([&](const BoxItem& item) { return item.Item && item.Item->GetIdRef() == id; });
}

void CObjectsBox::ShowState(BoxItem& item, CBaseSceneObject& state)
{
    static_cast<CSceneGroup&>(*item.Item).SetCurrent(state.GetIdRef(), false, 0.0f, nullptr);
    item.InventState = AsState(&state);
}

void CObjectsBox::SetItemNextState(const std::string& id)
{
    for (BoxItem& item : m_Objects) {
        CSceneGroup* group = AsGroup(item.Item.get());
        if (!group || item.Item->GetIdRef() != id || !item.InventState)
            continue;
        const std::string current = item.InventState->GetIdRef();
        const auto& states = group->Childs();
        auto it = std::find_if(states.begin(), states.end(),
                               [&](const BaseSceneObjectPtrT& state) { return state->GetIdRef() == current; });
        if (it != states.end() && std::next(it) != states.end())
            ShowState(item, **std::next(it));
    }
}

void CObjectsBox::SetItemStateById(const std::string& id, const std::string& state)
{
    for (BoxItem& item : m_Objects) {
        CSceneGroup* group = AsGroup(item.Item.get());
        if (!group || item.Item->GetIdRef() != id)
            continue;
        if (CBaseSceneObject* found = group->GetStateById(state))
            ShowState(item, *found);
    }
}

} // namespace qe
