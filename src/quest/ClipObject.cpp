#include "quest/ClipObject.h"

#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "misc/Location.h"
#include "misc/Matrix.h"
#include "misc/animation/ClipObjects.h"
#include "quest/PixelTest.h"
#include "quest/SceneGroup.h"

#include <algorithm>
#include <cmath>

namespace qe {

namespace anim = ox::misc::anim;
using ox::misc::FloatRect;

namespace {

constexpr const char* kChannel = "quest";
constexpr float kLeastSize = 0.1f;

bool IsTiny(const FloatVector& size) { return std::fabs(size.X) <= kLeastSize || std::fabs(size.Y) <= kLeastSize; }

// A point turned back by `angle` about the origin.
FloatVector Unturn(const FloatVector& d, float angle)
{
    if (angle == 0)
        return d;
    const float c = std::cos(angle), s = std::sin(angle);
    return {c * d.X + s * d.Y, c * d.Y - s * d.X};
}

bool ClipHit(const anim::CClip& clip, const FloatVector& point, const ox::core::CTexturesAlpha* masks);

// A point of the outer clip in a nested clip's own coordinates: the inverse of the way the
// nested clip is drawn (its rectangle's centre moved to its position, scaled, flipped, turned).
bool NestedClipHit(const anim::CClip& clip, const FloatVector& point, const ox::core::CTexturesAlpha* masks)
{
    const FloatVector size = clip.GetSize();
    const FloatRect& rect = clip.GetRect();
    if (IsTiny(size))
        return false;
    const FloatVector d = Unturn(point - clip.GetPos(), clip.GetAngle());
    const float sx = (clip.GetFlipFlags() & anim::FlipHorizontal) ? -1.0f : 1.0f;
    const float sy = (clip.GetFlipFlags() & anim::FlipVertical) ? -1.0f : 1.0f;
    const FloatVector local {d.X * rect.Width / size.X * sx + rect.X + rect.Width / 2,
                             d.Y * rect.Height / size.Y * sy + rect.Y + rect.Height / 2};
    return ClipHit(clip, local, masks);
}

// A point on an image of a clip: its place in the image's contour gives the texture pixel.
bool ImageHit(const anim::CImageObject& image, const FloatVector& point, const ox::core::CTexturesAlpha* masks)
{
    const ox::graphics::CTexture* texture = image.GetTexture();
    const ox::misc::Location location = image.GetLocation();
    if (!texture || !ox::misc::IsPointInPoly4(location.GetPoly(), point))
        return false;
    FloatVector uv = ox::misc::Poly4ConvertToLocalPos(location.Contour, Unturn(point - location.Pos, location.Angle));
    if (image.GetFlipFlags() & anim::FlipHorizontal)
        uv.X = 1 - uv.X;
    if (image.GetFlipFlags() & anim::FlipVertical)
        uv.Y = 1 - uv.Y;
    const int frame = texture->IsAnimated() ? texture->GetFrameByTime(image.GetFrameTime()) : 0;
    return IsSolidPixel(*texture, image.GetImageId().c_str(), static_cast<int>(std::floor(uv.X * texture->GetWidth())),
                        static_cast<int>(std::floor(uv.Y * texture->GetHeight())), frame, masks);
}

// The first visible image with a solid pixel under the point, or a nested clip holding one.
bool ClipHit(const anim::CClip& clip, const FloatVector& point, const ox::core::CTexturesAlpha* masks)
{
    if (IsTiny(clip.GetViewSize()))
        return false;
    for (const auto& object : clip.GetObjects()) {
        if (!object->IsVisible())
            continue;
        if (auto* nested = dynamic_cast<anim::CClipViewObject*>(object.get())) {
            if (nested->IsContains(point) && NestedClipHit(nested->GetClip(), point, masks))
                return true;
        } else if (auto* image = dynamic_cast<const anim::CImageObject*>(object.get())) {
            if (ImageHit(*image, point, masks))
                return true;
        }
    }
    return false;
}

} // namespace

float GetClipTime(const anim::CClip* clip)
{
    if (!clip)
        return 0;
    int longest = -1;
    for (const auto& object : clip->GetObjects())
        if (object->GetAnimationType() == anim::AnimationTypeOnce)
            longest = std::max(longest, object->GetPeriodTime());
    return static_cast<float>(longest);
}

anim::CClipObject* Clip_GetObjectById(anim::CClip* clip, const char* id)
{
    return clip ? clip->FindObject(id) : nullptr;
}

float CClipObject::GetClipTime() const { return qe::GetClipTime(&m_Clip); }

void CClipObject::SetClipId(const std::string& id)
{
    m_ClipId = id;
    m_NativeSize = {};
    if (!m_Clip.Load(id.c_str(), true)) {
        OX_LOG(kChannel, ox::diag::LogError, "Clip object '%s': no clip '%s'; it draws nothing and takes no click",
               GetIdRef().c_str(), id.c_str());
        return;
    }
    // Every object takes up its end state without a sound.
    m_Clip.DisableSounds(true);
    m_Clip.SetTime(0);
    if (const int end = static_cast<int>(GetClipTime()); end > 0)
        m_Clip.MoveTime(end);
    m_Clip.StopAllSounds();
    m_Clip.DisableSounds(false);
    m_Silent = false;
    m_NativeSize = m_Clip.GetSize();
}

void CClipObject::Update()
{
    const CSceneGroup* group = GetParentGroup();
    const bool silent = m_SoundsDisabled || ReadObjectFlag(ObjectFlagHidden) ||
                        (group && group->ReadObjectFlag(ObjectFlagHidden));
    if (silent != m_Silent) {
        m_Clip.DisableSounds(silent);
        m_Silent = silent;
    }
    m_Clip.Update();
}

void CClipObject::Draw(ox::graphics::CRenderer* renderer)
{
    if (!HasClip())
        return;
    // The clip draws its rectangle centred on the origin at its view size.
    renderer->PushMatrix();
    renderer->ApplyMatrix(ox::misc::MatrixScale(m_Size.X / m_NativeSize.X, m_Size.Y / m_NativeSize.Y));
    m_Clip.Draw(renderer);
    renderer->PopMatrix();
}

bool CClipObject::IsContains(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const
{
    if (!HasClip() || !IsInContour(point))
        return false;
    if (!m_UseAlpha)
        return true;
    if (IsTiny(m_Size))
        return false;
    const FloatRect& rect = m_Clip.GetRect();
    return ClipHit(m_Clip, ToPicture(point) + FloatVector(rect.X, rect.Y), masks);
}

BaseSceneObjectPtrT CClipObject::Clone() const
{
    ClipObjectPtrT clone(new CClipObject());
    CopyTo(*clone);
    clone->m_UseAlpha = m_UseAlpha;
    clone->m_SoundsDisabled = m_SoundsDisabled;
    clone->m_ClipId = m_ClipId;
    clone->m_NativeSize = {};
    if (HasClip()) {
        clone->m_Clip = m_Clip;
        clone->m_NativeSize = m_NativeSize;
        clone->m_Silent = m_Silent;
    }
    return clone;
}

} // namespace qe
