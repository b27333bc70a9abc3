// The renderer on the recording backend: aspect mapping, the vertices of every primitive,
// the device's life and loss, read-back and render targets.
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace ox::graphics;
using ox::misc::FloatRect;
using ox::misc::Poly4;
using ox::misc::ShortRect;
using oxtest::RecordingBackend;

namespace {

struct RendererFixture : ::testing::Test {
    RecordingBackend* backend = nullptr;
    std::unique_ptr<CRenderer> renderer;

    void SetUp() override { Make(1024, 768); }

    void Make(unsigned width, unsigned height)
    {
        renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, width, height);
        ASSERT_TRUE(renderer->BeginScene());
        backend->ClearRecord();
    }
    // Everything drawn so far, in order.
    std::vector<Vertex> Drawn()
    {
        renderer->Flush();
        std::vector<Vertex> all;
        for (const auto& draw : backend->draws)
            all.insert(all.end(), draw.vertices.begin(), draw.vertices.end());
        return all;
    }
};

void ExpectVertex(const Vertex& v, float x, float y, float u, float vv, uint32_t color, const char* what)
{
    SCOPED_TRACE(what);
    EXPECT_FLOAT_EQ(v.x, x);
    EXPECT_FLOAT_EQ(v.y, y);
    EXPECT_FLOAT_EQ(v.u, u);
    EXPECT_FLOAT_EQ(v.v, vv);
    EXPECT_EQ(v.diffuse, color);
    EXPECT_EQ(v.z, 0.0f);
    EXPECT_EQ(v.rhw, 1.0f);
    EXPECT_EQ(v.specular, 0u);
}

} // namespace

TEST(RendererAspect, WiderNarrowerAndNearlyEqualWindows)
{
    struct Case {
        unsigned w, h;
        float kx, ky, ox, oy;
    } cases[] = {
        {1920, 1080, 1.40625f, 1.40625f, 240, 0},                 // pillar bars
        {1280, 1024, 1.25f, 1.25f, 0, 32},                        // letterbox: 960 rows in float arithmetic
        {800, 800, 0.78125f, 0.78125f, 0, 100},                   // narrower
        {1366, 1024, 1366 / 1024.0f, 1024 / 768.0f, 0, 0},        // within 0.001: stretched
        {1024, 768, 1, 1, 0, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::to_string(c.w) + "x" + std::to_string(c.h));
        CRenderer r(std::make_unique<RecordingBackend>());
        r.SetSourceResolution(1024, 768);
        r.InitWindow(false, true, c.w, c.h);
        EXPECT_FLOAT_EQ(r.GetScale().X, c.kx);
        EXPECT_FLOAT_EQ(r.GetScale().Y, c.ky);
        EXPECT_FLOAT_EQ(r.GetAspectOffset().X, c.ox);
        EXPECT_FLOAT_EQ(r.GetAspectOffset().Y, c.oy);
        const FloatRect active = r.GetActiveRect();
        EXPECT_FLOAT_EQ(active.Width, c.w - 2 * c.ox);
        EXPECT_FLOAT_EQ(active.Height, c.h - 2 * c.oy);
    }
    // Without keeping the aspect the canvas stretches; an equal size is 1 either way.
    CRenderer r(std::make_unique<RecordingBackend>());
    r.SetSourceResolution(1024, 768);
    r.InitWindow(false, true, 1920, 1080);
    r.SetKeepAspect(false);
    EXPECT_FLOAT_EQ(r.GetScale().X, 1.875f);
    EXPECT_FLOAT_EQ(r.GetScale().Y, 1.40625f);
    EXPECT_EQ(r.GetAspectOffset().X, 0);
}

TEST_F(RendererFixture, AspectMatrixPlacesTheCanvasInTheWindow)
{
    Make(1920, 1080);
    renderer->RenderFilledPoly4(ox::misc::RectToPoly4({0, 0, 1024, 768}), Color(0xFF00FF00u));
    auto v = Drawn();
    ASSERT_EQ(v.size(), 6u);
    ExpectVertex(v[0], 239.5f, -0.5f, 0, 0, 0xFF00FF00u, "top left");
    ExpectVertex(v[2], 1679.5f, 1079.5f, 0, 0, 0xFF00FF00u, "bottom right");
    EXPECT_EQ(backend->draws[0].texture, nullptr);
}

TEST_F(RendererFixture, UntexturedPrimitivesAndColours)
{
    renderer->SetColor(Color(0x80FF8000u));
    renderer->RenderLine({1, 2}, {11, 12}, Color(0xFF808080u));
    renderer->RenderRect({10, 20, 30, 40});
    renderer->RenderFilledPoly4(Poly4 {{{0, 0}, {4, 0}, {4, 3}, {0, 3}}}, Color(0xFFFFFFFFu));
    auto v = Drawn();
    ASSERT_EQ(backend->draws.size(), 2u);
    EXPECT_EQ(backend->draws[0].type, PrimitiveLineList);
    EXPECT_EQ(backend->draws[0].vertices.size(), 10u) << "one line, then four for the outline";
    // Current colour times the given one, per channel truncated: green 0x80*0x80/255 = 64.25 -> 0x40.
    ExpectVertex(v[0], 0.5f, 1.5f, 0, 0, 0x80804000u, "line from");
    ExpectVertex(v[1], 10.5f, 11.5f, 0, 0, 0x80804000u, "line to");
    // The outline runs around the corners; a white argument keeps the current colour.
    ExpectVertex(v[2], 9.5f, 19.5f, 0, 0, 0x80FF8000u, "outline start");
    ExpectVertex(v[5], 39.5f, 59.5f, 0, 0, 0x80FF8000u, "outline corner");
    // Filled: triangles (0,1,2) and (0,2,3).
    EXPECT_EQ(backend->draws[1].type, PrimitiveTriangleList);
    const float xs[6] = {-0.5f, 3.5f, 3.5f, -0.5f, 3.5f, -0.5f};
    const float ys[6] = {-0.5f, -0.5f, 2.5f, -0.5f, 2.5f, 2.5f};
    for (int i = 0; i < 6; ++i)
        ExpectVertex(v[10 + i], xs[i], ys[i], 0, 0, 0x80FF8000u, "filled");

    // Alpha 0 in either colour draws nothing and changes no device state.
    backend->ClearRecord();
    renderer->RenderLine({0, 0}, {5, 5}, Color(0x00FFFFFFu));
    renderer->SetBlendMode(BlendAdditive);
    renderer->SetColor(Color(0x00FFFFFFu));
    renderer->RenderFilledPoly4(Poly4 {}, Color(0xFF000000u));
    renderer->Flush();
    EXPECT_TRUE(backend->calls.empty());
}

struct TextureFixture : RendererFixture {
    std::unique_ptr<CSurface> surface;
    std::unique_ptr<CTexture> texture;
    CDeviceTexture* device = nullptr;

    void SetUp() override
    {
        RendererFixture::SetUp();
        // A 64 x 32 sheet of two frames of 32 x 32.
        surface = std::make_unique<CSurface>(64, 32);
        texture = std::make_unique<CTexture>(surface.get(), std::vector<UVRect> {{0, 0, 0.5f, 1}, {0.5f, 0, 1, 1}},
                                             32, 32);
        device = surface->GetD3DTexture();
        ASSERT_NE(device, nullptr);
        backend->ClearRecord();
    }
    void TearDown() override
    {
        texture.reset();
        surface.reset();
    }
};

TEST_F(TextureFixture, RectangleQuadsFramesAndSourceRectangles)
{
    renderer->RenderTexture(texture.get(), 10.0f, 20.0f, 1u);          // natural size, second frame
    renderer->RenderTexture(texture.get(), FloatRect(0, 0, 8, 4), 7u); // past the count: frame 0
    renderer->RenderTexture(texture.get(), 100.0f, 50.0f, ShortRect(16, 8, 32, 16));
    renderer->RenderTexture(texture.get(), FloatRect(0, 0, 10, 10), ShortRect(0, 0, 0, 0));
    auto v = Drawn();
    ASSERT_EQ(v.size(), 24u);
    ASSERT_EQ(backend->draws.size(), 1u) << "one texture, one state: one draw";
    EXPECT_EQ(backend->draws[0].texture, device);
    // TL, TR, BL, BL, TR, BR.
    ExpectVertex(v[0], 9.5f, 19.5f, 0.5f, 0, 0xFFFFFFFFu, "TL");
    ExpectVertex(v[1], 41.5f, 19.5f, 1, 0, 0xFFFFFFFFu, "TR");
    ExpectVertex(v[2], 9.5f, 51.5f, 0.5f, 1, 0xFFFFFFFFu, "BL");
    EXPECT_EQ(std::memcmp(&v[3], &v[2], sizeof(Vertex)), 0);
    EXPECT_EQ(std::memcmp(&v[4], &v[1], sizeof(Vertex)), 0);
    ExpectVertex(v[5], 41.5f, 51.5f, 1, 1, 0xFFFFFFFFu, "BR");
    ExpectVertex(v[11], 7.5f, 3.5f, 0.5f, 1, 0xFFFFFFFFu, "frame 0");
    // Source in surface pixels: 16/64, 8/32, 48/64, 24/32; destination of the source's size.
    ExpectVertex(v[12], 99.5f, 49.5f, 0.25f, 0.25f, 0xFFFFFFFFu, "source TL");
    ExpectVertex(v[17], 131.5f, 65.5f, 0.75f, 0.75f, 0xFFFFFFFFu, "source BR");
    // An empty source is the first frame.
    ExpectVertex(v[23], 9.5f, 9.5f, 0.5f, 1, 0xFFFFFFFFu, "empty source");
}

TEST_F(TextureFixture, PolyQuadIsFourTrianglesAroundTheCentre)
{
    const Poly4 poly {{{0, 0}, {40, 0}, {60, 20}, {0, 20}}};
    renderer->RenderTexture(texture.get(), poly, 0u, Color(0xFF0000FFu));
    auto v = Drawn();
    ASSERT_EQ(v.size(), 12u);
    // Centre: the bilinear middle (25, 10), at the middle of the UV rectangle.
    const float cu = 0.25f, cv = 0.5f;
    const float corners[4][4] = {{0, 0, 0, 0}, {40, 0, 0.5f, 0}, {60, 20, 0.5f, 1}, {0, 20, 0, 1}};
    for (int i = 0; i < 4; ++i) {
        ExpectVertex(v[i * 3], 24.5f, 9.5f, cu, cv, 0xFF0000FFu, "centre");
        const float* c = corners[i];
        const float* p = corners[(i + 3) % 4];
        ExpectVertex(v[i * 3 + 1], c[0] - 0.5f, c[1] - 0.5f, c[2], c[3], 0xFF0000FFu, "corner i");
        ExpectVertex(v[i * 3 + 2], p[0] - 0.5f, p[1] - 0.5f, p[2], p[3], 0xFF0000FFu, "corner i-1");
    }

    renderer->RenderTextureTriangle(texture.get(), {0, 0}, {10, 0}, {0, 10}, {0.1f, 0.2f}, {0.3f, 0.4f},
                                    {0.5f, 0.6f});
    v = Drawn();
    ASSERT_EQ(v.size(), 15u);
    ExpectVertex(v[13], 9.5f, -0.5f, 0.3f, 0.4f, 0xFFFFFFFFu, "triangle");
    renderer->RenderTexture(nullptr, 0.0f, 0.0f);
    EXPECT_EQ(Drawn().size(), 15u) << "a null texture draws nothing";
}

TEST_F(TextureFixture, NinePartBoxTilesAndKeepsCornersUnscaled)
{
    // One 48 x 48 frame: cells of 16.
    CSurface tile(48, 48);
    CTexture box(&tile);
    struct Quad {
        float x, y, w, h, u1, v1, u2, v2;
    };
    auto quads = [&] {
        auto v = Drawn();
        std::vector<Quad> out;
        for (size_t i = 0; i + 5 < v.size(); i += 6)
            out.push_back({v[i].x + 0.5f, v[i].y + 0.5f, v[i + 5].x - v[i].x, v[i + 5].y - v[i].y, v[i].u, v[i].v,
                           v[i + 5].u, v[i + 5].v});
        backend->ClearRecord();
        return out;
    };
    // Equal on both axes, or smaller: one plain quad.
    renderer->RenderTextureBox(&box, FloatRect(0, 0, 48, 48));
    EXPECT_EQ(quads().size(), 1u);
    renderer->RenderTextureBox(&box, FloatRect(0, 0, 40, 100));
    EXPECT_EQ(quads().size(), 1u);

    // Half a pixel wider: three columns, the remainder under 1 is skipped.
    renderer->RenderTextureBox(&box, FloatRect(0, 0, 48.5f, 48));
    auto q = quads();
    ASSERT_EQ(q.size(), 9u);
    EXPECT_FLOAT_EQ(q[0].w, 16);
    EXPECT_FLOAT_EQ(q[0].h, 16);
    EXPECT_FLOAT_EQ(q[0].u2, 1.0f / 3);
    EXPECT_FLOAT_EQ(q[8].x, 32);
    EXPECT_FLOAT_EQ(q[8].y, 32);
    EXPECT_FLOAT_EQ(q[8].u1, 2.0f / 3);

    // 88 wide: 3 middle columns and a partial one of 8 cut in proportion; 40 high... on a
    // 56 high box: 1 middle row and a partial row of 8.
    renderer->RenderTextureBox(&box, FloatRect(10, 20, 88, 56));
    q = quads();
    ASSERT_EQ(q.size(), 6u * 4u);
    EXPECT_FLOAT_EQ(q[4].x, 10 + 16 + 48);
    EXPECT_FLOAT_EQ(q[4].w, 8);
    EXPECT_FLOAT_EQ(q[4].u1, 1.0f / 3);
    EXPECT_NEAR(q[4].u2, 1.0f / 3 + (1.0f / 3) * 0.5f, 1e-6);
    EXPECT_FLOAT_EQ(q[5].x, 10 + 72);
    EXPECT_FLOAT_EQ(q[5].w, 16) << "the right corner stays unscaled";
    EXPECT_FLOAT_EQ(q[12].y, 20 + 32);
    EXPECT_FLOAT_EQ(q[12].h, 8);
    EXPECT_NEAR(q[12].v2, 1.0f / 3 + (1.0f / 3) * 0.5f, 1e-6);
    EXPECT_FLOAT_EQ(q[18].y, 20 + 40);
    EXPECT_FLOAT_EQ(q[18].v1, 2.0f / 3);
}

TEST_F(TextureFixture, ClipAndMatrixReachTheVertices)
{
    renderer->PushState();
    renderer->SetClipPoly(ox::misc::RectToPoly4({0, 0, 20, 20}));
    renderer->ApplyMatrix(ox::misc::MatrixTranslation(10, 0));
    renderer->RenderTexture(texture.get(), FloatRect(0, 0, 20, 20));
    renderer->PopState();
    auto v = Drawn();
    float maxX = -1e9f, minU = 1e9f, maxU = -1e9f;
    for (const Vertex& x : v) {
        maxX = std::max(maxX, x.x);
        minU = std::min(minU, x.u);
        maxU = std::max(maxU, x.u);
    }
    EXPECT_FLOAT_EQ(maxX, 19.5f) << "cut at the clip's right edge";
    EXPECT_FLOAT_EQ(minU, 0.0f);
    EXPECT_FLOAT_EQ(maxU, 0.25f) << "half the frame's U range is left";
    // A line across a rotated clip keeps only its part inside, as one line.
    renderer->PushState();
    renderer->SetClipPoly(Poly4 {{{50, 20}, {80, 50}, {50, 80}, {20, 50}}});
    backend->ClearRecord();
    renderer->RenderLine({0, 50}, {100, 50});
    auto line = Drawn();
    renderer->PopState();
    ASSERT_EQ(line.size(), 2u);
    EXPECT_NEAR(std::min(line[0].x, line[1].x), 19.5f, 1e-3);
    EXPECT_NEAR(std::max(line[0].x, line[1].x), 79.5f, 1e-3);

    // After the pop nothing clips or moves.
    backend->ClearRecord();
    renderer->RenderTexture(texture.get(), FloatRect(0, 0, 40, 40));
    EXPECT_EQ(Drawn().size(), 6u);
}

TEST_F(RendererFixture, DeviceLossAndRecovery)
{
    oxtest::LogCapture log;
    renderer->EndScene();
    // Lost: the frame is skipped until the device can be reset.
    backend->cooperativeLevel = ResultDeviceLost;
    EXPECT_FALSE(renderer->BeginScene());
    EXPECT_TRUE(renderer->IsDeviceLost());
    EXPECT_TRUE(log.Contains("Test cooperative level failed, result: 88760868"));
    EXPECT_FALSE(renderer->BeginScene());
    EXPECT_EQ(backend->resets, 0);

    // Ready for a reset: InitGraphics resets and the frame goes on.
    backend->cooperativeLevel = ResultDeviceNotReset;
    backend->ClearRecord();
    EXPECT_TRUE(renderer->BeginScene());
    EXPECT_EQ(backend->resets, 1);
    EXPECT_FALSE(backend->Calls("SetRenderState 27 1").empty()) << "states set again after the reset";
    renderer->EndScene();
    backend->cooperativeLevel = ResultOk;
    EXPECT_TRUE(renderer->BeginScene());
    EXPECT_FALSE(renderer->IsDeviceLost());
    renderer->EndScene();

    // A failed scene start marks the device lost; the next frame resets it.
    backend->beginSceneResult = ResultFail;
    EXPECT_FALSE(renderer->BeginScene());
    EXPECT_TRUE(renderer->IsDeviceLost());
    backend->beginSceneResult = ResultOk;
    EXPECT_TRUE(renderer->BeginScene());
    EXPECT_EQ(backend->resets, 2);
    renderer->EndScene();
}

TEST_F(RendererFixture, ModeRestoreIsHandedToTheCaller)
{
    renderer->EndScene();
    EXPECT_FALSE(renderer->CheckModeRestore().has_value());

    // A window asks for its own size again, once.
    renderer->RequestModeRestore(false);
    std::optional<ModeRequest> mode = renderer->CheckModeRestore();
    ASSERT_TRUE(mode.has_value());
    EXPECT_FALSE(mode->fullscreen);
    EXPECT_FALSE(mode->bpp32);
    EXPECT_EQ(mode->width, 1024u);
    EXPECT_EQ(mode->height, 768u);
    EXPECT_FALSE(renderer->CheckModeRestore().has_value());
    EXPECT_TRUE(backend->hasDevice);

    // Full screen: the device goes, and the desktop's size (0 x 0) is asked for.
    renderer->InitWindow(true, true, 1024, 768);
    renderer->RequestModeRestore(true);
    mode = renderer->CheckModeRestore();
    ASSERT_TRUE(mode.has_value());
    EXPECT_TRUE(mode->fullscreen && mode->bpp32);
    EXPECT_EQ(mode->width, 0u);
    EXPECT_EQ(mode->height, 0u);
    EXPECT_FALSE(backend->hasDevice);
    EXPECT_TRUE(renderer->BeginScene()) << "a frame without a device makes a new one";
    EXPECT_TRUE(backend->hasDevice);
}

TEST(RendererDevice, CreationFailureIsLoggedAndRetriedEachFrame)
{
    oxtest::LogCapture log;
    auto owned = std::make_unique<RecordingBackend>();
    RecordingBackend* backend = owned.get();
    backend->createResult = ResultFail;
    CRenderer renderer(std::move(owned));
    renderer.SetSourceResolution(1024, 768);
    EXPECT_TRUE(renderer.InitWindow(false, true, 1024, 768));
    EXPECT_TRUE(log.Contains("Create D3D device failed, result: 80004005"));
    EXPECT_FALSE(renderer.BeginScene());
    backend->createResult = ResultOk;
    EXPECT_TRUE(renderer.BeginScene());
    EXPECT_EQ(backend->creates, 1);
    EXPECT_TRUE(log.Contains("CRenderer::InitGraphics calculated aspect: m_AspectK.X=1.000000"));
}

TEST_F(RendererFixture, ReadBackMapsSourceAreasToWindowPixels)
{
    Make(1920, 1080);
    renderer->Clear(Color(0xFF336699u));
    std::vector<uint32_t> pixels;
    unsigned w = 0, h = 0;
    ASSERT_TRUE(renderer->ReadBackBuffer(pixels, w, h, {0, 0, 0, 0}));
    EXPECT_EQ(w, 1920u);
    EXPECT_EQ(h, 1080u);
    ASSERT_TRUE(renderer->ReadBackBuffer(pixels, w, h, {-100, 0, 2000, 384}));
    EXPECT_EQ(backend->calls.back(), "ReadBackBuffer 240 0 1440 540") << "cut to the canvas, then mapped";
    EXPECT_EQ(pixels.size(), 1440u * 540u);
    EXPECT_EQ(pixels[0], 0xFF336699u);
    EXPECT_FALSE(renderer->ReadBackBuffer(pixels, w, h, {2000, 0, 10, 10}));
}

TEST_F(RendererFixture, RenderTargetsAndShaders)
{
    CSurface plain(16, 16);
    EXPECT_CONTRACT_FAILURE(renderer->SetRenderTarget(&plain), "is_render_target");

    CSurface target(16, 16, CSurface::FlagRenderTarget);
    renderer->SetRenderTarget(&target);
    renderer->RenderFilledPoly4(ox::misc::RectToPoly4({0, 0, 4, 4}));
    renderer->SetRenderTarget(nullptr);
    renderer->RenderFilledPoly4(ox::misc::RectToPoly4({0, 0, 4, 4}));
    renderer->Flush();
    ASSERT_EQ(backend->draws.size(), 2u);
    ASSERT_NE(backend->draws[0].target, nullptr);
    EXPECT_TRUE(backend->draws[0].target->RenderTarget);
    EXPECT_EQ(backend->draws[1].target, nullptr);

    oxtest::LogCapture log;
    CPixelShader broken;
    EXPECT_FALSE(broken.LoadSource("an error"));
    EXPECT_TRUE(log.Contains("LoadShader failed: 0:1: syntax error"));
    CPixelShader shader;
    ASSERT_TRUE(shader.LoadSource("void tint() {}", "tint"));
    EXPECT_NE(shader.GetSource().find("void main() { tint(); }"), std::string::npos);
    backend->ClearRecord();
    renderer->SetPixelShader(&shader);
    renderer->RenderFilledPoly4(ox::misc::RectToPoly4({0, 0, 4, 4}));
    renderer->Flush();
    ASSERT_EQ(backend->draws.size(), 1u);
    EXPECT_NE(backend->draws[0].shader, nullptr);
    // A device that goes and comes back gets the shader again from its source.
    renderer->ReleaseDevice(false);
    EXPECT_EQ(shader.GetDeviceShader(), nullptr);
    renderer->InitGraphics();
    EXPECT_NE(shader.GetDeviceShader(), nullptr);
}
