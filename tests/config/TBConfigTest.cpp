#include "config/TBConfig.h"

#include <filesystem>

#include "common/TextForm.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;

constexpr const char* kInternal = R"({"logLevel": "debug", "properties": {"InternalBuild": true}})";
constexpr const char* kPath = "Library/Application Support/Tallybook/Whitelist_Stagebox.ptree";
const std::string kParseFailure = "error: Couldn't parse the contents of the config file. Error: ";

/// The options for each key as text, "none" for a key left out.
std::string scalarOptions(const TBConfig& config, std::initializer_list<const char*> keys) {
  std::string text;
  for (const char* key : keys) {
    const PropertyDict* options = config.configOptionsForScalarKey(key);
    text += (text.empty() ? "" : " ") + (options != nullptr ? textForm(*options) : "none");
  }
  return text;
}

TEST(TBConfig, PutsExactKeysBeforePrefixesInOrder) {
  TestDevice device;
  device.writeWhitelistJson(R"({
      "First": {"ScalarKeys": {"exact": {}, "twice": {"sig_fig": 1}}, "Ignored": true,
                "ScalarKeyPrefixes": {"ex": {"sig_fig": 2}, "exac": {"sig_fig": 3},
                                      "long.er": {"sig_fig": 4}, "long": {"sig_fig": 5}},
                "DistributionKeys": {"dist": {}}},
      "Second": {"ScalarKeys": {"twice": {"sig_fig": 6}}, "ScalarKeyPrefixes": {"long": {"sig_fig": 7}},
                 "DistributionKeyPrefixes": {"d": {"intervals": []}}}})");
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  EXPECT_EQ(scalarOptions(*config, {"exact", "exactly", "twice", "long.er.key", "long.key", "Exact",
                                    "dist", ""}),
            "{} {sig_fig = 2} {sig_fig = 6} {sig_fig = 4} {sig_fig = 7} none none none");
  EXPECT_EQ(textForm(*config->configOptionsForDistributionKey("dist")), "{}");
  EXPECT_EQ(textForm(*config->configOptionsForDistributionKey("dust")), "{intervals = ()}");
  EXPECT_EQ(config->configOptionsForDistributionKey("exact"), nullptr);
  EXPECT_THAT(device.log(), ElementsAre("debug: prefix match ex for exactly",
                                        "debug: prefix match long.er for long.er.key",
                                        "debug: prefix match long for long.key",
                                        "debug: prefix match d for dust"));
}

TEST(TBConfig, TakesGroupsByDeviceAndTasking) {
  for (const bool isInternal : {false, true}) {
    TestDevice device(isInternal ? kInternal : TestDevice::kDescription);
    device.writeWhitelistJson(R"({
        "Absent": {"ScalarKeys": {"absent": {}}}, "On": {"ScalarKeys": {"on": {"a": 1}}},
        "Off": {"ScalarKeys": {"off": {"b": 1}}}, "Zero": {"ScalarKeys": {"zero": {"c": 1}}},
        "InternalTesting": {"ScalarKeys": {"testing": {"d": 1}}}})");
    Preferences& preferences = device.platform().preferences();
    preferences.LGSPreferencesSetValue("On", true, "com.quill.da");
    preferences.LGSPreferencesSetValue("Off", false, "com.quill.da");
    preferences.LGSPreferencesSetValue("Zero", 0, "com.quill.da");
    preferences.LGSPreferencesSetValue("InternalTesting", true, "com.quill.da");
    const std::unique_ptr<TBConfig> config = TBConfig::init();
    EXPECT_EQ(
        scalarOptions(*config, {"absent", "on", "off", "zero", "testing", "other"}),
        isInternal ? "{} {a = 1} {b = 1} {c = 1} {d = 1} {}" : "{} {a = 1} none none none none");
    using Log = std::vector<std::string>;
    EXPECT_EQ(device.log(), isInternal
                                ? Log({"debug: passing @{} for other as device is Quill Internal"})
                                : Log({"default: keyGroup Off is disabled by tasking",
                                       "default: keyGroup Zero is disabled by tasking"}));
  }
}

TEST(TBConfig, HoldsBackWhatItCannotRead) {
  TestDevice device(kInternal);
  device.writeWhitelistJson(R"({"NoGroup": [], "Group": {
      "DistributionKeys": 1, "DistributionKeyPrefixes": {"d.": {"intervals": ["1"]}},
      "ScalarKeys": {"p.true": true, "p.text": {"sig_fig": "2"}, "p.good": {"sig_fig": 3}},
      "ScalarKeyPrefixes": {"q.": {"bucket_interval": true}, "p.": {}}}})");
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  using ::testing::HasSubstr;
  EXPECT_THAT(device.log(),
              ElementsAre(HasSubstr("group NoGroup is not a dictionary and is skipped"),
                          HasSubstr("group Group: DistributionKeys is not a dictionary"),
                          HasSubstr("Prefixes: options of 1 keys cannot be read"),
                          HasSubstr("ScalarKeys: options of 2 keys cannot be read, which are left "
                                    "out; the first is p.true"),
                          HasSubstr("the first is q.")));
  EXPECT_EQ(scalarOptions(*config, {"p.true", "p.text", "p.good", "p.other", "q.any"}),
            "none none {sig_fig = 3} {} none");
  EXPECT_EQ(config->configOptionsForDistributionKey("d.any"), nullptr);
}

TEST(TBConfig, FailsOnAnyFileThatIsNoWhitelist) {
  TestDevice device;
  EXPECT_EQ(TBConfig::init(), nullptr);
  EXPECT_THAT(device.log(), ElementsAre("error: Couldn't load whitelist"));
  const std::pair<const char*, const char*> kCases[] = {
      {"<ptree version=\"1.0\"><array/></ptree>", "the root is not a dictionary"},
      {"no ptree", "line 1: the document does not begin with <ptree>"},
  };
  for (const auto& [content, error] : kCases) {
    device.write(kPath, content);
    EXPECT_EQ(TBConfig::init(), nullptr);
    EXPECT_EQ(device.log().back(), kParseFailure + error);
  }
  // The first is read and fails later, the second is not even read; neither takes room on the disk.
  for (const auto& [size, error] : {std::pair(256U << 20, "Couldn't parse"),
                                    std::pair((256U << 20) + 1, "Couldn't load whitelist")}) {
    std::filesystem::resize_file(device.path(kPath), size);
    EXPECT_EQ(TBConfig::init(), nullptr);
    EXPECT_THAT(device.log().back(), ::testing::HasSubstr(error));
  }
  const std::string whole = "<ptree version=\"1.0\"><dict/></ptree>";
  device.write(kPath, whole);
  EXPECT_EQ(TBConfig::init()->configFileDigest(), "09d8a7a8df0a493c4493c4b22c7c9dbb");
  device.write(kPath, whole + '\n');
  EXPECT_EQ(TBConfig::init()->configFileDigest(), "a6332e5df6b0ce9126a3fa57b7135d51");
}

}  // namespace
}  // namespace vesprun
