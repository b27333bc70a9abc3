#include "sound/AudioManager.h"

#include "diag/Assert.h"
#include "diag/Log.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>

namespace ox::sound {

namespace {

CAudioManager* g_Instance = nullptr;

void DestroyInstance()
{
    delete g_Instance;
    g_Instance = nullptr;
}

SoundPlayer& Player()
{
    static SoundPlayer player;
    return player;
}

} // namespace

CAudioManager::Handle PlaySound(const char* id)
{
    if (!id || !*id)
        return 0;
    if (const SoundPlayer& player = Player())
        return player(id);
    return CAudioManager::Instance().Play(id);
}

SoundPlayer SetSoundPlayer(SoundPlayer player)
{
    SoundPlayer previous = std::move(Player());
    Player() = std::move(player);
    return previous;
}

CAudioManager::CAudioManager() : CAudioManager(AudioManagerConfig()) {}

CAudioManager::CAudioManager(AudioManagerConfig config)
{
    core::CTimeManager& time = config.time ? *config.time : core::GetTimeManager();
    m_Timer = time.AttachGroupTimer("AudioManager", nullptr);
    m_Ticks = config.ticks ? std::move(config.ticks) : &core::CPlatformTimer::MonotonicMilliseconds;
    m_Device = OpenSoundDevice(config.device ? std::move(config.device) : CreateOpenAlDevice(), m_Available);
    m_Pool = std::make_unique<CAlSourcePool>(*m_Device, config.runThread, config.pack);
    m_Context = {m_Pool.get(), m_Timer.Get(), config.pack, &m_Volumes};
}

CAudioManager::~CAudioManager()
{
    StopAll(0.0f);
    // Sounds, then declarations (their timers live under the audio clock), then the pool
    // (its thread ends first), then the output.
    m_PlayingAudioRepository.clear();
    m_Items.clear();
    m_Pool.reset();
    m_Device->Close();
    m_Timer.Reset(nullptr);
}

CAudioManager& CAudioManager::Instance()
{
    if (!g_Instance) {
        g_Instance = new CAudioManager();
        std::atexit(&DestroyInstance);
    }
    return *g_Instance;
}

void CAudioManager::LoadDeclarations(const SoundDeclarationsLoader& loader)
{
    const SoundDeclarationsHeader* header = loader.GetData();
    if (!header)
        return;
    const SoundRecord* records = loader.GetRecords();
    for (uint32_t i = 0; i < header->count; ++i) {
        const SoundRecord& r = records[i];
        if (m_Items.count(r.id)) {
            OX_LOG("sound", diag::LogWarning, "sound \"%s\" is declared twice; the first declaration stays",
                   r.id.c_str());
            continue;
        }
        CSoundType& type = m_Items.try_emplace(r.id, &m_Context).first->second;
        if (!type.Init(r.file.c_str(), r.max_concurrent_sound_play)) {
            OX_LOG("sound", diag::LogWarning, "sound \"%s\": its file %s is missing; the sound is left out",
                   r.id.c_str(), r.file.c_str());
            m_Items.erase(r.id);
            continue;
        }
        if (!m_Volumes.HasGroup(r.group_template)) {
            m_Volumes.AddGroup(r.group_template);
            OX_LOG("sound", diag::LogInfo, "volume group \"%s\" comes with sound \"%s\"", r.group_template.c_str(),
                   r.id.c_str());
        }
        m_DeclaredGroups.insert(r.group_template);
        type.SetGroup(r.group_template);
        type.SetBalance(r.balance, 0.0f, 0.0f);
        type.SetVolume(r.volume, 0.0f, 0.0f);
        type.SetPriority(r.priority);
        type.SetRepeatCount(r.repeat);
        type.SetDelay(r.concurrent_sound_play_delay);
        type.SetSpeed(r.speed);
    }
}

// ---- volumes ----

void CAudioManager::SetGlobalVolume(float volume)
{
    m_Volumes.SetGlobal(volume);
    RefreshAll();
}

void CAudioManager::SetGroupVolume(const char* group, float volume)
{
    CheckGroup(group, "SetGroupVolume");
    m_Volumes.SetGroup(group ? group : "", volume);
    RefreshAll();
}

float CAudioManager::GetGroupVolume(const char* group) const
{
    CheckGroup(group, "GetGroupVolume");
    return m_Volumes.GetGroup(group ? group : "");
}

void CAudioManager::RefreshAll()
{
    for (auto& [handle, sound] : m_PlayingAudioRepository)
        sound.RefreshGain();
}

void CAudioManager::CheckGroup(const char* group, const char* what) const
{
    const misc::StringA88 name(group ? group : "");
    if (m_DeclaredGroups.empty() || m_DeclaredGroups.count(name) || !m_Reported.insert("group:" + name.str()).second)
        return;
    OX_LOG("sound", diag::LogWarning, "%s: no sound declaration names the volume group \"%s\"", what, name.c_str());
}

// ---- playing ----

CAudioManager::Handle CAudioManager::Play(const char* id, float balance, float volume, int priority, int repeat,
                                          float speed)
{
    if (!id || !*id)
        return 0;
    CSoundType* type = FindType(id);
    if (!type) {
        if (m_Reported.insert(std::string("sound:") + id).second)
            OX_LOG("sound", diag::LogWarning, "Play: no sound \"%s\" is declared", id);
        return 0;
    }
    if (!type->CanPlay())
        return 0;
    do
        ++m_NextHandle;
    while (m_NextHandle == 0 || m_PlayingAudioRepository.count(m_NextHandle));
    const Handle handle = m_NextHandle;
    auto it = m_PlayingAudioRepository.try_emplace(handle, *type).first;
    if (!it->second.Play(balance, volume, priority, repeat, speed)) {
        m_PlayingAudioRepository.erase(it);
        return 0;
    }
    // A sound started under a paused clock starts paused, once for each count.
    unsigned pauses = 0;
    for (const core::CGroupTimer* timer = m_Timer.Get(); timer; timer = timer->GetParent())
        pauses += timer->GetPauseCount();
    for (unsigned i = 0; i < pauses; ++i)
        Pause(handle, true);
    return handle;
}

bool CAudioManager::Stop(Handle handle, float fade)
{
    CSound* sound = Find(handle);
    if (!sound)
        return false;
    sound->SetVolume(0.0f, fade, 0.0f);
    sound->Stop(fade);
    return true;
}

bool CAudioManager::Stop(const char* id, float fade)
{
    const CSoundType* type = FindType(id);
    if (!type)
        return false;
    for (auto& [handle, sound] : m_PlayingAudioRepository)
        if (sound.GetParent() == type)
            Stop(handle, fade);
    return true;
}

void CAudioManager::StopAll(float fade)
{
    for (auto& [handle, sound] : m_PlayingAudioRepository)
        Stop(handle, fade);
}

void CAudioManager::StopGroup(const char* group, float fade)
{
    CheckGroup(group, "StopGroup");
    const misc::StringA88 name(group ? group : "");
    for (auto& [handle, sound] : m_PlayingAudioRepository)
        if (sound.GetGroup() == name)
            sound.Stop(fade);
}

void CAudioManager::PauseAll(bool pause)
{
    m_Timer.Get()->Pause(pause);
    for (auto& [handle, sound] : m_PlayingAudioRepository)
        Pause(handle, pause);
}

bool CAudioManager::Pause(Handle handle, bool pause)
{
    CSound* sound = Find(handle);
    if (!sound)
        return false;
    if (pause)
        sound->Pause();
    else
        sound->Resume();
    return true;
}

bool CAudioManager::IsPaused() const { return m_Timer.Get()->IsPaused(); }

// ---- queries ----

CSound* CAudioManager::Find(Handle handle)
{
    auto it = m_PlayingAudioRepository.find(handle);
    return it == m_PlayingAudioRepository.end() ? nullptr : &it->second;
}

const CSound* CAudioManager::FindSound(Handle handle) const
{
    auto it = m_PlayingAudioRepository.find(handle);
    return it == m_PlayingAudioRepository.end() ? nullptr : &it->second;
}

CSoundType* CAudioManager::FindType(const char* id)
{
    if (!id)
        return nullptr;
    auto it = m_Items.find(misc::StringA88(id));
    return it == m_Items.end() ? nullptr : &it->second;
}

const CSoundType* CAudioManager::FindType(const char* id) const
{
    return const_cast<CAudioManager*>(this)->FindType(id);
}

bool CAudioManager::IsSound(const char* id) const { return FindType(id) != nullptr; }

bool CAudioManager::IsSound(Handle handle) const { return FindSound(handle) != nullptr; }

bool CAudioManager::SetVolume(const char* id, float value, float time, float delay)
{
    CSoundType* type = FindType(id);
    if (type)
        type->SetVolume(value, time, delay);
    return type != nullptr;
}

bool CAudioManager::SetVolume(Handle handle, float value, float time, float delay)
{
    CSound* sound = Find(handle);
    if (sound)
        sound->SetVolume(value, time, delay);
    return sound != nullptr;
}

float CAudioManager::GetVolume(const char* id) const
{
    const CSoundType* type = FindType(id);
    return type ? type->GetVolume() : 0.0f;
}

float CAudioManager::GetVolume(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    return sound ? sound->GetVolume() : 0.0f;
}

float CAudioManager::GetMaxVolume(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    if (!sound)
        return 0.0f;
    OX_ASSERT(sound->GetParent());
    return sound->GetParent() ? sound->GetParent()->GetVolume() : 0.0f;
}

int CAudioManager::GetPriority(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    return sound ? sound->GetPriority() : 0;
}

int CAudioManager::GetRepeatCount(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    return sound ? sound->GetRepeatCount() : 0;
}

int CAudioManager::GetRepeatCount(const char* id) const
{
    const CSoundType* type = FindType(id);
    return type ? type->GetRepeatCount() : 0;
}

bool CAudioManager::SetRepeatCount(Handle handle, int count)
{
    CSound* sound = Find(handle);
    if (sound)
        sound->SetRepeatCount(count);
    return sound != nullptr;
}

float CAudioManager::GetBalance(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    return sound ? sound->GetBalance() : 0.0f;
}

float CAudioManager::GetSpeed(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    return sound ? sound->GetSpeed() : 0.0f;
}

double CAudioManager::GetLength(const char* id) const
{
    const CSoundType* type = FindType(id);
    return type ? type->GetLength() : 0.0;
}

double CAudioManager::GetLength(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    return sound ? sound->GetParent()->GetLength() : 0.0;
}

bool CAudioManager::SetPosition(Handle handle, float seconds)
{
    CSound* sound = Find(handle);
    if (sound)
        sound->SetPosition(seconds);
    return sound != nullptr;
}

double CAudioManager::GetPosition(Handle handle) const
{
    const CSound* sound = FindSound(handle);
    return sound ? sound->GetPosition() : 0.0;
}

void CAudioManager::UnloadAllOnDemandSounds()
{
    // Sounds hold nothing between plays: there is nothing to unload.
}

// ---- the frame ----

bool CAudioManager::Update()
{
    for (auto it = m_PlayingAudioRepository.begin(); it != m_PlayingAudioRepository.end();) {
        if (it->second.IsStopped()) {
            it = m_PlayingAudioRepository.erase(it);
        } else {
            it->second.Update();
            ++it;
        }
    }
    const auto holding = std::count_if(m_PlayingAudioRepository.begin(), m_PlayingAudioRepository.end(),
                                       [](const auto& entry) { return entry.second.GetSource() != nullptr; });
    if (static_cast<unsigned>(holding) != m_Pool->GetRunningSourcesCount() && m_Reported.insert("sources").second)
        OX_LOG("sound", diag::LogError, "%zu playing sounds hold sources, but %u sources are taken",
               static_cast<size_t>(holding), m_Pool->GetRunningSourcesCount());
    if (m_Statistics)
        WriteStatistics();
    return true;
}

void CAudioManager::WriteStatistics()
{
    const double now = m_Ticks();
    if (m_StatisticsTick < 0.0) {
        m_StatisticsTick = now;
        return;
    }
    if (now - m_StatisticsTick <= 5000.0)
        return;
    m_StatisticsTick = now;
    const std::string name = "sound_stat_" + std::to_string(m_StatisticsFile++);
    FILE* file = fopen(name.c_str(), "wt");
    if (!file) {
        OX_LOG("sound", diag::LogWarning, "cannot write the sound statistics %s", name.c_str());
        return;
    }
    for (const auto& [id, type] : m_Items)
        if (type.GetPlayingCount() >= 1)
            fprintf(file, "%20s %i\n", type.GetFile().c_str(), static_cast<int>(type.GetPlayingCount()));
    fclose(file);
}

} // namespace ox::sound
