#pragma once
// Distances inward from the four edges of a rectangle, in the order left, right, top, bottom.
namespace ox::misc {

template <class T>
struct Insets {
    T Left{};
    T Right{};
    T Top{};
    T Bottom{};

    constexpr Insets() = default;
    constexpr Insets(T left, T right, T top, T bottom) : Left(left), Right(right), Top(top), Bottom(bottom) {}

    constexpr bool operator==(const Insets& other) const = default;
};

using FloatInsets = Insets<float>;

} // namespace ox::misc
