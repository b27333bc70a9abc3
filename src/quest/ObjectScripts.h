#pragma once
// Object scripts run as script threads. A fragment (the body of a click, mouse-enter,
// mouse-leave or inventory script) is compiled once into a global function of the level's
// Lua host, __object_script_<n>, and cached under the object it belongs to; each run then
// asks the scheduler (CreateScript in the threads' host) to start a coroutine of it.
#include "quest/SceneObject.h"

#include <array>
#include <map>
#include <string>

namespace qe {

class CObjectScripts {
public:
    // The text that defines the function `name` from a fragment: "function <name>(self)",
    // pre_click_event() with events, the fragment, wrone_item_click() for a click (a handled
    // click returns before it), post_click_event() with events, "end".
    static std::string MakeFunctionText(const std::string& name, const std::string& script, bool withEvents,
                                        bool isClick);

    // Runs the object's script of `kind` (a CBaseSceneObject::ScriptKind), or its group's when
    // it has none; nothing when its group is disabled, or when there is no script and this is
    // no click. A click without any script starts empty_script_function.
    void Run(int kind, CBaseSceneObject& object, bool withEvents, bool isClick);
    // Forgets every compiled name; numbering starts again from 0. The functions stay defined.
    void Clear();

    // The cached name of `object`'s script of `kind`, or empty.
    std::string CachedName(const CBaseSceneObject* object, int kind) const;
    size_t CachedObjects() const { return m_Names.size(); }

private:
    // The function for the target's script, compiled and cached at first use.
    std::string FunctionFor(CBaseSceneObject& target, int kind, const std::string& script, bool withEvents,
                            bool isClick);

    struct Entry {
        // Held, so that the address is not reused for another object while names are cached.
        BaseSceneObjectPtrT object;
        std::array<std::string, CBaseSceneObject::ScriptCount> names;
    };
    std::map<const CBaseSceneObject*, Entry> m_Names;
    unsigned m_Counter = 0;
};

// The cache shared by every scene widget.
CObjectScripts& GetObjectScripts();

} // namespace qe
