#pragma once
// Something attached to a widget that changes it over time. The widget runs its effects in
// every update and around every draw; a dead effect is dropped at the widget's next update.
// The base does nothing: the timed effects derive from it.
#include "misc/ptr.h"

namespace ox::graphics {
class CRenderer;
}

namespace ox::gui {

class CBaseWidget;

class CEffect : public misc::CRefCountedObj {
public:
    // Once, when the effect is added to the widget.
    virtual void InitWidget(CBaseWidget& /*widget*/) {}
    // In every update of the widget, until the effect is dead.
    virtual void UpdateWidget(CBaseWidget& /*widget*/) {}
    // Around the widget's own drawing, with its transform, colour and clip in place.
    virtual void PreDraw(graphics::CRenderer& /*renderer*/) {}
    virtual void PostDraw(graphics::CRenderer& /*renderer*/) {}

    void SetDead(bool dead) { m_Dead = dead; }
    bool IsDead() const { return m_Dead; }

private:
    bool m_Dead = false;
};

using EffectPtrT = boost::intrusive_ptr<CEffect>;

} // namespace ox::gui
