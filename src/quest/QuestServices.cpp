#include "quest/QuestServices.h"

#include "diag/Log.h"
#include "lua/Lua.h"

namespace qe {

QuestServices& GetQuestServices()
{
    static QuestServices services;
    return services;
}

ox::lua::CLua* GetLevelLua() { return ox::lua::CLua::GetLua("qe_level"); }

bool DefineLevelFunction(const char* name, const char* parameters, const std::string& body)
{
    ox::lua::CLua* lua = GetLevelLua();
    if (!lua) {
        OX_LOG("quest", ox::diag::LogError, "No Lua host 'qe_level' to run %s in", name);
        return false;
    }
    return lua->Run(std::string("function ") + name + "(" + parameters + ")\n" + body + "\nend");
}

} // namespace qe
