// File watching by polling modification times.
#include "misc/FileWatcher.h"

#include "misc/sys/Path.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>

namespace ox::misc {

namespace {

// The modification time in nanoseconds; false if the file can't be read.
bool ReadWriteTime(const std::string& path, int64_t& time)
{
    struct stat info;
    if (stat(path.c_str(), &info) != 0)
        return false;
    time = static_cast<int64_t>(info.st_mtim.tv_sec) * 1000000000 + info.st_mtim.tv_nsec;
    return true;
}

uint32_t Ticks()
{
    using namespace std::chrono;
    return static_cast<uint32_t>(duration_cast<milliseconds>(steady_clock::now().time_since_epoch()).count());
}

// The path as the file system takes it, made absolute now: a thread reads it later, when
// the working folder may have changed.
std::string AbsolutePath(const wstring& name)
{
    std::error_code error;
    std::filesystem::path path = std::filesystem::absolute(sys::NativePath(name), error);
    return error ? sys::NativePath(name) : path.string();
}

} // namespace

CFileWatcher::CFileWatcher(bool threaded, unsigned period_ms) : m_Threaded(threaded), m_Period(period_ms) {}

CFileWatcher::~CFileWatcher() { ClearWatches(true); }

void CFileWatcher::WatchThread(Entry* entry, std::string path, std::chrono::milliseconds interval)
{
    int handle = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (handle < 0) {
        // Nothing on disk to watch (a file that lives only in the pack).
        entry->Running = false;
        return;
    }
    int64_t last = 0;
    ReadWriteTime(path, last);
    constexpr auto slice = std::chrono::milliseconds(10);
    while (!entry->Stop) {
        // The interval is slept in slices so that a stop request is seen soon.
        for (auto slept = std::chrono::milliseconds(0); slept < interval && !entry->Stop; slept += slice)
            std::this_thread::sleep_for(std::min(slice, interval - slept));
        if (entry->Stop)
            break;
        // The path, not the open file: editors often save by writing a new file over it.
        int64_t now = 0;
        if (ReadWriteTime(path, now) && now != last) {
            last = now;
            entry->Changed = true;
        }
    }
    close(handle);
    entry->Running = false;
}

bool CFileWatcher::WatchFile(const wstring& name, bool initially_changed)
{
    // Watches that were asked to stop and have ended leave the list first.
    for (auto it = m_Entries.begin(); it != m_Entries.end();) {
        if (it->Stop && !it->Running) {
            if (it->Thread.joinable())
                it->Thread.join();
            if (it->Handle >= 0)
                close(it->Handle);
            it = m_Entries.erase(it);
        } else {
            ++it;
        }
    }
    for (const Entry& entry : m_Entries)
        if (entry.Name == name)
            return true;

    std::string path = AbsolutePath(name);
    if (!m_Threaded) {
        int handle = open(path.c_str(), O_RDONLY | O_CLOEXEC);
        if (handle < 0)
            return false;
        Entry& entry = m_Entries.emplace_back();
        entry.Name = name;
        entry.Changed = initially_changed;
        entry.Handle = handle;
        entry.Path = path;
        ReadWriteTime(path, entry.LastWriteTime);
        entry.Tick = Ticks();
        return true;
    }
    Entry& entry = m_Entries.emplace_back();
    entry.Name = name;
    entry.Changed = initially_changed;
    entry.Path = path;
    // Set before the thread starts, so that the entry is never taken for an ended watch.
    entry.Running = true;
    entry.Thread = std::thread(&CFileWatcher::WatchThread, &entry, path, m_PollInterval);
    return true;
}

void CFileWatcher::ClearWatches(bool wait)
{
    for (Entry& entry : m_Entries)
        entry.Stop = true;
    if (!wait && m_Threaded)
        return;
    while (!m_Entries.empty()) {
        for (auto it = m_Entries.begin(); it != m_Entries.end();) {
            if (it->Running) {
                ++it;
                continue;
            }
            if (it->Thread.joinable())
                it->Thread.join();
            if (it->Handle >= 0)
                close(it->Handle);
            it = m_Entries.erase(it);
        }
        if (!m_Entries.empty())
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}

void CFileWatcher::Poll(Entry& entry)
{
    uint32_t now = Ticks();
    if (now - entry.Tick < m_Period)
        return;
    entry.Tick = now;
    int64_t time = 0;
    if (ReadWriteTime(entry.Path, time) && time != entry.LastWriteTime) {
        entry.LastWriteTime = time;
        entry.Changed = true;
    }
}

bool CFileWatcher::IsFilesChanged()
{
    bool changed = false;
    for (Entry& entry : m_Entries) {
        if (!m_Threaded && entry.Handle >= 0)
            Poll(entry);
        changed = changed || entry.Changed;
    }
    return changed;
}

CFileWatcher::FileNamesT CFileWatcher::GetChangedFiles() const
{
    FileNamesT names;
    for (const Entry& entry : m_Entries)
        if (entry.Changed)
            names.push_back(entry.Name);
    return names;
}

void CFileWatcher::ResetChanges()
{
    for (Entry& entry : m_Entries)
        entry.Changed = false;
}

} // namespace ox::misc
