// Feeds arbitrary bytes to the GUI as a description: each element of the document becomes a
// window (for "window") or a widget of the kind it names, built through the widget factory
// with the document's GUITemplates, laid out, resized, and driven through a widget manager
// with clicks, moves, keys, a wheel, updates and a tool tip. Scripts are in the game: a Lua
// host whose tables have hooks that handle, refuse and fail.
#include "gui/GuiBinding.h"
#include "gui/TextWidget.h"
#include "gui/WidgetFactory.h"
#include "gui/WidgetManager.h"
#include "gui/Window.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/mluabind/StdBinding.h"

#include <cstdint>
#include <string>

using namespace ox::gui;

namespace {

// A tool tip label that measures its text as 7 pixels a character.
struct FuzzLabel : CWidget, ITextWidget {
    size_t length = 0;
    void SetText(const ox::wstring& text) override { length = text.size(); }
    void ResizeToFitText() override { SetSize(7.0f * static_cast<float>(length), 12); }
};

class QuietHost : public ox::lua::CLua {
public:
    QuietHost() : CLua("fuzz", false) {}
    void ReportError(const char*, ...) override {}
};

QuietHost& Host()
{
    static QuietHost* host = [] {
        auto* lua = new QuietHost();
        lua->BeginBinding();
        lua->Bind(mluabind::BindStdStrings());
        lua->Bind(mluabind::Namespace("ox").Merge(ox::lua::BindLuaClasses()).Merge(BindGui()));
        lua->EndBinding();
        lua->Run(std::string(R"(
            Yes = { OnMouseDown = function() return true end, OnKeyDown = function() return true end,
                    DoUpdate = function(self) self.SetFlags(self.GetFlags()) end }
            No = { OnMouseDown = function() return false end, OnMouseMove = function() end,
                   OnChildAction = function(self, action, sender) return sender == nil end }
            Bad = { OnMouseDown = function() error("bad") end, OnMouseUp = function(self) self.EndModal(1) end,
                    __CreateInstance = function() return "Yes" end, Load = function() error("load") end })"));
        return lua;
    }();
    return *host;
}

void RegisterKinds()
{
    static bool done = [] {
        CWidgetFactory& factory = GetWidgetFactory();
        RegisterFrameworkWidgets(factory);
        factory.RegisterWidget<CWidget>("widget");
        factory.RegisterWidget<CWidget>("image_widget");
        factory.RegisterWidget<FuzzLabel>("label_widget");
        return true;
    }();
    (void)done;
}

void Drive(CWidgetManager& manager, CBaseWindow& window)
{
    using namespace ox::core;
    window.UpdateLayout();
    manager.SetMainWindow(&window);
    manager.Update();
    const uint32_t messages[][3] = {
        {WM_MOUSEMOVE, 0, MakeLong(10, 10)},        {WM_LBUTTONDOWN, 0, MakeLong(10, 10)},
        {WM_MOUSEMOVE, MK_LBUTTON, MakeLong(60, 40)}, {WM_LBUTTONUP, 0, MakeLong(60, 40)},
        {WM_LBUTTONDBLCLK, 0, MakeLong(5, 5)},       {WM_RBUTTONDOWN, 0, MakeLong(300, 200)},
        {WM_RBUTTONUP, 0, MakeLong(300, 200)},       {WM_MOUSEWHEEL, MakeLong(0, -240), MakeLong(20, 20)},
        {WM_KEYDOWN, VK_ESCAPE, 1},                  {WM_CHAR, 'a', 1},
        {WM_KEYUP, 'A', 1},
    };
    for (const auto& m : messages) {
        SystemEvent event;
        event.message = m[0];
        event.wParam = m[1];
        event.lParam = m[2];
        manager.OnWindowMessage(event);
    }
    if (auto* scripted = dynamic_cast<CWindow*>(&window)) {
        scripted->ShowToolTip({30, 900}, u"tip");
        scripted->OnChildAction("pressed", nullptr);
    }
    window.SetSize(window.GetSize().X + 33, window.GetSize().Y * 2);
    manager.Update();
    manager.Update();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    RegisterKinds();
    Host();
    ox::core::CSettings settings;
    if (!settings.LoadXmlFromMemory(reinterpret_cast<const char*>(data), size, "fuzz.xml"))
        return 0;
    const ox::core::CSettingsGroup& templates = settings.GetChild("GUITemplates", true);
    CWidgetManager manager;
    manager.SetActiveRect({0, 0, 1024, 768}, {1, 1});
    // The elements of the document, or of its one element when that is neither a window nor
    // a widget (a wrapper).
    const ox::core::CSettingsGroup* top = &settings;
    if (settings.GetChildren().size() == 1) {
        const std::string_view only = settings.GetFirstChild().GetId().view();
        if (only != "window" && !GetWidgetFactory().IsRegistered(only))
            top = &settings.GetFirstChild();
    }
    int elements = 0;
    for (const ox::core::SettingsGroupPtrT& node : top->GetChildren()) {
        if (++elements > 8)
            break;
        const std::string_view kind = node->GetId().view();
        if (kind == "GUITemplates")
            continue;
        WindowPtrT window(new CWindow());
        if (kind == "window") {
            window->Load(*node, templates);
        } else if (WidgetPtrT widget = GetWidgetFactory().Create(kind, *node, templates)) {
            window->AddWidget(widget);
            window->SetSize(1024, 768);
        }
        Drive(manager, *window);
    }
    manager.Clear();
    return 0;
}
