// The demo's options window in the real game, headless: clicks through the platform adapter
// open it from the main menu, move the music slider, open the screen-mode combo box and pick
// its second line, and OK applies and saves what they chose through the game's options.
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "game/GameOptions.h"
#include "gui/WidgetManager.h"
#include "gui/Window.h"
#include "gui/controls/ButtonWidget.h"
#include "gui/controls/ComboBoxWidget.h"
#include "gui/controls/ListWidget.h"
#include "gui/controls/SliderWidget.h"
#include "gui/controls/TabWidget.h"
#include "DemoChild.h"
#include "support/TestSupport.h"

#include <chrono>
#include <cmath>
#include <optional>
#include <thread>

using namespace ox;

namespace {

// A click at a canvas point, in the window's client pixels.
void PushClick(core::CApplication& app, misc::FloatVector canvas)
{
    const gui::CWidgetManager& manager = app.GetWidgetManager();
    const misc::FloatRect& rect = manager.GetActiveRect();
    const int x = static_cast<int>(rect.X + canvas.X * manager.GetScale().X);
    const int y = static_cast<int>(rect.Y + canvas.Y * manager.GetScale().Y);
    SDL_Event event {};
    event.type = SDL_MOUSEMOTION;
    event.motion.x = x;
    event.motion.y = y;
    SDL_PushEvent(&event);
    for (Uint32 type : {SDL_MOUSEBUTTONDOWN, SDL_MOUSEBUTTONUP}) {
        event = {};
        event.type = type;
        event.button.button = SDL_BUTTON_LEFT;
        event.button.state = type == SDL_MOUSEBUTTONDOWN ? SDL_PRESSED : SDL_RELEASED;
        event.button.clicks = 1;
        event.button.x = x;
        event.button.y = y;
        SDL_PushEvent(&event);
    }
}

// A point of a widget on the canvas: `at` is a share of its width and height.
misc::FloatVector CanvasPoint(const gui::CWidget& widget, float atX, float atY)
{
    return widget.GetAbsPos(true) + misc::FloatVector(widget.GetSize().X * atX, widget.GetSize().Y * atY);
}

int ChooseOptions()
{
    k17::CApp app;
    app.ReadGameFolder();
    if (!app.Init())
        return 10;
    gui::BaseWindowPtrT loading = app.CreateLoadWindow();
    app.SetMainWindow(loading);
    auto* adapter = dynamic_cast<core::CStandaloneApplicationSdl*>(app.GetSystemIntegration());
    if (!adapter)
        return 11;
    // Frames until the top window is `id` and has stood half a second, past its growing in.
    auto until = [&](const char* id) {
        std::optional<std::chrono::steady_clock::time_point> seen;
        for (int i = 0; i < 500; ++i) {
            adapter->PumpMessages();
            app.Update();
            app.Draw();
            gui::CBaseWindow* top = app.GetTopWindow();
            if (top->GetId() != id)
                seen.reset();
            else if (!seen)
                seen = std::chrono::steady_clock::now();
            else if (std::chrono::steady_clock::now() - *seen > std::chrono::milliseconds(500))
                return top;
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
        return static_cast<gui::CBaseWindow*>(nullptr);
    };
    gui::CBaseWindow* menu = until("main_menu");
    if (!menu || !menu->GetWidget("options", true))
        return 12;
    PushClick(app, CanvasPoint(*menu->GetWidget("options", true), 0.5f, 0.5f));
    gui::CBaseWindow* options = until("options");
    auto* music = options ? dynamic_cast<gui::CSliderWidget*>(options->GetWidget("music", true)) : nullptr;
    auto* screen = options ? dynamic_cast<gui::CComboBoxWidget*>(options->GetWidget("screen_mode", true)) : nullptr;
    if (!music || !screen || screen->EnumLines() != 2)
        return 13;
    const float volume = k17::g_GameOptions::Instance().GetMusicVolume();
    if (std::fabs(music->GetValue() * 100 - volume) > 0.5f)
        return 14;

    PushClick(app, CanvasPoint(*music, 0.25f, 0.5f));
    // The screen mode is on the second page, whose tab shows it.
    auto* tabs = dynamic_cast<gui::CTabWidget*>(options->GetWidget("options_tabs", true));
    if (!tabs || tabs->EnumPanels() != 2)
        return 19;
    PushClick(app, CanvasPoint(*tabs->GetPanels()[1].button, 0.5f, 0.5f));
    until("options");
    if (tabs->GetSelectedPanel() != 1)
        return 20;
    PushClick(app, CanvasPoint(*screen->GetButton(), 0.5f, 0.5f));
    until("options");
    if (!screen->IsListShown())
        return 15;
    gui::CListWidget& list = *screen->GetList();
    PushClick(app, list.GetAbsPos(true) + misc::FloatVector(20, list.GetInsets().Top + list.LineHeight() * 1.5f));
    until("options");
    if (screen->IsListShown() || screen->GetSelectedLine() != 1)
        return 16;
    const float chosen = music->GetValue() * 100;
    if (std::fabs(chosen - volume) < 1 || std::fabs(k17::g_GameOptions::Instance().GetMusicVolume() - chosen) > 0.01f)
        return 17;
    PushClick(app, CanvasPoint(*options->GetWidget("ok", true), 0.5f, 0.5f));
    if (until("main_menu") != menu)
        return 18;
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

} // namespace

TEST(DemoOptions, SlidersAndTheComboBoxChangeTheOptions)
{
    oxtest::DemoChild demo;
    const int result = demo.Run(&ChooseOptions);
    const std::string output = demo.Output();
    ASSERT_EQ(result, 0) << output << demo.Errors();
    size_t at = 0;
    for (const char* line : {"Menu: pressed options", "Menu: \"options\" opens", "Menu: list_showed screen_mode",
                             "Menu: line_selected screen_mode", "Menu: options applied"}) {
        const size_t found = output.find(line, at);
        ASSERT_NE(found, std::string::npos) << "missing after offset " << at << ": " << line << "\n" << output;
        at = found + 1;
    }
    EXPECT_EQ(demo.Errors().find("Lua Error"), std::string::npos) << demo.Errors();
}
