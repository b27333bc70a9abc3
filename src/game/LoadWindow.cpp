#include "game/LoadWindow.h"

#include "game/App.h"

namespace k17 {

using namespace ox;

void CLoadWindow::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CWindow::Load(node, templates);
    UpdateLayout();
    SetColor(graphics::Color(0u));
}

void CLoadWindow::DoUpdate()
{
    CWindow::DoUpdate();
    if (m_App.GetState() == core::Created) {
        m_App.Load();
        SetColor(graphics::Color(0xFFFFFFFFu));
    }
    if (!m_Started && m_App.GetState() == core::Running) {
        m_Started = true;
        m_App.OnLoadComplete();
    }
}

} // namespace k17
