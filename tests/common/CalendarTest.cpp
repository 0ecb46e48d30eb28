#include "common/Calendar.h"

#include <gtest/gtest.h>
#include <limits>

namespace vesprun {
namespace {

TEST(Calendar, TextRoundTripsAtTheEdgesOfTheCalendar) {
  for (const char* text :
       {"1970-01-01T00:00:00Z", "1969-12-31T23:59:59.999999999Z", "2000-02-29T12:00:00Z",
        "2024-03-05T09:15:02.25Z", "0000-03-01T00:00:00Z", "-0001-12-31T00:00:00Z",
        "12345-06-07T08:09:10Z"}) {
    const std::optional<Date> date = parseDateText(text);
    ASSERT_TRUE(date) << text;
    EXPECT_EQ(dateText(*date), text);
  }
}

TEST(Calendar, EveryDayNumberRoundTrips) {
  for (std::int64_t day = std::numeric_limits<std::int32_t>::min();
       day <= std::numeric_limits<std::int32_t>::max(); day += 1'000'003) {
    const Date start = startOfDay(static_cast<std::int32_t>(day));
    EXPECT_EQ(daysSince1970(start), day);
    EXPECT_EQ(daysSince1970({start.seconds + kSecondsPerDay - 1, 999'999'999}), day);
    EXPECT_EQ(parseDateText(dateText(start)), start) << dateText(start);
  }
  EXPECT_EQ(dateText(startOfDay(19787)), "2024-03-05T00:00:00Z");
}

TEST(Calendar, RefusesWhatIsNoDate) {
  for (const char* text :
       {"", "2024-03-05", "2024-03-05T09:15:02", "2024-02-30T00:00:00Z", "2023-02-29T00:00:00Z",
        "2024-13-01T00:00:00Z", "2024-00-01T00:00:00Z", "2024-01-01T24:00:00Z",
        "2024-01-01T00:60:00Z", "2024-01-01T00:00:60Z", "2024-01-01T00:00:00.Z",
        "2024-01-01T00:00:00.1234567890Z", "2024-01-01T00:00:00Z ", "24-01-01T00:00:00Z",
        "+2024-01-01T00:00:00Z", "99999999-01-01T00:00:00Z", "999999999-01-01T00:00:00Z"}) {
    EXPECT_FALSE(parseDateText(text)) << text;
  }
}

}  // namespace
}  // namespace vesprun
