#pragma once
// A texture in the widget's rectangle: stretched over it, fitted into it with its
// proportions, shrunk only when too large, or at its natural size, centred. An image takes
// no input and has no per-frame work of its own (it is born disabled).
#include "graphics/Image.h"
#include "gui/Widget.h"

namespace ox::gui {

class CImageWidget : public CWidget {
public:
    enum StretchType : int { StretchMaximum = 0, StretchProportional = 1, StretchOnlyDecrease = 2, StretchNo = 3 };

    CImageWidget();

    // The element's image; a width or height of 0 takes the image's.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    void SetSize(float width, float height) override;
    // The image's size with StretchNo, else (0, 0).
    FloatVector GetPreferredSize() const override;
    void DoDraw(graphics::CRenderer& renderer) override;

    // By declared id; an unknown id leaves no image.
    void SetImage(const char* id);
    void SetImage(const graphics::CTexture* texture);
    graphics::CImage& GetImage() { return m_Image; }
    const graphics::CImage& GetImage() const { return m_Image; }
    void SetStretchType(int type);
    int GetStretchType() const { return m_StretchType; }
    // Where the image is drawn, in the widget's coordinates.
    const misc::FloatRect& GetImageRect() const { return m_ImageRect; }

protected:
    // Where the image goes after a change of size, image or stretch.
    virtual void PlaceImage();
    void SetImageRect(const misc::FloatRect& rect) { m_ImageRect = rect; }

private:

    graphics::CImage m_Image;
    int m_StretchType = StretchMaximum;
    misc::FloatRect m_ImageRect;
};

} // namespace ox::gui
