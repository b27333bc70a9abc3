#pragma once
// What the GUI needs from the floors above it and from the platform, handed over by the
// application at start: the platform adapter (nested loops, the mouse capture, the pointer),
// the canvas size, whether the application is active or full-screen, and the players of
// sounds and effects by name. Until a service is given, the GUI goes on without it.
#include "core/SystemIntegration.h"
#include "gui/Effect.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"

#include <functional>
#include <string>

namespace ox::graphics {
struct CFont;
}

namespace ox::gui {

struct GuiServices {
    core::CSystemIntegration* platform = nullptr;
    // The source resolution the GUI lives on: dragged windows stay inside it.
    misc::FloatVector canvas {1024.0f, 768.0f};
    std::function<bool()> isActive;
    std::function<bool()> isFullscreen;
    // Plays a declared sound by id with its default parameters.
    std::function<void(const std::string& id)> playSound;
    // Whether a sound of the id is declared; without it descriptions aren't checked for sounds.
    std::function<bool(const std::string& id)> isSound;
    // A new effect of a registered name, or null for an unknown name.
    std::function<EffectPtrT(const wstring& name)> createEffect;
    // A declared font by id, or null: what labels and check boxes write with.
    std::function<const graphics::CFont*(const char* id)> findFont;
};

GuiServices& GetGuiServices();

// Plays a sound of a window or control by its declared id. Without an audio player the
// sound is silent, and each id is logged once.
void PlayGuiSound(const std::string& id);
// An effect by name for a window's opening or closing; null (logged once per name) when no
// effect of the name is known.
EffectPtrT CreateGuiEffect(const wstring& name);

} // namespace ox::gui
