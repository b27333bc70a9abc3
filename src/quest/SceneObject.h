#pragma once
// What a player can see or click in a scene. CBaseSceneObject holds what every kind
// shares: an id, a hint, the editor's and the game's flag words, four script slots, the
// group the object is a state of, and the fade alpha an effect writes. CSceneObject adds a
// sound and the contour test; CObject a place (position, angle, size), a colour and the
// pixel size of its picture. Drawing walks back to front, hit tests front to back.
#include "graphics/Color.h"
#include "misc/Poly.h"
#include "misc/Vector.h"
#include "quest/TreeNode.h"

#include <boost/intrusive_ptr.hpp>

#include <cstdint>
#include <string>

namespace ox::core {
class CSettingsGroup;
class CTexturesAlpha;
}
namespace ox::misc {
class CXmlElement;
}
namespace ox::graphics {
class CRenderer;
}

namespace qe {

using ox::graphics::Color;
using ox::misc::FloatVector;

class CSceneGroup;
class CBaseSceneObject;
using BaseSceneObjectPtrT = boost::intrusive_ptr<CBaseSceneObject>;

class CBaseSceneObject : public CTreeNode {
public:
    enum EditorFlags : uint32_t { FlagSelected = 1, FlagNoDrag = 2, FlagInvisible = 4, FlagExpanded = 8 };
    enum GameFlags : uint32_t {
        ObjectFlagDisable = 1,
        ObjectFlagHidden = 2,
        ObjectFlagRemoved = 4,
        ObjectFlagDoNotNeed = 8,
        ObjectCanAlwaysTake = 16,
    };
    enum ScriptKind : int {
        ScriptMouseClick = 0,
        ScriptMouseEnter = 1,
        ScriptMouseLeave = 2,
        ScriptInventoryClick = 3,
        ScriptCount = 4,
    };
    enum Type : int { ObjectType = 1, GroupType = 2 };
    // Game flags that keep an object, or every state of a group, from taking a click.
    static constexpr uint32_t kNoClickFlags = ObjectFlagDisable | ObjectFlagHidden | ObjectFlagRemoved;
    // The fade alpha while no fade runs.
    static constexpr float kNoFade = -1.0f;

    bool IsSelected() const override { return ReadFlag(FlagSelected); }
    void SetSelected(bool selected) override;

    virtual std::string GetId() const { return m_Id; }
    virtual FloatVector GetPos() const { return {}; }
    virtual FloatVector GetSize() const { return {}; }
    virtual float GetAngle() const { return 0; }
    virtual Color GetColor() const { return Color(); }
    virtual std::string GetHint() const { return m_Hint; }
    virtual void SetId(const std::string& id) { m_Id = id; }
    virtual void SetPos(const FloatVector&) {}
    virtual void SetSize(const FloatVector&) {}
    virtual void SetAngle(float) {}
    virtual void SetColor(const Color&) {}
    virtual void SetHint(const std::string& hint) { m_Hint = hint; }

    virtual void Update() {}
    // The picture in the object's own frame, centred on the origin.
    virtual void Draw(ox::graphics::CRenderer*) {}
    // The editor's view: a hidden object shows only while selected, and a selected one gets
    // a frame.
    virtual void DoDrawForEditor(ox::graphics::CRenderer* renderer);
    // Turned by the angle and moved to the position, then Draw.
    virtual void DrawTransformed(ox::graphics::CRenderer* renderer);
    // Inside a saved renderer state: the colour (its alpha scaled by a running fade)
    // multiplies the renderer's, then DrawTransformed.
    virtual void DrawGame(ox::graphics::CRenderer* renderer);

    virtual int GetType() const { return ObjectType; }
    // Whether a scene point lies on the object. Images and alpha clips test the pixel: the
    // alpha-mask store answers for textures it has a mask of (it may be null).
    virtual bool IsContains(const FloatVector&, const ox::core::CTexturesAlpha*) const { return false; }
    // A deep copy without a parent group; null for a kind that has none.
    virtual BaseSceneObjectPtrT Clone() const { return nullptr; }

    // The XML form: an element of the kind's name under `parent`, its attributes (brief: the
    // game state only), then its children.
    void Save(ox::misc::CXmlElement& parent, bool brief) const;
    // Reads the attributes that exist; brief reads the game state only. A value that does not
    // read raises boost::bad_lexical_cast.
    virtual void Load(const ox::core::CSettingsGroup& element, bool brief);

    // Editor flags. Raise and Clear leave a bit that already has the wanted state alone.
    void RaiseFlag(uint32_t flag) { m_Flags |= flag; }
    void ClearFlag(uint32_t flag) { m_Flags &= ~flag; }
    bool ReadFlag(uint32_t flag) const { return (m_Flags & flag) != 0; }
    uint32_t GetFlags() const { return m_Flags; }
    void SetFlags(uint32_t flags) { m_Flags = flags; }
    // Game flags.
    void RaiseObjectFlag(uint32_t flag) { m_ObjectFlags |= flag; }
    void ClearObjectFlag(uint32_t flag) { m_ObjectFlags &= ~flag; }
    bool ReadObjectFlag(uint32_t flag) const { return (m_ObjectFlags & flag) != 0; }
    uint32_t GetObjectFlags() const { return m_ObjectFlags; }
    void SetObjectFlags(uint32_t flags) { m_ObjectFlags = flags; }

    const std::string& GetIdRef() const { return m_Id; }
    CSceneGroup* GetParentGroup() const { return m_ParentGroup; }
    // The group this object is a state of (null: none). A group that is this object or lies
    // below it is refused with a log line: parent links never loop.
    bool SetParentGroup(CSceneGroup* group);
    // The script of a kind; empty (and ignored when set) for a kind out of range.
    const std::string& GetLuaScript(int kind) const;
    void SetLuaScript(const std::string& script, int kind);
    // The rectangle of GetSize centred on GetPos, turned by GetAngle about GetPos, corners
    // from the smaller coordinates on.
    ox::misc::Poly4 GetPoly() const;
    // False only when the parent group is hidden in the editor (FlagInvisible).
    bool IsParentGroupVisible() const;
    float GetAlpha() const { return m_Alpha; }
    void SetAlpha(float alpha) { m_Alpha = alpha; }

    // Neither the object nor any group above it is disabled, hidden or removed.
    bool CanTakeClick() const;
    // The object is `node` or lies below it through parent links.
    bool IsWithin(const CBaseSceneObject* node) const;

protected:
    CBaseSceneObject() = default;
    virtual const char* XmlName() const { return "object"; }
    // Attributes in the order of the kinds: object_flags, id, hint, editor flags and scripts.
    virtual void SaveAttributes(ox::misc::CXmlElement& element, bool brief) const;
    virtual void SaveChildren(ox::misc::CXmlElement&, bool) const {}
    // What every kind copies into its clone: flags, id, hint, scripts and fade alpha.
    void CopyTo(CBaseSceneObject& clone) const;
    // Whether a selected object gets its frame in the editor's view.
    virtual bool HasEditorFrame() const { return true; }

private:
    uint32_t m_Flags = 0;
    uint32_t m_ObjectFlags = 0;
    std::string m_Id;
    std::string m_Hint;
    std::string m_Scripts[ScriptCount];
    CSceneGroup* m_ParentGroup = nullptr;
    float m_Alpha = kNoFade;
};

// A scene object that is not a group: a sound and the contour test.
class CSceneObject : public CBaseSceneObject {
public:
    const std::string& GetSound() const { return m_Sound; }
    void SetSound(const std::string& sound) { m_Sound = sound; }

    // Inside the contour of GetPoly; a point on an edge is outside.
    bool IsContains(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const override;

    void Load(const ox::core::CSettingsGroup& element, bool brief) override;

protected:
    void SaveAttributes(ox::misc::CXmlElement& element, bool brief) const override;
    void CopyTo(CSceneObject& clone) const;
    // The contour test of a rectangle of `size` centred on `pos`, turned by `angle`.
    static bool IsInRectangle(const FloatVector& point, const FloatVector& pos, const FloatVector& size, float angle);

private:
    std::string m_Sound;
};

// A scene object with a place and a picture: an image or a clip.
class CObject : public CSceneObject {
public:
    FloatVector GetPos() const override { return m_Pos; }
    FloatVector GetSize() const override { return m_Size; }
    float GetAngle() const override { return m_Angle; }
    Color GetColor() const override { return m_Color; }
    void SetPos(const FloatVector& pos) override { m_Pos = pos; }
    void SetPos(float x, float y) { m_Pos = {x, y}; }
    void SetSize(const FloatVector& size) override { m_Size = size; }
    void SetAngle(float angle) override { m_Angle = angle; }
    void SetColor(const Color& color) override { m_Color = color; }
    // The pixel size of the texture or clip; zero when it is missing.
    FloatVector GetNativeSize() const { return m_NativeSize; }

    void Load(const ox::core::CSettingsGroup& element, bool brief) override;

protected:
    void SaveAttributes(ox::misc::CXmlElement& element, bool brief) const override;
    // The colour in a brief save only when it is not opaque white.
    void SaveColor(ox::misc::CXmlElement& element, bool brief) const;
    // The `color` attribute, or opaque white without one.
    void LoadColor(const ox::core::CSettingsGroup& element);
    void CopyTo(CObject& clone) const;
    // IsContains of a scene object, on the fields.
    bool IsInContour(const FloatVector& point) const { return IsInRectangle(point, m_Pos, m_Size, m_Angle); }
    // A scene point in picture pixels: unturned about the position, scaled from the shown
    // size to the native one, measured from the picture's top left corner.
    FloatVector ToPicture(const FloatVector& point) const;

    FloatVector m_NativeSize;
    FloatVector m_Pos;
    float m_Angle = 0;
    FloatVector m_Size;
    Color m_Color;
};

} // namespace qe
