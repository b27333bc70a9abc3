#pragma once
// Plays clip objects' sound points through an audio manager, and keeps the list of
// (object, sound) pairs they started so an object can pause, mute or stop its own sounds.
#include "misc/animation/ClipServices.h"
#include "sound/AudioManager.h"

#include <utility>
#include <vector>

namespace ox::misc::anim {

class CClipAudio : public IClipSoundPlayer {
public:
    explicit CClipAudio(sound::CAudioManager& audio) : m_Audio(audio) {}
    ~CClipAudio() override;

    void Play(const CClipObject& owner, const char* soundId, int lagMs) override;
    void Pause(const CClipObject& owner, bool pause) override;
    void StopAll(const CClipObject& owner) override;
    void Mute(const CClipObject& owner, bool mute) override;

    // Sounds still recorded (finished ones are dropped as the list is used).
    size_t Count() const { return m_Sounds.size(); }

private:
    void DropFinished();
    template <class F> void ForOwner(const CClipObject& owner, F action);

    sound::CAudioManager& m_Audio;
    std::vector<std::pair<const CClipObject*, sound::CAudioManager::Handle>> m_Sounds;
};

} // namespace ox::misc::anim
