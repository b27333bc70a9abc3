// The demo game's menus as a player meets them: its own menu script and window descriptions,
// under a stand-in for the application and the game's options. The loading bar fills, the
// main menu fades in, Options shows the player's choices, sets the volumes as their sliders
// move and applies the rest with OK, Play starts the game.
#include "gui/ControlTestSupport.h"
#include "gui/GuiBinding.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/CheckboxWidget.h"
#include "gui/controls/ComboBoxWidget.h"
#include "gui/controls/ProgressBarWidget.h"
#include "gui/controls/RadioButtonGroupWidget.h"
#include "gui/controls/SliderWidget.h"
#include "gui/controls/ToolTipHelperWidget.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"

using namespace ox::gui;
using ox::core::CSettings;
using ox::core::CSettingsGroup;

namespace {

// What the menus ask of the application.
struct StandInApp {
    CSettings* settings = nullptr;
    CWidgetManager* manager = nullptr;
    int stops = 0;
    CSettings& GetSettings() { return *settings; }
    CBaseWindow* GetMainWindow() { return manager->GetMainWindow(); }
    void Stop() { ++stops; }
};

struct DemoMenus : oxtest::ControlFixture {
    oxtest::MessageCapture boxes;
    CSettings settings;
    CWidgetManager manager;
    StandInApp app;
    ox::lua::CLua lua {"main", false};
    oxtest::ScopedKind box {"demo_box_widget", oxtest::ScopedKind::Of<CWidget>()};

    void SetUp() override
    {
        ControlFixture::SetUp();
        // Every texture and font the descriptions name stands for one of the fixture's.
        ox::graphics::CImage::SetTextureLookup([this](const char* id) -> const ox::graphics::CTexture* {
            return textures[std::string(id) == "menu_button" ? "strip" : "box"].second.get();
        });
        GetGuiServices().findFont = [this](const char*) { return &font; };
        ASSERT_TRUE(settings.LoadXml(OX_DEMO_GAME "/properties/guitemplates.xml"));
        ASSERT_TRUE(settings.LoadXml(OX_DEMO_GAME "/properties/gui.xml"));
        app = {&settings, &manager, 0};

        using G = CSettingsGroup;
        lua.BeginBinding();
        mluabind::Namespace core("core");
        core.AddClass(mluabind::Class<G>("CSettingsGroup")
                          .Method("GetChild", [](const G& g, const char* name, bool recursive) -> const G& {
                              return g.GetChild(ox::misc::StringA88(name), recursive);
                          })
                          .Method("GetChildByAttributeRef", [](const G& g, const char* e, const char* a, const char* v,
                                                               bool recursive) {
                              return g.GetChildByAttributeRef(ox::misc::StringA88(e), ox::misc::StringA88(a), v, recursive);
                          }));
        core.AddClass(mluabind::Class<CSettings>("CSettings").BaseClass<G>());
        core.AddClass(mluabind::Class<StandInApp>("CApplication")
                          .Method("GetSettings", &StandInApp::GetSettings)
                          .Method("GetMainWindow", &StandInApp::GetMainWindow)
                          .Method("Stop", &StandInApp::Stop));
        core.AddConstant(mluabind::Constant("g_Application", &app));
        mluabind::Namespace graphics("graphics");
        graphics.AddClass(mluabind::Class<ox::graphics::Color>("Color").Constructor<uint32_t>());
        lua.Bind(mluabind::BindStdStrings());
        lua.Bind(mluabind::Namespace("ox").Merge(ox::lua::BindLuaClasses()).Merge(core).Merge(graphics).Merge(BindGui()));
        lua.EndBinding();
        // The game's own start, and its options as a table that notes what it is told.
        Run(R"(g_Application = ox.core.g_Application
               ran = 0
               function Run() ran = ran + 1 end
               told = {}
               local options = { full = true, level = 1 }
               function options.GetFullScreenMode() return options.full end
               function options.GetDificultyLevel() return options.level end
               function options.SetFullScreenMode(on) table.insert(told, "full " .. tostring(on)) end
               function options.SetDificultyLevel(level) table.insert(told, "level " .. level) end
               function options.ApplyOptionsChanges() table.insert(told, "apply") end
               local volumes = { Music = 60, Sound = 70, Voice = 50 }
               for name in pairs(volumes) do
                   options["Get" .. name .. "Volume"] = function() return volumes[name] end
                   options["Set" .. name .. "Volume"] = function(v) table.insert(told, name .. " " .. v) end
               end
               function options.ApplyMusicChanges() table.insert(told, "volumes") end
               function options.UpdateLocalSettings() table.insert(told, "update") end
               function options.Save() table.insert(told, "save") end
               k17 = { g_GameOptions = { Instance = function() return options end } })");
        Run(oxtest::ReadFile(OX_DEMO_GAME "/scripts/menu.lua"));

        boost::intrusive_ptr<CWindow> loading(new CWindow());
        loading->Load(settings.GetChildByAttribute("window", "id", "loading", true), settings.GetChild("GUITemplates"));
        loading->UpdateLayout();
        manager.SetMainWindow(loading);
        manager.Update();
    }
    void TearDown() override
    {
        manager.Clear();
        ControlFixture::TearDown();
    }
    void Run(const std::string& code) { ASSERT_TRUE(lua.Run(code)) << code; }
    std::string Eval(const std::string& expression) { return oxtest::RunChunk(lua.GetLuaState(), "return " + expression); }
    template <class W>
    W* Find(CBaseWidget* in, const char* id)
    {
        return in ? dynamic_cast<W*>(in->GetWidget(id, true)) : nullptr;
    }
    void Press(CBaseWindow* window, const char* id)
    {
        auto* button = Find<CButtonWidget>(window, id);
        ASSERT_NE(button, nullptr) << id;
        button->OnButtonPressed();
        manager.Update();
    }
};

} // namespace

TEST_F(DemoMenus, BarFillsThenTheMenuLeadsToOptionsAndPlay)
{
    CBaseWindow* loading = manager.GetMainWindow();
    auto* bar = Find<CProgressBarWidget>(loading, "progress");
    ASSERT_NE(bar, nullptr);
    Run("Run()");
    EXPECT_EQ(Eval("ran"), "1") << "the game starts under the menu";
    manager.Update();
    EXPECT_FLOAT_EQ(bar->GetValue(), 0.25f) << "a step a frame";
    for (int i = 0; i < 4; ++i)
        manager.Update();
    EXPECT_FLOAT_EQ(bar->GetValue(), 1.0f);
    CBaseWindow* menu = loading->GetChildWindow();
    ASSERT_NE(menu, nullptr) << "the main menu opens over the first window";
    EXPECT_EQ(menu->GetId(), "main_menu");
    EXPECT_EQ(menu->GetEffects().size(), 1u) << "fading in";
    for (const char* id : {"play", "options", "profiles", "records", "quit"})
        EXPECT_NE(menu->GetWidget(id, true)->GetWidget(CToolTipHelperWidget::kId), nullptr) << id << " has a tool tip";

    Press(menu, "options");
    CBaseWindow* options = menu->GetChildWindow();
    ASSERT_NE(options, nullptr);
    auto* screen = Find<CComboBoxWidget>(options, "screen_mode");
    auto* level = Find<CRadioButtonGroupWidget>(options, "difficulty");
    auto* music = Find<CSliderWidget>(options, "music");
    ASSERT_TRUE(screen && level && music);
    EXPECT_EQ(screen->GetSelectedLine(), 1) << "the player's options show";
    EXPECT_EQ(level->GetChecked(), 1);
    EXPECT_FLOAT_EQ(music->GetValue(), 0.6f);
    EXPECT_FLOAT_EQ(Find<CSliderWidget>(options, "voice")->GetValue(), 0.5f);
    // A volume changes as its slider moves; the screen mode waits for OK.
    music->SetValue(0.25f, true);
    screen->SelectLine(0, true);
    EXPECT_EQ(Eval("table.concat(told, ';')"), "Music 25;volumes");
    Press(options, "ok");
    EXPECT_EQ(Eval("table.concat(told, ';')"), "Music 25;volumes;full false;level 1;apply;volumes;update;save");
    manager.Update();
    EXPECT_EQ(menu->GetChildWindow(), nullptr) << "OK closes the options";

    // Without the players' script the profiles window opens from its description.
    EXPECT_EQ(Find<CButtonWidget>(menu, "profiles")->GetButtonState(), CButtonWidget::StateNormal);
    Press(menu, "profiles");
    ASSERT_NE(menu->GetChildWindow(), nullptr);
    EXPECT_EQ(menu->GetChildWindow()->GetId(), "profiles");
    Press(menu, "quit");
    EXPECT_EQ(app.stops, 1);
    EXPECT_EQ(Eval("ran"), "1");
    for (const auto& box : boxes.Boxes())
        ADD_FAILURE() << box.caption << ": " << box.text;
}

TEST_F(DemoMenus, PlayCallsTheLevelsStartWhenThereIsOne)
{
    Run("started = 0 function StartGame() started = started + 1 end Run()");
    for (int i = 0; i < 6; ++i)
        manager.Update();
    CBaseWindow* menu = manager.GetMainWindow()->GetChildWindow();
    ASSERT_NE(menu, nullptr);
    Press(menu, "play");
    EXPECT_EQ(Eval("started"), "1");
    EXPECT_EQ(Eval("ran"), "1") << "once, at Run";
    EXPECT_EQ(manager.GetMainWindow()->GetChildWindow(), menu) << "the menu waits under the level";
}
