#pragma once
// An object with alternative pictures: each child is a state, and the current one is the
// state without ObjectFlagHidden. The group draws no picture of its own; its colour and
// fade multiply its states', and its flags keep every state from taking a click.
#include "misc/GenericIterator.h"
#include "quest/SceneObject.h"

#include <list>

namespace ox::core {
class CGroupTimer;
}

namespace qe {

class CSceneGroup : public CBaseSceneObject {
public:
    using ChildsListT = std::list<BaseSceneObjectPtrT>;
    using GroupChildIteratorT = ox::misc::CGenericIterator<ChildsListT>;

    CSceneGroup() = default;
    // The states that stay alive elsewhere lose their link to the group.
    ~CSceneGroup() override;

    // The mean position of the visible states, or of all when every one is hidden; (0, 0)
    // without states.
    FloatVector GetPos() const override;
    // Every state from the back, hidden ones too, so that they keep time.
    void Update() override;
    // The states from the back, with no transform of the group's own; a hidden state only
    // while it fades out.
    void DrawTransformed(ox::graphics::CRenderer* renderer) override;
    int GetType() const override { return GroupType; }
    BaseSceneObjectPtrT Clone() const override;
    // The attributes, then a new state for each child element (the states held are kept).
    void Load(const ox::core::CSettingsGroup& element, bool brief) override;

    // Inserts behind `after` (at the front when it is null or no state) and links the child
    // to the group. A child that is this group or holds it makes a cycle: refused, logged.
    bool InsertChild(BaseSceneObjectPtrT child, const CBaseSceneObject* after);
    // Removes every occurrence and clears the child's link to the group.
    void RemoveChild(CBaseSceneObject& child);
    unsigned EnumChilds() const { return static_cast<unsigned>(m_Childs.size()); }
    GroupChildIteratorT GetChilds() { return GroupChildIteratorT(&m_Childs); }
    const ChildsListT& Childs() const { return m_Childs; }
    // Whether `node` is a state of this group or of a group among its states.
    bool Holds(const CBaseSceneObject* node) const;

    // The first state with this id, or null.
    CBaseSceneObject* GetStateById(const std::string& id) const;
    bool FindState(const std::string& id) const { return GetStateById(id) != nullptr; }
    // Some state with this id is visible.
    bool IsCurrent(const std::string& id) const;
    // The id of the first visible state, or empty.
    std::string GetFirstVisibleState() const;
    // Shows the state `id` and hides the others, walking from the back. Above 0.01 ms the
    // change fades: the state that appears first holds if `holdFirst`, the others fade.
    void SetCurrent(const std::string& id, bool holdFirst, float time, const ox::core::CGroupTimer* timer);
    // Shows the n-th state (from 1) and hides the others; 0 hides them all.
    void SetCurrentByNumber(int number);

protected:
    const char* XmlName() const override { return "group"; }
    void SaveChildren(ox::misc::CXmlElement& element, bool brief) const override;

private:
    ChildsListT m_Childs;
};

using SceneGroupPtrT = boost::intrusive_ptr<CSceneGroup>;

} // namespace qe
