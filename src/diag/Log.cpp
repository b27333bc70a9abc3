#include "diag/Log.h"

#include "misc/Unicode.h"

#include <chrono>
#include <cstdarg>

namespace ox::diag {

Log::Log() : Log(&Log::SystemTicks) {}

Log::Log(TickSource ticks) : m_Ticks(std::move(ticks)) {}

Log::~Log()
{
    if (m_File)
        Close();
}

Log& Log::Instance()
{
    static Log* instance = new Log();
    return *instance;
}

uint32_t Log::SystemTicks()
{
    using namespace std::chrono;
    return static_cast<uint32_t>(duration_cast<milliseconds>(steady_clock::now().time_since_epoch()).count());
}

void Log::SetFile(const wchar* path)
{
    SetFile(misc::WideToUtf8(path));
}

void Log::SetFile(const std::string& utf8Path)
{
    if (m_File)
        fclose(m_File);
    m_StartTick = m_Ticks();
    m_File = fopen(utf8Path.c_str(), "wt");
    Write("log", LogInfo, "log created");
}

bool Log::WriteHeader(const char* channel, int level)
{
    if (!m_File)
        return false;
    if (m_TraceOff && level == LogTrace)
        return false;
    uint32_t t = m_Ticks() - m_StartTick;
    fprintf(m_File, "[%02i:%02i:%02i:%03i][%s][%i]: ", static_cast<int>(t / 3600000),
            static_cast<int>((t / 60000) % 60), static_cast<int>((t / 1000) % 60),
            static_cast<int>(t % 1000), channel, level);
    return true;
}

void Log::VWrite(const char* channel, int level, const char* format, va_list args)
{
    if (!WriteHeader(channel, level))
        return;
    vfprintf(m_File, format, args);
    fputc('\n', m_File);
    if (level >= LogError)
        fflush(m_File);
}

void Log::Write(const char* channel, int level, const char* format, ...)
{
    va_list args;
    va_start(args, format);
    VWrite(channel, level, format, args);
    va_end(args);
}

void Log::Write(const char* channel, int level, const wchar* format, ...)
{
    if (!WriteHeader(channel, level))
        return;
    va_list args;
    va_start(args, format);
    std::string text = misc::WideToUtf8(misc::VFormatWide(format, args));
    va_end(args);
    fputs(text.c_str(), m_File);
    fputc('\n', m_File);
    if (level >= LogError)
        fflush(m_File);
}

void Log::Flush()
{
    if (m_File)
        fflush(m_File);
}

void Log::Close()
{
    Write("log", LogInfo, "log destroyed");
    if (m_File) {
        fclose(m_File);
        m_File = nullptr;
    }
}

} // namespace ox::diag
