#include "quest/ObjectScripts.h"

#include "diag/Log.h"
#include "lua/Lua.h"
#include "quest/LuaThreadManager.h"
#include "quest/QuestServices.h"
#include "quest/SceneGroup.h"

namespace qe {

std::string CObjectScripts::MakeFunctionText(const std::string& name, const std::string& script, bool withEvents,
                                             bool isClick)
{
    std::string text = "function " + name + "(self)\n";
    if (withEvents)
        text += "pre_click_event()\n";
    text += script;
    if (isClick)
        text += "\nwrone_item_click()";
    if (withEvents)
        text += "\npost_click_event()";
    return text + "\nend";
}

std::string CObjectScripts::CachedName(const CBaseSceneObject* object, int kind) const
{
    auto found = m_Names.find(object);
    if (found == m_Names.end() || kind < 0 || kind >= CBaseSceneObject::ScriptCount)
        return {};
    return found->second.names[kind];
}

std::string CObjectScripts::FunctionFor(CBaseSceneObject& target, int kind, const std::string& script,
                                        bool withEvents, bool isClick)
{
    std::string cached = CachedName(&target, kind);
    if (!cached.empty())
        return cached;
    if (script.empty())
        return "empty_script_function";
    std::string name = "__object_script_" + std::to_string(m_Counter++);
    // A text that fails is reported by the host; the name is cached all the same.
    if (ox::lua::CLua* level = GetLevelLua()) {
        if (!level->Run(MakeFunctionText(name, script, withEvents, isClick)))
            OX_LOG("quest", ox::diag::LogError, "Script %d of '%s' does not compile (%s)", kind,
                   target.GetIdRef().c_str(), name.c_str());
    } else
        OX_LOG("quest", ox::diag::LogError, "No Lua host 'qe_level' for the script of '%s'", target.GetIdRef().c_str());
    Entry& entry = m_Names[&target];
    entry.object.reset(&target);
    entry.names[kind] = name;
    return name;
}

void CObjectScripts::Run(int kind, CBaseSceneObject& object, bool withEvents, bool isClick)
{
    CSceneGroup* group = object.GetParentGroup();
    if (group && group->ReadObjectFlag(CBaseSceneObject::ObjectFlagDisable))
        return;
    CBaseSceneObject* target = &object;
    std::string script = object.GetLuaScript(kind);
    if (script.empty() && group) {
        script = group->GetLuaScript(kind);
        target = group;
    }
    if (script.empty() && !isClick)
        return;
    const std::string name = FunctionFor(*target, kind, script, withEvents, isClick);
    ox::lua::CLua* threads = g_LuaThreadManager::Instance().GetLua();
    if (!threads) {
        OX_LOG("quest", ox::diag::LogError, "No script threads to run %s of '%s' in", name.c_str(),
               target->GetIdRef().c_str());
        return;
    }
    if (withEvents)
        ox::lua::CallLuaFunction(threads, "quest.SetScriptObject", target);
    ox::lua::CallLuaFunction(threads, "CreateScript", name, target);
}

void CObjectScripts::Clear()
{
    m_Names.clear();
    m_Counter = 0;
}

CObjectScripts& GetObjectScripts()
{
    static CObjectScripts scripts;
    return scripts;
}

} // namespace qe
