#pragma once
// What gives a widget its tool tip: a child of the owner's size that watches the pointer in
// the broadcast pass (it never handles an event). After the pointer has rested over it for
// more than half a second, the window it belongs to shows the text below the pointer, if
// that window is the top one; leaving hides it.
#include "core/TimeManager.h"
#include "gui/Widget.h"

namespace ox::gui {

class CToolTipHelperWidget : public CWidget {
public:
    static constexpr const char* kId = "ToolTipHelperWidget";
    static constexpr unsigned kDelay = 500;

    explicit CToolTipHelperWidget(const wstring& text = {});

    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    void DoUpdate() override;

    void StopShowToolTip() { m_Hovering = false; }
    void SetText(const wstring& text) { m_Text = text; }
    const wstring& GetText() const { return m_Text; }
    bool IsShown() const { return m_Shown; }
    core::CTimer* GetTimer() { return m_Timer.Get(); }

private:
    wstring m_Text;
    core::CTimerWrapper m_Timer;
    unsigned m_HoverStartTime = 0;
    bool m_Hovering = false;
    bool m_Shown = false;
    IntVector m_LastPos;
};

} // namespace ox::gui
