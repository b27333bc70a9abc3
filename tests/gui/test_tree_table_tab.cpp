// The composite controls driven as a player drives them: tabs switched by their buttons, trees
// opened, selected and dragged, tables fitted, scrolled and selected.
#include "gui/ControlTestSupport.h"
#include "gui/GuiBinding.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/ScrollWidget.h"
#include "gui/controls/TabWidget.h"
#include "gui/controls/TableWidget.h"
#include "gui/controls/TreeWidget.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"

using namespace ox::gui;
using ox::misc::FloatVector;
using oxtest::ActionWindow;
using Strings = std::vector<std::string>;
using ox::graphics::Vertex;

namespace {

const char* kTemplates = R"(
  <GUITemplates>
    <window_template id="plain"/>
    <label_template id="text" font="mono"/>
    <button_template id="tab" image="strip" label_template="text"/>
    <tab_template id="top" back_image="frame" tab_offset_left="4" tab_offset_right="6" tab_offset_bottom="2"
                  tab_space="3"><tab_insets left="5" top="5" right="5" bottom="5"/></tab_template>
    <tab_template id="side" back_image="frame" alignment_left="true" tab_offset_bottom="2"/>
    <tree_template id="tree" font="mono" offset="16" drag_line_length="30" check_texture="check"
                   color_selection="#255 0 0 255"><vertical_scroll/><horizontal_scroll/></tree_template>
    <scroll_template id="bar"/>
    <table_template id="grid" default_back_image="box" scroll_template="bar" default_selection_back="tick"
                    lines_image="frame"/>
  </GUITemplates>)";

struct CompositeTest : oxtest::ControlFixture {
    CWidgetManager manager;
    boost::intrusive_ptr<ActionWindow> window;

    void SetUp() override
    {
        ControlFixture::SetUp();
        // The expand box: two 8 x 8 frames side by side, open and closed.
        auto surface = std::make_unique<ox::graphics::CSurface>(16, 8);
        auto texture = std::make_unique<ox::graphics::CTexture>(
            surface.get(), std::vector<ox::graphics::UVRect> {{0, 0, 0.5f, 1}, {0.5f, 0, 1, 1}}, 8, 8);
        textures["check"] = {std::move(surface), std::move(texture)};
    }
    void Show(const std::string& content)
    {
        window = oxtest::LoadWindow<ActionWindow>("<window window_template=\"plain\" width=\"600\" height=\"400\">" +
                                                  content + "</window>" + kTemplates);
        manager.SetMainWindow(window);
        manager.Update();
    }
    template <class W>
    W& Get(const char* id)
    {
        auto* widget = dynamic_cast<W*>(window->GetWidget(id, true));
        EXPECT_NE(widget, nullptr) << id;
        return *widget;
    }
    void Move(int x, int y, int keys = 0) { manager.OnMouseMove({x, y}, keys); }
    void Down(int x, int y, int keys = 0) { manager.OnMouseDown({x, y}, LeftButton, keys); }
    void Up(int x, int y, int keys = 0) { manager.OnMouseUp({x, y}, LeftButton, keys); }
    void Click(int x, int y, int keys = 0)
    {
        Move(x, y, keys);
        Down(x, y, keys);
        Up(x, y, keys);
    }
};

// Three tabs of 16 x 16 buttons, the second selected by the description.
const char* kThreeTabs = R"(
  <tab_widget id="tabs" tab_template="top" selected="1" x="100" y="50" abs_pos="true">
    <tabs>
      <tab button_template="tab" caption="a"><label_widget id="la" label_template="text" text="aa"/></tab>
      <tab button_template="tab" caption="b"><label_widget id="lb" label_template="text" text="abcabc"/></tab>
      <tab button_template="tab" caption="c"/>
    </tabs>
  </tab_widget>)";

bool Shown(const CWidget* panel) { return panel && (panel->GetFlags() & (FlagHidden | FlagDisabled)) == 0; }

} // namespace

TEST_F(CompositeTest, TabsShowOnePanelAndSwitchByTheirButtons)
{
    Show(kThreeTabs);
    auto& tabs = Get<CTabWidget>("tabs");
    ASSERT_EQ(tabs.EnumPanels(), 3);
    EXPECT_EQ(tabs.GetSelectedPanel(), 1);
    const auto& panels = tabs.GetPanels();
    EXPECT_FALSE(Shown(panels[0].content.get()));
    EXPECT_TRUE(Shown(panels[1].content.get()));
    EXPECT_FALSE(Shown(panels[2].content.get()));
    EXPECT_EQ(panels[0].content->GetWidget("la"), window->GetWidget("la", true)) << "the tab's content is its panel's";
    // The selected tab is on top and can't be pressed; the others keep the first on top.
    EXPECT_EQ(panels[1].button->GetLayer(), LayerAlwaysOnTop);
    EXPECT_EQ(panels[1].button->GetButtonState(), CButtonWidget::StateDisabled);
    EXPECT_EQ(panels[0].button->GetLayer(), 5u);
    EXPECT_EQ(panels[2].button->GetLayer(), 3u);
    EXPECT_EQ(panels[0].button->GetText(), u"a");

    // Each tab behind the one before it, overlapping by tab_space; the frame overlaps the
    // strip by tab_offset_bottom; every panel has the same size, below the strip.
    EXPECT_EQ(panels[0].button->GetOffset(), FloatVector(4, 0));
    EXPECT_EQ(panels[1].button->GetOffset(), FloatVector(17, 0));
    EXPECT_EQ(panels[2].button->GetOffset(), FloatVector(30, 0));
    EXPECT_EQ(panels[1].content->GetOffset(), FloatVector(0, 16));
    EXPECT_EQ(panels[0].content->GetSize(), panels[1].content->GetSize());
    EXPECT_GE(panels[1].content->GetSize().X, 52.0f) << "at least the strip: its tabs and tab_offset_right";
    EXPECT_GE(panels[1].content->GetSize().Y, 30.0f) << "at least the label and the tab insets";

    // A press on the first tab (where the second one, on top, doesn't cover it).
    Click(100 + 8, 50 + 8);
    EXPECT_EQ(tabs.GetSelectedPanel(), 0);
    EXPECT_TRUE(Shown(panels[0].content.get()));
    EXPECT_FALSE(Shown(panels[1].content.get()));
    EXPECT_EQ(panels[1].button->GetLayer(), 4u);
    EXPECT_NE(panels[1].button->GetButtonState(), CButtonWidget::StateDisabled);
    Strings actions = window->Take();
    EXPECT_EQ(actions.back(), "panel_selected tabs");
    EXPECT_EQ(std::count(actions.begin(), actions.end(), "pressed "), 0) << "a tab's press stays in the tab widget";

    // The selected tab again, or out of range: nothing.
    Click(100 + 8, 50 + 8);
    tabs.SelectPanel(3);
    tabs.SelectPanel(-1);
    EXPECT_EQ(tabs.GetSelectedPanel(), 0);
    for (const std::string& action : window->Take())
        EXPECT_NE(action, "panel_selected tabs");

    EXPECT_EQ(tabs.GetPanelContent(u"c"), panels[2].content.get());
    EXPECT_EQ(tabs.GetPanelContent(u"d"), nullptr);
    EXPECT_EQ(tabs.GetPanelContent(3), nullptr);
}

TEST_F(CompositeTest, TabsDownTheSideTakeTheWidestWidthAndNoTabsHaveNoSize)
{
    Show(R"(<tab_widget id="side" tab_template="side">
              <tabs><tab button_template="tab" caption="a"/><tab caption="b" width="30" height="10"/></tabs>
            </tab_widget>
            <tab_widget id="none" tab_template="top"/>)");
    auto& side = Get<CTabWidget>("side");
    const auto& panels = side.GetPanels();
    ASSERT_EQ(panels.size(), 2u);
    EXPECT_EQ(panels[0].button->GetSize().X, 30.0f);
    EXPECT_EQ(panels[1].button->GetSize().X, 30.0f);
    EXPECT_EQ(panels[0].button->GetOffset(), FloatVector(0, 0));
    EXPECT_EQ(panels[1].button->GetOffset(), FloatVector(0, 16));
    EXPECT_EQ(panels[0].content->GetOffset(), FloatVector(30, 0)) << "the panels stand beside the strip";
    EXPECT_EQ(Get<CTabWidget>("none").GetPreferredSize(), FloatVector(0, 0));
    EXPECT_EQ(Get<CTabWidget>("none").GetSelectedPanel(), -1);
}

// Trees ------------------------------------------------------------------------------------------

namespace {

using Node = CTreeWidget::CNode;

// A tree at (100, 50), 200 x 200, rows 20 high, levels 16 apart, no icons: a row's text starts
// 16 right of its level's x. Events are noted as "<event> <text> <other text or ->".
struct TreeTest : CompositeTest {
    CTreeWidget* tree = nullptr;
    Strings events;
    std::map<std::string, bool> vetoes; // "<event> <text> <other text>" -> the answer

    void ShowTree(const char* extra = "")
    {
        Show(std::string(R"(<tree_widget id="tree" tree_template="tree" x="100" y="50" width="200" height="200"
                                         abs_pos="true" )") + extra + "/>");
        tree = &Get<CTreeWidget>("tree");
        tree->SetEventHandler([this](CTreeWidget&, int event, Node& node, Node* other) {
            const std::string key = std::to_string(event) + " " + Text(&node) + " " + (other ? Text(other) : "-");
            events.push_back(key);
            auto veto = vetoes.find(key);
            return veto == vetoes.end() || veto->second;
        });
    }
    static std::string Text(const Node* node)
    {
        std::string text;
        for (char16_t c : node->GetText())
            text += static_cast<char>(c);
        return text;
    }
    Node* Add(const char* text, Node* parent = nullptr, bool group = false)
    {
        std::u16string wide(text, text + strlen(text));
        return tree->AddNode(wide, parent, group ? uint32_t {Node::FlagGroup} : 0u);
    }
    // The texts of the children of a node, and the selected nodes.
    static std::string Children(const Node* parent)
    {
        std::string list;
        for (const Node* c = parent->GetFirstChild(); c; c = c->GetNextSibling())
            list += Text(c) + (c->GetNextSibling() ? " " : "");
        return list;
    }
    std::string Selected() const
    {
        std::string list;
        for (const auto& node : tree->GetSelectedNodes())
            list += Text(node.get()) + " ";
        return list;
    }
    // The canvas point on row `row` (from the top) at `x` into the row's level.
    static int RowY(int row) { return 50 + row * 20 + 10; }
};

} // namespace

TEST_F(TreeTest, GroupsOpenByTheirBoxAndSelectWithControlAndShift)
{
    ShowTree();
    Node* g = Add("g", nullptr, true);
    for (const char* text : {"a", "b", "c", "ab"})
        Add(text, g);
    Node* leaf = Add("bc");
    EXPECT_EQ(Add("x", leaf), nullptr) << "a leaf takes no children";
    EXPECT_EQ(tree->GetScroll(true)->GetMaxValue(), 2 * 20 + 1.0f) << "two rows, and one more";

    Click(100 + 5, RowY(0)); // the expand box
    EXPECT_TRUE(g->ReadFlag(Node::FlagExpanded));
    EXPECT_EQ(tree->GetScroll(true)->GetMaxValue(), 6 * 20 + 1.0f);
    EXPECT_EQ(window->Take(), Strings {}) << "opening selects nothing";

    Click(100 + 16 + 16 + 3, RowY(1)); // a
    EXPECT_EQ(Selected(), "a ");
    vetoes["6 b -"] = false;
    Click(100 + 16 + 16 + 3, RowY(4), ShiftPressed); // a to ab, b refused
    EXPECT_EQ(Selected(), "a c ab ");
    Click(100 + 16 + 16 + 3, RowY(4), ControlPressed); // ab off
    Click(100 + 16 + 16 + 3, RowY(2), ControlPressed); // b: refused again
    EXPECT_EQ(Selected(), "a c ");
    Click(100 + 16 + 3, RowY(5), ShiftPressed); // another parent: a plain click
    EXPECT_EQ(Selected(), "bc ");
    EXPECT_EQ(window->Take(), Strings(5, "selection_changed tree"));

    // Closing the group clears the selection below it, and says so.
    Click(100 + 16 + 16 + 3, RowY(1));
    Click(100 + 5, RowY(0));
    EXPECT_EQ(Selected(), "");
    EXPECT_EQ(window->Take(), Strings(2, "selection_changed tree"));
    // A click below the rows clears the selection; UpdateNodes opens the way to a selected node.
    Click(100 + 20, RowY(1));
    EXPECT_EQ(Selected(), "bc ");
    Click(100 + 20, RowY(4));
    EXPECT_EQ(Selected(), "");
    g->GetFirstChild()->RaiseFlag(Node::FlagSelected);
    tree->UpdateNodes();
    EXPECT_TRUE(g->ReadFlag(Node::FlagExpanded));
}

TEST_F(TreeTest, DraggingMovesANodeOnlyWhereItWouldChangePlace)
{
    ShowTree();
    Node* g = Add("g", nullptr, true);
    Node* a = Add("a", g);
    Node* b = Add("b", g, true);
    Node* c = Add("c", g);
    Node* d = Add("d", b);
    g->RaiseFlag(Node::FlagExpanded);
    b->RaiseFlag(Node::FlagExpanded);
    tree->UpdateNodes(); // rows: g, a, b, (d), c
    events.clear();

    // a pressed and dragged: over its own next sibling's top third there is no target
    // (nothing would move), nor over itself.
    Move(100 + 40, RowY(1));
    Down(100 + 40, RowY(1));
    EXPECT_TRUE(tree->IsDragging());
    Move(100 + 40, 50 + 2 * 20 + 2);
    EXPECT_EQ(tree->GetDragTarget(), nullptr);
    Move(100 + 40, RowY(1));
    EXPECT_EQ(tree->GetDragTarget(), nullptr);
    // The group b's middle third: into b; a leaf's lower half: behind it.
    Move(100 + 40, 50 + 2 * 20 + 10);
    EXPECT_EQ(tree->GetDragTarget(), b);
    EXPECT_EQ(tree->GetDragPlace(), CTreeWidget::DropInto);
    Move(100 + 40, 50 + 4 * 20 + 15);
    EXPECT_EQ(tree->GetDragTarget(), c);
    EXPECT_EQ(tree->GetDragPlace(), CTreeWidget::DropBehind);
    events.clear();
    Up(100 + 40, 50 + 4 * 20 + 15);
    EXPECT_FALSE(tree->IsDragging());
    EXPECT_EQ(Children(g), "b c a");
    EXPECT_EQ(events, Strings({"3 a g", "1 a g"})) << "asked, then told with the former parent";
    EXPECT_FALSE(a->ReadFlag(Node::FlagSelected)) << "a moved node loses its selection";

    // The group b can't go into its own child; a veto of the new parent leaves no target.
    Move(100 + 40, RowY(1));
    Down(100 + 40, RowY(1));
    Move(100 + 50, 50 + 2 * 20 + 5);
    EXPECT_EQ(tree->GetDragTarget(), nullptr) << "b's own child";
    Up(100 + 50, 50 + 2 * 20 + 5);
    EXPECT_EQ(Children(g), "b c a");
    vetoes["3 a b"] = false;
    Move(100 + 40, RowY(4));
    Down(100 + 40, RowY(4));
    Move(100 + 40, RowY(1));
    EXPECT_EQ(tree->GetDragTarget(), nullptr) << "vetoed";
    // Removing the dragged node ends the drag; a held node stays valid outside the tree.
    CTreeWidget::NodePtrT held(a);
    tree->RemoveNode(*a);
    EXPECT_FALSE(tree->IsDragging());
    EXPECT_EQ(held->GetParent(), nullptr);
    EXPECT_EQ(Text(held.get()), "a");
    EXPECT_EQ(Children(g), "b c");
    EXPECT_FALSE(tree->MoveNode(*c, g, b)) << "already there";
    EXPECT_TRUE(tree->MoveNode(*c, g, nullptr));
    EXPECT_EQ(Children(g), "c b");
    EXPECT_FALSE(tree->MoveNode(*b, d, nullptr)) << "into its own child";
    EXPECT_EQ(Children(g), "c b");
    // Cleared, a node a script holds stays, outside any tree.
    CTreeWidget::NodePtrT kept(c);
    tree->Clear();
    EXPECT_EQ(tree->GetFirstNode(), nullptr);
    EXPECT_EQ(kept->GetParent(), nullptr);
    EXPECT_EQ(kept->GetNextSibling(), nullptr);
}

// Tables -----------------------------------------------------------------------------------------

namespace {

// A cell of a fixed size: its content is a bare box of that size.
std::string Cell(int width, int height, int flex = 0, const char* extra = "")
{
    return "<cell flex=\"" + std::to_string(flex) + "\" " + extra + "><spacer width=\"" + std::to_string(width) +
           "\" height=\"" + std::to_string(height) + "\"/></cell>";
}

} // namespace

TEST_F(CompositeTest, TableColumnsShareTheWidthByFlexAndShortRowsAreFilled)
{
    Show("<table_widget id=\"t\" table_template=\"grid\" width=\"300\" abs_pos=\"true\"><rows><row>" + Cell(30, 20) +
         Cell(10, 10, 1) + Cell(10, 10, 2) + "</row><row>" + Cell(40, 25) + "</row></rows></table_widget>");
    auto& table = Get<CTableWidget>("t");
    EXPECT_EQ(table.GetCellsCount(), 6);
    EXPECT_EQ(table.GetColumnWidth(0), 40.0f) << "the widest in the column";
    EXPECT_FLOAT_EQ(table.GetColumnWidth(1), 260.0f / 3);
    EXPECT_FLOAT_EQ(table.GetColumnWidth(2), 520.0f / 3);
    EXPECT_EQ(table.GetRowHeight(1), 25.0f);
    ASSERT_NE(table.GetCell(1, 2), nullptr) << "the short row is filled";
    EXPECT_EQ(table.GetCell(1, 2)->GetSize(), FloatVector(520.0f / 3, 25));
    EXPECT_EQ(table.GetCell(1, 0)->GetOffset(), FloatVector(0, 20));
    EXPECT_EQ(table.GetCell(2, 0), nullptr);
    EXPECT_EQ(table.GetCell(0, 3), nullptr);
    ASSERT_NE(table.GetScroll(), nullptr);
    EXPECT_TRUE(table.GetScroll()->GetFlags() & FlagHidden) << "table_height 0 shows every row and no bar";

    table.ClearTable();
    EXPECT_EQ(table.GetCellsCount(), 0);
    table.LoadRow(1);
    table.LoadRow(7);
    EXPECT_TRUE(log.Contains("index < GetSourceRowsCount()"));
    table.FitCells();
    EXPECT_EQ(table.GetCellsCount(), 1);
    EXPECT_EQ(table.GetColumnWidth(0), 40.0f);
}

TEST_F(CompositeTest, TableScrollsUnderItsTitleAndSelectsRows)
{
    std::string rows = "<row>" + Cell(50, 20) + Cell(50, 20) + "</row>";
    for (int i = 0; i < 5; ++i)
        rows += "<row>" + Cell(50, 20, 0, i == 2 ? "back_image=\"frame\"" : "") + Cell(50, 20) + "</row>";
    Show("<table_widget id=\"t\" table_template=\"grid\" table_height=\"3\" has_title=\"true\" "
         "enable_selection=\"true\" x=\"100\" y=\"50\" abs_pos=\"true\"><rows>" + rows + "<row><cell>"
         "<label_widget label_template=\"missing\"/></cell></row></rows></table_widget>");
    EXPECT_TRUE(log.Contains("missing")) << "a cell naming a missing template is logged";
    auto& table = Get<CTableWidget>("t");
    CScrollWidget& scroll = *table.GetScroll();
    EXPECT_FALSE(scroll.GetFlags() & (FlagHidden | FlagDisabled));
    EXPECT_EQ(scroll.GetMaxValue(), 120.0f - 20) << "every row but the title";
    EXPECT_EQ(scroll.GetPageSize(), 60.0f - 20) << "the first three rows but the title";
    EXPECT_EQ(table.GetSize().Y, 60.0f);

    table.SelectRow(0);
    EXPECT_EQ(table.GetSelectedRow(), -1) << "the title can't be selected";
    Click(100 + 60, 50 + 45); // row 2
    EXPECT_EQ(table.GetSelectedRow(), 2);
    EXPECT_EQ(window->Take(), Strings {"row_selected t"});
    const auto& cells = table.GetCells();
    EXPECT_EQ(cells[2][1].back->GetImage().GetTexture()->GetSurface(), textures["tick"].first.get())
        << "the selection's back";
    EXPECT_EQ(cells[3][0].back->GetImage().GetTexture()->GetSurface(), textures["frame"].first.get())
        << "a cell's own back";

    scroll.SetValue(20);
    EXPECT_EQ(table.GetCell(1, 0)->GetOffset(), FloatVector(0, 0)) << "scrolled";
    EXPECT_EQ(table.GetCell(0, 0)->GetOffset(), FloatVector(0, 0)) << "the title stays";
    window->Take();
    Click(100 + 10, 50 + 25); // row 2 again, now under the pointer at 25 + 20
    EXPECT_EQ(window->Take(), Strings {}) << "the same row again";
    Click(100 + 10, 50 + 45);
    EXPECT_EQ(table.GetSelectedRow(), 3);
    EXPECT_EQ(cells[2][1].back->GetImage().GetTexture()->GetSurface(), textures["box"].first.get())
        << "the default back again";
    manager.OnDoubleClick({100 + 10, 50 + 45}, 0);
    manager.OnDoubleClick({100 + 10, 50 + 5}, 0);
    Strings actions = window->Take();
    EXPECT_EQ(std::count(actions.begin(), actions.end(), "table_double_click t"), 1) << "not on the title";
    manager.OnMouseWheel({100 + 10, 50 + 45}, -1, 0);
    EXPECT_GT(scroll.GetValue(), 20.0f);
}

TEST_F(TreeTest, RowsDrawTheirExpandBoxAndSelection)
{
    ShowTree();
    Node* g = Add("g", nullptr, true);
    Add("a", g);
    Add("b")->RaiseFlag(Node::FlagSelected);
    // The expand box's frame: the closed one (u from 0.5) while closed with children, then
    // the open one. The selected row fills behind its text with the selection colour.
    auto boxU = [&]() {
        Draws();
        tree->Draw(*renderer);
        float u = 2;
        bool filled = false;
        for (const auto& draw : Draws())
            for (const Vertex& v : draw.vertices) {
                if (v.x < 113 && v.y < 69 && draw.texture)
                    u = std::min(u, v.u);
                filled = filled || v.diffuse == 0xFF0000FFu;
            }
        EXPECT_TRUE(filled);
        return u;
    };
    EXPECT_FLOAT_EQ(boxU(), 0.5f);
    g->RaiseFlag(Node::FlagExpanded);
    EXPECT_FLOAT_EQ(boxU(), 0.0f);
}

TEST_F(TreeTest, ScriptsBuildTheTreeAndAFailingHandlerLeavesItUsable)
{
    oxtest::MessageCapture boxes;
    ox::lua::CLua lua {"tree_test", false};
    lua.BeginBinding();
    lua.Bind(mluabind::BindStdStrings());
    lua.Bind(mluabind::Namespace("ox").Merge(ox::lua::BindLuaClasses()).Merge(BindGui()));
    lua.EndBinding();
    ASSERT_TRUE(lua.Run(std::string(R"(
        function Build(tree)
            local N = ox.gui.CTreeWidget.CNode
            local g = tree.AddNode("g", nil, N.FlagGroup + N.FlagExpanded)
            tree.AddNode("", "a", g, 7, 42)
            tree.SetEventHandler(ox.lua.CLua.GetLua("tree_test"), "OnTree")
            return tree.FindNodeByUserData(42).GetUserType() .. " " .. tree.GetFirstNode(7).GetText().c_str()
        end
        function OnTree(tree, event, node, other)
            seen = (seen or "") .. event .. node.GetText().c_str() .. ";"
            error("the handler fails")
        end)")));
    ShowTree();
    tree->SetEventHandler(nullptr);
    EXPECT_EQ((ox::lua::CallLuaFunction<std::string>(lua, "Build", tree)), "7 a");
    Click(100 + 16 + 16 + 3, RowY(1));
    EXPECT_EQ(Selected(), "a ") << "a failing handler answers yes";
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "return seen"), "6a;");
    ASSERT_FALSE(boxes.Boxes().empty());
    EXPECT_EQ(boxes.Boxes().front().caption, "Lua Error");
    tree->SetEventHandler(&lua, "");
    Click(100 + 5, RowY(0));
    EXPECT_EQ(Selected(), "") << "closed";
}

// The demo's developer window: its description and scripts/devtools.lua over a level of two
// scenes, the window's own boxes standing in as plain widgets.
TEST_F(TreeTest, DemoDeveloperWindowShowsTheLevelAndRefusesMoves)
{
    oxtest::ScopedKind box {"demo_box_widget", oxtest::ScopedKind::Of<CWidget>()};
    oxtest::MessageCapture boxes;
    GetGuiServices().findFont = [this](const char*) { return &font; };
    ox::core::CSettings settings;
    ASSERT_TRUE(settings.LoadXml(OX_DEMO_GAME "/properties/guitemplates.xml"));
    ASSERT_TRUE(settings.LoadXml(OX_DEMO_GAME "/properties/gui.xml"));
    window = new ActionWindow();
    window->Load(settings.GetChildByAttribute("window", "id", "devtools", true), settings.GetChild("GUITemplates"));
    window->UpdateLayout();
    manager.SetMainWindow(window);
    manager.Update();
    tree = &Get<CTreeWidget>("devtools_tree");

    ox::lua::CLua lua {"main", false};
    lua.BeginBinding();
    lua.Bind(mluabind::BindStdStrings());
    lua.Bind(mluabind::Namespace("ox").Merge(ox::lua::BindLuaClasses()).Merge(BindGui()));
    lua.EndBinding();
    ASSERT_TRUE(lua.Run(std::string(R"(
        DemoWindow = { OnKeyDown = function() return false end }
        qe = { CBaseSceneObject = { GroupType = 2 } }
        local function list(items)
            local i = 1
            return { IsEnd = function() return i > #items end, Get = function() return items[i] end,
                     Next = function() i = i + 1 end }
        end
        local function object(id, kind) return { GetId = function() return id end, GetType = function() return kind end } end
        local function scene(id, objects)
            return { GetId = function() return id end, GetObjects = function() return list(objects) end }
        end
        lantern = { level = { GetId = function() return "level1" end, EnumScenes = function() return 2 end,
                              GetScenes = function() return list({ scene("hall", { object("lamp", 1), object("shelf", 2) }),
                                                                   scene("attic", { object("key", 1) }) }) end } })")));
    ASSERT_TRUE(lua.Run(oxtest::ReadFile(OX_DEMO_GAME "/scripts/devtools.lua")));
    EXPECT_EQ((ox::lua::CallLuaFunction<int>(lua, "DevTools.Fill", tree)), 3);
    Node* level = tree->GetFirstNode();
    ASSERT_NE(level, nullptr);
    EXPECT_EQ(Text(level), "level1");
    EXPECT_EQ(Children(level), "hall attic");
    EXPECT_EQ(Children(level->GetFirstChild()), "lamp shelf [group]");

    // Open the hall; its lamp can't be dragged into the attic: the script refuses.
    level->GetFirstChild()->RaiseFlag(Node::FlagExpanded);
    tree->UpdateNodes();
    const ox::misc::FloatVector at = tree->GetAbsPos(false);
    const int x = static_cast<int>(at.X) + 4 + 2 * 14 + 6, rowHeight = static_cast<int>(font.PixHeight);
    auto rowY = [&](int row) { return static_cast<int>(at.Y) + 4 + row * rowHeight + rowHeight / 2; };
    Move(x, rowY(2));
    Down(x, rowY(2));
    ASSERT_TRUE(tree->IsDragging());
    Move(x - 14, rowY(4));
    EXPECT_EQ(tree->GetDragTarget(), nullptr);
    Up(x - 14, rowY(4));
    EXPECT_EQ(Children(level->GetFirstChild()), "lamp shelf [group]");
    EXPECT_TRUE(boxes.Boxes().empty());
}
