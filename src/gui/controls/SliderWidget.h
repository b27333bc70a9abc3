#pragma once
// A slider from 0 to 1: a thumb image that runs along a bar image between the widget's left
// and right insets. A press on the thumb takes it, a press on the bar jumps it there, and
// while it is held it follows the pointer; the parent hears "value_changed".
#include "gui/Widget.h"
#include "gui/controls/ImageWidget.h"

#include <string>

namespace ox::gui {

class CSliderWidget : public CWidget {
public:
    CSliderWidget();

    // The slider_template (sound, insets, images), the widget's own reading, then the
    // element's value (not told).
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    // The thumb and bar images by declared id (empty: none); the widget takes the preferred
    // size.
    void SetImages(const char* thumb, const char* bar);
    // Only the width is taken: the height stays the preferred one.
    void SetSize(float width, float height) override;
    // The bar image's width by the higher of the two images.
    FloatVector GetPreferredSize() const override;

    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;

    // Clamped to 0 .. 1; told to the parent when `notify`.
    void SetValue(float value, bool notify);
    float GetValue() const { return m_Value; }
    bool IsDragging() const { return m_Dragging; }
    // "value_changed" to the parent.
    virtual void OnValueChanged();

    CImageWidget* GetThumb() const;
    CImageWidget* GetBar() const;

private:
    // Centres both images across the widget and places the thumb by the value.
    void Arrange();
    void PlaceThumb();
    // The value under a pointer's x, told when it changes it.
    void MoveTo(int x);

    WidgetPtrT m_Bar;
    WidgetPtrT m_Thumb;
    float m_Value = 0;
    bool m_Dragging = false;
    std::string m_Sound;
};

// An image that, pressed, tells its parent "selected" and takes the press.
class CThumbWidget : public CImageWidget {
public:
    CThumbWidget() { RemFlags(FlagDisabled); }
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
};

} // namespace ox::gui
