// Paths: the arc-length coefficient on straight and curved segments, curves that follow a
// moved or reshaped contour, segment bookkeeping, degenerate paths, and clip objects that
// follow a path by the coefficient of their keys.
#include "misc/animation/Path.h"

#include "core/TimeManager.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipObjects.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"

#include "support/TestSupport.h"

#include <algorithm>
#include <cmath>

using namespace ox::misc::anim;
using ox::misc::FloatVector;
using ox::misc::Location;
using ox::misc::RectToPoly4;

namespace {

PathPoint Anchor(float x, float y) { return {{x, y}, {x, y}, {x, y}}; }

float Dist(const FloatVector& a, const FloatVector& b) { return std::hypot(a.X - b.X, a.Y - b.Y); }

// A path on a 100 x 100 contour at the origin.
CPath PathOn100(bool closed)
{
    CPath path;
    path.SetClosed(closed);
    path.SetLocation({{0, 0}, RectToPoly4({0, 0, 100, 100}), 0});
    return path;
}

} // namespace

TEST(Path, StraightPathsReachTheirEndsAndMiddle)
{
    CPath open = PathOn100(false);
    open.AddPoint(Anchor(0, 0));
    open.AddPoint(Anchor(1, 0));
    ASSERT_EQ(open.GetSegments().size(), 1u);
    EXPECT_NEAR(open.GetLength(), 100, 1e-3);
    EXPECT_NEAR(open.GetPosByCoef(0).X, 0, 1e-3);
    EXPECT_NEAR(open.GetPosByCoef(0.5f).X, 50, 1e-3);
    EXPECT_NEAR(open.GetPosByCoef(1).X, 100, 1e-3);
    EXPECT_NEAR(open.GetPosByCoef(7).X, 100, 1e-3) << "clamped";

    CPath closed = PathOn100(true);
    for (auto [x, y] : {std::pair{0.f, 0.f}, {1.f, 0.f}, {1.f, 1.f}})
        closed.AddPoint(Anchor(x, y));
    ASSERT_EQ(closed.GetSegments().size(), 3u) << "two, and the closing one";
    EXPECT_NEAR(closed.GetLength(), 200 + 100 * std::sqrt(2.0f), 1e-2);
    const FloatVector end = closed.GetPosByCoef(1);
    EXPECT_NEAR(end.X, 0, 1e-2);
    EXPECT_NEAR(end.Y, 0, 1e-2) << "a closed path ends where it starts";
    const FloatVector corner = closed.GetPosByCoef(200 / closed.GetLength());
    EXPECT_NEAR(corner.X, 100, 1e-2);
    EXPECT_NEAR(corner.Y, 100, 1e-2);
}

TEST(Path, EqualStepsOfTheCoefficientAreEqualDistancesOnACurve)
{
    // A strongly bent segment: its Bezier parameter runs far from evenly.
    CPath path = PathOn100(false);
    path.AddPoint({{0.9f, 0}, {0, 0}, {0, 0}});
    path.AddPoint({{1, 1}, {1, 0}, {1, 1}});
    // The true arc length by fine integration.
    const PathSegment& segment = path.GetSegments()[0];
    double length = 0;
    FloatVector previous = path.CurvePos(segment, 0);
    for (int i = 1; i <= 20000; ++i) {
        const FloatVector p = path.CurvePos(segment, i / 20000.0f);
        length += Dist(previous, p);
        previous = p;
    }
    EXPECT_NEAR(path.GetLength(), length, length * 0.005);
    const int steps = 20;
    const float step = path.GetLength() / steps;
    for (int i = 0; i < steps; ++i) {
        const float d = Dist(path.GetPosByCoef(float(i) / steps), path.GetPosByCoef(float(i + 1) / steps));
        EXPECT_NEAR(d, step, step * 0.05) << "step " << i;
    }
}

TEST(Path, TheCurveFollowsAMovedAndReshapedContour)
{
    CPath path = PathOn100(false);
    path.AddPoint(Anchor(0, 0.5f));
    path.AddPoint(Anchor(1, 0.5f));
    const float k = 0.5f;
    EXPECT_NEAR(path.GetPosByCoef(k).X, 50, 1e-3);
    // Twice as wide, moved, and turned a quarter.
    path.SetLocation({{500, 300}, RectToPoly4({0, 0, 200, 100}), float(M_PI / 2)});
    const FloatVector p = path.GetPosByCoef(k);
    EXPECT_NEAR(p.X, 500 - 50, 1e-2);
    EXPECT_NEAR(p.Y, 300 + 100, 1e-2);
    FloatVector offset;
    EXPECT_NEAR(path.GetCoefByPos(p + FloatVector(3, 0), offset), k, 1e-3) << "the coefficient is a ratio";
    EXPECT_NEAR(offset.X, -3, 1e-3);
}

TEST(Path, NearestCoefficientPrefersTheEarlierOfEqualPoints)
{
    CPath path = PathOn100(false);
    for (auto [x, y] : {std::pair{0.f, 0.f}, {1.f, 0.f}, {1.f, 1.f}, {0.f, 1.f}})
        path.AddPoint(Anchor(x, y));
    FloatVector offset;
    EXPECT_NEAR(path.GetCoefByPos({50, -10}, offset), 50 / 300.0f, 1e-4);
    EXPECT_NEAR(offset.Y, 10, 1e-4);
    // Equally far from the top and the bottom side.
    EXPECT_NEAR(path.GetCoefByPos({20, 50}, offset), 20 / 300.0f + 0.0f, 0.2f);
    EXPECT_LT(path.GetCoefByPos({50, 50}, offset), 0.5f) << "the top side comes first";
    FloatVector nearOffset;
    const PathPoint* nearest = path.GetNearestPoint({95, 10}, nearOffset);
    ASSERT_NE(nearest, nullptr);
    EXPECT_EQ(nearest->a.X, 1.0f);
    EXPECT_EQ(nearest->a.Y, 0.0f);
}

TEST(Path, SegmentsFollowThePointsAndTheClosing)
{
    CPath path = PathOn100(true);
    path.AddPoint(Anchor(0, 0));
    EXPECT_TRUE(path.GetSegments().empty());
    FloatVector offset;
    EXPECT_EQ(path.GetCoefByPos({5, 5}, offset), 0.0f) << "one point has no segment";
    path.AddPoint(Anchor(2, 0));
    EXPECT_EQ(path.EnumPoints(), 1u) << "an anchor outside the contour is refused";
    path.AddPoint(Anchor(1, 0));
    path.AddPoint(Anchor(1, 1));
    EXPECT_EQ(path.GetSegments().size(), 3u);
    path.SetClosed(false);
    EXPECT_EQ(path.GetSegments().size(), 2u);
    path.SetClosed(true);
    EXPECT_EQ(path.GetSegments().size(), 3u);

    // Editing fits the contour round the curve and keeps its shape.
    const FloatVector before = path.GetPosByCoef(0.1f);
    const PathPoint* inserted = path.InsertPoint(0.1f);
    ASSERT_NE(inserted, nullptr);
    EXPECT_EQ(path.EnumPoints(), 4u);
    EXPECT_EQ(path.GetSegments().size(), 4u);
    EXPECT_NEAR(Dist(path.Abs(inserted->a), before), 0, 1e-2);
    path.RemovePoint(inserted);
    EXPECT_EQ(path.GetSegments().size(), 3u);
    EXPECT_NEAR(path.GetPosByCoef(0).X, 0, 1e-2);

    // A copy's segments point at its own points.
    CPath copy = path;
    path.Clear();
    EXPECT_EQ(copy.GetSegments().size(), 3u);
    EXPECT_NEAR(copy.GetPosByCoef(1).Y, 0, 1e-2);
}

TEST(Path, CoincidentPointsGiveNoLengthAndNoNaN)
{
    CPath path = PathOn100(false);
    path.AddPoint(Anchor(0.5f, 0.5f));
    path.AddPoint(Anchor(0.5f, 0.5f));
    EXPECT_EQ(path.GetLength(), 0.0f);
    const FloatVector p = path.GetPosByCoef(0.5f);
    EXPECT_EQ(p.X, 50.0f);
    EXPECT_EQ(p.Y, 50.0f);
    FloatVector offset;
    EXPECT_EQ(path.GetCoefByPos({0, 0}, offset), 0.0f);
    EXPECT_EQ(path.InsertPoint(0.5f), nullptr);

    // A zero chord inside a segment (a cusp) does not stop the walk.
    CPath cusp = PathOn100(false);
    cusp.AddPoint({{0, 0}, {0, 0}, {0, 0}});
    cusp.AddPoint({{1, 0}, {1, 0}, {1, 0}});
    for (float k = 0; k <= 1.0f; k += 0.125f)
        EXPECT_FALSE(std::isnan(cusp.GetPosByCoef(k).X)) << k;
    EXPECT_FALSE(std::isnan(cusp.GetPosByCoef(NAN).X));
}

namespace {

// A square path of side 100 round the origin, and a dot that goes round it in a second by
// the coefficient of its keys.
std::string FollowClip(const std::string& closed, const std::string& ka, const std::string& kb)
{
    return R"(<?xml version="1.0"?><clips><Clip id="ride" w="200" h="200">
    <path id="road" closed=")" + closed + R"(" py="0 0 100 0 100 100 0 100">
      <p a="0,0" p1="0,0" p2="0,0"/><p a="1,0" p1="1,0" p2="1,0"/><p a="1,1" p1="1,1" p2="1,1"/>
      <p a="0,1" p1="0,1" p2="0,1"/></path>
    <image id="dot" path="road" snap="true" vis="true" p="60,-5">
      <kp t="0" itpl="true" k=")" + ka + R"("/><kp t="1000" k=")" + kb + R"("/></image>
    <image id="stray" path="nowhere" vis="true"><kp t="0"/></image>
  </Clip></clips>)";
}

struct PathClip : ::testing::Test {
    oxtest::FakeClock clock;
    std::unique_ptr<ox::core::CTimeManager> time;
    CClipsLoader loader;

    void SetUp() override
    {
        time = std::make_unique<ox::core::CTimeManager>(clock.Source());
        GetClipServices().time = time.get();
        clock.Advance(1000);
        time->Update();
    }
    void TearDown() override { GetClipServices() = ClipServices(); }
    void Declare(const char* closed, const char* ka, const char* kb)
    {
        const std::string xml = FollowClip(closed, ka, kb);
        ClipRecords records;
        ASSERT_TRUE(ConvertClipsXml(xml.data(), xml.size(), "test.xml", records));
        ASSERT_TRUE(loader.LoadRecords(records));
    }
    // Frames of at most 50 ms (the time manager caps a frame at 100).
    FloatVector At(CClip& clip, int ms)
    {
        for (int done = 0; done < ms; done += 50) {
            clock.Advance(std::min(50, ms - done));
            time->Update();
            clip.Update();
        }
        return clip.FindObject("dot")->GetPos();
    }
};

} // namespace

TEST_F(PathClip, AnObjectFollowsThePathByItsKeys)
{
    Declare("0", "0", "1");
    oxtest::LogCapture log;
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "ride"));
    CClipObject* dot = clip.FindObject("dot");
    ASSERT_NE(dot, nullptr);
    ASSERT_NE(dot->GetPath(), nullptr);
    EXPECT_EQ(dot->LoadPathHelper("road"), dot->GetPath());
    EXPECT_TRUE(log.Contains("object 'stray' follows the unknown path 'nowhere'"));
    FloatVector p = At(clip, 500);
    EXPECT_NEAR(p.X, 100, 0.5);
    EXPECT_NEAR(p.Y, 50, 0.5) << "half of an open path of three sides";

    // A copy follows its own path: reshaping the original's leaves it alone.
    CClip copy = clip;
    clip.GetPaths()[0]->SetPoly(RectToPoly4({0, 0, 10, 10}));
    ASSERT_NE(copy.FindObject("dot")->GetPath(), clip.GetPaths()[0].get());
    const FloatVector mine = copy.FindObject("dot")->GetPath()->GetCurve().GetPosByCoef(0.5f);
    EXPECT_NEAR(mine.X, 100, 0.5);
    // The original's dot now runs on the small square.
    clip.SetTime(500);
    EXPECT_NEAR(clip.FindObject("dot")->GetPos().X, 10, 0.1);
}

TEST_F(PathClip, OnAClosedPathTheShorterWayIsTaken)
{
    Declare("1", "0.875", "0.125");
    CClip clip;
    ASSERT_TRUE(clip.Load(loader, "ride"));
    // From the middle of the left side over the start to the middle of the top side.
    FloatVector p = At(clip, 500);
    EXPECT_NEAR(p.X, 0, 0.5);
    EXPECT_NEAR(p.Y, 0, 0.5);
    p = At(clip, 250);
    EXPECT_NEAR(p.X, 25, 0.5);
    EXPECT_NEAR(p.Y, 0, 0.5);

    CClipObject& dot = *clip.FindObject("dot");
    dot.SnapToPath(false);
    dot.SetPos({60, -5});
    EXPECT_EQ(dot.GetPos(), FloatVector(60, -5));
    dot.SnapToPath(true);
    EXPECT_NEAR(dot.GetPos().X, 60, 0.05);
    EXPECT_NEAR(dot.GetPos().Y, 0, 0.05) << "snapping puts it on the nearest point";
    EXPECT_NEAR(dot.GetState().k, 0.15f, 1e-3);
}
