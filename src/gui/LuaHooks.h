#pragma once
// The script side of a window or a Lua widget: a host, the name of a Lua table of hooks, and
// for each hook whether the table has it. The table is asked about a hook once, at its first
// event; the answer stands until the table is set again, so a window without a hook costs no
// look-up per mouse move, and a hook added to the table later is not seen.
#include "lua/Lua.h"

#include <array>
#include <cstdint>
#include <string>

namespace ox::gui {

enum LuaHook : uint8_t {
    HookOnChar,
    HookOnKeyDown,
    HookOnKeyUp,
    HookOnMouseMove,
    HookOnMouseDown,
    HookOnMouseUp,
    HookOnDoubleClick,
    HookOnMouseWheel,
    HookOnChildAction,
    HookDoDraw,
    HookDoUpdate,
    HookCount
};

class CLuaHooks {
public:
    enum State : uint8_t { NotAsked = 0, Present = 1, Absent = 255 };

    lua::CLua* GetLua() const { return m_Lua; }
    void SetLua(lua::CLua* lua) { m_Lua = lua; }
    // The host of an id read from a description; an unknown id is logged and leaves none.
    void SetLuaById(const std::string& id, const std::string& owner);
    const std::string& GetTable() const { return m_Table; }
    // Stores the name and forgets what was known of the hooks.
    void SetTable(const std::string& name);
    State GetState(LuaHook hook) const { return static_cast<State>(m_State[hook]); }

    // Whether the hook is there to call: a host, a table, and the table has it.
    bool Has(LuaHook hook);
    // The hook's result as Lua sees its truth; an error is reported by the host and is false.
    template <class... Args>
    bool Call(LuaHook hook, const Args&... args)
    {
        return lua::CallLuaPredicate(*m_Lua, Name(hook).c_str(), args...);
    }
    // "<table>.<name>".
    std::string Name(const char* name) const { return m_Table + "." + name; }
    std::string Name(LuaHook hook) const;

private:
    lua::CLua* m_Lua = nullptr;
    std::string m_Table;
    std::array<uint8_t, HookCount> m_State {};
    // Whether a missing table was logged since the name was set.
    bool m_TableReported = false;
};

} // namespace ox::gui
