// The value controls driven as a player drives them, through the fake platform and the
// application, in window pixels: scroll bars by their arrows, bar, thumb and wheel, with the
// invariants of their values.
#include "core/Application.h"
#include "gui/ControlTestSupport.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ImageWidget.h"
#include "gui/controls/ScrollWidget.h"
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
