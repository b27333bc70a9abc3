#include "quest/LuaThreadManager.h"

#include "core/TimeManager.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "lua/Lua.h"

#include <cstdio>

namespace qe {

void CLuaThreadManager::SetLua(ox::lua::CLua& lua)
{
    Clear();
    m_Lua = &lua;
    m_LuaId = lua.GetId();
}

float CLuaThreadManager::GetElapsedTime() const { return m_Timer ? static_cast<float>(m_Timer->GetTime()) : 0.0f; }

void CLuaThreadManager::Error(const std::string& message) const
{
    fprintf(stderr, "%s\n", message.c_str());
    fflush(stderr);
    if (!m_SilentErrors)
        ox::diag::message::Show("Lua Error!", message.c_str());
}

void CLuaThreadManager::ManageThreads()
{
    if (!m_Lua)
        return;
    // A listed host that went away is forgotten rather than called.
    if (!m_LuaId.empty() && ox::lua::CLua::GetLua(m_LuaId) != m_Lua) {
        OX_LOG("lua", ox::diag::LogWarning, "The script threads' host '%s' is gone", m_LuaId.c_str());
        Clear();
        return;
    }
    ox::lua::CallLuaFunction(m_Lua, "ManageThreads");
}

CLuaThreadManager& g_LuaThreadManager::Instance()
{
    static CLuaThreadManager manager;
    return manager;
}

} // namespace qe
