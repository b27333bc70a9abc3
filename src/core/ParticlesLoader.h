#pragma once
// The particle records of the game, one fixed-layout record per particle system, looked up
// by id: used in place from properties/particles.bindump, else built from
// properties/particle.xml, else from every properties/particles/*.xml.
#include "graphics/Color.h"
#include "misc/String.h"
#include "misc/Vector.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace ox::core {

// "PAR" and the format version 1 in the top byte.
constexpr uint32_t kParticlesMagic = 0x01524150;
constexpr uint32_t kParticlesVersion = 1;
constexpr const char* kParticlesBindump = "properties/particles.bindump";
constexpr const char* kParticlesXml = "properties/particle.xml";
constexpr const char* kParticlesFolder = "properties/particles/";

enum ParticleFlags : uint32_t {
    ParticleAdditive = 0x200,
    ParticleEndless = 0x800,
    ParticleBurst = 0x1000,
    ParticleFollowMove = 0x2000,
    ParticleEmissionOff = 0x8000,
    ParticleRandomSpin = 0x20000,
    ParticleGravityBySize = 0x40000,
    ParticleGravityDivide = 0x80000,
    ParticleWind = 0x100000,
    ParticleWindBySize = 0x200000,
    ParticleWindDivide = 0x400000,
    ParticleMoveWithEmitter = 0x800000,
    ParticleEmitOnContour = 0x1000000,
    ParticleRadialFromEmitter = 0x2000000,
};

// Start, mid, end, the variation toward mid, and a random base amount.
struct ParticleCurve {
    float start, mid, end, var, base_var;
};

struct ParticleDesc {
    misc::StringA88 id;
    misc::FloatVector pos;
    float direction = 0;  // radians; 0 is up, positive clockwise
    float spread = 0;
    float start_speed_max = 0, start_speed_min = 0;
    float rad_acc_max = 0, rad_acc_min = 0;
    float tang_acc_max = 0, tang_acc_min = 0;
    float grav_max = 0, grav_min = 0;
    float wind_max = 0, wind_min = 0;
    float life_time_max = 0, life_time_min = 0;  // milliseconds
    int32_t max_life_particles = 0;
    float emission = 0;  // per second, or the count of a burst
    float reserved = 0.0001f;
    float system_life_time = 0;  // milliseconds
    uint32_t flags = 0;
    float wind_direction = 0;
    int32_t emiter_type = 0;  // 0 rectangle, 1 ellipse, other a point
    misc::FloatVector emiter_size;
    float emiter_angle = 0;
    ParticleCurve spin {};
    ParticleCurve size {};
    graphics::Color start_color, mid_color, end_color, var_color, base_var_color;
    misc::FloatVector wind;  // unit vector, computed when a system loads
    misc::StringA88 tex_id;
};

static_assert(sizeof(ParticleDesc) == 384);
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
static_assert(offsetof(ParticleDesc, pos) == 96 && offsetof(ParticleDesc, direction) == 104 &&
              offsetof(ParticleDesc, start_speed_max) == 112 && offsetof(ParticleDesc, rad_acc_max) == 120 &&
              offsetof(ParticleDesc, tang_acc_max) == 128 && offsetof(ParticleDesc, grav_max) == 136 &&
              offsetof(ParticleDesc, wind_max) == 144 && offsetof(ParticleDesc, life_time_max) == 152 &&
              offsetof(ParticleDesc, max_life_particles) == 160 && offsetof(ParticleDesc, emission) == 164 &&
              offsetof(ParticleDesc, reserved) == 168 && offsetof(ParticleDesc, system_life_time) == 172 &&
              offsetof(ParticleDesc, flags) == 176 && offsetof(ParticleDesc, wind_direction) == 180 &&
              offsetof(ParticleDesc, emiter_type) == 184 && offsetof(ParticleDesc, emiter_size) == 188 &&
              offsetof(ParticleDesc, emiter_angle) == 196 && offsetof(ParticleDesc, spin) == 200 &&
              offsetof(ParticleDesc, size) == 220 && offsetof(ParticleDesc, start_color) == 240 &&
              offsetof(ParticleDesc, mid_color) == 248 && offsetof(ParticleDesc, end_color) == 256 &&
              offsetof(ParticleDesc, var_color) == 264 && offsetof(ParticleDesc, base_var_color) == 272 &&
              offsetof(ParticleDesc, wind) == 280 && offsetof(ParticleDesc, tex_id) == 288);
#pragma GCC diagnostic pop

// Adds a record for each `particle` element of one XML document. Attributes that cannot be
// read are logged on channel "particle" with the record's id and keep their defaults.
// False when the document cannot be parsed at all.
bool ConvertParticlesXml(const char* xml, size_t size, const char* name, std::vector<ParticleDesc>& records);
// The dump of the records: header, then the records sorted by id, in 32-bit words.
std::vector<uint32_t> BuildParticlesDump(std::vector<ParticleDesc> records);

class CParticlesLoader {
public:
    // Reads through `pack`, or through the process-wide game pack when it is null.
    explicit CParticlesLoader(misc::CGamePack* pack = nullptr);
    ~CParticlesLoader();
    CParticlesLoader(const CParticlesLoader&) = delete;
    CParticlesLoader& operator=(const CParticlesLoader&) = delete;

    // The process-wide loader, made at first use and never destroyed.
    static CParticlesLoader& Instance();

    // Drops the table and reads it again. A dump of another format or size shows a message
    // and leaves no table (the XML is not tried). False when no table stands.
    bool Load();
    // Uses a dump held by the caller (aligned to 4 bytes, outliving the loader) in place.
    bool LoadFromMemory(const void* data, size_t size, const char* name);
    // Keeps the dump of these records.
    void LoadRecords(std::vector<ParticleDesc> records);

    // The record of an id, or null (logged when no table stands).
    const ParticleDesc* Find(const char* id) const;
    // Writes a table built from XML to properties/particles.bindump in the working folder.
    bool Save() const;

    bool IsLoaded() const { return m_Data != nullptr; }
    bool IsBuiltFromXml() const { return m_FromXml; }
    const uint8_t* Data() const { return m_Data; }
    size_t DataSize() const { return m_Size; }
    uint32_t Count() const;
    const ParticleDesc* Records() const;

private:
    void Release();
    bool LoadXml();
    // Why a dump cannot be used, or null.
    static const char* CheckDump(const uint8_t* data, size_t size);

    misc::CGamePack* m_Pack;
    const uint8_t* m_Data = nullptr;
    size_t m_Size = 0;
    const void* m_File = nullptr;  // what the pack gave, to be closed
    std::vector<uint32_t> m_Owned;  // a table built here, or a copy of an unaligned dump
    bool m_FromXml = false;
};

} // namespace ox::core
