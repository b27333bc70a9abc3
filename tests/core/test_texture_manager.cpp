// Texture declarations (XML conversion and the dump's checks) and the texture manager:
// loading on use, the video-memory budget, preloading, device resets and loose files.
#include "core/TextureDeclarations.h"
#include "core/TextureManager.h"
#include "graphics/Renderer.h"
#include "misc/GamePack.h"
#include "misc/PackWriter.h"
#include "misc/imagelib/MediaWriter.h"
#include "misc/imagelib/PvrContainer.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace ox;
using core::CTextureDeclarationsLoader;
using core::CTextureManager;
using graphics::CSurface;
using graphics::TextureDesc;
using graphics::UVRect;
using oxtest::RecordingBackend;

namespace {

// A game folder of loose files with a pack object reading it.
struct GameFolder {
    oxtest::TempDir dir;
    std::unique_ptr<misc::CGamePack> pack;

    void Png(const std::string& path, uint32_t w, uint32_t h, const char* pattern = "gradient")
    {
        std::vector<uint32_t> pixels;
        ASSERT_TRUE(misc::imagelib::MakePattern(pattern, w, h, pixels));
        std::vector<uint8_t> png;
        ASSERT_TRUE(misc::imagelib::EncodePng(pixels.data(), w, h, png));
        dir.Write(path, std::string(png.begin(), png.end()));
    }
    misc::CGamePack& Pack()
    {
        if (!pack) {
            misc::GamePackConfig config;
            config.folder = dir.Path().string();
            config.language = "";
            pack = std::make_unique<misc::CGamePack>(config);
        }
        return *pack;
    }
};

std::string Declarations(const std::string& body)
{
    return "<?xml version=\"1.0\"?>\n<resources>" + body + "</resources>";
}

struct Bulk {
    std::vector<uint32_t> words;
    size_t size = 0;
    const void* data() const { return words.data(); }
    explicit Bulk(const std::vector<uint8_t>& bytes) : words((bytes.size() + 3) / 4), size(bytes.size())
    {
        memcpy(words.data(), bytes.data(), bytes.size());
    }
    uint8_t* bytes() { return reinterpret_cast<uint8_t*>(words.data()); }
};

std::vector<int> Map(const TextureDesc* d) { return std::vector<int>(d->frame_map, d->frame_map + d->frame_map_length); }
std::vector<int> Delays(const TextureDesc* d)
{
    return std::vector<int>(d->frame_delays, d->frame_delays + d->frame_delays_count);
}

// The manager over a recording device, reading `folder`'s files.
struct ManagerFixture : ::testing::Test {
    GameFolder folder;
    RecordingBackend* backend = nullptr;
    std::unique_ptr<graphics::CRenderer> renderer;
    oxtest::FakeClock clock;

    void SetUp() override
    {
        auto owned = std::make_unique<RecordingBackend>();
        backend = owned.get();
        renderer = std::make_unique<graphics::CRenderer>(std::move(owned));
        renderer->InitWindow(false, true, 64, 64);
        graphics::SetFrameNumber(10);
    }
    void TearDown() override { renderer.reset(); }
};

} // namespace

TEST(TextureDeclarations, XmlBecomesTheBulkTheGameReadsInPlace)
{
    GameFolder game;
    game.Png("img/sheet.png", 12, 4);
    oxtest::LogCapture log;
    const std::string xml = Declarations(R"(
      <surfaces>
        <surface path="img/zeta!nearest.png" width="64" height="32"/>
        <surface path="img/sheet.png"/>
        <surface path="img/missing.png"/>
      </surfaces>
      <group id="ui" flags="load_on_demand">
        <image id="b_icon" path="img/zeta!nearest.png">
          <part rect_x="16" rect_y="8" rect_w="16" rect_h="8"/>
          <part rect_x="0" rect_y="0" rect_w="8" rect_h="8"/>
        </image>
        <group id="inner">
          <image id="a_walk" path="img/sheet.png" anim_type="pingpong" cols="3" rows="2" frame_delay="10, 20"/>
        </group>
        <image id="c_lost" path="img/missing.png" cols="1" rows="1"/>
        <image id="d_orphan" path="img/undeclared.png" cols="1" rows="1"/>
      </group>
      <image id="e_outside" path="img/sheet.png" cols="1" rows="1"/>)");
    CTextureDeclarationsLoader loader(&game.Pack());
    ASSERT_TRUE(loader.LoadXml(xml.data(), xml.size(), "resources.xml"));

    EXPECT_EQ(loader.SurfacesAmount(), 3u);
    EXPECT_STREQ(loader.Surfaces()[0].path.c_str(), "img/missing.png") << "sorted by path";
    EXPECT_STREQ(loader.Surfaces()[2].path.c_str(), "img/zeta!nearest.png");
    EXPECT_EQ(loader.Surfaces()[2].flags, CSurface::FlagNearest);
    EXPECT_EQ(loader.Surfaces()[1].width, 12) << "read from the file";
    ASSERT_EQ(loader.GroupsAmount(), 2u);
    EXPECT_EQ(loader.Group(loader.Groups()[1].parent), &loader.Groups()[0]);
    EXPECT_EQ(loader.Groups()[0].flags, CTextureDeclarationsLoader::GroupLoadOnDemand);

    ASSERT_EQ(loader.ImagesAmount(), 3u) << "the orphan and the image outside a group are left out";
    const char* ids[] = {"a_walk", "b_icon", "c_lost"};
    for (unsigned i = 0; i < 3; ++i) {
        const auto& entry = loader.Images()[i];
        EXPECT_STREQ(entry.id.c_str(), ids[i]);
        EXPECT_EQ(entry.id.hash, misc::CalcHash(ids[i], strlen(ids[i])));
        EXPECT_EQ(loader.FindImageIndex(ids[i]), static_cast<int>(i));
    }
    EXPECT_EQ(loader.FindImage("b_ico"), nullptr);

    const TextureDesc* icon = loader.Desc(*loader.FindImage("b_icon"));
    EXPECT_EQ(icon->flags, 1u | TextureDesc::FlagStatic) << "the group's flags";
    EXPECT_EQ(icon->frame_width, 16);
    EXPECT_EQ(icon->parts_amount, 2);
    EXPECT_EQ(icon->Parts()[0], (UVRect {0.25f, 0.25f, 0.5f, 0.5f}));
    EXPECT_EQ(Map(icon), (std::vector<int> {0}));

    const TextureDesc* walk = loader.Desc(*loader.FindImage("a_walk"));
    EXPECT_EQ(walk->flags, TextureDesc::FlagStatic);
    EXPECT_EQ(loader.Group(walk->group), &loader.Groups()[1]);
    EXPECT_EQ(walk->frame_width, 4);
    EXPECT_EQ(walk->frame_height, 2);
    ASSERT_EQ(walk->parts_amount, 6);
    EXPECT_EQ(walk->Parts()[4], (UVRect {4 / 12.0f, 0.5f, 8 / 12.0f, 1.0f})) << "grid cells row by row";
    EXPECT_EQ(Delays(walk), (std::vector<int> {10, 20, 20, 20, 20, 20}));
    EXPECT_EQ(Map(walk), (std::vector<int> {0, 1, 2, 3, 4, 5, 4, 3, 2, 1}));
    EXPECT_EQ(walk->total_time, 10 + 20 * 9);
    EXPECT_EQ(walk->frame_delays[6], 0xFFFF);
    EXPECT_EQ(walk->frame_map[10], -1);
    EXPECT_EQ(loader.SurfaceIndex(*walk), 1u);

    EXPECT_TRUE(log.Contains("Cannot load surface dimensions: \"img/missing.png\""));
    EXPECT_TRUE(log.Contains("image \"c_lost\" has no image file \"img/missing.png\""));
    EXPECT_TRUE(log.Contains("\"d_orphan\" names the undeclared surface"));
    EXPECT_TRUE(log.Contains("\"e_outside\" is outside any group"));
    EXPECT_TRUE(CTextureDeclarationsLoader::Check(loader.Data(), loader.DataSize(), "converted"));
}

TEST(TextureDeclarations, FrameMapsForEachAnimationType)
{
    GameFolder game;
    game.Png("sheet.png", 20, 2);
    struct Case {
        const char* type;
        int frames;
        std::vector<int> map;
    } cases[] = {
        {"loop", 1, {0}},
        {"once", 3, {0, 1, 2}},
        {"pingpong", 2, {0, 1}},
        {"pingpong", 3, {0, 1, 2, 1}},
        {"pingpong", 5, {0, 1, 2, 3, 4, 3, 2, 1}},
        {"backward loop", 2, {0, 1}},
        {"backward loop", 3, {2, 1, 0}},
        {"backward pingpong", 2, {0, 1}},
        {"backward pingpong", 3, {2, 1, 0, 1}},
        {"backward pingpong", 5, {4, 3, 2, 1, 0, 1, 2, 3}},
        {"none", 5, {0}},
    };
    for (const Case& c : cases) {
        const std::string xml = Declarations("<surfaces><surface path=\"sheet.png\"/></surfaces><group id=\"g\">"
                                             "<image id=\"x\" path=\"sheet.png\" anim_type=\"" +
                                             std::string(c.type) + "\" cols=\"" + std::to_string(c.frames) +
                                             "\" rows=\"1\" frame_delay=\"7\"/></group>");
        CTextureDeclarationsLoader loader(&game.Pack());
        ASSERT_TRUE(loader.LoadXml(xml.data(), xml.size(), "r.xml"));
        const TextureDesc* d = loader.Desc(loader.Images()[0]);
        EXPECT_EQ(Map(d), c.map) << c.type << " of " << c.frames;
        EXPECT_EQ(d->total_time, c.map.size() == 1 ? 0u : 7u * c.map.size()) << c.type << " of " << c.frames;
        // Each entry of the map shows for its 7 ms, in the map's order.
        const graphics::CTexture texture(nullptr, d);
        for (size_t i = 0; c.map.size() > 1 && i < c.map.size(); ++i)
            EXPECT_EQ(texture.GetFrameByTime(int(7 * i + 3)), c.map[i]) << c.type << " of " << c.frames << " at " << i;
    }

    // An explicit map is copied, minus entries naming frames that do not exist.
    oxtest::LogCapture log;
    const std::string xml = Declarations("<surfaces><surface path=\"sheet.png\"/></surfaces><group id=\"g\">"
                                         "<image id=\"x\" path=\"sheet.png\" anim_type=\"loop\" cols=\"3\" rows=\"1\" "
                                         "frame_map=\"2 0,9 1\" frame_delay=\"5 6 7\"/></group>");
    CTextureDeclarationsLoader loader(&game.Pack());
    ASSERT_TRUE(loader.LoadXml(xml.data(), xml.size(), "r.xml"));
    const TextureDesc* d = loader.Desc(loader.Images()[0]);
    EXPECT_EQ(Map(d), (std::vector<int> {2, 0, 1}));
    EXPECT_EQ(d->total_time, 18);
    EXPECT_TRUE(log.Contains("frame 9 of the frame map does not exist"));

    // A grid bigger than an image may hold is refused, not allocated.
    const std::string huge = Declarations("<surfaces><surface path=\"sheet.png\"/></surfaces><group id=\"g\">"
                                          "<image id=\"x\" path=\"sheet.png\" anim_type=\"loop\" cols=\"99999999999\" "
                                          "rows=\"90\"/><image id=\"y\" path=\"sheet.png\" cols=\"1\" rows=\"1\"/></group>");
    ASSERT_TRUE(loader.LoadXml(huge.data(), huge.size(), "r.xml"));
    EXPECT_EQ(loader.ImagesAmount(), 1u);
    EXPECT_TRUE(log.Contains("image \"x\" has 2147483647 x 90 frames, more than 512; ignored"));
}

TEST(TextureDeclarations, PartsAtTheEndsOfTheNumberRangeConvert)
{
    GameFolder game;
    const std::string xml = Declarations(
        "<surfaces><surface path=\"s.png\" width=\"64\" height=\"32\"/></surfaces><group id=\"g\">"
        "<image id=\"x\" path=\"s.png\"><part rect_x=\"1\" rect_y=\"-2147483647\" rect_w=\"2147483647\" "
        "rect_h=\"-2147483647\"/></image></group>");
    CTextureDeclarationsLoader loader(&game.Pack());
    ASSERT_TRUE(loader.LoadXml(xml.data(), xml.size(), "r.xml"));
    const UVRect& part = loader.Desc(loader.Images()[0])->Parts()[0];
    EXPECT_FLOAT_EQ(part.u2, 2147483648.0f / 64) << "the far edge does not wrap around";
    EXPECT_FLOAT_EQ(part.v2, -4294967294.0f / 32);
}

TEST(TextureDeclarations, BadDumpsAreRefusedWithoutFallingBackToXml)
{
    GameFolder game;
    game.Png("a.png", 4, 4);
    const std::string xml = Declarations("<surfaces><surface path=\"a.png\"/></surfaces><group id=\"g\">"
                                         "<image id=\"a\" path=\"a.png\" cols=\"1\" rows=\"1\"/>"
                                         "<image id=\"b\" path=\"a.png\" cols=\"1\" rows=\"1\"/></group>");
    std::vector<uint8_t> bytes;
    ASSERT_TRUE(CTextureDeclarationsLoader(&game.Pack()).ConvertXml(xml.data(), xml.size(), "r.xml", bytes));
    auto refused = [&](void (*spoil)(Bulk&), const char* why) {
        Bulk bulk(bytes);
        spoil(bulk);
        oxtest::LogCapture log;
        EXPECT_FALSE(CTextureDeclarationsLoader::Check(bulk.data(), bulk.size, "spoilt"));
        EXPECT_TRUE(log.Contains(why)) << why;
    };
    refused([](Bulk& b) { b.bytes()[3] = 2; },
            "Textures bindump is corrupted or has another version. Current revision: 1, bindump's revision2");
    refused([](Bulk& b) { b.bytes()[12] = 200; }, "its record counts run past its size");
    refused([](Bulk& b) { b.size -= 4; }, "an image's parts lie outside the file");
    refused([](Bulk& b) {
        auto* images = reinterpret_cast<CTextureDeclarationsLoader::ImageEntry*>(b.bytes() + 16 + 136 + 104);
        std::swap(images[0], images[1]);
    }, "the image table is not sorted by id");
    refused([](Bulk& b) { b.bytes()[16 + 136 + 104 + 96] += 1; }, "an image description lies outside the file");
    refused([](Bulk& b) { b.bytes()[16 + 136 + 104 + 4] ^= 1; }, "an image id has a wrong hash");

    // Through the pack: a refused dump is the end, even with the XML beside it.
    game.dir.Write("properties/resources.xml", xml);
    bytes[3] = 7;
    game.dir.Write("properties/resources.bindump", std::string(bytes.begin(), bytes.end()));
    oxtest::LogCapture log;
    CTextureDeclarationsLoader loader(&game.Pack());
    EXPECT_FALSE(loader.Load());
    EXPECT_FALSE(loader.IsLoaded());
    EXPECT_TRUE(log.Contains("bindump's revision7"));
    std::filesystem::remove(game.dir / "properties/resources.bindump");
    EXPECT_TRUE(loader.Load()) << "without a dump the XML serves";
    EXPECT_EQ(loader.ImagesAmount(), 2u);
}

TEST_F(ManagerFixture, DeclaredTexturesLoadOnFirstUse)
{
    folder.Png("img/a.png", 4, 2);
    folder.dir.Write("properties/resources.xml",
                     Declarations("<surfaces><surface path=\"img/a.png\"/><surface path=\"img/gone.png\" width=\"8\" "
                                  "height=\"8\"/><surface path=\"img/lost.png\"/></surfaces><group id=\"g\">"
                                  "<image id=\"lost\" path=\"img/lost.png\" cols=\"1\" rows=\"1\"/>"
                                  "<image id=\"a\" path=\"img/a.png\" cols=\"1\" rows=\"1\"/>"
                                  "<image id=\"gone\" path=\"img/gone.png\"><part rect_x=\"0\" rect_y=\"0\" "
                                  "rect_w=\"8\" rect_h=\"8\"/></image></group>"));
    CTextureDeclarationsLoader loader(&folder.Pack());
    ASSERT_TRUE(loader.Load());
    CTextureManager manager(&folder.Pack(), clock.Source());
    EXPECT_EQ(manager.GetItem("a"), nullptr) << "before Load";
    ASSERT_TRUE(manager.Load(&loader));
    EXPECT_CONTRACT_FAILURE(manager.Load(&loader), "!m_Loaded");
    EXPECT_EQ(manager.GetItem(""), nullptr);
    EXPECT_EQ(manager.GetItem(static_cast<const char*>(nullptr)), nullptr);
    EXPECT_EQ(manager.GetItem("zz"), nullptr);
    graphics::CTexture* a = manager.GetItem(std::string("a"));
    ASSERT_NE(a, nullptr);
    EXPECT_STREQ(manager.GetItemId(a), "a");
    EXPECT_EQ(a->GetData(), loader.Desc(*loader.FindImage("a"))) << "shared, in place";
    CSurface* surface = a->GetSurface();
    EXPECT_STREQ(manager.GetSurfaceFileName(surface), "img/a.png");
    EXPECT_EQ(surface->GetFlags(), CSurface::FlagLoadOnDemand | CSurface::FlagUnloaded);
    EXPECT_TRUE(backend->Calls("CreateTexture").empty()) << "no pixel before the first use";

    auto* device = static_cast<RecordingBackend::Texture*>(surface->GetD3DTexture());
    ASSERT_NE(device, nullptr);
    EXPECT_EQ(surface->GetFlags(), CSurface::FlagLoadOnDemand);
    std::vector<uint32_t> expected;
    misc::imagelib::MakePattern("gradient", 4, 2, expected);
    EXPECT_EQ(0, memcmp(device->bits.data(), expected.data(), 32));
    EXPECT_EQ(manager.GetVideoMemUsed(), 32u);
    EXPECT_EQ(manager.FindSurfaceByD3DTexture(device), surface);

    // A missing image: named in the log, an empty texture, and the game goes on.
    oxtest::LogCapture log;
    CSurface* gone = manager.GetItem("gone")->GetSurface();
    auto* empty = static_cast<RecordingBackend::Texture*>(gone->GetD3DTexture());
    ASSERT_NE(empty, nullptr);
    EXPECT_TRUE(log.Contains("Cannot load surface data with imagelib: \"img/gone.png\""));
    EXPECT_TRUE(log.Contains("Texture \"gone\" has no image: \"img/gone.png\""));
    EXPECT_EQ(std::vector<unsigned char>(256, 0), empty->bits);
    // Without even a size (the file was missing when the declarations were compiled): no
    // device texture, tried at each use, said once.
    CSurface* lost = manager.GetItem("lost")->GetSurface();
    EXPECT_EQ(lost->GetD3DTexture(), nullptr);
    EXPECT_EQ(lost->GetD3DTexture(), nullptr);
    size_t said = 0;
    for (const std::string& line : log.Entries())
        said += line == "texman|3|Can't create surface";
    EXPECT_EQ(said, 1u);
    EXPECT_TRUE(log.Contains("Texture \"lost\" has no image: \"img/lost.png\""));
    // Nor a pixel buffer: logged, and the texture reads as empty.
    oxtest::AssertCapture asserts;
    manager.GetItem("lost")->CreateBuffer();
    EXPECT_EQ(asserts.Count(), 0u);
    EXPECT_EQ(lost->GetBuffer(), nullptr);
    EXPECT_EQ(manager.GetItem("lost")->Pixel(0, 0), 0u);
    EXPECT_TRUE(log.Contains("Surface \"img/lost.png\" has no size: no pixel buffer"));

    manager.UnloadAllOnDemandSurfaces();
    EXPECT_EQ(manager.GetVideoMemUsed(), 0u);
    EXPECT_EQ(surface->GetFlags(), CSurface::FlagLoadOnDemand | CSurface::FlagUnloaded);
    manager.ReloadAll();
    EXPECT_FALSE(surface->IsValid()) << "what a caller dropped waits for its use";
}

TEST_F(ManagerFixture, EvictionDropsTheLeastRecentlyUsedDownToTheLowLimit)
{
    backend->allocateBits = false;
    CTextureManager manager(&folder.Pack(), clock.Source());
    // 64 MiB each on paper.
    auto make = [&](bool onDemand) {
        CSurface* s = manager.CreateSurface(4096, 4096);
        EXPECT_NE(s, nullptr);
        if (onDemand)
            s->SetFlags(CSurface::FlagLoadOnDemand);
        return s;
    };
    CSurface* pinned = make(false);
    pinned->GetD3DTexture();
    graphics::SetFrameNumber(11);
    CSurface* a = make(true);
    a->GetD3DTexture();
    EXPECT_EQ(manager.GetVideoMemUsed(), CTextureManager::kHighLimit) << "exactly at the limit: nothing";
    EXPECT_TRUE(pinned->IsValid() && a->IsValid());

    // One byte over (a 1 x 1 surface is 4): from the tail, the pinned one is skipped.
    graphics::SetFrameNumber(12);
    CSurface* small = manager.CreateSurface(1, 1);
    ASSERT_NE(small, nullptr);
    EXPECT_TRUE(pinned->IsValid()) << "not on demand: never evicted";
    EXPECT_FALSE(a->IsValid());
    EXPECT_EQ(a->GetFlags() & CSurface::FlagUnloaded, CSurface::FlagUnloaded);
    EXPECT_EQ(manager.GetVideoMemUsed(), 0x4000000u + 4);

    // Everything in use in this frame stays, even over the limit.
    graphics::SetFrameNumber(13);
    a->GetD3DTexture();
    CSurface* b = make(true);
    b->GetD3DTexture();
    EXPECT_EQ(manager.GetVideoMemUsed(), 3 * 0x4000000u + 4);
    EXPECT_TRUE(a->IsValid() && b->IsValid());

    // Next frame: the oldest on-demand ones go first, until at or under 96 MiB.
    graphics::SetFrameNumber(14);
    b->GetD3DTexture();
    CSurface* c = make(true);
    EXPECT_FALSE(a->IsValid()) << "least recently used";
    EXPECT_TRUE(b->IsValid()) << "used in this frame";
    EXPECT_TRUE(c->IsValid()) << "being made: not on the list yet";
    EXPECT_EQ(manager.GetVideoMemUsed(), 3 * 0x4000000u + 4) << "pinned, b, c and the small one";

    // Whatever order the surfaces go in, the count comes back to 0 and never below.
    oxtest::AssertCapture asserts;
    for (CSurface* s : {b, small, a, pinned, c})
        s->ReleaseD3D();
    a->ReleaseD3D();
    EXPECT_EQ(manager.GetVideoMemUsed(), 0u);
    EXPECT_EQ(asserts.Count(), 0u);
}

TEST_F(ManagerFixture, SurfacesMadeUnderAnotherManagerPayBackThere)
{
    auto first = std::make_unique<CTextureManager>(&folder.Pack(), clock.Source());
    CSurface early(8, 8);
    early.GetD3DTexture();
    EXPECT_EQ(first->GetVideoMemUsed(), 256u);
    {
        CTextureManager second(&folder.Pack(), clock.Source());
        CSurface* late = second.CreateSurface(2, 2);
        ASSERT_NE(late, nullptr);
        oxtest::AssertCapture asserts;
        early.ReleaseD3D();
        EXPECT_EQ(asserts.Count(), 0u) << "the second manager never counted it";
        EXPECT_EQ(first->GetVideoMemUsed(), 0u);
        EXPECT_EQ(second.GetVideoMemUsed(), 16u);
    }
    EXPECT_EQ(CSurface::GetManager(), first.get()) << "the previous manager is back";
    first.reset();
}

TEST_F(ManagerFixture, PreloadingLoadsASliceEachFrameAndCanStop)
{
    std::string surfaces, images;
    for (int i = 0; i < 5; ++i) {
        const std::string path = "level/p" + std::to_string(i) + ".png";
        folder.Png(path, 2, 2);
        surfaces += "<surface path=\"" + path + "\"/>";
        images += "<image id=\"p" + std::to_string(i) + "\" path=\"" + path + "\" cols=\"1\" rows=\"1\"/>";
    }
    folder.Png("menu/m.png", 2, 2);
    surfaces += "<surface path=\"menu/m.png\"/>";
    const std::string xml = Declarations("<surfaces>" + surfaces + "</surfaces><group id=\"g\">" + images + "</group>");
    CTextureDeclarationsLoader loader(&folder.Pack());
    ASSERT_TRUE(loader.LoadXml(xml.data(), xml.size(), "r.xml"));
    // Every look at the clock finds 4 ms more: three loads fit in a 10 ms slice.
    auto now = std::make_shared<double>(0.0);
    CTextureManager manager(&folder.Pack(), [now] { return *now += 4.0; });
    ASSERT_TRUE(manager.Load(&loader));

    manager.PreloadSurfacesByPrefix("level");
    EXPECT_EQ(manager.PreloadRemaining(), 5u);
    manager.UpdatePreload();
    EXPECT_EQ(manager.PreloadRemaining(), 2u);
    EXPECT_TRUE(manager.GetItem("p2")->GetSurface()->IsValid());
    EXPECT_FALSE(manager.GetItem("p3")->GetSurface()->IsValid());
    manager.UpdatePreload();
    EXPECT_FALSE(manager.IsPreloading()) << "done: the list is freed";
    EXPECT_TRUE(manager.GetItem("p4")->GetSurface()->IsValid());

    // A second call replaces the list; no matching file leaves none; stopping drops it.
    manager.UnloadAllOnDemandSurfaces();
    manager.PreloadSurfacesByPrefix("level");
    manager.PreloadSurfacesByPrefix("menu");
    EXPECT_EQ(manager.PreloadRemaining(), 1u);
    manager.PreloadSurfacesByPrefix("nothing");
    EXPECT_FALSE(manager.IsPreloading());
    manager.PreloadSurfacesByPrefix("level");
    manager.StopSurfacesPreloading();
    manager.UpdatePreload();
    EXPECT_FALSE(manager.GetItem("p0")->GetSurface()->IsValid());
}

TEST_F(ManagerFixture, DeviceResetAndLossReloadOnNextUse)
{
    folder.Png("a.png", 3, 3, "noise");
    const std::string xml = Declarations("<surfaces><surface path=\"a.png\"/></surfaces><group id=\"g\">"
                                         "<image id=\"a\" path=\"a.png\" cols=\"1\" rows=\"1\"/></group>");
    CTextureDeclarationsLoader loader(&folder.Pack());
    ASSERT_TRUE(loader.LoadXml(xml.data(), xml.size(), "r.xml"));
    CTextureManager manager(&folder.Pack(), clock.Source());
    manager.SetAllOnDemand(false);
    ASSERT_TRUE(manager.Load(&loader));
    renderer->AddDeviceResourceOwner(&manager);
    CSurface* surface = manager.GetItem("a")->GetSurface();
    EXPECT_EQ(surface->GetFlags(), 0) << "not on demand";
    CSurface* target = manager.CreateRenderTarget(4, 4);
    ASSERT_NE(target, nullptr);
    const auto before = static_cast<RecordingBackend::Texture*>(surface->GetD3DTexture())->bits;

    // A reset loses only render targets.
    renderer->InitGraphics();
    EXPECT_TRUE(surface->IsValid());
    EXPECT_FALSE(target->IsValid());
    EXPECT_NE(target->GetD3DTexture(), nullptr) << "made again on use";

    // A lost device loses everything; the next use reads the file again.
    renderer->ReleaseDevice(false);
    EXPECT_FALSE(surface->IsValid());
    EXPECT_EQ(manager.GetVideoMemUsed(), 0u);
    renderer->InitGraphics();
    auto* again = static_cast<RecordingBackend::Texture*>(surface->GetD3DTexture());
    ASSERT_NE(again, nullptr);
    EXPECT_EQ(again->bits, before);
    EXPECT_EQ(manager.GetVideoMemUsed(), 36u) << "the render target waits for its use";
    renderer->RemoveDeviceResourceOwner(&manager);
}

TEST_F(ManagerFixture, ClonesShrinksAndUnusedSurfaces)
{
    CTextureManager manager(&folder.Pack(), clock.Source());
    CSurface* source = manager.CreateSurface(4, 2);
    ASSERT_NE(source, nullptr);
    const uint32_t pixels[8] = {0xFF000000, 0xFF000004, 0x80000008, 0x8000000C, 0x10203040, 0x10203040, 0, 0};
    ASSERT_TRUE(source->LoadBits(pixels, sizeof pixels, 4, 2, graphics::FormatA8R8G8B8));
    graphics::CTexture texture(source);
    graphics::CTexture copy;
    ASSERT_TRUE(manager.CloneTexture(texture, copy));
    ASSERT_NE(copy.GetSurface(), source);
    EXPECT_EQ(0, memcmp(static_cast<RecordingBackend::Texture*>(copy.GetSurface()->GetD3DTexture())->bits.data(),
                        pixels, sizeof pixels));
    EXPECT_EQ(source->GetBuffer(), nullptr) << "the source's temporary copy is gone";

    CSurface* small = manager.CreateSurface(2, 1);
    manager.ShrinkSurface(*source, *small, 2, 1);
    ASSERT_NE(small->GetBuffer(), nullptr);
    // Each is the mean of a 2 x 2 block, per channel, truncated.
    EXPECT_EQ(small->GetBuffer()[0], 0x87101821u);
    EXPECT_EQ(small->GetBuffer()[1], 0x40000005u);
    EXPECT_CONTRACT_FAILURE(manager.ShrinkSurface(*small, *source, 4, 2), "kx >= 1 && ky >= 1");

    const size_t before = manager.GetSurfacesCount();
    manager.RemoveUnusedSurfaces();
    EXPECT_EQ(manager.GetSurfacesCount(), before - 1) << "only the unreferenced small one goes";
}

TEST_F(ManagerFixture, LooseFileBesideThePackOverridesItsSurface)
{
    // The pack holds the declarations and one image; two more lie loose beside it.
    misc::CPackWriter writer;
    std::vector<uint32_t> pixels;
    misc::imagelib::MakePattern("checker", 4, 4, pixels);
    std::vector<uint8_t> png;
    misc::imagelib::EncodePng(pixels.data(), 4, 4, png);
    writer.AddData("in/pack.png", std::string(png.begin(), png.end()));
    writer.AddData("properties/resources.xml",
                   Declarations(R"(<surfaces><surface path="in/pack.png" width="4" height="4"/>
                     <surface path="loose/big_2!.png" width="4" height="4"/>
                     <surface path="loose/plain.png" width="4" height="4"/></surfaces>
                     <group id="g"><image id="pack" path="in/pack.png"><part rect_x="0" rect_y="0" rect_w="2" rect_h="2"/></image>
                     <image id="big" path="loose/big_2!.png" anim_type="loop" cols="2" rows="1"><part rect_x="0" rect_y="0" rect_w="2" rect_h="4"/><part rect_x="2" rect_y="0" rect_w="2" rect_h="4"/></image>
                     <image id="plain" path="loose/plain.png"><part rect_x="0" rect_y="0" rect_w="2" rect_h="2"/></image></group>)"));
    ASSERT_TRUE(writer.Write(folder.dir / "game.pack")) << writer.Error();
    folder.Png("loose/big_2!.png", 10, 6);
    folder.Png("loose/plain.png", 6, 8);
    misc::GamePackConfig config;
    config.folder = folder.dir.Path().string();
    config.language = "";
    misc::CGamePack pack(config);
    ASSERT_TRUE(pack.HasPack());

    CTextureDeclarationsLoader loader(&pack);
    ASSERT_TRUE(loader.Load());
    CTextureManager manager(&pack, clock.Source());
    ASSERT_TRUE(manager.Load(&loader));
    const graphics::CTexture* inPack = manager.GetItem("pack");
    EXPECT_EQ(inPack->GetWidth(), 2) << "the declared parts";
    const graphics::CTexture* big = manager.GetItem("big");
    EXPECT_EQ(big->GetSurface()->GetWidth(), 10);
    EXPECT_FALSE(big->IsAnimated()) << "one part now";
    EXPECT_EQ(big->GetSurfaceRect(), (UVRect {0, 0, 1, 1}));
    EXPECT_EQ(big->GetWidth(), 5) << "\"_2!\": half on both axes";
    EXPECT_EQ(big->GetHeight(), 3);
    const graphics::CTexture* plain = manager.GetItem("plain");
    EXPECT_EQ(plain->GetWidth(), 6);
    EXPECT_EQ(plain->GetHeight(), 8);
    EXPECT_NE(plain->GetSurface()->GetD3DTexture(), nullptr);
}

TEST_F(ManagerFixture, ContainerFormatsAreRecordedAndAFileOfAnotherFormatDrawsNothing)
{
    std::vector<uint32_t> pixels;
    misc::imagelib::MakePattern("circle", 8, 8, pixels);
    auto write = [&](const std::string& path, unsigned pixelFormat) {
        std::vector<uint8_t> pvr, lzo;
        ASSERT_TRUE(misc::imagelib::EncodePvr(pixels.data(), 8, 8, pixelFormat, pvr));
        if (path.ends_with(".pvrlzo") && misc::imagelib::CompressPvrLzo(pvr.data(), pvr.size(), lzo))
            pvr.swap(lzo);
        folder.dir.Write(path, std::string(pvr.begin(), pvr.end()));
    };
    write("a.pvr", misc::imagelib::PvrDXT1);
    write("b.pvrlzo", misc::imagelib::PvrDXT5);
    // The images have parts: only the surfaces read the files.
    const std::string xml = Declarations(R"(<surfaces><surface path="a.pvr" width="8" height="8"/>
        <surface path="b.pvrlzo" width="8" height="8"/></surfaces><group id="g">
        <image id="a" path="a.pvr"><part rect_x="0" rect_y="0" rect_w="8" rect_h="8"/></image>
        <image id="b" path="b.pvrlzo"><part rect_x="0" rect_y="0" rect_w="8" rect_h="8"/></image></group>)");
    CTextureDeclarationsLoader loader(&folder.Pack());
    ASSERT_TRUE(loader.LoadXml(xml.data(), xml.size(), "r.xml"));
    EXPECT_EQ(loader.Surfaces()[0].internal_format, graphics::FormatDXT1);
    EXPECT_EQ(loader.Surfaces()[1].internal_format, graphics::FormatDXT5) << "a compressed container's too";
    auto bits = [](CTextureManager& manager, const char* id) {
        auto* device = static_cast<RecordingBackend::Texture*>(manager.GetItem(id)->GetSurface()->GetD3DTexture());
        return device ? device->bits : std::vector<unsigned char>();
    };
    {
        CTextureManager manager(&folder.Pack(), clock.Source());
        ASSERT_TRUE(manager.Load(&loader));
        EXPECT_EQ(bits(manager, "b").size(), 64u);
        EXPECT_NE(bits(manager, "b"), std::vector<unsigned char>(64, 0)) << "the circle's blocks";
    }

    // The files were made again in another format after the declarations were compiled.
    write("a.pvr", misc::imagelib::PvrARGB8888);
    write("b.pvrlzo", misc::imagelib::PvrARGB4444);
    CTextureManager manager(&folder.Pack(), clock.Source());
    ASSERT_TRUE(manager.Load(&loader));
    oxtest::LogCapture log;
    // Every DXT1 block transparent: both colours 0 (three-colour mode), each pixel on index 3.
    std::vector<unsigned char> clearDxt1(32, 0);
    for (size_t block = 0; block < 32; block += 8)
        memset(&clearDxt1[block + 4], 0xFF, 4);
    EXPECT_EQ(bits(manager, "a"), clearDxt1);
    EXPECT_EQ(bits(manager, "b"), std::vector<unsigned char>(64, 0)) << "DXT5 of alpha 0";
    EXPECT_TRUE(log.Contains("\"a.pvr\" holds surface format 1 where its declaration says 11"));
    EXPECT_TRUE(log.Contains("\"b.pvrlzo\" holds surface format 3 where its declaration says 15"));
    EXPECT_TRUE(log.Contains("Texture \"a\" has no image: \"a.pvr\""));
}
