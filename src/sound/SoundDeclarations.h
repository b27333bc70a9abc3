#pragma once
// The sound declarations: one fixed record per declared sound, in a block read in place.
// properties/sounds.bindump is that block as a file; without it the block is made from
// properties/sounds.xml.
#include "misc/String.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace ox::sound {

constexpr const char* kSoundsBindump = "properties/sounds.bindump";
constexpr const char* kSoundsXml = "properties/sounds.xml";

struct SoundRecord {
    misc::StringA120 file;          // path in the pack: lower case, forward slashes
    misc::StringA88 id;
    misc::StringA88 group_template; // the volume group; may be empty
    float balance;                  // -1 to 1
    float volume;                   // 0 to 100
    int32_t priority;
    int32_t repeat;                 // -1 without end
    int32_t max_concurrent_sound_play;    // negative: no limit
    uint32_t flags;                 // bit 0: load_on_demand
    float concurrent_sound_play_delay;    // milliseconds; negative: none
    float speed;
};
static_assert(sizeof(SoundRecord) == 352);
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
static_assert(offsetof(SoundRecord, id) == 128 && offsetof(SoundRecord, group_template) == 224 &&
              offsetof(SoundRecord, balance) == 320 && offsetof(SoundRecord, volume) == 324 &&
              offsetof(SoundRecord, priority) == 328 && offsetof(SoundRecord, repeat) == 332 &&
              offsetof(SoundRecord, max_concurrent_sound_play) == 336 && offsetof(SoundRecord, flags) == 340 &&
              offsetof(SoundRecord, concurrent_sound_play_delay) == 344 && offsetof(SoundRecord, speed) == 348);
#pragma GCC diagnostic pop

// The block: "SNDS", the count, the records in the order of the document.
struct SoundDeclarationsHeader {
    char magic[4];
    uint32_t count;
};
static_assert(sizeof(SoundDeclarationsHeader) == 8);

class SoundDeclarationsLoader {
public:
    static constexpr uint32_t FlagLoadOnDemand = 1;

    // Reads through `pack`, or through the process-wide game pack when it is null.
    explicit SoundDeclarationsLoader(misc::CGamePack* pack = nullptr);
    ~SoundDeclarationsLoader();
    SoundDeclarationsLoader(const SoundDeclarationsLoader&) = delete;
    SoundDeclarationsLoader& operator=(const SoundDeclarationsLoader&) = delete;

    // The dump from the pack, used in place, or else the converted XML. False (logged) when
    // neither exists or the one found cannot be used.
    bool Load();
    // The block; asserts that one is held.
    const SoundDeclarationsHeader* GetData() const;
    size_t GetSize() const { return m_Size; }
    uint32_t GetCount() const { return m_Data ? m_Data->count : 0; }
    const SoundRecord* GetRecords() const;
    // Writes a block made from the XML to properties/sounds.bindump in the working folder;
    // false for a dump read from the pack or a file that cannot be written.
    bool Save() const;

    // Converts a sounds.xml document into the block. Problems of single sounds are logged
    // with `name` and the line; false only when the document cannot be read at all.
    static bool ConvertXml(const char* xml, size_t size, const char* name, std::vector<uint8_t>& block);
    // Checks a block for use in place: the records fit, their strings end inside them.
    static bool Check(const void* data, size_t size, const char* name);

private:
    void Release();
    misc::CGamePack& Pack() const;

    misc::CGamePack* m_Pack;
    const SoundDeclarationsHeader* m_Data = nullptr;
    size_t m_Size = 0;
    bool m_Owned = false;
    const void* m_File = nullptr;     // what the pack gave, to be closed
    std::vector<uint32_t> m_Block;    // a converted document (words keep it aligned)
};

} // namespace ox::sound
