#pragma once
// Wide text is 16-bit units everywhere (files, memory, scripts).
#include <string>

namespace ox {
using wchar = char16_t;
using wstring = std::u16string;
}
