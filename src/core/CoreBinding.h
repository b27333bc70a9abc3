#pragma once
// Script names of the application and its core services, under "ox.core": the application
// (also the global g_Application) and the platform values, the texture and font managers,
// the settings tree, the timers and the time manager.
#include "lua/mluabind/Binding.h"

namespace ox::core {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindCore(mluabind::CHost& host);

// "core": the timers and their wrappers, the time manager and GetRootGroupTimer, the root of
// the time tree (what script threads take their clocks from). Part of BindCore; run in
// declaration mode and merge under "ox".
mluabind::Namespace BindTimers();

} // namespace ox::core
