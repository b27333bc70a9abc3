#include "core/TimeManager.h"

#include "diag/Assert.h"
#include "diag/Log.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <vector>

namespace ox::core {

uint32_t g_FrameTime = 0;

namespace {

// Only whole speeds are allowed; the fraction is a contract failure and is dropped.
int8_t WholeSpeed(float _k)
{
    OX_ASSERT(fabs(_k - (float((int)_k))) < 0.001);
    return static_cast<int8_t>(static_cast<int>(_k));
}

} // namespace

// ---- raw clock ----

double CPlatformTimer::MonotonicMilliseconds()
{
    using namespace std::chrono;
    return duration<double, std::milli>(steady_clock::now().time_since_epoch()).count();
}

CPlatformTimer::CPlatformTimer() : CPlatformTimer(&CPlatformTimer::MonotonicMilliseconds) {}

CPlatformTimer::CPlatformTimer(Source source) : m_Source(std::move(source)), m_Base(m_Source())
{
    OX_LOG("core", diag::LogInfo, "Time system choose monotonic clock");
}

// ---- shared clock ----

void CTimerClock::SetK(float _k) { m_K = WholeSpeed(_k); }

void CTimerClock::Pause(bool flag)
{
    if (flag)
        ++m_PauseCount;
    else if (m_PauseCount)
        --m_PauseCount;
}

void CTimerClock::Advance(int step)
{
    if (m_PauseCount) {
        m_FrameDelta = 0;
        return;
    }
    m_FrameDelta = static_cast<int16_t>(m_K * step);
    m_Time += static_cast<int32_t>(m_FrameDelta);
}

void CTimerClock::CopyClock(const CTimerClock& other)
{
    m_Time = other.m_Time;
    m_FrameDelta = other.m_FrameDelta;
    m_PauseCount = other.m_PauseCount;
    m_K = other.m_K;
}

// ---- CTimer ----

void CTimer::Destroy() { m_Manager->RemoveTimer(this); }

void CTimer::SetParent(CGroupTimer* parent)
{
    if (m_Parent && m_Manager->IsKnown(m_Parent))
        m_Parent->m_ChildTimers.erase(this);
    m_Parent = parent;
    if (m_Parent)
        m_Parent->m_ChildTimers.insert(this);
}

CTimer* CTimer::Clone(CGroupTimer* parent) const
{
    CTimer* copy = m_Manager->AttachTimer(parent ? parent : m_Parent);
    copy->CopyClock(*this);
    return copy;
}

// ---- CGroupTimer ----

CGroupTimer::CGroupTimer(CTimeManager* manager, const char* id, CGroupTimer* parent)
    : CTimerClock(manager, parent), m_Id(id ? id : "")
{
}

CTimer* CGroupTimer::AttachTimer() { return m_Manager->AttachTimer(this); }

CGroupTimer* CGroupTimer::AttachGroupTimer(const char* id) { return m_Manager->AttachGroupTimer(id, this); }

CGroupTimer* CGroupTimer::GetChildGroupTimer(const char* id) const
{
    if (!id || !*id)
        return nullptr;
    for (CGroupTimer* child : m_ChildGroups)
        if (child->m_Id == id)
            return child;
    return nullptr;
}

void CGroupTimer::Destroy() { m_Manager->RemoveGroupTimer(this); }

void CGroupTimer::Update(int step)
{
    Advance(step);
    for (CTimer* timer : m_ChildTimers)
        timer->Update(m_FrameDelta);
    for (CGroupTimer* group : m_ChildGroups)
        group->Update(m_FrameDelta);
}

void CGroupTimer::SetParent(CGroupTimer* parent)
{
    if (m_Parent && m_Manager->IsKnown(m_Parent))
        m_Parent->m_ChildGroups.erase(this);
    m_Parent = parent;
    if (m_Parent)
        m_Parent->m_ChildGroups.insert(this);
}

CGroupTimer* CGroupTimer::Clone(CGroupTimer* parent) const
{
    OX_ASSERT(m_Id.empty() && "Timer with non-empty Id is not copyable!");
    CGroupTimer* copy = m_Manager->AttachGroupTimer("", parent ? parent : m_Parent);
    copy->CopyClock(*this);
    for (CTimer* timer : m_ChildTimers)
        timer->Clone(copy);
    for (CGroupTimer* group : m_ChildGroups)
        group->Clone(copy);
    return copy;
}

// ---- CTimeManager ----

CTimeManager::CTimeManager() : CTimeManager(&CPlatformTimer::MonotonicMilliseconds) {}

CTimeManager::CTimeManager(CPlatformTimer::Source clock) : m_Clock(std::move(clock))
{
    m_Root = AttachGroupTimer("", nullptr);
    m_Time = static_cast<int32_t>(static_cast<float>(m_Clock.Read()));
    m_Offset = 20.0f;
}

CTimeManager::~CTimeManager()
{
    for (CTimer* timer : m_Timers)
        delete timer;
    for (CGroupTimer* group : m_GroupTimers)
        delete group;
}

CTimeManager& CTimeManager::Instance()
{
    static CTimeManager* instance = [] {
        auto* manager = new CTimeManager();
        if (const int step = FixedStepFromEnvironment())
            manager->SetFixedStep(step);
        return manager;
    }();
    return *instance;
}

int CTimeManager::FixedStepFromEnvironment()
{
    const char* value = getenv("OX_TEST_CLOCK");
    if (!value || !*value)
        return 0;
    char* end = nullptr;
    const long step = strtol(value, &end, 10);
    if (*end || step < 1 || step > kMaxFrameStep) {
        OX_LOG("core", diag::LogError, "OX_TEST_CLOCK=\"%s\" is no frame step from 1 to %d ms: the real clock runs",
               value, kMaxFrameStep);
        return 0;
    }
    return static_cast<int>(step);
}

void CTimeManager::SetFixedStep(int step)
{
    m_FixedStep = std::clamp(step, 0, kMaxFrameStep);
    if (m_FixedStep) {
        m_Time = 0;
        g_FrameTime = 0;
        OX_LOG("core", diag::LogInfo, "Time system runs on the test clock, %d ms a frame", m_FixedStep);
    } else {
        // The real clock goes on from here.
        m_Offset = static_cast<float>(m_Clock.Read()) - static_cast<float>(m_Time);
    }
}

CTimeManager& GetTimeManager() { return CTimeManager::Instance(); }

void CTimeManager::Update()
{
    if (m_FixedStep) {
        m_Time += m_FixedStep;
        g_FrameTime = static_cast<uint32_t>(m_Time);
        m_Root->Update(m_FixedStep);
        m_FrameDelta = m_Root->GetFrameDelta();
        return;
    }
    float now = static_cast<float>(m_Clock.Read());
    float delta = now - m_Offset - static_cast<float>(m_Time);
    m_Time = static_cast<int32_t>(now - m_Offset);
    g_FrameTime = static_cast<uint32_t>(m_Time);
    int step = static_cast<int>(delta);
    if (step > kMaxFrameStep)
        step = kMaxFrameStep;
    m_Root->Update(step);
    m_FrameDelta = m_Root->GetFrameDelta();
}

void CTimeManager::Pause(bool flag)
{
    bool wasPaused = m_Root->IsPaused();
    m_Root->Pause(flag);
    if (wasPaused && !m_Root->IsPaused() && !m_FixedStep) {
        // Strike out the time spent paused: the clock resumes where it stopped.
        float now = static_cast<float>(m_Clock.Read());
        m_Offset = now - static_cast<float>(m_Time);
        m_Time = static_cast<int32_t>(now - m_Offset);
    }
}

CTimer* CTimeManager::AttachTimer(CGroupTimer* parent)
{
    if (!parent)
        parent = m_Root;
    auto* timer = new CTimer(this, parent);
    m_Timers.insert(timer);
    if (parent)
        parent->m_ChildTimers.insert(timer);
    OX_ASSERT(!parent || m_GroupTimers.find(parent) != m_GroupTimers.end());
    return timer;
}

CGroupTimer* CTimeManager::AttachGroupTimer(const char* id, CGroupTimer* parent)
{
    if (!parent)
        parent = m_Root;
    auto* group = new CGroupTimer(this, id, parent);
    m_GroupTimers.insert(group);
    if (!group->m_Id.empty())
        m_NamedGroupTimers[group->m_Id] = group;
    if (parent)
        parent->m_ChildGroups.insert(group);
    OX_ASSERT(!parent || m_GroupTimers.find(parent) != m_GroupTimers.end());
    return group;
}

CGroupTimer* CTimeManager::GetTimer(const char* id) const
{
    if (!id || !*id)
        return nullptr;
    auto it = m_NamedGroupTimers.find(misc::StringA24(id));
    return it == m_NamedGroupTimers.end() ? nullptr : it->second;
}

void CTimeManager::RemoveTimer(CTimer* timer)
{
    if (m_Timers.erase(timer) == 0)
        return;
    if (timer->m_Parent && IsKnown(timer->m_Parent))
        timer->m_Parent->m_ChildTimers.erase(timer);
    delete timer;
}

void CTimeManager::RemoveGroupTimer(CGroupTimer* group)
{
    if (!IsKnown(group))
        return;
    if (!group->m_Id.empty()) {
        auto it = m_NamedGroupTimers.find(group->m_Id);
        if (it != m_NamedGroupTimers.end() && it->second == group)
            m_NamedGroupTimers.erase(it);
    }
    if (group->m_Parent && IsKnown(group->m_Parent))
        group->m_Parent->m_ChildGroups.erase(group);
    std::vector<CTimer*> timers(group->m_ChildTimers.begin(), group->m_ChildTimers.end());
    for (CTimer* timer : timers)
        RemoveTimer(timer);
    std::vector<CGroupTimer*> groups(group->m_ChildGroups.begin(), group->m_ChildGroups.end());
    for (CGroupTimer* child : groups)
        RemoveGroupTimer(child);
    m_GroupTimers.erase(group);
    if (group == m_Root)
        m_Root = nullptr;
    delete group;
}

} // namespace ox::core
