#pragma once
// A check box: a box with a tick that fades in and out, a text beside it (left or right),
// and a third, unspecified state shown by gray images. A click toggles it and tells the
// parent "check_changed"; hovering tells "overed" and "lost_over" as a button does.
#include "core/TimeManager.h"
#include "graphics/Image.h"
#include "gui/Widget.h"

namespace ox::gui {

class CLabelWidget;

class CCheckboxWidget : public CWidget {
public:
    enum CheckState : int { Unchecked = 0, Checked = 1, Unspecified = 2 };

    CCheckboxWidget();
    ~CCheckboxWidget() override;

    // The checkbox_template (images, indent, sounds, font, check time), then the element's
    // text, text_loc and checked.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    // The box's width and the text's (with the indent) by the box's height.
    FloatVector GetPreferredSize() const override;
    void SetSize(float width, float height) override;
    void DoDraw(graphics::CRenderer& renderer) override;

    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    // A click in the hit-test pass toggles the box, with its sounds.
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;

    // Tells the parent "check_changed".
    virtual void OnCheckChanged();

    // Shows the normal images with the tick on or off (faded by the check time); with
    // `notify`, OnCheckChanged.
    void Check(bool on, bool notify);
    bool IsChecked() const { return m_State == Checked; }
    int GetCheckState() const { return m_State; }
    // The gray images instead of the normal ones.
    void SetUnspecifiedState();
    // The check sound, then the one for the state it has now.
    void PlayCheckSounds();
    void SetText(const wstring& text);
    wstring GetText() const;
    // The tick's opacity now, 0 to 1.
    float GetTickAlpha() const;
    core::CTimer* GetCheckTimer() { return m_CheckTimer.Get(); }

private:
    void PlaceParts();
    CLabelWidget* Label() const;

    graphics::CImage m_Box;
    graphics::CImage m_Tick;
    graphics::CImage m_GrayBox;
    graphics::CImage m_GrayTick;
    WidgetPtrT m_Label;
    float m_Indent = 0;
    bool m_TextLeft = false;
    bool m_Over = false;
    int m_State = Unchecked;
    // The tick's opacity fades from `m_TickFrom` to the state's in the check time.
    float m_TickFrom = 0;
    unsigned m_CheckTime = 0;
    core::CTimerWrapper m_CheckTimer;
    std::string m_SoundOnCheck;
    std::string m_SoundOnCheckTrue;
    std::string m_SoundOnCheckFalse;
};

} // namespace ox::gui
