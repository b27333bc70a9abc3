#pragma once
// The player's inventory: the scene objects taken from scenes, front first. An object keeps
// its identity in the box; a group may look different in the box (its state "__inv") and on
// the cursor ("__cur"), and may change state as the story goes on. Nothing native draws the
// box or moves objects into it: scripts do both, through these operations and the hooks of
// CObjectsBoxWidget.
#include "gui/LuaWidget.h"
#include "misc/GenericIterator.h"
#include "quest/SceneObject.h"

#include <list>
#include <string>

namespace qe {

// One object in the box and the state it shows there (a state of a group, or the object
// itself; null for an empty group).
struct BoxItem {
    BaseSceneObjectPtrT Item;
    boost::intrusive_ptr<CSceneObject> InventState;
};

// The ids of a group's reserved states: the one shown in the box and the one on the cursor.
inline constexpr const char* kInventoryState = "__inv";
inline constexpr const char* kCursorState = "__cur";

// The state of `object` shown in the box: the object itself unless it is a group; for a group
// its state "__inv", else "__cur", else the first visible state, else the first; null for an
// empty group.
CSceneObject* FindObjectInventCondition(CBaseSceneObject* object);
// The state "__cur" of a group; null without one, or for an object that is no group.
CSceneObject* FindObjectCursorInventState(CBaseSceneObject* object);
// The state of a group `first` names, else `second`, else the first visible, else the first
// state; the object itself when it is no group; null for an empty group or none.
CBaseSceneObject* FindReservedState(CBaseSceneObject* object, const char* first, const char* second);

class CObjectsBox : public ox::misc::CRefCountedObj {
public:
    using ObjectsListT = std::list<BoxItem>;
    using ObjectsListIteratorT = ox::misc::CGenericIterator<ObjectsListT>;

    void Clear() { m_Objects.clear(); }
    unsigned EnumObjects() const { return static_cast<unsigned>(m_Objects.size()); }
    ObjectsListIteratorT GetObjects() { return ObjectsListIteratorT(&m_Objects); }
    const ObjectsListT& Objects() const { return m_Objects; }
    // The item `index` places from the front, or null past the end.
    BoxItem* GetObject(unsigned index);
    bool FindObjectInBox(const std::string& id) const;
    // A new item directly behind the one holding `after`, or at the front.
    void InsertObject(BaseSceneObjectPtrT object, const CBaseSceneObject* after);
    // Erases every item whose object has the id.
    void RemoveObject(const std::string& id);
    // Every item of a group with the id shows the state after its present one; the last
    // state, or one that is not among the group's, stays.
    void SetItemNextState(const std::string& id);
    // Every item of a group with the id shows its state `state`, when the group has one.
    void SetItemStateById(const std::string& id, const std::string& state);

private:
    // Makes `state` of the item's group current and the item's box state.
    static void ShowState(BoxItem& item, CBaseSceneObject& state);

    ObjectsListT m_Objects;
};

using ObjectsBoxPtrT = boost::intrusive_ptr<CObjectsBox>;

// A place for the box in a window's description: the hooks of its Lua table draw the
// contents and take the clicks.
class CObjectsBoxWidget : public ox::gui::CLuaWidget {};

} // namespace qe
