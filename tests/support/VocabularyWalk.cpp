#include "support/VocabularyWalk.h"

#include "lua/Lua.h"
#include "lua/LuaTestHost.h"

#include <gtest/gtest.h>

namespace oxtest {

using mluabind::i::GenericClass;

namespace {

mluabind::CHost* ProbeHost(lua_State* L) { return static_cast<mluabind::CHost*>(lua_touserdata(L, lua_upvalueindex(1))); }

// The overloads of a method as a script finds it: the class's own, else the first base's.
int CountMethods(mluabind::CHost& host, GenericClass* cls, const char* name)
{
    auto [first, last] = cls->FindMethodRun(name);
    if (first != last)
        return static_cast<int>(last - first);
    for (auto& [type, adapter] : cls->m_Adapters)
        if (GenericClass* base = adapter->GetTargetGenericClass(host))
            if (int count = CountMethods(host, base, name))
                return count;
    return 0;
}

bool HasMember(mluabind::CHost& host, GenericClass* cls, const char* name)
{
    if (cls->FindOwnMember(name))
        return true;
    for (auto& [type, adapter] : cls->m_Adapters)
        if (GenericClass* base = adapter->GetTargetGenericClass(host); base && HasMember(host, base, name))
            return true;
    return false;
}

int ProbeClass(lua_State* L)
{
    lua_pushboolean(L, ProbeHost(L)->FindClassByName(luaL_checkstring(L, 1)) != nullptr);
    return 1;
}

int ProbeFunctions(lua_State* L)
{
    const auto* overloads = ProbeHost(L)->FindFunctions(luaL_checkstring(L, 1));
    lua_pushnumber(L, overloads ? static_cast<double>(overloads->size()) : 0);
    return 1;
}

int ProbeMethods(lua_State* L)
{
    mluabind::CHost& host = *ProbeHost(L);
    GenericClass* cls = host.FindClassByName(luaL_checkstring(L, 1));
    lua_pushnumber(L, cls ? CountMethods(host, cls, luaL_checkstring(L, 2)) : 0);
    return 1;
}

int ProbeMember(lua_State* L)
{
    mluabind::CHost& host = *ProbeHost(L);
    GenericClass* cls = host.FindClassByName(luaL_checkstring(L, 1));
    lua_pushboolean(L, cls && HasMember(host, cls, luaL_checkstring(L, 2)));
    return 1;
}

} // namespace

GroupResult WalkVocabulary(mluabind::CHost& host, const std::string& walker, const std::string& names,
                           const std::string& group)
{
    lua_State* L = host.GetLuaState();
    EXPECT_EQ(luaL_dofile(L, walker.c_str()), 0) << lua_tostring(L, -1);
    lua_setglobal(L, "vocabulary");
    EXPECT_EQ(luaL_dofile(L, names.c_str()), 0) << lua_tostring(L, -1);
    lua_setglobal(L, "vocabulary_names");
    lua_newtable(L);
    const std::pair<const char*, lua_CFunction> probes[] = {
        {"class", &ProbeClass}, {"functions", &ProbeFunctions}, {"methods", &ProbeMethods}, {"member", &ProbeMember}};
    for (auto [name, function] : probes) {
        lua_pushlightuserdata(L, &host);
        lua_pushcclosure(L, function, 1);
        lua_setfield(L, -2, name);
    }
    lua_setglobal(L, "probe");
    GroupResult result;
    std::string code = "local w, f, p = vocabulary.walk(vocabulary_names." + group + ", probe) return w .. '|' .. f .. '|' .. p";
    std::string text = RunChunk(L, code);
    size_t a = text.find('|'), b = text.find('|', a + 1);
    EXPECT_NE(b, std::string::npos) << text;
    if (b == std::string::npos)
        return result;
    result.wanted = std::stoi(text.substr(0, a));
    result.found = std::stoi(text.substr(a + 1, b - a - 1));
    result.problems = text.substr(b + 1);
    return result;
}

} // namespace oxtest
