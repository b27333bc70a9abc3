// The render state: stacks, the clip stack and the polygon clipper.
#include "graphics/RendererState.h"
#include "support/TestSupport.h"

#include <algorithm>
#include <cstring>

using namespace ox::graphics;
using ox::misc::FloatVector;
using ox::misc::Poly4;
using ox::misc::RectToPoly4;

namespace {

Vertex V(float x, float y, float u = 0, float v = 0, uint32_t color = 0xFF102030u)
{
    return Vertex {x, y, 0, 1, color, 0, u, v};
}

// Two triangles of a quad, TL TR BL / BL TR BR, with UVs over the unit square.
unsigned Quad(Vertex* v, float x, float y, float w, float h)
{
    v[0] = V(x, y, 0, 0);
    v[1] = V(x + w, y, 1, 0);
    v[2] = V(x, y + h, 0, 1);
    v[3] = v[2];
    v[4] = v[1];
    v[5] = V(x + w, y + h, 1, 1);
    return 6;
}

float Area(const Vertex* v, unsigned n)
{
    float area = 0;
    for (unsigned i = 0; i + 2 < n; i += 3)
        area += std::fabs((v[i + 1].x - v[i].x) * (v[i + 2].y - v[i].y) -
                          (v[i + 2].x - v[i].x) * (v[i + 1].y - v[i].y)) / 2;
    return area;
}

} // namespace

TEST(RenderState, ResetFrameAndStackLimits)
{
    CRendererState state;
    state.SetColor(Color(0x80FF0000u));
    state.SetBlendMode(BlendAdditive);
    state.ApplyMatrix(ox::misc::MatrixTranslation(5, 6));
    state.ResetFrame();
    EXPECT_EQ(state.GetColor(), Color(0xFFFFFFFFu));
    EXPECT_EQ(state.GetBlendMode(), BlendNormal);
    EXPECT_EQ(state.GetMatrix(), ox::misc::FloatMatrix());
    EXPECT_EQ(state.GetPixelShader(), nullptr);
    EXPECT_EQ(state.GetClipPoly(), nullptr);

    // A stack takes 32 entries; the next push breaks the contract and changes nothing.
    BoundedStack<int> stack;
    for (int i = 0; i < 32; ++i)
        stack.Push(i);
    EXPECT_CONTRACT_FAILURE(stack.Push(99), "Top>=-1 && Top<MaxSize-1");
    EXPECT_EQ(stack.Size(), 32);
}

TEST(RenderState, ApplyMatrixActsBeforeTheCurrentOneAndAspectComesLast)
{
    CRendererState state;
    state.SetAspectMatrix({2, 3}, {100, 10});
    state.ApplyMatrix(ox::misc::MatrixTranslation(10, 0));
    state.ApplyMatrix(ox::misc::MatrixScale(2, 2)); // acts first: (1,1) -> (2,2) -> (12,2)
    Vertex v[MaxClipVertices] = {V(1, 1)};
    unsigned n = 1;
    state.TransformVertices(v, n, false);
    ASSERT_EQ(n, 1u);
    EXPECT_FLOAT_EQ(v[0].x, 12 * 2 + 100 - 0.5f);
    EXPECT_FLOAT_EQ(v[0].y, 2 * 3 + 10 - 0.5f);
}

TEST(RenderState, ClipStackFollowsPushAndPop)
{
    CRendererState state;
    // Empty stack, push, set, pop: the clip is gone again.
    state.PushState();
    state.SetClipPoly(RectToPoly4({0, 0, 100, 100}));
    ASSERT_NE(state.GetClipPoly(), nullptr);
    state.PopState();
    EXPECT_EQ(state.GetClipPoly(), nullptr);

    // Set before the push: the pop restores the first polygon.
    state.SetClipPoly(RectToPoly4({0, 0, 100, 100}));
    state.PushState();
    state.SetClipPoly(RectToPoly4({10, 10, 50, 50}));
    EXPECT_NEAR((*state.GetClipPoly())[0].X, 10, 1e-4);
    state.PopState();
    ASSERT_NE(state.GetClipPoly(), nullptr);
    EXPECT_EQ((*state.GetClipPoly())[0].X, 0);
    EXPECT_EQ((*state.GetClipPoly())[2].X, 100);

    // Nearly the same polygon (within half a pixel) replaces the top rather than cutting it.
    state.SetClipPoly(RectToPoly4({0.3f, 0, 100, 100}));
    EXPECT_EQ(state.GetClipPoly()->Size(), 4u);
    EXPECT_FLOAT_EQ((*state.GetClipPoly())[0].X, 0.3f);
}

TEST(RenderState, DisjointNestedClipsStayEmptyAndRemoveEverything)
{
    CRendererState state;
    state.SetClipPoly(RectToPoly4({0, 0, 10, 10}));
    state.SetClipPoly(RectToPoly4({50, 50, 10, 10}));
    ASSERT_NE(state.GetClipPoly(), nullptr);
    EXPECT_TRUE(state.GetClipPoly()->Empty());
    // A later clip on this level does not revive it.
    state.SetClipPoly(RectToPoly4({0, 0, 100, 100}));
    EXPECT_TRUE(state.GetClipPoly()->Empty());
    Vertex v[MaxClipVertices];
    unsigned n = Quad(v, 1, 1, 5, 5);
    state.ClipVertices(v, n);
    EXPECT_EQ(n, 0u);
}

TEST(RenderState, RectangleClipFastPath)
{
    CRendererState state;
    state.SetClipPoly(RectToPoly4({10, 10, 100, 50}));
    Vertex v[MaxClipVertices], before[MaxClipVertices];

    // All inside, edges included: untouched, same order and count.
    unsigned n = Quad(v, 10, 10, 100, 50);
    std::memcpy(before, v, sizeof v);
    state.ClipVertices(v, n);
    EXPECT_EQ(n, 6u);
    EXPECT_EQ(std::memcmp(before, v, 6 * sizeof(Vertex)), 0);

    // Wholly on one side, touching the edge counts as outside.
    n = Quad(v, 0, 20, 10, 10);
    state.ClipVertices(v, n);
    EXPECT_EQ(n, 0u);
    n = Quad(v, 20, 60, 10, 10);
    state.ClipVertices(v, n);
    EXPECT_EQ(n, 0u);

    // A clip thinner than half a pixel removes everything.
    CRendererState thin;
    thin.SetClipPoly(RectToPoly4({10, 10, 0.4f, 50}));
    n = Quad(v, 0, 0, 100, 100);
    thin.ClipVertices(v, n);
    EXPECT_EQ(n, 0u);
}

TEST(RenderState, PartlyInsideTriangleIsCutWithAffineTextureCoordinates)
{
    CRendererState state;
    state.SetClipPoly(RectToPoly4({0, -10, 4, 40}));
    Vertex v[MaxClipVertices] = {V(0, 0, 0, 0, 0xFF010203u), V(10, 0, 1, 0, 0xFFFFFFFFu), V(0, 10, 0, 1)};
    unsigned n = 3;
    state.ClipVertices(v, n);
    // The part x <= 4 of the triangle: a quad (0,0) (4,0) (4,6) (0,10), as a fan of two.
    ASSERT_EQ(n, 6u);
    EXPECT_NEAR(Area(v, n), 32.0f, 1e-3);
    std::vector<std::pair<float, float>> points;
    for (unsigned i = 0; i < n; ++i) {
        EXPECT_NEAR(v[i].u, v[i].x / 10, 1e-5);
        EXPECT_NEAR(v[i].v, v[i].y / 10, 1e-5);
        EXPECT_EQ(v[i].diffuse, 0xFF010203u) << "colours come from the first vertex";
        points.emplace_back(std::round(v[i].x * 1000) / 1000, std::round(v[i].y * 1000) / 1000);
    }
    std::sort(points.begin(), points.end());
    points.erase(std::unique(points.begin(), points.end()), points.end());
    EXPECT_EQ(points, (std::vector<std::pair<float, float>> {{0, 0}, {0, 10}, {4, 0}, {4, 6}}));
}

TEST(RenderState, RotatedClipEitherWindingGivesTheSameCut)
{
    // A diamond around (50, 50), given clockwise and counter-clockwise on the screen.
    Poly4 diamond {{{50, 20}, {80, 50}, {50, 80}, {20, 50}}};
    Poly4 reversed {{diamond[3], diamond[2], diamond[1], diamond[0]}};
    float areas[2];
    int i = 0;
    for (const Poly4& clip : {diamond, reversed}) {
        CRendererState state;
        state.SetClipPoly(clip);
        Vertex v[MaxClipVertices];
        unsigned n = Quad(v, 0, 0, 100, 100);
        state.ClipVertices(v, n);
        areas[i++] = Area(v, n);
        for (unsigned k = 0; k < n; ++k)
            EXPECT_LE(std::fabs(v[k].x - 50) + std::fabs(v[k].y - 50), 30.01f);
    }
    EXPECT_NEAR(areas[0], 1800.0f, 0.01f);
    EXPECT_NEAR(areas[1], 1800.0f, 0.01f);

    // A line across the diamond keeps only its part inside.
    CRendererState state;
    state.SetClipPoly(diamond);
    Vertex v[MaxClipVertices] = {V(0, 50), V(100, 50)};
    unsigned n = 2;
    state.ClipVertices(v, n);
    ASSERT_GE(n, 3u);
    float minX = 1e9, maxX = -1e9;
    for (unsigned k = 0; k < n; ++k) {
        minX = std::min(minX, v[k].x);
        maxX = std::max(maxX, v[k].x);
        EXPECT_FLOAT_EQ(v[k].y, 50);
    }
    EXPECT_NEAR(minX, 20, 1e-3);
    EXPECT_NEAR(maxX, 80, 1e-3);
}

TEST(RenderState, IntersectPolygonsEdgeCases)
{
    ClipPolygon square, subject, out;
    for (FloatVector p : {FloatVector {0, 0}, FloatVector {10, 0}, FloatVector {10, 10}, FloatVector {0, 10}})
        square.PushBack(p);
    // A single point is too little to clip: empty.
    subject.PushBack({5, 5});
    CRendererState::IntersectPolygons(square, subject, out);
    EXPECT_TRUE(out.Empty());
    // A polygon sharing an edge with the clip keeps it, with no doubled points.
    subject.Clear();
    for (FloatVector p : {FloatVector {0, 0}, FloatVector {10, 0}, FloatVector {5, -5}})
        subject.PushBack(p);
    CRendererState::IntersectPolygons(square, subject, out);
    EXPECT_EQ(out.Size(), 2u) << "only the shared edge is left";
}
