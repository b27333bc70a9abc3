// The scene widget driven as a player drives it: clicks through the fake platform, the
// application and the widget manager to a scene widget in a window, and the level's scripts
// (a recorder in the qe_level host) hearing each step of the click road. Overlapping images
// with a transparent hole, a hidden group over an area, a click thread that drops clicks,
// the box and cursor states of a taken object, focus and hints, and a close-up with a border.
#include "core/Application.h"
#include "core/TimeManager.h"
#include "gui/GuiTestSupport.h"
#include "gui/WidgetManager.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "quest/Area.h"
#include "quest/GameCursor.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "quest/LuaThreadManager.h"
#include "quest/ObjectsBox.h"
#include "quest/QuestBinding.h"
#include "quest/QuestServices.h"
#include "quest/SceneGroup.h"
#include "quest/SceneWidget.h"
#include "support/FakePlatform.h"
#include "support/TestSupport.h"

#include <cstring>
#include <optional>

using namespace qe;
using ox::lua::CLua;
using B = CBaseSceneObject;
using ox::misc::IntVector;

namespace {

// The level's side of the click road, written down as it happens. Object scripts that mean to
// handle a click raise the modify flag.
const char* kRecorder = R"(
    quest = {}
    calls = {}
    click_thread = false
    function note(text) table.insert(calls, text) end
    function IsClikThread() return click_thread end
    function quest.SetModifyFlag(flag) modified = flag end
    function quest.GetModifyFlag() return modified end
    function quest.SetClickPos(p) note('pos ' .. p.X .. ',' .. p.Y) end
    function quest.SetScriptObject(o) end
    function CreateScript(name, o) _G[name.c_str()](o) end
    function wrong_click(p) note('wrong ' .. p.X .. ',' .. p.Y) end
    function clear_cursor() note('clear') end
    function pre_click_event() end
    function post_click_event() end
    function wrone_item_click() end
    function empty_script_function(self) note('empty ' .. self.GetId().c_str()) end
    function quest.OnCloseScene(w) note('closed ' .. w.GetSceneId().c_str()) w.AddFlags(ox.gui.CWidget.FlagDead) end
    function quest.OnLevelChanged() note('changed') end
    cursor_lua_widget = {
        SetGameCursor = function(id) note('cursor ' .. id.c_str()) end,
        DropGameCursor = function() note('drop') end,
    }
    box = qe.CObjectsBox()
    function Remember(w, l) main_widget, level = w, l end
    function OpenCloseup() note('open') end
)";

// A button for the close-up's border: pressed on a click, sized by its text.
struct TestButton : ox::gui::CWidget, ox::gui::ITextWidget {
    ox::wstring text;
    void SetText(const ox::wstring& t) override { text = t; }
    void ResizeToFitText() override {}
    FloatVector GetPreferredSize() const override { return {8.0f * static_cast<float>(text.size()), 20}; }
    bool OnMouseDown(const IntVector&, ox::gui::MouseButtons, int, bool broadcast) override
    {
        if (!broadcast)
            OnChildAction("pressed", this);
        return !broadcast;
    }
};

// 8 x 8 pixels, red, with a transparent hole at pixels 2 to 5 when `holed`.
std::vector<uint32_t> Pixels(bool holed)
{
    std::vector<uint32_t> pixels(64, 0xFFFF0000u);
    for (int y = 2; y < 6; ++y)
        for (int x = 2; x < 6; ++x)
            pixels[y * 8 + x] = holed ? 0u : 0xFFFF0000u;
    return pixels;
}

ImageObjectPtrT Image(const char* id, const char* texture, FloatVector pos, FloatVector size, const char* click = "")
{
    ImageObjectPtrT image(new CImageObject());
    image->SetId(id);
    image->SetTextureId(texture);
    image->SetPos(pos);
    image->SetSize(size);
    image->SetLuaScript(click, B::ScriptMouseClick);
    image->SetHint(id);
    return image;
}

struct SceneWidgetTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    oxtest::MessageCapture boxes;
    std::unique_ptr<ox::core::CApplication> app;
    oxtest::FakePlatform* platform = nullptr;
    std::optional<oxtest::ScopedKind> button; // after the application, which registers the real one
    ox::graphics::CSurface holedSurface {8, 8}, solidSurface {8, 8};
    ox::graphics::CTexture holed {&holedSurface}, solid {&solidSurface};
    std::unique_ptr<CLua> lua;
    LevelPtrT level {new CLevel()};
    ScenePtrT scene {new CScene()};
    ScenePtrT closeup {new CScene()};
    ox::gui::WindowPtrT window;
    SceneWidgetPtrT widget;

    void SetUp() override
    {
        while (ox::core::GetTimeManager().GetRoot()->IsPaused())
            ox::core::GetTimeManager().Pause(false);
        dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Scene\"/>");
        app = std::make_unique<ox::core::CApplication>();
        auto owned = std::make_unique<oxtest::FakePlatform>();
        platform = owned.get();
        app->SetSystemIntegration(std::move(owned));
        ASSERT_TRUE(app->Init());
        button.emplace("button_widget", oxtest::ScopedKind::Of<TestButton>());
        app->GetRenderer()->SetSourceResolution(1024, 768);
        app->ChangeScreenMode(false, true, 1024, 768);
        RegisterQuestWidgets(ox::gui::GetWidgetFactory());
        ConnectQuestServices();
        // The pixel copies the hit tests read (the fake platform gives no device to load).
        for (auto [surface, isHoled] : {std::pair(&holedSurface, true), std::pair(&solidSurface, false)}) {
            surface->CreateBuffer();
            std::memcpy(surface->GetBuffer(), Pixels(isHoled).data(), 256);
        }
        ox::graphics::CImage::SetTextureLookup(
            [this](const char* id) { return std::strcmp(id, "holed") == 0 ? &holed : &solid; });

        lua = std::make_unique<CLua>("qe_level", false);
        BindFramework(*lua);
        BindMissingGeometry(*lua);
        lua->BeginBinding();
        lua->Bind(BindQuestClasses());
        lua->EndBinding();
        ASSERT_TRUE(lua->Run(kRecorder));
        g_LuaThreadManager::Instance().SetLua(*lua);
        BuildLevel();

        window = oxtest::LoadWindow<ox::gui::CWindow>(
            R"(<window id="main" width="1024" height="768" moveable="false"><scene_widget id="scene" x="50" y="40" abs_pos="true"/></window>)");
        widget = dynamic_cast<CSceneWidget*>(window->GetWidget("scene"));
        ASSERT_TRUE(widget);
        widget->SetScene(scene.get());
        app->SetMainWindow(window);
        app->Update();
        ox::lua::CallLuaFunction(lua.get(), "Remember", widget.get(), level.get());
        Calls();
    }
    void TearDown() override
    {
        g_LuaThreadManager::Instance().Clear();
        CSceneWidget::ClearScriptCache();
        g_Cursor::Instance().ClearCursor(true);
        GetQuestServices() = QuestServices();
        ox::graphics::CImage::SetTextureLookup(nullptr);
        window.reset();
        widget.reset();
        app.reset();
    }

    // A front image with a hole over a solid one; a hidden group over an area; a jar group with
    // its box and cursor states; and a close-up scene.
    void BuildLevel()
    {
        scene->SetId("main");
        scene->SetSize({400, 300});
        level->InsertScene(scene, nullptr);
        auto append = [this](BaseSceneObjectPtrT object) {
            scene->InsertObject(object, scene->Objects().empty() ? nullptr : scene->Objects().back().get());
        };
        append(Image("front", "holed", {100, 100}, {80, 80}, "note('front') quest.SetModifyFlag(true)"));
        append(Image("back", "solid", {100, 100}, {160, 160}, "note('back')"));
        SceneGroupPtrT ghost(new CSceneGroup());
        ghost->SetId("ghost");
        ghost->RaiseObjectFlag(B::ObjectFlagHidden);
        ghost->InsertChild(Image("ghost_a", "solid", {300, 100}, {40, 40}, "note('ghost')"), nullptr);
        append(ghost);
        SceneGroupPtrT jar(new CSceneGroup());
        jar->SetId("jar");
        jar->SetLuaScript("note('take jar') quest.SetModifyFlag(true) box.InsertObject(qe.CBaseSceneObjectPtrT(self), nil) "
                          "qe.g_Cursor.Instance().SetCursorObject(self)",
                          B::ScriptMouseClick);
        ImageObjectPtrT inv = Image("__inv", "solid", {300, 250}, {40, 40});
        ImageObjectPtrT cur = Image("__cur", "solid", {300, 250}, {40, 40});
        inv->RaiseObjectFlag(B::ObjectFlagHidden);
        cur->RaiseObjectFlag(B::ObjectFlagHidden);
        jar->InsertChild(Image("full", "solid", {300, 250}, {40, 40}), nullptr);
        jar->InsertChild(cur, jar->Childs().back().get());
        jar->InsertChild(inv, jar->Childs().back().get());
        append(jar);
        AreaPtrT door(new CArea());
        door->SetId("door");
        for (FloatVector p : {FloatVector(280, 80), FloatVector(320, 80), FloatVector(320, 120), FloatVector(280, 120)})
            door->InsertPoint(AreaPointPtrT(new CAreaPoint(p)), door->Points().empty() ? nullptr : door->Points().back().get());
        door->SetLuaScript("note('door') quest.SetModifyFlag(true) OpenCloseup()", B::ScriptMouseClick);
        scene->InsertArea(door, nullptr);
        scene->UpdateTotalChildList();

        closeup->SetId("closeup");
        closeup->SetSize({200, 100});
        closeup->SetOffset({150, 120});
        closeup->RaiseFlag(CScene::FlagSceneInNewWindow);
        closeup->InsertObject(Image("ring", "solid", {100, 50}, {60, 60}, "note('ring') quest.SetModifyFlag(true)"), nullptr);
        closeup->UpdateTotalChildList();
        level->InsertScene(closeup, scene.get());
    }

    // A click at a point of the main scene.
    void ClickScene(int x, int y) { oxtest::SendClick(*platform, 50 + x, 40 + y); }
    std::string Calls()
    {
        std::string all = oxtest::RunChunk(lua->GetLuaState(), "return table.concat(calls, ' | ')");
        lua->Run("calls = {}");
        return all;
    }
    std::string LuaErrors() const
    {
        std::string text;
        for (const auto& box : boxes.Boxes())
            text += box.caption + ": " + box.text + "\n";
        return text;
    }
};

} // namespace

TEST_F(SceneWidgetTest, AClickRunsTheTopmostObjectAndFallsThroughHolesAndHiddenGroups)
{
    // Each click moves the pointer there first: the focus follows.
    ClickScene(65, 65); // the front image's opaque rim
    EXPECT_EQ(Calls(), "cursor front | pos 115,105 | front | clear");
    ClickScene(100, 100); // its hole: the image below, which changes nothing
    EXPECT_EQ(Calls(), "cursor back | pos 150,140 | back | wrong 150,140 | clear");
    ClickScene(300, 100); // a state of a hidden group over the area
    EXPECT_EQ(Calls(), "cursor door | pos 350,140 | door | open | clear");
    ClickScene(390, 10); // nothing: a wrong click in window coordinates
    EXPECT_EQ(Calls(), "drop | wrong 440,50 | clear");

    // While a click script lives, clicks are dropped without a word.
    lua->Run("click_thread = true");
    ClickScene(65, 65);
    ClickScene(390, 10);
    EXPECT_EQ(Calls(), "cursor front | drop") << "hovers go on";
    EXPECT_TRUE(boxes.Boxes().empty()) << LuaErrors();
}

TEST_F(SceneWidgetTest, ATakenGroupShowsItsBoxStateInTheBoxAndItsCursorStateOnTheCursor)
{
    ClickScene(300, 250);
    EXPECT_EQ(Calls(), "cursor jar | pos 350,290 | take jar | clear");
    EXPECT_EQ(oxtest::RunChunk(lua->GetLuaState(),
                               "local item = box.GetObject(0) return item.Item.GetId().c_str() .. ' ' .. "
                               "item.InventState.GetId().c_str() .. ' ' .. box.EnumObjects()"),
              "jar __inv 1");
    ASSERT_NE(g_Cursor::Instance().GetDrawObject(), nullptr);
    EXPECT_EQ(g_Cursor::Instance().GetDrawObject()->GetIdRef(), "__cur");
    EXPECT_EQ(g_Cursor::Instance().GetCursorObject()->GetIdRef(), "jar");
    EXPECT_TRUE(boxes.Boxes().empty()) << LuaErrors();
}

TEST_F(SceneWidgetTest, TheFocusFollowsThePointerWithHintsAndEndsOnlyInsideTheWidget)
{
    oxtest::SendMove(*platform, 50 + 65, 40 + 65);
    EXPECT_EQ(Calls(), "cursor front");
    EXPECT_EQ(g_Cursor::Instance().GetHintText(), u"front");
    oxtest::SendMove(*platform, 50 + 300, 40 + 250);
    EXPECT_EQ(Calls(), "cursor jar") << "a state names its group";
    oxtest::SendMove(*platform, 1000, 700); // past the bottom-right edge: the focus stays
    EXPECT_EQ(Calls(), "");
    EXPECT_EQ(level->GetFocusedObject()->GetIdRef(), "full");
    oxtest::SendMove(*platform, 50 + 390, 40 + 10);
    EXPECT_EQ(Calls(), "drop");
    EXPECT_EQ(level->GetFocusedObject(), nullptr);
    EXPECT_TRUE(g_Cursor::Instance().GetHintText().empty());
}

TEST_F(SceneWidgetTest, ACloseUpOpensWithItsBorderTakesClicksAndClosesByItsButton)
{
    // The close-up as a level's script would make it: a bordered scene widget over the scene.
    oxtest::XmlDescription node(R"(<scene_widget show_border="true" scene_widget_template="frame"/>)");
    oxtest::XmlDescription templates(R"(<GUITemplates><scene_widget_template id="frame" background="solid">
                                          <insets left="10" top="20" right="10" bottom="30"/>
                                        </scene_widget_template></GUITemplates>)");
    ox::gui::WidgetPtrT made = ox::gui::GetWidgetFactory().Create("scene_widget", node.Root(), templates.Templates());
    SceneWidgetPtrT child(dynamic_cast<CSceneWidget*>(made.get()));
    ASSERT_TRUE(child && child->GetCloseButton());
    child->SetCloseButtonText("Close");
    child->SetScene(closeup.get());
    widget->AddWidget(child);
    app->Update();
    EXPECT_EQ(child->GetOffset(), FloatVector(140, 100)) << "the scene's place, less the insets";
    EXPECT_EQ(child->GetSize(), FloatVector(220, 150));
    const ox::gui::CWidget& button = *child->GetCloseButton();
    EXPECT_EQ(button.GetOffset(), FloatVector(110 - 20, 150 - 20 + 4));

    // A click in the close-up reaches its object before the scene below.
    oxtest::SendClick(*platform, 50 + 140 + 10 + 100, 40 + 100 + 20 + 50);
    EXPECT_EQ(Calls(), "cursor ring | pos 300,210 | ring | clear");
    // Its close button: the parent hears first, the level's scripts drop the widget.
    oxtest::SendClick(*platform, 50 + 140 + 110, 40 + 100 + 144);
    EXPECT_TRUE(child->IsDead());
    EXPECT_EQ(Calls(), "drop | closed closeup | changed");
    app->Update();
    EXPECT_EQ(child->GetParentWidget(), nullptr);
    EXPECT_TRUE(boxes.Boxes().empty()) << LuaErrors();

    // Closing by id closes only the matching ones; none left is nothing.
    widget->CloseChildScenes();
    EXPECT_EQ(Calls(), "");
}

TEST_F(SceneWidgetTest, BadScriptsAndHintsAreReportedAndTheLevelGoesOn)
{
    oxtest::LogCapture log;
    // A click script that raises: reported, and the click road ends as ever.
    scene->IsContentObject("front")->SetLuaScript("note('front') error('boom')", B::ScriptMouseClick);
    ClickScene(65, 65);
    EXPECT_EQ(Calls(), "cursor front | pos 115,105 | front | wrong 115,105 | clear");
    ASSERT_EQ(boxes.Boxes().size(), 1u);
    EXPECT_NE(boxes.Boxes()[0].text.find("boom"), std::string::npos) << LuaErrors();
    ClickScene(100, 100);
    EXPECT_EQ(Calls(), "cursor back | pos 150,140 | back | wrong 150,140 | clear");

    // A hint whose text is not in the string table: a log line, and the table's own text shows.
    scene->IsContentObject("back")->SetHint("$999");
    oxtest::SendMove(*platform, 50 + 65, 40 + 65);
    oxtest::SendMove(*platform, 50 + 100, 40 + 100);
    EXPECT_TRUE(log.Contains("hint '$999'")) << "no log line for the missing hint";
    EXPECT_FALSE(g_Cursor::Instance().GetHintText().empty());

    // A close-up whose click script closes it: the script goes on, the widget goes at the update.
    SceneWidgetPtrT child(new CSceneWidget());
    child->SetScene(closeup.get());
    widget->AddWidget(child);
    closeup->IsContentObject("ring")->SetLuaScript(
        "quest.SetModifyFlag(true) main_widget.CloseChildScenes() note('after ' .. tostring(self.GetId().c_str()))",
        B::ScriptMouseClick);
    Calls();
    oxtest::SendClick(*platform, 50 + 150 + 100, 40 + 120 + 50);
    EXPECT_EQ(Calls(), "cursor ring | pos 300,210 | closed closeup | changed | after ring | clear");
    app->Update();
    EXPECT_EQ(child->GetParentWidget(), nullptr);
    EXPECT_EQ(boxes.Boxes().size(), 1u) << LuaErrors();
}
