#pragma once
// The texture manager: owns every surface (the pool) and one texture for each declared
// image. Start-up makes only bookkeeping; a surface loads on its first use, video memory
// is counted, and past the high limit the least recently used on-demand surfaces are
// dropped down to the low limit. Also preloads surfaces by path prefix in time slices and
// holds the alpha-mask store.
#include "core/TextureDeclarations.h"
#include "core/TexturesAlpha.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"

#include <functional>
#include <list>
#include <memory>
#include <set>
#include <string>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace ox::core {

class CTextureManager : public graphics::ISurfaceManager, public graphics::IDeviceResourceOwner {
public:
    static constexpr unsigned kHighLimit = 0x8000000;  // 128 MiB
    static constexpr unsigned kLowLimit = 0x6000000;   // 96 MiB
    static constexpr double kPreloadSliceMs = 10.0;

    using Clock = std::function<double()>;  // milliseconds

    // Reads files through `pack` (the process-wide game pack when null) and measures the
    // preload slices with `clock` (the monotonic clock when empty). Becomes the surfaces'
    // manager; the last one made is.
    explicit CTextureManager(misc::CGamePack* pack = nullptr, Clock clock = {});
    ~CTextureManager() override;
    CTextureManager(const CTextureManager&) = delete;
    CTextureManager& operator=(const CTextureManager&) = delete;

    // The process-wide manager (g_TextureManager), made at first use and never destroyed.
    static CTextureManager& Instance();

    // Before Load: every declared surface gets FlagLoadOnDemand and FlagUnloaded.
    void SetAllOnDemand(bool value) { m_AllOnDemand = value; }
    bool GetAllOnDemand() const { return m_AllOnDemand; }

    // Builds the surfaces and textures of the declarations without reading a pixel. Once
    // only; the loader must outlive the manager.
    bool Load(const CTextureDeclarationsLoader* loader);
    bool IsLoaded() const { return m_Loaded; }

    graphics::CTexture* GetItem(const char* id);
    graphics::CTexture* GetItem(const std::string& id) { return GetItem(id.c_str()); }
    const char* GetItemId(const graphics::CTexture* texture) const;
    const char* GetSurfaceFileName(const graphics::CSurface* surface) const;
    graphics::CSurface* FindSurfaceByD3DTexture(const graphics::CDeviceTexture* texture);
    unsigned GetTexturesCount() const { return m_TexturesCount; }

    // Dynamic surfaces, in the pool, with their device texture made; null on failure.
    graphics::CSurface* CreateSurface(unsigned width, unsigned height);
    graphics::CSurface* CreateRenderTarget(unsigned width, unsigned height);
    graphics::CSurface* CloneSurface(const graphics::CSurface& source);
    // A texture on a clone of the source's surface with a copy of its description.
    bool CloneTexture(const graphics::CTexture& source, graphics::CTexture& out);
    // Box-filters `source` into `target` at width x height.
    void ShrinkSurface(graphics::CSurface& source, graphics::CSurface& target, unsigned _width, unsigned _height);
    // Drops the pool's surfaces that no texture uses.
    void RemoveUnusedSurfaces();

    // Device events: all device textures go; only render targets go (reset); everything
    // not dropped by a caller loads again.
    void ReleaseAllD3D();
    void ReleaseRenderTargets();
    void ReloadAll();
    void ReleaseDeviceResources(bool forReset) override;

    // Makes the device texture of a surface and fills it from its buffer or its file.
    bool LoadSurface(graphics::CSurface* surface) override;
    void AddVideoMemory(unsigned bytes) override;
    void RemoveVideoMemory(unsigned _bytes) override;
    unsigned GetVideoMemUsed() const { return m_VideoMemUsed; }

    // Loads, a slice each frame, the surfaces whose files begin with the prefix.
    void PreloadSurfacesByPrefix(const char* prefix);
    void StopSurfacesPreloading();
    // Once per frame.
    void UpdatePreload();
    bool IsPreloading() const { return m_Preload != nullptr; }
    size_t PreloadRemaining() const;

    void UnloadAllOnDemandSurfaces();

    CTexturesAlpha& GetTexturesAlpha() { return m_TexturesAlpha; }
    size_t GetSurfacesCount() const { return m_Surfaces.size(); }

private:
    struct PreloadContext {
        size_t surfaces_amount = 0;
        size_t current_surface = 0;
        std::vector<graphics::CSurface*> surfaces;
    };

    void Evict();
    graphics::CSurface* AddSurface(unsigned width, unsigned height, uint8_t flags, uint8_t format,
                                   const char* fileName);
    bool FillFromFile(graphics::CSurface& surface);
    void ReportTextures(const graphics::CSurface& surface) const;

    misc::CGamePack* m_Pack;
    Clock m_Clock;
    graphics::ISurfaceManager* m_PreviousManager = nullptr;
    std::list<graphics::CSurface> m_Surfaces;  // stable addresses
    bool m_AllOnDemand = true;
    bool m_Loaded = false;
    const CTextureDeclarationsLoader* m_TextureLoader = nullptr;
    std::unique_ptr<graphics::CTexture[]> m_Textures;
    unsigned m_TexturesCount = 0;
    std::unique_ptr<PreloadContext> m_Preload;
    unsigned m_VideoMemUsed = 0;
    unsigned m_HighLimit = kHighLimit;
    unsigned m_LowLimit = kLowLimit;
    CTexturesAlpha m_TexturesAlpha;
    // Surfaces whose device texture could not be made, already logged.
    std::set<const graphics::CSurface*> m_Reported;
};

} // namespace ox::core
