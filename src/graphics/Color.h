#pragma once
// A colour of four signed 16-bit channels, 0 to 255 each, in the order red, green, blue,
// alpha (the layout of binary records). Built from and packed to 0xAARRGGBB.
#include <cstdint>

namespace ox::graphics {

struct Color {
    int16_t Red = 255;
    int16_t Green = 255;
    int16_t Blue = 255;
    int16_t Alpha = 255;

    // White.
    constexpr Color() = default;
    // From a 0xAARRGGBB number.
    constexpr explicit Color(uint32_t argb)
        : Red(static_cast<int16_t>((argb >> 16) & 0xFF)), Green(static_cast<int16_t>((argb >> 8) & 0xFF)),
          Blue(static_cast<int16_t>(argb & 0xFF)), Alpha(static_cast<int16_t>(argb >> 24))
    {
    }
    constexpr Color(int16_t red, int16_t green, int16_t blue, int16_t alpha)
        : Red(red), Green(green), Blue(blue), Alpha(alpha)
    {
    }

    // Each channel into 0..255.
    constexpr void Clamp()
    {
        Red = ClampChannel(Red);
        Green = ClampChannel(Green);
        Blue = ClampChannel(Blue);
        Alpha = ClampChannel(Alpha);
    }

    // The device form: A<<24 | R<<16 | G<<8 | B.
    constexpr uint32_t GetARGB() const
    {
        return (static_cast<uint32_t>(Alpha & 0xFF) << 24) | (static_cast<uint32_t>(Red & 0xFF) << 16) |
               (static_cast<uint32_t>(Green & 0xFF) << 8) | static_cast<uint32_t>(Blue & 0xFF);
    }

    // Per channel trunc(a * b / 255.0), clamped.
    constexpr Color operator*(const Color& other) const
    {
        Color result(Multiply(Red, other.Red), Multiply(Green, other.Green), Multiply(Blue, other.Blue),
                     Multiply(Alpha, other.Alpha));
        result.Clamp();
        return result;
    }

    constexpr bool operator==(const Color& other) const
    {
        return Red == other.Red && Green == other.Green && Blue == other.Blue && Alpha == other.Alpha;
    }

private:
    static constexpr int16_t ClampChannel(int16_t v) { return v < 0 ? 0 : (v > 255 ? 255 : v); }
    static constexpr int16_t Multiply(int16_t a, int16_t b)
    {
        double v = a * b / 255.0;
        v = v < -32768.0 ? -32768.0 : (v > 32767.0 ? 32767.0 : v);
        return static_cast<int16_t>(v);
    }
};
static_assert(sizeof(Color) == 8);

} // namespace ox::graphics
