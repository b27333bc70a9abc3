#pragma once
// One Ogg Vorbis file decoded block by block to 16-bit interleaved PCM, over the low-level
// libogg and libvorbis calls, straight from the bytes in memory: the game pack's file, or
// a block the caller holds. Mono and stereo only. It has no lock: its user guards it.
#include "sound/OggIterator.h"

#include <vorbis/codec.h>

#include <string>

namespace ox::misc {
class CGamePack;
}

namespace ox::sound {

class COggVorbisStream {
public:
    // Reads files through `pack`, or through the process-wide game pack when it is null.
    explicit COggVorbisStream(unsigned readChunk = COggIterator::kChunkSize, misc::CGamePack* pack = nullptr);
    ~COggVorbisStream();
    COggVorbisStream(const COggVorbisStream&) = delete;
    COggVorbisStream& operator=(const COggVorbisStream&) = delete;

    // Opens a file of the pack and reads its headers. A missing file, a file without a
    // Vorbis stream and one of more than two channels are logged and leave it closed.
    bool Open(const char* file);
    // The same over a block the caller keeps alive until Close; `name` is for log lines.
    bool OpenMemory(const void* data, unsigned size, const char* name);
    void Close();
    bool IsOpen() const { return m_File != nullptr; }

    // Back to the start of the audio.
    bool Rewind();
    // Decodes up to `max_size` bytes of whole sample frames into `data` (or discards them
    // when `data` is null) and returns the bytes moved; 0 once everything is read.
    unsigned Read(void* data, unsigned max_size);
    bool IsReadAllPcmData() const { return !IsOpen() || m_AllRead; }
    // Goes to a time: the page whose granule lies at or before it, then decodes up to it.
    // False below a millisecond (the caller rewinds) or when no page lies before it.
    bool Seek(double seconds);
    // The length in seconds, from the granule of the last page; the decoding place stays.
    double GetLength() const;

    int GetRate() const { return m_Rate; }
    bool IsStereo() const { return m_Stereo; }
    int GetChannels() const { return m_Stereo ? 2 : 1; }
    const std::string& GetName() const { return m_Name; }

private:
    bool ReadHeaders();
    // Clears the decoder and ends the walk; the block stays.
    void ClearDecoder();
    void ReleaseBlock();
    misc::CGamePack& Pack() const;

    misc::CGamePack* m_Pack;
    const uint8_t* m_File = nullptr;
    unsigned m_Size = 0;
    bool m_FromPack = false;
    std::string m_Name;
    unsigned m_ReadChunk;
    COggIterator m_OggIter;
    bool m_AllRead = false;
    vorbis_info m_Info {};
    vorbis_comment m_Comment {};
    vorbis_dsp_state m_Dsp {};
    vorbis_block m_Block {};
    bool m_HeadersIn = false;   // info and comment hold headers
    bool m_DecoderReady = false; // dsp and block are made
    int m_Rate = 0;
    bool m_Stereo = false;
    // A failing packet is logged once an open.
    bool m_ReportedSynthesis = false;
    bool m_ReportedBlockin = false;
    bool m_ReportedNoEnd = false;
};

} // namespace ox::sound
