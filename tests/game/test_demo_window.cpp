// The demo's first window, driven headless through the real game: SDL events go through the
// platform adapter, the application and the widget manager to the widgets, whose actions reach
// the Lua hooks of scripts/main.lua; a modal dialog opens, takes all input and closes.
#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "gui/WidgetManager.h"
#include "gui/Window.h"
#include "DemoChild.h"
#include "support/TestSupport.h"

#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <thread>

namespace fs = std::filesystem;
using namespace ox;

namespace {

// Where a widget's centre lies in the window's client pixels, from its place on the canvas.
misc::IntVector ClientPoint(const core::CApplication& app, misc::FloatVector canvas)
{
    const gui::CWidgetManager& manager = const_cast<core::CApplication&>(app).GetWidgetManager();
    const misc::FloatRect& rect = manager.GetActiveRect();
    return {static_cast<int>(rect.X + canvas.X * manager.GetScale().X),
            static_cast<int>(rect.Y + canvas.Y * manager.GetScale().Y)};
}

misc::FloatVector Centre(const gui::CWidget& widget, misc::FloatVector windowPos)
{
    return windowPos + widget.GetAbsPos(false) + misc::FloatVector(widget.GetSize().X / 2, widget.GetSize().Y / 2);
}

void PushClick(misc::IntVector at)
{
    SDL_Event event {};
    event.type = SDL_MOUSEMOTION;
    event.motion.x = at.X;
    event.motion.y = at.Y;
    SDL_PushEvent(&event);
    for (Uint32 type : {SDL_MOUSEBUTTONDOWN, SDL_MOUSEBUTTONUP}) {
        event = {};
        event.type = type;
        event.button.button = SDL_BUTTON_LEFT;
        event.button.state = type == SDL_MOUSEBUTTONDOWN ? SDL_PRESSED : SDL_RELEASED;
        event.button.clicks = 1;
        event.button.x = at.X;
        event.button.y = at.Y;
        SDL_PushEvent(&event);
    }
}

void PushKey(SDL_Scancode scancode, SDL_Keycode key)
{
    for (Uint32 type : {SDL_KEYDOWN, SDL_KEYUP}) {
        SDL_Event event {};
        event.type = type;
        event.key.state = type == SDL_KEYDOWN ? SDL_PRESSED : SDL_RELEASED;
        event.key.keysym.scancode = scancode;
        event.key.keysym.sym = key;
        SDL_PushEvent(&event);
    }
}

// The game in this process, as main runs it, with input pushed between frames. Exit codes
// above 0 say where it went wrong.
int PlayTheDemo()
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
    auto frames = [&](int count) {
        for (int i = 0; i < count; ++i) {
            adapter->PumpMessages();
            app.Update();
            app.Draw();
        }
    };
    frames(3);
    if (app.GetMainWindow() != loading.get() || app.GetState() != core::Running)
        return 12;

    auto widget = [&](const char* id) { return loading->GetWidget(id, true); };
    if (!widget("lantern") || !widget("open_dialog") || !widget("chest"))
        return 13;
    const misc::FloatVector at = loading->GetOffset();
    // Where the dialog's buttons will be: it opens at its place over the first window.
    const core::CSettings& settings = app.GetSettings();
    gui::CWindow probe;
    probe.Load(settings.GetChildByAttribute("window", "id", "demo_dialog", true), settings.GetChild("GUITemplates"));
    probe.UpdateLayout();
    const misc::FloatVector dialogAt = at + probe.GetOffset();
    if (!probe.GetWidget("ok", true))
        return 14;

    PushClick(ClientPoint(app, Centre(*widget("lantern"), at)));
    PushKey(SDL_SCANCODE_SPACE, SDLK_SPACE);
    frames(2);
    // The dialog opens inside the release that clicks "Open a dialog", and runs its frames
    // from there: what comes next is queued before.
    PushClick(ClientPoint(app, Centre(*widget("open_dialog"), at)));
    PushClick(ClientPoint(app, Centre(*widget("chest"), at)));     // under the dialog's modality
    PushClick(ClientPoint(app, Centre(*probe.GetWidget("ok", true), dialogAt)));
    PushClick(ClientPoint(app, Centre(*widget("door"), at)));      // the dialog is gone
    frames(3);
    if (loading->GetChildWindow())
        return 15;
    PushClick(ClientPoint(app, Centre(*widget("open_dialog"), at)));
    PushKey(SDL_SCANCODE_ESCAPE, SDLK_ESCAPE);
    frames(3);
    if (loading->GetChildWindow())
        return 16;
    app.Stop();
    loading.reset();
    app.DoShutdown();
    return 0;
}

} // namespace

TEST(DemoWindow, ClicksAndKeysReachTheScriptsAndTheDialogIsModal)
{
    oxtest::DemoChild demo;
    const int result = demo.Run(&PlayTheDemo);
    const std::string output = demo.Output();
    const std::string errors = demo.Errors();
    ASSERT_EQ(result, 0) << output << errors;

    // In order: the window's own hooks, the modal dialog taking every click until OK, the
    // result it left, and the window taking clicks again.
    size_t at = 0;
    for (const char* line :
         {"Lantern Demo Run: the lantern is lit (1)", "DemoWindow: mouse down at", "DemoWindow: pressed lantern",
          "DemoWindow: Space, the lantern is lit (2)", "DemoWindow: pressed open_dialog", "DemoDialog: pressed ok",
          "Lantern Demo: the dialog demo_dialog closed with 1", "DemoWindow: pressed door",
          "DemoWindow: pressed open_dialog", "DemoDialog: Escape", "Lantern Demo: the dialog demo_dialog closed with 0",
          "Lantern Demo quest.OnClose"}) {
        const size_t found = output.find(line, at);
        ASSERT_NE(found, std::string::npos) << "missing after offset " << at << ": " << line << "\n" << output;
        at = found + 1;
    }
    EXPECT_EQ(output.find("pressed chest"), std::string::npos) << "a click under the dialog went through:\n" << output;
    EXPECT_EQ(errors.find("Lua Error"), std::string::npos) << errors;
}
