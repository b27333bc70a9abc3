#pragma once

#include "core/platform/StandaloneApplicationSdl.h"
#include "game/App.h"
#include "gui/BaseWindow.h"

namespace oxtest {

// The demo game made and run in this process (the child a DemoChild starts in the game's
// folder): started under its load window, stepped a frame at a time as the main loop would.
struct DemoGame {
    k17::CApp app;
    ox::gui::BaseWindowPtrT loading;
    ox::core::CStandaloneApplicationSdl* adapter = nullptr;

    // 0 once the game runs; else the exit code for the child (10: no start, 11: no SDL adapter).
    int Start()
    {
        app.ReadGameFolder();
        if (!app.Init())
            return 10;
        loading = app.CreateLoadWindow();
        app.SetMainWindow(loading);
        adapter = dynamic_cast<ox::core::CStandaloneApplicationSdl*>(app.GetSystemIntegration());
        return adapter ? 0 : 11;
    }

    void Frame()
    {
        adapter->PumpMessages();
        app.Update();
        app.Draw();
    }

    bool TopIs(const char* id) { return app.GetTopWindow() && app.GetTopWindow()->GetId() == id; }

    // Frames until the top window is `id`, at most `frames` of them; whether it came.
    bool Until(const char* id, int frames = 300)
    {
        for (int i = 0; i < frames && !TopIs(id); ++i)
            Frame();
        return TopIs(id);
    }

    void Stop()
    {
        app.Stop();
        loading.reset();
        app.DoShutdown();
    }
};

} // namespace oxtest
