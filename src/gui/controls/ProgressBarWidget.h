#pragma once
// A bar that fills from the left: a frame image under a bar image that is cut to the value's
// share of the width (the bar keeps its full-width look; only the part up to the value shows).
#include "gui/Widget.h"

namespace ox::gui {

class CImageWidget;

class CProgressBarWidget : public CWidget {
public:
    CProgressBarWidget();

    // The element's frame and progress images and value; a width or height below 0.001
    // takes the frame's (or else the bar's) image size.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    void SetSize(float width, float height) override;

    // By declared texture ids.
    void SetImages(const char* frame, const char* bar);
    // Clamped to 0 .. 1.
    void SetValue(float value);
    float GetValue() const { return m_Value; }
    CImageWidget* GetFrame() const;
    CImageWidget* GetBar() const;

private:
    void PlaceBar();

    WidgetPtrT m_Frame;
    WidgetPtrT m_Bar;
    float m_Value = 0;
};

} // namespace ox::gui
