#include "game/WindowEffects.h"

#include "core/SettingsReaders.h"
#include "diag/Log.h"
#include "game/GameClock.h"
#include "graphics/Renderer.h"
#include "gui/GuiServices.h"
#include "gui/Window.h"
#include "misc/Unicode.h"

#include <algorithm>
#include <map>

namespace k17 {

using namespace ox;
using misc::FloatVector;

namespace {

const core::CSettingsGroup* g_Effects = nullptr;

std::map<wstring, EffectMakerT>& Makers()
{
    static std::map<wstring, EffectMakerT> makers;
    return makers;
}

float Now() { return static_cast<float>(GetGameClock()); }

bool Exists(const core::CSettingsGroup& group) { return &group != &core::CSettingsGroup::Empty(); }

// Where a change of `time` milliseconds from `start` stands at `now`, from 0 to 1.
float Fraction(float now, float start, float time) { return (std::min(now, start + time) - start) / time; }

graphics::Color Mix(const graphics::Color& from, const graphics::Color& to, float f)
{
    auto channel = [f](int16_t a, int16_t b) { return static_cast<int16_t>(a + (b - a) * f); };
    graphics::Color color;
    color.Red = channel(from.Red, to.Red);
    color.Green = channel(from.Green, to.Green);
    color.Blue = channel(from.Blue, to.Blue);
    color.Alpha = channel(from.Alpha, to.Alpha);
    color.Clamp();
    return color;
}

// Fills the canvas with `color`, whatever transform the widget drawing stands in.
void FillCanvas(graphics::CRenderer& renderer, const graphics::Color& color)
{
    renderer.PushState();
    renderer.ApplyMatrix(misc::MatrixInverse(renderer.GetMatrix()));
    const misc::IntVector source = renderer.GetSourceResolution();
    renderer.RenderFilledPoly4(misc::RectToPoly4({0, 0, float(source.X), float(source.Y)}), color);
    renderer.PopState();
}

} // namespace

void SetEffectsSettings(const core::CSettingsGroup* effects) { g_Effects = effects; }

const core::CSettingsGroup& GetEffectGroup(const char* id)
{
    if (!g_Effects)
        return core::CSettingsGroup::Empty();
    return g_Effects->GetChildByAttribute("gui_effect", "id", id, false);
}

void RegisterEffect(const wstring& name, EffectMakerT maker) { Makers()[name] = std::move(maker); }

gui::EffectPtrT CreateEffect(const wstring& name)
{
    auto found = Makers().find(name);
    return found == Makers().end() ? gui::EffectPtrT() : found->second();
}

void RegisterWindowEffects()
{
    RegisterEffect(u"show_window_effect", [] { return gui::EffectPtrT(new CWindowShowEffect()); });
    RegisterEffect(u"hide_window_effect", [] { return gui::EffectPtrT(new CWindowHideEffect()); });
    gui::GetGuiServices().createEffect = CreateEffect;
}

// Show and hide ------------------------------------------------------------------------------

CWindowShowHideBaseEffect::CWindowShowHideBaseEffect(const char* id)
{
    const core::CSettingsGroup& group = GetEffectGroup(id);
    if (!Exists(group)) {
        OX_LOG("data", diag::LogWarning, "no <gui_effect id=\"%s\"> in the effects: the window scales not", id);
        return;
    }
    core::ReadVector(group, "begin_scale", m_BeginScale);
    core::ReadVector(group, "end_scale", m_EndScale);
    core::ReadFloat(group, "time", m_Time);
    core::ReadFloat(group, "shift_time", m_Shift);
}

void CWindowShowHideBaseEffect::InitWidget(gui::CBaseWidget& widget)
{
    m_Transform = widget.GetRotation();
    m_Size = widget.GetSize();
    m_Pos = widget.GetOffset();
    m_StartTime = Now() + m_Shift;
    widget.AddFlags(gui::FlagDisabled);
}

FloatVector CWindowShowHideBaseEffect::Scale(float now) const
{
    const float f = (now - m_StartTime) / m_Time;
    return m_BeginScale + (m_EndScale - m_BeginScale) * f;
}

// The widget at scale `s` about its centre.
void CWindowShowHideBaseEffect::Apply(gui::CBaseWidget& widget, const FloatVector& s) const
{
    widget.SetOffset((1 - s.X) * m_Size.X / 2 + m_Pos.X, (1 - s.Y) * m_Size.Y / 2 + m_Pos.Y);
    widget.SetRotation(misc::MatrixScale(s.X, s.Y) * m_Transform);
}

void CWindowShowHideBaseEffect::UpdateWidget(gui::CBaseWidget& widget)
{
    const float now = Now();
    if (now < m_StartTime + m_Time) {
        if (m_Time != 0 && now >= m_StartTime)
            Apply(widget, Scale(now));
        return;
    }
    Apply(widget, m_EndScale);
    widget.RemFlags(gui::FlagDisabled);
    SetDead(true);
}

void CWindowShowEffect::InitWidget(gui::CBaseWidget& widget)
{
    CWindowShowHideBaseEffect::InitWidget(widget);
    const core::CSettingsGroup& shadow = GetEffectGroup("shadow_window_effect");
    const core::CSettingsGroup& show = GetEffectGroup("show_window_effect");
    if (!Exists(show))
        return;
    if (Exists(shadow))
        widget.AddEffect(new CWindowChangeShadowEffect(core::ReadColor(shadow, "no_shadow_color"),
                                                       core::ReadColor(shadow, "shadow_color"), m_Time, m_Shift, true));
    const graphics::Color color = widget.GetColor();
    widget.SetColor(core::ReadColor(show, "begin_color"));
    widget.AddEffect(new CColorChangeEffect(color, m_Time, m_Shift));
}

void CWindowHideEffect::InitWidget(gui::CBaseWidget& widget)
{
    CWindowShowHideBaseEffect::InitWidget(widget);
    for (const gui::EffectPtrT& effect : widget.GetEffects())
        if (dynamic_cast<CWindowShadowEffect*>(effect.get()))
            effect->SetDead(true);
    widget.RemFlags(gui::FlagDead);
    gui::CBaseWidget* target = &widget;
    auto* window = dynamic_cast<gui::CWindow*>(&widget);
    if (window && window->GetParentWindow())
        target = new CDrawWindowWidget(*window);
    const core::CSettingsGroup& shadow = GetEffectGroup("shadow_window_effect");
    const core::CSettingsGroup& hide = GetEffectGroup("hide_window_effect");
    if (!Exists(shadow) || !Exists(hide))
        return;
    target->AddEffect(new CWindowChangeShadowEffect(core::ReadColor(shadow, "shadow_color"),
                                                    core::ReadColor(shadow, "no_shadow_color"), m_Time, m_Shift, false));
    target->AddEffect(new CWindowShowHideBaseEffect("hide_window_effect"));
    target->AddEffect(new CRemoveWidgetEffect(m_Time + m_Shift));
    target->AddEffect(new CColorChangeEffect(core::ReadColor(hide, "end_color"), m_Time, m_Shift));
}

void CWindowHideEffect::UpdateWidget(gui::CBaseWidget& widget)
{
    CWindowShowHideBaseEffect::UpdateWidget(widget);
    SetDead(true);
}

// Scripts' one-shot effects -----------------------------------------------------------------

CSimpleSceneEffect::CSimpleSceneEffect(float time, const FloatVector& target, const FloatVector& beginScale,
                                       const FloatVector& endScale)
    : m_Target(target)
{
    m_Time = time;
    m_BeginScale = beginScale;
    m_EndScale = endScale;
}

void CSimpleSceneEffect::InitWidget(gui::CBaseWidget& widget)
{
    CWindowShowHideBaseEffect::InitWidget(widget);
    if (m_Target.X < -500.0f && m_Target.Y < -500.0f)
        m_Target = m_Size;
    m_Target = m_Target - m_Size * 0.5f;
    UpdateWidget(widget);
}

void CSimpleSceneEffect::UpdateWidget(gui::CBaseWidget& widget)
{
    const float now = Now();
    if (now >= m_StartTime + m_Time) {
        Apply(widget, m_EndScale);
        widget.RemFlags(gui::FlagDisabled);
        SetDead(true);
        return;
    }
    if (m_Time == 0 || now < m_StartTime)
        return;
    const FloatVector s = Scale(now);
    widget.SetOffset((1 - s.X) * m_Size.X / 2 + (m_Pos.X - m_Target.X) * s.X + m_Target.X,
                     (1 - s.Y) * m_Size.Y / 2 + (m_Pos.Y - m_Target.Y) * s.Y + m_Target.Y);
    widget.SetRotation(misc::MatrixScale(s.X, s.Y) * m_Transform);
}

// Shadows and colours -----------------------------------------------------------------------

CWindowShadowEffect::CWindowShadowEffect()
    : m_Color(core::ReadColor(GetEffectGroup("shadow_window_effect"), "shadow_color"))
{
}

void CWindowShadowEffect::PreDraw(graphics::CRenderer& renderer)
{
    if (!IsDead())
        FillCanvas(renderer, m_Color);
}

CWindowChangeShadowEffect::CWindowChangeShadowEffect(const graphics::Color& from, const graphics::Color& to,
                                                     float time, float shift, bool steady)
    : m_From(from), m_To(to), m_Shift(shift), m_Time(time), m_Steady(steady)
{
}

void CWindowChangeShadowEffect::InitWidget(gui::CBaseWidget& /*widget*/) { m_StartTime = Now() + m_Shift; }

void CWindowChangeShadowEffect::UpdateWidget(gui::CBaseWidget& widget)
{
    if (Now() < m_StartTime + m_Time)
        return;
    SetDead(true);
    if (m_Steady)
        widget.AddEffect(new CWindowShadowEffect());
}

void CWindowChangeShadowEffect::PreDraw(graphics::CRenderer& renderer)
{
    const float now = Now();
    if (IsDead() || now < m_StartTime || m_Time == 0)
        return;
    FillCanvas(renderer, Mix(m_From, m_To, Fraction(now, m_StartTime, m_Time)));
}

CColorChangeEffect::CColorChangeEffect(const graphics::Color& end, float time, float shift)
    : m_End(end), m_Shift(shift), m_Time(time)
{
}

void CColorChangeEffect::InitWidget(gui::CBaseWidget& widget)
{
    m_Begin = widget.GetColor();
    m_StartTime = Now() + m_Shift;
}

void CColorChangeEffect::UpdateWidget(gui::CBaseWidget& widget)
{
    const float now = Now();
    if (now >= m_StartTime + m_Time) {
        widget.SetColor(m_End);
        SetDead(true);
    } else if (now >= m_StartTime && m_Time != 0) {
        widget.SetColor(Mix(m_Begin, m_End, Fraction(now, m_StartTime, m_Time)));
    }
}

void CRemoveWidgetEffect::InitWidget(gui::CBaseWidget& /*widget*/) { m_StartTime = Now(); }

void CRemoveWidgetEffect::UpdateWidget(gui::CBaseWidget& widget)
{
    if (Now() < m_StartTime + m_Delay)
        return;
    widget.AddFlags(gui::FlagDead);
    SetDead(true);
}

// The closing window's stand-in ------------------------------------------------------------

CDrawWindowWidget::CDrawWindowWidget(gui::CWindow& window) : m_Window(&window)
{
    SetOffset(window.GetOffset().X, window.GetOffset().Y);
    SetSize(window.GetSize().X, window.GetSize().Y);
    window.SetOffset(0, 0);
    window.GetParentWindow()->AddWidget(gui::WidgetPtrT(this));
}

void CDrawWindowWidget::DoDraw(graphics::CRenderer& renderer)
{
    CWidget::DoDraw(renderer);
    m_Window->Draw(renderer);
}

void AddEffectToWidget(gui::CWidget* widget, float time, const FloatVector& target, const FloatVector& beginScale,
                       const FloatVector& endScale)
{
    OX_CHECK_DATA(widget != nullptr);
    widget->AddEffect(new CSimpleSceneEffect(time, target, beginScale, endScale));
}

void AddRemoveEffectToWidget(gui::CWidget* widget, float delay)
{
    OX_CHECK_DATA(widget != nullptr);
    widget->AddEffect(new CRemoveWidgetEffect(delay));
}

} // namespace k17
