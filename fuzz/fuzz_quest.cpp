// Feeds arbitrary bytes to the quest data: as a quest block (every level it names is built,
// and described as oxdump show does) and as quest.xml (compiled; a level of what the compiler
// makes must be read to its end, with no part described as damaged).
#include "core/Settings.h"
#include "graphics/Image.h"
#include "quest/Level.h"
#include "quest/QuestData.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

using namespace qe;

namespace {

// The ids of the level blocks, read by the same rule the builder uses (a copy, so reads past
// the end are the sanitizer's to see).
std::vector<std::string> LevelIds(const uint8_t* data, size_t size)
{
    std::vector<std::string> ids;
    size_t at = 4;
    while (at + sizeof(dump::LevelHeader) <= size && ids.size() < 8) {
        dump::LevelHeader header;
        memcpy(static_cast<void*>(&header), data + at, sizeof(header));
        if (header.id.size < ox::misc::StringA88::kCapacity)
            ids.emplace_back(header.id.m_Data, strnlen(header.id.m_Data, header.id.size));
        if (header.size < sizeof(header))
            break;
        at += header.size;
    }
    return ids;
}

void TryBlock(const uint8_t* data, size_t size)
{
    std::vector<uint8_t> copy(data, data + size);
    CQuestData quest;
    quest.SetBlock(copy);
    for (const std::string& id : LevelIds(quest.GetData(), quest.GetSize()))
        LevelPtrT level(quest.CreateLevel(id.c_str()));
    (void)dump::Describe(quest.GetData(), quest.GetSize());
}

void TryXml(const uint8_t* data, size_t size)
{
    ox::core::CSettings settings;
    if (!settings.LoadXmlFromMemory(reinterpret_cast<const char*>(data), size, "fuzz.xml"))
        return;
    const std::vector<uint8_t> block = dump::Compile(settings.GetChild("Quest"), "fuzz.xml");
    // What the compiler writes, the builder reads to its end.
    bool intact = false;
    (void)dump::Describe(block.data(), block.size(), &intact);
    if (!intact)
        __builtin_trap();
    TryBlock(block.data(), block.size());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    ox::graphics::CImage::SetTextureLookup([](const char*) -> const ox::graphics::CTexture* { return nullptr; });
    TryBlock(data, size);
    if (size >= 4) {
        // Once more with the magic set, so that the walk behind it is reached.
        std::vector<uint8_t> magic(data, data + size);
        const uint32_t word = dump::kMagic;
        memcpy(magic.data(), &word, 4);
        TryBlock(magic.data(), magic.size());
    }
    TryXml(data, size);
    return 0;
}
