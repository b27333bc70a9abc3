#pragma once
// The data-driven window: loaded from a description and a window template, it plays sounds
// and effects when it opens and closes, can be dragged, shows tool tips, and hands its events
// to the hooks of a Lua table. An input hook replaces the window's own handling (the script
// calls SuperOn... for it); the draw and update hooks run before it.
#include "gui/BaseWindow.h"
#include "gui/LuaHooks.h"
#include "misc/Rect.h"

namespace ox::gui {

class CWindow : public CBaseWindow {
public:
    explicit CWindow(std::string_view id = {}) : CBaseWindow(id) {}

    // The template, then the node's script settings, insets, dragging, the background and
    // the tool tip, then the base's reading (id, place, colour, box and children).
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override;
    // Tile steps round the size up to whole tiles of the background.
    void SetSize(float width, float height) override;
    // The background's own size, or (0, 0).
    FloatVector GetPreferredSize() const override;

    bool OnChar(wchar character, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyUp(int key, int keys, int rawKeyData, bool broadcast) override;
    // While dragging, a move only moves the window.
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    // A press nothing handled inside the window starts dragging it.
    bool OnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast) override;
    bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;
    // The table's hook; without a table the global function named by on_action_script.
    void OnChildAction(const std::string& action, CWidget* sender) override;
    void DoDraw(graphics::CRenderer& renderer) override;
    void DoUpdate() override;
    // The open sound and, at the first opening only, the show effect.
    void OnOpen() override;
    // The close sound and the hide effect; always agrees.
    bool OnClose() override;

    // The input handling without hooks, for a hook that wants the default.
    bool SuperOnChar(wchar character, int keys, int rawKeyData, bool broadcast);
    bool SuperOnKeyDown(int key, int keys, int rawKeyData, bool broadcast);
    bool SuperOnKeyUp(int key, int keys, int rawKeyData, bool broadcast);
    bool SuperOnMouseMove(const IntVector& pos, int keys, bool broadcast);
    bool SuperOnMouseDown(const IntVector& pos, MouseButtons button, int keys, bool broadcast);
    bool SuperOnMouseUp(const IntVector& pos, MouseButtons button, int keys, bool broadcast);
    bool SuperOnDoubleClick(const IntVector& pos, int keys, bool broadcast);
    bool SuperOnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast);
    void SuperOnChildAction(const std::string& action, CWidget* sender);

    // Shows `text` in the tool tip label, centred on `position.X` with its top at
    // `position.Y`, kept inside the window.
    void ShowToolTip(const FloatVector& position, const wstring& text);
    void HideToolTip();
    bool IsToolTipShown() const;

    void SetCanDrag(bool canDrag) { m_Moveable = canDrag; }
    bool IsCanDrag() const { return m_Moveable; }
    bool IsDragging() const { return m_IsDragging; }

    CLuaHooks& GetHooks() { return m_Hooks; }
    void SetOverloadTable(const std::string& name) { m_Hooks.SetTable(name); }
    const std::string& GetOverloadTable() const { return m_Hooks.GetTable(); }
    const std::string& GetOnActionScript() const { return m_OnActionScript; }
    const wstring& GetShowEffect() const { return m_ShowEffect; }
    const wstring& GetHideEffect() const { return m_HideEffect; }
    CWidget* GetBackground() const { return m_Background.get(); }
    CWidget* GetToolTipLabel() const { return m_ToolTipLabel.get(); }
    CWidget* GetToolTipBackground() const { return m_ToolTipBackground.get(); }

private:
    void LoadTemplate(const core::CSettingsGroup& tmpl, const core::CSettingsGroup& templates);
    void LoadToolTip(const core::CSettingsGroup& tmpl, const core::CSettingsGroup& templates);
    // The tool tip background around the label, grown by the tool tip insets.
    void FitToolTipBackground();
    void Drag(const IntVector& pos);
    // An input hook if the table has it, else the window's own handling.
    template <class Hook, class Default>
    bool HookOr(LuaHook hook, const Hook& callHook, const Default& callDefault);

    CLuaHooks m_Hooks;
    std::string m_OnActionScript;
    WidgetPtrT m_Background;
    WidgetPtrT m_ToolTipLabel;
    WidgetPtrT m_ToolTipBackground;
    int m_ToolTipInsets[4] = {}; // left, top, right, bottom
    graphics::Color m_ToolTipColor;
    graphics::Color m_ToolTipBkColor;
    bool m_Moveable = true;
    bool m_IsDragging = false;
    FloatVector m_DragStart;
    wstring m_ShowEffect;
    wstring m_HideEffect;
    std::string m_OpenSound;
    std::string m_CloseSound;
    int m_TileStepX = 0;
    int m_TileStepY = 0;
};

using WindowPtrT = boost::intrusive_ptr<CWindow>;

} // namespace ox::gui
