#pragma once
// What the scripts of a Lua host can't do with the standard libraries: load a precompiled
// chunk (the undump of Lua 5.1 trusts its input), load a native library, or reach native
// state through the debug library.
#include <lua.hpp>

#include <cstddef>

namespace ox::lua {

// A chunk that starts with the signature of compiled Lua.
bool IsPrecompiled(const char* text, size_t size);

// Pushes the message that refuses the precompiled chunk `name` and logs it.
const char* RefusePrecompiled(lua_State* L, const char* name);

// loadstring, load, loadfile, dofile and the file loader of require load text only, and
// refuse a precompiled chunk with an error naming it. package.loadlib, package.cpath and
// the native loaders of require are taken away.
void RestrictLoading(lua_State* L);

// The debug library keeps away from userdata, native functions and native frames: no
// registry, no debug.debug, metatables as getmetatable gives them, no environment or
// upvalue of a userdata or native function, no local of a native frame, and hooks on
// lines and counts only.
void GuardDebugLibrary(lua_State* L);

} // namespace ox::lua
