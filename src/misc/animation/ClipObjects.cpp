#include "misc/animation/ClipObjects.h"

#include "diag/Log.h"
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "misc/StringTable.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace ox::misc::anim {

namespace {

constexpr const char* kChannel = "anim";

const graphics::CTexture* FindTexture(const std::string& id)
{
    const auto& lookup = GetClipServices().textures;
    return lookup && !id.empty() ? lookup(id.c_str()) : nullptr;
}

const graphics::CFont* FindFont(const std::string& id)
{
    const auto& lookup = GetClipServices().fonts;
    return lookup && !id.empty() ? lookup(id.c_str()) : nullptr;
}

// Logs a resource an object names that is not there.
void ReportMissing(const LoadContext& context, const ClipObjectBase& base, const char* what, const std::string& id)
{
    OX_LOG(kChannel, diag::LogError, "Clip '%s': %s object '%s' names the unknown %s '%s'; it is drawn without it",
           context.clipId, CClipObject::GetTypeName(base.type), base.id.c_str(), what, id.c_str());
}

template <class T>
const T& ExtensionOf(const ClipObjectBase* base)
{
    return *static_cast<const T*>(base->Extension());
}

} // namespace

// Placed objects ---------------------------------------------------------------------------

void CPlacedObject::SetPos(const FloatVector& pos)
{
    if (pos == m_Location.Pos)
        return;
    m_Location.Pos = pos;
    OnPlaceChanged();
}

void CPlacedObject::SetPoly(const Poly4& poly)
{
    if (poly == m_Location.Contour)
        return;
    m_Location.Contour = poly;
    OnPlaceChanged();
}

void CPlacedObject::SetAngle(float angle)
{
    // Changes below a thousandth of a radian wait until they add up.
    if (std::fabs(angle - m_Location.Angle) < 0.001f)
        return;
    m_Location.Angle = angle;
    OnPlaceChanged();
}

void CPlacedObject::SetFlipFlags(unsigned flags)
{
    if (flags == m_Flip)
        return;
    m_Flip = flags;
    OnPlaceChanged();
}

// Images -----------------------------------------------------------------------------------

bool CImageObject::LoadFromBase(const ClipObjectBase* base, const LoadContext& context)
{
    if (!CClipObject::LoadFromBase(base, context))
        return false;
    m_ImageId = ExtensionOf<ImageExtension>(base).image.str();
    m_Texture = FindTexture(m_ImageId);
    if (!m_Texture)
        ReportMissing(context, *base, "texture", m_ImageId);
    return true;
}

void CImageObject::SetImage(const char* id)
{
    m_ImageId = id ? id : "";
    m_Texture = FindTexture(m_ImageId);
}

void CImageObject::Reload() { m_Texture = FindTexture(m_ImageId); }

void CImageObject::ResetPoly()
{
    const float w = m_Texture ? m_Texture->GetWidth() : 0.0f, h = m_Texture ? m_Texture->GetHeight() : 0.0f;
    SetPoly(RectToPoly4({-w / 2, -h / 2, w, h}));
}

void CImageObject::Update() { m_FrameTime += ClipTimeManager().GetRoot()->GetFrameDelta(); }

void CImageObject::Play()
{
    m_FrameTime = 0;
    CClipObject::Play();
}

void CImageObject::Draw(graphics::CRenderer* renderer)
{
    if (!IsVisible() || !m_Texture)
        return;
    if (m_Dirty) {
        m_Poly = m_Location.GetPoly();
        if (m_Flip & FlipVertical) {
            std::swap(m_Poly[0], m_Poly[3]);
            std::swap(m_Poly[1], m_Poly[2]);
        }
        if (m_Flip & FlipHorizontal) {
            std::swap(m_Poly[0], m_Poly[1]);
            std::swap(m_Poly[3], m_Poly[2]);
        }
        m_Dirty = false;
    }
    if (m_Additive) {
        renderer->PushBlendMode();
        renderer->SetBlendMode(graphics::BlendAdditive);
    }
    // No frame (-1) reaches the renderer as one past the parts: the first part.
    const int frame = m_Texture->IsAnimated() ? m_Texture->GetFrameByTime(m_FrameTime) : 0;
    renderer->RenderTexture(m_Texture, m_Poly, static_cast<unsigned>(frame), m_Color);
    if (m_Additive)
        renderer->PopBlendMode();
}

// Texts ------------------------------------------------------------------------------------

unsigned CTextObject::MapTextFlags(unsigned flags)
{
    using R = graphics::CRenderer;
    static const std::pair<unsigned, unsigned> kMap[] = {
        {1, R::TextLeft}, {2, R::TextCenterH}, {4, R::TextRight},      {8, R::TextTop},
        {16, R::TextCenterV}, {32, R::TextBottom}, {0x1000, R::TextWordWrap}};
    unsigned mapped = 0;
    for (const auto& [from, to] : kMap)
        if (flags & from)
            mapped |= to;
    return mapped;
}

bool CTextObject::LoadFromBase(const ClipObjectBase* base, const LoadContext& context)
{
    if (!CClipObject::LoadFromBase(base, context))
        return false;
    const auto& text = ExtensionOf<TextExtension>(base);
    m_Bounds = text.bounds;
    m_RenderFlags = MapTextFlags(text.tx_fl);
    m_BackColor = text.bk_color;
    m_Insets = text.insets;
    m_Key = text.key.str();
    m_FontId = text.font.str();
    m_BackgroundId = text.background.str();
    Reload();
    if (!m_Font)
        ReportMissing(context, *base, "font", m_FontId);
    if (!m_Background && !m_BackgroundId.empty())
        ReportMissing(context, *base, "background texture", m_BackgroundId);
    return true;
}

void CTextObject::Reload()
{
    m_Font = FindFont(m_FontId);
    m_Background = FindTexture(m_BackgroundId);
    m_Text = CStringTable::Instance().FormatByStringsID(m_Key);
}

void CTextObject::SetBounds(const FloatRect& bounds)
{
    const float oldW = m_Bounds.Width, oldH = m_Bounds.Height;
    m_Bounds = bounds;
    if (std::fabs(oldW) < 0.001f || std::fabs(oldH) < 0.001f)
        return;
    const float kx = bounds.Width / oldW, ky = bounds.Height / oldH;
    auto scale = [kx, ky](Poly4 poly) {
        for (int i = 0; i < 4; ++i)
            poly[i] = {poly[i].X * kx, poly[i].Y * ky};
        return poly;
    };
    SetPoly(scale(GetPoly()));
    for (unsigned i = 0; i < EnumKeyStates(); ++i) {
        KeyState* key = FindKeyStateForEdit(GetKeyStates()[i].t);
        key->contour = scale(key->contour);
    }
}

void CTextObject::Draw(graphics::CRenderer* renderer)
{
    if (!IsVisible() || std::fabs(m_Bounds.Width) < 0.001f || std::fabs(m_Bounds.Height) < 0.001f)
        return;
    if (m_Additive) {
        renderer->PushBlendMode();
        renderer->SetBlendMode(graphics::BlendAdditive);
    }
    renderer->PushMatrix();
    const Poly4& contour = m_Location.Contour;
    const FloatVector s = contour[2] - contour[0];
    FloatMatrix m = MatrixScale(s.X / m_Bounds.Width, s.Y / m_Bounds.Height);
    if (m_Flip & FlipHorizontal)
        m = m * MatrixScale(-1, 1) * MatrixTranslation(s.X, 0);
    if (m_Flip & FlipVertical)
        m = m * MatrixScale(1, -1) * MatrixTranslation(0, s.Y);
    m = m * MatrixTranslation(contour[0].X, contour[0].Y) * MatrixRotation(m_Location.Angle) *
        MatrixTranslation(m_Location.Pos.X, m_Location.Pos.Y);
    renderer->ApplyMatrix(m);
    if (m_Background) {
        renderer->PushColor();
        renderer->SetColor(renderer->GetColor() * m_BackColor);
        const FloatRect box(m_Bounds.X - m_Insets.left, m_Bounds.Y - m_Insets.top,
                            m_Bounds.Width + m_Insets.left + m_Insets.right,
                            m_Bounds.Height + m_Insets.top + m_Insets.bottom);
        renderer->RenderTextureBox(m_Background, box, 0, graphics::Color());
        renderer->PopColor();
    }
    if (m_Font)
        renderer->RenderText(*m_Font, m_Text,
                             IntRect(static_cast<int>(m_Bounds.X), static_cast<int>(m_Bounds.Y),
                                     static_cast<int>(m_Bounds.Width), static_cast<int>(m_Bounds.Height)),
                             m_RenderFlags, 0, m_Color);
    renderer->PopMatrix();
    if (m_Additive)
        renderer->PopBlendMode();
}

// Nested clips ----------------------------------------------------------------------------

bool CClipViewObject::LoadFromBase(const ClipObjectBase* base, const LoadContext& context)
{
    const std::string id = ExtensionOf<ClipViewExtension>(base).clip.str();
    // The inner clip first: the object's own record then sets its place and size.
    if (!context.loader || !m_Clip.Load(*context.loader, id.c_str(), true, &context)) {
        OX_LOG(kChannel, diag::LogError, "Clip '%s': clip object '%s' cannot show the clip '%s'; left out",
               context.clipId, base->id.c_str(), id.c_str());
        return false;
    }
    m_Loader = context.loader;
    return CClipObject::LoadFromBase(base, context);
}

void CClipViewObject::Reload()
{
    if (m_Loader)
        m_Clip.Load(*m_Loader, std::string(m_Clip.GetId()).c_str(), false);
}

void CClipViewObject::SetPoly(const Poly4& poly)
{
    m_Clip.SetSize({std::fabs(poly[2].X - poly[0].X), std::fabs(poly[2].Y - poly[0].Y)});
}

Poly4 CClipViewObject::GetPoly() const
{
    const FloatVector size = m_Clip.GetSize();
    return RectToPoly4({-size.X / 2, -size.Y / 2, size.X, size.Y});
}

void CClipViewObject::Draw(graphics::CRenderer* renderer)
{
    if (IsVisible())
        m_Clip.Draw(renderer);
}

void CClipViewObject::Update() { m_Clip.Update(); }

void CClipViewObject::DisableSounds(bool disable)
{
    CClipObject::DisableSounds(disable);
    m_Clip.DisableSounds(disable);
}

void CClipViewObject::StopAllSounds()
{
    CClipObject::StopAllSounds();
    m_Clip.StopAllSounds();
}

void CClipViewObject::SetTime(int time, bool apply)
{
    CClipObject::SetTime(time, apply);
    m_Clip.SetTime(time, apply);
}

void CClipViewObject::MoveTime(int time, bool apply)
{
    CClipObject::MoveTime(time, apply);
    m_Clip.MoveTime(time, apply);
}

void CClipViewObject::Play()
{
    CClipObject::Play();
    m_Clip.Play();
}

void CClipViewObject::Pause()
{
    CClipObject::Pause();
    m_Clip.Pause();
}

void CClipViewObject::Stop()
{
    CClipObject::Stop();
    m_Clip.Stop();
}

// Particle systems --------------------------------------------------------------------

CParticleObject::CParticleObject(const CParticleObject& other)
    : CPlacedObject(other), m_System(other.m_System), m_SystemId(other.m_SystemId), m_Scale(other.m_Scale),
      m_BaseEmission(other.m_BaseEmission), m_BaseEmiterSize(other.m_BaseEmiterSize),
      m_AdvanceTime(other.m_AdvanceTime), m_FixEmit(other.m_FixEmit), m_ScaleMode(other.m_ScaleMode)
{
    if (const core::CTimer* timer = other.m_Timer.Get())
        m_Timer = timer->Clone(nullptr);
    m_System.SetTimer(m_Timer.Get());
}

bool CParticleObject::LoadFromBase(const ClipObjectBase* base, const LoadContext& context)
{
    const ParticleExtension& extension = ExtensionOf<ParticleExtension>(base);
    m_SystemId = extension.system.str();
    if (!m_System.LoadById(m_SystemId.c_str()))
        OX_LOG(kChannel, diag::LogError, "Clip '%s': particle object '%s' cannot run the system '%s'; it draws "
               "nothing", context.clipId, base->id.c_str(), m_SystemId.c_str());
    if (!m_Timer.Get()) {
        core::CTimeManager& time = ClipTimeManager();
        m_Timer = time.AttachTimer(time.GetRoot());
    }
    m_System.SetTimer(m_Timer.Get());
    m_BaseEmission = m_System.GetEmission();
    m_BaseEmiterSize = m_System.GetEmiterSize();
    m_FixEmit = extension.fix_emit != 0;
    m_ScaleMode = extension.scale != 0;
    m_AdvanceTime = std::clamp(extension.adv_time, 0, 60000);
    if (!CClipObject::LoadFromBase(base, context))
        return false;
    Restart();
    return true;
}

void CParticleObject::Reload()
{
    const FloatVector location = m_System.GetLocation();
    if (m_System.LoadById(m_SystemId.c_str()))
        m_System.SetLocation(location.X, location.Y);
}

void CParticleObject::Restart()
{
    m_System.Reset();
    m_System.AdvanceTime(m_AdvanceTime, 20);
}

void CParticleObject::SetPos(const FloatVector& pos)
{
    CPlacedObject::SetPos(pos);
    if (m_FixEmit)
        m_System.SetLocation(pos.X, pos.Y);
}

void CParticleObject::SetPoly(const Poly4& poly)
{
    CPlacedObject::SetPoly(poly);
    auto ratio = [](float size, float base) { return std::fabs(base) > 0.0001f ? std::fabs(size) / base : 1.0f; };
    m_Scale = {ratio(poly[2].X - poly[0].X, m_BaseEmiterSize.X), ratio(poly[2].Y - poly[0].Y, m_BaseEmiterSize.Y)};
    if (m_ScaleMode || !m_System.IsLoaded())
        return;
    if (!m_FixEmit)
        m_System.SetEmission(m_BaseEmission * m_Scale.X * m_Scale.Y);
    m_System.SetEmiterSize({m_BaseEmiterSize.X * m_Scale.X, m_BaseEmiterSize.Y * m_Scale.Y});
}

void CParticleObject::Update()
{
    if (m_System.IsLoaded())
        m_System.Update();
}

void CParticleObject::Play()
{
    CClipObject::Play();
    m_System.PauseTimer(false);
}

void CParticleObject::Pause()
{
    CClipObject::Pause();
    m_System.PauseTimer(true);
}

void CParticleObject::Stop()
{
    CClipObject::Stop();
    for (unsigned i = 0; i < EnumKeyStates(); ++i)
        if (GetKeyStates()[i].custom & 1)
            return;
    Restart();
}

void CParticleObject::Draw(graphics::CRenderer* renderer)
{
    if (!IsVisible() || !m_System.IsLoaded())
        return;
    renderer->PushState();
    if (!(m_Color == graphics::Color()))
        renderer->SetColor(renderer->GetColor() * m_Color);
    const float fx = (m_Flip & FlipHorizontal) ? -1.0f : 1.0f, fy = (m_Flip & FlipVertical) ? -1.0f : 1.0f;
    if (!m_FixEmit || m_Flip & (FlipHorizontal | FlipVertical)) {
        const FloatVector emitter = m_System.GetLocation();
        FloatMatrix m = MatrixTranslation(-emitter.X, -emitter.Y);
        if (m_FixEmit)
            m = m * MatrixScale(fx, fy);
        else {
            m = m * MatrixRotation(m_Location.Angle);
            if (m_ScaleMode)
                m = m * MatrixScale(m_Scale.X * fx, m_Scale.Y * fy);
        }
        renderer->ApplyMatrix(m * MatrixTranslation(m_Location.Pos.X, m_Location.Pos.Y));
    }
    m_System.Render(renderer);
    renderer->PopState();
}

// Paths -------------------------------------------------------------------------------------

bool CPathObject::LoadFromBase(const ClipObjectBase* base, const LoadContext& context)
{
    m_Curve.Clear();
    if (!CClipObject::LoadFromBase(base, context))
        return false;
    m_Curve.SetLocation(m_Location);
    const PathExtension& extension = ExtensionOf<PathExtension>(base);
    m_Curve.SetClosed(extension.closed != 0);
    for (unsigned i = 0; i < extension.points; ++i)
        m_Curve.AddPoint(extension.Points()[i]);
    if (m_Curve.GetLength() > 0)
        return true;
    OX_LOG(kChannel, diag::LogError, "Clip '%s': path '%s' has no length (%u usable of %u points); it is left out",
           context.clipId, base->id.c_str(), static_cast<unsigned>(m_Curve.EnumPoints()), extension.points);
    return false;
}

bool CPathObject::IsContains(const FloatVector& point) const
{
    if (m_Curve.GetSegments().empty())
        return false;
    FloatVector offset;
    m_Curve.GetCoefByPos(point, offset);
    return offset.X * offset.X + offset.Y * offset.Y <= 9.0f;
}

void CPathObject::Draw(graphics::CRenderer* renderer)
{
    if (IsVisible())
        m_Curve.Draw(*renderer, graphics::Color(0xFFFFFF00u));
}

} // namespace ox::misc::anim
