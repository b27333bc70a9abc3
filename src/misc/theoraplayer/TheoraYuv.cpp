#include "misc/theoraplayer/TheoraYuv.h"

namespace {

struct Tables {
    int y[256], vr[256], ug[256], vg[256], ub[256];
    uint8_t clamp[1024];  // index + 320: 320 zeros, the ramp 0..255, 448 times 255
    uint8_t alpha[256];

    Tables()
    {
        const auto scale = [](double k) { return static_cast<int>(k * 8192 + 0.5); };
        for (int v = 0; v < 256; ++v) {
            y[v] = scale(1.164) * (v - 16);
            vr[v] = scale(1.596) * (v - 128);
            ug[v] = scale(0.391) * (v - 128);
            vg[v] = scale(0.813) * (v - 128);
            ub[v] = scale(2.018) * (v - 128);
            alpha[v] = static_cast<uint8_t>(v <= 16 ? 0 : v >= 235 ? 255 : (v - 16) * 255 / 219);
        }
        for (int i = 0; i < 1024; ++i)
            clamp[i] = static_cast<uint8_t>(i < 320 ? 0 : i < 576 ? i - 320 : 255);
    }
};

const Tables& T()
{
    static const Tables tables;
    return tables;
}

inline uint32_t Pixel(const Tables& t, int luma, int r, int g, int b)
{
    const uint8_t* c = t.clamp + 320;
    return static_cast<uint32_t>(c[(luma + r) >> 13]) << 16 | static_cast<uint32_t>(c[(luma - g) >> 13]) << 8 |
           c[(luma + b) >> 13];
}

} // namespace

uint8_t TheoraStudioToFull(uint8_t luma) { return T().alpha[luma]; }

void TheoraYuvToRgb(const th_ycbcr_buffer planes, const TheoraPicture& picture, uint32_t* out, unsigned outStride,
                    TheoraAlphaMode mode)
{
    const Tables& t = T();
    const uint32_t alphaMask = mode == kAlphaKeep ? 0xFF000000u : 0;
    const uint32_t alphaSet = mode == kAlphaKeep ? 0 : 0xFF000000u;
    for (unsigned row = 0; row < picture.height; ++row) {
        const unsigned fy = picture.y + row;
        const uint8_t* ys = planes[0].data + static_cast<long>(fy) * planes[0].stride;
        const uint8_t* us = planes[1].data + static_cast<long>(fy >> 1) * planes[1].stride;
        const uint8_t* vs = planes[2].data + static_cast<long>(fy >> 1) * planes[2].stride;
        uint32_t* line = out + static_cast<size_t>(row) * outStride;
        unsigned x = 0;
        // Two pixels share a chroma sample when the picture starts on an even column.
        if ((picture.x & 1) == 0) {
            for (; x + 1 < picture.width; x += 2) {
                const unsigned fx = picture.x + x;
                const int u = us[fx >> 1], v = vs[fx >> 1];
                const int r = t.vr[v], g = t.ug[u] + t.vg[v], b = t.ub[u];
                line[x] = (line[x] & alphaMask) | alphaSet | Pixel(t, t.y[ys[fx]], r, g, b);
                line[x + 1] = (line[x + 1] & alphaMask) | alphaSet | Pixel(t, t.y[ys[fx + 1]], r, g, b);
            }
        }
        for (; x < picture.width; ++x) {
            const unsigned fx = picture.x + x;
            const int u = us[fx >> 1], v = vs[fx >> 1];
            line[x] = (line[x] & alphaMask) | alphaSet | Pixel(t, t.y[ys[fx]], t.vr[v], t.ug[u] + t.vg[v], t.ub[u]);
        }
    }
}

void TheoraLumaToAlpha(const th_ycbcr_buffer planes, const TheoraPicture& picture, uint32_t* out,
                       unsigned outStride)
{
    const Tables& t = T();
    for (unsigned row = 0; row < picture.height; ++row) {
        const uint8_t* ys = planes[0].data + static_cast<long>(picture.y + row) * planes[0].stride + picture.x;
        uint32_t* line = out + static_cast<size_t>(row) * outStride;
        for (unsigned x = 0; x < picture.width; ++x)
            line[x] = (line[x] & 0xFFFFFFu) | static_cast<uint32_t>(t.alpha[ys[x]]) << 24;
    }
}
