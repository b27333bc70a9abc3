#pragma once
// Surfaces and textures as the renderer draws them. A surface is one device texture with
// an optional system-memory copy of its pixels (0xAARRGGBB words, top-down); a texture is
// a light handle on a surface with a description: the frames (parts) as rectangles of the
// surface and the animation data.
#include "graphics/RenderBackend.h"
#include "misc/String.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace ox::graphics {

struct UVRect {
    float u1 = 0, v1 = 0, u2 = 0, v2 = 0;
    bool operator==(const UVRect& o) const { return u1 == o.u1 && v1 == o.v1 && u2 == o.u2 && v2 == o.v2; }
};
static_assert(sizeof(UVRect) == 16);

// The description of an image in the layout of the texture declarations: 220 bytes, then
// `parts_amount` UVRects.
struct TextureDesc {
    static constexpr unsigned MaximumFrames = 32;
    static constexpr uint32_t FlagStatic = 2;

    misc::StringA88 id;
    uint32_t anim_type = 0;
    uint32_t flags = 0;
    uint16_t frame_width = 0;
    uint16_t frame_height = 0;
    uint16_t frame_delays[MaximumFrames];
    int8_t frame_map[MaximumFrames];
    uint32_t group = 0;
    uint32_t surface = 0;
    uint8_t cols = 0;
    uint8_t rows = 0;
    uint8_t frame_delays_count = 0;
    uint8_t frame_map_length = 0;
    uint16_t total_time = 0;
    uint16_t parts_amount = 0;

    UVRect* Parts() { return reinterpret_cast<UVRect*>(this + 1); }
    const UVRect* Parts() const { return reinterpret_cast<const UVRect*>(this + 1); }
    size_t ByteSize() const { return sizeof(TextureDesc) + parts_amount * sizeof(UVRect); }
};
static_assert(sizeof(TextureDesc) == 220);
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
static_assert(offsetof(TextureDesc, anim_type) == 96 && offsetof(TextureDesc, frame_width) == 104 &&
              offsetof(TextureDesc, frame_delays) == 108 && offsetof(TextureDesc, frame_map) == 172 &&
              offsetof(TextureDesc, group) == 204 && offsetof(TextureDesc, cols) == 212 &&
              offsetof(TextureDesc, total_time) == 216 && offsetof(TextureDesc, parts_amount) == 218);
#pragma GCC diagnostic pop

class CSurface {
public:
    enum Flags : uint8_t { FlagLoadOnDemand = 2, FlagUnloaded = 4, FlagRenderTarget = 8, FlagNearest = 16 };

    // `fileName` must outlive the surface; a dynamic surface has the empty name.
    CSurface(uint16_t width, uint16_t height, uint8_t flags = 0, uint8_t internalFormat = FormatA8R8G8B8,
             const char* fileName = "");
    ~CSurface();
    CSurface(const CSurface&) = delete;
    CSurface& operator=(const CSurface&) = delete;

    bool IsValid() const { return Surface != nullptr; }
    uint16_t GetWidth() const { return Width; }
    uint16_t GetHeight() const { return Height; }
    uint8_t GetFlags() const { return m_Flags; }
    void SetFlags(uint8_t flags) { m_Flags = flags; }
    uint8_t GetInternalFormat() const { return m_InternalFormat; }
    uint32_t* GetBuffer() const { return m_Buffer.get(); }
    unsigned GetBytesInVMem() const { return m_BytesInVMem; }
    const char* GetFileName() const;
    uint16_t GetRefCount() const { return RefCount; }
    void AddRef() { ++RefCount; }
    void Release();

    // The one way to the device texture: made on first use (and after a device loss).
    CDeviceTexture* GetD3DTexture();
    // Makes an empty device texture of the surface's size, format and kind.
    bool CreateDeviceTexture();
    // Drops the device texture and the system-memory copy.
    void ReleaseD3D();
    // Drops the device texture of an on-demand surface until its next use.
    void Unload();

    // The system-memory copy: zeroed, read from the device, written to the device, dropped.
    void CreateBuffer();
    void LoadBuffer();
    void CommitBits();
    void DropBuffer() { m_Buffer.reset(); }
    bool LoadBits(const void* _data, size_t _data_size, unsigned _width, unsigned _height,
                  uint8_t _internal_format);

    // Who loads a surface that is not in video memory (the texture manager); without one
    // an empty device texture is made.
    using Loader = bool (*)(CSurface& surface);
    static void SetLoader(Loader loader);

private:
    CDeviceTexture* Surface = nullptr;
    std::unique_ptr<uint32_t[]> m_Buffer;
    uint16_t Width;
    uint16_t Height;
    uint16_t RefCount = 0;
    uint8_t m_Flags;
    uint8_t m_InternalFormat;
    unsigned m_BytesInVMem = 0;
    const char* m_FileName;
};

class CTexture {
public:
    CTexture() = default;
    // A one-frame texture covering the whole surface; the description belongs to the handle.
    explicit CTexture(CSurface* surface);
    // Frames given as parts of the surface, each of the given pixel size.
    CTexture(CSurface* surface, const std::vector<UVRect>& parts, uint16_t frameWidth, uint16_t frameHeight);
    // A description from the declarations data: shared, never freed here.
    CTexture(CSurface* surface, const TextureDesc* staticDesc);
    CTexture(const CTexture& other);
    CTexture& operator=(const CTexture& other);
    ~CTexture();

    CSurface* GetSurface() const { return m_Surface; }
    const TextureDesc* GetData() const { return m_Data; }
    // The first part, or all zeros without one.
    UVRect GetSurfaceRect() const;
    // A frame at or past the number of parts takes the first part.
    UVRect GetFrameSurfaceRect(unsigned frame) const;
    unsigned GetFramesCount() const;
    // The size of one frame in pixels.
    uint16_t GetWidth() const;
    uint16_t GetHeight() const;
    bool IsAnimated() const;
    unsigned EnumFrames() const;

private:
    void Assign(CSurface* surface, const TextureDesc* data);
    void Free();

    CSurface* m_Surface = nullptr;
    TextureDesc* m_Data = nullptr;
};

} // namespace ox::graphics
