#include "gui/LuaHooks.h"

#include "diag/Log.h"

namespace ox::gui {

namespace {

constexpr const char* kHookNames[HookCount] = {"OnChar",       "OnKeyDown",     "OnKeyUp",      "OnMouseMove",
                                               "OnMouseDown",  "OnMouseUp",     "OnDoubleClick", "OnMouseWheel",
                                               "OnChildAction", "DoDraw",       "DoUpdate"};

} // namespace

void CLuaHooks::SetLuaById(const std::string& id, const std::string& owner)
{
    m_Lua = id.empty() ? nullptr : lua::CLua::GetLua(id);
    if (!id.empty() && !m_Lua)
        OX_LOG("gui", diag::LogWarning, "%s: no Lua host \"%s\", its script hooks are not called", owner.c_str(),
               id.c_str());
}

void CLuaHooks::SetTable(const std::string& name)
{
    m_Table = name;
    m_State.fill(NotAsked);
    m_TableReported = false;
}

std::string CLuaHooks::Name(LuaHook hook) const { return Name(kHookNames[hook]); }

bool CLuaHooks::Has(LuaHook hook)
{
    if (!m_Lua || m_Table.empty() || m_State[hook] == Absent)
        return false;
    if (m_State[hook] == NotAsked) {
        m_State[hook] = lua::HasLuaFunction(*m_Lua, Name(hook).c_str()) ? Present : Absent;
        if (m_State[hook] == Absent && !m_TableReported && !lua::HasLuaFunction(*m_Lua, m_Table.c_str())) {
            m_TableReported = true;
            OX_LOG("gui", diag::LogWarning, "no Lua table \"%s\" in host \"%s\": its hooks are not called",
                   m_Table.c_str(), m_Lua->GetId().c_str());
        }
    }
    return m_State[hook] == Present;
}

} // namespace ox::gui
