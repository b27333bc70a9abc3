#include "lua/LuaBinding.h"

#include "lua/Lua.h"
#include "lua/mluabind/StdBinding.h"
#include "core/TimeManager.h"
#include "misc/FileWatcher.h"

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

namespace {

core::CGroupTimer* GetRootGroupTimer() { return core::GetTimeManager().GetRoot(); }

} // namespace

mluabind::Namespace BindGroupTimers()
{
    using core::CGroupTimer;
    using mluabind::Class;
    mluabind::Namespace ns("core");
    ns.AddClass(Class<CGroupTimer>("CGroupTimer")
                    .Method("GetTime", &CGroupTimer::GetTime)
                    .Method("Pause", &CGroupTimer::Pause)
                    .Method("IsPaused", &CGroupTimer::IsPaused)
                    .Method("AttachGroupTimer", &CGroupTimer::AttachGroupTimer)
                    .Method("GetChildGroupTimer", &CGroupTimer::GetChildGroupTimer));
    ns.AddFunction(mluabind::Function("GetRootGroupTimer", &GetRootGroupTimer));
    return ns;
}

} // namespace ox::lua
