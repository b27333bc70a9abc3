#pragma once
// Script names of the GUI's widgets, windows, cursor and widget manager. Run in declaration
// mode and merge the result under "ox".
#include "lua/mluabind/Binding.h"

namespace ox::gui {

// "gui": the key codes OX_* and the Justify values; CBaseWidget and CWidget with their
// pointer classes CBaseWidgetPtrT and CWidgetPtrT; CBaseWindow, CWindow, CLuaWidget; CCursor
// with CCursor.Instance and g_Cursor.Instance; CWidgetManager; the effects (CEffect with
// CEffectPtrT, CPositionChangeEffect, CColorChangeEffect, CFlagsChangeEffect) and the basic
// controls. Methods that take a window, a widget or an effect move a script-made one into the
// GUI's keeping.
mluabind::Namespace BindGui();

// The GUI's whole vocabulary under "ox.gui": BindGui's names, the insets IntInsets and
// FloatInsets and the walks CBaseWidget.WidgetIteratorT and ConstWidgetIteratorT. Binds in
// declaration mode.
void BindGuiVocabulary(mluabind::CHost& host);

} // namespace ox::gui
