#pragma once
// A platform adapter for tests, and input helpers that drive an application through it.
// The fake keeps a window of the size asked for (a full-screen one covers its desktop),
// records what the application asks of it, and hands event records to its client as the
// real adapter does. The helpers build SDL events and turn them into records with the real
// adapter's translation, so the client sees what a player's input would give it.
#include "core/SystemIntegration.h"
#include "core/platform/SdlEventTranslation.h"

#include <functional>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace oxtest {

class FakePlatform : public ox::core::CSystemIntegration {
public:
    using IntRect = ox::core::IntRect;
    using IntPoint = ox::core::IntPoint;
    using SystemEvent = ox::core::SystemEvent;

    struct Mode {
        bool fullscreen, bpp32;
        unsigned width, height;
        bool operator==(const Mode& o) const = default;
    };

    // What the platform answers.
    unsigned desktopWidth = 1920, desktopHeight = 1080;
    IntRect workArea {0, 0, 1920, 1040};
    int frameWidth = 10, frameHeight = 30; // what AdjustRect adds around a client area
    IntPoint windowPosition {100, 50};     // the client area's origin on the screen
    bool initResult = true, singleInstance = true;
    void* windowHandle = nullptr; // a real SDL window, for a render device that needs one

    // What the application asked for.
    int inits = 0, shutdowns = 0, stops = 0, defaults = 0;
    std::vector<SystemEvent> handled; // every record dispatched, with the result it got
    std::vector<Mode> modes;
    IntRect client; // empty until the first SetScreenMode
    bool fullscreen = false;
    unsigned cursorType = 0;
    bool cursorVisible = true;
    std::optional<IntRect> cursorClip;
    std::string product, windowTitle, lockFolder;
    bool mouseCaptured = false;
    int captures = 0;   // CaptureMouse(true) calls
    // The clipboard, as the system holds it (UTF-8, which may be invalid); a refusing one
    // neither gives nor takes text.
    std::string clipboard;
    bool clipboardRefuses = false;
    // A nested loop (a modal window) runs this once a frame until StopNested, at most 1000
    // times; without it RunNested returns at once.
    std::function<void()> nestedFrame;
    int nestedRuns = 0;
    // Called from the destructor, with the fake still whole.
    std::function<void(const FakePlatform&)> onDestroyed;

    // The input state the helpers keep: SDL modifiers, SDL button mask, the mouse in client
    // pixels, and the other keys held (virtual-key codes).
    uint16_t modifiers = 0;
    uint32_t mouseButtons = 0;
    IntPoint mouse;
    std::set<uint32_t> keysHeld;

    ~FakePlatform() override;

    // One record to the client, as the real adapter's window procedure hands it on: it is
    // the current event while the client handles it. Returns the handlers' result.
    uint32_t Dispatch(const SystemEvent& event);
    uint32_t Dispatch(uint32_t message, uint32_t wParam = 0, uint32_t lParam = 0);
    // An SDL event through the real translation, each record dispatched in turn.
    void Deliver(const SDL_Event& event);
    // The desktop takes a new size: a full-screen window follows it, and the platform says so.
    void ChangeDesktop(unsigned width, unsigned height);
    ox::core::TranslationState State() const;
    ox::core::IPlatformClient* GetClient() const { return m_Client; }

    bool Init() override;
    void Run() override {}
    void Stop() override { ++stops; }
    void Shutdown() override { ++shutdowns; }
    bool CheckSingleInstance() override { return singleInstance; }
    void RunNested() override;
    void StopNested() override { m_StopNested = true; }
    bool SetScreenMode(bool fullscreen, bool bpp32, unsigned width, unsigned height) override;
    bool GetDesktopResolution(unsigned* width, unsigned* height) override;
    SystemEvent* GetCurrentEvent() override { return &m_Event; }
    void DefaultProcess() override { ++defaults; }
    IntRect GetClientRect() override { return client; }
    void AdjustRect(IntRect& rect) override;
    IntRect GetWorkArea() override { return workArea; }
    void ScreenToClient(IntPoint& point) override;
    void ClientToScreen(IntPoint& point) override;
    void SetCursorPos(IntPoint point) override;
    IntPoint GetCursorPos() override;
    void SetCursorType(unsigned type, bool applyNow) override;
    unsigned GetCursorType() override { return cursorType; }
    void ShowCursor(bool show) override { cursorVisible = show; }
    bool IsCursorVisible() override { return cursorVisible; }
    void ClipCursor(const IntRect* clientRect) override;
    void CaptureMouse(bool capture) override
    {
        mouseCaptured = capture;
        captures += capture ? 1 : 0;
    }
    bool IsKeyDown(uint32_t virtualKey) override;
    void* GetWindowHandle() override { return windowHandle; }
    bool GetClipboardText(ox::wstring& out) override;
    bool SetClipboardText(const ox::wstring& text) override;
    void SetClient(ox::core::IPlatformClient* client) override { m_Client = client; }
    void SetIdentity(const std::string& product, const std::string& windowTitle,
                     const std::string& lockFolder) override;

private:
    ox::core::IPlatformClient* m_Client = nullptr;
    SystemEvent m_Event;
    bool m_StopNested = false;
};

// Input in client (window) pixels, as a player's would arrive through the platform.
void SendMove(FakePlatform& platform, int x, int y);
// A move to the point, the button down and up; `clicks` 2 makes the down a double click.
void SendClick(FakePlatform& platform, int x, int y, uint8_t button = SDL_BUTTON_LEFT, uint8_t clicks = 1);
// A key pressed and released with the modifiers held (KMOD_* flags), on a US layout.
void SendKey(FakePlatform& platform, SDL_Scancode key, uint16_t modifiers = KMOD_NONE);
// A button pressed or released where the mouse is; a move between a press and a release drags.
void SendButton(FakePlatform& platform, bool down, uint8_t button = SDL_BUTTON_LEFT);
// Typed text (UTF-8), as the platform's text input delivers it.
void SendText(FakePlatform& platform, const std::string& text);

} // namespace oxtest
