#pragma once
// Game time: one tree of timers under a root group. The root advances once per frame by the
// measured frame time, capped at 100 ms. Every timer and group has its own clock, nesting
// pause count and whole-number speed; a paused group stops everything below it.
//
// The test clock: with a fixed frame step every update advances the time by that step,
// whatever the real clock says, so a run of the same input gives the same frames. The
// environment variable OX_TEST_CLOCK (milliseconds a frame) turns it on for the process.
#include "misc/String.h"

#include <cstdint>
#include <functional>
#include <map>
#include <set>

namespace ox::core {

class CTimeManager;
class CGroupTimer;

// The raw clock: real time in milliseconds since it was made, from one monotonic source.
class CPlatformTimer {
public:
    using Source = std::function<double()>; // any monotonic millisecond reading

    CPlatformTimer();
    explicit CPlatformTimer(Source source);
    double Read() const { return m_Source() - m_Base; }

    static double MonotonicMilliseconds();

private:
    Source m_Source;
    double m_Base;
};

// What a timer and a group timer share: a clock, a nesting pause count, a whole-number
// speed and the owning group.
class CTimerClock {
public:
    void SetK(float _k);
    float GetK() const { return m_K; }
    unsigned GetTime() const { return m_Time; }
    void SetTime(unsigned time) { m_Time = time; }
    int GetFrameDelta() const { return m_FrameDelta; }
    void Pause(bool flag);
    bool IsPaused() const { return m_PauseCount != 0; }
    unsigned GetPauseCount() const { return m_PauseCount; }
    CGroupTimer* GetParent() const { return m_Parent; }

protected:
    CTimerClock(CTimeManager* manager, CGroupTimer* parent) : m_Manager(manager), m_Parent(parent) {}
    // Advances by step times the speed unless paused; the delta is kept in 16 bits.
    void Advance(int step);
    void CopyClock(const CTimerClock& other);

    CTimeManager* m_Manager;
    uint32_t m_Time = 0;
    int16_t m_FrameDelta = 0;
    uint8_t m_PauseCount = 0;
    int8_t m_K = 1;
    CGroupTimer* m_Parent;
};

class CTimer : public CTimerClock {
public:
    void Destroy();
    void SetParent(CGroupTimer* parent);
    CTimer* Clone(CGroupTimer* parent) const;

private:
    friend class CTimeManager;
    friend class CGroupTimer;
    CTimer(CTimeManager* manager, CGroupTimer* parent) : CTimerClock(manager, parent) {}
    ~CTimer() = default;
    void Update(int step) { Advance(step); }
};

class CGroupTimer : public CTimerClock {
public:
    const misc::StringA24& GetId() const { return m_Id; }
    CTimer* AttachTimer();
    CGroupTimer* AttachGroupTimer(const char* id);
    // A direct child group with this id (no recursion); null for an empty id.
    CGroupTimer* GetChildGroupTimer(const char* id) const;
    void Destroy();

    void SetParent(CGroupTimer* parent);
    CGroupTimer* Clone(CGroupTimer* parent) const;

    const std::set<CTimer*>& GetChildTimers() const { return m_ChildTimers; }
    const std::set<CGroupTimer*>& GetChildGroups() const { return m_ChildGroups; }

private:
    friend class CTimeManager;
    friend class CTimer;
    CGroupTimer(CTimeManager* manager, const char* id, CGroupTimer* parent);
    ~CGroupTimer() = default;
    void Update(int step);

    misc::StringA24 m_Id;
    std::set<CGroupTimer*> m_ChildGroups;
    std::set<CTimer*> m_ChildTimers;
};

// m_Time of the manager as of its last update, for code that wants a frame-stable clock.
extern uint32_t g_FrameTime;

class CTimeManager {
public:
    static constexpr int kMaxFrameStep = 100;

    CTimeManager();
    explicit CTimeManager(CPlatformTimer::Source clock);
    ~CTimeManager();
    CTimeManager(const CTimeManager&) = delete;
    CTimeManager& operator=(const CTimeManager&) = delete;

    // The process-wide manager, created at first use and never destroyed; on the test clock
    // when OX_TEST_CLOCK holds a step.
    static CTimeManager& Instance();

    // Every update from now on advances by `step` ms (at most the cap), real time unread; the
    // manager's time starts over from 0. A step of 0 goes back to the real clock.
    void SetFixedStep(int step);
    int GetFixedStep() const { return m_FixedStep; }
    // The step OX_TEST_CLOCK asks for: 0 when unset; a value that is no step from 1 to the cap
    // is logged and gives 0.
    static int FixedStepFromEnvironment();

    void Update();
    void Pause(bool flag);
    int GetTime() const { return m_Time; }
    unsigned GetAppTime() const { return m_Root->GetTime(); }
    int GetFrameDelta() const { return m_FrameDelta; }
    CGroupTimer* GetRoot() const { return m_Root; }

    CTimer* AttachTimer(CGroupTimer* parent);
    CGroupTimer* AttachGroupTimer(const char* id, CGroupTimer* parent);
    CGroupTimer* GetTimer(const char* id) const;
    void RemoveTimer(CTimer* timer);
    void RemoveGroupTimer(CGroupTimer* group);

    bool IsKnown(const CTimer* timer) const { return m_Timers.count(const_cast<CTimer*>(timer)) != 0; }
    bool IsKnown(const CGroupTimer* group) const { return m_GroupTimers.count(const_cast<CGroupTimer*>(group)) != 0; }

private:
    CPlatformTimer m_Clock;
    std::set<CTimer*> m_Timers;
    std::set<CGroupTimer*> m_GroupTimers;
    std::map<misc::StringA24, CGroupTimer*> m_NamedGroupTimers;
    CGroupTimer* m_Root = nullptr;
    int32_t m_Time = 0;
    float m_Offset = 20.0f;
    int32_t m_FrameDelta = 0;
    int m_FixedStep = 0;
};

CTimeManager& GetTimeManager();

// Owns a timer: destroys it on destruction or on a new assignment.
template <class T>
class CBasicTimerWrapper {
public:
    CBasicTimerWrapper() = default;
    explicit CBasicTimerWrapper(T* timer) : m_Timer(timer) {}
    ~CBasicTimerWrapper() { Reset(nullptr); }
    CBasicTimerWrapper(const CBasicTimerWrapper&) = delete;
    CBasicTimerWrapper& operator=(const CBasicTimerWrapper&) = delete;
    CBasicTimerWrapper& operator=(T* timer) { Reset(timer); return *this; }

    T* Get() { return m_Timer; }
    const T* Get() const { return m_Timer; }
    void Reset(T* timer)
    {
        if (m_Timer && m_Timer != timer)
            m_Timer->Destroy();
        m_Timer = timer;
    }

private:
    T* m_Timer = nullptr;
};

using CTimerWrapper = CBasicTimerWrapper<CTimer>;
using CGroupTimerWrapper = CBasicTimerWrapper<CGroupTimer>;

} // namespace ox::core
