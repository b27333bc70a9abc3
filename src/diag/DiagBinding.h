#pragma once
// Script names of the log and the message box, under "ox.diag": the levels LogTrace to
// LogError, LogA and LogW, and ox.diag.message with Supress, ShowA and ShowW.
#include "lua/mluabind/Binding.h"

namespace ox::diag {

// Binds in declaration mode (the caller brackets it with BeginBinding and EndBinding).
void BindDiag(mluabind::CHost& host);

} // namespace ox::diag
