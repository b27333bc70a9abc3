#include "core/TextureManager.h"

#include "core/TimeManager.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/GamePack.h"
#include "misc/imagelib/ImageLib.h"
#include "misc/imagelib/PvrContainer.h"

#include <algorithm>
#include <cstring>

namespace ox::core {

namespace {

constexpr const char* kChannel = "texman";

using graphics::CSurface;
using graphics::CTexture;
using graphics::TextureDesc;
using graphics::UVRect;

misc::CGamePack& PackOf(misc::CGamePack* pack) { return pack ? *pack : misc::g_GamePack::Instance(); }

// A level of the surface's format that draws nothing: zero is transparent in every format
// with alpha, and a DXT1 block of two zero colours is transparent on index 3. R5G6B5 has
// no alpha: black.
std::vector<uint8_t> BlankLevel(const CSurface& surface)
{
    const uint8_t format = surface.GetInternalFormat();
    std::vector<uint8_t> level(misc::imagelib::PvrTextureBytes(format, surface.GetWidth(), surface.GetHeight()), 0);
    if (format == graphics::FormatDXT1)
        for (size_t block = 0; block + 8 <= level.size(); block += 8)
            memset(&level[block + 4], 0xFF, 4);
    return level;
}

} // namespace

CTextureManager::CTextureManager(misc::CGamePack* pack, Clock clock)
    : m_Pack(pack), m_Clock(clock ? std::move(clock) : Clock(&CPlatformTimer::MonotonicMilliseconds)),
      m_TexturesAlpha(pack)
{
    m_PreviousManager = CSurface::GetManager();
    CSurface::SetManager(this);
}

CTextureManager::~CTextureManager()
{
    StopSurfacesPreloading();
    m_Textures.reset();
    m_TexturesCount = 0;
    m_Surfaces.clear();
    if (CSurface::GetManager() == this)
        CSurface::SetManager(m_PreviousManager);
}

CTextureManager& CTextureManager::Instance()
{
    static CTextureManager* instance = new CTextureManager();
    return *instance;
}

CSurface* CTextureManager::AddSurface(unsigned width, unsigned height, uint8_t flags, uint8_t format,
                                      const char* fileName)
{
    m_Surfaces.emplace_back(static_cast<uint16_t>(width), static_cast<uint16_t>(height), flags, format, fileName);
    return &m_Surfaces.back();
}

bool CTextureManager::Load(const CTextureDeclarationsLoader* loader)
{
    OX_ASSERT(!m_Loaded);
    if (m_Loaded)
        return false;
    if (!loader || !loader->IsLoaded()) {
        OX_LOG(kChannel, diag::LogError, "Texture manager: no texture declarations to load");
        return false;
    }
    const double start = m_Clock();
    misc::CGamePack& pack = PackOf(m_Pack);
    m_TextureLoader = loader;

    const uint32_t surfacesAmount = loader->SurfacesAmount();
    const auto* records = loader->Surfaces();
    std::vector<CSurface*> surfaces(surfacesAmount, nullptr);
    std::vector<bool> overridden(surfacesAmount, false);
    for (uint32_t i = 0; i < surfacesAmount; ++i) {
        const auto& record = records[i];
        uint8_t flags = static_cast<uint8_t>(record.flags);
        if (m_AllOnDemand)
            flags |= CSurface::FlagLoadOnDemand | CSurface::FlagUnloaded;
        const char* path = record.path.c_str();
        unsigned width = record.width, height = record.height, format = record.internal_format;
        // A loose file beside the pack stands for a changed image: its own size counts.
        if (pack.HasPack() && pack.IsLooseFile(path)) {
            uint32_t w = 0, h = 0;
            unsigned f = 0;
            const bool loaded = ReadImageDimensions(pack, path, w, h, f) && w <= 0xFFFF && h <= 0xFFFF;
            if (loaded) {
                width = w;
                height = h;
                format = f;
                overridden[i] = true;
            } else {
                OX_LOG(kChannel, diag::LogError, "Cannot read the size of the loose file \"%s\"", path);
            }
        }
        surfaces[i] = AddSurface(width, height, flags, static_cast<uint8_t>(format), path);
    }

    m_TexturesCount = loader->ImagesAmount();
    m_Textures = std::make_unique<CTexture[]>(m_TexturesCount);
    const auto* images = loader->Images();
    for (uint32_t i = 0; i < m_TexturesCount; ++i) {
        const TextureDesc* desc = loader->Desc(images[i]);
        const uint32_t index = loader->SurfaceIndex(*desc);
        CSurface* surface = index < surfacesAmount ? surfaces[index] : nullptr;
        if (index >= surfacesAmount || !overridden[index]) {
            m_Textures[i] = CTexture(surface, desc);
        } else {
            // One part over the whole image; "_2!" in the name halves the frame on both axes.
            std::vector<uint8_t> bytes(sizeof(TextureDesc) + sizeof(UVRect), 0);
            auto* own = new (bytes.data()) TextureDesc();
            own->id = desc->id;
            own->flags = desc->flags & ~TextureDesc::FlagStatic;
            own->group = desc->group;
            own->surface = desc->surface;
            memset(own->frame_delays, 0xFF, sizeof own->frame_delays);
            memset(own->frame_map, 0xFF, sizeof own->frame_map);
            own->frame_delays[0] = 0;
            own->frame_delays_count = 1;
            own->frame_map[0] = 0;
            own->frame_map_length = 1;
            own->parts_amount = 1;
            own->Parts()[0] = {0, 0, 1, 1};
            const bool half = strstr(surface->GetFileName(), "_2!") != nullptr;
            own->frame_width = static_cast<uint16_t>(half ? surface->GetWidth() / 2 : surface->GetWidth());
            own->frame_height = static_cast<uint16_t>(half ? surface->GetHeight() / 2 : surface->GetHeight());
            m_Textures[i] = CTexture(surface, own);
        }
        OX_ASSERT(m_Textures[i].GetSurface() != 0);
    }
    m_Loaded = true;
    OX_LOG(kChannel, diag::LogTrace, "Texture information created in %dms", static_cast<int>(m_Clock() - start));
    return true;
}

CTexture* CTextureManager::GetItem(const char* id)
{
    if (!id || !*id || !m_Loaded)
        return nullptr;
    OX_ASSERT(m_TextureLoader != 0);
    OX_ASSERT(m_Textures != 0);
    if (!m_TextureLoader || !m_Textures)
        return nullptr;
    const int index = m_TextureLoader->FindImageIndex(id);
    if (index < 0 || static_cast<unsigned>(index) >= m_TexturesCount)
        return nullptr;
    return &m_Textures[index];
}

const char* CTextureManager::GetItemId(const CTexture* texture) const
{
    if (!texture || !texture->GetData())
        return "";
    return texture->GetData()->id.c_str();
}

const char* CTextureManager::GetSurfaceFileName(const CSurface* surface) const
{
    return surface ? surface->GetFileName() : "";
}

CSurface* CTextureManager::FindSurfaceByD3DTexture(const graphics::CDeviceTexture* texture)
{
    if (!texture)
        return nullptr;
    for (CSurface& surface : m_Surfaces)
        if (surface.PeekD3DTexture() == texture)
            return &surface;
    return nullptr;
}

// Loading ------------------------------------------------------------------------------

bool CTextureManager::LoadSurface(CSurface* surface)
{
    if (!surface)
        return false;
    if (!surface->IsValid() && !surface->CreateDeviceTexture()) {
        // Tried again at every use; said once.
        if (m_Reported.insert(surface).second) {
            OX_LOG(kChannel, diag::LogError, "Can't create surface");
            ReportTextures(*surface);
        }
        return false;
    }
    if (surface->GetBuffer()) {
        surface->CommitBits();
        return true;
    }
    return FillFromFile(*surface);
}

bool CTextureManager::FillFromFile(CSurface& surface)
{
    const char* path = surface.GetFileName();
    if (!*path)
        return true;  // a dynamic surface: its owner fills it
    misc::CGamePack& pack = PackOf(m_Pack);
    bool loaded = false;
    if (IsContainerPath(path)) {
        loaded = misc::imagelib::PvrLoadBits(path, [&](const misc::imagelib::PvrTexture& texture) {
            return surface.LoadBits(texture.data, texture.size, texture.width, texture.height,
                                    static_cast<uint8_t>(texture.internal_format));
        }, &pack);
        if (!loaded)
            OX_LOG(kChannel, diag::LogError, "Cannot load surface data with pvrimagecontainer: \"%s\"", path);
    } else {
        unsigned size = 0;
        misc::imagelib::Image raw_image;
        std::unique_ptr<misc::imagelib::CImageDecoder> decoder = misc::imagelib::MakeDecoder(path);
        if (const void* data = decoder ? pack.Open(path, &size) : nullptr) {
            decoder->SetName(path);
            if (decoder->Decode(data, size, raw_image)) {
                const bool sized = raw_image.width == surface.GetWidth() && raw_image.height == surface.GetHeight();
                if (!sized)
                    OX_LOG(kChannel, diag::LogError, "\"%s\" is %ux%u, declared as %ux%u", path, raw_image.width,
                           raw_image.height, surface.GetWidth(), surface.GetHeight());
                else
                    loaded = surface.LoadBits(raw_image.pixels.data(), raw_image.pixels.size() * 4, raw_image.width,
                                              raw_image.height, graphics::FormatA8R8G8B8);
            }
            pack.Close(data);
        }
        if (!loaded)
            OX_LOG(kChannel, diag::LogError, "Cannot load surface data with imagelib: \"%s\"", path);
    }
    if (!loaded)
        ReportTextures(surface);
    // A surface without its image draws nothing rather than what the device had.
    if (!loaded && surface.IsValid()) {
        const std::vector<uint8_t> blank = BlankLevel(surface);
        if (!blank.empty())
            surface.LoadBits(blank.data(), blank.size(), surface.GetWidth(), surface.GetHeight(),
                             surface.GetInternalFormat());
    }
    return loaded;
}

void CTextureManager::ReportTextures(const CSurface& surface) const
{
    // Name the textures that will draw nothing, for the game maker.
    for (unsigned i = 0; i < m_TexturesCount; ++i)
        if (m_Textures[i].GetSurface() == &surface)
            OX_LOG(kChannel, diag::LogError, "Texture \"%s\" has no image: \"%s\"", GetItemId(&m_Textures[i]),
                   surface.GetFileName());
}

// Video memory -------------------------------------------------------------------------

void CTextureManager::AddVideoMemory(unsigned bytes)
{
    m_VideoMemUsed = bytes > UINT32_MAX - m_VideoMemUsed ? UINT32_MAX : m_VideoMemUsed + bytes;
    if (m_VideoMemUsed > m_HighLimit)
        Evict();
}

void CTextureManager::RemoveVideoMemory(unsigned _bytes)
{
    OX_ASSERT(m_VideoMemUsed >= _bytes);
    m_VideoMemUsed = m_VideoMemUsed >= _bytes ? m_VideoMemUsed - _bytes : 0;
}

void CTextureManager::Evict()
{
    // From the least recently used toward the head; what this frame uses stays, and so
    // does everything after it on the list.
    const uint32_t frame = graphics::GetFrameNumber();
    for (CSurface* surf = CSurface::GetMRUTail(); surf && m_VideoMemUsed > m_LowLimit;) {
        if (surf->GetLastUsedFrame() == frame)
            break;
        CSurface* next = surf->GetNextInMRUList();
        if (surf->GetFlags() & CSurface::FlagLoadOnDemand) {
            surf->Unload();
            OX_ASSERT(surf->GetBytesInVMem() == 0);
        }
        surf = next;
    }
}

// Dynamic surfaces ----------------------------------------------------------------------

CSurface* CTextureManager::CreateSurface(unsigned width, unsigned height)
{
    if (width == 0 || height == 0 || width > 0xFFFF || height > 0xFFFF)
        return nullptr;
    CSurface* surface = AddSurface(width, height, 0, graphics::FormatA8R8G8B8, "");
    if (surface->CreateDeviceTexture())
        return surface;
    m_Surfaces.pop_back();
    return nullptr;
}

CSurface* CTextureManager::CreateRenderTarget(unsigned width, unsigned height)
{
    if (width == 0 || height == 0 || width > 0xFFFF || height > 0xFFFF)
        return nullptr;
    CSurface* surface = AddSurface(width, height, CSurface::FlagRenderTarget, graphics::FormatA8R8G8B8, "");
    if (surface->CreateDeviceTexture())
        return surface;
    m_Surfaces.pop_back();
    return nullptr;
}

CSurface* CTextureManager::CloneSurface(const CSurface& source_)
{
    auto& source = const_cast<CSurface&>(source_);
    if (source.GetWidth() == 0 || source.GetHeight() == 0)
        return nullptr;
    CSurface* clone = AddSurface(source.GetWidth(), source.GetHeight(),
                                 source.GetFlags() & CSurface::FlagRenderTarget, graphics::FormatA8R8G8B8, "");
    if (!clone->CreateDeviceTexture()) {
        m_Surfaces.pop_back();
        return nullptr;
    }
    const bool ownBuffer = source.GetBuffer() != nullptr;
    if (!ownBuffer) {
        source.CreateBuffer();
        source.LoadBuffer();
    }
    clone->CreateBuffer();
    if (source.GetBuffer() && clone->GetBuffer())
        memcpy(clone->GetBuffer(), source.GetBuffer(), size_t(source.GetWidth()) * source.GetHeight() * 4);
    if (!ownBuffer)
        source.DropBuffer();
    if (clone->IsValid() && clone->GetBuffer())
        clone->CommitBits();
    return clone;
}

bool CTextureManager::CloneTexture(const CTexture& source, CTexture& out)
{
    if (!source.GetSurface() || !source.GetData())
        return false;
    CSurface* clone = CloneSurface(*source.GetSurface());
    if (!clone)
        return false;
    out = CTexture(clone, source.GetData());
    return true;
}

void CTextureManager::ShrinkSurface(CSurface& source, CSurface& target, unsigned _width, unsigned _height)
{
    OX_ASSERT(_width > 0 && _height > 0);
    if (_width == 0 || _height == 0)
        return;
    const unsigned kx = source.GetWidth() / _width, ky = source.GetHeight() / _height;
    OX_ASSERT(kx >= 1 && ky >= 1);
    if (kx < 1 || ky < 1)
        return;
    const bool ownSource = source.GetBuffer() != nullptr;
    if (!ownSource) {
        source.CreateBuffer();
        source.LoadBuffer();
    }
    if (!target.GetBuffer())
        target.CreateBuffer();
    const uint32_t* from = source.GetBuffer();
    uint32_t* to = target.GetBuffer();
    if (from && to) {
        const unsigned sw = source.GetWidth(), sh = source.GetHeight();
        const unsigned w = std::min<unsigned>(_width, target.GetWidth());
        const unsigned h = std::min<unsigned>(_height, target.GetHeight());
        const unsigned count = kx * ky;
        for (unsigned y = 0; y < h; ++y)
            for (unsigned x = 0; x < w; ++x) {
                uint64_t a = 0, r = 0, g = 0, b = 0;
                for (unsigned j = 0; j < ky; ++j)
                    for (unsigned i = 0; i < kx; ++i) {
                        const unsigned sx = std::min(x * kx + i, sw - 1), sy = std::min(y * ky + j, sh - 1);
                        const uint32_t p = from[size_t(sy) * sw + sx];
                        a += p >> 24;
                        r += (p >> 16) & 0xFF;
                        g += (p >> 8) & 0xFF;
                        b += p & 0xFF;
                    }
                to[size_t(y) * target.GetWidth() + x] = uint32_t(a / count) << 24 | uint32_t(r / count) << 16 |
                                                        uint32_t(g / count) << 8 | uint32_t(b / count);
            }
        if (target.IsValid())
            target.CommitBits();
    }
    if (!ownSource)
        source.DropBuffer();
}

void CTextureManager::RemoveUnusedSurfaces()
{
    for (auto it = m_Surfaces.begin(); it != m_Surfaces.end();) {
        if (it->GetRefCount() != 0) {
            ++it;
            continue;
        }
        if (m_Preload) {
            auto& list = m_Preload->surfaces;
            auto at = std::find(list.begin(), list.end(), &*it);
            if (at != list.end()) {
                const size_t index = static_cast<size_t>(at - list.begin());
                list.erase(at);
                if (index < m_Preload->current_surface)
                    --m_Preload->current_surface;
                m_Preload->surfaces_amount = list.size();
            }
        }
        m_Reported.erase(&*it);
        it = m_Surfaces.erase(it);
    }
    if (m_Preload && m_Preload->current_surface >= m_Preload->surfaces_amount)
        m_Preload.reset();
}

// Device events ------------------------------------------------------------------------

void CTextureManager::ReleaseAllD3D()
{
    for (CSurface& surface : m_Surfaces)
        surface.ReleaseD3D();
}

void CTextureManager::ReleaseRenderTargets()
{
    for (CSurface& surface : m_Surfaces)
        if (surface.GetFlags() & CSurface::FlagRenderTarget)
            surface.ReleaseD3D();
}

void CTextureManager::ReloadAll()
{
    for (CSurface& surface : m_Surfaces)
        if (!(surface.GetFlags() & CSurface::FlagUnloaded))
            LoadSurface(&surface);
}

void CTextureManager::ReleaseDeviceResources(bool forReset)
{
    if (forReset)
        ReleaseRenderTargets();
    else
        ReleaseAllD3D();
}

void CTextureManager::UnloadAllOnDemandSurfaces()
{
    for (CSurface& surface : m_Surfaces)
        if (surface.GetFlags() & CSurface::FlagLoadOnDemand)
            surface.Unload();
}

// Preloading ---------------------------------------------------------------------------

void CTextureManager::PreloadSurfacesByPrefix(const char* prefix)
{
    StopSurfacesPreloading();
    if (!prefix)
        return;
    std::vector<std::string> files;
    PackOf(m_Pack).EnumFiles(prefix, [](void* user, const char* path) {
        static_cast<std::vector<std::string>*>(user)->emplace_back(path);
    }, &files);
    auto context = std::make_unique<PreloadContext>();
    for (const std::string& file : files)
        for (CSurface& surface : m_Surfaces)
            if (file == surface.GetFileName()) {
                context->surfaces.push_back(&surface);
                break;
            }
    context->surfaces_amount = context->surfaces.size();
    if (context->surfaces_amount)
        m_Preload = std::move(context);
}

void CTextureManager::StopSurfacesPreloading() { m_Preload.reset(); }

size_t CTextureManager::PreloadRemaining() const
{
    return m_Preload ? m_Preload->surfaces_amount - m_Preload->current_surface : 0;
}

void CTextureManager::UpdatePreload()
{
    if (!m_Preload)
        return;
    const double start = m_Clock();
    do {
        m_Preload->surfaces[m_Preload->current_surface++]->GetD3DTexture();
    } while (m_Preload->current_surface < m_Preload->surfaces_amount && m_Clock() - start < kPreloadSliceMs);
    if (m_Preload->current_surface >= m_Preload->surfaces_amount)
        m_Preload.reset();
}

} // namespace ox::core
