#pragma once
// A scene in the widget tree. The widget draws its scene inside its insets, finds the object
// under the mouse, keeps the level's focused object up to date and starts object scripts: a
// click runs the road below, which the scripts of the level state (qe_level) take part in.
// A close-up (a scene that opens in a new window) is another scene widget, a child of the
// main one, with a border picture and a close button. The widget has no game rules.
#include "graphics/Image.h"
#include "gui/Widget.h"
#include "quest/Scene.h"

#include <functional>
#include <string>

namespace ox::gui {
class CWidgetFactory;
}

namespace qe {

class CSceneWidget;
using SceneWidgetPtrT = boost::intrusive_ptr<CSceneWidget>;

class CSceneWidget : public ox::gui::CWidget {
public:
    using IntVector = ox::misc::IntVector;

    CSceneWidget() = default;

    // The size becomes the scene's plus the insets; a scene of its own window also places the
    // widget at the scene's offset, less the insets' left and top.
    void SetScene(CScene* scene);
    CScene* GetScene() const { return m_Scene.get(); }
    std::string GetSceneId() const { return m_Scene ? m_Scene->GetId() : std::string(); }

    // Closes every child scene widget, or those showing the scene `id`, in child order.
    void CloseChildScenes();
    void CloseChildSceneById(const std::string& id);
    // The widget is dead from now on; the level's scripts hear of it (quest.OnCloseScene,
    // quest.OnLevelChanged) and take the widget away.
    void Close();
    bool IsDead() const { return m_IsDead; }

    // The click road for an object, `screenPos` in the coordinates of the tree's top: dropped
    // while a click script lives; else the modify flag is lowered, the drag ends, the click
    // position is told, the object's click script starts, a click that changed nothing is a
    // wrong click, and the cursor is cleared.
    void RunMouseCickScript(CBaseSceneObject* object, const FloatVector& screenPos);
    void RunIventoryClickScript(CBaseSceneObject* object);
    // The object's mouse-enter or mouse-leave script, unless a click script lives.
    static void RunMouseEnterScript(CBaseSceneObject* object);
    static void RunMouseLeaveScript(CBaseSceneObject* object);
    // Forgets every compiled object script.
    static void ClearScriptCache();

    // The object or area under a point of the widget, or null.
    CBaseSceneObject* GetObjectAt(const IntVector& pos) const;

    void SetInitPos(const FloatVector& pos) { m_InitPos = pos; }
    FloatVector GetInitPos() const { return m_InitPos; }
    void SetWorldInitPos(const FloatVector& pos) { m_WorldInitPos = pos; }
    FloatVector GetWorldInitPos() const { return m_WorldInitPos; }
    void SetCloseButtonText(const std::string& text);
    // The close button stands centred at the bottom edge.
    void UpdateCloseButtonPos();
    void DisableCloseButton(bool disable);
    ox::gui::CWidget* GetCloseButton() const { return m_CloseButton.get(); }
    bool HasBorder() const { return m_ShowBorder; }

    void SetSize(float width, float height) override;
    // The close button's "pressed" tells the parent "close_button_pressed", then closes.
    void OnChildAction(const std::string& action, ox::gui::CWidget* sender) override;
    bool OnMouseMove(const IntVector& pos, int keys, bool broadcast) override;
    bool OnMouseDown(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast) override;
    // A release during a drag is a click.
    bool OnMouseUp(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast) override;
    // `show_border` and `scene_widget_template`: with a border, the template's close button
    // (a button_widget), background picture and insets; then the widget's own reading.
    void Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates) override;
    // The background, the scene clipped to its rectangle over black, then the children.
    void DoDraw(ox::graphics::CRenderer& renderer) override;
    // The scene's objects that are not removed, from the back.
    void DoUpdate() override;

private:
    void CloseChildren(const std::function<bool(const CSceneWidget&)>& which);
    void MakeBorder(const ox::core::CSettingsGroup& tpl, const ox::core::CSettingsGroup& templates);
    // The click at a point of the widget: the object's road, or a wrong click on nothing.
    void Click(const IntVector& pos);
    bool IsInside(const IntVector& pos) const { return pos.X <= GetSize().X && pos.Y <= GetSize().Y; }

    ox::graphics::CImage m_Background;
    bool m_HasBackground = false;
    ox::gui::WidgetPtrT m_CloseButton;
    ScenePtrT m_Scene;
    FloatVector m_SceneOffset;
    bool m_ShowBorder = false;
    FloatVector m_InitPos;
    FloatVector m_WorldInitPos;
    std::string m_CloseButtonText;
    bool m_IsDead = false;
};

// The quest's widget kinds (scene_widget, objects_box_widget) in the factory, and the scene
// widget's mouse scripts and the game cursor's hints connected to the quest tree.
void RegisterQuestWidgets(ox::gui::CWidgetFactory& factory);
void ConnectQuestServices();

} // namespace qe
