#include "quest/PixelTest.h"

#include "core/TexturesAlpha.h"
#include "graphics/Image.h"
#include "graphics/Texture.h"

namespace qe {

const ox::core::TextureAlphaDesc* CMaskLookup::Find(const ox::core::CTexturesAlpha* masks, const std::string& id) const
{
    const void* block = masks ? masks->Records() : nullptr;
    const bool same = masks == m_Store && block == m_Block &&
                      (!m_Mask || (m_Mask < masks->Records() + masks->Count() && m_Mask->id.view() == id));
    if (!same) {
        m_Store = masks;
        m_Block = block;
        m_Mask = masks ? masks->Find(id.c_str()) : nullptr;
    }
    return m_Mask;
}

bool IsSolidPixel(const ox::graphics::CTexture& texture, const ox::core::CTexturesAlpha* masks,
                  const ox::core::TextureAlphaDesc* mask, int x, int y, int frame)
{
    if (masks && mask)
        return masks->IsOpaque(*mask, x, y);
    ox::graphics::CSurface* surface = texture.GetSurface();
    if (!surface)
        return false;
    if (!surface->GetBuffer()) {
        surface->CreateBuffer();
        surface->LoadBuffer();
    }
    return (texture.Pixel(x, y, frame) >> 24) != 0;
}

bool IsSolidPixel(const ox::graphics::CTexture& texture, const char* id, int x, int y, int frame,
                  const ox::core::CTexturesAlpha* masks)
{
    return IsSolidPixel(texture, masks, masks ? masks->Find(id) : nullptr, x, y, frame);
}

bool TryAlpha(const ox::graphics::CImage& image, int x, int y)
{
    const ox::graphics::CTexture* texture = image.GetTexture();
    return texture && IsSolidPixel(*texture, nullptr, nullptr, x, y, image.GetCurrentFrame());
}

} // namespace qe
