#include "core/FrameLimiter.h"

#include <chrono>

namespace ox::core {

void CFrameLimiter::SetFps(unsigned fps)
{
    {
        std::lock_guard lock(m_Mutex);
        m_Interval = fps ? 1000 / fps : 0;
    }
    if (m_Interval != 0) {
        if (!m_Thread.joinable())
            m_Thread = std::thread([this] { Loop(); });
        return;
    }
    m_Signal.notify_all();
    if (m_Thread.joinable())
        m_Thread.join();
    std::lock_guard lock(m_Mutex);
    m_Set = false;
}

void CFrameLimiter::Loop()
{
    std::unique_lock lock(m_Mutex);
    while (m_Interval != 0) {
        // Sleeps the interval; a change to 0 wakes it at once.
        unsigned interval = m_Interval;
        m_Signal.wait_for(lock, std::chrono::milliseconds(interval), [this] { return m_Interval == 0; });
        if (m_Interval == 0)
            break;
        m_Set = true;
        m_Signal.notify_all();
    }
}

void CFrameLimiter::Wait()
{
    std::unique_lock lock(m_Mutex);
    if (!m_Thread.joinable() || m_Interval == 0)
        return;
    m_Signal.wait(lock, [this] { return m_Set || m_Interval == 0; });
    m_Set = false; // auto-reset
}

} // namespace ox::core
