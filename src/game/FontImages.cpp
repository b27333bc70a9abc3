#include "game/FontImages.h"

#include "diag/Log.h"
#include "misc/imagelib/ImageLib.h"

namespace k17 {

using namespace ox;

CFontImages::CFontImages(graphics::CRenderer& renderer) : m_Renderer(renderer)
{
    m_Renderer.AddDeviceResourceOwner(this);
}

CFontImages::~CFontImages()
{
    m_Renderer.RemoveDeviceResourceOwner(this);
    for (auto& [id, image] : m_Images) {
        image->texture.reset();
        image->surface.reset();
    }
}

const graphics::CTexture* CFontImages::Get(const char* id)
{
    auto found = m_Images.find(id);
    if (found != m_Images.end())
        return found->second ? found->second->texture.get() : nullptr;
    const std::string path = std::string(id) + ".png";
    misc::imagelib::Image decoded;
    std::unique_ptr<Image> image;
    if (!misc::imagelib::LoadImage(path.c_str(), decoded) || decoded.width > 0xFFFF || decoded.height > 0xFFFF) {
        OX_LOG("font", diag::LogError, "cannot read the font image '%s'", path.c_str());
    } else {
        image = std::make_unique<Image>();
        image->pixels = std::move(decoded.pixels);
        image->surface = std::make_unique<graphics::CSurface>(static_cast<uint16_t>(decoded.width),
                                                              static_cast<uint16_t>(decoded.height));
        image->texture = std::make_unique<graphics::CTexture>(image->surface.get());
    }
    const graphics::CTexture* texture = image ? image->texture.get() : nullptr;
    m_Images[id] = std::move(image);
    Restore();
    return texture;
}

void CFontImages::Restore()
{
    for (auto& [id, image] : m_Images)
        if (image && !image->surface->IsValid())
            image->surface->LoadBits(image->pixels.data(), image->pixels.size() * 4, image->surface->GetWidth(),
                                     image->surface->GetHeight(), graphics::FormatA8R8G8B8);
}

void CFontImages::ReleaseDeviceResources(bool forReset)
{
    if (forReset)
        return;
    for (auto& [id, image] : m_Images)
        if (image)
            image->surface->ReleaseD3D();
}

} // namespace k17
