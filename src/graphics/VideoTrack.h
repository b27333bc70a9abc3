#pragma once
// One Theora stream of an Ogg file held whole in memory, decoded on the caller's thread:
// the Ogg sync and stream state, the decoder, the read position and the last decoded
// picture. Frame times are start times: frame n starts at n frames, and the duration is
// the last frame's time plus one frame.
#include "misc/theoraplayer/TheoraYuv.h"

#include <ogg/ogg.h>
#include <theora/theoradec.h>

#include <cstdint>
#include <string>

namespace ox::misc {
class CGamePack;
}

namespace ox::graphics {

class CVideoTrack {
public:
    enum Result { kFrame, kBadPacket, kEnd };

    CVideoTrack() = default;
    ~CVideoTrack() { Close(); }
    CVideoTrack(const CVideoTrack&) = delete;
    CVideoTrack& operator=(const CVideoTrack&) = delete;

    // Reads the whole file through `pack` and the stream's headers; false, with a log line
    // naming the file, when it is missing, empty or holds no readable Theora stream.
    bool Open(const char* path, misc::CGamePack& pack);
    // The same on bytes the caller keeps alive while the track is open.
    bool OpenMemory(const void* data, size_t size, const char* name);
    void Close();
    bool IsOpen() const { return m_Decoder != nullptr; }

    // Decodes the next packet of the stream: a frame, a packet the decoder refused, or the
    // end of the file.
    Result DecodeNext();
    // Back before the first frame, as just opened.
    bool Rewind();

    // The last decoded frame's number (-1 before the first) and its start time.
    int64_t Frame() const { return m_Frame; }
    unsigned FrameTime() const { return TimeOf(m_Frame); }
    // The start time of frame `frame`, milliseconds.
    unsigned TimeOf(int64_t frame) const;
    unsigned Duration() const { return m_Duration; }
    unsigned Width() const { return m_Picture.width; }
    unsigned Height() const { return m_Picture.height; }
    const TheoraPicture& Picture() const { return m_Picture; }
    // The last decoded frame's planes; false before the first frame.
    bool Planes(th_ycbcr_buffer out);
    const std::string& Name() const { return m_Name; }

private:
    bool ReadHeaders();
    bool FindBosPages();
    bool FeedChunk();
    void FindDuration();
    void ClearStreams();

    misc::CGamePack* m_Pack = nullptr;
    const uint8_t* m_File = nullptr;
    size_t m_Size = 0, m_Position = 0, m_Chunk = 4096;
    std::string m_Name;

    ogg_sync_state m_Sync{};
    ogg_stream_state m_Stream{};
    bool m_HasStream = false, m_HasSync = false;
    th_info m_Info{};
    th_comment m_Comment{};
    th_setup_info* m_Setup = nullptr;
    th_dec_ctx* m_Decoder = nullptr;
    TheoraPicture m_Picture;
    int64_t m_Frame = -1;
    unsigned m_Duration = 0;
};

} // namespace ox::graphics
