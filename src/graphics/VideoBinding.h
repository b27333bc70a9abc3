#pragma once
// Script names of the videos, under "ox.graphics": CVideoPlayer, COpaqueVideo and
// CTranslucentVideo.
#include "lua/mluabind/Binding.h"

namespace ox::graphics {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindVideo(mluabind::CHost& host);

} // namespace ox::graphics
