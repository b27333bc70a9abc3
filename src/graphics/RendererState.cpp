#include "graphics/RendererState.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace ox::graphics {

using misc::FloatMatrix;
using misc::FloatVector;

CRendererState::CRendererState() { ResetFrame(); }

void CRendererState::ResetFrame()
{
    m_MatrixStack.Clear();
    m_ColorStack.Clear();
    m_ClipStack.Clear();
    m_BlendStack.Clear();
    m_ShaderStack.Clear();
    m_MatrixStack.Push(FloatMatrix::Identity());
    m_ColorStack.Push(Color(0xFFFFFFFFu));
    m_BlendStack.Push(BlendNormal);
    m_ShaderStack.Push(nullptr);
    m_TransformValid = false;
}

void CRendererState::ApplyMatrix(const FloatMatrix& m)
{
    FloatMatrix& top = m_MatrixStack.GetTop();
    top = m * top;
    m_TransformValid = false;
}

void CRendererState::SetAspectMatrix(const FloatVector& scale, const FloatVector& offset)
{
    m_AspectMatrix = misc::MatrixScale(scale.X, scale.Y) * misc::MatrixTranslation(offset.X, offset.Y);
    m_TransformValid = false;
}

void CRendererState::PushState()
{
    m_MatrixStack.Push(m_MatrixStack.GetTop());
    m_ColorStack.Push(m_ColorStack.GetTop());
    if (!m_ClipStack.Empty())
        m_ClipStack.Push(m_ClipStack.GetTop());
    m_BlendStack.Push(m_BlendStack.GetTop());
    m_ShaderStack.Push(m_ShaderStack.GetTop());
}

void CRendererState::PopState()
{
    m_ShaderStack.Pop();
    m_BlendStack.Pop();
    if (!m_ClipStack.Empty())
        m_ClipStack.Pop();
    m_ColorStack.Pop();
    m_MatrixStack.Pop();
    m_TransformValid = false;
}

void CRendererState::SetClipPoly(const misc::Poly4& poly)
{
    const FloatMatrix& m = GetTransform();
    ClipPolygon clip;
    for (int i = 0; i < 4; ++i)
        clip.PushBack(m.Transform(poly[i]));

    if (m_ClipStack.Empty()) {
        m_ClipStack.Push(clip);
        return;
    }
    ClipPolygon& top = m_ClipStack.GetTop();
    if (top.Empty())
        return; // an empty clip stays empty on this level

    if (clip.Size() == top.Size()) {
        bool same = true;
        for (size_t i = 0; i < clip.Size() && same; ++i)
            same = std::fabs(clip[i].X - top[i].X) < 0.5f && std::fabs(clip[i].Y - top[i].Y) < 0.5f;
        if (same) {
            top = clip;
            return;
        }
    }
    ClipPolygon result;
    IntersectPolygons(top, clip, result);
    if (result.Size() < 3)
        result.Clear();
    top = result;
}

void CRendererState::TransformVertices(Vertex* v, unsigned& count, bool skipClip) const
{
    const FloatMatrix& m = GetTransform();
    const float m00 = m.m[0][0], m01 = m.m[0][1], m10 = m.m[1][0], m11 = m.m[1][1], m20 = m.m[2][0],
                m21 = m.m[2][1];
    for (unsigned i = 0; i < count; ++i) {
        const float x = v[i].x, y = v[i].y;
        v[i].x = x * m00 + y * m10 + m20;
        v[i].y = x * m01 + y * m11 + m21;
    }
    ClipAndShift(v, count, skipClip);
}

void CRendererState::ClipAndShift(Vertex* v, unsigned& count, bool skipClip) const
{
    if (!skipClip)
        ClipVertices(v, count);
    for (unsigned i = 0; i < count; ++i) {
        v[i].x -= 0.5f;
        v[i].y -= 0.5f;
    }
}

namespace {

// The affine function f(x, y) = a*x + b*y + c through three samples.
struct Affine {
    float a = 0, b = 0, c = 0;
    float operator()(float x, float y) const { return a * x + b * y + c; }
};

Affine FitAffine(const Vertex& p0, const Vertex& p1, const Vertex& p2, float f0, float f1, float f2)
{
    const float dx1 = p1.x - p0.x, dy1 = p1.y - p0.y, dx2 = p2.x - p0.x, dy2 = p2.y - p0.y;
    const float det = dx1 * dy2 - dx2 * dy1;
    Affine f;
    if (std::fabs(det) < 1e-12f) {
        // No area (a line): the value of the first vertex everywhere.
        f.c = f0;
        return f;
    }
    const float df1 = f1 - f0, df2 = f2 - f0;
    f.a = (df1 * dy2 - df2 * dy1) / det;
    f.b = (dx1 * df2 - dx2 * df1) / det;
    f.c = f0 - f.a * p0.x - f.b * p0.y;
    return f;
}

} // namespace

void CRendererState::ClipVertices(Vertex* v, unsigned& count) const
{
    if (m_ClipStack.Empty())
        return;
    const ClipPolygon& clip = m_ClipStack.GetTop();
    if (clip.Size() < 3) {
        count = 0;
        return;
    }
    if (count < 2)
        return;

    if (clip.Size() == 4 && std::fabs(clip[0].Y - clip[1].Y) < 0.5f && std::fabs(clip[2].Y - clip[3].Y) < 0.5f &&
        std::fabs(clip[0].X - clip[3].X) < 0.5f && std::fabs(clip[1].X - clip[2].X) < 0.5f) {
        // An axis-aligned rectangle: whole primitives inside or outside need no polygon work.
        const float left = std::min(clip[0].X, clip[1].X), right = std::max(clip[0].X, clip[1].X);
        const float top = std::min(clip[0].Y, clip[2].Y), bottom = std::max(clip[0].Y, clip[2].Y);
        if (right - left < 0.5f || bottom - top < 0.5f) {
            count = 0;
            return;
        }
        bool inside = true, allLeft = true, allRight = true, allAbove = true, allBelow = true;
        for (unsigned i = 0; i < count; ++i) {
            const float x = v[i].x, y = v[i].y;
            inside = inside && x >= left && x <= right && y >= top && y <= bottom;
            allLeft = allLeft && x <= left;
            allRight = allRight && x >= right;
            allAbove = allAbove && y <= top;
            allBelow = allBelow && y >= bottom;
        }
        if (inside)
            return;
        if (allLeft || allRight || allAbove || allBelow) {
            count = 0;
            return;
        }
    }

    if (count == 2) {
        // A line: a degenerate triangle.
        v[2] = v[1];
        count = 3;
    }

    Vertex out[MaxClipVertices];
    unsigned outCount = 0;
    const unsigned triangles = count / 3;
    for (unsigned t = 0; t < triangles; ++t) {
        const Vertex* tri = v + t * 3;
        ClipPolygon subject, result;
        for (int i = 0; i < 3; ++i)
            subject.PushBack({tri[i].x, tri[i].y});
        IntersectPolygons(clip, subject, result);
        if (result.Empty())
            continue;
        const Affine fu = FitAffine(tri[0], tri[1], tri[2], tri[0].u, tri[1].u, tri[2].u);
        const Affine fv = FitAffine(tri[0], tri[1], tri[2], tri[0].v, tri[1].v, tri[2].v);
        auto make = [&](size_t i) {
            Vertex r = v[0];
            r.x = result[i].X;
            r.y = result[i].Y;
            r.u = std::clamp(fu(r.x, r.y), 0.0f, 1.0f);
            r.v = std::clamp(fv(r.x, r.y), 0.0f, 1.0f);
            return r;
        };
        for (size_t i = 1; i + 1 < result.Size(); ++i) {
            const unsigned out_verts_count = outCount + 3;
            OX_ASSERT(out_verts_count<=64);
            if (out_verts_count > MaxClipVertices)
                break;
            out[outCount++] = make(0);
            out[outCount++] = make(i);
            out[outCount++] = make(i + 1);
        }
    }
    if (outCount > 0)
        std::memcpy(v, out, outCount * sizeof(Vertex));
    count = outCount;
}

void CRendererState::IntersectPolygons(const ClipPolygon& clip, const ClipPolygon& subject, ClipPolygon& out)
{
    out.Clear();
    const size_t n = clip.Size();
    if (n < 3) {
        return;
    }
    const float cross = (clip[1].X - clip[0].X) * (clip[2].Y - clip[0].Y) -
                        (clip[1].Y - clip[0].Y) * (clip[2].X - clip[0].X);
    const bool positive = cross > 0.1f;

    ClipPolygon polys[2];
    polys[0] = subject;
    int in = 0;
    for (size_t e = 0; e < n; ++e) {
        // The edge (a, b): walked from the last point down for a positive orientation,
        // else from point 0 up.
        FloatVector a, b;
        if (positive) {
            const size_t i = n - 1 - e;
            a = clip[(i + 1) % n];
            b = clip[i];
        } else {
            const size_t i = e;
            a = clip[(i + n - 1) % n];
            b = clip[i];
        }
        const float A = b.Y - a.Y, B = a.X - b.X, C = -A * a.X - B * a.Y;

        ClipPolygon& input = polys[in];
        ClipPolygon& output = polys[1 - in];
        output.Clear();
        if (input.Size() < 2) {
            input.Clear();
            output.Clear();
            break;
        }
        FloatVector prev = input[input.Size() - 1];
        float dPrev = A * prev.X + B * prev.Y + C;
        for (size_t i = 0; i < input.Size(); ++i) {
            const FloatVector cur = input[i];
            const float dCur = A * cur.X + B * cur.Y + C;
            const bool curOn = std::fabs(dCur) < 0.1f, prevOn = std::fabs(dPrev) < 0.1f;
            const bool curIn = dCur > -0.1f, prevIn = dPrev > -0.1f;
            auto meet = [&] {
                const float t = dPrev / (dPrev - dCur);
                return FloatVector {prev.X + (cur.X - prev.X) * t, prev.Y + (cur.Y - prev.Y) * t};
            };
            if (curOn) {
                output.PushBack(cur);
            } else if (prevOn && !curIn) {
                // leaves from the line: nothing
            } else if (curIn && prevIn) {
                output.PushBack(cur);
            } else if (!curIn && prevIn) {
                output.PushBack(meet());
            } else if (curIn && !prevIn) {
                output.PushBack(meet());
                output.PushBack(cur);
            }
            prev = cur;
            dPrev = dCur;
        }
        input.Clear();
        in = 1 - in;
    }
    out = polys[in];
}

} // namespace ox::graphics
