#pragma once
// The audio manager: declared sounds by id, playing sounds under 32-bit handles, the global
// volume and the named volume groups. Sounds, fades and delays run on the "AudioManager"
// group timer, so they stop with game time. Every sound streams from its file as it plays.
#include "core/TimeManager.h"
#include "misc/String.h"
#include "sound/AlSourcePool.h"
#include "sound/Sound.h"
#include "sound/SoundDeclarations.h"
#include "sound/SoundDevice.h"

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <set>
#include <string>

namespace ox::sound {

// What a manager is built on. The game's manager takes the defaults; tests inject theirs.
struct AudioManagerConfig {
    std::unique_ptr<ISoundDevice> device;  // null: OpenAL
    core::CTimeManager* time = nullptr;     // null: the process-wide time manager
    misc::CGamePack* pack = nullptr;        // null: the process-wide pack
    bool runThread = true;                  // false: the owner calls FeedSources
    std::function<double()> ticks;          // milliseconds for the statistics; empty: monotonic
};

class CAudioManager {
public:
    using Handle = uint32_t;
    static constexpr float kKeep = -2.0f;

    CAudioManager();
    explicit CAudioManager(AudioManagerConfig config);
    ~CAudioManager();
    CAudioManager(const CAudioManager&) = delete;
    CAudioManager& operator=(const CAudioManager&) = delete;

    // The game's manager, made at first use (it opens the output) and destroyed at exit.
    static CAudioManager& Instance();

    bool IsAudioAvailable() const { return m_Available; }
    // Accepted; every sound streams whatever it says.
    void SetOnDemand(bool value) { m_OnDemand = value; }
    // Makes a declared sound of each record whose file exists; the others are logged.
    void LoadDeclarations(const SoundDeclarationsLoader& loader);

    void SetGlobalVolume(float volume);
    float GetGlobalVolume() const { return m_Volumes.GetGlobal(); }
    // Creates a missing group.
    void SetGroupVolume(const char* group, float volume);
    // 100 for a group that does not exist.
    float GetGroupVolume(const char* group) const;

    // A handle, or 0 when the sound is unknown, may not play now or gets no source. -2 for
    // an argument takes the declared value.
    Handle Play(const char* id, float balance = kKeep, float volume = kKeep, int priority = -2, int repeat = -2,
                float speed = kKeep);
    // Fades the sound's volume down over `fade` ms and ends it then.
    bool Stop(Handle handle, float fade);
    // Every playing sound of a declared one.
    bool Stop(const char* id, float fade);
    void StopAll(float fade);
    // Every sound of the group plays on at its volume for `fade` ms and ends then.
    void StopGroup(const char* group, float fade);
    // One count of pausing or resuming for every sound, and for the audio clock.
    void PauseAll(bool pause);
    bool Pause(Handle handle, bool pause);
    bool IsPaused() const;

    bool IsSound(const char* id) const;
    bool IsSound(Handle handle) const;
    bool SetVolume(const char* id, float value, float time, float delay);
    bool SetVolume(Handle handle, float value, float time, float delay);
    float GetVolume(const char* id) const;
    float GetVolume(Handle handle) const;
    // The volume of the sound's declaration.
    float GetMaxVolume(Handle handle) const;
    int GetPriority(Handle handle) const;
    int GetRepeatCount(Handle handle) const;
    int GetRepeatCount(const char* id) const;
    bool SetRepeatCount(Handle handle, int count);
    float GetBalance(Handle handle) const;
    float GetSpeed(Handle handle) const;
    // Milliseconds; for a declared sound -1 until it has played once.
    double GetLength(const char* id) const;
    double GetLength(Handle handle) const;
    bool SetPosition(Handle handle, float seconds);
    // Milliseconds into the file.
    double GetPosition(Handle handle) const;
    void UnloadAllOnDemandSounds();

    // Once a frame: ended sounds go, the others advance; with statistics on, the counts of
    // playing sounds go to a file "sound_stat_<n>" every 5 s.
    bool Update();
    void SetStatistics(bool on) { m_Statistics = on; }

    // One feed pass of the sources, for an owner without the pool's thread.
    void FeedSources() { m_Pool->Update(); }
    CAlSourcePool& GetPool() { return *m_Pool; }
    size_t GetPlayingCount() const { return m_PlayingAudioRepository.size(); }
    const CSound* FindSound(Handle handle) const;

private:
    CSound* Find(Handle handle);
    CSoundType* FindType(const char* id);
    const CSoundType* FindType(const char* id) const;
    // Every playing sound gets its gain again.
    void RefreshAll();
    // A group no declaration names is reported once.
    void CheckGroup(const char* group, const char* what) const;
    void WriteStatistics();

    bool m_Available = false;
    bool m_OnDemand = true;
    std::unique_ptr<ISoundDevice> m_Device;
    std::unique_ptr<CAlSourcePool> m_Pool;
    core::CGroupTimerWrapper m_Timer;
    CVolumeTable m_Volumes;
    SoundContext m_Context;
    std::map<misc::StringA88, CSoundType> m_Items;
    std::map<Handle, CSound> m_PlayingAudioRepository;
    Handle m_NextHandle = 0;
    std::set<misc::StringA88> m_DeclaredGroups;
    mutable std::set<std::string> m_Reported;
    bool m_Statistics = false;
    std::function<double()> m_Ticks;
    double m_StatisticsTick = -1.0;
    unsigned m_StatisticsFile = 0;
};

// Plays a declared sound by id with its declared values: what a window opening or closing
// calls. It goes to the game's audio manager unless a player was put in its place (tests
// record with one). An empty id plays nothing. The handle, or 0.
CAudioManager::Handle PlaySound(const char* id);
using SoundPlayer = std::function<CAudioManager::Handle(const char* id)>;
// Returns the previous player; an empty one gives the audio manager back.
SoundPlayer SetSoundPlayer(SoundPlayer player);

} // namespace ox::sound
