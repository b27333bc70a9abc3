#pragma once
// A picture in a scene: a declared texture (animated or not) drawn centred on the object's
// position at its shown size, turned by its angle. It takes a click only on a solid pixel.
#include "graphics/Image.h"
#include "quest/PixelTest.h"
#include "quest/SceneObject.h"

namespace qe {

class CImageObject : public CObject {
public:
    void Draw(ox::graphics::CRenderer* renderer) override;
    // Inside the contour and on a solid pixel of the current frame.
    bool IsContains(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const override;
    BaseSceneObjectPtrT Clone() const override;
    void Load(const ox::core::CSettingsGroup& element, bool brief) override;

    // Binds the declared texture and takes its frame size as the native size. An unknown id
    // is logged naming the object, which then draws nothing and takes no click.
    void SetTextureId(const std::string& id);
    const std::string& GetTextureId() const { return m_TextureId; }
    FloatVector GetTextureSize() const { return m_Image.GetTextureSize(); }
    const ox::graphics::CImage& GetImage() const { return m_Image; }

    // The animation: back to its start, its length (0 without a texture), its time.
    void PlayFromStart() { m_Image.SetTime(0); }
    unsigned GetTotalTime() const;
    void SetTime(unsigned ms) { m_Image.SetTime(ms); }
    unsigned GetAnimTime() const { return m_Image.GetTime(); }

protected:
    void SaveAttributes(ox::misc::CXmlElement& element, bool brief) const override;

private:
    ox::graphics::CImage m_Image;
    std::string m_TextureId;
    CMaskLookup m_Mask;
    // A hit test without a texture was logged (once, not on every move of the mouse).
    mutable bool m_Reported = false;
};

using ImageObjectPtrT = boost::intrusive_ptr<CImageObject>;

} // namespace qe
