#pragma once
// The game's window effects: a window opens scaling up from a start size while the screen
// darkens behind it and its colour fades in, and closes the other way round. They read their
// numbers from the <gui_effect> groups of properties/effects.xml. Beside them, one-shot
// effects scripts put on any widget: scale and move, remove later. All run on the game clock.
#include "core/Settings.h"
#include "graphics/Color.h"
#include "gui/Widget.h"
#include "misc/Matrix.h"

#include <functional>

namespace ox::gui {
class CWindow;
}

namespace k17 {

using EffectMakerT = std::function<ox::gui::EffectPtrT()>;

// The <Effects> group the effects read; null (the default) reads as empty groups.
void SetEffectsSettings(const ox::core::CSettingsGroup* effects);
// The <gui_effect> of the id, or the empty group.
const ox::core::CSettingsGroup& GetEffectGroup(const char* id);

// The effect factory: names to makers. An unknown name gives null.
void RegisterEffect(const ox::wstring& name, EffectMakerT maker);
ox::gui::EffectPtrT CreateEffect(const ox::wstring& name);
// Enters the window effects under show_window_effect and hide_window_effect and makes the
// factory the one windows use for their show_effect and hide_effect.
void RegisterWindowEffects();

// Scales the widget about its centre from the begin scale to the end scale; the widget takes
// no input meanwhile. Times are milliseconds; the shift delays the start.
class CWindowShowHideBaseEffect : public ox::gui::CEffect {
public:
    explicit CWindowShowHideBaseEffect(const char* id);
    void InitWidget(ox::gui::CBaseWidget& widget) override;
    void UpdateWidget(ox::gui::CBaseWidget& widget) override;

protected:
    // Default scales (1, 1) and times of 0, for effects given their numbers by code.
    CWindowShowHideBaseEffect() = default;
    void Apply(ox::gui::CBaseWidget& widget, const ox::misc::FloatVector& scale) const;
    ox::misc::FloatVector Scale(float now) const;

    ox::misc::FloatVector m_BeginScale {1.0f, 1.0f};
    ox::misc::FloatVector m_EndScale {1.0f, 1.0f};
    float m_StartTime = 0.0f;
    float m_Time = 0.0f;
    float m_Shift = 0.0f;
    ox::misc::FloatMatrix m_Transform;
    ox::misc::FloatVector m_Size;
    ox::misc::FloatVector m_Pos;
};

class CWindowShowEffect : public CWindowShowHideBaseEffect {
public:
    CWindowShowEffect() : CWindowShowHideBaseEffect("show_window_effect") {}
    // The scale, then the darkening behind and the colour from begin_color back.
    void InitWidget(ox::gui::CBaseWidget& widget) override;
};

class CWindowHideEffect : public CWindowShowHideBaseEffect {
public:
    CWindowHideEffect() : CWindowShowHideBaseEffect("hide_window_effect") {}
    // The standing shadow goes; the closing runs on a stand-in in the parent window, which
    // fades, scales and is removed after.
    void InitWidget(ox::gui::CBaseWidget& widget) override;
    void UpdateWidget(ox::gui::CBaseWidget& widget) override;
};

// Scales as the base and moves towards a target at the same pace. A target with both
// components below -500 stands for the widget's own size.
class CSimpleSceneEffect : public CWindowShowHideBaseEffect {
public:
    CSimpleSceneEffect(float time, const ox::misc::FloatVector& target, const ox::misc::FloatVector& beginScale,
                       const ox::misc::FloatVector& endScale);
    void InitWidget(ox::gui::CBaseWidget& widget) override;
    void UpdateWidget(ox::gui::CBaseWidget& widget) override;

private:
    ox::misc::FloatVector m_Target;
};

// A dark layer over the whole canvas, under the widget.
class CWindowShadowEffect : public ox::gui::CEffect {
public:
    CWindowShadowEffect();
    void PreDraw(ox::graphics::CRenderer& renderer) override;

private:
    ox::graphics::Color m_Color;
};

// The layer's colour going from one to another; with `steady`, a standing shadow follows.
class CWindowChangeShadowEffect : public ox::gui::CEffect {
public:
    CWindowChangeShadowEffect(const ox::graphics::Color& from, const ox::graphics::Color& to, float time, float shift,
                              bool steady);
    void InitWidget(ox::gui::CBaseWidget& widget) override;
    void UpdateWidget(ox::gui::CBaseWidget& widget) override;
    void PreDraw(ox::graphics::CRenderer& renderer) override;

private:
    ox::graphics::Color m_From, m_To;
    float m_StartTime = 0.0f, m_Shift, m_Time;
    bool m_Steady;
};

// The widget's colour from what it is to `end`.
class CColorChangeEffect : public ox::gui::CEffect {
public:
    CColorChangeEffect(const ox::graphics::Color& end, float time, float shift);
    void InitWidget(ox::gui::CBaseWidget& widget) override;
    void UpdateWidget(ox::gui::CBaseWidget& widget) override;

private:
    ox::graphics::Color m_End, m_Begin;
    float m_StartTime = 0.0f, m_Shift, m_Time;
};

// Marks the widget dead once the delay has passed.
class CRemoveWidgetEffect : public ox::gui::CEffect {
public:
    explicit CRemoveWidgetEffect(float delay) : m_Delay(delay) {}
    void InitWidget(ox::gui::CBaseWidget& widget) override;
    void UpdateWidget(ox::gui::CBaseWidget& widget) override;

private:
    float m_StartTime = 0.0f, m_Delay;
};

// Draws a closing window in its parent window's place while its effects run: it stands where
// the window stood, and the window is drawn inside it at (0, 0).
class CDrawWindowWidget : public ox::gui::CWidget {
public:
    explicit CDrawWindowWidget(ox::gui::CWindow& window);
    void DoDraw(ox::graphics::CRenderer& renderer) override;

private:
    boost::intrusive_ptr<ox::gui::CWindow> m_Window;
};

// What scripts attach: a scale-and-move, and a removal after a delay.
void AddEffectToWidget(ox::gui::CWidget* widget, float time, const ox::misc::FloatVector& target,
                       const ox::misc::FloatVector& beginScale, const ox::misc::FloatVector& endScale);
void AddRemoveEffectToWidget(ox::gui::CWidget* widget, float delay);

} // namespace k17
