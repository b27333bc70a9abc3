#pragma once
// Script names of recording and playback, under "ox.replay": CRecord and CPlayback with
// their instances g_Record and g_Playback.
#include "lua/mluabind/Binding.h"

namespace ox::replay {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindReplay(mluabind::CHost& host);

} // namespace ox::replay
