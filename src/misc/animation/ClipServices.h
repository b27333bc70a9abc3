#pragma once
// What clips take from the floors above them: textures and fonts by id, the player of their
// sounds, and the game clock. The application connects them at start; tests connect their own.
#include <functional>

namespace ox::core {
class CTimeManager;
}
namespace ox::graphics {
class CTexture;
struct CFont;
}

namespace ox::misc::anim {

class CClipObject;

// Plays the sounds of clip objects. Without one, sound points pass silently.
class IClipSoundPlayer {
public:
    virtual ~IClipSoundPlayer() = default;
    // `owner` reached its sound point `soundId`; the key's moment passed `lagMs` ago, so a
    // sound shorter than that is not started, a longer one starts that far in.
    virtual void Play(const CClipObject& owner, const char* soundId, int lagMs) = 0;
    // The sounds `owner` started: paused or resumed, stopped, muted or given back their volume.
    virtual void Pause(const CClipObject& owner, bool pause) = 0;
    virtual void StopAll(const CClipObject& owner) = 0;
    virtual void Mute(const CClipObject& owner, bool mute) = 0;
};

struct ClipServices {
    std::function<const graphics::CTexture*(const char* id)> textures;
    std::function<const graphics::CFont*(const char* id)> fonts;
    IClipSoundPlayer* sounds = nullptr;
    // The clock of every clip object; null means the process-wide time manager.
    core::CTimeManager* time = nullptr;
};

ClipServices& GetClipServices();
core::CTimeManager& ClipTimeManager();

} // namespace ox::misc::anim
