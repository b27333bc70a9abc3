#pragma once
// A picture in a frame: the content image inside the insets, clipped to them and placed by
// the element's `stretch` (no, fit, width, height, fill), with a nine-part frame around it.
// A press tells the parent "on_mouse_down".
#include "graphics/Image.h"
#include "gui/Widget.h"

namespace ox::gui {

class CImageBoxWidget : public CWidget {
public:
    enum Stretch : int { StretchNone = 0, StretchFit = 1, StretchWidth = 2, StretchHeight = 3, StretchFill = 4 };

    // The imagebox_template's insets and frame_image; the element's image and stretch.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    void DoDraw(graphics::CRenderer& renderer) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;

    void SetImage(const char* id) { m_Content.SetTexture(id ? id : ""); }
    void SetStretch(int stretch) { m_Stretch = stretch; }
    // Where the content goes, in the widget's coordinates (it may pass the insets: it is clipped).
    misc::FloatRect GetContentRect() const;

private:
    graphics::CImage m_Frame;
    graphics::CImage m_Content;
    int m_Stretch = StretchFit;
};

} // namespace ox::gui
