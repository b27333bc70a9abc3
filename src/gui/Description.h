#pragma once
// Checked reading of GUI descriptions: a value a game maker got wrong is logged on channel
// "gui" with the element it stands in, and the widget or box takes a sane value instead.
#include "core/Settings.h"
#include "misc/Insets.h"

#include <string>

namespace ox::gui {

// The largest size, inset or coordinate a description may give, in canvas pixels.
constexpr float kMaxDescriptionSize = 16384.0f;

// The element as a log line names it: its name and, when it has one, its id.
std::string DescribeElement(const core::CSettingsGroup& node);

// Reads a number attribute when it is present. A value that is not a number is logged and
// ignored (false); one outside [min, max] is logged and clamped.
bool ReadChecked(const core::CSettingsGroup& node, const char* name, float& value, float min, float max);
bool ReadChecked(const core::CSettingsGroup& node, const char* name, int& value, int min, int max);

// Reads `left`, `right`, `top` and `bottom` (each checked as a size); absent ones are 0.
void ReadInsets(const core::CSettingsGroup& group, misc::FloatInsets& insets);

// Logs a line about the element on channel "gui".
void ReportElement(const core::CSettingsGroup& node, const char* what, const std::string& detail = {});

} // namespace ox::gui
