#pragma once
// A Lua host of the engine: one Lua 5.1 state on the Lua heap with the standard libraries
// and LuaFileSystem, the bound class registry, the scripts loaded into it from the game
// pack and their reload when they change on disk.
//
// Failures of bound calls and of scripts are shown in a box titled "Lua Error" and logged
// under "lua"; the script goes on as if the failed call had returned nothing.
#include "lua/mluabind/mluabind.h"
#include "misc/FileWatcher.h"
#include "misc/WideChar.h"

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace ox::lua {

class CLua : public mluabind::CHost {
public:
    // The garbage-collector step: at most once a period, of this size, on every listed host.
    static constexpr uint32_t GCPeriod = 1000;
    static constexpr int GCStepSize = 5;

    // A host listed under `id` (unless empty); `watch_files` watches every loaded script.
    CLua(const std::string& id, bool watch_files);
    ~CLua() override;

    // Formats, shows the text in a "Lua Error" box, logs it, and returns.
    void ReportError(const char* format, ...) override __attribute__((format(printf, 2, 3)));
    // Reports the error value on top of the stack and pops it.
    virtual void ReportLuaError();

    // Loads and runs a pack file (pack path, forward slashes) and watches it.
    void LoadScript(const char* _script);
    // LoadScript for every file directly in a pack folder whose name holds ".lua". The
    // folder is a text prefix with its trailing '/' ("scripts/"): without it the files of
    // the folder lie behind a separator and none is loaded (a warning says so).
    void LoadLuaScripts(const char* folder);
    // Compiles and runs a chunk of text; false (after a report) when either fails.
    bool Run(const std::string& code);
    bool Run(const wstring& code);
    // Runs again every watched script whose file changed.
    void CheckFileChanges();

    const std::string& GetId() const { return m_Id; }
    misc::CFileWatcher* GetFileWatcher() const { return m_FileWatcher.get(); }

    // The host listed under `id`, or null.
    static CLua* GetLua(const std::string& id);
    // One small collection step on every listed host, once a period; `now` is the frame
    // time in milliseconds.
    static void StepGarbageCollector(uint32_t now);
    static uint32_t GetLastGCTime() { return m_LastGCTime; }

private:
    static lua_State* NewState();
    // Keeps scripts away from finalisers: no newproxy, the library metatables are
    // protected, and the debug library can't reach into userdata, native functions or
    // native frames.
    void SealFinalisers();
    void RunScript(const char* text, size_t size, const char* _script);

    std::string m_Id;
    std::unique_ptr<misc::CFileWatcher> m_FileWatcher;

    static std::map<std::string, CLua*> m_Luas;
    static uint32_t m_LastGCTime;
};

// The scripts LoadLuaScripts runs: the files whose path is `folder` followed by a name
// without '/' that holds ".lua" anywhere, in the pack's order.
std::vector<std::string> ListLuaScripts(const misc::CGamePack& pack, const char* folder);

// --- calling Lua functions from native code ---

namespace detail {

// Pushes the value of a dotted name, looked up from the globals through tables and full
// userdata. False (nothing pushed) when a step isn't a container or the value is nil.
bool FindLuaFunction(mluabind::CHost& host, lua_State* L, const char* name);
// Finds the function and makes room for its arguments; reports a missing function.
bool BeginCall(mluabind::CHost& host, lua_State* L, const char* name, int arguments);
// The protected call between the host brackets; reports and pops a failure.
bool FinishCall(mluabind::CHost& host, lua_State* L, int arguments, int results);
void ReportBadResult(mluabind::CHost& host);

template <class A>
void PushArgument(mluabind::CHost& host, lua_State* L, const A& value)
{
    int pushed;
    if constexpr (std::is_array_v<A>) {
        using P = const std::remove_extent_t<A>*;
        pushed = mluabind::PushValue<P>(host, L, static_cast<P>(value));
    } else {
        pushed = mluabind::PushValue<std::decay_t<A>>(host, L, value);
    }
    // A value that couldn't be pushed (reported) still takes its slot.
    if (pushed == 0)
        lua_pushnil(L);
}

} // namespace detail

// Calls the Lua function `name` (dotted names look into tables and objects) with up to ten
// arguments, converted as bound functions convert their results. R is the result type
// (void for none); a failure is reported through the host and gives a zero R.
template <class R = void, class... Args>
R CallLuaFunction(mluabind::CHost* host, const char* name, const Args&... args)
{
    static_assert(sizeof...(Args) <= 10, "at most ten arguments");
    static_assert(!std::is_pointer_v<R> || !std::is_arithmetic_v<std::remove_cv_t<std::remove_pointer_t<R>>>,
                  "text results must be std::string: the Lua value is gone after the call");
    lua_State* L = host->GetLuaState();
    constexpr int arguments = static_cast<int>(sizeof...(Args));
    if (!detail::BeginCall(*host, L, name, arguments))
        return R();
    (detail::PushArgument(*host, L, args), ...);
    constexpr int results = std::is_void_v<R> ? 0 : 1;
    if (!detail::FinishCall(*host, L, arguments, results))
        return R();
    if constexpr (!std::is_void_v<R>) {
        R value {};
        if (mluabind::MatchValue<R>(*host, L, -1) < mluabind::i::NoMatch &&
            mluabind::ExtractValue<R>(*host, L, -1, value)) {
            lua_pop(L, 1);
            return value;
        }
        lua_pop(L, 1);
        detail::ReportBadResult(*host);
        return R();
    }
}

template <class R = void, class... Args>
R CallLuaFunction(mluabind::CHost& host, const char* name, const Args&... args)
{
    return CallLuaFunction<R>(&host, name, args...);
}

// Whether a dotted name gives a value in the host, found as CallLuaFunction finds functions.
// Nothing is called and nothing is reported.
bool HasLuaFunction(mluabind::CHost& host, const char* name);

// Calls as CallLuaFunction does and gives the truth of the result as Lua sees it: nil and
// false are false, so a function that returns nothing says false. A failure is reported
// and gives false.
template <class... Args>
bool CallLuaPredicate(mluabind::CHost& host, const char* name, const Args&... args)
{
    static_assert(sizeof...(Args) <= 10, "at most ten arguments");
    lua_State* L = host.GetLuaState();
    constexpr int arguments = static_cast<int>(sizeof...(Args));
    if (!detail::BeginCall(host, L, name, arguments))
        return false;
    (detail::PushArgument(host, L, args), ...);
    if (!detail::FinishCall(host, L, arguments, 1))
        return false;
    const bool result = lua_toboolean(L, -1) != 0;
    lua_pop(L, 1);
    return result;
}

} // namespace ox::lua
