#pragma once
// Script names of the ground floor, under "ox.misc": geometry (vectors, rectangles, quads,
// matrices, locations) and its helpers, bit operations, files and paths, the clipboard,
// message boxes, the fixed-capacity strings, the string table with its look-ups _T and T_,
// FormatString and the XML writer.
#include "lua/mluabind/Binding.h"

namespace ox::misc {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindMisc(mluabind::CHost& host);

} // namespace ox::misc
