#include "gui/TimedEffects.h"

#include "diag/Log.h"
#include "gui/BaseWidget.h"

namespace ox::gui {

namespace {

core::CTimer* AttachEffectTimer(const char* group)
{
    core::CTimeManager& time = core::GetTimeManager();
    core::CGroupTimer* parent = group && *group ? time.GetTimer(group) : nullptr;
    if (group && *group && !parent)
        OX_LOG("gui", diag::LogWarning, "effect: no timer group \"%s\", the effect runs on the root clock", group);
    return time.AttachTimer(parent);
}

int16_t Blend(int16_t from, int16_t to, float k)
{
    return static_cast<int16_t>(static_cast<float>(from) + static_cast<float>(to - from) * k);
}

} // namespace

CTimedEffect::CTimedEffect(float duration, float delay, const char* group)
    : m_StartTime(delay), m_Duration(duration < 0 ? 0 : duration), m_Timer(AttachEffectTimer(group))
{
}

CTimedEffect::~CTimedEffect()
{
    if (HasClock())
        m_Timer->Destroy();
}

bool CTimedEffect::HasClock() const
{
    // A group that goes (a level that ends) takes its timers with it.
    return m_Timer && core::GetTimeManager().IsKnown(m_Timer);
}

unsigned CTimedEffect::GetTime() const { return HasClock() ? m_Timer->GetTime() : 0; }

void CTimedEffect::InitWidget(CBaseWidget& /*widget*/) { m_StartTime += static_cast<float>(GetTime()); }

float CTimedEffect::Progress() const
{
    // Without a clock the change is over at once.
    if (!HasClock())
        return 1.0f;
    const float t = static_cast<float>(GetTime());
    if (t >= m_StartTime + m_Duration)
        return 1.0f;
    if (m_Duration == 0 || t < m_StartTime)
        return -1.0f;
    return (t - m_StartTime) / m_Duration;
}

// Moving ----------------------------------------------------------------------------------

CPositionChangeEffect::CPositionChangeEffect(const misc::FloatVector& target, float duration, float delay,
                                             const char* group)
    : CTimedEffect(duration, delay, group), m_Target(target)
{
}

void CPositionChangeEffect::InitWidget(CBaseWidget& widget)
{
    m_Start = widget.GetOffset();
    CTimedEffect::InitWidget(widget);
}

void CPositionChangeEffect::UpdateWidget(CBaseWidget& widget)
{
    const float k = Progress();
    if (k >= 1.0f) {
        widget.SetOffset(m_Target.X, m_Target.Y);
        SetDead(true);
    } else if (k >= 0) {
        widget.SetOffset(m_Start.X + (m_Target.X - m_Start.X) * k, m_Start.Y + (m_Target.Y - m_Start.Y) * k);
    }
}

// Colouring -------------------------------------------------------------------------------

CColorChangeEffect::CColorChangeEffect(const graphics::Color& target, float duration, float delay, const char* group)
    : CTimedEffect(duration, delay, group), m_Target(target)
{
}

void CColorChangeEffect::InitWidget(CBaseWidget& widget)
{
    m_Start = widget.GetColor();
    CTimedEffect::InitWidget(widget);
}

void CColorChangeEffect::UpdateWidget(CBaseWidget& widget)
{
    const float k = Progress();
    if (k >= 1.0f) {
        widget.SetColor(m_Target);
        SetDead(true);
    } else if (k >= 0) {
        graphics::Color c;
        c.Red = Blend(m_Start.Red, m_Target.Red, k);
        c.Green = Blend(m_Start.Green, m_Target.Green, k);
        c.Blue = Blend(m_Start.Blue, m_Target.Blue, k);
        c.Alpha = Blend(m_Start.Alpha, m_Target.Alpha, k);
        widget.SetColor(c);
    }
}

// Flags -----------------------------------------------------------------------------------

CFlagsChangeEffect::CFlagsChangeEffect(uint32_t flags, bool add, float delay, const char* group)
    : CTimedEffect(0, delay, group), m_Flags(flags), m_Add(add)
{
}

void CFlagsChangeEffect::UpdateWidget(CBaseWidget& widget)
{
    if (Progress() < 1.0f)
        return;
    if (m_Add)
        widget.AddFlags(m_Flags);
    else
        widget.RemFlags(m_Flags);
    SetDead(true);
}

} // namespace ox::gui
