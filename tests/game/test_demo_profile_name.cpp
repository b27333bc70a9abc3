// The demo's players' chooser in the real game, headless: a new player's name typed into its
// edit widget through the platform's events (typed, a character taken back, a paste from the
// clipboard, a slip undone) while the first window's letter keys stay letters, then "New
// player" makes that player the current one.
#include "DemoChild.h"
#include "DemoGame.h"
#include "game/Profile.h"
#include "gui/Window.h"
#include "gui/controls/EditWidget.h"
#include "gui/controls/ListWidget.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "misc/Unicode.h"

#include <SDL.h>

#include <cstring>
#include <fstream>

using namespace ox;

namespace {

std::string g_Out;

void PushText(const char* text)
{
    SDL_Event event {};
    event.type = SDL_TEXTINPUT;
    strncpy(event.text.text, text, sizeof(event.text.text) - 1);
    SDL_PushEvent(&event);
}

void PushKey(SDL_Keycode key, SDL_Scancode scancode, uint16_t modifiers)
{
    for (Uint32 type : {SDL_KEYDOWN, SDL_KEYUP}) {
        SDL_Event event {};
        event.type = type;
        event.key.state = type == SDL_KEYDOWN ? SDL_PRESSED : SDL_RELEASED;
        event.key.keysym.sym = key;
        event.key.keysym.scancode = scancode;
        event.key.keysym.mod = modifiers;
        SDL_PushEvent(&event);
    }
}

// Runs the game to its main menu, opens the chooser from it and types "Rob" as a player
// would; writes the box's text after each step, then the current player's name.
int TypeAName()
{
    oxtest::DemoGame game;
    if (const int failed = game.Start())
        return failed;
    k17::CApp& app = game.app;
    auto frame = [&game] { game.Frame(); };
    auto top = [&game](const char* id) { return game.TopIs(id); };
    game.Until("main_menu");
    lua::CLua* mainLua = lua::CLua::GetLua("main");
    if (!mainLua || !top("main_menu"))
        return 12;
    oxtest::RunChunk(mainLua->GetLuaState(), "local menu = g_Application.GetTopWindow()"
                                             " MainMenu.OnChildAction(menu, 'pressed', menu.GetWidget('profiles', true))");
    frame();
    auto* edit = dynamic_cast<gui::CEditWidget*>(app.GetTopWindow()->GetWidget("new_name", true));
    if (!top("profiles") || !edit || !oxtest::PressWidget(app.GetTopWindow(), "new_name"))
        return 13;
    // Opened over the menu, the chooser still lies on the canvas.
    const auto at = app.GetTopWindow()->GetAbsPos(true), size = app.GetTopWindow()->GetSize();
    if (at.X < 0 || at.Y < 0 || at.X + size.X > 1024 || at.Y + size.Y > 768)
        return 16;
    std::ofstream out(g_Out);
    auto step = [&](auto&& push) {
        push();
        frame();
        out << misc::WideToUtf8(edit->GetText()) << "|";
    };
    // R is also the first window's key for the records: in the box it is a letter.
    step([] {
        PushKey(SDLK_r, SDL_SCANCODE_R, KMOD_LSHIFT);
        PushText("Rx");
    });
    step([] { PushKey(SDLK_BACKSPACE, SDL_SCANCODE_BACKSPACE, KMOD_NONE); });
    step([] {
        SDL_SetClipboardText("ob");
        PushKey(SDLK_v, SDL_SCANCODE_V, KMOD_LCTRL);
    });
    step([] { PushText("!z"); }); // the '!' is no character of a name
    step([] { PushKey(SDLK_z, SDL_SCANCODE_Z, KMOD_LCTRL); });
    if (!oxtest::PressWidget(app.GetTopWindow(), "new_profile"))
        return 14;
    frame();
    k17::CProfile* current = k17::g_ProfileManager::Instance().GetCurrentProfile();
    auto name = [](const k17::CProfile* player) {
        return player ? misc::WideToUtf8(player->GetName()) : std::string("nobody");
    };
    out << name(current) << "|" << misc::WideToUtf8(edit->GetText());
    // The list holds every player with the current one selected; choosing a line switches.
    auto* players = dynamic_cast<gui::CListWidget*>(app.GetTopWindow()->GetWidget("players", true));
    if (!players || !oxtest::PressWidget(app.GetTopWindow(), "new_profile"))
        return 15;
    frame();
    out << "|" << players->EnumLines() << " " << misc::WideToUtf8(players->GetLine(players->GetSelectedLine()));
    players->SelectLine(players->FindLine(u"Rob"), true);
    frame();
    out << "|" << name(k17::g_ProfileManager::Instance().GetCurrentProfile()) << " " << players->EnumLines();
    out.close();
    game.Stop();
    return 0;
}

} // namespace

TEST(DemoProfileName, ANewPlayersNameIsTypedEditedPastedAndUndone)
{
    oxtest::DemoChild demo;
    g_Out = (demo.dir / "result.txt").string();
    ASSERT_EQ(demo.Run(&TypeAName), 0) << demo.Output() << demo.Errors();
    EXPECT_EQ(oxtest::ReadFile(g_Out), "Rx|R|Rob|Robz|Rob|Rob||2 Player 2|Rob 2");
    EXPECT_NE(demo.Output().find("Lantern Demo: new player Rob"), std::string::npos) << demo.Output();
    EXPECT_EQ(demo.Errors().find("Lua Error"), std::string::npos) << demo.Errors();
}
