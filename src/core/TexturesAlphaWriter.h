#pragma once
// Making properties/texturesalpha.bindump, for the content tools (oxdump, oxmedia) and
// tests: the runs of each mask from pixels, the whole file from image files on disk, and a
// line describing a mask.
#include "core/TexturesAlpha.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ox::core {

// One image for the builder: its id, size and 0xAARRGGBB pixels (a pixel is solid when its
// alpha is not 0).
struct AlphaMaskSource {
    std::string id;
    uint32_t width = 0;
    uint32_t height = 0;
    std::vector<uint32_t> pixels;
    // 1: rows, 2: columns, 0: whichever takes fewer runs.
    int order = 0;
};

// Builds a texturesalpha.bindump image: records sorted by id, hashes set, uniform images
// without runs. False with a reason for an id that is too long or repeated, or an image
// too big for the format.
bool BuildTexturesAlpha(const std::vector<AlphaMaskSource>& sources, std::vector<uint8_t>& out,
                        std::string* error = nullptr);

// An image file on disk and the texture id its mask answers for.
struct AlphaMaskFile {
    std::string id;
    std::string path;
};

// The scan order for its name: "auto" 0, "rows" 1, "columns" 2; -1 for another name.
int AlphaMaskOrder(const std::string& name);

// Decodes every file (PNG or JPEG), builds the table in `order` (as AlphaMaskSource has
// it) and writes it to `out` whole or not at all. False with the reason in `error`;
// `size` gets the bytes written.
bool WriteTexturesAlpha(const std::vector<AlphaMaskFile>& files, int order, const std::string& out,
                        std::string& error, size_t* size = nullptr);

// "ID WxH uniform solid" (or clear) for a mask without runs, else "ID WxH N runs by rows"
// (or columns).
std::string DescribeMask(const TextureAlphaDesc& mask);

} // namespace ox::core
