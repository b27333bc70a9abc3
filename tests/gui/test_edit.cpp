// The edit widget driven as a player drives it, through the fake platform and the
// application: typing and the editing keys at the ends of the text, selection by Shift with
// the arrows and by dragging, the clipboard's round trip and what a bad clipboard holds, undo
// and redo, and the caret placed by clicks in a box away from the canvas origin. Every place
// follows from the mono font: characters advance 11 pixels and stand 20 high.
#include "core/Application.h"
#include "core/TimeManager.h"
#include "gui/ControlTestSupport.h"
#include "gui/StateHistory.h"
#include "gui/controls/EditWidget.h"
#include "support/FakePlatform.h"

using namespace ox::gui;
using ox::misc::FloatVector;
using oxtest::FakePlatform;
using Strings = std::vector<std::string>;

namespace {

// A one-line box at (300, 200) and a multi-line one at (300, 400); text starts 4 pixels
// right of a box's edge and 2 below its top, so character i spans x = 304 + 11 i .. +10.
const char* kWindow = R"(
  <window id="main" width="1024" height="768" moveable="false">
    <edit_widget id="name" edit_template="plain" x="300" y="200" width="200" max_chars="8" abs_pos="true"/>
    <edit_widget id="notes" edit_template="plain" multiline="true" x="300" y="400" width="200" height="100"
                 abs_pos="true"/>
  </window>
  <GUITemplates>
    <edit_template id="plain" font="mono" cursor_image="caret"><insets left="4" top="2" right="4" bottom="2"/></edit_template>
  </GUITemplates>)";

struct EditTest : oxtest::ControlFixture {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    std::unique_ptr<ox::core::CApplication> app;
    FakePlatform* platform = nullptr; // owned by the application
    boost::intrusive_ptr<oxtest::ActionWindow> window;
    CEditWidget* name = nullptr;
    CEditWidget* notes = nullptr;

    void SetUp() override
    {
        while (ox::core::GetTimeManager().GetRoot()->IsPaused())
            ox::core::GetTimeManager().Pause(false);
        dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Edit\"/>");
        app = std::make_unique<ox::core::CApplication>();
        auto owned = std::make_unique<FakePlatform>();
        platform = owned.get();
        app->SetSystemIntegration(std::move(owned));
        ASSERT_TRUE(app->Init());
        app->GetRenderer()->SetSourceResolution(1024, 768);
        app->ChangeScreenMode(false, true, 1024, 768);
        // The textures and the font after the application, which has its own look-up.
        ControlFixture::SetUp();
        auto surface = std::make_unique<ox::graphics::CSurface>(2, 20);
        auto texture = std::make_unique<ox::graphics::CTexture>(surface.get());
        textures["caret"] = {std::move(surface), std::move(texture)};
        window = oxtest::LoadWindow<oxtest::ActionWindow>(kWindow);
        app->SetMainWindow(window);
        app->Update();
        name = dynamic_cast<CEditWidget*>(window->GetWidget("name"));
        notes = dynamic_cast<CEditWidget*>(window->GetWidget("notes"));
        ASSERT_TRUE(name && notes);
    }
    void TearDown() override
    {
        app.reset();
        ControlFixture::TearDown();
    }
    void Key(SDL_Scancode key, uint16_t modifiers = KMOD_NONE) { oxtest::SendKey(*platform, key, modifiers); }
    void Type(const std::string& text) { oxtest::SendText(*platform, text); }
    // Clicks in the one-line box on character `index`, in its left or right half.
    void ClickName(int index, bool rightHalf, uint16_t shift = 0)
    {
        platform->modifiers = shift;
        oxtest::SendClick(*platform, 304 + 11 * index + (rightHalf ? 7 : 2), 210);
        platform->modifiers = 0;
    }
    std::string Text(const CEditWidget& edit) const { return oxtest::Narrow(edit.GetText()); }
    std::pair<int, int> Selection(const CEditWidget& edit) const
    {
        return {edit.GetSelectionStart(), edit.GetSelectionEnd()};
    }
};

} // namespace

TEST_F(EditTest, TypingAndTheEditingKeysAtTheEndsOfTheText)
{
    ClickName(0, false);
    EXPECT_EQ(window->Take(), Strings {"got_focus name"});
    EXPECT_FALSE(name->GetCursorWidget()->GetFlags() & FlagHidden);
    Type("abca");
    Type("d");                      // not in the font
    Key(SDL_SCANCODE_C, KMOD_CTRL); // a control character comes along and is refused
    EXPECT_EQ(Text(*name), "abca");
    EXPECT_EQ(window->Take(), Strings(4, "text_changed name"));
    EXPECT_EQ(name->GetCursorPos(), 4);

    Key(SDL_SCANCODE_HOME);
    Key(SDL_SCANCODE_BACKSPACE); // nothing before the caret
    EXPECT_TRUE(window->Take().empty());
    Key(SDL_SCANCODE_DELETE);
    EXPECT_EQ(Text(*name), "bca");
    Key(SDL_SCANCODE_END);
    Key(SDL_SCANCODE_DELETE); // nothing behind it
    Key(SDL_SCANCODE_BACKSPACE);
    EXPECT_EQ(Text(*name), "bc");
    EXPECT_EQ(window->Take(), Strings(2, "text_changed name"));

    // Control with Backspace takes the word before the caret and the blank before it.
    name->SetText(u"ab cab");
    name->MoveCursor(6, true);
    Key(SDL_SCANCODE_BACKSPACE, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "ab");
    // The limit holds against typing; Return gives the focus up and hides the caret.
    Type("abcabcabc");
    EXPECT_EQ(Text(*name), "ababcabc");
    window->Take();
    Key(SDL_SCANCODE_RETURN);
    EXPECT_EQ(window->Take(), Strings {"lost_focus name"});
    EXPECT_TRUE(name->GetCursorWidget()->GetFlags() & FlagHidden);
}

TEST_F(EditTest, SelectionByShiftWithTheArrowsAndByDragging)
{
    ClickName(0, false);
    Type("abcabc");
    Key(SDL_SCANCODE_HOME);
    Key(SDL_SCANCODE_RIGHT, KMOD_SHIFT);
    Key(SDL_SCANCODE_RIGHT, KMOD_SHIFT);
    EXPECT_EQ(Selection(*name), std::make_pair(0, 2));
    Key(SDL_SCANCODE_LEFT, KMOD_SHIFT);
    EXPECT_EQ(Selection(*name), std::make_pair(0, 1));
    Key(SDL_SCANCODE_END);
    EXPECT_EQ(Selection(*name), std::make_pair(6, 6)) << "a move without Shift collapses it";
    Key(SDL_SCANCODE_HOME, KMOD_SHIFT);
    EXPECT_EQ(Selection(*name), std::make_pair(0, 6));
    EXPECT_EQ(name->GetCursorPos(), 0);

    // A drag from the right half of 'a' to the left half of the second 'b', then a typed
    // character in place of what it selected.
    oxtest::SendMove(*platform, 304 + 7, 210);
    oxtest::SendButton(*platform, true);
    oxtest::SendMove(*platform, 304 + 44 + 2, 212);
    oxtest::SendButton(*platform, false);
    EXPECT_EQ(Selection(*name), std::make_pair(1, 4));
    EXPECT_EQ(name->GetCursorPos(), 4);
    Type("c");
    EXPECT_EQ(Text(*name), "acbc");

    // A drag that leaves the box on the left goes on selecting to the start; Shift and a
    // click extend from where the selection stood.
    oxtest::SendMove(*platform, 304 + 33 + 7, 210);
    oxtest::SendButton(*platform, true);
    oxtest::SendMove(*platform, 100, 300);
    oxtest::SendButton(*platform, false);
    EXPECT_EQ(Selection(*name), std::make_pair(0, 4));
    ClickName(1, true, KMOD_LSHIFT);
    EXPECT_EQ(Selection(*name), std::make_pair(2, 4));
}

TEST_F(EditTest, CutAndPasteRoundTripAndUndoAndRedoAcrossAPaste)
{
    ClickName(0, false);
    Type("abc");
    Key(SDL_SCANCODE_A, KMOD_CTRL);
    Key(SDL_SCANCODE_X, KMOD_CTRL);
    EXPECT_EQ(platform->clipboard, "abc");
    EXPECT_EQ(Text(*name), "");
    Type("b");
    Key(SDL_SCANCODE_V, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "babc");
    EXPECT_EQ(name->GetCursorPos(), 4);

    Key(SDL_SCANCODE_Z, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "b");
    Key(SDL_SCANCODE_Z, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "");
    Key(SDL_SCANCODE_Y, KMOD_CTRL);
    Key(SDL_SCANCODE_Y, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "babc");
    EXPECT_FALSE(name->CanRedo());
    Key(SDL_SCANCODE_Z, KMOD_CTRL);
    Type("a");
    EXPECT_EQ(Text(*name), "ab") << "the caret stayed at the start through undo and redo";
    EXPECT_FALSE(name->CanRedo()) << "a new text ends the redo branch";

    // Copy of a selection, and a paste over one.
    Key(SDL_SCANCODE_END);
    Key(SDL_SCANCODE_LEFT, KMOD_SHIFT);
    Key(SDL_SCANCODE_C, KMOD_CTRL);
    EXPECT_EQ(platform->clipboard, "b");
    Key(SDL_SCANCODE_HOME, KMOD_SHIFT);
    Key(SDL_SCANCODE_V, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "b");
}

TEST_F(EditTest, APasteKeepsWhatTheBoxTakesAndLosesNoText)
{
    ClickName(0, false);
    Type("cc");
    Key(SDL_SCANCODE_LEFT);
    // Controls, bytes that are no UTF-8 and characters the font lacks are left out, the line
    // break of a one-line box becomes a blank, and the paste stops at the limit while the
    // text behind the caret stays.
    platform->clipboard = "ab\x01\xff\xfe" "ab\r\nabcabc";
    Key(SDL_SCANCODE_V, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "cabab ac");
    EXPECT_EQ(name->GetCursorPos(), 7);
    Key(SDL_SCANCODE_V, KMOD_CTRL);
    EXPECT_EQ(Text(*name), "cabab ac") << "at the limit a paste does nothing";

    platform->clipboard = "a\r\nb\rc\td";
    oxtest::SendClick(*platform, 310, 410);
    Key(SDL_SCANCODE_V, KMOD_CTRL);
    EXPECT_EQ(notes->GetText(), u"a\nb\nc ");
    platform->clipboardRefuses = true;
    Key(SDL_SCANCODE_V, KMOD_CTRL);
    EXPECT_EQ(notes->GetText(), u"a\nb\nc ");
}

TEST_F(EditTest, TheCaretFollowsClicksAndLinesInABoxAwayFromTheOrigin)
{
    name->SetText(u"abc");
    ClickName(1, true);
    EXPECT_EQ(name->GetCursorWidget()->GetSize(), FloatVector(2, 20));
    EXPECT_EQ(name->GetCursorPos(), 2);
    // Behind 'b' (x 15 .. 25 in the box), the 2-pixel caret centred on its line.
    EXPECT_EQ(name->GetCursorWidget()->GetOffset(), FloatVector(24, 2));
    ClickName(0, false);
    EXPECT_EQ(name->GetCursorPos(), 0);
    oxtest::SendClick(*platform, 480, 203);
    EXPECT_EQ(name->GetCursorPos(), 3) << "right of the text";

    oxtest::SendClick(*platform, 310, 410);
    Type("ab");
    Key(SDL_SCANCODE_RETURN);
    EXPECT_EQ(notes->GetText(), u"ab\n");
    EXPECT_EQ(notes->GetCursorWidget()->GetOffset(), FloatVector(3, 22)) << "the start of the empty last line";
    Type("abc");
    Key(SDL_SCANCODE_UP);
    EXPECT_EQ(notes->GetCursorPos(), 2) << "the end of the shorter line above";
    Key(SDL_SCANCODE_DOWN);
    EXPECT_EQ(notes->GetCursorPos(), 5);
    Key(SDL_SCANCODE_DOWN);
    EXPECT_EQ(notes->GetCursorPos(), 6) << "down on the last line goes to the end";
    oxtest::SendClick(*platform, 450, 410);
    EXPECT_EQ(notes->GetCursorPos(), 2) << "right of a line's end stays before its line break";
    oxtest::SendClick(*platform, 310, 490);
    EXPECT_EQ(notes->GetCursorPos(), 4) << "below the text counts on its last line";
}

TEST(StateHistory, KeepsTheLimitPlusOneAndAnEqualStateAddsNothing)
{
    StateHistory<int> history(CEditWidget::kHistoryLimit);
    history.Push(0);
    EXPECT_FALSE(history.CanUndo()) << "the first state can't be undone to nothing";
    history.Push(0);
    EXPECT_EQ(history.GetCount(), 1u);
    for (int i = 1; i <= 41; ++i)
        history.Push(i);
    EXPECT_EQ(history.GetCount(), 41u) << "the 42nd state dropped the oldest";
    int oldest = -1;
    while (history.CanUndo())
        oldest = history.Undo();
    EXPECT_EQ(oldest, 1);
}
