#include "gui/Widget.h"

#include "gui/Description.h"

#include <climits>

namespace ox::gui {

namespace {

// One axis of a parent's resize: `start` and `end` are the anchors at the near and far edge.
void FollowParent(bool start, bool end, float parent, float oldParent, float& pos, float& size)
{
    const float farMargin = oldParent - (pos + size);
    if (start && end) {
        size = parent - farMargin - pos;
    } else if (end) {
        pos = parent - farMargin - size;
    } else if (!start && oldParent != 0) {
        const float ratio = parent / oldParent;
        pos *= ratio;
        size *= ratio;
    }
}

} // namespace

CWidget::CWidget(std::string_view id, uint32_t layer, uint32_t broadcastMask)
    : CBaseWidget(id), m_Layer(layer), m_BroadcastMask(broadcastMask)
{
}

misc::FloatVector CWidget::GetAbsPos(bool toScreen) const
{
    return m_ParentWidget ? m_ParentWidget->GetAbsPos(toScreen) + GetOffset() : GetOffset();
}

void CWidget::SetChildFocused(CWidget* child)
{
    if (m_ParentWidget)
        m_ParentWidget->SetChildFocused(child);
}

void CWidget::OnChildAction(const std::string& action, CWidget* sender)
{
    if (m_ParentWidget)
        m_ParentWidget->OnChildAction(action, sender);
}

void CWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CBaseWidget::Load(node, templates);
    int layer = 0;
    if (ReadChecked(node, "layer", layer, INT_MIN, INT_MAX))
        m_Layer = static_cast<uint32_t>(layer);
}

void CWidget::OnParentSizeChanged(float oldWidth, float oldHeight)
{
    OX_ASSERT(m_ParentWidget != 0);
    if (!m_ParentWidget)
        return;
    const FloatVector parent = m_ParentWidget->GetSize();
    FloatVector offset = GetOffset(), size = GetSize();
    FollowParent(m_Anchors & AnchorLeft, m_Anchors & AnchorRight, parent.X, oldWidth, offset.X, size.X);
    FollowParent(m_Anchors & AnchorTop, m_Anchors & AnchorBottom, parent.Y, oldHeight, offset.Y, size.Y);
    if (!(offset == GetOffset()))
        SetOffset(offset.X, offset.Y);
    if (!(size == GetSize()))
        SetSize(size.X, size.Y);
}

void CWidget::SetLayer(uint32_t layer)
{
    m_Layer = layer;
    if (m_ParentWidget)
        m_ParentWidget->OnChildLayerChanged(this);
}

uint32_t CWidget::GetChildrenBroadcastMask() const
{
    if (m_ChildrenMaskKnown)
        return m_ChildrenMask;
    uint32_t mask = m_BroadcastMask;
    for (const WidgetPtrT& child : GetWidgets())
        mask |= child->GetChildrenBroadcastMask();
    m_ChildrenMask = mask;
    m_ChildrenMaskKnown = true;
    return mask;
}

void CWidget::SetBroadcastMask(uint32_t mask)
{
    m_BroadcastMask = mask;
    OnChildrenMaskChanged();
}

void CWidget::OnChildrenMaskChanged()
{
    // A parent knows its mask only while its children know theirs: the walk up ends at the
    // first widget that doesn't know.
    if (!m_ChildrenMaskKnown)
        return;
    m_ChildrenMaskKnown = false;
    if (m_ParentWidget)
        m_ParentWidget->OnChildrenMaskChanged();
}

void CWidget::LayInFront(const CWidget& other)
{
    OX_ASSERT(m_ParentWidget);
    if (m_ParentWidget)
        m_ParentWidget->LayChildWidgetInFront(*this, other);
}

} // namespace ox::gui
