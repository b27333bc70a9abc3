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

class CSurface;

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
    enum AnimType : uint32_t {
        AnimNone = 0,
        AnimOnce = 1,
        AnimLoop = 2,
        AnimPingPong = 3,
        AnimBackwardLoop = 4,
        AnimBackwardPingPong = 5,
    };

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

// Who loads surfaces and counts video memory (the texture manager). Without one, a surface
// that is not in video memory gets an empty device texture and nothing is counted.
class ISurfaceManager {
public:
    virtual ~ISurfaceManager() = default;
    // Makes the device texture of a surface that has none and fills it.
    virtual bool LoadSurface(CSurface* surface) = 0;
    virtual void AddVideoMemory(unsigned bytes) = 0;
    virtual void RemoveVideoMemory(unsigned bytes) = 0;
};

// The application's frame number. A surface moves to the head of the MRU list at most once
// per frame; the application counts frames from 1.
uint32_t GetFrameNumber();
void SetFrameNumber(uint32_t frame);

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
    uint32_t GetLastUsedFrame() const { return m_LastUsedFrame; }
    // The device texture as it is, without loading or touching (null when not in memory).
    CDeviceTexture* PeekD3DTexture() const { return Surface; }

    // The one way to the device texture: loaded on first use (and after a drop or a device
    // loss); the surface moves to the head of the MRU list once per frame.
    CDeviceTexture* GetD3DTexture();
    // Makes an empty device texture of the surface's size, format and kind, and counts it.
    bool CreateDeviceTexture();
    // Drops the device texture and the system-memory copy, and leaves the MRU list.
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

    static void SetManager(ISurfaceManager* manager);
    static ISurfaceManager* GetManager();

    // The MRU list of surfaces in video memory: the tail is the least recently used, and
    // next points toward the head.
    static CSurface* GetMRUTail() { return s_MRUTail; }
    static CSurface* GetMRUHead() { return s_MRUHead; }
    CSurface* GetNextInMRUList() const { return m_NextInMRUList; }
    CSurface* GetPrevInMRUList() const { return m_PrevInMRUList; }
    bool IsInMRUList() const { return m_PrevInMRUList || m_NextInMRUList || s_MRUHead == this; }

private:
    void MoveToMRUHead();
    void RemoveFromMRUList();

    CDeviceTexture* Surface = nullptr;
    std::unique_ptr<uint32_t[]> m_Buffer;
    uint16_t Width;
    uint16_t Height;
    uint16_t RefCount = 0;
    uint8_t m_Flags;
    uint8_t m_InternalFormat;
    unsigned m_BytesInVMem = 0;
    uint32_t m_LastUsedFrame = 0;
    const char* m_FileName;
    CSurface* m_NextInMRUList = nullptr;
    CSurface* m_PrevInMRUList = nullptr;
    // The manager that counted m_BytesInVMem, so that the same one is paid back.
    ISurfaceManager* m_CountedBy = nullptr;

    static CSurface* s_MRUHead;
    static CSurface* s_MRUTail;
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

    // The frame shown at `ms` into the animation; -1 when none is (drawn as the first part).
    int GetFrameByTime(int ms) const;
    // The time at which frame-map entry `index` starts; 0 at or past the map's end.
    unsigned GetTimeByFrame(unsigned index) const;
    // The length of one pass of the animation, milliseconds.
    unsigned GetAnimTime() const;

    // The surface's pixel copy; each does nothing without a surface (CreateBuffer also
    // nothing when a copy exists).
    void CreateBuffer();
    void LoadBuffer();
    void DropBuffer();
    void CommitBits();
    bool SurfaceIsBuffer() const { return m_Surface && m_Surface->GetBuffer(); }
    // A pixel of the copy, (x, y) inside the frame (-1: the first part); 0 without a
    // surface or copy, or outside the frame.
    uint32_t Pixel(int x, int y, int frame = -1) const;
    // Writes a pixel of the copy; false where reading would give 0 for want of a place.
    bool Pixel(int x, int y, uint32_t value, int frame);

private:
    uint32_t* PixelAddress(int x, int y, int frame) const;
    void Assign(CSurface* surface, const TextureDesc* data);
    void Free();

    CSurface* m_Surface = nullptr;
    TextureDesc* m_Data = nullptr;
};

} // namespace ox::graphics
