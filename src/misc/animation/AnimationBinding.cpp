#include "misc/animation/AnimationBinding.h"

#include "graphics/Renderer.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipObjects.h"
#include "misc/animation/ClipsLoader.h"

namespace ox::misc::anim {

namespace {

using mluabind::Class;

mluabind::i::GenericClass& ClipClass()
{
    using C = CClip;
    return Class<C>("CClip")
        .Constructor<>()
        .Method("Load", [](C& c, const char* id) { return c.Load(id ? id : ""); })
        .Method("Load", [](C& c, const char* id, bool reset) { return c.Load(id ? id : "", reset); })
        .Method("FindObject", &C::FindObject)
        .Method("Update", &C::Update)
        .Method("Draw", &C::Draw)
        .Method("Play", &C::Play)
        .Method("Stop", &C::Stop)
        .Method("Pause", &C::Pause)
        .Method("Clear", &C::Clear)
        .Method("SetTime", &C::SetTime)
        .Method("MoveTime", &C::MoveTime)
        .Method("GetViewSize", &C::GetViewSize)
        .Method("SetPos", &C::SetPos)
        .Method("GetPos", &C::GetPos)
        .Method("SetSize", &C::SetSize)
        .Method("GetSize", &C::GetSize)
        .Method("SetAngle", &C::SetAngle)
        .Method("GetAngle", &C::GetAngle)
        .Method("SetColor", &C::SetColor)
        .Method("GetColor", &C::GetColor)
        .Method("DisableSounds", &C::DisableSounds)
        .Method("FlipHorizontal", &C::FlipHorizontal)
        .Method("FlipVertical", &C::FlipVertical);
}

void SetFlip(CClipObject& o, unsigned bit, bool on)
{
    o.SetFlipFlags(on ? (o.GetFlipFlags() | bit) : (o.GetFlipFlags() & ~bit));
}

mluabind::i::GenericClass& ClipObjectClass()
{
    using O = CClipObject;
    auto& cls = Class<O>("CClipObject")
                    .Method("Play", &O::Play)
                    .Method("Pause", &O::Pause)
                    .Method("Stop", &O::Stop)
                    .Method("GetAnimationState", &O::GetAnimationState)
                    .Method("SetAnimationType", &O::SetAnimationType)
                    .Method("SetAnimationDirection", &O::SetAnimationDirection)
                    .Method("GetAnimationDirection", &O::GetAnimationDirection)
                    .Method("SetTime", &O::SetTime)
                    .Method("GetTime", &O::GetTime)
                    .Method("GetPeriodTime", &O::GetPeriodTime)
                    .Method("GetSound", &O::GetSound)
                    .Method("FlipHorizontal", [](O& o, bool on) { SetFlip(o, FlipHorizontal, on); })
                    .Method("FlipVertical", [](O& o, bool on) { SetFlip(o, FlipVertical, on); })
                    .Method("Reload", &O::Reload)
                    .Method("Draw", &O::Draw)
                    .Method("Update", &O::Update)
                    .Method("GetId", &O::GetId)
                    .Method("SetPos", &O::SetPos)
                    .Method("GetPos", &O::GetPos)
                    .Method("GetPoly", &O::GetPoly)
                    .Method("SetPoly", &O::SetPoly)
                    .Method("ResetPoly", &O::ResetPoly)
                    .Method("SetAngle", &O::SetAngle)
                    .Method("GetAngle", &O::GetAngle)
                    .Method("SetColor", &O::SetColor)
                    .Method("GetColor", &O::GetColor)
                    .Method("SetAdditiveBlend", &O::SetAdditiveBlend)
                    .Method("IsAdditiveBlend", &O::IsAdditiveBlend)
                    .Method("GetFlipFlags", &O::GetFlipFlags)
                    .Method("AddFlipFlags", &O::AddFlipFlags)
                    .Method("RemFlipFlags", &O::RemFlipFlags)
                    .Method("SetFlipFlags", &O::SetFlipFlags)
                    .Method("GetCustomFlags", &O::GetCustomFlags)
                    .Method("AddCustomFlags", &O::AddCustomFlags)
                    .Method("RemCustomFlags", &O::RemCustomFlags)
                    .Method("SetCustomFlags", &O::SetCustomFlags)
                    .Method("GetLocation", &O::GetLocation)
                    .Method("IsContains", &O::IsContains)
                    .Method("IsSnapToPath", &O::IsSnapToPath)
                    .Method("SnapToPath", &O::SnapToPath)
                    .Method("SetPath", &O::SetPath)
                    .Method("GetPath", &O::GetPath)
                    .Method("Load", &O::LoadAgain)
                    .Method("LoadPathHelper", &O::LoadPathHelper)
                    .Method("SetUserFlags", &O::SetUserFlags)
                    .Method("GetUserFlags", &O::GetUserFlags)
                    .Method("SetVisible", &O::SetVisible)
                    .Method("IsVisible", &O::IsVisible)
                    .Method("GetType", &O::GetType)
                    .Method("GetState", &O::GetState)
                    .Method("GetResourceId", &O::GetResourceId)
                    .Method("DisableSounds", &O::DisableSounds)
                    .Method("StopAllSounds", &O::StopAllSounds);
    for (auto [name, value] : {std::pair{"AnimationStatePlaying", 0}, {"AnimationStatePaused", 1},
                               {"AnimationStateStopped", 2}, {"AnimationTypeOnce", 0}, {"AnimationTypeLoop", 1},
                               {"AnimationTypePingPong", 2}, {"AnimationDirectionForward", 0},
                               {"AnimationDirectionBackward", 1}, {"FlipHorizontal", 1}, {"FlipVertical", 2}})
        cls.Constant(name, value);
    return cls;
}

bool ReloadClips() { return CClipsLoader::Instance().Load(); }

} // namespace

void BindAnimation(mluabind::CHost& host)
{
    mluabind::Namespace anim("anim");
    anim.AddClass(ClipClass());
    anim.AddClass(Class<KeyState>("CClipObject.KeyState"));
    anim.AddClass(ClipObjectClass());
    anim.AddClass(Class<CImageObject>("CImageObject")
                      .BaseClass<CClipObject>()
                      .Method("SetImage", &CImageObject::SetImage)
                      .Method("GetImageId", &CImageObject::GetImageId)
                      .Method("GetClassType", [](const CImageObject&) { return CImageObject::GetClassType(); }));
    anim.AddClass(Class<CClipViewObject>("CClipViewObject")
                      .BaseClass<CClipObject>()
                      .Method("SetClip", [](CClipViewObject& o, const char* id) { return o.GetClip().Load(id ? id : ""); })
                      .Method("GetClipId", &CClipViewObject::GetClipId)
                      .Method("GetClassType", [](const CClipViewObject&) { return CClipViewObject::GetClassType(); }));
    anim.AddClass(Class<CPathObject>("CPathObject")
                      .BaseClass<CClipObject>()
                      .Method("IsClosed", &CPathObject::IsClosed)
                      .Method("GetLength", [](const CPathObject& o) { return o.GetCurve().GetLength(); })
                      .Method("GetPosByCoef", [](const CPathObject& o, float k) { return o.GetCurve().GetPosByCoef(k); })
                      .Method("GetCoefByPos",
                              [](const CPathObject& o, const FloatVector& pos) {
                                  FloatVector offset;
                                  return o.GetCurve().GetCoefByPos(pos, offset);
                              })
                      .Method("GetClassType", [](const CPathObject&) { return CPathObject::GetClassType(); }));
    anim.AddFunction(mluabind::Function("ReloadClips", &ReloadClips));
    host.Bind(mluabind::Namespace("ox").Merge(mluabind::Namespace("misc").Merge(anim)));
}

} // namespace ox::misc::anim
