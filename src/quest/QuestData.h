#pragma once
// The compiled quest: properties/quest.bindump from the game pack, used in place, or the same
// block compiled in memory from properties/quest.xml. Records lie end to end, little-endian;
// the stored sizes of levels, scenes and groups let CreateLevel skip whole blocks.
#include "misc/String.h"

#include <bit>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ox::core {
class CSettingsGroup;
}
namespace ox::misc {
class CGamePack;
}

namespace qe {

class CLevel;

static_assert(std::endian::native == std::endian::little, "the quest block is read in place as little-endian");

namespace dump {

constexpr uint32_t kMagic = 0xE9BCA601;
enum Kind : uint16_t { KindGroup = 1, KindImage = 2, KindClip = 3, KindArea = 4 };

// Offsets of the fields the compiler fills in after the record's contents are written.
constexpr size_t kLevelSceneCountAt = 100, kLevelSizeAt = 104;
constexpr size_t kSceneSizeAt = 120, kSceneObjectCountAt = 124, kSceneAreaCountAt = 126;
constexpr size_t kObjectKindAt = 110;
constexpr size_t kGroupSizeAt = 0, kGroupCountAt = 4;
constexpr size_t kAreaPointCountAt = 20;

// Fixed strings make the records non-standard-layout; their layout is still plain.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"

// Each record is followed by its strings, each zero-padded to a multiple of 4 bytes; a
// stored length of 0 is an empty string.
struct LevelHeader {
    ox::misc::StringA88 id;
    uint16_t s1Length;
    uint16_t s2Length;
    uint32_t sceneCount;
    uint32_t size; // the whole level, scenes included
};
static_assert(sizeof(LevelHeader) == 108 && offsetof(LevelHeader, sceneCount) == kLevelSceneCountAt && offsetof(LevelHeader, size) == kLevelSizeAt);

struct SceneHeader {
    ox::misc::StringA88 id;
    uint32_t flags;
    float size[2];
    float offset[2];
    uint32_t scriptLength;
    uint32_t sceneSize; // the whole scene, objects and areas included
    uint16_t objectCount;
    uint16_t areaCount;
};
static_assert(sizeof(SceneHeader) == 128 && offsetof(SceneHeader, flags) == 96 && offsetof(SceneHeader, size) == 100 &&
              offsetof(SceneHeader, offset) == 108 && offsetof(SceneHeader, scriptLength) == 116 &&
              offsetof(SceneHeader, sceneSize) == kSceneSizeAt && offsetof(SceneHeader, objectCount) == kSceneObjectCountAt &&
              offsetof(SceneHeader, areaCount) == kSceneAreaCountAt);

// Hint, then the four scripts.
struct ObjectHeader {
    ox::misc::StringA88 id;
    uint32_t objectFlags;
    uint16_t scriptLength[4];
    uint16_t hintLength;
    uint16_t kind;
};
static_assert(sizeof(ObjectHeader) == 112 && offsetof(ObjectHeader, objectFlags) == 96 &&
              offsetof(ObjectHeader, scriptLength) == 100 && offsetof(ObjectHeader, hintLength) == 108 &&
              offsetof(ObjectHeader, kind) == kObjectKindAt);

struct ImageRecord {
    ox::misc::StringA88 imageId;
    int16_t color[4]; // red, green, blue, alpha
    float offset[2];
    float size[2];
    float angle;
};
static_assert(sizeof(ImageRecord) == 124 && offsetof(ImageRecord, color) == 96 && offsetof(ImageRecord, offset) == 104 &&
              offsetof(ImageRecord, size) == 112 && offsetof(ImageRecord, angle) == 120);

struct ClipRecord {
    ox::misc::StringA88 clipId;
    int16_t color[4];
    float offset[2];
    float size[2];
    float angle;
    uint8_t useAlpha;
    uint8_t zero[3];
};
static_assert(sizeof(ClipRecord) == 128 && offsetof(ClipRecord, angle) == 120 && offsetof(ClipRecord, useAlpha) == 124);

// Followed by its children, each an object header with an image or clip record.
struct GroupRecord {
    uint32_t size; // from this record to the end of the last child
    uint32_t count;
};
static_assert(sizeof(GroupRecord) == 8 && offsetof(GroupRecord, size) == kGroupSizeAt && offsetof(GroupRecord, count) == kGroupCountAt);

// Followed by the points, two floats each. Offset, size and angle are carried, unused.
struct AreaRecord {
    float offset[2];
    float size[2];
    float angle;
    uint32_t pointCount;
};
static_assert(sizeof(AreaRecord) == 24 && offsetof(AreaRecord, pointCount) == kAreaPointCountAt);

#pragma GCC diagnostic pop

// The stored length of a text: a multiple of 4 that leaves at least one zero behind it.
inline uint32_t StoredLength(size_t length) { return length == 0 ? 0 : static_cast<uint32_t>((length & ~size_t(3)) + 4); }

// Compiles the children of a Quest element (the root of quest.xml) into a whole block,
// magic included. `file` names the document in log lines.
std::vector<uint8_t> Compile(const ox::core::CSettingsGroup& quest, const char* file);

// The level `id` built from a block (the first of that id), or null. Used by CQuestData.
CLevel* BuildLevel(const uint8_t* data, size_t size, const char* id);

// One line per level and scene of a block (ids, counts, sizes); problems are described too,
// and `intact` (if given) says whether there were none.
std::string Describe(const void* data, size_t size, bool* intact = nullptr);

} // namespace dump

class CQuestData {
public:
    static constexpr const char* kBindump = "properties/quest.bindump";
    static constexpr const char* kXml = "properties/quest.xml";

    // Reads through `pack`, or the process-wide pack when null.
    explicit CQuestData(ox::misc::CGamePack* pack = nullptr) : m_Pack(pack) {}
    ~CQuestData() { Release(); }
    CQuestData(const CQuestData&) = delete;
    CQuestData& operator=(const CQuestData&) = delete;

    // The pack's quest.bindump (kept in place) when it has one with the right magic; else
    // quest.xml compiled in memory. A wrong magic is shown in a box, and no level exists.
    void Load();
    // Takes a compiled block (tests, tools).
    void SetBlock(std::vector<uint8_t> block);
    // A new level with reference count 0, or null for an unknown id or no block. A damaged
    // block is logged, naming the level or scene, and builds what can be read.
    CLevel* CreateLevel(const char* id) const;

    const uint8_t* GetData() const { return m_Data; }
    size_t GetSize() const { return m_Size; }
    bool IsOwned() const { return m_Owned; }

private:
    void Release();
    ox::misc::CGamePack& Pack() const;

    ox::misc::CGamePack* m_Pack;
    const uint8_t* m_Data = nullptr;
    size_t m_Size = 0;
    bool m_Owned = false;
    std::vector<uint8_t> m_Block;
};

// The process-wide quest data, loaded by the application at the end of its start.
struct g_QuestData {
    static CQuestData& Instance();
};

} // namespace qe
