#pragma once
// What hangs on the mouse pointer during a quest: the inventory object the player picked up
// (drawn in its cursor state, at a fixed width) and the hint of the object under the pointer.
// The pointer itself belongs to the GUI's cursor; this class only reads its position. Scripts
// call Draw, from a widget above the scene.
#include "graphics/Image.h"
#include "misc/WideChar.h"
#include "quest/SceneObject.h"

#include <string>

namespace ox::graphics {
class CFont;
}

namespace qe {

class CCursor : public ox::misc::CRefCountedObj {
public:
    // The object handed over, and the state drawn: for a group its state "__cur", else
    // "__inv", else the first visible, else the first; an empty group keeps the drawn one.
    void SetCursorObject(CBaseSceneObject* object);
    CBaseSceneObject* GetCursorObject() const { return m_CursorObject.get(); }
    CBaseSceneObject* GetDrawObject() const { return m_DrawObject.get(); }
    // Drops the object; with `resetHints` the hints show again and the text empties.
    void ClearCursor(bool resetHints);
    // At the pointer: the pre-object picture, the object scaled to the object width, then the
    // hint (white, moved left so that it ends at the work area's right edge).
    void Draw(ox::graphics::CRenderer* renderer);

    void SetWorkAreaSize(const FloatVector& size) { m_WorkAreaSize = size; }
    void SetWorkAreaOffset(const FloatVector& offset) { m_WorkAreaOffset = offset; }
    void SetIsDrag(bool drag) { m_IsDrag = drag; }
    bool GetIsDrag() const { return m_IsDrag; }
    void SetShowHints(bool show) { m_ShowHints = show; }
    bool GetShowHints() const { return m_ShowHints; }
    void SetDisableHints(bool disable) { m_DisableHints = disable; }
    bool GetDisableHints() const { return m_DisableHints; }
    void SetHintOffset(float x, float y) { m_HintOffset = {x, y}; }
    FloatVector GetHintOffset() const { return m_HintOffset; }
    // The hint is a string-table id; the second argument has no effect.
    void SetHintText(const std::string& id, bool unused = false);
    const ox::wstring& GetHintText() const { return m_HintText; }
    // A font of the font manager; an unknown name leaves no font (logged): no hints are drawn.
    void SetHintFont(const std::string& name);
    void SetHintFont(const ox::graphics::CFont* font) { m_HintFont = font; }
    void SetObjectWidth(float width) { m_ObjectWidth = width; }
    void SetCursorObjectScale(float x, float y) { m_CursorObjectScale = {x, y}; }
    FloatVector GetCursorObjectScale() const { return m_CursorObjectScale; }
    void SetObjectOffset(float x, float y) { m_ObjectOffset = {x, y}; }
    void SetPreObject(const std::string& textureId);
    void SetPreObjectOffset(float x, float y) { m_PreObjectOffset = {x, y}; }

private:
    void DrawObject(ox::graphics::CRenderer& renderer, const FloatVector& pointer);
    void DrawHint(ox::graphics::CRenderer& renderer, const FloatVector& pointer) const;

    BaseSceneObjectPtrT m_CursorObject;
    BaseSceneObjectPtrT m_DrawObject;
    FloatVector m_WorkAreaSize {1024, 768};
    FloatVector m_WorkAreaOffset;
    FloatVector m_HintOffset {10, 10};
    bool m_IsDrag = false;
    bool m_ShowHints = true;
    bool m_DisableHints = false;
    ox::wstring m_HintText;
    const ox::graphics::CFont* m_HintFont = nullptr;
    FloatVector m_CursorObjectScale {1, 1};
    FloatVector m_ObjectOffset;
    FloatVector m_PreObjectOffset;
    ox::graphics::CImage m_PreObject;
    float m_ObjectWidth = 100.0f;
};

// The process-wide game cursor.
struct g_Cursor {
    static CCursor& Instance();
};

} // namespace qe
