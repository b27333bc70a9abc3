#include "gui/BaseWindow.h"

#include "diag/Log.h"
#include "gui/GuiServices.h"

namespace ox::gui {

namespace {

bool TakesInput(const CBaseWidget& widget) { return (widget.GetFlags() & (FlagDisabled | FlagDead)) == 0; }

} // namespace

CBaseWindow::~CBaseWindow()
{
    if (m_ChildWindow && m_ChildWindow->m_ParentWindow == this)
        m_ChildWindow->m_ParentWindow = nullptr;
}

misc::FloatVector CBaseWindow::GetAbsPos(bool toScreen) const
{
    if (!toScreen)
        return {};
    return (m_ParentWindow ? m_ParentWindow->GetAbsPos(true) : FloatVector()) + GetOffset();
}

void CBaseWindow::SetChildFocused(CWidget* child)
{
    if (child == m_FocusedChild.get())
        return;
    // Only a widget some tree holds can be held here: holding one nobody owns would end it.
    OX_ASSERT(!child || child->GetRefCount() > 0);
    if (child && child->GetRefCount() == 0)
        return;
    WidgetPtrT old = m_FocusedChild;
    if (old && TakesInput(*old))
        old->SetFocused(false);
    if (child && TakesInput(*child))
        child->SetFocused(true);
    m_FocusedChild = child;
}

CBaseWindow* CBaseWindow::GetTopWindow()
{
    CBaseWindow* top = this;
    while (top->m_ChildWindow)
        top = top->m_ChildWindow.get();
    return top;
}

// Routing ---------------------------------------------------------------------------------

template <class Call>
bool CBaseWindow::RouteToChildWindow(const Call& call)
{
    if (!m_ChildWindow)
        return false;
    // Held: the child may close itself while it handles the event.
    BaseWindowPtrT child = m_ChildWindow;
    if (TakesInput(*child))
        call(*child);
    return true;
}

template <class Call>
bool CBaseWindow::RouteKey(const Call& call)
{
    bool handled = false;
    if (WidgetPtrT focused = m_FocusedChild; focused && TakesInput(*focused))
        handled = call(static_cast<CBaseWidget&>(*focused), false);
    return call(static_cast<CBaseWidget&>(*this), true) || handled;
}

bool CBaseWindow::OnChar(wchar character, int keys, int rawKeyData, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnChar(character, keys, rawKeyData, broadcast); }))
        return true;
    return RouteKey([&](CBaseWidget& w, bool base) {
        return base ? CBaseWidget::OnChar(character, keys, rawKeyData, broadcast)
                    : w.OnChar(character, keys, rawKeyData, broadcast);
    });
}

bool CBaseWindow::OnKeyDown(int key, int keys, int rawKeyData, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnKeyDown(key, keys, rawKeyData, broadcast); }))
        return true;
    return RouteKey([&](CBaseWidget& w, bool base) {
        return base ? CBaseWidget::OnKeyDown(key, keys, rawKeyData, broadcast) : w.OnKeyDown(key, keys, rawKeyData, broadcast);
    });
}

bool CBaseWindow::OnKeyUp(int key, int keys, int rawKeyData, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnKeyUp(key, keys, rawKeyData, broadcast); }))
        return true;
    return RouteKey([&](CBaseWidget& w, bool base) {
        return base ? CBaseWidget::OnKeyUp(key, keys, rawKeyData, broadcast) : w.OnKeyUp(key, keys, rawKeyData, broadcast);
    });
}

bool CBaseWindow::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnMouseMove(w.AdaptPos(pos), keys, broadcast); }))
        return true;
    return CBaseWidget::OnMouseMove(pos, keys, broadcast);
}

bool CBaseWindow::OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnMouseDown(w.AdaptPos(pos), button, keys, broadcast); }))
        return true;
    return CBaseWidget::OnMouseDown(pos, button, keys, broadcast);
}

bool CBaseWindow::OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnMouseUp(w.AdaptPos(pos), button, keys, broadcast); }))
        return true;
    return CBaseWidget::OnMouseUp(pos, button, keys, broadcast);
}

bool CBaseWindow::OnDoubleClick(const IntVector& pos, int keys, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnDoubleClick(w.AdaptPos(pos), keys, broadcast); }))
        return true;
    return CBaseWidget::OnDoubleClick(pos, keys, broadcast);
}

bool CBaseWindow::OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast)
{
    if (RouteToChildWindow([&](CBaseWindow& w) { w.OnMouseWheel(w.AdaptPos(pos), delta, keys, broadcast); }))
        return true;
    return CBaseWidget::OnMouseWheel(pos, delta, keys, broadcast);
}

// The frame -------------------------------------------------------------------------------

void CBaseWindow::DoDraw(graphics::CRenderer& renderer)
{
    if (!(GetFlags() & FlagHidden))
        CBaseWidget::DoDraw(renderer);
    if (BaseWindowPtrT child = m_ChildWindow)
        child->Draw(renderer);
}

void CBaseWindow::DoUpdate()
{
    CBaseWidget::DoUpdate();
    if (m_ChildWindow && (m_ChildWindow->GetFlags() & FlagDead))
        RemoveChildWindow();
    if (BaseWindowPtrT child = m_ChildWindow)
        child->Update();
}

// Stacking --------------------------------------------------------------------------------

void CBaseWindow::AddChildWindow(BaseWindowPtrT _window)
{
    OX_ASSERT(_window);
    if (!_window)
        return;
    if (m_ChildWindow && m_ChildWindow->m_ParentWindow == this)
        m_ChildWindow->m_ParentWindow = nullptr;
    m_ChildWindow = _window;
    _window->m_ParentWindow = this;
    _window->OnOpen();
}

void CBaseWindow::RemoveChildWindow()
{
    BaseWindowPtrT child = m_ChildWindow;
    if (!child || !child->OnClose())
        return;
    // OnClose may have put another window in its place.
    if (m_ChildWindow == child) {
        m_ChildWindow.reset();
        if (child->m_ParentWindow == this)
            child->m_ParentWindow = nullptr;
    }
}

int CBaseWindow::DoModal(BaseWindowPtrT window)
{
    OX_ASSERT(window);
    if (!window)
        return 0;
    AddChildWindow(window);
    if (core::CSystemIntegration* platform = GetGuiServices().platform)
        platform->RunNested();
    else
        OX_LOG("gui", diag::LogError, "DoModal: no platform loop to run the modal window in");
    RemoveChildWindow();
    return window->m_ModalResult;
}

void CBaseWindow::EndModal(int result)
{
    m_ModalResult = result;
    if (core::CSystemIntegration* platform = GetGuiServices().platform)
        platform->StopNested();
}

} // namespace ox::gui
