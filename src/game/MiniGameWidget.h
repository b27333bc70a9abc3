#pragma once
// The widget a mini-game written in Lua lives in: every input event and the per-frame update
// go to script functions named per widget (behind a common prefix, the group), and the game
// leaves its result for the parent, which hears "end_game".
#include "gui/Widget.h"
#include "lua/mluabind/Binding.h"

#include <array>
#include <string>

namespace ox::gui {
class CWidgetFactory;
}
namespace ox::lua {
class CLua;
}

namespace kminigames {

class CMiniGameWidget : public ox::gui::CWidget {
public:
    // The script names, in the order of the widget's fields.
    enum Slot : int {
        ScriptChar,
        ScriptKeyDown,
        ScriptKeyUp,
        ScriptMouseMove,
        ScriptMouseDown,
        ScriptMouseUp,
        ScriptDoubleClick,
        ScriptMouseWheel,
        ScriptUpdate,
        ScriptGroup,
        ScriptPreferredSize,
        ScriptChildAction,
        SlotCount
    };

    // As a widget, then script_name_group, then the on_load_script run in the host `lua`.
    void Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates) override;

    bool OnChar(ox::wchar character, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyDown(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnKeyUp(int key, int keys, int rawKeyData, bool broadcast) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast) override;
    bool OnMouseUp(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast) override;
    bool OnDoubleClick(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseWheel(const IntVector& pos, int delta, int keys, bool broadcast) override;
    void DoUpdate() override;
    // The larger, per axis, of the base's and the script's.
    FloatVector GetPreferredSize() const override;
    void OnChildAction(const std::string& action, ox::gui::CWidget* child) override;

    // The parent hears "end_game"; it reads the result the game set before.
    void OnEndGame();
    virtual void SetGameResult(float result) { m_GameResult = result; }
    float GetGameResult() const { return m_GameResult; }

    void SetScriptName(Slot slot, const std::string& name) { m_Names[slot] = name; }
    const std::string& GetScriptName(Slot slot) const { return m_Names[slot]; }
    // Takes the host of `luaId` (when it is another than the one held) and calls `name` with
    // the widget, without the group prefix.
    void SetOnLoadScriptName(const std::string& name, const std::string& luaId);
    const std::string& GetOnLoadScriptName() const { return m_OnLoad; }
    ox::lua::CLua* GetLua() const { return m_Lua; }

private:
    // Calls the group's function of the slot with the widget and `args`; true if there was a
    // call and it said the event was taken.
    template <class... Args>
    bool Forward(Slot slot, const Args&... args);

    std::array<std::string, SlotCount> m_Names;
    float m_GameResult = 0.0f;
    std::string m_OnLoad;
    ox::lua::CLua* m_Lua = nullptr;
};

// Enters the widget under minigame_widget.
void RegisterMiniGameWidget(ox::gui::CWidgetFactory& factory);
// The namespace kminigames for a script host; g_MainLua is `mainLua`, the game's main host.
mluabind::Namespace BindMiniGames(ox::lua::CLua* mainLua);

} // namespace kminigames
