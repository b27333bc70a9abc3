#include "misc/animation/Clip.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "misc/animation/ClipObjects.h"
#include "misc/animation/ClipsLoader.h"

#include <cstring>

namespace ox::misc::anim {

bool g_LoadInvisibleObjects = false;

namespace {

constexpr const char* kChannel = "anim";

std::unique_ptr<CClipObject> MakeObject(uint32_t type)
{
    switch (type) {
    case ImageType:
        return std::make_unique<CImageObject>();
    case ParticleType:
        return std::make_unique<CParticleObject>();
    case ClipType:
        return std::make_unique<CClipViewObject>();
    case TextType:
        return std::make_unique<CTextObject>();
    default:
        return nullptr;
    }
}

} // namespace

CClip::CClip() = default;

CClip::~CClip() { Clear(); }

CClip::CClip(const CClip& other) { *this = other; }

CClip& CClip::operator=(const CClip& other)
{
    if (this == &other)
        return *this;
    Clear();
    for (const auto& object : other.m_Objects)
        m_Objects.emplace_back(object->Clone());
    for (const auto& path : other.m_Paths)
        m_Paths.emplace_back(static_cast<CPathObject*>(path->Clone()));
    // The copies follow the copied paths.
    for (const auto& object : m_Objects) {
        object->SetClipPaths(&m_Paths);
        if (const CPathObject* followed = object->GetPath()) {
            CPathObject* mine = nullptr;
            for (const auto& path : m_Paths)
                if (strcmp(path->GetId(), followed->GetId()) == 0)
                    mine = path.get();
            OX_ASSERT(mine);
            object->SetPath(mine);
        }
    }
    m_Rect = other.m_Rect;
    m_Id = other.m_Id;
    m_Pos = other.m_Pos;
    m_Size = other.m_Size;
    m_Angle = other.m_Angle;
    m_Color = other.m_Color;
    m_Flip = other.m_Flip;
    m_Additive = other.m_Additive;
    m_Mute = other.m_Mute;
    return *this;
}

void CClip::Clear()
{
    m_Objects.clear();
    m_Paths.clear();
    m_Id = nullptr;
}

bool CClip::Load(const char* id, bool reset) { return Load(CClipsLoader::Instance(), id, reset); }

bool CClip::CanNest(const char* id, const LoadContext* parent)
{
    const int depth = parent ? parent->depth + 1 : 0;
    for (const LoadContext* outer = parent; outer; outer = outer->parent)
        if (strcmp(outer->clipId, id) == 0) {
            OX_LOG(kChannel, diag::LogError, "Clip '%s' holds itself through '%s'; the inner one is left out", id,
                   parent->clipId);
            return false;
        }
    if (depth >= kMaxClipNesting) {
        OX_LOG(kChannel, diag::LogError, "Clip '%s' is nested more than %d deep in '%s'; left out", id,
               kMaxClipNesting, parent->clipId);
        return false;
    }
    return true;
}

bool CClip::Load(const CClipsLoader& loader, const char* id, bool reset, const LoadContext* parent)
{
    Clear();
    if (!id || !CanNest(id, parent))
        return false;
    const ClipRecord* clip = loader.FindClip(id);
    if (!clip) {
        OX_LOG(kChannel, diag::LogWarning, "Clip '%s' does not exist", id);
        return false;
    }
    OX_ASSERT(((size_t)clip) % 4 == 0);
    m_Id = &clip->id;
    m_Rect = FloatRect(clip->x, clip->y, clip->w, clip->h);
    LoadBudget ownBudget;
    LoadBudget& budget = parent ? *parent->budget : ownBudget;
    const LoadContext context {&loader, clip->id.c_str(), parent ? parent->depth + 1 : 0, parent, &budget, &m_Paths};
    auto spend = [&] {
        if (budget.left > 0) {
            --budget.left;
            return true;
        }
        if (!budget.reported)
            OX_LOG(kChannel, diag::LogError, "Clip '%s': more than %u objects with its nested clips; the rest are "
                   "left out", clip->id.c_str(), kMaxClipObjects);
        budget.reported = true;
        return false;
    };
    for (const ClipObjectBase* base = ObjectsBegin(clip); base; base = NextObject(base)) {
        if (base->type != PathType || !spend())
            continue;
        auto path = std::make_unique<CPathObject>();
        if (path->LoadFromBase(base, context))
            m_Paths.push_back(std::move(path));
    }
    for (const ClipObjectBase* base = ObjectsBegin(clip); base; base = NextObject(base)) {
        if (base->type == PathType || (!base->visible && !g_LoadInvisibleObjects) || !spend())
            continue;
        std::unique_ptr<CClipObject> object = MakeObject(base->type);
        if (!object) {
            OX_LOG(kChannel, diag::LogError, "Clip '%s': object '%s' is of the unknown kind %u; left out",
                   clip->id.c_str(), base->id.c_str(), base->type);
            continue;
        }
        if (object->LoadFromBase(base, context))
            m_Objects.push_back(std::move(object));
    }
    if (reset) {
        m_Pos = {0, 0};
        m_Size = {m_Rect.Width, m_Rect.Height};
        m_Angle = 0;
        m_Color = graphics::Color();
        m_Flip = 0;
        m_Additive = false;
        m_Mute = false;
    }
    Play();
    return true;
}

CClipObject* CClip::FindObject(const char* id) const
{
    for (const auto& object : m_Objects)
        if (id && strcmp(object->GetId(), id) == 0)
            return object.get();
    return nullptr;
}

template <class F>
void CClip::ForEachObject(F action)
{
    for (const auto& object : m_Objects)
        action(*object);
}

void CClip::Update()
{
    ForEachObject([](CClipObject& object) {
        object.Update();
        if (object.GetRawTime() != object.GetLastInterpolateTime())
            object.Interpolate();
    });
}

void CClip::Play()
{
    ForEachObject([](CClipObject& object) { object.Play(); });
}

void CClip::Pause()
{
    ForEachObject([](CClipObject& object) { object.Pause(); });
}

void CClip::Stop()
{
    ForEachObject([](CClipObject& object) { object.Stop(); });
}

void CClip::SetTime(int time, bool apply)
{
    ForEachObject([=](CClipObject& object) { object.SetTime(time, apply); });
}

void CClip::MoveTime(int time, bool apply)
{
    ForEachObject([=](CClipObject& object) { object.MoveTime(time, apply); });
}

void CClip::DisableSounds(bool disable)
{
    m_Mute = disable;
    ForEachObject([=](CClipObject& object) { object.DisableSounds(disable); });
}

void CClip::StopAllSounds()
{
    ForEachObject([](CClipObject& object) { object.StopAllSounds(); });
}

void CClip::Draw(graphics::CRenderer* renderer)
{
    if (!m_Id || m_Rect.Width == 0 || m_Rect.Height == 0)
        return;
    renderer->PushState();
    const float sx = (m_Flip & anim::FlipHorizontal) ? -1.0f : 1.0f;
    const float sy = (m_Flip & anim::FlipVertical) ? -1.0f : 1.0f;
    // The clip turns about its centre, and its position is where the centre lands.
    renderer->ApplyMatrix(MatrixTranslation(-m_Rect.X - m_Rect.Width / 2, -m_Rect.Y - m_Rect.Height / 2) *
                          MatrixScale(m_Size.X / m_Rect.Width * sx, m_Size.Y / m_Rect.Height * sy) *
                          MatrixRotation(m_Angle) * MatrixTranslation(m_Pos.X, m_Pos.Y));
    renderer->SetClipPoly(RectToPoly4(m_Rect));
    renderer->SetColor(renderer->GetColor() * m_Color);
    if (m_Additive)
        renderer->SetBlendMode(graphics::BlendAdditive);
    ForEachObject([renderer](CClipObject& object) { object.Draw(renderer); });
    renderer->PopState();
}

} // namespace ox::misc::anim
