#pragma once
// Script names of the graphics, under "ox.graphics": colours and blend values, fonts, the
// renderer and its resolutions, surfaces, textures and images.
#include "lua/mluabind/Binding.h"

namespace ox::graphics {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindGraphics(mluabind::CHost& host);

} // namespace ox::graphics
