#include "quest/SceneWidget.h"

#include "core/SettingsReaders.h"
#include "core/TextureManager.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "gui/TextWidget.h"
#include "gui/WidgetFactory.h"
#include "lua/Lua.h"
#include "misc/Unicode.h"
#include "quest/GameCursor.h"
#include "quest/Level.h"
#include "quest/ObjectScripts.h"
#include "quest/ObjectsBox.h"
#include "quest/QuestServices.h"

#include <cmath>

namespace qe {

using ox::gui::CWidget;
using ox::misc::IntVector;

namespace {

// A function of the level's scripts, when there is a level host.
template <class R = void, class... Args>
R CallLevel(const char* name, const Args&... args)
{
    ox::lua::CLua* lua = GetLevelLua();
    return lua ? ox::lua::CallLuaFunction<R>(lua, name, args...) : R();
}

// The scripts' word that a click script is still alive: clicks and hovers wait for it.
bool ClickThreadLives() { return CallLevel<bool>("IsClikThread"); }

} // namespace

void CSceneWidget::SetScene(CScene* scene)
{
    const ox::misc::FloatInsets& insets = GetInsets();
    const FloatVector extra(insets.Left + insets.Right, insets.Top + insets.Bottom);
    m_Scene = scene;
    FloatVector size = extra;
    if (m_Scene) {
        m_SceneOffset = {insets.Left, insets.Top};
        size = m_Scene->GetSize() + extra;
        if (m_Scene->ReadFlag(CScene::FlagSceneInNewWindow)) {
            const FloatVector at = m_Scene->GetOffset() - m_SceneOffset;
            SetOffset(at.X, at.Y);
        }
    }
    SetSize(size.X, size.Y);
}

void CSceneWidget::SetSize(float width, float height)
{
    CWidget::SetSize(width, height);
    UpdateCloseButtonPos();
}

void CSceneWidget::UpdateCloseButtonPos()
{
    if (!m_CloseButton)
        return;
    const FloatVector button = m_CloseButton->GetSize();
    m_CloseButton->SetOffset(GetSize().X / 2 - button.X / 2, GetSize().Y - button.Y + 4.0f);
}

void CSceneWidget::SetCloseButtonText(const std::string& text)
{
    m_CloseButtonText = text;
    if (!m_CloseButton)
        return;
    if (auto* label = dynamic_cast<ox::gui::ITextWidget*>(m_CloseButton.get()))
        label->SetText(ox::misc::ConvertToWide(text));
    const FloatVector preferred = m_CloseButton->GetPreferredSize();
    m_CloseButton->SetSize(preferred.X, preferred.Y);
    UpdateCloseButtonPos();
}

void CSceneWidget::DisableCloseButton(bool disable)
{
    if (!m_CloseButton)
        return;
    if (disable)
        m_CloseButton->AddFlags(ox::gui::FlagDisabled);
    else
        m_CloseButton->RemFlags(ox::gui::FlagDisabled);
}

void CSceneWidget::Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates)
{
    ox::core::ReadBool(node, "show_border", m_ShowBorder);
    if (m_ShowBorder) {
        const std::string& name = node.GetValue("scene_widget_template");
        MakeBorder(templates.GetChildByAttribute("scene_widget_template", "id", name), templates);
    }
    CWidget::Load(node, templates);
}

void CSceneWidget::MakeBorder(const ox::core::CSettingsGroup& tpl, const ox::core::CSettingsGroup& templates)
{
    m_CloseButton = ox::gui::GetWidgetFactory().Create("button_widget", tpl, templates);
    if (m_CloseButton) {
        m_CloseButton->SetOffset(40, 40);
        AddWidget(m_CloseButton);
        SetCloseButtonText(m_CloseButtonText);
    } else {
        OX_LOG("data", ox::diag::LogWarning, "scene widget: no button_widget kind for the close button");
    }
    m_HasBackground = tpl.IsValue("background");
    if (m_HasBackground) {
        m_Background.Init();
        m_Background.SetTexture(tpl.GetValue("background").c_str());
        m_Background.SetFlags(ox::graphics::CImage::FlagBoxImage | ox::graphics::CImage::FlagIntDest);
    }
    const ox::core::CSettingsGroup& insets = tpl.GetChild("insets");
    auto read = [&](const char* name) {
        float value = 0;
        ox::core::ReadFloat(insets, name, value);
        return value;
    };
    SetInsets({read("left"), read("right"), read("top"), read("bottom")});
}

void CSceneWidget::DoDraw(ox::graphics::CRenderer& r)
{
    if (m_HasBackground) {
        m_Background.SetRect({0, 0, GetSize().X, GetSize().Y});
        m_Background.Draw(r);
    }
    if (m_Scene) {
        const FloatVector size = m_Scene->GetSize();
        const ox::misc::Poly4 rect = ox::misc::RectToPoly4({0, 0, size.X, size.Y});
        r.PushState();
        r.ApplyMatrix(ox::misc::MatrixTranslation(m_SceneOffset.X, m_SceneOffset.Y));
        r.SetClipPoly(rect);
        r.RenderFilledPoly4(rect, ox::graphics::Color(0xFF000000u));
        m_Scene->DrawGame(&r);
        r.PopState();
    }
    CWidget::DoDraw(r);
}

void CSceneWidget::DoUpdate()
{
    if (!m_Scene)
        return;
    const CScene::ObjectsListT& objects = m_Scene->Objects();
    for (auto it = objects.rbegin(); it != objects.rend(); ++it)
        if (!(*it)->ReadObjectFlag(CBaseSceneObject::ObjectFlagRemoved))
            (*it)->Update();
}

CBaseSceneObject* CSceneWidget::GetObjectAt(const IntVector& pos) const
{
    if (!m_Scene)
        return nullptr;
    const FloatVector point(static_cast<float>(pos.X - static_cast<int>(m_SceneOffset.X)),
                            static_cast<float>(pos.Y - static_cast<int>(m_SceneOffset.Y)));
    return m_Scene->GetObjectAt(point, &ox::core::CTextureManager::Instance().GetTexturesAlpha());
}

bool CSceneWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    if (CWidget::OnMouseMove(pos, keys, broadcast))
        return true;
    if (broadcast)
        return false;
    CLevel* level = m_Scene ? m_Scene->GetParentLevel() : nullptr;
    if (!level)
        return true;
    CBaseSceneObject* hit = GetObjectAt(pos);
    if (hit || IsInside(pos))
        level->UpdateFocusedObject(hit);
    return true;
}

bool CSceneWidget::OnMouseDown(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast)
{
    const bool taken = CWidget::OnMouseDown(pos, button, keys, broadcast);
    if (taken || broadcast)
        return taken;
    Click(pos);
    return true;
}

bool CSceneWidget::OnMouseUp(const IntVector& pos, ox::gui::MouseButtons button, int keys, bool broadcast)
{
    const bool taken = CWidget::OnMouseUp(pos, button, keys, broadcast);
    if (taken || broadcast)
        return taken;
    if (g_Cursor::Instance().GetIsDrag())
        Click(pos);
    return true;
}

void CSceneWidget::Click(const IntVector& pos)
{
    // A script may close and drop this widget while the click runs.
    SceneWidgetPtrT self(this);
    const FloatVector abs = GetAbsPos(false);
    const FloatVector screen(abs.X + static_cast<float>(pos.X), abs.Y + static_cast<float>(pos.Y));
    if (CBaseSceneObject* hit = GetObjectAt(pos)) {
        RunMouseCickScript(hit, screen);
        return;
    }
    if (!ClickThreadLives()) {
        CallLevel("wrong_click", IntVector(static_cast<int>(screen.X), static_cast<int>(screen.Y)));
        CallLevel("clear_cursor");
    }
}

void CSceneWidget::RunMouseCickScript(CBaseSceneObject* object, const FloatVector& screenPos)
{
    OX_CHECK_DATA(object != nullptr);
    if (ClickThreadLives())
        return;
    const BaseSceneObjectPtrT held(object);
    const IntVector click(static_cast<int>(screenPos.X), static_cast<int>(screenPos.Y));
    CallLevel("quest.SetModifyFlag", false);
    g_Cursor::Instance().SetIsDrag(false);
    CallLevel("quest.SetClickPos", click);
    GetObjectScripts().Run(CBaseSceneObject::ScriptMouseClick, *object, true, true);
    if (!CallLevel<bool>("quest.GetModifyFlag"))
        CallLevel("wrong_click", click);
    CallLevel("clear_cursor");
}

void CSceneWidget::RunIventoryClickScript(CBaseSceneObject* object)
{
    OX_CHECK_DATA(object != nullptr);
    GetObjectScripts().Run(CBaseSceneObject::ScriptInventoryClick, *object, true, false);
}

void CSceneWidget::RunMouseEnterScript(CBaseSceneObject* object)
{
    if (object && !ClickThreadLives())
        GetObjectScripts().Run(CBaseSceneObject::ScriptMouseEnter, *object, false, false);
}

void CSceneWidget::RunMouseLeaveScript(CBaseSceneObject* object)
{
    if (object && !ClickThreadLives())
        GetObjectScripts().Run(CBaseSceneObject::ScriptMouseLeave, *object, false, false);
}

void CSceneWidget::ClearScriptCache() { GetObjectScripts().Clear(); }

void CSceneWidget::Close()
{
    const SceneWidgetPtrT self(this);
    m_IsDead = true;
    CallLevel("quest.OnCloseScene", this);
    CallLevel("quest.OnLevelChanged");
}

void CSceneWidget::OnChildAction(const std::string& action, CWidget* sender)
{
    CWidget::OnChildAction(action, sender);
    if (!m_CloseButton || sender != m_CloseButton.get() || action != "pressed")
        return;
    const SceneWidgetPtrT self(this);
    if (CBaseWidget* parent = GetParentWidget())
        parent->OnChildAction("close_button_pressed", this);
    Close();
}

void CSceneWidget::CloseChildScenes()
{
    CloseChildren([](const CSceneWidget&) { return true; });
}

void CSceneWidget::CloseChildSceneById(const std::string& id)
{
    CloseChildren([&](const CSceneWidget& child) { return child.GetSceneId() == id; });
}

void CSceneWidget::CloseChildren(const std::function<bool(const CSceneWidget&)>& which)
{
    // A snapshot: closing lets scripts change the children.
    const WidgetsT children = GetWidgets();
    for (const ox::gui::WidgetPtrT& child : children)
        if (auto* scene = dynamic_cast<CSceneWidget*>(child.get()); scene && which(*scene))
            scene->Close();
}

void RegisterQuestWidgets(ox::gui::CWidgetFactory& factory)
{
    factory.RegisterWidget<CSceneWidget>("scene_widget");
    factory.RegisterWidget<CObjectsBoxWidget>("objects_box_widget");
}

void ConnectQuestServices()
{
    QuestServices& services = GetQuestServices();
    services.runMouseScript = [](CBaseSceneObject& object, int kind) {
        if (kind == CBaseSceneObject::ScriptMouseEnter)
            CSceneWidget::RunMouseEnterScript(&object);
        else
            CSceneWidget::RunMouseLeaveScript(&object);
    };
    services.setHintText = [](const std::string& hint) { g_Cursor::Instance().SetHintText(hint); };
}

} // namespace qe
