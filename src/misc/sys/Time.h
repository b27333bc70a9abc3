#pragma once
// Real dates: the stamp form used in saves and its parsing, and a short date for display.
#include <ctime>
#include <string>

namespace ox::misc::sys {

// Local time as "yyyy.mm.dd.hh.mm.ss", with the year counted from 1900 and the month
// from 0, as they stand in a broken-down time.
std::string FormatTimeStamp(time_t time);
// The inverse; false if the text does not parse or the date does not convert.
bool ParseTimeStamp(const std::string& text, time_t& result);
// The date in the user's short date form (their LC_TIME), at most 63 characters.
std::string FormatShortDate(time_t time);

} // namespace ox::misc::sys
