#include "core/platform/StandaloneApplicationSdl.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/String.h"
#include "misc/sys/Clipboard.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstring>

namespace ox::core {

namespace {

// The notification channel of an instance: an abstract local socket named after its lock
// file, so that nothing is left on disk.
sockaddr_un NotifyAddress(const std::string& lockPath, socklen_t& length)
{
    sockaddr_un address {};
    address.sun_family = AF_UNIX;
    std::string name = "oxquest-notify:" + std::to_string(misc::CalcHash(lockPath.data(), lockPath.size())) + ":" +
                       lockPath;
    if (name.size() > sizeof(address.sun_path) - 2)
        name = name.substr(name.size() - (sizeof(address.sun_path) - 2));
    memcpy(address.sun_path + 1, name.data(), name.size()); // leading zero byte: abstract name
    length = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + 1 + name.size());
    return address;
}

const SDL_SystemCursor kSystemCursors[4] = {SDL_SYSTEM_CURSOR_ARROW, SDL_SYSTEM_CURSOR_HAND,
                                            SDL_SYSTEM_CURSOR_IBEAM, SDL_SYSTEM_CURSOR_WAIT};

} // namespace

CStandaloneApplicationSdl::CStandaloneApplicationSdl(bool resizable) : m_Resizable(resizable) {}

CStandaloneApplicationSdl::~CStandaloneApplicationSdl()
{
    Shutdown();
    if (m_NotifySocket >= 0)
        close(m_NotifySocket);
    if (m_LockFd >= 0)
        close(m_LockFd);
    if (m_VideoReady)
        SDL_QuitSubSystem(SDL_INIT_VIDEO);
}

void CStandaloneApplicationSdl::SetIdentity(const std::string& product, const std::string& windowTitle,
                                            const std::string& lockFolder)
{
    m_Product = product;
    m_WindowTitle = windowTitle;
    m_LockFolder = lockFolder;
    if (m_Wnd)
        SDL_SetWindowTitle(m_Wnd, m_WindowTitle.c_str());
}

bool CStandaloneApplicationSdl::CheckSingleInstance()
{
    if (m_Product.empty())
        return true;
    std::string lockPath = m_LockFolder + "/" + m_Product + "MutexOX.lock";
    int fd = open(lockPath.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644);
    if (fd < 0) {
        OX_LOG("core", diag::LogWarning, "cannot open the instance lock %s: %s", lockPath.c_str(), strerror(errno));
        return true; // no lock possible: do not keep the game from starting
    }
    socklen_t length = 0;
    sockaddr_un address = NotifyAddress(lockPath, length);
    if (flock(fd, LOCK_EX | LOCK_NB) != 0) {
        close(fd);
        m_SecondInstance = true;
        // Another instance holds the lock: ask it to come to the front.
        int sock = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
        if (sock >= 0) {
            const char message[] = "Notify";
            sendto(sock, message, sizeof message, MSG_DONTWAIT, reinterpret_cast<sockaddr*>(&address), length);
            close(sock);
        }
        return false;
    }
    m_LockFd = fd;
    m_NotifySocket = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    if (m_NotifySocket >= 0 && bind(m_NotifySocket, reinterpret_cast<sockaddr*>(&address), length) != 0) {
        close(m_NotifySocket);
        m_NotifySocket = -1;
    }
    return true;
}

bool CStandaloneApplicationSdl::Init()
{
    if (m_VideoReady)
        return true;
    // The capture follows the buttons the GUI counts, and nothing else; a double click is
    // as quick and as near as on the desktop the game was made for.
    SDL_SetHint(SDL_HINT_MOUSE_AUTO_CAPTURE, "0");
    SDL_SetHint(SDL_HINT_MOUSE_DOUBLE_CLICK_TIME, "500");
    SDL_SetHint(SDL_HINT_MOUSE_DOUBLE_CLICK_RADIUS, "2");
    if (SDL_InitSubSystem(SDL_INIT_VIDEO) != 0) {
        fprintf(stderr, "Cannot open a display: %s\n", SDL_GetError());
        fflush(stderr);
        OX_LOG("core", diag::LogError, "SDL video init failed: %s", SDL_GetError());
        return false;
    }
    m_VideoReady = true;
    return true;
}

void CStandaloneApplicationSdl::Shutdown()
{
    OX_ASSERT(m_EventsIndex == 0);
    if (!m_Wnd)
        return;
    for (SDL_Cursor*& cursor : m_Cursors) {
        if (cursor)
            SDL_FreeCursor(cursor);
        cursor = nullptr;
    }
    SDL_DestroyWindow(m_Wnd);
    m_Wnd = nullptr;
}

bool CStandaloneApplicationSdl::SetScreenMode(bool fullscreen, bool /*bpp32*/, unsigned width, unsigned height)
{
    if (!Init())
        return false;
    if (m_Wnd) {
        bool wasFullscreen = m_Fullscreen;
        if (SDL_SetWindowFullscreen(m_Wnd, fullscreen ? SDL_WINDOW_FULLSCREEN_DESKTOP : 0) != 0) {
            OX_LOG("core", diag::LogError, "SDL_SetWindowFullscreen failed: %s", SDL_GetError());
            return false;
        }
        if (!fullscreen) {
            SDL_SetWindowSize(m_Wnd, static_cast<int>(width), static_cast<int>(height));
            if (wasFullscreen) // moves only when leaving full screen
                SDL_SetWindowPosition(m_Wnd, SDL_WINDOWPOS_CENTERED, SDL_WINDOWPOS_CENTERED);
        }
        m_Fullscreen = fullscreen;
        return true;
    }
    Uint32 flags = SDL_WINDOW_OPENGL | SDL_WINDOW_ALLOW_HIGHDPI;
    if (fullscreen)
        flags |= SDL_WINDOW_FULLSCREEN_DESKTOP;
    if (m_Resizable)
        flags |= SDL_WINDOW_RESIZABLE;
    m_Wnd = SDL_CreateWindow(m_WindowTitle.c_str(), SDL_WINDOWPOS_CENTERED, SDL_WINDOWPOS_CENTERED,
                             static_cast<int>(width), static_cast<int>(height), flags);
    if (!m_Wnd) {
        // Without OpenGL (a display with no GL at all) a plain window still lets the game run.
        m_Wnd = SDL_CreateWindow(m_WindowTitle.c_str(), SDL_WINDOWPOS_CENTERED, SDL_WINDOWPOS_CENTERED,
                                 static_cast<int>(width), static_cast<int>(height), flags & ~SDL_WINDOW_OPENGL);
    }
    OX_ASSERT(m_Wnd != 0 && "CreateWindowEx failed");
    if (!m_Wnd) {
        OX_LOG("core", diag::LogError, "SDL_CreateWindow failed: %s", SDL_GetError());
        return false;
    }
    m_Fullscreen = fullscreen;
    SDL_ShowWindow(m_Wnd);
    ApplyCursor();
    return true;
}

bool CStandaloneApplicationSdl::GetDesktopResolution(unsigned* width, unsigned* height)
{
    // A full-screen window covers the desktop and follows a change of its mode, which the
    // display's own record may not show yet.
    if (m_Wnd && m_Fullscreen) {
        int w = 0, h = 0;
        SDL_GetWindowSize(m_Wnd, &w, &h);
        *width = static_cast<unsigned>(w);
        *height = static_cast<unsigned>(h);
        return true;
    }
    SDL_DisplayMode mode;
    const int display = m_Wnd ? std::max(SDL_GetWindowDisplayIndex(m_Wnd), 0) : 0;
    if (!Init() || SDL_GetDesktopDisplayMode(display, &mode) != 0)
        return false;
    *width = static_cast<unsigned>(mode.w);
    *height = static_cast<unsigned>(mode.h);
    return true;
}

void CStandaloneApplicationSdl::DefaultProcess()
{
    // Nothing of the platform's own handling is needed: closing is the application's call.
    m_Event.result = 0;
}

IntRect CStandaloneApplicationSdl::GetClientRect()
{
    OX_ASSERT(m_Wnd);
    IntRect rect;
    if (m_Wnd)
        SDL_GetWindowSize(m_Wnd, &rect.Width, &rect.Height);
    return rect;
}

void CStandaloneApplicationSdl::AdjustRect(IntRect& rect)
{
    int top = 0, left = 0, bottom = 0, right = 0;
    if (m_Wnd && !m_Fullscreen)
        SDL_GetWindowBordersSize(m_Wnd, &top, &left, &bottom, &right);
    rect.X -= left;
    rect.Y -= top;
    rect.Width += left + right;
    rect.Height += top + bottom;
}

IntRect CStandaloneApplicationSdl::GetWorkArea()
{
    IntRect rect;
    SDL_Rect usable;
    if (Init() && SDL_GetDisplayUsableBounds(0, &usable) == 0) {
        rect.Width = usable.w;
        rect.Height = usable.h;
    }
    return rect;
}

void CStandaloneApplicationSdl::ScreenToClient(IntPoint& point)
{
    OX_ASSERT(m_Wnd);
    int x = 0, y = 0;
    if (m_Wnd)
        SDL_GetWindowPosition(m_Wnd, &x, &y);
    point.X -= x;
    point.Y -= y;
}

void CStandaloneApplicationSdl::ClientToScreen(IntPoint& point)
{
    OX_ASSERT(m_Wnd);
    int x = 0, y = 0;
    if (m_Wnd)
        SDL_GetWindowPosition(m_Wnd, &x, &y);
    point.X += x;
    point.Y += y;
}

void CStandaloneApplicationSdl::SetCursorPos(IntPoint point) { SDL_WarpMouseGlobal(point.X, point.Y); }

IntPoint CStandaloneApplicationSdl::GetCursorPos()
{
    IntPoint point;
    SDL_GetGlobalMouseState(&point.X, &point.Y);
    return point;
}

void CStandaloneApplicationSdl::SetCursorType(unsigned type, bool applyNow)
{
    OX_ASSERT(type < 4);
    if (type >= 4)
        return;
    m_CursorType = type;
    if (applyNow)
        ShowCursor(true);
}

void CStandaloneApplicationSdl::ShowCursor(bool show)
{
    m_CursorVisible = show;
    ApplyCursor();
}

void CStandaloneApplicationSdl::ApplyCursor()
{
    if (!m_VideoReady)
        return;
    if (m_CursorVisible) {
        if (!m_Cursors[m_CursorType])
            m_Cursors[m_CursorType] = SDL_CreateSystemCursor(kSystemCursors[m_CursorType]);
        if (m_Cursors[m_CursorType])
            SDL_SetCursor(m_Cursors[m_CursorType]);
    }
    SDL_ShowCursor(m_CursorVisible ? SDL_ENABLE : SDL_DISABLE);
}

void CStandaloneApplicationSdl::ClipCursor(const IntRect* clientRect)
{
    if (!m_Wnd)
        return;
    if (!clientRect) {
        SDL_SetWindowMouseRect(m_Wnd, nullptr);
        return;
    }
    SDL_Rect rect {clientRect->X, clientRect->Y, clientRect->Width, clientRect->Height};
    SDL_SetWindowMouseRect(m_Wnd, &rect);
}

void CStandaloneApplicationSdl::CaptureMouse(bool capture)
{
    if (m_VideoReady)
        SDL_CaptureMouse(capture ? SDL_TRUE : SDL_FALSE);
}

bool CStandaloneApplicationSdl::IsKeyDown(uint32_t virtualKey)
{
    const uint16_t modifiers = m_EventsIndex > 0 ? m_Modifiers : static_cast<uint16_t>(SDL_GetModState());
    switch (virtualKey) {
    case VK_SHIFT: return modifiers & KMOD_SHIFT;
    case VK_CONTROL: return modifiers & KMOD_CTRL;
    case VK_MENU: return modifiers & KMOD_ALT;
    default: break;
    }
    int count = 0;
    const Uint8* keys = SDL_GetKeyboardState(&count);
    for (int i = 0; i < count; ++i) {
        const auto scancode = static_cast<SDL_Scancode>(i);
        if (keys[i] && VirtualKeyFromSdl(SDL_GetKeyFromScancode(scancode), scancode) == virtualKey)
            return true;
    }
    return false;
}

bool CStandaloneApplicationSdl::GetClipboardText(wstring& out)
{
    out.clear();
    return m_VideoReady && misc::sys::GetClipboardText(out);
}

bool CStandaloneApplicationSdl::SetClipboardText(const wstring& text)
{
    return m_VideoReady && misc::sys::SetClipboardText(text);
}

TranslationState CStandaloneApplicationSdl::CurrentState(const SDL_Event& event)
{
    TranslationState state;
    // A key event carries the modifiers of its moment; later ones may be queued behind it.
    const bool key = event.type == SDL_KEYDOWN || event.type == SDL_KEYUP;
    state.modifiers = key ? event.key.keysym.mod : static_cast<uint16_t>(SDL_GetModState());
    m_Modifiers = state.modifiers;
    state.mouseButtons = SDL_GetMouseState(&state.mouseX, &state.mouseY);
    if (m_Wnd) {
        SDL_GetWindowPosition(m_Wnd, &state.windowX, &state.windowY);
        SDL_GetWindowSize(m_Wnd, &state.clientWidth, &state.clientHeight);
    }
    state.fullscreen = m_Fullscreen;
    if (event.type == SDL_DISPLAYEVENT) {
        unsigned width = 0, height = 0;
        GetDesktopResolution(&width, &height);
        state.desktopWidth = static_cast<int>(width);
        state.desktopHeight = static_cast<int>(height);
    }
    return state;
}

uint32_t CStandaloneApplicationSdl::Dispatch(const SystemEvent& event)
{
    ++m_EventsIndex;
    m_Event = event;
    m_Event.inProgress = true;
    m_Event.result = 0;
    if (!m_Wnd) {
        DefaultProcess();
    } else if (event.message == WM_PAINT) {
        if (m_Client)
            m_Client->Draw();
        m_Event.result = 0;
        m_Event.inProgress = false;
        --m_EventsIndex;
        return 0;
    } else {
        if (event.message == WM_OX_NOTIFY) {
            if (SDL_GetWindowFlags(m_Wnd) & SDL_WINDOW_MINIMIZED)
                SDL_RestoreWindow(m_Wnd);
            SDL_RaiseWindow(m_Wnd);
        }
        if (m_Client)
            m_Client->ProcessEvent();
        else
            DefaultProcess();
    }
    m_Event.inProgress = false;
    --m_EventsIndex;
    return m_Event.result;
}

void CStandaloneApplicationSdl::PollNotifications()
{
    if (m_NotifySocket < 0)
        return;
    char buffer[64];
    while (recv(m_NotifySocket, buffer, sizeof buffer, MSG_DONTWAIT) > 0) {
        SystemEvent notify;
        notify.message = WM_OX_NOTIFY;
        m_Pending.push_back(notify);
    }
}

bool CStandaloneApplicationSdl::PumpMessages()
{
    PollNotifications();
    // The records of each event are taken out before they are handled: a handler may run a
    // nested loop (a modal window), which pumps on its own.
    std::vector<SystemEvent> records;
    auto dispatchAll = [&] {
        for (size_t i = 0; i < records.size() && !m_StopRequested; ++i)
            Dispatch(records[i]);
        records.clear();
    };
    if (m_VideoReady) {
        SDL_Event event;
        // A nested loop told to stop leaves the rest of the events to the loop it returns to.
        while (!m_StopRequested && !m_StopNestedRequested && SDL_PollEvent(&event)) {
            TranslateSdlEvent(event, CurrentState(event), records);
            dispatchAll();
        }
    }
    records.swap(m_Pending);
    dispatchAll();
    return !m_StopRequested;
}

void CStandaloneApplicationSdl::MainLoop(bool nested)
{
    while (!(nested && m_StopNestedRequested)) {
        PumpMessages();
        if (m_StopRequested)
            break;
        if (m_Client) {
            m_Client->Update();
            m_Client->Draw();
        }
    }
}

void CStandaloneApplicationSdl::Run() { MainLoop(false); }

void CStandaloneApplicationSdl::RunNested()
{
    ++m_NestedDepth;
    MainLoop(true);
    --m_NestedDepth;
    m_StopNestedRequested = false;
}

void CStandaloneApplicationSdl::StopNested()
{
    // Only a nested loop ends: the main loop ends by Stop alone.
    if (m_NestedDepth > 0)
        m_StopNestedRequested = true;
}

} // namespace ox::core
