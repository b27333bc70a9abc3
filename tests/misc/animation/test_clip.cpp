// Running clips on a hand-driven clock: interpolation at and between keys and past the
// last one, looping, ping-pong and backward time lines, sound points, nested clips, and
// the vertices a clip draws on the recording backend.
#include "core/TimeManager.h"
#include "graphics/Texture.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipObjects.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <algorithm>
#include <cstring>

using namespace ox::misc::anim;
using ox::graphics::Color;
using ox::misc::FloatVector;

namespace {

// Every sound a clip asks for, as "id@lag".
struct RecordingSounds : IClipSoundPlayer {
    std::vector<std::string> played;
    void Play(const CClipObject&, const char* id, int lag) override { played.push_back(id + ("@" + std::to_string(lag))); }
    void Pause(const CClipObject&, bool) override {}
    void StopAll(const CClipObject&) override {}
    void Mute(const CClipObject&, bool) override {}
};

// One image object of texture "tex" in a 200 x 100 clip, with the given keys and attributes.
std::string OneImage(const std::string& id, const std::string& attributes, const std::string& keys)
{
    return "<Clip id=\"" + id + "\" w=\"200\" h=\"100\"><image id=\"o\" i_id=\"tex\" vis=\"true\" " + attributes +
           ">" + keys + "</image></Clip>";
}

const std::string kRamp = R"(<kp t="0" itpl="true" p="0,0" a="0" c="0xFF000000" cf="2" py="0 0 10 0 10 10 0 10"/>
    <kp t="1000" p="100,0" a="1" c="0xFFFFFFFF" fl="1" cf="4" py="0 0 20 0 20 20 0 20"/>)";
const std::string kSteps = R"(<kp t="0" itpl="true" p="0,0"/><kp t="100" itpl="true" p="10,0"/>
    <kp t="200" itpl="true" p="20,0"/><sd k="0" id="a"/><sd k="100" id="b"/><sd k="200" id="c"/>)";
const std::string kSwing = R"(<kp t="0" itpl="true" p="0,0"/><kp t="100" itpl="true" p="100,0"/>
    <sd k="0" id="a"/><sd k="100" id="b"/>)";

// The rectangle around drawn vertices: left, top, right, bottom.
struct Box {
    float left, top, right, bottom;
    bool operator==(const Box&) const = default;
};
std::ostream& operator<<(std::ostream& out, const Box& b)
{
    return out << b.left << "," << b.top << " - " << b.right << "," << b.bottom;
}
Box BoundsOf(const std::vector<ox::graphics::Vertex>& vertices)
{
    Box box {1e9f, 1e9f, -1e9f, -1e9f};
    for (const auto& v : vertices)
        box = {std::min(box.left, v.x), std::min(box.top, v.y), std::max(box.right, v.x), std::max(box.bottom, v.y)};
    return box;
}

struct ClipFixture : ::testing::Test {
    oxtest::FakeClock clock;
    std::unique_ptr<ox::core::CTimeManager> time;
    RecordingSounds sounds;
    CClipsLoader loader;
    // Made before the surface and so gone after it: the surface's device texture goes back to it.
    std::unique_ptr<ox::graphics::CRenderer> renderer;
    ox::graphics::CSurface surface {32, 32};
    ox::graphics::CTexture texture {&surface};

    void SetUp() override
    {
        time = std::make_unique<ox::core::CTimeManager>(clock.Source());
        Frame(1000);
        ClipServices& services = GetClipServices();
        services.time = time.get();
        services.sounds = &sounds;
        services.textures = [this](const char* id) { return strcmp(id, "tex") == 0 ? &texture : nullptr; };
    }
    void TearDown() override { GetClipServices() = ClipServices(); }

    void Declare(const std::string& clips)
    {
        const std::string xml = "<?xml version=\"1.0\"?><clips>" + clips + "</clips>";
        ClipRecords records;
        ASSERT_TRUE(ConvertClipsXml(xml.data(), xml.size(), "test.xml", records));
        ASSERT_TRUE(loader.LoadRecords(records));
    }
    void Frame(int ms)
    {
        clock.Advance(ms);
        time->Update();
    }
    // Frames of `step` ms (at most 100, the time manager's cap), the clip updated in each.
    void Run(CClip& clip, int ms, int step = 50)
    {
        for (int done = 0; done < ms; done += step) {
            Frame(std::min(step, ms - done));
            clip.Update();
        }
    }
    CClipObject& Object(CClip& clip, const char* id = "o")
    {
        CClipObject* object = clip.FindObject(id);
        EXPECT_NE(object, nullptr) << id;
        return *object;
    }
};

} // namespace

TEST_F(ClipFixture, OnceAtTheKeysBetweenThemAndPastTheLast)
{
    Declare(OneImage("once", "", kRamp));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "once"));
    clip.Update();
    CClipObject& o = Object(clip);
    EXPECT_EQ(o.GetPos().X, 0.0f);
    EXPECT_EQ(o.GetCustomFlags(), 2u) << "a custom flag shows at its key";
    EXPECT_EQ(o.GetColor(), Color(0xFF000000u));

    Run(clip, 250);
    EXPECT_FLOAT_EQ(o.GetPos().X, 25.0f);
    EXPECT_FLOAT_EQ(o.GetAngle(), 0.25f);
    EXPECT_EQ(o.GetColor(), Color(63, 63, 63, 255)) << "channels truncated";
    EXPECT_FLOAT_EQ(o.GetPoly()[2].X, 12.5f);
    EXPECT_EQ(o.GetFlipFlags(), 0u);
    EXPECT_EQ(o.GetCustomFlags(), 0u) << "and is gone between keys";

    Run(clip, 750);
    EXPECT_EQ(o.GetPos().X, 100.0f);
    EXPECT_EQ(o.GetFlipFlags(), 1u);
    EXPECT_EQ(o.GetCustomFlags(), 4u);
    Run(clip, 500);
    EXPECT_EQ(o.GetPos().X, 100.0f) << "the last key holds";
    EXPECT_EQ(o.GetTime(), 1000);
    EXPECT_EQ(o.GetPeriodTime(), 1000);
}

TEST_F(ClipFixture, KeyWithoutInterpolationHoldsItsValues)
{
    Declare(OneImage("hold", "", R"(<kp t="0" p="0,0"/><kp t="1000" p="100,0"/>)"));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "hold"));
    Run(clip, 500);
    EXPECT_EQ(Object(clip).GetPos().X, 0.0f);
}

TEST_F(ClipFixture, LoopFiresEveryKeyOncePerPassAndKeepsItsPhase)
{
    Declare(OneImage("loop", "at=\"1\"", kSteps));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "loop"));
    clip.Update();
    Run(clip, 450, 90);
    // The last key and the first share a moment: no time passes between them.
    EXPECT_EQ(sounds.played, (std::vector<std::string> {"a@0", "b@80", "c@70", "a@70", "b@60", "c@50", "a@50"}));
    // A jump over several periods fires each key once per pass, in order, with its lag.
    sounds.played.clear();
    Object(clip).MoveTime(1000, true);
    EXPECT_EQ(sounds.played, (std::vector<std::string> {"b@500", "c@400", "a@400", "b@300", "c@200", "a@200",
                                                        "b@100", "c@0", "a@0"}));
    Run(clip, 50);
    EXPECT_FLOAT_EQ(Object(clip).GetPos().X, 5.0f);
    EXPECT_EQ(Object(clip).GetTime(), 50);
}

TEST_F(ClipFixture, PingPongTurnsAtTheEndsAndFiresEachEndOncePerTurn)
{
    Declare(OneImage("swing", "at=\"2\"", kSwing));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "swing"));
    clip.Update();
    Run(clip, 100);
    EXPECT_EQ(Object(clip).GetPos().X, 100.0f);
    Run(clip, 50);
    EXPECT_FLOAT_EQ(Object(clip).GetPos().X, 50.0f) << "on the way back";
    EXPECT_EQ(Object(clip).GetTime(), 50);
    EXPECT_EQ(Object(clip).GetPeriodTime(), 200);
    Run(clip, 250);
    EXPECT_EQ(sounds.played, (std::vector<std::string> {"a@0", "b@0", "a@0", "b@0", "a@0"}));
}

TEST_F(ClipFixture, BackwardTravelsFromTheLastKeyToTheFirst)
{
    Declare(OneImage("back", "ad=\"1\"", R"(<kp t="0" itpl="true" p="0,0"/><kp t="1000" itpl="true" p="100,0"/>)"));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "back"));
    clip.Update();
    EXPECT_EQ(Object(clip).GetPos().X, 100.0f);
    Run(clip, 250);
    EXPECT_FLOAT_EQ(Object(clip).GetPos().X, 75.0f);
    EXPECT_EQ(Object(clip).GetTime(), 750);
    Run(clip, 1000);
    EXPECT_EQ(Object(clip).GetPos().X, 0.0f);
}

TEST_F(ClipFixture, OneKeyIsAppliedOnceWithItsSound)
{
    Declare(OneImage("one", "", R"(<kp t="0" p="5,5"/><sd k="0" id="one"/>)"));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "one"));
    clip.Update();
    EXPECT_EQ(Object(clip).GetPos(), FloatVector(5, 5));
    Object(clip).SetPos({0, 0});
    Run(clip, 500);
    EXPECT_EQ(Object(clip).GetPos(), FloatVector(0, 0)) << "never applied again";
    EXPECT_EQ(sounds.played, std::vector<std::string> {"one@0"});
}

TEST_F(ClipFixture, StoppedObjectShowsTheTimeItIsSetTo)
{
    Declare(OneImage("once", "", kRamp));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "once"));
    Run(clip, 300);
    clip.Stop();
    Run(clip, 300);
    CClipObject& o = Object(clip);
    EXPECT_EQ(o.GetAnimationState(), AnimationStateStopped);
    EXPECT_EQ(o.GetPos().X, 0.0f) << "stopped at time 0";
    o.SetTime(500, true);
    EXPECT_FLOAT_EQ(o.GetPos().X, 50.0f);
    o.SetTime(1500, true);
    EXPECT_EQ(o.GetPos().X, 100.0f);
    EXPECT_EQ(o.GetCustomFlags(), 0u) << "past the end: the middle of the last key with itself";
    // Paused and played again: the clock goes on from where it stood.
    clip.Play();
    clip.SetTime(200);
    clip.Pause();
    Run(clip, 300);
    EXPECT_FLOAT_EQ(o.GetPos().X, 20.0f);
    clip.Play();
    Run(clip, 100);
    EXPECT_FLOAT_EQ(o.GetPos().X, 30.0f);
}

TEST_F(ClipFixture, NestedClipRunsItsOwnTimeLineInsideTheOuterOne)
{
    Declare(R"(<Clip id="inner" w="20" h="20">
        <image id="dot" i_id="tex" vis="true" at="1" c="0xFFFFFFFF" py="0 0 2 0 2 2 0 2">
          <kp t="0" itpl="true" p="0,2" c="0xFFFFFFFF" py="0 0 2 0 2 2 0 2"/>
          <kp t="100" itpl="true" p="10,2" c="0xFFFFFFFF" py="0 0 2 0 2 2 0 2"/></image></Clip>
      <Clip id="outer" w="200" h="100">
        <clip id="view" clip_id="inner" vis="true" c="0xFFFFFFFF" py="0 0 40 0 40 40 0 40">
          <kp t="0" p="50,50" c="0xFFFFFFFF" py="0 0 40 0 40 40 0 40"/></clip></Clip>)");
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "outer"));
    clip.SetPos({512, 384});
    clip.Update();
    Run(clip, 150);
    auto& view = static_cast<CClipViewObject&>(Object(clip, "view"));
    CClipObject& dot = Object(view.GetClip(), "dot");
    EXPECT_FLOAT_EQ(dot.GetPos().X, 5.0f);
    EXPECT_EQ(view.GetClip().GetSize(), FloatVector(40, 40));

    oxtest::RecordingBackend* backend = nullptr;
    renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    ASSERT_TRUE(renderer->BeginScene());
    clip.Draw(renderer.get());
    renderer->Flush();
    ASSERT_EQ(backend->draws.size(), 1u);
    // Inner (5..7, 2..4) -> scale 2 about the inner centre, at (50,50) -> outer centre at (512,384).
    EXPECT_EQ(BoundsOf(backend->draws[0].vertices), (Box {451.5f, 367.5f, 455.5f, 371.5f}));

    clip.Pause();
    EXPECT_EQ(dot.GetAnimationState(), AnimationStatePaused);
    Run(clip, 30);
    EXPECT_FLOAT_EQ(dot.GetPos().X, 5.0f);
}

TEST_F(ClipFixture, DrawPlacesColoursFlipsAndClipsToTheRectangle)
{
    Declare(R"(<Clip id="draw" w="100" h="100">
        <image id="a" i_id="tex" vis="true" add_b="true"><kp t="0" p="40,40" c="0x80FFFFFF" py="-10 -10 10 -10 10 10 -10 10"/></image>
        <image id="b" i_id="tex" vis="true"><kp t="0" p="95,50" c="0xFFFFFFFF" py="-10 -10 10 -10 10 10 -10 10"/></image>
      </Clip>)");
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "draw"));
    clip.Update();
    clip.SetPos({200, 200});
    clip.SetColor(Color(0xFF808080u));
    oxtest::RecordingBackend* backend = nullptr;
    renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    ASSERT_TRUE(renderer->BeginScene());
    clip.Draw(renderer.get());
    renderer->Flush();
    ASSERT_EQ(backend->draws.size(), 2u) << "the additive object is a draw of its own";
    EXPECT_NE(backend->draws[0].destBlend, backend->draws[1].destBlend);
    EXPECT_EQ(BoundsOf(backend->draws[0].vertices), (Box {179.5f, 179.5f, 199.5f, 199.5f}));
    EXPECT_EQ(backend->draws[0].vertices[0].diffuse, 0x80808080u) << "the clip's colour times the object's";
    EXPECT_EQ(BoundsOf(backend->draws[1].vertices), (Box {234.5f, 189.5f, 249.5f, 209.5f}))
        << "cut at the clip's right edge";

    backend->ClearRecord();
    clip.FlipHorizontal(true);
    clip.Draw(renderer.get());
    renderer->Flush();
    EXPECT_EQ(BoundsOf(backend->draws[0].vertices), (Box {199.5f, 179.5f, 219.5f, 199.5f}))
        << "mirrored about the centre";
}

TEST_F(ClipFixture, ObjectsThatCannotBeUsedAreLoggedAndLeftOut)
{
    Declare(R"(<Clip id="bad" w="10" h="10">
        <image id="late" i_id="tex" vis="true"><kp t="100"/><kp t="50"/></image>
        <image id="gone" i_id="nope" vis="true"><kp t="0"/></image>
        <image id="keyless" i_id="tex" vis="true"/>
        <image id="far" i_id="tex" vis="true" at="2"><kp t="0"/><kp t="2000000000"/></image>
        <image id="hidden" i_id="tex"><kp t="0"/></image>
        <particle id="spark" p_id="sparks" vis="true"><kp t="0"/></particle>
        <path id="road" closed="1"><p a="0,0"/></path>
        <clip id="self" clip_id="bad" vis="true" py="0 0 1 0 1 1 0 1"><kp t="0"/></clip>
      </Clip>)");
    oxtest::LogCapture log;
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "bad"));
    EXPECT_EQ(clip.FindObject("late"), nullptr);
    EXPECT_EQ(clip.FindObject("keyless"), nullptr);
    EXPECT_EQ(clip.FindObject("far"), nullptr) << "twice its period would not fit in 32 bits";
    EXPECT_EQ(clip.FindObject("hidden"), nullptr) << "invisible objects stay out of the game";
    ASSERT_NE(clip.FindObject("gone"), nullptr) << "kept, drawn without its texture";
    ASSERT_NE(clip.FindObject("spark"), nullptr);
    EXPECT_TRUE(clip.GetPaths().empty()) << "a path of one point has no length";
    EXPECT_TRUE(log.Contains("Clip 'bad': path 'road' has no length (1 usable of 1 points); it is left out"));
    EXPECT_TRUE(log.Contains("Clip 'bad': image object 'late' is left out: its key states are out of order at the "
                             "time (50)"));
    EXPECT_TRUE(log.Contains("Clip 'bad': image object 'keyless' is left out: it has no key state"));
    EXPECT_TRUE(log.Contains("Clip 'bad': image object 'far' is left out: a key's time lies beyond twelve days"));
    EXPECT_TRUE(log.Contains("Clip 'bad': image object 'gone' names the unknown texture 'nope'"));
    EXPECT_TRUE(log.Contains("Clip 'bad': particle object 'spark' cannot run the system 'sparks'; it draws nothing"));
    EXPECT_TRUE(log.Contains("Clip 'bad' holds itself through 'bad'; the inner one is left out"));
    EXPECT_TRUE(log.Contains("Clip 'bad': clip object 'self' cannot show the clip 'bad'; left out"));
    EXPECT_FALSE(clip.Load(loader, "missing"));

    oxtest::RecordingBackend* backend = nullptr;
    renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    ASSERT_TRUE(renderer->BeginScene());
    clip.Update();
    clip.Draw(renderer.get());
    renderer->Flush();
    EXPECT_TRUE(backend->draws.empty());
}

TEST_F(ClipFixture, NestingIsBoundedInDepthAndInObjects)
{
    // A chain of ten clips, each showing the next.
    std::string chain;
    for (int i = 0; i < 10; ++i)
        chain += "<Clip id=\"c" + std::to_string(i) + "\" w=\"10\" h=\"10\"><clip id=\"v\" clip_id=\"c" +
                 std::to_string(i + 1) + "\" vis=\"true\"><kp t=\"0\"/></clip></Clip>";
    // Three levels of thirty: more objects than one clip may build.
    auto views = [](const std::string& of) {
        std::string xml;
        for (int i = 0; i < 30; ++i)
            xml += "<clip id=\"v" + std::to_string(i) + "\" clip_id=\"" + of + "\" vis=\"true\"><kp t=\"0\"/></clip>";
        return xml;
    };
    std::string images;
    for (int i = 0; i < 30; ++i)
        images += "<image id=\"i" + std::to_string(i) + "\" i_id=\"tex\" vis=\"true\"><kp t=\"0\"/></image>";
    Declare(chain + "<Clip id=\"wide\" w=\"1\" h=\"1\">" + views("wider") + "</Clip><Clip id=\"wider\" w=\"1\" h=\"1\">" +
            views("leaf") + "</Clip><Clip id=\"leaf\" w=\"1\" h=\"1\">" + images + "</Clip>");
    oxtest::LogCapture log;
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "c0"));
    int depth = 0;
    for (CClip* at = &clip; !at->GetObjects().empty(); ++depth)
        at = &static_cast<CClipViewObject&>(*at->GetObjects()[0]).GetClip();
    EXPECT_EQ(depth, 7) << "eight clips, c0 to c7; c7 without its view";
    EXPECT_TRUE(log.Contains("Clip 'c8' is nested more than 8 deep in 'c7'; left out"));

    ASSERT_TRUE(clip.Load(loader, "wide"));
    size_t built = 0;
    for (const auto& view : clip.GetObjects())
        for (const auto& inner : static_cast<CClipViewObject&>(*view).GetClip().GetObjects())
            built += 1 + static_cast<CClipViewObject&>(*inner).GetClip().GetObjects().size();
    EXPECT_LE(built + clip.GetObjects().size(), kMaxClipObjects);
    EXPECT_TRUE(log.Contains("Clip 'leaf': more than 20000 objects with its nested clips; the rest are left out"));
}

TEST_F(ClipFixture, UnknownObjectKindInADumpIsLeftOut)
{
    const std::string xml = "<?xml version=\"1.0\"?>" + OneImage("odd", "", "<kp t=\"0\"/>");
    ClipRecords records;
    ASSERT_TRUE(ConvertClipsXml(xml.data(), xml.size(), "odd.xml", records));
    auto* record = reinterpret_cast<ClipRecord*>(records["odd"].data());
    const_cast<ClipObjectBase*>(ObjectsBegin(record))->type = 9;
    ASSERT_TRUE(loader.LoadRecords(records));
    oxtest::LogCapture log;
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "odd"));
    EXPECT_TRUE(clip.GetObjects().empty());
    EXPECT_TRUE(log.Contains("Clip 'odd': object 'o' is of the unknown kind 9; left out"));
}

TEST_F(ClipFixture, KeysEditedOutOfOrderAreADataErrorNotAHang)
{
    Declare(OneImage("loop", "at=\"1\"", kSteps));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "loop"));
    CClipObject& o = Object(clip);
    o.FindKeyStateForEdit(100)->t = 0;
    o.FindKeyStateForEdit(200)->t = 0;
    oxtest::LogCapture log;
    Run(clip, 100);
    EXPECT_TRUE(log.Contains("[data][3]: check failed \"m_States[n - 1].t > m_States[0].t\""));
    EXPECT_EQ(ObjectsBegin(loader.FindClip("loop"))->KeyStates()[2].t, 200) << "edits stay in the object";
}

TEST_F(ClipFixture, CopiedClipRunsApart)
{
    Declare(OneImage("once", "", kRamp));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "once"));
    clip.Update();
    CClip copy(clip);
    Run(copy, 500);
    EXPECT_FLOAT_EQ(Object(copy).GetPos().X, 50.0f);
    EXPECT_EQ(Object(clip).GetPos().X, 0.0f);
    EXPECT_NE(&Object(copy), &Object(clip));
}

TEST(ClipText, FlagsMapAndNewBoundsRescaleEveryContour)
{
    using R = ox::graphics::CRenderer;
    EXPECT_EQ(CTextObject::MapTextFlags(2 | 16 | 0x1000 | 0x800), R::TextCenterH | R::TextCenterV | R::TextWordWrap);
    EXPECT_EQ(CTextObject::MapTextFlags(1 | 4 | 8 | 32), R::TextLeft | R::TextRight | R::TextTop | R::TextBottom);

    const std::string xml = R"(<?xml version="1.0"?><Clip id="t" w="100" h="100">
        <text id="label" vis="true" bnd="0 0 50 20" py="0 0 50 0 50 20 0 20" tx="hello">
          <kp t="0" py="0 0 50 0 50 20 0 20"/><kp t="10" py="0 0 100 0 100 40 0 40"/></text></Clip>)";
    ClipRecords records;
    ASSERT_TRUE(ConvertClipsXml(xml.data(), xml.size(), "t.xml", records));
    CClipsLoader loader;
    ASSERT_TRUE(loader.LoadRecords(records));
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "t"));
    auto* text = static_cast<CTextObject*>(clip.FindObject("label"));
    ASSERT_NE(text, nullptr);
    EXPECT_EQ(text->GetText(), u"hello");
    text->SetBounds({0, 0, 100, 10});
    EXPECT_EQ(text->GetPoly()[2], FloatVector(100, 10));
    EXPECT_EQ(text->FindKeyState(10)->contour[2], FloatVector(200, 20));
    EXPECT_EQ(ObjectsBegin(loader.FindClip("t"))->KeyStates()[1].contour[2], FloatVector(100, 40))
        << "the bulk stays as it was";
}
