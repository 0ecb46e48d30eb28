#include "platform/host/HostClock.h"

#include <stdlib.h>
#include <time.h>

#include "platform/host/WholeFile.h"

namespace vesprun {

Date HostClock::now() {
  if (_standingStillAt) {
    return *_standingStillAt;
  }
  timespec time{};
  clock_gettime(CLOCK_REALTIME, &time);
  return {time.tv_sec, static_cast<std::uint32_t>(time.tv_nsec)};
}

std::string HostClock::localDateText(const Date& date) {
  const time_t seconds = date.seconds;
  tm local{};
  localtime_r(&seconds, &local);
  char text[64];
  return {text, strftime(text, sizeof text, "%Y-%m-%d %H:%M:%S %z", &local)};
}

namespace {

/// Is there a zone of that name in the time-zone database, which has other files and folders, too?
bool isTimeZone(const std::string& name) {
  const bool isPath = name.empty() || name.front() == '/' || name.front() == '.' ||
                      name.find("..") != std::string::npos;
  std::string error;
  const std::optional<std::string> zone =
      isPath ? std::nullopt : readWholeFile("/usr/share/zoneinfo/" + name, error);
  return zone && zone->starts_with("TZif");
}

}  // namespace

bool useTimeZone(const std::optional<std::string>& name) {
  if (!name) {
    unsetenv("TZ");
  } else {
    // The C library takes an unknown zone for UTC without a word.
    if (*name != "UTC" && !isTimeZone(*name)) {
      return false;
    }
    setenv("TZ", name->c_str(), 1);
  }
  tzset();
  return true;
}

}  // namespace vesprun
