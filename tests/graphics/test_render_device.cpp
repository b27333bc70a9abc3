// The render device: initial states, the state shadow, the batch and its splits, the
// frame steps.
#include "graphics/RenderDevice.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

using namespace ox::graphics;
using oxtest::RecordingBackend;

namespace {

struct DeviceFixture : ::testing::Test {
    RecordingBackend backend;
    std::unique_ptr<RenderDevice> device = std::make_unique<RenderDevice>(&backend);
    RecordingBackend::Texture a, b;

    void SetUp() override
    {
        backend.hasDevice = true;
        a.id = 1;
        b.id = 2;
        device->Init();
        ASSERT_TRUE(device->BeginScene());
        backend.ClearRecord();
    }
    std::vector<Vertex> Triangles(unsigned count, float base = 0)
    {
        std::vector<Vertex> v(count);
        for (unsigned i = 0; i < count; ++i)
            v[i] = Vertex {base + i, 0, 0, 1, 0xFFFFFFFFu, 0, 0, 0};
        return v;
    }
    void DrawWith(CDeviceTexture* texture, BlendModes mode, unsigned count = 6)
    {
        device->SetTexture(0, texture);
        device->SetBlendMode(mode);
        auto v = Triangles(count);
        device->Draw(PrimitiveTriangleList, v.data(), count);
    }
};

} // namespace

TEST_F(DeviceFixture, InitSendsFixedStatesAndStageDefaults)
{
    RecordingBackend fresh;
    fresh.hasDevice = true;
    RenderDevice other(&fresh);
    other.Init();
    auto has = [&](const std::string& call) {
        return std::find(fresh.calls.begin(), fresh.calls.end(), call) != fresh.calls.end();
    };
    EXPECT_TRUE(has("SetRenderState 27 1"));  // alpha blending on
    EXPECT_TRUE(has("SetRenderState 22 1"));  // no culling
    EXPECT_TRUE(has("SetRenderState 26 0"));  // no dithering
    EXPECT_TRUE(has("SetTextureStageState 0 1 4")); // stage 0 colour: modulate
    EXPECT_TRUE(has("SetTextureStageState 0 2 2")); // texture
    EXPECT_TRUE(has("SetTextureStageState 0 3 1")); // current
    EXPECT_TRUE(has("SetTextureStageState 1 1 1")); // stage 1 disabled
    EXPECT_TRUE(has("SetTextureStageState 1 4 1"));
    EXPECT_TRUE(has("SetSamplerState 0 1 3"));      // clamp U
    EXPECT_TRUE(has("SetSamplerState 0 6 2"));      // linear minification
    EXPECT_TRUE(has("SetSamplerState 1 7 0"));      // no mip filter
    EXPECT_EQ(fresh.srcBlend, 5u);
    EXPECT_EQ(fresh.destBlend, 6u);
    EXPECT_TRUE(fresh.Calls("SetTextureStageState 0 7").empty()) << "unsupported states are not sent";

    RecordingBackend none;
    RenderDevice absent(&none);
    EXPECT_CONTRACT_FAILURE(absent.Init(), "device");
}

TEST_F(DeviceFixture, EqualStateRunsAreOneDrawCall)
{
    DrawWith(&a, BlendNormal);
    DrawWith(&a, BlendNormal);
    // A blend mode set away and back before the next draw does not split.
    device->SetBlendMode(BlendAdditive);
    DrawWith(&a, BlendNormal);
    device->Flush();
    ASSERT_EQ(backend.draws.size(), 1u);
    EXPECT_EQ(backend.draws[0].vertices.size(), 18u);
    EXPECT_EQ(backend.draws[0].primitives, 6u);
    EXPECT_TRUE(backend.Calls("SetRenderState").empty()) << "no state call for an unchanged state";

    backend.ClearRecord();
    DrawWith(&a, BlendNormal);
    DrawWith(&b, BlendNormal);
    DrawWith(&a, BlendNormal);
    DrawWith(&a, BlendAdditive);
    device->Flush();
    ASSERT_EQ(backend.draws.size(), 4u);
    EXPECT_EQ(backend.draws[1].texture, &b);
    EXPECT_EQ(backend.draws[2].texture, &a);
    EXPECT_EQ(backend.draws[3].srcBlend, 5u);
    EXPECT_EQ(backend.draws[3].destBlend, 2u) << "additive: source alpha, one";

    // A change of primitive type flushes too; lines count two vertices per primitive.
    backend.ClearRecord();
    auto lines = Triangles(4);
    device->Draw(PrimitiveLineList, lines.data(), 4);
    DrawWith(&a, BlendNone, 3);
    device->Flush();
    ASSERT_EQ(backend.draws.size(), 2u);
    EXPECT_EQ(backend.draws[0].type, PrimitiveLineList);
    EXPECT_EQ(backend.draws[0].primitives, 2u);
    EXPECT_EQ(backend.draws[1].srcBlend, 2u);
    EXPECT_EQ(backend.draws[1].destBlend, 1u) << "none: one, zero";
}

TEST_F(DeviceFixture, FullBatchSplitsOnWholePrimitives)
{
    // 6,000 vertices fit. Three already there and 6,000 more: the first call takes 6,000.
    DrawWith(&a, BlendNormal, 3);
    auto big = Triangles(6000, 3);
    device->Draw(PrimitiveTriangleList, big.data(), 6000);
    device->Flush();
    ASSERT_EQ(backend.draws.size(), 2u);
    EXPECT_EQ(backend.draws[0].vertices.size(), 6000u);
    EXPECT_EQ(backend.draws[1].vertices.size(), 3u);
    EXPECT_EQ(backend.draws[1].vertices[0].x, 5997 + 3) << "nothing lost or repeated";

    // Lines with four in the batch: 5,996 more fill it exactly, the rest follows.
    backend.ClearRecord();
    auto lines = Triangles(4);
    device->Draw(PrimitiveLineList, lines.data(), 4);
    auto more = Triangles(13000, 4);
    device->Draw(PrimitiveLineList, more.data(), 13000);
    device->Flush();
    ASSERT_EQ(backend.draws.size(), 3u);
    unsigned total = 0;
    for (const auto& draw : backend.draws) {
        EXPECT_EQ(draw.vertices.size() % 2, 0u);
        EXPECT_LE(draw.vertices.size(), 6000u);
        for (size_t i = 0; i < draw.vertices.size(); ++i)
            EXPECT_EQ(draw.vertices[i].x, total + i);
        total += static_cast<unsigned>(draw.vertices.size());
    }
    EXPECT_EQ(total, 13004u);
}

TEST_F(DeviceFixture, FrameStepsAndTheEventQuery)
{
    DrawWith(&a, BlendNormal);
    backend.ClearRecord();
    // Clear draws what is batched first, so the order of the picture is kept.
    device->Clear(Color(0xFF112233u));
    device->EndScene();
    EXPECT_EQ(backend.calls.front(), "DrawPrimitiveUP 4 2 6");
    EXPECT_EQ(backend.calls[1], "Clear FF112233");
    EXPECT_TRUE(backend.Calls("SetTexture").empty()) << "the end of a frame does not apply textures";
    EXPECT_EQ(backend.Calls("Present").size(), 1u);
    EXPECT_EQ(backend.queryPolls, 0) << "a healthy frame does not wait";

    // The next frame starts cleared to black with every state forced and no textures.
    backend.ClearRecord();
    ASSERT_TRUE(device->BeginScene());
    EXPECT_EQ(backend.calls[1], "Clear FF000000");
    EXPECT_EQ(backend.Calls("SetTexture 0 null").size(), 1u);
    EXPECT_EQ(backend.Calls("SetSamplerState 0 1 3").size(), 1u);

    // A failed present waits for the frame's event.
    backend.presentResult = ResultDeviceLost;
    device->EndScene();
    EXPECT_EQ(backend.queryPolls, 3);

    // No query available: the flag falls once and stays down.
    backend.queryAvailable = false;
    backend.presentResult = ResultOk;
    ASSERT_TRUE(device->BeginScene());
    device->EndScene();
    EXPECT_FALSE(device->IsUsingQuery());
    backend.ClearRecord();
    ASSERT_TRUE(device->BeginScene());
    device->EndScene();
    EXPECT_TRUE(backend.Calls("CreateEventQuery").empty());

    backend.beginSceneResult = ResultDeviceLost;
    EXPECT_FALSE(device->BeginScene());
}

TEST(DeviceProblems, ASurfaceWithoutADeviceTextureIsReportedOncePerDevice)
{
    RecordingBackend* backend = nullptr;
    std::unique_ptr<CRenderer> renderer = oxtest::MakeRecordingRenderer(backend, 64, 64, 64, 64);
    oxtest::LogCapture log;
    CSurface pvrtc(8, 8, 0, 9), other(8, 8, 0, 10);
    CTexture texture(&pvrtc), second(&other);
    auto frames = [&](int count) {
        for (int i = 0; i < count; ++i) {
            ASSERT_TRUE(renderer->BeginScene());
            renderer->RenderTexture(&texture, 0.0f, 0.0f);
            renderer->RenderTexture(&second, 8.0f, 0.0f);
            renderer->EndScene();
        }
    };
    auto told = [&](const std::string& text) {
        auto entries = log.Entries();
        return std::count(entries.begin(), entries.end(), "graphics|3|" + text);
    };
    frames(3);
    EXPECT_EQ(told("unknown format for windows texture: 9"), 1);
    EXPECT_EQ(told("unknown format for windows texture: 10"), 1) << "once per surface, not once in all";
    // A new device (after a reset) tells it once more.
    renderer->GetDevice().Init();
    frames(2);
    EXPECT_EQ(told("unknown format for windows texture: 9"), 2);
}
