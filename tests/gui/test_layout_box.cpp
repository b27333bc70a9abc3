// Layout boxes read from descriptions: nested boxes with spacers, flexible shares, packing and
// alignment, boxes that stand apart, and descriptions a game maker got wrong.
#include "gui/LayoutBox.h"
#include "gui/ProbeWidget.h"
#include "support/TestSupport.h"

#include <cmath>

using namespace ox::gui;
using ox::misc::FloatVector;
using oxtest::ProbeWidget;
using oxtest::XmlDescription;

namespace {

// A probe whose element may name a template (attribute `template`, kind probe_template): the
// template's node is loaded into a child of the same kind, as controls load their parts.
struct TemplatedProbe : ProbeWidget {
    void Load(const ox::core::CSettingsGroup& node, const ox::core::CSettingsGroup& templates) override
    {
        ProbeWidget::Load(node, templates);
        if (!node.IsValue("template"))
            return;
        WidgetPtrT part(new TemplatedProbe());
        part->Load(templates.GetChildByAttribute("probe_template", "id", node.GetValue("template")), templates);
        AddWidget(part);
    }
};

struct Layout : ::testing::Test {
    boost::intrusive_ptr<ProbeWidget> root;

    void SetUp() override
    {
        ProbeWidget::Register();
        GetWidgetFactory().RegisterWidget<TemplatedProbe>("templated_widget");
    }
    // Loads the first element as the root, lays it out, and returns the widget with the id.
    void Build(const std::string& xml)
    {
        XmlDescription description(xml);
        root = new ProbeWidget();
        root->Load(description.Root(), description.Templates());
        root->UpdateLayout();
    }
    CWidget& W(const char* id)
    {
        CWidget* w = root->GetId() == id ? root.get() : root->GetWidget(id, true);
        EXPECT_NE(w, nullptr) << id;
        static ProbeWidget none;
        return w ? *w : none;
    }
    void ExpectBox(const char* id, float x, float y, float w, float h)
    {
        SCOPED_TRACE(id);
        EXPECT_EQ(W(id).GetOffset(), FloatVector(x, y));
        EXPECT_EQ(W(id).GetSize(), FloatVector(w, h));
    }
};

} // namespace

TEST_F(Layout, NestedBoxesWithSpacersPackAndAlign)
{
    Build(R"(<probe_widget id="panel" width="400" height="300">
               <insets left="10" right="10" top="20" bottom="20"/>
               <vbox flex="1">
                 <hbox>
                   <probe_widget id="a" width="50" height="30"/>
                   <spacer flex="1"/>
                   <probe_widget id="b" width="70" height="40"/>
                 </hbox>
                 <spacer height="15"/>
                 <hbox pack="end" align="center" height="60">
                   <probe_widget id="c" width="40" height="20"/>
                   <probe_widget id="d" width="60" height="50"/>
                 </hbox>
               </vbox>
             </probe_widget>)");
    // The vbox fills the panel inside its insets (380 x 260). The first row stretches its
    // children to its height (40) and its spacer takes the free 260 pixels; 15 pixels of spacer
    // below, then a 60-pixel row packed to the end (280 free) with its children centred across.
    ExpectBox("panel", 0, 0, 400, 300);
    ExpectBox("a", 10, 20, 50, 40);
    ExpectBox("b", 320, 20, 70, 40);
    ExpectBox("c", 290, 95, 40, 20);
    ExpectBox("d", 330, 80, 60, 50);
    // The widgets below bare boxes belong to the nearest widget above.
    EXPECT_EQ(W("c").GetParentWidget(), root.get());
    EXPECT_EQ(root->GetWidgets().size(), 4u);
}

TEST_F(Layout, FlexSharesAbsoluteBoxesAndPreferredSizes)
{
    Build(R"(<probe_widget id="row" height="10">
               <probe_widget id="one" flex="1"/>
               <probe_widget id="two" flex="2"/>
               <probe_widget id="free" abs_pos="true" x="5" y="6" width="500" height="500"/>
             </probe_widget>)");
    // Nothing measured: the flexible children had no size, nor has the row.
    ExpectBox("row", 0, 0, 0, 10);
    root->SetSize(300, 10);
    ExpectBox("one", 0, 0, 100, 10);
    ExpectBox("two", 100, 0, 200, 10);
    ExpectBox("free", 5, 6, 500, 500);

    // A minimum beats a smaller preferred size; a larger preferred size beats the minimum.
    auto& two = static_cast<ProbeWidget&>(W("two"));
    two.preferred = {260, 12};
    EXPECT_EQ(root->GetLayoutBox()->ComputePreferredSize(), FloatVector(390, 12)) << "two's room at its share";
    EXPECT_EQ(root->GetSize(), FloatVector(300, 10)) << "computing changes nothing";
    root->UpdateLayout();
    ExpectBox("two", 130, 0, 260, 12);
    ExpectBox("one", 0, 0, 130, 12);
}

TEST_F(Layout, DeadWidgetsBoxLeavesTheTree)
{
    Build(R"(<probe_widget><probe_widget id="first" width="30" height="5"/>
               <hbox><probe_widget id="second" width="20" height="5"/></hbox></probe_widget>)");
    ExpectBox("second", 30, 0, 20, 5);
    CWidget& first = W("first");
    root->RemoveWidget(&first);
    root->Update();
    EXPECT_EQ(root->GetWidget("first"), nullptr);
    root->UpdateLayout();
    ExpectBox("second", 0, 0, 20, 5);
    EXPECT_EQ(root->GetSize(), FloatVector(20, 5)) << "measured without the dead one";
}

TEST_F(Layout, BadDescriptionsAreLoggedAndLaidOutSanely)
{
    oxtest::LogCapture log;
    Build(R"(<probe_widget id="panel">
               <grid id="g"><probe_widget id="lost"/></grid>
               <hbox orient="" align="middle" pack="left">
                 <probe_widget id="neg" width="-5" height="1e9"/>
                 <probe_widget id="nan" width="abc" height="nan" flex="-2"/>
               </hbox>
               <templated_widget id="outer" template="loop"/>
             </probe_widget>
             <GUITemplates>
               <probe_template id="loop"><templated_widget id="inner" template="loop"/></probe_template>
             </GUITemplates>)");
    for (const char* line : {"<grid id=\"g\">: neither a box nor a known widget kind",
                             "<hbox>: unknown value, ignored: orient=\"\"", "align=\"middle\"", "pack=\"left\"",
                             "<probe_widget id=\"neg\">: out of range, clamped: width=\"-5\" to 0",
                             "height=\"1e9\" to 16384", "width=\"abc\"", "height=\"nan\"", "flex=\"-2\" to 0",
                             "<probe_template id=\"loop\">: contains itself through templates"})
        EXPECT_TRUE(log.Contains(line)) << line;
    EXPECT_EQ(root->GetWidget("lost", true), nullptr);
    // The broken boxes still lay out: the row stays horizontal, every size is finite.
    ExpectBox("neg", 0, 0, 0, 16384);
    ExpectBox("nan", 0, 0, 0, 16384);
    EXPECT_EQ(W("nan").GetLayoutBox()->GetFlex(), 0);
    // The cycle ends after one round: outer, its part from the template, inner, inner's part.
    CWidget& inner = W("inner");
    ASSERT_EQ(inner.GetWidgets().size(), 1u);
    EXPECT_TRUE(inner.GetWidgets()[0]->GetWidgets().empty());
    EXPECT_TRUE(std::isfinite(root->GetSize().X) && std::isfinite(root->GetSize().Y));
}
