#include "platform/host/HostClock.h"

#include <stdlib.h>
#include <time.h>
#include <unistd.h>

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

bool useTimeZone(const std::optional<std::string>& name) {
  if (!name) {
    unsetenv("TZ");
  } else {
    // The C library takes an unknown zone for UTC without a word.
    const bool isPath = name->empty() || name->front() == '/' || name->front() == '.' ||
                        name->find("..") != std::string::npos;
    if (isPath || (*name != "UTC" && access(("/usr/share/zoneinfo/" + *name).c_str(), R_OK) != 0)) {
      return false;
    }
    setenv("TZ", name->c_str(), 1);
  }
  tzset();
  return true;
}

}  // namespace vesprun
