// The widget manager driven as a player drives it: input through the fake platform and the
// application, in window pixels, to the main window in canvas coordinates. Hit tests, the
// broadcast pass, the main window's successor, a letterboxed canvas, capture, double clicks,
// the wheel, key codes and characters, and main windows that take no input.
#include "core/Application.h"
#include "core/TimeManager.h"
#include "gui/Cursor.h"
#include "gui/GuiTestSupport.h"
#include "gui/WidgetManager.h"
#include "support/FakePlatform.h"
#include "support/TestSupport.h"

using namespace ox::gui;
using ox::core::CApplication;
using ox::misc::FloatVector;
using oxtest::FakePlatform;
using oxtest::LoadWindow;
using oxtest::NotingWindow;
using oxtest::ProbeWidget;

namespace {

using Journal = std::vector<std::string>;
Journal Take() { return std::exchange(ProbeWidget::Journal(), {}); }

struct WidgetManagerTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    std::unique_ptr<CApplication> app;
    FakePlatform* platform = nullptr; // owned by the application
    boost::intrusive_ptr<NotingWindow> window;

    void SetUp() override
    {
        while (ox::core::GetTimeManager().GetRoot()->IsPaused())
            ox::core::GetTimeManager().Pause(false);
        dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Gui\"/>");
        app = std::make_unique<CApplication>();
        auto owned = std::make_unique<FakePlatform>();
        platform = owned.get();
        app->SetSystemIntegration(std::move(owned));
        ASSERT_TRUE(app->Init());
        app->GetRenderer()->SetSourceResolution(1024, 768);
        app->ChangeScreenMode(false, true, 1024, 768);
        ProbeWidget::Register();
        Show(R"(<window id="main" width="1024" height="768" moveable="false">
                  <probe_widget id="below" x="100" y="100" width="200" height="200" layer="1" abs_pos="true"/>
                  <probe_widget id="top" x="100" y="100" width="200" height="200" layer="2" abs_pos="true"/>
                  <probe_widget id="watcher" x="600" y="600" width="10" height="10" abs_pos="true"/></window>)");
    }
    void Show(const std::string& xml)
    {
        window = LoadWindow(xml);
        app->SetMainWindow(window);
        app->Update();
        Take();
    }
    CWidget& W(const char* id) { return *window->GetWidget(id, true); }
};

} // namespace

TEST_F(WidgetManagerTest, ClickReachesTheTopmostEnabledWidgetThenTheBroadcastPass)
{
    W("watcher").SetBroadcastMask(BroadcastOnMouseDown);
    oxtest::SendClick(*platform, 150, 120);
    EXPECT_EQ(Take(), (Journal {"down 150,120 0", "down top 50,20", "down watcher -450,-480 b", "up"}));
    EXPECT_TRUE(platform->captures == 1 && !platform->mouseCaptured);

    W("top").AddFlags(FlagDisabled);
    oxtest::SendClick(*platform, 150, 120);
    EXPECT_EQ(Take(), (Journal {"down 150,120 0", "down below 50,20", "down watcher -450,-480 b", "up"}));

    // The masks a pass walks by are kept: one asked for later, deep down or on a widget
    // added later, is seen all the same, and one given up is not.
    boost::intrusive_ptr<ProbeWidget> deep(new ProbeWidget("deep"));
    W("below").AddWidget(deep);
    oxtest::SendClick(*platform, 700, 700);
    deep->SetBroadcastMask(BroadcastOnMouseDown);
    W("watcher").SetBroadcastMask(0);
    Take();
    oxtest::SendClick(*platform, 700, 700);
    EXPECT_EQ(Take(), (Journal {"down 700,700 0", "down deep 600,600 b", "up"}));
    deep->AddWidget(new ProbeWidget("late", LayerTop, BroadcastOnMouseDown));
    oxtest::SendClick(*platform, 700, 700);
    EXPECT_EQ(Take(), (Journal {"down 700,700 0", "down deep 600,600 b", "down late 600,600 b", "up"}));
}

TEST_F(WidgetManagerTest, ANewMainWindowTakesOverAtTheNextUpdate)
{
    auto next = LoadWindow(R"(<window id="next"/>)");
    struct Switcher : ProbeWidget {
        CApplication* app = nullptr;
        BaseWindowPtrT next;
        bool OnMouseDown(const IntVector& p, MouseButtons b, int k, bool broadcast) override
        {
            app->SetMainWindow(next);
            return ProbeWidget::OnMouseDown(p, b, k, broadcast);
        }
    };
    boost::intrusive_ptr<Switcher> switcher(new Switcher());
    switcher->app = app.get();
    switcher->next = next;
    switcher->SetSize(1024, 768);
    window->AddWidget(switcher);
    Take();
    oxtest::SendClick(*platform, 5, 5);
    EXPECT_EQ(app->GetMainWindow(), window.get()) << "the whole click went to the old window";
    EXPECT_EQ(Take(), (Journal {"down 5,5 0", "down  5,5", "up"}));
    app->Update();
    EXPECT_EQ(Take(), (Journal {"close main", "open next"}));
    EXPECT_EQ(app->GetMainWindow(), next.get());
}

TEST_F(WidgetManagerTest, LetterboxedCanvasMapsAndKeepsThePointerOffTheBars)
{
    app->GetRenderer()->SetAvailableResolutions({{1920, 1080, true}});
    app->ChangeScreenMode(true, true, 1920, 1080);
    const CWidgetManager& manager = app->GetWidgetManager();
    ASSERT_EQ(manager.GetActiveRect().X, 240.0f);
    ASSERT_EQ(manager.GetScale(), FloatVector(1.40625f, 1.40625f));

    // Canvas (128, 256) is window pixel (240 + 128 * 1.40625, 256 * 1.40625).
    oxtest::SendClick(*platform, 420, 360);
    EXPECT_EQ(Take(), (Journal {"down 128,256 0", "down top 28,156", "up"}));
    EXPECT_EQ(CCursor::Instance().GetPosition(), FloatVector(128, 256));

    // Over the left bar: the pointer is put back on the canvas's edge and nothing moves.
    oxtest::SendMove(*platform, 100, 300);
    EXPECT_EQ(platform->mouse, ox::misc::IntVector(240, 300));
    EXPECT_EQ(CCursor::Instance().GetPosition(), FloatVector(128, 256));
}

TEST_F(WidgetManagerTest, ButtonsCaptureDoubleClicksAndTheWheel)
{
    using namespace ox::core;
    platform->Dispatch(WM_LBUTTONDOWN, 0, MakeLong(10, 10));
    platform->Dispatch(WM_RBUTTONDOWN, 0, MakeLong(10, 10));
    platform->Dispatch(WM_LBUTTONUP, 0, MakeLong(10, 10));
    EXPECT_TRUE(platform->mouseCaptured) << "one button is still held";
    platform->Dispatch(WM_RBUTTONUP, 0, MakeLong(10, 10));
    EXPECT_FALSE(platform->mouseCaptured);
    EXPECT_EQ(Take(), (Journal {"down 10,10 0", "down 10,10 1", "up", "up"}));

    // Left: down, up, double click, up. Right: the second press is a press. Middle: none.
    oxtest::SendClick(*platform, 10, 10, SDL_BUTTON_LEFT, 2);
    oxtest::SendClick(*platform, 10, 10, SDL_BUTTON_RIGHT, 2);
    oxtest::SendClick(*platform, 10, 10, SDL_BUTTON_MIDDLE, 2);
    EXPECT_EQ(Take(), (Journal {"dbl", "up", "down 10,10 1", "up", "up"}));
    EXPECT_EQ(app->GetWidgetManager().GetPressCount(), 0);

    // Two steps of the wheel at a point given on the screen.
    platform->Dispatch(WM_MOUSEWHEEL, MakeLong(0, 2 * WHEEL_DELTA), MakeLong(110, 60));
    EXPECT_EQ(Take(), (Journal {"wheel 2"}));
}

TEST_F(WidgetManagerTest, KeysAndCharactersArriveAsEngineCodes)
{
    oxtest::SendKey(*platform, SDL_SCANCODE_SPACE);
    oxtest::SendKey(*platform, SDL_SCANCODE_F5);
    oxtest::SendKey(*platform, SDL_SCANCODE_SEMICOLON);
    oxtest::SendKey(*platform, SDL_SCANCODE_C, KMOD_CTRL);
    oxtest::SendText(*platform, "é");
    // Ctrl itself has no code and still arrives; Ctrl+C also types the control character 3.
    EXPECT_EQ(Take(), (Journal {"key 10010 0", "key 10019 0", "key 0 0", "key 0 2", "key 67 2", "char 3", "char 233"}));
    EXPECT_EQ(TranslateKey(ox::core::VK_OEM_2), OX_OEM_2);
    EXPECT_EQ(TranslateKey('7'), '7');
}

TEST_F(WidgetManagerTest, BlockedInputAndDisabledOrDeadMainWindows)
{
    bool playing = true;
    app->GetWidgetManager().SetInputBlocked([&] { return playing; });
    oxtest::SendClick(*platform, 150, 120);
    oxtest::SendKey(*platform, SDL_SCANCODE_A);
    EXPECT_EQ(Take(), Journal {});
    playing = false;

    window->AddFlags(FlagDisabled);
    oxtest::SendClick(*platform, 150, 120);
    app->Update();
    app->GetWidgetManager().Draw(*app->GetRenderer());
    EXPECT_EQ(Take(), Journal {}) << "neither input, nor update, nor drawing";
    window->SetFlags(FlagDead);
    app->Update();
    EXPECT_EQ(app->GetMainWindow(), nullptr);
}

TEST_F(WidgetManagerTest, CursorFollowsTheWidgetUnderThePointer)
{
    struct HandProbe : ProbeWidget {
        bool OnMouseMove(const IntVector&, int, bool broadcast) override
        {
            if (!broadcast)
                CCursor::Instance().SetCursor(CCursor::CursorHand);
            return !broadcast;
        }
    };
    boost::intrusive_ptr<HandProbe> hand(new HandProbe());
    hand->SetOffset(400, 400);
    hand->SetSize(100, 100);
    window->AddWidget(hand);
    CCursor& cursor = CCursor::Instance();

    oxtest::SendMove(*platform, 450, 450);
    EXPECT_EQ(platform->cursorType, static_cast<unsigned>(CCursor::CursorHand));
    oxtest::SendMove(*platform, 10, 10);
    EXPECT_EQ(platform->cursorType, static_cast<unsigned>(CCursor::CursorPointer));
    EXPECT_TRUE(platform->cursorVisible);

    // Hidden, the pointer goes at the next update; custom cursors without their textures
    // leave the platform's pointer.
    cursor.HideCursor(true);
    app->Update();
    EXPECT_FALSE(platform->cursorVisible);
    cursor.HideCursor(false);
    cursor.EnableCustomCursors(true);
    oxtest::SendMove(*platform, 450, 450);
    EXPECT_EQ(cursor.GetCurrentImage(), nullptr);
    EXPECT_TRUE(platform->cursorVisible);
    EXPECT_EQ(platform->cursorType, static_cast<unsigned>(CCursor::CursorHand));
    cursor.EnableCustomCursors(false);
}
