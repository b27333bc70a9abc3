#pragma once
// The alpha-mask store: whether a texture's pixel is solid, answered from run-length masks
// of one bit a pixel in properties/texturesalpha.bindump, read in place. Hit tests need no
// pixel buffer where a mask exists.
#include "misc/String.h"

#include <cstddef>
#include <cstdint>

namespace ox::misc {
class CGamePack;
}
namespace ox::graphics {
class CTexture;
}

namespace ox::core {

// 'A', 'P', 'H' and the revision 1.
constexpr uint32_t g_Magick = 0x01485041;
constexpr const char* kTexturesAlphaFile = "properties/texturesalpha.bindump";

struct TexturesAlphaHeader {
    uint32_t magick;
    uint32_t count;
};
static_assert(sizeof(TexturesAlphaHeader) == 8);

// One mask; the records follow the header, sorted by id.
struct TextureAlphaDesc {
    misc::StringA88 id;
    uint16_t width;
    uint16_t height;
    uint32_t offset;  // of the run data, from the start of the file
    uint32_t size;    // of the run data, in bytes
    uint8_t uniform;  // not 0: every pixel gives `uniform_value`
    uint8_t uniform_value;
    uint8_t order;    // 1: row by row; anything else: column by column
    uint8_t unused;
};
static_assert(sizeof(TextureAlphaDesc) == 112);
// Byte offsets of the fields in a record, as the builder writes them.
enum TextureAlphaDescOffset : size_t {
    kDescWidth = 96,
    kDescHeight = 98,
    kDescOffset = 100,
    kDescSize = 104,
    kDescUniform = 108,
    kDescUniformValue = 109,
    kDescOrder = 110,
};
// The id string makes the record a non-standard-layout type; its layout is still fixed.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
static_assert(offsetof(TextureAlphaDesc, width) == kDescWidth && offsetof(TextureAlphaDesc, height) == kDescHeight &&
              offsetof(TextureAlphaDesc, offset) == kDescOffset && offsetof(TextureAlphaDesc, size) == kDescSize &&
              offsetof(TextureAlphaDesc, uniform) == kDescUniform &&
              offsetof(TextureAlphaDesc, uniform_value) == kDescUniformValue &&
              offsetof(TextureAlphaDesc, order) == kDescOrder);
#pragma GCC diagnostic pop

// A run: bits 0..14 its length in pixels, bit 15 the answer.
constexpr uint16_t kRunValueBit = 0x8000;
constexpr uint16_t kMaxRunLength = 0x7FFF;

class CTexturesAlpha {
public:
    // Reads through `pack`, or through the process-wide game pack when it is null.
    explicit CTexturesAlpha(misc::CGamePack* pack = nullptr);
    ~CTexturesAlpha();
    CTexturesAlpha(const CTexturesAlpha&) = delete;
    CTexturesAlpha& operator=(const CTexturesAlpha&) = delete;

    // Opens properties/texturesalpha.bindump and keeps it. A missing file leaves the store
    // unavailable; a bad one is logged and released.
    bool Load();
    // Uses a block held by the caller, which must outlive the store (tools, tests).
    bool LoadFromMemory(const void* data, size_t size, const char* name = kTexturesAlphaFile);
    bool IsAvailable() const { return m_Header != nullptr; }

    // The mask of a texture id, or null (also when the store is unavailable).
    const TextureAlphaDesc* Find(const char* id) const;
    bool HasMask(const char* id) const { return Find(id) != nullptr; }
    uint32_t Count() const { return m_Header ? m_Header->count : 0; }
    // The Count() records in id order, in place (null when unavailable).
    const TextureAlphaDesc* Records() const { return m_Records; }

    // Whether the pixel (x, y) of the texture is solid. The store must be available and
    // hold the id (contract failures otherwise). Points outside the image, and points the
    // runs do not reach, are not solid.
    bool IsOpaque(const char* _from, int x, int y) const;
    bool IsOpaque(const misc::StringA88& id, int x, int y) const { return IsOpaque(id.c_str(), x, y); }
    // The same for the texture's id (its description must exist).
    bool IsOpaque(const graphics::CTexture& texture, int x, int y) const;
    // The same for a mask Find gave (no search).
    bool IsOpaque(const TextureAlphaDesc& mask, int x, int y) const;

private:
    void Release();
    // Checks the whole block before it is used: header, record ids, order, run ranges.
    bool Check(const uint8_t* data, size_t size, const char* name) const;

    misc::CGamePack* m_Pack;
    const void* m_File = nullptr;  // the block opened through the pack, if any
    const TexturesAlphaHeader* m_Header = nullptr;
    const TextureAlphaDesc* m_Records = nullptr;
    size_t m_Size = 0;
};

} // namespace ox::core
