#include "support/FakePlatform.h"

#include "misc/Unicode.h"

#include <algorithm>
#include <cstring>
#include <iterator>

namespace oxtest {

using namespace ox::core;

FakePlatform::~FakePlatform()
{
    if (onDestroyed)
        onDestroyed(*this);
}

uint32_t FakePlatform::Dispatch(const SystemEvent& event)
{
    m_Event = event;
    m_Event.inProgress = true;
    m_Event.result = 0;
    if (!m_Client)
        DefaultProcess();
    else if (event.message == WM_PAINT)
        m_Client->Draw();
    else
        m_Client->ProcessEvent();
    m_Event.inProgress = false;
    handled.push_back(m_Event);
    return m_Event.result;
}

uint32_t FakePlatform::Dispatch(uint32_t message, uint32_t wParam, uint32_t lParam)
{
    SystemEvent event;
    event.message = message;
    event.wParam = wParam;
    event.lParam = lParam;
    return Dispatch(event);
}

void FakePlatform::Deliver(const SDL_Event& event)
{
    std::vector<SystemEvent> records;
    TranslateSdlEvent(event, State(), records);
    for (const SystemEvent& record : records)
        Dispatch(record);
}

void FakePlatform::ChangeDesktop(unsigned width, unsigned height)
{
    desktopWidth = width;
    desktopHeight = height;
    SDL_Event event {};
    if (fullscreen && client.Width > 0) {
        client = {0, 0, static_cast<int>(width), static_cast<int>(height)};
        event.type = SDL_WINDOWEVENT;
        event.window.event = SDL_WINDOWEVENT_SIZE_CHANGED;
        event.window.data1 = static_cast<int>(width);
        event.window.data2 = static_cast<int>(height);
    } else {
        event.type = SDL_DISPLAYEVENT;
        event.display.event = SDL_DISPLAYEVENT_ORIENTATION;
    }
    Deliver(event);
}

TranslationState FakePlatform::State() const
{
    TranslationState state;
    state.modifiers = modifiers;
    state.mouseButtons = mouseButtons;
    state.windowX = windowPosition.X;
    state.windowY = windowPosition.Y;
    state.clientWidth = client.Width;
    state.clientHeight = client.Height;
    state.mouseX = mouse.X;
    state.mouseY = mouse.Y;
    state.fullscreen = fullscreen;
    state.desktopWidth = static_cast<int>(desktopWidth);
    state.desktopHeight = static_cast<int>(desktopHeight);
    return state;
}

bool FakePlatform::Init()
{
    ++inits;
    return initResult;
}

void FakePlatform::RunNested()
{
    ++nestedRuns;
    m_StopNested = false;
    for (int frame = 0; nestedFrame && frame < 1000 && !m_StopNested; ++frame)
        nestedFrame();
    m_StopNested = false;
}

bool FakePlatform::SetScreenMode(bool full, bool bpp32, unsigned width, unsigned height)
{
    modes.push_back({full, bpp32, width, height});
    fullscreen = full;
    // Full screen covers the desktop, whatever size was asked, as the real adapter's does.
    client = full ? IntRect {0, 0, static_cast<int>(desktopWidth), static_cast<int>(desktopHeight)}
                  : IntRect {0, 0, static_cast<int>(width), static_cast<int>(height)};
    return true;
}

bool FakePlatform::GetClipboardText(ox::wstring& out)
{
    out = clipboardRefuses || clipboard.empty() ? ox::wstring() : ox::misc::Utf8ToWide(clipboard);
    return !out.empty();
}

bool FakePlatform::SetClipboardText(const ox::wstring& text)
{
    if (clipboardRefuses)
        return false;
    clipboard = ox::misc::WideToUtf8(text);
    return true;
}

bool FakePlatform::GetDesktopResolution(unsigned* width, unsigned* height)
{
    *width = desktopWidth;
    *height = desktopHeight;
    return true;
}

void FakePlatform::AdjustRect(IntRect& rect)
{
    rect.Width += frameWidth;
    rect.Height += frameHeight;
}

void FakePlatform::ScreenToClient(IntPoint& point)
{
    point.X -= windowPosition.X;
    point.Y -= windowPosition.Y;
}

void FakePlatform::ClientToScreen(IntPoint& point)
{
    point.X += windowPosition.X;
    point.Y += windowPosition.Y;
}

void FakePlatform::SetCursorPos(IntPoint point)
{
    ScreenToClient(point);
    mouse = point;
}

IntPoint FakePlatform::GetCursorPos()
{
    IntPoint point = mouse;
    ClientToScreen(point);
    return point;
}

void FakePlatform::SetCursorType(unsigned type, bool applyNow)
{
    cursorType = type;
    if (applyNow)
        cursorVisible = true;
}

void FakePlatform::ClipCursor(const IntRect* clientRect)
{
    cursorClip = clientRect ? std::optional<IntRect>(*clientRect) : std::nullopt;
}

bool FakePlatform::IsKeyDown(uint32_t virtualKey)
{
    switch (virtualKey) {
    case VK_SHIFT: return modifiers & KMOD_SHIFT;
    case VK_CONTROL: return modifiers & KMOD_CTRL;
    case VK_MENU: return modifiers & KMOD_ALT;
    default: return keysHeld.count(virtualKey) > 0;
    }
}

void FakePlatform::SetIdentity(const std::string& productName, const std::string& title, const std::string& folder)
{
    product = productName;
    windowTitle = title;
    lockFolder = folder;
}

// Input helpers ------------------------------------------------------------------------

namespace {

// The key code a US layout gives a key.
SDL_Keycode UsKeycode(SDL_Scancode key)
{
    if (key >= SDL_SCANCODE_A && key <= SDL_SCANCODE_Z)
        return SDLK_a + (key - SDL_SCANCODE_A);
    if (key >= SDL_SCANCODE_1 && key <= SDL_SCANCODE_9)
        return SDLK_1 + (key - SDL_SCANCODE_1);
    switch (key) {
    case SDL_SCANCODE_0: return SDLK_0;
    case SDL_SCANCODE_RETURN: return SDLK_RETURN;
    case SDL_SCANCODE_ESCAPE: return SDLK_ESCAPE;
    case SDL_SCANCODE_BACKSPACE: return SDLK_BACKSPACE;
    case SDL_SCANCODE_TAB: return SDLK_TAB;
    case SDL_SCANCODE_SPACE: return SDLK_SPACE;
    default: return SDL_SCANCODE_TO_KEYCODE(key);
    }
}

// One key going down or up; the platform's key state follows.
void DeliverKey(FakePlatform& platform, SDL_Scancode key, bool down)
{
    const SDL_Keycode sym = UsKeycode(key);
    const uint32_t vk = VirtualKeyFromSdl(sym, key);
    if (down)
        platform.keysHeld.insert(vk);
    else
        platform.keysHeld.erase(vk);
    SDL_Event event {};
    event.type = down ? SDL_KEYDOWN : SDL_KEYUP;
    event.key.state = down ? SDL_PRESSED : SDL_RELEASED;
    event.key.keysym.scancode = key;
    event.key.keysym.sym = sym;
    event.key.keysym.mod = platform.modifiers;
    platform.Deliver(event);
}

struct ModifierKey {
    uint16_t flags;
    uint16_t left;
    SDL_Scancode key;
};
constexpr ModifierKey kModifierKeys[] = {
    {KMOD_CTRL, KMOD_LCTRL, SDL_SCANCODE_LCTRL},
    {KMOD_SHIFT, KMOD_LSHIFT, SDL_SCANCODE_LSHIFT},
    {KMOD_ALT, KMOD_LALT, SDL_SCANCODE_LALT},
};

void DeliverButton(FakePlatform& platform, int x, int y, uint8_t button, uint8_t clicks, bool down)
{
    if (down)
        platform.mouseButtons |= SDL_BUTTON(button);
    else
        platform.mouseButtons &= ~SDL_BUTTON(button);
    SDL_Event event {};
    event.type = down ? SDL_MOUSEBUTTONDOWN : SDL_MOUSEBUTTONUP;
    event.button.button = button;
    event.button.state = down ? SDL_PRESSED : SDL_RELEASED;
    event.button.clicks = clicks;
    event.button.x = x;
    event.button.y = y;
    platform.Deliver(event);
}

} // namespace

void SendMove(FakePlatform& platform, int x, int y)
{
    platform.mouse = {x, y};
    SDL_Event event {};
    event.type = SDL_MOUSEMOTION;
    event.motion.state = platform.mouseButtons;
    event.motion.x = x;
    event.motion.y = y;
    platform.Deliver(event);
}

void SendClick(FakePlatform& platform, int x, int y, uint8_t button, uint8_t clicks)
{
    SendMove(platform, x, y);
    DeliverButton(platform, x, y, button, clicks, true);
    DeliverButton(platform, x, y, button, clicks, false);
}

void SendButton(FakePlatform& platform, bool down, uint8_t button)
{
    DeliverButton(platform, platform.mouse.X, platform.mouse.Y, button, 1, down);
}

void SendKey(FakePlatform& platform, SDL_Scancode key, uint16_t modifiers)
{
    // The modifier keys go down first and come up last, as on a keyboard.
    for (const ModifierKey& modifier : kModifierKeys) {
        if (modifiers & modifier.flags) {
            platform.modifiers |= modifier.left;
            DeliverKey(platform, modifier.key, true);
        }
    }
    DeliverKey(platform, key, true);
    DeliverKey(platform, key, false);
    for (auto it = std::rbegin(kModifierKeys); it != std::rend(kModifierKeys); ++it) {
        if (modifiers & it->flags) {
            platform.modifiers &= static_cast<uint16_t>(~it->left);
            DeliverKey(platform, it->key, false);
        }
    }
}

void SendText(FakePlatform& platform, const std::string& text)
{
    // The platform delivers text in pieces that fit its event, cut between characters.
    constexpr size_t kPiece = SDL_TEXTINPUTEVENT_TEXT_SIZE - 1;
    size_t from = 0;
    while (from < text.size()) {
        size_t end = std::min(text.size(), from + kPiece);
        while (end < text.size() && end > from && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80)
            --end;
        SDL_Event event {};
        event.type = SDL_TEXTINPUT;
        memcpy(event.text.text, text.data() + from, end - from);
        platform.Deliver(event);
        from = end;
    }
}

} // namespace oxtest
