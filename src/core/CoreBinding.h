#pragma once
// Script names of the application and its core services, under "ox.core": the application
// (also the global g_Application) and the platform values, the texture and font managers,
// the settings tree, the timers and the time manager.
#include "lua/mluabind/Binding.h"

namespace ox::core {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindCore(mluabind::CHost& host);

} // namespace ox::core
