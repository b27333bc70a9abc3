#pragma once
// Fixed character classes for UTF-16 units, the same on every machine and in every locale
// (the C library's classes depend on the locale and on the platform's wide character type).
#include "misc/WideChar.h"

namespace ox::misc {

// A blank at which text may break and between which words are counted: the ASCII controls
// 9 to 13, the space, NEL, the Ogham space mark, the typographic spaces U+2000 to U+200A
// except the figure space, the line and paragraph separators, the medium mathematical
// space and the ideographic space. The no-break spaces (U+00A0, U+2007, U+202F) are not
// in it: they hold the words on both sides together.
constexpr bool IsBreakSpace(wchar c)
{
    if (c < 0x80)
        return c == 0x20 || (c >= 0x09 && c <= 0x0D);
    switch (c) {
    case 0x85:
    case 0x1680:
    case 0x2028:
    case 0x2029:
    case 0x205F:
    case 0x3000:
        return true;
    default:
        return c >= 0x2000 && c <= 0x200A && c != 0x2007;
    }
}

} // namespace ox::misc
