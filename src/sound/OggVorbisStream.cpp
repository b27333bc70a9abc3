#include "sound/OggVorbisStream.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "misc/GamePack.h"

#include <algorithm>
#include <cstdint>

namespace ox::sound {

namespace {

// A decoded sample to 16 bits: truncated, clamped (NaN reads as the lowest value).
inline int16_t ToSample(float x)
{
    const double s = x * 32768.0;
    if (s >= 32767.0)
        return 32767;
    if (!(s > -32768.0))
        return -32768;
    return static_cast<int16_t>(s);
}

} // namespace

COggVorbisStream::COggVorbisStream(unsigned readChunk, misc::CGamePack* pack)
    : m_Pack(pack), m_ReadChunk(readChunk), m_OggIter(readChunk)
{
}

COggVorbisStream::~COggVorbisStream() { Close(); }

misc::CGamePack& COggVorbisStream::Pack() const { return m_Pack ? *m_Pack : misc::g_GamePack::Instance(); }

bool COggVorbisStream::Open(const char* file)
{
    Close();
    if (!file || !*file)
        return false;
    unsigned size = 0;
    const void* block = Pack().Open(file, &size);
    if (!block) {
        OX_LOG("sound", diag::LogWarning, "sound file %s is missing or empty: silence instead", file);
        return false;
    }
    if (!OpenMemory(block, size, file)) {
        Pack().Close(block);
        return false;
    }
    m_FromPack = true;
    return true;
}

bool COggVorbisStream::OpenMemory(const void* data, unsigned size, const char* name)
{
    Close();
    if (!data || size == 0) {
        OX_LOG("sound", diag::LogWarning, "sound file %s does not play: it is empty", name ? name : "");
        return false;
    }
    m_File = static_cast<const uint8_t*>(data);
    m_Size = size;
    m_Name = name ? name : "";
    m_FromPack = false;
    m_OggIter.ResetReports();
    m_ReportedSynthesis = m_ReportedBlockin = m_ReportedNoEnd = false;
    if (ReadHeaders())
        return true;
    m_File = nullptr;
    m_Size = 0;
    return false;
}

bool COggVorbisStream::ReadHeaders()
{
    m_AllRead = false;
    vorbis_info_init(&m_Info);
    vorbis_comment_init(&m_Comment);
    m_HeadersIn = true;
    m_OggIter.Begin(m_File, m_Size, -1, m_Name.c_str());
    int headers = 0;
    const char* problem = "it holds no Vorbis stream";
    ogg_packet packet;
    while (m_OggIter.NextPacket(&packet)) {
        if (headers == 0 && !vorbis_synthesis_idheader(&packet))
            continue;
        if (headers == 0)
            m_OggIter.FixSerial();
        if (vorbis_synthesis_headerin(&m_Info, &m_Comment, &packet) != 0) {
            problem = "its Vorbis headers are damaged";
            break;
        }
        if (++headers < 3)
            continue;
        if (m_Info.channels != 1 && m_Info.channels != 2) {
            problem = "it has more than two channels";
            break;
        }
        if (m_Info.rate < 1 || vorbis_synthesis_init(&m_Dsp, &m_Info) != 0) {
            problem = "the decoder refuses its headers";
            break;
        }
        if (vorbis_block_init(&m_Dsp, &m_Block) != 0) {
            vorbis_dsp_clear(&m_Dsp);
            problem = "the decoder refuses its headers";
            break;
        }
        m_DecoderReady = true;
        m_Stereo = m_Info.channels == 2;
        m_Rate = static_cast<int>(m_Info.rate);
        return true;
    }
    if (headers > 0 && headers < 3 && m_OggIter.AtEnd())
        problem = "it ends inside its Vorbis headers";
    OX_LOG("sound", diag::LogWarning, "sound file %s does not play: %s", m_Name.c_str(), problem);
    ClearDecoder();
    return false;
}

void COggVorbisStream::ClearDecoder()
{
    if (m_DecoderReady) {
        vorbis_block_clear(&m_Block);
        vorbis_dsp_clear(&m_Dsp);
        m_DecoderReady = false;
    }
    if (m_HeadersIn) {
        vorbis_comment_clear(&m_Comment);
        vorbis_info_clear(&m_Info);
        m_HeadersIn = false;
    }
    m_OggIter.End();
    m_Rate = 0;
    m_Stereo = false;
    m_AllRead = false;
}

void COggVorbisStream::ReleaseBlock()
{
    if (m_FromPack && m_File)
        Pack().Close(m_File);
    m_File = nullptr;
    m_Size = 0;
    m_FromPack = false;
}

void COggVorbisStream::Close()
{
    if (!IsOpen())
        return;
    ClearDecoder();
    ReleaseBlock();
}

bool COggVorbisStream::Rewind()
{
    if (!IsOpen())
        return false;
    ClearDecoder();
    if (ReadHeaders())
        return true;
    ReleaseBlock();
    return false;
}

unsigned COggVorbisStream::Read(void* data, unsigned max_size)
{
    if (IsReadAllPcmData())
        return 0;
    const int channels = m_Info.channels;
    int remaining = static_cast<int>(max_size / 2);
    auto* const begin = static_cast<int16_t*>(data);
    size_t moved = 0; // samples of all channels
    for (;;) {
        float** pcm = nullptr;
        int avail = vorbis_synthesis_pcmout(&m_Dsp, &pcm);
        if (avail > 0) {
            if (avail * channels > remaining)
                avail = remaining / channels;
            if (begin) {
                int16_t* cur = begin + moved;
                OX_ASSERT_A(2 * (moved + static_cast<size_t>(avail) * channels) <= max_size);
                for (int c = 0; c < channels; ++c) {
                    const float* source = pcm[c];
                    for (int i = 0; i < avail; ++i)
                        cur[i * channels + c] = ToSample(source[i]);
                }
            }
            vorbis_synthesis_read(&m_Dsp, avail);
            moved += static_cast<size_t>(avail) * channels;
            remaining -= avail * channels;
            if (remaining < channels)
                break;
            continue;
        }
        ogg_packet packet;
        if (!m_OggIter.NextPacket(&packet))
            break;
        const int result = vorbis_synthesis(&m_Block, &packet);
        if (result == 0) {
            if (vorbis_synthesis_blockin(&m_Dsp, &m_Block) != 0 && !m_ReportedBlockin) {
                OX_LOG("sound", diag::LogWarning, "vorbis_synthesis_blockin failed in %s", m_Name.c_str());
                m_ReportedBlockin = true;
            }
        } else if (result != OV_ENOTAUDIO && !m_ReportedSynthesis) {
            OX_LOG("sound", diag::LogWarning, "vorbis_synthesis failed in %s: a damaged packet is skipped",
                   m_Name.c_str());
            m_ReportedSynthesis = true;
        }
    }
    if (m_OggIter.AtEnd() && vorbis_synthesis_pcmout(&m_Dsp, nullptr) == 0) {
        m_AllRead = true;
        if (!m_OggIter.SawEndOfStream() && !m_ReportedNoEnd)
            OX_LOG("sound", diag::LogInfo, "sound file %s ends without an end-of-stream page (cut short?)",
                   m_Name.c_str());
        m_ReportedNoEnd = true;
    }
    return static_cast<unsigned>(moved * 2) & ~1u;
}

bool COggVorbisStream::Seek(double seconds)
{
    // Beyond a few days no file reaches: that keeps the sample arithmetic in range.
    if (!IsOpen() || !(seconds >= 0.001 && seconds < 1e6))
        return false;
    const int64_t target = static_cast<int64_t>(m_Rate * seconds);
    int64_t lo = 0, hi = m_Size, found = -1, foundGranule = 0;
    while (lo < hi) {
        const int64_t mid = (lo + hi) / 2;
        OX_ASSERT_A(mid >= 0);
        const bool success = m_OggIter.SeekToByte(static_cast<unsigned>(mid));
        OX_ASSERT_A(success);
        if (!m_OggIter.NextPage()) {
            hi = mid;
            continue;
        }
        const int64_t granule = ogg_page_granulepos(&m_OggIter.GetCurrentPage());
        if (granule > target) {
            hi = mid;
            continue;
        }
        if (found == -1 || granule > foundGranule) {
            found = mid;
            foundGranule = granule;
        }
        lo = mid + 1;
    }
    if (found == -1) {
        OX_LOG("sound", diag::LogWarning, "sound file %s: no page lies before %.3f s", m_Name.c_str(), seconds);
        diag::message::Show("Error", "Audio seek to time failed.");
        return false;
    }
    m_AllRead = false;
    bool success = m_OggIter.SeekToByte(static_cast<unsigned>(found));
    OX_ASSERT_A(success);
    success = m_OggIter.NextPage();
    OX_ASSERT_A(success);
    OX_ASSERT_A(ogg_page_granulepos(&m_OggIter.GetCurrentPage()) == foundGranule);
    const int result = vorbis_synthesis_restart(&m_Dsp);
    OX_ASSERT_A(result == 0);
    // A damaged page may claim a position far below the start: it counts as the start.
    int64_t pcm_bytes_to_skip = (target - std::max<int64_t>(foundGranule, -1)) * 2 * m_Info.channels;
    OX_ASSERT_A(pcm_bytes_to_skip >= 0);
    while (pcm_bytes_to_skip > 0) {
        const unsigned read = Read(nullptr, static_cast<unsigned>(std::min<int64_t>(pcm_bytes_to_skip, 1 << 30)));
        if (read == 0)
            return false;
        pcm_bytes_to_skip -= read;
    }
    return true;
}

double COggVorbisStream::GetLength() const
{
    if (!IsOpen() || m_Rate <= 0)
        return 0.0;
    COggIterator walk(m_ReadChunk);
    walk.Begin(m_File, m_Size, m_OggIter.GetSerial(), m_Name.c_str());
    unsigned pos = m_Size > m_ReadChunk ? m_Size - m_ReadChunk : 0;
    walk.SeekToByte(pos);
    bool found = false;
    int64_t lastGranule = 0;
    for (;;) {
        if (walk.NextPage()) {
            // Read at once: the page points into the sync buffer, which moves as it fills.
            lastGranule = ogg_page_granulepos(&walk.GetCurrentPage());
            if (ogg_page_eos(&walk.GetCurrentPage()))
                return static_cast<double>(lastGranule) / m_Rate;
            found = true;
            continue;
        }
        if (found && walk.AtEnd())
            return static_cast<double>(lastGranule) / m_Rate;
        if (pos == 0)
            return 0.0;
        pos = pos > m_ReadChunk ? pos - m_ReadChunk : 0;
        OX_ASSERT_A(m_Size > pos);
        walk.SeekToByte(pos);
    }
}

} // namespace ox::sound
