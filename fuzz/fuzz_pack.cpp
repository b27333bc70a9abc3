// Feeds arbitrary bytes to the game pack as its image: the checks on load must refuse
// whatever would lead a search, an enumeration or a read outside the image. Each input
// is tried as it is and once more with the header and the entry hashes made consistent,
// so that the later checks and the searches are reached too.
#include "misc/GamePack.h"

#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

using namespace ox::misc;

namespace {

void Exercise(const uint8_t* image, size_t size, const char* language)
{
    // An exact-size copy, so that the address sanitizer sees any read past the end.
    std::unique_ptr<uint8_t[]> copy(new uint8_t[size ? size : 1]);
    if (size)
        memcpy(copy.get(), image, size);
    GamePackConfig config;
    config.folder = "/nonexistent-oxfuzz";
    config.language = language;
    CGamePack pack(copy.get(), size, config);
    if (!pack.HasPack())
        return;

    std::vector<std::string> paths;
    pack.EnumFiles("", [](void* user, const char* path) {
        static_cast<std::vector<std::string>*>(user)->push_back(path);
    }, &paths);
    if (paths.size() != pack.EntryCount())
        __builtin_trap();

    unsigned sum = 0;
    for (const std::string& path : paths) {
        for (const std::string& name : {path, path.substr(0, path.size() / 2), path + "x"}) {
            unsigned length = 0;
            const void* data = pack.Open(name.c_str(), &length);
            if (data) {
                const auto* bytes = static_cast<const uint8_t*>(data);
                for (unsigned i = 0; i < length; ++i)
                    sum += bytes[i];
                if (pack.GetSize(data) != length)
                    __builtin_trap();
                pack.Close(data);
            }
            pack.IsLocalized(name.c_str());
            pack.Access(name.c_str());
        }
        pack.EnumFiles(path.substr(0, 3).c_str(), [](void*, const char*) {}, nullptr);
    }
    pack.EnumFiles("!langs/", [](void*, const char*) {}, nullptr);
    volatile unsigned sink = sum;
    (void)sink;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const char* language = size > 0 && (data[size - 1] & 1) ? "en-US" : "en";
    Exercise(data, size, language);

    if (size < sizeof(PackHeader))
        return 0;
    std::vector<uint8_t> repaired(data, data + size);
    PackHeader header;
    memcpy(&header, repaired.data(), sizeof(header));
    header.magic = kPackMagic;
    header.totalSize = static_cast<uint32_t>(size);
    memcpy(repaired.data(), &header, sizeof(header));
    for (uint64_t i = 0; i < header.count && sizeof(PackHeader) + (i + 1) * sizeof(PackEntry) <= size; ++i) {
        uint8_t* entry = repaired.data() + sizeof(PackHeader) + i * sizeof(PackEntry);
        uint16_t length;
        memcpy(&length, entry, 2);
        if (length < kPackPathCapacity) {
            uint16_t hash = CalcHash(entry + 8, length);
            memcpy(entry + 4, &hash, 2);
        }
    }
    Exercise(repaired.data(), size, language);
    return 0;
}
