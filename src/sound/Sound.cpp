#include "sound/Sound.h"

#include "diag/Assert.h"
#include "misc/GamePack.h"
#include "sound/AlSourcePool.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace ox::sound {

namespace {

constexpr int kKeep = -2;

core::CTimer* AttachTimer(core::CGroupTimer* clock) { return clock ? clock->AttachTimer() : nullptr; }

} // namespace

// ---- CVolumeTable ----

void CVolumeTable::SetGlobal(float volume) { m_Global = std::clamp(volume, 0.0f, 100.0f); }

float CVolumeTable::GetGroup(const misc::StringA88& group) const
{
    auto it = m_Groups.find(group);
    return it == m_Groups.end() ? 100.0f : it->second;
}

void CVolumeTable::AddGroup(const misc::StringA88& group) { m_Groups.try_emplace(group, 100.0f); }

void CVolumeTable::SetGroup(const misc::StringA88& group, float volume)
{
    m_Groups[group] = std::clamp(volume, 0.0f, 100.0f);
}

int CVolumeTable::Effective(float volume, const misc::StringA88& group) const
{
    const float value = m_Global / 100.0f * (GetGroup(group) / 100.0f * volume);
    return static_cast<int>(std::clamp(value, 0.0f, 100.0f));
}

// ---- CFade ----

CFade::CFade(core::CGroupTimer* clock, float delta, float time, float delay) : m_Timer(AttachTimer(clock))
{
    m_Start = Now() + delay;
    m_Last = m_Start;
    m_End = m_Start + time;
    m_Delta = delta;
}

CFade::CFade(const CFade& other) { *this = other; }

CFade& CFade::operator=(const CFade& other)
{
    if (this == &other)
        return *this;
    m_Timer.Reset(other.m_Timer.Get() ? other.m_Timer.Get()->Clone(nullptr) : nullptr);
    m_Start = other.m_Start;
    m_End = other.m_End;
    m_Last = other.m_Last;
    m_Delta = other.m_Delta;
    m_Applied = other.m_Applied;
    return *this;
}

float CFade::Now() const { return m_Timer.Get() ? static_cast<float>(m_Timer.Get()->GetTime()) : 0.0f; }

float CFade::Step()
{
    const float now = Now();
    float part = 0.0f;
    if (now >= m_Start) {
        // What is due by now, less what earlier steps gave: the parts add up to the delta
        // exactly, and a fade of no length gives it all at once.
        const float due = now >= m_End ? m_Delta : m_Delta * (now - m_Start) / (m_End - m_Start);
        part = due - m_Applied;
        m_Applied = due;
    }
    m_Last = now;
    return part;
}

void CFade::Pause(bool flag)
{
    if (m_Timer.Get())
        m_Timer.Get()->Pause(flag);
}

// ---- CBaseSound ----

CBaseSound::CBaseSound(const SoundContext* context) : m_Context(context) {}

void CBaseSound::AdjustVolume(float delta, float time, float delay)
{
    if (time == 0.0f && delay == 0.0f)
        m_Volume = std::clamp(m_Volume + delta, 0.0f, 100.0f);
    else
        m_VolumeFades.emplace_back(m_Context->clock, delta, time, delay);
}

void CBaseSound::SetVolume(float value, float time, float delay)
{
    m_VolumeFades.clear();
    AdjustVolume(std::clamp(value, 0.0f, 100.0f) - m_Volume, time, delay);
}

void CBaseSound::SetPriority(int priority)
{
    if (priority != kKeep)
        m_Priority = std::max(priority, 0);
}

void CBaseSound::SetRepeatCount(int count)
{
    if (count != kKeep)
        m_RepeatCount = count < 0 ? -1 : count;
}

void CBaseSound::SetBalance(float value, float time, float delay)
{
    if (value == kKeep)
        return;
    value = std::clamp(value, -1.0f, 1.0f);
    if (time == 0.0f && delay == 0.0f)
        m_Balance = value;
    else
        m_BalanceFade = CFade(m_Context->clock, value - m_Balance, time, delay);
}

void CBaseSound::SetSpeed(float /*speed*/) {}

// ---- CSoundType ----

CSoundType::CSoundType(const SoundContext* context)
    : CBaseSound(context), m_LastPlay(std::numeric_limits<float>::lowest()), m_Timer(AttachTimer(context->clock))
{
}

float CSoundType::Now() const { return m_Timer.Get() ? static_cast<float>(m_Timer.Get()->GetTime()) : 0.0f; }

bool CSoundType::Init(const char* file, int max, bool /*on_demand*/)
{
    m_Max = max;
    misc::CGamePack& pack = m_Context->pack ? *m_Context->pack : misc::g_GamePack::Instance();
    if (!file || !pack.Access(file))
        return false;
    m_File = file;
    return true;
}

bool CSoundType::CanResume() const { return m_Max < 0 || static_cast<int>(m_Playing) < m_Max; }

bool CSoundType::CanPlay() const { return CanResume() && !(m_Delay >= 0.0f && Now() < m_LastPlay + m_Delay); }

CAlSource* CSoundType::Acquire()
{
    if (m_File.empty() || !m_Context->pool)
        return nullptr;
    CAlSource* source = m_Context->pool->Acquire(m_File.c_str());
    if (source && m_Length < 0.0)
        m_Length = std::max(source->GetLength() * 1000.0, 0.0);
    return source;
}

void CSoundType::OnStart()
{
    ++m_Playing;
    m_LastPlay = Now();
}

void CSoundType::OnStop()
{
    if (m_Playing)
        --m_Playing;
}

// ---- CSound ----

CSound::CSound(CSoundType& parent) : CBaseSound(parent), m_Parent(&parent) {}

CSound::~CSound()
{
    ReleaseSource();
    Count(false);
}

void CSound::ReleaseSource()
{
    if (m_Source && m_Context->pool)
        m_Context->pool->Release(m_Source);
    m_Source = nullptr;
}

void CSound::Count(bool playing)
{
    if (playing == m_Counted)
        return;
    m_Counted = playing;
    if (playing)
        m_Parent->OnStart();
    else
        m_Parent->OnStop();
}

bool CSound::Play(float balance, float volume, int priority, int repeat, float speed)
{
    ReleaseSource();
    m_Source = m_Parent->Acquire();
    if (!m_Source)
        return false;
    // Nothing below reacts to the end of the source while it is set up.
    m_PauseCount = 1;
    SetBalance(balance, 0.0f, 0.0f);
    if (volume != kKeep)
        m_Volume = std::clamp(volume, 0.0f, 100.0f);
    SetPriority(priority);
    SetRepeatCount(repeat);
    SetSpeed(speed);
    Count(true);
    m_Source->SetGain(GetEffectiveVolume() / 100.0f);
    m_Source->SetLooping(m_RepeatCount == -1);
    m_Source->Play();
    m_PauseCount = 0;
    return true;
}

void CSound::Pause()
{
    if (!m_Source)
        return;
    if (m_PauseCount == 0)
        Count(false);
    // The stop fade runs on: a sound fading out ends even while paused.
    for (CFade& fade : m_VolumeFades)
        fade.Pause(true);
    m_BalanceFade.Pause(true);
    if (++m_PauseCount == 1)
        m_Source->Pause();
}

void CSound::Resume()
{
    if (!m_Source || m_PauseCount == 0)
        return;
    if (m_PauseCount == 1 && !m_Parent->CanResume()) {
        Stop(0.0f);
        return;
    }
    for (CFade& fade : m_VolumeFades)
        fade.Pause(false);
    m_BalanceFade.Pause(false);
    if (--m_PauseCount == 0) {
        Count(true);
        m_Source->Resume();
    }
}

void CSound::Stop(float fade)
{
    if (fade > 0.0f) {
        m_StopFade = CFade(m_Context->clock, 0.0f, fade, 0.0f);
        return;
    }
    Count(false);
    m_Stopped = true;
    SetRepeatCount(0);
}

void CSound::EndTest()
{
    if (m_PauseCount == 0 && m_Source && m_Source->IsStopped()) {
        if (m_Stopped || m_RepeatCount == -1) {
            // A looping source only stops when its file gives no audio at all.
            Stop(0.0f);
        } else if (--m_RepeatCount >= 1) {
            Count(false);
            Play(kKeep, kKeep, kKeep, kKeep, kKeep);
        } else {
            Stop(0.0f);
        }
    }
    if (!m_Source)
        Stop(0.0f);
}

void CSound::Update()
{
    if (m_Source)
        m_Source->CheckEnd();
    EndTest();
    bool faded = false;
    for (auto it = m_VolumeFades.begin(); it != m_VolumeFades.end();) {
        CBaseSound::AdjustVolume(it->Step(), 0.0f, 0.0f);
        faded = true;
        it = it->Ended() ? m_VolumeFades.erase(it) : std::next(it);
    }
    if (!m_BalanceFade.IsNull()) {
        CBaseSound::SetBalance(m_Balance + m_BalanceFade.Step(), 0.0f, 0.0f);
        faded = true;
        if (m_BalanceFade.Ended())
            m_BalanceFade = CFade();
    }
    bool stoppedNow = false;
    if (!m_StopFade.IsNull()) {
        m_StopFade.Step();
        if (m_StopFade.Ended()) {
            m_StopFade = CFade();
            Stop(0.0f);
            stoppedNow = true;
        }
    }
    if (faded && !stoppedNow)
        RefreshGain();
}

int CSound::GetEffectiveVolume() const
{
    if (m_Context->volumes)
        return m_Context->volumes->Effective(m_Volume, m_Group);
    return static_cast<int>(std::clamp(m_Volume, 0.0f, 100.0f));
}

void CSound::RefreshGain()
{
    if (m_Source)
        m_Source->SetGain(GetEffectiveVolume() / 100.0f);
    EndTest();
}

double CSound::GetPosition() const
{
    if (!m_Source)
        return 0.0;
    const double p = m_Source->GetPlayedTime() * 1000.0;
    const double len = m_Parent->GetLength();
    if (p <= len || len <= 0.0)
        return p;
    const double pos = p - std::trunc(p / len) * len;
    OX_ASSERT_A(pos >= 0);
    OX_ASSERT_A(pos <= len + 0.001);
    return pos;
}

void CSound::SetPosition(double seconds)
{
    if (m_Source)
        m_Source->SetPosition(seconds);
}

void CSound::AdjustVolume(float delta, float time, float delay)
{
    CBaseSound::AdjustVolume(delta, time, delay);
    RefreshGain();
}

void CSound::SetPriority(int priority)
{
    CBaseSound::SetPriority(priority);
    RefreshGain();
}

void CSound::SetRepeatCount(int count)
{
    CBaseSound::SetRepeatCount(count);
    if (m_Source)
        m_Source->SetLooping(m_RepeatCount == -1);
}

void CSound::SetBalance(float value, float time, float delay)
{
    CBaseSound::SetBalance(value, time, delay);
    RefreshGain();
}

void CSound::SetSpeed(float speed)
{
    CBaseSound::SetSpeed(speed);
    RefreshGain();
}

} // namespace ox::sound
