#include "gui/controls/ListWidget.h"

#include "core/SettingsReaders.h"
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/ScrollWidget.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

namespace {

constexpr const char* kColorKeys[4] = {"color_text_normal", "color_text_selected", "color_text_over",
                                       "color_selection"};
constexpr int kMaxListHeight = 1000;

// The justification words of a template into the Justify values; a missing word leaves its
// value alone.
void ReadJustification(const std::string& words, int& horizontal, int& vertical)
{
    auto has = [&words](const char* word) { return words.find(word) != std::string::npos; };
    if (has("left"))
        horizontal = -1;
    else if (has("right"))
        horizontal = 1;
    else if (has("center"))
        horizontal = 0;
    if (has("top"))
        vertical = -1;
    else if (has("bottom"))
        vertical = 1;
    else if (has("center"))
        vertical = 0;
}

void ReadInsetsGroup(const core::CSettingsGroup& owner, const char* name, misc::FloatInsets& insets)
{
    if (const core::CSettingsGroup* group = owner.GetChildRef(misc::StringA88(name)))
        ReadInsets(*group, insets);
}

} // namespace

CListWidget::CListWidget()
    : CWidget({}, LayerTop, BroadcastOnMouseMove | BroadcastOnMouseUp), m_Background(new CImageWidget())
{
    m_Background->SetAnchors(AnchorLeft | AnchorRight | AnchorTop | AnchorBottom);
    AddWidget(m_Background);
}

CListWidget::~CListWidget() = default;

CScrollWidget* CListWidget::GetScroll() const { return static_cast<CScrollWidget*>(m_Scroll.get()); }
CImageWidget* CListWidget::GetBackground() const { return static_cast<CImageWidget*>(m_Background.get()); }

CLabelWidget* CListWidget::GetLineLabel(int index) const
{
    return index >= 0 && index < EnumLines() ? static_cast<CLabelWidget*>(m_Lines[index].get()) : nullptr;
}

void CListWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "list_template");
    m_SelectSound = ReadSound(tmpl, "sound_on_select");
    misc::FloatInsets insets = GetInsets();
    ReadInsetsGroup(tmpl, "insets", insets);
    SetInsets(insets);
    ReadInsetsGroup(tmpl, "label_insets", m_LabelInsets);
    for (int i = 0; i < 4; ++i)
        ReadColorChecked(tmpl, kColorKeys[i], m_Colors[i]);
    m_Font = ReadFont(tmpl, "font");
    if (!m_Font)
        ReportElement(node, "a list without a font in its template shows no lines");
    if (!tmpl.GetValue("scroll_template").empty())
        MakeScroll(tmpl.GetValue("scroll_template"), templates);
    ReadImage(tmpl, "background", GetBackground()->GetImage());
    GetBackground()->GetImage().SetFlags(graphics::CImage::FlagBoxImage | graphics::CImage::FlagIntDest);
    ReadJustification(tmpl.GetValue("justification"), m_HorzJustify, m_VertJustify);

    CWidget::Load(node, templates);
    int lines = m_ListHeight;
    if (ReadChecked(node, "list_height", lines, INT_MIN, kMaxListHeight))
        SetListHeight(lines);
    TakeNaturalSize(*this, GetPreferredSize());
    for (const core::SettingsGroupPtrT& child : node.GetChild(misc::StringA88("strings")).GetChildren())
        if (child->GetId().view() == "string")
            AddLine(core::ReadLocalText(*child, "text"));
    int selected = 0;
    ReadChecked(node, "selected", selected, -1, INT_MAX);
    SelectLine(selected, true);
    m_TellWhenAttached = GetParentWidget() == nullptr && m_SelectedLine >= 0;
}

void CListWidget::SetParentWidget(CBaseWidget* parent)
{
    CWidget::SetParentWidget(parent);
    if (std::exchange(m_TellWhenAttached, false) && parent)
        OnLineSelected();
}

void CListWidget::MakeScroll(const std::string& templateId, const core::CSettingsGroup& templates)
{
    if (m_Scroll)
        RemoveWidget(m_Scroll);
    auto* scroll = new CScrollWidget();
    m_Scroll = scroll;
    core::CSettingsGroup node(misc::StringA88("scroll_widget"));
    node.AddValue("scroll_template", templateId.c_str());
    scroll->Load(node, templates);
    scroll->AddFlags(FlagHidden | FlagDisabled);
    scroll->SetMouseWheelK(1);
    if (m_Font)
        scroll->SetButtonValue(1);
    scroll->SetAnchors(AnchorRight | AnchorTop | AnchorBottom);
    AddWidget(m_Scroll);
}

void CListWidget::SetFont(const graphics::CFont* font)
{
    m_Font = font;
    for (size_t i = 0; i < m_Lines.size(); ++i)
        static_cast<CLabelWidget&>(*m_Lines[i]).SetFont(font);
    FitScroll();
}

// Geometry --------------------------------------------------------------------------------------

float CListWidget::LineHeight() const
{
    return m_Font ? static_cast<float>(m_Font->PixHeight) + m_LabelInsets.Top + m_LabelInsets.Bottom : 0.0f;
}

void CListWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    if (m_Scroll) {
        m_Scroll->SetOffset(width - m_Scroll->GetSize().X, 0);
        m_Scroll->SetSize(m_Scroll->GetSize().X, height);
    }
    FitScroll();
}

misc::FloatVector CListWidget::GetPreferredSize() const
{
    float widest = 0;
    for (const WidgetPtrT& line : m_Lines)
        widest = std::max(widest, line->GetPreferredSize().X);
    const misc::FloatInsets& in = GetInsets();
    const FloatVector back = GetBackground()->GetImage().GetTextureSize();
    const FloatVector scroll = m_Scroll ? m_Scroll->GetPreferredSize() : FloatVector();
    float height = std::max(back.Y, scroll.Y);
    if (m_Font)
        height = std::max(height, in.Top + in.Bottom + LineHeight() * static_cast<float>(m_ListHeight));
    return {std::max(widest + scroll.X + in.Left + in.Right, back.X), height};
}

float CListWidget::CalcHeightToFitLines(int lines) const
{
    return m_Font ? GetInsets().Top + GetInsets().Bottom + static_cast<float>(lines) * LineHeight() : 0.0f;
}

float CListWidget::GetScrollWidth() const { return m_Scroll ? m_Scroll->GetSize().X : 0.0f; }

void CListWidget::SetListHeight(int lines) { m_ListHeight = lines < 1 ? 5 : lines; }

// The scroll bar's value counts lines (it may stand between two); the offset follows it, so
// that a value brought back into range by a change of lines moves the lines too.
void CListWidget::FitScroll(size_t from)
{
    if (!m_Font)
        return;
    const float offset = m_ScrollOffset, lineHeight = LineHeight();
    CScrollWidget* scroll = GetScroll();
    const float width = GetSize().X;
    if (scroll) {
        const misc::FloatInsets& in = GetInsets();
        const float visible = lineHeight > 0 ? (GetSize().Y - in.Top - in.Bottom) / lineHeight : 0.0f;
        const float lines = static_cast<float>(m_Lines.size());
        if (m_Lines.empty()) {
            scroll->SetMaxValue(0);
            scroll->SetValue(0);
        }
        if (!m_Lines.empty() && visible <= lines) {
            m_Background->SetSize(width - scroll->GetSize().X, GetSize().Y);
            scroll->RemFlags(FlagHidden | FlagDisabled);
            scroll->SetMaxValue(lines);
            scroll->SetPageSize(std::trunc(visible));
        } else {
            scroll->AddFlags(FlagHidden | FlagDisabled);
            m_Background->SetSize(width, GetSize().Y);
        }
    }
    const bool shown = scroll && !(scroll->GetFlags() & FlagHidden);
    m_ScrollOffset = shown ? std::max(0.0f, scroll->GetValue() * lineHeight) : 0.0f;
    if (offset != m_ScrollOffset)
        PlaceLines(0, from);
    for (size_t i = from; i < m_Lines.size(); ++i)
        LayOutLine(i);
}

void CListWidget::LayOutLine(size_t index)
{
    const misc::FloatInsets& in = GetInsets();
    CWidget& line = *m_Lines[index];
    line.SetInsets({m_LabelInsets.Left + in.Left, m_LabelInsets.Right, m_LabelInsets.Top + in.Top, m_LabelInsets.Bottom});
    line.SetSize(GetSize().X, LineHeight());
    PlaceLines(index, index + 1);
}

void CListWidget::PlaceLines(size_t from, size_t to)
{
    const float top = GetInsets().Top - m_ScrollOffset, lineHeight = LineHeight();
    for (size_t i = from; i < to; ++i)
        m_Lines[i]->SetOffset(0, top + static_cast<float>(i) * lineHeight);
}

void CListWidget::OnChildAction(const std::string& action, CWidget* sender)
{
    CWidget::OnChildAction(action, sender);
    if (action == "value_changed" && sender == m_Scroll.get() && m_Font) {
        m_ScrollOffset = std::max(0.0f, GetScroll()->GetValue() * LineHeight());
        PlaceLines(0, m_Lines.size());
    }
}

void CListWidget::SetScrollValue(int value)
{
    if (m_Scroll && !(m_Scroll->GetFlags() & FlagDisabled))
        GetScroll()->SetValue(static_cast<float>(value));
}

int CListWidget::GetScrollValue() const
{
    return m_Scroll && !(m_Scroll->GetFlags() & FlagDisabled) ? static_cast<int>(GetScroll()->GetValue()) : 0;
}

// Lines -----------------------------------------------------------------------------------------

void CListWidget::AddLine(const wstring& text)
{
    if (!m_Font)
        return;
    auto* label = new CLabelWidget();
    m_Lines.emplace_back(label);
    label->SetFont(m_Font);
    label->SetText(text);
    label->SetJustifications(m_HorzJustify, m_VertJustify);
    FitScroll(m_Lines.size() - 1);
    Paint(EnumLines() - 1);
}

void CListWidget::RemoveLine(int index)
{
    if (index < 0 || index >= EnumLines())
        return;
    if (index == m_OverLine)
        SetOverLine(-1);
    m_Lines.erase(m_Lines.begin() + index);
    if (index == m_SelectedLine)
        SelectLine(-1, true);
    else if (index < m_SelectedLine)
        SelectLine(m_SelectedLine - 1, true);
    else if (m_SelectedLine >= EnumLines())
        SelectLine(EnumLines() - 1, true);
    if (m_OverLine > index)
        --m_OverLine;
    FitScroll(static_cast<size_t>(index));
}

// The selection stays as it was: a script may still ask which line it was.
void CListWidget::ClearLines()
{
    m_Lines.clear();
    m_OverLine = -1;
    FitScroll();
}

wstring CListWidget::GetLine(int index) const
{
    const CLabelWidget* line = GetLineLabel(index);
    return line ? line->GetText() : wstring();
}

void CListWidget::SetLine(int index, const wstring& text)
{
    if (CLabelWidget* line = GetLineLabel(index))
        line->SetText(text);
}

int CListWidget::FindLine(const wstring& text) const
{
    for (int i = 0; i < EnumLines(); ++i)
        if (GetLineLabel(i)->GetText() == text)
            return i;
    return -1;
}

void CListWidget::SelectLine(int index, bool notify)
{
    if (index >= EnumLines())
        return;
    const int old = std::exchange(m_SelectedLine, std::max(index, -1));
    Paint(old);
    Paint(m_SelectedLine);
    if (notify)
        OnLineSelected();
}

void CListWidget::OnLineSelected() { TellParent(*this, "line_selected"); }

// The hover colour wins over the selection's.
void CListWidget::Paint(int index)
{
    if (index < 0 || index >= EnumLines())
        return;
    const int color = index == m_OverLine       ? ListColorTextOver
                      : index == m_SelectedLine ? ListColorTextSelected
                                                : ListColorTextNormal;
    m_Lines[index]->SetColor(m_Colors[color]);
}

void CListWidget::SetOverLine(int index)
{
    const int old = std::exchange(m_OverLine, index);
    Paint(old);
    Paint(index);
}

void CListWidget::SetLineJustifications(int horizontal, int vertical)
{
    m_HorzJustify = std::clamp(horizontal, -1, 1);
    m_VertJustify = std::clamp(vertical, -1, 1);
    for (int i = 0; i < EnumLines(); ++i)
        GetLineLabel(i)->SetJustifications(m_HorzJustify, m_VertJustify);
}

void CListWidget::SetListColors(int index, const graphics::Color& color)
{
    if (index < 0 || index > ListColorSelection)
        return;
    m_Colors[index] = color;
    for (int i = 0; i < EnumLines(); ++i)
        Paint(i);
}

const graphics::Color& CListWidget::GetListColor(int index) const
{
    return m_Colors[std::clamp(index, 0, static_cast<int>(ListColorSelection))];
}

// Drawing -----------------------------------------------------------------------------------

void CListWidget::DoDraw(graphics::CRenderer& renderer)
{
    CWidget::DoDraw(renderer);
    const misc::FloatInsets& in = GetInsets();
    const bool scrollShown = m_Scroll && !(m_Scroll->GetFlags() & FlagHidden);
    const float right = GetSize().X - in.Right - (scrollShown ? GetScrollWidth() : 0.0f);
    const float bottom = GetSize().Y - in.Bottom;
    renderer.PushState();
    renderer.SetClipPoly(misc::RectToPoly4({in.Left, in.Top, right - in.Left, bottom - in.Top}));
    if (CLabelWidget* selected = GetLineLabel(m_SelectedLine)) {
        misc::Poly4 poly = selected->GetPoly();
        for (auto& corner : poly.Points)
            corner.X += in.Left;
        renderer.RenderFilledPoly4(poly, m_Colors[ListColorSelection]);
    }
    // Only the lines that can show are drawn: a list may hold thousands.
    const float lineHeight = LineHeight();
    if (lineHeight > 0 && !m_Lines.empty()) {
        const float first = std::floor((m_ScrollOffset - lineHeight) / lineHeight);
        const float last = std::ceil((m_ScrollOffset + GetSize().Y) / lineHeight);
        const size_t from = static_cast<size_t>(std::clamp(first, 0.0f, static_cast<float>(m_Lines.size())));
        const size_t to = static_cast<size_t>(std::clamp(last + 1, 0.0f, static_cast<float>(m_Lines.size())));
        for (size_t i = from; i < to; ++i)
            m_Lines[i]->Draw(renderer);
    }
    renderer.PopState();
}

// Input -------------------------------------------------------------------------------------

bool CListWidget::InScrollArea(const IntVector& pos) const
{
    const bool scrollShown = m_Scroll && !(m_Scroll->GetFlags() & FlagHidden);
    return scrollShown && static_cast<float>(pos.X) - GetInsets().Left >= m_Background->GetSize().X;
}

int CListWidget::LineAt(const IntVector& pos) const
{
    const float lineHeight = LineHeight();
    if (lineHeight <= 0 || !IsInside(*this, pos) || InScrollArea(pos))
        return -1;
    // The point is taken in from the insets; the lines stand below the top inset as well.
    const misc::FloatInsets& in = GetInsets();
    const FloatVector point(static_cast<float>(pos.X) - in.Left, static_cast<float>(pos.Y) - in.Top);
    const float row = std::floor((point.Y - in.Top + m_ScrollOffset) / lineHeight);
    if (row < 0 || row >= static_cast<float>(m_Lines.size()))
        return -1;
    const int index = static_cast<int>(row);
    return m_Lines[index]->ContainsPoint(point) ? index : -1;
}

bool CListWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    if (CWidget::OnMouseDown(pos, button, keys, broadcast))
        return true;
    if (broadcast)
        return false;
    if (InScrollArea(pos))
        return false;
    SetChildFocused(this);
    const int line = LineAt(pos);
    if (line >= 0) {
        PlayGuiSound(m_SelectSound);
        SelectLine(line, true);
    }
    return true;
}

bool CListWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    const bool base = CWidget::OnMouseMove(pos, keys, broadcast);
    if (const int over = LineAt(pos); over != m_OverLine)
        SetOverLine(over);
    return broadcast ? base : true;
}

bool CListWidget::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    if (CWidget::OnMouseWheel(pos, delta, keys, broadcast))
        return true;
    if (m_Lines.empty())
        return false;
    if (m_Scroll)
        m_Scroll->OnMouseWheel(pos, delta, keys, broadcast);
    return true;
}

bool CListWidget::OnKeyDown(int key, int keys, int rawKeyData, bool broadcast)
{
    const bool base = CWidget::OnKeyDown(key, keys, rawKeyData, broadcast);
    if (broadcast || m_Lines.empty())
        return base;
    const int page = std::max(1, static_cast<int>(GetScroll() ? GetScroll()->GetPageSize() : m_ListHeight));
    const int last = EnumLines() - 1;
    switch (key) {
    case OX_UP: SelectAndShow(std::max(0, m_SelectedLine - 1)); return true;
    case OX_DOWN: SelectAndShow(std::min(last, m_SelectedLine + 1)); return true;
    case OX_PGUP: SelectAndShow(std::max(0, m_SelectedLine - page)); return true;
    case OX_PGDOWN: SelectAndShow(std::min(last, std::max(0, m_SelectedLine) + page)); return true;
    case OX_HOME: SelectAndShow(0); return true;
    case OX_END: SelectAndShow(last); return true;
    default: return base;
    }
}

void CListWidget::SelectAndShow(int index)
{
    if (index != m_SelectedLine)
        SelectLine(index, true);
    if (!m_Scroll || (m_Scroll->GetFlags() & FlagDisabled))
        return;
    const int first = GetScrollValue(), page = static_cast<int>(GetScroll()->GetPageSize());
    if (index < first)
        SetScrollValue(index);
    else if (index >= first + page)
        SetScrollValue(index - page + 1);
}

} // namespace ox::gui
