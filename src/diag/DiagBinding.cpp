#include "diag/DiagBinding.h"

#include "diag/Log.h"
#include "diag/Message.h"

#include <string>

namespace ox::diag {

namespace {

using mluabind::Constant;
using mluabind::Function;

// A script's text is a format with no arguments: "%%" gives "%", as a formatter makes it. A
// conversion that would read an argument the script never gave stays as it is written.
template <class Ch>
std::basic_string<Ch> ZeroArgumentFormat(const Ch* text)
{
    std::basic_string<Ch> out;
    for (const Ch* p = text; p && *p; ++p) {
        out += *p;
        if (p[0] == '%' && p[1] == '%')
            ++p;
    }
    return out;
}

void LogA(const char* channel, int level, const char* text)
{
    Log::Instance().Write(channel ? channel : "", level, "%s", ZeroArgumentFormat(text).c_str());
}

void LogW(const char* channel, int level, const wchar* text)
{
    Log::Instance().Write(channel ? channel : "", level, u"%s", ZeroArgumentFormat(text).c_str());
}

mluabind::Namespace MessageFunctions()
{
    namespace m = message;
    mluabind::Namespace ns("message");
    ns.AddFunction(Function("Supress", &m::Supress));
    ns.AddFunction(Function("ShowA", [](const char* text) { m::Show(text ? text : ""); }));
    ns.AddFunction(Function("ShowA", [](const char* caption, const char* text) {
        m::Show(caption ? caption : "", text ? text : "");
    }));
    ns.AddFunction(Function("ShowW", [](const wchar* text) { m::Show(text ? text : u""); }));
    ns.AddFunction(Function("ShowW", [](const wchar* caption, const wchar* text) {
        m::Show(caption ? caption : u"", text ? text : u"");
    }));
    return ns;
}

} // namespace

void BindDiag(mluabind::CHost& host)
{
    mluabind::Namespace diag("diag");
    diag.AddConstant(Constant("LogTrace", static_cast<int>(LogTrace)));
    diag.AddConstant(Constant("LogInfo", static_cast<int>(LogInfo)));
    diag.AddConstant(Constant("LogWarning", static_cast<int>(LogWarning)));
    diag.AddConstant(Constant("LogError", static_cast<int>(LogError)));
    diag.AddFunction(Function("LogA", &LogA));
    diag.AddFunction(Function("LogW", &LogW));
    diag.Merge(MessageFunctions());
    host.Bind(mluabind::Namespace("ox").Merge(diag));
}

} // namespace ox::diag
