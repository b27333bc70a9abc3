#pragma once
// A scroll bar: a bar image between two arrow buttons, with a thumb (a button too, so that it
// has the button's states) whose length shows the page against the whole. The value runs
// from 0 to max - page; the arrows step it by the button value when released, a press on
// the bar pages towards the press, the thumb drags it and the wheel moves it. Every change
// tells the parent "value_changed".
#include "gui/Widget.h"

#include <string>

namespace ox::gui {

class CButtonWidget;
class CImageWidget;

class CScrollWidget : public CWidget {
public:
    explicit CScrollWidget(bool vertical = true);
    ~CScrollWidget() override;

    // The scroll_template (sounds, orientation, images), the widget's own reading, then the
    // element's max_value, page_size and value, in this order, and mouse_wheel_k.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    // The thumb, bar and arrow images by declared id (empty: none); the widget takes the
    // preferred size.
    void SetImages(const char* thumb, const char* back, const char* top, const char* bottom);
    // A vertical scroll keeps its width, a horizontal one its height, unless that is 0.
    void SetSize(float width, float height) override;
    // Along the axis the arrows and the longer of bar and thumb; across it the widest part.
    FloatVector GetPreferredSize() const override;

    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;

    // Clamped to 0 .. max - page; tells the parent, changed or not.
    void SetValue(float value);
    float GetValue() const { return m_Value; }
    // At least 1; the value keeps its place relative to the whole, and the page never
    // exceeds the max.
    void SetMaxValue(float value);
    float GetMaxValue() const { return m_MaxValue; }
    // Kept within 1 .. max.
    void SetPageSize(float value);
    float GetPageSize() const { return m_PageSize; }
    void SetButtonValue(float value) { m_ButtonValue = value; }
    float GetButtonValue() const { return m_ButtonValue; }
    void SetMouseWheelK(float k) { m_MouseWheelK = k; }
    float GetMouseWheelK() const { return m_MouseWheelK; }
    bool IsVertical() const { return m_Vertical; }
    // "value_changed" to the parent.
    virtual void OnValueChanged();

    CButtonWidget* GetThumb() const;
    CButtonWidget* GetTopButton() const;
    CButtonWidget* GetBottomButton() const;
    CImageWidget* GetBar() const;

private:
    // The coordinate of a vector along the scroll's axis, and a vector from both.
    float Along(const FloatVector& v) const { return m_Vertical ? v.Y : v.X; }
    float Across(const FloatVector& v) const { return m_Vertical ? v.X : v.Y; }
    FloatVector Make(float along, float across) const
    {
        return m_Vertical ? FloatVector(across, along) : FloatVector(along, across);
    }
    // Places the arrows at the ends and the bar between them, then fits the thumb.
    void Arrange();
    void FitThumb();
    void PlaceThumb();
    // The value within its range, or 0 when the page covers the whole.
    float Clamped(float value) const;

    WidgetPtrT m_Back;
    WidgetPtrT m_Top;
    WidgetPtrT m_Bottom;
    WidgetPtrT m_Thumb;
    float m_DragOffset = 0;
    float m_Value = 0;
    float m_MaxValue = 1;
    float m_PageSize = 1;
    float m_ButtonValue = 1;
    float m_MouseWheelK = 1;
    bool m_Vertical;
    std::string m_SoundOnDragAndDrop;
    std::string m_SoundOnButtonPress;
    std::string m_SoundOnSetValue;
};

} // namespace ox::gui
