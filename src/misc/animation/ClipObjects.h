#pragma once
// The kinds of clip object: an image, a text, a nested clip; particle systems and paths
// load their records and draw nothing until they are supported.
#include "misc/WideChar.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipObject.h"

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

// A particle system of a clip. Particle systems are not supported yet: the object keeps
// its place and time line and draws nothing.
class CParticleObject : public CPlacedObject {
public:
    static const char* GetClassType() { return "particle"; }

    void Draw(graphics::CRenderer*) override {}
    std::string GetResourceId() const override { return m_SystemId; }
    bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context) override;
    const char* GetType() const override { return GetClassType(); }
    CClipObject* Clone() const override { return new CParticleObject(*this); }

private:
    std::string m_SystemId;
};

// A path of a clip. Paths are not supported yet: the object keeps its record and draws
// nothing, and no object follows it.
class CPathObject : public CPlacedObject {
public:
    static const char* GetClassType() { return "path"; }

    void Draw(graphics::CRenderer*) override {}
    graphics::Color GetColor() const override { return graphics::Color(); }
    bool LoadFromBase(const ClipObjectBase* base, const LoadContext& context) override;
    const char* GetType() const override { return GetClassType(); }
    CClipObject* Clone() const override { return new CPathObject(*this); }
    bool IsClosed() const;
};

} // namespace ox::misc::anim
