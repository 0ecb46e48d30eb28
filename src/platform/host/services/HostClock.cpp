#include "platform/host/services/HostClock.h"

#include <stdlib.h>
#include <time.h>

#include <cstdlib>

#include "platform/host/files/Files.h"

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

ProcessTimeZone::~ProcessTimeZone() {
  if (_isSet) {
    _before ? setenv("TZ", _before->c_str(), 1) : unsetenv("TZ");
    tzset();
  }
}

bool ProcessTimeZone::set(const std::string& name) {
  // The C library silently takes an unknown zone for UTC.
  const bool isPath = name.empty() || name.front() == '/' || name.front() == '.' ||
                      name.find("..") != std::string::npos || name.find('\0') != std::string::npos;
  std::string error;
  if (isPath ||
      (name != "UTC" &&
       !readWholeFile("/usr/share/zoneinfo/" + name, error).value_or("").starts_with("TZif"))) {
    return false;
  }
  if (!_isSet) {
    const char* before = std::getenv("TZ");
    _before = before != nullptr ? std::optional<std::string>(before) : std::nullopt;
    _isSet = true;
  }
  setenv("TZ", name.c_str(), 1);
  tzset();
  return true;
}

}  // namespace vesprun
