#pragma once
// A clip played in a widget: updated with the widget, drawn with its centre on the widget's
// centre. A size of 0 takes the clip's own.
#include "gui/Widget.h"
#include "misc/animation/Clip.h"

namespace ox::gui {

class CClipWidget : public CWidget {
public:
    // The element's clip (logged when there is no such clip).
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    void DoUpdate() override;
    void DoDraw(graphics::CRenderer& renderer) override;
    // The clip's view size.
    FloatVector GetPreferredSize() const override { return m_Clip.GetViewSize(); }

    misc::anim::CClip* GetClip() { return &m_Clip; }

private:
    misc::anim::CClip m_Clip;
    bool m_Loaded = false;
};

} // namespace ox::gui
