#include "game/LevelState.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "game/PlayerFiles.h"
#include "gui/BaseWindow.h"
#include "misc/Unicode.h"
#include "misc/XmlWriter.h"
#include "quest/Level.h"
#include "quest/SceneGroup.h"
#include "quest/SceneWidget.h"
#include "replay/ReplayCheck.h"

#include <algorithm>
#include <cstdlib>
#include <vector>

namespace k17 {

using namespace ox;

namespace {

// Puts the saved state of `saved` and, for a group, of its states onto the objects of `level`.
void Restore(qe::CLevel& level, const qe::CBaseSceneObject& saved)
{
    if (qe::CBaseSceneObject* object = level.FindObjectById(saved.GetId(), true, true)) {
        object->SetObjectFlags(saved.GetObjectFlags());
        object->SetHint(saved.GetHint());
        object->SetColor(saved.GetColor());
    }
    if (const auto* group = dynamic_cast<const qe::CSceneGroup*>(&saved))
        for (const qe::BaseSceneObjectPtrT& child : group->Childs())
            Restore(level, *child);
}

// The levels of the scene widgets under `widget`, each once, in tree order.
void CollectShownLevels(const gui::CBaseWidget& widget, std::vector<const qe::CLevel*>& levels)
{
    for (const gui::WidgetPtrT& child : widget.GetWidgets()) {
        const auto* scene = dynamic_cast<const qe::CSceneWidget*>(child.get());
        const qe::CLevel* level = scene && scene->GetScene() ? scene->GetScene()->GetParentLevel() : nullptr;
        if (level && std::find(levels.begin(), levels.end(), level) == levels.end())
            levels.push_back(level);
        CollectShownLevels(*child, levels);
    }
}

} // namespace

bool SaveLevelState(const qe::CLevel* level, const wstring& path)
{
    OX_CHECK_DATA(level != nullptr, false);
    misc::CXmlWriter writer(true);
    {
        misc::CXmlElement root(writer, "save");
        level->Save(root, true);
    }
    return WritePlayerFile(writer, path);
}

bool RestoreLevelState(qe::CLevel* level, const wstring& path)
{
    OX_CHECK_DATA(level != nullptr, false);
    core::CSettings settings;
    if (!ReadPlayerFile(settings, path, "save"))
        return false;
    const core::CSettingsGroup& node =
        settings.GetChild("save").GetChildByAttribute("level", "id", level->GetId());
    if (&node == &core::CSettingsGroup::Empty()) {
        CAttributeReader(path).Problem(("holds no state of level " + level->GetId()).c_str());
        return false;
    }
    qe::LevelPtrT saved(new qe::CLevel());
    saved->Load(node, true);
    for (const qe::ScenePtrT& scene : saved->Scenes()) {
        for (const qe::BaseSceneObjectPtrT& object : scene->Objects())
            Restore(*level, *object);
        for (const qe::BaseSceneObjectPtrT& area : scene->Areas())
            Restore(*level, *area);
    }
    return true;
}

uint32_t HashShownLevelState(const gui::CBaseWindow* window)
{
    std::vector<const qe::CLevel*> levels;
    for (; window; window = window->GetChildWindow())
        CollectShownLevels(*window, levels);
    if (levels.empty())
        return 0;
    misc::CXmlWriter writer(true);
    {
        misc::CXmlElement root(writer, "save");
        for (const qe::CLevel* level : levels)
            level->Save(root, true);
    }
    void* text = nullptr;
    unsigned size = 0;
    const uint32_t hash = writer.GetBuffer(&text, &size) ? replay::HashBytes(text, size) : 0;
    free(text);
    return hash;
}

} // namespace k17
