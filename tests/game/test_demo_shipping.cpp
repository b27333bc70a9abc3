// The demo as it ships. With the language set to Russian the string table comes from the
// translation under games/demo/!langs/ru, and the main menu shows Cyrillic text in fonts that
// hold every letter of it; the fonts are what make-fonts.sh makes. stage-run.sh, which `make
// run` uses, packs the game into game.pack with oxpack, and the game started there with nothing
// loose beside the pack comes to its menu, in Russian too, through the pack's overlay.
#include "core/FontManager.h"
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "gui/Window.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/LabelWidget.h"
#include "misc/Unicode.h"
#include "DemoChild.h"
#include "support/TestSupport.h"

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <sys/wait.h>

namespace fs = std::filesystem;
using namespace ox;

namespace {

// Every character of `text` has a glyph in `font`.
bool Draws(const graphics::CFont* font, const wstring& text)
{
    if (!font || text.empty())
        return false;
    for (wchar code : text) {
        const graphics::FontChar* glyph = font->GetChar(code);
        if (!glyph || (code != u' ' && glyph->Width == 0))
            return false;
    }
    return true;
}

// The game in this process, in Russian, up to its main menu: 0 when the menu's title and Play
// are in Russian and their fonts draw them; above 0, where it went wrong.
int OpenTheMenuInRussian()
{
    setenv("LC_ALL", "ru_RU.UTF-8", 1);
    k17::CApp app;
    app.ReadGameFolder();
    if (!app.Init())
        return 10;
    gui::BaseWindowPtrT loading = app.CreateLoadWindow();
    app.SetMainWindow(loading);
    auto* adapter = dynamic_cast<core::CStandaloneApplicationSdl*>(app.GetSystemIntegration());
    if (!adapter)
        return 11;
    const auto until = std::chrono::steady_clock::now() + std::chrono::seconds(30);
    auto top = [&app] { return app.GetTopWindow() ? app.GetTopWindow()->GetId() : std::string(); };
    while (top() != "main_menu" && std::chrono::steady_clock::now() < until) {
        adapter->PumpMessages();
        app.Update();
        app.Draw();
    }
    if (top() != "main_menu")
        return 12;
    gui::CBaseWindow* menu = app.GetTopWindow();
    auto* title = dynamic_cast<gui::CLabelWidget*>(menu->GetWidget("menu_title", true));
    auto* play = dynamic_cast<gui::CButtonWidget*>(menu->GetWidget("play", true));
    int result = 0;
    if (!title || !play)
        result = 13;
    else if (title->GetText() != u"Фонарь" || play->GetText() != u"Играть")
        result = 14;
    else if (!Draws(title->GetFont(), title->GetText()) ||
             !Draws(core::CFontManager::Instance().GetItem("small"), play->GetText()))
        result = 15;
    if (title && play)
        printf("The menu: %s, %s\n", misc::WideToUtf8(title->GetText()).c_str(), misc::WideToUtf8(play->GetText()).c_str());
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return result;
}

int RunScript(const std::string& command, const fs::path& log)
{
    return WEXITSTATUS(system((command + " >'" + log.string() + "' 2>&1").c_str()));
}

} // namespace

TEST(DemoShipping, TheMenuIsInRussianWhenTheLanguageIsRussian)
{
    oxtest::DemoChild demo;
    const int result = demo.Run(&OpenTheMenuInRussian, 90);
    EXPECT_EQ(result, 0) << demo.Output() << demo.Errors();
    EXPECT_NE(demo.Output().find("The menu: Фонарь, Играть"), std::string::npos) << demo.Output();
}

TEST(DemoShipping, TheFontsRegenerateByteForByte)
{
    oxtest::TempDir out;
    const std::string command =
        std::string("sh '") + OX_DEMO_GAME + "/make-fonts.sh' '" + OX_TOOLS_DIR + "' '" + out.Path().string() + "'";
    ASSERT_EQ(RunScript(command, out / "log.txt"), 0) << oxtest::ReadFile(out / "log.txt");
    for (const char* file : {"small.png", "small.xml", "small.xml.bindump", "title.png", "title.xml",
                             "title.xml.bindump"}) {
        const fs::path kept = fs::path(OX_DEMO_GAME) / "fonts" / file;
        EXPECT_TRUE(oxtest::ReadFile(out / "fonts" / file) == oxtest::ReadFile(kept))
            << kept << " differs from what games/demo/make-fonts.sh makes";
    }
}

TEST(DemoShipping, TheStagedDemoStartsFromItsPack)
{
    oxtest::DemoChild demo;
    demo.game = demo.dir / "run";
    const std::string command = std::string("sh '") + OX_DEMO_GAME + "/stage-run.sh' '" + OX_TOOLS_DIR + "' '" +
                                demo.game.string() + "'";
    ASSERT_EQ(RunScript(command, demo.dir / "stage.txt"), 0) << oxtest::ReadFile(demo.dir / "stage.txt");
    // Nothing of the game lies loose beside the pack: what the game reads comes from it.
    EXPECT_TRUE(fs::is_regular_file(demo.game / "game.pack"));
    for (const char* loose : {"game.xml", "properties", "scripts", "textures", "!langs"})
        EXPECT_FALSE(fs::exists(demo.game / loose)) << loose;
    // The start-up pictures beside it would show for twelve seconds first.
    fs::remove_all(demo.game / "fsdata");
    fs::remove_all(demo.game / "branch");
    const int result = demo.Run(&OpenTheMenuInRussian, 90);
    EXPECT_EQ(result, 0) << demo.Output() << demo.Errors();
    EXPECT_NE(demo.Output().find("The menu: Фонарь, Играть"), std::string::npos) << demo.Output();
}
