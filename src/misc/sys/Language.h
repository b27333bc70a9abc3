#pragma once
// The language the user wants the program in, as an ISO 639 code such as "en".
#include <cstddef>
#include <string>

namespace ox::misc::sys {

// The capacity of a language code buffer, terminator included.
constexpr size_t kLanguageCapacity = 64;

// The language of a POSIX locale name: "ru_RU.UTF-8" gives "ru", "C" and "POSIX" give
// "en". Empty for an empty name or one that is not letters, digits and "-" before the
// territory, codeset or modifier.
std::string LanguageFromLocale(const char* locale);

// Reads the messages locale the way the C library would pick it (LC_ALL, then
// LC_MESSAGES, then LANG; the first that is set and not empty), without touching the
// process locale. With none set the C locale applies, which is English. False, with an
// empty buffer, when no language can be made of it.
bool GetCurrentUserPreferredLanguage(char* buffer, size_t capacity);

} // namespace ox::misc::sys
