#include "graphics/VideoTrack.h"

#include "diag/Log.h"
#include "misc/GamePack.h"

#include <algorithm>

namespace ox::graphics {

bool CVideoTrack::Open(const char* path, misc::CGamePack& pack)
{
    Close();
    unsigned size = 0;
    const void* data = pack.Open(path, &size);
    if (!data) {
        OX_LOG("video", diag::LogError, "%s: cannot read the video", path);
        return false;
    }
    m_Pack = &pack;
    return OpenMemory(data, size, path);
}

bool CVideoTrack::OpenMemory(const void* data, size_t size, const char* name)
{
    if (m_File && m_File != data)
        Close();
    m_File = static_cast<const uint8_t*>(data);
    m_Size = size;
    m_Name = name;
    if (size == 0) {
        OX_LOG("video", diag::LogError, "%s: empty video file", name);
        Close();
        return false;
    }
    // Large files read in chunks of 32 KiB, small ones in eighths of their power of two.
    size_t pow2 = 1;
    while (pow2 < size)
        pow2 <<= 1;
    m_Chunk = size >= 65536 ? 32768 : std::max<size_t>(1, pow2 / 8);
    if (!ReadHeaders()) {
        Close();
        return false;
    }
    FindDuration();
    return true;
}

void CVideoTrack::ClearStreams()
{
    if (m_Decoder)
        th_decode_free(m_Decoder);
    m_Decoder = nullptr;
    if (m_Setup)
        th_setup_free(m_Setup);
    m_Setup = nullptr;
    if (m_HasStream)
        ogg_stream_clear(&m_Stream);
    m_HasStream = false;
    if (m_HasSync) {
        ogg_sync_clear(&m_Sync);
        th_info_clear(&m_Info);
        th_comment_clear(&m_Comment);
    }
    m_HasSync = false;
    m_Frame = -1;
    m_Position = 0;
}

void CVideoTrack::Close()
{
    ClearStreams();
    if (m_Pack && m_File)
        m_Pack->Close(m_File);
    m_Pack = nullptr;
    m_File = nullptr;
    m_Size = 0;
    m_Duration = 0;
    m_Picture = {};
}

bool CVideoTrack::FeedChunk()
{
    if (m_Position >= m_Size)
        return false;
    const size_t n = std::min(m_Chunk, m_Size - m_Position);
    char* buffer = ogg_sync_buffer(&m_Sync, static_cast<long>(n));
    std::copy(m_File + m_Position, m_File + m_Position + n, buffer);
    ogg_sync_wrote(&m_Sync, static_cast<long>(n));
    m_Position += n;
    return true;
}

// Reads the beginning-of-stream pages; the first that parses as a Theora header fixes the
// stream, the others are dropped. Stops at the first page of data.
bool CVideoTrack::FindBosPages()
{
    ogg_page page;
    ogg_packet packet;
    for (;;) {
        if (ogg_sync_pageout(&m_Sync, &page) <= 0) {
            if (!FeedChunk())
                return m_HasStream;
            continue;
        }
        if (!ogg_page_bos(&page)) {
            if (m_HasStream)
                ogg_stream_pagein(&m_Stream, &page);
            return m_HasStream;
        }
        ogg_stream_state test;
        ogg_stream_init(&test, ogg_page_serialno(&page));
        ogg_stream_pagein(&test, &page);
        if (!m_HasStream && ogg_stream_packetout(&test, &packet) == 1 &&
            th_decode_headerin(&m_Info, &m_Comment, &m_Setup, &packet) > 0) {
            m_Stream = test;
            m_HasStream = true;
        } else {
            ogg_stream_clear(&test);
        }
    }
}

bool CVideoTrack::ReadHeaders()
{
    ogg_sync_init(&m_Sync);
    th_info_init(&m_Info);
    th_comment_init(&m_Comment);
    m_HasSync = true;
    if (!FindBosPages()) {
        OX_LOG("video", diag::LogError, "%s: no Theora stream", m_Name.c_str());
        return false;
    }
    ogg_packet packet;
    ogg_page page;
    for (int headers = 1; headers < 3;) {
        const int got = ogg_stream_packetout(&m_Stream, &packet);
        if (got > 0) {
            if (th_decode_headerin(&m_Info, &m_Comment, &m_Setup, &packet) <= 0) {
                OX_LOG("video", diag::LogError, "%s: bad Theora header", m_Name.c_str());
                return false;
            }
            ++headers;
        } else if (got < 0) {
            OX_LOG("video", diag::LogError, "%s: broken Theora header pages", m_Name.c_str());
            return false;
        } else if (ogg_sync_pageout(&m_Sync, &page) > 0) {
            ogg_stream_pagein(&m_Stream, &page);
        } else if (!FeedChunk()) {
            OX_LOG("video", diag::LogError, "%s: the file ends inside the Theora headers", m_Name.c_str());
            return false;
        }
    }
    if (m_Info.pixel_fmt != TH_PF_420 || m_Info.fps_numerator == 0 || m_Info.fps_denominator == 0 ||
        m_Info.pic_width == 0 || m_Info.pic_height == 0) {
        OX_LOG("video", diag::LogError, "%s: unsupported Theora stream (pixel format %d, %ux%u)", m_Name.c_str(),
               static_cast<int>(m_Info.pixel_fmt), m_Info.pic_width, m_Info.pic_height);
        return false;
    }
    if (m_Info.frame_width > kTheoraMaxSide || m_Info.frame_height > kTheoraMaxSide) {
        OX_LOG("video", diag::LogError, "%s: a picture of %ux%u is over the texture limit of %u", m_Name.c_str(),
               m_Info.frame_width, m_Info.frame_height, kTheoraMaxSide);
        return false;
    }
    m_Decoder = th_decode_alloc(&m_Info, m_Setup);
    if (!m_Decoder) {
        OX_LOG("video", diag::LogError, "%s: the Theora decoder refuses the stream", m_Name.c_str());
        return false;
    }
    m_Picture = {m_Info.pic_x, m_Info.pic_y, m_Info.pic_width, m_Info.pic_height};
    return true;
}

unsigned CVideoTrack::TimeOf(int64_t frame) const
{
    if (frame < 0 || m_Info.fps_numerator == 0)
        return 0;
    return static_cast<unsigned>(frame * 1000 * m_Info.fps_denominator / m_Info.fps_numerator);
}

// The last page of the stream with a granule position, from growing tails of the file.
void CVideoTrack::FindDuration()
{
    const int serial = m_Stream.serialno;
    int64_t last = -1;
    for (size_t k = 1; k <= 16 && last < 0; ++k) {
        const size_t tail = std::min(m_Size, k * 4096);
        ogg_sync_state sync;
        ogg_sync_init(&sync);
        char* buffer = ogg_sync_buffer(&sync, static_cast<long>(tail));
        std::copy(m_File + m_Size - tail, m_File + m_Size, buffer);
        ogg_sync_wrote(&sync, static_cast<long>(tail));
        ogg_page page;
        for (int got; (got = ogg_sync_pageout(&sync, &page)) != 0;)
            if (got > 0 && ogg_page_serialno(&page) == serial && ogg_page_granulepos(&page) > 0)
                last = std::max<int64_t>(last, th_granule_frame(m_Decoder, ogg_page_granulepos(&page)));
        ogg_sync_clear(&sync);
        if (tail == m_Size)
            break;
    }
    m_Duration = last >= 0 ? TimeOf(last + 1) : 0;
    if (last < 0)
        OX_LOG("video", diag::LogWarning, "%s: unable to determine the duration", m_Name.c_str());
}

CVideoTrack::Result CVideoTrack::DecodeNext()
{
    if (!m_Decoder)
        return kEnd;
    ogg_packet packet;
    ogg_page page;
    for (;;) {
        const int got = ogg_stream_packetout(&m_Stream, &packet);
        if (got > 0) {
            ogg_int64_t granule = -1;
            const int r = th_decode_packetin(m_Decoder, &packet, &granule);
            if (r != 0 && r != TH_DUPFRAME)
                return kBadPacket;
            m_Frame = granule >= 0 ? th_granule_frame(m_Decoder, granule) : m_Frame + 1;
            return kFrame;
        }
        if (got < 0)
            continue;  // a hole in the data: the next packet
        if (ogg_sync_pageout(&m_Sync, &page) > 0)
            ogg_stream_pagein(&m_Stream, &page);
        else if (!FeedChunk())
            return kEnd;
    }
}

bool CVideoTrack::Rewind()
{
    if (!m_File)
        return false;
    ClearStreams();
    if (ReadHeaders())
        return true;
    ClearStreams();
    return false;
}

bool CVideoTrack::Planes(th_ycbcr_buffer out)
{
    return m_Decoder && m_Frame >= 0 && th_decode_ycbcr_out(m_Decoder, out) == 0;
}

} // namespace ox::graphics
