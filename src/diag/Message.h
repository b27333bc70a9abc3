#pragma once
// Message boxes for what the user must see. Every box is logged on channel "message"
// first; the box itself goes to a replaceable sink (an SDL box when a display exists,
// standard error otherwise, a capture in tests).
#include "misc/WideChar.h"

#include <functional>
#include <string>

namespace ox::diag::message {

void Show(const wchar* text);
void Show(const wchar* caption, const wchar* text);
void Show(const char* text);
void Show(const char* caption, const char* text);

// Formats into a 2048-character buffer, then shows. A message that does not fit is a
// contract failure and is not shown.
void ShowFormat(const wchar* caption, const wchar* format, ...);
void ShowFormat(const char* caption, const char* format, ...) __attribute__((format(printf, 2, 3)));

// Suppresses boxes and the stop after assertion failures (both still log).
void Supress(bool flag);
bool IsSupressed();

// Where a box goes. Caption and text are UTF-8. Returns the previous sink; an empty sink
// restores the default.
using Sink = std::function<void(const std::string& caption, const std::string& text)>;
Sink SetSink(Sink sink);

} // namespace ox::diag::message
