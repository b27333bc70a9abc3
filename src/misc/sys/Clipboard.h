#pragma once
// Text on the system clipboard, as wide text.
#include "misc/WideChar.h"

namespace ox::misc::sys {

// False if the clipboard holds no text or cannot be read; `out` starts empty.
bool GetClipboardText(wstring& out);
bool SetClipboardText(const wstring& text);

} // namespace ox::misc::sys
