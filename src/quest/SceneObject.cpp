#include "quest/SceneObject.h"

#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "misc/Matrix.h"
#include "quest/SceneGroup.h"

#include <algorithm>
#include <cmath>

namespace qe {

using ox::graphics::CRenderer;
using ox::misc::Poly4;

namespace {

constexpr const char* kChannel = "quest";

// Turns a point about `centre` by `angle` radians, as the renderer's rotation does.
FloatVector TurnAbout(const FloatVector& point, const FloatVector& centre, float c, float s)
{
    const FloatVector d = point - centre;
    return {centre.X + d.X * c - d.Y * s, centre.Y + d.X * s + d.Y * c};
}

Poly4 RectanglePoly(const FloatVector& pos, const FloatVector& size, float angle)
{
    const float x1 = pos.X - size.X / 2, x2 = pos.X + size.X / 2;
    const float y1 = pos.Y - size.Y / 2, y2 = pos.Y + size.Y / 2;
    const float left = std::min(x1, x2), right = std::max(x1, x2);
    const float top = std::min(y1, y2), bottom = std::max(y1, y2);
    Poly4 poly {{{left, top}, {right, top}, {right, bottom}, {left, bottom}}};
    if (angle != 0) {
        const float c = std::cos(angle), s = std::sin(angle);
        for (auto& point : poly.Points)
            point = TurnAbout(point, pos, c, s);
    }
    return poly;
}

} // namespace

// CBaseSceneObject --------------------------------------------------------------------------

void CBaseSceneObject::SetSelected(bool selected)
{
    if (selected)
        RaiseFlag(FlagSelected);
    else
        ClearFlag(FlagSelected);
}

bool CBaseSceneObject::SetParentGroup(CSceneGroup* group)
{
    if (group && group->IsWithin(this)) {
        OX_LOG(kChannel, ox::diag::LogError, "Object '%s' can't become a state of group '%s', which lies inside it",
               m_Id.c_str(), group->GetIdRef().c_str());
        return false;
    }
    m_ParentGroup = group;
    return true;
}

const std::string& CBaseSceneObject::GetLuaScript(int kind) const
{
    static const std::string none;
    return kind >= 0 && kind < ScriptCount ? m_Scripts[kind] : none;
}

void CBaseSceneObject::SetLuaScript(const std::string& script, int kind)
{
    if (kind >= 0 && kind < ScriptCount)
        m_Scripts[kind] = script;
}

Poly4 CBaseSceneObject::GetPoly() const { return RectanglePoly(GetPos(), GetSize(), GetAngle()); }

bool CBaseSceneObject::IsParentGroupVisible() const
{
    return !m_ParentGroup || !m_ParentGroup->ReadFlag(FlagInvisible);
}

bool CBaseSceneObject::CanTakeClick() const
{
    for (const CBaseSceneObject* node = this; node; node = node->m_ParentGroup)
        if (node->m_ObjectFlags & kNoClickFlags)
            return false;
    return true;
}

bool CBaseSceneObject::IsWithin(const CBaseSceneObject* node) const
{
    for (const CBaseSceneObject* at = this; at; at = at->m_ParentGroup)
        if (at == node)
            return true;
    return false;
}

void CBaseSceneObject::CopyTo(CBaseSceneObject& clone) const
{
    clone.m_Flags = m_Flags;
    clone.m_ObjectFlags = m_ObjectFlags;
    clone.m_Id = m_Id;
    clone.m_Hint = m_Hint;
    std::copy(std::begin(m_Scripts), std::end(m_Scripts), std::begin(clone.m_Scripts));
    clone.m_Alpha = m_Alpha;
}

void CBaseSceneObject::DrawTransformed(CRenderer* renderer)
{
    const FloatVector pos = GetPos();
    const float angle = GetAngle();
    const ox::misc::FloatMatrix move = ox::misc::MatrixTranslation(pos.X, pos.Y);
    renderer->ApplyMatrix(angle == 0 ? move : ox::misc::MatrixRotation(angle) * move);
    Draw(renderer);
}

void CBaseSceneObject::DrawGame(CRenderer* renderer)
{
    Color color = GetColor();
    if (m_Alpha > kNoFade)
        color.Alpha = static_cast<int16_t>(color.Alpha * m_Alpha);
    renderer->PushState();
    renderer->SetColor(renderer->GetColor() * color);
    DrawTransformed(renderer);
    renderer->PopState();
}

void CBaseSceneObject::DoDrawForEditor(CRenderer* renderer)
{
    const bool selected = ReadFlag(FlagSelected);
    const bool visible = !ReadFlag(FlagInvisible) && IsParentGroupVisible();
    renderer->PushState();
    if (visible || selected) {
        Color color = GetColor();
        if (!visible)
            color.Alpha = 100;
        renderer->PushState();
        renderer->SetColor(renderer->GetColor() * color);
        DrawTransformed(renderer);
        renderer->PopState();
    }
    if (selected && HasEditorFrame()) {
        const Poly4 frame = GetPoly();
        for (int i = 0; i < 4; ++i)
            renderer->RenderLine(frame[i], frame[(i + 1) % 4], Color(0xFFFFFFFFu));
    }
    renderer->PopState();
}

// CSceneObject ------------------------------------------------------------------------------

bool CSceneObject::IsContains(const FloatVector& point, const ox::core::CTexturesAlpha*) const
{
    return IsInRectangle(point, GetPos(), GetSize(), GetAngle());
}

bool CSceneObject::IsInRectangle(const FloatVector& point, const FloatVector& pos, const FloatVector& size,
                                 float angle)
{
    // The circle through the corners holds the whole rectangle, whatever its turn: a point
    // outside it is outside without the corners being worked out.
    const FloatVector d = point - pos;
    if (d.X * d.X + d.Y * d.Y > (size.X * size.X + size.Y * size.Y) / 4)
        return false;
    return ox::misc::IsInside(RectanglePoly(pos, size, angle), point);
}

void CSceneObject::CopyTo(CSceneObject& clone) const
{
    CBaseSceneObject::CopyTo(clone);
    clone.m_Sound = m_Sound;
}

// CObject -----------------------------------------------------------------------------------

void CObject::CopyTo(CObject& clone) const
{
    CSceneObject::CopyTo(clone);
    clone.m_NativeSize = m_NativeSize;
    clone.m_Pos = m_Pos;
    clone.m_Angle = m_Angle;
    clone.m_Size = m_Size;
    clone.m_Color = m_Color;
}

FloatVector CObject::ToPicture(const FloatVector& point) const
{
    const FloatVector d = point - m_Pos;
    float x = d.X, y = d.Y;
    if (m_Angle != 0) {
        const float c = std::cos(m_Angle), s = std::sin(m_Angle);
        x = c * d.X + s * d.Y;
        y = c * d.Y - s * d.X;
    }
    return {x * m_NativeSize.X / m_Size.X + m_NativeSize.X / 2, y * m_NativeSize.Y / m_Size.Y + m_NativeSize.Y / 2};
}

} // namespace qe
