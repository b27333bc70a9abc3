// The restricted standard libraries of a Lua host. The functions here are entered from
// Lua and may raise Lua errors: they hold no object with a destructor.
#include "lua/LuaSandbox.h"

#include "diag/Log.h"

#include <cerrno>
#include <cstdio>
#include <cstring>

namespace ox::lua {

bool IsPrecompiled(const char* text, size_t size) { return size > 0 && text[0] == LUA_SIGNATURE[0]; }

const char* RefusePrecompiled(lua_State* L, const char* name)
{
    const char* message =
        lua_pushfstring(L, "%s: a precompiled Lua chunk is refused, scripts are loaded as text only", name);
    OX_LOG("lua", diag::LogError, "%s", message);
    return message;
}

namespace {

// --- text-only loading ---

// A reader in front of another: when the first piece is precompiled it ends the stream,
// so the undump never sees it.
struct TextReader {
    lua_Reader inner;
    void* data;
    bool first = true;
    bool refused = false;
};

const char* ReadText(lua_State* L, void* data, size_t* size)
{
    auto* reader = static_cast<TextReader*>(data);
    const char* piece = reader->refused ? nullptr : reader->inner(L, reader->data, size);
    if (reader->first && piece)
        reader->refused = IsPrecompiled(piece, *size);
    reader->first = false;
    if (reader->refused || !piece) {
        *size = 0;
        return nullptr;
    }
    return piece;
}

// lua_load of text: a precompiled chunk gives LUA_ERRSYNTAX with the refusal as message.
int LoadText(lua_State* L, lua_Reader inner, void* data, const char* chunk)
{
    TextReader reader {inner, data};
    int status = lua_load(L, &ReadText, &reader, chunk);
    if (!reader.refused)
        return status;
    lua_pop(L, 1);
    // Lua's marks of file and literal names go; loadstring's default name is the chunk.
    bool marked = *chunk == '@' || *chunk == '=';
    RefusePrecompiled(L, marked ? chunk + 1 : IsPrecompiled(chunk, std::strlen(chunk)) ? "(string)" : chunk);
    return LUA_ERRSYNTAX;
}

// The result of a load function: the chunk, or nil and the message.
int PushLoaded(lua_State* L, int status)
{
    if (status == 0)
        return 1;
    lua_pushnil(L);
    lua_insert(L, -2);
    return 2;
}

struct StringSource {
    const char* text;
    size_t size;
};

const char* ReadString(lua_State*, void* data, size_t* size)
{
    auto* source = static_cast<StringSource*>(data);
    *size = source->size;
    source->size = 0;
    return *size > 0 ? source->text : nullptr;
}

int LoadStringText(lua_State* L)
{
    size_t size = 0;
    const char* text = luaL_checklstring(L, 1, &size);
    StringSource source {text, size};
    return PushLoaded(L, LoadText(L, &ReadString, &source, luaL_optstring(L, 2, text)));
}

// load's pieces: the function at index 1 gives them; slot 3 keeps the last one alive.
const char* ReadFunction(lua_State* L, void*, size_t* size)
{
    luaL_checkstack(L, 2, "too many nested functions");
    lua_pushvalue(L, 1);
    lua_call(L, 0, 1);
    if (lua_isnil(L, -1)) {
        lua_pop(L, 1);
        *size = 0;
        return nullptr;
    }
    if (!lua_isstring(L, -1))
        luaL_error(L, "reader function must return a string");
    lua_replace(L, 3);
    return lua_tolstring(L, 3, size);
}

int LoadFunctionText(lua_State* L)
{
    const char* chunk = luaL_optstring(L, 2, "=(load)");
    luaL_checktype(L, 1, LUA_TFUNCTION);
    lua_settop(L, 3);
    return PushLoaded(L, LoadText(L, &ReadFunction, nullptr, chunk));
}

struct FileSource {
    FILE* file;
    bool emptyLine;
    char buffer[LUAL_BUFFERSIZE];
};

const char* ReadFile(lua_State*, void* data, size_t* size)
{
    auto* source = static_cast<FileSource*>(data);
    if (source->emptyLine) {
        source->emptyLine = false;
        *size = 1;
        return "\n";
    }
    *size = std::fread(source->buffer, 1, sizeof(source->buffer), source->file);
    return *size > 0 ? source->buffer : nullptr;
}

// Replaces the chunk name at `chunk` by the failure to `what` the file.
int FileError(lua_State* L, const char* what, int chunk, int error)
{
    lua_pushfstring(L, "cannot %s %s: %s", what, lua_tostring(L, chunk) + 1, std::strerror(error));
    lua_remove(L, chunk);
    return LUA_ERRFILE;
}

// luaL_loadfile for text (null `name`: standard input). A first line that starts with
// '#' reads as an empty one.
int LoadTextFile(lua_State* L, const char* name)
{
    if (name)
        lua_pushfstring(L, "@%s", name);
    else
        lua_pushliteral(L, "=stdin");
    int chunk = lua_gettop(L);
    FileSource source {name ? std::fopen(name, "r") : stdin, false, {}};
    if (!source.file)
        return FileError(L, "open", chunk, errno);
    int c = std::getc(source.file);
    if (c == '#') {
        source.emptyLine = true;
        while (c != EOF && c != '\n')
            c = std::getc(source.file);
    } else if (c != EOF) {
        std::ungetc(c, source.file);
    }
    int status = LoadText(L, &ReadFile, &source, lua_tostring(L, chunk));
    bool failed = std::ferror(source.file) != 0;
    int error = errno;
    if (name)
        std::fclose(source.file);
    if (failed) {
        lua_settop(L, chunk);
        return FileError(L, "read", chunk, error);
    }
    lua_remove(L, chunk);
    return status;
}

int LoadFileText(lua_State* L) { return PushLoaded(L, LoadTextFile(L, luaL_optstring(L, 1, nullptr))); }

int DoFileText(lua_State* L)
{
    const char* name = luaL_optstring(L, 1, nullptr);
    int top = lua_gettop(L);
    if (LoadTextFile(L, name) != 0)
        return lua_error(L);
    lua_call(L, 0, LUA_MULTRET);
    return lua_gettop(L) - top;
}

bool Readable(const char* name)
{
    FILE* file = std::fopen(name, "r");
    if (file)
        std::fclose(file);
    return file != nullptr;
}

// The first file that a template of package.path (upvalue 1: the package table) names
// with `name` for each mark and that opens, left on the stack; else null, with the list
// of the files tried.
const char* FindModuleFile(lua_State* L, const char* name)
{
    lua_getfield(L, lua_upvalueindex(1), "path");
    const char* path = lua_tostring(L, -1);
    if (!path)
        luaL_error(L, LUA_QL("package.path") " must be a string");
    lua_pushliteral(L, "");
    for (const char* end = path; *path; path = *end ? end + 1 : end) {
        end = std::strchr(path, LUA_PATHSEP[0]);
        if (!end)
            end = path + std::strlen(path);
        if (end == path)
            continue;
        lua_pushlstring(L, path, static_cast<size_t>(end - path));
        const char* file = luaL_gsub(L, lua_tostring(L, -1), LUA_PATH_MARK, name);
        lua_remove(L, -2);
        if (Readable(file))
            return file;
        lua_pushfstring(L, "\n\tno file " LUA_QS, file);
        lua_remove(L, -2);
        lua_concat(L, 2);
    }
    return nullptr;
}

// The loader of require for Lua files, loading them as text.
int LoadModuleText(lua_State* L)
{
    const char* name = luaL_checkstring(L, 1);
    const char* file = FindModuleFile(L, luaL_gsub(L, name, ".", LUA_DIRSEP));
    if (file && LoadTextFile(L, file) != 0)
        luaL_error(L, "error loading module " LUA_QS " from file " LUA_QS ":\n\t%s", name, file, lua_tostring(L, -1));
    return 1;
}

// --- the debug library ---

// Calls the original function (upvalue 1) with the arguments and gives its results.
int CallOriginal(lua_State* L)
{
    lua_pushvalue(L, lua_upvalueindex(1));
    lua_insert(L, 1);
    lua_call(L, lua_gettop(L) - 1, LUA_MULTRET);
    return lua_gettop(L);
}

const char* GuardedName(lua_State* L) { return lua_tostring(L, lua_upvalueindex(2)); }

// Refuses userdata and native functions: their metatables, environments and upvalues
// lead to finalisers.
int RefuseNative(lua_State* L)
{
    if (lua_type(L, 1) == LUA_TUSERDATA || lua_iscfunction(L, 1))
        return luaL_error(L, "%s: not for userdata or native functions", GuardedName(L));
    return CallOriginal(L);
}

// getlocal and setlocal: the slots of a native frame hold what native code works on.
int RefuseNativeFrame(lua_State* L)
{
    int arg = lua_type(L, 1) == LUA_TTHREAD ? 1 : 0;
    lua_State* thread = arg ? lua_tothread(L, 1) : L;
    int level = luaL_checkint(L, arg + 1);
    lua_Debug frame;
    if (lua_getstack(thread, level, &frame) && lua_getinfo(thread, "S", &frame) && std::strcmp(frame.what, "C") == 0)
        return luaL_error(L, "%s: not for the frame of a native function", GuardedName(L));
    // The original counts this function as one more level.
    if (thread == L) {
        lua_pushinteger(L, level + 1);
        lua_replace(L, arg + 1);
    }
    return CallOriginal(L);
}

// sethook: call and return events fire around native calls, where an error of the hook
// would jump over native frames; lines and counts fire inside Lua functions only.
int RefuseNativeEvents(lua_State* L)
{
    int arg = lua_type(L, 1) == LUA_TTHREAD ? 1 : 0;
    const char* mask = lua_isnoneornil(L, arg + 1) ? nullptr : lua_tostring(L, arg + 2);
    if (mask && std::strpbrk(mask, "cr"))
        return luaL_error(L, "%s: hooks are on lines and counts only, not on calls or returns", GuardedName(L));
    return CallOriginal(L);
}

} // namespace

void RestrictLoading(lua_State* L)
{
    const luaL_Reg loads[] = {
        {"loadstring", &LoadStringText}, {"load", &LoadFunctionText}, {"loadfile", &LoadFileText}, {"dofile", &DoFileText}};
    for (const luaL_Reg& load : loads) {
        lua_pushcfunction(L, load.func);
        lua_setglobal(L, load.name);
    }
    lua_getglobal(L, "package");
    if (lua_istable(L, -1)) {
        int package = lua_gettop(L);
        lua_pushnil(L);
        lua_setfield(L, package, "loadlib");
        lua_pushnil(L);
        lua_setfield(L, package, "cpath");
        // The loaders: the preloaded modules, then Lua files as text; none for native libraries.
        lua_getfield(L, package, "loaders");
        if (lua_istable(L, -1)) {
            lua_pushvalue(L, package);
            lua_pushcclosure(L, &LoadModuleText, 1);
            lua_rawseti(L, -2, 2);
            for (int native = static_cast<int>(lua_objlen(L, -1)); native > 2; --native) {
                lua_pushnil(L);
                lua_rawseti(L, -2, native);
            }
        }
        lua_settop(L, package);
    }
    lua_pop(L, 1);
}

void GuardDebugLibrary(lua_State* L)
{
    lua_getglobal(L, "debug");
    if (lua_istable(L, -1)) {
        int debug = lua_gettop(L);
        for (const char* name : {"getregistry", "debug"}) {
            lua_pushnil(L);
            lua_setfield(L, debug, name);
        }
        // Honours a protected metatable, as getmetatable does.
        lua_getglobal(L, "getmetatable");
        lua_setfield(L, debug, "getmetatable");
        const luaL_Reg guards[] = {{"getfenv", &RefuseNative},      {"setfenv", &RefuseNative},
                                   {"getupvalue", &RefuseNative},   {"setupvalue", &RefuseNative},
                                   {"setmetatable", &RefuseNative}, {"getlocal", &RefuseNativeFrame},
                                   {"setlocal", &RefuseNativeFrame}, {"sethook", &RefuseNativeEvents}};
        for (const luaL_Reg& guard : guards) {
            lua_getfield(L, debug, guard.name);
            lua_pushfstring(L, "debug.%s", guard.name);
            lua_pushcclosure(L, guard.func, 2);
            lua_setfield(L, debug, guard.name);
        }
    }
    lua_pop(L, 1);
}

} // namespace ox::lua
