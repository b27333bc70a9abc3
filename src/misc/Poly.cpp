#include "misc/Poly.h"

#include <cmath>

namespace ox::misc {

bool IsInside(const Poly4& p, const Vector<float>& point)
{
    auto cross = [&](int i) {
        const Vector<float>& a = p[i];
        const Vector<float>& b = p[(i + 1) % 4];
        return (b.X - a.X) * (point.Y - a.Y) - (b.Y - a.Y) * (point.X - a.X);
    };
    const float first = cross(0);
    for (int i = 0; i < 4; ++i)
        if (first * (i == 0 ? first : cross(i)) < 0.001f)
            return false;
    return true;
}

Vector<float> Poly4ConvertToLocalPos(const Poly4& p, const Vector<float>& pos)
{
    double u = 0.5, v = 0.5;
    for (int i = 0; i < 16; ++i) {
        // Residual and Jacobian of the bilinear map at (u, v).
        const double w0 = (1 - u) * (1 - v), w1 = u * (1 - v), w2 = u * v, w3 = (1 - u) * v;
        const double fx = w0 * p[0].X + w1 * p[1].X + w2 * p[2].X + w3 * p[3].X - pos.X;
        const double fy = w0 * p[0].Y + w1 * p[1].Y + w2 * p[2].Y + w3 * p[3].Y - pos.Y;
        const double dxu = (1 - v) * (p[1].X - p[0].X) + v * (p[2].X - p[3].X);
        const double dyu = (1 - v) * (p[1].Y - p[0].Y) + v * (p[2].Y - p[3].Y);
        const double dxv = (1 - u) * (p[3].X - p[0].X) + u * (p[2].X - p[1].X);
        const double dyv = (1 - u) * (p[3].Y - p[0].Y) + u * (p[2].Y - p[1].Y);
        const double det = dxu * dyv - dxv * dyu;
        if (std::fabs(det) < 1e-12)
            break; // degenerate quad: no unique answer
        const double du = (fx * dyv - fy * dxv) / det;
        const double dv = (fy * dxu - fx * dyu) / det;
        u -= du;
        v -= dv;
        if (std::fabs(du) < 1e-9 && std::fabs(dv) < 1e-9)
            break;
    }
    return {static_cast<float>(u), static_cast<float>(v)};
}

} // namespace ox::misc
