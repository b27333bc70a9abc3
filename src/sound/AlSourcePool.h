#pragma once
// The pool of 32 sources that play streamed sounds. Each source has its own Ogg Vorbis
// stream and a ring of 4 buffers of 8192 bytes, which the pool's thread refills every
// 20 ms. The main thread starts, pauses and stops sources; a recursive lock per source
// keeps the two apart. Without the thread, Update is the feed step the caller runs.
#include "sound/OggVorbisStream.h"
#include "sound/SoundDevice.h"

#include <atomic>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace ox::sound {

class CAlSource {
public:
    static constexpr int BuffersCount = 4;
    static constexpr unsigned BufferSize = 8192;
    enum State : int { StatePlaying = 0, StatePaused = 1, StateStopped = 2 };

    // Makes the device's source and buffers and the stream, when the device is open.
    CAlSource(ISoundDevice& device, misc::CGamePack* pack);
    ~CAlSource();
    CAlSource(const CAlSource&) = delete;
    CAlSource& operator=(const CAlSource&) = delete;

    // Taken by the pool: the stream opens `file`. False (the source stays free) when it
    // cannot be played.
    bool Open(const char* file);
    // Given back to the pool: stopped, the stream closed.
    void Close();
    bool IsOpen() const;

    // Queues up to 4 buffers and plays; only from stopped. A stream without audio stays stopped.
    void Play();
    void Pause();
    void Resume();
    // Stops and takes every buffer back from the device's queue.
    void Stop();
    // Not looping and everything played: stopped.
    void CheckEnd();
    bool IsStopped() const { return m_State == StateStopped; }
    int GetState() const { return m_State; }
    void SetLooping(bool looping) { m_Looping = looping; }
    void SetGain(float gain);
    // Seconds played since Play, across loops.
    double GetPlayedTime();
    // Starts again at `seconds` (at the start when the stream cannot seek there).
    void SetPosition(double seconds);
    double GetLength();

    // The feed step: played buffers are refilled and queued again.
    void Update();

    // For tests: the ring's oldest queued buffer (-1 when none) and the device's names.
    int GetFirstBuffer() const { return m_FirstBuffer; }
    SoundName GetSourceName() const { return m_Source; }
    const SoundName* GetBuffers() const { return m_Buffers; }

private:
    unsigned FillBuffer(void* block, unsigned size);
    // Queues PCM into the ring's buffer at `index`.
    void QueueRingBuffer(int index, const void* block, unsigned size);
    // Takes `count` played buffers from the device, from the ring's oldest on, across its end.
    void UnqueueRing(unsigned count);

    ISoundDevice& m_Device;
    std::unique_ptr<COggVorbisStream> m_Stream;
    SoundName m_Buffers[BuffersCount] = {};
    SoundName m_Source = 0;
    int m_FirstBuffer = -1;
    std::atomic<int> m_State {StateStopped};
    std::atomic<bool> m_Looping {false};
    double m_PlayedTime = 0.0;
    mutable std::recursive_mutex m_Lock;
};

class CAlSourcePool {
public:
    static constexpr int SourcesCount = 32;
    static constexpr int FeedIntervalMs = 20;

    // Makes the sources on `device`, which must outlive the pool. With `runThread` and an
    // open device the feeding thread starts; otherwise the owner calls Update.
    CAlSourcePool(ISoundDevice& device, bool runThread, misc::CGamePack* pack = nullptr);
    ~CAlSourcePool();
    CAlSourcePool(const CAlSourcePool&) = delete;
    CAlSourcePool& operator=(const CAlSourcePool&) = delete;

    // The first free source, opened on `file`; null without a device, when all are taken
    // (the user is told) or when the file does not play.
    CAlSource* Acquire(const char* file);
    void Release(CAlSource* _source);
    unsigned GetRunningSourcesCount() const;
    // One feed pass over the open sources.
    void Update();
    bool HasThread() const { return m_Thread.joinable(); }
    CAlSource& GetSource(int index) { return *m_Sources[index]; }

private:
    void Run();

    ISoundDevice& m_Device;
    std::vector<std::unique_ptr<CAlSource>> m_Sources;
    std::thread m_Thread;
    std::atomic<bool> m_StopThread {false};
    std::mutex m_WakeLock;
    std::condition_variable m_Wake;
};

} // namespace ox::sound
