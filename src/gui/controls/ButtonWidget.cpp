#include "gui/controls/ButtonWidget.h"

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

namespace {

constexpr int kMaxTileStep = 4096;
constexpr const char* kColorKeys[4] = {"color_normal", "color_over", "color_pressed", "color_disabled"};

float RoundUpToStep(float v, int step)
{
    const int whole = static_cast<int>(v);
    return step == 0 || whole % step == 0 ? v : static_cast<float>((whole / step + 1) * step);
}

graphics::Color Blend(const graphics::Color& a, const graphics::Color& b, float k)
{
    auto mix = [k](int16_t x, int16_t y) { return static_cast<int16_t>(static_cast<float>(x) + (y - x) * k); };
    return {mix(a.Red, b.Red), mix(a.Green, b.Green), mix(a.Blue, b.Blue), mix(a.Alpha, b.Alpha)};
}

} // namespace

CButtonWidget::CButtonWidget()
    : CWidget({}, LayerTop, BroadcastOnMouseMove | BroadcastOnMouseUp),
      m_FadeTimer(core::GetTimeManager().AttachTimer(nullptr))
{
}

CButtonWidget::~CButtonWidget() = default;

void CButtonWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const core::CSettingsGroup& tmpl = FindTemplate(node, templates, "button_template");
    ReadChecked(tmpl, "tile_step_x", m_TileStepX, 0, kMaxTileStep);
    ReadChecked(tmpl, "tile_step_y", m_TileStepY, 0, kMaxTileStep);
    ReadSeconds(tmpl, "image_fade_time", m_FadeTime);
    m_SoundOnPress = ReadSound(tmpl, "sound_on_press");
    m_SoundOnOver = ReadSound(tmpl, "sound_on_over");
    m_SoundOnDisabledPress = ReadSound(tmpl, "sound_on_disabled_press");
    ReadImage(tmpl, "image", m_Image);

    if (tmpl.IsValue("label_template")) {
        // The label's own description: its template, and the button's words for its layout.
        core::CSettingsGroup label(misc::StringA88("label_widget"));
        label.AddValue("label_template", tmpl.GetValue("label_template").c_str());
        label.AddValue("justification", node.IsValue("justification") ? node.GetValue("justification").c_str() : "center");
        if (node.IsValue("multi_string_flag"))
            label.AddValue("multi_string_flag", node.GetValue("multi_string_flag").c_str());
        auto* made = new CLabelWidget();
        m_Label = made;
        made->Load(label, templates);
        made->SetAnchors(AnchorLeft | AnchorRight | AnchorTop | AnchorBottom);
        AddWidget(m_Label);
    }
    for (int i = 0; i < 4; ++i)
        ReadColorChecked(node, kColorKeys[i], m_Colors[i]);
    wstring text;
    if (core::ReadLocalText(node, "text", text))
        SetText(text);
    CWidget::Load(node, templates);
    TakeNaturalSize(*this, GetPreferredSize());
    if (m_Label)
        m_Label->SetSize(GetSize().X, GetSize().Y);
    bool disabled = false;
    DisableButton(ReadFlag(node, "disabled", disabled) && disabled);
}

void CButtonWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    const float x = RoundUpToStep(width, m_TileStepX), y = RoundUpToStep(height, m_TileStepY);
    if (x != width || y != height)
        CWidget::SetSize(x, y);
}

misc::FloatVector CButtonWidget::GetPreferredSize() const
{
    const FloatVector image = m_Image.GetTextureSize();
    return {std::floor(image.X / 4), image.Y};
}

// State ---------------------------------------------------------------------------------------

void CButtonWidget::ChangeState(State state)
{
    if (state == m_State)
        return;
    m_OldState = m_State;
    m_State = state;
    if (m_FadeTimer.Get())
        m_FadeTimer.Get()->SetTime(0);
}

float CButtonWidget::FadeProgress() const
{
    if (m_FadeTime == 0)
        return 1.0f;
    return std::clamp(static_cast<float>(TimerNow(m_FadeTimer)) / static_cast<float>(m_FadeTime), 0.0f, 1.0f);
}

void CButtonWidget::DisableButton(bool disable)
{
    if (disable == (m_State == StateDisabled))
        return;
    ChangeState(disable ? StateDisabled : StateNormal);
    if (disable)
        m_OldState = StateDisabled; // no fade: only the disabled image stays
    if (m_Label)
        m_Label->SetColor(m_Colors[m_State]);
}

// Input ---------------------------------------------------------------------------------------

bool CButtonWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (m_State == StateDisabled)
        return false;
    // Children that asked (a tool tip) see the move as well.
    if (broadcast)
        CWidget::OnMouseMove(pos, keys, true);
    if (broadcast && !IsInside(*this, pos)) {
        if (m_State != StatePressed) {
            const bool wasOver = m_State == StateOver;
            ChangeState(StateNormal);
            if (wasOver)
                TellParent(*this, "lost_over");
        }
        return true;
    }
    CCursor::Instance().SetCursor(CCursor::CursorHand);
    if (m_State != StateOver && m_State != StatePressed) {
        PlayGuiSound(m_SoundOnOver);
        ChangeState(StateOver);
        TellParent(*this, "overed");
    }
    return true;
}

bool CButtonWidget::OnMouseDown(const IntVector& /*pos*/, MouseButtons /*button*/, int /*keys*/, bool broadcast)
{
    if (m_State == StateDisabled || broadcast)
        return false;
    ChangeState(StatePressed);
    return true;
}

bool CButtonWidget::OnMouseUp(const IntVector& pos, MouseButtons /*button*/, int /*keys*/, bool broadcast)
{
    const bool inside = IsInside(*this, pos);
    if (m_State == StateDisabled) {
        // Said once, in the pass that finds the button under the pointer.
        if (inside && !broadcast)
            PlayGuiSound(m_SoundOnDisabledPress);
        return false;
    }
    const bool wasPressed = m_State == StatePressed;
    ChangeState(inside ? StateOver : StateNormal);
    if (wasPressed && inside)
        OnButtonPressed();
    return !broadcast;
}

bool CButtonWidget::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    return OnMouseDown(pos, LeftButton, keys, broadcast);
}

void CButtonWidget::OnButtonPressed()
{
    PlayGuiSound(m_SoundOnPress);
    TellParent(*this, "pressed");
}

// Text and drawing -------------------------------------------------------------------------------

CLabelWidget* CButtonWidget::GetLabel() const { return static_cast<CLabelWidget*>(m_Label.get()); }

void CButtonWidget::SetText(const wstring& text)
{
    if (CLabelWidget* label = GetLabel())
        label->SetText(text);
}

wstring CButtonWidget::GetText() const { return m_Label ? GetLabel()->GetText() : wstring(); }

void CButtonWidget::SetLabelColor(int state, const graphics::Color& color)
{
    if (state < StateNormal || state > StateDisabled)
        return;
    m_Colors[state] = color;
}

void CButtonWidget::DoDraw(graphics::CRenderer& renderer)
{
    const float k = FadeProgress();
    if (const graphics::CTexture* texture = m_Image.GetTexture()) {
        const misc::FloatRect rect(0, 0, GetSize().X, GetSize().Y);
        if (k < 1.0f)
            renderer.RenderTexture(texture, rect, StripPart(*texture, m_OldState, 4));
        graphics::Color alpha;
        alpha.Alpha = static_cast<int16_t>(255 * k);
        renderer.RenderTexture(texture, rect, StripPart(*texture, m_State, 4), alpha);
    }
    if (m_Label)
        m_Label->SetColor(k < 1.0f ? Blend(m_Colors[m_OldState], m_Colors[m_State], k) : m_Colors[m_State]);
    CWidget::DoDraw(renderer);
}

} // namespace ox::gui
