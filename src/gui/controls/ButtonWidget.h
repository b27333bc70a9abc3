#pragma once
// A push button: four state images side by side in one texture (normal, over, pressed,
// disabled) that cross-fade on a change, an optional label whose colour follows the state,
// and sounds. It tells its parent "overed", "lost_over" and, when a press inside is released
// inside, "pressed". It asks for moves and releases in the broadcast pass, so that it sees
// the pointer leave and a release outside.
#include "core/TimeManager.h"
#include "graphics/Image.h"
#include "gui/Widget.h"

namespace ox::gui {

class CLabelWidget;

class CButtonWidget : public CWidget {
public:
    enum State : int { StateNormal = 0, StateOver = 1, StatePressed = 2, StateDisabled = 3 };

    CButtonWidget();
    ~CButtonWidget() override;

    // The button_template (tile steps, fade time, sounds, image, label template), then the
    // element's text, state colours and disabled flag. A size of 0 takes a state image's.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    // Rounded up to whole tiles when the template gives tile steps.
    void SetSize(float width, float height) override;
    // A quarter of the image's width by its height.
    FloatVector GetPreferredSize() const override;
    void DoDraw(graphics::CRenderer& renderer) override;

    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    // A quick second click is a press.
    bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast) override;

    // The press sound, then "pressed" to the parent.
    virtual void OnButtonPressed();

    void SetText(const wstring& text);
    wstring GetText() const;
    void SetLabelColor(int state, const graphics::Color& color);
    State GetButtonState() const { return m_State; }
    int GetButtonStateInt() const { return m_State; }
    // Disabled shows only the disabled image and colour, and takes no press.
    void DisableButton(bool disable);
    CLabelWidget* GetLabel() const;
    // The cross-fade's clock.
    core::CTimer* GetFadeTimer() { return m_FadeTimer.Get(); }

private:
    void ChangeState(State state);
    // How far the cross-fade from the old state to the new one is, 0 to 1.
    float FadeProgress() const;

    graphics::CImage m_Image;
    WidgetPtrT m_Label;
    graphics::Color m_Colors[4];
    State m_State = StateNormal;
    State m_OldState = StateNormal;
    unsigned m_FadeTime = 0;
    core::CTimerWrapper m_FadeTimer;
    std::string m_SoundOnPress;
    std::string m_SoundOnOver;
    std::string m_SoundOnDisabledPress;
    int m_TileStepX = 0;
    int m_TileStepY = 0;
};

} // namespace ox::gui
