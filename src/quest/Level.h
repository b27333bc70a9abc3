#pragma once
// A level: its scenes in file order, two scripts (run on each take and at the start), two
// sounds, and the object under the mouse. A running game holds one level at a time; its
// scripts run in the Lua host listed as "qe_level".
#include "misc/GenericIterator.h"
#include "quest/Scene.h"

#include <list>
#include <string>

namespace qe {

class CLevel;
using LevelPtrT = boost::intrusive_ptr<CLevel>;

class CLevel : public CTreeNode {
public:
    enum Script : int { ScriptLevel = 0, ScriptStart = 1, ScriptCount = 2 };
    enum Sound : int { SoundMovingToABox = 0, SoundOpenScene = 1, SoundCount = 2 };
    using ScenesListT = std::list<ScenePtrT>;
    using SceneIteratorT = ox::misc::CGenericIterator<ScenesListT>;

    CLevel() = default;
    // Running effects end first, so that none outlives the objects it fades.
    ~CLevel() override;

    // Inserts behind `after` (or at the front) and links the scene to this level.
    virtual void InsertScene(ScenePtrT scene, const CScene* after);
    virtual void RemoveScene(CScene& scene);

    const std::string& GetId() const { return m_Id; }
    void SetId(const std::string& id) { m_Id = id; }
    // Empty for an index out of range; setting one is ignored.
    const std::string& GetLuaScript(int index) const;
    void SetLuaScript(const std::string& script, int index);
    const std::string& GetSound(int index) const;
    void SetSound(const std::string& sound, int index);
    bool GetShowChildSceneAreas() const { return m_ShowChildSceneAreas; }
    void SetShowChildSceneAreas(bool show) { m_ShowChildSceneAreas = show; }

    unsigned EnumScenes() const { return static_cast<unsigned>(m_Scenes.size()); }
    SceneIteratorT GetScenes() { return SceneIteratorT(&m_Scenes); }
    const ScenesListT& Scenes() const { return m_Scenes; }
    CScene* GetSceneById(const std::string& id) const;
    // Every scene's parent link becomes this level.
    void UpdateLinks();
    // Empties the scene list.
    void ClearObjectsList() { m_Scenes.clear(); }

    // Scenes in order; in each, the objects in order (removed ones only `withRemoved`), with
    // the states of groups when `inGroups`, then the areas. The first match, or null.
    CBaseSceneObject* FindObjectById(const std::string& id, bool inGroups, bool withRemoved) const;
    // Takes the last object with this id out of its scene (areas and states are not looked
    // at) and rebuilds that scene's flat list. Focus on it, or on a state of it, is dropped
    // without its leave script.
    void RemoveObject(const std::string& id);

    // The object under the mouse changed: the old one's leave script, the new one's enter
    // script and the game cursor for its group (or itself), the cursor dropped when nothing
    // is under the mouse any more, and the hint. Nothing happens for the same object.
    void UpdateFocusedObject(CBaseSceneObject* object);
    // Refreshes the hint if `object` has the focus.
    void UpdateHint(CBaseSceneObject* object);
    CBaseSceneObject* GetFocusedObject() const { return m_FocusedObject.get(); }

    // Defines quest.on_box_take from the level script (or the start script) in the level's
    // Lua host and calls it. An empty script does nothing.
    void RunLevelScript();
    void RunStartLevelScript();

    // The XML form: id (and unless brief the scripts and sounds), then the scenes.
    void Save(ox::misc::CXmlElement& parent, bool brief) const;
    void Load(const ox::core::CSettingsGroup& element, bool brief);

    // A deep copy of every scene, linked to the copy; the focus is not copied.
    LevelPtrT Clone() const;

private:
    void RefreshHint(const CBaseSceneObject* object) const;
    void RunScript(const std::string& script);

    ScenesListT m_Scenes;
    std::string m_Id;
    std::string m_Sounds[SoundCount];
    std::string m_Scripts[ScriptCount];
    // Held, so that a script removing the focused object from its scene leaves no dangling
    // link; the level's walks drop it when they take the object out.
    BaseSceneObjectPtrT m_FocusedObject;
    bool m_ShowChildSceneAreas = true;
};

} // namespace qe
