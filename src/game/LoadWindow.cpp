#include "game/LoadWindow.h"

#include "game/App.h"
#include "game/Branch.h"
#include "gui/controls/ClipWidget.h"

namespace k17 {

using namespace ox;

CLoadWindow::CLoadWindow(CApp& app)
    : m_Road {[&app] { return app.GetState(); }, [&app] { app.Load(); }, [&app] { app.OnLoadComplete(); },
              app.GetGameFolder()}
{
}

void CLoadWindow::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CWindow::Load(node, templates);
    UpdateLayout();
    SetColor(graphics::Color(0u));
    boost::intrusive_ptr<CBranch> branch(new CBranch(m_Road.gameFolder));
    AddWidget(branch);
    m_Branch = branch.get();
}

void CLoadWindow::DoUpdate()
{
    CWindow::DoUpdate();
    const bool waiting = m_Branch && !m_Branch->IsDone();
    if (!waiting && m_Road.state() == core::Created) {
        m_Road.load();
        SetColor(graphics::Color(0xFFFFFFFFu));
        StartClips();
    }
    if (!m_Started && m_Road.state() == core::Running) {
        m_Started = true;
        m_Road.loadComplete();
    }
}

void CLoadWindow::StartClips()
{
    for (const gui::WidgetPtrT& child : GetWidgets()) {
        auto* clip = dynamic_cast<gui::CClipWidget*>(child.get());
        if (!clip)
            continue;
        clip->GetClip()->SetTime(0);
        clip->GetClip()->Stop();
        clip->GetClip()->Play();
        if (clip->GetId() == "loading_progress")
            clip->GetClip()->Stop();
    }
}

} // namespace k17
