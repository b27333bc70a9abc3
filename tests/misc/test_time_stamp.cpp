#include "misc/sys/Time.h"
#include "support/TestSupport.h"

using namespace ox::misc::sys;

TEST(TimeStamp, BrokenDownFieldsRoundTrip)
{
    oxtest::ScopedEnv tz("TZ", "UTC");
    tzset();
    time_t t = 1795000000; // 2026-11-18 11:06:40 UTC
    std::string text = FormatTimeStamp(t);
    EXPECT_EQ(text, "0126.10.18.11.06.40") << "year from 1900, month from 0";
    time_t back = 0;
    ASSERT_TRUE(ParseTimeStamp(text, back));
    EXPECT_EQ(back, t);
    EXPECT_FALSE(ParseTimeStamp("not a date", back));
    EXPECT_FALSE(FormatShortDate(t).empty());
}
