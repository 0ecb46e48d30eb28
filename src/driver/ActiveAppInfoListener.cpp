#include "driver/ActiveAppInfoListener.h"

#include <atomic>
#include <string>
#include <string_view>
#include <utility>

#include "common/AppInfoList.h"
#include "common/ProcessState.h"
#include "common/TextForm.h"
#include "driver/DailyTasks.h"
#include "platform/Guarded.h"
#include "platform/Platform.h"

namespace vesprun {

bool aaiRequested = false;

namespace {

constexpr std::string_view kLoggingNotification = "com.quill.aggregated.vesprun.logging";

enum Operation : std::uint32_t { kLoggingStatus = 0, kDailyTasks = 1, kActiveAppInfo = 2 };

std::atomic_flag gMessageGateClosed;  // for every operation but kActiveAppInfo

const ProcessState kMessageState([] {
  aaiRequested = false;
  gMessageGateClosed.clear();
});

void appendTextForm(const AppInfoList& list, std::string& text) {
  const char* separator = "(";
  list.forEach([&](const PropertyDict& app) {
    text += std::exchange(separator, ", ") + textForm(PropertyValue(app));
    return true;
  });
  text += *separator == '(' ? "()" : ")";
}

void takeActiveAppInfo(const PropertyDict& message) {
  const AppInfoList list(message.find("app_data"));
  if (SystemLog& log = platform().systemLog(); log.keeps(LogLevel::Default)) {
    std::string text = "vesprun got ";
    text += aaiRequested ? "requested" : "(unsolicited -- so ignoring) ";
    text += "AAI:\n";
    appendTextForm(list, text);
    log.write(LogLevel::Default, text);
  }
  if (aaiRequested) {
    // Served whatever becomes of the check: another one would do the day's work again.
    runGuarded([&list] { runDayCheck(&list); });
    aaiRequested = false;
  }
}

void requestActiveAppInfo() {
  aaiRequested = true;
  platform().eventHub().PostNotification(kLoggingNotification);
  logMessage(LogLevel::Default, "notified of logging status, waiting for activate app info");
}

void handle(const PropertyDict& message) {
  const auto operation = static_cast<std::uint32_t>(message.integerOr("operation", 0));
  if (operation == kActiveAppInfo) {
    takeActiveAppInfo(message);
  } else if (!gMessageGateClosed.test_and_set()) {
    if (operation == kLoggingStatus) {
      requestActiveAppInfo();
    } else if (operation == kDailyTasks) {
      runDailyTasks(static_cast<std::int32_t>(message.integerOr("value", 0)), nullptr);
    }
  }
}

}  // namespace

void handlePeerMessage(const PropertyValue& message) noexcept {
  if (const PropertyDict* dict = message.dict()) {
    runGuarded([dict] { handle(*dict); });
  }
}

}  // namespace vesprun
