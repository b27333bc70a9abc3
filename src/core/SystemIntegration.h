#pragma once
// The interface between the application and the operating system: one window, one
// message loop, the mouse cursor and the screen geometry.
#include "core/platform/Event.h"
#include "misc/Rect.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"

#include <string>

namespace ox::core {

using misc::IntRect;
using IntPoint = misc::IntVector;

// What the loop calls back: the application.
class IPlatformClient {
public:
    virtual ~IPlatformClient() = default;
    virtual void ProcessEvent() = 0; // the adapter's current event
    virtual void Update() = 0;
    virtual void Draw() = 0;
};

enum CursorType : unsigned { CursorArrow = 0, CursorHand = 1, CursorIBeam = 2, CursorWait = 3 };

class CSystemIntegration {
public:
    virtual ~CSystemIntegration() = default;
    virtual bool Init() = 0;
    virtual void Run() = 0;
    virtual void Stop() = 0;
    virtual void Shutdown() = 0;
    virtual bool CheckSingleInstance() = 0;
    virtual void RunNested() = 0;
    virtual void StopNested() = 0;
    virtual bool SetScreenMode(bool fullscreen, bool bpp32, unsigned width, unsigned height) = 0;
    virtual bool GetDesktopResolution(unsigned* width, unsigned* height) = 0;
    virtual SystemEvent* GetCurrentEvent() = 0;
    virtual void DefaultProcess() = 0;
    virtual IntRect GetClientRect() = 0;
    virtual void AdjustRect(IntRect& rect) = 0;
    virtual IntRect GetWorkArea() = 0;
    virtual void ScreenToClient(IntPoint& point) = 0;
    virtual void ClientToScreen(IntPoint& point) = 0;
    virtual void SetCursorPos(IntPoint point) = 0;
    virtual IntPoint GetCursorPos() = 0;
    virtual void SetCursorType(unsigned type, bool applyNow) = 0;
    virtual unsigned GetCursorType() = 0;
    virtual void ShowCursor(bool show) = 0;
    virtual bool IsCursorVisible() = 0;
    // Confines the mouse to a rectangle of the window's client area; null frees it.
    virtual void ClipCursor(const IntRect* clientRect) = 0;
    // Keeps the mouse events coming to the window while a button is held outside it.
    virtual void CaptureMouse(bool /*capture*/) {}
    // Whether a key (a virtual-key code) was held when the current event happened.
    virtual bool IsKeyDown(uint32_t virtualKey) = 0;
    // The platform window the render device draws into (an SDL_Window*); null without one.
    virtual void* GetWindowHandle() { return nullptr; }
    // The system clipboard's text. False when it holds none or can't be reached (`out` is
    // then empty); a platform without a clipboard refuses both.
    virtual bool GetClipboardText(wstring& out)
    {
        out.clear();
        return false;
    }
    virtual bool SetClipboardText(const wstring& /*text*/) { return false; }

    // Who the loop calls back, and the names the single-instance lock and the window use
    // (the lock lives in the user's data folder of the game).
    virtual void SetClient(IPlatformClient* client) = 0;
    virtual void SetIdentity(const std::string& product, const std::string& windowTitle,
                             const std::string& lockFolder) = 0;
};

} // namespace ox::core
