#pragma once
// An image that takes the mouse only on its opaque pixels: a click on a transparent corner
// goes to what lies under it. A move over an opaque pixel tells the parent "mouse_move".
#include "gui/controls/ImageWidget.h"

namespace ox::gui {
class CWidgetFactory;
}

namespace qe {

class CAlphaImageWidget : public ox::gui::CImageWidget {
public:
    CAlphaImageWidget();

    // As an image, then the texture's pixel copy is made.
    void Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast) override;

    // The mask of the texture if the mask store has one, else the pixel of the first frame
    // under `pos` (in the widget's coordinates, through where the image is drawn).
    bool IsOpaqueAt(const IntVector& pos) const;
};

// Enters the widget under alpha_image_widget.
void RegisterAlphaImageWidget(ox::gui::CWidgetFactory& factory);

} // namespace qe
