#pragma once
// libtheoraplayer: Ogg Theora clips decoded ahead by a worker thread into a queue of frames,
// the main thread taking the frame that is due. The manager (one per process in the game)
// owns the clips and the worker; its mutex guards the clip list, the assignment of clips to
// the worker and their destruction; a queue's mutex guards its frames; a clip's audio mutex
// guards its Vorbis state. Errors while loading are TheoraGenericException.
#include <ogg/ogg.h>
#include <theora/theoradec.h>
#include <vorbis/codec.h>

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <algorithm>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

class TheoraVideoClip;
class TheoraWorkerThread;

class _TheoraGenericException {
public:
    explicit _TheoraGenericException(std::string text) : m_Text(std::move(text)) {}
    virtual ~_TheoraGenericException() = default;
    const std::string& getErrorText() const { return m_Text; }
    virtual std::string getType() const { return "TheoraGenericException"; }

private:
    std::string m_Text;
};

class TheoraDataSource {
public:
    virtual ~TheoraDataSource() = default;
    // Copies up to `bytes` bytes from the read position; the number copied.
    virtual int read(void* buffer, int bytes) = 0;
    virtual std::string repr() = 0;
    virtual void seek(uint64_t position) = 0;
    virtual uint64_t size() = 0;
    virtual uint64_t tell() = 0;
};

// The file's bytes, copied.
class TheoraMemoryFileDataSource : public TheoraDataSource {
public:
    TheoraMemoryFileDataSource(const void* data, size_t size, std::string name);
    TheoraMemoryFileDataSource(std::vector<uint8_t> data, std::string name);
    int read(void* buffer, int bytes) override;
    std::string repr() override { return m_Name; }
    void seek(uint64_t position) override { m_Position = std::min<uint64_t>(position, m_Data.size()); }
    uint64_t size() override { return m_Data.size(); }
    uint64_t tell() override { return m_Position; }

private:
    std::vector<uint8_t> m_Data;
    uint64_t m_Position = 0;
    std::string m_Name;
};

// A file on disk, read whole when opened (empty when it cannot be read).
class TheoraFileDataSource : public TheoraMemoryFileDataSource {
public:
    explicit TheoraFileDataSource(const std::string& path);
};

// A clip's clock, seconds.
class TheoraTimer {
public:
    virtual ~TheoraTimer() = default;
    virtual float getTime() { return m_Time; }
    virtual void update(float seconds)
    {
        if (!m_Paused)
            m_Time += seconds;
    }
    virtual void pause() { m_Paused = true; }
    virtual void play() { m_Paused = false; }
    virtual bool isPaused() { return m_Paused; }
    virtual void stop() { m_Time = 0, m_Paused = true; }
    virtual void seek(float time) { m_Time = time; }

protected:
    // The worker reads the clock while the main thread moves it.
    std::atomic<float> m_Time{0};
    std::atomic<bool> m_Paused{false};
};

// Where a clip's decoded audio goes.
class TheoraAudioInterface {
public:
    TheoraAudioInterface(TheoraVideoClip* owner, int channels, int frequency)
        : m_Owner(owner), m_NumChannels(channels), m_Frequency(frequency) {}
    virtual ~TheoraAudioInterface() = default;
    // `samples` samples of each of the channels.
    virtual void insertData(float** data, int samples) = 0;

protected:
    TheoraVideoClip* m_Owner;
    int m_NumChannels, m_Frequency;
};

class TheoraAudioInterfaceFactory {
public:
    virtual ~TheoraAudioInterfaceFactory() = default;
    virtual TheoraAudioInterface* createInstance(TheoraVideoClip* owner, int channels, int frequency) = 0;
};

class TheoraVideoFrame {
public:
    TheoraVideoFrame(unsigned width, unsigned height) : m_Width(width), m_Height(height), m_Pixels(width * height) {}
    uint32_t* getBuffer() { return m_Pixels.data(); }
    unsigned getWidth() const { return m_Width; }
    unsigned getHeight() const { return m_Height; }

    float mTimeToDisplay = 0;
    int mIteration = 0;
    int64_t mFrameNumber = 0;
    bool mReady = false, mInUse = false;

private:
    unsigned m_Width, m_Height;
    std::vector<uint32_t> m_Pixels;
};

// A fixed ring of frames in decoding order. A frame in use and not ready belongs to the
// worker.
class TheoraFrameQueue {
public:
    TheoraFrameQueue(unsigned count, unsigned width, unsigned height);
    // The first free frame, now in use and not ready; null when all are in use.
    TheoraVideoFrame* requestEmptyFrame();
    // Gives back a frame the worker did not fill.
    void release(TheoraVideoFrame* frame);
    void setReady(TheoraVideoFrame* frame);
    // The oldest frame when it is ready.
    TheoraVideoFrame* getFirstAvailableFrame();
    void pop();
    void clear();
    unsigned getReadyCount();
    unsigned getSize() const { return static_cast<unsigned>(m_Frames.size()); }
    std::mutex& getMutex() { return m_Mutex; }
    std::deque<TheoraVideoFrame*>& order() { return m_Order; }

private:
    std::vector<std::unique_ptr<TheoraVideoFrame>> m_Frames;
    std::deque<TheoraVideoFrame*> m_Order;
    std::mutex m_Mutex;
};

class TheoraVideoClip {
public:
    // Takes the source. Output mode 2: 32-bit pixels, red in bits 16 to 23, alpha 255.
    TheoraVideoClip(TheoraDataSource* source, int outputMode, unsigned precachedFrames, bool usePower2Stride);
    ~TheoraVideoClip();
    TheoraVideoClip(const TheoraVideoClip&) = delete;
    TheoraVideoClip& operator=(const TheoraVideoClip&) = delete;

    // Parses the headers and finds the duration; throws _TheoraGenericException.
    void load(TheoraAudioInterfaceFactory* audioFactory);

    // Worker side: decodes the next frame into an empty frame of the queue.
    bool decodeNextFrame();
    void doSeek();

    // Main thread: the frame due now or null; pop it once shown.
    TheoraVideoFrame* getNextFrame();
    void popFrame();
    // Advances the clock, restarts at the end when asked to, and moves decoded audio out.
    void update(float seconds);
    void decodedAudioCheck();
    // Asks the worker to go to `time` (frame 0 restarts).
    void seek(float time);

    const std::string& getName() const { return m_Name; }
    unsigned getWidth() const { return m_Width; }
    unsigned getHeight() const { return m_Height; }
    unsigned getStride() const { return m_Stride; }
    float getDuration() const { return m_Duration; }
    float getFPS() const { return m_FPS; }
    int getNumFrames() const { return m_NumFrames; }
    int getNumDroppedFrames() const { return m_NumDroppedFrames; }
    int getIteration() const { return m_Iteration; }
    bool isDone() const { return m_EndOfFile && !m_AutoRestart; }
    void setAutoRestart(bool value) { m_AutoRestart = value; }
    bool getAutoRestart() const { return m_AutoRestart; }
    bool hasAudio() const { return m_HasVorbis; }
    TheoraTimer* getTimer() { return m_Timer; }
    // Null restores the clip's own timer.
    void setTimer(TheoraTimer* timer) { m_Timer = timer ? timer : &m_DefaultTimer; }
    TheoraFrameQueue& getFrameQueue() { return *m_FrameQueue; }
    // The smallest is served first: the ready frames, and half the queue more when paused.
    float getPriority();

    std::atomic<TheoraWorkerThread*> m_AssignedWorkerThread{nullptr};
    std::atomic<int> m_SeekFrame{-1};

private:
    bool readData();
    bool readRaw();
    void routePage(ogg_page& page);
    void readHeaders();
    void findDuration();
    // Back to the file's start with a fresh decoder; header packets met again are skipped.
    void restartStream();
    // -1: no seek; -2: looking for a keyframe after a seek.
    int m_SeekState = -1;
    int m_SkippedFrames = 0;

    std::unique_ptr<TheoraDataSource> m_Source;
    std::string m_Name;
    std::unique_ptr<TheoraFrameQueue> m_FrameQueue;
    unsigned m_Precached;
    TheoraTimer m_DefaultTimer;
    TheoraTimer* m_Timer = &m_DefaultTimer;
    std::unique_ptr<TheoraAudioInterface> m_AudioInterface;
    std::mutex m_AudioMutex;

    ogg_sync_state m_Sync{};
    ogg_stream_state m_TheoraStream{}, m_VorbisStream{};
    th_info m_Info{};
    th_comment m_Comment{};
    th_setup_info* m_Setup = nullptr;
    th_dec_ctx* m_Decoder = nullptr;
    vorbis_info m_VorbisInfo{};
    vorbis_comment m_VorbisComment{};
    vorbis_dsp_state m_VorbisDsp{};
    vorbis_block m_VorbisBlock{};
    bool m_HasTheora = false, m_HasVorbis = false, m_VorbisReady = false;

    unsigned m_Width = 0, m_Height = 0, m_Stride = 0;
    std::atomic<float> m_Duration{0};  // rises as the worker meets later frames
    float m_FPS = 0;
    int m_NumFrames = 0;
    std::atomic<int> m_NumDroppedFrames{0};
    std::atomic<int> m_Iteration{0};
    std::atomic<bool> m_EndOfFile{false};
    std::atomic<bool> m_AutoRestart{false};
    int64_t m_FrameNumber = -1;
};

class TheoraWorkerThread {
public:
    explicit TheoraWorkerThread(class TheoraVideoManager& manager);
    ~TheoraWorkerThread();
    TheoraVideoClip* getAssignedClip() const { return m_Clip; }

private:
    void run();
    class TheoraVideoManager& m_Manager;
    TheoraVideoClip* m_Clip = nullptr;
    std::thread m_Thread;
};

class TheoraVideoManager {
public:
    using LogFunction = std::function<void(const std::string&)>;
    static constexpr unsigned kDefaultPrecachedFrames = 16;

    explicit TheoraVideoManager(unsigned workerThreads = 1);
    // Stops and joins the workers, then destroys the clips left.
    ~TheoraVideoManager();
    TheoraVideoManager(const TheoraVideoManager&) = delete;
    TheoraVideoManager& operator=(const TheoraVideoManager&) = delete;

    // The process's manager, made by the first call.
    static TheoraVideoManager& getSingleton();
    static TheoraVideoManager* getSingletonPtr();

    // Takes the source; throws _TheoraGenericException when it holds no Theora stream.
    TheoraVideoClip* createVideoClip(TheoraDataSource* source, int outputMode = 2, unsigned precachedFrames = 0,
                                     bool usePower2Stride = false);
    // Waits for the worker holding the clip to let it go, then deletes it.
    void destroyVideoClip(TheoraVideoClip* clip);
    void update(float seconds);

    // Worker side: the clip to decode next, now held by `thread`; null when none is free.
    TheoraVideoClip* requestWork(TheoraWorkerThread* thread);
    bool isStopping() const { return m_Stopping; }
    // Sleeps up to `ms` milliseconds, less when the manager stops.
    void idle(unsigned ms);

    void setAudioInterfaceFactory(TheoraAudioInterfaceFactory* factory) { m_AudioFactory = factory; }
    TheoraAudioInterfaceFactory* getAudioInterfaceFactory() const { return m_AudioFactory; }
    void setLogFunction(LogFunction function) { m_Log = std::move(function); }
    void logMessage(const std::string& text);
    size_t getClipCount();
    unsigned getDefaultPrecachedFrames() const { return m_DefaultPrecached; }

private:
    std::vector<TheoraVideoClip*> m_Clips;
    std::vector<std::unique_ptr<TheoraWorkerThread>> m_Workers;
    std::recursive_mutex m_Mutex;
    std::mutex m_IdleMutex;
    std::condition_variable m_IdleWake;
    std::atomic<bool> m_Stopping{false};
    unsigned m_DefaultPrecached = kDefaultPrecachedFrames;
    TheoraAudioInterfaceFactory* m_AudioFactory = nullptr;
    LogFunction m_Log;
    std::mutex m_LogMutex;
};
