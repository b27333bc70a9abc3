#pragma once
// The game's application: creates the platform adapter, loads the game's data in order,
// runs the per-frame script work and the debug keys.
#include "core/Application.h"
#include "core/TimeManager.h"
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/DemoScene.h"
#include "lua/Lua.h"
#include "misc/animation/ClipAudio.h"

#include <cstdio>
#include <memory>

namespace k17 {

class CApp : public ox::core::CApplication {
public:
    enum class InitFailure { None, SecondInstance, Platform };

    CApp();
    ~CApp() override;

    bool Init() override;
    void OnStop() override;
    void ProcessEvent() override;
    void DoDraw(ox::graphics::CRenderer* renderer) override;
    void DoUpdate() override;

    // The first window, made from the description <window id="loading">: it runs the loading
    // and then the scripts' Run.
    ox::gui::BaseWindowPtrT CreateLoadWindow();
    // Loading is through: custom cursors on, then the script function Run.
    void OnLoadComplete();

    // The working folder at start: the game folder.
    void ReadGameFolder();
    const ox::wstring& GetGameFolder() const { return m_GameFolder; }
    InitFailure GetInitFailure() const { return m_InitFailure; }
    ox::core::CGroupTimer* GetMainTimer() { return m_MainTimer.Get(); }
    // The main script host, from Init on.
    ox::lua::CLua* GetLua() { return m_Lua.get(); }

    // The frame-rate limit the debug keys move; starts at 50.
    static unsigned GetFpsLimit();
    static bool IsShowFps();

private:
    void RedirectOutput();
    void CloseOutput();
    void BindScripts();
    void LoadPlayerFiles(const ox::wstring& saves);
    // The frame-rate overlay, when the debug level and show_fps ask for it.
    void DrawFps(ox::graphics::CRenderer* renderer);

    ox::core::CGroupTimerWrapper m_MainTimer;
    std::unique_ptr<ox::lua::CLua> m_Lua;
    ox::wstring m_GameFolder;
    // The adapter, owned by the application base, which outlives this part of the object.
    ox::core::CStandaloneApplicationSdl* m_Adapter = nullptr;
    InitFailure m_InitFailure = InitFailure::None;
    // Drawn until the game's windows exist.
    std::unique_ptr<CDemoScene> m_Demo;
    // Clip objects' sound points, played through the audio manager.
    std::unique_ptr<ox::misc::anim::CClipAudio> m_ClipAudio;
    // Serves the fonts' glyph images until the texture manager does.
    bool m_OutputRedirected = false;
};

} // namespace k17
