#include "quest/SceneGroup.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "quest/QuestServices.h"
#include "quest/TreeEdit.h"

#include <algorithm>

namespace qe {

namespace {

constexpr const char* kChannel = "quest";

bool IsHidden(const CBaseSceneObject& object) { return object.ReadObjectFlag(CBaseSceneObject::ObjectFlagHidden); }

} // namespace

CSceneGroup::~CSceneGroup()
{
    for (const BaseSceneObjectPtrT& child : m_Childs)
        if (child->GetParentGroup() == this)
            child->SetParentGroup(nullptr);
}

FloatVector CSceneGroup::GetPos() const
{
    FloatVector visible, all;
    int visibleCount = 0;
    for (const BaseSceneObjectPtrT& child : m_Childs) {
        const FloatVector pos = child->GetPos();
        all += pos;
        if (!IsHidden(*child)) {
            visible += pos;
            ++visibleCount;
        }
    }
    if (visibleCount > 0)
        return visible * (1.0f / visibleCount);
    return m_Childs.empty() ? FloatVector() : all * (1.0f / m_Childs.size());
}

void CSceneGroup::Update()
{
    for (auto it = m_Childs.rbegin(); it != m_Childs.rend(); ++it)
        (*it)->Update();
}

void CSceneGroup::DrawTransformed(ox::graphics::CRenderer* renderer)
{
    for (auto it = m_Childs.rbegin(); it != m_Childs.rend(); ++it) {
        CBaseSceneObject& child = **it;
        if (!IsHidden(child) || child.GetAlpha() > kNoFade)
            child.DrawGame(renderer);
    }
}

BaseSceneObjectPtrT CSceneGroup::Clone() const
{
    SceneGroupPtrT clone(new CSceneGroup());
    CopyTo(*clone);
    for (const BaseSceneObjectPtrT& child : m_Childs)
        if (BaseSceneObjectPtrT copy = child->Clone())
            clone->InsertChild(std::move(copy), clone->m_Childs.empty() ? nullptr : clone->m_Childs.back().get());
    return clone;
}

bool CSceneGroup::Holds(const CBaseSceneObject* node) const
{
    for (const BaseSceneObjectPtrT& child : m_Childs) {
        if (child.get() == node)
            return true;
        if (child->GetType() == GroupType && static_cast<const CSceneGroup&>(*child).Holds(node))
            return true;
    }
    return false;
}

bool CSceneGroup::InsertChild(BaseSceneObjectPtrT child, const CBaseSceneObject* after)
{
    OX_CHECK_DATA(child, false);
    const bool cycle = child.get() == this || IsWithin(child.get()) ||
                       (child->GetType() == GroupType && static_cast<const CSceneGroup&>(*child).Holds(this));
    if (cycle) {
        OX_LOG(kChannel, ox::diag::LogError, "Group '%s' can't take '%s' as a state: the group lies inside it",
               GetIdRef().c_str(), child->GetIdRef().c_str());
        return false;
    }
    child->SetParentGroup(this);
    InsertBehind(m_Childs, std::move(child), after);
    return true;
}

void CSceneGroup::RemoveChild(CBaseSceneObject& child)
{
    auto found = std::find_if(m_Childs.begin(), m_Childs.end(), [&child](const auto& p) { return p.get() == &child; });
    if (found == m_Childs.end())
        return;
    BaseSceneObjectPtrT hold = *found;
    RemoveEvery(m_Childs, child);
    if (child.GetParentGroup() == this)
        child.SetParentGroup(nullptr);
}

CBaseSceneObject* CSceneGroup::GetStateById(const std::string& id) const
{
    for (const BaseSceneObjectPtrT& child : m_Childs)
        if (child->GetIdRef() == id)
            return child.get();
    return nullptr;
}

bool CSceneGroup::IsCurrent(const std::string& id) const
{
    for (const BaseSceneObjectPtrT& child : m_Childs)
        if (child->GetIdRef() == id && !IsHidden(*child))
            return true;
    return false;
}

std::string CSceneGroup::GetFirstVisibleState() const
{
    for (const BaseSceneObjectPtrT& child : m_Childs)
        if (!IsHidden(*child))
            return child->GetIdRef();
    return {};
}

void CSceneGroup::SetCurrent(const std::string& id, bool holdFirst, float time, const ox::core::CGroupTimer* timer)
{
    const auto& fade = GetQuestServices().startFade;
    const bool fading = time > 0.01f && fade;
    for (auto it = m_Childs.rbegin(); it != m_Childs.rend(); ++it) {
        CBaseSceneObject& child = **it;
        const bool appear = child.GetIdRef() == id;
        // The first fade made holds its state if asked; every later one fades.
        if (fading && IsHidden(child) == appear) {
            fade(child, appear, holdFirst, time, timer);
            holdFirst = false;
        }
        if (appear)
            child.ClearObjectFlag(ObjectFlagHidden);
        else
            child.RaiseObjectFlag(ObjectFlagHidden);
    }
}

void CSceneGroup::SetCurrentByNumber(int number)
{
    int at = 1;
    for (const BaseSceneObjectPtrT& child : m_Childs) {
        if (at++ == number)
            child->ClearObjectFlag(ObjectFlagHidden);
        else
            child->RaiseObjectFlag(ObjectFlagHidden);
    }
}

} // namespace qe
