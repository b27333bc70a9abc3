#pragma once
// Sounds above the source pool, on the main thread: the volume and balance fades on the
// audio clock, a declared sound (CSoundType) and one playing instance of it (CSound).
#include "core/TimeManager.h"
#include "misc/String.h"

#include <list>
#include <map>
#include <string>

namespace ox::misc {
class CGamePack;
}

namespace ox::sound {

class CAlSource;
class CAlSourcePool;

// The global volume and the named volume groups a playing sound's gain is made of. All
// volumes are 0 to 100.
class CVolumeTable {
public:
    float GetGlobal() const { return m_Global; }
    void SetGlobal(float volume);
    bool HasGroup(const misc::StringA88& group) const { return m_Groups.count(group) != 0; }
    // 100 for a group that does not exist.
    float GetGroup(const misc::StringA88& group) const;
    // Creates a missing group at 100.
    void AddGroup(const misc::StringA88& group);
    // Creates a missing group; the volume is clamped.
    void SetGroup(const misc::StringA88& group, float volume);
    // trunc(clamp(global / 100 * (group / 100 * volume), 0, 100)), in 32-bit floats.
    int Effective(float volume, const misc::StringA88& group) const;
    const std::map<misc::StringA88, float>& Groups() const { return m_Groups; }

private:
    float m_Global = 100.0f;
    std::map<misc::StringA88, float> m_Groups;
};

// What the sounds of one audio manager share.
struct SoundContext {
    CAlSourcePool* pool = nullptr;
    // The audio clock: every fade and delay runs on timers under it.
    core::CGroupTimer* clock = nullptr;
    misc::CGamePack* pack = nullptr; // null: the process-wide pack
    const CVolumeTable* volumes = nullptr;
};

// A change spread over time on a timer of its own: `delta` in all, from `delay` ms on for
// `time` ms, linearly.
class CFade {
public:
    // The null fade: no change, never running.
    CFade() = default;
    CFade(core::CGroupTimer* clock, float delta, float time, float delay);
    // A copy runs on a copy of the timer.
    CFade(const CFade& other);
    CFade& operator=(const CFade& other);

    // The part of the change since the last step; the parts add up to the delta.
    float Step();
    bool Ended() const { return m_Last >= m_End; }
    bool IsNull() const { return m_Start == m_End && m_Delta == 0.0f; }
    void Pause(bool flag);

private:
    float Now() const;

    core::CTimerWrapper m_Timer;
    float m_Start = -1000.0f;
    float m_End = -1000.0f;
    float m_Last = -1000.0f;
    float m_Delta = 0.0f;
    float m_Applied = 0.0f;
};

class CBaseSound {
public:
    explicit CBaseSound(const SoundContext* context);
    CBaseSound(const CBaseSound& other) = default;
    CBaseSound& operator=(const CBaseSound&) = delete;
    virtual ~CBaseSound() = default;

    // Now when time and delay are 0, else as a fade.
    virtual void AdjustVolume(float delta, float time, float delay);
    // Replaces any running volume fade.
    virtual void SetVolume(float value, float time, float delay);
    // -2 keeps the value; a negative one is 0.
    virtual void SetPriority(int priority);
    // -2 keeps the value; a negative one is -1, without end.
    virtual void SetRepeatCount(int count);
    // -2 keeps the value; -1 (left) to 1 (right).
    virtual void SetBalance(float value, float time, float delay);
    // Has no effect: sounds play at their own speed.
    virtual void SetSpeed(float speed);

    float GetVolume() const { return m_Volume; }
    float GetBalance() const { return m_Balance; }
    int GetPriority() const { return m_Priority; }
    int GetRepeatCount() const { return m_RepeatCount; }
    float GetSpeed() const { return 1.0f; }
    const misc::StringA88& GetGroup() const { return m_Group; }
    void SetGroup(const misc::StringA88& group) { m_Group = group; }

protected:
    const SoundContext* m_Context;
    bool m_Stopped = false;
    int m_Priority = 0;
    int m_RepeatCount = 1;
    float m_Volume = 100.0f;
    float m_Balance = 0.0f;
    std::list<CFade> m_VolumeFades;
    CFade m_BalanceFade;
    CFade m_StopFade;
    misc::StringA88 m_Group;
};

// A declared sound: its file, defaults, and how many of it may play at once.
class CSoundType : public CBaseSound {
public:
    explicit CSoundType(const SoundContext* context);
    CSoundType(const CSoundType&) = delete;

    // False when the pack has no such file.
    bool Init(const char* file, int max, bool on_demand = false);
    // The maximum and the delay since the last start allow one more.
    bool CanPlay() const;
    // Only the maximum: a paused sound may come back.
    bool CanResume() const;
    // A source playing the file; the length is known from the first one on.
    CAlSource* Acquire();
    void OnStart();
    void OnStop();
    // Milliseconds; -1 until a first play.
    double GetLength() const { return m_Length; }
    void SetDelay(float delay) { m_Delay = delay; }
    float GetDelay() const { return m_Delay; }
    int GetMax() const { return m_Max; }
    unsigned GetPlayingCount() const { return m_Playing; }
    const std::string& GetFile() const { return m_File; }
    const SoundContext* GetContext() const { return m_Context; }

private:
    float Now() const;

    std::string m_File;
    double m_Length = -1.0;
    unsigned m_Playing = 0;
    int m_Max = -1;
    float m_LastPlay = 0.0f;
    float m_Delay = -1.0f;
    core::CTimerWrapper m_Timer;
};

// One playing instance of a declared sound, with a source while it plays.
class CSound : public CBaseSound {
public:
    explicit CSound(CSoundType& parent);
    ~CSound() override;
    CSound(const CSound&) = delete;

    // -2 (-2.0) for an argument takes the type's value. False without a source.
    bool Play(float balance, float volume, int priority, int repeat, float speed);
    // Nested: each Pause needs one Resume. A paused sound frees its place under the maximum.
    void Pause();
    // A sound that lost its place under the type's maximum meanwhile ends.
    void Resume();
    // Now (the manager erases it at its next update), or after `fade` ms.
    void Stop(float fade);
    // Once a frame: the end of the source, repeats, fades.
    void Update();
    bool IsStopped() const { return m_Stopped; }
    bool IsPaused() const { return m_PauseCount != 0; }
    // Hands the source its gain and runs the end test.
    void RefreshGain();
    // Milliseconds into the file (a loop counts from its start).
    double GetPosition() const;
    void SetPosition(double seconds);
    int GetEffectiveVolume() const;
    CSoundType* GetParent() const { return m_Parent; }
    CAlSource* GetSource() const { return m_Source; }

    void AdjustVolume(float delta, float time, float delay) override;
    void SetPriority(int priority) override;
    // A sound that stops repeating without end plays to the end of its file.
    void SetRepeatCount(int count) override;
    void SetBalance(float value, float time, float delay) override;
    void SetSpeed(float speed) override;

private:
    void EndTest();
    void ReleaseSource();
    // Counts this sound among the type's playing ones, or takes it out; once each.
    void Count(bool playing);

    CSoundType* m_Parent;
    CAlSource* m_Source = nullptr;
    int m_PauseCount = 0;
    bool m_Counted = false;
};

} // namespace ox::sound
