#pragma once
// The kinds of clip object: an image, a text, a nested clip, a particle system and a path.
#include "graphics/ParticleSystem.h"
#include "misc/WideChar.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipObject.h"
#include "misc/animation/Path.h"

namespace ox::graphics {
class CTexture;
struct CFont;
}

namespace ox::misc::anim {

// An object with a place of its own: position, contour, angle, colour and flags.
class CPlacedObject : public CClipObject {
public:
    FloatVector GetPos() const override { return m_Location.Pos; }
    void SetPos(const FloatVector& pos) override;
    void SetPoly(const Poly4& poly) override;
    Poly4 GetPoly() const override { return m_Location.Contour; }
    void ResetPoly() override {}
    void SetAngle(float angle) override;
    float GetAngle() const override { return m_Location.Angle; }
    void SetColor(const graphics::Color& color) override { m_Color = color; }
    graphics::Color GetColor() const override { return m_Color; }
    void SetAdditiveBlend(bool additive) override { m_Additive = additive; }
    bool IsAdditiveBlend() const override { return m_Additive; }
    unsigned GetFlipFlags() const override { return m_Flip; }
    void SetFlipFlags(unsigned flags) override;
    unsigned GetCustomFlags() const override { return m_CustomFlags; }
    void SetCustomFlags(unsigned flags) override { m_CustomFlags = flags; }
    Location GetLocation() const override { return m_Location; }

protected:
    // The position, contour, angle or flip changed.
    virtual void OnPlaceChanged() {}

    Location m_Location;
    graphics::Color m_Color;
    unsigned m_Flip = 0;
    unsigned m_CustomFlags = 0;
    bool m_Additive = false;
};

class CImageObject : public CPlacedObject {
public:
    static const char* GetClassType() { return "image"; }

    void Draw(graphics::CRenderer* renderer) override;
    void Update() override;
    std::string GetResourceId() const override { return GetImageId(); }
    void ResetPoly() override;
    void Reload() override;
    bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context) override;
    const char* GetType() const override { return GetClassType(); }
    CClipObject* Clone() const override { return new CImageObject(*this); }
    void Play() override;

    // Shows another declared texture; an unknown id shows nothing.
    void SetImage(const char* id);
    std::string GetImageId() const { return m_ImageId; }
    const graphics::CTexture* GetTexture() const { return m_Texture; }
    int GetFrameTime() const { return m_FrameTime; }

protected:
    void OnPlaceChanged() override { m_Dirty = true; }

private:
    std::string m_ImageId;
    const graphics::CTexture* m_Texture = nullptr;
    int m_FrameTime = 0;
    // The drawn quad, made again after a change of place.
    Poly4 m_Poly;
    bool m_Dirty = true;
};

class CTextObject : public CPlacedObject {
public:
    static const char* GetClassType() { return "text"; }

    void Draw(graphics::CRenderer* renderer) override;
    void ResetPoly() override { SetPoly(RectToPoly4({0, 0, m_Bounds.Width, m_Bounds.Height})); }
    void Reload() override;
    bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context) override;
    const char* GetType() const override { return GetClassType(); }
    CClipObject* Clone() const override { return new CTextObject(*this); }

    // New bounds rescale the contour and every key's contour by the change of size.
    void SetBounds(const FloatRect& bounds);
    const FloatRect& GetBounds() const { return m_Bounds; }
    const wstring& GetText() const { return m_Text; }
    unsigned GetRenderFlags() const { return m_RenderFlags; }

    // Text flags of the record as the renderer's text flags.
    static unsigned MapTextFlags(unsigned flags);

private:
    FloatRect m_Bounds;
    const graphics::CFont* m_Font = nullptr;
    const graphics::CTexture* m_Background = nullptr;
    graphics::Color m_BackColor;
    Insets m_Insets {};
    std::string m_Key;
    wstring m_Text;
    unsigned m_RenderFlags = 0;
    std::string m_FontId;
    std::string m_BackgroundId;
};

// A clip inside a clip: its place, angle, colour and flags are those of the inner clip.
class CClipViewObject : public CClipObject {
public:
    static const char* GetClassType() { return "clip"; }

    void Draw(graphics::CRenderer* renderer) override;
    void Update() override;
    std::string GetResourceId() const override { return m_Clip.GetId(); }
    FloatVector GetPos() const override { return m_Clip.GetPos(); }
    void SetPos(const FloatVector& pos) override { m_Clip.SetPos(pos); }
    // The size becomes the width and height between the first and the third point.
    void SetPoly(const Poly4& poly) override;
    Poly4 GetPoly() const override;
    void ResetPoly() override { m_Clip.SetSize(m_Clip.GetViewSize()); }
    void SetAngle(float angle) override { m_Clip.SetAngle(angle); }
    float GetAngle() const override { return m_Clip.GetAngle(); }
    void SetColor(const graphics::Color& color) override { m_Clip.SetColor(color); }
    graphics::Color GetColor() const override { return m_Clip.GetColor(); }
    void SetAdditiveBlend(bool additive) override { m_Clip.SetAdditiveBlend(additive); }
    bool IsAdditiveBlend() const override { return m_Clip.IsAdditiveBlend(); }
    unsigned GetFlipFlags() const override { return m_Clip.GetFlipFlags(); }
    void SetFlipFlags(unsigned flags) override { m_Clip.SetFlipFlags(flags); }
    unsigned GetCustomFlags() const override { return m_CustomFlags; }
    void SetCustomFlags(unsigned flags) override { m_CustomFlags = flags; }
    void Reload() override;
    bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context) override;
    const char* GetType() const override { return GetClassType(); }
    CClipObject* Clone() const override { return new CClipViewObject(*this); }

    void DisableSounds(bool disable) override;
    void StopAllSounds() override;
    void SetTime(int time, bool apply) override;
    void MoveTime(int time, bool apply) override;
    void Play() override;
    void Pause() override;
    void Stop() override;

    CClip& GetClip() { return m_Clip; }
    std::string GetClipId() const { return m_Clip.GetId(); }

private:
    CClip m_Clip;
    unsigned m_CustomFlags = 0;
    const CClipsLoader* m_Loader = nullptr;
};

// A particle system of a clip, run on a timer of its own. In `fix_emit` mode the emitter
// moves with the object and the particles stay where they were emitted; otherwise the whole
// system is drawn turned, scaled and moved with the object.
class CParticleObject : public CPlacedObject {
public:
    static const char* GetClassType() { return "particle"; }

    CParticleObject() = default;
    CParticleObject(const CParticleObject& other);

    void Draw(graphics::CRenderer* renderer) override;
    void Update() override;
    std::string GetResourceId() const override { return m_SystemId; }
    void SetPos(const FloatVector& pos) override;
    // Sizes the emitter (or, in `scale` mode, the drawing) by the contour's width and height.
    void SetPoly(const Poly4& poly) override;
    void Reload() override;
    bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context) override;
    const char* GetType() const override { return GetClassType(); }
    CClipObject* Clone() const override { return new CParticleObject(*this); }
    void Play() override;
    void Pause() override;
    // A key with custom flag 1 keeps the system running; otherwise it starts again.
    void Stop() override;

    graphics::CParticleSystem& GetSystem() { return m_System; }
    const graphics::CParticleSystem& GetSystem() const { return m_System; }

private:
    // Starts the system afresh with its head start.
    void Restart();

    graphics::CParticleSystem m_System;
    core::CTimerWrapper m_Timer;
    std::string m_SystemId;
    FloatVector m_Scale {1, 1};
    float m_BaseEmission = 0;
    FloatVector m_BaseEmiterSize;
    int m_AdvanceTime = 0;
    bool m_FixEmit = false;
    bool m_ScaleMode = false;
};

// A path of a clip: its place, contour and angle are those of the curve, which the
// clip's objects follow by coefficient.
class CPathObject : public CPlacedObject {
public:
    static const char* GetClassType() { return "path"; }

    // The curve when visible, for tools.
    void Draw(graphics::CRenderer* renderer) override;
    graphics::Color GetColor() const override { return graphics::Color(); }
    // Within 3 units of the curve.
    bool IsContains(const FloatVector& point) const override;
    // A path with no length is logged and refused: nothing could follow it.
    bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context) override;
    const char* GetType() const override { return GetClassType(); }
    CClipObject* Clone() const override { return new CPathObject(*this); }
    bool IsClosed() const { return m_Curve.IsClosed(); }
    CPath& GetCurve() { return m_Curve; }
    const CPath& GetCurve() const { return m_Curve; }

protected:
    void OnPlaceChanged() override { m_Curve.SetLocation(m_Location); }

private:
    CPath m_Curve;
};

} // namespace ox::misc::anim
