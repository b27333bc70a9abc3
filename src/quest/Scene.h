#pragma once
// One picture of a level: its objects and groups (the front of the list is the topmost),
// its clickable areas, and the flat list of everything clickable that hit tests walk.
#include "misc/GenericIterator.h"
#include "quest/SceneObject.h"

#include <list>
#include <string>

namespace qe {

class CLevel;
class CScene;
using ScenePtrT = boost::intrusive_ptr<CScene>;

class CScene : public CTreeNode {
public:
    enum Flags : uint32_t { FlagMainScene = 1, FlagSceneInNewWindow = 2 };
    using ObjectsListT = std::list<BaseSceneObjectPtrT>;
    using ObjectIteratorT = ox::misc::CGenericIterator<ObjectsListT>;

    // The editing rules of the tree: insertion directly behind `after`, or at the front
    // (on top) when `after` is null or not in the list; removal of every occurrence. The
    // flat list changes only with UpdateTotalChildList.
    virtual void RemoveObject(CBaseSceneObject& object);
    virtual void InsertObject(BaseSceneObjectPtrT object, const CBaseSceneObject* after);
    virtual void RemoveArea(CBaseSceneObject& area);
    virtual void InsertArea(BaseSceneObjectPtrT area, const CBaseSceneObject* after);

    const std::string& GetId() const { return m_Id; }
    void SetId(const std::string& id) { m_Id = id; }
    FloatVector GetSize() const { return m_Size; }
    void SetSize(const FloatVector& size) { m_Size = size; }
    FloatVector GetOffset() const { return m_Offset; }
    void SetOffset(const FloatVector& offset) { m_Offset = offset; }
    uint32_t GetFlags() const { return m_Flags; }
    void SetFlags(uint32_t flags) { m_Flags = flags; }
    bool ReadFlag(uint32_t flag) const { return (m_Flags & flag) != 0; }
    void RaiseFlag(uint32_t flag) { m_Flags |= flag; }
    void ClearFlag(uint32_t flag) { m_Flags &= ~flag; }
    const std::string& GetScript() const { return m_Script; }
    void SetScript(const std::string& script) { m_Script = script; }
    CLevel* GetParentLevel() const { return m_ParentLevel; }
    void SetParentLevel(CLevel* level) { m_ParentLevel = level; }

    unsigned EnumObjects() const { return static_cast<unsigned>(m_Objects.size()); }
    ObjectIteratorT GetObjects() { return ObjectIteratorT(&m_Objects); }
    const ObjectsListT& Objects() const { return m_Objects; }
    unsigned EnumAreas() const { return static_cast<unsigned>(m_Areas.size()); }
    ObjectIteratorT GetAreas() { return ObjectIteratorT(&m_Areas); }
    const ObjectsListT& Areas() const { return m_Areas; }
    unsigned EnumChilds() const { return static_cast<unsigned>(m_Childs.size()); }
    ObjectIteratorT GetChilds() { return ObjectIteratorT(&m_Childs); }
    const ObjectsListT& Childs() const { return m_Childs; }

    // Rebuilds the flat list: the objects in order, each group replaced by its states (and
    // a group among them by its own states); no areas.
    void UpdateTotalChildList();
    // The last object (or area) in list order with this id, or null; states of groups are
    // not searched.
    CBaseSceneObject* IsContentObject(const std::string& id) const;
    CBaseSceneObject* IsContentArea(const std::string& id) const;

    // Defines quest.on_show_scene(_current_scene) from the scene's script in the level's
    // Lua host and calls it with this scene. An empty script does nothing.
    void RunSceneScript();
    // Every object from the back; UpdateGame leaves out removed ones.
    void Update();
    void UpdateGame();
    // The game's view, inside a saved renderer state: the objects from the back (removed
    // ones never, hidden ones only while they fade out), then the areas when the level
    // shows them.
    void DrawGame(ox::graphics::CRenderer* renderer);
    // The editor's views: the objects; or, moved by the offset, the frame of the picture,
    // the objects and the areas.
    void Draw(ox::graphics::CRenderer* renderer);
    void DrawInEditor(ox::graphics::CRenderer* renderer);

    // The object under a scene point: the flat list from the front, the first one that no
    // flag of its own or of a group above keeps from clicks and that contains the point;
    // then the areas from the front, the first one not disabled. The alpha-mask store
    // answers the pixel tests of images and alpha clips (it may be null). Null: nothing.
    CBaseSceneObject* GetObjectAt(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const;

    // The XML form: id, size, offset, flags, script, then `objects` and `areas` (brief
    // objects and areas hold only their game state). A brief load reads only id and flags of
    // the scene; objects and areas are made anew from their elements.
    void Save(ox::misc::CXmlElement& parent, bool brief) const;
    void Load(const ox::core::CSettingsGroup& element, bool brief);

    // A deep copy: fields, parent link, cloned areas and objects, the flat list rebuilt.
    ScenePtrT Clone() const;

private:
    ObjectsListT m_Objects;
    ObjectsListT m_Areas;
    ObjectsListT m_Childs;
    std::string m_Id;
    FloatVector m_Size;
    FloatVector m_Offset;
    uint32_t m_Flags = 0;
    std::string m_Script;
    CLevel* m_ParentLevel = nullptr;
};

// A new object from an element of a scene's `objects`: `object` of type image or clip, or
// `group`; null for anything else or a value that does not read (logged). The caller adopts
// the one reference it holds (`BaseSceneObjectPtrT(object, false)`).
CBaseSceneObject* LoadSceneChild_(const ox::core::CSettingsGroup* element, bool brief);

} // namespace qe
