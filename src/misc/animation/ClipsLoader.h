#pragma once
// All clips of the game in one read-only block of fixed-layout records, the bulk: used in
// place from properties/clips.bindump, else built from properties/clips.xml, else from
// every clips/*.xml but clips/groups.xml. Clip objects point into the block.
#include "misc/animation/ClipFormat.h"

#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace ox::misc::anim {

constexpr const char* kClipsBindump = "properties/clips.bindump";
constexpr const char* kClipsXml = "properties/clips.xml";
constexpr const char* kClipsFolder = "clips/";
constexpr const char* kClipGroupsXml = "clips/groups.xml";

// Clip records by id, each a whole record (end mark included) in 32-bit words.
using ClipRecords = std::map<std::string, std::vector<uint32_t>>;

// Converts one XML document (one `Clip` element or several) into clip records, added to
// `clips`; a later clip of the same id replaces the earlier one. What cannot be used is
// logged on channel "anim" with the clip's id and left out. False when the document
// cannot be parsed at all.
bool ConvertClipsXml(const char* xml, size_t size, const char* name, ClipRecords& clips);
// The bulk of the records: header, the table sorted by id, the records in the same order.
std::vector<uint32_t> BuildClipsBulk(const ClipRecords& clips);

class CClipsLoader {
public:
    // Reads through `pack`, or through the process-wide game pack when it is null.
    explicit CClipsLoader(CGamePack* pack = nullptr);
    ~CClipsLoader();
    CClipsLoader(const CClipsLoader&) = delete;
    CClipsLoader& operator=(const CClipsLoader&) = delete;

    // The process-wide loader, made at first use and never destroyed.
    static CClipsLoader& Instance();

    // Drops the clips held so far and reads them again. A dump of another format shows a
    // message and leaves no clips; every problem is logged on channel "anim" and the game
    // goes on with the clips that could be used. False only when a bulk built from XML
    // fails its own checks.
    bool Load();
    // Uses a bulk held by the caller (aligned to 4 bytes, outliving the loader) in place.
    // False when its header or table cannot be used; a broken clip is logged and left out.
    bool LoadFromMemory(const void* data, size_t size, const char* name);
    // Converts XML documents as Load does and keeps the bulk.
    bool LoadRecords(const ClipRecords& clips);

    // The clip of an id, or null (also for a clip the checks left out).
    const ClipRecord* FindClip(const char* id) const;
    // Writes a bulk built from XML to properties/clips.bindump in the working folder.
    bool SaveBindump() const;

    bool IsLoaded() const { return m_Data != nullptr; }
    bool IsBuiltFromXml() const { return m_BuiltFromXml; }
    const uint8_t* Data() const { return m_Data; }
    size_t DataSize() const { return m_Size; }
    uint32_t Count() const;
    const ClipTableEntry* Table() const;
    // Whether the clip at a table index passed the checks.
    bool IsUsable(uint32_t index) const { return index < m_Usable.size() && m_Usable[index]; }

private:
    void Release();
    bool LoadXml();
    // Checks header and table, then each clip; fills m_Usable.
    bool Check(const uint8_t* data, size_t size, const char* name);

    CGamePack* m_Pack;
    const uint8_t* m_Data = nullptr;
    size_t m_Size = 0;
    const void* m_File = nullptr;  // what the pack gave, to be closed
    std::vector<uint32_t> m_Owned;  // a bulk built here, or a copy of an unaligned dump
    std::vector<bool> m_Usable;
    bool m_BuiltFromXml = false;
};

// Checks one clip record that lies in `size` bytes at `clip`: its size, its id, every
// object's size and strings. `why` gets the reason of a refusal.
bool CheckClipRecord(const ClipRecord* clip, size_t size, std::string& why);

} // namespace ox::misc::anim
