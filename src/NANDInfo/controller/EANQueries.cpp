#include "NANDInfo/controller/EANQueries.h"

#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr const char* kServiceClass = "QuillNVMeEAN";

struct Query {
  std::uint32_t method;
  const char* name;      ///< in the text of a connection that failed
  const char* callName;  ///< in the text of a call that failed
};

constexpr Query kImageSize{3, "GetEANImageSize", "GetImageSize"};
constexpr Query kUpdateCount{7, "GetEANUpdateCount", "GetUpdateCount"};

/// The character of a code at `index`, 0 being the first.
int character(std::uint32_t code, unsigned index) {
  return static_cast<int>(code >> (24 - 8 * index) & 0xFF);
}

std::uint64_t ask(const Query& query, std::uint32_t code) {
  EANConnection ean;
  if (!getEANConnection(ean)) {
    logMessage(LogLevel::Default,
               "%s: Unable to get EAN Io service connection for key (%u): %c%c%c%c\n", query.name,
               code, character(code, 0), character(code, 1), character(code, 2),
               character(code, 3));
    return 0;
  }
  DeviceRegistry& registry = platform().deviceRegistry();
  std::uint64_t answer = 0;
  const RegistryResult result =
      registry.DevRegConnectCallScalarMethod(ean.connection, query.method, code, answer);
  if (result != kRegistrySuccess) {
    logMessage(LogLevel::Default,
               "%s: DevRegConnectCallMethod failed (key (%u): %c%c%c%c) kernResult:%x\n",
               query.callName, code, character(code, 0), character(code, 1), character(code, 2),
               character(code, 3), result);
    answer = 0;
  }
  registry.DevRegServiceClose(ean.connection);
  return answer;
}

}  // namespace

bool getEANConnection(EANConnection& ean) {
  DeviceRegistry& registry = platform().deviceRegistry();
  RegistryObject service(registry.DevRegServiceGetMatchingService(kServiceClass));
  if (!service) {
    logMessage(LogLevel::Default, "getEANConnection: Couldn't find QuillNVMeEAN object\n");
    return false;
  }
  if (const RegistryResult result = registry.DevRegServiceOpen(service.get(), ean.connection)) {
    logMessage(LogLevel::Default,
               "getEANConnection: DevRegServiceOpen on QuillNVMeEAN failed kernResult:%x\n",
               result);
    return false;
  }
  ean.service = std::move(service);
  return true;
}

std::uint64_t GetEANImageSize(std::uint32_t code) { return ask(kImageSize, code); }

std::uint64_t GetEANUpdateCount(std::uint32_t code) { return ask(kUpdateCount, code); }

}  // namespace vesprun
