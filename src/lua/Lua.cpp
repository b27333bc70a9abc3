// The engine's Lua host.
#include "lua/Lua.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "lua/LuaHeap.h"
#include "lua/LuaSandbox.h"
#include "misc/GamePack.h"
#include "misc/Unicode.h"

#include <lfs.h>

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

namespace ox::lua {

using misc::g_GamePack;

std::map<std::string, CLua*> CLua::m_Luas;
uint32_t CLua::m_LastGCTime = 0;

namespace {

constexpr size_t kReportCapacity = 65535;

// A metatable that is its own __index (as the one of files) would hand itself out to
// every script through that field: it gets a copy of its fields as method table instead.
void DetachSelfIndex(lua_State* L, int mt)
{
    lua_getfield(L, mt, "__index");
    bool self = lua_rawequal(L, -1, mt);
    lua_pop(L, 1);
    if (!self)
        return;
    lua_newtable(L);
    lua_pushnil(L);
    while (lua_next(L, mt)) {
        lua_pushvalue(L, -2);
        lua_insert(L, -2);
        lua_rawset(L, -4);
    }
    lua_pushnil(L);
    lua_setfield(L, -2, "__index");
    lua_setfield(L, mt, "__index");
}

} // namespace

lua_State* CLua::NewState()
{
    lua_State* state = lua_newstate(&CLuaHeap::LuaAlloc, &GetLuaHeap());
    if (!state) {
        fprintf(stderr, "cannot create a Lua state on the Lua heap\n");
        std::abort();
    }
    return state;
}

CLua::CLua(const std::string& id, bool watch_files) : CHost(NewState(), false), m_Id(id)
{
    if (watch_files)
        m_FileWatcher = std::make_unique<misc::CFileWatcher>(true, 1000);
    luaL_openlibs(L);
    lua_pushcfunction(L, &luaopen_lfs);
    lua_call(L, 0, 0);
    SealFinalisers();
    RestrictLoading(L);
    if (!m_Id.empty()) {
        auto f = m_Luas.find(m_Id);
        OX_ASSERT(f==m_Luas.end());
        if (f == m_Luas.end())
            m_Luas.emplace(m_Id, this);
    }
}

void CLua::SealFinalisers()
{
    // Every userdata a script can make gets its finaliser from a protected metatable.
    lua_pushnil(L);
    lua_setglobal(L, "newproxy");
    lua_pushnil(L);
    while (lua_next(L, LUA_REGISTRYINDEX)) {
        if (lua_type(L, -2) == LUA_TSTRING && lua_istable(L, -1)) {
            lua_getfield(L, -1, "__gc");
            lua_getfield(L, -2, "__metatable");
            bool unprotected = !lua_isnil(L, -2) && lua_isnil(L, -1);
            lua_pop(L, 2);
            if (unprotected) {
                DetachSelfIndex(L, lua_gettop(L));
                ProtectMetatable(-1, lua_tostring(L, -2));
                lua_pop(L, 1);
            }
        }
        lua_pop(L, 1);
    }
    GuardDebugLibrary(L);
}

CLua::~CLua()
{
    if (!m_Id.empty()) {
        auto it = m_Luas.find(m_Id);
        if (it != m_Luas.end() && it->second == this)
            m_Luas.erase(it);
    }
    // Every __gc runs here, while the class registry still stands.
    lua_close(L);
    L = nullptr;
    m_FileWatcher.reset();
}

void CLua::ReportError(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    std::string text = misc::VFormat(format, args);
    va_end(args);
    if (text.size() >= kReportCapacity)
        text.resize(kReportCapacity - 1);
    diag::message::Show("Lua Error", text.c_str());
    OX_LOG("lua", diag::LogError, "%s", text.c_str());
}

void CLua::ReportLuaError()
{
    if (const char* text = lua_tostring(L, -1))
        ReportError("%s", text);
    else
        ReportError("(error object is a %s value)", luaL_typename(L, -1));
    lua_settop(L, -2);
}

void CLua::RunScript(const char* text, size_t size, const char* _script)
{
    if (IsPrecompiled(text, size)) {
        RefusePrecompiled(L, _script);
        lua_pop(L, 1);
        return;
    }
    // Editors may start a UTF-8 file with a byte order mark, which Lua can't read.
    if (size >= 3 && std::memcmp(text, "\xEF\xBB\xBF", 3) == 0) {
        text += 3;
        size -= 3;
    }
    int top = lua_gettop(L);
    int res = luaL_loadbuffer(L, text, size, _script);
    if (res != 0) {
        if (res == LUA_ERRSYNTAX)
            diag::message::Show(misc::Format("failed to load lua file: %s (LUA_ERRSYNTAX)", _script).c_str());
        else if (res == LUA_ERRMEM)
            diag::message::Show(misc::Format("failed to load lua file: %s (LUA_ERRMEM)", _script).c_str());
        const char* message = lua_tostring(L, -1);
        OX_LOG("lua", diag::LogError, "%s", message ? message : _script);
        lua_settop(L, top);
        OX_ASSERT_A(res == 0);
        return;
    }
    PushCurrentHost(this);
    int status = lua_pcall(L, 0, LUA_MULTRET, 0);
    PopCurrentHost();
    if (status != 0)
        ReportLuaError();
    lua_settop(L, top);
}

void CLua::LoadScript(const char* _script)
{
    misc::CGamePack& pack = g_GamePack::Instance();
    OX_ASSERT_A(g_GamePack::Instance().Access(_script));
    if (!_script)
        return;
    unsigned size = 0;
    if (const void* buffer = pack.Open(_script, &size)) {
        RunScript(static_cast<const char*>(buffer), size, _script);
        pack.Close(buffer);
    }
    // Also a script that failed: fixing it on disk loads it again.
    if (m_FileWatcher)
        m_FileWatcher->WatchFile(misc::ConvertToWide(_script), false);
}

std::vector<std::string> ListLuaScripts(const misc::CGamePack& pack, const char* folder)
{
    struct Gather {
        size_t prefix;
        std::vector<std::string> files;
        unsigned behindSeparator = 0;
    } gather {folder ? std::strlen(folder) : 0, {}};
    if (!folder)
        return {};
    pack.EnumFiles(folder, [](void* user, const char* path) {
        auto* g = static_cast<Gather*>(user);
        // What stands behind the prefix must be a bare name: the walk doesn't go into
        // sub-folders, and ".lua" may stand anywhere in the name.
        const char* name = path + std::min(g->prefix, std::strlen(path));
        if (std::strchr(name, '/') == nullptr && std::strstr(name, ".lua") != nullptr)
            g->files.emplace_back(path);
        else if (*name == '/')
            ++g->behindSeparator;
    }, &gather);
    if (gather.behindSeparator > 0)
        OX_LOG("lua", diag::LogWarning,
               "LoadLuaScripts(\"%s\"): %u files in the folder are not loaded; a folder is named with a trailing '/'",
               folder, gather.behindSeparator);
    return gather.files;
}

void CLua::LoadLuaScripts(const char* folder)
{
    for (const std::string& file : ListLuaScripts(g_GamePack::Instance(), folder))
        LoadScript(file.c_str());
}

bool CLua::Run(const std::string& code)
{
    if (IsPrecompiled(code.data(), code.size())) {
        RefusePrecompiled(L, "CLua::Run");
        lua_pop(L, 1);
        return false;
    }
    int top = lua_gettop(L);
    PushCurrentHost(this);
    int status = luaL_loadstring(L, code.c_str());
    if (status == 0)
        status = lua_pcall(L, 0, LUA_MULTRET, 0);
    PopCurrentHost();
    if (status != 0)
        ReportLuaError();
    lua_settop(L, top);
    return status == 0;
}

bool CLua::Run(const wstring& code) { return Run(misc::ConvertToNarrow(code)); }

void CLua::CheckFileChanges()
{
    if (!m_FileWatcher || !m_FileWatcher->IsFilesChanged())
        return;
    for (const wstring& name : m_FileWatcher->GetChangedFiles()) {
        std::string path = misc::ConvertToNarrow(name);
        OX_LOG("lua", diag::LogInfo, "%s changed, running it again", path.c_str());
        LoadScript(path.c_str());
    }
    m_FileWatcher->ResetChanges();
}

CLua* CLua::GetLua(const std::string& id)
{
    auto it = m_Luas.find(id);
    return it == m_Luas.end() ? nullptr : it->second;
}

void CLua::StepGarbageCollector(uint32_t now)
{
    // Unsigned: a clock that wraps or starts again steps once and goes on from there.
    if (now - m_LastGCTime > GCPeriod) {
        m_LastGCTime = now;
        // A step may finalise a host that a script made, which takes it off the list.
        std::vector<std::pair<std::string, CLua*>> hosts(m_Luas.begin(), m_Luas.end());
        for (auto& [id, host] : hosts) {
            auto listed = m_Luas.find(id);
            if (listed != m_Luas.end() && listed->second == host)
                lua_gc(host->L, LUA_GCSTEP, GCStepSize);
        }
    }
}

// --- CallLuaFunction ---

namespace detail {

namespace {

// Protected part of the look-up: metamethods of objects may fail.
int LookUp(lua_State* L)
{
    const char* name = lua_tostring(L, 1);
    lua_pushvalue(L, LUA_GLOBALSINDEX);
    for (;;) {
        const char* dot = std::strchr(name, '.');
        lua_pushlstring(L, name, dot ? static_cast<size_t>(dot - name) : std::strlen(name));
        lua_gettable(L, -2);
        lua_remove(L, -2);
        if (!dot)
            return 1;
        int type = lua_type(L, -1);
        if (type != LUA_TTABLE && type != LUA_TUSERDATA) {
            lua_pop(L, 1);
            lua_pushnil(L);
            return 1;
        }
        name = dot + 1;
    }
}

} // namespace

bool FindLuaFunction(mluabind::CHost& host, lua_State* L, const char* name)
{
    if (!name)
        return false;
    lua_pushcfunction(L, &LookUp);
    lua_pushstring(L, name);
    mluabind::CHost::PushCurrentHost(&host);
    int status = lua_pcall(L, 1, 1, 0);
    mluabind::CHost::PopCurrentHost();
    if (status != 0 || lua_isnil(L, -1)) {
        lua_pop(L, 1);
        return false;
    }
    return true;
}

bool BeginCall(mluabind::CHost& host, lua_State* L, const char* name, int arguments)
{
    if (!lua_checkstack(L, arguments + 4)) {
        host.ReportError("CallLuaFunction: error - no room on the Lua stack to call %s.", name ? name : "");
        return false;
    }
    if (!FindLuaFunction(host, L, name)) {
        host.ReportError("CallLuaFunction: error - can't find function %s.", name ? name : "");
        return false;
    }
    return true;
}

bool FinishCall(mluabind::CHost& host, lua_State* L, int arguments, int results)
{
    mluabind::CHost::PushCurrentHost(&host);
    int status = lua_pcall(L, arguments, results, 0);
    mluabind::CHost::PopCurrentHost();
    if (status == 0)
        return true;
    if (const char* text = lua_tostring(L, -1))
        host.ReportError("%s", text);
    lua_pop(L, 1);
    return false;
}

void ReportBadResult(mluabind::CHost& host)
{
    host.ReportError("CallLuaFunction: return value can't be converted to desired type.");
}

} // namespace detail

bool HasLuaFunction(mluabind::CHost& host, const char* name)
{
    lua_State* L = host.GetLuaState();
    if (!lua_checkstack(L, 3) || !detail::FindLuaFunction(host, L, name))
        return false;
    lua_pop(L, 1);
    return true;
}

} // namespace ox::lua
