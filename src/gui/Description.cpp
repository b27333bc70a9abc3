#include "gui/Description.h"

#include "core/SettingsReaders.h"
#include "diag/Log.h"

#include <boost/lexical_cast.hpp>

#include <algorithm>
#include <cmath>

namespace ox::gui {

std::string DescribeElement(const core::CSettingsGroup& node)
{
    std::string text = "<" + node.GetId().str();
    const std::string& id = node.GetValue("id");
    if (!id.empty())
        text += " id=\"" + id + "\"";
    return text + ">";
}

void ReportElement(const core::CSettingsGroup& node, const char* what, const std::string& detail)
{
    OX_LOG("gui", diag::LogWarning, "%s: %s%s", DescribeElement(node).c_str(), what, detail.c_str());
}

namespace {

template <class T, class Parse>
bool ReadNumber(const core::CSettingsGroup& node, const char* name, T& value, T min, T max, Parse parse)
{
    if (!node.IsValue(name))
        return false;
    const std::string& text = node.GetValue(name);
    T read {};
    try {
        read = parse(text);
    } catch (const boost::bad_lexical_cast&) {
        ReportElement(node, "not a number, ignored: ", std::string(name) + "=\"" + text + "\"");
        return false;
    }
    if constexpr (std::is_floating_point_v<T>) {
        if (!std::isfinite(read)) {
            ReportElement(node, "not a finite number, ignored: ", std::string(name) + "=\"" + text + "\"");
            return false;
        }
    }
    if (read < min || read > max) {
        read = std::clamp(read, min, max);
        ReportElement(node, "out of range, clamped: ",
                      std::string(name) + "=\"" + text + "\" to " + boost::lexical_cast<std::string>(read));
    }
    value = read;
    return true;
}

} // namespace

bool ReadChecked(const core::CSettingsGroup& node, const char* name, float& value, float min, float max)
{
    return ReadNumber(node, name, value, min, max, core::ParseSettingsFloat);
}

bool ReadChecked(const core::CSettingsGroup& node, const char* name, int& value, int min, int max)
{
    return ReadNumber(node, name, value, min, max, core::ParseSettingsInt);
}

void ReadInsets(const core::CSettingsGroup& group, misc::FloatInsets& insets)
{
    insets = {};
    ReadChecked(group, "left", insets.Left, 0, kMaxDescriptionSize);
    ReadChecked(group, "right", insets.Right, 0, kMaxDescriptionSize);
    ReadChecked(group, "top", insets.Top, 0, kMaxDescriptionSize);
    ReadChecked(group, "bottom", insets.Bottom, 0, kMaxDescriptionSize);
}

} // namespace ox::gui
