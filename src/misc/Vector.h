#pragma once
// A plain two-component value: positions, sizes, offsets.
namespace ox::misc {

template <class T>
struct Vector {
    T X{};
    T Y{};

    constexpr Vector() = default;
    constexpr Vector(T x, T y) : X(x), Y(y) {}

    constexpr Vector operator+(const Vector& other) const { return {X + other.X, Y + other.Y}; }
    constexpr Vector operator-(const Vector& other) const { return {X - other.X, Y - other.Y}; }
    constexpr Vector operator*(T k) const { return {X * k, Y * k}; }
    constexpr Vector& operator+=(const Vector& other) { X += other.X; Y += other.Y; return *this; }
    constexpr Vector& operator-=(const Vector& other) { X -= other.X; Y -= other.Y; return *this; }
    constexpr bool operator==(const Vector& other) const { return X == other.X && Y == other.Y; }
};

using FloatVector = Vector<float>;
using IntVector = Vector<int>;

} // namespace ox::misc
