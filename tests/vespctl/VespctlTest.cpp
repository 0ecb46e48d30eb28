#include "vespctl/VespctlTest.h"

#include <algorithm>
#include <map>
#include <sstream>

#include "platform/host/figures/FigureTable.h"

namespace vesprun {
namespace {

using ::testing::AllOf, ::testing::AnyOf, ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty, ::testing::MatchesRegex;
using ::testing::Not;

TEST_F(VespctlTest, SaysWhatIsWrong) {
  folder.write("apps", R"([{"version": "1"}, {"uuid": "0011223-34455-6677-8899-AABBCCDDEEFF"}])");
  folder.write("bad", "sample\t1\tk\tnan(x)\t0\n");
  folder.write("file/outbox/logs", "");
  shell("mkdir huge && truncate -s 17000000 huge/device.json");
  const char* const noNumber = " is not a number from 0 to ";
  const struct {
    int status;  ///< 2: the arguments are wrong
    const char* arguments;
    const char* complaint;
  } cases[] = {
      {2, "frob", "unknown command \"frob\"; one of init, run,"},
      {2, "shwo", "unknown command \"shwo\", perhaps \"show\"; one of init, run,"},
      {2, "--json show", "\"--json\" stands before the command"},
      {2, "init", "DIR is required: A folder"},
      {2, "", "a command is missing; one of init, run,"},
      {2, "counters frob 1",
       "unknown command \"frob\"; one of get, set, add, sample, import, dump"},
      {2, "counters", "a command is missing; one of get"},
      {2, "counters set k 1 2", "VALUE: At Most 1"},
      {2, "ptree a b", "not expected"},
      {2, "show frob", "unknown kind \"frob\"; one of logs"},
      {2, "prefs get d k --frob", "not expected"},
      {2, "counters set k abc", "\"abc\" is not a signed 64-bit integer"},
      {2, "counters set k 1 --day x", "\"x\" is not a day: "},
      {2, "counters sample k 1 infinity", "\"infinity\" is not a double"},
      {2, "counters dump --from a", "\"a\" is not a day: "},
      {2, "prefs set d k '{'", "JSON: \"{\""},
      {2, "fields frob", "unknown list \"frob\""},
      {2, "nand magazine -- -1", noNumber},
      {2, "nand magazine 18446744073709551616", noNumber},
      {2, "nand magazine 0x8", noNumber},
      {2, "nand magazine 1 --mode 0x1", noNumber},
      {2, "nand magazine 1 --mode=-1", noNumber},
      {2, "nand magazine 1 --mode 4294967296", noNumber},
      {2, "counters dump --json", "not expected"},
      {2, "show -C device", "\"-C\" is not expected here: it stands before the command"},
      {1, "-C nowhere show", "nowhere: No such file"},
      {1, "-C file counters set k 1", "file: no device: it has no device.json; make one with"},
      {1, "init file", "file: is not empty"},
      {1, "collect --root nowhere", "nowhere: No such file"},
      {1, "ptree - </tmp", "standard input: Is a directory"},
      {1, "ptree nowhere", "nowhere: No such file"},
      {1, "ptree $'\\e[2J'", "vespctl ptree: \\x1b[2J: No such file or directory\n"},
      {1, "ptree <(echo '<dict>')", "line 1: "},
      {1, "decode base nowhere", "nowhere: No such file"},
      {1, "prefs get d k", "no key \"k\" in domain \"d\""},
      {1, "counters import - </tmp", "line 1: Is a directory"},
      {1, "counters import bad", "bad: line 1: \"nan(x)\" is not a double"},
      {1, "send apps apps", "apps: app 2: \"uuid\": not a UUID text"},
      {1, "send apps - <<<'[7]'", "standard input: app 1: not a dictionary"},
      {1, "send apps - <<<'[{\"x\": 1}]'", "app 1: \"x\": unknown entry"},
      {1, "send apps - <<<'[{\"arch\": true}]'", "app 1: \"arch\": not a signed 64-bit"},
      {1, "nand disk >&-", "standard output cannot be written"},
  };
  for (const auto& [status, arguments, complaint] : cases) {
    EXPECT_EQ(run(arguments), status) << arguments;
    EXPECT_THAT(error, HasSubstr(complaint)) << arguments;
    EXPECT_TRUE(error.starts_with(status == 2 ? "vespctl" : "vespctl ")) << error;
    const auto lines = std::count(error.begin(), error.end(), '\n');
    EXPECT_EQ(lines, status == 2 ? 2 : 1) << error << "where help is, too";
  }
  EXPECT_EQ(run("fields >/dev/null; ulimit -f 1; '" VESPCTL_PROGRAM "' page full"), 1);
  EXPECT_THAT(error, HasSubstr("full: File too large")) << "no signal";
  // Just above what the loader needs, not even an exception finds memory.
  EXPECT_EQ(shell("limited() { (ulimit -v $1; '" VESPCTL_PROGRAM "' fields) >/dev/null 2>&1; }; "
                  "for ((m = 40000; m > 0; m -= 1000)); do limited $m || break; done; "
                  "for ((i = m + 1000; m < 39000 && i > m; i -= 40)); do limited $i; s=$?; "
                  "test $s -lt 2 -o $s = 127 || echo $i: $s; done"),
            "");
  EXPECT_EQ(print("counters dump"), "") << "nothing was changed";
}

TEST_F(VespctlTest, InitIsWholeAndCanBeRepeated) {
  // Cut short with a mark, and by a version that made none: the same device comes out.
  for (const char* const left :
       {"cp -r device half && rm half/device.json && touch half/.init-unfinished",
        "cp -r device half && rm half/Library/*/*/* && touch half/.unfinished-1",
        "mkdir half && touch half/.init-unfinished && mkdir half/Library"}) {
    shell(left);
    print("init half");
    shell("rm -f half/.unfinished-1; diff -r device half && rm -r half");
  }
  print("init half --sample");
  const std::string rows = print("-C half counters dump");
  EXPECT_EQ(print("-C half counters dump | cut -f3 | grep -v '^linux[.]' || true"), "");
  shell("mv half/device.json . && touch half/.init-unfinished");
  print("init half --sample");
  EXPECT_EQ(std::ranges::count(print("-C half counters dump"), '\n'),
            std::ranges::count(rows, '\n'));
  // A device, and what is none, are not touched.
  for (const char* const foreign : {"rm half/Library/*/*/*", "rm half/device.json", "true"}) {
    shell(foreign);
    const std::string before = shell("find half -printf '%p %T@ %m\n' | sort");
    EXPECT_EQ(run("init half"), 1);
    EXPECT_EQ(shell("find half -printf '%p %T@ %m\n' | sort"), before);
  }
}

TEST_F(VespctlTest, DumpsAllButKeysThatBreakALine) {
  for (const char* const change :
       {"set $'a\\nb' 1", "sample $'a\\nb' 1", "set k 2", "sample d 3"}) {
    print("counters " + std::string(change) + " --day 7");
  }
  EXPECT_EQ(run("counters dump"), 1);
  EXPECT_THAT(output, MatchesRegex("scalar\t7\tk\t2\nsample\t7\td\t3\t[0-9]+\n"));
  EXPECT_EQ(error,
            "vespctl counters dump: 2 counters, the first of them \"a\\x0ab\", are left out: no "
            "line can carry a "
            "line feed in a key\n");
}

TEST_F(VespctlTest, TakesNumbersAsDecimalOnes) {
  for (const char* const number : {"0", "08", "18446744073709551615"}) {
    print(std::string("nand magazine -- ") + number);
  }
  EXPECT_EQ(print("days --last 010 --json | wc -l"), "10\n");
  for (const char* const option : {"days --last ", "catch-up --last ", "prune --counters ",
                                   "prune --outbox ", "prune --outbox-size "}) {
    EXPECT_NE(run(std::string(option) + "08"), 2) << error;
    EXPECT_EQ(run(std::string(option) + "0x8"), 2) << option;
    EXPECT_THAT(error, HasSubstr("\"0x8\" is not a number from ")) << option;
  }
}

TEST_F(VespctlTest, TakesDaysAsNumbersDatesAndWords) {
  folder.write("device/device.json", R"({"clock": "2024-03-05T09:15:02Z"})");
  for (const char* const day : {"19787", "2024-03-05", "today"}) {
    print(std::string("counters add a.key 1 --day ") + day);
  }
  print("counters sample a.key 1 2 --day yesterday");
  EXPECT_EQ(print("counters get 'a.*' --json"),
            R"({"day":19786,"kind":"distribution","key":"a.key","statistics":[1.0,2.0,1.5,0.5,2]}
{"day":19787,"kind":"scalar","key":"a.key","value":3}
)");
  EXPECT_EQ(print("counters get --exact 'a.*' --json --from 1970-01-01"), "");
  EXPECT_EQ(
      print("counters get --to yesterday a.key"),
      "Date          Day  Kind          Key    Value\n"
      "2024-03-04  19786  distribution  a.key  minimum 1, maximum 2, mean 1.5, deviations 0.5, "
      "count 2\n");
  EXPECT_EQ(print("counters get a.kye"),
            "\"a.kye\" was never counted; the nearest that was is \"a.key\".\n");
  EXPECT_EQ(
      print("counters get 'a.kye*'"),
      "A key that begins with \"a.kye\" was never counted; the nearest that was is \"a.key\".\n");
  EXPECT_EQ(print("counters get a.key --to 2024-01-01"),
            "\"a.key\" was not counted in these days, but from 2024-03-04 to 2024-03-05.\n");
  for (const char* const day : {"2024-02-30", "tomorrow", "0x8", "99999999-01-01"}) {
    EXPECT_EQ(run(std::string("preview --day ") + day), 2);
    EXPECT_THAT(error, HasSubstr(std::string("\"") + day + "\" is not a day: "));
  }
}

TEST_F(VespctlTest, TellsOfADamagedDatabase) {
  const char* const database = "device/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";
  const char* const kept = "is not a database; kept as ";
  folder.write(database, "no database");
  EXPECT_EQ(run("counters set k 1"), 0);
  EXPECT_THAT(error, HasSubstr(kept));
  EXPECT_EQ(run("counters set k 2 --day 5"), 0);
  EXPECT_THAT(error, IsEmpty());
  folder.write(database, "no database");
  EXPECT_EQ(run("counters dump"), 1);
  EXPECT_THAT(error, HasSubstr(kept));
  EXPECT_EQ(std::count(error.begin(), error.end(), '\n'), 1) << error;
}

TEST_F(VespctlTest, ShowsSubmittedLogs) {
  std::string text = "Date: today\n\nvesprun: a:0";
  for (int i = 1; i < 50; ++i) {
    text += ";a:" + std::to_string(i);
  }
  folder.write("device/outbox/logs/0001-165-Storage.log", text);
  folder.write("device/outbox/logs/0002-193-log.ptree", R"(<?xml version="1.0" encoding="UTF-8"?>
<ptree version="1.0"><dict>
<key>TBStartDate</key><date>2024-03-05T00:00:00Z</date>
<key>TBScalars</key><dict><key>k</key><integer>7</integer></dict>
<key>TBDistributions</key><dict><key>d</key><array>
<real>1</real><real>3</real><real>2</real><real>2</real><integer>2</integer></array></dict>
<key>TBDistributionsHistogram</key><dict><key>d</key><dict>
<key>(-inf, 2]</key><integer>1</integer><key>(2, inf)</key><integer>-4</integer></dict></dict>
</dict></ptree>)");
  EXPECT_EQ(run("show"), 0);
  EXPECT_THAT(output,
              AllOf(HasSubstr("\n  vesprun: a:0\n    a:1\n"), HasSubstr("\n    … "),
                    HasSubstr(" more; "), Not(HasSubstr("a:49")), HasSubstr("\n0002-193-log")));
  EXPECT_EQ(run("show logs"), 0);
  EXPECT_THAT(output, AllOf(HasSubstr("\n    a:49\n0002-193-log.ptree\n"),
                            HasSubstr("  day        2024-03-05T00:00:00Z\n"),
                            HasSubstr("  created    (absent)\n"), HasSubstr("    k  7\n"),
                            HasSubstr("count 2, min 1, mean 2, max 3, standard deviation 1\n"),
                            HasSubstr("  (-inf, 2]  " + std::string(40, '#') + " 1\n"),
                            HasSubstr("   (2, inf)   -4\n")));
  folder.write("device/outbox/events.jsonl", R"({"event": "a"}
{"event": "b"}
x
)");
  EXPECT_EQ(print("show events --last 2"), "  b  0 fields\n(line 3 cannot be read)\n");
}

TEST_F(VespctlTest, ExportsNothingOfAnUnsoundDailyLog) {
  const std::string dates =
      R"({"TBStartDate": {"date": "2024-03-05T00:00:00Z"}, "TBLogCreationDate": {"date": "2024-03-06T00:00:00Z"})";
  const std::string digest = dates + R"(, "TBWhitelistDigest": "w")";
  const auto log = [&](const char* scalars, const char* distributions, const char* histograms) {
    return digest + R"(, "TBScalars": )" + scalars + R"(, "TBDistributions": )" + distributions +
           R"(, "TBDistributionsHistogram": )" + histograms + "}";
  };
  const char* const notFive = "a distribution that is not five numbers";
  const char* const notCounts = "a histogram that is no dictionary of counts";
  const std::pair<std::string, const char*> cases[] = {
      {"[]", "not a dictionary"},
      {R"({"TBStartDate": 1, "TBLogCreationDate": 2})", "a date is missing"},
      {dates + "}", "the whitelist digest is missing"},
      {log("[]", "{}", "{}"), "its scalars, distributions or histograms are missing"},
      {log(R"({"k": 1.5})", "{}", "{}"), "a scalar that is no integer"},
      {log("{}", R"({"d": [1, 2, 3, 4]})", "{}"), notFive},
      {log("{}", R"({"d": [1, 2, 3, 4, 5.5]})", "{}"), notFive},
      {log("{}", R"({"d": [1, 2, 3, "4", 5]})", "{}"), notFive},
      {log("{}", "{}", R"({"d": 1})"), notCounts},
      {log("{}", "{}", R"({"d": {"(-inf, 1]": "1"}})"), notCounts},
  };
  std::string complaints;
  for (const auto& [document, fault] : cases) {
    const std::string name =
        std::to_string(1000 + std::count(complaints.begin(), complaints.end(), '\n')) +
        "-193-log-aggregated.ptree";
    writePtree("device/outbox/logs/" + name, document);
    complaints += "vespctl export: " + name + ": " + fault + '\n';
  }
  writePtree("device/outbox/logs/2000-193-log-aggregated.ptree", log(R"({"k": 1})", "{}", "{}"));
  EXPECT_EQ(run("export --device d"), 1);
  EXPECT_EQ(error, complaints);
  EXPECT_THAT(output, AllOf(HasSubstr(R"("day":19787,"revision":1,)"), EndsWith("{}}\n")));
  EXPECT_THAT(print("show"),
              HasSubstr("1000-193-log-aggregated.ptree\n  cannot be read: not a dictionary\n"));
}

TEST_F(VespctlTest, CollectsWhatTheStarterWhitelistLetsLeave) {
  // A machine that has every figure: 1 in the unit of a file's first.
  std::map<std::string, std::map<std::string, std::string>> files;
  for (const LinuxFigure& figure : linuxFigures) {
    std::string path = "root" + std::string(figure.file);
    for (const DeviceClass& device : linuxDeviceClasses) {
      std::string name(device.patterns.substr(0, device.patterns.find(' ')));
      std::ranges::replace(name, '#', '1');
      std::ranges::replace(name, '@', 'a');
      if (const std::size_t place = path.find(device.name); place != std::string::npos) {
        path.replace(place, device.name.size(), name);
      }
    }
    const std::string label(figure.field.substr(0, figure.field.rfind(' ') + 1));
    std::string line = label;
    for (int word = 1; word <= 10; ++word) {
      line += (figure.field.ends_with('=') ? "total=" : "") + std::to_string(figure.divisor) + ' ';
    }
    files[path].try_emplace(label, line + '\n');
  }
  for (const auto& [path, lines] : files) {
    std::string text;
    for (const auto& [label, line] : lines) {
      text += line;
    }
    folder.write(path, text);
  }
  EXPECT_EQ(run("collect"), 0) << error;
  EXPECT_EQ(run("collect --root root"), 0) << error;
  EXPECT_EQ(run("collect"), 0) << error;
  EXPECT_EQ(run("counters dump | cut -f 3 | sort -u"), 0);
  const std::string counted = output;
  EXPECT_EQ(run("run -- -t; '" VESPCTL_PROGRAM "' ptree device/outbox/logs/0001*.ptree"), 0);
  for (const LinuxFigure& figure : linuxFigures) {
    const std::string end = figure.key.ends_with('.') ? "" : "\":";
    EXPECT_THAT(output, HasSubstr('"' + std::string(figure.key) + end)) << figure.file;
  }
  std::istringstream keys(counted);
  for (std::string key; keys >> key;) {
    EXPECT_THAT(output, HasSubstr('"' + key + "\":"));
  }
}

TEST_F(VespctlTest, LetsNoControlCharacterFromAFileReachTheTerminal) {
  const std::string clear = "\x1B[2J";
  folder.write("device/outbox/logs/0001-165-" + clear + ".log", "a" + clear + ";b\r\n");
  folder.write("device/outbox/logs/0001-165-" + clear + ".header.json", R"({"\u001b": "\u0007"})");
  folder.write("device/outbox/logs/0002-193-log.ptree",
               "<ptree version=\"1.0\"><dict><key>TBScalars</key><dict><key>\x7F</key>"
               "<string>\n\xC2\x9B</string></dict></dict></ptree>");
  for (const char* name : {"events", "records", "notifications", "log"}) {
    folder.write(
        "device/outbox/" + std::string(name) + ".jsonl",
        R"({"time":"\u001b","event":"\u001b","payload":{"\u001b":"\u001b"},"type":"\b",)"
        R"("record":{"\u001b":"\u001b"},"name":"\u001b","level":"\b","message":"\u001b"})");
  }
  for (const char* part : {"", " events", " records", " logs"}) {
    EXPECT_EQ(run("show" + std::string(part)), 0);
    EXPECT_EQ(output.find_first_of("\x1B\x7F\b\a\r\x9B"), std::string::npos) << output;
    EXPECT_THAT(output, AnyOf(HasSubstr("\\x1b"), HasSubstr("\\x08")));
  }
  EXPECT_THAT(output, HasSubstr("    \\x7f  \\x0a\\xc2\\x9b\n"));
}

}  // namespace
}  // namespace vesprun
