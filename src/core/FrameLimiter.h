#pragma once
// Paces the main loop: a thread sets an auto-reset event once per interval, and each frame
// waits for it. A frame that took longer than the interval finds the event already set.
#include <condition_variable>
#include <mutex>
#include <thread>

namespace ox::core {

class CFrameLimiter {
public:
    ~CFrameLimiter() { SetFps(0); }

    // Interval = 1000 / fps milliseconds; 0 stops the thread, and Wait no longer waits.
    void SetFps(unsigned fps);
    void Wait();
    bool HasThread() const { return m_Thread.joinable(); }
    unsigned GetInterval() const { return m_Interval; }

private:
    void Loop();

    std::mutex m_Mutex;
    std::condition_variable m_Signal;
    std::thread m_Thread;
    unsigned m_Interval = 0;
    bool m_Set = false;
};

} // namespace ox::core
