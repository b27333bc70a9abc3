#pragma once
// A text box of one line or many: a caret, a selection by mouse and by Shift with the moving
// keys, the clipboard through the platform, undo and redo, a limit on the length and two
// optional scroll bars. Every place in the text is asked of the text renderer; the widget
// never measures a character itself. It tells its parent "text_changed", "got_focus" and
// "lost_focus".
#include "graphics/Color.h"
#include "gui/StateHistory.h"
#include "gui/Widget.h"
#include "misc/Rect.h"

namespace ox::graphics {
struct CFont;
}

namespace ox::gui {

class CImageWidget;

class CEditWidget : public CWidget {
public:
    enum EditColors : int { ColorText = 0, ColorSelectedText = 1, ColorSelection = 2, ColorCount = 3 };
    static constexpr uint32_t kHistoryLimit = 40;

    CEditWidget();
    ~CEditWidget() override;

    // The edit_template's font, justification, colours, insets, caret and back images; the
    // element's text, max_chars and multiline. The size grows to hold the back image and one
    // line of text within the insets.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    FloatVector GetPreferredSize() const override;
    void SetSize(float width, float height) override;
    void DoDraw(graphics::CRenderer& renderer) override;

    bool OnChar(wchar character, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    // The caret shows only with the focus; losing it collapses the selection.
    void SetFocused(bool focused) override;

    // The text, cut to the limit, becomes the newest state of the history.
    void SetText(const wstring& text);
    const wstring& GetText() const { return m_Text; }
    // Both ends clamped to the text and put in order.
    void SelectText(int start, int end);
    int GetSelectionStart() const { return m_SelectionStart; }
    int GetSelectionEnd() const { return m_SelectionEnd; }
    int GetCursorPos() const { return m_CursorPos; }
    // Puts the caret before the character `index` (clamped), scrolling it into view if asked.
    void MoveCursor(int index, bool scrollIntoView);
    // The index of the caret place nearest to a point in the widget's coordinates.
    int GetIndexByPos(const IntVector& pos);
    // -1 left, 0 centre, 1 right; any other value changes nothing.
    void SetTextJustification(int justification);
    // 0 is no limit.
    void SetMaxChars(unsigned maxChars);
    unsigned GetMaxChars() const { return m_MaxChars; }
    void SetEditColors(int index, const graphics::Color& color);
    void SetFont(const graphics::CFont* font);
    void SetMultiline(bool multiline);
    bool IsMultiline() const { return m_Multiline; }
    bool CanUndo() const { return m_History.CanUndo(); }
    bool CanRedo() const { return m_History.CanRedo(); }
    // The caret's place in the widget and whether it shows.
    CWidget* GetCursorWidget() const;

    // Tells the parent "text_changed".
    virtual void OnTextChanged();

    // Characters no edit widget takes (the application gives them at start).
    static void SetForbiddenSymbols(const wchar* _symbols);
    static void SetClipboardEnabled(bool enabled) { s_ClipboardEnabled = enabled; }

private:
    // The box the text is laid out in, in the widget's coordinates.
    misc::IntRect TextRect() const;
    unsigned TextFlags() const { return m_HorzFlags | m_VertFlags; }
    // The rectangle of the character the caret stands behind (or before, at 0 and at the
    // start of a line); false when the text renderer finds none.
    bool CaretCharRect(int position, misc::IntRect& rect, bool& lineStart);
    // Whether a typed or pasted character may enter the text.
    bool Accepts(wchar character) const;
    // The clipboard's text as the box takes it: characters it refuses are dropped, line
    // breaks of a one-line box become blanks.
    wstring CleanPaste(const wstring& text) const;
    // The selection's text and its removal (the caret goes to its start).
    wstring SelectedText() const;
    void EraseSelection();
    bool HasSelection() const { return m_SelectionStart != m_SelectionEnd; }
    // The common tail of the moving keys and of the mouse.
    void Extend(bool shift, bool caretAtStart);
    bool MoveKey(int key, bool shift);
    bool EditKey(int key, bool control);
    bool ClipboardKey(int key);
    void Paste();
    void CopyToClipboard(const wstring& text) const;
    // Where the caret goes for Up and Down; -1 when it stays.
    int VerticalTarget(bool up);

    StateHistory<wstring> m_History {kHistoryLimit};
    const graphics::CFont* m_Font = nullptr;
    wstring m_Text;
    unsigned m_HorzFlags;
    unsigned m_VertFlags;
    misc::FloatInsets m_TextInsets;
    unsigned m_MaxChars = 0;
    graphics::Color m_Colors[ColorCount];
    WidgetPtrT m_BackImage;
    WidgetPtrT m_CursorImage;
    bool m_Multiline = false;
    int m_CursorPos = 0;
    int m_SelectionStart = 0;
    int m_SelectionEnd = 0;
    bool m_MouseSelecting = false;
    bool m_Notifying = false; // the parent is being told of a change

    static const wchar* s_ForbiddenSymbols;
    static bool s_ClipboardEnabled;
};

} // namespace ox::gui
