// The file watcher, threaded and polled.
#include "misc/FileWatcher.h"

#include "misc/Unicode.h"
#include "support/TestSupport.h"

#include <chrono>
#include <thread>

using ox::misc::CFileWatcher;

namespace {

namespace fs = std::filesystem;

// Replaces a file's text in one step, with a time apart from the old one.
void Rewrite(const oxtest::TempDir& dir, const std::string& name, const std::string& text, int seconds_ahead)
{
    fs::path next = dir.Write(name + ".next", text);
    fs::last_write_time(next, fs::file_time_type::clock::now() + std::chrono::seconds(seconds_ahead));
    fs::rename(next, dir / name);
}

bool WaitForChange(CFileWatcher& watcher)
{
    for (int i = 0; i < 300; ++i) {
        if (watcher.IsFilesChanged())
            return true;
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return false;
}

} // namespace

TEST(FileWatcher, ThreadedReportsEachChangeOnce)
{
    oxtest::TempDir dir;
    dir.Write("a.lua", "1");
    const ox::wstring name = ox::misc::Utf8ToWide((dir / "a.lua").string());
    const ox::wstring missing = ox::misc::Utf8ToWide((dir / "missing.lua").string());
    CFileWatcher watcher(true, 1000);
    watcher.SetPollInterval(std::chrono::milliseconds(10));
    EXPECT_TRUE(watcher.WatchFile(name, false));
    EXPECT_TRUE(watcher.WatchFile(name, true)) << "a watched name is left as it is";
    EXPECT_TRUE(watcher.WatchFile(missing, false));
    EXPECT_EQ(watcher.GetWatchCount(), 2u);
    EXPECT_FALSE(watcher.IsFilesChanged());
    std::this_thread::sleep_for(std::chrono::milliseconds(40));

    Rewrite(dir, "a.lua", "2", 5);
    ASSERT_TRUE(WaitForChange(watcher));
    EXPECT_EQ(watcher.GetChangedFiles(), CFileWatcher::FileNamesT {name});
    watcher.ResetChanges();
    std::this_thread::sleep_for(std::chrono::milliseconds(60));
    EXPECT_FALSE(watcher.IsFilesChanged()) << "one change, one report";

    Rewrite(dir, "a.lua", "3", 10);
    ASSERT_TRUE(WaitForChange(watcher));
    EXPECT_EQ(watcher.GetChangedFiles(), CFileWatcher::FileNamesT {name});

    watcher.ClearWatches(true);
    EXPECT_EQ(watcher.GetWatchCount(), 0u);
}

TEST(FileWatcher, UnthreadedPollsOpenFilesOnly)
{
    oxtest::TempDir dir;
    dir.Write("b.lua", "1");
    const ox::wstring name = ox::misc::Utf8ToWide((dir / "b.lua").string());
    CFileWatcher watcher(false, 0);
    EXPECT_FALSE(watcher.WatchFile(ox::misc::Utf8ToWide((dir / "missing.lua").string()), false));
    EXPECT_TRUE(watcher.WatchFile(name, true));
    EXPECT_EQ(watcher.GetWatchCount(), 1u);
    EXPECT_TRUE(watcher.IsFilesChanged()) << "initially changed";
    watcher.ResetChanges();
    EXPECT_FALSE(watcher.IsFilesChanged());
    Rewrite(dir, "b.lua", "2", 5);
    EXPECT_TRUE(watcher.IsFilesChanged());
    EXPECT_EQ(watcher.GetChangedFiles(), CFileWatcher::FileNamesT {name});

    // A stopped watch list is emptied at once when unthreaded.
    watcher.ClearWatches(false);
    EXPECT_EQ(watcher.GetWatchCount(), 0u);
}
