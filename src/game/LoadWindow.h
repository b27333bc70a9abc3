#pragma once
// The game's first window: it starts invisible, lets the start-up pictures run, then runs
// the application's loading, shows itself when that is through, and hands over to the
// scripts' Run once.
#include "core/Application.h"
#include "gui/Window.h"

#include <functional>

namespace k17 {

class CApp;
class CBranch;

class CLoadWindow : public ox::gui::CWindow {
public:
    // What the window drives: the application's state, its loading, and what follows it.
    struct Road {
        std::function<ox::core::AppState()> state;
        std::function<void()> load;
        std::function<void()> loadComplete;
        ox::wstring gameFolder;
    };

    explicit CLoadWindow(CApp& app);
    explicit CLoadWindow(Road road) : m_Road(std::move(road)) {}

    // As a window, then fully transparent until loading is done; the pictures join it.
    void Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates) override;
    void DoUpdate() override;

    bool IsStarted() const { return m_Started; }
    CBranch* GetBranch() const { return m_Branch; }

private:
    // The window's clips start from their beginning; the progress clip stands.
    void StartClips();

    Road m_Road;
    CBranch* m_Branch = nullptr;
    bool m_Started = false;
};

} // namespace k17
