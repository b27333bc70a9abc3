#pragma once
// A walk over the pages and packets of an Ogg file that lies in memory. The bytes go to the
// sync layer a chunk at a time; packets come from one logical stream, whose serial number
// is either given or taken from the pages until it is fixed.
#include <ogg/ogg.h>

#include <cstdint>

namespace ox::sound {

class COggIterator {
public:
    static constexpr unsigned kChunkSize = 8192;

    explicit COggIterator(unsigned chunk = kChunkSize);
    ~COggIterator();
    COggIterator(const COggIterator&) = delete;
    COggIterator& operator=(const COggIterator&) = delete;

    // Starts a walk over `size` bytes at `_file` (not owned) from the first byte. A serial
    // of -1 makes the stream follow the serial numbers of the pages until FixSerial.
    // `name` (kept as a pointer) names the file in log lines.
    void Begin(const void* _file, unsigned size, int serial, const char* name = nullptr);
    void End();
    // Goes on from `position`; false when that lies behind the block.
    bool SeekToByte(unsigned position);
    // The next whole page of any stream; false at the end of the block.
    bool NextPage();
    // The next packet of the walk's stream; pages of other streams are skipped.
    bool NextPacket(ogg_packet* _packet);
    const ogg_page& GetCurrentPage() const { return m_Page; }
    int GetSerial() const { return static_cast<int>(m_Stream.serialno); }
    bool AtEnd() const { return m_AtEnd; }
    // The serial number stays as it is from now on.
    void FixSerial();
    // A page of the walk's stream with the end-of-stream flag went into the stream.
    bool SawEndOfStream() const { return m_SawEnd; }
    bool IsBegun() const { return m_File != nullptr; }
    // Each kind of trouble is logged once until this is called (not at every Begin: a
    // looping sound walks its file again and again).
    void ResetReports() { m_ReportedPagein = m_ReportedOtherStream = false; }

private:
    const uint8_t* m_File = nullptr;
    unsigned m_MapSize = 0;
    unsigned m_Position = 0;
    unsigned m_ChunkSize;
    bool m_AtEnd = false;
    bool m_AdoptSerial = false;
    bool m_SawEnd = false;
    bool m_ReportedPagein = false;
    bool m_ReportedOtherStream = false;
    const char* m_Name = nullptr;
    ogg_sync_state m_Sync {};
    ogg_stream_state m_Stream {};
    ogg_page m_Page {};
};

} // namespace ox::sound
