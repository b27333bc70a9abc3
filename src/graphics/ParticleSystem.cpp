#include "graphics/ParticleSystem.h"

#include "core/TimeManager.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace ox::graphics {

namespace {

using core::ParticleDesc;
using misc::FloatVector;
constexpr const char* kChannel = "particle";
// A step emits at most this many: the cap stops the walk long before.
constexpr double kMaxEmitPerStep = 8 * kMaxLiveParticles;

CParticleSystem::TextureLookup g_TextureLookup;
uint32_t g_Seed = 7;

bool Has(const ParticleDesc& d, uint32_t flag) { return (d.flags & flag) != 0; }

// Normalised, unless both coordinates are tiny, when it stays as it is.
FloatVector Direction(const FloatVector& v)
{
    if (std::fabs(v.X) <= 0.0001f && std::fabs(v.Y) <= 0.0001f)
        return v;
    const float k = 1.0f / std::sqrt(v.X * v.X + v.Y * v.Y);
    return {v.X * k, v.Y * k};
}

// Extreme but finite records can make a value NaN on the way (infinity less infinity): it
// counts as 0 rather than reaching a conversion that is undefined for it.
uint8_t Channel(float value) { return value >= 255 ? 255 : value > 0 ? static_cast<uint8_t>(value) : 0; }

int16_t Coordinate(float value)
{
    return std::isnan(value) ? 0 : static_cast<int16_t>(std::clamp(value, -32768.0f, 32767.0f));
}

// Every number of a record that is read as a float is finite.
bool IsFinite(const ParticleDesc& d)
{
    const float values[] = {d.pos.X, d.pos.Y, d.direction, d.spread, d.start_speed_max, d.start_speed_min,
                            d.rad_acc_max, d.rad_acc_min, d.tang_acc_max, d.tang_acc_min, d.grav_max, d.grav_min,
                            d.wind_max, d.wind_min, d.life_time_max, d.life_time_min, d.emission,
                            d.system_life_time, d.wind_direction, d.emiter_size.X, d.emiter_size.Y,
                            d.emiter_angle, d.spin.start, d.spin.mid, d.spin.end, d.spin.var, d.spin.base_var,
                            d.size.start, d.size.mid, d.size.end, d.size.var, d.size.base_var};
    return std::all_of(std::begin(values), std::end(values), [](float v) { return std::isfinite(v); });
}

} // namespace

void CParticleSystem::SetTextureLookup(TextureLookup lookup) { g_TextureLookup = std::move(lookup); }

void CParticleSystem::SetRandomSeed(uint32_t seed) { g_Seed = seed; }

float CParticleSystem::Random()
{
    g_Seed *= 16807u;
    return static_cast<float>(((g_Seed >> 16) & 0x7FFF) * 3.0518509447574615e-5);
}

float CParticleSystem::Random(float a, float b) { return Random() * (b - a) + a; }

bool CParticleSystem::LoadById(const char* id)
{
    if (!id || !*id)
        return false;
    const ParticleDesc* desc = core::CParticlesLoader::Instance().Find(id);
    if (!desc) {
        OX_LOG(kChannel, diag::LogError, "cannot load particle: %s", id);
        return false;
    }
    return LoadDesc(*desc);
}

bool CParticleSystem::LoadDesc(const ParticleDesc& desc)
{
    m_Loaded = false;
    m_Particles.clear();
    m_ParticlesCount = 0;
    if (!IsFinite(desc)) {
        OX_LOG(kChannel, diag::LogError, "particle '%s' holds a number that is not finite; it is not used",
               desc.id.c_str());
        return false;
    }
    m_Desc = desc;
    m_HasPrevPos = false;
    m_Desc.wind = {std::cos(desc.wind_direction), std::sin(desc.wind_direction)};
    m_Texture = nullptr;
    if (!desc.tex_id.empty()) {
        m_Texture = g_TextureLookup ? g_TextureLookup(desc.tex_id.c_str()) : nullptr;
        if (!m_Texture)
            OX_LOG(kChannel, diag::LogWarning, "texture not found: %s (particle '%s')", desc.tex_id.c_str(),
                   desc.id.c_str());
    }
    // The cap: what the emission rate and the life of a particle can fill, at most 512.
    m_LifeFactor = 1.0f;
    if (!Has(desc, core::ParticleBurst)) {
        const float life = Has(desc, core::ParticleEndless) ? desc.life_time_max
                                                             : std::min(desc.system_life_time, desc.life_time_max);
        m_LifeFactor = life / 1000.0f * 1.5f;
    }
    double n = std::trunc(double(m_LifeFactor) * desc.emission);
    if (desc.max_life_particles < n) {
        n = desc.max_life_particles;
        m_LifeFactor = -1.0f;
    }
    if (n < 0 || n > kMaxLiveParticles)
        n = kMaxLiveParticles;
    m_Desc.max_life_particles = static_cast<int32_t>(n);
    if (desc.emission < 0 || desc.emission > 1e6f)
        OX_LOG(kChannel, diag::LogWarning, "particle '%s': the emission %g is out of reason; the cap is %d",
               desc.id.c_str(), desc.emission, m_Desc.max_life_particles);
    m_Age = 0;
    m_EmitAccumulator = 0;
    m_FirstBurst = true;
    m_Loaded = true;
    return true;
}

void CParticleSystem::PauseTimer(bool pause)
{
    if (m_LocalTimer && m_LocalTimer->IsPaused() != pause)
        m_LocalTimer->Pause(pause);
}

void CParticleSystem::SetEmission(float emission)
{
    if (!(emission >= 0))
        emission = 0;
    if (emission > 0 && m_LifeFactor > 0) {
        const double n = std::trunc(double(m_LifeFactor) * emission);
        if (n > m_Desc.max_life_particles)
            m_Desc.max_life_particles = static_cast<int32_t>(std::min<double>(n, kMaxLiveParticles));
    }
    m_Desc.emission = emission;
}

void CParticleSystem::SetLocation(float x, float y)
{
    const FloatVector old = m_Desc.pos;
    const FloatVector moved = FloatVector(x, y) - old;
    const bool carry = Has(m_Desc, core::ParticleMoveWithEmitter);
    for (int i = 0; i < m_ParticlesCount; ++i) {
        Particle& p = m_Particles[i];
        p.Origin[0] = Coordinate(p.Origin[0] + moved.X);
        p.Origin[1] = Coordinate(p.Origin[1] + moved.Y);
        if (carry)
            p.Pos += moved;
    }
    m_Angle = 0;
    if (Has(m_Desc, core::ParticleFollowMove) && (std::fabs(moved.X) > 0.0001f || std::fabs(moved.Y) >= 0.0001f)) {
        const FloatVector n = Direction({moved.X, -moved.Y});
        const float lengths = std::hypot(n.X, n.Y);
        const float cosine = lengths < 0.0001f ? 0.0f : std::clamp(-n.Y / lengths, -1.0f, 1.0f);
        const float a = std::acos(cosine);
        m_Angle = n.X > 0 ? -a : a;
    }
    m_PrevPos = m_HasPrevPos ? old : FloatVector(x, y);
    m_HasPrevPos = true;
    m_Desc.pos = {x, y};
}

void CParticleSystem::Update()
{
    OX_CHECK_DATA(m_LocalTimer && "You should set a timer for CParticleSystem");
    if (!m_Loaded)
        return;
    const int dt = std::max(0, m_LocalTimer->GetFrameDelta());
    Step(dt);
    Emit(dt);
}

void CParticleSystem::Step(int dt)
{
    const float ms = static_cast<float>(dt), s = ms / 1000.0f;
    const ParticleDesc& d = m_Desc;
    const bool fromEmitter = Has(d, core::ParticleRadialFromEmitter), wind = Has(d, core::ParticleWind);
    const bool windBySize = Has(d, core::ParticleWindBySize), windDivide = Has(d, core::ParticleWindDivide);
    const bool gravityBySize = Has(d, core::ParticleGravityBySize);
    const bool gravityDivide = Has(d, core::ParticleGravityDivide);
    for (int i = 0; i < m_ParticlesCount;) {
        Particle& p = m_Particles[i];
        const int age = p.Age + dt;
        if (age > p.LifeTime) {
            p = m_Particles[--m_ParticlesCount];
            continue;
        }
        p.Age = static_cast<uint16_t>(age);
        const bool late = p.Age >= (p.LifeTime >> 1);
        p.Rotation += (late ? p.RotationRate2 : p.RotationRate1) * ms;
        p.Size += (late ? p.SizeRate2 : p.SizeRate1) * ms;
        const FloatVector centre = fromEmitter ? d.pos : FloatVector(p.Origin[0], p.Origin[1]);
        const FloatVector r = Direction(p.Pos - centre);
        FloatVector acc = r * p.RadialAcc + FloatVector(-r.Y, r.X) * p.TangentialAcc;
        const bool bySizeOk = p.Size > 0.00001f;
        if (wind) {
            const FloatVector w = d.wind * p.Wind;
            if (!windBySize)
                acc += w;
            else if (bySizeOk)
                acc += windDivide ? w * (1.0f / p.Size) : w * p.Size;
        }
        p.Velocity += acc * s;
        if (!gravityBySize)
            p.Velocity.Y += p.Gravity * s;
        else if (bySizeOk)
            p.Velocity.Y += gravityDivide ? p.Gravity * s / p.Size : p.Size * p.Gravity * s;
        p.Pos += p.Velocity * s;
        ++i;
    }
    m_Age += static_cast<uint32_t>(dt);
    if (m_ParticlesCount == 0 && !m_Particles.empty())
        std::vector<Particle>().swap(m_Particles);
}

void CParticleSystem::Emit(int dt)
{
    const ParticleDesc& d = m_Desc;
    if (!Has(d, core::ParticleFollowMove))
        m_Angle = 0;
    double count = 0;
    if (Has(d, core::ParticleBurst)) {
        if (m_FirstBurst)
            count = std::trunc(d.emission);
        m_FirstBurst = false;
    } else if (!Has(d, core::ParticleEndless) && d.system_life_time <= m_Age) {
        count = 0;
    } else {
        m_EmitAccumulator += static_cast<float>(dt);
        if (d.emission > 0 && !Has(d, core::ParticleEmissionOff)) {
            const float interval = 1000.0f / d.emission;
            count = std::trunc(m_EmitAccumulator / interval);
            m_EmitAccumulator -= static_cast<float>(count * interval);
            // Extreme rates can make both infinite: nothing is emitted and the count starts over.
            if (!std::isfinite(m_EmitAccumulator) || std::isnan(count)) {
                m_EmitAccumulator = 0;
                count = 0;
            }
        } else {
            m_EmitAccumulator = 0;
        }
    }
    const int n = static_cast<int>(std::clamp(count, 0.0, kMaxEmitPerStep));
    if (n <= 0 || d.max_life_particles <= 0)
        return;
    if (m_Particles.size() < static_cast<size_t>(d.max_life_particles))
        m_Particles.resize(d.max_life_particles);
    const FloatVector back = m_PrevPos - d.pos;
    for (int i = 0; i < n; ++i) {
        const float t = static_cast<float>(i) / n * dt;
        if (d.life_time_max < t)
            continue;
        if (m_ParticlesCount >= d.max_life_particles)
            break;
        EmitOne(i, n, dt, back);
    }
}

FloatVector CParticleSystem::EmitterOffset() const
{
    const float w = m_Desc.emiter_size.X, h = m_Desc.emiter_size.Y;
    const bool contour = Has(m_Desc, core::ParticleEmitOnContour);
    if (m_Desc.emiter_type == 0 && !contour) {
        const float x = Random() * w - w / 2;
        return {x, Random() * h - h / 2};
    }
    if (m_Desc.emiter_type == 0) {
        // A walk round the outline from the top left corner.
        const float r = Random() * (2 * w + 2 * h);
        if (r < w)
            return {-w / 2 + (w - r), -h / 2};
        if (r < w + h)
            return {w / 2, -h / 2 + (w + h - r)};
        if (r < 2 * w + h)
            return {-w / 2 + w - (2 * w + h - r), h / 2};
        return {-w / 2, -h / 2 + h - (2 * w + 2 * h - r)};
    }
    if (m_Desc.emiter_type == 1 && contour) {
        const float a = Random() * 6.29f;
        return {std::cos(a) * w / 2, std::sin(a) * h / 2};
    }
    if (m_Desc.emiter_type == 1) {
        for (int tries = 0; tries < 3; ++tries) {
            const float x = Random() * w - w / 2;
            const float y = Random() * h - h / 2;
            const float qx = w != 0 ? x / (w / 2) : 0.0f, qy = h != 0 ? y / (h / 2) : 0.0f;
            if (qx * qx + qy * qy <= 1)
                return {x, y};
        }
        const float a = Random() * 3.145f;
        const float x = std::cos(a) * w / 2, y0 = std::fabs(std::sin(a) * h / 2);
        return {x, y0 - Random() * 2 * y0};
    }
    return {0, 0};
}

void CParticleSystem::EmitOne(int i, int count, int dt, const FloatVector& back)
{
    const ParticleDesc& d = m_Desc;
    Particle& p = m_Particles[m_ParticlesCount++];
    const float share = static_cast<float>(i) / count;
    p.Age = static_cast<uint16_t>(share * dt);

    const FloatVector offset = EmitterOffset();
    const float dist = std::hypot(offset.X, offset.Y);
    const FloatVector u = Direction(offset);
    const float alpha = d.emiter_angle - m_Angle - m_BaseAngle, c = std::cos(alpha), s = std::sin(alpha);
    p.Pos = d.pos + FloatVector(u.X * c + u.Y * s, u.Y * c - u.X * s) * dist;
    if (m_HasPrevPos)
        p.Pos += back * share;
    p.Origin[0] = Coordinate(p.Pos.X);
    p.Origin[1] = Coordinate(p.Pos.Y);

    p.RadialAcc = Random(d.rad_acc_min, d.rad_acc_max);
    p.Gravity = Random(d.grav_min, d.grav_max);
    p.Wind = Has(d, core::ParticleWind) ? Random(d.wind_min, d.wind_max) : 0.0f;
    p.TangentialAcc = Random(d.tang_acc_min, d.tang_acc_max);

    const float theta = d.direction + m_Angle + m_BaseAngle - d.spread / 2 + Random() * d.spread;
    const float speed = Random(d.start_speed_min, d.start_speed_max);
    p.Velocity = {std::sin(theta) * speed, -std::cos(theta) * speed};

    const float life = Random(d.life_time_min, d.life_time_max);
    p.LifeTime = life < 65500 ? static_cast<uint16_t>(std::max(life, 0.0f)) : 65500;
    // A particle of no half life stands at its end: its rates are 0.
    const float half = p.LifeTime / 2.0f;
    auto rate = [half](float change) { return half > 0 ? change / half : 0.0f; };

    const int16_t* start = &d.start_color.Red;
    const int16_t* mid = &d.mid_color.Red;
    const int16_t* end = &d.end_color.Red;
    const int16_t* var = &d.var_color.Red;
    const int16_t* base = &d.base_var_color.Red;
    for (int ch = 0; ch < 4; ++ch) {
        const float b = Random() * base[ch];
        p.StartColor[ch] = Channel(Random(start[ch], start[ch] + (mid[ch] - start[ch]) * var[ch] / 255.0f) + b);
        p.MidColor[ch] = Channel(mid[ch] + b);
        p.EndColor[ch] = Channel(end[ch] + b);
    }

    const core::ParticleCurve& size = d.size;
    float b = Random() * size.base_var;
    p.Size = Random(size.start, size.start + (size.mid - size.start) * size.var) + b;
    p.SizeRate1 = rate(b + size.mid - p.Size);
    p.SizeRate2 = rate(size.end - size.mid);

    const core::ParticleCurve& spin = d.spin;
    const float a = m_Angle + m_BaseAngle;
    b = Random() * spin.base_var;
    p.Rotation = Random(spin.start + a, spin.start + a + (spin.mid - spin.start) * spin.var) + b;
    p.RotationRate1 = rate(b + spin.mid + a - p.Rotation);
    p.RotationRate2 = rate(spin.end - spin.mid);
    if (Has(d, core::ParticleRandomSpin) && Random() > 0.5f) {
        p.RotationRate1 = -p.RotationRate1;
        p.RotationRate2 = -p.RotationRate2;
    }
}

void CParticleSystem::AdvanceTime(int total, int step)
{
    if (total <= 0 || !m_Loaded)
        return;
    step = std::max(step, 1);
    if (m_LocalTimer)
        m_LocalTimer->SetTime(m_LocalTimer->GetTime() + static_cast<unsigned>(total));
    int done = 0;
    for (; done + step <= total; done += step) {
        Step(step);
        Emit(step);
    }
    if (done < total) {
        Step(total - done);
        Emit(total - done);
    }
}

void CParticleSystem::Render(CRenderer* renderer)
{
    if (!m_Texture || !renderer || m_ParticlesCount == 0)
        return;
    CSurface* surface = m_Texture->GetSurface();
    CRendererState& state = renderer->GetState();
    const Color& current = state.GetColor();
    if (current.Alpha == 0)
        return;
    const misc::FloatMatrix& m = state.GetTransform();
    RenderDevice& device = renderer->GetDevice();
    device.SetPixelShader(state.GetPixelShader());
    device.SetBlendMode(Has(m_Desc, core::ParticleAdditive) ? BlendAdditive : BlendNormal);
    device.SetTexture(0, surface ? surface->GetD3DTexture() : nullptr);
    const float k[4] = {current.Red / 255.0f, current.Green / 255.0f, current.Blue / 255.0f, current.Alpha / 255.0f};
    const float qw = m_Texture->GetWidth() * m_Scale.X, qh = m_Texture->GetHeight() * m_Scale.Y;
    const bool animated = m_Texture->IsAnimated();
    const UVRect still = m_Texture->GetFrameSurfaceRect(0);
    // Without a clip the quads go to the device ten at a time; with one, each is cut first.
    const bool clip = state.GetClipPoly() != nullptr;
    Vertex buffer[MaxClipVertices];
    unsigned filled = 0;
    for (int i = 0; i < m_ParticlesCount; ++i) {
        const Particle& p = m_Particles[i];
        if (p.Size < 0.1f)
            continue;
        const UVRect uv = animated ? m_Texture->GetFrameSurfaceRect(m_Texture->GetFrameByTime(p.Age)) : still;
        // The corner offsets, turned about the particle when it is turned.
        const float hw = qw / 2 * p.Size, hh = qh / 2 * p.Size;
        float c = 1, s = 0;
        if (std::fabs(p.Rotation) > 0.01f) {
            c = std::cos(p.Rotation);
            s = std::sin(p.Rotation);
        }
        const int half = p.LifeTime >> 1;
        const bool late = p.Age >= half;
        // A particle emitted past its own life within a step stands at its end colour.
        const float t = half == 0 ? 1.0f : std::min(late ? float(p.Age - half) / half : float(p.Age) / half, 1.0f);
        const uint8_t* from = late ? p.MidColor : p.StartColor;
        const uint8_t* to = late ? p.EndColor : p.MidColor;
        uint32_t channel[4];
        for (int ch = 0; ch < 4; ++ch)
            channel[ch] = Channel((from[ch] + (to[ch] - from[ch]) * t) * k[ch]);
        const uint32_t diffuse = channel[3] << 24 | channel[0] << 16 | channel[1] << 8 | channel[2];
        auto corner = [&](float dx, float dy, float tu, float tv) {
            const float x = p.Pos.X + dx * c - dy * s, y = p.Pos.Y + dx * s + dy * c;
            return Vertex {x * m.m[0][0] + y * m.m[1][0] + m.m[2][0], x * m.m[0][1] + y * m.m[1][1] + m.m[2][1],
                           0.0f, 1.0f, diffuse, 0u, tu, tv};
        };
        Vertex* v = buffer + filled;
        v[0] = corner(-hw, -hh, uv.u1, uv.v1);
        v[1] = corner(hw, -hh, uv.u2, uv.v1);
        v[2] = corner(-hw, hh, uv.u1, uv.v2);
        v[3] = v[2];
        v[4] = v[1];
        v[5] = corner(hw, hh, uv.u2, uv.v2);
        if (!clip) {
            filled += 6;
            if (filled + 6 > MaxClipVertices) {
                device.Draw(PrimitiveTriangleList, buffer, filled);
                filled = 0;
            }
            continue;
        }
        unsigned count = 6;
        state.ClipVertices(buffer, count);
        if (count >= 3)
            device.Draw(PrimitiveTriangleList, buffer, count);
    }
    if (filled)
        device.Draw(PrimitiveTriangleList, buffer, filled);
}

void CParticleSystem::Reset()
{
    if (m_LocalTimer)
        m_LocalTimer->SetTime(0);
    m_Age = 0;
    m_FirstBurst = true;
    m_ParticlesCount = 0;
}

bool CParticleSystem::IsDead() const
{
    if (Has(m_Desc, core::ParticleBurst))
        return m_ParticlesCount == 0;
    if (Has(m_Desc, core::ParticleEndless))
        return false;
    return m_Age > m_Desc.system_life_time && m_ParticlesCount == 0;
}

} // namespace ox::graphics
