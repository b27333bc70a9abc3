#include "game/DemoShell.h"

#include "core/Application.h"
#include "core/FontManager.h"
#include "core/SettingsReaders.h"
#include "diag/Log.h"
#include "game/LevelState.h"
#include "quest/Level.h"
#include "gui/GuiServices.h"
#include "gui/Window.h"
#include "gui/WidgetFactory.h"

namespace k17 {

using namespace ox;

namespace {

class CDemoTextWidget : public gui::CWidget {
public:
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override
    {
        CWidget::Load(node, templates);
        m_Font = node.IsValue("font") ? node.GetValue("font") : "small";
        core::ReadColor(node, "color", m_Color);
        m_Centred = node.GetValue("justify") == "center";
        m_Text = core::ReadLocalText(node, "text");
    }

    void SetText(const wstring& text) { m_Text = text; }

    void DoDraw(graphics::CRenderer& r) override
    {
        const graphics::CFont* font = core::CFontManager::Instance().GetItem(m_Font.c_str());
        if (font && !m_Text.empty())
            r.RenderString(font, m_Text, m_Centred ? GetSize().X / 2 : 4.0f, GetSize().Y / 2,
                           m_Centred ? graphics::JustifyCenterH : graphics::JustifyLeft, graphics::JustifyCenterV, 1.0f,
                           m_Color);
        CWidget::DoDraw(r);
    }

private:
    std::string m_Font;
    graphics::Color m_Color {0xFF101010u};
    bool m_Centred = false;
    wstring m_Text;
};

void SetText(gui::CWidget* widget, const wstring& text)
{
    auto* line = dynamic_cast<CDemoTextWidget*>(widget);
    OX_CHECK_DATA(line != nullptr);
    line->SetText(text);
}

// Places `window` centred on the canvas as a child of the top window: a child window's place
// is relative to its parent's, and the demo's windows open over the first window or a menu.
void CentreWindow(gui::CBaseWindow* window)
{
    OX_CHECK_DATA(window && core::g_Application && core::g_Application->GetTopWindow());
    const misc::FloatVector canvas = gui::GetGuiServices().canvas;
    const misc::FloatVector parent = core::g_Application->GetTopWindow()->GetAbsPos(true);
    window->SetOffset((canvas.X - window->GetSize().X) / 2 - parent.X, (canvas.Y - window->GetSize().Y) / 2 - parent.Y);
}

gui::CWindow* OpenWindow(const std::string& id)
{
    OX_CHECK_DATA(core::g_Application && core::g_Application->GetTopWindow(), nullptr);
    const core::CSettings& settings = core::g_Application->GetSettings();
    const core::CSettingsGroup& node = settings.GetChildByAttribute("window", "id", id, true);
    if (&node == &core::CSettingsGroup::Empty()) {
        OX_LOG("data", diag::LogWarning, "demo: no window \"%s\" to open", id.c_str());
        return nullptr;
    }
    gui::WindowPtrT window(new gui::CWindow());
    window->Load(node, settings.GetChild("GUITemplates"));
    window->UpdateLayout();
    CentreWindow(window.get());
    core::g_Application->GetTopWindow()->AddChildWindow(window);
    return window.get();
}

} // namespace

void RegisterDemoShellWidgets() { gui::GetWidgetFactory().RegisterWidget<CDemoTextWidget>("demo_text_widget"); }

mluabind::Namespace BindDemoShell()
{
    mluabind::Namespace ns("demo");
    ns.AddFunction(mluabind::Function("SetText", &SetText));
    ns.AddFunction(mluabind::Function("OpenWindow", &OpenWindow));
    ns.AddFunction(mluabind::Function("CentreWindow", &CentreWindow));
    ns.AddFunction(mluabind::Function("SaveLevelState", &SaveLevelState));
    ns.AddFunction(mluabind::Function("RestoreLevelState", &RestoreLevelState));
    return ns;
}

} // namespace k17
