// The font viewer of game makers on the demo's fonts, headless: the combo box lists the
// declared fonts, the label shows the typed text in the chosen one, a font file saved again
// rebuilds the label, and Escape closes the window.
#include "DemoChild.h"
#include "DemoGame.h"
#include "core/FontManager.h"
#include "game/FontViewerWindow.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ComboBoxWidget.h"
#include "gui/controls/EditWidget.h"
#include "gui/controls/LabelWidget.h"
#include "lua/Lua.h"
#include "misc/Unicode.h"

#include <chrono>
#include <fstream>
#include <thread>

using namespace ox;

namespace {

std::string g_Out;

int ViewFonts()
{
    oxtest::DemoGame game;
    if (const int failed = game.Start())
        return failed;
    k17::CApp& app = game.app;
    auto frame = [&game] { game.Frame(); };
    game.Until("main_menu");
    // Opened as the demo's F11 does, by its script.
    lua::CallLuaFunction<void>(lua::CLua::GetLua("main"), "DevTools.OpenFontViewer");
    boost::intrusive_ptr<k17::CFontViewerWindow> viewer(
        dynamic_cast<k17::CFontViewerWindow*>(app.GetTopWindow()));
    if (!viewer)
        return 13;
    frame();
    auto* fonts = dynamic_cast<gui::CComboBoxWidget*>(viewer->GetWidget("combobox_fonts", true));
    auto* edit = dynamic_cast<gui::CEditWidget*>(viewer->GetWidget("edit_text", true));
    auto label = [&] { return dynamic_cast<gui::CLabelWidget*>(viewer->GetWidget("label_text", true)); };
    if (!fonts || !edit || !label())
        return 12;
    auto font = [&](const char* id) { return label()->GetFont() == core::CFontManager::Instance().GetItem(id); };
    std::ofstream out(g_Out);
    out << viewer->GetFontCount() << " " << misc::WideToUtf8(fonts->GetLine(0)) << " "
        << misc::WideToUtf8(fonts->GetLine(1)) << "|" << misc::WideToUtf8(label()->GetText()) << " " << font("small");
    edit->SetText(u"Abc");
    out << "|" << misc::WideToUtf8(label()->GetText());
    fonts->SelectLine(1, true);
    frame();
    const gui::CWidget* titled = label();
    out << "|" << misc::WideToUtf8(label()->GetText()) << " " << font("title") << " "
        << (label()->GetOffset().Y >= edit->GetAbsPos(false).Y + edit->GetSize().Y);
    // The title font's file saved again: the label is built anew.
    std::filesystem::last_write_time("fonts/title.xml",
                                     std::filesystem::last_write_time("fonts/title.xml") + std::chrono::seconds(5));
    std::this_thread::sleep_for(std::chrono::milliseconds(1100));
    frame();
    frame();
    out << "|" << (label() != titled) << " " << font("title");
    viewer->OnKeyDown(gui::OX_ESC, 0, 0, false);
    frame();
    out << "|" << app.GetTopWindow()->GetId();
    out.close();
    viewer.reset();
    game.Stop();
    return 0;
}

} // namespace

TEST(FontViewer, ListsTheFontsShowsTheTextFollowsItsFilesAndClosesOnEscape)
{
    oxtest::DemoChild demo;
    g_Out = (demo.dir / "result.txt").string();
    ASSERT_EQ(demo.Run(&ViewFonts), 0) << demo.Output() << demo.Errors();
    EXPECT_EQ(oxtest::ReadFile(g_Out), "2 small title|Lantern Demo 1|Abc|Abc 1 1|1 1|main_menu");
}
