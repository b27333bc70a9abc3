#pragma once
// The pixel test of hit tests: whether the pixel of a texture under a point is solid.
namespace ox::core {
class CTexturesAlpha;
}
namespace ox::graphics {
class CImage;
class CTexture;
}

namespace qe {

// The alpha-mask store answers for a texture id it has a mask of. Otherwise the pixel of
// the frame is read from the texture's pixel copy, which is made and filled from the device
// at the first need: solid when its alpha is not 0. Outside the frame nothing is solid.
bool IsSolidPixel(const ox::graphics::CTexture& texture, const char* id, int x, int y, int frame,
                  const ox::core::CTexturesAlpha* masks);

// The pixel (x, y) of the image's texture in its current frame has an alpha other than 0;
// the pixel copy is made on demand. False without a texture.
bool TryAlpha(const ox::graphics::CImage& image, int x, int y);

} // namespace qe
