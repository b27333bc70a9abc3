#pragma once
// The log file: one line per call, "[hh:mm:ss:mmm][channel][level]: text".
#include "misc/WideChar.h"

#include <cstdint>
#include <cstdio>
#include <functional>
#include <string>

namespace ox::diag {

enum LogLevel : int {
    LogTrace = 0,
    LogInfo = 1,
    LogWarning = 2,
    LogError = 3,
};

class Log {
public:
    using TickSource = std::function<uint32_t()>;

    // A log with the system's millisecond tick, or with an injected one.
    Log();
    explicit Log(TickSource ticks);
    ~Log();
    Log(const Log&) = delete;
    Log& operator=(const Log&) = delete;

    // The process-wide log, created at first use and never deleted.
    static Log& Instance();

    // Opens (truncates) the file and writes "log created". A file that cannot be opened
    // leaves the log closed: every line is then dropped.
    void SetFile(const wchar* path);
    void SetFile(const std::string& utf8Path);

    void Write(const char* channel, int level, const char* format, ...) __attribute__((format(printf, 4, 5)));
    void Write(const char* channel, int level, const wchar* format, ...);
    void VWrite(const char* channel, int level, const char* format, va_list args) __attribute__((format(printf, 4, 0)));

    void Flush();
    // Writes "log destroyed" and closes the file.
    void Close();

    bool IsOpen() const { return m_File != nullptr; }
    void SetTraceOff(bool off) { m_TraceOff = off; }

    // The millisecond tick of the system, as the log counts it.
    static uint32_t SystemTicks();

private:
    bool WriteHeader(const char* channel, int level);

    FILE* m_File = nullptr;
    bool m_TraceOff = false;
    uint32_t m_StartTick = 0;
    TickSource m_Ticks;
};

} // namespace ox::diag

// Shorthand for the process-wide log.
#define OX_LOG(channel, level, ...) ::ox::diag::Log::Instance().Write(channel, level, __VA_ARGS__)
