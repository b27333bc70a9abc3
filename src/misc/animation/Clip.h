#pragma once
// A running instance of a clip record: one object for each object of the record, a place,
// size, angle, colour and flip of its own, drawn through the renderer inside its rectangle.
#include "graphics/Color.h"
#include "misc/Rect.h"
#include "misc/String.h"
#include "misc/Vector.h"

#include <memory>
#include <vector>

namespace ox::graphics {
class CRenderer;
}

namespace ox::misc::anim {

class CClipsLoader;
class CClipObject;
class CPathObject;
struct LoadContext;

// Objects whose record says they are not visible are left out at load unless this is set
// (editors set it; the game clears it at start).
extern bool g_LoadInvisibleObjects;

// Clips nested in clips deeper than this are refused.
constexpr int kMaxClipNesting = 8;

class CClip {
public:
    CClip();
    ~CClip();
    // A copy clones every object.
    CClip(const CClip& other);
    CClip& operator=(const CClip& other);

    // Builds the objects of the clip `id` of the process-wide loader (or of `loader`) and
    // plays them. With `reset` the clip's place, size, angle, colour and flags start afresh.
    // False (logged) when there is no such clip, or, nested in `parent`, when the clip would
    // hold itself or nest too deep.
    bool Load(const char* id, bool reset = true);
    bool Load(const CClipsLoader& loader, const char* id, bool reset = true, const LoadContext* parent = nullptr);
    void Clear();
    CClipObject* FindObject(const char* id) const;
    const std::vector<std::unique_ptr<CClipObject>>& GetObjects() const { return m_Objects; }
    const std::vector<std::unique_ptr<CPathObject>>& GetPaths() const { return m_Paths; }
    const char* GetId() const { return m_Id ? m_Id->c_str() : ""; }

    // Advances every object and applies its time line.
    void Update();
    void Draw(graphics::CRenderer* renderer);
    void Play();
    void Pause();
    void Stop();
    void SetTime(int time, bool apply = true);
    void MoveTime(int time, bool apply = true);
    void DisableSounds(bool disable);
    void StopAllSounds();

    // Where the clip's centre lands, its drawn size, its turn about the centre.
    void SetPos(const FloatVector& pos) { m_Pos = pos; }
    FloatVector GetPos() const { return m_Pos; }
    void SetSize(const FloatVector& size) { m_Size = size; }
    FloatVector GetSize() const { return m_Size; }
    void SetAngle(float angle) { m_Angle = angle; }
    float GetAngle() const { return m_Angle; }
    void SetColor(const graphics::Color& color) { m_Color = color; }
    graphics::Color GetColor() const { return m_Color; }
    // The rectangle's size as authored.
    FloatVector GetViewSize() const { return {m_Rect.Width, m_Rect.Height}; }
    const FloatRect& GetRect() const { return m_Rect; }
    void FlipHorizontal(bool flip) { SetFlipBit(1, flip); }  // the bits of FlipFlags
    void FlipVertical(bool flip) { SetFlipBit(2, flip); }
    void SetFlipFlags(unsigned flags) { m_Flip = flags; }
    unsigned GetFlipFlags() const { return m_Flip; }
    void SetAdditiveBlend(bool additive) { m_Additive = additive; }
    bool IsAdditiveBlend() const { return m_Additive; }

private:
    void SetFlipBit(unsigned bit, bool on) { m_Flip = on ? (m_Flip | bit) : (m_Flip & ~bit); }
    // Whether the clip `id` may be built inside `parent`: never inside itself, never too deep.
    static bool CanNest(const char* id, const LoadContext* parent);
    template <class F>
    void ForEachObject(F action);

    std::vector<std::unique_ptr<CClipObject>> m_Objects;
    std::vector<std::unique_ptr<CPathObject>> m_Paths;
    FloatRect m_Rect;
    const StringA88* m_Id = nullptr;
    FloatVector m_Pos;
    FloatVector m_Size;
    float m_Angle = 0;
    graphics::Color m_Color;
    unsigned m_Flip = 0;
    bool m_Additive = false;
    bool m_Mute = false;
};

} // namespace ox::misc::anim
