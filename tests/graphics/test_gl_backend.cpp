// The OpenGL backend on real pixels: a small window (headless with SDL's offscreen driver)
// whose back buffer is read after drawing through the renderer.
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "graphics/gl/GlBackend.h"
#include "support/FakePlatform.h"
#include "support/TestSupport.h"

#include <SDL.h>

using namespace ox::graphics;
using ox::misc::FloatRect;
using ox::misc::RectToPoly4;

namespace {

constexpr int kWidth = 64, kHeight = 48;

class GlPixels : public ::testing::Test {
protected:
    static void SetUpTestSuite()
    {
        if (!getenv("SDL_VIDEODRIVER"))
            SDL_SetHint(SDL_HINT_VIDEODRIVER, "offscreen");
        if (SDL_InitSubSystem(SDL_INIT_VIDEO) != 0) {
            s_Skip = std::string("no video: ") + SDL_GetError();
            return;
        }
        s_Window = SDL_CreateWindow("gl test", 0, 0, kWidth, kHeight, SDL_WINDOW_OPENGL | SDL_WINDOW_HIDDEN);
        if (!s_Window)
            s_Skip = std::string("no OpenGL window: ") + SDL_GetError();
    }
    static void TearDownTestSuite()
    {
        if (s_Window)
            SDL_DestroyWindow(s_Window);
        s_Window = nullptr;
        SDL_QuitSubSystem(SDL_INIT_VIDEO);
    }

    void SetUp() override
    {
        if (!s_Skip.empty())
            GTEST_SKIP() << "OpenGL pixel tests skipped: " << s_Skip;
        platform.windowHandle = s_Window;
        platform.client = {0, 0, kWidth, kHeight};
        renderer.SetSystemIntegration(&platform);
        renderer.SetSourceResolution(kWidth, kHeight);
        renderer.InitWindow(false, true, kWidth, kHeight);
        if (!renderer.GetBackend()->HasDevice())
            GTEST_SKIP() << "OpenGL pixel tests skipped: no OpenGL 3.3 context could be made";
        ASSERT_TRUE(renderer.BeginScene());
    }
    void TearDown() override { renderer.ReleaseDevice(false); }

    std::vector<uint32_t> Read(ox::misc::IntRect area = {})
    {
        std::vector<uint32_t> pixels;
        unsigned w = 0, h = 0;
        EXPECT_TRUE(renderer.ReadBackBuffer(pixels, w, h, area));
        return pixels;
    }
    static uint32_t At(const std::vector<uint32_t>& pixels, int x, int y) { return pixels[y * kWidth + x] | 0xFF000000u; }

    static std::string s_Skip;
    static SDL_Window* s_Window;
    oxtest::FakePlatform platform;
    CRenderer renderer {std::make_unique<CGlBackend>()};
};

std::string GlPixels::s_Skip;
SDL_Window* GlPixels::s_Window = nullptr;

// Within one step of 8 bits per channel.
void ExpectColor(uint32_t got, uint32_t want, const char* what)
{
    for (int shift = 0; shift < 24; shift += 8) {
        const int a = (got >> shift) & 0xFF, b = (want >> shift) & 0xFF;
        EXPECT_LE(std::abs(a - b), 1) << what << std::hex << ": got " << got << ", want " << want;
    }
}

} // namespace

TEST_F(GlPixels, PixelCentresOrientationAndVertexColourOrder)
{
    renderer.RenderFilledPoly4(RectToPoly4({3, 4, 1, 1}), Color(0xFF102030u));
    renderer.RenderFilledPoly4(RectToPoly4({0, 0, 2, 1}), Color(0xFFFF0000u));
    const auto pixels = Read();
    ASSERT_EQ(pixels.size(), static_cast<size_t>(kWidth * kHeight));
    EXPECT_EQ(At(pixels, 3, 4), 0xFF102030u) << "one source unit is exactly one pixel";
    for (auto [x, y] : {std::pair {2, 4}, {4, 4}, {3, 3}, {3, 5}})
        EXPECT_EQ(At(pixels, x, y), 0xFF000000u) << x << "," << y;
    EXPECT_EQ(At(pixels, 0, 0), 0xFFFF0000u) << "the first row is the top";
    EXPECT_EQ(At(pixels, 1, 0), 0xFFFF0000u);
    EXPECT_EQ(At(pixels, 2, 0), 0xFF000000u);
    EXPECT_EQ(At(pixels, 0, 1), 0xFF000000u);
}

TEST_F(GlPixels, TexturesKeepTexelOrderAndChannels)
{
    CSurface surface(2, 2);
    const uint32_t texels[4] = {0xFFFF0000u, 0xFF00FF00u, 0xFF0000FFu, 0xFF123456u};
    ASSERT_TRUE(surface.LoadBits(texels, sizeof texels, 2, 2, FormatA8R8G8B8));
    CTexture texture(&surface);
    renderer.RenderTexture(&texture, 10.0f, 20.0f);
    renderer.RenderTexture(&texture, FloatRect(30, 20, 2, 2), 0u, Color(0xFF808080u));
    const auto pixels = Read();
    EXPECT_EQ(At(pixels, 10, 20), texels[0]);
    EXPECT_EQ(At(pixels, 11, 20), texels[1]);
    EXPECT_EQ(At(pixels, 10, 21), texels[2]);
    EXPECT_EQ(At(pixels, 11, 21), texels[3]);
    EXPECT_EQ(At(pixels, 12, 20), 0xFF000000u);
    ExpectColor(At(pixels, 30, 20), 0xFF800000u, "modulated by the vertex colour");

    // The system-memory copy reads back what was uploaded.
    surface.CreateBuffer();
    surface.LoadBuffer();
    EXPECT_EQ(surface.GetBuffer()[3], texels[3]);
    surface.ReleaseD3D();
}

TEST_F(GlPixels, BlendModes)
{
    renderer.Clear(Color(0xFF404040u));
    renderer.SetBlendMode(BlendNone);
    renderer.RenderFilledPoly4(RectToPoly4({0, 0, 1, 1}), Color(0x80FF0000u));
    renderer.SetBlendMode(BlendNormal);
    renderer.RenderFilledPoly4(RectToPoly4({1, 0, 1, 1}), Color(0x80FF0000u));
    renderer.SetBlendMode(BlendAdditive);
    renderer.RenderFilledPoly4(RectToPoly4({2, 0, 1, 1}), Color(0x80FF0000u));
    renderer.RenderFilledPoly4(RectToPoly4({2, 0, 1, 1}), Color(0x80FF0000u));
    const auto pixels = Read({0, 0, 4, 1});
    ASSERT_EQ(pixels.size(), 4u);
    ExpectColor(pixels[0], 0xFF0000, "none: the source replaces");
    // 0x40 * (1 - 128/255) + 0xFF * 128/255, and 0x40 * (1 - 128/255) for the others.
    ExpectColor(pixels[1], 0x9F2020, "normal: source over");
    // 0x40 + 2 * 0xFF * 128/255, clamped; the others stay.
    ExpectColor(pixels[2], 0xFF4040, "additive");
    ExpectColor(pixels[3], 0x404040, "untouched");
}

TEST_F(GlPixels, RenderTargetIsATextureWithTheFirstRowOnTop)
{
    CSurface target(8, 8, CSurface::FlagRenderTarget);
    CTexture texture(&target);
    renderer.SetRenderTarget(&target);
    renderer.Clear(Color(0xFF0000FFu));
    renderer.RenderFilledPoly4(RectToPoly4({1, 0, 1, 1}), Color(0xFFFF0000u));
    renderer.SetRenderTarget(nullptr);
    renderer.RenderTexture(&texture, 20.0f, 10.0f);
    const auto pixels = Read();
    EXPECT_EQ(At(pixels, 20, 10), 0xFF0000FFu);
    EXPECT_EQ(At(pixels, 21, 10), 0xFFFF0000u);
    EXPECT_EQ(At(pixels, 21, 11), 0xFF0000FFu);
    EXPECT_EQ(At(pixels, 28, 10), 0xFF000000u) << "the back buffer's own clear is untouched";

    target.CreateBuffer();
    target.LoadBuffer();
    EXPECT_EQ(target.GetBuffer()[1], 0xFFFF0000u);
    EXPECT_EQ(target.GetBuffer()[8 + 1], 0xFF0000FFu);
    target.ReleaseD3D();
}

TEST_F(GlPixels, ReadBackOfAnAreaAndAPixelShader)
{
    renderer.RenderFilledPoly4(RectToPoly4({5, 6, 1, 1}), Color(0xFF00FF00u));
    auto area = Read({5, 6, 2, 2});
    ASSERT_EQ(area.size(), 4u);
    EXPECT_EQ(area[0] | 0xFF000000u, 0xFF00FF00u);
    EXPECT_EQ(area[1] | 0xFF000000u, 0xFF000000u);

    CPixelShader shader;
    ASSERT_TRUE(shader.LoadSource("#version 330 core\nin vec4 v_Color;\nout vec4 o_Color;\n"
                                  "void invert() { o_Color = vec4(1.0 - v_Color.rgb, v_Color.a); }\n",
                                  "invert"));
    renderer.SetPixelShader(&shader);
    renderer.RenderFilledPoly4(RectToPoly4({0, 10, 1, 1}), Color(0xFF00FF00u));
    renderer.SetPixelShader(nullptr);
    renderer.RenderFilledPoly4(RectToPoly4({1, 10, 1, 1}), Color(0xFF00FF00u));
    area = Read({0, 10, 2, 1});
    EXPECT_EQ(area[0] | 0xFF000000u, 0xFFFF00FFu);
    EXPECT_EQ(area[1] | 0xFF000000u, 0xFF00FF00u);
}
