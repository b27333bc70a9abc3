#pragma once
// A running particle system: a 2-D emitter of textured quads defined by one particle
// record. It holds up to 512 live particles, steps them by its own timer, emits new ones
// and draws each as a screen quad straight into the device's batch.
#include "core/ParticlesLoader.h"
#include "misc/Vector.h"

#include <cstdint>
#include <functional>
#include <vector>

namespace ox::core {
class CTimerClock;
}

namespace ox::graphics {

class CRenderer;
class CTexture;

constexpr int kMaxLiveParticles = 512;

struct Particle {
    float Rotation, RotationRate1, RotationRate2;  // radians, radians per millisecond
    float Size, SizeRate1, SizeRate2;              // per millisecond
    float Gravity, Wind, RadialAcc, TangentialAcc;
    uint16_t LifeTime, Age;  // milliseconds
    uint8_t StartColor[4], MidColor[4], EndColor[4];  // R, G, B, A
    misc::FloatVector Pos, Velocity;  // velocity in units per second
    int16_t Origin[2];
};
static_assert(sizeof(Particle) == 76);

class CParticleSystem {
public:
    using TextureLookup = std::function<const CTexture*(const char* id)>;
    // How systems find their texture by id; set by whoever holds the declared textures.
    static void SetTextureLookup(TextureLookup lookup);
    // The one generator of every system: a value from 0 to 1, and one from a to b.
    static void SetRandomSeed(uint32_t seed);
    static float Random();
    static float Random(float a, float b);

    // Arms the system with the record of an id from the process-wide table; false (logged
    // on channel "particle") for an unknown id or a record that cannot be run.
    bool LoadById(const char* id);
    bool LoadDesc(const core::ParticleDesc& desc);
    bool IsLoaded() const { return m_Loaded; }
    const core::ParticleDesc& GetDesc() const { return m_Desc; }

    // The clock of Update; not owned.
    void SetTimer(core::CTimerClock* timer) { m_LocalTimer = timer; }
    core::CTimerClock* GetTimer() const { return m_LocalTimer; }
    void PauseTimer(bool pause);
    // Moves the emitter; live particles keep their origin relative to it.
    void SetLocation(float x, float y);
    misc::FloatVector GetLocation() const { return m_Desc.pos; }
    // Steps and emits by the time the timer moved.
    void Update();
    void Step(int dt);
    void Emit(int dt);
    // Runs `total` milliseconds at once in pieces of `step`, as if the system had run.
    void AdvanceTime(int total, int step);
    void Render(CRenderer* renderer);
    void Reset();
    bool IsDead() const;
    int GetLifeParticlesCount() const { return m_ParticlesCount; }
    const Particle* GetParticles() const { return m_Particles.data(); }
    // The cap on live particles.
    int GetCapacity() const { return m_Desc.max_life_particles; }
    void DropOldPos() { m_HasPrevPos = false; }
    unsigned GetFlags() const { return m_Desc.flags; }
    void SetFlags(unsigned flags) { m_Desc.flags = flags; }
    float GetEmission() const { return m_Desc.emission; }
    void SetEmission(float emission);
    misc::FloatVector GetEmiterSize() const { return m_Desc.emiter_size; }
    void SetEmiterSize(const misc::FloatVector& size) { m_Desc.emiter_size = size; }
    // The draw scale of every quad, and an angle the owner adds to the emission direction.
    void SetScale(const misc::FloatVector& scale) { m_Scale = scale; }
    void SetBaseAngle(float angle) { m_BaseAngle = angle; }
    const CTexture* GetTexture() const { return m_Texture; }

private:
    void EmitOne(int i, int count, int dt, const misc::FloatVector& back);
    misc::FloatVector EmitterOffset() const;

    core::ParticleDesc m_Desc;
    std::vector<Particle> m_Particles;
    core::CTimerClock* m_LocalTimer = nullptr;
    const CTexture* m_Texture = nullptr;
    float m_Angle = 0;
    float m_BaseAngle = 0;
    uint32_t m_Age = 0;
    float m_EmitAccumulator = 0;
    misc::FloatVector m_PrevPos;
    bool m_HasPrevPos = false;
    float m_LifeFactor = 1;
    misc::FloatVector m_Scale {1, 1};
    bool m_FirstBurst = true;
    bool m_Loaded = false;
    uint16_t m_ParticlesCount = 0;
};

} // namespace ox::graphics
