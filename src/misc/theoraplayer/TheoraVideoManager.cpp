#include "misc/theoraplayer/TheoraPlayer.h"

#include <algorithm>
#include <chrono>
#include <cstring>
#include <fstream>
#include <iterator>

// Data sources ----------------------------------------------------------------------------

TheoraMemoryFileDataSource::TheoraMemoryFileDataSource(const void* data, size_t size, std::string name)
    : m_Data(static_cast<const uint8_t*>(data), static_cast<const uint8_t*>(data) + size), m_Name(std::move(name))
{
}

int TheoraMemoryFileDataSource::read(void* buffer, int bytes)
{
    const uint64_t n = std::min<uint64_t>(bytes < 0 ? 0 : bytes, m_Data.size() - m_Position);
    memcpy(buffer, m_Data.data() + m_Position, n);
    m_Position += n;
    return static_cast<int>(n);
}

TheoraMemoryFileDataSource::TheoraMemoryFileDataSource(std::vector<uint8_t> data, std::string name)
    : m_Data(std::move(data)), m_Name(std::move(name))
{
}

namespace {

std::vector<uint8_t> ReadDisk(const std::string& path)
{
    std::ifstream file(path, std::ios::binary);
    return std::vector<uint8_t>(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
}

} // namespace

TheoraFileDataSource::TheoraFileDataSource(const std::string& path) : TheoraMemoryFileDataSource(ReadDisk(path), path)
{
}

// Frame queue -----------------------------------------------------------------------------

TheoraFrameQueue::TheoraFrameQueue(unsigned count, unsigned width, unsigned height)
{
    for (unsigned i = 0; i < count; ++i)
        m_Frames.push_back(std::make_unique<TheoraVideoFrame>(width, height));
}

TheoraVideoFrame* TheoraFrameQueue::requestEmptyFrame()
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    for (auto& frame : m_Frames)
        if (!frame->mInUse) {
            frame->mInUse = true;
            frame->mReady = false;
            m_Order.push_back(frame.get());
            return frame.get();
        }
    return nullptr;
}

void TheoraFrameQueue::release(TheoraVideoFrame* frame)
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    frame->mInUse = frame->mReady = false;
    m_Order.erase(std::remove(m_Order.begin(), m_Order.end(), frame), m_Order.end());
}

void TheoraFrameQueue::setReady(TheoraVideoFrame* frame)
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    frame->mReady = true;
}

TheoraVideoFrame* TheoraFrameQueue::getFirstAvailableFrame()
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    return !m_Order.empty() && m_Order.front()->mReady ? m_Order.front() : nullptr;
}

void TheoraFrameQueue::pop()
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    if (m_Order.empty() || !m_Order.front()->mReady)
        return;
    m_Order.front()->mInUse = m_Order.front()->mReady = false;
    m_Order.pop_front();
}

void TheoraFrameQueue::clear()
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    for (auto& frame : m_Frames)
        frame->mInUse = frame->mReady = false;
    m_Order.clear();
}

unsigned TheoraFrameQueue::getReadyCount()
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    return static_cast<unsigned>(std::count_if(m_Order.begin(), m_Order.end(), [](auto* f) { return f->mReady; }));
}

// Worker ----------------------------------------------------------------------------------

TheoraWorkerThread::TheoraWorkerThread(TheoraVideoManager& manager) : m_Manager(manager), m_Thread([this] { run(); })
{
}

TheoraWorkerThread::~TheoraWorkerThread()
{
    if (m_Thread.joinable())
        m_Thread.join();
}

void TheoraWorkerThread::run()
{
    while (!m_Manager.isStopping()) {
        m_Clip = m_Manager.requestWork(this);
        if (!m_Clip) {
            m_Manager.idle(250);
            continue;
        }
        if (m_Clip->m_SeekFrame >= 0)
            m_Clip->doSeek();
        m_Clip->decodeNextFrame();
        TheoraVideoClip* clip = m_Clip;
        m_Clip = nullptr;
        clip->m_AssignedWorkerThread = nullptr;
        m_Manager.idle(1);
    }
}

// Manager ---------------------------------------------------------------------------------

namespace {
TheoraVideoManager* g_Singleton = nullptr;
}

TheoraVideoManager::TheoraVideoManager(unsigned workerThreads)
{
    for (unsigned i = 0; i < workerThreads; ++i)
        m_Workers.push_back(std::make_unique<TheoraWorkerThread>(*this));
}

TheoraVideoManager::~TheoraVideoManager()
{
    {
        std::lock_guard<std::mutex> lock(m_IdleMutex);
        m_Stopping = true;
    }
    m_IdleWake.notify_all();
    m_Workers.clear();
    for (TheoraVideoClip* clip : m_Clips)
        delete clip;
    if (g_Singleton == this)
        g_Singleton = nullptr;
}

TheoraVideoManager& TheoraVideoManager::getSingleton()
{
    static TheoraVideoManager manager(1);
    g_Singleton = &manager;
    return manager;
}

TheoraVideoManager* TheoraVideoManager::getSingletonPtr() { return g_Singleton; }

void TheoraVideoManager::idle(unsigned ms)
{
    std::unique_lock<std::mutex> lock(m_IdleMutex);
    m_IdleWake.wait_for(lock, std::chrono::milliseconds(ms), [this] { return m_Stopping.load(); });
}

void TheoraVideoManager::logMessage(const std::string& text)
{
    std::lock_guard<std::mutex> lock(m_LogMutex);
    if (m_Log)
        m_Log(text);
}

TheoraVideoClip* TheoraVideoManager::createVideoClip(TheoraDataSource* source, int outputMode,
                                                      unsigned precachedFrames, bool usePower2Stride)
{
    auto clip = std::make_unique<TheoraVideoClip>(source, outputMode,
                                                  precachedFrames ? precachedFrames : m_DefaultPrecached,
                                                  usePower2Stride);
    clip->load(m_AudioFactory);
    std::lock_guard<std::recursive_mutex> lock(m_Mutex);
    m_Clips.push_back(clip.get());
    return clip.release();
}

void TheoraVideoManager::destroyVideoClip(TheoraVideoClip* clip)
{
    if (!clip)
        return;
    std::unique_lock<std::recursive_mutex> lock(m_Mutex);
    // Taken off the list first, so that no worker picks it up again.
    m_Clips.erase(std::remove(m_Clips.begin(), m_Clips.end(), clip), m_Clips.end());
    while (clip->m_AssignedWorkerThread) {
        lock.unlock();
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
        lock.lock();
    }
    delete clip;
}

void TheoraVideoManager::update(float seconds)
{
    std::lock_guard<std::recursive_mutex> lock(m_Mutex);
    for (TheoraVideoClip* clip : m_Clips) {
        clip->update(seconds);
        clip->decodedAudioCheck();
    }
}

TheoraVideoClip* TheoraVideoManager::requestWork(TheoraWorkerThread* thread)
{
    std::lock_guard<std::recursive_mutex> lock(m_Mutex);
    TheoraVideoClip* best = nullptr;
    float priority = 100000.0f;
    for (TheoraVideoClip* clip : m_Clips) {
        if (clip->m_AssignedWorkerThread || clip->isDone())
            continue;
        const float p = clip->getPriority();
        if (p < priority) {
            priority = p;
            best = clip;
        }
    }
    if (best)
        best->m_AssignedWorkerThread = thread;
    return best;
}

size_t TheoraVideoManager::getClipCount()
{
    std::lock_guard<std::recursive_mutex> lock(m_Mutex);
    return m_Clips.size();
}
