#include "gui/controls/ClipWidget.h"

#include "gui/Description.h"
#include "gui/controls/ControlSupport.h"

namespace ox::gui {

void CClipWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    const std::string& id = node.GetValue("clip");
    m_Loaded = !id.empty() && m_Clip.Load(id.c_str());
    if (!id.empty() && !m_Loaded)
        ReportElement(node, "no such clip, nothing is drawn: ", id);
    CWidget::Load(node, templates);
    TakeNaturalSize(*this, m_Clip.GetViewSize());
}

void CClipWidget::DoUpdate()
{
    if (m_Loaded)
        m_Clip.Update();
}

void CClipWidget::DoDraw(graphics::CRenderer& renderer)
{
    if (m_Loaded) {
        m_Clip.SetPos({GetSize().X / 2, GetSize().Y / 2});
        m_Clip.Draw(&renderer);
    }
    CWidget::DoDraw(renderer);
}

} // namespace ox::gui
