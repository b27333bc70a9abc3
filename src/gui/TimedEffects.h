#pragma once
// The framework's three timed effects: a move to a place, a change to a colour, and a flag
// set or cleared at a moment. Each runs on a timer of its own in a named timer group, so it
// stops while the group is paused and runs at the group's speed. Times are milliseconds;
// the delay counts from the moment the effect is added to a widget.
#include "core/TimeManager.h"
#include "graphics/Color.h"
#include "gui/Effect.h"
#include "misc/Vector.h"

#include <cstdint>

namespace ox::gui {

// What every timed effect shares: its own timer in a group (an unknown group, logged, gives
// the root), a start time turned absolute when the effect meets its widget, a duration.
class CTimedEffect : public CEffect {
public:
    ~CTimedEffect() override;
    CTimedEffect(const CTimedEffect&) = delete;
    CTimedEffect& operator=(const CTimedEffect&) = delete;

    void InitWidget(CBaseWidget& widget) override;
    unsigned GetTime() const;
    // The effect's own clock.
    core::CTimer* GetTimer() { return HasClock() ? m_Timer : nullptr; }

protected:
    CTimedEffect(float duration, float delay, const char* group);
    // Where the change stands at the timer's time: below 0 not begun, 1 or more done.
    float Progress() const;
    bool HasClock() const;

    float m_StartTime;
    float m_Duration;

private:
    // Not a timer wrapper: a timer whose group went is gone already and must not be destroyed.
    core::CTimer* m_Timer;
};

// Moves the widget from where it stands to `target`, in a straight line.
class CPositionChangeEffect : public CTimedEffect {
public:
    CPositionChangeEffect(const misc::FloatVector& target, float duration, float delay, const char* group);
    CPositionChangeEffect(float x, float y, float duration, float delay, const char* group)
        : CPositionChangeEffect(misc::FloatVector(x, y), duration, delay, group)
    {
    }
    void InitWidget(CBaseWidget& widget) override;
    void UpdateWidget(CBaseWidget& widget) override;

private:
    misc::FloatVector m_Target;
    misc::FloatVector m_Start;
};

// Changes the widget's colour (and with it its alpha) from what it is to `target`.
class CColorChangeEffect : public CTimedEffect {
public:
    CColorChangeEffect(const graphics::Color& target, float duration, float delay, const char* group);
    // The target as a 0xAARRGGBB number.
    CColorChangeEffect(uint32_t argb, float duration, float delay, const char* group)
        : CColorChangeEffect(graphics::Color(argb), duration, delay, group)
    {
    }
    void InitWidget(CBaseWidget& widget) override;
    void UpdateWidget(CBaseWidget& widget) override;

private:
    graphics::Color m_Target;
    graphics::Color m_Start;
};

// Adds (or removes) flags once the delay has passed, then ends. With FlagDead it removes
// the widget after a while.
class CFlagsChangeEffect : public CTimedEffect {
public:
    CFlagsChangeEffect(uint32_t flags, bool add, float delay, const char* group);
    void UpdateWidget(CBaseWidget& widget) override;

private:
    uint32_t m_Flags;
    bool m_Add;
};

} // namespace ox::gui
