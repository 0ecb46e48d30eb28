#include "platform/host/device/LiveSystem.h"

#include <gmock/gmock.h>
#include <sys/sysinfo.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>

#include "common/LittleEndian.h"
#include "platform/host/device/Pseudonym.h"
#include "support/TemporaryFolder.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre, ::testing::IsEmpty;

TEST(LiveSystem, TheSwapRecordIsTotalFreeUsedAndPageSize) {
  const std::optional<KernelVariable> record = live::swapUsage();
  struct sysinfo system {};
  ASSERT_EQ(sysinfo(&system), 0);
  ASSERT_TRUE(record);
  ASSERT_EQ(record->bytes.size(), 32U);
  const auto field = [&](std::size_t at) {
    return loadLittleEndian<std::uint64_t>(record->bytes.data() + at);
  };
  EXPECT_EQ(field(0), std::uint64_t{system.totalswap} * system.mem_unit);
  EXPECT_EQ(field(8) + field(16), field(0));
  EXPECT_NEAR(static_cast<double>(field(8)), static_cast<double>(system.freeswap) * system.mem_unit,
              64e6);                                                        // it may move
  EXPECT_EQ(field(24), static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE)));  // and a flag of 0
}

TEST(LiveSystem, ADigestStandsForTheMachine) {
  const auto identifierOf = [](const std::string& entries) {
    return TestDevice('{' + entries + '}')
        .platform()
        .deviceInformation()
        .GetSysIDWithDescription(false);
  };
  EXPECT_EQ(identifierOf(R"("system": {"systemID": "own"})"), "own");
  // Known bytes: HMAC-SHA-256 of RFC 4231, second case, begins so.
  EXPECT_EQ(pseudonymOf("Jefe", "what do ya want for nothing?"),
            "5bdcc146bf60754e6a042426089575c7");
  const std::string machine = live::machineIdentifier();
  EXPECT_EQ(identifierOf(""), machine.empty() ? "" : pseudonymOf(machine, "vesprun system"));
}

TEST(LiveSystem, AppsAreTheDesktopEntriesOfTheSystemAndTheUser) {
  const TemporaryFolder home;
  home.write(".local/share/applications/own.desktop", "");
  setenv("HOME", home.path().c_str(), 1);
  std::size_t ofSystem = 0;
  for (const char* const folder : {"/usr/share/applications", "/usr/local/share/applications"}) {
    std::error_code missing;
    for (const auto& entry : std::filesystem::directory_iterator(folder, missing)) {
      ofSystem += entry.path().extension() == ".desktop" ? 1U : 0U;
    }
  }
  const std::vector<ApplicationDescription> apps = live::applications();
  ASSERT_EQ(apps.size(), ofSystem + 1);
  EXPECT_TRUE(apps.back().bundle == "own" && apps.back().user);
  EXPECT_EQ(std::ranges::count(apps, true, &ApplicationDescription::user), 1);
}

TEST(LiveSystem, PrefersTheLanguagesOfTheProcess) {
  for (const char* name : {"LANGUAGE", "LC_ALL", "LC_MESSAGES", "LANG"}) {
    unsetenv(name);
  }
  EXPECT_THAT(live::preferredLanguages(), IsEmpty());
  setenv("LANG", "de_CH.UTF-8", 1);
  EXPECT_THAT(live::preferredLanguages(), ElementsAre("de-CH"));
  setenv("LC_MESSAGES", "fr", 1);
  EXPECT_THAT(live::preferredLanguages(), ElementsAre("fr"));
  setenv("LC_ALL", "C", 1);
  EXPECT_THAT(live::preferredLanguages(), IsEmpty());
  setenv("LANGUAGE", "en_GB.UTF-8@euro::POSIX:pt_BR", 1);
  EXPECT_THAT(live::preferredLanguages(), ElementsAre("en-GB", "pt-BR"));
  for (const char* name : {"LANGUAGE", "LC_ALL", "LC_MESSAGES", "LANG"}) {
    unsetenv(name);
  }
}

}  // namespace
}  // namespace vesprun
