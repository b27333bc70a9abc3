#include "core/platform/SdlEventTranslation.h"

#include "misc/Unicode.h"

namespace ox::core {

namespace {

struct KeyEntry {
    SDL_Scancode scancode;
    uint32_t vk;
};

// Keys that are not letters or digits, by their position on the keyboard.
constexpr KeyEntry kKeyTable[] = {
    {SDL_SCANCODE_BACKSPACE, VK_BACK}, {SDL_SCANCODE_TAB, VK_TAB}, {SDL_SCANCODE_RETURN, VK_RETURN},
    {SDL_SCANCODE_KP_ENTER, VK_RETURN}, {SDL_SCANCODE_LSHIFT, VK_SHIFT}, {SDL_SCANCODE_RSHIFT, VK_SHIFT},
    {SDL_SCANCODE_LCTRL, VK_CONTROL}, {SDL_SCANCODE_RCTRL, VK_CONTROL}, {SDL_SCANCODE_LALT, VK_MENU},
    {SDL_SCANCODE_RALT, VK_MENU}, {SDL_SCANCODE_PAUSE, VK_PAUSE}, {SDL_SCANCODE_CAPSLOCK, VK_CAPITAL},
    {SDL_SCANCODE_ESCAPE, VK_ESCAPE}, {SDL_SCANCODE_SPACE, VK_SPACE}, {SDL_SCANCODE_PAGEUP, VK_PRIOR},
    {SDL_SCANCODE_PAGEDOWN, VK_NEXT}, {SDL_SCANCODE_END, VK_END}, {SDL_SCANCODE_HOME, VK_HOME},
    {SDL_SCANCODE_LEFT, VK_LEFT}, {SDL_SCANCODE_UP, VK_UP}, {SDL_SCANCODE_RIGHT, VK_RIGHT},
    {SDL_SCANCODE_DOWN, VK_DOWN}, {SDL_SCANCODE_PRINTSCREEN, VK_SNAPSHOT}, {SDL_SCANCODE_INSERT, VK_INSERT},
    {SDL_SCANCODE_DELETE, VK_DELETE}, {SDL_SCANCODE_KP_MULTIPLY, VK_MULTIPLY}, {SDL_SCANCODE_KP_PLUS, VK_ADD},
    {SDL_SCANCODE_KP_MINUS, VK_SUBTRACT}, {SDL_SCANCODE_KP_PERIOD, VK_DECIMAL},
    {SDL_SCANCODE_KP_DIVIDE, VK_DIVIDE}, {SDL_SCANCODE_NUMLOCKCLEAR, VK_NUMLOCK},
    {SDL_SCANCODE_SCROLLLOCK, VK_SCROLL}, {SDL_SCANCODE_SEMICOLON, VK_OEM_1}, {SDL_SCANCODE_EQUALS, VK_OEM_PLUS},
    {SDL_SCANCODE_COMMA, VK_OEM_COMMA}, {SDL_SCANCODE_MINUS, VK_OEM_MINUS}, {SDL_SCANCODE_PERIOD, VK_OEM_PERIOD},
    {SDL_SCANCODE_SLASH, VK_OEM_2}, {SDL_SCANCODE_GRAVE, VK_OEM_3}, {SDL_SCANCODE_LEFTBRACKET, VK_OEM_4},
    {SDL_SCANCODE_BACKSLASH, VK_OEM_5}, {SDL_SCANCODE_RIGHTBRACKET, VK_OEM_6},
    {SDL_SCANCODE_APOSTROPHE, VK_OEM_7},
};

uint32_t MouseKeyFlags(const TranslationState& state)
{
    uint32_t flags = 0;
    if (state.mouseButtons & SDL_BUTTON_LMASK) flags |= MK_LBUTTON;
    if (state.mouseButtons & SDL_BUTTON_RMASK) flags |= MK_RBUTTON;
    if (state.mouseButtons & SDL_BUTTON_MMASK) flags |= MK_MBUTTON;
    if (state.modifiers & KMOD_SHIFT) flags |= MK_SHIFT;
    if (state.modifiers & KMOD_CTRL) flags |= MK_CONTROL;
    return flags;
}

void Push(std::vector<SystemEvent>& out, uint32_t message, uint32_t wParam, uint32_t lParam)
{
    SystemEvent e;
    e.message = message;
    e.wParam = wParam;
    e.lParam = lParam;
    out.push_back(e);
}

// Control characters that keys produce as text on the original platform.
uint32_t ControlCharacter(const SDL_KeyboardEvent& key)
{
    switch (key.keysym.scancode) {
    case SDL_SCANCODE_BACKSPACE: return 8;
    case SDL_SCANCODE_TAB: return 9;
    case SDL_SCANCODE_RETURN:
    case SDL_SCANCODE_KP_ENTER: return 13;
    case SDL_SCANCODE_ESCAPE: return 27;
    default: break;
    }
    bool ctrl = key.keysym.mod & KMOD_CTRL;
    bool alt = key.keysym.mod & KMOD_ALT;
    if (ctrl && !alt && key.keysym.sym >= SDLK_a && key.keysym.sym <= SDLK_z)
        return static_cast<uint32_t>(key.keysym.sym - SDLK_a + 1);
    return 0;
}

void TranslateKey(const SDL_KeyboardEvent& key, std::vector<SystemEvent>& out)
{
    uint32_t vk = VirtualKeyFromSdl(key.keysym.sym, key.keysym.scancode);
    if (!vk)
        return;
    bool down = key.type == SDL_KEYDOWN;
    bool alt = key.keysym.mod & KMOD_ALT;
    bool ctrl = key.keysym.mod & KMOD_CTRL;
    // Alt without Ctrl (and F10) make the "system" key messages.
    bool system = (alt && !ctrl) || vk == VK_F1 + 9;
    uint32_t lParam = 1 | (static_cast<uint32_t>(key.keysym.scancode & 0xFF) << 16);
    if (alt)
        lParam |= 1u << 29;
    if (down && key.repeat)
        lParam |= 1u << 30;
    if (!down)
        lParam |= (1u << 30) | (1u << 31);
    uint32_t message = down ? (system ? WM_SYSKEYDOWN : WM_KEYDOWN) : (system ? WM_SYSKEYUP : WM_KEYUP);
    Push(out, message, vk, lParam);
    if (down) {
        if (uint32_t c = ControlCharacter(key))
            Push(out, WM_CHAR, c, lParam);
    }
}

void TranslateButton(const SDL_MouseButtonEvent& button, const TranslationState& state, std::vector<SystemEvent>& out)
{
    uint32_t base;
    switch (button.button) {
    case SDL_BUTTON_LEFT: base = WM_LBUTTONDOWN; break;
    case SDL_BUTTON_RIGHT: base = WM_RBUTTONDOWN; break;
    case SDL_BUTTON_MIDDLE: base = WM_MBUTTONDOWN; break;
    default: return;
    }
    uint32_t message;
    if (button.type == SDL_MOUSEBUTTONUP)
        message = base + 1;
    else
        message = (button.clicks >= 2 && button.clicks % 2 == 0) ? base + 2 : base;
    Push(out, message, MouseKeyFlags(state), MakeLong(button.x, button.y));
}

void TranslateWindow(const SDL_WindowEvent& window, const TranslationState& state, std::vector<SystemEvent>& out)
{
    switch (window.event) {
    case SDL_WINDOWEVENT_MOVED:
        Push(out, WM_MOVE, 0, MakeLong(window.data1, window.data2));
        break;
    case SDL_WINDOWEVENT_SIZE_CHANGED:
        Push(out, WM_SIZE, SIZE_RESTORED, MakeLong(window.data1, window.data2));
        // A full-screen window changes its size only with the desktop.
        if (state.fullscreen)
            Push(out, WM_DISPLAYCHANGE, 32, MakeLong(window.data1, window.data2));
        break;
    case SDL_WINDOWEVENT_MINIMIZED:
        Push(out, WM_SIZE, SIZE_MINIMIZED, 0);
        break;
    case SDL_WINDOWEVENT_MAXIMIZED:
        Push(out, WM_SIZE, SIZE_MAXIMIZED, MakeLong(state.clientWidth, state.clientHeight));
        break;
    case SDL_WINDOWEVENT_RESTORED:
        Push(out, WM_SIZE, SIZE_RESTORED, MakeLong(state.clientWidth, state.clientHeight));
        break;
    case SDL_WINDOWEVENT_FOCUS_GAINED:
        Push(out, WM_ACTIVATEAPP, 1, 0);
        break;
    case SDL_WINDOWEVENT_FOCUS_LOST:
        Push(out, WM_ACTIVATEAPP, 0, 0);
        break;
    case SDL_WINDOWEVENT_CLOSE:
        Push(out, WM_CLOSE, 0, 0);
        break;
    case SDL_WINDOWEVENT_EXPOSED:
        Push(out, WM_PAINT, 0, 0);
        break;
    default:
        break;
    }
}

} // namespace

uint32_t VirtualKeyFromSdl(SDL_Keycode key, SDL_Scancode scancode)
{
    // Letters follow the keyboard layout, as on the original platform.
    if (key >= SDLK_a && key <= SDLK_z)
        return static_cast<uint32_t>('A' + (key - SDLK_a));
    if (scancode >= SDL_SCANCODE_1 && scancode <= SDL_SCANCODE_9)
        return static_cast<uint32_t>('1' + (scancode - SDL_SCANCODE_1));
    if (scancode == SDL_SCANCODE_0)
        return '0';
    if (scancode >= SDL_SCANCODE_A && scancode <= SDL_SCANCODE_Z)
        return static_cast<uint32_t>('A' + (scancode - SDL_SCANCODE_A));
    if (scancode >= SDL_SCANCODE_F1 && scancode <= SDL_SCANCODE_F12)
        return VK_F1 + (scancode - SDL_SCANCODE_F1);
    if (scancode >= SDL_SCANCODE_KP_1 && scancode <= SDL_SCANCODE_KP_9)
        return VK_NUMPAD0 + 1 + (scancode - SDL_SCANCODE_KP_1);
    if (scancode == SDL_SCANCODE_KP_0)
        return VK_NUMPAD0;
    for (const KeyEntry& entry : kKeyTable)
        if (entry.scancode == scancode)
            return entry.vk;
    return 0;
}

void TranslateSdlEvent(const SDL_Event& event, const TranslationState& state, std::vector<SystemEvent>& out)
{
    switch (event.type) {
    case SDL_QUIT:
        Push(out, WM_CLOSE, 0, 0);
        break;
    case SDL_WINDOWEVENT:
        TranslateWindow(event.window, state, out);
        break;
    case SDL_DISPLAYEVENT:
        Push(out, WM_DISPLAYCHANGE, 32, MakeLong(state.desktopWidth, state.desktopHeight));
        break;
    case SDL_KEYDOWN:
    case SDL_KEYUP:
        TranslateKey(event.key, out);
        break;
    case SDL_TEXTINPUT: {
        wstring text = misc::Utf8ToWide(event.text.text);
        for (wchar unit : text)
            Push(out, WM_CHAR, unit, 1);
        break;
    }
    case SDL_MOUSEMOTION:
        // The original platform asks for the cursor shape before every move.
        Push(out, WM_SETCURSOR, 0, MakeLong(HTCLIENT, WM_MOUSEMOVE));
        Push(out, WM_MOUSEMOVE, MouseKeyFlags(state), MakeLong(event.motion.x, event.motion.y));
        break;
    case SDL_MOUSEBUTTONDOWN:
    case SDL_MOUSEBUTTONUP:
        TranslateButton(event.button, state, out);
        break;
    case SDL_MOUSEWHEEL: {
        int steps = event.wheel.y;
        if (event.wheel.direction == SDL_MOUSEWHEEL_FLIPPED)
            steps = -steps;
        if (steps == 0)
            break;
        // The wheel reports its position in screen coordinates.
        Push(out, WM_MOUSEWHEEL, MakeLong(static_cast<int>(MouseKeyFlags(state)), steps * WHEEL_DELTA),
             MakeLong(state.windowX + state.mouseX, state.windowY + state.mouseY));
        break;
    }
    default:
        break;
    }
}

} // namespace ox::core
