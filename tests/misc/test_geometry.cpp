// Matrices and quads shared by the graphics and the scene code.
#include "misc/Matrix.h"
#include "misc/Poly.h"

#include <gtest/gtest.h>

using namespace ox::misc;

TEST(Geometry, MatrixProductAppliesTheLeftFactorFirst)
{
    const FloatMatrix m = MatrixScale(2, 3) * MatrixTranslation(10, 20);
    const FloatVector p = m.Transform({1, 1});
    EXPECT_FLOAT_EQ(p.X, 12);
    EXPECT_FLOAT_EQ(p.Y, 23);
    const FloatVector r = MatrixRotation(3.14159265f / 2).Transform({1, 0});
    EXPECT_NEAR(r.X, 0, 1e-6);
    EXPECT_NEAR(r.Y, 1, 1e-6) << "positive angles turn x toward y";
}

TEST(Geometry, Poly4AbsoluteAndLocalPositionsAreInverse)
{
    const Poly4 quad {{{0, 0}, {40, 0}, {60, 20}, {0, 30}}};
    EXPECT_EQ(Poly4ConvertToAbsPos(quad, {1, 1}), (FloatVector {60, 20}));
    const FloatVector centre = Poly4ConvertToAbsPos(quad, {0.5f, 0.5f});
    EXPECT_FLOAT_EQ(centre.X, 25);
    EXPECT_FLOAT_EQ(centre.Y, 12.5f);
    for (FloatVector local : {FloatVector {0.25f, 0.75f}, FloatVector {0.9f, 0.1f}, FloatVector {0.5f, 0.5f}}) {
        const FloatVector back = Poly4ConvertToLocalPos(quad, Poly4ConvertToAbsPos(quad, local));
        EXPECT_NEAR(back.X, local.X, 1e-5);
        EXPECT_NEAR(back.Y, local.Y, 1e-5);
    }
}
