#pragma once
// Typed reading of settings values at the point of use. The two-argument forms give the
// value (or the reader's zero); the three-argument forms fill `value` only when the
// attribute exists and say whether it did, which is how defaults are given.
// A malformed number raises boost::bad_lexical_cast.
#include "core/Settings.h"
#include "graphics/Color.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"

namespace ox::core {

using SettingsName = CSettingsGroup::String;

// True only for exactly "true".
bool ReadBool(const CSettingsGroup& group, const SettingsName& name);
// Empty is 0; otherwise boost::lexical_cast<int>.
int ReadInt(const CSettingsGroup& group, const SettingsName& name);
// Empty is 0.0; otherwise boost::lexical_cast<float>.
float ReadFloat(const CSettingsGroup& group, const SettingsName& name);
// "x y"; what cannot be read stays 0.
misc::Vector<float> ReadVector(const CSettingsGroup& group, const SettingsName& name);
// Empty is Color(0). "#a r g b" (C integer syntax: 0x.. hexadecimal, a leading 0 octal);
// otherwise a decimal integer taken as 0xAARRGGBB.
graphics::Color ReadColor(const CSettingsGroup& group, const SettingsName& name);
// The value converted to wide text.
wstring ReadWString(const CSettingsGroup& group, const SettingsName& name);

// The value with its "$<id>" references replaced from the string table.
wstring ReadLocalText(const CSettingsGroup& group, const SettingsName& name);

bool ReadBool(const CSettingsGroup& group, const SettingsName& name, bool& value);
bool ReadInt(const CSettingsGroup& group, const SettingsName& name, int& value);
bool ReadFloat(const CSettingsGroup& group, const SettingsName& name, float& value);
bool ReadVector(const CSettingsGroup& group, const SettingsName& name, misc::Vector<float>& value);
bool ReadColor(const CSettingsGroup& group, const SettingsName& name, graphics::Color& value);
bool ReadWString(const CSettingsGroup& group, const SettingsName& name, wstring& value);
bool ReadLocalText(const CSettingsGroup& group, const SettingsName& name, wstring& value);

// The same rules on a bare value text.
int ParseSettingsInt(const std::string& text);
float ParseSettingsFloat(const std::string& text);
misc::Vector<float> ParseSettingsVector(const std::string& text);
graphics::Color ParseSettingsColor(const std::string& text);

} // namespace ox::core
