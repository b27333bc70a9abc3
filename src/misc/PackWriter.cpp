#include "misc/PackWriter.h"

#include "misc/sys/Path.h"

#include "misc/GamePack.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <unistd.h>

namespace ox::misc {

namespace fs = std::filesystem;

namespace {

constexpr size_t kCopyBlock = 1 << 16;

uint64_t AlignUp4(uint64_t value) { return (value + 3) & ~uint64_t(3); }

} // namespace

std::string CPackWriter::CheckPath(const std::string& path)
{
    if (path.empty())
        return "the path is empty";
    if (path.size() + 1 > kPackPathCapacity)
        return "the path is longer than 111 bytes";
    if (path.find('\0') != std::string::npos)
        return "the path holds a zero byte";
    if (path.find('\\') != std::string::npos)
        return "the path holds a backslash; use \"/\"";
    if (path.front() == '/')
        return "the path is absolute";
    size_t start = 0;
    for (;;) {
        size_t end = path.find('/', start);
        std::string part = path.substr(start, end == std::string::npos ? std::string::npos : end - start);
        if (part.empty() || part == "." || part == "..")
            return "the path has an empty, \".\" or \"..\" component";
        if (end == std::string::npos)
            break;
        start = end + 1;
    }
    std::string overlay = std::string(kLanguagesFolder) + "/";
    if (path.compare(0, overlay.size(), overlay) == 0) {
        size_t slash = path.find('/', overlay.size());
        if (slash == std::string::npos)
            return "a translation needs the form !langs/<language>/<path>";
        // The game looks a translation up only when its name with the terminator stays
        // under the 112 bytes of an entry.
        if (path.size() + 1 >= kPackPathCapacity)
            return "a translation path must be shorter than 111 bytes";
    }
    return {};
}

bool CPackWriter::Fail(std::string message)
{
    m_Error = std::move(message);
    return false;
}

bool CPackWriter::Add(Item item)
{
    std::string why = CheckPath(item.path);
    if (!why.empty())
        return Fail(item.path + ": " + why);
    if (!m_Paths.insert(item.path).second)
        return Fail(item.path + ": added twice");
    if (item.size > UINT32_MAX)
        return Fail(item.path + ": larger than 4 GiB");
    m_Items.push_back(std::move(item));
    return true;
}

bool CPackWriter::AddData(const std::string& path, std::string data)
{
    Item item;
    item.path = path;
    item.size = data.size();
    item.data = std::move(data);
    return Add(std::move(item));
}

bool CPackWriter::AddFile(const std::string& path, const fs::path& source)
{
    std::error_code error;
    uint64_t size = fs::file_size(source, error);
    if (error)
        return Fail(source.string() + ": " + error.message());
    Item item;
    item.path = path;
    item.source = source;
    item.size = size;
    return Add(std::move(item));
}

bool CPackWriter::AddFolder(const fs::path& folder, const fs::path& exclude)
{
    std::error_code error;
    if (!fs::is_directory(folder, error))
        return Fail(folder.string() + ": not a folder");
    std::vector<fs::path> files;
    for (auto it = fs::recursive_directory_iterator(folder, error); it != fs::recursive_directory_iterator();
         it.increment(error)) {
        if (error)
            break;
        if (!it->is_regular_file(error))
            continue;
        if (!exclude.empty() && fs::equivalent(it->path(), exclude, error))
            continue;
        files.push_back(it->path());
    }
    if (error)
        return Fail(folder.string() + ": " + error.message());
    for (const fs::path& file : files)
        if (!AddFile(file.lexically_relative(folder).generic_string(), file))
            return false;
    return true;
}

bool CPackWriter::Emit(const Sink& sink)
{
    std::sort(m_Items.begin(), m_Items.end(), [](const Item& a, const Item& b) {
        // std::string orders by unsigned byte, as the game's search does.
        return a.path < b.path;
    });

    uint64_t position = sizeof(PackHeader) + uint64_t(m_Items.size()) * sizeof(PackEntry);
    std::vector<PackEntry> table(m_Items.size());
    for (size_t i = 0; i < m_Items.size(); ++i) {
        PackEntry& entry = table[i];
        entry.path = std::string_view(m_Items[i].path);
        entry.path.Hash();
        entry.size = static_cast<uint32_t>(m_Items[i].size);
        uint64_t offset = position + sizeof(uint32_t);
        entry.offset = static_cast<uint32_t>(offset);
        position = AlignUp4(offset + m_Items[i].size);
        // An empty file last would start at the very end; the pack then ends in a word
        // of padding, so that every file starts inside it.
        if (i + 1 == m_Items.size() && m_Items[i].size == 0)
            position += sizeof(uint32_t);
        if (position > UINT32_MAX)
            return Fail("the pack would be larger than 4 GiB");
    }

    PackHeader header{kPackMagic, static_cast<uint32_t>(m_Items.size()), static_cast<uint32_t>(position)};
    if (!sink(&header, sizeof(header)) || (!table.empty() && !sink(table.data(), table.size() * sizeof(PackEntry))))
        return Fail("cannot write the table");

    static const char kZeros[4] = {};
    std::vector<char> block;
    for (size_t i = 0; i < m_Items.size(); ++i) {
        const Item& item = m_Items[i];
        uint32_t size = table[i].size;
        if (!sink(&size, sizeof(size)))
            return Fail(item.path + ": cannot write");
        if (item.source.empty()) {
            if (!item.data.empty() && !sink(item.data.data(), item.data.size()))
                return Fail(item.path + ": cannot write");
        } else {
            FILE* in = fopen(item.source.c_str(), "rb");
            if (!in)
                return Fail(item.source.string() + ": cannot be read");
            block.resize(kCopyBlock);
            uint64_t copied = 0;
            bool ok = true;
            while (ok) {
                size_t n = fread(block.data(), 1, block.size(), in);
                if (n == 0)
                    break;
                copied += n;
                ok = copied <= item.size && sink(block.data(), n);
            }
            ok = ok && !ferror(in) && copied == item.size;
            fclose(in);
            if (!ok)
                return Fail(item.source.string() + ": cannot be read, or it changed while the pack was built");
        }
        size_t padding = static_cast<size_t>(AlignUp4(item.size) - item.size);
        if (i + 1 == m_Items.size() && item.size == 0)
            padding = sizeof(uint32_t);
        if (padding && !sink(kZeros, padding))
            return Fail(item.path + ": cannot write");
    }
    return true;
}

bool CPackWriter::Build(std::string& image)
{
    image.clear();
    return Emit([&image](const void* data, size_t size) {
        image.append(static_cast<const char*>(data), size);
        return true;
    });
}

bool CPackWriter::Write(const fs::path& packFile)
{
    m_Error.clear();
    switch (sys::WriteFileAtomically(packFile.string(), [this](FILE* out) {
        return Emit([out](const void* data, size_t size) { return fwrite(data, 1, size, out) == size; });
    })) {
    case sys::AtomicWrite::Done:
        return true;
    case sys::AtomicWrite::CannotCreate:
        return Fail(packFile.string() + ": cannot be created");
    case sys::AtomicWrite::CannotWrite:
        // Emit names what went wrong itself, unless the disk refused the data.
        return m_Error.empty() ? Fail(packFile.string() + ": cannot be written") : false;
    case sys::AtomicWrite::CannotReplace:
        return Fail(packFile.string() + ": cannot be replaced");
    }
    return false;
}

} // namespace ox::misc
