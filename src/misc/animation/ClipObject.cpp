#include "misc/animation/ClipObject.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/animation/ClipObjects.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <utility>

namespace ox::misc::anim {

namespace {

constexpr const char* kChannel = "anim";

int AppTime() { return static_cast<int>(ClipTimeManager().GetAppTime()); }

int ClampTime(int64_t time) { return static_cast<int>(std::clamp<int64_t>(time, -kMaxClipTime, kMaxClipTime)); }

// A coefficient brought into 0..1: whole turns dropped, a negative one counted from the end.
float NormaliseCoef(float k)
{
    float x = std::fabs(k);
    if (x > 1.001f)
        x -= std::floor(x);
    return k < 0 ? 1 - x : x;
}

// The coefficient a part `k` of the way from `ka` to `kb`; round a closed path the shorter way.
float PathCoef(float ka, float kb, float k, bool closed)
{
    ka = NormaliseCoef(ka);
    kb = NormaliseCoef(kb);
    if (!closed)
        return ka + (kb - ka) * k;
    const float forward = kb >= ka && kb < 1.001f ? kb - ka : 1 - ka + kb;
    const float back = kb >= 0 && ka >= kb ? ka - kb : 1 - kb + ka;
    return NormaliseCoef(back <= forward ? ka - back * k : ka + forward * k);
}

CPathObject* FindPath(const PathList* paths, const char* id)
{
    if (paths && id)
        for (const auto& path : *paths)
            if (strcmp(path->GetId(), id) == 0)
                return path.get();
    return nullptr;
}

} // namespace

CClipObject::CClipObject() : m_StartTime(AppTime()) {}

CClipObject::CClipObject(const CClipObject& other)
    : m_Path(other.m_Path), m_ClipPaths(other.m_ClipPaths), m_Base(other.m_Base), m_UserFlags(other.m_UserFlags), m_Snap(other.m_Snap),
      m_SoundsDisabled(other.m_SoundsDisabled),
      m_Visible(other.m_Visible), m_OwnStates(other.m_OwnStates), m_AnimationState(other.m_AnimationState),
      m_AnimationType(other.m_AnimationType), m_AnimationDirection(other.m_AnimationDirection),
      m_LastInterpolateTime(other.m_LastInterpolateTime), m_States(other.m_States),
      m_OwnedStates(other.m_OwnedStates), m_Interpolated(other.m_Interpolated), m_StartTime(other.m_StartTime)
{
    if (m_OwnStates)
        m_States = m_OwnedStates.data();
    if (const core::CTimer* timer = other.m_Timer.Get())
        m_Timer = timer->Clone(nullptr);
}

CClipObject::~CClipObject() { StopAllSounds(); }

bool CClipObject::CheckKeyStates(const ClipObjectBase& base, const LoadContext& context) const
{
    auto refuse = [&](const char* why, int t) {
        OX_LOG(kChannel, diag::LogError, "Clip '%s': %s object '%s' is left out: %s (%d)", context.clipId, GetType(),
               base.id.c_str(), why, t);
        return false;
    };
    if (base.keypointsnum > kMaxObjectKeyStates)
        return refuse("it has more key states than 126", base.keypointsnum);
    if (base.keypointsnum == 0 && base.type != PathType)
        return refuse("it has no key state", 0);
    const KeyState* keys = base.KeyStates();
    for (unsigned i = 0; i < base.keypointsnum; ++i) {
        if (keys[i].t < -kMaxClipTime || keys[i].t > kMaxClipTime)
            return refuse("a key's time lies beyond twelve days", keys[i].t);
        if (i > 0 && keys[i].t <= keys[i - 1].t)
            return refuse("its key states are out of order at the time", keys[i].t);
    }
    return true;
}

bool CClipObject::LoadFromBase(const ClipObjectBase* base, const LoadContext& context)
{
    OX_ASSERT(base != 0);
    StopAllSounds();
    ReleaseOwnStates();
    if (!base || !CheckKeyStates(*base, context))
        return false;
    m_States = base->KeyStates();
    OX_ASSERT((size_t)m_States % 4 == 0);
    m_Base = base;
    m_Snap = base->snap != 0;
    m_ClipPaths = context.paths;
    m_Path = base->path.empty() ? nullptr : FindPath(m_ClipPaths, base->path.c_str());
    if (!base->path.empty() && !m_Path)
        OX_LOG(kChannel, diag::LogError, "Clip '%s': object '%s' follows the unknown path '%s'; it moves by its key "
               "states", context.clipId, base->id.c_str(), base->path.c_str());
    PlacePos(base->pos);
    SetPoly(base->contour);
    SetAngle(base->angle);
    SetColor(base->color);
    SetAdditiveBlend(base->additive != 0);
    SetFlipFlags(base->flip);
    m_UserFlags = base->user_flags;
    m_Visible = base->visible != 0;
    m_AnimationType = AnimationTypeOnce;
    m_AnimationDirection = AnimationDirectionForward;
    SetAnimationType(base->anim_type);
    SetAnimationDirection(base->anim_dir);
    if (base->anim_type > AnimationTypePingPong || base->anim_dir > AnimationDirectionBackward)
        OX_LOG(kChannel, diag::LogError, "Clip '%s': object '%s' has the animation type %u and direction %u; "
               "once and forward are used", context.clipId, base->id.c_str(), base->anim_type, base->anim_dir);
    m_StartTime = AppTime();
    return true;
}

CPathObject* CClipObject::LoadPathHelper(const char* id) const { return FindPath(m_ClipPaths, id); }

bool CClipObject::LoadAgain()
{
    if (!m_Base)
        return false;
    LoadBudget budget;
    const LoadContext context {&CClipsLoader::Instance(), "(reloaded)", 0, nullptr, &budget, m_ClipPaths};
    return LoadFromBase(m_Base, context);
}

void CClipObject::PlacePos(const FloatVector& pos)
{
    if (!m_Snap || !m_Path) {
        SetPos(pos);
        return;
    }
    const CPath& path = m_Path->GetCurve();
    FloatVector offset;
    SetPos(path.GetPosByCoef(path.GetCoefByPos(pos, offset)));
}

void CClipObject::SnapToPath(bool snap)
{
    m_Snap = snap;
    if (snap)
        PlacePos(GetPos());
}

void CClipObject::ReleaseOwnStates()
{
    m_OwnedStates.clear();
    m_OwnStates = false;
    m_States = m_Base ? m_Base->KeyStates() : nullptr;
}

const char* CClipObject::GetTypeName(uint32_t type)
{
    static const char* const names[] = {"unknown", "path", "image", "particle", "clip", "text"};
    return type < std::size(names) ? names[type] : names[0];
}

// Controls -------------------------------------------------------------------------------

core::CTimer* CClipObject::Timer()
{
    if (!m_Timer.Get()) {
        core::CTimeManager& time = ClipTimeManager();
        const int raw = GetRawTime();
        m_Timer = time.AttachTimer(time.GetRoot());
        m_Timer.Get()->SetTime(raw > 0 ? static_cast<unsigned>(raw) : 0);
    }
    return m_Timer.Get();
}

int CClipObject::GetRawTime() const
{
    if (const core::CTimer* timer = m_Timer.Get())
        return ClampTime(timer->GetTime());
    return ClampTime(int64_t(AppTime()) - m_StartTime);
}

void CClipObject::Play()
{
    if (m_AnimationState == AnimationStatePaused && GetClipServices().sounds)
        GetClipServices().sounds->Pause(*this, false);
    if (core::CTimer* timer = m_Timer.Get(); timer && timer->IsPaused())
        timer->Pause(false);
    m_LastInterpolateTime = GetRawTime() - 1;
    m_AnimationState = AnimationStatePlaying;
}

void CClipObject::Pause()
{
    if (GetClipServices().sounds)
        GetClipServices().sounds->Pause(*this, true);
    if (EnumKeyStates() && !Timer()->IsPaused())
        Timer()->Pause(true);
    m_AnimationState = AnimationStatePaused;
}

void CClipObject::Stop()
{
    StopAllSounds();
    if (EnumKeyStates()) {
        Timer()->SetTime(0);
        if (!Timer()->IsPaused())
            Timer()->Pause(true);
        m_LastInterpolateTime = -1;
    }
    m_AnimationState = AnimationStateStopped;
}

void CClipObject::MoveTime(int time, bool apply)
{
    if (!EnumKeyStates())
        return;
    if (core::CTimer* timer = m_Timer.Get())
        timer->SetTime(static_cast<unsigned>(std::clamp(time, 0, kMaxClipTime)));
    else
        m_StartTime = ClampTime(int64_t(AppTime()) - ClampTime(time));
    if (apply)
        Interpolate();
}

void CClipObject::SetTime(int time, bool apply)
{
    if (!EnumKeyStates())
        return;
    MoveTime(time, false);
    m_LastInterpolateTime = GetRawTime() - 1;
    if (apply)
        Interpolate();
}

void CClipObject::DisableSounds(bool disable)
{
    if (disable == m_SoundsDisabled)
        return;
    m_SoundsDisabled = disable;
    if (GetClipServices().sounds)
        GetClipServices().sounds->Mute(*this, disable);
}

void CClipObject::StopAllSounds()
{
    if (GetClipServices().sounds)
        GetClipServices().sounds->StopAll(*this);
}

void CClipObject::SetAnimationType(unsigned type)
{
    if (type <= AnimationTypePingPong)
        m_AnimationType = static_cast<uint8_t>(type);
}

void CClipObject::SetAnimationDirection(unsigned direction)
{
    if (direction <= AnimationDirectionBackward)
        m_AnimationDirection = static_cast<uint8_t>(direction);
}

// Keys -------------------------------------------------------------------------------------

int CClipObject::GetPeriodTime() const
{
    if (!EnumKeyStates())
        return 0;
    const int last = m_States[EnumKeyStates() - 1].t;
    return m_AnimationType == AnimationTypePingPong ? 2 * last : last;
}

int CClipObject::GetTime() const
{
    if (!EnumKeyStates())
        return 0;
    const int L = m_States[EnumKeyStates() - 1].t;
    const int T = GetRawTime();
    if (L <= 0)
        return 0;
    const bool backward = m_AnimationDirection == AnimationDirectionBackward;
    if (m_AnimationType == AnimationTypeOnce) {
        const int v = T < 0 ? 0 : (T > L ? L : T);
        return backward ? L - v : v;
    }
    if (m_AnimationType == AnimationTypeLoop) {
        int v = T % L;
        if (T != 0 && v == 0)
            v = L;
        return backward ? L - v : v;
    }
    int v = T % (2 * L);
    if (T != 0 && v == 0)
        v = 2 * L;
    if (backward)
        return v > L ? v - L : L - v;
    return v <= L ? v : 2 * L - v;
}

const KeyState* CClipObject::FindKeyState(int t) const
{
    for (unsigned i = 0; i < EnumKeyStates(); ++i)
        if (m_States[i].t == t)
            return &m_States[i];
    return nullptr;
}

KeyState* CClipObject::FindKeyStateForEdit(int t)
{
    if (!m_OwnStates && EnumKeyStates()) {
        m_OwnedStates.assign(m_States, m_States + EnumKeyStates());
        m_States = m_OwnedStates.data();
        m_OwnStates = true;
    }
    return const_cast<KeyState*>(FindKeyState(t));
}

KeyState CClipObject::GetState() const
{
    KeyState state {};
    state.pos = GetPos();
    state.contour = GetPoly();
    state.angle = GetAngle();
    state.color = GetColor();
    state.flip = GetFlipFlags();
    state.custom = GetCustomFlags();
    if (m_Snap && m_Path) {
        FloatVector offset;
        state.k = m_Path->GetCurve().GetCoefByPos(GetPos(), offset);
    }
    return state;
}

std::string CClipObject::GetSound(int t) const
{
    if (!m_Base)
        return {};
    const SoundPoint* sounds = m_Base->SoundPoints();
    for (unsigned i = 0; i < m_Base->soundpointsnum; ++i)
        if (sounds[i].k == t)
            return sounds[i].id.str();
    return {};
}

// The time line ----------------------------------------------------------------------------

void CClipObject::Interpolate()
{
    if (!EnumKeyStates())
        return;
    const int time = GetRawTime();
    if (m_AnimationState == AnimationStateStopped)
        InterpolateStopped(time);
    else
        InterpolatePlaying(time);
}

void CClipObject::InterpolateStopped(int time)
{
    const int n = static_cast<int>(EnumKeyStates());
    if (n == 1) {
        ApplyState(m_States[0], -1, -1);
        return;
    }
    if (time > m_States[n - 1].t) {
        ApplyPiece(n - 1, n - 1, 0.5f);
        return;
    }
    for (int i = 0; i + 1 < n; ++i) {
        const KeyState& a = m_States[i];
        const KeyState& b = m_States[i + 1];
        if (a.t <= time && time <= b.t) {
            OX_CHECK_DATA(!a.itpl || b.t > a.t);
            ApplyPiece(i, i + 1, a.itpl ? static_cast<float>(time - a.t) / static_cast<float>(b.t - a.t) : 0.0f);
            return;
        }
    }
    m_LastInterpolateTime = time;
}

bool CClipObject::Advance(Walk& walk) const
{
    if (walk.cursor == walk.last) {
        if (m_AnimationType == AnimationTypeOnce)
            return false;
        if (m_AnimationType == AnimationTypeLoop) {
            // No time passes between the last key and the first.
            walk.cursor = walk.first;
            return true;
        }
        std::swap(walk.first, walk.last);
        walk.dir = -walk.dir;
    }
    if (walk.cursor == walk.last)
        return true;
    const int next = walk.cursor + walk.dir;
    walk.base += static_cast<int64_t>(m_States[next].t - m_States[walk.cursor].t) * walk.dir;
    walk.cursor = next;
    return true;
}

void CClipObject::InterpolatePlaying(int time)
{
    const int n = static_cast<int>(EnumKeyStates());
    if (n == 1) {
        if (m_LastInterpolateTime == -1)
            ApplyState(m_States[0], 0, -1);
        m_LastInterpolateTime = time;
        return;
    }
    if (time < m_LastInterpolateTime) {
        // A clock set back by hand: the keys from there on play again.
        OX_LOG(kChannel, diag::LogWarning, "Clip object '%s': its time went back from %d to %d", GetId(),
               m_LastInterpolateTime, time);
        m_LastInterpolateTime = time - 1;
    }
    // Key times edited out of order: a pass of the walk must take time, or it never ends.
    OX_CHECK_DATA(m_States[n - 1].t > m_States[0].t);
    Walk walk {0, n - 1, 1, 0, 0};
    if (m_AnimationDirection == AnimationDirectionBackward) {
        std::swap(walk.first, walk.last);
        walk.dir = -1;
    }
    walk.cursor = walk.first;
    const int period = GetPeriodTime();
    if (m_LastInterpolateTime != -1 && m_AnimationType != AnimationTypeOnce && period > 0)
        walk.base = static_cast<int64_t>(m_LastInterpolateTime / period) * period;
    // Keys reached by an earlier call.
    while (walk.base <= m_LastInterpolateTime)
        if (!Advance(walk))
            return;
    // Keys reached now, each applied with its sound.
    while (walk.base <= time) {
        const KeyState& key = m_States[walk.cursor];
        ApplyState(key, key.t, static_cast<int>(walk.base));
        if (!Advance(walk)) {
            m_LastInterpolateTime = time;
            return;
        }
    }
    // On the way from the key before toward the key at hand.
    const int prev = walk.cursor - walk.dir;
    if (prev >= 0 && prev < n) {
        const int delta = std::abs(m_States[walk.cursor].t - m_States[prev].t);
        const int64_t start = walk.base - delta;
        OX_CHECK_DATA(delta > 0);
        if (time != start && m_States[prev].itpl)
            ApplyPiece(prev, walk.cursor, static_cast<float>(time - start) / static_cast<float>(delta));
    }
    m_LastInterpolateTime = time;
}

void CClipObject::ApplyPiece(int from, int to, float k)
{
    m_CurrentPieceAnimation[0] = &m_States[from];
    m_CurrentPieceAnimation[1] = &m_States[to];
    InterpolateState(k);
    ApplyState(m_Interpolated, -1, -1);
}

void CClipObject::InterpolateState(float k)
{
    const KeyState& a = *m_CurrentPieceAnimation[0];
    const KeyState& b = *m_CurrentPieceAnimation[1];
    OX_ASSERT((size_t)m_CurrentPieceAnimation[0] % 4 == 0);
    KeyState& out = m_Interpolated;
    out.pos = a.pos + (b.pos - a.pos) * k;
    out.k = m_Path ? PathCoef(a.k, b.k, k, m_Path->GetCurve().IsClosed()) : 0.0f;
    out.angle = a.angle + (b.angle - a.angle) * k;
    out.flip = k <= 0.999f ? a.flip : b.flip;
    // A custom flag shows only at the ends of a piece, so that the game can see its edge.
    out.custom = k > 0.999f ? b.custom : (k < 0.001f ? a.custom : 0);
    // Truncated toward zero, in double precision.
    auto channel = [k](int16_t x, int16_t y) { return static_cast<int16_t>(x + (y - x) * double(k)); };
    out.color = graphics::Color(channel(a.color.Red, b.color.Red), channel(a.color.Green, b.color.Green),
                                channel(a.color.Blue, b.color.Blue), channel(a.color.Alpha, b.color.Alpha));
    for (int i = 0; i < 4; ++i)
        out.contour[i] = a.contour[i] + (b.contour[i] - a.contour[i]) * k;
}

void CClipObject::ApplyState(const KeyState& state, int keyTime, int baseTime)
{
    if (m_Snap && m_Path)
        SetPos(m_Path->GetCurve().GetPosByCoef(state.k));
    else
        SetPos(state.pos);
    SetPoly(state.contour);
    SetAngle(state.angle);
    SetColor(state.color);
    SetFlipFlags(state.flip);
    SetCustomFlags(state.custom);
    IClipSoundPlayer* sounds = GetClipServices().sounds;
    if (m_SoundsDisabled || keyTime == -1 || !m_Base || !sounds)
        return;
    const SoundPoint* points = m_Base->SoundPoints();
    for (unsigned i = 0; i < m_Base->soundpointsnum; ++i) {
        if (points[i].k != keyTime || points[i].id.empty())
            continue;
        const int lag = baseTime != -1 ? GetRawTime() - baseTime : 0;
        OX_ASSERT(lag >= 0);
        sounds->Play(*this, points[i].id.c_str(), lag);
        return;
    }
}

} // namespace ox::misc::anim
