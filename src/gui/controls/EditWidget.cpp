#include "gui/controls/EditWidget.h"

#include "core/SettingsReaders.h"
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "graphics/TextRender.h"
#include "gui/Cursor.h"
#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"
#include "misc/CharClass.h"

#include <algorithm>
#include <climits>

namespace ox::gui {

namespace {

using R = graphics::CRenderer;
constexpr wchar kLineBreak = 10;

// Measuring needs no renderer: one text walker serves every edit widget.
graphics::CTextRender& Measurer()
{
    static auto* render = new graphics::CTextRender();
    return *render;
}

// Fixed classes, the same in every locale: printable is anything but the C0 and C1 controls,
// DEL and the two non-characters at the top of the plane.
bool IsPrintable(wchar c) { return c >= 0x20 && c != 0x7F && !(c >= 0x80 && c < 0xA0) && c < 0xFFFE; }

// ASCII punctuation, the Latin-1 signs, the general and the CJK punctuation blocks.
bool IsPunctuation(wchar c)
{
    if (c < 0x80)
        return (c >= 0x21 && c <= 0x2F) || (c >= 0x3A && c <= 0x40) || (c >= 0x5B && c <= 0x60) ||
               (c >= 0x7B && c <= 0x7E);
    return (c >= 0xA1 && c <= 0xBF) || (c >= 0x2010 && c <= 0x2027) || (c >= 0x2030 && c <= 0x205E) ||
           (c >= 0x3001 && c <= 0x3003);
}

// Where Ctrl+Backspace and Ctrl+Delete stop.
bool IsWordStop(wchar c) { return IsPunctuation(c) || misc::IsBreakSpace(c) || c == 0xA0; }

bool IsHighSurrogate(wchar c) { return c >= 0xD800 && c <= 0xDBFF; }

} // namespace

const wchar* CEditWidget::s_ForbiddenSymbols = u"";
bool CEditWidget::s_ClipboardEnabled = true;

CEditWidget::CEditWidget()
    : CWidget({}, LayerTop, BroadcastOnMouseMove | BroadcastOnMouseUp), m_HorzFlags(R::TextLeft),
      m_VertFlags(R::TextCenterV)
{
    m_Colors[ColorText] = graphics::Color(0xFFFFFFFFu);
    m_Colors[ColorSelectedText] = graphics::Color(0xFF404040u);
    m_Colors[ColorSelection] = graphics::Color(0xFFC0C0C0u);
    auto* back = new CImageWidget();
    back->SetAnchors(AnchorLeft | AnchorRight | AnchorTop | AnchorBottom);
    m_BackImage = back;
    AddWidget(m_BackImage);
    m_CursorImage = new CImageWidget();
    m_CursorImage->AddFlags(FlagHidden);
    AddWidget(m_CursorImage);
}

CEditWidget::~CEditWidget() = default;

void CEditWidget::SetForbiddenSymbols(const wchar* _symbols)
{
    OX_ASSERT(_symbols);
    s_ForbiddenSymbols = _symbols ? _symbols : u"";
}

CWidget* CEditWidget::GetCursorWidget() const { return m_CursorImage.get(); }

// Loading ---------------------------------------------------------------------------------

void CEditWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "edit_template");
    m_Font = ReadFont(tmpl, "font");
    const std::string& justification = tmpl.GetValue("justification");
    const char* const words[] = {"left", "right", "center"};
    const unsigned flags[] = {R::TextLeft, R::TextRight, R::TextCenterH};
    const auto word = std::find(std::begin(words), std::end(words), justification);
    if (word != std::end(words))
        m_HorzFlags = flags[word - std::begin(words)];
    else if (!justification.empty())
        ReportElement(tmpl, "justification is none of left, right, center; left is used: ", justification);
    const char* const colors[] = {"color_text", "color_selected_text", "color_selection"};
    for (int i = 0; i < ColorCount; ++i)
        ReadColorChecked(tmpl, colors[i], m_Colors[i]);
    if (const core::CSettingsGroup* insets = tmpl.GetChildRef("insets"))
        ReadInsets(*insets, m_TextInsets);
    auto* back = static_cast<CImageWidget*>(m_BackImage.get());
    auto* caret = static_cast<CImageWidget*>(m_CursorImage.get());
    ReadImage(tmpl, "back_image", back->GetImage());
    back->GetImage().SetFlags(graphics::CImage::FlagBoxImage | graphics::CImage::FlagIntDest);
    ReadImage(tmpl, "cursor_image", caret->GetImage());
    const FloatVector caretSize = caret->GetImage().GetTextureSize();
    caret->SetSize(caretSize.X, caretSize.Y);

    core::ReadLocalText(node, "text", m_Text);
    int maxChars = 0;
    if (ReadChecked(node, "max_chars", maxChars, 0, INT_MAX))
        m_MaxChars = static_cast<unsigned>(maxChars);
    if (m_MaxChars && m_Text.size() > m_MaxChars)
        m_Text.resize(m_MaxChars);
    bool multiline = false;
    if (ReadFlag(node, "multiline", multiline))
        SetMultiline(multiline);
    CWidget::Load(node, templates);
    const FloatVector preferred = GetPreferredSize();
    SetSize(std::max(preferred.X, GetSize().X), std::max(preferred.Y, GetSize().Y));
    MoveCursor(0, true);
    m_CursorImage->AddFlags(FlagHidden);
}

misc::FloatVector CEditWidget::GetPreferredSize() const
{
    const FloatVector back = static_cast<const CImageWidget&>(*m_BackImage).GetImage().GetTextureSize();
    FloatVector text;
    misc::IntVector measured;
    if (m_Font && Measurer().GetTextSize(m_Font, m_Text.c_str(), misc::IntRect(), TextFlags(), 0, measured))
        text = {static_cast<float>(measured.X), static_cast<float>(m_Font->PixHeight)};
    return {std::max(back.X, text.X + m_TextInsets.Left + m_TextInsets.Right),
            std::max(back.Y, text.Y + m_TextInsets.Top + m_TextInsets.Bottom)};
}

void CEditWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    m_BackImage->SetSize(width, height);
    MoveCursor(m_CursorPos, true);
}

void CEditWidget::SetFont(const graphics::CFont* font)
{
    m_Font = font;
    MoveCursor(m_CursorPos, true);
}

void CEditWidget::SetMultiline(bool multiline)
{
    m_Multiline = multiline;
    m_VertFlags = multiline ? R::TextTop : R::TextCenterV;
}

void CEditWidget::SetTextJustification(int justification)
{
    if (justification < -1 || justification > 1)
        return;
    const unsigned flags[] = {R::TextLeft, R::TextCenterH, R::TextRight};
    m_HorzFlags = flags[justification + 1];
    MoveCursor(m_CursorPos, true);
}

void CEditWidget::SetMaxChars(unsigned maxChars)
{
    m_MaxChars = maxChars;
    if (m_MaxChars && m_Text.size() > m_MaxChars)
        SetText(m_Text);
}

void CEditWidget::SetEditColors(int index, const graphics::Color& color)
{
    OX_CHECK_DATA(index >= 0 && index < ColorCount);
    m_Colors[index] = color;
}

// Text and caret --------------------------------------------------------------------------

void CEditWidget::SetText(const wstring& text)
{
    m_Text = text;
    if (m_MaxChars && m_Text.size() > m_MaxChars)
        m_Text.resize(m_MaxChars);
    const int length = static_cast<int>(m_Text.size());
    m_SelectionStart = std::min(m_SelectionStart, length);
    m_SelectionEnd = std::min(m_SelectionEnd, length);
    m_History.Push(m_Text);
    MoveCursor(m_CursorPos, true);
    // A parent that sets the text again while it hears of a change hears no more of it.
    if (m_Notifying)
        return;
    m_Notifying = true;
    OnTextChanged();
    m_Notifying = false;
}

void CEditWidget::OnTextChanged() { TellParent(*this, "text_changed"); }

misc::IntRect CEditWidget::TextRect() const
{
    const misc::FloatInsets& in = m_TextInsets;
    return misc::IntRect(static_cast<int>(in.Left), static_cast<int>(in.Top),
                         std::max(0, static_cast<int>(GetSize().X - in.Left - in.Right)),
                         std::max(0, static_cast<int>(GetSize().Y - in.Top - in.Bottom)));
}

bool CEditWidget::CaretCharRect(int position, misc::IntRect& rect, bool& lineStart)
{
    lineStart = false;
    if (m_Text.empty()) {
        lineStart = true;
        return Measurer().GetCharRect(m_Font, u" ", TextRect(), TextFlags(), 1, 0, rect);
    }
    // The caret stands behind the character before it, or before the first of a line.
    unsigned q = position > 0 ? static_cast<unsigned>(position - 1) : 0;
    const wstring* text = &m_Text;
    wstring extended;
    if (position > 0 && m_Text[q] == kLineBreak) {
        ++q;
        lineStart = true;
        // The empty last line gets a rectangle from a line break added for the measuring.
        if (q == m_Text.size()) {
            extended = m_Text + kLineBreak;
            text = &extended;
        }
    }
    return Measurer().GetCharRect(m_Font, text->c_str(), TextRect(), TextFlags(),
                                  static_cast<unsigned>(text->size()), q, rect);
}

void CEditWidget::MoveCursor(int index, bool /*scrollIntoView*/)
{
    m_CursorPos = std::clamp(index, 0, static_cast<int>(m_Text.size()));
    CWidget& caret = *m_CursorImage;
    misc::IntRect rect;
    bool lineStart = false;
    if (!m_Font) {
        caret.SetOffset(0, 0);
        return;
    }
    // Only a text of characters the font lacks has no rectangle.
    OX_CHECK_DATA(CaretCharRect(m_CursorPos, rect, lineStart), caret.SetOffset(TextRect().X, TextRect().Y));
    const int x = (m_CursorPos == 0 || lineStart) ? rect.X : rect.X + rect.Width;
    const FloatVector size = caret.GetSize();
    caret.SetOffset(static_cast<float>(x) - size.X / 2,
                    static_cast<float>(rect.Y) + static_cast<float>(rect.Height) / 2 - size.Y / 2);
}

int CEditWidget::GetIndexByPos(const IntVector& pos)
{
    if (!m_Font || m_Text.empty())
        return 0;
    const misc::IntRect box = TextRect();
    misc::IntVector point(pos.X - box.X, pos.Y - box.Y);
    // A point above the first line or below the last one counts on that line.
    const int length = static_cast<int>(m_Text.size());
    misc::IntRect first, last;
    bool lineStart = false;
    const bool lines = Measurer().GetCharRect(m_Font, m_Text.c_str(), box, TextFlags(), static_cast<unsigned>(length),
                                              0, first) &&
                       CaretCharRect(length, last, lineStart);
    if (lines)
        point.Y = std::clamp(point.Y, first.Y - box.Y, std::max(first.Y, last.Y) - box.Y + last.Height - 1);
    int index = -1;
    bool leftHalf = false, topHalf = false;
    if (!Measurer().HitTest(m_Font, m_Text.c_str(), box, TextFlags(), static_cast<unsigned>(length), false, point,
                            index, leftHalf, topHalf) ||
        index < 0)
        // Only the empty line behind a final line break has no character to hit.
        return lines && point.Y >= last.Y - box.Y ? length : 0;
    // A click right of a line's end stays on that line, before its line break.
    if (!leftHalf && !(m_Multiline && m_Text[static_cast<size_t>(index)] == kLineBreak))
        ++index;
    return index;
}

void CEditWidget::SelectText(int start, int end)
{
    const int length = static_cast<int>(m_Text.size());
    start = std::clamp(start, 0, length);
    end = std::clamp(end, 0, length);
    if (end < start)
        std::swap(start, end);
    m_SelectionStart = start;
    m_SelectionEnd = end;
    if (m_CursorPos != start && m_CursorPos != end)
        MoveCursor(end, true);
}

void CEditWidget::Extend(bool shift, bool caretAtStart)
{
    if (!shift)
        SelectText(m_CursorPos, m_CursorPos);
    else if (caretAtStart)
        SelectText(m_CursorPos, m_SelectionEnd);
    else
        SelectText(m_SelectionStart, m_CursorPos);
}

wstring CEditWidget::SelectedText() const
{
    return m_Text.substr(static_cast<size_t>(m_SelectionStart), static_cast<size_t>(m_SelectionEnd - m_SelectionStart));
}

void CEditWidget::EraseSelection()
{
    m_Text.erase(static_cast<size_t>(m_SelectionStart), static_cast<size_t>(m_SelectionEnd - m_SelectionStart));
    m_CursorPos = m_SelectionStart;
    m_SelectionEnd = m_SelectionStart;
}

// Typing ----------------------------------------------------------------------------------

bool CEditWidget::Accepts(wchar c) const
{
    if (!(IsPrintable(c) || (c == kLineBreak && m_Multiline)))
        return false;
    for (const wchar* s = s_ForbiddenSymbols; *s; ++s)
        if (*s == c)
            return false;
    return !m_Font || c == kLineBreak || m_Font->GetChar(c) != nullptr;
}

bool CEditWidget::OnChar(wchar character, int /*keys*/, int /*rawKeyData*/, bool /*broadcast*/)
{
    if (!Accepts(character))
        return false;
    if (HasSelection())
        EraseSelection();
    if (m_MaxChars && m_Text.size() >= m_MaxChars)
        return false;
    m_Text.insert(static_cast<size_t>(m_CursorPos), 1, character);
    SelectText(m_CursorPos + 1, m_CursorPos + 1);
    SetText(m_Text);
    MoveCursor(m_CursorPos, true);
    return true;
}

bool CEditWidget::OnKeyDown(int key, int keys, int /*rawKeyData*/, bool /*broadcast*/)
{
    const bool shift = (keys & ShiftPressed) != 0, control = (keys & ControlPressed) != 0;
    return MoveKey(key, shift) || EditKey(key, control) || (control && ClipboardKey(key));
}

int CEditWidget::VerticalTarget(bool up)
{
    misc::IntRect here, end;
    bool lineStart = false, endLineStart = false;
    if (!m_Font || m_Text.empty() || !CaretCharRect(m_CursorPos, here, lineStart))
        return m_CursorPos;
    // Up on the first line goes to the start, Down on the last one to the end.
    const int edge = up ? 0 : static_cast<int>(m_Text.size());
    if (CaretCharRect(edge, end, endLineStart) && end.Y == here.Y)
        return edge;
    // Aimed at the caret's own x, one line pitch up or down.
    const int x = (m_CursorPos == 0 || lineStart) ? here.X : here.X + here.Width;
    const int pitch = m_Font->PixHeight + m_Font->LineGap;
    return GetIndexByPos({x, here.Y + here.Height / 2 + (up ? -pitch : pitch)});
}

bool CEditWidget::MoveKey(int key, bool shift)
{
    const int length = static_cast<int>(m_Text.size());
    int target = m_CursorPos;
    switch (key) {
    case OX_LEFT: target = m_CursorPos - 1; break;
    case OX_RIGHT: target = m_CursorPos + 1; break;
    case OX_UP:
    case OX_DOWN: target = VerticalTarget(key == OX_UP); break;
    case OX_PGUP: target = 0; break;
    case OX_PGDOWN: target = length; break;
    case OX_HOME:
        target = 0;
        for (int i = m_CursorPos - 1; i >= 0; --i)
            if (m_Text[static_cast<size_t>(i)] == kLineBreak) {
                target = i + 1;
                break;
            }
        break;
    case OX_END:
        target = m_CursorPos;
        while (target < length && m_Text[static_cast<size_t>(target)] != kLineBreak)
            ++target;
        break;
    default: return false;
    }
    if (!HasSelection())
        m_SelectionStart = m_SelectionEnd = m_CursorPos;
    const bool atStart = m_CursorPos == m_SelectionStart;
    MoveCursor(target, true);
    Extend(shift, atStart);
    return true;
}

bool CEditWidget::EditKey(int key, bool control)
{
    const size_t pos = static_cast<size_t>(m_CursorPos), length = m_Text.size();
    switch (key) {
    case OX_BACK:
    case OX_DELETE:
        if (HasSelection()) {
            if (key == OX_DELETE)
                CopyToClipboard(SelectedText());
            EraseSelection();
        } else if (key == OX_BACK && pos > 0) {
            size_t from = pos - 1;
            while (control && from > 0 && !IsWordStop(m_Text[from]))
                --from;
            m_Text.erase(from, pos - from);
            m_CursorPos = static_cast<int>(from);
        } else if (key == OX_DELETE && pos < length) {
            size_t to = pos + 1;
            while (control && to < length && !IsWordStop(m_Text[to]))
                ++to;
            m_Text.erase(pos, to - pos);
        } else {
            return true;
        }
        m_SelectionStart = m_SelectionEnd = m_CursorPos;
        SetText(m_Text);
        return true;
    case OX_RETURN:
        if (m_Multiline)
            OnChar(kLineBreak, 0, 0, false);
        else if (CBaseWidget* parent = GetParentWidget())
            parent->SetChildFocused(nullptr);
        return true;
    default: return false;
    }
}

// The clipboard and the history -----------------------------------------------------------

void CEditWidget::CopyToClipboard(const wstring& text) const
{
    core::CSystemIntegration* platform = GetGuiServices().platform;
    if (s_ClipboardEnabled && platform)
        platform->SetClipboardText(text);
}

wstring CEditWidget::CleanPaste(const wstring& text) const
{
    wstring clean;
    clean.reserve(text.size());
    for (size_t i = 0; i < text.size(); ++i) {
        wchar c = text[i];
        if (c == 13) {
            if (i + 1 < text.size() && text[i + 1] == kLineBreak)
                continue;
            c = kLineBreak;
        }
        if (c == 9 || (c == kLineBreak && !m_Multiline))
            c = u' ';
        if (Accepts(c))
            clean += c;
    }
    return clean;
}

void CEditWidget::Paste()
{
    core::CSystemIntegration* platform = GetGuiServices().platform;
    wstring pasted;
    if (!platform || !platform->GetClipboardText(pasted))
        return;
    pasted = CleanPaste(pasted);
    // What doesn't fit under the limit is left out: the text already there stays whole.
    const size_t kept = m_Text.size() - static_cast<size_t>(m_SelectionEnd - m_SelectionStart);
    if (m_MaxChars) {
        if (kept >= m_MaxChars)
            return;
        if (pasted.size() > m_MaxChars - kept) {
            pasted.resize(m_MaxChars - kept);
            if (IsHighSurrogate(pasted.back()))
                pasted.pop_back();
        }
    }
    if (pasted.empty())
        return;
    if (HasSelection())
        EraseSelection();
    m_Text.insert(static_cast<size_t>(m_CursorPos), pasted);
    const int end = m_CursorPos + static_cast<int>(pasted.size());
    m_SelectionStart = m_SelectionEnd = end;
    m_CursorPos = end;
    SetText(m_Text);
}

bool CEditWidget::ClipboardKey(int key)
{
    switch (key) {
    case 'C':
        CopyToClipboard(HasSelection() ? SelectedText() : m_Text);
        return true;
    case 'V':
        if (s_ClipboardEnabled)
            Paste();
        return true;
    case 'X':
        if (!s_ClipboardEnabled)
            return true;
        CopyToClipboard(HasSelection() ? SelectedText() : m_Text);
        if (HasSelection()) {
            EraseSelection();
        } else {
            m_Text.clear();
            m_CursorPos = m_SelectionStart = m_SelectionEnd = 0;
        }
        SetText(m_Text);
        return true;
    case 'A':
        if (!m_Text.empty()) {
            SelectText(0, static_cast<int>(m_Text.size()));
            MoveCursor(static_cast<int>(m_Text.size()), true);
        }
        return true;
    case 'Z':
    case 'Y':
        if (key == 'Z' ? m_History.CanUndo() : m_History.CanRedo()) {
            const wstring state = key == 'Z' ? m_History.Undo() : m_History.Redo();
            SetText(state);
        }
        return true;
    default: return false;
    }
}

// Mouse and focus -------------------------------------------------------------------------

bool CEditWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    if (CWidget::OnMouseDown(pos, button, keys, broadcast))
        return true;
    if (!IsFocused())
        if (CBaseWidget* parent = GetParentWidget())
            parent->SetChildFocused(this);
    m_MouseSelecting = true;
    if (!HasSelection())
        m_SelectionStart = m_SelectionEnd = m_CursorPos;
    const bool atStart = m_CursorPos == m_SelectionStart;
    MoveCursor(GetIndexByPos(pos), true);
    Extend((keys & ShiftPressed) != 0, atStart);
    return true;
}

bool CEditWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (CWidget::OnMouseMove(pos, keys, broadcast))
        return true;
    if (!broadcast)
        CCursor::Instance().SetCursor(CCursor::CursorText);
    if (m_MouseSelecting) {
        const bool atStart = m_CursorPos == m_SelectionStart;
        MoveCursor(GetIndexByPos(pos), true);
        Extend(true, atStart);
    }
    return false;
}

bool CEditWidget::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    const bool handled = CWidget::OnMouseUp(pos, button, keys, broadcast);
    if (!handled)
        m_MouseSelecting = false;
    return handled;
}

void CEditWidget::SetFocused(bool focused)
{
    CWidget::SetFocused(focused);
    if (focused) {
        m_CursorImage->RemFlags(FlagHidden);
    } else {
        m_CursorImage->AddFlags(FlagHidden);
        m_MouseSelecting = false;
        SelectText(m_CursorPos, m_CursorPos);
    }
    TellParent(*this, focused ? "got_focus" : "lost_focus");
}

// Drawing ---------------------------------------------------------------------------------

void CEditWidget::DoDraw(graphics::CRenderer& renderer)
{
    if (!m_Font)
        return;
    renderer.PushState();
    renderer.SetClipPoly(misc::RectToPoly4({0, 0, GetSize().X, GetSize().Y}));
    CWidget::DoDraw(renderer);
    const misc::IntRect box = TextRect();
    renderer.PushState();
    renderer.SetClipPoly(misc::RectToPoly4({m_TextInsets.Left, m_TextInsets.Top, static_cast<float>(box.Width),
                                            static_cast<float>(box.Height)}));
    const graphics::Color none(0u);
    if (IsFocused() && HasSelection())
        renderer.RenderText(*m_Font, m_Text, box, TextFlags(), 0, m_Colors[ColorText], none,
                            m_Colors[ColorSelectedText], m_Colors[ColorSelection], m_SelectionStart,
                            m_SelectionEnd - 1);
    else
        renderer.RenderText(*m_Font, m_Text, box, TextFlags(), 0, m_Colors[ColorText], none);
    // Without a caret image the caret is a thin bar of the text's colour and height.
    const CWidget& caret = *m_CursorImage;
    if (!(caret.GetFlags() & FlagHidden) && !static_cast<const CImageWidget&>(caret).GetImage().HasTexture()) {
        const FloatVector at = caret.GetOffset();
        const float height = static_cast<float>(m_Font->PixHeight);
        renderer.RenderFilledPoly4(misc::RectToPoly4({at.X - 1, at.Y - height / 2, 2, height}), m_Colors[ColorText]);
    }
    renderer.PopState();
    renderer.PopState();
}

} // namespace ox::gui
