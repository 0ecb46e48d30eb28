#include "config/TBConfig.h"

#include <algorithm>
#include <filesystem>
#include <random>

#include "common/TextForm.h"
#include "config/PrefixTable.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;

constexpr const char* kInternal = R"({"logLevel": "debug", "properties": {"InternalBuild": true}})";
constexpr const char* kPath = "Library/Application Support/Tallybook/Whitelist_Stagebox.ptree";
const std::string kParseFailure = "error: Couldn't parse the contents of the config file. Error: ";

/// What becomes of the value of each key, in words.
std::vector<std::string> scalarOptions(const TBConfig& config,
                                       std::initializer_list<const char*> keys) {
  std::vector<std::string> texts;
  for (const char* key : keys) {
    const ScalarOptions* const options = config.configOptionsForScalarKey(key);
    std::string text = options == nullptr ? "left out" : "";
    if (options != nullptr && options->bucketInterval) {
      text += "buckets of " + std::to_string(*options->bucketInterval);
    }
    if (options != nullptr && options->significantDigits) {
      text += std::to_string(*options->significantDigits) + " digits";
    }
    texts.push_back(text.empty() ? "as it is" : text);
  }
  return texts;
}

TEST(TBConfig, PutsExactKeysBeforePrefixesInOrder) {
  TestDevice device;
  device.writeWhitelistJson(R"({
      "First": {"ScalarKeys": {"exact": {}, "twice": {"sig_fig": 1}}, "Ignored": true,
                "ScalarKeyPrefixes": {"ex": {"sig_fig": 2}, "exac": {"sig_fig": 3},
                                      "long.er": {"sig_fig": 4}, "long": {"sig_fig": 5}},
                "DistributionKeys": {"dist": {}}},
      "Second": {"ScalarKeys": {"twice": {"sig_fig": 6}}, "ScalarKeyPrefixes": {"long": {"sig_fig": 7}},
                 "DistributionKeyPrefixes": {"d": {"intervals": [7]}}}})");
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  EXPECT_THAT(scalarOptions(*config, {"exact", "exactly", "twice", "long.er.key", "long.key",
                                      "Exact", "dist", ""}),
              ElementsAre("as it is", "2 digits", "6 digits", "4 digits", "7 digits", "left out",
                          "left out", "left out"));
  EXPECT_EQ(config->configOptionsForDistributionKey("dist")->intervals, nullptr);
  EXPECT_EQ(textForm(*config->configOptionsForDistributionKey("dust")->intervals), "(7)");
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
        "Absent": {"ScalarKeys": {"absent": {}}}, "On": {"ScalarKeys": {"on": {"sig_fig": 1}}},
        "Off": {"ScalarKeys": {"off": {"sig_fig": 2}}}, "Zero": {"ScalarKeys": {"zero": {"bucket_interval": 3}}},
        "InternalTesting": {"ScalarKeys": {"testing": {"sig_fig": 4}}}})");
    Preferences& preferences = device.platform().preferences();
    preferences.LGSPreferencesSetValue("On", true, "com.quill.da");
    preferences.LGSPreferencesSetValue("Off", false, "com.quill.da");
    preferences.LGSPreferencesSetValue("Zero", 0, "com.quill.da");
    preferences.LGSPreferencesSetValue("InternalTesting", true, "com.quill.da");
    const std::unique_ptr<TBConfig> config = TBConfig::init();
    using Texts = std::vector<std::string>;
    EXPECT_EQ(
        scalarOptions(*config, {"absent", "on", "off", "zero", "testing", "other"}),
        isInternal
            ? Texts({"as it is", "1 digits", "2 digits", "buckets of 3", "4 digits", "as it is"})
            : Texts({"as it is", "1 digits", "left out", "left out", "left out", "left out"}));
    EXPECT_EQ(device.log(),
              isInternal ? Texts({"debug: passing @{} for other as device is Quill Internal"})
                         : Texts({"default: keyGroup Off is disabled by tasking",
                                  "default: keyGroup Zero is disabled by tasking"}));
  }
}

TEST(TBConfig, HoldsBackWhatItCannotRead) {
  TestDevice device(kInternal);
  device.writeWhitelistJson(R"({"NoGroup": [], "Group": {
      "DistributionKeys": 1, "DistributionKeyPrefixes": {"d.": {"intervals": ["1"]}},
      "ScalarKeys": {"p.mended": {"sig_fig": "2"}, "p.true": true, "p.text": {"sig_fig": "2"},
                     "p.spoiled": {}, "p.good": {"sig_fig": 3}},
      "ScalarKeyPrefixes": {"q.": {"bucket_interval": true}, "p.": {}}},
    "Later": {"ScalarKeys": {"p.mended": {"sig_fig": 4}, "p.spoiled": 1},
              "DistributionKeys": {"e": {"intervals": 1}},
              "DistributionKeyPrefixes": {"d.": {}}}})");
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  const std::string whitelist = "error: Whitelist: ";
  const std::string held = "keys cannot be read, which are left out; the first is ";
  EXPECT_THAT(
      device.log(),
      ElementsAre(
          "error: Whitelist group NoGroup is not a dictionary and is skipped",
          "error: Whitelist group Group: DistributionKeys is not a dictionary and is skipped",
          whitelist + "ScalarKeys: options of 3 " + held + "p.true in group Group",
          whitelist + "DistributionKeys: options of 1 " + held + "e in group Later",
          whitelist + "ScalarKeyPrefixes: options of 1 " + held + "q. in group Group"));
  EXPECT_THAT(scalarOptions(*config, {"p.true", "p.text", "p.spoiled", "p.mended", "p.good",
                                      "p.other", "q.any"}),
              ElementsAre("left out", "left out", "left out", "4 digits", "3 digits", "as it is",
                          "left out"));
  EXPECT_NE(config->configOptionsForDistributionKey("d.any"), nullptr);
  EXPECT_EQ(config->configOptionsForDistributionKey("e"), nullptr);
}

TEST(TBConfig, TellsOfOptionsThatNothingReads) {
  TestDevice device;
  device.writeWhitelistJson(R"({"A": {
      "ScalarKeys": {"later": {}, "a": {"sigfig": 2, "x": 1}, "mended": {"sigfig": 2},
                     "told": {"owner": 1, "reason": [], "expires": "", "sig_fig": 1}},
      "DistributionKeys": {"d": {"sig_fig": 2}}, "DistributionKeyPrefixes": {"d.": {"intervals": []}}},
    "InternalTesting": {"ScalarKeyPrefixes": {"p.": {"intervals": []}}},
    "B": {"About": {"x": 1}, "ScalarKeys": {"later": {"interval": 5}, "mended": {}}}})");
  TBConfig::init();
  const std::string rest =
      " keys have options that nothing reads, so they leave as if these were "
      "not there; the first is ";
  EXPECT_THAT(
      device.log(),
      ElementsAre("error: Whitelist: ScalarKeys: 2" + rest + "a in group A with sigfig",
                  "error: Whitelist: DistributionKeys: 1" + rest + "d in group A with sig_fig"));
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

TEST(PrefixTable, AnswersLikeAScanInOrder) {
  std::mt19937 random(20240305);
  const auto text = [&random](std::string_view letters, std::size_t longest) {
    std::string made(random() % (longest + 1), '\0');
    for (char& c : made) {
      c = letters[random() % letters.size()];
    }
    return made;
  };
  int answered = 0;
  const std::string common = "common to all.";
  for (const std::string& letters : {std::string("ab"), std::string("a.\0\x01\x7F\x80\xFF", 7)}) {
    for (const std::size_t count : {0U, 1U, 10U, 3000U, 3001U}) {
      const std::string begin = count % 2 == 0 ? common : "";
      std::vector<std::string> prefixes;
      for (std::size_t i = 0; i < count; ++i) {
        // The empty prefix, which hides all that follow, comes late.
        const std::string made = text(letters, 9);
        const std::string prefix = begin + (made.empty() && i < count / 2 ? "a" : made);
        if (std::find(prefixes.begin(), prefixes.end(), prefix) == prefixes.end()) {
          prefixes.push_back(prefix);
        }
      }
      const PrefixTable table({prefixes.begin(), prefixes.end()});
      for (int i = 0; i < 500; ++i) {
        const std::string key = (i % 50 == 0 ? "comm" : begin) + text(letters, 12);
        const auto first =
            std::find_if(prefixes.begin(), prefixes.end(),
                         [&](const std::string& prefix) { return key.starts_with(prefix); });
        const std::optional<std::size_t> expected =
            first != prefixes.end() ? std::optional<std::size_t>(first - prefixes.begin())
                                    : std::nullopt;
        ASSERT_EQ(table.find(key), expected) << key;
        answered += expected ? 1 : 0;
      }
    }
  }
  EXPECT_GT(answered, 1000);
}

}  // namespace
}  // namespace vesprun
