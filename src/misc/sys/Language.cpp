#include "misc/sys/Language.h"

#include <cstdlib>
#include <cstring>

namespace ox::misc::sys {

std::string LanguageFromLocale(const char* locale)
{
    if (!locale || !*locale)
        return {};
    std::string name(locale);
    if (name == "C" || name == "POSIX" || name.rfind("C.", 0) == 0)
        return "en";
    name = name.substr(0, name.find_first_of("_.@"));
    if (name.empty() || name.size() >= kLanguageCapacity)
        return {};
    for (char c : name) {
        bool allowed = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '-';
        if (!allowed)
            return {};
    }
    return name;
}

bool GetCurrentUserPreferredLanguage(char* buffer, size_t capacity)
{
    if (!buffer || capacity == 0)
        return false;
    buffer[0] = 0;
    const char* locale = nullptr;
    for (const char* variable : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
        const char* value = getenv(variable);
        if (value && *value) {
            locale = value;
            break;
        }
    }
    std::string language = LanguageFromLocale(locale ? locale : "C");
    if (language.empty() || language.size() + 1 > capacity)
        return false;
    memcpy(buffer, language.c_str(), language.size() + 1);
    return true;
}

} // namespace ox::misc::sys
