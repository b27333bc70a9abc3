#pragma once
// What the quest tree takes from the parts of the engine that stand beside it: the scene
// widget runs mouse scripts, the game cursor shows hints, the effects list fades group
// states. Whoever owns those connects them; without a connection the tree still works
// (no script, no hint, states switch at once). Scripts of levels and scenes run in the
// Lua host listed as "qe_level".
#include <functional>
#include <string>

namespace ox::core {
class CGroupTimer;
}
namespace ox::lua {
class CLua;
}

namespace qe {

class CBaseSceneObject;

struct QuestServices {
    // Runs the mouse-enter or mouse-leave script of an object (a CBaseSceneObject::ScriptKind).
    std::function<void(CBaseSceneObject& object, int kind)> runMouseScript;
    // Shows a hint beside the game cursor; an empty text clears it.
    std::function<void(const std::string& hint)> setHintText;
    // Fades a group state in (appear) or out over `time` milliseconds of `timer`; `hold`
    // keeps the state opaque for the whole time.
    std::function<void(CBaseSceneObject& object, bool appear, bool hold, float time,
                       const ox::core::CGroupTimer* timer)>
        startFade;
    // Ends every running effect (a level goes, and the objects they fade with it).
    std::function<void()> clearEffects;
};

QuestServices& GetQuestServices();

// The Lua host of the running level ("qe_level"), or null when there is none.
ox::lua::CLua* GetLevelLua();

// Defines the global function "function <name>(<parameters>)\n<body>\nend" in the level's
// host. False when there is no such host (logged) or the text fails (reported by the host).
bool DefineLevelFunction(const char* name, const char* parameters, const std::string& body);

} // namespace qe
