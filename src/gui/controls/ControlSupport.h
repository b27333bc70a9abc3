#pragma once
// What the controls share: reading their look (the template a description names, the fonts,
// textures, sounds and values it gives, each checked: a value a game maker got wrong is
// logged naming the template or the element, and the control goes on with its default),
// telling their parent, and their own clocks.
#include "core/Settings.h"
#include "core/TimeManager.h"
#include "graphics/Color.h"
#include "graphics/Image.h"
#include "misc/Rect.h"
#include "misc/Vector.h"

#include <string>

namespace ox::graphics {
struct CFont;
}

namespace ox::gui {

// The child of `templates` of kind `kind` whose id is the node's attribute `kind`. The empty
// group when the node names none; the same, logged, when the named one doesn't exist.
const core::CSettingsGroup& FindTemplate(const core::CSettingsGroup& node, const core::CSettingsGroup& templates,
                                         const char* kind);
// The font the attribute `key` of `owner` names; null without one, logged when unknown.
const graphics::CFont* ReadFont(const core::CSettingsGroup& owner, const char* key);
// The texture the attribute `key` of `owner` names, into `image` (which is emptied first);
// false without one, false and logged when unknown.
bool ReadImage(const core::CSettingsGroup& owner, const char* key, graphics::CImage& image);
// The sound id the attribute `key` of `owner` names; one that isn't declared is logged.
std::string ReadSound(const core::CSettingsGroup& owner, const char* key);
// "true" or "false" (also "1", "0") when present; anything else is logged and ignored.
bool ReadFlag(const core::CSettingsGroup& node, const char* name, bool& value);
// A colour when present; one that cannot be read is logged and ignored.
bool ReadColorChecked(const core::CSettingsGroup& node, const char* name, graphics::Color& value);
// A time in seconds when present, as whole milliseconds; negative or unreadable logged.
bool ReadSeconds(const core::CSettingsGroup& node, const char* name, unsigned& milliseconds);
// The text flags of justification words: the first of "left", "right", "center" found, in
// this order, then the first of "top", "bottom", "center": "center" alone centres both ways.
unsigned ParseJustification(const std::string& words);

class CWidget;

// Tells the sender's parent what happened ("pressed", "overed", ...). The sender is held
// while the parent (and the script behind it) reacts, so that it may remove it.
void TellParent(CWidget& sender, const char* action);
// A width or height of 0 (below 0.001) takes the natural one: after loading, a control
// given no size takes its image's.
void TakeNaturalSize(CWidget& widget, const misc::FloatVector& natural);
// Whether a point in a widget's own coordinates lies inside its rectangle.
bool IsInside(const CWidget& widget, const misc::IntVector& pos);
// Part `index` of `count` equal parts side by side in a texture, in surface pixels.
misc::ShortRect StripPart(const graphics::CTexture& texture, int index, int count);
// The time of a control's own timer (0 without one).
unsigned TimerNow(const core::CTimerWrapper& timer);

} // namespace ox::gui
