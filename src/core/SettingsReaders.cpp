#include "core/SettingsReaders.h"

#include "misc/StringTable.h"

#include "misc/Unicode.h"

#include <boost/lexical_cast.hpp>

#include <cstdio>
#include <cstdlib>

namespace ox::core {

int ParseSettingsInt(const std::string& text) { return text.empty() ? 0 : boost::lexical_cast<int>(text); }

float ParseSettingsFloat(const std::string& text) { return text.empty() ? 0.0f : boost::lexical_cast<float>(text); }

misc::Vector<float> ParseSettingsVector(const std::string& text)
{
    misc::Vector<float> v;
    sscanf(text.c_str(), "%f %f", &v.X, &v.Y);
    return v;
}

graphics::Color ParseSettingsColor(const std::string& text)
{
    if (text.empty())
        return graphics::Color(0u);
    graphics::Color color;
    if (text[0] == '#') {
        sscanf(text.c_str(), "#%hi %hi %hi %hi", &color.Alpha, &color.Red, &color.Green, &color.Blue);
        return color;
    }
    // atoi as the C library does it on this platform, without its undefined overflow.
    return graphics::Color(static_cast<uint32_t>(static_cast<int>(strtol(text.c_str(), nullptr, 10))));
}

bool ReadBool(const CSettingsGroup& group, const SettingsName& name) { return group.GetValue(name) == "true"; }
int ReadInt(const CSettingsGroup& group, const SettingsName& name) { return ParseSettingsInt(group.GetValue(name)); }
float ReadFloat(const CSettingsGroup& group, const SettingsName& name) { return ParseSettingsFloat(group.GetValue(name)); }

misc::Vector<float> ReadVector(const CSettingsGroup& group, const SettingsName& name)
{
    return ParseSettingsVector(group.GetValue(name));
}

graphics::Color ReadColor(const CSettingsGroup& group, const SettingsName& name)
{
    return ParseSettingsColor(group.GetValue(name));
}

wstring ReadWString(const CSettingsGroup& group, const SettingsName& name)
{
    return misc::ConvertToWide(group.GetValue(name));
}

wstring ReadLocalText(const CSettingsGroup& group, const SettingsName& name)
{
    return misc::CStringTable::Instance().FormatByStringsID(group.GetValue(name));
}

namespace {

template <class T, class Reader>
bool ReadIfPresent(const CSettingsGroup& group, const SettingsName& name, T& value, Reader reader)
{
    if (!group.IsValue(name))
        return false;
    value = reader(group, name);
    return true;
}

} // namespace

bool ReadBool(const CSettingsGroup& group, const SettingsName& name, bool& value)
{
    return ReadIfPresent(group, name, value, [](auto& g, auto& n) { return ReadBool(g, n); });
}

bool ReadInt(const CSettingsGroup& group, const SettingsName& name, int& value)
{
    return ReadIfPresent(group, name, value, [](auto& g, auto& n) { return ReadInt(g, n); });
}

bool ReadFloat(const CSettingsGroup& group, const SettingsName& name, float& value)
{
    return ReadIfPresent(group, name, value, [](auto& g, auto& n) { return ReadFloat(g, n); });
}

bool ReadVector(const CSettingsGroup& group, const SettingsName& name, misc::Vector<float>& value)
{
    return ReadIfPresent(group, name, value, [](auto& g, auto& n) { return ReadVector(g, n); });
}

bool ReadColor(const CSettingsGroup& group, const SettingsName& name, graphics::Color& value)
{
    return ReadIfPresent(group, name, value, [](auto& g, auto& n) { return ReadColor(g, n); });
}

bool ReadWString(const CSettingsGroup& group, const SettingsName& name, wstring& value)
{
    return ReadIfPresent(group, name, value, [](auto& g, auto& n) { return ReadWString(g, n); });
}

bool ReadLocalText(const CSettingsGroup& group, const SettingsName& name, wstring& value)
{
    return ReadIfPresent(group, name, value, [](auto& g, auto& n) { return ReadLocalText(g, n); });
}

} // namespace ox::core
