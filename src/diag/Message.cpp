#include "diag/Message.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/Unicode.h"

#include <SDL.h>

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace ox::diag::message {

namespace {

bool g_Supress = false;

// An SDL box needs a display; headless drivers and a missing display get standard error.
bool HasDisplay()
{
    const char* driver = getenv("SDL_VIDEODRIVER");
    if (driver && (strcmp(driver, "offscreen") == 0 || strcmp(driver, "dummy") == 0))
        return false;
    return getenv("DISPLAY") || getenv("WAYLAND_DISPLAY");
}

void DefaultSink(const std::string& caption, const std::string& text)
{
    if (HasDisplay() && SDL_ShowSimpleMessageBox(0, caption.c_str(), text.c_str(), nullptr) == 0)
        return;
    fprintf(stderr, "%s: %s\n", caption.c_str(), text.c_str());
    fflush(stderr);
}

Sink& CurrentSink()
{
    static Sink sink = DefaultSink;
    return sink;
}

void Deliver(const std::string& caption, const std::string& text)
{
    Log::Instance().Flush();
    if (g_Supress)
        return;
    CurrentSink()(caption, text);
}

} // namespace

void Show(const wchar* caption, const wchar* text)
{
    Log::Instance().Write("message", LogInfo, u"caption: %ls\nmessage: %ls", caption, text);
    Deliver(misc::WideToUtf8(caption), misc::WideToUtf8(text));
}

void Show(const wchar* text) { Show(u"Message", text); }

void Show(const char* caption, const char* text)
{
    Log::Instance().Write("message", LogInfo, "caption: %s\nmessage: %s", caption, text);
    Deliver(caption, text);
}

void Show(const char* text) { Show("Message", text); }

void ShowFormat(const wchar* caption, const wchar* format, ...)
{
    constexpr size_t kCapacity = 2048;
    va_list args;
    va_start(args, format);
    wstring text = misc::VFormatWide(format, args);
    va_end(args);
    int result = text.size() < kCapacity ? static_cast<int>(text.size()) : -1;
    OX_ASSERT(result != -1);
    if (result == -1)
        return;
    Show(caption, text.c_str());
}

void ShowFormat(const char* caption, const char* format, ...)
{
    char buffer[2048];
    va_list args;
    va_start(args, format);
    int n = vsnprintf(buffer, sizeof buffer, format, args);
    va_end(args);
    int result = (n < 0 || n >= static_cast<int>(sizeof buffer)) ? -1 : n;
    OX_ASSERT(result != -1);
    if (result == -1)
        return;
    Show(caption, buffer);
}

void Supress(bool flag) { g_Supress = flag; }
bool IsSupressed() { return g_Supress; }

Sink SetSink(Sink sink)
{
    Sink previous = CurrentSink();
    CurrentSink() = sink ? std::move(sink) : Sink(DefaultSink);
    return previous;
}

} // namespace ox::diag::message
