#pragma once
// A list of single text lines over a background, with an optional vertical scroll bar that
// shows when the lines don't fit. The lines are labels the list holds, draws and hit-tests
// itself (they are not its children): a click selects one ("line_selected" to the parent),
// the pointer over one colours it, the wheel scrolls, and when the list has the focus the
// arrow, Home, End and page keys move the selection.
#include "graphics/Color.h"
#include "gui/Widget.h"

#include <string>
#include <vector>

namespace ox::graphics {
struct CFont;
}

namespace ox::gui {

class CImageWidget;
class CLabelWidget;
class CScrollWidget;

class CListWidget : public CWidget {
public:
    enum ListColors : int {
        ListColorTextNormal = 0,
        ListColorTextSelected = 1,
        ListColorTextOver = 2,
        ListColorSelection = 3,
    };

    CListWidget();
    ~CListWidget() override;

    // The list_template (sound, insets, line insets, colours, font, scroll bar, background,
    // justification), the widget's own reading, then the element's list_height and strings,
    // and last `selected` (0 when absent), which is told.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    bool ReadsChildElement(std::string_view element) const override { return element == "strings"; }
    void SetSize(float width, float height) override;
    // The widest line and the scroll bar within the insets, at least the background image;
    // with a font at least list_height lines high.
    FloatVector GetPreferredSize() const override;
    void DoDraw(graphics::CRenderer& renderer) override;
    void OnChildAction(const std::string& action, CWidget* sender) override;
    // A selection made while loading, before the list had a parent, is told to the parent.
    void SetParentWidget(CBaseWidget* parent) override;

    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;
    bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast) override;

    // Lines. Without a font nothing is added; indices out of range are ignored.
    void AddLine(const wstring& text);
    void RemoveLine(int index);
    void ClearLines();
    int EnumLines() const { return static_cast<int>(m_Lines.size()); }
    wstring GetLine(int index) const;
    void SetLine(int index, const wstring& text);
    // The first line equal to the text, or -1.
    int FindLine(const wstring& text) const;
    // -1 clears the selection; told to the parent when `notify`.
    void SelectLine(int index, bool notify);
    int GetSelectedLine() const { return m_SelectedLine; }
    int GetOverLine() const { return m_OverLine; }
    // By the Justify values (-1, 0, 1 on each axis), for every line.
    void SetLineJustifications(int horizontal, int vertical);
    void SetListColors(int index, const graphics::Color& color);
    const graphics::Color& GetListColor(int index) const;
    // Lines wanted in the preferred size; below 1 gives 5.
    void SetListHeight(int lines);
    int GetListHeight() const { return m_ListHeight; }
    // The height that shows n lines within the insets (0 without a font).
    float CalcHeightToFitLines(int lines) const;
    // The scroll bar's width, 0 without one.
    float GetScrollWidth() const;
    // The first line shown, through the scroll bar while it is in use; 0 otherwise.
    void SetScrollValue(int value);
    int GetScrollValue() const;
    // "line_selected" to the parent.
    virtual void OnLineSelected();

    void SetFont(const graphics::CFont* font);
    const graphics::CFont* GetFont() const { return m_Font; }
    CScrollWidget* GetScroll() const;
    CImageWidget* GetBackground() const;
    // The label of a line (null out of range).
    CLabelWidget* GetLineLabel(int index) const;
    float GetScrollOffset() const { return m_ScrollOffset; }
    // The height of a line: the font's and the line insets'.
    float LineHeight() const;

private:
    void MakeScroll(const std::string& templateId, const core::CSettingsGroup& templates);
    // Shows the scroll bar when the lines fill the list, hides it otherwise, and follows its
    // value; then lays out the lines from `from` on (all of them when the view moved).
    void FitScroll(size_t from = 0);
    // Insets, size and place of a line; the places alone of lines [from, to).
    void LayOutLine(size_t index);
    void PlaceLines(size_t from, size_t to);
    // Colours a line by whether it is under the pointer or selected.
    void Paint(int index);
    void SetOverLine(int index);
    // Whether a point of the list's own coordinates lies beside the lines, on the scroll bar.
    bool InScrollArea(const IntVector& pos) const;
    // The line under a point of the list's own coordinates, or -1.
    int LineAt(const IntVector& pos) const;
    // Moves the selection by keys and keeps it in view.
    void SelectAndShow(int index);

    WidgetPtrT m_Background;
    WidgetPtrT m_Scroll;
    const graphics::CFont* m_Font = nullptr;
    std::vector<WidgetPtrT> m_Lines;
    graphics::Color m_Colors[4];
    int m_ListHeight = 5;
    int m_HorzJustify = 0;
    int m_VertJustify = 0;
    int m_SelectedLine = -1;
    int m_OverLine = -1;
    float m_ScrollOffset = 0;
    std::string m_SelectSound;
    misc::FloatInsets m_LabelInsets;
    bool m_TellWhenAttached = false;
};

} // namespace ox::gui
