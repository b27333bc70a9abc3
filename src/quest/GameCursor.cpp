#include "quest/GameCursor.h"

#include "core/FontManager.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Font.h"
#include "graphics/Renderer.h"
#include "gui/Cursor.h"
#include "misc/StringTable.h"
#include "quest/ObjectsBox.h"

#include <cmath>

namespace qe {

using ox::misc::MatrixRotation;
using ox::misc::MatrixScale;
using ox::misc::MatrixTranslation;

void CCursor::SetCursorObject(CBaseSceneObject* object)
{
    m_CursorObject = object;
    if (CBaseSceneObject* state = FindReservedState(object, kCursorState, kInventoryState); state || !object)
        m_DrawObject = state;
}

void CCursor::ClearCursor(bool resetHints)
{
    m_CursorObject.reset();
    m_DrawObject.reset();
    if (!resetHints)
        return;
    m_DisableHints = false;
    m_ShowHints = true;
    m_HintText.clear();
}

void CCursor::SetHintText(const std::string& id, bool)
{
    m_HintText = ox::misc::CStringTable::Instance().FormatByStringsID(id);
    // The table answers a missing id with a text of its own, which the hint shows.
    if (m_HintText.find(u"has not found!") != ox::wstring::npos)
        OX_LOG("data", ox::diag::LogWarning, "hint '%s': a text of it is not in the string table", id.c_str());
}

void CCursor::SetHintFont(const std::string& name)
{
    m_HintFont = ox::core::CFontManager::Instance().GetItem(name.c_str());
    OX_CHECK_DATA(m_HintFont != nullptr);
}

void CCursor::SetPreObject(const std::string& textureId)
{
    m_PreObject.Init();
    m_PreObject.SetTexture(textureId.c_str());
}

void CCursor::Draw(ox::graphics::CRenderer* renderer)
{
    OX_CHECK_DATA(renderer != nullptr);
    const FloatVector pointer = ox::gui::CCursor::Instance().GetPosition();
    if (m_DrawObject)
        DrawObject(*renderer, pointer);
    if (m_ShowHints && m_HintFont && !m_DisableHints)
        DrawHint(*renderer, pointer);
}

void CCursor::DrawObject(ox::graphics::CRenderer& r, const FloatVector& pointer)
{
    r.PushState();
    r.ApplyMatrix(MatrixTranslation(pointer.X + m_PreObjectOffset.X, pointer.Y + m_PreObjectOffset.Y));
    m_PreObject.Draw(r);
    r.PopState();

    // An object without a width has no scale to draw it at.
    const float width = m_DrawObject->GetSize().X;
    if (width == 0)
        return;
    const float scale = m_ObjectWidth / width;
    const float qx = std::trunc(pointer.X + m_ObjectOffset.X), qy = std::trunc(pointer.Y + m_ObjectOffset.Y);
    r.PushState();
    r.ApplyMatrix(MatrixScale(scale, scale) * MatrixRotation(m_DrawObject->GetAngle()) * MatrixTranslation(qx, qy));
    m_DrawObject->Draw(&r);
    r.PopState();
}

void CCursor::DrawHint(ox::graphics::CRenderer& r, const FloatVector& pointer) const
{
    const auto width = static_cast<float>(m_HintFont->GetStringWidth(m_HintText));
    const float edge = m_WorkAreaSize.X + m_WorkAreaOffset.X;
    float x = pointer.X + m_HintOffset.X;
    if (x + width > edge)
        x = edge - width;
    r.RenderString(m_HintFont, m_HintText, x, pointer.Y + m_HintOffset.Y);
}

CCursor& g_Cursor::Instance()
{
    static auto* cursor = new CCursor();
    return *cursor;
}

} // namespace qe
