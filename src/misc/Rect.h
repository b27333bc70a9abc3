#pragma once
// A plain axis-aligned rectangle: origin and size.
namespace ox::misc {

template <class T>
struct Rect {
    T X{};
    T Y{};
    T Width{};
    T Height{};

    constexpr Rect() = default;
    constexpr Rect(T x, T y, T width, T height) : X(x), Y(y), Width(width), Height(height) {}

    constexpr bool operator==(const Rect& other) const
    {
        return X == other.X && Y == other.Y && Width == other.Width && Height == other.Height;
    }
};

using FloatRect = Rect<float>;
using IntRect = Rect<int>;
using ShortRect = Rect<short>;

} // namespace ox::misc
