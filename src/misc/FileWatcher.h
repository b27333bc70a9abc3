#pragma once
// Watches files for changes of their modification time.
//
// Threaded, each watched file gets a thread that reads the file's time once a poll interval
// (1000 ms) and raises the entry's `changed` flag; the thread shares only its entry's flags
// with the owner. Unthreaded, IsFilesChanged polls the files itself, at most once every
// `period_ms` for each file. A file that can't be opened is never reported.
#include "misc/WideChar.h"

#include <atomic>
#include <chrono>
#include <cstdint>
#include <list>
#include <string>
#include <thread>
#include <vector>

namespace ox::misc {

class CFileWatcher {
public:
    using FileNamesT = std::vector<wstring>;

    CFileWatcher(bool threaded, unsigned period_ms);
    // ClearWatches(true).
    ~CFileWatcher();
    CFileWatcher(const CFileWatcher&) = delete;
    CFileWatcher& operator=(const CFileWatcher&) = delete;

    // Adds a file (a name already in the list gives true and changes nothing). Threaded,
    // this starts the file's thread and gives true; unthreaded, false when the file can't
    // be opened.
    bool WatchFile(const wstring& name, bool initially_changed);
    // Asks every watch to end. With `wait` (always, unthreaded) waits until each has ended
    // and empties the list.
    void ClearWatches(bool wait);
    bool IsFilesChanged();
    FileNamesT GetChangedFiles() const;
    void ResetChanges();

    bool IsThreaded() const { return m_Threaded; }
    size_t GetWatchCount() const { return m_Entries.size(); }
    // How often a watch thread reads its file's time; for threads started afterwards.
    void SetPollInterval(std::chrono::milliseconds interval) { m_PollInterval = interval; }

private:
    struct Entry {
        wstring Name;
        std::string Path; // absolute, as the file system takes it
        std::atomic<bool> Running {false};
        std::atomic<bool> Stop {false};
        std::atomic<bool> Changed {false};
        // Unthreaded form: the open file (-1 when none), its time, the tick of the last poll.
        int Handle = -1;
        int64_t LastWriteTime = 0;
        uint32_t Tick = 0;
        std::thread Thread;
    };

    static void WatchThread(Entry* entry, std::string path, std::chrono::milliseconds interval);
    void Poll(Entry& entry);

    bool m_Threaded;
    unsigned m_Period;
    std::chrono::milliseconds m_PollInterval {1000};
    std::list<Entry> m_Entries;
};

} // namespace ox::misc
