#include "gui/controls/ComboBoxWidget.h"

#include "core/SettingsReaders.h"
#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/ListWidget.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

namespace {

// The part's description: the template's attributes without its id and child elements, so
// that each part finds its own template and keys there and nothing else.
void CopyAttributes(const core::CSettingsGroup& from, core::CSettingsGroup& to)
{
    for (unsigned i = 0; i < from.EnumAttributes(); ++i) {
        const misc::StringA88& name = from.GetAttribute(i);
        if (name.view() != "id")
            to.AddValue(name, from.GetValue(name));
    }
}

bool Hidden(const WidgetPtrT& widget) { return (widget->GetFlags() & FlagHidden) != 0; }

} // namespace

CComboBoxWidget::CComboBoxWidget()
    : m_Back(new CImageWidget()), m_Button(new CButtonWidget()), m_Label(new CLabelWidget()),
      m_List(new CListWidget())
{
    SetBroadcastMask(GetBroadcastMask() | BroadcastOnMouseDown);
    // The chosen line stands at the left, in the middle of the box's height, unless the
    // template says otherwise.
    GetLabel()->SetJustifications(-1, 0);
    AddWidget(m_Back);
    AddWidget(m_Button);
    AddWidget(m_Label);
    AddWidget(m_List);
    m_List->AddFlags(FlagHidden | FlagDisabled);
}

CComboBoxWidget::~CComboBoxWidget() = default;

CButtonWidget* CComboBoxWidget::GetButton() const { return static_cast<CButtonWidget*>(m_Button.get()); }
CLabelWidget* CComboBoxWidget::GetLabel() const { return static_cast<CLabelWidget*>(m_Label.get()); }
CListWidget* CComboBoxWidget::GetList() const { return static_cast<CListWidget*>(m_List.get()); }
CImageWidget* CComboBoxWidget::GetBack() const { return static_cast<CImageWidget*>(m_Back.get()); }

void CComboBoxWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "combobox_template");
    m_OpenSound = ReadSound(tmpl, "sound_on_open");
    m_SelectSound = ReadSound(tmpl, "sound_on_select");
    core::CSettingsGroup parts(misc::StringA88("combobox_part"));
    CopyAttributes(tmpl, parts);
    m_Button->Load(parts, templates);
    m_Label->Load(parts, templates);
    if (const core::CSettingsGroup* insets = tmpl.GetChildRef(misc::StringA88("label_insets"))) {
        misc::FloatInsets read;
        ReadInsets(*insets, read);
        m_Label->SetInsets(read);
    }
    ReadImage(tmpl, "back_image", GetBack()->GetImage());
    GetBack()->GetImage().SetFlags(graphics::CImage::FlagBoxImage | graphics::CImage::FlagIntDest);
    m_List->Load(parts, templates);
    m_List->AddFlags(FlagHidden | FlagDisabled);
    m_Label->SetColor(GetList()->GetListColor(CListWidget::ListColorTextNormal));

    CWidget::Load(node, templates);
    int lines = GetList()->GetListHeight();
    if (ReadChecked(node, "list_height", lines, INT_MIN, 1000))
        GetList()->SetListHeight(lines);
    for (const core::SettingsGroupPtrT& child : node.GetChild(misc::StringA88("strings")).GetChildren())
        if (child->GetId().view() == "string")
            AddLine(core::ReadLocalText(*child, "text"));
    TakeNaturalSize(*this, GetPreferredSize());
    int selected = 0;
    ReadChecked(node, "selected", selected, -1, INT_MAX);
    SelectLine(selected, true);
}

// Geometry ------------------------------------------------------------------------------------

misc::FloatVector CComboBoxWidget::GetPreferredSize() const
{
    const FloatVector list = m_List->GetPreferredSize(), back = GetBack()->GetImage().GetTextureSize();
    const FloatVector label = m_Label->GetPreferredSize(), button = m_Button->GetPreferredSize();
    return {std::max({list.X - GetList()->GetScrollWidth(), back.X, label.X}) + button.X,
            std::max({back.Y, button.Y, label.Y})};
}

void CComboBoxWidget::SetSize(float width, float height)
{
    m_BoxHeight = height;
    CWidget::SetSize(width, height + (Hidden(m_List) ? 0.0f : m_ListHeight));
    Arrange();
}

void CComboBoxWidget::Arrange()
{
    const float width = GetSize().X, top = m_OpenUp && !Hidden(m_List) ? m_ListHeight : 0.0f;
    const FloatVector button = m_Button->GetSize();
    m_Back->SetOffset(0, top);
    m_Back->SetSize(width, m_BoxHeight);
    m_Label->SetOffset(0, top);
    m_Label->SetSize(std::max(0.0f, width - button.X), m_BoxHeight);
    m_Button->SetOffset(width - button.X, top + std::floor((m_BoxHeight - button.Y) / 2));
    m_List->SetOffset(0, m_OpenUp ? 0.0f : m_BoxHeight);
    m_List->SetSize(width, m_ListHeight);
}

// The list opens below the box when it fits on the canvas; otherwise on the side with more
// room, cut to the whole lines that fit there.
void CComboBoxWidget::ChooseListPlace()
{
    const float wanted = m_List->GetPreferredSize().Y, canvas = GetGuiServices().canvas.Y;
    const float boxTop = GetAbsPos(true).Y + m_Raised;
    const float below = canvas - boxTop - m_BoxHeight, above = boxTop;
    m_OpenUp = wanted > below && above > below;
    const float room = m_OpenUp ? above : below;
    m_ListHeight = wanted;
    if (wanted > room) {
        const float line = GetList()->LineHeight();
        const float fit = line > 0 ? std::floor((room - GetList()->CalcHeightToFitLines(0)) / line) : 0.0f;
        m_ListHeight = std::max(GetList()->CalcHeightToFitLines(static_cast<int>(std::max(fit, 1.0f))), 0.0f);
    }
}

void CComboBoxWidget::ShowList(bool show)
{
    const FloatVector box(GetOffset().X, GetOffset().Y + m_Raised);
    if (show) {
        m_List->RemFlags(FlagHidden | FlagDisabled);
        ChooseListPlace();
        ComeToFront();
    } else {
        m_List->AddFlags(FlagHidden | FlagDisabled);
        m_OpenUp = false;
    }
    // Opened upwards, the widget rises by the list's height so that its area holds the list.
    m_Raised = show && m_OpenUp ? m_ListHeight : 0.0f;
    CWidget::SetOffset(box.X, box.Y - m_Raised);
    SetSize(GetSize().X, m_BoxHeight);
    if (show)
        TellParent(*this, "list_showed");
}

// An open list lies over the widgets after the box: the box goes in front of its siblings
// (those always on top stay in front).
void CComboBoxWidget::ComeToFront()
{
    CBaseWidget* parent = GetParentWidget();
    if (!parent)
        return;
    for (const WidgetPtrT& sibling : parent->GetWidgets()) {
        if (sibling->GetLayer() == LayerAlwaysOnTop)
            continue;
        if (sibling.get() != this)
            LayInFront(*sibling);
        return;
    }
}

bool CComboBoxWidget::IsListShown() const { return !Hidden(m_List); }

// Choosing ------------------------------------------------------------------------------------

void CComboBoxWidget::OnChildAction(const std::string& action, CWidget* sender)
{
    CWidget::OnChildAction(action, sender);
    if (action == "line_selected" && sender == m_List.get()) {
        ShowList(false);
        SetText(GetLine(GetSelectedLine()), true);
    } else if (action == "pressed" && sender == m_Button.get()) {
        if (!std::exchange(m_ToggledByPress, false))
            ShowList(!IsListShown());
    }
}

bool CComboBoxWidget::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    const uint32_t listFlags = m_List->GetFlags();
    bool handled = CWidget::OnMouseDown(pos, button, keys, broadcast);
    const FloatVector point(static_cast<float>(pos.X), static_cast<float>(pos.Y));
    const bool onButton = m_Button->ContainsPoint(point), onLabel = m_Label->ContainsPoint(point);
    const bool onList = m_List->ContainsPoint(point);
    if (!broadcast) {
        m_ToggledByPress = onButton;
        if (onButton) {
            if (!IsListShown())
                PlayGuiSound(m_OpenSound);
            ShowList(!IsListShown());
            handled = true;
        } else if (listFlags != m_List->GetFlags() && onList && !onLabel) {
            PlayGuiSound(m_SelectSound);
        }
    }
    if (!onButton && !onList && !onLabel && IsListShown())
        ShowList(false);
    return handled;
}

void CComboBoxWidget::SelectLine(int index, bool notify)
{
    GetList()->SelectLine(index, notify);
    if (notify)
        return;
    ShowList(false);
    SetText(GetLine(GetSelectedLine()), false);
}

void CComboBoxWidget::SetText(const wstring& text, bool notify)
{
    GetLabel()->SetText(text);
    if (notify)
        OnLineSelected();
}

wstring CComboBoxWidget::GetText() const { return GetLabel()->GetText(); }

void CComboBoxWidget::OnLineSelected() { TellParent(*this, "line_selected"); }

// The list's lines ------------------------------------------------------------------------------

void CComboBoxWidget::AddLine(const wstring& text) { GetList()->AddLine(text); }
void CComboBoxWidget::RemoveLine(int index) { GetList()->RemoveLine(index); }
int CComboBoxWidget::EnumLines() const { return GetList()->EnumLines(); }
wstring CComboBoxWidget::GetLine(int index) const { return GetList()->GetLine(index); }
void CComboBoxWidget::SetLine(int index, const wstring& text) { GetList()->SetLine(index, text); }
int CComboBoxWidget::FindLine(const wstring& text) const { return GetList()->FindLine(text); }
int CComboBoxWidget::GetSelectedLine() const { return GetList()->GetSelectedLine(); }

void CComboBoxWidget::ClearLines()
{
    GetList()->ClearLines();
    SetText(wstring(), true);
}

} // namespace ox::gui
