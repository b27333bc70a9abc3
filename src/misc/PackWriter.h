#pragma once
// Builds game.pack images: the sorted table the game searches in place, each file's bytes
// behind a size word at a 4-byte aligned offset.
#include <cstdint>
#include <filesystem>
#include <functional>
#include <set>
#include <string>
#include <vector>

namespace ox::misc {

class CPackWriter {
public:
    // Adds a file held in memory under its pack path ("properties/gui.xml",
    // "!langs/de/properties/gui.xml" for a translation). False, with Error() set, for a
    // path the pack cannot hold or one already added.
    bool AddData(const std::string& path, std::string data);
    // Adds a file on disk; its bytes are read when the pack is written.
    bool AddFile(const std::string& path, const std::filesystem::path& source);
    // Adds every regular file under `folder`, named by its path relative to the folder
    // with "/" between components; files under "!langs/<language>/" become overlays.
    // `exclude` (the pack being written, if it lies inside) is skipped.
    bool AddFolder(const std::filesystem::path& folder, const std::filesystem::path& exclude = {});

    // The whole image in memory.
    bool Build(std::string& image);
    // Writes the pack to a temporary file beside `packFile`, then renames it into place.
    bool Write(const std::filesystem::path& packFile);

    size_t Count() const { return m_Items.size(); }
    const std::string& Error() const { return m_Error; }

    // Why a pack path is unfit, or empty if it is fine.
    static std::string CheckPath(const std::string& path);

private:
    struct Item {
        std::string path;
        std::string data;               // the bytes, for files added from memory
        std::filesystem::path source;   // or the file they are read from
        uint64_t size = 0;
    };
    using Sink = std::function<bool(const void* data, size_t size)>;

    bool Add(Item item);
    bool Emit(const Sink& sink);
    bool Fail(std::string message);

    std::vector<Item> m_Items;
    std::set<std::string> m_Paths;
    std::string m_Error;
};

} // namespace ox::misc
