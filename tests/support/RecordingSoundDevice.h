#pragma once
// A sound device that plays nothing: it keeps sources, queues and buffers in memory and
// plays them only when the test moves its clock (Advance). Whole buffers played through
// count as processed, a queue that runs out stops its source, as OpenAL does. Misuse that
// OpenAL would refuse (unqueueing unplayed buffers, filling a queued one, a deleted name)
// is counted in `errors`. Every call takes a lock: the pool's thread may run beside it.
#include "sound/SoundDevice.h"

#include <deque>
#include <map>
#include <mutex>
#include <string>
#include <vector>

namespace oxtest {

class RecordingSoundDevice : public ox::sound::ISoundDevice {
public:
    using SoundName = ox::sound::SoundName;
    using SourceState = ox::sound::SourceState;

    struct Buffer {
        std::vector<int16_t> pcm;
        bool stereo = false;
        int rate = 0;
        double Seconds() const;
    };
    struct Source {
        std::deque<SoundName> queue;
        size_t processed = 0;     // played buffers at the queue's front
        double position = 0.0;    // seconds into the first unplayed buffer
        SourceState state = SourceState::Initial;
        float gain = 1.0f;
        double playedSeconds = 0.0;
        int plays = 0;            // Play calls
    };

    bool openResult = true;
    int errors = 0;

    bool Open() override;
    void Close() override;
    bool IsOpen() const override;
    const char* GetName() const override { return "recording"; }
    SoundName CreateSource() override;
    void DeleteSource(SoundName source) override;
    SoundName CreateBuffer() override;
    void DeleteBuffer(SoundName buffer) override;
    void BufferData(SoundName buffer, bool stereo, const void* data, unsigned size, int rate) override;
    void QueueBuffer(SoundName source, SoundName buffer) override;
    void UnqueueBuffers(SoundName source, unsigned count, SoundName* buffers) override;
    void Play(SoundName source) override;
    void Pause(SoundName source) override;
    void Stop(SoundName source) override;
    void SetGain(SoundName source, float gain) override;
    unsigned GetProcessed(SoundName source) override;
    unsigned GetQueued(SoundName source) override;
    SourceState GetState(SoundName source) override;
    double GetSecOffset(SoundName source) override;
    unsigned GetBufferSize(SoundName buffer) override;

    // Plays `ms` milliseconds on every playing source.
    void Advance(double ms);
    // Copies for inspection.
    Source GetSource(SoundName source);
    size_t LiveBuffers();
    size_t LiveSources();
    size_t PlayingSources();
    bool IsBuffer(SoundName buffer);

private:
    Source* Find(SoundName source);

    mutable std::mutex m_Lock;
    bool m_Open = false;
    SoundName m_Next = 1;
    std::map<SoundName, Source> m_Sources;
    std::map<SoundName, Buffer> m_Buffers;
};

} // namespace oxtest
