#include "driver/DailyDriver.h"

#include <cstdint>
#include <memory>
#include <string_view>

#include "driver/ActiveAppInfoListener.h"
#include "driver/DailyTasks.h"
#include "platform/Guarded.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr int kMaxFailures = 100;  // of the main loop, in a row
constexpr std::string_view kServiceName = "com.quill.aggregated.vesprun";

void runOption(const char* argument) {
  const std::int32_t today = platform().tallybook().TBDaysSince1970();
  const std::string_view option = argument;
  if (option == "-d") {
    runDayCheck(nullptr);
  } else if (option == "-f") {
    runDailyTasks(dayBefore(today), nullptr);
  } else if (option == "-t") {
    runDailyTasks(today, nullptr);
  } else {
    logMessage(LogLevel::Default, "Unknown arg: %s", argument);
  }
}

void runCommandLine(std::span<const char* const> commandLine) {
  if (commandLine.size() == 1) {
    runListenerMode();
  } else if (commandLine.size() > 1) {
    runOption(commandLine[1]);
  }
}

}  // namespace

void runListenerMode(double quietSeconds) {
  std::unique_ptr<ServiceListener> listener;
  runGuarded([&listener] {
    listener = platform().messageService().createListener(kServiceName, handlePeerMessage);
  });
  auto result = MainLoop::SliceResult::HandledEvent;
  // A failed slice has probably used up its event, such as a message too large to read.
  for (int failures = 0; result == MainLoop::SliceResult::HandledEvent && failures < kMaxFailures;
       ++failures) {
    runGuarded([&] {
      result = platform().mainLoop().runMainLoopSlice(quietSeconds);
      failures = -1;
    });
  }
  if (aaiRequested) {
    logMessage(LogLevel::Default, "never received requested AAI, so moving along without it");
    runDayCheck(nullptr);
  }
}

void runDailyDriver(std::span<const char* const> commandLine) noexcept {
  runGuarded([] { logMessage(LogLevel::Default, "vesprun started"); });
  runGuarded([commandLine] { runCommandLine(commandLine); });
  runGuarded([] { logMessage(LogLevel::Default, "vesprun ended"); });
}

}  // namespace vesprun
