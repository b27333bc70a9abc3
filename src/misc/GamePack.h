#pragma once
// Read-only game content by path: the archive game.pack, mapped once and read in place,
// then loose files, each source with a language overlay under "!langs/<language>/".
#include "misc/String.h"

#include <bit>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>

namespace ox::misc {

static_assert(std::endian::native == std::endian::little, "packs are read in place as little-endian");

// "OXP" and the format revision 1.
constexpr uint32_t kPackMagic = 0x0150584F;
constexpr size_t kPackPathCapacity = 112;
constexpr const char* kLanguagesFolder = "!langs";

// The start of a pack: magic, entry count, and the size of the whole file.
struct PackHeader {
    uint32_t magic;
    uint32_t count;
    uint32_t totalSize;
};
static_assert(sizeof(PackHeader) == 12);

// One table entry. `path` is a fixed string in its memory form; `offset` points behind the
// u32 that repeats `size` in front of the file's bytes.
struct PackEntry {
    StringA112 path;
    uint32_t size;
    uint32_t offset;
};
static_assert(sizeof(PackEntry) == 128);
static_assert(alignof(PackEntry) == 4);

// Where a pack reads from. Tests and tools inject these; the game uses the defaults.
struct GamePackConfig {
    // Folder of the pack and of the loose files; empty for the working folder.
    std::string folder;
    // The pack file, relative to `folder` unless absolute.
    std::string packFile = "game.pack";
    // The overlay language: unset asks the user's environment, empty means none.
    std::optional<std::string> language;
};

class CGamePack {
public:
    using EnumCallback = void (*)(void* user, const char* path);

    CGamePack();
    explicit CGamePack(GamePackConfig config);
    // Reads a pack image held by the caller, which must outlive this object and be
    // aligned to 4 bytes. It is not copied.
    CGamePack(const void* image, size_t size, GamePackConfig config);
    ~CGamePack();
    CGamePack(const CGamePack&) = delete;
    CGamePack& operator=(const CGamePack&) = delete;

    // The file exists, by the same rules as Open (an empty loose file counts here).
    bool Access(const char* path) const;
    // A loose file of this path (or its language version) lies beside the pack.
    bool IsLooseFile(const char* path) const;
    // A read-only pointer to the whole file and its size, or null. Tried in this order:
    // the overlay in the pack, the pack, the loose overlay file, the loose file.
    // `size` may be null. Every pointer must be given back with Close.
    const void* Open(const char* path, unsigned* size = nullptr);
    void Close(const void* pointer);
    // The size of what Open returned.
    unsigned GetSize(const void* pointer) const;
    // The path resolves to a language version.
    bool IsLocalized(const char* path) const;
    // Calls `callback(user, path)` for each file under `_prefix` and returns their number:
    // with a pack, the entries that begin with the prefix (all of them for ""); without
    // one, the plain files directly in that folder.
    unsigned EnumFiles(const char* _prefix, EnumCallback callback, void* user) const;

    bool HasPack() const { return m_Data != nullptr; }
    bool HasLanguage() const { return m_HasLanguage; }
    bool HasOverlay() const { return m_LanguageBegin != nullptr; }
    const char* GetLanguage() const { return m_Language; }
    // Why there is no pack: missing, or the check that refused it. Empty with a pack.
    const std::string& PackError() const { return m_PackError; }

    // The table, for tools.
    uint32_t EntryCount() const { return HasPack() ? Header().count : 0; }
    const PackEntry* Entries() const;
    const void* EntryData(const PackEntry& entry) const { return m_Data + entry.offset; }

private:
    void SetNames(const GamePackConfig& config);
    void Load(GamePackConfig& config);
    bool CheckPack();
    void FindOverlay();
    const PackHeader& Header() const { return *reinterpret_cast<const PackHeader*>(m_Data); }
    bool InsidePack(const void* pointer) const;
    // The entry of exactly `path` in [begin, end), or null; one whose size word does not
    // repeat its size is logged and not found.
    const PackEntry* Search(const PackEntry* begin, const PackEntry* end, const char* path) const;
    const PackEntry* SearchOverlay(const char* path) const;
    const PackEntry* SearchPack(const char* path) const;
    std::string LoosePath(const char* path) const;
    std::string LooseOverlayPath(const char* path) const;

    char m_Language[64] = {};
    bool m_HasLanguage = false;
    const PackEntry* m_LanguageBegin = nullptr;
    const PackEntry* m_LanguageEnd = nullptr;
    const uint8_t* m_Data = nullptr;
    size_t m_Size = 0;
    bool m_Mapped = false;
    std::string m_Folder;
    std::string m_PackName;
    std::string m_PackError;
};

// The process-wide pack: game.pack in the working folder and the user's language. Made at
// first use and never destroyed.
struct g_GamePack {
    static CGamePack& Instance();
};

// The halving search of a sorted table for the entries that begin with `prefix`. Returns
// their number and sets [*first, *last); calls `callback` for each if it is given.
unsigned SearchPrefix(const PackEntry* begin, const PackEntry* end, const char* prefix,
                      const PackEntry** first, const PackEntry** last,
                      CGamePack::EnumCallback callback = nullptr, void* user = nullptr);

} // namespace ox::misc
