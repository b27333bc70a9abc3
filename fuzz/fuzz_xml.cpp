// Feeds arbitrary bytes to the XML event parser (all callbacks, reading every name, value and
// text it hands out) and to a settings load, then walks and copies the tree. The names the
// trees made must go with them.
#include "core/Settings.h"
#include "core/SettingsReaders.h"
#include "misc/XmlParser.h"

#include <cstdint>
#include <cstring>
#include <vector>

namespace {

// Touches every byte a callback is given, so that a read outside the buffer is caught.
volatile unsigned g_Sink;

void Touch(const char* data, size_t length)
{
    unsigned sum = 0;
    for (size_t i = 0; i < length; ++i)
        sum += static_cast<unsigned char>(data[i]);
    g_Sink = g_Sink + sum;
}

void Walk(const ox::core::CSettingsGroup& group, int depth)
{
    for (unsigned i = 0; i < group.EnumAttributes(); ++i) {
        const auto& name = group.GetAttribute(i);
        Touch(group.GetValue(name).data(), group.GetValue(name).size());
        try {
            (void)ox::core::ReadInt(group, name);
        } catch (const std::exception&) {
        }
        (void)ox::core::ReadColor(group, name);
        (void)ox::core::ReadVector(group, name);
    }
    if (depth < 80)
        for (const auto& child : group.GetChildren())
            Walk(*child, depth + 1);
    (void)group.GetNextSibling();
}

void Exercise(const uint8_t* data, size_t size)
{
    // An exact copy: a read one byte past the input is caught by the sanitizer.
    std::vector<char> bytes(data, data + size);
    const char* text = bytes.empty() ? "" : bytes.data();

    ox::misc::XmlParseProblem problem;
    ox::misc::ParseXml(
        text, bytes.size(), nullptr,
        [](void*, ox::misc::XmlRecord* s, int d) { Touch(s[d].name, s[d].nameLength); },
        [](void*, ox::misc::XmlRecord*, int, const char* n, size_t nl, const char* v, size_t vl, bool) {
            Touch(n, nl);
            Touch(v, vl);
        },
        [](void*, ox::misc::XmlRecord* s, int d) { Touch(s[d].name, s[d].nameLength); },
        [](void*, ox::misc::XmlRecord* s, int d) { Touch(s[d].name, s[d].nameLength); },
        [](void*, ox::misc::XmlRecord* s, int d, bool) { Touch(s[d].text, s[d].textLength); }, &problem);

    ox::core::CSettings settings;
    settings.LoadXmlFromMemory(text, bytes.size(), "fuzz.xml");
    Walk(settings, 0);
    ox::core::CSettings copy;
    settings.CopyTo(copy);
    (void)copy.GetChild("scene", true).GetNamedChild("hero", true).GetValue("name");
}

} // namespace

// Names the trees of one input made go with them: what exists after an input is what
// existed before the first.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    static const size_t ids = (ox::core::EmptyId(), ox::core::IdCount());
    Exercise(data, size);
    if (ox::core::IdCount() != ids)
        __builtin_trap();
    return 0;
}
