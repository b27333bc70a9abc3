#pragma once
// The bridge between the application and the window on screen: the main window and the one
// that replaces it at the next update, the platform's messages turned into widget events (a
// hit-test pass and a broadcast pass for each mouse event), window pixels turned into canvas
// positions, and the mouse capture while buttons are held.
#include "core/platform/Event.h"
#include "gui/BaseWindow.h"
#include "misc/Rect.h"

#include <functional>

namespace ox::gui {

class CWidgetFactory;

// The engine's key codes: digits and capitals are their character codes.
enum KeyCodes : int {
    OX_NONE = 0,
    OX_LEFT = 10000,
    OX_RIGHT,
    OX_UP,
    OX_DOWN,
    OX_HOME,
    OX_END,
    OX_PGUP,
    OX_PGDOWN,
    OX_INSERT,
    OX_DELETE,
    OX_SPACE,
    OX_BACK,
    OX_RETURN,
    OX_TAB,
    OX_ESC,
    OX_F1,
    OX_F2,
    OX_F3,
    OX_F4,
    OX_F5,
    OX_F6,
    OX_F7,
    OX_F8,
    OX_F9,
    OX_F10,
    OX_F11,
    OX_F12,
    OX_OEM_2,
};

// Hears the events that the platform's messages become (a recorder); replayed events, fed
// to the manager's entries directly, pass it by.
class IInputListener {
public:
    virtual ~IInputListener() = default;
    virtual void OnChar(wchar character, int keys, int rawKeyData) = 0;
    virtual void OnKeyDown(int key, int keys, int rawKeyData) = 0;
    virtual void OnKeyUp(int key, int keys, int rawKeyData) = 0;
    virtual void OnMouseMove(const misc::IntVector& pos, int keys) = 0;
    virtual void OnMouseDown(const misc::IntVector& pos, MouseButtons button, int keys) = 0;
    virtual void OnMouseUp(const misc::IntVector& pos, MouseButtons button, int keys) = 0;
    virtual void OnDoubleClick(const misc::IntVector& pos, int keys) = 0;
    virtual void OnMouseWheel(const misc::IntVector& pos, int delta, int keys) = 0;
};

// The key code of a platform key (a virtual-key code); a key without one gives OX_NONE.
int TranslateKey(uint32_t virtualKey);

class CWidgetManager {
public:
    using IntVector = misc::IntVector;
    using FloatVector = misc::FloatVector;

    // The window takes over at the start of the next Update, never in the middle of an event.
    void SetMainWindow(BaseWindowPtrT window) { m_PendingMainWindow = std::move(window); }
    CBaseWindow* GetMainWindow() const { return m_MainWindow.get(); }
    CBaseWindow* GetPendingMainWindow() const { return m_PendingMainWindow.get(); }
    // The main window, or the deepest of its chain of child windows.
    CBaseWindow* GetTopWindow() const { return m_MainWindow ? m_MainWindow->GetTopWindow() : nullptr; }

    // The old main window closes and the pending one opens; a dead main window is dropped;
    // the main window updates unless disabled.
    void Update();
    // The main window, unless disabled or dead.
    void Draw(graphics::CRenderer& renderer);
    // Drops the main window and the pending one.
    void Clear();

    // A platform message: mouse, keys and characters become widget events; others are ignored.
    void OnWindowMessage(const core::SystemEvent& event);
    // Where the GUI fills the window, in window pixels, and its scale from canvas units.
    void SetActiveRect(const misc::FloatRect& rect, const FloatVector& scale);
    const misc::FloatRect& GetActiveRect() const { return m_ActiveRect; }
    const FloatVector& GetScale() const { return m_Scale; }
    // A window pixel on the canvas.
    FloatVector CanvasPos(const IntVector& pos) const;
    // A window pixel in the main window's own coordinates, to whole units.
    IntVector AdaptPos(const IntVector& pos) const;
    // ShiftPressed, ControlPressed and AltPressed as the keys are held now.
    int GetKeyboardState() const;
    // Lets the mouse go (the application went to the background): no button counts as held.
    void ReleaseCapture();
    int GetPressCount() const { return m_PressCount; }
    // While this answers true (a replay plays), messages from the platform are ignored.
    void SetInputBlocked(std::function<bool()> blocked) { m_InputBlocked = std::move(blocked); }
    // Hears each event made from a platform message, before the window gets it.
    void SetInputListener(IInputListener* listener) { m_Listener = listener; }

    // The events as the main window gets them, in its coordinates: what the messages become,
    // and what a replay feeds. A mouse event makes two calls, a hit-test pass and then a
    // broadcast pass; a key one call. The result says whether a widget handled it.
    bool OnChar(wchar character, int keys, int rawKeyData);
    bool OnKeyDown(int key, int keys, int rawKeyData);
    bool OnKeyUp(int key, int keys, int rawKeyData);
    bool OnMouseMove(const IntVector& pos, int keys);
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys);
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys);
    bool OnDoubleClick(const IntVector& pos, int keys);
    bool OnMouseWheel(const IntVector& pos, int delta, int keys);

    CWidgetFactory& GetWidgetFactory();

private:
    // The main window, held, if it takes input.
    BaseWindowPtrT InputWindow() const;
    template <class Call>
    bool MouseEvent(const Call& call);
    void Translate(const core::SystemEvent& event);
    void MouseMove(const core::SystemEvent& event);
    void Press();
    void Release();
    int MouseKeys(uint32_t wParam) const;
    bool HasActiveRect() const { return m_ActiveRect.Width > 0 && m_ActiveRect.Height > 0; }

    BaseWindowPtrT m_MainWindow;
    BaseWindowPtrT m_PendingMainWindow;
    misc::FloatRect m_ActiveRect;
    FloatVector m_Scale {1.0f, 1.0f};
    int m_PressCount = 0;
    std::function<bool()> m_InputBlocked;
    IInputListener* m_Listener = nullptr;
    // The listener in reach while a platform message is being turned into events.
    IInputListener* m_LiveListener = nullptr;
};

} // namespace ox::gui
