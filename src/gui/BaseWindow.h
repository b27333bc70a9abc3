#pragma once
// The top of a widget tree: one child window above it (windows stack as a chain, the deepest
// on top; while a child window is open it takes all the input, which is the whole of
// modality), a focused widget that gets the keys first, and the modal loop.
#include "gui/Widget.h"

namespace ox::gui {

class CBaseWindow;
using BaseWindowPtrT = boost::intrusive_ptr<CBaseWindow>;

class CBaseWindow : public CBaseWidget {
public:
    explicit CBaseWindow(std::string_view id = {}) : CBaseWidget(id) {}
    ~CBaseWindow() override;

    // (0, 0) in the window's own coordinates; on the screen, the parent window's position
    // plus the offset. So a widget's GetAbsPos(false) is relative to its window.
    FloatVector GetAbsPos(bool toScreen) const override;
    // The old focused widget loses focus and the new one gains it (each unless disabled or dead).
    void SetChildFocused(CWidget* child) override;

    // Input: to the child window alone while there is one (true, whatever it did); else keys
    // to the focused widget and then to those that asked by mask, and the mouse to the tree.
    bool OnChar(wchar character, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyUp(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;

    // The children unless hidden, then the child window.
    void DoDraw(graphics::CRenderer& renderer) override;
    // A dead child window is removed; one that stays is updated.
    void DoUpdate() override;

    // Puts `window` on top of this one and opens it.
    virtual void AddChildWindow(BaseWindowPtrT window);
    // Closes the child window; it goes only if its OnClose agrees.
    virtual void RemoveChildWindow();
    virtual void OnOpen() {}
    virtual bool OnClose() { return true; }

    // Opens `window` on top and runs frames until it calls EndModal; closes it and gives
    // the result it left.
    int DoModal(BaseWindowPtrT window);
    void EndModal(int result);

    CBaseWindow* GetChildWindow() const { return m_ChildWindow.get(); }
    CBaseWindow* GetParentWindow() const { return m_ParentWindow; }
    CWidget* GetFocusedChild() const { return m_FocusedChild.get(); }
    int GetModalResult() const { return m_ModalResult; }
    // This window, or the deepest of its chain of child windows.
    CBaseWindow* GetTopWindow();

private:
    // While a child window is open it takes the event (unless it is disabled or dead): true.
    template <class Call>
    bool RouteToChildWindow(const Call& call);
    // Without a child window: the focused widget first, then the base dispatch.
    template <class Call>
    bool RouteKey(const Call& call);

    int m_ModalResult = 0;
    CBaseWindow* m_ParentWindow = nullptr;
    BaseWindowPtrT m_ChildWindow;
    // Held, so that a focused widget taken out of the tree cannot leave a dangling link.
    WidgetPtrT m_FocusedChild;
};

} // namespace ox::gui
