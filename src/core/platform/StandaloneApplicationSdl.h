#pragma once
// The platform adapter on SDL2: a top-level window, the message loop, cursors, the single
// instance lock and the notification of the first instance by a second one.
#include "core/SystemIntegration.h"
#include "core/platform/SdlEventTranslation.h"

#include <SDL.h>

#include <string>
#include <vector>

namespace ox::core {

class CStandaloneApplicationSdl : public CSystemIntegration {
public:
    explicit CStandaloneApplicationSdl(bool resizable);
    ~CStandaloneApplicationSdl() override;

    // Who the loop calls, and the names the lock and the window use. The lock file lives
    // in lockFolder (the user's data folder of the game).
    void SetClient(IPlatformClient* client) override { m_Client = client; }
    void SetIdentity(const std::string& product, const std::string& windowTitle,
                     const std::string& lockFolder) override;

    bool Init() override;
    void Run() override;
    void Stop() override { m_StopRequested = true; }
    void Shutdown() override;
    bool CheckSingleInstance() override;
    void RunNested() override;
    void StopNested() override;
    bool SetScreenMode(bool fullscreen, bool bpp32, unsigned width, unsigned height) override;
    bool GetDesktopResolution(unsigned* width, unsigned* height) override;
    SystemEvent* GetCurrentEvent() override { return &m_Event; }
    void DefaultProcess() override;
    IntRect GetClientRect() override;
    void AdjustRect(IntRect& rect) override;
    IntRect GetWorkArea() override;
    void ScreenToClient(IntPoint& point) override;
    void ClientToScreen(IntPoint& point) override;
    void SetCursorPos(IntPoint point) override;
    IntPoint GetCursorPos() override;
    void SetCursorType(unsigned type, bool applyNow) override;
    unsigned GetCursorType() override { return m_CursorType; }
    void ShowCursor(bool show) override;
    bool IsCursorVisible() override { return m_CursorVisible; }
    void ClipCursor(const IntRect* clientRect) override;
    void CaptureMouse(bool capture) override;
    bool IsKeyDown(uint32_t virtualKey) override;

    SDL_Window* GetWindow() const { return m_Wnd; }
    void* GetWindowHandle() override { return m_Wnd; }
    // SDL's clipboard, which needs the window: refused before Init.
    bool GetClipboardText(wstring& out) override;
    bool SetClipboardText(const wstring& text) override;
    bool IsStopRequested() const { return m_StopRequested; }
    // The last CheckSingleInstance found another instance running.
    bool IsSecondInstance() const { return m_SecondInstance; }
    // Handles one record as the window procedure would: the platform's own messages here,
    // the rest to the client.
    uint32_t Dispatch(const SystemEvent& event);
    // Drains pending SDL events and notifications; false once a stop was requested.
    bool PumpMessages();

private:
    // Runs frames until Stop, or for a nested loop until StopNested.
    void MainLoop(bool nested);
    void PollNotifications();
    void ApplyCursor();
    TranslationState CurrentState(const SDL_Event& event);

    IPlatformClient* m_Client = nullptr;
    SDL_Window* m_Wnd = nullptr;
    bool m_VideoReady = false;
    bool m_StopRequested = false;
    bool m_StopNestedRequested = false;
    int m_NestedDepth = 0;
    bool m_Resizable;
    bool m_Fullscreen = false;
    unsigned m_CursorType = 0;
    bool m_CursorVisible = true;
    SDL_Cursor* m_Cursors[4] = {};
    int m_EventsIndex = 0;
    SystemEvent m_Event;
    uint16_t m_Modifiers = 0; // as the event being handled found them
    std::vector<SystemEvent> m_Pending;

    std::string m_Product;
    std::string m_WindowTitle;
    std::string m_LockFolder;
    int m_LockFd = -1;
    int m_NotifySocket = -1;
    bool m_SecondInstance = false;
};

} // namespace ox::core
