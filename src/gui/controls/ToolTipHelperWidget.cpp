#include "gui/controls/ToolTipHelperWidget.h"

#include "gui/Window.h"
#include "gui/controls/ControlSupport.h"

namespace ox::gui {

namespace {

// The window a widget belongs to: the first parent that is one.
CWindow* OwningWindow(CWidget& widget)
{
    CBaseWidget* parent = widget.GetParentWidget();
    while (parent) {
        if (auto* window = dynamic_cast<CWindow*>(parent))
            return window;
        auto* inner = dynamic_cast<CWidget*>(parent);
        parent = inner ? inner->GetParentWidget() : nullptr;
    }
    return nullptr;
}

} // namespace

CToolTipHelperWidget::CToolTipHelperWidget(const wstring& text)
    : CWidget(kId, LayerTop, BroadcastOnMouseMove), m_Text(text), m_Timer(core::GetTimeManager().AttachTimer(nullptr))
{
    SetAnchors(AnchorLeft | AnchorRight | AnchorTop | AnchorBottom);
}

bool CToolTipHelperWidget::OnMouseMove(const IntVector& pos, int /*keys*/, bool /*broadcast*/)
{
    if (IsInside(*this, pos)) {
        if (!m_Shown) {
            if (!m_Hovering)
                m_HoverStartTime = TimerNow(m_Timer);
            m_Hovering = true;
            m_LastPos = pos;
        }
        return false;
    }
    if (m_Shown) {
        if (CWindow* window = OwningWindow(*this))
            window->HideToolTip();
        m_Shown = false;
    }
    m_Hovering = false;
    return false;
}

void CToolTipHelperWidget::DoUpdate()
{
    if (!m_Hovering || m_Shown || TimerNow(m_Timer) - m_HoverStartTime <= kDelay)
        return;
    m_Hovering = false;
    CWindow* window = OwningWindow(*this);
    // Not while another window lies over this one.
    if (!window || window->GetChildWindow())
        return;
    const FloatVector at = GetAbsPos(false) + FloatVector(static_cast<float>(m_LastPos.X), static_cast<float>(m_LastPos.Y) + 30);
    window->ShowToolTip(at, m_Text);
    m_Shown = true;
}

} // namespace ox::gui
