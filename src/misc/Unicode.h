#pragma once
// Conversions between narrow (UTF-8) and wide (UTF-16) text, and the wide formatters.
#include "misc/WideChar.h"

#include <cstdarg>
#include <string>
#include <string_view>

namespace ox::misc {

// Longest text a conversion accepts, in characters; longer input is cut after an assertion.
constexpr size_t kMaxConvertLength = 65534;

// Strict codec: invalid UTF-8 and lone surrogates become U+FFFD.
wstring Utf8ToWide(std::string_view text);
std::string WideToUtf8(std::u16string_view text);

// The "system code page" of this platform is UTF-8.
wstring ConvertToWide(std::string_view text);
std::string ConvertToNarrow(std::u16string_view text);

// Length of a zero-terminated wide text.
size_t WideLength(const wchar* text);

// Small wide formatter: %s (wide text), %i/%d with width and zero padding, %f through
// the C formatter, %% . Returns the number of characters written (terminator excluded).
unsigned StringFormat(wchar* buffer, unsigned capacity, const wchar* format, ...);

// printf-style wide formatting with the conventions of wide formats on the original
// platform: %s and %ls take wide text, %S and %hs narrow text, %c a wide character.
// Numbers follow the C library. Never truncates.
wstring VFormatWide(const wchar* format, va_list args);
wstring FormatWide(const wchar* format, ...);

// Formats into a 32768-character buffer, as scripts and messages use it.
wstring FormatString(const wchar* format, ...);

// printf-style narrow formatting into a std::string.
std::string VFormat(const char* format, va_list args) __attribute__((format(printf, 1, 0)));
std::string Format(const char* format, ...) __attribute__((format(printf, 1, 2)));

} // namespace ox::misc
