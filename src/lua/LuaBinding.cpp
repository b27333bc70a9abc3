#include "lua/LuaBinding.h"

#include "lua/Lua.h"
#include "lua/mluabind/StdBinding.h"
#include "core/CoreBinding.h"
#include "misc/FileWatcher.h"

#include <cmath>
#include <cstdlib>
#include <utility>

namespace ox::lua {

mluabind::Namespace BindLuaClasses()
{
    using mluabind::Class;
    mluabind::Namespace ns("lua");
    ns.AddClass(Class<CLua>("CLua")
                    .Constructor<const std::string&, bool>()
                    .Method("LoadScript", &CLua::LoadScript)
                    .Method("LoadLuaScripts", &CLua::LoadLuaScripts)
                    .Method("Run", static_cast<bool (CLua::*)(const std::string&)>(&CLua::Run))
                    .Method("Run", static_cast<bool (CLua::*)(const wstring&)>(&CLua::Run))
                    .Method("CheckFileChanges", &CLua::CheckFileChanges)
                    .Method("GetId", &CLua::GetId));
    ns.AddFunction(mluabind::Function("CLua.GetLua", &CLua::GetLua));
    return ns;
}

mluabind::Namespace BindFileWatcher()
{
    using misc::CFileWatcher;
    using mluabind::Class;
    mluabind::Namespace ns("misc");
    ns.AddClass(Class<CFileWatcher>("CFileWatcher")
                    .Constructor<bool, unsigned>()
                    .Method("WatchFile", &CFileWatcher::WatchFile)
                    .Method("ClearWatches", &CFileWatcher::ClearWatches)
                    .Method("IsFilesChanged", &CFileWatcher::IsFilesChanged)
                    .Method("GetChangedFiles", &CFileWatcher::GetChangedFiles)
                    .Method("ResetChanges", &CFileWatcher::ResetChanges));
    ns.Merge(mluabind::VectorClass<wstring>("CFileWatcher.FileNamesT"));
    return ns;
}

mluabind::Namespace BindGroupTimers() { return core::BindTimers(); }

mluabind::Namespace BindStdMaths()
{
    using mluabind::Function;
    using F = double (*)(double);
    mluabind::Namespace ns("std");
    // Lambdas, not the addresses of library functions, which need not be addressable.
    const std::pair<const char*, F> unary[] = {
        {"abs", [](double x) { return std::fabs(x); }},
        {"acos", [](double x) { return std::acos(x); }},
        {"asin", [](double x) { return std::asin(x); }},
        {"atan", [](double x) { return std::atan(x); }},
        {"ceil", [](double x) { return std::ceil(x); }},
        {"cos", [](double x) { return std::cos(x); }},
        {"cosh", [](double x) { return std::cosh(x); }},
        {"exp", [](double x) { return std::exp(x); }},
        {"floor", [](double x) { return std::floor(x); }},
        {"log", [](double x) { return std::log(x); }},
        {"log10", [](double x) { return std::log10(x); }},
        {"sin", [](double x) { return std::sin(x); }},
        {"sinh", [](double x) { return std::sinh(x); }},
        {"sqrt", [](double x) { return std::sqrt(x); }},
        {"tan", [](double x) { return std::tan(x); }},
        {"tanh", [](double x) { return std::tanh(x); }},
    };
    for (auto [name, f] : unary)
        ns.AddFunction(Function(name, f));
    ns.AddFunction(Function("atan2", [](double y, double x) { return std::atan2(y, x); }));
    ns.AddFunction(Function("pow", [](double x, double y) { return std::pow(x, y); }));
    ns.AddFunction(Function("atof", [](const char* text) { return text ? std::atof(text) : 0.0; }));
    ns.AddFunction(Function("rand", [] { return std::rand(); }));
    ns.AddFunction(Function("srand", [](unsigned seed) { std::srand(seed); }));
    return ns;
}

} // namespace ox::lua
