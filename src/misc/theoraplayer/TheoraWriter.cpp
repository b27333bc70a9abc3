#include "misc/theoraplayer/TheoraWriter.h"

#include "diag/Log.h"

#include <ogg/ogg.h>
#include <theora/theoraenc.h>
#include <vorbis/vorbisenc.h>

#include <algorithm>
#include <cmath>
#include <memory>

namespace {

struct Page {
    std::vector<uint8_t> bytes;
    double time;
};

void Append(std::vector<uint8_t>& out, const ogg_page& page)
{
    out.insert(out.end(), page.header, page.header + page.header_len);
    out.insert(out.end(), page.body, page.body + page.body_len);
}

template <class Out>
void Flush(ogg_stream_state& stream, Out&& out)
{
    ogg_page page;
    while (ogg_stream_flush(&stream, &page) > 0)
        out(page);
}

// BT.601 studio range from 8-bit RGB.
uint8_t Luma(int r, int g, int b) { return static_cast<uint8_t>(16.5 + (65.481 * r + 128.553 * g + 24.966 * b) / 255); }
uint8_t Cb(int r, int g, int b) { return static_cast<uint8_t>(128.5 + (-37.797 * r - 74.203 * g + 112.0 * b) / 255); }
uint8_t Cr(int r, int g, int b) { return static_cast<uint8_t>(128.5 + (112.0 * r - 93.786 * g - 18.214 * b) / 255); }

// The Y'CbCr planes of one picture of the encoder's frame size.
struct Planes {
    unsigned w, h;  // frame size (16-aligned)
    std::vector<uint8_t> y, cb, cr;
    Planes(unsigned fw, unsigned fh) : w(fw), h(fh), y(fw * fh, 16), cb(fw * fh / 4, 128), cr(fw * fh / 4, 128) {}

    // Writes `pixels` (width x height) at row `top`; as grey from alpha when `alpha`.
    void Put(const std::vector<uint32_t>& pixels, unsigned width, unsigned height, unsigned top, bool alpha)
    {
        for (unsigned row = 0; row < height; ++row)
            for (unsigned x = 0; x < width; ++x) {
                const uint32_t p = pixels[row * width + x];
                const int r = alpha ? p >> 24 : (p >> 16) & 0xFF, g = alpha ? p >> 24 : (p >> 8) & 0xFF,
                          b = alpha ? p >> 24 : p & 0xFF;
                y[(top + row) * w + x] = Luma(r, g, b);
            }
        if (alpha)
            return;
        for (unsigned row = 0; row < height; row += 2)
            for (unsigned x = 0; x < width; x += 2) {
                int r = 0, g = 0, b = 0, n = 0;
                for (unsigned dy = 0; dy < 2 && row + dy < height; ++dy)
                    for (unsigned dx = 0; dx < 2 && x + dx < width; ++dx, ++n) {
                        const uint32_t p = pixels[(row + dy) * width + x + dx];
                        r += (p >> 16) & 0xFF, g += (p >> 8) & 0xFF, b += p & 0xFF;
                    }
                const size_t c = ((top + row) / 2) * (w / 2) + x / 2;
                cb[c] = Cb(r / n, g / n, b / n);
                cr[c] = Cr(r / n, g / n, b / n);
            }
    }
    void Fill(th_ycbcr_buffer buffer)
    {
        uint8_t* data[3] = {y.data(), cb.data(), cr.data()};
        for (int i = 0; i < 3; ++i) {
            buffer[i].width = static_cast<int>(i ? w / 2 : w);
            buffer[i].height = static_cast<int>(i ? h / 2 : h);
            buffer[i].stride = buffer[i].width;
            buffer[i].data = data[i];
        }
    }
};

struct TheoraEncoder {
    th_enc_ctx* ctx = nullptr;
    ogg_stream_state stream{};
    ~TheoraEncoder()
    {
        if (ctx)
            th_encode_free(ctx);
        ogg_stream_clear(&stream);
    }
};

struct VorbisEncoder {
    vorbis_info info{};
    vorbis_comment comment{};
    vorbis_dsp_state dsp{};
    vorbis_block block{};
    ogg_stream_state stream{};
    bool dspReady = false;
    VorbisEncoder() { vorbis_info_init(&info); vorbis_comment_init(&comment); }
    ~VorbisEncoder()
    {
        ogg_stream_clear(&stream);
        if (dspReady) {
            vorbis_block_clear(&block);
            vorbis_dsp_clear(&dsp);
        }
        vorbis_comment_clear(&comment);
        vorbis_info_clear(&info);
    }
};

// Vorbis data pages of the whole track, each with its end time.
void EncodeAudio(VorbisEncoder& v, const TheoraEncodeOptions& o, std::vector<Page>& pages)
{
    const auto takePages = [&](bool flush) {
        ogg_page page;
        while (flush ? ogg_stream_flush(&v.stream, &page) > 0 : ogg_stream_pageout(&v.stream, &page) > 0) {
            Page p;
            Append(p.bytes, page);
            p.time = vorbis_granule_time(&v.dsp, ogg_page_granulepos(&page));
            pages.push_back(std::move(p));
        }
    };
    const auto drain = [&] {
        ogg_packet packet;
        while (vorbis_analysis_blockout(&v.dsp, &v.block) == 1) {
            vorbis_analysis(&v.block, nullptr);
            vorbis_bitrate_addblock(&v.block);
            while (vorbis_bitrate_flushpacket(&v.dsp, &packet)) {
                ogg_stream_packetin(&v.stream, &packet);
                takePages(false);
            }
        }
    };
    const size_t step = 1024;
    for (size_t done = 0; done < o.pcmFrames; done += step) {
        const size_t n = std::min(step, o.pcmFrames - done);
        float** buffer = vorbis_analysis_buffer(&v.dsp, static_cast<int>(n));
        for (size_t i = 0; i < n; ++i)
            for (int c = 0; c < o.channels; ++c)
                buffer[c][i] = o.pcm[(done + i) * o.channels + c] / 32768.0f;
        vorbis_analysis_wrote(&v.dsp, static_cast<int>(n));
        drain();
    }
    vorbis_analysis_wrote(&v.dsp, 0);
    drain();
    takePages(true);
}

} // namespace

bool EncodeTheora(unsigned width, unsigned height, unsigned frames, const TheoraFrameSource& source,
                  std::vector<uint8_t>& out, const TheoraEncodeOptions& o)
{
    const unsigned pictureHeight = o.layout == TheoraEncodeOptions::Stacked ? height * 2 : height;
    if (width == 0 || height == 0 || width > 4096 || pictureHeight > 4096 || frames == 0 || o.fpsNumerator == 0 ||
        o.fpsDenominator == 0) {
        OX_LOG("video", ox::diag::LogError, "theora encoder: bad size %ux%u, frames %u or rate", width, height, frames);
        return false;
    }
    th_info info;
    th_info_init(&info);
    info.frame_width = (width + 15) & ~15u;
    info.frame_height = (pictureHeight + 15) & ~15u;
    info.pic_width = width;
    info.pic_height = pictureHeight;
    info.fps_numerator = o.fpsNumerator;
    info.fps_denominator = o.fpsDenominator;
    info.aspect_numerator = info.aspect_denominator = 1;
    info.colorspace = TH_CS_UNSPECIFIED;
    info.pixel_fmt = TH_PF_420;
    info.quality = std::clamp(o.quality, 0, 63);
    info.keyframe_granule_shift = 5;
    TheoraEncoder t;
    t.ctx = th_encode_alloc(&info);
    ogg_stream_init(&t.stream, o.serial);
    const unsigned frameW = info.frame_width, frameH = info.frame_height;
    th_info_clear(&info);
    if (!t.ctx) {
        OX_LOG("video", ox::diag::LogError, "theora encoder refuses %ux%u", width, pictureHeight);
        return false;
    }
    const bool audio = o.pcm && o.pcmFrames > 0;
    VorbisEncoder v;
    if (audio) {
        if (vorbis_encode_init_vbr(&v.info, o.channels, o.rate, o.audioQuality) != 0) {
            OX_LOG("video", ox::diag::LogError, "vorbis encoder refuses %d channel(s) at %d Hz", o.channels, o.rate);
            return false;
        }
        vorbis_analysis_init(&v.dsp, &v.info);
        vorbis_block_init(&v.dsp, &v.block);
        v.dspReady = true;
        ogg_stream_init(&v.stream, o.serial + 1);
    }

    // Headers: each stream's first packet alone on a page, Theora's first; then the rest.
    th_comment comment;
    th_comment_init(&comment);
    ogg_packet packet;
    const auto write = [&](const ogg_page& page) { Append(out, page); };
    for (bool first = true; th_encode_flushheader(t.ctx, &comment, &packet) > 0; first = false) {
        ogg_stream_packetin(&t.stream, &packet);
        if (first)
            Flush(t.stream, write);
    }
    th_comment_clear(&comment);
    if (audio) {
        ogg_packet id, com, code;
        vorbis_analysis_headerout(&v.dsp, &v.comment, &id, &com, &code);
        ogg_stream_packetin(&v.stream, &id);
        Flush(v.stream, write);
        ogg_stream_packetin(&v.stream, &com);
        ogg_stream_packetin(&v.stream, &code);
    }
    Flush(t.stream, write);
    if (audio)
        Flush(v.stream, write);

    // Data: the video's pages, then merged with the audio's by time.
    std::vector<Page> video, sound;
    const auto takeVideo = [&](bool flush) {
        ogg_page page;
        while (flush ? ogg_stream_flush(&t.stream, &page) > 0 : ogg_stream_pageout(&t.stream, &page) > 0) {
            Page p;
            Append(p.bytes, page);
            p.time = th_granule_time(t.ctx, ogg_page_granulepos(&page));
            video.push_back(std::move(p));
        }
    };
    std::vector<uint32_t> pixels(static_cast<size_t>(width) * height);
    Planes planes(frameW, frameH);
    th_ycbcr_buffer buffer;
    for (unsigned f = 0; f < frames; ++f) {
        std::fill(pixels.begin(), pixels.end(), 0u);
        source(f, pixels);
        planes.Put(pixels, width, height, 0, o.layout == TheoraEncodeOptions::Alpha);
        if (o.layout == TheoraEncodeOptions::Stacked)
            planes.Put(pixels, width, height, height, true);
        planes.Fill(buffer);
        if (th_encode_ycbcr_in(t.ctx, buffer) != 0) {
            OX_LOG("video", ox::diag::LogError, "theora encoder refused frame %u", f);
            return false;
        }
        while (th_encode_packetout(t.ctx, f + 1 == frames, &packet) > 0) {
            ogg_stream_packetin(&t.stream, &packet);
            takeVideo(false);
        }
    }
    takeVideo(true);
    if (audio)
        EncodeAudio(v, o, sound);
    std::vector<Page> all;
    std::merge(video.begin(), video.end(), sound.begin(), sound.end(), std::back_inserter(all),
               [](const Page& a, const Page& b) { return a.time < b.time; });
    for (const Page& p : all)
        out.insert(out.end(), p.bytes.begin(), p.bytes.end());
    return true;
}

uint8_t VideoLevel(unsigned index, unsigned count)
{
    return static_cast<uint8_t>(count < 2 ? 128 : 20 + index * 215 / (count - 1));
}

const char* VideoPatternNames() { return "levels, bars, disc"; }

bool MakeVideoFrame(const std::string& pattern, unsigned w, unsigned h, unsigned index, unsigned count,
                    std::vector<uint32_t>& pixels)
{
    pixels.assign(static_cast<size_t>(w) * h, 0);
    const double phase = count ? static_cast<double>(index) / count : 0.0;
    const double pi = 3.14159265358979;
    if (pattern == "levels") {
        const uint32_t g = VideoLevel(index, count);
        std::fill(pixels.begin(), pixels.end(), g << 24 | g << 16 | g << 8 | g);
        return true;
    }
    if (pattern == "bars") {
        const unsigned bar = static_cast<unsigned>(phase * (w + w / 8)) ;
        for (unsigned y = 0; y < h; ++y)
            for (unsigned x = 0; x < w; ++x) {
                const double u = static_cast<double>(x) / w + phase, v = static_cast<double>(y) / h;
                const auto c = [&](double shift) {
                    return static_cast<uint32_t>(60 + 60 * std::sin(2 * pi * (u + shift)) + 40 * v);
                };
                uint32_t p = 0xFF000000u | c(0.0) << 16 | c(1.0 / 3) << 8 | c(2.0 / 3);
                if (x + w / 8 >= bar && x < bar)
                    p = 0xFFF0F0F0u;
                pixels[static_cast<size_t>(y) * w + x] = p;
            }
        return true;
    }
    if (pattern == "disc") {
        const double cx = w / 2.0, cy = h / 2.0;
        const double radius = std::min(w, h) * (0.3 + 0.12 * std::sin(2 * pi * phase));
        const auto channel = [&](double shift) {
            return static_cast<uint32_t>(150 + 100 * std::sin(2 * pi * (phase + shift)));
        };
        const uint32_t colour = channel(0.0) << 16 | channel(1.0 / 3) << 8 | channel(2.0 / 3);
        for (unsigned y = 0; y < h; ++y)
            for (unsigned x = 0; x < w; ++x) {
                const double d = std::hypot(x + 0.5 - cx, y + 0.5 - cy);
                const double a = std::clamp((radius - d) / 4.0 + 0.5, 0.0, 1.0);
                pixels[static_cast<size_t>(y) * w + x] = static_cast<uint32_t>(a * 255 + 0.5) << 24 | colour;
            }
        return true;
    }
    return false;
}
