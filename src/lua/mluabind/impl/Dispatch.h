#pragma once
// Entry points from Lua into the binding layer. Each is a C function whose first upvalue
// is its host; the body runs guarded (see the error model in Host.h).
#include "lua/mluabind/Host.h"

namespace mluabind::i {

// __index of bound objects (upvalue 2: the table of what names stand for in the class).
int MetaOperatorIndex(lua_State* L);
int MetaOperatorNewIndex(lua_State* L);
// __newindex of the face of a protected metatable (upvalue 2: the name it reports).
int MetaOperatorReadOnly(lua_State* L);
int LuaMethodCallProxieFunction(lua_State* L);
int LuaOperatorCallProxieFunction(lua_State* L);
int ConstructorCallDispatcher(lua_State* L);
int LuaGlobalFunctionDispatcher(lua_State* L);

int LuaCast(lua_State* L);
int LuaCastUnsafe(lua_State* L);
int LuaConst(lua_State* L);
int LuaGetType(lua_State* L);
int LuaGetTypeEx(lua_State* L);
int LuaGetRttiType(lua_State* L);

// "* number\n" lines for the stack from `from` on, or "None\n".
std::string DescribeParameters(lua_State* L, int from);

} // namespace mluabind::i
