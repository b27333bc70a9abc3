#pragma once
// A binding host on a fresh Lua state for tests. Its reports are recorded and the failed
// call gives nil, the way the game's host behaves; RaisingHost keeps the default report,
// which raises a Lua error.
#include "lua/mluabind/mluabind.h"

#include <gtest/gtest.h>

#include <cstdarg>
#include <cstdio>
#include <string>
#include <vector>

namespace oxtest {

// Runs a chunk and gives its first result as text ("nil", "true", ...); a Lua error gives
// "error: <message>".
inline std::string RunChunk(lua_State* state, const std::string& code)
{
    int top = lua_gettop(state);
    std::string result;
    if (luaL_loadstring(state, code.c_str()) != 0 || lua_pcall(state, 0, 1, 0) != 0) {
        const char* message = lua_tostring(state, -1);
        result = std::string("error: ") + (message ? message : "?");
    } else if (lua_isnil(state, -1)) {
        result = "nil";
    } else if (lua_isboolean(state, -1)) {
        result = lua_toboolean(state, -1) ? "true" : "false";
    } else {
        const char* text = lua_tostring(state, -1);
        result = text ? text : lua_typename(state, lua_type(state, -1));
    }
    lua_settop(state, top);
    return result;
}

class LuaTestHost : public mluabind::CHost {
public:
    LuaTestHost() : CHost(NewState(), true) {}

    void ReportError(const char* format, ...) override __attribute__((format(printf, 2, 3)))
    {
        char buffer[8192];
        va_list args;
        va_start(args, format);
        vsnprintf(buffer, sizeof(buffer), format, args);
        va_end(args);
        Reports.push_back(buffer);
    }

    // Runs a chunk; a Lua error becomes the result text "error: <message>".
    std::string Run(const std::string& code) { return RunChunk(GetLuaState(), code); }

    // Declares and publishes one namespace.
    template <class Build>
    void Declare(Build&& build)
    {
        BeginBinding();
        Bind(build());
        EndBinding();
    }

    std::string LastReport() const { return Reports.empty() ? std::string() : Reports.back(); }

    std::vector<std::string> Reports;

private:
    static lua_State* NewState()
    {
        lua_State* state = luaL_newstate();
        luaL_openlibs(state);
        return state;
    }
};

class RaisingHost : public mluabind::CHost {
public:
    RaisingHost() : CHost(NewState(), true) {}

    std::string Run(const std::string& code) { return RunChunk(GetLuaState(), code); }

    template <class Build>
    void Declare(Build&& build)
    {
        BeginBinding();
        Bind(build());
        EndBinding();
    }

private:
    static lua_State* NewState()
    {
        lua_State* state = luaL_newstate();
        luaL_openlibs(state);
        return state;
    }
};

} // namespace oxtest
