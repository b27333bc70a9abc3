#include "quest/PixelTest.h"

#include "core/TexturesAlpha.h"
#include "graphics/Image.h"
#include "graphics/Texture.h"

namespace qe {

bool IsSolidPixel(const ox::graphics::CTexture& texture, const char* id, int x, int y, int frame,
                  const ox::core::CTexturesAlpha* masks)
{
    if (masks && masks->HasMask(id))
        return masks->IsOpaque(id, x, y);
    ox::graphics::CSurface* surface = texture.GetSurface();
    if (!surface)
        return false;
    if (!surface->GetBuffer()) {
        surface->CreateBuffer();
        surface->LoadBuffer();
    }
    return (texture.Pixel(x, y, frame) >> 24) != 0;
}

bool TryAlpha(const ox::graphics::CImage& image, int x, int y)
{
    const ox::graphics::CTexture* texture = image.GetTexture();
    return texture && IsSolidPixel(*texture, "", x, y, image.GetCurrentFrame(), nullptr);
}

} // namespace qe
