#include "gui/controls/CheckboxWidget.h"

#include "core/SettingsReaders.h"
#include "graphics/Renderer.h"
#include "gui/Cursor.h"
#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/controls/ControlSupport.h"
#include "gui/controls/LabelWidget.h"

#include <algorithm>
#include <cmath>

namespace ox::gui {

CCheckboxWidget::CCheckboxWidget()
    : CWidget({}, LayerTop, BroadcastOnMouseMove), m_CheckTimer(core::GetTimeManager().AttachTimer(nullptr))
{
}

CCheckboxWidget::~CCheckboxWidget() = default;

void CCheckboxWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "checkbox_template");
    ReadImage(tmpl, "box_image", m_Box);
    ReadImage(tmpl, "check_image", m_Tick);
    ReadImage(tmpl, "gray_box_image", m_GrayBox);
    ReadImage(tmpl, "gray_check_image", m_GrayTick);
    ReadChecked(tmpl, "indent", m_Indent, 0, kMaxDescriptionSize);
    m_SoundOnCheck = ReadSound(tmpl, "sound_on_check");
    m_SoundOnCheckTrue = ReadSound(tmpl, "sound_on_check_true");
    m_SoundOnCheckFalse = ReadSound(tmpl, "sound_on_check_false");
    ReadSeconds(tmpl, "check_time", m_CheckTime);

    auto* label = new CLabelWidget();
    m_Label = label;
    label->SetFont(ReadFont(tmpl, "font"));
    label->SetJustifications(-1, 0);
    AddWidget(m_Label);
    wstring text;
    if (core::ReadLocalText(node, "text", text))
        SetText(text);
    const std::string& where = node.GetValue("text_loc");
    if (where == "left" || where == "right")
        m_TextLeft = where == "left";
    else if (!where.empty())
        ReportElement(node, "text_loc is neither left nor right, ignored: ", where);
    bool checked = false;
    ReadFlag(node, "checked", checked);
    Check(checked, false);
    m_TickFrom = checked ? 1.0f : 0.0f;
    CWidget::Load(node, templates);
    const FloatVector preferred = GetPreferredSize();
    SetSize(std::max(preferred.X, GetSize().X), std::max(preferred.Y, GetSize().Y));
}

void CCheckboxWidget::SetText(const wstring& text)
{
    Label()->SetText(text);
    Label()->ResizeToFitText(true);
    PlaceParts();
}

wstring CCheckboxWidget::GetText() const { return Label()->GetText(); }

CLabelWidget* CCheckboxWidget::Label() const { return static_cast<CLabelWidget*>(m_Label.get()); }

misc::FloatVector CCheckboxWidget::GetPreferredSize() const
{
    const FloatVector box = m_Box.GetTextureSize();
    const FloatVector text = Label()->GetText().empty() ? FloatVector() : Label()->GetPreferredSize();
    return {box.X + (text.X > 0 ? m_Indent + text.X : 0), std::max(box.Y, text.Y)};
}

void CCheckboxWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    PlaceParts();
}

void CCheckboxWidget::PlaceParts()
{
    // The text stands beside the box, centred on the widget's height.
    const float boxWidth = m_Box.GetTextureSize().X;
    const FloatVector text = Label()->GetSize();
    const float x = m_TextLeft ? 0 : boxWidth + m_Indent;
    Label()->SetOffset(x, std::floor((GetSize().Y - text.Y) / 2));
}

// Checking ------------------------------------------------------------------------------------

float CCheckboxWidget::GetTickAlpha() const
{
    const float target = m_State == Checked ? 1.0f : 0.0f;
    if (m_CheckTime == 0)
        return target;
    const float k = std::clamp(static_cast<float>(TimerNow(m_CheckTimer)) / static_cast<float>(m_CheckTime), 0.0f, 1.0f);
    return m_TickFrom + (target - m_TickFrom) * k;
}

void CCheckboxWidget::Check(bool on, bool notify)
{
    // A fade that is under way goes on from where it stands.
    m_TickFrom = m_State == Unspecified ? (on ? 0.0f : 1.0f) : GetTickAlpha();
    if (m_CheckTimer.Get())
        m_CheckTimer.Get()->SetTime(0);
    m_State = on ? Checked : Unchecked;
    if (notify)
        OnCheckChanged();
}

void CCheckboxWidget::SetUnspecifiedState() { m_State = Unspecified; }

void CCheckboxWidget::OnCheckChanged() { TellParent(*this, "check_changed"); }

void CCheckboxWidget::PlayCheckSounds()
{
    PlayGuiSound(m_SoundOnCheck);
    PlayGuiSound(IsChecked() ? m_SoundOnCheckTrue : m_SoundOnCheckFalse);
}

// Input ---------------------------------------------------------------------------------------

bool CCheckboxWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (broadcast)
        CWidget::OnMouseMove(pos, keys, true);
    if (broadcast && !IsInside(*this, pos)) {
        if (m_Over) {
            m_Over = false;
            TellParent(*this, "lost_over");
        }
        return true;
    }
    CCursor::Instance().SetCursor(CCursor::CursorHand);
    if (!m_Over) {
        m_Over = true;
        TellParent(*this, "overed");
    }
    return true;
}

bool CCheckboxWidget::OnMouseDown(const IntVector& /*pos*/, MouseButtons /*button*/, int /*keys*/, bool broadcast)
{
    if (broadcast)
        return false;
    WidgetPtrT held(this);
    Check(!IsChecked(), true);
    PlayCheckSounds();
    return true;
}

// Drawing -------------------------------------------------------------------------------------

void CCheckboxWidget::DoDraw(graphics::CRenderer& renderer)
{
    const FloatVector box = m_Box.GetTextureSize();
    const float x = m_TextLeft ? GetSize().X - box.X : 0;
    const misc::FloatRect rect(x, std::floor((GetSize().Y - box.Y) / 2), box.X, box.Y);
    if (m_State == Unspecified) {
        m_GrayBox.Draw(renderer, misc::FloatRect(rect.X, rect.Y, m_GrayBox.GetTextureSize().X, m_GrayBox.GetTextureSize().Y));
        m_GrayTick.Draw(renderer, misc::FloatRect(rect.X, rect.Y, m_GrayTick.GetTextureSize().X, m_GrayTick.GetTextureSize().Y));
    } else {
        m_Box.Draw(renderer, rect);
        if (const float alpha = GetTickAlpha(); alpha > 0) {
            graphics::Color tint;
            tint.Alpha = static_cast<int16_t>(255 * alpha);
            m_Tick.SetColor(tint);
            const FloatVector tick = m_Tick.GetTextureSize();
            m_Tick.Draw(renderer, misc::FloatRect(rect.X + (box.X - tick.X) / 2, rect.Y + (box.Y - tick.Y) / 2, tick.X, tick.Y));
        }
    }
    CWidget::DoDraw(renderer);
}

} // namespace ox::gui
