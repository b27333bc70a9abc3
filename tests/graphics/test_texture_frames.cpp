// Surfaces in the MRU list, frames of animated textures by time, pixels of frames, and
// images drawing their frames.
#include "graphics/Image.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <list>
#include <random>

using namespace ox::graphics;
using oxtest::RecordingBackend;

namespace {

struct Device : ::testing::Test {
    RecordingBackend* backend = nullptr;
    std::unique_ptr<CRenderer> renderer;
    void SetUp() override
    {
        renderer = oxtest::MakeRecordingRenderer(backend, 256, 256, 256, 256);
        SetFrameNumber(100);
    }
};

// The list from the tail (oldest) to the head.
std::vector<CSurface*> MruList()
{
    std::vector<CSurface*> list;
    for (CSurface* s = CSurface::GetMRUTail(); s; s = s->GetNextInMRUList()) {
        if (!list.empty()) {
            EXPECT_EQ(s->GetPrevInMRUList(), list.back());
        }
        list.push_back(s);
    }
    EXPECT_EQ(list.empty() ? nullptr : list.back(), CSurface::GetMRUHead());
    return list;
}

// A description with `delays` (one per frame), a frame map and parts of a 4 x 1 sheet.
std::vector<unsigned char> MakeDesc(uint32_t type, std::vector<uint16_t> delays, std::vector<int8_t> map)
{
    std::vector<unsigned char> bytes(sizeof(TextureDesc) + 4 * sizeof(UVRect));
    auto* desc = new (bytes.data()) TextureDesc();
    desc->flags = TextureDesc::FlagStatic;
    desc->anim_type = type;
    desc->frame_width = 2;
    desc->frame_height = 2;
    desc->parts_amount = 4;
    for (int i = 0; i < 4; ++i)
        desc->Parts()[i] = {i * 0.25f, 0, (i + 1) * 0.25f, 1};
    desc->frame_delays_count = static_cast<uint8_t>(delays.size());
    for (size_t i = 0; i < delays.size(); ++i)
        desc->frame_delays[i] = delays[i];
    desc->frame_map_length = static_cast<uint8_t>(map.size());
    unsigned total = 0;
    for (size_t i = 0; i < map.size(); ++i) {
        desc->frame_map[i] = map[i];
        total += delays[map[i]];
    }
    desc->total_time = static_cast<uint16_t>(total);
    return bytes;
}

} // namespace

TEST_F(Device, MruListTouchesOncePerFrameAndKeepsBothEnds)
{
    CSurface a(2, 2), b(2, 2), c(2, 2);
    EXPECT_TRUE(MruList().empty());
    a.GetD3DTexture();
    EXPECT_EQ(MruList(), (std::vector<CSurface*> {&a})) << "into an empty list";
    b.GetD3DTexture();
    c.GetD3DTexture();
    EXPECT_EQ(MruList(), (std::vector<CSurface*> {&a, &b, &c}));
    // The same frame: a second use changes nothing, even for the tail.
    a.GetD3DTexture();
    EXPECT_EQ(MruList(), (std::vector<CSurface*> {&a, &b, &c}));

    SetFrameNumber(101);
    a.GetD3DTexture();  // the tail goes to the head
    EXPECT_EQ(MruList(), (std::vector<CSurface*> {&b, &c, &a}));
    c.GetD3DTexture();  // the middle
    EXPECT_EQ(MruList(), (std::vector<CSurface*> {&b, &a, &c}));
    c.GetD3DTexture();  // the head
    EXPECT_EQ(c.GetLastUsedFrame(), 101u);

    a.ReleaseD3D();  // middle out
    EXPECT_EQ(MruList(), (std::vector<CSurface*> {&b, &c}));
    c.ReleaseD3D();  // head out
    EXPECT_EQ(MruList(), (std::vector<CSurface*> {&b}));
    b.ReleaseD3D();  // the only one
    EXPECT_TRUE(MruList().empty());
    EXPECT_FALSE(b.IsInMRUList());
}

TEST_F(Device, MruListFollowsAModelUnderRandomUse)
{
    std::vector<std::unique_ptr<CSurface>> surfaces;
    for (int i = 0; i < 6; ++i)
        surfaces.push_back(std::make_unique<CSurface>(1, 1));
    std::list<CSurface*> model;  // front = tail
    std::mt19937 random(7);
    for (int step = 0; step < 400; ++step) {
        if (step % 5 == 0)
            SetFrameNumber(GetFrameNumber() + 1);
        CSurface* s = surfaces[random() % surfaces.size()].get();
        if (random() % 4 == 0) {
            s->ReleaseD3D();
            model.remove(s);
        } else {
            const bool touched = s->GetLastUsedFrame() != GetFrameNumber() || !s->IsValid();
            s->GetD3DTexture();
            if (touched) {
                model.remove(s);
                model.push_back(s);
            }
        }
        ASSERT_EQ(MruList(), std::vector<CSurface*>(model.begin(), model.end())) << "step " << step;
    }
    for (auto& s : surfaces)
        s.reset();
    EXPECT_TRUE(MruList().empty()) << "destroyed surfaces leave the list";
}

TEST(TextureFrames, FrameByTimeForEachKindOfAnimation)
{
    auto loop = MakeDesc(TextureDesc::AnimLoop, {100, 50, 30}, {0, 1, 2});
    CTexture looped(nullptr, reinterpret_cast<TextureDesc*>(loop.data()));
    EXPECT_TRUE(looped.IsAnimated());
    EXPECT_EQ(looped.GetAnimTime(), 180u);
    const std::pair<int, int> loopCases[] = {{0, 0}, {99, 0}, {100, 1}, {149, 1}, {150, 2}, {179, 2},
                                             {180, -1},  // exactly the total: not wrapped, drawn as frame 0
                                             {181, 0}, {280, 1}, {340, 2}};
    for (auto [time, frame] : loopCases)
        EXPECT_EQ(looped.GetFrameByTime(time), frame) << "loop at " << time;

    auto once = MakeDesc(TextureDesc::AnimOnce, {100, 50, 30}, {0, 1, 2});
    CTexture onceOnly(nullptr, reinterpret_cast<TextureDesc*>(once.data()));
    EXPECT_EQ(onceOnly.GetFrameByTime(179), 2);
    EXPECT_EQ(onceOnly.GetFrameByTime(180), 2) << "once stops on its last entry";
    EXPECT_EQ(onceOnly.GetFrameByTime(5000), 2);

    auto pingpong = MakeDesc(TextureDesc::AnimPingPong, {10, 20, 30}, {0, 1, 2, 1});
    CTexture pp(nullptr, reinterpret_cast<TextureDesc*>(pingpong.data()));
    EXPECT_EQ(pp.GetAnimTime(), 80u);
    EXPECT_EQ(pp.GetFrameByTime(65), 1);
    EXPECT_EQ(pp.GetFrameByTime(85), 0);
    EXPECT_EQ(pp.GetTimeByFrame(0), 0u);
    EXPECT_EQ(pp.GetTimeByFrame(3), 60u);
    EXPECT_EQ(pp.GetTimeByFrame(4), 0u) << "past the map";

    // A backward loop walks its map like a loop: from the last frame down, then wraps.
    auto backward = MakeDesc(TextureDesc::AnimBackwardLoop, {10, 20, 30}, {2, 1, 0});
    CTexture back(nullptr, reinterpret_cast<TextureDesc*>(backward.data()));
    const std::pair<int, int> backCases[] = {{0, 2}, {29, 2}, {30, 1}, {49, 1}, {50, 0}, {59, 0}, {60, -1}, {61, 2}};
    for (auto [time, frame] : backCases)
        EXPECT_EQ(back.GetFrameByTime(time), frame) << "backward loop at " << time;

    auto single = MakeDesc(TextureDesc::AnimLoop, {40}, {0});
    CTexture one(nullptr, reinterpret_cast<TextureDesc*>(single.data()));
    EXPECT_FALSE(one.IsAnimated());
    EXPECT_EQ(one.GetFrameByTime(0), 0);
    EXPECT_EQ(one.GetFrameByTime(12345), 0);
    auto none = MakeDesc(TextureDesc::AnimLoop, {}, {});
    EXPECT_EQ(CTexture(nullptr, reinterpret_cast<TextureDesc*>(none.data())).GetFrameByTime(3), -1);
}

TEST_F(Device, PixelsOfFramesInTheBuffer)
{
    CSurface sheet(8, 2);
    std::vector<uint32_t> pixels(16);
    for (uint32_t i = 0; i < 16; ++i)
        pixels[i] = 0xFF000000u | i;
    ASSERT_TRUE(sheet.LoadBits(pixels.data(), 64, 8, 2, FormatA8R8G8B8));
    auto bytes = MakeDesc(TextureDesc::AnimLoop, {10, 10, 10, 10}, {0, 1, 2, 3});
    CTexture texture(&sheet, reinterpret_cast<TextureDesc*>(bytes.data()));
    EXPECT_EQ(texture.Pixel(0, 0), 0u) << "no buffer yet";
    EXPECT_FALSE(texture.SurfaceIsBuffer());
    texture.CreateBuffer();
    texture.LoadBuffer();
    EXPECT_EQ(texture.Pixel(1, 1, 2), 0xFF00000Du) << "frame 2 starts at x 4";
    EXPECT_EQ(texture.Pixel(1, 0, -1), 0xFF000001u) << "-1 is the first part";
    EXPECT_EQ(texture.Pixel(1, 0, 9), 0xFF000001u) << "past the parts: the first";
    EXPECT_EQ(texture.Pixel(2, 0, 1), 0u) << "outside the frame's width";
    EXPECT_EQ(texture.Pixel(-1, 0, 1), 0u);
    EXPECT_TRUE(texture.Pixel(0, 1, 0xFFABCDEFu, 3));
    EXPECT_FALSE(texture.Pixel(0, 2, 0xFFABCDEFu, 3));
    texture.CommitBits();
    auto* device = static_cast<RecordingBackend::Texture*>(sheet.GetD3DTexture());
    uint32_t written;
    memcpy(&written, device->bits.data() + (8 + 6) * 4, 4);
    EXPECT_EQ(written, 0xFFABCDEFu);
    texture.DropBuffer();
    EXPECT_EQ(texture.Pixel(0, 1, 3), 0u);
}

TEST_F(Device, ImageDrawsItsFrameWithScaleAndWholePixels)
{
    ox::core::CTimeManager& time = ox::core::GetTimeManager();
    CSurface sheet(8, 2);
    auto bytes = MakeDesc(TextureDesc::AnimLoop, {100, 100, 100, 100}, {0, 1, 2, 3});
    CTexture texture(&sheet, reinterpret_cast<TextureDesc*>(bytes.data()));
    CImage image(&texture);
    ASSERT_NE(image.Get(), nullptr) << "an animated texture gets a timer";
    EXPECT_EQ(image.GetRect().Width, 2.0f) << "an empty rectangle takes the frame size";
    image.SetSourceRect({0, 0, 4, 2});
    EXPECT_FALSE(image.HasSourceRect()) << "not for an animated image";

    image.SetRect({10.7f, 20.2f, 4, 4});
    image.SetScale(1.5f);
    image.SetFlags(CImage::FlagIntDest);
    image.SetFrame(2);
    EXPECT_EQ(image.GetTime(), 200u);
    ASSERT_TRUE(renderer->BeginScene());
    image.Draw(*renderer);
    renderer->Flush();
    ASSERT_EQ(backend->draws.size(), 1u);
    const auto& v = backend->draws[0].vertices;
    // Rectangle (10, 20, 6, 6) after truncation, less the half pixel; frame 2's UV.
    EXPECT_FLOAT_EQ(v[0].x, 9.5f);
    EXPECT_FLOAT_EQ(v[0].y, 19.5f);
    EXPECT_FLOAT_EQ(v[5].x, 15.5f);
    EXPECT_FLOAT_EQ(v[0].u, 0.5f);
    EXPECT_FLOAT_EQ(v[5].u, 0.75f);

    // Speed and pause act on the image's own timer.
    image.SetAnimationK(2.0f);
    EXPECT_EQ(image.GetAnimationK(), 2.0f);
    image.PauseAnimation(true);
    const unsigned before = image.GetTime();
    time.Update();
    EXPECT_EQ(image.GetTime(), before);

    // Reset puts the timer back; a still texture drops it.
    CTexture still(&sheet);
    image.SetTexture(&texture, true);
    EXPECT_EQ(image.GetTime(), 0u);
    EXPECT_EQ(image.GetAnimationK(), 1.0f);
    image.SetTexture(&still);
    EXPECT_EQ(image.Get(), nullptr);
    EXPECT_EQ(image.GetAnimationK(), 1.0f);
    image.SetSourceRect({2, 0, 3, 2});
    EXPECT_EQ(image.GetSourceRect().Width, 3);
    image.SetSourceRect({0, 0, -1, 0});
    EXPECT_EQ(image.GetSourceRect().Width, 8) << "without one: the first part in pixels";

    // Nothing to draw: no texture, or a zero scale.
    backend->ClearRecord();
    image.SetScale(0);
    image.Draw(*renderer);
    CImage empty;
    empty.Draw(*renderer, 0, 0);
    renderer->Flush();
    EXPECT_TRUE(backend->draws.empty());
    renderer->EndScene();
}

TEST(Image, FindsTexturesByIdThroughTheLookUpItIsGiven)
{
    CSurface sheet(8, 2);
    CTexture texture(&sheet);
    CImage::SetTextureLookup([&](const char* id) { return strcmp(id, "sheet") == 0 ? &texture : nullptr; });
    CImage image;
    image.SetTexture("sheet");
    ASSERT_TRUE(image.HasTexture());
    EXPECT_EQ(image.GetTexture()->GetSurface(), &sheet);
    image.SetTexture("other");
    EXPECT_FALSE(image.HasTexture()) << "an unknown id drops the texture";
    image.SetTexture(static_cast<const char*>(nullptr));
    EXPECT_FALSE(image.HasTexture());
    CImage::SetTextureLookup(nullptr);
    image.SetTexture("sheet");
    EXPECT_FALSE(image.HasTexture()) << "without a look-up no id is known";
}
