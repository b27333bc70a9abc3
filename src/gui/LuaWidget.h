#pragma once
// A widget whose behaviour a Lua table gives: each slot asks the table's hook first, and the
// hook's truth decides: true ends the slot, false (or no hook) goes on to the widget's own.
#include "gui/LuaHooks.h"
#include "gui/Widget.h"

namespace ox::gui {

class CLuaWidget : public CWidget {
public:
    CLuaWidget() = default;

    // The widget's reading, then `lua` and `lua_overload_table`, then the table's Load with
    // the widget, the node and the templates, if it has one.
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;

    bool OnChar(wchar character, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyUp(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;
    void OnChildAction(const std::string& action, CWidget* sender) override;
    void DoDraw(graphics::CRenderer& renderer) override;
    void DoUpdate() override;

    void SetLua(lua::CLua* lua) { m_Hooks.SetLua(lua); }
    lua::CLua* GetLua() const { return m_Hooks.GetLua(); }
    // Stores the name and forgets the hooks; with a host, the table's __CreateInstance (if
    // it has one) is called with the widget and a name it gives back replaces this one.
    void SetOverloadTable(const std::string& name);
    const std::string& GetOverloadTable() const { return m_Hooks.GetTable(); }
    const CLuaHooks& GetHooks() const { return m_Hooks; }
    // The widget's own drawing and update, for a hook that wants them.
    void BaseDoDraw(graphics::CRenderer& renderer) { CBaseWidget::DoDraw(renderer); }
    void BaseDoUpdate() { CBaseWidget::DoUpdate(); }

private:
    template <class... Args>
    bool Hook(LuaHook hook, const Args&... args)
    {
        return m_Hooks.Has(hook) && m_Hooks.Call(hook, this, args...);
    }

    CLuaHooks m_Hooks;
};

} // namespace ox::gui
