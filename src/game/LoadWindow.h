#pragma once
// The game's first window: it starts invisible, runs the application's loading at its first
// update, shows itself when that is through, and hands over to the scripts' Run once.
#include "gui/Window.h"

namespace k17 {

class CApp;

class CLoadWindow : public ox::gui::CWindow {
public:
    explicit CLoadWindow(CApp& app) : m_App(app) {}

    // As a window, then fully transparent until loading is done.
    void Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates) override;
    void DoUpdate() override;

    bool IsStarted() const { return m_Started; }

private:
    CApp& m_App;
    bool m_Started = false;
};

} // namespace k17
