#pragma once
// Script names of the Lua host and the file watcher. Run in declaration mode and merge the
// results under "ox": lua.CLua (with CLua.GetLua) and misc.CFileWatcher.
#include "lua/mluabind/Binding.h"

namespace ox::lua {

// "lua": CLua with its constructor (id, watch_files), LoadScript, LoadLuaScripts, Run (a
// string or a wide string), CheckFileChanges, GetId and the static GetLua.
mluabind::Namespace BindLuaClasses();
// "misc": CFileWatcher and its list of names, CFileWatcher.FileNamesT.
mluabind::Namespace BindFileWatcher();
// "core": the timers and GetRootGroupTimer, for hosts that take only part of the framework
// (the same as ox::core::BindTimers).
mluabind::Namespace BindGroupTimers();
// "std": the maths helpers abs, acos, asin, atan, atan2, atof, ceil, cos, cosh, exp, floor,
// log, log10, pow, rand, sin, sinh, sqrt, srand, tan and tanh.
mluabind::Namespace BindStdMaths();

} // namespace ox::lua
