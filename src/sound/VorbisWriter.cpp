#include "sound/VorbisWriter.h"

#include "diag/Log.h"

#include <vorbis/vorbisenc.h>

#include <algorithm>
#include <cmath>

namespace ox::sound {

namespace {

constexpr size_t kFramesPerWrite = 1024;

// Appends a page; with `keepEnd` false a last page loses its end-of-stream flag (its
// checksum is made again).
void AppendPage(ogg_page& page, bool keepEnd, std::vector<uint8_t>& out)
{
    if (!keepEnd && ogg_page_eos(&page)) {
        page.header[5] &= static_cast<unsigned char>(~0x04);
        ogg_page_checksum_set(&page);
    }
    out.insert(out.end(), page.header, page.header + page.header_len);
    out.insert(out.end(), page.body, page.body + page.body_len);
}

// The encoder's state for one file, cleared in the right order.
struct Encoder {
    vorbis_info info;
    vorbis_comment comment;
    vorbis_dsp_state dsp;
    vorbis_block block;
    ogg_stream_state stream;
    bool analysing = false;

    Encoder()
    {
        vorbis_info_init(&info);
        vorbis_comment_init(&comment);
    }
    ~Encoder()
    {
        if (analysing) {
            ogg_stream_clear(&stream);
            vorbis_block_clear(&block);
            vorbis_dsp_clear(&dsp);
        }
        vorbis_comment_clear(&comment);
        vorbis_info_clear(&info);
    }
    // Moves every finished packet into pages.
    void Drain(bool keepEnd, std::vector<uint8_t>& out)
    {
        ogg_packet packet;
        ogg_page page;
        while (vorbis_analysis_blockout(&dsp, &block) == 1) {
            vorbis_analysis(&block, nullptr);
            vorbis_bitrate_addblock(&block);
            while (vorbis_bitrate_flushpacket(&dsp, &packet)) {
                ogg_stream_packetin(&stream, &packet);
                while (ogg_stream_pageout(&stream, &page))
                    AppendPage(page, keepEnd, out);
            }
        }
    }
};

} // namespace

std::vector<int16_t> SynthesiseTone(double frequency, size_t frames, int channels, int rate, double amplitude,
                                    double fade)
{
    std::vector<int16_t> pcm(frames * static_cast<size_t>(std::max(channels, 0)));
    const double fadeFrames = fade * rate / 1000.0;
    for (size_t i = 0; i < frames; ++i) {
        double envelope = 1.0;
        if (fadeFrames >= 1.0)
            envelope = std::min({1.0, i / fadeFrames, (frames - 1 - i) / fadeFrames});
        const double value = amplitude * envelope * std::sin(2.0 * M_PI * frequency * i / rate);
        const auto sample = static_cast<int16_t>(std::lround(std::clamp(value, -1.0, 1.0) * 32767.0));
        for (int c = 0; c < channels; ++c)
            pcm[i * channels + c] = sample;
    }
    return pcm;
}

bool EncodeVorbis(const int16_t* pcm, size_t frames, int channels, int rate, std::vector<uint8_t>& out,
                  const VorbisEncodeOptions& options)
{
    Encoder e;
    if (channels < 1 || rate < 1 || vorbis_encode_init_vbr(&e.info, channels, rate, options.quality) != 0) {
        OX_LOG("sound", diag::LogError, "the Vorbis encoder refuses %i channels at %i Hz", channels, rate);
        return false;
    }
    vorbis_comment_add_tag(&e.comment, "ENCODER", "oxmedia");
    vorbis_analysis_init(&e.dsp, &e.info);
    vorbis_block_init(&e.dsp, &e.block);
    ogg_stream_init(&e.stream, options.serial);
    e.analysing = true;

    ogg_packet headers[3];
    vorbis_analysis_headerout(&e.dsp, &e.comment, &headers[0], &headers[1], &headers[2]);
    for (ogg_packet& header : headers)
        ogg_stream_packetin(&e.stream, &header);
    // The headers stand on pages of their own, as decoders expect.
    ogg_page page;
    while (ogg_stream_flush(&e.stream, &page))
        AppendPage(page, true, out);

    for (size_t done = 0; done < frames;) {
        const size_t count = std::min(kFramesPerWrite, frames - done);
        float** buffer = vorbis_analysis_buffer(&e.dsp, static_cast<int>(count));
        for (size_t i = 0; i < count; ++i)
            for (int c = 0; c < channels; ++c)
                buffer[c][i] = pcm[(done + i) * channels + c] / 32768.0f;
        vorbis_analysis_wrote(&e.dsp, static_cast<int>(count));
        done += count;
        e.Drain(options.endOfStream, out);
    }
    vorbis_analysis_wrote(&e.dsp, 0);
    e.Drain(options.endOfStream, out);
    while (ogg_stream_flush(&e.stream, &page))
        AppendPage(page, options.endOfStream, out);
    return true;
}

} // namespace ox::sound
