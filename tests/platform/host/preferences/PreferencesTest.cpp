#include <thread>

#include "platform/host/preferences/HostPreferences.h"
#include "platform/host/services/HostClock.h"
#include "support/HostServiceTest.h"

namespace vesprun {
namespace {

using namespace std::string_literals;
using ::testing::ElementsAre, ::testing::EndsWith, ::testing::HasSubstr, ::testing::IsEmpty,
    ::testing::StartsWith;

constexpr const char* kPreferencesFolder = "var/mobile/Library/Preferences";
constexpr const char* kPreferencesFile = "var/mobile/Library/Preferences/a.ptree";
constexpr const char* kOneKey =
    "<ptree version=\"1.0\"><dict><key>first</key><integer>1</integer></dict></ptree>";

class PreferencesTest : public HostServiceTest {
 protected:
  /// What a process that starts now finds.
  PropertyDict found() { return HostPreferences(device, clock, log).valuesOfDomain("a"); }
  HostClock clock{Date{1709630102, 0}};  // 2024-03-05 09:15:02
  HostPreferences preferences{device, clock, log};
};

TEST_F(PreferencesTest, AreThereForTheNextProcess) {
  {
    HostPreferences here(device, clock, log);
    here.LGSPreferencesSetValue("first", 1, "a");
    here.LGSPreferencesSetValue("gone", 1, "a");
    here.LGSPreferencesSetValue("gone", std::nullopt, "a");
    EXPECT_EQ(here.LGSPreferencesGetValue("first", "a"), PropertyValue(1));
    EXPECT_EQ(here.LGSPreferencesGetValue("gone", "a"), std::nullopt);
    EXPECT_THAT(folder.names(kPreferencesFolder), IsEmpty());
    EXPECT_TRUE(here.LGSPreferencesSynchronize("a"));
    EXPECT_THAT(folder.names(kPreferencesFolder), ElementsAre("a.ptree"));
    here.LGSPreferencesSetValue("second", "text", "a");
    here.LGSPreferencesSetValue("other", true, "b");
  }
  EXPECT_EQ(found(), (PropertyDict{{"first", 1}, {"second", "text"}}));
  EXPECT_THAT(folder.names(kPreferencesFolder), ElementsAre("a.ptree", "b.ptree"));
  HostPreferences(device, clock, log, "root").LGSPreferencesSetValue("k", 1, "a");
  EXPECT_THAT(folder.names("var/root/Library/Preferences"), ElementsAre("a.ptree"));
  HostPreferences(device, clock, log, PreferenceFolder{"Library/Logsmith"})
      .LGSPreferencesSetValue("k", 1, "com.x");
  EXPECT_THAT(folder.names("Library/Logsmith"), ElementsAre("com.x.ptree"));
  EXPECT_THAT(log.messages, IsEmpty());
}

TEST_F(PreferencesTest, AreNotWrittenWithoutADifference) {
  preferences.LGSPreferencesSetValue("absent", std::nullopt, "a");
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(folder.names(kPreferencesFolder), IsEmpty());
  folder.write(kPreferencesFile, kOneKey);
  preferences.LGSPreferencesSetValue("first", 1, "a");
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(preferences.LGSPreferencesGetValue("first", "a"), PropertyValue(1));
  EXPECT_EQ(folder.read(kPreferencesFile), kOneKey);
  preferences.LGSPreferencesSetValue("first", 1.0, "a");  // another kind of number
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(folder.read(kPreferencesFile), HasSubstr("<real>1</real>"));
}

TEST_F(PreferencesTest, KeepWhatOtherProcessesChanged) {
  HostPreferences there(device, clock, log);
  EXPECT_EQ(preferences.LGSPreferencesGetValue("x", "a"), std::nullopt);
  there.LGSPreferencesSetValue("x", 1, "a");
  there.LGSPreferencesSetValue("y", 1, "a");
  EXPECT_TRUE(there.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(there.LGSPreferencesGetValue("z", "a"), std::nullopt);
  preferences.LGSPreferencesSetValue("y", 2, "a");
  preferences.LGSPreferencesSetValue("z", 2, "a");
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(preferences.LGSPreferencesGetValue("x", "a"), PropertyValue(1));
  EXPECT_EQ(there.LGSPreferencesGetValue("z", "a"), std::nullopt);
  EXPECT_TRUE(there.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(there.LGSPreferencesGetValue("z", "a"), PropertyValue(2));
  EXPECT_EQ(found(), (PropertyDict{{"x", 1}, {"y", 2}, {"z", 2}}));
}

TEST_F(PreferencesTest, LoseNothingToProcessesAndThreadsThatWriteAtOnce) {
  constexpr int kKeys = 15;
  const auto write = [](HostPreferences& here, const std::string& writer) {
    for (int key = 0; key < kKeys; ++key) {
      here.LGSPreferencesSetValue(writer + std::to_string(key), key, "a");
      EXPECT_TRUE(here.LGSPreferencesSynchronize("a"));
    }
  };
  const pid_t child = startProcess([&] { write(preferences, "child"); });
  HostPreferences others(device, clock, log);
  std::thread shared([&] { write(preferences, "shared"); });
  std::thread own([&] { write(others, "own"); });
  write(preferences, "main");
  shared.join();
  own.join();
  EXPECT_TRUE(hasSucceeded(child));
  EXPECT_EQ(found().size(), 4U * kKeys);
}

TEST_F(PreferencesTest, KeepADocumentThatIsNoneBesideTheNewOne) {
  for (const std::string malformed :
       {"<ptree version=\"1.0\">\n<dict>\n<key>first", "<ptree version=\"1.0\"><true/></ptree>"}) {
    log.messages.clear();
    folder.write(kPreferencesFile, malformed);
    HostPreferences here(device, clock, log);
    EXPECT_EQ(here.LGSPreferencesGetValue("first", "a"), std::nullopt);
    EXPECT_EQ(here.LGSPreferencesGetValue("other", "a"), std::nullopt);
    EXPECT_THAT(log.messages, ElementsAre(StartsWith(folder.path(kPreferencesFile) + ": line ")));
    EXPECT_TRUE(here.LGSPreferencesSynchronize("a"));
    EXPECT_EQ(folder.read(kPreferencesFile), malformed);
    here.LGSPreferencesSetValue("first", 2, "a");
    EXPECT_TRUE(here.LGSPreferencesSynchronize("a"));
    EXPECT_EQ(found(), (PropertyDict{{"first", 2}}));
    EXPECT_THAT(log.messages.back(), HasSubstr(": kept as "));
  }
  const std::vector<std::string> names = folder.names(kPreferencesFolder);
  ASSERT_EQ(names.size(), 3U);
  EXPECT_THAT(names[1], StartsWith("a.ptree.unreadable-20240305T091502Z"));
  EXPECT_THAT(folder.read(std::string(kPreferencesFolder) + '/' + names[1]), StartsWith("<ptree"));
}

TEST_F(PreferencesTest, NeverWriteOverWhatCannotBeRead) {
  folder.write(std::string(kPreferencesFile) + "/inside", "a folder in place of the document");
  EXPECT_EQ(preferences.LGSPreferencesGetValue("first", "a"), std::nullopt);
  preferences.LGSPreferencesSetValue("first", 1, "a");
  EXPECT_FALSE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(log.messages.back(), HasSubstr("a.ptree: Is a directory"));
  EXPECT_THAT(folder.names(kPreferencesFile), ElementsAre("inside"));
  unlink(folder.path(std::string(kPreferencesFile) + "/inside").c_str());
  rmdir(folder.path(kPreferencesFile).c_str());
  ASSERT_EQ(symlink("a.ptree", folder.path(kPreferencesFile).c_str()), 0);
  EXPECT_FALSE(preferences.LGSPreferencesSynchronize("a"));
  EXPECT_THAT(log.messages.back(), HasSubstr("a.ptree: a symbolic link"));
  EXPECT_EQ(modeOf(kPreferencesFile) & S_IFMT, mode_t{S_IFLNK});
  unlink(folder.path(kPreferencesFile).c_str());
  EXPECT_TRUE(preferences.LGSPreferencesSynchronize("a"));  // the change has waited
  EXPECT_EQ(found(), (PropertyDict{{"first", 1}}));
  const std::string longest(245, 'b');  // no longer name can be given to what is kept aside
  const std::string malformed = std::string(kPreferencesFolder) + "/" + longest + ".ptree";
  folder.write(malformed, "no document");
  preferences.LGSPreferencesSetValue("first", 1, longest);
  EXPECT_FALSE(preferences.LGSPreferencesSynchronize(longest));
  EXPECT_THAT(log.messages.back(), EndsWith("-20240305T091502Z: File name too long"));
  EXPECT_EQ(folder.read(malformed), "no document");
}

TEST_F(PreferencesTest, AreNotWrittenWhileAnotherProcessKeepsTheFolder) {
  HostPreferences here(device, clock, log, "mobile", std::chrono::milliseconds(20));
  folder.write(kPreferencesFile, kOneKey);
  here.LGSPreferencesSetValue("first", 2, "a");
  {
    const auto kept = lockFolder(folder.path(kPreferencesFolder), error);
    EXPECT_FALSE(here.LGSPreferencesSynchronize("a"));
    EXPECT_THAT(log.messages,
                ElementsAre(folder.path(kPreferencesFolder) + ": another process keeps it locked"));
    EXPECT_EQ(folder.read(kPreferencesFile), kOneKey);
  }
  EXPECT_TRUE(here.LGSPreferencesSynchronize("a"));
  EXPECT_EQ(found(), (PropertyDict{{"first", 2}}));
}

TEST_F(PreferencesTest, EndWithoutAWordWhenNotEvenTheLogCanBeWritten) {
  class FullLog final : public SystemLog {
    bool keeps(LogLevel /*level*/) const override { return true; }
    void write(LogLevel /*level*/, std::string_view /*message*/) override {
      throw std::bad_alloc();
    }
  } full;
  folder.write(std::string(kPreferencesFile) + "/inside", "a folder in place of the document");
  {
    HostPreferences here(device, clock, full);
    here.LGSPreferencesSetValue("first", 1, "a");
    here.LGSPreferencesSetValue("first", 1, "b");
  }
  EXPECT_THAT(folder.names(kPreferencesFolder), ElementsAre("a.ptree", "b.ptree"));
}

TEST_F(PreferencesTest, RefuseNamesThatLeadElsewhereAndValuesThatNoDocumentCarries) {
  for (const std::string& domain : {""s, "../a"s, "."s, ".a"s, "a/b"s, "a\0b"s}) {
    log.messages.clear();
    preferences.LGSPreferencesSetValue("k", 1, domain);
    EXPECT_THAT(log.messages, ElementsAre(EndsWith("\" cannot be the name of a domain"))) << domain;
    EXPECT_FALSE(preferences.LGSPreferencesSynchronize(domain));
    EXPECT_EQ(preferences.LGSPreferencesGetValue("k", domain), std::nullopt);
  }
  HostPreferences other(device, clock, log, "../mobile");
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
