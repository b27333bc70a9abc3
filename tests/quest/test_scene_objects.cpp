// Scene objects on the recording backend: drawing back to front with colours and fades,
// hit tests front to back with contours, pixels and masks, groups and their flags, areas,
// clips using alpha, and objects a game maker got wrong.
#include "core/TexturesAlpha.h"
#include "core/TexturesAlphaWriter.h"
#include "graphics/Image.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"
#include "quest/Area.h"
#include "quest/ClipObject.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "quest/QuestServices.h"
#include "quest/SceneGroup.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cmath>
#include <cstring>
#include <numbers>

using namespace qe;
using ox::graphics::CTexture;
using ox::graphics::Vertex;

namespace {

// An 8 x 8 texture, solid red but for a transparent 4 x 4 hole at pixels 2 to 5.
std::vector<uint32_t> HoledPixels()
{
    std::vector<uint32_t> pixels(64, 0xFFFF0000u);
    for (int y = 2; y < 6; ++y)
        for (int x = 2; x < 6; ++x)
            pixels[y * 8 + x] = 0x00FF0000u;
    return pixels;
}

// Left, top of each drawn quad (six vertices a quad), in drawing order.
std::vector<std::pair<float, float>> Corners(const std::vector<Vertex>& vertices)
{
    std::vector<std::pair<float, float>> corners;
    for (size_t i = 0; i + 6 <= vertices.size(); i += 6) {
        float left = 1e9f, top = 1e9f;
        for (size_t j = i; j < i + 6; ++j) {
            left = std::min(left, vertices[j].x);
            top = std::min(top, vertices[j].y);
        }
        corners.emplace_back(left, top);
    }
    return corners;
}

AreaPtrT MakeArea(const std::string& id, std::initializer_list<FloatVector> points)
{
    AreaPtrT area(new CArea());
    area->SetId(id);
    for (const FloatVector& p : points)
        area->InsertPoint(AreaPointPtrT(new CAreaPoint(p)), area->Points().empty() ? nullptr : area->Points().back().get());
    return area;
}

struct SceneObjects : ::testing::Test {
    oxtest::RecordingBackend* backend = nullptr;
    std::unique_ptr<ox::graphics::CRenderer> renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    ox::graphics::CSurface surface {8, 8};
    CTexture texture {&surface};
    ScenePtrT scene {new CScene()};

    void SetUp() override
    {
        const std::vector<uint32_t> pixels = HoledPixels();
        ASSERT_TRUE(surface.LoadBits(pixels.data(), pixels.size() * 4, 8, 8, ox::graphics::FormatA8R8G8B8));
        ox::graphics::CImage::SetTextureLookup(
            [this](const char* id) { return strcmp(id, "holed") == 0 ? &texture : nullptr; });
        ox::misc::anim::GetClipServices().textures = [this](const char* id) -> const CTexture* {
            return strcmp(id, "holed") == 0 ? &texture : nullptr;
        };
        ASSERT_TRUE(renderer->BeginScene());
        backend->ClearRecord();
    }
    void TearDown() override
    {
        ox::graphics::CImage::SetTextureLookup(nullptr);
        ox::misc::anim::GetClipServices() = ox::misc::anim::ClipServices();
        GetQuestServices() = QuestServices();
    }

    // An image of the holed texture, appended behind the scene's other objects.
    ImageObjectPtrT AddImage(const std::string& id, FloatVector pos, FloatVector size, float angle = 0)
    {
        ImageObjectPtrT image(new CImageObject());
        image->SetId(id);
        image->SetTextureId("holed");
        image->SetPos(pos);
        image->SetSize(size);
        image->SetAngle(angle);
        AddObject(image);
        return image;
    }
    void AddObject(BaseSceneObjectPtrT object)
    {
        scene->InsertObject(std::move(object), scene->Objects().empty() ? nullptr : scene->Objects().back().get());
        scene->UpdateTotalChildList();
    }
    std::vector<Vertex> Drawn()
    {
        renderer->Flush();
        std::vector<Vertex> all;
        for (const auto& draw : backend->draws)
            all.insert(all.end(), draw.vertices.begin(), draw.vertices.end());
        backend->ClearRecord();
        return all;
    }
    std::string HitAt(float x, float y, const ox::core::CTexturesAlpha* masks = nullptr) const
    {
        const CBaseSceneObject* hit = scene->GetObjectAt({x, y}, masks);
        return hit ? hit->GetIdRef() : "none";
    }
    void DeclareClips(const std::string& clips)
    {
        const std::string xml = "<?xml version=\"1.0\"?><clips>" + clips + "</clips>";
        ox::misc::anim::ClipRecords records;
        ASSERT_TRUE(ox::misc::anim::ConvertClipsXml(xml.data(), xml.size(), "test.xml", records));
        ASSERT_TRUE(ox::misc::anim::CClipsLoader::Instance().LoadRecords(records));
    }
};

} // namespace

TEST_F(SceneObjects, DrawsBackToFrontWithColoursAndFades)
{
    ImageObjectPtrT top = AddImage("top", {100, 100}, {80, 80});
    ImageObjectPtrT middle = AddImage("middle", {130, 130}, {80, 80});
    ImageObjectPtrT bottom = AddImage("bottom", {160, 160}, {80, 80});
    middle->SetColor(Color(0x80FFFFFFu));
    top->SetAlpha(0.5f);
    scene->DrawGame(renderer.get());
    std::vector<Vertex> v = Drawn();
    EXPECT_EQ(Corners(v), (std::vector<std::pair<float, float>> {{119.5f, 119.5f}, {89.5f, 89.5f}, {59.5f, 59.5f}}));
    ASSERT_EQ(v.size(), 18u);
    EXPECT_EQ(v[0].diffuse, 0xFFFFFFFFu);
    EXPECT_EQ(v[6].diffuse, 0x80FFFFFFu) << "the object's colour multiplies the renderer's";
    EXPECT_EQ(v[12].diffuse, 0x7FFFFFFFu) << "a running fade scales the alpha: 255 * 0.5";

    // Hidden: drawn only while it fades out; removed: never.
    middle->RaiseObjectFlag(CBaseSceneObject::ObjectFlagHidden);
    middle->SetAlpha(0.25f);
    bottom->RaiseObjectFlag(CBaseSceneObject::ObjectFlagHidden);
    top->RaiseObjectFlag(CBaseSceneObject::ObjectFlagRemoved);
    scene->DrawGame(renderer.get());
    EXPECT_EQ(Corners(Drawn()), (std::vector<std::pair<float, float>> {{89.5f, 89.5f}}));

    // Turned a quarter about its position: the 80 x 40 rectangle stands 40 x 80.
    CScene turned;
    ImageObjectPtrT image = AddImage("turned", {300, 300}, {80, 40}, std::numbers::pi_v<float> / 2);
    turned.InsertObject(image, nullptr);
    turned.DrawGame(renderer.get());
    v = Drawn();
    ASSERT_EQ(v.size(), 6u);
    float minX = 1e9f, maxY = -1e9f;
    for (const Vertex& vertex : v) {
        minX = std::min(minX, vertex.x);
        maxY = std::max(maxY, vertex.y);
    }
    EXPECT_NEAR(minX, 279.5f, 1e-3f);
    EXPECT_NEAR(maxY, 339.5f, 1e-3f);
}

TEST_F(SceneObjects, HitTestsGoFrontToBackThroughTransparentPixels)
{
    AddImage("top", {100, 100}, {80, 80});
    ImageObjectPtrT below = AddImage("below", {130, 100}, {80, 80});
    // Pixel 4 of the top one lies in its hole, pixel 1 of the one below does not: the click
    // passes to the object below.
    EXPECT_EQ(HitAt(100, 100), "below");
    EXPECT_EQ(HitAt(65, 65), "top");
    EXPECT_EQ(HitAt(165, 100), "below");
    EXPECT_EQ(HitAt(300, 300), "none");
    EXPECT_EQ(HitAt(60, 100), "none") << "a point on the edge is outside";
    below->RaiseObjectFlag(CBaseSceneObject::ObjectFlagDisable);
    EXPECT_EQ(HitAt(100, 100), "none") << "a disabled object takes no click";
    EXPECT_NE(surface.GetBuffer(), nullptr) << "the pixel copy was made for the test";

    // Turned and stretched: the hole stays where the picture shows it.
    scene.reset(new CScene());
    AddImage("turned", {300, 300}, {80, 40}, std::numbers::pi_v<float> / 2);
    EXPECT_EQ(HitAt(300, 300), "none");
    EXPECT_EQ(HitAt(300, 335), "turned");
    EXPECT_EQ(HitAt(315, 300), "turned");
    EXPECT_EQ(HitAt(325, 300), "none");

    // Objects go before areas, whatever their order; a hidden area still takes clicks, a
    // disabled one none.
    AreaPtrT area = MakeArea("area", {{250, 250}, {350, 250}, {350, 350}, {250, 350}});
    scene->InsertArea(area, nullptr);
    EXPECT_EQ(HitAt(300, 335), "turned");
    EXPECT_EQ(HitAt(300, 300), "area");
    area->RaiseObjectFlag(CBaseSceneObject::ObjectFlagHidden);
    EXPECT_EQ(HitAt(300, 300), "area");
    area->RaiseObjectFlag(CBaseSceneObject::ObjectFlagDisable);
    EXPECT_EQ(HitAt(300, 300), "none");
}

TEST_F(SceneObjects, TheAlphaMaskStoreAnswersBeforeAnyPixelIsRead)
{
    ox::core::AlphaMaskSource solid;
    solid.id = "holed";
    solid.width = solid.height = 8;
    solid.pixels.assign(64, 0xFF000000u);
    std::vector<uint8_t> bytes;
    ASSERT_TRUE(ox::core::BuildTexturesAlpha({solid}, bytes));
    ox::core::CTexturesAlpha masks;
    ASSERT_TRUE(masks.LoadFromMemory(bytes.data(), bytes.size()));

    AddImage("masked", {100, 100}, {80, 80});
    EXPECT_EQ(HitAt(100, 100, &masks), "masked") << "the mask says solid where the pixels have a hole";
    EXPECT_EQ(surface.GetBuffer(), nullptr) << "and no pixel copy was made";

    // The store loaded again answers anew: a clear mask, then no mask for the texture.
    ox::core::AlphaMaskSource other = solid;
    other.pixels.assign(64, 0);
    std::vector<uint8_t> clear, without;
    ASSERT_TRUE(ox::core::BuildTexturesAlpha({other}, clear));
    ASSERT_TRUE(masks.LoadFromMemory(clear.data(), clear.size()));
    EXPECT_EQ(HitAt(65, 65, &masks), "none");
    other.id = "another";
    ASSERT_TRUE(ox::core::BuildTexturesAlpha({other}, without));
    ASSERT_TRUE(masks.LoadFromMemory(without.data(), without.size()));
    EXPECT_EQ(HitAt(65, 65, &masks), "masked") << "the pixels answer";
    EXPECT_EQ(HitAt(100, 100, &masks), "none");
}

TEST_F(SceneObjects, GroupFlagsAndStatesReachEveryState)
{
    ImageObjectPtrT closed(new CImageObject()), open(new CImageObject());
    closed->SetId("closed");
    open->SetId("open");
    for (CImageObject* state : {closed.get(), open.get()}) {
        state->SetTextureId("holed");
        state->SetPos({100, 100});
        state->SetSize({80, 80});
    }
    open->RaiseObjectFlag(CBaseSceneObject::ObjectFlagHidden);
    SceneGroupPtrT drawer(new CSceneGroup());
    drawer->SetId("drawer");
    drawer->InsertChild(closed, nullptr);
    drawer->InsertChild(open, closed.get());
    AddObject(drawer);

    EXPECT_EQ(HitAt(65, 65), "closed");
    EXPECT_EQ(drawer->GetFirstVisibleState(), "closed");
    EXPECT_TRUE(drawer->IsCurrent("closed"));
    EXPECT_FALSE(drawer->IsCurrent("open"));
    EXPECT_EQ(drawer->GetPos(), FloatVector(100, 100));
    for (uint32_t flag : {CBaseSceneObject::ObjectFlagDisable, CBaseSceneObject::ObjectFlagHidden,
                          CBaseSceneObject::ObjectFlagRemoved}) {
        drawer->SetObjectFlags(flag);
        EXPECT_EQ(HitAt(65, 65), "none") << "the group's flag " << flag << " keeps its state from clicks";
    }
    drawer->SetObjectFlags(CBaseSceneObject::ObjectFlagDisable);
    scene->DrawGame(renderer.get());
    EXPECT_EQ(Drawn().size(), 6u) << "a disabled group still draws its current state";
    drawer->SetObjectFlags(CBaseSceneObject::ObjectFlagHidden);
    scene->DrawGame(renderer.get());
    EXPECT_TRUE(Drawn().empty()) << "a hidden group draws none";

    // Switching states: at once without time; with time each change fades, the first made holds.
    drawer->SetObjectFlags(0);
    std::vector<std::string> fades;
    GetQuestServices().startFade = [&](CBaseSceneObject& o, bool appear, bool hold, float, const ox::core::CGroupTimer*) {
        fades.push_back(o.GetIdRef() + (appear ? " in" : " out") + (hold ? " held" : ""));
    };
    drawer->SetCurrent("open", true, 0, nullptr);
    EXPECT_TRUE(fades.empty());
    EXPECT_EQ(drawer->GetFirstVisibleState(), "open");
    drawer->SetCurrent("closed", true, 500, nullptr);
    EXPECT_EQ(fades, (std::vector<std::string> {"open out held", "closed in"})) << "walked from the back";
    open->SetAlpha(0.5f);
    drawer->SetAlpha(0.5f);
    scene->DrawGame(renderer.get());
    std::vector<Vertex> v = Drawn();
    ASSERT_EQ(v.size(), 12u) << "the state fading out is drawn under the new one";
    EXPECT_EQ(v[0].diffuse, 0x3FFFFFFFu) << "the group's fade, 127, times the state's, 127";
    EXPECT_EQ(v[6].diffuse, 0x7FFFFFFFu);
    drawer->SetCurrent("no such state", false, 0, nullptr);
    EXPECT_EQ(drawer->GetFirstVisibleState(), "");
    drawer->SetCurrentByNumber(2);
    EXPECT_EQ(drawer->GetFirstVisibleState(), "open");
    drawer->SetCurrentByNumber(0);
    EXPECT_EQ(drawer->GetFirstVisibleState(), "");
}

TEST(SceneAreas, ContourTests)
{
    AreaPtrT square = MakeArea("square", {{0, 0}, {100, 0}, {100, 100}, {0, 100}});
    EXPECT_TRUE(square->IsContains({50, 50}, nullptr));
    EXPECT_FALSE(square->IsContains({150, 50}, nullptr));
    EXPECT_TRUE(square->IsContains({0, 50}, nullptr)) << "a point on a crossing of the ray is inside";
    EXPECT_EQ(square->GetPos(), FloatVector(50, 50));

    AreaPtrT u = MakeArea("u", {{0, 0}, {30, 0}, {30, 70}, {70, 70}, {70, 0}, {100, 0}, {100, 100}, {0, 100}});
    EXPECT_FALSE(u->IsContains({50, 30}, nullptr)) << "inside the notch of a concave contour";
    EXPECT_TRUE(u->IsContains({50, 85}, nullptr));
    EXPECT_TRUE(u->IsContains({15, 30}, nullptr));

    // The ray through (50, 50), where the contour only touches the line, adds no crossing.
    AreaPtrT notch = MakeArea("notch", {{0, 0}, {100, 0}, {100, 100}, {60, 100}, {50, 50}, {40, 100}, {0, 100}});
    EXPECT_TRUE(notch->IsContains({20, 50}, nullptr));
    // The ray through (100, 50), where the contour passes the line, adds one.
    AreaPtrT passing = MakeArea("passing", {{0, 0}, {100, 0}, {100, 50}, {100, 100}, {0, 100}});
    EXPECT_TRUE(passing->IsContains({50, 50}, nullptr));

    // Editing tools: a point near a vertex wins, a point near an edge names the vertex before
    // it, the closing edge is no candidate.
    EXPECT_TRUE(square->PointIsNearToContour({103, 2}));
    EXPECT_FALSE(square->PointIsNearToContour({50, 2}));
    EXPECT_EQ(square->GetNearestPoint({102, 3}), std::make_pair(false, square->Points()[1].get()));
    EXPECT_EQ(square->GetNearestPoint({50, 3}), std::make_pair(true, square->Points()[0].get()));
    EXPECT_EQ(square->GetNearestPoint({3, 50}), std::make_pair(false, static_cast<CAreaPoint*>(nullptr)));
    EXPECT_EQ(square->GetNearestPoint({50, 50}), std::make_pair(false, static_cast<CAreaPoint*>(nullptr)));
}

TEST_F(SceneObjects, ClipsTestTheirImagesPixelsWhenUsingAlpha)
{
    DeclareClips(R"(<Clip id="holed_clip" w="80" h="80">
          <image id="o" i_id="holed" vis="true" py="0 0 80 0 80 80 0 80">
            <kp t="0" p="0,0" c="0xFFFFFFFF" py="0 0 80 0 80 80 0 80"/></image></Clip>
        <Clip id="outer" w="160" h="160">
          <clip id="view" clip_id="holed_clip" vis="true" c="0xFFFFFFFF" py="0 0 160 0 160 160 0 160">
            <kp t="0" p="80,80" c="0xFFFFFFFF" py="0 0 160 0 160 160 0 160"/></clip></Clip>)");
    ClipObjectPtrT clip(new CClipObject());
    clip->SetId("clip");
    clip->SetClipId("holed_clip");
    EXPECT_EQ(clip->GetNativeSize(), FloatVector(80, 80));
    clip->SetPos({500, 500});
    clip->SetSize({80, 80});
    AddObject(clip);
    EXPECT_EQ(HitAt(500, 500), "clip") << "without alpha the whole rectangle takes clicks";
    clip->UseAlpha(true);
    EXPECT_EQ(HitAt(500, 500), "none");
    EXPECT_EQ(HitAt(470, 470), "clip");

    // Through a nested clip drawn at twice its size.
    ClipObjectPtrT outer(new CClipObject());
    outer->SetId("outer");
    outer->SetClipId("outer");
    outer->SetPos({700, 300});
    outer->SetSize({160, 160});
    outer->UseAlpha(true);
    AddObject(outer);
    EXPECT_EQ(HitAt(700, 300), "none");
    EXPECT_EQ(HitAt(630, 230), "outer");

    // Drawn centred on its position at its shown size.
    scene->RemoveObject(*outer);
    clip->SetSize({160, 80});
    scene->DrawGame(renderer.get());
    float left = 1e9f, top = 1e9f, right = -1e9f, bottom = -1e9f;
    for (const Vertex& vertex : Drawn()) {
        left = std::min(left, vertex.x);
        top = std::min(top, vertex.y);
        right = std::max(right, vertex.x);
        bottom = std::max(bottom, vertex.y);
    }
    EXPECT_EQ(std::make_pair(left, top), std::make_pair(419.5f, 459.5f));
    EXPECT_EQ(std::make_pair(right, bottom), std::make_pair(579.5f, 539.5f));
}

TEST_F(SceneObjects, ObjectsAGameMakerGotWrongAreLoggedDrawNothingAndTakeNoClick)
{
    oxtest::LogCapture log;
    DeclareClips(R"(<Clip id="known" w="8" h="8"/>)");
    ImageObjectPtrT image(new CImageObject());
    image->SetId("lamp");
    image->SetTextureId("no_such_texture");
    image->SetPos({100, 100});
    image->SetSize({80, 80});
    AddObject(image);
    ClipObjectPtrT clip(new CClipObject());
    clip->SetId("smoke");
    clip->SetClipId("no_such_clip");
    clip->SetPos({100, 100});
    clip->SetSize({80, 80});
    AddObject(clip);
    AreaPtrT line = MakeArea("line", {{0, 0}, {200, 0}});
    AreaPtrT flat = MakeArea("flat", {{0, 0}, {100, 100}, {200, 200}});
    scene->InsertArea(line, nullptr);
    scene->InsertArea(flat, nullptr);
    LevelPtrT level(new CLevel());
    level->InsertScene(scene, nullptr);

    EXPECT_EQ(HitAt(100, 100), "none");
    EXPECT_EQ(HitAt(100, 100), "none");
    scene->DrawGame(renderer.get());
    EXPECT_TRUE(Drawn().empty());
    EXPECT_TRUE(log.Contains("Image 'lamp': no texture 'no_such_texture'; it draws nothing and takes no click"));
    EXPECT_TRUE(log.Contains("Clip object 'smoke': no clip 'no_such_clip'; it draws nothing and takes no click"));
    EXPECT_TRUE(log.Contains("Area 'line': a contour of 2 points with no area inside"));
    EXPECT_TRUE(log.Contains("Area 'flat': a contour of 3 points with no area inside"));
    int reports = 0;
    for (const std::string& line : log.Entries())
        reports += line.find("Error using texture tex_id=no_such_texture (image 'lamp')") != std::string::npos;
    EXPECT_EQ(reports, 1) << "once, not at every move of the mouse";
    level->RemoveScene(*scene);
}
