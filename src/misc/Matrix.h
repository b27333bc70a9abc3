#pragma once
// A 3 x 3 float matrix, row-major, for 2-D affine transforms. Points are row vectors:
// x' = x*m00 + y*m10 + m20, y' = x*m01 + y*m11 + m21. In a product A * B, A acts first.
#include "misc/Vector.h"

#include <cmath>

namespace ox::misc {

struct FloatMatrix {
    float m[3][3] = {{1, 0, 0}, {0, 1, 0}, {0, 0, 1}};

    constexpr FloatMatrix() = default;
    constexpr FloatMatrix(float m00, float m01, float m02, float m10, float m11, float m12, float m20, float m21,
                          float m22)
        : m {{m00, m01, m02}, {m10, m11, m12}, {m20, m21, m22}}
    {
    }

    static constexpr FloatMatrix Identity() { return {}; }

    constexpr FloatMatrix operator*(const FloatMatrix& b) const
    {
        FloatMatrix r;
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                r.m[i][j] = m[i][0] * b.m[0][j] + m[i][1] * b.m[1][j] + m[i][2] * b.m[2][j];
        return r;
    }

    constexpr Vector<float> Transform(const Vector<float>& p) const
    {
        return {p.X * m[0][0] + p.Y * m[1][0] + m[2][0], p.X * m[0][1] + p.Y * m[1][1] + m[2][1]};
    }

    constexpr bool operator==(const FloatMatrix& o) const
    {
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                if (m[i][j] != o.m[i][j])
                    return false;
        return true;
    }
};

inline FloatMatrix MatrixRotation(float angle)
{
    const float c = std::cos(angle), s = std::sin(angle);
    return {c, s, 0, -s, c, 0, 0, 0, 1};
}

// The inverse of an affine transform (last column 0, 0, 1); a singular one gives the identity.
constexpr FloatMatrix MatrixInverse(const FloatMatrix& a)
{
    const float det = a.m[0][0] * a.m[1][1] - a.m[0][1] * a.m[1][0];
    if (det == 0.0f)
        return {};
    const float i00 = a.m[1][1] / det, i01 = -a.m[0][1] / det, i10 = -a.m[1][0] / det, i11 = a.m[0][0] / det;
    return {i00, i01, 0, i10, i11, 0, -(a.m[2][0] * i00 + a.m[2][1] * i10), -(a.m[2][0] * i01 + a.m[2][1] * i11), 1};
}

constexpr FloatMatrix MatrixTranslation(float x, float y) { return {1, 0, 0, 0, 1, 0, x, y, 1}; }
constexpr FloatMatrix MatrixScale(float x, float y) { return {x, 0, 0, 0, y, 0, 0, 0, 1}; }

} // namespace ox::misc
