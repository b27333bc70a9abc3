#pragma once
// The texture declarations: every surface (an image file) and every texture (an image id
// with its parts of a surface and its animation) of the game, in one block read in place,
// the "bulk". properties/resources.bindump is that block as a file; without it the block is
// built from properties/resources.xml. TextureDeclarationsBindump.cpp reads and checks the
// bulk, TextureDeclarationsXml.cpp converts the XML form.
#include "graphics/Texture.h"
#include "misc/String.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace ox::core {

constexpr const char* kResourcesBindump = "properties/resources.bindump";
constexpr const char* kResourcesXml = "properties/resources.xml";

class CTextureDeclarationsLoader {
public:
    // "TEX" and the revision 1 in the top byte.
    static constexpr uint32_t Magic = 0x01584554;
    static constexpr uint32_t Revision = 1;
    // Room for one converted document, and for the parts of one image.
    static constexpr size_t ConversionBufferSize = 0x1000000;
    static constexpr size_t MaximumParts = 512;
    // Group flags.
    static constexpr uint32_t GroupLoadOnDemand = 1;
    static constexpr const char* LogChannel = "texman";

    using TextureDesc = graphics::TextureDesc;

    struct Header {
        uint32_t magic;
        uint32_t surfaces_amount;
        uint32_t groups_amount;
        uint32_t images_amount;
    };
    struct SurfaceRecord {
        misc::StringA120 path;
        uint16_t width;
        uint16_t height;
        uint16_t internal_format;
        uint16_t flags;  // CSurface::FlagNearest when the path holds "!nearest"
    };
    struct GroupRecord {
        misc::StringA88 id;
        uint32_t flags;
        uint32_t parent;  // offset of the enclosing group; 0 at top level
    };
    struct ImageEntry {
        misc::StringA88 id;
        uint32_t desc;   // offset of the description
        uint32_t group;  // offset of the group
    };

    // Reads through `pack`, or through the process-wide game pack when it is null.
    explicit CTextureDeclarationsLoader(misc::CGamePack* pack = nullptr);
    ~CTextureDeclarationsLoader();
    CTextureDeclarationsLoader(const CTextureDeclarationsLoader&) = delete;
    CTextureDeclarationsLoader& operator=(const CTextureDeclarationsLoader&) = delete;

    // properties/resources.bindump, or when there is none, properties/resources.xml. A bad
    // dump fails the load (no fall back); every failure is logged on channel "texman".
    bool Load();
    // Uses a bulk held by the caller in place after checking it; the block must outlive
    // the loader and be aligned to 4 bytes.
    bool LoadFromMemory(const void* data, size_t size, const char* name);
    // Converts a resources.xml document and keeps the result.
    bool LoadXml(const char* xml, size_t size, const char* name);

    // Converts a resources.xml document into a bulk (the bindump file's bytes). Image
    // sizes the document leaves out are read from the files through the pack given to
    // the loader.
    bool ConvertXml(const char* xml, size_t size, const char* name, std::vector<uint8_t>& bulk) const;

    bool IsLoaded() const { return m_Data != nullptr; }
    const Header* Data() const;
    size_t DataSize() const { return m_Size; }

    // The records, in place.
    const SurfaceRecord* Surfaces() const;
    const GroupRecord* Groups() const;
    const ImageEntry* Images() const;
    uint32_t SurfacesAmount() const { return m_Data ? m_Data->surfaces_amount : 0; }
    uint32_t GroupsAmount() const { return m_Data ? m_Data->groups_amount : 0; }
    uint32_t ImagesAmount() const { return m_Data ? m_Data->images_amount : 0; }
    const TextureDesc* Desc(const ImageEntry& image) const;
    // The index of the surface a description uses.
    uint32_t SurfaceIndex(const TextureDesc& desc) const;
    const GroupRecord* Group(uint32_t offset) const;

    // The byte order of ids and paths, in which the tables are sorted and searched.
    static int CompareIds(const char* a, const char* b) { return strcmp(a, b); }
    // The index of an image id in the table, or -1: a binary search in byte order.
    int FindImageIndex(const char* id) const;
    const ImageEntry* FindImage(const char* id) const;

    // Checks a bulk: header, record counts against the size, every string, offset and
    // count inside the block, the table sorted and the ids' hashes right. A refusal is
    // logged with `name` on channel "texman".
    static bool Check(const void* data, size_t size, const char* name);

private:
    void Release();
    misc::CGamePack& Pack() const;

    misc::CGamePack* m_Pack;
    const Header* m_Data = nullptr;
    size_t m_Size = 0;
    const void* m_File = nullptr;  // what the pack gave, to be closed
    std::vector<uint32_t> m_Owned;  // a converted document (words keep it aligned)
};

static_assert(sizeof(CTextureDeclarationsLoader::Header) == 16);
static_assert(sizeof(CTextureDeclarationsLoader::SurfaceRecord) == 136);
static_assert(sizeof(CTextureDeclarationsLoader::GroupRecord) == 104);
static_assert(sizeof(CTextureDeclarationsLoader::ImageEntry) == 104);
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
static_assert(offsetof(CTextureDeclarationsLoader::SurfaceRecord, width) == 128 &&
              offsetof(CTextureDeclarationsLoader::SurfaceRecord, height) == 130 &&
              offsetof(CTextureDeclarationsLoader::SurfaceRecord, internal_format) == 132 &&
              offsetof(CTextureDeclarationsLoader::SurfaceRecord, flags) == 134);
static_assert(offsetof(CTextureDeclarationsLoader::GroupRecord, flags) == 96 &&
              offsetof(CTextureDeclarationsLoader::GroupRecord, parent) == 100);
static_assert(offsetof(CTextureDeclarationsLoader::ImageEntry, desc) == 96 &&
              offsetof(CTextureDeclarationsLoader::ImageEntry, group) == 100);
static_assert(offsetof(graphics::TextureDesc, flags) == 100 && offsetof(graphics::TextureDesc, surface) == 208 &&
              offsetof(graphics::TextureDesc, rows) == 213 && offsetof(graphics::TextureDesc, frame_delays_count) == 214 &&
              offsetof(graphics::TextureDesc, frame_map_length) == 215);
#pragma GCC diagnostic pop

// The size and surface format of an image file read through `pack`: PVR containers by
// their header, PNG and JPEG by the decoder (format 1).
bool ReadImageDimensions(misc::CGamePack& pack, const char* path, uint32_t& width, uint32_t& height,
                         unsigned& internal_format);
// Whether a path names a PVR container (".pvr" or ".pvrlzo" at its end).
bool IsContainerPath(const char* path);

} // namespace ox::core
