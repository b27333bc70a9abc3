#pragma once
// The glyph images of the fonts, until the texture manager serves them: an image id names
// the file "<id>.png" in the game pack. Each image is decoded once and kept in system
// memory, so that it can be uploaded again after the device was lost.
#include "graphics/Renderer.h"
#include "graphics/Texture.h"

#include <map>
#include <memory>
#include <string>
#include <vector>

namespace k17 {

class CFontImages : public ox::graphics::IDeviceResourceOwner {
public:
    explicit CFontImages(ox::graphics::CRenderer& renderer);
    ~CFontImages() override;
    CFontImages(const CFontImages&) = delete;
    CFontImages& operator=(const CFontImages&) = delete;

    // The texture of an image id, or null when its file is missing or broken (logged).
    const ox::graphics::CTexture* Get(const char* id);
    // Uploads every image whose device texture is gone; call before drawing.
    void Restore();
    void ReleaseDeviceResources(bool forReset) override;

private:
    struct Image {
        std::vector<uint32_t> pixels;
        std::unique_ptr<ox::graphics::CSurface> surface;
        std::unique_ptr<ox::graphics::CTexture> texture;
    };

    ox::graphics::CRenderer& m_Renderer;
    std::map<std::string, std::unique_ptr<Image>> m_Images;
};

} // namespace k17
