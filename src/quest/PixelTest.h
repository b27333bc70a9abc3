#pragma once
// The pixel test of hit tests: whether the pixel of a texture under a point is solid.
#include <string>

namespace ox::core {
class CTexturesAlpha;
struct TextureAlphaDesc;
}
namespace ox::graphics {
class CImage;
class CTexture;
}

namespace qe {

// The mask of one texture id in the alpha-mask store, searched once. While the store holds
// the same block the answer stands (a mask found is checked to still carry the id), so a
// hit test on an object asks no search of the store.
class CMaskLookup {
public:
    // The mask, or null when the store (which may be null) has none for the id.
    const ox::core::TextureAlphaDesc* Find(const ox::core::CTexturesAlpha* masks, const std::string& id) const;

private:
    mutable const ox::core::CTexturesAlpha* m_Store = nullptr;
    mutable const void* m_Block = nullptr;
    mutable const ox::core::TextureAlphaDesc* m_Mask = nullptr;
};

// A mask answers for its texture. Without one the pixel of the frame is read from the
// texture's pixel copy, which is made and filled from the device at the first need: solid
// when its alpha is not 0. Outside the frame nothing is solid.
bool IsSolidPixel(const ox::graphics::CTexture& texture, const ox::core::CTexturesAlpha* masks,
                  const ox::core::TextureAlphaDesc* mask, int x, int y, int frame);
// The same with the mask searched by the texture's id.
bool IsSolidPixel(const ox::graphics::CTexture& texture, const char* id, int x, int y, int frame,
                  const ox::core::CTexturesAlpha* masks);

// The pixel (x, y) of the image's texture in its current frame has an alpha other than 0;
// the pixel copy is made on demand. False without a texture.
bool TryAlpha(const ox::graphics::CImage& image, int x, int y);

} // namespace qe
