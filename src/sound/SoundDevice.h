#pragma once
// The sound output as the source pool sees it: sources that play queues of 16-bit PCM
// buffers, with a gain, a state and counts of played buffers. OpenAL in the game, nothing
// at all without an output, a recorder in the tests.
#include <cstdint>
#include <memory>

namespace ox::sound {

// A source or buffer of the device; 0 is none.
using SoundName = uint32_t;

enum class SourceState { Initial, Playing, Paused, Stopped };

class ISoundDevice {
public:
    virtual ~ISoundDevice() = default;

    // Opens the output and a context with the listener at the origin, facing -z. False when
    // there is no output; the device then stays closed and nothing can play.
    virtual bool Open() = 0;
    virtual void Close() = 0;
    virtual bool IsOpen() const = 0;
    // For log lines.
    virtual const char* GetName() const = 0;

    virtual SoundName CreateSource() = 0;
    virtual void DeleteSource(SoundName source) = 0;
    virtual SoundName CreateBuffer() = 0;
    virtual void DeleteBuffer(SoundName buffer) = 0;
    // Fills a buffer that is not queued with 16-bit interleaved PCM.
    virtual void BufferData(SoundName buffer, bool stereo, const void* data, unsigned size, int rate) = 0;
    // Appends a buffer to a source's queue.
    virtual void QueueBuffer(SoundName source, SoundName buffer) = 0;
    // Takes `count` played buffers from the front of the queue; their names go to `buffers`.
    virtual void UnqueueBuffers(SoundName source, unsigned count, SoundName* buffers) = 0;
    // Plays: a paused source goes on, a stopped one starts its queue from the front.
    virtual void Play(SoundName source) = 0;
    virtual void Pause(SoundName source) = 0;
    // Stops; every queued buffer then counts as played.
    virtual void Stop(SoundName source) = 0;
    virtual void SetGain(SoundName source, float gain) = 0;

    // The frequent reads.
    virtual unsigned GetProcessed(SoundName source) = 0;
    virtual unsigned GetQueued(SoundName source) = 0;
    virtual SourceState GetState(SoundName source) = 0;
    // Seconds played from the front of the queue; 0 on an error.
    virtual double GetSecOffset(SoundName source) = 0;
    virtual unsigned GetBufferSize(SoundName buffer) = 0;
};

// The system's output through OpenAL Soft (its drivers chosen as OpenAL chooses them, for
// example by ALSOFT_DRIVERS).
std::unique_ptr<ISoundDevice> CreateOpenAlDevice();
// No output: it never opens and does nothing.
std::unique_ptr<ISoundDevice> CreateNullDevice();

// Opens `device`. When it has no output the user is told once, the null device takes its
// place and `available` is false: the game goes on silently.
std::unique_ptr<ISoundDevice> OpenSoundDevice(std::unique_ptr<ISoundDevice> device, bool& available);

} // namespace ox::sound
