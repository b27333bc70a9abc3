#include "misc/theoraplayer/TheoraPlayer.h"
#include "misc/theoraplayer/TheoraYuv.h"

#include <algorithm>

namespace {
constexpr int kReadSize = 4096;
}

TheoraVideoClip::TheoraVideoClip(TheoraDataSource* source, int /*outputMode*/, unsigned precachedFrames,
                                 bool /*usePower2Stride*/)
    : m_Source(source), m_Name(source ? source->repr() : std::string()), m_Precached(std::max(1u, precachedFrames))
{
    ogg_sync_init(&m_Sync);
    th_info_init(&m_Info);
    th_comment_init(&m_Comment);
    vorbis_info_init(&m_VorbisInfo);
    vorbis_comment_init(&m_VorbisComment);
}

TheoraVideoClip::~TheoraVideoClip()
{
    if (m_Decoder)
        th_decode_free(m_Decoder);
    if (m_Setup)
        th_setup_free(m_Setup);
    if (m_HasTheora)
        ogg_stream_clear(&m_TheoraStream);
    if (m_VorbisReady) {
        vorbis_block_clear(&m_VorbisBlock);
        vorbis_dsp_clear(&m_VorbisDsp);
    }
    if (m_HasVorbis)
        ogg_stream_clear(&m_VorbisStream);
    vorbis_comment_clear(&m_VorbisComment);
    vorbis_info_clear(&m_VorbisInfo);
    th_comment_clear(&m_Comment);
    th_info_clear(&m_Info);
    ogg_sync_clear(&m_Sync);
}

bool TheoraVideoClip::readRaw()
{
    char* buffer = ogg_sync_buffer(&m_Sync, kReadSize);
    const int n = m_Source->read(buffer, kReadSize);
    ogg_sync_wrote(&m_Sync, n);
    return n > 0;
}

void TheoraVideoClip::routePage(ogg_page& page)
{
    if (m_HasTheora && ogg_page_serialno(&page) == m_TheoraStream.serialno) {
        ogg_stream_pagein(&m_TheoraStream, &page);
    } else if (m_VorbisReady && m_AudioInterface && ogg_page_serialno(&page) == m_VorbisStream.serialno) {
        std::lock_guard<std::mutex> lock(m_AudioMutex);
        ogg_stream_pagein(&m_VorbisStream, &page);
    }
}

// Pages already in the sync first (the headers' reads may have taken more), then 4096 bytes
// more; false at the end of the file.
bool TheoraVideoClip::readData()
{
    ogg_page page;
    bool routed = false;
    for (int pass = 0; pass < 2 && !routed; ++pass) {
        if (pass == 1 && !readRaw())
            return false;
        for (int got; (got = ogg_sync_pageout(&m_Sync, &page)) != 0;)
            if (got > 0) {
                routePage(page);
                routed = true;
            }
    }
    return true;
}

void TheoraVideoClip::readHeaders()
{
    if (!m_Source)
        throw _TheoraGenericException("invalid theora stream");
    ogg_page page;
    ogg_packet packet;
    int theoraHeaders = 0, vorbisHeaders = 0;
    // The beginning-of-stream pages: the first Theora and the first Vorbis stream are kept.
    for (bool data = false; !data;) {
        if (ogg_sync_pageout(&m_Sync, &page) <= 0) {
            if (!readRaw())
                break;
            continue;
        }
        if (!ogg_page_bos(&page)) {
            if (m_HasTheora)
                ogg_stream_pagein(&m_TheoraStream, &page);
            if (m_HasVorbis)
                ogg_stream_pagein(&m_VorbisStream, &page);
            data = true;
            continue;
        }
        ogg_stream_state test;
        ogg_stream_init(&test, ogg_page_serialno(&page));
        ogg_stream_pagein(&test, &page);
        const bool got = ogg_stream_packetout(&test, &packet) == 1;
        if (got && !m_HasTheora && th_decode_headerin(&m_Info, &m_Comment, &m_Setup, &packet) > 0) {
            m_TheoraStream = test;
            m_HasTheora = true;
            theoraHeaders = 1;
        } else if (got && !m_HasVorbis && vorbis_synthesis_headerin(&m_VorbisInfo, &m_VorbisComment, &packet) == 0) {
            m_VorbisStream = test;
            m_HasVorbis = true;
            vorbisHeaders = 1;
        } else {
            ogg_stream_clear(&test);
        }
    }
    if (!m_HasTheora)
        throw _TheoraGenericException("invalid theora stream");
    while (theoraHeaders < 3 || (m_HasVorbis && vorbisHeaders < 3)) {
        int got;
        while (theoraHeaders < 3 && (got = ogg_stream_packetout(&m_TheoraStream, &packet)) != 0) {
            if (got < 0 || th_decode_headerin(&m_Info, &m_Comment, &m_Setup, &packet) <= 0)
                throw _TheoraGenericException("Error parsing Theora stream headers.");
            ++theoraHeaders;
        }
        while (m_HasVorbis && vorbisHeaders < 3 && (got = ogg_stream_packetout(&m_VorbisStream, &packet)) != 0) {
            if (got < 0 || vorbis_synthesis_headerin(&m_VorbisInfo, &m_VorbisComment, &packet) != 0)
                throw _TheoraGenericException("Error parsing vorbis stream headers");
            ++vorbisHeaders;
        }
        if (theoraHeaders == 3 && (!m_HasVorbis || vorbisHeaders == 3))
            break;
        if (ogg_sync_pageout(&m_Sync, &page) > 0) {
            if (ogg_page_serialno(&page) == m_TheoraStream.serialno)
                ogg_stream_pagein(&m_TheoraStream, &page);
            else if (m_HasVorbis && ogg_page_serialno(&page) == m_VorbisStream.serialno)
                ogg_stream_pagein(&m_VorbisStream, &page);
        } else if (!readRaw()) {
            throw _TheoraGenericException("End of file found prematurely");
        }
    }
}

void TheoraVideoClip::load(TheoraAudioInterfaceFactory* audioFactory)
{
    readHeaders();
    if (m_Info.pixel_fmt != TH_PF_420 || m_Info.pic_width == 0 || m_Info.pic_height == 0 ||
        m_Info.fps_numerator == 0 || m_Info.fps_denominator == 0)
        throw _TheoraGenericException("Error parsing Theora stream headers.");
    if (m_Info.frame_width > kTheoraMaxSide || m_Info.frame_height > kTheoraMaxSide)
        throw _TheoraGenericException("picture over the texture limit");
    m_Decoder = th_decode_alloc(&m_Info, m_Setup);
    if (!m_Decoder)
        throw _TheoraGenericException("Error parsing Theora stream headers.");
    m_Width = m_Stride = m_Info.pic_width;
    m_Height = m_Info.pic_height;
    m_FPS = static_cast<float>(m_Info.fps_numerator) / static_cast<float>(m_Info.fps_denominator);
    m_FrameQueue = std::make_unique<TheoraFrameQueue>(m_Precached, m_Width, m_Height);
    if (m_HasVorbis) {
        vorbis_synthesis_init(&m_VorbisDsp, &m_VorbisInfo);
        vorbis_block_init(&m_VorbisDsp, &m_VorbisBlock);
        m_VorbisReady = true;
        if (audioFactory)
            m_AudioInterface.reset(audioFactory->createInstance(this, m_VorbisInfo.channels,
                                                                static_cast<int>(m_VorbisInfo.rate)));
    }
    findDuration();
}

// The last granule position of the Theora stream in growing tails of the file.
void TheoraVideoClip::findDuration()
{
    const uint64_t position = m_Source->tell(), size = m_Source->size();
    int64_t last = -1;
    std::vector<char> tail;
    for (uint64_t k = 1; k <= 10 && last < 0; ++k) {
        const uint64_t n = std::min<uint64_t>(size, k * kReadSize);
        tail.resize(n);
        m_Source->seek(size - n);
        tail.resize(static_cast<size_t>(m_Source->read(tail.data(), static_cast<int>(n))));
        ogg_sync_state sync;
        ogg_sync_init(&sync);
        std::copy(tail.begin(), tail.end(), ogg_sync_buffer(&sync, static_cast<long>(tail.size())));
        ogg_sync_wrote(&sync, static_cast<long>(tail.size()));
        ogg_page page;
        for (int got; (got = ogg_sync_pageout(&sync, &page)) != 0;)
            if (got > 0 && ogg_page_serialno(&page) == m_TheoraStream.serialno && ogg_page_granulepos(&page) > 0)
                last = std::max<int64_t>(last, th_granule_frame(m_Decoder, ogg_page_granulepos(&page)));
        ogg_sync_clear(&sync);
        if (n == size)
            break;
    }
    m_Source->seek(position);
    TheoraVideoManager* manager = TheoraVideoManager::getSingletonPtr();
    if (last < 0) {
        if (manager)
            manager->logMessage(m_Name + ": unable to determine file duration!");
        return;
    }
    m_NumFrames = static_cast<int>(last + 1);
    m_Duration = static_cast<float>(m_NumFrames) / m_FPS;
    if (manager)
        manager->logMessage(m_Name + ": file duration is " + std::to_string(m_Duration) + " seconds");
}

void TheoraVideoClip::restartStream()
{
    th_decode_free(m_Decoder);
    m_Decoder = th_decode_alloc(&m_Info, m_Setup);
    ogg_sync_reset(&m_Sync);
    ogg_stream_reset(&m_TheoraStream);
    if (m_VorbisReady) {
        std::lock_guard<std::mutex> lock(m_AudioMutex);
        ogg_stream_reset(&m_VorbisStream);
        vorbis_synthesis_restart(&m_VorbisDsp);
    }
    m_Source->seek(0);
    m_FrameNumber = -1;
}

bool TheoraVideoClip::decodeNextFrame()
{
    if (!m_Decoder || (m_EndOfFile && !m_AutoRestart))
        return false;
    TheoraVideoFrame* frame = m_FrameQueue->requestEmptyFrame();
    if (!frame)
        return false;
    ogg_packet packet;
    for (;;) {
        const int got = ogg_stream_packetout(&m_TheoraStream, &packet);
        if (got == 0) {
            if (readData())
                continue;
            // The end of the file: an auto-restarting clip decodes its next pass ahead,
            // marked by the end flag until the main thread's clock wraps.
            if (m_AutoRestart && !m_EndOfFile) {
                restartStream();
                m_EndOfFile = true;
                continue;
            }
            m_EndOfFile = true;
            m_FrameQueue->release(frame);
            return false;
        }
        if (got < 0 || (packet.bytes > 0 && (packet.packet[0] & 0x80)))
            continue;  // a hole, or a header packet met again after a restart
        if (m_SeekState == -2) {
            if (!th_packet_iskeyframe(&packet)) {
                ++m_SkippedFrames;
                continue;
            }
            m_SeekState = -1;
            if (m_SkippedFrames && TheoraVideoManager::getSingletonPtr())
                TheoraVideoManager::getSingletonPtr()->logMessage(
                    "[seek]: skipped " + std::to_string(m_SkippedFrames) + " frames while searching for keyframe");
            m_SkippedFrames = 0;
        }
        ogg_int64_t granule = -1;
        const int result = th_decode_packetin(m_Decoder, &packet, &granule);
        if (result != 0 && result != TH_DUPFRAME)
            continue;  // a bad packet: the frame is not taken
        m_FrameNumber = granule >= 0 ? th_granule_frame(m_Decoder, granule) : m_FrameNumber + 1;
        const float time = static_cast<float>(m_FrameNumber) / m_FPS;
        if (!m_EndOfFile && time + 1.0f / m_FPS > m_Duration)
            m_Duration = time + 1.0f / m_FPS;
        if (time >= m_Timer->getTime() || m_EndOfFile) {
            frame->mTimeToDisplay = time;
            frame->mIteration = m_Iteration;
            frame->mFrameNumber = m_FrameNumber;
            th_ycbcr_buffer planes;
            th_decode_ycbcr_out(m_Decoder, planes);
            TheoraPicture picture{m_Info.pic_x, m_Info.pic_y, m_Width, m_Height};
            TheoraYuvToRgb(planes, picture, frame->getBuffer(), m_Stride, kAlphaOpaque);
            m_FrameQueue->setReady(frame);
            return true;
        }
        ++m_NumDroppedFrames;
    }
}

void TheoraVideoClip::seek(float time)
{
    m_SeekFrame = std::max(0, static_cast<int>(time * m_FPS));
}

// From the start, with the clock at the target: frames before it are decoded and dropped.
void TheoraVideoClip::doSeek()
{
    const int target = m_SeekFrame.exchange(-1);
    if (target < 0)
        return;
    restartStream();
    m_FrameQueue->clear();
    m_EndOfFile = false;
    m_Timer->seek(static_cast<float>(target) / m_FPS);
}

TheoraVideoFrame* TheoraVideoClip::getNextFrame()
{
    const float time = m_Timer->getTime();
    for (;;) {
        TheoraVideoFrame* frame = m_FrameQueue->getFirstAvailableFrame();
        if (!frame || time < frame->mTimeToDisplay)
            return nullptr;
        if (time - 0.1f <= frame->mTimeToDisplay) {
            m_Iteration = frame->mIteration;
            return frame;
        }
        if (m_EndOfFile && frame->mTimeToDisplay < 2.0f)
            return nullptr;
        ++m_NumDroppedFrames;
        m_FrameQueue->pop();
    }
}

void TheoraVideoClip::popFrame() { m_FrameQueue->pop(); }

float TheoraVideoClip::getPriority()
{
    const float ready = static_cast<float>(m_FrameQueue->getReadyCount());
    return m_Timer->isPaused() ? ready + m_FrameQueue->getSize() / 2.0f : ready;
}

void TheoraVideoClip::update(float seconds)
{
    if (!m_Timer->isPaused())
        m_Timer->update(seconds);
    const float time = m_Timer->getTime();
    if (!(m_AutoRestart && m_EndOfFile && m_Duration > 0 && time >= m_Duration))
        return;
    m_Iteration = !m_Iteration;
    m_Timer->seek(time - m_Duration);
    m_EndOfFile = false;
    // Frames of the pass that ended and were never shown: the first takes the new pass's
    // time, the others go.
    std::lock_guard<std::mutex> lock(m_FrameQueue->getMutex());
    std::deque<TheoraVideoFrame*>& order = m_FrameQueue->order();
    int dropped = 0;
    bool first = true;
    for (auto it = order.begin(); it != order.end() && (*it)->mReady && (*it)->mTimeToDisplay > 0.5f; first = false) {
        if (first) {
            (*it)->mTimeToDisplay = time - m_Duration;
            (*it)->mIteration = m_Iteration;
            ++it;
            continue;
        }
        (*it)->mInUse = (*it)->mReady = false;
        it = order.erase(it);
        ++dropped;
    }
    if (dropped && TheoraVideoManager::getSingletonPtr())
        TheoraVideoManager::getSingletonPtr()->logMessage("dropped " + std::to_string(dropped) + " end frames");
}

void TheoraVideoClip::decodedAudioCheck()
{
    if (!m_VorbisReady || !m_AudioInterface)
        return;
    std::lock_guard<std::mutex> lock(m_AudioMutex);
    ogg_packet packet;
    float** pcm = nullptr;
    for (;;) {
        for (int n; (n = vorbis_synthesis_pcmout(&m_VorbisDsp, &pcm)) > 0;) {
            m_AudioInterface->insertData(pcm, n);
            vorbis_synthesis_read(&m_VorbisDsp, n);
        }
        if (ogg_stream_packetout(&m_VorbisStream, &packet) <= 0)
            break;
        if (vorbis_synthesis(&m_VorbisBlock, &packet) == 0)
            vorbis_synthesis_blockin(&m_VorbisDsp, &m_VorbisBlock);
    }
}
