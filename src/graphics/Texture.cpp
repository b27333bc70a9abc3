#include "graphics/Texture.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/RenderDevice.h"

#include <algorithm>
#include <cstring>

namespace ox::graphics {

namespace {

ISurfaceManager* g_Manager = nullptr;
uint32_t g_FrameNumber = 1;

TextureDesc* NewDesc(uint16_t parts)
{
    void* memory = ::operator new(sizeof(TextureDesc) + parts * sizeof(UVRect));
    auto* desc = new (memory) TextureDesc();
    std::memset(desc->frame_delays, 0xFF, sizeof desc->frame_delays);
    std::memset(desc->frame_map, 0xFF, sizeof desc->frame_map);
    desc->parts_amount = parts;
    return desc;
}

void DeleteDesc(TextureDesc* desc)
{
    desc->~TextureDesc();
    ::operator delete(desc);
}

TextureDesc* CopyDesc(const TextureDesc* from)
{
    TextureDesc* desc = NewDesc(from->parts_amount);
    std::memcpy(static_cast<void*>(desc), from, from->ByteSize());
    return desc;
}

} // namespace

uint32_t GetFrameNumber() { return g_FrameNumber; }
void SetFrameNumber(uint32_t frame) { g_FrameNumber = frame; }

// Surface ----------------------------------------------------------------------------

CSurface* CSurface::s_MRUHead = nullptr;
CSurface* CSurface::s_MRUTail = nullptr;

CSurface::CSurface(uint16_t width, uint16_t height, uint8_t flags, uint8_t internalFormat, const char* fileName)
    : Width(width), Height(height), m_Flags(flags), m_InternalFormat(internalFormat), m_FileName(fileName)
{
}

CSurface::~CSurface()
{
    ReleaseD3D();
    RemoveFromMRUList();
}

void CSurface::SetManager(ISurfaceManager* manager) { g_Manager = manager; }
ISurfaceManager* CSurface::GetManager() { return g_Manager; }

const char* CSurface::GetFileName() const
{
    OX_ASSERT(m_FileName != 0);
    return m_FileName ? m_FileName : "";
}

void CSurface::Release()
{
    OX_ASSERT(RefCount > 0);
    if (RefCount > 0)
        --RefCount;
}

CDeviceTexture* CSurface::GetD3DTexture()
{
    OX_ASSERT((!Surface && !m_BytesInVMem) || (Surface && m_BytesInVMem));
    if (!Surface) {
        if (g_Manager)
            g_Manager->LoadSurface(this);
        else
            CreateDeviceTexture();
        m_Flags &= static_cast<uint8_t>(~FlagUnloaded);
    }
    // Only what is in video memory is on the list (a failed load tries again next use).
    if (Surface && m_LastUsedFrame != g_FrameNumber) {
        m_LastUsedFrame = g_FrameNumber;
        MoveToMRUHead();
    }
    return Surface;
}

void CSurface::MoveToMRUHead()
{
    if (s_MRUHead == this)
        return;
    if (!s_MRUHead) {
        OX_ASSERT(s_MRUTail == 0);
        OX_ASSERT(m_PrevInMRUList == 0 && m_NextInMRUList == 0);
        s_MRUHead = s_MRUTail = this;
        return;
    }
    if (IsInMRUList())
        RemoveFromMRUList();
    // Now outside the list, which is not empty: put at the head.
    OX_ASSERT(m_PrevInMRUList == 0);
    OX_ASSERT(m_NextInMRUList == 0);
    m_PrevInMRUList = s_MRUHead;
    s_MRUHead->m_NextInMRUList = this;
    s_MRUHead = this;
    if (!s_MRUTail)
        s_MRUTail = this;
}

void CSurface::RemoveFromMRUList()
{
    if (!IsInMRUList())
        return;
    if (s_MRUHead == this && s_MRUTail == this) {
        OX_ASSERT(m_PrevInMRUList == 0 && m_NextInMRUList == 0);
        s_MRUHead = s_MRUTail = nullptr;
    } else if (s_MRUTail == this) {
        OX_ASSERT(m_PrevInMRUList == 0);
        OX_ASSERT(m_NextInMRUList != 0);
        s_MRUTail = m_NextInMRUList;
        s_MRUTail->m_PrevInMRUList = nullptr;
    } else if (s_MRUHead == this) {
        OX_ASSERT(m_NextInMRUList == 0);
        OX_ASSERT(m_PrevInMRUList != 0);
        s_MRUHead = m_PrevInMRUList;
        s_MRUHead->m_NextInMRUList = nullptr;
    } else {
        OX_ASSERT(m_PrevInMRUList != 0);
        OX_ASSERT(m_NextInMRUList != 0);
        m_PrevInMRUList->m_NextInMRUList = m_NextInMRUList;
        m_NextInMRUList->m_PrevInMRUList = m_PrevInMRUList;
    }
    m_PrevInMRUList = m_NextInMRUList = nullptr;
}

bool CSurface::CreateDeviceTexture()
{
    if (Surface)
        return true;
    IRenderBackend* backend = GetRenderBackend();
    if (!backend || !backend->HasDevice() || Width == 0 || Height == 0)
        return false;
    // Failures are tried again at each use and logged at the first.
    if (!IsDeviceFormat(m_InternalFormat)) {
        if (FirstDrawProblem(this))
            OX_LOG("graphics", diag::LogError, "unknown format for windows texture: %d", m_InternalFormat);
        return false;
    }
    const uint64_t bytes = uint64_t(FormatBitsPerPixel(m_InternalFormat)) * Width * Height / 8;
    // Nothing this big fits a device; the count must stay within 32 bits.
    Surface = bytes <= 0x40000000u
                  ? backend->CreateTexture(Width, Height, m_InternalFormat, (m_Flags & FlagRenderTarget) != 0)
                  : nullptr;
    if (!Surface) {
        if (FirstDrawProblem(this))
            CheckResult(ResultOutOfVideoMemory, "Create texture", diag::LogError);
        return false;
    }
    m_BytesInVMem = static_cast<unsigned>(bytes);
    // Counting may evict others; this surface is not on the list yet, so it stays.
    m_CountedBy = g_Manager;
    if (m_CountedBy)
        m_CountedBy->AddVideoMemory(m_BytesInVMem);
    return true;
}

void CSurface::ReleaseD3D()
{
    if (Surface) {
        if (RenderDevice* device = GetRenderDevice())
            device->ForgetTexture(Surface);
        if (IRenderBackend* backend = GetRenderBackend())
            backend->ReleaseTexture(Surface);
        Surface = nullptr;
        if (m_CountedBy)
            m_CountedBy->RemoveVideoMemory(m_BytesInVMem);
        m_CountedBy = nullptr;
        m_BytesInVMem = 0;
        RemoveFromMRUList();
        m_LastUsedFrame = 0;  // the next use, in any frame, puts it back on the list
        m_Buffer.reset();
    }
}

void CSurface::Unload()
{
    OX_ASSERT(m_Flags & FlagLoadOnDemand);
    ReleaseD3D();
    m_Flags |= FlagUnloaded;
}

void CSurface::CreateBuffer()
{
    OX_ASSERT(m_Buffer == 0);
    if (m_Buffer)
        return;
    if (Width == 0 || Height == 0) {
        // Its image was missing when the declarations were compiled: no pixels, and it draws nothing.
        OX_LOG("graphics", diag::LogError, "Surface \"%s\" has no size: no pixel buffer", GetFileName());
        return;
    }
    GetD3DTexture();
    m_Buffer.reset(new uint32_t[static_cast<size_t>(Width) * Height]());
}

void CSurface::LoadBuffer()
{
    if (!Surface || !m_Buffer)
        return;
    if (IRenderBackend* backend = GetRenderBackend())
        CheckResult(backend->ReadTexture(Surface, m_Buffer.get()), "LockRect", diag::LogError);
}

void CSurface::CommitBits()
{
    OX_ASSERT(Surface != 0);
    OX_ASSERT(m_Buffer != 0);
    if (!Surface || !m_Buffer)
        return;
    LoadBits(m_Buffer.get(), static_cast<size_t>(Width) * Height * 4, Width, Height, FormatA8R8G8B8);
}

bool CSurface::LoadBits(const void* _data, size_t _data_size, unsigned _width, unsigned _height,
                        uint8_t _internal_format)
{
    OX_ASSERT(_data != 0);
    OX_ASSERT(_data_size != 0);
    OX_ASSERT(_width != 0);
    OX_ASSERT(_height != 0);
    OX_ASSERT(_internal_format != 0);
    if (!_data || !_data_size || _width != Width || _height != Height)
        return false;
    // A file made again in another format than its declaration records.
    if (m_InternalFormat != _internal_format) {
        OX_LOG("graphics", diag::LogError, "\"%s\" holds surface format %u where its declaration says %u",
               GetFileName(), unsigned(_internal_format), unsigned(m_InternalFormat));
        return false;
    }
    // The data must hold the whole level: rows of pixels, or rows of 4 x 4 blocks.
    const bool blocks = m_InternalFormat == FormatDXT1 || m_InternalFormat == FormatDXT3 ||
                        m_InternalFormat == FormatDXT5;
    const size_t needed = blocks ? static_cast<size_t>((Width + 3) / 4) * ((Height + 3) / 4) *
                                       (m_InternalFormat == FormatDXT1 ? 8 : 16)
                                 : static_cast<size_t>(FormatBitsPerPixel(m_InternalFormat)) * Width * Height / 8;
    if (_data_size < needed) {
        OX_LOG("graphics", diag::LogError, "LoadBits: %zu bytes for a %ux%u surface of format %d", _data_size,
               _width, _height, m_InternalFormat);
        return false;
    }
    if (!Surface && !CreateDeviceTexture())
        return false;
    IRenderBackend* backend = GetRenderBackend();
    if (!backend)
        return false;
    return !CheckResult(backend->LoadBits(Surface, _data, needed), "LockRect", diag::LogError);
}

// Texture ----------------------------------------------------------------------------

// One frame covering the whole surface.
CTexture::CTexture(CSurface* surface)
    : CTexture(surface, {UVRect{0, 0, 1, 1}}, surface ? static_cast<uint16_t>(surface->GetWidth()) : uint16_t(0),
               surface ? static_cast<uint16_t>(surface->GetHeight()) : uint16_t(0))
{
}

CTexture::CTexture(CSurface* surface, const std::vector<UVRect>& parts, uint16_t frameWidth, uint16_t frameHeight)
{
    TextureDesc* desc = NewDesc(static_cast<uint16_t>(parts.size()));
    for (size_t i = 0; i < parts.size(); ++i)
        desc->Parts()[i] = parts[i];
    desc->frame_width = frameWidth;
    desc->frame_height = frameHeight;
    desc->frame_delays_count = 1;
    desc->frame_delays[0] = 0;
    desc->frame_map[0] = 0;
    desc->frame_map_length = 1;
    m_Data = desc;
    m_Surface = surface;
    if (m_Surface)
        m_Surface->AddRef();
}

CTexture::CTexture(CSurface* surface, const TextureDesc* staticDesc)
{
    Assign(surface, staticDesc);
}

CTexture::CTexture(const CTexture& other) { Assign(other.m_Surface, other.m_Data); }

CTexture& CTexture::operator=(const CTexture& other)
{
    if (this != &other) {
        CSurface* surface = other.m_Surface;
        const TextureDesc* data = other.m_Data;
        // Copy before freeing: `other` may hold the only reference to what we share.
        TextureDesc* copy = data && !(data->flags & TextureDesc::FlagStatic) ? CopyDesc(data) : nullptr;
        if (surface)
            surface->AddRef();
        Free();
        m_Surface = surface;
        m_Data = copy ? copy : const_cast<TextureDesc*>(data);
    }
    return *this;
}

CTexture::~CTexture() { Free(); }

void CTexture::Assign(CSurface* surface, const TextureDesc* data)
{
    m_Surface = surface;
    if (m_Surface)
        m_Surface->AddRef();
    if (!data)
        m_Data = nullptr;
    else if (data->flags & TextureDesc::FlagStatic)
        m_Data = const_cast<TextureDesc*>(data);
    else
        m_Data = CopyDesc(data);
}

void CTexture::Free()
{
    if (m_Surface)
        m_Surface->Release();
    m_Surface = nullptr;
    if (m_Data && !(m_Data->flags & TextureDesc::FlagStatic))
        DeleteDesc(m_Data);
    m_Data = nullptr;
}

UVRect CTexture::GetSurfaceRect() const
{
    OX_ASSERT(m_Data != 0);
    if (!m_Data || m_Data->parts_amount == 0)
        return {};
    return m_Data->Parts()[0];
}

UVRect CTexture::GetFrameSurfaceRect(unsigned frame) const
{
    OX_ASSERT(m_Data != 0);
    if (!m_Data || m_Data->parts_amount == 0)
        return {};
    return m_Data->Parts()[frame < m_Data->parts_amount ? frame : 0];
}

unsigned CTexture::GetFramesCount() const { return m_Data ? m_Data->parts_amount : 0; }

uint16_t CTexture::GetWidth() const
{
    OX_ASSERT(m_Data != 0);
    return m_Data ? m_Data->frame_width : 0;
}

uint16_t CTexture::GetHeight() const
{
    OX_ASSERT(m_Data != 0);
    return m_Data ? m_Data->frame_height : 0;
}

bool CTexture::IsAnimated() const { return EnumFrames() > 1; }

unsigned CTexture::EnumFrames() const
{
    OX_ASSERT(m_Data != 0);
    return m_Data ? m_Data->frame_delays_count : 0;
}

int CTexture::GetFrameByTime(int ms) const
{
    OX_ASSERT(m_Data != 0);
    if (!m_Data || m_Data->frame_delays_count == 0)
        return -1;
    if (m_Data->frame_delays_count == 1)
        return 0;
    const unsigned length = std::min<unsigned>(m_Data->frame_map_length, TextureDesc::MaximumFrames);
    if (length == 0)
        return -1;
    if (length == 1)
        return m_Data->frame_map[0];
    const int total = m_Data->total_time;
    if (m_Data->anim_type == TextureDesc::AnimOnce) {
        if (ms >= total)
            return m_Data->frame_map[length - 1];
    } else if (ms > total && total > 0) {
        ms %= total;
    }
    for (unsigned i = 0; i < length; ++i) {
        const int frame = m_Data->frame_map[i];
        if (frame >= 0 && frame < static_cast<int>(TextureDesc::MaximumFrames) &&
            frame < m_Data->frame_delays_count)
            ms -= m_Data->frame_delays[frame];
        if (ms < 0)
            return frame;
    }
    return -1;
}

unsigned CTexture::GetTimeByFrame(unsigned index) const
{
    OX_ASSERT(m_Data != 0);
    if (!m_Data)
        return 0;
    const unsigned length = std::min<unsigned>(m_Data->frame_map_length, TextureDesc::MaximumFrames);
    if (index >= length)
        return 0;
    unsigned time = 0;
    for (unsigned i = 0; i < index; ++i) {
        const int frame = m_Data->frame_map[i];
        if (frame >= 0 && frame < m_Data->frame_delays_count && frame < static_cast<int>(TextureDesc::MaximumFrames))
            time += m_Data->frame_delays[frame];
    }
    return time;
}

unsigned CTexture::GetAnimTime() const
{
    OX_ASSERT(m_Data != 0);
    return m_Data ? m_Data->total_time : 0;
}

void CTexture::CreateBuffer()
{
    if (m_Surface && !m_Surface->GetBuffer())
        m_Surface->CreateBuffer();
}

void CTexture::LoadBuffer()
{
    if (m_Surface)
        m_Surface->LoadBuffer();
}

void CTexture::DropBuffer()
{
    if (m_Surface)
        m_Surface->DropBuffer();
}

void CTexture::CommitBits()
{
    if (m_Surface)
        m_Surface->CommitBits();
}

uint32_t* CTexture::PixelAddress(int x, int y, int frame) const
{
    OX_ASSERT(m_Data);
    if (!m_Data)
        return nullptr;
    OX_ASSERT(m_Data->parts_amount > 0);
    if (!m_Surface || !m_Surface->GetBuffer() || m_Data->parts_amount == 0)
        return nullptr;
    if (x < 0 || y < 0 || x >= m_Data->frame_width || y >= m_Data->frame_height)
        return nullptr;
    const UVRect part = frame < 0 ? m_Data->Parts()[0] : GetFrameSurfaceRect(static_cast<unsigned>(frame));
    const int left = static_cast<int>(m_Surface->GetWidth() * part.u1);
    const int top = static_cast<int>(m_Surface->GetHeight() * part.v1);
    const int px = left + x, py = top + y;
    // A description that reaches past its surface reads nothing.
    if (px < 0 || py < 0 || px >= m_Surface->GetWidth() || py >= m_Surface->GetHeight())
        return nullptr;
    return m_Surface->GetBuffer() + static_cast<size_t>(py) * m_Surface->GetWidth() + px;
}

uint32_t CTexture::Pixel(int x, int y, int frame) const
{
    const uint32_t* at = PixelAddress(x, y, frame);
    return at ? *at : 0;
}

bool CTexture::Pixel(int x, int y, uint32_t value, int frame)
{
    uint32_t* at = PixelAddress(x, y, frame);
    if (!at)
        return false;
    *at = value;
    return true;
}

} // namespace ox::graphics
