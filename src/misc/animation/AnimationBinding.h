#pragma once
// Script names of clips, under "ox.misc.anim": CClip, CClipObject with its values, the clip
// objects CImageObject and CClipViewObject, and ReloadClips.
#include "lua/mluabind/Binding.h"

namespace ox::misc::anim {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindAnimation(mluabind::CHost& host);

} // namespace ox::misc::anim
