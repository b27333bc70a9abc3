#include "gui/WidgetManager.h"

#include "gui/Cursor.h"
#include "gui/GuiServices.h"
#include "gui/WidgetFactory.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace ox::gui {

using core::SystemEvent;
using misc::FloatVector;
using misc::IntVector;

namespace {

struct KeyEntry {
    uint32_t virtualKey;
    int code;
};

constexpr KeyEntry kKeys[] = {
    {core::VK_LEFT, OX_LEFT},     {core::VK_RIGHT, OX_RIGHT},   {core::VK_UP, OX_UP},
    {core::VK_DOWN, OX_DOWN},     {core::VK_HOME, OX_HOME},     {core::VK_END, OX_END},
    {core::VK_PRIOR, OX_PGUP},    {core::VK_NEXT, OX_PGDOWN},   {core::VK_INSERT, OX_INSERT},
    {core::VK_DELETE, OX_DELETE}, {core::VK_SPACE, OX_SPACE},   {core::VK_BACK, OX_BACK},
    {core::VK_RETURN, OX_RETURN}, {core::VK_TAB, OX_TAB},       {core::VK_ESCAPE, OX_ESC},
    {core::VK_OEM_2, OX_OEM_2},
};

bool TakesInput(const CBaseWidget& widget) { return (widget.GetFlags() & (FlagDisabled | FlagDead)) == 0; }

IntVector ClientPos(uint32_t lParam) { return {core::LowWordSigned(lParam), core::HighWordSigned(lParam)}; }

} // namespace

int TranslateKey(uint32_t virtualKey)
{
    if ((virtualKey >= '0' && virtualKey <= '9') || (virtualKey >= 'A' && virtualKey <= 'Z'))
        return static_cast<int>(virtualKey);
    if (virtualKey >= core::VK_F1 && virtualKey < core::VK_F1 + 12)
        return OX_F1 + static_cast<int>(virtualKey - core::VK_F1);
    for (const KeyEntry& entry : kKeys)
        if (entry.virtualKey == virtualKey)
            return entry.code;
    return OX_NONE;
}

CWidgetFactory& CWidgetManager::GetWidgetFactory() { return gui::GetWidgetFactory(); }

// The frame ---------------------------------------------------------------------------------

void CWidgetManager::Update()
{
    if (m_PendingMainWindow) {
        BaseWindowPtrT next = std::move(m_PendingMainWindow);
        m_PendingMainWindow.reset();
        if (BaseWindowPtrT old = m_MainWindow)
            old->OnClose();
        m_MainWindow = next;
        next->OnOpen();
    }
    BaseWindowPtrT window = m_MainWindow;
    if (!window)
        return;
    if (window->GetFlags() & FlagDead)
        m_MainWindow.reset();
    else if (!(window->GetFlags() & FlagDisabled))
        window->Update();
}

void CWidgetManager::Draw(graphics::CRenderer& renderer)
{
    if (BaseWindowPtrT window = m_MainWindow; window && TakesInput(*window))
        window->Draw(renderer);
}

void CWidgetManager::Clear()
{
    m_MainWindow.reset();
    m_PendingMainWindow.reset();
}

// Positions ---------------------------------------------------------------------------------

void CWidgetManager::SetActiveRect(const misc::FloatRect& rect, const FloatVector& scale)
{
    m_ActiveRect = rect;
    m_Scale = {scale.X > 0 ? scale.X : 1.0f, scale.Y > 0 ? scale.Y : 1.0f};
    CCursor::Instance().SetActiveRect(m_ActiveRect, m_Scale);
}

FloatVector CWidgetManager::CanvasPos(const IntVector& pos) const
{
    return {(static_cast<float>(pos.X) - m_ActiveRect.X) / m_Scale.X,
            (static_cast<float>(pos.Y) - m_ActiveRect.Y) / m_Scale.Y};
}

IntVector CWidgetManager::AdaptPos(const IntVector& pos) const
{
    const FloatVector canvas = CanvasPos(pos);
    const IntVector whole(static_cast<int>(canvas.X), static_cast<int>(canvas.Y));
    return m_MainWindow ? m_MainWindow->AdaptPos(whole) : whole;
}

int CWidgetManager::GetKeyboardState() const
{
    core::CSystemIntegration* platform = GetGuiServices().platform;
    if (!platform)
        return 0;
    return (platform->IsKeyDown(core::VK_SHIFT) ? ShiftPressed : 0) |
           (platform->IsKeyDown(core::VK_CONTROL) ? ControlPressed : 0) |
           (platform->IsKeyDown(core::VK_MENU) ? AltPressed : 0);
}

int CWidgetManager::MouseKeys(uint32_t wParam) const
{
    core::CSystemIntegration* platform = GetGuiServices().platform;
    return ((wParam & core::MK_SHIFT) ? ShiftPressed : 0) | ((wParam & core::MK_CONTROL) ? ControlPressed : 0) |
           (platform && platform->IsKeyDown(core::VK_MENU) ? AltPressed : 0);
}

// Messages ----------------------------------------------------------------------------------

void CWidgetManager::OnWindowMessage(const SystemEvent& event)
{
    if (m_InputBlocked && m_InputBlocked())
        return;
    // Restored on the way out, so that a nested loop inside a handler does not leave it unset.
    IInputListener* const outerListener = std::exchange(m_LiveListener, m_Listener);
    Translate(event);
    m_LiveListener = outerListener;
}

void CWidgetManager::Translate(const SystemEvent& event)
{
    const IntVector pos = ClientPos(event.lParam);
    const int rawKeyData = static_cast<int>(event.lParam);
    switch (event.message) {
    case core::WM_MOUSEMOVE: MouseMove(event); break;
    case core::WM_KEYDOWN:
    case core::WM_SYSKEYDOWN: OnKeyDown(TranslateKey(event.wParam), GetKeyboardState(), rawKeyData); break;
    case core::WM_KEYUP:
    case core::WM_SYSKEYUP: OnKeyUp(TranslateKey(event.wParam), GetKeyboardState(), rawKeyData); break;
    case core::WM_CHAR: OnChar(static_cast<wchar>(event.wParam & 0xFFFF), GetKeyboardState(), rawKeyData); break;
    case core::WM_LBUTTONDOWN:
        Press();
        OnMouseDown(AdaptPos(pos), LeftButton, MouseKeys(event.wParam));
        break;
    case core::WM_LBUTTONUP:
        Release();
        OnMouseUp(AdaptPos(pos), LeftButton, MouseKeys(event.wParam));
        break;
    case core::WM_LBUTTONDBLCLK:
        // The second press of a double click is no mouse down: down, up, double click, up.
        Press();
        OnDoubleClick(AdaptPos(pos), MouseKeys(event.wParam));
        break;
    case core::WM_RBUTTONDOWN:
    case core::WM_RBUTTONDBLCLK:
        Press();
        OnMouseDown(AdaptPos(pos), RightButton, MouseKeys(event.wParam));
        break;
    case core::WM_RBUTTONUP:
        Release();
        OnMouseUp(AdaptPos(pos), RightButton, MouseKeys(event.wParam));
        break;
    case core::WM_MBUTTONDOWN:
        Press();
        OnMouseDown(AdaptPos(pos), MiddleButton, MouseKeys(event.wParam));
        break;
    case core::WM_MBUTTONUP:
        Release();
        OnMouseUp(AdaptPos(pos), MiddleButton, MouseKeys(event.wParam));
        break;
    case core::WM_MOUSEWHEEL: {
        // The wheel's position is on the screen.
        IntVector client = pos;
        if (core::CSystemIntegration* platform = GetGuiServices().platform)
            platform->ScreenToClient(client);
        OnMouseWheel(AdaptPos(client), core::HighWordSigned(event.wParam) / core::WHEEL_DELTA,
                     MouseKeys(event.wParam & 0xFFFF));
        break;
    }
    default: break;
    }
}

void CWidgetManager::MouseMove(const SystemEvent& event)
{
    IntVector pos = ClientPos(event.lParam);
    if (HasActiveRect()) {
        // A pointer over the bars around the canvas is put back on its edge, and nothing moves.
        const int left = static_cast<int>(m_ActiveRect.X), top = static_cast<int>(m_ActiveRect.Y);
        const int right = static_cast<int>(m_ActiveRect.X + m_ActiveRect.Width) - 1;
        const int bottom = static_cast<int>(m_ActiveRect.Y + m_ActiveRect.Height) - 1;
        const IntVector clamped(std::clamp(pos.X, left, std::max(left, right)),
                                std::clamp(pos.Y, top, std::max(top, bottom)));
        if (!(clamped == pos)) {
            if (core::CSystemIntegration* platform = GetGuiServices().platform) {
                IntVector screen = clamped;
                platform->ClientToScreen(screen);
                platform->SetCursorPos(screen);
            }
            return;
        }
    }
    CCursor& cursor = CCursor::Instance();
    cursor.SetPosition(CanvasPos(pos));
    OnMouseMove(AdaptPos(pos), MouseKeys(event.wParam));
    cursor.Refresh();
}

void CWidgetManager::Press()
{
    if (++m_PressCount == 1)
        if (core::CSystemIntegration* platform = GetGuiServices().platform)
            platform->CaptureMouse(true);
}

void CWidgetManager::Release()
{
    // A release whose press made no message (a middle double click) counts for nothing.
    if (m_PressCount == 0)
        return;
    if (--m_PressCount == 0)
        if (core::CSystemIntegration* platform = GetGuiServices().platform)
            platform->CaptureMouse(false);
}

void CWidgetManager::ReleaseCapture()
{
    if (m_PressCount == 0)
        return;
    m_PressCount = 1;
    Release();
}

// Events ------------------------------------------------------------------------------------

BaseWindowPtrT CWidgetManager::InputWindow() const
{
    return m_MainWindow && TakesInput(*m_MainWindow) ? m_MainWindow : BaseWindowPtrT();
}

template <class Call>
bool CWidgetManager::MouseEvent(const Call& call)
{
    BaseWindowPtrT window = InputWindow();
    if (!window)
        return false;
    bool handled = call(*window, false);
    if (window == m_MainWindow && TakesInput(*window))
        handled = call(*window, true) || handled;
    return handled;
}

bool CWidgetManager::OnChar(wchar character, int keys, int rawKeyData)
{
    if (m_LiveListener)
        m_LiveListener->OnChar(character, keys, rawKeyData);
    BaseWindowPtrT window = InputWindow();
    return window && window->OnChar(character, keys, rawKeyData, false);
}

bool CWidgetManager::OnKeyDown(int key, int keys, int rawKeyData)
{
    if (m_LiveListener)
        m_LiveListener->OnKeyDown(key, keys, rawKeyData);
    BaseWindowPtrT window = InputWindow();
    return window && window->OnKeyDown(key, keys, rawKeyData, false);
}

bool CWidgetManager::OnKeyUp(int key, int keys, int rawKeyData)
{
    if (m_LiveListener)
        m_LiveListener->OnKeyUp(key, keys, rawKeyData);
    BaseWindowPtrT window = InputWindow();
    return window && window->OnKeyUp(key, keys, rawKeyData, false);
}

bool CWidgetManager::OnMouseMove(const IntVector& pos, int keys)
{
    if (m_LiveListener)
        m_LiveListener->OnMouseMove(pos, keys);
    return MouseEvent([&](CBaseWindow& w, bool broadcast) { return w.OnMouseMove(pos, keys, broadcast); });
}

bool CWidgetManager::OnMouseDown(const IntVector& pos, MouseButtons button, int keys)
{
    if (m_LiveListener)
        m_LiveListener->OnMouseDown(pos, button, keys);
    return MouseEvent([&](CBaseWindow& w, bool broadcast) { return w.OnMouseDown(pos, button, keys, broadcast); });
}

bool CWidgetManager::OnMouseUp(const IntVector& pos, MouseButtons button, int keys)
{
    if (m_LiveListener)
        m_LiveListener->OnMouseUp(pos, button, keys);
    return MouseEvent([&](CBaseWindow& w, bool broadcast) { return w.OnMouseUp(pos, button, keys, broadcast); });
}

bool CWidgetManager::OnDoubleClick(const IntVector& pos, int keys)
{
    if (m_LiveListener)
        m_LiveListener->OnDoubleClick(pos, keys);
    return MouseEvent([&](CBaseWindow& w, bool broadcast) { return w.OnDoubleClick(pos, keys, broadcast); });
}

bool CWidgetManager::OnMouseWheel(const IntVector& pos, int delta, int keys)
{
    if (m_LiveListener)
        m_LiveListener->OnMouseWheel(pos, delta, keys);
    return MouseEvent([&](CBaseWindow& w, bool broadcast) { return w.OnMouseWheel(pos, delta, keys, broadcast); });
}

} // namespace ox::gui
