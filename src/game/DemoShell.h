#pragma once
// Demo support for the profile and records windows until the basic controls exist: a line of
// text that scripts set, and opening a described window over the top window.
#include "lua/mluabind/Binding.h"

namespace k17 {

// <demo_text_widget font="small" color="#255 r g b" justify="left|center"/>.
void RegisterDemoShellWidgets();

// "demo": SetText(widget, text) for a demo_text_widget (anything else is logged and left),
// OpenWindow(id), which builds the window of that id from the GUI description, puts it on
// top of the top window, centred on the canvas, and gives it (nil for an unknown id);
// CentreWindow(window), the same place for a window about to open; SaveLevelState and
// RestoreLevelState (game/LevelState.h).
mluabind::Namespace BindDemoShell();

} // namespace k17
