#include "sound/OggIterator.h"

#include "diag/Assert.h"
#include "diag/Log.h"

#include <algorithm>
#include <cstring>

namespace ox::sound {

COggIterator::COggIterator(unsigned chunk) : m_ChunkSize(chunk) { m_Stream.serialno = -1; }

COggIterator::~COggIterator() { End(); }

void COggIterator::Begin(const void* _file, unsigned size, int serial, const char* name)
{
    OX_ASSERT(_file);
    End();
    if (!_file)
        return;
    m_File = static_cast<const uint8_t*>(_file);
    m_MapSize = size;
    m_Name = name;
    ogg_stream_init(&m_Stream, serial);
    ogg_sync_init(&m_Sync);
    m_Page = {};
    m_AdoptSerial = serial == -1;
    m_Position = 0;
    m_AtEnd = false;
    m_SawEnd = false;
}

void COggIterator::End()
{
    if (!m_File)
        return;
    ogg_stream_clear(&m_Stream);
    ogg_sync_clear(&m_Sync);
    m_Stream = {};
    m_Stream.serialno = -1;
    m_Sync = {};
    m_Page = {};
    m_File = nullptr;
    m_MapSize = 0;
}

bool COggIterator::SeekToByte(unsigned position)
{
    OX_ASSERT(m_File);
    if (!m_File || position > m_MapSize)
        return false;
    m_Position = position;
    ogg_sync_reset(&m_Sync);
    m_AtEnd = false;
    return true;
}

bool COggIterator::NextPage()
{
    OX_ASSERT(m_File);
    if (!m_File)
        return false;
    for (;;) {
        if (ogg_sync_pageout(&m_Sync, &m_Page) == 1)
            return true;
        if (m_Position >= m_MapSize) {
            m_AtEnd = true;
            return false;
        }
        const unsigned n = std::min(m_ChunkSize, m_MapSize - m_Position);
        char* buffer = ogg_sync_buffer(&m_Sync, n);
        if (!buffer) {
            m_AtEnd = true;
            return false;
        }
        memcpy(buffer, m_File + m_Position, n);
        ogg_sync_wrote(&m_Sync, n);
        m_Position += n;
    }
}

bool COggIterator::NextPacket(ogg_packet* _packet)
{
    OX_ASSERT(_packet && m_File);
    if (!_packet || !m_File)
        return false;
    for (;;) {
        int result;
        while ((result = ogg_stream_packetout(&m_Stream, _packet)) == -1) {
            // A hole in the data: the packet is lost, the next one follows.
        }
        if (result == 1)
            return true;
        for (;;) {
            if (!NextPage())
                return false;
            if (m_AdoptSerial)
                ogg_stream_reset_serialno(&m_Stream, ogg_page_serialno(&m_Page));
            if (ogg_page_serialno(&m_Page) != m_Stream.serialno) {
                if (!m_ReportedOtherStream)
                    OX_LOG("sound", diag::LogWarning,
                           "%s holds several logical streams: only stream %i plays, the pages of stream %i are skipped",
                           m_Name ? m_Name : "an Ogg file", static_cast<int>(m_Stream.serialno), ogg_page_serialno(&m_Page));
                m_ReportedOtherStream = true;
                continue;
            }
            if (ogg_stream_pagein(&m_Stream, &m_Page) != 0) {
                if (!m_ReportedPagein)
                    OX_LOG("sound", diag::LogWarning, "ogg_stream_pagein failed in %s", m_Name ? m_Name : "an Ogg file");
                m_ReportedPagein = true;
                continue;
            }
            if (ogg_page_eos(&m_Page))
                m_SawEnd = true;
            break;
        }
    }
}

void COggIterator::FixSerial()
{
    OX_ASSERT_A(m_Stream.serialno != -1);
    m_AdoptSerial = false;
}

} // namespace ox::sound
