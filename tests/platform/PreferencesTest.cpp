#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <thread>

#include "platform/host/HostPreferences.h"
#include "support/TemporaryFolder.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;

constexpr const char* kFolder = "var/mobile/Library/Preferences";
constexpr const char* kFile = "var/mobile/Library/Preferences/a.ptree";
constexpr const char* kOneKey =
    "<ptree version=\"1.0\"><dict><key>first</key><integer>1</integer></dict></ptree>";

class MessageList final : public SystemLog {
 public:
  bool keeps(LogLevel /*level*/) const override { return true; }
  void write(LogLevel level, std::string_view message) override {
    EXPECT_EQ(level, LogLevel::Error);
    messages.emplace_back(message);
  }

  std::vector<std::string> messages;
};

class PreferencesTest : public ::testing::Test {
 protected:
  ino_t fileNumber() const {
    struct stat status {};
    return stat(folder.path(kFile).c_str(), &status) == 0 ? status.st_ino : 0;
  }

  /// What a process that starts now finds.
  PropertyDict found() {
    HostPreferences preferences(device, log);
    return preferences.valuesOfDomain("a");
  }

  TemporaryFolder folder;
  std::string error;
  DeviceDirectory device = DeviceDirectory::open(folder.path(), error).value();
  MessageList log;
};

TEST_F(PreferencesTest, areThereForTheNextProcess) {
  {
    HostPreferences preferences(device, log);
    preferences.LGSPreferencesSetValue("first", 1, "a");
    preferences.LGSPreferencesSetValue("gone", 1, "a");
    preferences.LGSPreferencesSetValue("gone", std::nullopt, "a");
    EXPECT_EQ(preferences.LGSPreferencesGetValue("first", "a"), PropertyValue(1));
    EXPECT_EQ(preferences.LGSPreferencesGetValue("gone", "a"), std::nullopt);
    EXPECT_THAT(folder.names(kFolder), IsEmpty());
    EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
    EXPECT_THAT(folder.names(kFolder), ElementsAre("a.ptree"));
    preferences.LGSPreferencesSetValue("second", "text", "a");
    preferences.LGSPreferencesSetValue("other", true, "b");
  }
  EXPECT_EQ(found(), (PropertyDict{{"first", 1}, {"second", "text"}}));
  EXPECT_THAT(folder.names(kFolder), ElementsAre("a.ptree", "b.ptree"));
  { HostPreferences(device, log, "root").LGSPreferencesSetValue("k", 1, "a"); }
  EXPECT_THAT(folder.names("var/root/Library/Preferences"), ElementsAre("a.ptree"));
  {
    HostPreferences(device, log, PreferenceFolder{"Library/Logsmith"})
        .LGSPreferencesSetValue("k", 1, "com.x");
  }
  EXPECT_THAT(folder.names("Library/Logsmith"), ElementsAre("com.x.ptree"));
  EXPECT_THAT(log.messages, IsEmpty());
}

TEST_F(PreferencesTest, areNotWrittenWithoutADifference) {
  HostPreferences preferences(device, log);
  preferences.LGSPreferencesSetValue("absent", std::nullopt, "a");
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(folder.names(kFolder), IsEmpty());
  folder.write(kFile, kOneKey);
  const ino_t before = fileNumber();
  preferences.LGSPreferencesSetValue("first", 1, "a");
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(preferences.LGSPreferencesGetValue("first", "a"), PropertyValue(1));
  EXPECT_EQ(fileNumber(), before);
  EXPECT_EQ(folder.read(kFile), kOneKey);
  preferences.LGSPreferencesSetValue("first", 1.0, "a");  // another kind of number
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(folder.read(kFile), HasSubstr("<real>1</real>"));
}

TEST_F(PreferencesTest, keepWhatOtherProcessesChanged) {
  HostPreferences here(device, log);
  HostPreferences there(device, log);
  EXPECT_EQ(here.LGSPreferencesGetValue("x", "a"), std::nullopt);
  there.LGSPreferencesSetValue("x", 1, "a");
  there.LGSPreferencesSetValue("y", 1, "a");
  EXPECT_TRUE(there.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(there.LGSPreferencesGetValue("z", "a"), std::nullopt);
  here.LGSPreferencesSetValue("y", 2, "a");
  here.LGSPreferencesSetValue("z", 2, "a");
  EXPECT_TRUE(here.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(here.LGSPreferencesGetValue("x", "a"), PropertyValue(1));
  EXPECT_EQ(there.LGSPreferencesGetValue("z", "a"), std::nullopt);
  EXPECT_TRUE(there.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(there.LGSPreferencesGetValue("z", "a"), PropertyValue(2));
  EXPECT_EQ(found(), (PropertyDict{{"x", 1}, {"y", 2}, {"z", 2}}));
}

TEST_F(PreferencesTest, loseNothingToProcessesAndThreadsThatWriteAtOnce) {
  constexpr int kKeys = 15;
  const auto write = [](HostPreferences& preferences, const std::string& writer) {
    bool good = true;
    for (int key = 0; key < kKeys; ++key) {
      preferences.LGSPreferencesSetValue(writer + std::to_string(key), key, "a");
      good = preferences.LGSPreferencesSynchronize("a") && good;
    }
    return good;
  };
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    HostPreferences preferences(device, log);
    _exit(write(preferences, "child") ? 0 : 1);
  }
  HostPreferences preferences(device, log);
  HostPreferences others(device, log);
  std::thread shared([&] { EXPECT_TRUE(write(preferences, "shared")); });
  std::thread own([&] { EXPECT_TRUE(write(others, "own")); });
  EXPECT_TRUE(write(preferences, "main"));
  shared.join();
  own.join();
  int status = -1;
  waitpid(child, &status, 0);
  EXPECT_EQ(status, 0);
  EXPECT_EQ(found().size(), 4U * kKeys);
}

TEST_F(PreferencesTest, keepADocumentThatIsNoneBesideTheNewOne) {
  for (const std::string malformed :
       {"<ptree version=\"1.0\">\n<dict>\n<key>first", "<ptree version=\"1.0\"><true/></ptree>"}) {
    log.messages.clear();
    folder.write(kFile, malformed);
    HostPreferences preferences(device, log);
    EXPECT_EQ(preferences.LGSPreferencesGetValue("first", "a"), std::nullopt);
    EXPECT_EQ(preferences.LGSPreferencesGetValue("other", "a"), std::nullopt);
    EXPECT_THAT(log.messages, ElementsAre(StartsWith(folder.path(kFile) + ": line ")));
    EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
    EXPECT_EQ(folder.read(kFile), malformed);
    preferences.LGSPreferencesSetValue("first", 2, "a");
    EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
    EXPECT_EQ(found(), (PropertyDict{{"first", 2}}));
    EXPECT_THAT(log.messages.back(), HasSubstr(": kept as "));
  }
  const std::vector<std::string> names = folder.names(kFolder);
  ASSERT_EQ(names.size(), 3U);
  EXPECT_THAT(names[1], StartsWith("a.ptree.unreadable-20"));
  EXPECT_THAT(folder.read(std::string(kFolder) + '/' + names[1]), StartsWith("<ptree"));
}

TEST_F(PreferencesTest, neverWriteOverWhatCannotBeRead) {
  folder.write(std::string(kFile) + "/inside", "a folder in place of the document");
  HostPreferences preferences(device, log);
  EXPECT_EQ(preferences.LGSPreferencesGetValue("first", "a"), std::nullopt);
  preferences.LGSPreferencesSetValue("first", 1, "a");
  EXPECT_FALSE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(log.messages.back(), HasSubstr("a.ptree: Is a directory"));
  EXPECT_THAT(folder.names(kFile), ElementsAre("inside"));
  unlink(folder.path(std::string(kFile) + "/inside").c_str());
  rmdir(folder.path(kFile).c_str());
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));  // the change has waited
  EXPECT_EQ(found(), (PropertyDict{{"first", 1}}));
}

TEST_F(PreferencesTest, refuseNamesThatLeadElsewhereAndValuesThatNoDocumentCarries) {
  HostPreferences preferences(device, log);
  for (const std::string& domain :
       {std::string(), std::string("../a"), std::string("."), std::string(".a"), std::string("a/b"),
        std::string("a\0b", 3)}) {
    log.messages.clear();
    preferences.LGSPreferencesSetValue("k", 1, domain);
    EXPECT_EQ(log.messages.size(), 1U) << domain;
    EXPECT_FALSE(preferences.LGSPreferencesSynchronize(domain));
    EXPECT_EQ(preferences.LGSPreferencesGetValue("k", domain), std::nullopt);
  }
  HostPreferences other(device, log, "../mobile");
  EXPECT_EQ(log.messages.back(), "\"../mobile\" cannot be the name of a user");
  other.LGSPreferencesSetValue("k", 1, "a");
  EXPECT_FALSE(other.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(folder.names(), IsEmpty());

  preferences.LGSPreferencesSetValue("bad", "\x01", "a");
  EXPECT_THAT(log.messages.back(), HasSubstr("a.ptree: \"bad\": the string"));
  preferences.LGSPreferencesSetValue("good", 1, "a");
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(found(), (PropertyDict{{"good", 1}}));
}

}  // namespace
}  // namespace vesprun
