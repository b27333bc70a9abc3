// The value controls driven as a player drives them, through the fake platform and the
// application, in window pixels: scroll bars by their arrows, bar, thumb and wheel, with the
// invariants of their values; sliders pressed and dragged; lists clicked, wheeled and keyed,
// long ones too; combo boxes opened, chosen from and closed, also at the canvas's edge.
#include "core/Application.h"
#include "gui/ControlTestSupport.h"
#include "gui/GuiBinding.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ComboBoxWidget.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/LabelWidget.h"
#include "gui/controls/ListWidget.h"
#include "gui/controls/ScrollWidget.h"
#include "gui/controls/SliderWidget.h"
#include "lua/Lua.h"
#include "lua/LuaBinding.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"
#include "support/FakePlatform.h"

using namespace ox::gui;
using ox::misc::FloatVector;
using Strings = std::vector<std::string>;

namespace {

const char* kTemplates = R"(
  <GUITemplates>
    <scroll_template id="v" vertical="true" thumb_image="strip" back_image="box" top_image="strip"
                     bottom_image="strip" sound_on_drag_and_drop="drag" sound_on_button_press="step"
                     sound_on_set_value="page"/>
    <scroll_template id="h" vertical="false" thumb_image="strip" back_image="frame" top_image="strip"
                     bottom_image="strip"/>
    <slider_template id="s" slider_image="frame" thumb_image="box" sound="slide">
      <insets left="5" top="0" right="5" bottom="0"/>
    </slider_template>
    <list_template id="l" font="mono" scroll_template="v" background="frame" sound_on_select="pick"
                   color_text_normal="#255 255 255 255" color_text_selected="#255 255 255 0"
                   color_text_over="#255 0 255 255" color_selection="#255 0 0 128"/>
    <list_template id="bare" background="frame"/>
    <button_template id="arrow" image="strip"/>
    <label_template id="text" font="mono"/>
    <combobox_template id="c" button_template="arrow" label_template="text" list_template="l" back_image="frame"
                       sound_on_open="open" sound_on_select="pick"/>
  </GUITemplates>)";

struct ListsTest : oxtest::ControlFixture {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    std::unique_ptr<ox::core::CApplication> app;
    oxtest::FakePlatform* platform = nullptr; // owned by the application
    boost::intrusive_ptr<oxtest::ActionWindow> window;
    std::unique_ptr<oxtest::LogCapture> appLog; // the application takes the log over from the fixture's

    void SetUp() override
    {
        while (ox::core::GetTimeManager().GetRoot()->IsPaused())
            ox::core::GetTimeManager().Pause(false);
        dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Lists\"/>");
        app = std::make_unique<ox::core::CApplication>();
        auto owned = std::make_unique<oxtest::FakePlatform>();
        platform = owned.get();
        app->SetSystemIntegration(std::move(owned));
        ASSERT_TRUE(app->Init());
        app->GetRenderer()->SetSourceResolution(1024, 768);
        app->ChangeScreenMode(false, true, 1024, 768);
        appLog = std::make_unique<oxtest::LogCapture>();
        // The application's services first, the fixture's textures, font and sounds over them.
        ControlFixture::SetUp();
        GetGuiServices().isSound = [](const std::string&) { return true; };
    }
    void TearDown() override
    {
        if (window)
            window->RemoveAllWidgets();
        ControlFixture::TearDown();
        appLog.reset();
        app.reset();
    }
    void Show(const std::string& content, const std::string& templates = kTemplates)
    {
        window = oxtest::LoadWindow<oxtest::ActionWindow>(
            R"(<window id="main" width="1024" height="768" moveable="false">)" + content + "</window>" + templates);
        app->SetMainWindow(window);
        app->Update();
    }
    template <class W>
    W& Get(const char* id)
    {
        auto* widget = dynamic_cast<W*>(window->GetWidget(id, true));
        EXPECT_NE(widget, nullptr) << id;
        return *widget;
    }
    // The actions of one sender, in order.
    Strings Told(const std::string& id)
    {
        Strings told;
        for (const std::string& action : window->Take())
            if (action.size() > id.size() && action.compare(action.size() - id.size() - 1, std::string::npos, " " + id) == 0)
                told.push_back(action.substr(0, action.size() - id.size() - 1));
        return told;
    }

    // Input in window pixels beside the platform's own helpers: a press, a release and the
    // wheel where the pointer stands.
    void Button(int x, int y, bool down)
    {
        oxtest::SendMove(*platform, x, y);
        if (down)
            platform->mouseButtons |= SDL_BUTTON(SDL_BUTTON_LEFT);
        else
            platform->mouseButtons &= ~SDL_BUTTON(SDL_BUTTON_LEFT);
        SDL_Event event {};
        event.type = down ? SDL_MOUSEBUTTONDOWN : SDL_MOUSEBUTTONUP;
        event.button.button = SDL_BUTTON_LEFT;
        event.button.state = down ? SDL_PRESSED : SDL_RELEASED;
        event.button.clicks = 1;
        event.button.x = x;
        event.button.y = y;
        platform->Deliver(event);
    }
    void Press(int x, int y) { Button(x, y, true); }
    void Release(int x, int y) { Button(x, y, false); }
    void Wheel(int steps)
    {
        SDL_Event event {};
        event.type = SDL_MOUSEWHEEL;
        event.wheel.y = steps;
        platform->Deliver(event);
    }
};

} // namespace

// Scroll bars ---------------------------------------------------------------------------------

TEST_F(ListsTest, ScrollValuesKeepTheirRangeAndTheThumbFollows)
{
    Show(R"(<scroll_widget id="sc" scroll_template="v" x="100" y="100" height="200" abs_pos="true"/>)");
    auto& scroll = Get<CScrollWidget>("sc");
    // Three 16-pixel buttons and a 16-pixel bar: 16 wide, the bar between the arrows.
    EXPECT_EQ(scroll.GetPreferredSize(), FloatVector(16, 48));
    EXPECT_EQ(scroll.GetSize(), FloatVector(16, 200));
    EXPECT_EQ(scroll.GetBar()->GetOffset(), FloatVector(0, 16));
    EXPECT_EQ(scroll.GetBar()->GetSize(), FloatVector(16, 168));
    EXPECT_EQ(scroll.GetBottomButton()->GetOffset(), FloatVector(0, 184));
    EXPECT_EQ(scroll.GetBar()->GetImage().GetFlags(), 3);
    window->Take();

    scroll.SetMaxValue(0);
    EXPECT_EQ(scroll.GetMaxValue(), 1.0f);
    scroll.SetValue(5);
    EXPECT_EQ(scroll.GetValue(), 0.0f) << "max 1 and page 1 leave no room";
    EXPECT_EQ(Told("sc"), Strings {"value_changed"}) << "told even when unchanged";

    scroll.SetMaxValue(10);
    scroll.SetPageSize(4);
    scroll.SetValue(3);
    EXPECT_EQ(scroll.GetThumb()->GetSize(), FloatVector(16, 68)) << "168 * 4 / 10 rounded up";
    EXPECT_FLOAT_EQ(scroll.GetThumb()->GetOffset().Y, 16 + 168 * 0.3f);
    // Twice the whole, twice the value: the thumb keeps its place and halves its length.
    scroll.SetMaxValue(20);
    EXPECT_EQ(scroll.GetValue(), 6.0f);
    EXPECT_FLOAT_EQ(scroll.GetThumb()->GetOffset().Y, 16 + 168 * 0.3f);
    EXPECT_EQ(scroll.GetThumb()->GetSize().Y, 34.0f);
    scroll.SetValue(100);
    EXPECT_EQ(scroll.GetValue(), 16.0f);
    scroll.SetValue(-3);
    EXPECT_EQ(scroll.GetValue(), 0.0f);
    // The page stays within 1 .. max, also when the max shrinks below it.
    scroll.SetPageSize(50);
    EXPECT_EQ(scroll.GetPageSize(), 20.0f);
    scroll.SetPageSize(0.25f);
    EXPECT_EQ(scroll.GetPageSize(), 1.0f);
    scroll.SetPageSize(8);
    scroll.SetValue(12);
    scroll.SetMaxValue(5);
    EXPECT_EQ(scroll.GetPageSize(), 5.0f);
    EXPECT_EQ(scroll.GetValue(), 0.0f) << "brought back into its range";
    EXPECT_EQ(scroll.GetThumb()->GetSize().Y, 168.0f);
}

TEST_F(ListsTest, ScrollReadsItsElementInOrderAndItsOrientationFromTheTemplate)
{
    Show(R"(<scroll_widget id="sc" scroll_template="v" max_value="30" page_size="10" value="25" mouse_wheel_k="3"
                           x="100" y="100" height="200" abs_pos="true"/>
            <scroll_widget id="hz" scroll_template="h" x="300" y="100" width="300" abs_pos="true"/>
            <scroll_widget id="none" scroll_template="missing" x="0" y="0" abs_pos="true"/>)");
    auto& scroll = Get<CScrollWidget>("sc");
    EXPECT_EQ(scroll.GetMaxValue(), 30.0f);
    EXPECT_EQ(scroll.GetPageSize(), 10.0f);
    EXPECT_EQ(scroll.GetValue(), 20.0f) << "the value clamped by the page read before it";
    EXPECT_EQ(scroll.GetMouseWheelK(), 3.0f);

    // Horizontal: arrows at the left and right ends, the bar's height across.
    auto& across = Get<CScrollWidget>("hz");
    EXPECT_FALSE(across.IsVertical());
    EXPECT_EQ(across.GetPreferredSize(), FloatVector(100 + 32, 16));
    EXPECT_EQ(across.GetSize(), FloatVector(300, 16));
    EXPECT_EQ(across.GetBottomButton()->GetOffset(), FloatVector(284, 0));
    EXPECT_EQ(across.GetBar()->GetSize(), FloatVector(268, 16));
    across.SetSize(200, 50);
    EXPECT_EQ(across.GetSize(), FloatVector(200, 16)) << "a horizontal scroll keeps its height";

    EXPECT_TRUE(appLog->Contains("scroll_template \"missing\""));
    EXPECT_EQ(Get<CScrollWidget>("none").GetSize(), FloatVector(0, 0));
}

TEST_F(ListsTest, ScrollArrowsStepOnReleaseAndTheBarPagesTowardsThePress)
{
    Show(R"(<scroll_widget id="sc" scroll_template="v" max_value="10" page_size="2"
                           x="100" y="100" height="200" abs_pos="true"/>)");
    auto& scroll = Get<CScrollWidget>("sc");
    window->Take();
    TakeSounds();
    // The bottom arrow: pressed, nothing yet; released inside, one step.
    Press(108, 290);
    EXPECT_EQ(scroll.GetValue(), 0.0f);
    Release(108, 290);
    EXPECT_EQ(scroll.GetValue(), 1.0f);
    EXPECT_EQ(TakeSounds(), Strings {"step"});
    EXPECT_EQ(Told("sc"), Strings {"value_changed"});
    // Released off the arrow: no step.
    Press(108, 290);
    Release(400, 400);
    EXPECT_EQ(scroll.GetValue(), 1.0f);
    oxtest::SendClick(*platform, 108, 105);
    EXPECT_EQ(scroll.GetValue(), 0.0f);
    EXPECT_EQ(Told("sc"), Strings {"value_changed"});
    TakeSounds();

    // The bar below the thumb pages down, above it up.
    oxtest::SendClick(*platform, 108, 250);
    EXPECT_EQ(scroll.GetValue(), 2.0f);
    oxtest::SendClick(*platform, 108, 250);
    EXPECT_EQ(scroll.GetValue(), 4.0f);
    oxtest::SendClick(*platform, 108, 120);
    EXPECT_EQ(scroll.GetValue(), 2.0f);
    EXPECT_EQ(TakeSounds(), (Strings {"page", "page", "page"}));
    EXPECT_EQ(Told("sc"), (Strings {"value_changed", "value_changed", "value_changed"}));

    // Disabled, it takes nothing.
    scroll.AddFlags(FlagDisabled);
    oxtest::SendClick(*platform, 108, 250);
    EXPECT_EQ(scroll.GetValue(), 2.0f);
}

TEST_F(ListsTest, ScrollThumbDragsByWhereItWasTakenAndTheWheelMovesTheValue)
{
    Show(R"(<scroll_widget id="sc" scroll_template="v" max_value="10" page_size="2" mouse_wheel_k="0.5"
                           x="100" y="100" height="200" abs_pos="true"/>)");
    auto& scroll = Get<CScrollWidget>("sc");
    // The thumb: 168 * 0.2 rounded up = 34 long, at 116 .. 150 in the window; 134 free pixels.
    ASSERT_EQ(scroll.GetThumb()->GetSize().Y, 34.0f);
    TakeSounds();
    window->Take();
    Press(108, 126); // 10 pixels into the thumb
    EXPECT_EQ(TakeSounds(), Strings {"drag"});
    oxtest::SendMove(*platform, 108, 126 + 67);
    EXPECT_FLOAT_EQ(scroll.GetValue(), 4.0f) << "half the free length, half of max - page";
    EXPECT_EQ(Told("sc"), Strings {"value_changed"}) << "once, though the move reached it twice";
    oxtest::SendMove(*platform, 300, 700); // far off the bar: clamped, still dragged
    EXPECT_FLOAT_EQ(scroll.GetValue(), 8.0f);
    oxtest::SendMove(*platform, 108, 10);
    EXPECT_FLOAT_EQ(scroll.GetValue(), 0.0f);
    oxtest::SendMove(*platform, 108, 126 + 134);
    EXPECT_FLOAT_EQ(scroll.GetValue(), 8.0f);
    EXPECT_FLOAT_EQ(scroll.GetThumb()->GetOffset().Y, 16 + 168 * 0.8f);
    Release(108, scroll.GetThumb()->GetOffset().Y + 110);
    EXPECT_EQ(TakeSounds(), Strings {"drag"});
    oxtest::SendMove(*platform, 108, 150);
    EXPECT_FLOAT_EQ(scroll.GetValue(), 8.0f) << "released: moves do nothing";

    // The wheel: a step up lowers the value by the wheel factor.
    oxtest::SendMove(*platform, 108, 200);
    Wheel(1);
    EXPECT_FLOAT_EQ(scroll.GetValue(), 7.5f);
    Wheel(-4);
    EXPECT_FLOAT_EQ(scroll.GetValue(), 8.0f);

    // A thumb that fills its bar doesn't drag.
    scroll.SetPageSize(10);
    window->Take();
    Press(108, 150);
    oxtest::SendMove(*platform, 108, 200);
    Release(108, 200);
    EXPECT_EQ(scroll.GetValue(), 0.0f);
    EXPECT_EQ(Told("sc"), Strings {});
}

// Sliders ---------------------------------------------------------------------------------------

TEST_F(ListsTest, SliderJumpsToAPressFollowsADragClampedAndTellsOnlyWhenAsked)
{
    // A 100 x 10 bar, a 16 x 16 thumb, insets of 5: the thumb's left edge runs 5 .. 179.
    Show(R"(<slider_widget id="sl" slider_template="s" value="0.25" x="100" y="100" width="200" abs_pos="true"/>)");
    auto& slider = Get<CSliderWidget>("sl");
    EXPECT_EQ(slider.GetPreferredSize(), FloatVector(100, 16));
    EXPECT_EQ(slider.GetSize(), FloatVector(200, 16));
    EXPECT_EQ(slider.GetBar()->GetOffset(), FloatVector(0, 3));
    EXPECT_EQ(slider.GetThumb()->GetOffset(), FloatVector(5 + 174 * 0.25f, 0));
    EXPECT_EQ(Told("sl"), Strings {}) << "the element's value isn't told";
    TakeSounds();

    // A press on the bar: the thumb's middle goes to the pointer.
    oxtest::SendClick(*platform, 100 + 5 + 8 + 87, 104);
    EXPECT_FLOAT_EQ(slider.GetValue(), 0.5f);
    EXPECT_EQ(Told("sl"), Strings {"value_changed"});
    EXPECT_EQ(TakeSounds(), (Strings {"slide"}));
    // Taken by the thumb and dragged beyond both ends: clamped, and told once a change.
    Press(100 + 5 + 87 + 3, 108);
    oxtest::SendMove(*platform, 600, 300);
    EXPECT_FLOAT_EQ(slider.GetValue(), 1.0f);
    oxtest::SendMove(*platform, 700, 300);
    oxtest::SendMove(*platform, 20, 300);
    EXPECT_FLOAT_EQ(slider.GetValue(), 0.0f);
    Release(100 + 13 + 87, 108);
    EXPECT_FLOAT_EQ(slider.GetValue(), 0.5f);
    EXPECT_FALSE(slider.IsDragging());
    EXPECT_EQ(Told("sl"), (Strings {"value_changed", "value_changed", "value_changed"}));
    EXPECT_EQ(TakeSounds(), (Strings {"slide", "slide"}));
    oxtest::SendMove(*platform, 150, 108);
    EXPECT_FLOAT_EQ(slider.GetValue(), 0.5f) << "released: no more following";

    slider.SetValue(3, false);
    EXPECT_EQ(slider.GetValue(), 1.0f);
    EXPECT_EQ(Told("sl"), Strings {});
    slider.SetValue(0.5f, true);
    EXPECT_EQ(Told("sl"), Strings {"value_changed"}) << "told though unchanged";
    // Only the width is taken.
    slider.SetSize(300, 80);
    EXPECT_EQ(slider.GetSize(), FloatVector(300, 16));
    EXPECT_FLOAT_EQ(slider.GetThumb()->GetOffset().X, 5 + 274 * 0.5f);

    // A thumb image on its own tells its parent it was taken.
    WidgetPtrT thumb(new CThumbWidget());
    thumb->SetId("th");
    thumb->SetOffset(600, 600);
    thumb->SetSize(10, 10);
    window->AddWidget(thumb);
    oxtest::SendClick(*platform, 605, 605);
    EXPECT_EQ(Told("th"), Strings {"selected"});
}

// Lists -----------------------------------------------------------------------------------------

TEST_F(ListsTest, ListShowsItsScrollBarWhenTheLinesFillItAndSelectsItsFirstLine)
{
    Show(R"(<list_widget id="full" list_template="l" x="0" y="0" width="200" height="100" abs_pos="true">
              <strings><string text="a"/><string text="b"/><string text="c"/><string text="ab"/><string text="ba"/></strings>
            </list_widget>
            <list_widget id="short" list_template="l" x="300" y="0" width="200" height="100" abs_pos="true" selected="2">
              <strings><string text="a"/><string text="b"/><string text="c"/><string text="ab"/></strings>
            </list_widget>
            <list_widget id="tall" list_template="l" list_height="0" x="600" y="0" abs_pos="true"/>
            <list_widget id="bare" list_template="bare" x="800" y="0" width="50" height="50" abs_pos="true"/>)");
    const Strings told = window->Take();
    EXPECT_EQ(std::count(told.begin(), told.end(), "line_selected full"), 1);
    EXPECT_EQ(std::count(told.begin(), told.end(), "line_selected short"), 1);
    auto& full = Get<CListWidget>("full");
    auto& few = Get<CListWidget>("short");
    EXPECT_EQ(full.GetSelectedLine(), 0);
    EXPECT_EQ(few.GetSelectedLine(), 2);
    // Five lines of 20 in 100 pixels fill it exactly: the bar shows, a page of 5.
    ASSERT_NE(full.GetScroll(), nullptr);
    EXPECT_EQ(full.GetScroll()->GetFlags() & (FlagHidden | FlagDisabled), 0u);
    EXPECT_EQ(full.GetScroll()->GetMaxValue(), 5.0f);
    EXPECT_EQ(full.GetScroll()->GetPageSize(), 5.0f);
    EXPECT_EQ(full.GetBackground()->GetSize().X, 200 - full.GetScrollWidth());
    EXPECT_EQ(full.GetScrollWidth(), 16.0f);
    EXPECT_EQ(few.GetScroll()->GetFlags() & (FlagHidden | FlagDisabled), FlagHidden | FlagDisabled);
    EXPECT_EQ(few.GetBackground()->GetSize().X, 200.0f);
    EXPECT_EQ(few.GetScrollValue(), 0) << "no value while the bar is off";
    // list_height 0 asks for 5 lines: 100 high, as wide as the background image.
    EXPECT_EQ(Get<CListWidget>("tall").GetSize(), FloatVector(100, 100));
    // Without a font no line can be added, and the description is blamed.
    auto& bare = Get<CListWidget>("bare");
    bare.AddLine(u"ab");
    EXPECT_EQ(bare.EnumLines(), 0);
    EXPECT_TRUE(appLog->Contains("a list without a font"));

    // Lines: out of range ignored, the first of two equal ones found, hover over selected.
    few.AddLine(u"ab");
    EXPECT_EQ(few.FindLine(u"ab"), 3);
    EXPECT_EQ(few.FindLine(u"zz"), -1);
    few.SetLine(9, u"x");
    EXPECT_EQ(few.GetLine(9), u"");
    few.SelectLine(5, true);
    EXPECT_EQ(few.GetSelectedLine(), 2);
    oxtest::SendMove(*platform, 310, 45); // line 2
    EXPECT_EQ(few.GetOverLine(), 2);
    EXPECT_EQ(few.GetLineLabel(2)->GetColor(), few.GetListColor(CListWidget::ListColorTextOver));
    EXPECT_EQ(few.GetLineLabel(1)->GetColor(), few.GetListColor(CListWidget::ListColorTextNormal));
    oxtest::SendMove(*platform, 310, 5);
    EXPECT_EQ(few.GetLineLabel(2)->GetColor(), few.GetListColor(CListWidget::ListColorTextSelected));
    EXPECT_EQ(few.GetLineLabel(0)->GetColor(), few.GetListColor(CListWidget::ListColorTextOver));
    window->Take();

    // A line above the selected one goes: the same text stays selected, and it is told.
    few.RemoveLine(0);
    EXPECT_EQ(few.GetSelectedLine(), 1);
    EXPECT_EQ(few.GetLine(1), u"c");
    EXPECT_EQ(Told("short"), Strings {"line_selected"});
    few.RemoveLine(1);
    EXPECT_EQ(few.GetSelectedLine(), -1);
    few.ClearLines();
    EXPECT_EQ(few.EnumLines(), 0);
}

TEST_F(ListsTest, ListSelectsByClickAndKeysAndScrollsByTheWheel)
{
    std::string strings;
    for (char c : std::string("abcabcabca"))
        strings += std::string("<string text=\"") + c + "\"/>";
    Show(R"(<list_widget id="lst" list_template="l" x="100" y="100" width="200" height="100" abs_pos="true"
                         selected="-1"><strings>)" + strings + "</strings></list_widget>");
    auto& list = Get<CListWidget>("lst");
    ASSERT_EQ(list.EnumLines(), 10);
    EXPECT_EQ(list.GetSelectedLine(), -1);
    window->Take();
    TakeSounds();

    oxtest::SendClick(*platform, 150, 165); // the fourth line
    EXPECT_EQ(list.GetSelectedLine(), 3);
    EXPECT_EQ(Told("lst"), Strings {"line_selected"});
    EXPECT_EQ(TakeSounds(), Strings {"pick"});
    // Over the scroll bar it isn't a line.
    oxtest::SendClick(*platform, 290, 130);
    EXPECT_EQ(list.GetSelectedLine(), 3);

    // The wheel scrolls by lines; a click then picks by what shows.
    oxtest::SendMove(*platform, 150, 150);
    Wheel(-2);
    EXPECT_EQ(list.GetScrollValue(), 2);
    EXPECT_EQ(list.GetScrollOffset(), 40.0f);
    oxtest::SendClick(*platform, 150, 105);
    EXPECT_EQ(list.GetSelectedLine(), 2);
    Wheel(-20);
    EXPECT_EQ(list.GetScrollValue(), 5) << "10 lines, 5 a page";

    // Keys go to the list the click focused; the selection stays in view.
    window->Take();
    oxtest::SendKey(*platform, SDL_SCANCODE_DOWN);
    EXPECT_EQ(list.GetSelectedLine(), 3);
    EXPECT_EQ(list.GetScrollValue(), 3) << "scrolled back to show it";
    oxtest::SendKey(*platform, SDL_SCANCODE_END);
    EXPECT_EQ(list.GetSelectedLine(), 9);
    EXPECT_EQ(list.GetScrollValue(), 5);
    oxtest::SendKey(*platform, SDL_SCANCODE_PAGEUP);
    EXPECT_EQ(list.GetSelectedLine(), 4);
    oxtest::SendKey(*platform, SDL_SCANCODE_HOME);
    EXPECT_EQ(list.GetSelectedLine(), 0);
    EXPECT_EQ(list.GetScrollValue(), 0);
    oxtest::SendKey(*platform, SDL_SCANCODE_UP);
    EXPECT_EQ(list.GetSelectedLine(), 0);
    EXPECT_EQ(Told("lst"), (Strings {"line_selected", "line_selected", "line_selected", "line_selected"}));
}

TEST_F(ListsTest, ListOfThousandsOfLinesKeepsItsViewAndDrawsOnlyWhatShows)
{
    Show(R"(<list_widget id="lst" list_template="l" x="0" y="0" width="200" height="100" abs_pos="true"/>)");
    auto& list = Get<CListWidget>("lst");
    for (int i = 0; i < 5000; ++i)
        list.AddLine(i % 2 ? u"ab" : u"ba");
    EXPECT_EQ(list.GetScroll()->GetMaxValue(), 5000.0f);
    list.SelectLine(0, false);
    oxtest::SendClick(*platform, 50, 10);
    oxtest::SendKey(*platform, SDL_SCANCODE_END);
    EXPECT_EQ(list.GetSelectedLine(), 4999);
    EXPECT_EQ(list.GetScrollValue(), 4995);
    EXPECT_EQ(list.GetLineLabel(4999)->GetOffset(), FloatVector(0, 80));
    // Removing lines from the end brings the value back into range and the lines with it.
    for (int i = 0; i < 4990; ++i)
        list.RemoveLine(list.EnumLines() - 1);
    EXPECT_EQ(list.GetScrollValue(), 5);
    EXPECT_EQ(list.GetLineLabel(9)->GetOffset(), FloatVector(0, 80));

    // Drawn: the background, the scroll bar and the five lines that show, not ten.
    list.SetScrollValue(0);
    Draws();
    list.Draw(*renderer);
    size_t texts = 0;
    const ox::graphics::CDeviceTexture* glyphs = textures["glyphs"].first->PeekD3DTexture();
    for (const auto& draw : Draws())
        texts += glyphs && draw.texture == glyphs ? draw.vertices.size() / 6 : 0;
    EXPECT_EQ(texts, 5u * 2) << "two glyphs a line";
}

// Combo boxes -------------------------------------------------------------------------------------

TEST_F(ListsTest, ComboBoxOpensByItsButtonAndAPickedLineBecomesItsText)
{
    Show(R"(<combobox_widget id="cb" combobox_template="c" x="100" y="100" width="150" abs_pos="true" selected="1">
              <strings><string text="a"/><string text="b"/><string text="c"/></strings>
            </combobox_widget>
            <slider_widget id="under" slider_template="s" x="100" y="160" width="150" abs_pos="true"/>)");
    auto& combo = Get<CComboBoxWidget>("cb");
    EXPECT_EQ(combo.GetText(), u"b");
    EXPECT_EQ(combo.GetSize(), FloatVector(150, 20)) << "as high as the label's text";
    EXPECT_FALSE(combo.IsListShown());
    window->Take();
    TakeSounds();

    oxtest::SendClick(*platform, 240, 108); // the button at the right end
    EXPECT_TRUE(combo.IsListShown());
    EXPECT_EQ(Told("cb"), Strings {"list_showed"});
    EXPECT_EQ(TakeSounds(), Strings {"open"});
    // Five lines of 20 below the box, in the widget's own area.
    EXPECT_EQ(combo.GetSize(), FloatVector(150, 120));
    EXPECT_EQ(combo.GetList()->GetOffset(), FloatVector(0, 20));

    oxtest::SendClick(*platform, 150, 120 + 50); // the third line, over the slider after the box
    EXPECT_FALSE(combo.IsListShown());
    EXPECT_EQ(combo.GetText(), u"c");
    EXPECT_EQ(combo.GetSelectedLine(), 2);
    EXPECT_EQ(Told("cb"), Strings {"line_selected"});
    EXPECT_EQ(TakeSounds(), (Strings {"pick", "pick"}));
    EXPECT_EQ(combo.GetSize(), FloatVector(150, 20));
    EXPECT_EQ(Get<CSliderWidget>("under").GetValue(), 0.0f);

    // Open, then a press elsewhere closes it without choosing.
    oxtest::SendClick(*platform, 240, 108);
    oxtest::SendClick(*platform, 600, 600);
    EXPECT_FALSE(combo.IsListShown());
    EXPECT_EQ(combo.GetText(), u"c");
    // The button closes it too.
    oxtest::SendClick(*platform, 240, 108);
    oxtest::SendClick(*platform, 240, 108);
    EXPECT_FALSE(combo.IsListShown());
    window->Take();

    // Chosen by a script without telling: closed, the text follows, nobody hears.
    oxtest::SendClick(*platform, 240, 108);
    combo.SelectLine(0, false);
    EXPECT_FALSE(combo.IsListShown());
    EXPECT_EQ(combo.GetText(), u"a");
    EXPECT_EQ(Told("cb"), Strings {"list_showed"});
    combo.ClearLines();
    EXPECT_EQ(combo.GetText(), u"");
    EXPECT_EQ(Told("cb"), Strings {"line_selected"});
}

TEST_F(ListsTest, ComboBoxNearTheCanvasEdgeOpensWhereTheListStaysOnTheCanvas)
{
    Show(R"(<combobox_widget id="low" combobox_template="c" x="100" y="740" width="150" abs_pos="true">
              <strings><string text="a"/><string text="b"/><string text="c"/></strings>
            </combobox_widget>
            <combobox_widget id="long" combobox_template="c" list_height="30" x="400" y="300" width="150"
                             abs_pos="true"><strings><string text="a"/><string text="b"/></strings>
            </combobox_widget>)");
    auto& low = Get<CComboBoxWidget>("low");
    oxtest::SendClick(*platform, 240, 748);
    ASSERT_TRUE(low.IsListShown());
    // Upwards: the widget rises by the list's height, the box stays where it was.
    EXPECT_EQ(low.GetOffset(), FloatVector(100, 640));
    EXPECT_EQ(low.GetList()->GetOffset(), FloatVector(0, 0));
    EXPECT_EQ(low.GetButton()->GetOffset().Y, 102.0f);
    oxtest::SendClick(*platform, 150, 650); // the first line
    EXPECT_EQ(low.GetText(), u"a");
    EXPECT_FALSE(low.IsListShown());
    EXPECT_EQ(low.GetOffset(), FloatVector(100, 740));
    EXPECT_EQ(low.GetSize(), FloatVector(150, 20));

    // Thirty lines fit neither above nor below: cut to the 22 whole lines of the larger room,
    // the 448 pixels below the box.
    auto& tall = Get<CComboBoxWidget>("long");
    tall.ShowList(true);
    EXPECT_EQ(tall.GetOffset(), FloatVector(400, 300));
    EXPECT_EQ(tall.GetList()->GetSize(), FloatVector(150, 440));
    EXPECT_LE(tall.GetAbsPos(true).Y + tall.GetSize().Y, 768.0f);
}

// Scripts ---------------------------------------------------------------------------------------

TEST_F(ListsTest, ScriptsFillAndReadTheValueControls)
{
    oxtest::MessageCapture boxes;
    Show(R"(<list_widget id="lst" list_template="l" x="0" y="0" width="200" height="100" abs_pos="true"/>
            <combobox_widget id="cb" combobox_template="c" x="300" y="0" width="150" abs_pos="true"/>
            <slider_widget id="sl" slider_template="s" x="0" y="200" width="200" abs_pos="true"/>
            <scroll_widget id="sc" scroll_template="v" x="500" y="0" height="200" abs_pos="true"/>)");
    ox::lua::CLua lua {"lists_test", false};
    lua.BeginBinding();
    lua.Bind(mluabind::BindStdStrings());
    mluabind::Namespace test("test");
    test.AddConstant(mluabind::Constant("window", static_cast<CBaseWidget*>(window.get())));
    lua.Bind(mluabind::Namespace("ox").Merge(ox::lua::BindLuaClasses()).Merge(BindGui()).Merge(test));
    lua.EndBinding();
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), R"(
        local gui, window = ox.gui, ox.test.window
        local list = gui.CListWidget.Cast(window.GetWidget("lst", true))
        list.AddLine("ab") list.AddLine("ba") list.AddLine("ab")
        list.SelectLine(list.FindLine("ba"), true)
        local combo = gui.CComboBoxWidget.Cast(window.GetWidget("cb", true))
        combo.AddLine("c") combo.AddLine("cab")
        combo.SelectLine(1, false)
        gui.CSliderWidget.Cast(window.GetWidget("sl", true)).SetValue(0.5, true)
        local scroll = gui.CScrollWidget.Cast(window.GetWidget("sc", true))
        scroll.SetMaxValue(10) scroll.SetPageSize(4) scroll.SetValue(9)
        return table.concat({ list.EnumLines(), list.GetSelectedLine(), combo.GetText().c_str(),
                              tostring(gui.CListWidget.Cast(window.GetWidget("sl", true))), scroll.GetValue(),
                              gui.CListWidget.ListColorSelection }, ";"))"),
              "3;1;cab;nil;6;3");
    EXPECT_EQ(Get<CComboBoxWidget>("cb").GetText(), u"cab");
    EXPECT_EQ(Get<CListWidget>("lst").GetLine(1), u"ba");
    EXPECT_EQ(Told("lst"), Strings {"line_selected"});
    for (const auto& box : boxes.Boxes())
        ADD_FAILURE() << box.caption << ": " << box.text;
}
