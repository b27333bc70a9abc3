#include "diag/DiagBinding.h"

#include "diag/Log.h"
#include "diag/Message.h"

namespace ox::diag {

namespace {

using mluabind::Constant;
using mluabind::Function;

// A script's text goes to the log as it is: a '%' in it is no format for arguments the
// script never gave.
void LogA(const char* channel, int level, const char* text)
{
    Log::Instance().Write(channel ? channel : "", level, "%s", text ? text : "");
}

void LogW(const char* channel, int level, const wchar* text)
{
    Log::Instance().Write(channel ? channel : "", level, u"%s", text ? text : u"");
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
