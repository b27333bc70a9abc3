#pragma once
// A clip in a scene: a declared clip drawn centred on the object's position at its shown
// size. It takes a click anywhere in its rectangle, or, using alpha, only where one of the
// clip's images (in nested clips too) has a solid pixel.
#include "misc/animation/Clip.h"
#include "quest/SceneObject.h"

namespace ox::misc::anim {
class CClipObject;
}

namespace qe {

class CClipObject : public CObject {
public:
    // Silent while its sounds are disabled or it or its group is hidden; then the clip runs.
    void Update() override;
    void Draw(ox::graphics::CRenderer* renderer) override;
    bool IsContains(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const override;
    BaseSceneObjectPtrT Clone() const override;
    void Load(const ox::core::CSettingsGroup& element, bool brief) override;

    // Loads the declared clip afresh, runs it silently to where every object stands at its
    // end, and takes its view size as the native size. An unknown id is logged naming the
    // object, which then draws nothing and takes no click.
    void SetClipId(const std::string& id);
    const std::string& GetClipId() const { return m_ClipId; }
    // The longest period among the clip's objects that play once; -1 without one.
    float GetClipTime() const;
    void Play() { m_Clip.Play(); }
    void Stop() { m_Clip.Stop(); }
    void Pause() { m_Clip.Pause(); }
    void UseAlpha(bool use) { m_UseAlpha = use; }
    bool IsUsingAlpha() const { return m_UseAlpha; }
    void DisableSounds(bool disable) { m_SoundsDisabled = disable; }
    ox::misc::anim::CClip& GetClip() { return m_Clip; }

protected:
    void SaveAttributes(ox::misc::CXmlElement& element, bool brief) const override;

private:
    bool HasClip() const { return m_NativeSize.X != 0 && m_NativeSize.Y != 0; }

    ox::misc::anim::CClip m_Clip;
    std::string m_ClipId;
    bool m_UseAlpha = false;
    bool m_SoundsDisabled = false;
    // Whether the clip's sounds are off now.
    bool m_Silent = false;
};

using ClipObjectPtrT = boost::intrusive_ptr<CClipObject>;

// The clip time of a clip as CClipObject::GetClipTime gives it; 0 for null.
float GetClipTime(const ox::misc::anim::CClip* clip);
// The clip's object with this id, or null.
ox::misc::anim::CClipObject* Clip_GetObjectById(ox::misc::anim::CClip* clip, const char* id);

} // namespace qe
