// The OpenAL output, the null device, and the choice between them at start.
#include "sound/SoundDevice.h"

#include "diag/Log.h"
#include "diag/Message.h"

#include <AL/al.h>
#include <AL/alc.h>

#include <thread>

namespace ox::sound {

namespace {

class COpenAlDevice : public ISoundDevice {
public:
    ~COpenAlDevice() override { Close(); }

    bool Open() override
    {
        Close();
        m_OpenThread = std::this_thread::get_id();
        m_Device = alcOpenDevice(nullptr);
        if (!m_Device)
            return false;
        m_Context = alcCreateContext(m_Device, nullptr);
        const ALCenum error = alcGetError(m_Device);
        if (!m_Context || error != ALC_NO_ERROR) {
            diag::message::ShowFormat("OpenAL ALC error", "%s\nFile %s, line %i.", alcGetString(m_Device, error),
                                      __FILE__, __LINE__);
            Close();
            return false;
        }
        m_Previous = alcGetCurrentContext();
        alcMakeContextCurrent(m_Context);
        const ALfloat orientation[] = {0.0f, 0.0f, -1.0f, 0.0f, 1.0f, 0.0f};
        alListener3f(AL_POSITION, 0.0f, 0.0f, 0.0f);
        alListener3f(AL_VELOCITY, 0.0f, 0.0f, 0.0f);
        alListenerfv(AL_ORIENTATION, orientation);
        Check(__LINE__);
        OX_LOG("sound", diag::LogInfo, "OpenAL output: %s", alcGetString(m_Device, ALC_DEVICE_SPECIFIER));
        return true;
    }

    void Close() override
    {
        if (m_Context) {
            // A device opened while another one was open (tests do) hands the other's
            // context back.
            if (alcGetCurrentContext() == m_Context)
                alcMakeContextCurrent(m_Previous);
            alcDestroyContext(m_Context);
            m_Context = nullptr;
        }
        if (m_Device) {
            alcCloseDevice(m_Device);
            m_Device = nullptr;
        }
    }

    bool IsOpen() const override { return m_Context != nullptr; }
    const char* GetName() const override { return "OpenAL"; }

    SoundName CreateSource() override
    {
        ALuint source = 0;
        alGenSources(1, &source);
        Check(__LINE__);
        return source;
    }
    void DeleteSource(SoundName source) override
    {
        alDeleteSources(1, &source);
        Check(__LINE__);
    }
    SoundName CreateBuffer() override
    {
        ALuint buffer = 0;
        alGenBuffers(1, &buffer);
        Check(__LINE__);
        return buffer;
    }
    void DeleteBuffer(SoundName buffer) override
    {
        alDeleteBuffers(1, &buffer);
        Check(__LINE__);
    }
    void BufferData(SoundName buffer, bool stereo, const void* data, unsigned size, int rate) override
    {
        alBufferData(buffer, stereo ? AL_FORMAT_STEREO16 : AL_FORMAT_MONO16, data, static_cast<ALsizei>(size), rate);
        Check(__LINE__);
    }
    void QueueBuffer(SoundName source, SoundName buffer) override
    {
        alSourceQueueBuffers(source, 1, &buffer);
        Check(__LINE__);
    }
    void UnqueueBuffers(SoundName source, unsigned count, SoundName* buffers) override
    {
        alSourceUnqueueBuffers(source, static_cast<ALsizei>(count), buffers);
        Check(__LINE__);
    }
    void Play(SoundName source) override
    {
        alSourcePlay(source);
        Check(__LINE__);
    }
    void Pause(SoundName source) override
    {
        alSourcePause(source);
        Check(__LINE__);
    }
    void Stop(SoundName source) override
    {
        alSourceStop(source);
        Check(__LINE__);
    }
    void SetGain(SoundName source, float gain) override
    {
        alSourcef(source, AL_GAIN, gain);
        Check(__LINE__);
    }

    unsigned GetProcessed(SoundName source) override { return GetInt(source, AL_BUFFERS_PROCESSED); }
    unsigned GetQueued(SoundName source) override { return GetInt(source, AL_BUFFERS_QUEUED); }
    SourceState GetState(SoundName source) override
    {
        switch (static_cast<ALenum>(GetInt(source, AL_SOURCE_STATE))) {
        case AL_PLAYING:
            return SourceState::Playing;
        case AL_PAUSED:
            return SourceState::Paused;
        case AL_STOPPED:
            return SourceState::Stopped;
        default:
            return SourceState::Initial;
        }
    }
    double GetSecOffset(SoundName source) override
    {
        ALfloat offset = 0.0f;
        alGetSourcef(source, AL_SEC_OFFSET, &offset);
        return alGetError() == AL_NO_ERROR ? offset : 0.0;
    }
    unsigned GetBufferSize(SoundName buffer) override
    {
        ALint size = 0;
        alGetBufferi(buffer, AL_SIZE, &size);
        return size > 0 ? static_cast<unsigned>(size) : 0;
    }

private:
    static unsigned GetInt(SoundName source, ALenum what)
    {
        ALint value = 0;
        alGetSourcei(source, what, &value);
        return value > 0 ? static_cast<unsigned>(value) : 0;
    }
    // An error of the last calls: logged; on the thread that opened the output also shown.
    // The pool's thread never shows a box.
    void Check(int line) const
    {
        const ALenum error = alGetError();
        if (error == AL_NO_ERROR)
            return;
        const char* text = alGetString(error);
        if (std::this_thread::get_id() == m_OpenThread)
            diag::message::ShowFormat("OpenAL error", "%s\nFile %s, line %i.", text ? text : "?", __FILE__, line);
        else
            OX_LOG("sound", diag::LogError, "OpenAL error: %s (%s, line %i)", text ? text : "?", __FILE__, line);
    }

    ALCdevice* m_Device = nullptr;
    ALCcontext* m_Context = nullptr;
    ALCcontext* m_Previous = nullptr;
    std::thread::id m_OpenThread;
};

class CNullDevice : public ISoundDevice {
public:
    bool Open() override { return false; }
    void Close() override {}
    bool IsOpen() const override { return false; }
    const char* GetName() const override { return "none"; }
    SoundName CreateSource() override { return 0; }
    void DeleteSource(SoundName) override {}
    SoundName CreateBuffer() override { return 0; }
    void DeleteBuffer(SoundName) override {}
    void BufferData(SoundName, bool, const void*, unsigned, int) override {}
    void QueueBuffer(SoundName, SoundName) override {}
    void UnqueueBuffers(SoundName, unsigned, SoundName*) override {}
    void Play(SoundName) override {}
    void Pause(SoundName) override {}
    void Stop(SoundName) override {}
    void SetGain(SoundName, float) override {}
    unsigned GetProcessed(SoundName) override { return 0; }
    unsigned GetQueued(SoundName) override { return 0; }
    SourceState GetState(SoundName) override { return SourceState::Stopped; }
    double GetSecOffset(SoundName) override { return 0.0; }
    unsigned GetBufferSize(SoundName) override { return 0; }
};

} // namespace

std::unique_ptr<ISoundDevice> CreateOpenAlDevice() { return std::make_unique<COpenAlDevice>(); }

std::unique_ptr<ISoundDevice> CreateNullDevice() { return std::make_unique<CNullDevice>(); }

std::unique_ptr<ISoundDevice> OpenSoundDevice(std::unique_ptr<ISoundDevice> device, bool& available)
{
    available = device && device->Open();
    if (available)
        return device;
    OX_LOG("sound", diag::LogWarning, "no audio output (%s): the game runs silently",
           device ? device->GetName() : "no device");
    diag::message::Show("Warning", "Cannot initialize audio subsystem.");
    return CreateNullDevice();
}

} // namespace ox::sound
