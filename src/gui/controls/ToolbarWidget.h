#pragma once
// A row of buttons on a background that the player can drag about as a group: a press on
// the toolbar's own area (not on one of its children) starts the drag.
#include "graphics/Image.h"
#include "gui/Widget.h"

namespace ox::gui {

class CToolbarWidget : public CWidget {
public:
    CToolbarWidget();

    // The element's back_image; a size of 0 takes the image's.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    void DoDraw(graphics::CRenderer& renderer) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;

    bool IsDragging() const { return m_Dragging; }

private:
    graphics::CImage m_Back;
    bool m_Dragging = false;
    IntVector m_DragStart;
};

} // namespace ox::gui
