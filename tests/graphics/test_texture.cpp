// Surfaces and textures as far as the renderer uses them: device textures, pixel copies,
// frames and copies of handles.
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

using namespace ox::graphics;
using oxtest::RecordingBackend;

namespace {

struct SurfaceFixture : ::testing::Test {
    RecordingBackend* backend = nullptr;
    std::unique_ptr<CRenderer> renderer;
    void SetUp() override
    {
        renderer = oxtest::MakeRecordingRenderer(backend, 64, 64, 64, 64);
    }
};

} // namespace

TEST_F(SurfaceFixture, DeviceTextureBitsAndBuffer)
{
    oxtest::LogCapture log;
    CSurface surface(4, 2);
    EXPECT_FALSE(surface.IsValid());
    const uint32_t pixels[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    EXPECT_FALSE(surface.LoadBits(pixels, sizeof pixels, 2, 4, FormatA8R8G8B8)) << "another size";
    EXPECT_FALSE(surface.LoadBits(pixels, 16, 4, 2, FormatA8R8G8B8)) << "too little data";
    ASSERT_TRUE(surface.LoadBits(pixels, sizeof pixels, 4, 2, FormatA8R8G8B8));
    EXPECT_TRUE(surface.IsValid());
    EXPECT_EQ(surface.GetBytesInVMem(), 32u);
    surface.CreateBuffer();
    surface.LoadBuffer();
    EXPECT_EQ(surface.GetBuffer()[7], 8u);
    surface.GetBuffer()[0] = 0xFF00FF00u;
    surface.CommitBits();
    auto* device = static_cast<RecordingBackend::Texture*>(surface.GetD3DTexture());
    EXPECT_EQ(device->bits[3], 0xFF);
    EXPECT_EQ(device->bits[1], 0xFF);

    // Dropped: device texture and buffer go; the next use makes a fresh one.
    surface.ReleaseD3D();
    EXPECT_FALSE(surface.IsValid());
    EXPECT_EQ(surface.GetBuffer(), nullptr);
    EXPECT_EQ(surface.GetBytesInVMem(), 0u);
    EXPECT_NE(surface.GetD3DTexture(), nullptr);

    // A format without a device form, and a device that refuses.
    CSurface pvrtc(8, 8, 0, 9);
    EXPECT_EQ(pvrtc.GetD3DTexture(), nullptr);
    EXPECT_TRUE(log.Contains("unknown format for windows texture: 9"));
    backend->failCreateTexture = true;
    CSurface refused(8, 8);
    EXPECT_EQ(refused.GetD3DTexture(), nullptr);
    EXPECT_TRUE(log.Contains("Create texture failed"));
    EXPECT_CONTRACT_FAILURE(refused.Unload(), "m_Flags & FlagLoadOnDemand");
}

TEST_F(SurfaceFixture, ReleasedTextureLeavesNoStaleDeviceState)
{
    auto surface = std::make_unique<CSurface>(8, 8);
    CTexture texture(surface.get());
    ASSERT_TRUE(renderer->BeginScene());
    renderer->RenderTexture(&texture, 0.0f, 0.0f);
    auto* device = surface->GetD3DTexture();
    backend->ClearRecord();
    // Going mid-frame: its batched sprite is drawn first, then no state points at it.
    surface->ReleaseD3D();
    ASSERT_EQ(backend->draws.size(), 1u);
    EXPECT_EQ(backend->draws[0].texture, device);
    EXPECT_EQ(backend->stageTexture[0], nullptr);
    EXPECT_EQ(backend->Calls("ReleaseTexture").size(), 1u);
    EXPECT_EQ(backend->liveTextures, 0);
    EXPECT_EQ(renderer->GetDevice().GetWantedStage(0).Texture, nullptr);
}

TEST_F(SurfaceFixture, TextureFramesAndCopies)
{
    CSurface surface(64, 32);
    {
        CTexture whole(&surface);
        EXPECT_EQ(surface.GetRefCount(), 1);
        EXPECT_EQ(whole.GetWidth(), 64);
        EXPECT_EQ(whole.GetSurfaceRect(), (UVRect {0, 0, 1, 1}));
        EXPECT_FALSE(whole.IsAnimated());

        CTexture frames(&surface, {{0, 0, 0.5f, 1}, {0.5f, 0, 1, 1}}, 32, 32);
        EXPECT_EQ(frames.GetFrameSurfaceRect(1), (UVRect {0.5f, 0, 1, 1}));
        EXPECT_EQ(frames.GetFrameSurfaceRect(2), (UVRect {0, 0, 0.5f, 1}));
        // A copy owns its own description; the surface counts both.
        CTexture copy(frames);
        EXPECT_NE(copy.GetData(), frames.GetData());
        EXPECT_EQ(copy.GetFrameSurfaceRect(1), frames.GetFrameSurfaceRect(1));
        EXPECT_EQ(surface.GetRefCount(), 3);
        copy = whole;
        EXPECT_EQ(copy.GetFramesCount(), 1u);
        EXPECT_EQ(surface.GetRefCount(), 3);
    }
    EXPECT_EQ(surface.GetRefCount(), 0);

    // A description from the declarations is shared, never copied.
    std::vector<unsigned char> bytes(sizeof(TextureDesc) + sizeof(UVRect));
    auto* desc = new (bytes.data()) TextureDesc();
    desc->flags = TextureDesc::FlagStatic;
    desc->parts_amount = 1;
    desc->frame_width = 7;
    desc->Parts()[0] = {0, 0, 0.25f, 0.25f};
    CTexture declared(&surface, desc);
    CTexture shared(declared);
    EXPECT_EQ(shared.GetData(), desc);
    EXPECT_EQ(shared.GetWidth(), 7);
}
