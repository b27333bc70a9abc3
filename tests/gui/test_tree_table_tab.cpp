// The composite controls driven as a player drives them: tabs switched by their buttons.
#include "gui/ControlTestSupport.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/TabWidget.h"

using namespace ox::gui;
using ox::misc::FloatVector;
using oxtest::ActionWindow;
using Strings = std::vector<std::string>;

namespace {

const char* kTemplates = R"(
  <GUITemplates>
    <window_template id="plain"/>
    <label_template id="text" font="mono"/>
    <button_template id="tab" image="strip" label_template="text"/>
    <tab_template id="top" back_image="frame" tab_offset_left="4" tab_offset_right="6" tab_offset_bottom="2"
                  tab_space="3"><tab_insets left="5" top="5" right="5" bottom="5"/></tab_template>
    <tab_template id="side" back_image="frame" alignment_left="true" tab_offset_bottom="2"/>
  </GUITemplates>)";

struct CompositeTest : oxtest::ControlFixture {
    CWidgetManager manager;
    boost::intrusive_ptr<ActionWindow> window;

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
