#include "misc/sys/Path.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/Unicode.h"
#include "misc/sys/MemMap.h"

#include <zlib.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <dirent.h>
#include <fcntl.h>
#include <filesystem>
#include <fnmatch.h>
#include <sys/stat.h>
#include <unistd.h>

namespace ox::misc::sys {

namespace {

constexpr size_t kGzipBlock = 32768;

bool IsSeparator(wchar c) { return c == u'/' || c == u'\\'; }

// The wide length under the name the contract text uses.
size_t wcslen(const wchar* text) { return WideLength(text); }

// The name of the temporary file written beside `path` before it replaces it.
std::string TemporaryBeside(const std::string& path)
{
    return path + ".tmp";
}

std::string& FullAccessRoot()
{
    static auto* root = new std::string();
    return *root;
}

// Whether the path, with every link and ".." resolved, is the full-access root or lies in it.
bool InsideFullAccessRoot(const std::string& path)
{
    if (FullAccessRoot().empty())
        return false;
    char* root = realpath(FullAccessRoot().c_str(), nullptr);
    char* resolved = realpath(path.c_str(), nullptr);
    bool inside = false;
    if (root && resolved) {
        std::string folder = root;
        std::string target = resolved;
        inside = target == folder || (target.size() > folder.size() && target.compare(0, folder.size(), folder) == 0 &&
                                      (folder.back() == '/' || target[folder.size()] == '/'));
    }
    free(root);
    free(resolved);
    return inside;
}

// u+rwX, go-w.
void AddFullAccess(const std::string& path, const struct stat& info)
{
    mode_t user = S_ISDIR(info.st_mode) || (info.st_mode & 0111) ? S_IRWXU : (S_IRUSR | S_IWUSR);
    chmod(path.c_str(), (info.st_mode | user) & ~(S_IWGRP | S_IWOTH) & 07777);
}

} // namespace

std::string NativePath(const std::string& path)
{
    std::string native = path;
    std::replace(native.begin(), native.end(), '\\', '/');
    return native;
}

std::string NativePath(const wstring& path) { return NativePath(WideToUtf8(path)); }

wstring AppendPath(const wstring& first, const wstring& second)
{
    size_t from = 0;
    while (from < second.size() && IsSeparator(second[from]))
        ++from;
    if (first.empty())
        return second;
    if (from == second.size())
        return first;
    size_t end = first.size();
    while (end > 0 && IsSeparator(first[end - 1]))
        --end;
    wstring joined = end == 0 ? wstring(u"/") : first.substr(0, end) + u"/";
    return joined + second.substr(from);
}

bool CheckExistPath(const wstring& path)
{
    return !path.empty() && access(NativePath(path).c_str(), F_OK) == 0;
}

wstring GetCurrentDirectory()
{
    std::error_code error;
    std::filesystem::path current = std::filesystem::current_path(error);
    return error ? wstring() : Utf8ToWide(current.string());
}

bool SetCurrentDirectory(const wstring& path)
{
    return !path.empty() && chdir(NativePath(path).c_str()) == 0;
}

uint32_t CalcCRC(const void* data, size_t size, uint32_t crc)
{
    // zlib runs the same reflected table; its inversions on entry and exit are undone here.
    const auto* bytes = static_cast<const Bytef*>(data);
    uLong value = ~crc & 0xFFFFFFFFu;
    while (size > 0) {
        uInt block = static_cast<uInt>(std::min<size_t>(size, 1u << 30));
        value = crc32(value, bytes, block);
        bytes += block;
        size -= block;
    }
    return static_cast<uint32_t>(~value);
}

int CalcFileCRC(const wstring& path)
{
    unsigned size = 0;
    const void* memory = MapFile(path.c_str(), &size);
    if (!memory)
        return -1;
    uint32_t crc = CalcCRC(memory, size);
    UnmapFile(memory);
    return static_cast<int>(crc);
}

void SetNamedFullAccess(const wstring& path, bool inherit)
{
    std::string native = NativePath(path);
    struct stat info;
    if (native.empty() || lstat(native.c_str(), &info) != 0 || S_ISLNK(info.st_mode))
        return;
    if (!InsideFullAccessRoot(native)) {
        OX_LOG("data", diag::LogWarning, "SetNamedFullAccess: %s is outside the game's data folder, left as it is",
               native.c_str());
        return;
    }
    AddFullAccess(native, info);
    if (!inherit || !S_ISDIR(info.st_mode))
        return;
    std::error_code error;
    for (auto it = std::filesystem::recursive_directory_iterator(native, error);
         !error && it != std::filesystem::recursive_directory_iterator(); it.increment(error)) {
        std::string child = it->path().string();
        if (lstat(child.c_str(), &info) == 0 && !S_ISLNK(info.st_mode))
            AddFullAccess(child, info);
    }
}

void SetFullAccessRoot(const wstring& root) { FullAccessRoot() = NativePath(root); }

bool Compress(const wstring& source, const wstring& destination)
{
    std::string target = NativePath(destination);
    FILE* in = fopen(NativePath(source).c_str(), "rb");
    if (!in)
        return false;
    std::string temporary = TemporaryBeside(target);
    gzFile out = gzopen(temporary.c_str(), "wb6 ");
    if (!out) {
        fclose(in);
        return false;
    }
    std::vector<char> block(kGzipBlock);
    bool ok = true;
    for (;;) {
        size_t n = fread(block.data(), 1, block.size(), in);
        if (n > 0 && gzwrite(out, block.data(), static_cast<unsigned>(n)) != static_cast<int>(n)) {
            ok = false;
            break;
        }
        if (n < block.size())
            break;
    }
    ok = ok && !ferror(in) && feof(in);
    fclose(in);
    ok = gzclose(out) == Z_OK && ok;
    ok = ok && rename(temporary.c_str(), target.c_str()) == 0;
    if (!ok)
        remove(temporary.c_str());
    return ok;
}

AtomicWrite WriteFileAtomically(const std::string& path, const std::function<bool(FILE*)>& emit)
{
    const std::string temporary = TemporaryBeside(path);
    FILE* out = fopen(temporary.c_str(), "wb");
    if (!out)
        return AtomicWrite::CannotCreate;
    bool ok = emit(out);
    ok = ok && fflush(out) == 0 && fsync(fileno(out)) == 0;
    ok = fclose(out) == 0 && ok;
    if (!ok) {
        remove(temporary.c_str());
        return AtomicWrite::CannotWrite;
    }
    if (rename(temporary.c_str(), path.c_str()) != 0) {
        remove(temporary.c_str());
        return AtomicWrite::CannotReplace;
    }
    // The rename itself reaches the disk with the folder.
    size_t slash = path.rfind('/');
    std::string folder = slash == std::string::npos ? "." : (slash == 0 ? "/" : path.substr(0, slash));
    int fd = open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (fd >= 0) {
        fsync(fd);
        close(fd);
    }
    return AtomicWrite::Done;
}

bool WriteFileAtomically(const std::string& path, const void* data, size_t size)
{
    return WriteFileAtomically(path, [&](FILE* out) { return size == 0 || fwrite(data, size, 1, out) == 1; }) ==
           AtomicWrite::Done;
}

bool ReadWholeFile(const std::string& path, std::string& out)
{
    out.clear();
    FILE* in = fopen(path.c_str(), "rb");
    if (!in)
        return false;
    char block[65536];
    size_t n;
    while ((n = fread(block, 1, sizeof block, in)) > 0)
        out.append(block, n);
    bool ok = !ferror(in);
    fclose(in);
    return ok;
}

bool Uncompress(const wstring& source, const wstring& destination)
{
    gzFile in = gzopen(NativePath(source).c_str(), "rb");
    if (!in)
        return false;
    AtomicWrite result = WriteFileAtomically(NativePath(destination), [in](FILE* out) {
        std::vector<char> block(kGzipBlock);
        for (;;) {
            int n = gzread(in, block.data(), static_cast<unsigned>(block.size()));
            if (n < 0)
                return false;
            if (n == 0)
                break;
            if (fwrite(block.data(), 1, static_cast<size_t>(n), out) != static_cast<size_t>(n))
                return false;
        }
        int error = Z_OK;
        gzerror(in, &error);
        return error == Z_OK;
    });
    // A stream cut short is reported again by the close.
    bool closed = gzclose(in) == Z_OK;
    return result == AtomicWrite::Done && closed;
}

void ListFiles(std::vector<wstring>& _list, const wchar* _path_and_name_of_folder)
{
    OX_ASSERT(wcslen(_path_and_name_of_folder)<500);
    wstring path(_path_and_name_of_folder);
    std::replace(path.begin(), path.end(), u'\\', u'/');
    size_t cut = path.rfind(u'/');
    wstring folder = cut == wstring::npos ? wstring() : path.substr(0, cut + 1);
    std::string pattern = WideToUtf8(cut == wstring::npos ? path : path.substr(cut + 1));

    DIR* dir = opendir(folder.empty() ? "." : WideToUtf8(folder).c_str());
    if (!dir)
        return;
    std::vector<std::string> names;
    while (const dirent* entry = readdir(dir)) {
        std::string name = entry->d_name;
        if (name == "." || name == "..")
            continue;
        if (fnmatch(pattern.c_str(), name.c_str(), FNM_CASEFOLD) == 0)
            names.push_back(name);
    }
    closedir(dir);
    std::sort(names.begin(), names.end());
    for (const std::string& name : names)
        _list.push_back(folder + Utf8ToWide(name));
}

bool RemoveLastPathPart(wchar* _path)
{
    size_t length = WideLength(_path);
    if (length <= 1 || IsSeparator(_path[length - 1]))
        return false;
    size_t i = length - 1;
    while (i > 0 && !IsSeparator(_path[i]))
        --i;
    _path[i] = 0;
    return true;
}

bool RemoveLastPathPart(wstring& _path)
{
    if (!RemoveLastPathPart(_path.data()))
        return false;
    _path.resize(WideLength(_path.c_str()));
    return true;
}

bool CreateFolder(const wstring& path)
{
    if (path.empty())
        return false;
    std::error_code error;
    std::filesystem::path native(NativePath(path));
    std::filesystem::create_directories(native, error);
    return std::filesystem::is_directory(native, error);
}

} // namespace ox::misc::sys
