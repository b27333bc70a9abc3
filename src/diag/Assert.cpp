#include "diag/Assert.h"

#include "diag/Log.h"
#include "diag/Message.h"
#include "misc/Unicode.h"

#include <cstdio>
#include <cstdlib>

namespace ox::diag {

namespace {

void DefaultHandler(const wchar* expression, const wchar* file, int line)
{
    fprintf(stderr, "Assertion failed: %s, file %s, line %i\n", misc::WideToUtf8(expression).c_str(),
            misc::WideToUtf8(file).c_str(), line);
    fflush(stderr);
    abort();
}

AssertHandler& CurrentHandler()
{
    static AssertHandler handler = DefaultHandler;
    return handler;
}

} // namespace

void AssertFailed(const wchar* expression, const wchar* file, int line)
{
    Log& log = Log::Instance();
    log.Write("assert", LogError, u"assertion failed \"%ls\", file \"%ls\" line %i", expression, file, line);
    log.Flush();
    if (message::IsSupressed())
        return;
    CurrentHandler()(expression, file, line);
}

void AssertFailedA(const char* expression, const char* file, int line)
{
    Log& log = Log::Instance();
    log.Write("assert", LogError, "assertion failed \"%s\", file \"%s\" line %i", expression, file, line);
    log.Flush();
}

void DataCheckFailed(const char* expression, const char* file, int line)
{
    Log::Instance().Write("data", LogError, "check failed \"%s\", file \"%s\" line %i", expression, file, line);
}

AssertHandler SetAssertHandler(AssertHandler handler)
{
    AssertHandler previous = CurrentHandler();
    CurrentHandler() = handler ? std::move(handler) : AssertHandler(DefaultHandler);
    return previous;
}

} // namespace ox::diag
