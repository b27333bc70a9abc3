#pragma once
// Where a drawn thing stands: a position, a contour around it and an angle.
#include "misc/Poly.h"
#include "misc/Vector.h"

#include <cmath>

namespace ox::misc {

struct Location {
    FloatVector Pos;
    Poly4 Contour;
    float Angle = 0;  // radians

    // The contour turned by the angle about the origin, then moved by the position.
    Poly4 GetPoly() const
    {
        const float c = std::cos(Angle), s = std::sin(Angle);
        Poly4 poly;
        for (int i = 0; i < 4; ++i) {
            const FloatVector& p = Contour[i];
            poly[i] = {p.X * c - p.Y * s + Pos.X, p.X * s + p.Y * c + Pos.Y};
        }
        return poly;
    }
};

// Whether a point lies inside a quad (by the crossings of a ray; any winding, any shape).
inline bool IsPointInPoly4(const Poly4& poly, const FloatVector& point)
{
    bool inside = false;
    for (int i = 0, j = 3; i < 4; j = i++) {
        const FloatVector& a = poly[i];
        const FloatVector& b = poly[j];
        if ((a.Y > point.Y) != (b.Y > point.Y) && point.X < (b.X - a.X) * (point.Y - a.Y) / (b.Y - a.Y) + a.X)
            inside = !inside;
    }
    return inside;
}

} // namespace ox::misc
