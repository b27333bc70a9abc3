#include "gui/controls/ToolbarWidget.h"

#include "gui/controls/ControlSupport.h"

namespace ox::gui {

CToolbarWidget::CToolbarWidget() : CWidget({}, LayerTop, BroadcastOnMouseMove | BroadcastOnMouseUp) {}

void CToolbarWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    ReadImage(node, "back_image", m_Back);
    CWidget::Load(node, templates);
    TakeNaturalSize(*this, m_Back.GetTextureSize());
}

void CToolbarWidget::DoDraw(graphics::CRenderer& renderer)
{
    m_Back.Draw(renderer, misc::FloatRect(0, 0, GetSize().X, GetSize().Y));
    CWidget::DoDraw(renderer);
}

bool CToolbarWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    const bool handled = CWidget::OnMouseDown(pos, button, keys, broadcast);
    if (handled || broadcast)
        return handled;
    // Nothing on the toolbar took the press: the toolbar itself is taken.
    m_Dragging = true;
    m_DragStart = pos;
    return true;
}

bool CToolbarWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (!m_Dragging)
        return CWidget::OnMouseMove(pos, keys, broadcast);
    // The broadcast pass brings every move, over the toolbar or not: it moves the toolbar.
    if (broadcast) {
        const FloatVector to = GetOffset() + FloatVector(static_cast<float>(pos.X - m_DragStart.X),
                                                         static_cast<float>(pos.Y - m_DragStart.Y));
        SetOffset(to.X, to.Y);
    }
    return true;
}

bool CToolbarWidget::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    m_Dragging = false;
    return CWidget::OnMouseUp(pos, button, keys, broadcast);
}

} // namespace ox::gui
