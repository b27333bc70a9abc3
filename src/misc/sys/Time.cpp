#include "misc/sys/Time.h"

#include "diag/Assert.h"

#include <clocale>
#include <cstdio>
#include <locale.h>

// %x is the user's own short date form, whatever it does with the year.
#pragma GCC diagnostic ignored "-Wformat-y2k"

namespace ox::misc::sys {

std::string FormatTimeStamp(time_t time)
{
    struct tm local {};
    localtime_r(&time, &local);
    char buffer[64];
    snprintf(buffer, sizeof buffer, "%04d.%02d.%02d.%02d.%02d.%02d", local.tm_year, local.tm_mon, local.tm_mday,
             local.tm_hour, local.tm_min, local.tm_sec);
    return buffer;
}

bool ParseTimeStamp(const std::string& text, time_t& result)
{
    struct tm local {};
    if (sscanf(text.c_str(), "%d.%d.%d.%d.%d.%d", &local.tm_year, &local.tm_mon, &local.tm_mday, &local.tm_hour,
               &local.tm_min, &local.tm_sec) != 6)
        return false;
    local.tm_isdst = -1;
    time_t t = mktime(&local);
    if (t == static_cast<time_t>(-1))
        return false;
    result = t;
    return true;
}

std::string FormatShortDate(time_t time)
{
    struct tm local {};
    localtime_r(&time, &local);
    char buffer[64];
    // The user's date form without touching the process locale (numbers stay with ".").
    locale_t user = newlocale(LC_TIME_MASK, "", static_cast<locale_t>(0));
    size_t result = user ? strftime_l(buffer, sizeof buffer, "%x", &local, user)
                         : strftime(buffer, sizeof buffer, "%x", &local);
    if (user)
        freelocale(user);
    OX_ASSERT(result > 0);
    return result > 0 ? std::string(buffer, result) : std::string();
}

} // namespace ox::misc::sys
