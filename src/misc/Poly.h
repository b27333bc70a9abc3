#pragma once
// A polygon of N points; Poly<4> is a quad in the order top left, top right, bottom right,
// bottom left.
#include "misc/Rect.h"
#include "misc/Vector.h"

namespace ox::misc {

template <int N>
struct Poly {
    Vector<float> Points[N];

    constexpr Vector<float>& operator[](int i) { return Points[i]; }
    constexpr const Vector<float>& operator[](int i) const { return Points[i]; }
    constexpr bool operator==(const Poly& other) const
    {
        for (int i = 0; i < N; ++i)
            if (!(Points[i] == other.Points[i]))
                return false;
        return true;
    }
};

using Poly4 = Poly<4>;

// The quad of a rectangle.
constexpr Poly4 RectToPoly4(const Rect<float>& r)
{
    return Poly4 {{{r.X, r.Y}, {r.X + r.Width, r.Y}, {r.X + r.Width, r.Y + r.Height}, {r.X, r.Y + r.Height}}};
}

// The bilinear map of the unit square onto the quad: (0,0) -> P0, (1,0) -> P1, (1,1) -> P2,
// (0,1) -> P3.
constexpr Vector<float> Poly4ConvertToAbsPos(const Poly4& p, const Vector<float>& local)
{
    const float u = local.X, v = local.Y;
    const float w0 = (1 - u) * (1 - v), w1 = u * (1 - v), w2 = u * v, w3 = (1 - u) * v;
    return {w0 * p[0].X + w1 * p[1].X + w2 * p[2].X + w3 * p[3].X,
            w0 * p[0].Y + w1 * p[1].Y + w2 * p[2].Y + w3 * p[3].Y};
}

// Whether a point lies strictly inside a convex quad of either winding: for every edge, the cross
// product of the edge with the point has the sign of the first edge's, their product being at
// least 0.001. Points on an edge are outside.
bool IsInside(const Poly4& poly, const Vector<float>& point);

// The inverse of Poly4ConvertToAbsPos: the local (u, v) of a point, by Newton steps on the
// bilinear map (exact in one step for parallelograms).
Vector<float> Poly4ConvertToLocalPos(const Poly4& p, const Vector<float>& pos);

} // namespace ox::misc
