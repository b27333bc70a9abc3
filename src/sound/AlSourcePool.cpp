#include "sound/AlSourcePool.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"

#include <algorithm>
#include <chrono>

namespace ox::sound {

using Lock = std::lock_guard<std::recursive_mutex>;

// ---- CAlSource ----

CAlSource::CAlSource(ISoundDevice& device, misc::CGamePack* pack) : m_Device(device)
{
    if (!m_Device.IsOpen())
        return;
    m_Stream = std::make_unique<COggVorbisStream>(COggIterator::kChunkSize, pack);
    m_Source = m_Device.CreateSource();
    for (SoundName& buffer : m_Buffers)
        buffer = m_Device.CreateBuffer();
}

CAlSource::~CAlSource()
{
    if (!m_Stream)
        return;
    Close();
    m_Device.DeleteSource(m_Source);
    for (SoundName buffer : m_Buffers)
        m_Device.DeleteBuffer(buffer);
}

bool CAlSource::IsOpen() const
{
    Lock lock(m_Lock);
    return m_Stream && m_Stream->IsOpen();
}

bool CAlSource::Open(const char* file)
{
    Lock lock(m_Lock);
    if (!m_Stream)
        return false;
    m_Stream->Close();
    m_PlayedTime = 0.0;
    m_Looping = false;
    return m_Stream->Open(file);
}

void CAlSource::Close()
{
    Lock lock(m_Lock);
    Stop();
    if (m_Stream)
        m_Stream->Close();
    m_PlayedTime = 0.0;
}

void CAlSource::QueueRingBuffer(int index, const void* block, unsigned size)
{
    m_Device.BufferData(m_Buffers[index], m_Stream->IsStereo(), block, size, m_Stream->GetRate());
    m_Device.QueueBuffer(m_Source, m_Buffers[index]);
}

void CAlSource::Play()
{
    Lock lock(m_Lock);
    if (m_State != StateStopped || !IsOpen())
        return;
    OX_ASSERT_A(m_FirstBuffer == -1);
    char block[BufferSize];
    int queued = 0;
    for (; queued < BuffersCount; ++queued) {
        const unsigned size = FillBuffer(block, BufferSize);
        if (size == 0)
            break;
        QueueRingBuffer(queued, block, size);
    }
    if (queued == 0)
        return;
    m_FirstBuffer = 0;
    m_Device.Play(m_Source);
    m_State = StatePlaying;
}

void CAlSource::Pause()
{
    Lock lock(m_Lock);
    if (m_State != StatePlaying)
        return;
    m_Device.Pause(m_Source);
    m_State = StatePaused;
}

void CAlSource::Resume()
{
    Lock lock(m_Lock);
    if (m_State != StatePaused)
        return;
    m_Device.Play(m_Source);
    m_State = StatePlaying;
}

void CAlSource::UnqueueRing(unsigned count)
{
    count = std::min<unsigned>(count, BuffersCount);
    const unsigned first = static_cast<unsigned>(m_FirstBuffer);
    if (first + count > BuffersCount) {
        m_Device.UnqueueBuffers(m_Source, BuffersCount - first, &m_Buffers[first]);
        m_Device.UnqueueBuffers(m_Source, count - (BuffersCount - first), &m_Buffers[0]);
    } else {
        m_Device.UnqueueBuffers(m_Source, count, &m_Buffers[first]);
    }
}

void CAlSource::Stop()
{
    Lock lock(m_Lock);
    m_State = StateStopped;
    if (!m_Stream)
        return;
    m_Device.Stop(m_Source);
    const unsigned processed = m_Device.GetProcessed(m_Source);
    OX_ASSERT_A(!processed || m_FirstBuffer != -1);
    if (processed && m_FirstBuffer != -1)
        UnqueueRing(processed);
    const unsigned queued = m_Device.GetQueued(m_Source);
    OX_ASSERT_A(queued == 0);
    m_FirstBuffer = -1;
    m_PlayedTime = 0.0;
}

void CAlSource::CheckEnd()
{
    Lock lock(m_Lock);
    if (!m_Looping && m_Stream && m_Device.GetState(m_Source) == SourceState::Stopped &&
        m_Stream->IsReadAllPcmData())
        m_State = StateStopped;
}

void CAlSource::SetGain(float gain)
{
    if (m_Stream)
        m_Device.SetGain(m_Source, gain);
}

double CAlSource::GetPlayedTime()
{
    Lock lock(m_Lock);
    return m_Stream ? m_Device.GetSecOffset(m_Source) + m_PlayedTime : 0.0;
}

void CAlSource::SetPosition(double seconds)
{
    Lock lock(m_Lock);
    if (!IsOpen())
        return;
    Stop();
    if (m_Stream->Seek(seconds)) {
        m_PlayedTime = seconds;
    } else {
        m_PlayedTime = 0.0;
        m_Stream->Rewind();
    }
    Play();
}

double CAlSource::GetLength()
{
    Lock lock(m_Lock);
    return m_Stream ? m_Stream->GetLength() : 0.0;
}

unsigned CAlSource::FillBuffer(void* block, unsigned size)
{
    if (!IsOpen())
        return 0;
    if (!m_Looping && m_Stream->IsReadAllPcmData())
        return 0;
    const unsigned data_size = m_Stream->Read(block, size);
    OX_ASSERT_A(data_size || m_Stream->IsReadAllPcmData());
    if (data_size)
        return data_size;
    // A loop goes on from the start without a gap in the queue.
    if (m_Looping && m_Stream->Rewind())
        return m_Stream->Read(block, size);
    return 0;
}

void CAlSource::Update()
{
    Lock lock(m_Lock);
    if (m_FirstBuffer == -1 || !IsOpen())
        return;
    const unsigned processed = m_Device.GetProcessed(m_Source);
    if (processed == 0)
        return;
    const double bytesPerSecond = 2.0 * m_Stream->GetChannels() * m_Stream->GetRate();
    char block[BufferSize];
    bool requeued = false;
    for (unsigned p = 0; p < processed && p < BuffersCount; ++p) {
        const unsigned buf_size = m_Device.GetBufferSize(m_Buffers[m_FirstBuffer]);
        OX_ASSERT_A(!m_Stream->IsStereo() || (buf_size % 2 == 0));
        m_PlayedTime += buf_size / bytesPerSecond;
        m_Device.UnqueueBuffers(m_Source, 1, &m_Buffers[m_FirstBuffer]);
        const int index = m_FirstBuffer;
        m_FirstBuffer = (m_FirstBuffer + 1) % BuffersCount;
        const unsigned size = FillBuffer(block, BufferSize);
        if (size) {
            QueueRingBuffer(index, block, size);
            requeued = true;
        } else if (m_Looping) {
            // A looping stream that gives nothing even from its start.
            m_State = StateStopped;
            return;
        }
    }
    // The queue ran dry before the refill (a late pass): it starts again.
    if (requeued && m_State == StatePlaying && m_Device.GetState(m_Source) == SourceState::Stopped)
        m_Device.Play(m_Source);
    const unsigned queued = m_Device.GetQueued(m_Source);
    OX_ASSERT_A(m_Stream->IsReadAllPcmData() || queued == BuffersCount);
}

// ---- CAlSourcePool ----

CAlSourcePool::CAlSourcePool(ISoundDevice& device, bool runThread, misc::CGamePack* pack) : m_Device(device)
{
    m_Sources.reserve(SourcesCount);
    for (int i = 0; i < SourcesCount; ++i)
        m_Sources.push_back(std::make_unique<CAlSource>(device, pack));
    if (runThread && m_Device.IsOpen())
        m_Thread = std::thread([this] { Run(); });
}

CAlSourcePool::~CAlSourcePool()
{
    // The thread ends before any source goes.
    if (m_Thread.joinable()) {
        {
            std::lock_guard<std::mutex> lock(m_WakeLock);
            m_StopThread = true;
        }
        m_Wake.notify_all();
        m_Thread.join();
    }
    m_Sources.clear();
}

void CAlSourcePool::Run()
{
    std::unique_lock<std::mutex> lock(m_WakeLock);
    while (!m_StopThread) {
        lock.unlock();
        Update();
        lock.lock();
        m_Wake.wait_for(lock, std::chrono::milliseconds(FeedIntervalMs), [this] { return m_StopThread.load(); });
    }
}

void CAlSourcePool::Update()
{
    for (const auto& source : m_Sources)
        source->Update();
}

CAlSource* CAlSourcePool::Acquire(const char* file)
{
    if (!m_Device.IsOpen())
        return nullptr;
    auto free = std::find_if(m_Sources.begin(), m_Sources.end(), [](const auto& s) { return !s->IsOpen(); });
    if (free == m_Sources.end()) {
        OX_LOG("sound", diag::LogWarning, "all %i sources play: %s does not start", SourcesCount, file ? file : "");
        diag::message::ShowFormat(
            "Error", "Total number of concurrently playing sounds exceeded allowed maximum (%i).", SourcesCount);
        return nullptr;
    }
    CAlSource* source = free->get();
    const bool success = source->Open(file);
    OX_ASSERT_A(!success || source->IsOpen());
    OX_ASSERT_A(success || !source->IsOpen());
    return success ? source : nullptr;
}

void CAlSourcePool::Release(CAlSource* _source)
{
    OX_ASSERT(_source);
    if (!_source)
        return;
    OX_ASSERT_A(_source->IsOpen());
    const bool found = std::any_of(m_Sources.begin(), m_Sources.end(), [&](const auto& s) { return s.get() == _source; });
    OX_ASSERT(found);
    if (found)
        _source->Close();
}

unsigned CAlSourcePool::GetRunningSourcesCount() const
{
    return static_cast<unsigned>(
        std::count_if(m_Sources.begin(), m_Sources.end(), [](const auto& s) { return s->IsOpen(); }));
}

} // namespace ox::sound
