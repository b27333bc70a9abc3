// The game executable: runs the game in the working folder. It takes no command line.
#define SDL_MAIN_HANDLED
#include "game/App.h"

#include <SDL.h>

int main(int /*argc*/, char** /*argv*/)
{
    SDL_SetMainReady();
    int result = 0;
    {
        k17::CApp app;
        app.ReadGameFolder();
        if (app.Init()) {
            ox::gui::BaseWindowPtrT loading = app.CreateLoadWindow();
            app.SetMainWindow(loading);
            app.Run();
            loading.reset();
        } else if (app.GetInitFailure() == k17::CApp::InitFailure::Platform) {
            result = 1;
        }
        app.DoShutdown();
    }
    SDL_Quit();
    return result;
}
