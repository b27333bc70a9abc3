#include "graphics/GraphicsBinding.h"

#include "graphics/Font.h"
#include "graphics/Image.h"
#include "graphics/ParticleSystem.h"
#include "graphics/Renderer.h"
#include "lua/mluabind/StdBinding.h"

namespace ox::graphics {

namespace {

using misc::FloatMatrix;
using misc::FloatRect;
using misc::FloatVector;
using misc::IntRect;
using misc::Poly4;
using misc::ShortRect;
using mluabind::Class;
using mluabind::Constant;

mluabind::Namespace ValueClasses()
{
    mluabind::Namespace ns;
    ns.AddClass(Class<Color>("Color")
                    .Constructor<>()
                    .Constructor<uint32_t>()
                    .Constructor<int16_t, int16_t, int16_t, int16_t>()
                    .Member("Red", &Color::Red)
                    .Member("Green", &Color::Green)
                    .Member("Blue", &Color::Blue)
                    .Member("Alpha", &Color::Alpha)
                    .Method("Clamp", &Color::Clamp));
    ns.AddClass(Class<Resolution>("Resolution")
                    .Constructor<>()
                    .Member("Width", &Resolution::Width)
                    .Member("Height", &Resolution::Height)
                    .Member("Bpp32", &Resolution::Bpp32));
    ns.Merge(mluabind::VectorClass<Resolution>("ResolutionsT"));
    ns.AddClass(Class<UVRect>("UVRect")
                    .Constructor<>()
                    .Member("u1", &UVRect::u1)
                    .Member("v1", &UVRect::v1)
                    .Member("u2", &UVRect::u2)
                    .Member("v2", &UVRect::v2));
    ns.AddConstant(Constant("BlendNormal", static_cast<int>(BlendNormal)));
    ns.AddConstant(Constant("BlendAdditive", static_cast<int>(BlendAdditive)));
    return ns;
}

mluabind::Namespace TextureClasses()
{
    using T = CTexture;
    mluabind::Namespace ns;
    ns.AddClass(Class<CSurface>("CSurface")
                    .Method("IsValid", &CSurface::IsValid)
                    .Method("GetWidth", &CSurface::GetWidth)
                    .Method("GetHeight", &CSurface::GetHeight));
    ns.AddClass(Class<T>("CTexture")
                    .Method("GetSurface", [](T& t) { return t.GetSurface(); })
                    .Method("GetSurface", [](const T& t) -> const CSurface* { return t.GetSurface(); })
                    .Method("GetSurfaceRect", &T::GetSurfaceRect)
                    .Method("CreateBuffer", &T::CreateBuffer)
                    .Method("LoadBuffer", &T::LoadBuffer)
                    .Method("DropBuffer", &T::DropBuffer)
                    .Method("Pixel", static_cast<uint32_t (T::*)(int, int, int) const>(&T::Pixel))
                    .Method("SurfaceIsBuffer", &T::SurfaceIsBuffer)
                    .Method("CommitBits", &T::CommitBits)
                    .Method("IsAnimated", &T::IsAnimated)
                    .Method("EnumFrames", &T::EnumFrames)
                    .Method("GetFrameSurfaceRect", &T::GetFrameSurfaceRect)
                    .Method("GetFrameByTime", &T::GetFrameByTime)
                    .Method("GetTimeByFrame", &T::GetTimeByFrame)
                    .Method("GetWidth", &T::GetWidth)
                    .Method("GetHeight", &T::GetHeight)
                    .Method("GetAnimTime", &T::GetAnimTime));
    ns.AddClass(Class<CFont>("CFont")
                    .Method("GetStringWidth", &CFont::GetStringWidth)
                    .Member("PixHeight", &CFont::PixHeight)
                    .Property("SpaceWidth", &CFont::GetSpaceWidth)
                    .Property("LineSpacing", &CFont::GetLineSpacing)
                    .Property("Texture", [](const CFont& f) { return f.Texture; }));
    return ns;
}

// Every drawing call takes all its parameters: a script has no default arguments.
mluabind::i::GenericClass& RendererClass()
{
    using R = CRenderer;
    using C = const CTexture*;
    using Col = const Color&;
    return Class<R>("CRenderer")
        .Method("InitWindow", &R::InitWindow)
        .Method("UpdateWindowInfo", &R::UpdateWindowInfo)
        .Method("SetSourceResolution", &R::SetSourceResolution)
        .Method("GetSourceResolution", &R::GetSourceResolution)
        .Method("RenderLine", &R::RenderLine)
        .Method("RenderRect", &R::RenderRect)
        .Method("RenderFilledPoly4", &R::RenderFilledPoly4)
        .Method("RenderString", &R::RenderString)
        .Method("RenderText", static_cast<void (R::*)(const CFont&, const wstring&, const IntRect&, unsigned, unsigned,
                                                      Col, Col)>(&R::RenderText))
        .Method("RenderTexture", static_cast<void (R::*)(C, float, float, unsigned, Col)>(&R::RenderTexture))
        .Method("RenderTexture", static_cast<void (R::*)(C, const FloatRect&, unsigned, Col)>(&R::RenderTexture))
        .Method("RenderTexture", static_cast<void (R::*)(C, const Poly4&, unsigned, Col)>(&R::RenderTexture))
        .Method("RenderTexture", static_cast<void (R::*)(C, float, float, const ShortRect&, Col)>(&R::RenderTexture))
        .Method("RenderTexture",
                static_cast<void (R::*)(C, const FloatRect&, const ShortRect&, Col)>(&R::RenderTexture))
        .Method("RenderTexture", static_cast<void (R::*)(C, const Poly4&, const ShortRect&, Col)>(&R::RenderTexture))
        .Method("RenderTextureBox", static_cast<void (R::*)(C, const FloatRect&, unsigned, Col)>(&R::RenderTextureBox))
        .Method("RenderTextureBox",
                static_cast<void (R::*)(C, const FloatRect&, const ShortRect&, Col)>(&R::RenderTextureBox))
        .Method("BeginScene", &R::BeginScene)
        .Method("EndScene", &R::EndScene)
        .Method("SetBlendMode", [](R& r, int mode) { r.SetBlendMode(static_cast<BlendModes>(mode)); })
        .Method("SetColor", &R::SetColor)
        .Method("GetColor", &R::GetColor)
        .Method("ApplyMatrix", &R::ApplyMatrix)
        .Method("GetMatrix", &R::GetMatrix)
        .Method("SetClipPoly", &R::SetClipPoly)
        .Method("PushState", &R::PushState)
        .Method("PopState", &R::PopState)
        .Method("GetWidth", &R::GetWidth)
        .Method("GetHeight", &R::GetHeight)
        .Method("Is32BPP", &R::Is32BPP)
        .Method("IsFullscreen", &R::IsFullscreen)
        .Method("GetActiveRect", &R::GetActiveRect)
        .Method("GetScale", &R::GetScale)
        .Method("GetAvailableResolutions", &R::GetAvailableResolutions);
}

mluabind::i::GenericClass& ImageClass()
{
    using I = CImage;
    return Class<I>("CImage")
        .BaseClass<core::CTimerWrapper>()
        .Constructor<>()
        .Method("Init", &I::Init)
        .Method("SetTexture", static_cast<void (I::*)(const CTexture*, bool)>(&I::SetTexture))
        .Method("SetTexture", static_cast<void (I::*)(const char*, bool)>(&I::SetTexture))
        .Method("GetTexture", &I::GetTexture)
        .Method("GetTextureSize", &I::GetTextureSize)
        .Method("Draw", static_cast<void (I::*)(CRenderer&)>(&I::Draw))
        .Method("Draw", static_cast<void (I::*)(CRenderer&, float, float)>(&I::Draw))
        .Method("Draw", static_cast<void (I::*)(CRenderer&, const FloatRect&)>(&I::Draw))
        .Method("DrawTransformed", static_cast<void (I::*)(CRenderer&, const FloatMatrix&)>(&I::DrawTransformed))
        .Method("DrawTransformed",
                static_cast<void (I::*)(CRenderer&, const FloatRect&, const FloatMatrix&)>(&I::DrawTransformed))
        .Method("SetRect", &I::SetRect)
        .Method("GetRect", &I::GetRect)
        .Method("SetSourceRect", &I::SetSourceRect)
        .Method("GetSourceRect", &I::GetSourceRect)
        .Method("SetTransformationMatrix", &I::SetTransformationMatrix)
        .Method("GetTransformationMatrix", &I::GetTransformationMatrix)
        .Method("SetScale", &I::SetScale)
        .Method("GetScale", &I::GetScale)
        .Method("SetColor", &I::SetColor)
        .Method("GetColor", &I::GetColor)
        .Method("SetFlags", &I::SetFlags)
        .Method("GetFlags", &I::GetFlags)
        .Method("IsAnimated", &I::IsAnimated)
        .Method("GetFrameCount", &I::GetFrameCount)
        .Method("PauseAnimation", &I::PauseAnimation)
        .Method("SetAnimationK", &I::SetAnimationK)
        .Method("GetAnimationK", &I::GetAnimationK)
        .Method("SetFrame", &I::SetFrame)
        .Method("SetTime", &I::SetTime)
        .Method("GetTime", &I::GetTime)
        .Constant("FlagBoxImage", static_cast<int>(I::FlagBoxImage))
        .Constant("FlagIntDest", static_cast<int>(I::FlagIntDest));
}

// A script makes a system, gives it a timer of its own and loads a record by id.
mluabind::i::GenericClass& ParticleClass()
{
    using P = CParticleSystem;
    auto& cls = Class<P>("CParticleSystem")
                    .Constructor<>()
                    .Method("IsStopEmit", [](const P& p) { return (p.GetFlags() & core::ParticleEmissionOff) != 0; })
                    .Method("IsContinuous", [](const P& p) { return (p.GetFlags() & core::ParticleEndless) != 0; })
                    .Method("LoadById", [](P& p, const misc::StringA88& id) { return p.LoadById(id.c_str()); })
                    .Method("Reset", &P::Reset)
                    .Method("Update", &P::Update)
                    .Method("Render", &P::Render)
                    .Method("GetLifeParticlesCount", &P::GetLifeParticlesCount)
                    .Method("DropOldPos", &P::DropOldPos)
                    .Method("IsDead", &P::IsDead)
                    .Method("GetFlags", &P::GetFlags)
                    .Method("SetFlags", &P::SetFlags)
                    .Method("GetEmission", &P::GetEmission)
                    .Method("SetEmission", &P::SetEmission)
                    .Method("GetEmiterSize", &P::GetEmiterSize)
                    .Method("SetEmiterSize", &P::SetEmiterSize)
                    .Method("SetTimer", [](P& p, core::CTimer* timer) { p.SetTimer(timer); })
                    .Method("SetLocation", &P::SetLocation);
    cls.Constant("IsStopEmit", static_cast<int>(core::ParticleEmissionOff));
    cls.Constant("IsContinuous", static_cast<int>(core::ParticleEndless));
    return cls;
}

} // namespace

void BindGraphics(mluabind::CHost& host)
{
    mluabind::Namespace graphics("graphics");
    graphics.Merge(ValueClasses()).Merge(TextureClasses());
    graphics.AddClass(RendererClass());
    graphics.AddClass(ImageClass());
    graphics.AddClass(ParticleClass());
    host.Bind(mluabind::Namespace("ox").Merge(graphics));
}

} // namespace ox::graphics
