#include "platform/host/services/HostClock.h"

#include <stdlib.h>
#include <time.h>

#include <cstdlib>
#include <mutex>

#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

std::mutex gTimeZoneMutex;

/// Another zone in TZ as long as the object lives.
class TimeZoneForAWhile {
 public:
  explicit TimeZoneForAWhile(const std::string& name) : _guard(gTimeZoneMutex) {
    if (const char* before = std::getenv("TZ")) {
      _before = before;
    }
    setenv("TZ", name.c_str(), 1);
    tzset();
  }
  ~TimeZoneForAWhile() {
    _before ? setenv("TZ", _before->c_str(), 1) : unsetenv("TZ");
    tzset();
  }
  TimeZoneForAWhile(const TimeZoneForAWhile&) = delete;
  TimeZoneForAWhile& operator=(const TimeZoneForAWhile&) = delete;

 private:
  std::scoped_lock<std::mutex> _guard;
  std::optional<std::string> _before;
};

}  // namespace

Date HostClock::now() {
  if (_standingStillAt) {
    return *_standingStillAt;
  }
  timespec time{};
  clock_gettime(CLOCK_REALTIME, &time);
  return {time.tv_sec, static_cast<std::uint32_t>(time.tv_nsec)};
}

std::string HostClock::localDateText(const Date& date) {
  std::optional<TimeZoneForAWhile> zone;
  if (_timeZone) {
    zone.emplace(*_timeZone);
  }
  const time_t seconds = date.seconds;
  tm local{};
  localtime_r(&seconds, &local);
  char text[64];
  return {text, strftime(text, sizeof text, "%Y-%m-%d %H:%M:%S %z", &local)};
}

bool isTimeZone(const std::string& name) {
  // The C library silently takes an unknown zone for UTC.
  const bool isPath = name.empty() || name.front() == '/' || name.front() == '.' ||
                      name.find("..") != std::string::npos || name.find('\0') != std::string::npos;
  std::string error;
  return !isPath &&
         (name == "UTC" ||
          readWholeFile("/usr/share/zoneinfo/" + name, error).value_or("").starts_with("TZif"));
}

}  // namespace vesprun
