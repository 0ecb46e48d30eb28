#include <gmock/gmock.h>
#include <pthread.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <atomic>
#include <cmath>
#include <thread>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/structuredlog/StructuredLogGlobals.h"
#include "common/ProcessState.h"
#include "platform/host/HostPlatform.h"
#include "support/HostServiceTest.h"
#include "support/ScarceMemory.h"
#include "vesprun/vesprun.h"

namespace vesprun {
namespace {

using ::testing::HasSubstr, ::testing::IsEmpty, ::testing::StartsWith, ::testing::StrEq;

constexpr const char* kFile = "var/mobile/Library/Tallybook/TBDataStore.sqlitedb";

/// A device directory, opened as a program in C does.
class VesprunLibraryTest : public ::testing::Test {
 protected:
  VesprunLibraryTest() { folder.write("device.json", R"({"clock": "2024-03-05T09:15:02Z"})"); }
  ~VesprunLibraryTest() override { vesprun_close(device); }

  void open() {
    device = vesprun_open(folder.path().c_str());
    ASSERT_NE(device, nullptr) << vesprun_last_error();
  }

  void close() { vesprun_close(std::exchange(device, nullptr)); }

  /// What was written, as lines; no device is open.
  std::string dump() const {
    std::string error;
    const auto opened = HostPlatform::open(folder.path(), error);
    return linesOf(opened->counters());
  }

  std::string call(const char* entryPoint, const char* arguments = nullptr) {
    char* const json = vesprun_call(device, entryPoint, arguments);
    std::string text = json != nullptr ? json : vesprun_last_error();
    vesprun_free(json);
    return text;
  }

  TemporaryFolder folder;
  vesprun_device* device = nullptr;
};

TEST_F(VesprunLibraryTest, WritesCountersAtACheckpointAndWhenItCloses) {
  open();
  EXPECT_EQ(vesprun_checkpoint(device), 0);
  EXPECT_THAT(folder.names("var"), IsEmpty());
  EXPECT_EQ(vesprun_add_to_scalar(device, "added", 2), 0);
  EXPECT_EQ(vesprun_set_scalar(device, "set", 5), 0);
  EXPECT_EQ(vesprun_add_to_scalar(device, "set", -1), 0);
  EXPECT_EQ(vesprun_add_to_distribution(device, "value", 0.5), 0);
  EXPECT_EQ(vesprun_checkpoint(device), 0);
  EXPECT_EQ(vesprun_set_scalar(device, "set", 7), 0);
  EXPECT_EQ(vesprun_add_to_scalar(device, "added", INT64_MAX), 0);
  EXPECT_EQ(vesprun_add_to_distribution(device, "value", -1), 0);
  close();
  EXPECT_EQ(dump(),
            "scalar\t19787\tadded\t-9223372036854775807\nscalar\t19787\tset\t7\n"
            "sample\t19787\tvalue\t0.5\t33302\nsample\t19787\tvalue\t-1\t33302\n");
}

TEST_F(VesprunLibraryTest, KeepsInOrderWhatCannotBeWritten) {
  open();
  const auto change = [&](int value) {
    EXPECT_EQ(vesprun_add_to_scalar(device, "k", value), 0);
    EXPECT_EQ(vesprun_add_to_distribution(device, "v", value), 0);
  };
  folder.write(std::string(kFile) + "/folder", "");
  for (const int value : {1, 2}) {
    change(value);
    EXPECT_EQ(vesprun_checkpoint(device), -1);
    EXPECT_THAT(vesprun_last_error(), HasSubstr("TBDataStore.sqlitedb: not a regular file"));
  }
  change(4);
  unlink(folder.path(std::string(kFile) + "/folder").c_str());
  rmdir(folder.path(kFile).c_str());
  EXPECT_EQ(vesprun_checkpoint(device), 0);
  EXPECT_EQ(vesprun_checkpoint(device), 0);
  close();
  EXPECT_EQ(dump(),
            "scalar\t19787\tk\t7\nsample\t19787\tv\t1\t33302\nsample\t19787\tv\t2\t33302\n"
            "sample\t19787\tv\t4\t33302\n");
}

TEST_F(VesprunLibraryTest, LosesNothingOfThreadsAndProcessesThatWriteAtOnce) {
  constexpr int kWriters = 4;
  constexpr int kAdds = 500;
  const auto work = [this] {
    open();
    std::vector<std::thread> threads;
    threads.reserve(kWriters);
    for (int writer = 0; writer < kWriters; ++writer) {
      threads.emplace_back([this] {
        for (int i = 1; i <= kAdds; ++i) {
          EXPECT_EQ(vesprun_add_to_scalar(device, "k", 1), 0);
          EXPECT_EQ(vesprun_add_to_distribution(device, "v", 1), 0);
          EXPECT_EQ(i % 100 != 0 || vesprun_checkpoint(device) == 0, true);
          EXPECT_EQ(vesprun_set_scalar(device, "\x01", 1), -1);
          EXPECT_THAT(vesprun_last_error(), HasSubstr("no ptree document can carry"));
        }
      });
    }
    for (std::thread& thread : threads) {
      thread.join();
    }
    close();
  };
  const pid_t child = startProcess(work);
  work();
  EXPECT_TRUE(hasSucceeded(child));
  const std::string text = dump();
  EXPECT_THAT(text, StartsWith("scalar\t19787\tk\t4000\n"));
  EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 1 + 2 * kWriters * kAdds);
}

TEST_F(VesprunLibraryTest, GivesTheResultOfAnEntryPointAsJson) {
  open();
  ProcessState::startAfresh();
  for (const char* name : {"vm-freezer", "CopyVMFreezerNANDInfo"}) {
    EXPECT_EQ(call(name), R"({"result":{},"error":"NA"})");
  }
  // The error is that of the call, not the first of the process.
  EXPECT_EQ(call("connect", "{}"), R"({"result":false,"error":"NA"})");
  EXPECT_EQ(call("CopyNANDFTLInfo", R"({"stat-keys":true})"),
            R"({"result":null,"error":"gatherORUFTLData: Could not get nand_exporter_t"})");
  EXPECT_EQ(call("vm-freezer"), R"({"result":{},"error":"NA"})");
  vesprun_force_validity_list(1);
  EXPECT_EQ(call("structured-log"), R"({"result":false,"error":"NA"})");
  EXPECT_EQ(gForceCollectionSet, 1);
  vesprun_force_validity_list(0);
  EXPECT_EQ(gForceCollectionSet, 0);
  EXPECT_THAT(call("magazine", R"({"hours":24,"raw":false,"mode":4294967295})"),
              HasSubstr("com.quill.NANDInfo.IsStatMagSupported"));
  ProcessState::startAfresh();
}

TEST_F(VesprunLibraryTest, SaysWhatIsWrongWithACall) {
  open();
  const struct {
    const char* name;
    const char* arguments;
    const char* error;
  } cases[] = {
      {"frob\n", nullptr, R"(there is no entry point "frob\x0a")"},
      {"magazine", nullptr, "magazine: hours is missing"},
      {"CopyOTANANDInfo", "{\"round\":true}", "ota: there is no argument \"round\""},
      {"ftl", "{\"round\":1}", "ftl: round is neither true nor false"},
      {"magazine", "{\"hours\":-1}", "magazine: hours is no number from 0 to 18446744073709551615"},
      {"magazine", "{\"hours\":1.0}", "magazine: hours is no number"},
      {"magazine", "{\"hours\":1,\"mode\":4294967296}",
       "magazine: mode is no number from 0 to 4294967295"},
      {"ftl", "[true]", "ftl: the arguments are no JSON object"},
      {"ftl", "{\"round\":true", "ftl: the arguments are no JSON object: parse error at line 1"},
      {nullptr, nullptr, "no entry point is given"},
  };
  for (const auto& wrong : cases) {
    EXPECT_THAT(call(wrong.name, wrong.arguments), StartsWith(wrong.error)) << wrong.error;
  }
}

TEST_F(VesprunLibraryTest, SurvivesAProgramThatUsesItWrongly) {
  const auto fails = [](bool failed, const char* error, vesprun_error code) {
    EXPECT_TRUE(failed) << error;
    EXPECT_THAT(vesprun_last_error(), HasSubstr(error));
    EXPECT_EQ(vesprun_last_error_code(), code) << error;
  };
  fails(vesprun_open(nullptr) == nullptr, "no directory is given", VESPRUN_ERROR_ARGUMENT);
  fails(vesprun_open("/nowhere") == nullptr, "/nowhere", VESPRUN_ERROR_NOT_A_DEVICE);
  fails(vesprun_set_scalar(nullptr, "k", 1) == -1, "no device is given", VESPRUN_ERROR_ARGUMENT);
  fails(vesprun_checkpoint(nullptr) == -1, "no device is given", VESPRUN_ERROR_ARGUMENT);
  fails(vesprun_call(nullptr, "lab", nullptr) == nullptr, "no device is given",
        VESPRUN_ERROR_ARGUMENT);
  open();
  fails(vesprun_open(folder.path().c_str()) == nullptr, "another device is open",
        VESPRUN_ERROR_BUSY);
  fails(vesprun_add_to_scalar(device, nullptr, 1) == -1, "no key is given", VESPRUN_ERROR_ARGUMENT);
  fails(vesprun_add_to_distribution(device, "\xff", 1) == -1, "at byte 0", VESPRUN_ERROR_KEY);
  fails(vesprun_call(device, "frob", nullptr) == nullptr, "there is no entry point",
        VESPRUN_ERROR_ARGUMENT);
  // A long text is cut between characters.
  const std::string longPath = '/' + std::string(1021, 'x') + "\xC3\xA4";
  close();
  EXPECT_EQ(vesprun_open(longPath.c_str()), nullptr);
  EXPECT_THAT(vesprun_last_error(), StrEq(longPath.substr(0, 1022)));
  // A database of a newer version is neither written to nor moved aside.
  open();
  EXPECT_EQ(vesprun_set_scalar(device, "k", 1), 0);
  EXPECT_EQ(vesprun_checkpoint(device), 0);
  std::string database = folder.read(kFile);
  database[63] = 2;  // the version in the header
  folder.write(kFile, database);
  EXPECT_EQ(vesprun_set_scalar(device, "k", 2), 0);
  fails(vesprun_checkpoint(device) == -1, "newer version", VESPRUN_ERROR_TOO_OLD);
  EXPECT_EQ(folder.read(kFile), database);
  close();
  open();  // the refused ones hold nothing
  EXPECT_STREQ(vesprun_version(), VESPRUN_VERSION);
  vesprun_free(nullptr);
}

TEST_F(VesprunLibraryTest, CountsOnceWhenTheProcessForksAndLeavesItsTimeZone) {
  folder.write("device.json", R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "Asia/Tokyo"})");
  setenv("TZ", "UTC-1", 1);
  open();
  EXPECT_STREQ(getenv("TZ"), "UTC-1");
  EXPECT_EQ(vesprun_add_to_scalar(device, "k", 1), 0);
  EXPECT_TRUE(hasSucceeded(startProcess([this] {
    EXPECT_EQ(vesprun_add_to_scalar(device, "k", 1), -1);
    EXPECT_EQ(vesprun_checkpoint(device), -1);
    EXPECT_EQ(vesprun_call(device, "lab", nullptr), nullptr);
    EXPECT_EQ(vesprun_last_error_code(), VESPRUN_ERROR_FORKED);
    close();
    open();
    EXPECT_EQ(vesprun_add_to_scalar(device, "k", 10), 0);
    close();
  })));
  close();
  EXPECT_EQ(dump(), "scalar\t19787\tk\t11\n");
  unsetenv("TZ");
}

TEST_F(VesprunLibraryTest, SendsCountersToASocket) {
  const std::string path = folder.path("socket");
  const auto listen = [&path] {
    const int listener = socket(AF_UNIX, SOCK_DGRAM | SOCK_NONBLOCK, 0);
    sockaddr_un address{AF_UNIX, {}};
    path.copy(address.sun_path, sizeof address.sun_path - 1);
    unlink(path.c_str());
    EXPECT_EQ(bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
    return listener;
  };
  const auto received = [](int listener) {
    std::string text(70'000, '\0');
    const ssize_t size = recv(listener, text.data(), text.size(), 0);
    text.resize(size > 0 ? static_cast<std::size_t>(size) : 0);
    return text;
  };
  const int first = listen();
  device = vesprun_open(path.c_str());
  ASSERT_NE(device, nullptr) << vesprun_last_error();
  EXPECT_EQ(vesprun_add_to_scalar(device, "a", 2), 0);
  EXPECT_EQ(vesprun_set_scalar(device, "b", INT64_MIN), 0);
  EXPECT_EQ(vesprun_add_to_distribution(device, "c", 0.1), 0);
  for (const std::string& key :
       {std::string(), std::string("a:b"), std::string("a|b"), std::string("a\nb"),
        std::string("\x01"), std::string(8'192, 'x')}) {
    EXPECT_EQ(vesprun_add_to_scalar(device, key.c_str(), 1), -1) << key;
    EXPECT_EQ(vesprun_last_error_code(), VESPRUN_ERROR_KEY) << key;
  }
  EXPECT_EQ(vesprun_add_to_distribution(device, "c", std::nan("")), -1);
  EXPECT_EQ(vesprun_last_error_code(), VESPRUN_ERROR_ARGUMENT);
  EXPECT_EQ(vesprun_call(device, "lab", nullptr), nullptr);
  EXPECT_EQ(vesprun_last_error_code(), VESPRUN_ERROR_SOCKET);
  EXPECT_TRUE(hasSucceeded(startProcess([this] {
    EXPECT_EQ(vesprun_checkpoint(device), -1);
    close();  // sends nothing
  })));
  EXPECT_EQ(received(first), "");
  EXPECT_EQ(vesprun_checkpoint(device), 0);
  EXPECT_EQ(received(first), "a:2|c\nb:-9223372036854775808|g\nc:0.1|d\n");

  // What fills a datagram goes by itself, in whole lines.
  const std::string key(4'000, 'k');
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(vesprun_add_to_scalar(device, key.c_str(), i), 0);
  }
  EXPECT_EQ(received(first), key + ":0|c\n" + key + ":1|c\n");

  // A listener that stands still holds nobody up for ever.
  while (vesprun_add_to_scalar(device, "a", 1) == 0 && vesprun_checkpoint(device) == 0) {
  }
  EXPECT_EQ(vesprun_last_error_code(), VESPRUN_ERROR_BUSY);

  // Nobody listens any more: what is collected waits for another listener.
  ::close(first);
  EXPECT_EQ(vesprun_checkpoint(device), -1);
  EXPECT_EQ(vesprun_last_error_code(), VESPRUN_ERROR_NOT_A_DEVICE);
  EXPECT_EQ(vesprun_open(path.c_str()), nullptr);
  const int second = listen();
  close();
  EXPECT_EQ(received(second), "a:1|c\n");
  ::close(second);
}

TEST_F(VesprunLibraryTest, FailsWithoutMemoryAndChangesNothing) {
  std::int64_t added = 0;
  std::int64_t sampled = 0;
  for (std::size_t failing = 1; failing < 60; ++failing) {
    open();
    const std::string key = "a key that is too long to lie in the string itself";
    allocationsLeft = failing;
    added += vesprun_add_to_scalar(device, key.c_str(), 1) == 0 ? 1 : 0;
    allocationsLeft = failing;
    sampled += vesprun_add_to_distribution(device, key.c_str(), 1) == 0 ? 1 : 0;
    allocationsLeft = failing;
    vesprun_checkpoint(device);
    allocationsLeft = failing;
    vesprun_free(vesprun_call(device, "magazine", "{\"hours\":1}"));
    allocationsLeft = 0;
    close();
    allocationsLeft = failing;
    vesprun_close(vesprun_open(folder.path().c_str()));
    allocationsLeft = 0;
  }
  const std::string text = dump();
  EXPECT_GT(added, 0);
  EXPECT_LT(added, 59);
  EXPECT_THAT(text, HasSubstr("the string itself\t" + std::to_string(added) + '\n'));
  EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 1 + sampled);
}

TEST_F(VesprunLibraryTest, IsNotEndedByAThreadThatIsCancelled) {
  open();
  std::atomic<int> rounds = 0;
  std::thread writer([&] {
    for (;;) {
      vesprun_add_to_scalar(device, "k", 1);
      vesprun_checkpoint(device);
      ++rounds;
      pthread_testcancel();
    }
  });
  while (rounds == 0) {
    std::this_thread::yield();
  }
  pthread_cancel(writer.native_handle());
  writer.join();
  close();
  EXPECT_EQ(dump(), "scalar\t19787\tk\t" + std::to_string(rounds) + '\n');
}

}  // namespace
}  // namespace vesprun
