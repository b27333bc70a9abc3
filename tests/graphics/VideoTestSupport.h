#pragma once
// A game folder of generated videos, read through a pack, with the texture manager's
// dynamic surfaces over a recording device, and a frame delta the test sets.
#include "core/TextureManager.h"
#include "graphics/Renderer.h"
#include "graphics/Video.h"
#include "misc/GamePack.h"
#include "misc/theoraplayer/TheoraWriter.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <gtest/gtest.h>

#include <cstdlib>

namespace oxtest {

// Encodes `frames` frames of a pattern; with `seconds` of a 440 Hz tone as a Vorbis track.
inline std::string MakeVideo(const char* pattern, unsigned w, unsigned h, unsigned frames,
                             TheoraEncodeOptions options = {}, double seconds = 0.0)
{
    std::vector<int16_t> pcm;
    if (seconds > 0) {
        pcm.resize(static_cast<size_t>(seconds * options.rate));
        for (size_t i = 0; i < pcm.size(); ++i)
            pcm[i] = static_cast<int16_t>((i * 440 * 2 * 16000 / options.rate) % 32000 - 16000);
        options.pcm = pcm.data();
        options.pcmFrames = pcm.size();
        options.channels = 1;
    }
    std::vector<uint8_t> bytes;
    const bool ok = EncodeTheora(w, h, frames, [&](unsigned i, std::vector<uint32_t>& pixels) {
        MakeVideoFrame(pattern, w, h, i, frames, pixels);
    }, bytes, options);
    EXPECT_TRUE(ok);
    return std::string(bytes.begin(), bytes.end());
}

struct VideoFixture : ::testing::Test {
    TempDir dir;
    std::unique_ptr<ox::misc::CGamePack> pack;
    RecordingBackend* backend = nullptr;
    std::unique_ptr<ox::graphics::CRenderer> renderer;
    std::unique_ptr<ox::core::CTextureManager> textures;
    int delta = 0;

    void SetUp() override
    {
        ox::misc::GamePackConfig config;
        config.folder = dir.Path().string();
        config.language = "";
        pack = std::make_unique<ox::misc::CGamePack>(config);
        auto owned = std::make_unique<RecordingBackend>();
        backend = owned.get();
        renderer = std::make_unique<ox::graphics::CRenderer>(std::move(owned));
        renderer->InitWindow(false, true, 64, 64);
        textures = std::make_unique<ox::core::CTextureManager>(pack.get());
        ox::graphics::VideoServices& s = ox::graphics::GetVideoServices();
        s = {};
        s.pack = pack.get();
        s.createSurface = [this](unsigned w, unsigned h) { return textures->CreateSurface(w, h); };
        s.removeUnusedSurfaces = [this] { textures->RemoveUnusedSurfaces(); };
        s.frameDelta = [this] { return delta; };
    }
    void TearDown() override { ox::graphics::GetVideoServices() = {}; }

    void Write(const std::string& name, const std::string& bytes) { dir.Write(name, bytes); }

    // One frame of the renderer with the video drawn at (x, y).
    template <class Video>
    void DrawOnce(Video& video, float x = 0, float y = 0)
    {
        renderer->BeginScene();
        video.Draw(*renderer, x, y);
        renderer->EndScene();
    }

    // The words of the device texture that the video's surface holds.
    std::vector<uint32_t> DeviceBits(const ox::graphics::CTexture* texture) const
    {
        auto* t = static_cast<RecordingBackend::Texture*>(texture->GetSurface()->PeekD3DTexture());
        std::vector<uint32_t> words(t->bits.size() / 4);
        memcpy(words.data(), t->bits.data(), t->bits.size());
        return words;
    }
};

// Channels of a pixel within `tolerance` of a grey level (and of an alpha).
inline bool Near(uint32_t pixel, int grey, int alpha, int tolerance = 3)
{
    const int c[4] = {static_cast<int>(pixel >> 24), static_cast<int>(pixel >> 16 & 0xFF),
                      static_cast<int>(pixel >> 8 & 0xFF), static_cast<int>(pixel & 0xFF)};
    return std::abs(c[0] - alpha) <= tolerance && std::abs(c[1] - grey) <= tolerance &&
           std::abs(c[2] - grey) <= tolerance && std::abs(c[3] - grey) <= tolerance;
}

} // namespace oxtest
