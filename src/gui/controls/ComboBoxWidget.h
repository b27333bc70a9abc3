#pragma once
// A combo box: a label showing the chosen line over a back image, a button that opens a list
// of lines below them (or above, when the canvas has more room there), and the list. A line
// picked in the list closes it and becomes the label's text; the parent hears "list_showed"
// when the list opens and "line_selected" when a line is chosen. A press anywhere but on the
// box closes an open list.
#include "gui/Widget.h"

#include <string>

namespace ox::gui {

class CButtonWidget;
class CImageWidget;
class CLabelWidget;
class CListWidget;

class CComboBoxWidget : public CWidget {
public:
    CComboBoxWidget();
    ~CComboBoxWidget() override;

    // The combobox_template (sounds, label insets, back image) and, read from the same
    // template, the button's, label's and list's own keys; the widget's own reading; then
    // the element's list_height, strings and selected (told).
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    bool ReadsChildElement(std::string_view element) const override { return element == "strings"; }
    // The height given is the box's; an open list adds its own.
    void SetSize(float width, float height) override;
    // The widest of the list's lines, the back image and the label, plus the button; the
    // highest of back image, button and label.
    FloatVector GetPreferredSize() const override;
    void OnChildAction(const std::string& action, CWidget* sender) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;

    // The list's lines.
    void AddLine(const wstring& text);
    void RemoveLine(int index);
    // Empties the list and the label (which is told).
    void ClearLines();
    int EnumLines() const;
    wstring GetLine(int index) const;
    void SetLine(int index, const wstring& text);
    int FindLine(const wstring& text) const;
    // Told back through the list when `notify`; otherwise the list closes and the label
    // shows the line silently.
    void SelectLine(int index, bool notify);
    int GetSelectedLine() const;
    void ShowList(bool show);
    bool IsListShown() const;
    wstring GetText() const;
    // "line_selected" to the parent.
    virtual void OnLineSelected();

    CButtonWidget* GetButton() const;
    CLabelWidget* GetLabel() const;
    CListWidget* GetList() const;
    CImageWidget* GetBack() const;

private:
    // The label's text, told to the parent when `notify`.
    void SetText(const wstring& text, bool notify);
    // Sizes the widget to the box and, while it shows, the list, and places the parts.
    void Arrange();
    // The list's height and whether it opens upwards, by the room on the canvas.
    void ChooseListPlace();
    void ComeToFront();

    WidgetPtrT m_Back;
    WidgetPtrT m_Button;
    WidgetPtrT m_Label;
    WidgetPtrT m_List;
    std::string m_OpenSound;
    std::string m_SelectSound;
    float m_BoxHeight = 0;
    float m_ListHeight = 0;
    // While the list opens upwards, the widget stands this much higher than its box.
    float m_Raised = 0;
    bool m_OpenUp = false;
    // A press on the button toggles the list on its way down; the "pressed" that its
    // release then tells is the same press.
    bool m_ToggledByPress = false;
};

} // namespace ox::gui
