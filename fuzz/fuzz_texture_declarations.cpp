// Feeds arbitrary bytes to the texture declarations: as a resources.bindump (checked, then
// every record walked as the manager would) and as resources.xml (converted, then checked).
// The dump is tried once more with its magic set, so that the checks behind it are reached.
#include "core/TextureDeclarations.h"
#include "misc/GamePack.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <vector>

using ox::core::CTextureDeclarationsLoader;

namespace {

volatile uint32_t g_Sink;

ox::misc::CGamePack& NoFiles()
{
    static ox::misc::CGamePack* pack = [] {
        ox::misc::GamePackConfig config;
        config.folder = "/nonexistent-ox-fuzz";
        config.language = "";
        return new ox::misc::CGamePack(config);
    }();
    return *pack;
}

void Walk(const CTextureDeclarationsLoader& loader)
{
    uint32_t sum = 0;
    for (uint32_t i = 0; i < loader.SurfacesAmount(); ++i)
        sum += loader.Surfaces()[i].width + static_cast<uint32_t>(strlen(loader.Surfaces()[i].path.c_str()));
    for (uint32_t i = 0; i < loader.GroupsAmount(); ++i)
        if (const auto* parent = loader.Group(loader.Groups()[i].parent))
            sum += parent->flags;
    for (uint32_t i = 0; i < loader.ImagesAmount(); ++i) {
        const auto& entry = loader.Images()[i];
        if (loader.FindImageIndex(entry.id.c_str()) != static_cast<int>(i))
            __builtin_trap();  // a checked table must find each of its ids
        const auto* desc = loader.Desc(entry);
        for (unsigned p = 0; p < desc->parts_amount; ++p) {
            // The bits, not the value: a float from the dump may be any number, and
            // converting one out of range to an integer is undefined.
            uint32_t bits;
            memcpy(&bits, &desc->Parts()[p].u2, sizeof bits);
            sum += bits;
        }
        sum += loader.Surfaces()[loader.SurfaceIndex(*desc)].height;
        if (const auto* group = loader.Group(entry.group))
            sum += group->flags;
    }
    g_Sink = sum;
}

void TryDump(const uint8_t* data, size_t size)
{
    // An exact-size, 4-aligned copy: the sanitizer sees any read past the end.
    void* copy = aligned_alloc(4, (size + 3) / 4 * 4 + 4);
    memcpy(copy, data, size);
    CTextureDeclarationsLoader loader;
    if (loader.LoadFromMemory(copy, size, "fuzz.bindump"))
        Walk(loader);
    free(copy);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    TryDump(data, size);
    if (size >= 16) {
        std::vector<uint8_t> repaired(data, data + size);
        const uint32_t magic = CTextureDeclarationsLoader::Magic;
        memcpy(repaired.data(), &magic, 4);
        TryDump(repaired.data(), repaired.size());
    }
    CTextureDeclarationsLoader xml(&NoFiles());
    std::vector<uint8_t> bulk;
    if (xml.ConvertXml(reinterpret_cast<const char*>(data), size, "fuzz.xml", bulk)) {
        if (!CTextureDeclarationsLoader::Check(bulk.data(), bulk.size(), "converted"))
            __builtin_trap();  // what the converter makes, the game must accept
        CTextureDeclarationsLoader converted;
        if (converted.LoadFromMemory(bulk.data(), bulk.size(), "converted"))
            Walk(converted);
    }
    return 0;
}
