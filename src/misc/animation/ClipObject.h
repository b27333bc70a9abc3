#pragma once
// One object of a running clip. It walks the key states of its record on its own time
// line, writes position, contour, angle, colour and flags to itself and reaches its sound
// points; the kinds of object below it decide how that is drawn.
#include "core/TimeManager.h"
#include "graphics/Color.h"
#include "misc/Location.h"
#include "misc/animation/ClipFormat.h"

#include <memory>
#include <string>
#include <vector>

namespace ox::graphics {
class CRenderer;
}

namespace ox::misc::anim {

class CClipsLoader;
class CPathObject;

enum AnimationType : uint8_t { AnimationTypeOnce = 0, AnimationTypeLoop = 1, AnimationTypePingPong = 2 };
enum AnimationDirection : uint8_t { AnimationDirectionForward = 0, AnimationDirectionBackward = 1 };
enum AnimationState : uint8_t { AnimationStatePlaying = 0, AnimationStatePaused = 1, AnimationStateStopped = 2 };
enum FlipFlags : unsigned { FlipHorizontal = 1, FlipVertical = 2 };

// An object keeps at most this many key states.
constexpr unsigned kMaxObjectKeyStates = 126;
// Key times and an object's clock stay within this many milliseconds either side of 0
// (twelve days), so that twice a period and every difference of times fit in 32 bits.
constexpr int kMaxClipTime = 1 << 30;

// How many objects one clip may build, the clips nested in it included: nesting repeats
// clips, and a dump could otherwise ask for more than any memory holds.
constexpr unsigned kMaxClipObjects = 20000;

struct LoadBudget {
    unsigned left = kMaxClipObjects;
    bool reported = false;
};

// What loading an object needs beside its record.
using PathList = std::vector<std::unique_ptr<CPathObject>>;

struct LoadContext {
    const CClipsLoader* loader;  // nested clips come from the same bulk
    const char* clipId;          // names the clip in log lines
    int depth;                   // how deep in nested clips this clip is
    const LoadContext* parent;   // the clip this one is nested in, or null
    LoadBudget* budget;          // shared by a clip and everything nested in it
    // The paths of the clip, which objects follow by id.
    const PathList* paths = nullptr;
};

class CClipObject {
public:
    virtual ~CClipObject();
    CClipObject& operator=(const CClipObject&) = delete;

    virtual void Draw(graphics::CRenderer* renderer) = 0;
    virtual void Update() {}
    virtual std::string GetResourceId() const { return {}; }
    virtual FloatVector GetPos() const = 0;
    virtual void SetPos(const FloatVector& pos) = 0;
    virtual void SetPoly(const Poly4& poly) = 0;
    virtual Poly4 GetPoly() const = 0;
    virtual void ResetPoly() = 0;
    virtual void SetAngle(float angle) = 0;
    virtual float GetAngle() const = 0;
    virtual void SetColor(const graphics::Color& color) = 0;
    virtual graphics::Color GetColor() const = 0;
    virtual void SetAdditiveBlend(bool additive) = 0;
    virtual bool IsAdditiveBlend() const = 0;
    virtual unsigned GetFlipFlags() const = 0;
    virtual void SetFlipFlags(unsigned flags) = 0;
    virtual void AddFlipFlags(unsigned flags) { SetFlipFlags(GetFlipFlags() | flags); }
    virtual void RemFlipFlags(unsigned flags) { SetFlipFlags(GetFlipFlags() & ~flags); }
    virtual unsigned GetCustomFlags() const = 0;
    virtual void SetCustomFlags(unsigned flags) = 0;
    void AddCustomFlags(unsigned flags) { SetCustomFlags(GetCustomFlags() | flags); }
    void RemCustomFlags(unsigned flags) { SetCustomFlags(GetCustomFlags() & ~flags); }
    virtual Location GetLocation() const { return {GetPos(), GetPoly(), GetAngle()}; }
    virtual bool IsContains(const FloatVector& point) const { return IsPointInPoly4(GetLocation().GetPoly(), point); }
    // Looks up again what the object takes by id (texture, font, text, clip).
    virtual void Reload() {}
    // Takes the object's record; false (logged with the clip's id) when it cannot be used.
    virtual bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context);
    virtual const char* GetType() const = 0;
    virtual CClipObject* Clone() const = 0;

    virtual void DisableSounds(bool disable);
    virtual void StopAllSounds();
    // Moves the time line to `time`; SetTime also counts every key since then as unplayed,
    // MoveTime reaches (and sounds) the keys between.
    virtual void SetTime(int time, bool apply);
    virtual void MoveTime(int time, bool apply);
    virtual void Play();
    virtual void Pause();
    virtual void Stop();

    // Walks the time line to the present and applies what it reaches.
    void Interpolate();
    // Milliseconds on the object's own clock.
    int GetRawTime() const;
    int GetLastInterpolateTime() const { return m_LastInterpolateTime; }
    // The last key's time; twice that for ping-pong; 0 without keys.
    int GetPeriodTime() const;
    // Where in the period the object stands.
    int GetTime() const;

    unsigned EnumKeyStates() const { return m_Base ? m_Base->keypointsnum : 0; }
    const KeyState* GetKeyStates() const { return m_States; }
    const KeyState* FindKeyState(int t) const;
    // The same, for a change: the key states are first copied into the object.
    KeyState* FindKeyStateForEdit(int t);
    // The present state as a key at time 0.
    KeyState GetState() const;
    // The id of the sound point at `t`, or empty.
    std::string GetSound(int t) const;

    void SetAnimationType(unsigned type);
    AnimationType GetAnimationType() const { return static_cast<AnimationType>(m_AnimationType); }
    void SetAnimationDirection(unsigned direction);
    AnimationDirection GetAnimationDirection() const { return static_cast<AnimationDirection>(m_AnimationDirection); }
    AnimationState GetAnimationState() const { return static_cast<AnimationState>(m_AnimationState); }
    void SetUserFlags(unsigned flags) { m_UserFlags = flags; }
    unsigned GetUserFlags() const { return m_UserFlags; }
    void SetVisible(bool visible) { m_Visible = visible; }
    bool IsVisible() const { return m_Visible; }
    // The path the object follows by the coefficient of its keys, or null.
    void SetPath(CPathObject* path) { m_Path = path; }
    CPathObject* GetPath() const { return m_Path; }
    // The path of an id among those of the object's clip, or null.
    CPathObject* LoadPathHelper(const char* id) const;
    // Takes the object's record again, with the paths of its clip.
    bool LoadAgain();
    void SetClipPaths(const PathList* paths) { m_ClipPaths = paths; }
    // A snapped object on a path stands on it: at once the nearest point of the path.
    void SnapToPath(bool snap);
    bool IsSnapToPath() const { return m_Snap; }
    const char* GetId() const { return m_Base ? m_Base->id.c_str() : ""; }
    const ClipObjectBase* GetBase() const { return m_Base; }
    // The name of a record's object type, as GetType gives it.
    static const char* GetTypeName(uint32_t type);

protected:
    CClipObject();
    CClipObject(const CClipObject& other);

    // Writes a state to the object; `keyTime` names the key reached (its sound point
    // starts), -1 for an interpolated state. `baseTime` is when the key was due, -1 for now.
    void ApplyState(const KeyState& state, int keyTime, int baseTime);
    bool SoundsDisabled() const { return m_SoundsDisabled; }
    // Sets the position, moved to the nearest point of the path when snapped to one.
    void PlacePos(const FloatVector& pos);

private:
    // A pass over the keys: its ends, direction, the key at hand and the time it is due.
    struct Walk {
        int first, last, dir, cursor;
        int64_t base;
    };
    bool Advance(Walk& walk) const;
    void InterpolateStopped(int time);
    void InterpolatePlaying(int time);
    // The state between the two keys of the current piece, at 0 <= k <= 1.
    void InterpolateState(float k);
    void ApplyPiece(int from, int to, float k);
    core::CTimer* Timer();
    void ReleaseOwnStates();
    // The keys are usable: at most 126, times strictly rising, one at least (but a path).
    bool CheckKeyStates(const ClipObjectBase& base, const LoadContext& context) const;

    CPathObject* m_Path = nullptr;
    const PathList* m_ClipPaths = nullptr;
    const ClipObjectBase* m_Base = nullptr;
    unsigned m_UserFlags = 0;
    bool m_Snap = false;
    bool m_SoundsDisabled = false;
    bool m_Visible = true;
    bool m_OwnStates = false;
    uint8_t m_AnimationState = AnimationStatePlaying;
    uint8_t m_AnimationType = AnimationTypeOnce;
    uint8_t m_AnimationDirection = AnimationDirectionForward;
    int m_LastInterpolateTime = -1;
    const KeyState* m_States = nullptr;
    std::vector<KeyState> m_OwnedStates;
    const KeyState* m_CurrentPieceAnimation[2] = {};
    KeyState m_Interpolated {};
    core::CTimerWrapper m_Timer;
    int m_StartTime = 0;
};

} // namespace ox::misc::anim
