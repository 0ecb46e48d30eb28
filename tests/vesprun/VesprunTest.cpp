#include <gmock/gmock.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <functional>
#include <thread>

#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

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
      if (description == kDescription) {
        close(STDERR_FILENO);  // the system log takes its number, but not what is printed
      }
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

  /// Sends what the arguments of `vespctl send DIR` say, once the service is offered.
  void send(const std::string& arguments) {
    ASSERT_TRUE(comesTrue([&] { return device.exists(std::string("run/") + kService); }));
    const std::string command = VESPCTL_PROGRAM " -C " + device.path() + " send " + arguments;
    EXPECT_EQ(std::system(command.c_str()), 0) << command;
  }

  bool isNotified() {
    return comesTrue([this] { return device.lines("notifications.jsonl").size() == 1; });
  }

  std::optional<PropertyValue> storedDay() {
    auto day = device.platform().preferences().LGSPreferencesGetValue(
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
};

TEST(Vesprun, LooksAtItsArgument) {
  const Process process("--help");
  EXPECT_EQ(process.wait(), 0);
  EXPECT_THAT(process.device.log(), ElementsAre(kStarted, "default: Unknown arg: --help", kEnded));
}

TEST(Vesprun, ExitsWithZeroWhereNoDeviceIs) {
  ::testing::internal::CaptureStderr();
  Process process("-d", "{");
  EXPECT_EQ(process.wait(), 0);
  EXPECT_THAT(::testing::internal::GetCapturedStderr(),
              ::testing::StartsWith("vesprun: ./device.json: "));
}

TEST(Vesprun, HasTheRightsOfTheDevicesOwner) {
  if (geteuid() != 0) {
    GTEST_SKIP() << "only root has other rights";
  }
  TestDevice device("{}");
  device.endProcess();
  const std::string run = "cd " + device.path() + " && chown -R 12345:12345 . && " VESPRUN_PROGRAM;
  const char* const others =
      "test \"$(find . ! -user 12345; stat -c %u outbox/log.jsonl)\" = 12345";
  EXPECT_EQ(std::system((run + " -d && " + others).c_str()), 0);
}

TEST(Vesprun, ListensUntilTenSecondsWereQuiet) {
  const auto start = std::chrono::steady_clock::now();
  Process unasked;
  Process unserved;
  Process served;
  Process asked;
  Process supplied;
  unserved.send("logging");
  EXPECT_TRUE(unserved.isNotified());
  served.device.write("apps", R"([{"bundle_id": "a", "version": "2", "arch": 5}])");
  served.send("session " + served.device.path("apps"));
  EXPECT_TRUE(served.isNotified());
  asked.send("daily 19780");
  supplied.device.write("apps", "[]");
  supplied.send("apps " + supplied.device.path("apps"));
  supplied.device.write("message", "<ptree version=\"1.0\"><integer>1</integer></ptree>");
  supplied.send("raw - <" + supplied.device.path("message"));
  for (Process* process : {&unasked, &unserved, &served, &asked, &supplied}) {
    EXPECT_EQ(process->wait(), 0);
    EXPECT_THAT(process->device.names("run"), IsEmpty()) << "the service is no longer offered";
  }
  EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::seconds(10));
  EXPECT_THAT(unasked.device.log(), ElementsAre(kStarted, kEnded));
  EXPECT_THAT(unserved.device.log(),
              ElementsAre(kStarted, kNotified,
                          "default: never received requested AAI, so moving along without it",
                          kYesterdaysTasks, kOSChange, kEnded));
  EXPECT_THAT(served.device.log(), ElementsAre(kStarted, kNotified,
                                               "default: vesprun got requestedAAI:\n({bundle = a; "
                                               "version = 2; adamID = 0; arch = 5; uuid = })",
                                               kYesterdaysTasks, kOSChange, kEnded));
  EXPECT_THAT(asked.device.log(),
              ElementsAre(kStarted, "default: daily tasks for day 19780", kOSChange, kEnded));
  EXPECT_THAT(
      supplied.device.log(),
      ElementsAre(kStarted, "default: vesprun got (unsolicited -- so ignoring) AAI:\n()", kEnded));
  const PropertyValue yesterday(TestDevice::kToday - 1);
  EXPECT_EQ(unasked.storedDay(), std::nullopt);
  EXPECT_EQ(unserved.storedDay(), yesterday);
  EXPECT_EQ(served.storedDay(), yesterday);
}

}  // namespace
}  // namespace vesprun
