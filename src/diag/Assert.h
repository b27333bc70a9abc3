#pragma once
// Contract checks. Always compiled in: a failure is logged on channel "assert" and, unless
// message boxes and assertions are suppressed, handed to the failure handler (the game
// reports and ends; tests capture and go on).
#include "misc/WideChar.h"

#include <functional>

namespace ox::diag {

// Wide form: logs, flushes, and stops the run through the handler unless suppressed.
void AssertFailed(const wchar* expression, const wchar* file, int line);
// Narrow form: logs and flushes only; it never stops the run.
void AssertFailedA(const char* expression, const char* file, int line);

// A check on data a game maker can get wrong failed: logs the expression, file and line on
// channel "data" as an error. The caller then returns; the game goes on.
void DataCheckFailed(const char* expression, const char* file, int line);

// What happens after a failure that is not suppressed. The default prints the failure to
// standard error and aborts.
using AssertHandler = std::function<void(const wchar* expression, const wchar* file, int line)>;
// Installs a handler and returns the previous one; an empty handler restores the default.
AssertHandler SetAssertHandler(AssertHandler handler);

} // namespace ox::diag

#define OX_WIDEN_LITERAL2(x) u##x
#define OX_WIDEN_LITERAL(x) OX_WIDEN_LITERAL2(x)

// OX_ASSERT(cond): the wide assertion with the expression text, source file and line.
#define OX_ASSERT(cond)                                                                        \
    do {                                                                                       \
        if (!(cond))                                                                           \
            ::ox::diag::AssertFailed(u"" #cond, OX_WIDEN_LITERAL(__FILE__), __LINE__);         \
    } while (0)

// OX_ASSERT_A(cond): the narrow assertion; logs and goes on.
#define OX_ASSERT_A(cond)                                                                      \
    do {                                                                                       \
        if (!(cond))                                                                           \
            ::ox::diag::AssertFailedA(#cond, __FILE__, __LINE__);                              \
    } while (0)

// OX_CHECK_DATA(cond, ...): guards data that a game maker or a damaged file can get wrong (not
// a programmer's contract). A failure is logged on channel "data" and the enclosing function
// returns the remaining arguments (nothing for a void function).
#define OX_CHECK_DATA(cond, ...)                                                               \
    do {                                                                                       \
        if (!(cond)) {                                                                         \
            ::ox::diag::DataCheckFailed(#cond, __FILE__, __LINE__);                            \
            return __VA_ARGS__;                                                                \
        }                                                                                      \
    } while (0)
