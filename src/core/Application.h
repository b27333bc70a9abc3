#pragma once
// The framework's application object: owns the settings, the declarations and the renderer,
// runs one frame at a time for the platform loop, follows focus and minimising, and changes
// the screen mode. A game derives from it.
#include "core/Declaration.h"
#include "core/FrameLimiter.h"
#include "core/Settings.h"
#include "core/SystemIntegration.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "gui/WidgetManager.h"
#include "misc/WideChar.h"
#include "sound/AudioManager.h"

#include <functional>
#include <memory>

namespace mluabind {
class CHost;
}

namespace ox::core {

enum AppState : uint32_t { Created = 0, Loading = 1, LoadingPaused = 2, Running = 3, ShuttingDown = 4 };
enum DebugLevel : int { DebugNone = 0, DebugCheats = 1, DebugLight = 2, DebugHeavy = 3 };

// Media that pause while the application is in the background. The audio manager is
// registered by the application; video registers here when it exists.
struct MediaPauseHooks {
    std::function<void(bool pause)> audio;
    std::function<void(bool pause)> video;
};

class CApplication : public IPlatformClient {
public:
    CApplication();
    ~CApplication() override;
    CApplication(const CApplication&) = delete;
    CApplication& operator=(const CApplication&) = delete;

    virtual bool Init();
    virtual void DoShutdown();
    virtual void OnStop() {}
    void ProcessEvent() override;
    virtual bool OnChangeScreenMode(bool /*fullscreen*/, bool /*bpp32*/, unsigned /*width*/, unsigned /*height*/)
    {
        return true;
    }
    virtual void OnActivate(bool /*active*/) {}
    virtual void DoDraw(graphics::CRenderer* renderer);
    virtual void DoUpdate() {}
    virtual void DoLoad();
    // The project's own script names, bound by the framework's vocabulary after its own
    // (in declaration mode).
    virtual void BindScript(mluabind::CHost& /*host*/) {}

    void Update() override;
    void Draw() override;

    void Run();
    void Stop();
    void Shutdown() { m_ShutdownRequested = true; }
    void Load();
    void LimitFPS(unsigned fps) { m_FrameLimiter.SetFps(fps); }
    bool ChangeScreenMode(bool fullscreen, bool bpp32, unsigned width, unsigned height);
    void SetCursorClip(bool enabled, const misc::IntRect& rect);

    CSettings& GetSettings() { return m_Settings; }
    CResourceDeclarations& GetResourceDeclarations() { return m_ResourceDeclarations; }
    graphics::CRenderer* GetRenderer() { return &m_Renderer; }
    sound::CAudioManager& GetAudioManager() { return sound::CAudioManager::Instance(); }
    gui::CWidgetManager& GetWidgetManager() { return m_WidgetManager; }
    // The widget manager's main window; a new one takes over at the next update.
    void SetMainWindow(gui::BaseWindowPtrT window) { m_WidgetManager.SetMainWindow(std::move(window)); }
    gui::CBaseWindow* GetMainWindow() const { return m_WidgetManager.GetMainWindow(); }
    gui::CBaseWindow* GetTopWindow() const { return m_WidgetManager.GetTopWindow(); }
    CSystemIntegration* GetSystemIntegration() const { return m_SystemIntegration.get(); }
    // The application owns the adapter from here on: it goes only after the application,
    // so nothing that can reach the application finds it deleted.
    void SetSystemIntegration(std::unique_ptr<CSystemIntegration> adapter);
    int GetDebugLevel() const { return m_DebugLevel; }
    void SetDebugLevel(int level) { m_DebugLevel = level; }
    const wstring& GetAppDataFolder() const { return m_AppDataFolder; }
    const wstring& GetCompany() const { return m_Company; }
    const wstring& GetProduct() const { return m_Product; }
    const wstring& GetWindowTitle() const { return m_WindowTitle; }
    AppState GetState() const { return m_State; }
    bool IsActive() const { return m_Focused && !m_Minimized; }
    bool IsMediaPaused() const { return m_MediaPaused; }
    bool IsShutdownDone() const { return m_ShutdownDone; }
    const CFrameLimiter& GetFrameLimiter() const { return m_FrameLimiter; }
    // Frames counted by Update, from 1.
    uint32_t GetFrameNumber() const { return graphics::GetFrameNumber(); }
    MediaPauseHooks& GetMediaPauseHooks() { return m_MediaHooks; }
    // What Ctrl+Alt+P does (the replay starts or stops). The key is swallowed either way.
    void SetReplayKey(std::function<void()> toggle) { m_ReplayKey = std::move(toggle); }

    // The user's data folder of a game: $XDG_DATA_HOME (or ~/.local/share), company, product.
    static wstring UserDataFolder(const wstring& company, const wstring& product);
    // The folder under that base the game owns and may open to its user: the company's, or
    // the product's when the company is empty. Empty when that name is not one plain folder
    // name, so that nothing beside or above the game's folders is ever changed.
    static wstring OwnDataFolder(const wstring& company, const wstring& product);

protected:
    void UpdateActivity();
    void ApplyCursorClip();
    void DrawLetterbox();
    void CreateDataFolder(const wstring& ownFolder);
    // Ctrl+Alt+P (or Ctrl+Alt+F1) pressed: the replay key.
    bool IsReplayKey(const SystemEvent& event) const;
    // The desktop's size or depth changed: the renderer notes a mode restore if it differs.
    void OnDisplayChange(const SystemEvent& event);
    // Forward: the widget tree while active, then the platform's default handling.
    void Forward(const SystemEvent& event);
    // The cursor follows the widgets' wishes while the pointer is over the window.
    void RefreshCursor();

    AppState m_State = Created;
    wstring m_Company = u"Tarnwick Loom";
    wstring m_Product;
    int m_Version = 0;
    wstring m_FullVersion;
    wstring m_WindowTitle;
    CSettings m_Settings;
    CResourceDeclarations m_ResourceDeclarations;
    // Declared before the renderer, which holds it too: the renderer goes first.
    std::unique_ptr<CSystemIntegration> m_SystemIntegration;
    graphics::CRenderer m_Renderer;
    gui::CWidgetManager m_WidgetManager;
    bool m_Minimized = false;
    bool m_Focused = true;
    bool m_Active = true;
    bool m_MediaPaused = false;
    int m_DebugLevel = DebugNone;
    misc::IntRect m_CursorClipRect;
    bool m_CursorClipEnabled = false;
    bool m_ShutdownDone = false;
    bool m_ShutdownRequested = false;
    wstring m_AppDataFolder;
    const misc::IntVector m_DefaultResolution {1024, 768};
    CFrameLimiter m_FrameLimiter;
    MediaPauseHooks m_MediaHooks;
    std::function<void()> m_ReplayKey;
};

extern CApplication* g_Application;

} // namespace ox::core
