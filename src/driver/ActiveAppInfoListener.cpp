#include "driver/ActiveAppInfoListener.h"

#include <atomic>
#include <string>
#include <string_view>

#include "common/HexText.h"
#include "common/TextForm.h"
#include "driver/DailyTasks.h"
#include "platform/Platform.h"

namespace vesprun {

bool aaiRequested = false;

namespace {

constexpr std::string_view kLoggingNotification = "com.quill.aggregated.vesprun.logging";

enum Operation : std::uint32_t { kLoggingStatus = 0, kDailyTasks = 1, kActiveAppInfo = 2 };

std::atomic_flag gMessageGateClosed;  // for every operation but kActiveAppInfo

std::int64_t integerField(const PropertyDict& dict, std::string_view key) {
  const PropertyValue* value = dict.find(key);
  const Number* number = value != nullptr ? value->number() : nullptr;
  return number != nullptr ? number->asInt64() : 0;
}

std::string textField(const PropertyDict& dict, std::string_view key) {
  const PropertyValue* value = dict.find(key);
  const std::string* text = value != nullptr ? value->string() : nullptr;
  return text != nullptr ? *text : "";
}

std::string uuidField(const PropertyDict& dict, std::string_view key) {
  constexpr std::size_t kLength = 16;
  const PropertyValue* value = dict.find(key);
  const Bytes* bytes = value != nullptr ? value->data() : nullptr;
  if (bytes == nullptr || bytes->size() != kLength) {
    return "";
  }
  std::string text;
  for (std::size_t i = 0; i < kLength; ++i) {
    if (i == 4 || i == 6 || i == 8 || i == 10) {
      text += '-';
    }
    appendHex(text, (*bytes)[i], kUpperHexDigits);
  }
  return text;
}

void takeActiveAppInfo(const PropertyDict& message) {
  const AppInfoList list = appInfoListFromData(message.find("app_data"));
  logMessage(LogLevel::Default, "vesprun got %sAAI:\n%s",
             aaiRequested ? "requested" : "(unsolicited -- so ignoring) ", textForm(list).c_str());
  if (aaiRequested) {
    runDayCheck(&list);
    aaiRequested = false;
  }
}

void requestActiveAppInfo() {
  aaiRequested = true;
  platform().notificationCenter().PostNotification(kLoggingNotification);
  logMessage(LogLevel::Default, "notified of logging status, waiting for activate app info");
}

}  // namespace

AppInfoList appInfoListFromData(const PropertyValue* appData) {
  AppInfoList list;
  const PropertyArray* elements = appData != nullptr ? appData->array() : nullptr;
  if (elements == nullptr) {
    return list;
  }
  list.reserve(elements->size());
  for (const PropertyValue& element : *elements) {
    if (const PropertyDict* app = element.dict()) {
      list.emplace_back(PropertyDict{{"bundle", textField(*app, "bundle_id")},
                                     {"version", textField(*app, "version")},
                                     {"adamID", integerField(*app, "adam_id")},
                                     {"arch", integerField(*app, "arch")},
                                     {"uuid", uuidField(*app, "uuid")}});
    }
  }
  return list;
}

void handlePeerMessage(const PropertyValue& message) {
  const PropertyDict* dict = message.dict();
  if (dict == nullptr) {
    return;
  }
  const auto operation = static_cast<std::uint32_t>(integerField(*dict, "operation"));
  if (operation == kActiveAppInfo) {
    takeActiveAppInfo(*dict);
  } else if (!gMessageGateClosed.test_and_set()) {
    if (operation == kLoggingStatus) {
      requestActiveAppInfo();
    } else if (operation == kDailyTasks) {
      runDailyTasks(static_cast<std::int32_t>(integerField(*dict, "value")), nullptr);
    }
  }
}

void handleNewPeer(PeerConnection& peer) {
  peer.setMessageHandler(handlePeerMessage);
  peer.start();
}

void startActiveAppInfoAfresh() {
  aaiRequested = false;
  gMessageGateClosed.clear();
}

}  // namespace vesprun
