// The basic controls driven through the widget manager as a player drives them: buttons
// through presses and releases inside and outside, check boxes and radio groups with the
// order of their actions, labels against measured text, progress bars, tool tips, and
// descriptions that get things wrong.
#include "core/TimeManager.h"
#include "gui/ControlTestSupport.h"
#include "gui/GuiBinding.h"
#include "gui/WidgetManager.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/CheckboxWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/ProgressBarWidget.h"
#include "gui/controls/RadioButtonGroupWidget.h"
#include "gui/controls/ToolTipHelperWidget.h"
#include "gui/controls/ImageBoxWidget.h"
#include "gui/controls/ImageWidget.h"

using namespace ox::gui;
using ox::misc::FloatVector;
using ox::misc::IntVector;
using oxtest::ActionWindow;
using Strings = std::vector<std::string>;
using ox::graphics::Vertex;

namespace {

const char* kTemplates = R"(
  <GUITemplates>
    <window_template id="tips" background="frame" label_template="tip"/>
    <label_template id="tip" font="mono"/>
    <label_template id="text" font="mono"/>
    <button_template id="plain" image="strip" sound_on_press="press" sound_on_over="over"
                     sound_on_disabled_press="denied" label_template="text" image_fade_time="0.2"/>
    <imagebox_template id="framed" frame_image="tip_back"><insets left="5" top="5" right="5" bottom="5"/></imagebox_template>
    <checkbox_template id="check" box_image="box" check_image="tick" font="mono" indent="4" check_time="0.1"
                       sound_on_check="check" sound_on_check_true="on" sound_on_check_false="off"/>
  </GUITemplates>)";

struct ControlsTest : oxtest::ControlFixture {
    CWidgetManager manager;
    boost::intrusive_ptr<ActionWindow> window;

    void Show(const std::string& content, const std::string& templates = kTemplates)
    {
        window = oxtest::LoadWindow<ActionWindow>(
            "<window window_template=\"tips\" width=\"400\" height=\"300\">" + content + "</window>" + templates);
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
    void Move(int x, int y) { manager.OnMouseMove({x, y}, 0); }
    void Down(int x, int y) { manager.OnMouseDown({x, y}, LeftButton, 0); }
    void Up(int x, int y) { manager.OnMouseUp({x, y}, LeftButton, 0); }
    void Click(int x, int y)
    {
        Move(x, y);
        Down(x, y);
        Up(x, y);
    }
};

} // namespace

TEST_F(ControlsTest, ButtonPressesOnlyWhenReleasedInsideAndSoundsAsItChanges)
{
    Show(R"(<button_widget id="ok" button_template="plain" text="ab" x="20" y="20" abs_pos="true"/>)");
    auto& button = Get<CButtonWidget>("ok");
    EXPECT_EQ(button.GetSize(), FloatVector(16, 16)) << "a quarter of the strip";
    ASSERT_NE(button.GetLabel(), nullptr);
    EXPECT_EQ(button.GetLabel()->GetSize(), FloatVector(16, 16));

    Move(25, 25);
    EXPECT_EQ(window->Take(), Strings {"overed ok"});
    EXPECT_EQ(TakeSounds(), Strings {"over"});
    Down(25, 25);
    EXPECT_EQ(button.GetButtonState(), CButtonWidget::StatePressed);
    // Out and released there: no press, and the button is normal again.
    Move(200, 200);
    EXPECT_EQ(button.GetButtonState(), CButtonWidget::StatePressed) << "held while pressed";
    Up(200, 200);
    EXPECT_EQ(button.GetButtonState(), CButtonWidget::StateNormal);
    EXPECT_EQ(window->Take(), Strings {});
    EXPECT_EQ(TakeSounds(), Strings {});

    Click(25, 25);
    EXPECT_EQ(window->Take(), (Strings {"overed ok", "pressed ok"}));
    EXPECT_EQ(TakeSounds(), (Strings {"over", "press"}));
    EXPECT_EQ(button.GetButtonState(), CButtonWidget::StateOver);
    Move(200, 200);
    EXPECT_EQ(window->Take(), Strings {"lost_over ok"});

    // A quick second click is a second press: down, up, double click, up.
    Click(25, 25);
    manager.OnDoubleClick({25, 25}, 0);
    Up(25, 25);
    EXPECT_EQ(window->Take(), (Strings {"overed ok", "pressed ok", "pressed ok"}));
    TakeSounds();

    // Disabled: the sound comes with the release inside, once, and nothing is pressed.
    button.DisableButton(true);
    Move(26, 26);
    Down(26, 26);
    EXPECT_EQ(TakeSounds(), Strings {});
    Up(26, 26);
    EXPECT_EQ(TakeSounds(), Strings {"denied"});
    Up(300, 250);
    EXPECT_EQ(TakeSounds(), Strings {});
    EXPECT_EQ(window->Take(), Strings {});
}

TEST_F(ControlsTest, ButtonCrossFadesItsImagesAndLabelColour)
{
    Show(R"(<button_widget id="ok" button_template="plain" text="ab" x="20" y="20" abs_pos="true"
                           color_normal="#255 255 255 255" color_over="#255 55 155 255"/>)");
    auto& button = Get<CButtonWidget>("ok");
    Move(25, 25);
    button.GetFadeTimer()->SetTime(100); // half of 0.2 seconds
    Draws();
    button.Draw(*renderer);
    EXPECT_EQ(button.GetLabel()->GetColor(), ox::graphics::Color(155, 205, 255, 255));
    // The old state's quarter of the strip drawn opaque, the new one's over it half through.
    std::vector<Vertex> quads;
    for (const auto& draw : Draws())
        if (draw.texture && draw.vertices.size() >= 6)
            quads.insert(quads.end(), draw.vertices.begin(), draw.vertices.end());
    ASSERT_GE(quads.size(), 12u);
    auto leftU = [&](size_t first) {
        float u = 1;
        for (size_t i = first; i < first + 6; ++i)
            u = std::min(u, quads[i].u);
        return u;
    };
    EXPECT_EQ(quads[0].diffuse >> 24, 255u);
    EXPECT_NEAR(leftU(0), 0.0f, 1e-4) << "normal";
    EXPECT_EQ(quads[6].diffuse >> 24, 127u);
    EXPECT_NEAR(leftU(6), 0.25f, 1e-4) << "over";

    button.GetFadeTimer()->SetTime(250);
    button.Draw(*renderer);
    EXPECT_EQ(button.GetLabel()->GetColor(), ox::graphics::Color(55, 155, 255, 255));
}

TEST_F(ControlsTest, RadioGroupKeepsOneCheckedAndTellsInOrder)
{
    Show(R"(<radio_group_widget id="difficulty" columns_count="0" x="10" y="100" abs_pos="true">
              <buttons>
                <b id="normal" checkbox_template="check" caption="a"/>
                <b id="hard" checkbox_template="check" caption="b"/>
                <b id="third" checkbox_template="check" caption="c"/>
              </buttons>
            </radio_group_widget>)");
    auto& group = Get<CRadioButtonGroupWidget>("difficulty");
    ASSERT_EQ(group.GetButtons().size(), 3u);
    EXPECT_EQ(group.GetChecked(), 0) << "the first starts checked";
    EXPECT_EQ(group.GetButtons()[1]->GetOffset(), FloatVector(0, 20)) << "one column, stacked";
    EXPECT_EQ(group.GetButtons()[1]->GetText(), u"b");

    auto checked = [&] {
        int count = 0;
        for (const auto& button : group.GetButtons())
            count += button->IsChecked() ? 1 : 0;
        return count;
    };
    Move(15, 130);
    window->Take();
    Down(15, 130);
    EXPECT_EQ(window->Take(), (Strings {"check_changed hard", "change_checked difficulty"}));
    EXPECT_EQ(TakeSounds(), (Strings {"check", "on"}));
    EXPECT_EQ(group.GetChecked(), 1);
    EXPECT_EQ(checked(), 1);

    Down(15, 130);
    EXPECT_EQ(window->Take(), Strings {}) << "the checked one does nothing";
    group.Check(2);
    EXPECT_EQ(window->Take(), (Strings {"check_changed third", "change_checked difficulty"}));
    EXPECT_EQ(group.GetChecked(), 2);
    EXPECT_EQ(checked(), 1);
}

TEST_F(ControlsTest, CheckBoxTogglesWithSoundsAndFadesItsTick)
{
    Show(R"(<checkbox_widget id="sound" checkbox_template="check" text="ab" x="10" y="200" abs_pos="true"/>)");
    auto& box = Get<CCheckboxWidget>("sound");
    EXPECT_EQ(box.GetSize().Y, 20.0f) << "the text is taller than the box";
    EXPECT_FALSE(box.IsChecked());
    EXPECT_EQ(box.GetTickAlpha(), 0.0f);

    Move(12, 205);
    Down(12, 205);
    EXPECT_EQ(window->Take(), (Strings {"overed sound", "check_changed sound"}));
    EXPECT_EQ(TakeSounds(), (Strings {"check", "on"}));
    EXPECT_TRUE(box.IsChecked());
    box.GetCheckTimer()->SetTime(50);
    EXPECT_FLOAT_EQ(box.GetTickAlpha(), 0.5f) << "half of 0.1 seconds";
    box.GetCheckTimer()->SetTime(100);
    EXPECT_FLOAT_EQ(box.GetTickAlpha(), 1.0f);

    Down(12, 205);
    EXPECT_EQ(window->Take(), Strings {"check_changed sound"});
    EXPECT_EQ(TakeSounds(), (Strings {"check", "off"}));
    box.Check(true, false);
    EXPECT_EQ(window->Take(), Strings {}) << "told only when asked";
}

TEST_F(ControlsTest, LabelJustifiesAndBreaksAsTheTextIsMeasured)
{
    Show(R"(<label_widget id="one" label_template="text" text="ab ab" justification="right bottom"
                          width="100" height="60" abs_pos="true"/>
            <label_widget id="two" label_template="text" text="ab ab" multi_string_flag="true"
                          width="30" height="60" abs_pos="true"/>
            <label_widget id="big" label_template="text" text="a" label_font_scale="500" abs_pos="true"/>
            <label_widget id="bare" text="ab" abs_pos="true"/>)");
    auto& one = Get<CLabelWidget>("one");
    IntVector measured;
    ASSERT_TRUE(renderer->GetTextRender().GetTextSize(&font, u"ab ab", {0, 0, 100, 60}, 0, 0, measured));
    EXPECT_EQ(one.GetPreferredSize(), FloatVector(measured.X, measured.Y));
    EXPECT_EQ(one.GetSize(), FloatVector(100, 60)) << "never smaller than given";

    auto extent = [&](CLabelWidget& label) {
        Draws();
        label.Draw(*renderer);
        float left = 1e9, right = -1e9, top = 1e9, bottom = -1e9;
        for (const auto& draw : Draws())
            for (const Vertex& v : draw.vertices) {
                left = std::min(left, v.x + 0.5f), right = std::max(right, v.x + 0.5f);
                top = std::min(top, v.y + 0.5f), bottom = std::max(bottom, v.y + 0.5f);
            }
        return ox::misc::FloatRect(left, top, right - left, bottom - top);
    };
    const auto placed = extent(one);
    EXPECT_NEAR(placed.X + placed.Width, 100, 1.5) << "right";
    EXPECT_NEAR(placed.Y + placed.Height, 60, 1.0) << "bottom";
    EXPECT_NEAR(placed.Height, measured.Y, 0.01) << "one line";

    const auto broken = extent(Get<CLabelWidget>("two"));
    EXPECT_NEAR(broken.Height, 2 * measured.Y, 0.01) << "two lines in 30 pixels";
    EXPECT_LE(broken.Width, 30.0f);

    EXPECT_EQ(Get<CLabelWidget>("big").GetFontScale(), 100.0f);
    EXPECT_TRUE(log.Contains("out of range, clamped: label_font_scale=\"500\" to 100"));
    auto& bare = Get<CLabelWidget>("bare");
    EXPECT_EQ(bare.GetPreferredSize(), FloatVector());
    Draws();
    bare.Draw(*renderer);
    EXPECT_TRUE(Draws().empty()) << "no font, nothing drawn";
}

TEST_F(ControlsTest, ProgressBarShowsItsShareOfTheWidth)
{
    Show(R"(<progress_bar_widget id="load" frame="frame" progress="bar" value="1.5" abs_pos="true"/>)");
    auto& bar = Get<CProgressBarWidget>("load");
    EXPECT_EQ(bar.GetSize(), FloatVector(100, 10)) << "from the frame";
    EXPECT_EQ(bar.GetValue(), 1.0f);
    EXPECT_TRUE(log.Contains("value=\"1.5\""));
    bar.SetValue(0.25f);
    EXPECT_EQ(bar.GetBar()->GetSize(), FloatVector(25, 10));
    EXPECT_EQ(bar.GetBar()->GetImageRect(), ox::misc::FloatRect(0, 0, 100, 10)) << "cut, not squeezed";
    EXPECT_TRUE(bar.GetBar()->GetFlags() & FlagClipDraw);
    bar.SetValue(-3);
    EXPECT_EQ(bar.GetBar()->GetSize().X, 0.0f);
}

TEST_F(ControlsTest, ToolTipShowsAfterHalfASecondOnlyOnTheTopWindow)
{
    Show(R"(<button_widget id="ok" button_template="plain" tool_tip_text="bb" x="20" y="20" abs_pos="true"/>)");
    auto* helper = dynamic_cast<CToolTipHelperWidget*>(Get<CButtonWidget>("ok").GetWidget(CToolTipHelperWidget::kId));
    ASSERT_NE(helper, nullptr);
    EXPECT_EQ(helper->GetSize(), FloatVector(16, 16));
    auto rest = [&](unsigned ms) {
        helper->GetTimer()->SetTime(helper->GetTimer()->GetTime() + ms);
        manager.Update();
    };
    Move(25, 25);
    rest(500);
    EXPECT_FALSE(window->IsToolTipShown()) << "not before half a second has passed";
    rest(1);
    ASSERT_TRUE(window->IsToolTipShown());
    auto* label = dynamic_cast<CLabelWidget*>(window->GetToolTipLabel());
    ASSERT_NE(label, nullptr);
    EXPECT_EQ(label->GetText(), u"bb");
    EXPECT_EQ(label->GetOffset().Y, 55.0f) << "30 below the pointer";
    Move(300, 250);
    EXPECT_FALSE(window->IsToolTipShown());

    // A child window over this one keeps the tip away.
    Move(25, 25);
    window->AddChildWindow(BaseWindowPtrT(new CWindow()));
    rest(600);
    EXPECT_FALSE(window->IsToolTipShown());
}

TEST_F(ControlsTest, BadDescriptionsAreLoggedNamingTheTemplateAndTheControlsStillWork)
{
    Show(R"(<button_widget id="lost" button_template="missing" x="200" y="0" width="20" height="20" abs_pos="true"/>
            <button_widget id="bad" button_template="bad" color_over="blue" x="50" y="50" width="20" height="20"
                           abs_pos="true"/>
            <checkbox_widget id="odd" checkbox_template="odd" checked="maybe" text_loc="middle" abs_pos="true"/>
            <label_widget id="nofont" label_template="nofont" text="ab" abs_pos="true"/>
            <progress_bar_widget id="empty" frame="nope" abs_pos="true"/>
            <clip_widget id="noclip" clip="no_such_clip" abs_pos="true"/>)",
         R"(<GUITemplates>
              <button_template id="bad" image="nope" image_fade_time="soon" label_template="nolabel"
                               sound_on_press="hush"/>
              <checkbox_template id="odd" box_image="box" indent="-5" font="nofont"/>
              <label_template id="nofont" font="nofont"/>
            </GUITemplates>)");
    for (const char* line : {
             "<button_widget id=\"lost\">: no such template, defaults used: button_template \"missing\"",
             "<button_template id=\"bad\">: no such texture, not drawn: image=\"nope\"",
             "<button_template id=\"bad\">: not a number, ignored: image_fade_time=\"soon\"",
             "<button_template id=\"bad\">: no such sound, silent: sound_on_press=\"hush\"",
             "no such template, defaults used: label_template \"nolabel\"",
             "<button_widget id=\"bad\">: not a colour, ignored: color_over=\"blue\"",
             "<checkbox_widget id=\"odd\">: not true or false, ignored: checked=\"maybe\"",
             "<checkbox_widget id=\"odd\">: text_loc is neither left nor right, ignored: middle",
             "<checkbox_template id=\"odd\">: out of range, clamped: indent=\"-5\"",
             "<label_template id=\"nofont\">: no such font, the text is not drawn: font=\"nofont\"",
             "<progress_bar_widget id=\"empty\">: no such texture, not drawn: frame=\"nope\"",
             "<clip_widget id=\"noclip\">: no such clip, nothing is drawn: no_such_clip",
         })
        EXPECT_TRUE(log.Contains(line)) << line;

    // Drawn as far as they can be, and they still work.
    manager.Draw(*renderer);
    Click(55, 55);
    EXPECT_EQ(window->Take(), (Strings {"overed bad", "pressed bad"}));
    Click(205, 5);
    EXPECT_EQ(window->Take(), (Strings {"overed lost", "lost_over bad", "pressed lost"}));
    EXPECT_FALSE(Get<CCheckboxWidget>("odd").IsChecked());
}

TEST_F(ControlsTest, EveryControlIsMadeByItsElementName)
{
    const std::pair<const char*, bool (*)(CWidget*)> kinds[] = {
        {"label_widget", [](CWidget* w) { return dynamic_cast<CLabelWidget*>(w) != nullptr; }},
        {"image_widget", [](CWidget* w) { return dynamic_cast<CImageWidget*>(w) != nullptr; }},
        {"button_widget", [](CWidget* w) { return dynamic_cast<CButtonWidget*>(w) != nullptr; }},
        {"checkbox_widget", [](CWidget* w) { return dynamic_cast<CCheckboxWidget*>(w) != nullptr; }},
        {"radio_group_widget", [](CWidget* w) { return dynamic_cast<CRadioButtonGroupWidget*>(w) != nullptr; }},
        {"progress_bar_widget", [](CWidget* w) { return dynamic_cast<CProgressBarWidget*>(w) != nullptr; }},
        {"image_box_widget", [](CWidget* w) { return dynamic_cast<CImageBoxWidget*>(w) != nullptr; }},
    };
    for (const auto& [name, is] : kinds) {
        WidgetPtrT made = GetWidgetFactory().Create(name);
        EXPECT_TRUE(made && is(made.get())) << name;
    }
    EXPECT_TRUE(GetWidgetFactory().IsRegistered("clip_widget"));
    EXPECT_TRUE(GetWidgetFactory().IsRegistered("toolbar_widget"));
    EXPECT_TRUE(GetWidgetFactory().Create("image_widget")->GetFlags() & FlagDisabled) << "an image takes no input";
}

TEST_F(ControlsTest, ScriptsTellControlsApartAndFadeTheirWindows)
{
    oxtest::MessageCapture boxes;
    ox::lua::CLua lua {"controls_test", false};
    lua.BeginBinding();
    lua.Bind(mluabind::BindStdStrings());
    // Colours are the graphics vocabulary's; the GUI's methods take them as numbers too.
    mluabind::Namespace graphics("graphics");
    graphics.AddClass(mluabind::Class<ox::graphics::Color>("Color").Constructor<uint32_t>());
    lua.Bind(mluabind::Namespace("ox").Merge(ox::lua::BindLuaClasses()).Merge(std::move(graphics)).Merge(BindGui()));
    lua.EndBinding();
    ASSERT_TRUE(lua.Run(std::string(R"(seen = {}
        T = { OnChildAction = function(self, action, sender)
            local box = ox.gui.CCheckboxWidget.Cast(sender)
            table.insert(seen, action .. (box and (box.IsChecked() and " on" or " off") or " -"))
            if action == "pressed" then
                self.SetColor(0x00FFFFFF)
                self.AddEffect(ox.gui.CColorChangeEffect(0xFFFFFFFF, 100, 0, ""))
                ox.gui.CRadioButtonGroupWidget.Cast(self.GetWidget("group", true)).Check(1)
            end
            return true
        end })")));
    Show(R"(<checkbox_widget id="box" checkbox_template="check" x="10" y="10" abs_pos="true"/>
            <button_widget id="go" button_template="plain" x="100" y="10" abs_pos="true"/>
            <radio_group_widget id="group" x="10" y="100" abs_pos="true">
              <buttons><b id="one" checkbox_template="check"/><b id="two" checkbox_template="check"/></buttons>
            </radio_group_widget>)");
    window->SetOverloadTable("T");
    window->GetHooks().SetLuaById("controls_test", "test");
    Click(12, 12);
    Click(105, 15);
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "return table.concat(seen, ';')"),
              "overed off;check_changed on;overed -;lost_over on;pressed -;check_changed on;change_checked -");
    EXPECT_EQ(window->GetColor().Alpha, 0);
    ASSERT_EQ(window->GetEffects().size(), 1u) << "the script's effect is the window's now";
    for (const auto& box : boxes.Boxes())
        ADD_FAILURE() << box.caption << ": " << box.text;
}

TEST_F(ControlsTest, ImagesStretchShrinkOrStandAtTheirNaturalSize)
{
    Show(R"(<image_widget id="natural" image="box" abs_pos="true"/>
            <image_widget id="sized" image="frame" width="50" height="50" abs_pos="true"/>)");
    auto& natural = Get<CImageWidget>("natural");
    EXPECT_EQ(natural.GetSize(), FloatVector(16, 16)) << "no size takes the image's";
    natural.SetSize(40, 20);
    EXPECT_EQ(natural.GetImageRect(), ox::misc::FloatRect(0, 0, 40, 20)) << "stretched by default";
    natural.SetStretchType(CImageWidget::StretchOnlyDecrease);
    EXPECT_EQ(natural.GetImageRect(), ox::misc::FloatRect(12, 2, 16, 16)) << "small: natural size, centred";
    auto& sized = Get<CImageWidget>("sized");
    sized.SetStretchType(CImageWidget::StretchOnlyDecrease);
    EXPECT_EQ(sized.GetImageRect(), ox::misc::FloatRect(0, 22.5f, 50, 5)) << "large: shrunk in proportion";
    sized.SetStretchType(CImageWidget::StretchNo);
    EXPECT_EQ(sized.GetImageRect(), ox::misc::FloatRect(-25, 20, 100, 10));
    EXPECT_EQ(sized.GetPreferredSize(), FloatVector(100, 10));

    auto bare = oxtest::LoadWindow<ActionWindow>(std::string("<window window_template=\"tips\"/>") + kTemplates);
    EXPECT_EQ(bare->GetSize(), FloatVector(100, 10)) << "a window wants its background image's size";
}

TEST_F(ControlsTest, ToolbarIsDraggedByItsOwnAreaAndItsButtonsStillPress)
{
    Show(R"(<toolbar_widget id="bar" back_image="frame" x="50" y="50" abs_pos="true">
              <button_widget id="tool" button_template="plain" x="4" y="-3" abs_pos="true"/>
            </toolbar_widget>)");
    auto& bar = *window->GetWidget("bar");
    EXPECT_EQ(bar.GetSize(), FloatVector(100, 10));
    Click(58, 52);
    EXPECT_EQ(window->Take(), (Strings {"overed tool", "pressed tool"}));
    EXPECT_EQ(bar.GetOffset(), FloatVector(50, 50)) << "a press on a button doesn't drag";

    Move(130, 55);
    Down(130, 55);
    Move(160, 85);
    Move(170, 95); // past the toolbar: it follows
    Up(170, 95);
    Move(180, 105);
    EXPECT_EQ(bar.GetOffset(), FloatVector(90, 90));
}

TEST_F(ControlsTest, ImageBoxPlacesItsPictureInsideTheFrameAndTellsOfPresses)
{
    Show(R"(<image_box_widget id="fit" imagebox_template="framed" image="frame" width="110" height="110" x="0" y="0"
                              abs_pos="true"/>
            <image_box_widget id="fill" imagebox_template="framed" image="frame" stretch="fill" width="110"
                              height="110" x="200" y="0" abs_pos="true"/>
            <image_box_widget id="odd" image="frame" stretch="sideways" abs_pos="true"/>)");
    auto& fit = Get<CImageBoxWidget>("fit");
    EXPECT_EQ(fit.GetContentRect(), ox::misc::FloatRect(5, 50, 100, 10)) << "fitted inside the insets";
    EXPECT_EQ(Get<CImageBoxWidget>("fill").GetContentRect(), ox::misc::FloatRect(-445, 5, 1000, 100))
        << "filled, and clipped when drawn";
    fit.SetStretch(CImageBoxWidget::StretchNone);
    EXPECT_EQ(fit.GetContentRect(), ox::misc::FloatRect(5, 50, 100, 10));
    EXPECT_TRUE(log.Contains("<image_box_widget id=\"odd\">: stretch is none of no, fit, width, height, fill"));
    Click(20, 20);
    EXPECT_EQ(window->Take(), Strings {"on_mouse_down fit"});
}
