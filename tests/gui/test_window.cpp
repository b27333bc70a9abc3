// Windows: the child window's hold on all input and the modal loop, focus and the order of
// keys, dragging, tile steps, tool tips, and the script hooks of windows and Lua widgets
// (looked up once, replacing or deciding the default), with scripts and descriptions that
// are wrong.
#include "gui/GuiBinding.h"
#include "gui/GuiServices.h"
#include "gui/GuiTestSupport.h"
#include "gui/LuaWidget.h"
#include "gui/WidgetFactory.h"
#include "gui/WidgetManager.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "lua/LuaBinding.h"
#include "lua/mluabind/StdBinding.h"
#include "support/FakePlatform.h"
#include "support/TestSupport.h"

using namespace ox::gui;
using ox::misc::FloatVector;
using oxtest::LoadWindow;
using oxtest::NotingWindow;
using oxtest::ProbeWidget;

namespace {

using Journal = std::vector<std::string>;
Journal Take() { return std::exchange(ProbeWidget::Journal(), {}); }

struct WindowTest : ::testing::Test {
    oxtest::FakePlatform platform;
    oxtest::LogCapture log;
    oxtest::MessageCapture boxes;

    void SetUp() override
    {
        ProbeWidget::Register();
        RegisterFrameworkWidgets(GetWidgetFactory());
        Take();
        GetGuiServices().platform = &platform;
    }
    void TearDown() override { GetGuiServices().platform = nullptr; }
    static bool Click(CBaseWindow& w, int x, int y) { return w.OnMouseDown({x, y}, LeftButton, 0, false); }
};

size_t BoxCount(const oxtest::MessageCapture& boxes, const char* caption)
{
    return std::count_if(boxes.Boxes().begin(), boxes.Boxes().end(),
                         [&](const auto& box) { return box.caption == caption; });
}

} // namespace

TEST_F(WindowTest, ChildWindowTakesAllInputUntilEndModal)
{
    auto main = LoadWindow(R"(<window id="main" width="400" height="300" moveable="false">
                                <probe_widget id="a" x="0" y="0" width="100" height="100" abs_pos="true"/></window>)");
    auto dialog = LoadWindow(R"(<window id="dialog" x="200" y="150" width="100" height="80" moveable="false">
                                  <probe_widget id="x" x="10" y="10" width="50" height="50" abs_pos="true"/></window>)");
    Take();
    int frames = 0;
    platform.nestedFrame = [&] {
        ++frames;
        main->Update();
        if (frames == 1) {
            EXPECT_EQ(Take(), (Journal {"open dialog", "update a", "update x"}));
            // Outside the dialog: only the dialog hears of it, and it counts as handled.
            EXPECT_TRUE(Click(*main, 20, 20));
            EXPECT_TRUE(main->OnKeyDown('A', 0, 0, false));
            EXPECT_EQ(Take(), (Journal {"down 20,20 0", "down -180,-130 0", "key 65 0", "key 65 0"}));
            // Inside it, in its own coordinates.
            Click(*main, 215, 165);
            EXPECT_EQ(Take(), (Journal {"down 215,165 0", "down 15,15 0", "down x 5,5"}));
        } else if (frames == 3) {
            dialog->EndModal(7);
        }
    };
    EXPECT_EQ(main->DoModal(dialog), 7);
    EXPECT_EQ(frames, 3);
    EXPECT_EQ(Take(), (Journal {"update a", "update x", "update a", "update x", "close dialog"}));
    EXPECT_EQ(main->GetChildWindow(), nullptr);
    EXPECT_EQ(dialog->GetParentWindow(), nullptr);
    Click(*main, 20, 20);
    EXPECT_EQ(Take(), (Journal {"down 20,20 0", "down a 20,20"}));

    // A disabled child window still swallows everything; a dead one goes at the next update.
    main->AddChildWindow(dialog);
    dialog->AddFlags(FlagDisabled);
    Take();
    EXPECT_TRUE(Click(*main, 20, 20));
    EXPECT_EQ(Take(), (Journal {"down 20,20 0"}));
    dialog->AddFlags(FlagDead);
    main->Update();
    EXPECT_EQ(main->GetChildWindow(), nullptr);
}

TEST_F(WindowTest, FocusedWidgetGetsKeysFirst)
{
    auto window = LoadWindow(R"(<window width="400" height="300"><probe_widget id="f"/><probe_widget id="m"/></window>)");
    auto* f = window->GetWidget("f");
    auto* m = window->GetWidget("m");
    m->SetBroadcastMask(BroadcastOnKeyDown);
    window->SetChildFocused(f);
    EXPECT_TRUE(f->IsFocused());
    Take();
    window->OnKeyDown(OX_SPACE, 0, 0, false);
    EXPECT_EQ(Take(), (Journal {"key 10010 0", "key f", "key m"}));

    window->SetChildFocused(m);
    EXPECT_FALSE(f->IsFocused());
    EXPECT_TRUE(m->IsFocused());
    window->OnKeyDown(OX_SPACE, 0, 0, false);
    EXPECT_EQ(Take(), (Journal {"key 10010 0", "key m", "key m"})) << "focused first, then by its mask";
    // A disabled focused widget gets nothing.
    m->AddFlags(FlagDisabled);
    window->OnKeyDown(OX_SPACE, 0, 0, false);
    EXPECT_EQ(Take(), (Journal {"key 10010 0"}));
}

TEST_F(WindowTest, DraggingMovesInsideTheCanvas)
{
    GetGuiServices().canvas = {1024, 768};
    auto window = LoadWindow(R"(<window x="100" y="100" width="200" height="100">
                                  <probe_widget id="p" x="150" y="0" width="50" height="50" abs_pos="true"/></window>)");
    window->OnMouseDown({10, 10}, LeftButton, 0, false);
    ASSERT_TRUE(window->IsDragging());
    window->OnMouseMove({60, 30}, 0, false);
    window->OnMouseMove({60, 30}, 0, true); // the broadcast pass moves nothing more
    EXPECT_EQ(window->GetOffset(), FloatVector(150, 120));
    window->OnMouseMove({5000, 5000}, 0, false);
    EXPECT_EQ(window->GetOffset(), FloatVector(824, 668));
    window->OnMouseUp({0, 0}, LeftButton, 0, false);
    EXPECT_FALSE(window->IsDragging());

    // A press a widget takes starts nothing, nor does one outside the window.
    window->OnMouseDown({160, 10}, LeftButton, 0, false);
    EXPECT_FALSE(window->IsDragging());
    window->OnMouseDown({-5, 10}, LeftButton, 0, false);
    EXPECT_FALSE(window->IsDragging());

    auto fixed = LoadWindow(R"(<window width="200" height="100" moveable="false"/>)");
    fixed->OnMouseDown({10, 10}, LeftButton, 0, false);
    EXPECT_FALSE(fixed->IsDragging());
    fixed->SetCanDrag(true);
    fixed->OnMouseDown({10, 10}, LeftButton, 0, false);
    EXPECT_TRUE(fixed->IsDragging());
}

TEST_F(WindowTest, TileStepsAndToolTipsFromTheTemplate)
{
    oxtest::ScopedKind image("image_widget", oxtest::ScopedKind::Of<ProbeWidget>());
    oxtest::ScopedKind label("label_widget", oxtest::ScopedKind::Of<oxtest::TextProbe>());
    auto window = LoadWindow(R"(<window window_template="t" width="100" height="100"/>
        <GUITemplates>
          <window_template id="t" tile_step_x="32" background="back" label_template="tip"
                           tool_tip_background="tip_back">
            <tool_tip_background_insets left="2" top="2" right="2" bottom="2"/>
          </window_template>
        </GUITemplates>)");
    EXPECT_EQ(window->GetSize(), FloatVector(128, 100)) << "width up to whole tiles, height free";
    ASSERT_NE(window->GetBackground(), nullptr);
    EXPECT_EQ(window->GetBackground()->GetSize(), FloatVector(128, 100));
    window->SetSize(96, 50);
    EXPECT_EQ(window->GetSize(), FloatVector(96, 50));

    ASSERT_NE(window->GetToolTipLabel(), nullptr);
    EXPECT_FALSE(window->IsToolTipShown());
    window->ShowToolTip({50, 10}, u"hello");
    EXPECT_TRUE(window->IsToolTipShown());
    EXPECT_EQ(window->GetToolTipLabel()->GetOffset(), FloatVector(30, 10));
    EXPECT_EQ(window->GetToolTipBackground()->GetOffset(), FloatVector(28, 8));
    EXPECT_EQ(window->GetToolTipBackground()->GetSize(), FloatVector(44, 20));
    // Near the corner the whole tip is moved back inside.
    window->ShowToolTip({5, 45}, u"hello");
    EXPECT_EQ(window->GetToolTipBackground()->GetOffset(), FloatVector(0, 30));
    EXPECT_EQ(window->GetToolTipLabel()->GetOffset(), FloatVector(2, 32));
    window->HideToolTip();
    EXPECT_FALSE(window->IsToolTipShown());
}

TEST_F(WindowTest, MissingTemplatesAndPartsAreLoggedAndTheWindowWorks)
{
    auto window = LoadWindow(R"(<window id="w" window_template="nope" lua="no_host" width="50" height="50"/>
        <GUITemplates><window_template id="t" background="back" open_sound="ding" show_effect="swoosh"/></GUITemplates>)");
    EXPECT_TRUE(log.Contains("<window id=\"w\">: no such window_template, defaults used: nope"));
    EXPECT_TRUE(log.Contains("no Lua host \"no_host\""));
    EXPECT_EQ(window->GetHooks().GetLua(), nullptr);

    // A background kind nobody registered; a sound and an effect nobody plays, said once.
    oxtest::ScopedKind none("image_widget", nullptr);
    auto plain = LoadWindow(R"(<window window_template="t"/>
        <GUITemplates><window_template id="t" background="back" open_sound="ding" show_effect="swoosh"/></GUITemplates>)");
    EXPECT_TRUE(log.Contains("no widget kind for a part of the window, skipped: image_widget"));
    EXPECT_EQ(plain->GetBackground(), nullptr);
    plain->OnOpen();
    plain->OnOpen();
    EXPECT_TRUE(plain->GetShowEffect().empty()) << "shown at the first opening only";
    const auto lines = log.Lines();
    EXPECT_EQ(std::count_if(lines.begin(), lines.end(),
                            [](const std::string& l) { return l.find("sound \"ding\"") != std::string::npos; }),
              1);
    EXPECT_TRUE(log.Contains("effect \"swoosh\": no such effect, skipped"));
}

// Script hooks ----------------------------------------------------------------------------------

namespace {

struct ScriptedWindow : WindowTest {
    ox::lua::CLua lua {"gui_test", false};

    void SetUp() override
    {
        WindowTest::SetUp();
        lua.BeginBinding();
        lua.Bind(mluabind::BindStdStrings());
        lua.Bind(mluabind::Namespace("ox").Merge(ox::lua::BindLuaClasses()).Merge(BindGui()));
        lua.EndBinding();
    }
    void Run(const std::string& code) { ASSERT_TRUE(lua.Run(code)) << code; }
    std::string Eval(const std::string& expression)
    {
        return oxtest::RunChunk(lua.GetLuaState(), "return " + expression);
    }
};

} // namespace

TEST_F(ScriptedWindow, HooksReplaceTheDefaultAndAreAskedForOnce)
{
    Run(R"(calls = {}
           T = {}
           function T.OnMouseDown(self, x, y, button, keys, broadcast)
               if not broadcast then table.insert(calls, "down " .. x .. "," .. y) end
               if x > 50 then return self.SuperOnMouseDown(x, y, button, keys, broadcast) end
           end)");
    auto window = LoadWindow(R"(<window width="200" height="100" lua="gui_test" lua_overload_table="T" moveable="false">
                                  <probe_widget id="p" width="200" height="100"/></window>)");
    Take();
    EXPECT_FALSE(Click(*window, 10, 10)) << "a hook that gives nothing handled nothing";
    EXPECT_TRUE(Click(*window, 60, 10)) << "SuperOnMouseDown reaches the widgets";
    EXPECT_EQ(Take(), (Journal {"down 10,10 0", "down 60,10 0", "down p 60,10"}));
    EXPECT_EQ(Eval("table.concat(calls, ';')"), "down 10,10;down 60,10");

    // A hook added after its first event is not seen until the table is set again.
    window->OnKeyDown('K', 0, 0, false);
    EXPECT_EQ(window->GetHooks().GetState(HookOnKeyDown), CLuaHooks::Absent);
    Run("function T.OnKeyDown(self, key) table.insert(calls, 'key ' .. key) return true end");
    window->OnKeyDown('K', 0, 0, false);
    EXPECT_EQ(Eval("#calls"), "2");
    window->SetOverloadTable("T");
    EXPECT_TRUE(window->OnKeyDown('K', 0, 0, false));
    EXPECT_EQ(Eval("calls[3]"), "key 75");
    EXPECT_EQ(BoxCount(boxes, "Lua Error"), 0u);
}

TEST_F(ScriptedWindow, ActionsGoToTheTableElseToTheActionScript)
{
    Run(R"(seen = ""
           function OnAction(window, action, sender) seen = seen .. "script " .. action .. " " .. sender.GetId().c_str() .. ";" end
           T = { OnChildAction = function(self, action, sender) seen = seen .. "table " .. action .. ";" end })");
    auto scripted = LoadWindow(R"(<window lua="gui_test" on_action_script="OnAction"><probe_widget id="b"/></window>)");
    scripted->GetWidget("b")->OnChildAction("pressed", scripted->GetWidget("b"));
    auto tabled = LoadWindow(R"(<window lua="gui_test" on_action_script="OnAction" lua_overload_table="T">
                                  <probe_widget id="b"/></window>)");
    tabled->GetWidget("b")->OnChildAction("pressed", tabled->GetWidget("b"));
    EXPECT_EQ(Eval("seen"), "script pressed b;table pressed;");
}

TEST_F(ScriptedWindow, LuaWidgetHookDecidesAndMayRenameItsTable)
{
    Run(R"(handled = false
           W = { __CreateInstance = function(w) W1 = { OnMouseDown = function() return handled end } return "W1" end }
           P = {})");
    auto window = LoadWindow(R"(<window width="200" height="100">
        <lua_widget id="lw" lua="gui_test" lua_overload_table="W" width="100" height="100" abs_pos="true">
          <probe_widget id="inner" width="100" height="100"/></lua_widget>
        <lua_widget id="plain" lua="gui_test" lua_overload_table="P"/></window>)");
    auto* widget = dynamic_cast<CLuaWidget*>(window->GetWidget("lw"));
    ASSERT_NE(widget, nullptr);
    EXPECT_EQ(widget->GetOverloadTable(), "W1");
    EXPECT_EQ(static_cast<CLuaWidget*>(window->GetWidget("plain"))->GetOverloadTable(), "P");
    Take();
    Click(*window, 10, 10);
    EXPECT_EQ(Take(), (Journal {"down 10,10 0", "down inner 10,10"})) << "false goes on to the widget's own handling";
    Run("handled = true");
    EXPECT_TRUE(Click(*window, 10, 10));
    EXPECT_EQ(Take(), Journal {"down 10,10 0"});
    EXPECT_EQ(BoxCount(boxes, "Lua Error"), 0u);
}

TEST_F(ScriptedWindow, FailingHooksAreReportedAndAHookMayCloseItsWindow)
{
    Run(R"(Broken = { OnMouseDown = function() error("hook broke") end }
           Closer = { OnMouseDown = function(self) self.GetParentWindow().RemoveChildWindow() return true end })");
    auto broken = LoadWindow(R"(<window width="100" height="100" lua="gui_test" lua_overload_table="Broken"
                                        moveable="false"><probe_widget id="p" width="100" height="100"/></window>)");
    EXPECT_FALSE(Click(*broken, 5, 5));
    EXPECT_FALSE(Click(*broken, 5, 5));
    EXPECT_EQ(BoxCount(boxes, "Lua Error"), 2u);
    EXPECT_TRUE(log.Contains("hook broke"));
    broken->OnKeyDown('A', 0, 0, false); // other slots go on
    broken->Update();

    // No such table: said once, and nothing is called.
    auto missing = LoadWindow(R"(<window lua="gui_test" lua_overload_table="NoSuchTable"/>)");
    Click(*missing, 1, 1);
    missing->OnKeyDown('A', 0, 0, false);
    EXPECT_TRUE(log.Contains("no Lua table \"NoSuchTable\" in host \"gui_test\""));

    // The child closes itself from its own hook; it lives until its event is over.
    auto parent = LoadWindow(R"(<window width="300" height="300"/>)");
    parent->AddChildWindow(LoadWindow<CWindow>(R"(<window width="100" height="100" lua="gui_test"
                                                          lua_overload_table="Closer"/>)"));
    EXPECT_TRUE(Click(*parent, 5, 5));
    EXPECT_EQ(parent->GetChildWindow(), nullptr);
    EXPECT_EQ(BoxCount(boxes, "Lua Error"), 2u);
}

TEST_F(ScriptedWindow, ScriptsMakeWindowsAndHandThemOver)
{
    EXPECT_EQ(Eval("ox.gui.OX_SPACE"), "10010");
    EXPECT_EQ(Eval("ox.gui.OX_OEM_2"), "10027");
    EXPECT_EQ(Eval("ox.gui.CWidget.FlagDead"), "8");
    EXPECT_EQ(Eval("ox.gui.g_Cursor.Instance().GetCursor() == ox.gui.CCursor.Instance().GetCursor()"), "true");

    // A window made by a script goes into the keeping of the window it is put on: the script
    // may drop it, and it goes when that window lets it go.
    Run(R"(function PutOn(parent)
               local made = ox.gui.CWindow()
               made.SetCanDrag(false)
               parent.AddChildWindow(made)
           end)");
    auto parent = LoadWindow(R"(<window id="parent"/>)");
    ox::lua::CallLuaFunction(lua, "PutOn", static_cast<CBaseWindow*>(parent.get()));
    Run("collectgarbage('collect')");
    auto* child = dynamic_cast<CWindow*>(parent->GetChildWindow());
    ASSERT_NE(child, nullptr);
    EXPECT_FALSE(child->IsCanDrag());
    EXPECT_EQ(child->GetRefCount(), 1);
    parent->RemoveChildWindow();
    Run("collectgarbage('collect')");
    EXPECT_EQ(BoxCount(boxes, "Lua Error"), 0u);
}
