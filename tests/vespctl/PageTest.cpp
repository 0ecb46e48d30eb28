#include <sys/stat.h>

#include <array>
#include <regex>
#include <set>

#include "vespctl/VespctlTest.h"

namespace vesprun {
namespace {

using ::testing::AllOf, ::testing::ElementsAre, ::testing::HasSubstr;
using ::testing::Not, ::testing::StartsWith;

/// A device whose whitelist lets what begins with "s." and "d." through.
class PageTest : public VespctlTest {
 protected:
  PageTest() {
    writePtree(kWhitelist, R"({"G": {"ScalarKeyPrefixes": {"s.": {}},
                                     "DistributionKeyPrefixes": {"d.": {"intervals": [10, 100]}}}})");
  }

  /// Counts what `lines` say of a day and reports it on the day after. Day 1 is 1970-01-02.
  void report(int day, const std::string& lines) {
    char time[32];
    std::snprintf(time, sizeof time, "1970-01-%02dT09:15:02Z", day + 2);
    folder.write("device/device.json",
                 std::string("{\"clock\": \"") + time + "\", \"registry\": []}");
    import(std::regex_replace(lines, std::regex("(scalar|sample)\t"),
                              "$1\t" + std::to_string(day) + '\t'));
    print("run -- -f");
  }

  const std::string& page() {
    print("page");
    EXPECT_THAT(output, StartsWith("<!DOCTYPE html>\n"));
    return output;
  }
};

TEST_F(PageTest, ShowsTheCourseOfEachKeyOverTheDays) {
  report(1, "scalar\ts.a\t10\nscalar\ts.once\t7\nsample\td.a\t5\t0");
  report(2, "scalar\ts.a\t99\nsample\td.a\t20\t0");
  report(2, "scalar\ts.a\t30\n");  // again: the second revision holds
  report(4,
         "scalar\ts.a\t20000\nscalar\tkept\t987654321\nsample\td.a\t500\t0\n"
         "sample\td.kept\t1\t0\nsample\tkept\t1\t0");
  EXPECT_THAT(page(), Not(HasSubstr("987654321"))) << "a value that stays";
  for (const char* const shown :
       {"<b>3</b> days reported", "<b>4</b> keys kept back", "<p>No report of 1970-01-04.</p>",
        "s.a</bdi></summary><p class=values>1970-01-02 10\n1970-01-03 30\n1970-01-05 20000\n</p>",
        // Broken where a day is missing.
        "3 values from 10 to 20\u202F000, the newest 20\u202F000\"><path class=m d=\"M5 84L102",
        "class=m d=\"M5 84L102 84M295 15h0\"/><path class=e d=\"M295 15h0\"/></svg>",
        "<td>7 <small>1970-01-03</small><td>", ", logarithmic</figcaption>"}) {
    EXPECT_THAT(output, HasSubstr(shown));
  }
  const std::size_t keptBack = output.find("<section id=left-out>");
  EXPECT_THAT(output.substr(keptBack),
              AllOf(HasSubstr("<h3>3 scalars</h3>"), HasSubstr("<h3>1 distribution</h3>"),
                    HasSubstr("<li><bdi>kept</bdi>"), Not(HasSubstr("d.kept"))));
}

TEST_F(PageTest, SaysHowTheStorageIs) {
  EXPECT_THAT(page(), AllOf(HasSubstr("no verdict"), HasSubstr("No figure of the storage")));
  const auto writeLog = [this](const char* name, const std::string& date, const char* fields) {
    folder.write("device/outbox/logs/" + std::string(name),
                 "Date: " + date + " 00:00:00 +0000\n\n" + date + " vesprun[1]: " + fields);
  };
  writeLog("9999-165-StorageStatus.log", "1970-01-02", "UserWamp:9;com.quill.NANDInfo.numPfail:7");
  writeLog("10000-165-StorageStatus.log", "1970-01-03",
           "UserWamp:2.5;com.quill.NANDInfo.numGrownBad:0;com.quill.NANDInfo.numPfail:1;"
           "com.quill.NANDInfo.UserPartitionPEPercentUsed:60;com.quill.NANDInfo.numEfail:-1");
  const std::string event =
      "{\"time\":\"1970-01-04T00:00:00Z\",\"event\":"
      "\"com.quill.massStorage.NANDInfo.";
  folder.write(
      "device/outbox/events.jsonl",
      event + R"(FTLCounters_1","payload":{"hostWrites":500,"zero":0}})" + '\n' + event +
          R"(FTLCounters_1","payload":{"numGrownBad":3,"hostWrites":1000,"percentUsed":79,)" +
          R"("zero":0}})" + '\n' + event +
          R"(SM.Daily.FTLCounters_1","payload":{"hostWrites":25.0}})" + '\n');
  EXPECT_THAT(page(), AllOf(HasSubstr("<b>look at</b> storage"),
                            HasSubstr("class=\"verdict look\">Some figures deserve a look."),
                            HasSubstr("<li class=look>3 blocks went bad in use."),
                            HasSubstr("<li class=look>1 program operation failed."),
                            HasSubstr("<li class=good>79\u202F% of the rated erase cycles"),
                            HasSubstr("user partition is 2.5. <small>1970-01-03</small>"),
                            HasSubstr("last day is 2.5\u202F% of all"),
                            HasSubstr("2 values from 500 to 1\u202F000"),
                            HasSubstr("1 field always 0</summary><p class=names><bdi>zero</bdi>"),

                            Not(HasSubstr("erase operation")), HasSubstr("<bdi>log 165-Storage")));
  folder.write("device/outbox/events.jsonl",
               event +
                   "FTLCounters_1\",\"payload\":{\"numDieFailures\":1,"
                   "\"spareAvailablePercent\":100}}\n");
  EXPECT_THAT(page(), AllOf(HasSubstr("class=\"verdict act\">The storage needs attention."),
                            HasSubstr("<li class=act>1 die failure counted."),
                            HasSubstr("<li class=good>100\u202F% of the spare blocks")));
}

TEST_F(PageTest, NoTextOfOthersBecomesMarkup) {
  const std::array hostile{"<script>alert(1)</script>",
                           "\"><img src=x onerror=alert(1)>",
                           "</style></title><svg/onload=alert(1)>",
                           "' onclick='alert(1)",
                           "&lt;b&gt;&#60;b&#62;",
                           "<!--",
                           "]]>",
                           "\u202Ecod.exe\u202C",
                           "\u2066\u200Bx\u2069",
                           "שלום",
                           "\U000E0041"};
  std::string lines;
  std::string events;
  for (const std::string text : hostile) {
    lines += "scalar\ts." + text + "\t1\nscalar\t" + text + "\t1\nsample\td." + text +
             "\t1\t0\nsample\t" + text + "\t1\t0\n";
    std::string json = text;
    for (std::size_t at = 0; (at = json.find('"', at)) != std::string::npos; at += 2) {
      json.insert(at, 1, '\\');
    }
    events += "{\"time\":\"" + json + "\",\"event\":\"" + json + "\",\"payload\":{\"" + json +
              "\":\"" + json + "\",\"n" + json + "\":1,\"z" + json + "\":0,\"msp_index\":\"" +
              json + "\"}}\n";
    folder.write("device/outbox/logs/1-165-" + std::to_string(lines.size()) +
                     std::regex_replace(text, std::regex("/"), "\\") + ".log",
                 text);
  }
  const std::string longest = std::string(5000, 'k') + "<i>";
  report(1, lines + "scalar\ts." + longest + "\t1\nscalar\t" + longest + "\t1");
  folder.write("device/outbox/events.jsonl", events + "{}\n{\"event\":\"\\u0000\\u001b\"}\n");
  folder.write("device/outbox/logs/0009-193-log-aggregated.ptree", "<b>");
  const std::string html = page();
  EXPECT_THAT(html, AllOf(HasSubstr("s.&lt;script&gt;alert(1)&lt;/script&gt;</bdi>"),
                          HasSubstr("<bdi>d.&quot;&gt;&lt;img"), HasSubstr("<bdi>s.\\u{202E}cod"),
                          HasSubstr("s.&amp;lt;b&amp;gt;"), HasSubstr("&#39; onclick=&#39;"),
                          HasSubstr("<bdi>s.שלום</bdi>"), HasSubstr("\\u{0}\\u{1B}"),
                          HasSubstr("<summary><i>empty</i>"), HasSubstr("\\u{E0041}"),
                          HasSubstr(std::string(5000, 'k') + "&lt;i&gt;</bdi></p>"),
                          HasSubstr("5\u202F003 bytes"),
                          HasSubstr("default-src 'none'; style-src 'unsafe-inline'")));
  // NOLINTNEXTLINE(misc-misleading-bidirectional)
  for (const char* const unseen : {"\u202E", "\u2066", "\u200B", "\U000E0041", "\x1B"}) {
    EXPECT_THAT(html, Not(HasSubstr(unseen)));
  }
  // Whatever looks like a tag is one that the page itself has, with its attributes.
  const std::size_t body = html.find("</style>");
  std::set<std::string> foreign;
  const std::regex tag("<[^>]*>?");
  const std::regex own(
      "</?(a|article|b|bdi|details|div|figcaption|figure|h[123]|header|html|i|li|main|nav|p|path|"
      "rect|section|small|span|style|summary|svg|t[drh]|table|thead|title|ul)"
      "( (open|(class|id|role|aria-hidden|preserveAspectRatio)=[a-z0-9-]+|"
      "(class|d|width|height|href|viewBox)=\"[a-zA-Z0-9# -]*\"|aria-label=\"[a-z0-9 "
      ",.\u202F-]*\"))*/?>");
  for (std::sregex_iterator at(html.begin() + static_cast<std::ptrdiff_t>(body), html.end(), tag);
       at != std::sregex_iterator(); ++at) {
    if (!std::regex_match(at->str(), own)) {
      foreign.insert(at->str());
    }
  }
  EXPECT_THAT(foreign, ElementsAre());
}

TEST_F(PageTest, PutsKeysThatBeginAlikeTogether) {
  std::string lines;
  for (int i = 0; i < 100; ++i) {
    lines += "scalar\ts." +
             std::string(i < 50   ? "one."
                         : i < 98 ? "two.x."
                                  : "k") +
             std::to_string(i) + "\t" + std::to_string(i) + '\n';
  }
  report(1, lines);
  EXPECT_THAT(page(), AllOf(HasSubstr("<details><summary><bdi>s.one.</bdi> <small>50</small>"),
                            HasSubstr("<bdi>s.two.x.</bdi> <small>48</small>"),
                            HasSubstr("<bdi>s.</bdi> others <small>2</small>")));
  for (int i = 0; i < 100; ++i) {
    const std::string value = "1970-01-02 " + std::to_string(i) + "\n</p>";
    EXPECT_NE(output.find(value), std::string::npos) << value;
    EXPECT_EQ(output.find(value), output.rfind(value)) << value;
  }
}

TEST_F(PageTest, FoldsOldReportsAndLeavesOldEventsOut) {
  std::string days;
  std::string events;
  for (int i = 1; i <= 450; ++i) {
    days += i <= 20 ? "scalar\t" + std::to_string(i) + "\ts.a\t1\n" : "";
    events += R"({"event":"e","time":"1970-01-02T00:00:00Z","payload":{"n":)" + std::to_string(i) +
              "}}\n";
  }
  import(days);
  folder.write("device/device.json", R"({"clock": "1970-01-23T09:00:00Z", "registry": []})");
  print("catch-up --last 30");
  folder.write("device/outbox/events.jsonl", events);
  EXPECT_THAT(
      page(),
      AllOf(HasSubstr(">6 earlier reports<"), HasSubstr(">450 sent, the last 1970-01-02<"),
            HasSubstr("<p class=values>1970-01-02 201\n"), HasSubstr("\n1970-01-02 450\n")));
}

TEST_F(PageTest, NamesWhatItCannotRead) {
  report(1, "scalar\ts.a\t1");
  folder.write("device/outbox/logs/0007-193-log-aggregated.ptree", "<ptree");
  folder.write("device/outbox/events.jsonl", "{\n[]\n{\"event\":\"sound\"}\n");
  EXPECT_THAT(page(), AllOf(HasSubstr("<li><bdi>0007-193-log-aggregated.ptree</bdi>: "),
                            HasSubstr("<li><bdi>events.jsonl</bdi>: 2 lines cannot be read"),
                            HasSubstr("<bdi>s.a</bdi>"), HasSubstr("<bdi>sound</bdi>")));
  EXPECT_THAT(error, AllOf(HasSubstr("vespctl page: 0007-193-log-aggregated.ptree: "),
                           HasSubstr("vespctl page: events.jsonl: 2 lines cannot be read\n")));
  print("init empty");
  print("-C empty page");
  EXPECT_THAT(output, AllOf(HasSubstr("There is no daily log"), HasSubstr("No scalar"),
                            HasSubstr("No distribution"), HasSubstr("No analytics event")));
  EXPECT_THAT(output, HasSubstr("Every key of the counter database may leave"));
}

TEST_F(PageTest, WritesAFileWholeOrNotAtAll) {
  folder.write("page.html", "earlier");
  folder.write("folder/kept", "");
  EXPECT_EQ(run("page - >standard; ln -s page.html link; mkfifo pipe"), 0);
  EXPECT_EQ(run("page link"), 0) << error;
  EXPECT_EQ(folder.read("page.html"), folder.read("standard"));
  struct stat status {};
  EXPECT_EQ(stat(folder.path("page.html").c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 0777U, 0600U);
  for (const auto& [file, complaint] :
       {std::pair("folder", "not a regular file"), std::pair("pipe", "not a regular file"),
        std::pair("nowhere/page", "No such file"), std::pair("page.html/x", "Not a directory")}) {
    EXPECT_EQ(run("page " + std::string(file)), 1) << file;
    EXPECT_THAT(error, HasSubstr(complaint)) << file;
  }
  EXPECT_EQ(run("page >/dev/full"), 1);
  EXPECT_THAT(folder.names("folder"), ElementsAre("kept"));
}

}  // namespace
}  // namespace vesprun
