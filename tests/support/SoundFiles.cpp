#include "support/SoundFiles.h"

#include <ogg/ogg.h>

namespace oxtest {

std::vector<uint8_t> MakeToneOgg(int channels, int rate, size_t frames, double frequency, double amplitude,
                                 const ox::sound::VorbisEncodeOptions& options)
{
    std::vector<int16_t> pcm = ox::sound::SynthesiseTone(frequency, frames, channels, rate, amplitude);
    std::vector<uint8_t> out;
    ox::sound::EncodeVorbis(pcm.data(), frames, channels, rate, out, options);
    return out;
}

std::vector<std::vector<uint8_t>> OggPages(const std::vector<uint8_t>& file)
{
    std::vector<std::vector<uint8_t>> pages;
    size_t at = 0;
    while (at + 27 <= file.size()) {
        const size_t segments = file[at + 26];
        size_t size = 27 + segments;
        for (size_t s = 0; s < segments && at + 27 + s < file.size(); ++s)
            size += file[at + 27 + s];
        size = std::min(size, file.size() - at);
        pages.emplace_back(file.begin() + at, file.begin() + at + size);
        at += size;
    }
    return pages;
}

std::vector<uint8_t> MakeOggOfPackets(int serial, const std::vector<std::string>& packets)
{
    ogg_stream_state stream;
    ogg_stream_init(&stream, serial);
    std::vector<uint8_t> out;
    ogg_page page;
    for (size_t i = 0; i < packets.size(); ++i) {
        ogg_packet packet {};
        packet.packet = reinterpret_cast<unsigned char*>(const_cast<char*>(packets[i].data()));
        packet.bytes = static_cast<long>(packets[i].size());
        packet.b_o_s = i == 0;
        packet.e_o_s = i + 1 == packets.size();
        packet.granulepos = static_cast<ogg_int64_t>(i);
        packet.packetno = static_cast<ogg_int64_t>(i);
        ogg_stream_packetin(&stream, &packet);
        while (ogg_stream_flush(&stream, &page)) {
            out.insert(out.end(), page.header, page.header + page.header_len);
            out.insert(out.end(), page.body, page.body + page.body_len);
        }
    }
    ogg_stream_clear(&stream);
    return out;
}

std::vector<uint8_t> InterleavePages(const std::vector<uint8_t>& first, const std::vector<uint8_t>& second)
{
    auto a = OggPages(first), b = OggPages(second);
    std::vector<uint8_t> out;
    for (size_t i = 0; i < std::max(a.size(), b.size()); ++i) {
        if (i < a.size())
            out.insert(out.end(), a[i].begin(), a[i].end());
        if (i < b.size())
            out.insert(out.end(), b[i].begin(), b[i].end());
    }
    return out;
}

std::string AsString(const std::vector<uint8_t>& bytes) { return std::string(bytes.begin(), bytes.end()); }

} // namespace oxtest
