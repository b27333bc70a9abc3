#include "core/TexturesAlphaWriter.h"

#include "misc/imagelib/ImageLib.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cstring>

namespace ox::core {

namespace {

// The runs of one image, by rows or by columns; none when every pixel gives one answer.
std::vector<uint16_t> MakeRuns(const AlphaMaskSource& source, bool byRows, bool* uniform, bool* value)
{
    std::vector<uint16_t> runs;
    const uint64_t total = uint64_t(source.width) * source.height;
    auto solid = [&](uint64_t i) {
        uint64_t x = byRows ? i % source.width : i / source.height;
        uint64_t y = byRows ? i / source.width : i % source.height;
        return (source.pixels[y * source.width + x] >> 24) != 0;
    };
    *uniform = true;
    *value = total ? solid(0) : false;
    uint64_t i = 0;
    while (i < total) {
        bool current = solid(i);
        if (current != *value)
            *uniform = false;
        uint64_t length = 1;
        while (i + length < total && length < kMaxRunLength && solid(i + length) == current)
            ++length;
        runs.push_back(uint16_t(length | (current ? kRunValueBit : 0)));
        i += length;
    }
    if (*uniform)
        runs.clear();
    return runs;
}

bool Fail(std::string* error, const std::string& text)
{
    if (error)
        *error = text;
    return false;
}

} // namespace

bool BuildTexturesAlpha(const std::vector<AlphaMaskSource>& sources, std::vector<uint8_t>& out, std::string* error)
{
    out.clear();
    std::vector<const AlphaMaskSource*> sorted;
    for (const AlphaMaskSource& source : sources) {
        if (source.id.empty() || source.id.size() >= misc::StringA88::kCapacity ||
            source.id.find('\0') != std::string::npos)
            return Fail(error, "the id \"" + source.id + "\" is empty or longer than 87 bytes");
        if (source.width > 0xFFFF || source.height > 0xFFFF)
            return Fail(error, "\"" + source.id + "\" is too big for a mask (at most 65535 a side)");
        if (source.pixels.size() != size_t(source.width) * source.height)
            return Fail(error, "\"" + source.id + "\" has the wrong number of pixels");
        sorted.push_back(&source);
    }
    // The order of Compare: unsigned bytes, as strcmp has it.
    std::sort(sorted.begin(), sorted.end(),
              [](const AlphaMaskSource* a, const AlphaMaskSource* b) { return strcmp(a->id.c_str(), b->id.c_str()) < 0; });
    for (size_t i = 1; i < sorted.size(); ++i)
        if (sorted[i - 1]->id == sorted[i]->id)
            return Fail(error, "the id \"" + sorted[i]->id + "\" is given twice");

    const size_t recordsEnd = sizeof(TexturesAlphaHeader) + sorted.size() * sizeof(TextureAlphaDesc);
    out.resize(recordsEnd);
    TexturesAlphaHeader header{g_Magick, uint32_t(sorted.size())};
    memcpy(out.data(), &header, sizeof(header));
    for (size_t i = 0; i < sorted.size(); ++i) {
        const AlphaMaskSource& source = *sorted[i];
        bool uniform = false, value = false;
        std::vector<uint16_t> runs;
        bool byRows = source.order != 2;
        runs = MakeRuns(source, byRows, &uniform, &value);
        if (source.order == 0 && !uniform) {
            bool ignoredUniform, ignoredValue;
            std::vector<uint16_t> columns = MakeRuns(source, false, &ignoredUniform, &ignoredValue);
            if (columns.size() < runs.size()) {
                runs = std::move(columns);
                byRows = false;
            }
        }
        const size_t runBytes = runs.size() * sizeof(uint16_t);
        if (out.size() + runBytes > 0xFFFFFFFFu)
            return Fail(error, "the masks do not fit in 4 GB");

        // The record is written byte by byte: an id string with its hash and zero padding.
        uint8_t record[sizeof(TextureAlphaDesc)] = {};
        misc::StringA88 id(source.id);
        id.Hash();
        memcpy(record, &id, sizeof(misc::BasicString));
        memcpy(record + sizeof(misc::BasicString), id.c_str(), id.size);
        const uint16_t width = uint16_t(source.width), height = uint16_t(source.height);
        const uint32_t offset = uniform ? 0 : uint32_t(out.size());
        const uint32_t size = uint32_t(runBytes);
        memcpy(record + kDescWidth, &width, 2);
        memcpy(record + kDescHeight, &height, 2);
        memcpy(record + kDescOffset, &offset, 4);
        memcpy(record + kDescSize, &size, 4);
        record[kDescUniform] = uniform ? 1 : 0;
        record[kDescUniformValue] = value ? 1 : 0;
        record[kDescOrder] = byRows ? 1 : 0;
        memcpy(out.data() + sizeof(TexturesAlphaHeader) + i * sizeof(TextureAlphaDesc), record, sizeof(record));

        const size_t at = out.size();
        out.resize(at + runBytes);
        if (runBytes)
            memcpy(out.data() + at, runs.data(), runBytes);
    }
    return true;
}

int AlphaMaskOrder(const std::string& name)
{
    return name == "auto" ? 0 : name == "rows" ? 1 : name == "columns" ? 2 : -1;
}

bool WriteTexturesAlpha(const std::vector<AlphaMaskFile>& files, int order, const std::string& out,
                        std::string& error, size_t* size)
{
    std::vector<AlphaMaskSource> sources;
    for (const AlphaMaskFile& file : files) {
        misc::imagelib::Image image;
        if (!misc::imagelib::DecodeImageOnDisk(file.path, image, error))
            return false;
        sources.push_back({file.id, image.width, image.height, std::move(image.pixels), order});
    }
    std::vector<uint8_t> table;
    if (!BuildTexturesAlpha(sources, table, &error))
        return false;
    if (!misc::sys::WriteFileAtomically(out, table.data(), table.size())) {
        error = "cannot write " + out;
        return false;
    }
    if (size)
        *size = table.size();
    return true;
}

std::string DescribeMask(const TextureAlphaDesc& mask)
{
    std::string line = std::string(mask.id.c_str()) + " " + std::to_string(mask.width) + "x" +
                       std::to_string(mask.height);
    if (mask.uniform)
        return line + " uniform " + (mask.uniform_value ? "solid" : "clear");
    return line + " " + std::to_string(mask.size / 2) + " runs by " + (mask.order == 1 ? "rows" : "columns");
}

} // namespace ox::core
