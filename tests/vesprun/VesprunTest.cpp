#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <functional>
#include <thread>

#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;

constexpr const char* kService = "com.quill.aggregated.vesprun";
constexpr std::string_view kDescription =
    R"({"clock": "2024-03-05T09:15:02Z", "submission": {"enabled": false},
        "system": {"buildVersion": "2B"},
        "kernel": {"variables": {"kern.bootsessionuuid": "1"}}})";

const std::string kStarted = "default: vesprun started";
const std::string kEnded = "default: vesprun ended";
const std::string kNotified = "default: notified of logging status, waiting for activate app info";
const std::string kOSChange = "default: OS change since last run ((null) -> 2B)";
const std::string kYesterdaysTasks = "default: daily tasks for day 19786";

/// The program itself, started with one argument or none in a device directory.
class Process {
 public:
  explicit Process(const char* argument = nullptr, std::string_view description = kDescription)
      : device("{}") {
    device.endProcess();
    device.write("device.json", description);
    _child = fork();
    if (_child == 0) {
      if (chdir(device.path().c_str()) == 0) {
        execl(VESPRUN_PROGRAM, "vesprun", argument, nullptr);
      }
      _exit(1);
    }
  }

  /// The exit status; -1 when a signal ended the process.
  int wait() const {
    int status = -1;
    waitpid(_child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }

  /// Connects to the service and sends an operation.
  void send(int operation) {
    std::string error;
    ASSERT_TRUE(comesTrue([&] { return device.exists(std::string("run/") + kService); }));
    if (!_peer.isOpen()) {
      const auto directory = DeviceDirectory::open(device.path(), error);
      _peer = connectToService(directory.value(), kService, 5, error);
      ASSERT_TRUE(_peer.isOpen()) << error;
    }
    std::string document;
    ASSERT_TRUE(writePtree(PropertyDict{{"operation", operation}}, document, error)) << error;
    const std::string frame = messageFrame(document).value();
    ASSERT_EQ(::send(_peer.get(), frame.data(), frame.size(), MSG_NOSIGNAL),
              static_cast<ssize_t>(frame.size()));
  }

  bool isNotified() {
    return comesTrue([this] { return device.lines("notifications.jsonl").size() == 1; });
  }

  std::optional<PropertyValue> storedDay() {
    const auto day = device.platform().preferences().LGSPreferencesGetValue(
        "LastCrashLogSerializationDateInDaysSince1970", kService);
    device.endProcess();
    return day;
  }

  TestDevice device;

 private:
  /// Within 30 seconds.
  static bool comesTrue(const std::function<bool()>& condition) {
    for (int tries = 0; tries < 3000 && !condition(); ++tries) {
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return condition();
  }

  pid_t _child = -1;
  FileDescriptor _peer;
};

TEST(Vesprun, RunsWhatItsArgumentSays) {
  const PropertyValue yesterday(TestDevice::kToday - 1);
  const std::string kUnknown = "default: Unknown arg: --help";
  const struct {
    const char* argument;
    std::string says;
    std::optional<PropertyValue> storedDay;
  } kCases[] = {{"-d", kYesterdaysTasks, yesterday},
                {"-f", kYesterdaysTasks, std::nullopt},
                {"-t", "default: daily tasks for day 19787", std::nullopt},
                {"--help", kUnknown, std::nullopt}};
  for (const auto& [argument, says, storedDay] : kCases) {
    Process process(argument);
    EXPECT_EQ(process.wait(), 0) << argument;
    std::vector<std::string> log{kStarted, says, kEnded};
    if (says != kUnknown) {
      log.insert(log.end() - 1, kOSChange);
    }
    EXPECT_EQ(process.device.log(), log) << argument;
    EXPECT_EQ(process.storedDay(), storedDay) << argument;
  }
}

TEST(Vesprun, ExitsWithZeroWhereNoDeviceIs) {
  ::testing::internal::CaptureStderr();
  Process process("-d", "{");
  EXPECT_EQ(process.wait(), 0);
  EXPECT_THAT(::testing::internal::GetCapturedStderr(),
              ::testing::StartsWith("vesprun: ./device.json: "));
}

TEST(Vesprun, ListensUntilTenSecondsWereQuiet) {
  const auto start = std::chrono::steady_clock::now();
  Process unasked;
  Process unserved;
  Process served;
  unserved.send(0);
  served.send(0);
  EXPECT_TRUE(unserved.isNotified());
  EXPECT_TRUE(served.isNotified());
  served.send(2);
  for (Process* process : {&unasked, &unserved, &served}) {
    EXPECT_EQ(process->wait(), 0);
    EXPECT_THAT(process->device.names("run"), IsEmpty()) << "the service is no longer offered";
  }
  EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::seconds(10));
  EXPECT_THAT(unasked.device.log(), ElementsAre(kStarted, kEnded));
  EXPECT_THAT(unserved.device.log(),
              ElementsAre(kStarted, kNotified,
                          "default: never received requested AAI, so moving along without it",
                          kYesterdaysTasks, kOSChange, kEnded));
  EXPECT_THAT(served.device.log(),
              ElementsAre(kStarted, kNotified, "default: vesprun got requestedAAI:\n()",
                          kYesterdaysTasks, kOSChange, kEnded));
  const PropertyValue yesterday(TestDevice::kToday - 1);
  EXPECT_EQ(unasked.storedDay(), std::nullopt);
  EXPECT_EQ(unserved.storedDay(), yesterday);
  EXPECT_EQ(served.storedDay(), yesterday);
}

}  // namespace
}  // namespace vesprun
