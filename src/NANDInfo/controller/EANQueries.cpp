#include "NANDInfo/controller/EANQueries.h"

#include "platform/RegistryObject.h"

namespace vesprun {
namespace {

constexpr const char* kServiceClass = "QuillNVMeEAN";
constexpr std::uint32_t kImageSizeMethod = 3;
constexpr std::uint32_t kUpdateCountMethod = 7;

/// The service and the connection to it, closed at the end.
struct EANConnection {
  RegistryObject service{};
  RegistryHandle connection = 0;

  ~EANConnection() {
    if (connection != 0) {
      platform().deviceRegistry().DevRegServiceClose(connection);
    }
  }
};

bool getEANConnection(EANConnection& ean) {
  DeviceRegistry& registry = platform().deviceRegistry();
  ean.service = RegistryObject(registry.DevRegServiceGetMatchingService(kServiceClass));
  if (!ean.service) {
    logMessage(LogLevel::Default, "getEANConnection: Couldn't find QuillNVMeEAN object\n");
    return false;
  }
  if (const RegistryResult result = registry.DevRegServiceOpen(ean.service.get(), ean.connection)) {
    logMessage(LogLevel::Default,
               "getEANConnection: DevRegServiceOpen on QuillNVMeEAN failed kernResult:%x\n",
               result);
    return false;
  }
  return true;
}

/// `name` and `callName` are for the log lines of the two failures.
std::uint64_t ask(std::uint32_t method, const char* name, const char* callName,
                  std::uint32_t code) {
  const char key[] = {static_cast<char>(code >> 24), static_cast<char>(code >> 16),
                      static_cast<char>(code >> 8), static_cast<char>(code)};
  EANConnection ean;
  if (!getEANConnection(ean)) {
    logMessage(LogLevel::Default,
               "%s: Unable to get EAN Io service connection for key (%u): %.4s\n", name, code, key);
    return 0;
  }
  std::uint64_t answer = 0;
  const RegistryResult result = platform().deviceRegistry().DevRegConnectCallScalarMethod(
      ean.connection, method, code, answer);
  if (result != kRegistrySuccess) {
    logMessage(LogLevel::Default,
               "%s: DevRegConnectCallMethod failed (key (%u): %.4s) kernResult:%x\n", callName,
               code, key, result);
    return 0;
  }
  return answer;
}

}  // namespace

std::uint64_t GetEANImageSize(std::uint32_t code) {
  return ask(kImageSizeMethod, "GetEANImageSize", "GetImageSize", code);
}

std::uint64_t GetEANUpdateCount(std::uint32_t code) {
  return ask(kUpdateCountMethod, "GetEANUpdateCount", "GetUpdateCount", code);
}

}  // namespace vesprun
