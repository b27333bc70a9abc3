#include "gui/controls/TabWidget.h"

#include "core/SettingsReaders.h"
#include "gui/Description.h"
#include "gui/LayoutBox.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/ImageWidget.h"

#include <algorithm>

namespace ox::gui {

namespace {

constexpr uint32_t kPanelLayer = 2;
constexpr uint32_t kFrameLayer = 1;
constexpr uint32_t kAllAnchors = AnchorLeft | AnchorRight | AnchorTop | AnchorBottom;

// The element's attributes without its children: a tab's button must not build the panel's
// content as its own.
void CopyAttributes(const core::CSettingsGroup& from, core::CSettingsGroup& to)
{
    for (unsigned i = 0; i < from.EnumAttributes(); ++i) {
        const misc::StringA88& name = from.GetAttribute(i);
        to.AddValue(name, from.GetValue(name));
    }
}

// A plain widget's wish: what its box of child widgets needs.
misc::FloatVector ContentSize(const CWidget& widget)
{
    return widget.GetLayoutBox() ? widget.GetLayoutBox()->ComputePreferredSize() : widget.GetPreferredSize();
}

} // namespace

CTabWidget::CTabWidget() = default;
CTabWidget::~CTabWidget() = default;

void CTabWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "tab_template");
    misc::FloatInsets tabInsets;
    ReadInsets(tmpl.GetChild("tab_insets"), tabInsets);
    ReadChecked(tmpl, "tab_offset_left", m_TabOffsetLeft, -kMaxDescriptionSize, kMaxDescriptionSize);
    ReadChecked(tmpl, "tab_offset_right", m_TabOffsetRight, -kMaxDescriptionSize, kMaxDescriptionSize);
    ReadChecked(tmpl, "tab_offset_bottom", m_TabOffsetBottom, -kMaxDescriptionSize, kMaxDescriptionSize);
    float tabSpace = 0;
    ReadChecked(tmpl, "tab_space", tabSpace, -kMaxDescriptionSize, kMaxDescriptionSize);
    ReadFlag(tmpl, "alignment_left", m_AlignmentLeft);
    CWidget::Load(node, templates);

    for (const core::CSettingsGroup* tab = node.GetChild("tabs").GetFirstChildRef(); tab;
         tab = tab->GetNextSiblingRef()) {
        Panel panel;
        panel.caption = core::ReadLocalText(*tab, "caption");
        core::CSettingsGroup attributes(tab->GetId());
        CopyAttributes(*tab, attributes);
        panel.button = new CButtonWidget();
        panel.button->Load(attributes, templates);
        panel.button->SetAnchors(AnchorLeft | AnchorTop);
        panel.button->SetText(panel.caption);
        panel.content = new CWidget();
        panel.content->Load(*tab, templates);
        panel.content->SetInsets(tabInsets);
        if (panel.content->GetLayoutBox())
            panel.content->GetLayoutBox()->SetInsets(tabInsets);
        panel.content->UpdateLayout();
        m_Panels.push_back(std::move(panel));
    }

    // The strip: each tab behind the one before it, overlapping it by `tab_space`; down the
    // left side every tab as wide as the widest, which stands at x 0.
    float widest = 0;
    for (const Panel& panel : m_Panels)
        widest = std::max(widest, panel.button->GetSize().X);
    float along = m_TabOffsetLeft;
    for (size_t i = 0; i < m_Panels.size(); ++i) {
        CButtonWidget& button = *m_Panels[i].button;
        if (m_AlignmentLeft) {
            button.SetSize(widest, button.GetSize().Y);
            button.SetOffset(0, along);
            along += button.GetSize().Y - tabSpace;
        } else {
            button.SetOffset(along, 0);
            along += button.GetSize().X - tabSpace;
        }
        button.SetLayer(ButtonLayer(i));
    }

    m_BackImage = new CImageWidget();
    m_BackImage->SetImage(tmpl.GetValue("back_image").c_str());
    m_BackImage->GetImage().SetFlags(graphics::CImage::FlagBoxImage | graphics::CImage::FlagIntDest);
    m_BackImage->SetAnchors(kAllAnchors);
    m_BackImage->SetLayer(kFrameLayer);
    AddWidget(m_BackImage);
    for (Panel& panel : m_Panels) {
        panel.content->SetLayer(kPanelLayer);
        panel.content->AddFlags(FlagHidden | FlagDisabled);
        AddWidget(panel.content);
        AddWidget(panel.button);
    }
    const FloatVector preferred = GetPreferredSize();
    SetSize(std::max(preferred.X, GetSize().X), std::max(preferred.Y, GetSize().Y));
    int selected = 0;
    ReadChecked(node, "selected", selected, -1, 1 << 20);
    SelectPanel(selected);
}

uint32_t CTabWidget::ButtonLayer(size_t index) const
{
    return static_cast<uint32_t>(m_Panels.size() - index + 2);
}

float CTabWidget::StripThickness() const
{
    float thickness = 0;
    for (const Panel& panel : m_Panels)
        thickness = std::max(thickness, m_AlignmentLeft ? panel.button->GetSize().X : panel.button->GetSize().Y);
    return thickness;
}

float CTabWidget::StripLength() const
{
    if (m_Panels.empty())
        return 0;
    const CButtonWidget& last = *m_Panels.back().button;
    const float end = m_AlignmentLeft ? last.GetOffset().Y + last.GetSize().Y : last.GetOffset().X + last.GetSize().X;
    return end + m_TabOffsetRight;
}

float CTabWidget::FrameStart() const { return m_Panels.empty() ? 0 : StripThickness() - m_TabOffsetBottom; }

misc::FloatVector CTabWidget::PanelSize(const FloatVector& size) const
{
    // The frame's inner room: the frame less the overlap across the tabs, at least the strip
    // along them; and at least what every panel wants.
    const float across = FrameStart() + m_TabOffsetBottom;
    FloatVector inner = m_AlignmentLeft ? FloatVector(size.X - across, std::max(size.Y, StripLength()))
                                        : FloatVector(std::max(size.X, StripLength()), size.Y - across);
    for (const Panel& panel : m_Panels) {
        const FloatVector wanted = ContentSize(*panel.content);
        inner = {std::max(inner.X, wanted.X), std::max(inner.Y, wanted.Y)};
    }
    return {std::max(inner.X, 0.0f), std::max(inner.Y, 0.0f)};
}

misc::FloatVector CTabWidget::GetPreferredSize() const
{
    if (m_Panels.empty())
        return {};
    const FloatVector panel = PanelSize({});
    const float across = FrameStart() + m_TabOffsetBottom;
    return m_AlignmentLeft ? FloatVector(across + panel.X, panel.Y) : FloatVector(panel.X, across + panel.Y);
}

void CTabWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    if (!m_BackImage)
        return;
    const float start = FrameStart();
    const FloatVector panel = PanelSize({width, height});
    const float across = start + m_TabOffsetBottom;
    if (m_AlignmentLeft) {
        m_BackImage->SetOffset(start, 0);
        m_BackImage->SetSize(width - start, height);
    } else {
        m_BackImage->SetOffset(0, start);
        m_BackImage->SetSize(width, height - start);
    }
    for (Panel& p : m_Panels) {
        p.content->SetOffset(m_AlignmentLeft ? across : 0, m_AlignmentLeft ? 0 : across);
        p.content->SetSize(panel.X, panel.Y);
    }
}

void CTabWidget::SelectPanel(int index)
{
    if (index < 0 || index >= EnumPanels() || index == m_SelectedPanel)
        return;
    Panel& chosen = m_Panels[static_cast<size_t>(index)];
    chosen.content->RemFlags(FlagHidden | FlagDisabled);
    chosen.button->DisableButton(true);
    chosen.button->SetLayer(LayerAlwaysOnTop);
    if (m_SelectedPanel >= 0) {
        Panel& old = m_Panels[static_cast<size_t>(m_SelectedPanel)];
        old.content->AddFlags(FlagHidden | FlagDisabled);
        old.button->DisableButton(false);
        old.button->SetLayer(ButtonLayer(static_cast<size_t>(m_SelectedPanel)));
    }
    m_SelectedPanel = index;
    SortChildren();
    OnPanelSelected();
}

CWidget* CTabWidget::GetPanelContent(int index) const
{
    return index < 0 || index >= EnumPanels() ? nullptr : m_Panels[static_cast<size_t>(index)].content.get();
}

CWidget* CTabWidget::GetPanelContent(const wstring& caption) const
{
    auto found = std::find_if(m_Panels.begin(), m_Panels.end(), [&](const Panel& p) { return p.caption == caption; });
    return found == m_Panels.end() ? nullptr : found->content.get();
}

void CTabWidget::OnChildAction(const std::string& action, CWidget* sender)
{
    if (action == "pressed") {
        auto found = std::find_if(m_Panels.begin(), m_Panels.end(), [&](const Panel& p) { return p.button == sender; });
        if (found != m_Panels.end()) {
            SelectPanel(static_cast<int>(found - m_Panels.begin()));
            return;
        }
    }
    CWidget::OnChildAction(action, sender);
}

void CTabWidget::OnPanelSelected() { TellParent(*this, "panel_selected"); }

} // namespace ox::gui
