// Feeds arbitrary bytes to every image reader: the PNG and JPEG decoders, the PVR
// container, its LZO form, and the alpha-mask table. Each works on an exact-size copy so
// that the address sanitizer sees any read past the data. Inputs are also tried once
// "repaired" (PVR mark set, an LZO trailer added, the table's magic, ids, hashes and
// order made valid), so that the checks behind the first ones are reached too.
#include "core/TexturesAlpha.h"
#include "misc/imagelib/ImageLib.h"
#include "misc/imagelib/PvrContainer.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <memory>
#include <vector>

using namespace ox::misc::imagelib;
using ox::core::CTexturesAlpha;
using ox::core::TextureAlphaDesc;

namespace {

volatile uint32_t g_Sink;

void Touch(const void* data, size_t size)
{
    const auto* p = static_cast<const uint8_t*>(data);
    uint32_t sum = 0;
    for (size_t i = 0; i < size; ++i)
        sum += p[i];
    g_Sink = sum;
}

void CheckImage(bool ok, const Image& image)
{
    if (ok ? image.pixels.size() != size_t(image.width) * image.height || image.pixels.empty()
           : !image.pixels.empty())
        __builtin_trap();
}

void Decoders(const uint8_t* data, size_t size)
{
    uint32_t w = 0, h = 0;
    Image image;
    CPNGDecoder png;
    png.SetCheckCrc(false);
    png.GetInfo(data, size, w, h);
    CheckImage(png.Decode(data, size, image), image);
    CJPEGDecoder jpeg;
    jpeg.GetInfo(data, size, w, h);
    CheckImage(jpeg.Decode(data, size, image), image);
}

bool UseContainer(const void* data, size_t size)
{
    PvrTexture texture;
    if (!PvrParse(data, size, "fuzz.pvr", texture))
        return false;
    const auto* begin = static_cast<const uint8_t*>(data);
    const auto* bits = static_cast<const uint8_t*>(texture.data);
    if (bits < begin || bits + texture.size > begin + size ||
        texture.size < PvrTextureBytes(texture.internal_format, texture.width, texture.height))
        __builtin_trap();
    Touch(texture.data, texture.size);
    return true;
}

void Masks(const uint8_t* data, size_t size)
{
    CTexturesAlpha store;
    if (!store.LoadFromMemory(data, size, "fuzz.bindump"))
        return;
    const auto* records = reinterpret_cast<const TextureAlphaDesc*>(data + sizeof(ox::core::TexturesAlphaHeader));
    for (uint32_t i = 0; i < store.Count(); ++i) {
        const TextureAlphaDesc& d = records[i];
        if (store.Find(d.id.c_str()) != &d)
            __builtin_trap();
        const int w = d.width, h = d.height;
        const int points[][2] = {{0, 0}, {w - 1, h - 1}, {w / 2, h / 3}, {-1, 0}, {w, h}, {w - 1, 0}};
        for (const auto& p : points)
            store.IsOpaque(d.id.c_str(), p[0], p[1]);
    }
}

// The table made acceptable: magic, the records that fit, well-formed ids with their
// hashes, sorted without repeats.
std::vector<uint8_t> RepairMasks(const uint8_t* data, size_t size)
{
    std::vector<uint8_t> out(data, data + size);
    if (size < 8)
        return out;
    const uint32_t magic = ox::core::g_Magick;
    memcpy(out.data(), &magic, 4);
    size_t count = std::min<size_t>((size - 8) / 112, data[4]);
    std::vector<std::array<uint8_t, 112>> records(count);
    for (size_t i = 0; i < count; ++i) {
        std::array<uint8_t, 112>& r = records[i];
        memcpy(r.data(), data + 8 + i * 112, 112);
        uint16_t length = uint16_t(strnlen(reinterpret_cast<const char*>(r.data() + 8), 87));
        uint16_t capacity = 88, hash = ox::misc::CalcHash(r.data() + 8, length);
        r[8 + length] = 0;
        memcpy(r.data(), &length, 2);
        memcpy(r.data() + 2, &capacity, 2);
        memcpy(r.data() + 4, &hash, 2);
    }
    auto id = [](const std::array<uint8_t, 112>& r) { return reinterpret_cast<const char*>(r.data() + 8); };
    std::sort(records.begin(), records.end(), [&](const auto& a, const auto& b) { return strcmp(id(a), id(b)) < 0; });
    records.erase(std::unique(records.begin(), records.end(),
                              [&](const auto& a, const auto& b) { return strcmp(id(a), id(b)) == 0; }),
                  records.end());
    const uint32_t kept = uint32_t(records.size());
    memcpy(out.data() + 4, &kept, 4);
    for (size_t i = 0; i < records.size(); ++i)
        memcpy(out.data() + 8 + i * 112, records[i].data(), 112);
    return out;
}

// Runs `use` on an exact-size heap copy of the bytes.
template <class Use>
void OnCopy(const uint8_t* data, size_t size, Use use)
{
    std::unique_ptr<uint8_t[]> copy(new uint8_t[size ? size : 1]);
    if (size)
        memcpy(copy.get(), data, size);
    use(copy.get(), size);
}

} // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    // Small images are enough to reach every path, and keep each run fast.
    SetMaxImagePixels(1u << 20);
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    OnCopy(data, size, Decoders);
    OnCopy(data, size, [](const uint8_t* p, size_t n) { UseContainer(p, n); });
    OnCopy(data, size, [](const uint8_t* p, size_t n) { PvrDecompressLzo(p, n, "fuzz.pvrlzo", UseContainer); });
    OnCopy(data, size, Masks);

    if (size >= sizeof(PvrHeader)) {
        std::vector<uint8_t> marked(data, data + size);
        memcpy(marked.data() + 44, "PVR!", 4);
        OnCopy(marked.data(), size, [](const uint8_t* p, size_t n) { UseContainer(p, n); });
    }
    if (size >= 2) {
        // Any stream with a trailer; the claimed size comes from the first bytes.
        std::vector<uint8_t> trailed(data, data + size);
        const uint32_t magic = g_LzoMagicNumber, claimed = (uint32_t(data[0]) | uint32_t(data[1]) << 8) * 8u + 1;
        trailed.insert(trailed.end(), reinterpret_cast<const uint8_t*>(&magic), reinterpret_cast<const uint8_t*>(&magic) + 4);
        trailed.insert(trailed.end(), reinterpret_cast<const uint8_t*>(&claimed), reinterpret_cast<const uint8_t*>(&claimed) + 4);
        OnCopy(trailed.data(), trailed.size(),
               [](const uint8_t* p, size_t n) { PvrDecompressLzo(p, n, "fuzz.pvrlzo", UseContainer); });
    }
    std::vector<uint8_t> masks = RepairMasks(data, size);
    OnCopy(masks.data(), masks.size(), Masks);
    return 0;
}
