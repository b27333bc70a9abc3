#include "misc/animation/ClipAudio.h"

#include <algorithm>
#include <cmath>

namespace ox::misc::anim {

CClipAudio::~CClipAudio()
{
    if (GetClipServices().sounds == this)
        GetClipServices().sounds = nullptr;
}

void CClipAudio::DropFinished()
{
    std::erase_if(m_Sounds, [this](const auto& entry) { return !m_Audio.IsSound(entry.second); });
}

template <class F> void CClipAudio::ForOwner(const CClipObject& owner, F action)
{
    DropFinished();
    for (const auto& [object, handle] : m_Sounds)
        if (object == &owner)
            action(handle);
}

void CClipAudio::Play(const CClipObject& owner, const char* soundId, int lagMs)
{
    // A sound shorter than the time since its key is over already; a longer one starts that
    // far in.
    double length = m_Audio.GetLength(soundId);
    if (length >= 0 && lagMs >= length)
        return;
    // At its declared volume, the same that un-muting gives back.
    const sound::CAudioManager::Handle handle = m_Audio.Play(soundId);
    if (!handle)
        return;
    if (length < 0)
        length = m_Audio.GetLength(handle);
    if (length > 0.001 && lagMs >= length) {
        m_Audio.Stop(handle, 0);
        return;
    }
    const double into = length > 0.001 ? std::fmod(double(lagMs), length) : 0.0;
    if (into > 0)
        m_Audio.SetPosition(handle, static_cast<float>(into / 1000.0));
    m_Sounds.emplace_back(&owner, handle);
    DropFinished();
}

void CClipAudio::Pause(const CClipObject& owner, bool pause)
{
    ForOwner(owner, [&](sound::CAudioManager::Handle h) { m_Audio.Pause(h, pause); });
}

void CClipAudio::StopAll(const CClipObject& owner)
{
    ForOwner(owner, [&](sound::CAudioManager::Handle h) { m_Audio.Stop(h, 0); });
    std::erase_if(m_Sounds, [&](const auto& entry) { return entry.first == &owner; });
}

void CClipAudio::Mute(const CClipObject& owner, bool mute)
{
    ForOwner(owner, [&](sound::CAudioManager::Handle h) {
        m_Audio.SetVolume(h, mute ? 0.0f : m_Audio.GetMaxVolume(h), 0, 0);
    });
}

} // namespace ox::misc::anim
