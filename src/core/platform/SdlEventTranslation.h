#pragma once
// Turns one SDL event into zero or more window-message records.
#include "core/platform/Event.h"

#include <SDL.h>

#include <vector>

namespace ox::core {

// What a translation needs besides the event, so that it stays a pure function.
struct TranslationState {
    uint16_t modifiers = 0;     // SDL_Keymod at the time of the event
    uint32_t mouseButtons = 0;  // SDL_BUTTON_* mask at the time of the event
    int windowX = 0, windowY = 0;        // window position on the screen
    int clientWidth = 0, clientHeight = 0;
    int mouseX = 0, mouseY = 0;          // cursor in client coordinates
    bool fullscreen = false;             // the window covers the desktop
    int desktopWidth = 0, desktopHeight = 0;
};

// The virtual-key code of a key, 0 if it has none.
uint32_t VirtualKeyFromSdl(SDL_Keycode key, SDL_Scancode scancode);

void TranslateSdlEvent(const SDL_Event& event, const TranslationState& state, std::vector<SystemEvent>& out);

} // namespace ox::core
