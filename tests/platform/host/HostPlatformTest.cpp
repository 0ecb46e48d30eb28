#include "platform/host/HostPlatform.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/syscall.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <future>
#include <set>
#include <stdexcept>
#include <thread>

#include "support/HostServiceTest.h"
#include "support/TestDevice.h"

namespace {

bool timesCannotBeSet = false;

}  // namespace

// In place of the C library's.
extern "C" int futimens(int file, const timespec* times) {
  return timesCannotBeSet ? -1 : static_cast<int>(syscall(SYS_utimensat, file, nullptr, times, 0));
}

namespace vesprun {
namespace {

TEST(HostPlatform, SaysWhyADeviceCannotBeOpened) {
  std::string error;
  EXPECT_EQ(HostPlatform::open("/nowhere/at/all", error), nullptr);
  EXPECT_EQ(error, "/nowhere/at/all: No such file or directory");
  const TemporaryFolder folder;
  for (const std::string zone : {"Moon/Crater", "Europe", "zone.tab", "", "/usr/share/zoneinfo/UTC",
                                 "./UTC", "Europe/../UTC"}) {
    folder.write("device.json", R"({"timeZone": ")" + zone + "\"}");
    EXPECT_EQ(HostPlatform::open(folder.path(), error), nullptr);
    EXPECT_THAT(error,
                testing::EndsWith("device.json: timeZone: unknown time zone \"" + zone + '"'));
  }
  folder.write("device.json", R"({"usage": 1})");
  EXPECT_EQ(HostPlatform::open(folder.path(), error), nullptr);
  EXPECT_THAT(error, testing::EndsWith("device.json: usage: not a dictionary"));
  folder.write("device.json", "{}" + std::string(4 << 20, ' '));
  EXPECT_EQ(HostPlatform::open(folder.path(), error), nullptr);
  EXPECT_THAT(error, testing::EndsWith("device.json: larger than 4194304 bytes"));
}

TEST(HostPlatform, LeavesTheTimeZoneOfTheProcess) {
  EXPECT_TRUE(hasSucceeded(startProcess([] {
    setenv("TZ", "Asia/Tokyo", 1);
    tzset();
    const TestDevice device(R"({"timeZone": "America/Lima"})");
    EXPECT_STREQ(std::getenv("TZ"), "Asia/Tokyo");
    EXPECT_EQ(timezone, -9 * 3600);
  })));
}

TEST(HostPlatform, LogKeepsLevelsDownToTheDescribedOne) {
  TestDevice device(R"({"logLevel": "notice", "clock": "2024-03-05T09:15:02.5Z"})");
  logMessage(LogLevel::Error, "first %d", 1);
  logMessage(LogLevel::Info, "dropped");
  logMessage(LogLevel::Notice, "a \"quoted\"\nline %s", "\xC3\xA9");
  EXPECT_EQ(device.read("outbox/log.jsonl"),
            "{\"time\":\"2024-03-05T09:15:02.5Z\",\"level\":\"error\",\"message\":\"first 1\"}\n"
            "{\"time\":\"2024-03-05T09:15:02.5Z\",\"level\":\"notice\","
            "\"message\":\"a \\\"quoted\\\"\\nline \xC3\xA9\"}\n");
}

TEST(HostPlatform, SaysOnStandardErrorWhatCannotBeLogged) {
  TestDevice device("{}");
  device.write("outbox", "");
  testing::internal::CaptureStderr();
  logMessage(LogLevel::Error, "a \x1B line\n");
  EXPECT_THAT(testing::internal::GetCapturedStderr(),
              testing::MatchesRegex(
                  "vesprun: a \\\\x1b line \\(not logged: /[^\n]*/outbox: File exists\\)\n"));
}

TEST(HostKernel, ReadsOnlyVariablesOfTheAskedWidth) {
  TestDevice device(R"({"kernel": {"variables": {
      "narrow": {"u32": 258}, "wide": {"u64": 1}, "text": "abc", "bytes": {"data": "AQID"}}}})");
  Kernel& kernel = device.platform().kernel();
  const auto read = [&](const char* name, std::size_t width) {
    std::vector<std::uint8_t> buffer(width, 0xEE);
    std::size_t length = 0;
    const int error = kernel.sysctlbyname(name, buffer, length);
    buffer.resize(error == 0 ? length : 0);
    return std::pair(error, buffer);
  };
  using Result = std::pair<int, std::vector<std::uint8_t>>;
  EXPECT_EQ(read("narrow", 4), (Result{0, {2, 1, 0, 0}}));
  EXPECT_EQ(read("narrow", 8), (Result{EINVAL, {}}));
  EXPECT_EQ(read("wide", 4).first, EINVAL);
  EXPECT_EQ(read("text", 100), (Result{0, {'a', 'b', 'c', 0}}));
  EXPECT_EQ(read("text", 3).first, ENOMEM);
  EXPECT_EQ(read("bytes", 3), (Result{0, {1, 2, 3}}));
  EXPECT_EQ(read("absent", 4).first, ENOENT);
  EXPECT_EQ(read("kern.bootsessionuuid", 100).second.size(), 37U);
}

TEST(HostLanguages, MatchesTheNearestLocalization) {
  TestDevice device;
  DeviceInformation& languages = device.platform().deviceInformation();
  const std::vector<std::string> available{"en", "en-US", "pt-BR", "zh-Hans", "fr"};
  using Tags = std::vector<std::string>;
  EXPECT_EQ(languages.bestLocalizations(available, {"en-GB", "fr", "en"}), (Tags{"en", "fr"}));
  EXPECT_EQ(languages.bestLocalizations(available, {"zh-Hans-CN", "pt-PT"}),
            (Tags{"zh-Hans", "pt-BR"}));
  EXPECT_EQ(languages.bestLocalizations(available, {"xx"}), Tags{});
}

TEST(EventHub, BuildsOnlyWhatIsTaken) {
  TestDevice device(R"({"clock": "2024-03-05T09:15:02Z",
                        "events": {"used": ["wanted", "broken"], "fails": ["broken"]}})");
  EventHub& hub = device.platform().eventHub();
  int built = 0;
  const auto build = [&built] { return PropertyDict{{"n", ++built}, {"half", 0.5}, {"one", 1.0}}; };
  EXPECT_TRUE(hub.EventHubSendEventLazy("wanted", build));
  EXPECT_TRUE(hub.EventHubSendEventLazy("unwanted", build));
  EXPECT_FALSE(hub.EventHubSendEventLazy("broken", build));
  EXPECT_EQ(built, 1);
  EXPECT_EQ(device.read("outbox/events.jsonl"),
            "{\"time\":\"2024-03-05T09:15:02Z\",\"event\":\"wanted\","
            "\"payload\":{\"n\":1,\"half\":0.5,\"one\":1.0}}\n");
  std::filesystem::remove(device.path("outbox/events.jsonl"));
  std::filesystem::create_directory(device.path("outbox/events.jsonl"));
  EXPECT_FALSE(hub.EventHubSendEventLazy("wanted", build));
  EXPECT_EQ(device.log(), std::vector<std::string>{"error: " + device.path("outbox/events.jsonl") +
                                                   ": Is a directory"});
}

TEST(Outbox, NumbersLogsUpwardsAndKeepsHeadersBesideThem) {
  TestDevice device;
  device.write("outbox/logs/0041-165-StorageStatus.log", "earlier");
  device.write("outbox/logs/note.txt", "not a log");
  Logsmith& logsmith = device.platform().logsmith();
  const auto writer = [](const LogFileHandle& write) { write("text"); };
  const PropertyDict header{{"previous_os_version", "1"}};
  EXPECT_TRUE(logsmith.LGSWriteLogForSubmission("193", "log-aggregated", &header, writer));
  EXPECT_TRUE(logsmith.LGSWriteLogForSubmission("165", "StorageStatus", nullptr, writer));
  EXPECT_EQ(device.names("outbox/logs"),
            (std::vector<std::string>{
                "0041-165-StorageStatus.log", "0042-193-log-aggregated.header.json",
                "0042-193-log-aggregated.ptree", "0043-165-StorageStatus.log", "note.txt"}));
  EXPECT_EQ(device.read("outbox/logs/0042-193-log-aggregated.header.json"),
            "{\"previous_os_version\":\"1\"}\n");
  EXPECT_EQ(device.read("outbox/logs/0043-165-StorageStatus.log"), "text");
  for (const char* const end : {".ptree", ".header.json"}) {
    struct stat status {};
    stat(device.path(std::string("outbox/logs/0042-193-log-aggregated") + end).c_str(), &status);
    EXPECT_EQ(status.st_mtim.tv_sec, 1709630102) << "the device's clock";
  }
}

TEST(Outbox, NumbersGoOnAfterWhateverHappenedToTheFolder) {
  TestDevice device;
  const auto nextName = [&device] {
    const auto writer = [](const LogFileHandle& write) { write("text"); };
    EXPECT_TRUE(platform().logsmith().LGSWriteLogForSubmission("165", "S", nullptr, writer));
    return device.names("outbox/logs").back();
  };
  const std::filesystem::path logs = device.path("outbox/logs");
  EXPECT_EQ(nextName(), "0001-165-S.log");
  // At once: within the same tick of the clock that the folder's modification time comes from.
  device.write("outbox/logs/0007-165-S.log", "put there by someone else");
  EXPECT_EQ(nextName(), "0008-165-S.log");
  std::filesystem::remove_all(logs);
  EXPECT_EQ(nextName(), "0009-165-S.log");
  device.write("outbox/pruned.jsonl",
               "{\"name\":\"0020-193-log-aggregated.ptree\",\"day\":1,"
               "\"revision\":1}\nno note\n");
  EXPECT_EQ(nextName(), "0021-165-S.log");
  device.write("outbox/.log-number", "garbage");
  std::filesystem::remove_all(logs);
  EXPECT_EQ(nextName(), "0021-165-S.log") << "what the notes tell";
  const auto time = std::filesystem::last_write_time(logs);
  device.write("outbox/logs/0010-165-S.log", "");
  std::filesystem::remove(logs / "0021-165-S.log");
  device.write("outbox/logs/0090-165-S.log", "");
  std::filesystem::last_write_time(logs, time);
  EXPECT_EQ(nextName(), "0090-165-S.log");
  EXPECT_TRUE(device.exists("outbox/logs/0022-165-S.log")) << "an unchanged folder is not read";
  timesCannotBeSet = true;
  nextName();
  EXPECT_EQ(nextName(), "0091-165-S.log") << "one whose changes cannot be seen is read";
  timesCannotBeSet = false;
}

TEST(Outbox, SubmissionsAtOnceNeverShareANumber) {
  TestDevice device;
  const auto submit = [](const char* type, const char* name, bool hasHeader) {
    for (int i = 0; i < 20; ++i) {
      const PropertyDict header{{"n", i}};
      EXPECT_TRUE(platform().logsmith().LGSWriteLogForSubmission(
          type, name, hasHeader ? &header : nullptr,
          [i](const LogFileHandle& write) { write(std::to_string(i)); }));
    }
  };
  std::thread same([&] { submit("193", "log-aggregated", true); });
  std::thread other([&] { submit("165", "S", false); });
  submit("193", "log-aggregated", true);
  same.join();
  other.join();
  std::set<std::string> numbers;
  for (const std::string& name : device.names("outbox/logs")) {
    if (name.ends_with(".header.json")) {
      const std::string log = "outbox/logs/" + name.substr(0, name.find('.')) + ".ptree";
      EXPECT_EQ(device.read("outbox/logs/" + name), "{\"n\":" + device.read(log) + "}\n");
    } else {
      EXPECT_TRUE(numbers.insert(name.substr(0, 4)).second) << name;
    }
  }
  EXPECT_EQ(numbers.size(), 60U);
}

TEST(Outbox, AFailedSubmissionLeavesWhatWasThereAndNothingElse) {
  TestDevice device;
  device.write("outbox/logs/0001-165-S.log", "earlier");
  const PropertyDict header{{"n", 1}};
  bool isTaken = false;
  const auto submit = [&] {
    return platform().logsmith().LGSWriteLogForSubmission(
        "165", "S", &header, [&isTaken](const LogFileHandle& write) {
          isTaken = write(std::string(200'000, 'x')) || write("more");
        });
  };
  {
    const FileSizeLimit limit(100'000);
    EXPECT_FALSE(submit() || isTaken);
  }
  rlimit before{};
  getrlimit(RLIMIT_NOFILE, &before);
  const int lowestFree = open("/dev/null", O_RDONLY);
  close(lowestFree);
  for (int allowed = 0; allowed < 4; ++allowed) {
    const rlimit limited{static_cast<rlim_t>(lowestFree + allowed), before.rlim_max};
    setrlimit(RLIMIT_NOFILE, &limited);
    EXPECT_FALSE(submit()) << allowed;
    setrlimit(RLIMIT_NOFILE, &before);
  }
  // Where not even the log finds a descriptor, standard error has the line.
  EXPECT_THAT(device.log(), testing::SizeIs(2));
  EXPECT_THAT(device.log(), testing::Each(testing::StartsWith("error: ")));
  EXPECT_EQ(device.names("outbox/logs"), std::vector<std::string>{"0001-165-S.log"});
  EXPECT_EQ(device.read("outbox/logs/0001-165-S.log"), "earlier");
}

TEST(HostServices, SayWhichFileCannotBeRead) {
  TestDevice device(R"({"kernel": {"snapshot": "absent"}})");
  device.write("kernel/ecc", "a file in the way of the queue");
  device.write("whitelist/note", "a folder in the way of a file");
  std::array<std::uint8_t, 72> event{};
  std::size_t length = 0;
  EXPECT_EQ(platform().kernel().sysctlbyname("kern.next_ecc_event", event, length), EIO);
  EXPECT_EQ(platform().kernel().captureSnapshot(0), std::nullopt);
  EXPECT_EQ(platform().fileSystem().readFile("/none"), std::nullopt);
  EXPECT_EQ(platform().fileSystem().readFile("/whitelist"), std::nullopt);
  EXPECT_THAT(device.log(),
              testing::ElementsAre(testing::EndsWith("kernel/ecc: Not a directory"),
                                   testing::EndsWith("absent: No such file or directory"),
                                   testing::EndsWith("whitelist: Is a directory")));
}

TEST(HostMurmur, OutlivesAHandlerThatThrows) {
  TestDevice device;
  std::promise<void> called;
  const auto feed = platform().murmur().createUsageFeed({});
  feed->usageToDateForNameKindReply({}, {}, [&](const auto*) {
    called.set_value();
    throw std::runtime_error("no room");
  });
  called.get_future().wait();
  while (device.log().empty()) {
    std::this_thread::yield();
  }
  EXPECT_THAT(device.log(), testing::ElementsAre("error: usage feed: no room"));
}

TEST(DiagnosticHeader, IsLiveWhenItIsNotDescribed) {
  TestDevice device;
  DeviceInformation& header = device.platform().deviceInformation();
  EXPECT_NE(header.GetHardwareModel(), "");
  EXPECT_NE(header.GetSystemVersion(), "");
  EXPECT_EQ(header.GetIncidentID().size(), 36U);
  EXPECT_NE(header.GetIncidentID(), header.GetIncidentID());
}

}  // namespace
}  // namespace vesprun
