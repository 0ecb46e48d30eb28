#include <filesystem>
#include <random>

#include "vespctl/VespctlTest.h"

namespace vesprun {
namespace {

using ::testing::HasSubstr;

const std::string kDatabase = "device/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";

/// A device on day 19787 whose corruptions were counted and whose group "Off" is switched off.
class PreviewTest : public VespctlTest {
 protected:
  PreviewTest() { describe(""); }

  void describe(const std::string& entries) {
    folder.write("device/device.json",
                 R"({"clock": "2024-03-05T09:15:02Z", "apps": [{"bundle": "a", "user": true}],)"
                 R"("registry": [], "kernel": {"ticks": {"value": 1, "numerator": 1, )"
                 R"("denominator": 1}, "variables": {"vm.vmtc_total": {"u32": 7}}})" +
                     entries + "}");
    writePtree("device/var/mobile/Library/Preferences/com.quill.aggregated.ptree",
               R"({"DatabaseCorruptionCount": 3})");
    writePtree("device/var/mobile/Library/Preferences/com.quill.da.ptree",
               R"({"Off": false, "InternalTesting": false})");
  }
};

/// A whitelist of short keys in all four lists, which often meet, as JSON text.
std::string randomWhitelist(std::mt19937& random) {
  const char* const options[] = {"{}",
                                 R"({"sig_fig":1})",
                                 R"({"bucket_interval":10,"sig_fig":2})",
                                 R"({"sig_fig":"1"})",
                                 R"({"intervals":[2,5.5]})",
                                 R"({"intervals":true})"};
  PropertyDict groups;
  for (const char* name : {"A", "InternalTesting", "Off", "B"}) {
    PropertyDict lists;
    for (const char* list :
         {"ScalarKeys", "ScalarKeyPrefixes", "DistributionKeys", "DistributionKeyPrefixes"}) {
      PropertyDict entries;
      for (const char* key : {"a", "ab", "b.", "b.c", "com.quill."}) {
        if (random() % 4 == 0) {
          entries.set(key, valueOfJson(options[random() % std::size(options)]));
        }
      }
      lists.set(list, entries);
    }
    groups.set(name, lists);
  }
  return jsonText(groups);
}

TEST_F(PreviewTest, PreviewsWhatTheRunSubmitsRightAfter) {
  std::string lines;
  int number = 0;
  for (const char* day : {"19784", "19785", "19786", "19787"}) {
    for (const char* key : {"a", "ab", "abc", "b.c", "d", "com.quill.kernel.vmtc_total"}) {
      if (++number % 3 != 0) {
        lines += std::string("scalar\t") + day + '\t' + key + '\t' + std::to_string(number * 997);
        lines += std::string("\nsample\t") + day + '\t' + key + "\t4\t1\nsample\t" + day + '\t' +
                 key + '\t' + std::to_string(number) + ".25\t2\n";
      }
    }
  }
  import(lines);
  int logs = 0;
  for (unsigned int seed = 0; seed < 12; ++seed) {
    std::mt19937 random(seed);
    describe(seed % 3 == 0 ? R"(, "properties": {"InternalBuild": true})" : "");
    writePtree(kWhitelist, randomWhitelist(random));
    const bool today = seed % 4 == 3;
    const std::string day = today ? " --day 19787" : "";
    const std::string before = snapshot();
    const std::string preview = print("preview --document" + day);
    const std::string json = print("preview --json" + day);
    const PropertyValue leftOut = valueOfJson(print("preview --json --left-out" + day));
    EXPECT_EQ(snapshot(), before) << seed;
    print(std::string("run -- ") + (today ? "-t" : "-f"));
    const bool hasLog = run("ptree device/outbox/logs/*-193-*.ptree") == 0;
    EXPECT_EQ(json, hasLog ? output : "null\n") << seed;
    EXPECT_EQ(preview, hasLog ? shell("cat device/outbox/logs/*-193-*.ptree") : "") << seed;
    logs += hasLog ? 1 : 0;
    if (!leftOut.array()->empty()) {
      const PropertyDict& row = *leftOut.array()->back().dict();
      const bool isScalar = *row.findString("kind") == "scalar";
      print("explain --json " + *row.findString("key") +
            (isScalar ? " --kind scalar" : " --kind distribution"));
      EXPECT_THAT(output, HasSubstr("\"leaves\":false")) << seed;
    }
    std::filesystem::remove_all(folder.path("device/outbox"));
    std::filesystem::remove_all(folder.path("device/var/mobile/Library/Preferences"));
  }
  EXPECT_GT(logs, 8);
}

TEST_F(PreviewTest, PreviewsNullWhereNothingWouldBeSubmitted) {
  import("scalar\t19785\ts\t1\nscalar\t19786\ts\t1\n");
  const struct {
    const char* entries;
    const char* whitelist;
    const char* complaint;
  } cases[] = {
      {"", R"({"Off": {"ScalarKeys": {"s": {}}}})",
       "vespctl preview: keyGroup Off is disabled by tasking\n"},
      {R"(, "submission": {"enabled": false})", R"({"G": {"ScalarKeys": {"s": {}}}})", ""},
      {R"(, "submission": {"fails": true})", R"({"G": {"ScalarKeys": {"s": {}}}})",
       "vespctl preview: Failed to write aggregated log\n"},
      {R"(, "languages": {"preferred": ["\u0001"]})", R"({"G": {"ScalarKeys": {"s": {}}}})",
       "vespctl preview: Could not create aggregated ptree: "},
      {R"(, "properties": {"InternalBuild": true})", "[]",
       "vespctl preview: Couldn't parse the contents of the config file. "},
  };
  for (const auto& [entries, whitelist, complaint] : cases) {
    describe(entries);
    writePtree(kWhitelist, whitelist);
    EXPECT_EQ(print("preview --json"), "null\n") << whitelist;
    EXPECT_TRUE(error.starts_with(complaint) && error.empty() == (*complaint == '\0')) << error;
    EXPECT_EQ(print("preview --document"), "");
  }
  EXPECT_EQ(print("preview --json --left-out"), "[{\"kind\":\"scalar\",\"key\":\"s\"}]\n");
  EXPECT_EQ(run("preview --left-out --document"), 2);
  EXPECT_EQ(run("preview --day x"), 2);
}

TEST_F(PreviewTest, LooksAtADeviceWithoutTouchingIt) {
  import("scalar\t19786\ts\t1\n");
  writePtree(kWhitelist, R"({"G": {"ScalarKeys": {"s": {}}}})");
  const std::string database = folder.read(kDatabase);
  std::string otherFormat = database;
  otherFormat[18] = 3;
  std::string writeAhead = database;
  writeAhead[18] = writeAhead[19] = 2;
  const struct {
    std::string database;
    const char* beside;
    const char* complaint;
  } cases[] = {
      {database, "-none", ""},
      {database, "-journal", "the last commit was cut off"},
      {"", "-journal", "not a counter database"},
      {database, "-wal", "has a write-ahead log"},
      {"", "-wal", "TBDataStore"},
      {writeAhead, "-none", "has a write-ahead log"},
      {otherFormat, "-none", "the header is damaged"},
      {database.substr(0, database.size() / 2), "-none", "malformed"},
      {"no database", "-none", "not a database"},
  };
  for (const auto& [content, beside, complaint] : cases) {
    folder.write(kDatabase, content);
    folder.write(kDatabase + beside, "\xD9\xD5\x05\xF9\x20\xA1\x63\xD7");
    shell("chmod -R a-w device");
    const std::string before = snapshot();
    for (const char* command : {"preview", "preview --left-out", "explain s", "page",
                                "whitelist diff device/Library/*/*/Whitelist_Stagebox.ptree"}) {
      EXPECT_EQ(run(command), *complaint == '\0' ? 0 : 1) << command << complaint << output;
      EXPECT_THAT(error, HasSubstr(complaint)) << command;
      EXPECT_EQ(std::count(error.begin(), error.end(), '\n'), *complaint == '\0' ? 0 : 1) << error;
    }
    EXPECT_EQ(snapshot(), before) << complaint;
    shell("chmod -R u+w device");
    std::filesystem::remove(folder.path(kDatabase + beside));
  }
}

TEST_F(PreviewTest, ExplainsByWhatAKeyLeavesOrStays) {
  import(
      "scalar\t19785\tkey\t14\nscalar\t19786\tkey\t26\nscalar\t19787\tkey\t9\n"
      "scalar\t19786\tkey.longer\t1\nsample\t19786\tpre.d\t3\t0\nsample\t19786\theld.d\t3\t0\n"
      "sample\t19786\tpre.d.longer\t9\t0\n");
  writePtree(kWhitelist, R"({
      "A": {"ScalarKeys": {"key": {}, "held": {"sig_fig": "2"}, "text": "x"},
            "ScalarKeyPrefixes": {"pre.": {}}, "DistributionKeyPrefixes": {"pre": {"intervals": [5]}}},
      "Off": {"ScalarKeys": {"key": {}}, "ScalarKeyPrefixes": {"o": {}, "off": {}}},
      "B": {"ScalarKeys": {"key": {"bucket_interval": 10, "why": 1}}, "DistributionKeys": {"held.d": {"intervals": 1}}},
      "InternalTesting": {"ScalarKeyPrefixes": {"of": {}}, "ScalarKeys": {"off": {}}}})");
  const std::string nothing = R"("prefix":null,"group":null,"options":null,"source":)";
  const std::string off = R"({"group":"Off","why":"disabled by tasking","by":)";
  const std::pair<const char*, std::string> cases[] = {
      {"key",
       R"("leaves":true,"by":"key","prefix":null,"group":"B","options":{"bucket_interval":10,"why":1},"source":false,"passedOver":[)" +
           off +
           R"("key"}],"values":[{"day":19785,"stored":14,"reported":10},{"day":19786,"stored":26,"reported":30}]})"},
      {"held",
       R"("leaves":false,"by":"key","prefix":null,"group":"A","options":{"sig_fig":"2"},"source":false,"passedOver":[],"values":[]})"},
      {"text", R"("leaves":false,"by":"key","prefix":null,"group":"A","options":null,)"},
      {"pre.fix", R"("leaves":true,"by":"prefix","prefix":"pre.","group":"A","options":{},)"},
      {"off",
       R"("leaves":false,"by":null,)" + nothing + R"(false,"passedOver":[)" + off +
           R"("prefix"},{"group":"InternalTesting","why":"internal devices only","by":"key"}],"values":[]})"},
      {"key.longer",
       R"("leaves":false,"by":null,)" + nothing +
           R"(false,"passedOver":[],"values":[{"day":19786,"stored":1,"reported":null}]})"},
      {"com.quill.kernel.swapusage", R"("leaves":false,"by":null,)" + nothing + "true,"},
      {"pre.d --kind distribution",
       R"("leaves":true,"by":"prefix","prefix":"pre","group":"A","options":{"intervals":[5]},"source":false,"passedOver":[],"values":[{"day":19786,"statistics":[3.0,3.0,3.0,0.0,1],"histogram":{"(-inf, 5]":1}}]})"},
      {"held.d --kind distribution",
       R"("options":{"intervals":1},"source":false,"passedOver":[],"values":[{"day":19786,"statistics":null,"histogram":null}]})"},
  };
  for (const auto& [key, answer] : cases) {
    EXPECT_THAT(print(std::string("explain --json ") + key), HasSubstr(answer));
  }
  describe(R"(, "properties": {"InternalBuild": true})");
  const std::pair<const char*, const char*> onInternalDevice[] = {
      {"text", R"("leaves":false,"by":"key")"},
      {"off",
       R"("leaves":true,"by":"key","prefix":null,"group":"InternalTesting","options":{},"source":false,"passedOver":[])"},
      {"key.longer",
       R"("leaves":true,"by":"internal device","prefix":null,"group":null,"options":{},)"}};
  for (const auto& [key, answer] : onInternalDevice) {
    EXPECT_THAT(print(std::string("explain --json ") + key), HasSubstr(answer));
  }
  std::filesystem::remove(folder.path(kWhitelist));
  EXPECT_THAT(print("explain --json key"), HasSubstr(R"("leaves":false,"by":null,)" + nothing));
}

}  // namespace
}  // namespace vesprun
