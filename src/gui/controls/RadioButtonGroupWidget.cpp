#include "gui/controls/RadioButtonGroupWidget.h"

#include "core/SettingsReaders.h"
#include "gui/Description.h"
#include "gui/controls/CheckboxWidget.h"
#include "gui/controls/ControlSupport.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

namespace {
constexpr int kMaxColumns = 64;
}

void CRadioButtonGroupWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CWidget::Load(node, templates);
    int columns = 1;
    ReadChecked(node, "columns_count", columns, 0, kMaxColumns);
    columns = std::max(columns, 1);

    for (const core::CSettingsGroup* child = node.GetChild("buttons").GetFirstChildRef(); child;
         child = child->GetNextSiblingRef()) {
        boost::intrusive_ptr<CCheckboxWidget> button(new CCheckboxWidget());
        button->Load(*child, templates);
        button->SetText(core::ReadLocalText(*child, "caption"));
        button->SetSize(button->GetPreferredSize().X, button->GetPreferredSize().Y);
        m_Buttons.push_back(button);
    }
    if (m_Buttons.empty())
        ReportElement(node, "a radio group without buttons");

    // Columns of equal width, rows of equal height, filled top to bottom.
    float cellW = 0, cellH = 0;
    for (const auto& button : m_Buttons) {
        cellW = std::max(cellW, button->GetSize().X);
        cellH = std::max(cellH, button->GetSize().Y);
    }
    const size_t rows = (m_Buttons.size() + columns - 1) / columns;
    for (size_t i = 0; i < m_Buttons.size(); ++i) {
        m_Buttons[i]->SetOffset(cellW * static_cast<float>(i / rows), cellH * static_cast<float>(i % rows));
        m_Buttons[i]->Check(i == 0, false);
        AddWidget(m_Buttons[i]);
    }
    const FloatVector preferred = GetPreferredSize();
    SetSize(std::max(preferred.X, GetSize().X), std::max(preferred.Y, GetSize().Y));
}

misc::FloatVector CRadioButtonGroupWidget::GetPreferredSize() const
{
    FloatVector size;
    for (const auto& button : m_Buttons) {
        size.X = std::max(size.X, button->GetOffset().X + button->GetSize().X);
        size.Y = std::max(size.Y, button->GetOffset().Y + button->GetSize().Y);
    }
    return size;
}

bool CRadioButtonGroupWidget::OnMouseDown(const IntVector& pos, MouseButtons /*button*/, int /*keys*/, bool broadcast)
{
    if (broadcast)
        return false;
    const FloatVector point(static_cast<float>(pos.X), static_cast<float>(pos.Y));
    for (size_t i = 0; i < m_Buttons.size(); ++i) {
        if (!m_Buttons[i]->ContainsPoint(point))
            continue;
        if (m_Buttons[i]->IsChecked())
            return false;
        WidgetPtrT held(this);
        Select(i);
        m_Buttons[i]->PlayCheckSounds();
        return true;
    }
    return false;
}

void CRadioButtonGroupWidget::Select(size_t index)
{
    for (size_t i = 0; i < m_Buttons.size(); ++i)
        if (i != index && m_Buttons[i]->GetCheckState() != CCheckboxWidget::Unchecked)
            m_Buttons[i]->Check(false, false);
    m_Buttons[index]->Check(true, true);
    OnChangeChecked();
}

int CRadioButtonGroupWidget::GetChecked() const
{
    for (size_t i = 0; i < m_Buttons.size(); ++i)
        if (m_Buttons[i]->IsChecked())
            return static_cast<int>(i);
    return -1;
}

void CRadioButtonGroupWidget::Check(int index)
{
    if (index < 0 || static_cast<size_t>(index) >= m_Buttons.size() || m_Buttons[index]->IsChecked())
        return;
    Select(static_cast<size_t>(index));
}

void CRadioButtonGroupWidget::OnChangeChecked() { TellParent(*this, "change_checked"); }

} // namespace ox::gui
