#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <random>
#include <sstream>

#include "HttpClient.h"
#include "support/ProgramTest.h"

namespace vesprun {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

/// The program on an SQLite store, and on a ClickHouse server where one is given by the
/// environment.
class FleetTest : public ProgramTest, public ::testing::WithParamInterface<std::string> {
 protected:
  FleetTest() {
    if (GetParam() == "SQLite") {
      store = folder.path("fleet.db");
      return;
    }
    const char* const server = std::getenv("VESPFLEET_TEST_SERVER");
    if (server == nullptr) {
      return;
    }
    static int made = 0;
    const std::string name =
        "vespfleet_test_" + std::to_string(getpid()) + '_' + std::to_string(++made);
    system = std::make_unique<HttpClient>(std::string(server) + "/system");
    system->post("CREATE DATABASE " + name);
    dropDatabase = "DROP DATABASE " + name;
    store = std::string(server) + '/' + name;
  }
  ~FleetTest() override {
    if (system) {
      system->post(dropDatabase);
    }
  }
  void SetUp() override {
    if (store.empty()) {
      GTEST_SKIP() << "no ClickHouse server: VESPFLEET_TEST_SERVER is not set";
    }
  }

  /// What follows `vespfleet` in a shell; the exit status.
  int run(const std::string& arguments) {
    return runScript("S='" + store + "'; '" VESPFLEET_PROGRAM "' " + arguments);
  }
  /// The output of a question, which must have an answer.
  std::string ask(const std::string& question) {
    EXPECT_EQ(run(question), 0) << error;
    return output;
  }
  /// All that the store tells.
  std::string answers() {
    return ask("keys \"$S\"") + ask("scalar \"$S\" a --least 1") +
           ask("scalar \"$S\" b --least 1") + ask("distribution \"$S\" d --least 1");
  }
  void write(const char* file, const std::vector<std::string>& lines) {
    std::string text;
    for (const std::string& line : lines) {
      text += line + '\n';
    }
    folder.write(file, text);
  }
  void load(const std::vector<std::string>& lines) {
    write("lines", lines);
    EXPECT_EQ(run("load \"$S\" lines"), 0) << error;
  }

  std::string store;
  std::unique_ptr<HttpClient> system;
  std::string dropDatabase;
};

INSTANTIATE_TEST_SUITE_P(Stores, FleetTest, ::testing::Values("SQLite", "ClickHouse"),
                         [](const auto& tested) { return tested.param; });

struct Line {
  std::string device = "D";
  int day = 20000;
  int revision = 1;
  std::string created = "2024-10-05T00:00:00Z";
  std::string scalars = {};
  std::string distributions = {};
  std::string histograms = {};
};

std::string text(const Line& line) {
  return "{\"version\":1,\"device\":\"" + line.device + "\",\"day\":" + std::to_string(line.day) +
         ",\"revision\":" + std::to_string(line.revision) + ",\"created\":{\"date\":\"" +
         line.created + "\"},\"whitelist\":\"w\",\"scalars\":{" + line.scalars +
         "},\"distributions\":{" + line.distributions + "},\"histograms\":{" + line.histograms +
         "}}";
}

TEST_P(FleetTest, HoldsWhatTheHighestRevisionSaysInWhateverOrderItArrives) {
  const std::vector<std::string> lines = {
      text({.scalars = R"("a":1,"b":2)", .distributions = R"("d":[1,2,1.5,0.5,2])"}),
      text({.revision = 2, .scalars = R"("a":3)"}),
      text({.revision = 2, .created = "2024-10-05T00:00:00.5Z", .scalars = R"("a":4)"}),
      text({.revision = 2, .created = "2024-10-05T00:00:00.5Z", .scalars = R"("a":7)"}),
      text({.device = "E", .scalars = R"("a":10)"}),
  };
  const std::string expected =
      "{\"key\":\"a\",\"kind\":\"scalar\",\"devices\":2,\"days\":1}\n"
      "{\"day\":20000,\"devices\":2,\"minimum\":7,\"maximum\":10,\"mean\":8.5,\"quantiles\":"
      "{\"0.05\":7,\"0.25\":7,\"0.5\":7,\"0.75\":10,\"0.95\":10}}\n";
  std::mt19937 random(3);
  for (int order = 0; order < 4; ++order) {
    if (GetParam() == "SQLite") {
      std::remove(store.c_str());
    } else if (order > 0) {
      system->post(dropDatabase);
      system->post("CREATE DATABASE" + dropDatabase.substr(dropDatabase.rfind(' ')));
    }
    std::vector<std::string> shuffled = lines;
    std::shuffle(shuffled.begin(), shuffled.end(), random);
    load({shuffled[0], shuffled[1]});
    load({shuffled[2], shuffled[0], shuffled[3]});
    load({shuffled[4]});
    EXPECT_EQ(answers(), expected);
    load(shuffled);
    EXPECT_EQ(answers(), expected) << "loaded again";
  }
}

TEST_P(FleetTest, TellsNothingOfTooFewDevices) {
  std::vector<std::string> lines;
  for (int device = 0; device < 5; ++device) {
    Line line{
        .device = "D" + std::to_string(device),
        .distributions =
            R"("d":[1.0,4.0,2.5,5.0,4],"none":[0,0,0,0,0],"nan":[1,2,{"real":"nan"},1,2],"e":[1.0,4.0,2.5,5.0,4])"};
    line.scalars = "\"a\":" + std::to_string(device) + (device < 4 ? ",\"b\":1" : "");
    const std::string boundary = std::to_string(device);
    line.histograms = R"~("e":{"(-inf, )~" + boundary + "]\":2,\"(" + boundary + ", inf)\":2}";
    line.histograms += device < 4 ? R"~(,"d":{"(-inf, 2]":2,"(2, inf)":2})~" : "";
    lines.push_back(text(line));
  }
  lines.push_back(text({.device = "D0", .day = -7, .scalars = "\"a\":9223372036854775807"}));
  load(lines);
  const std::string fifth =
      "{\"day\":20000,\"devices\":5,\"minimum\":0,\"maximum\":4,\"mean\":2.0,\"quantiles\":"
      "{\"0.05\":0,\"0.25\":1,\"0.5\":2,\"0.75\":3,\"0.95\":4}}\n";
  EXPECT_EQ(ask("scalar \"$S\" a"), "{\"day\":-7,\"devices\":1}\n" + fifth);
  EXPECT_EQ(ask("scalar \"$S\" a --from 00 --to 020000"), fifth);
  EXPECT_EQ(ask("scalar \"$S\" a --from 20001"), "");
  EXPECT_EQ(ask("scalar \"$S\" a --from 020000 --least 08"), "{\"day\":20000,\"devices\":5}\n");
  EXPECT_EQ(run("scalar \"$S\" a --from 0x1"), 2);
  EXPECT_EQ(ask("scalar \"$S\" b"), "{\"day\":20000,\"devices\":4}\n");
  EXPECT_EQ(ask("scalar \"$S\" d"), "") << "a key of the other kind";
  EXPECT_EQ(ask("distribution \"$S\" none") + ask("distribution \"$S\" nan"), "");
  const std::string statistics =
      "{\"day\":20000,\"devices\":5,\"statistics\":[1.0,4.0,2.5,25.0,20],\"histogram\":";
  EXPECT_EQ(ask("distribution \"$S\" d"), statistics + "null}\n");
  EXPECT_EQ(ask("distribution \"$S\" d --least 4"),
            statistics + "{\"(-inf, 2]\":8,\"(2, inf)\":8}}\n");
  EXPECT_EQ(error, "");
  EXPECT_THAT(ask("distribution \"$S\" e"), HasSubstr(R"~({"(-inf, 0]":2,"(-inf, 1]":2,)~"));
  EXPECT_THAT(error, HasSubstr("day 20000: devices counted between different boundaries"));
  EXPECT_EQ(ask("keys \"$S\""),
            "{\"key\":\"a\",\"kind\":\"scalar\",\"devices\":5,\"days\":2}\n"
            "{\"key\":\"b\",\"kind\":\"scalar\",\"devices\":4,\"days\":1}\n"
            "{\"key\":\"d\",\"kind\":\"distribution\",\"devices\":5,\"days\":1}\n"
            "{\"key\":\"e\",\"kind\":\"distribution\",\"devices\":5,\"days\":1}\n");
  EXPECT_EQ(run("keys \"$S\" >/dev/full 2>error #"), 1);
  EXPECT_EQ(error, "vespfleet: standard output cannot be written\n");
}

TEST_P(FleetTest, SkipsMalformedLinesAndNamesThem) {
  const std::string good = text({.scalars = R"("a":1)", .histograms = R"("d":{"x":1})"});
  const auto with = [&good](const std::string& from, const std::string& to) {
    std::string changed = good;
    return changed.replace(changed.find(from), from.size(), to);
  };
  const std::vector<std::pair<std::string, std::string>> malformed = {
      {"", "a blank line"},
      {good.substr(0, good.size() - 1), "not JSON"},
      {"[]", "not an object"},
      {with("\"version\":1", "\"version\":2"), "another version"},
      {with("\"day\":20000,", ""), "an entry is missing"},
      {with("{\"version\"", "{\"secret\":1,\"version\""), "does not belong"},
      {with("\"a\":1", "\"secret\":1,\"secret\":2"), "a name twice"},
      {with("\"x\":1", "\"x\":1,\"x\":1"), "a name twice"},
      {with("20000", "2147483648"), "no 32-bit integer"},
      {with("20000", "1.0"), "no 32-bit integer"},
      {with("\"revision\":1", "\"revision\":0"), "a revision"},
      {with("\"D\"", "\"\""), "an empty device"},
      {with("\"D\"", "\"secret\\u0001\""), "XML cannot carry"},
      {with("\"w\"", "7"), "whitelist"},
      {with("2024-10-05", "2024-10-55"), "not JSON"},
      {with("{\"date\":\"2024-10-05T00:00:00Z\"}", "1"), "creation date"},
      {with("\"a\":1", "\"\":1"), "an empty key"},
      {with("\"a\":1", "\"a\":9223372036854775808"), "no 64-bit integer"},
      {with("\"a\":1", "\"a\":true"), "no 64-bit integer"},
      {with("\"distributions\":{", "\"distributions\":{\"d\":[1,2,3,4,2147483648]"), "a count"},
      {with("\"distributions\":{", "\"distributions\":{\"d\":[1,2,3,4]"), "four doubles"},
      {with("\"x\":1", "\"x\":-1"), "a count"},
  };
  std::string lines;
  for (const auto& [line, why] : malformed) {
    lines += line + '\n';
  }
  folder.write("bad", lines + good);
  EXPECT_EQ(run("load \"$S\" missing bad"), 1);
  EXPECT_EQ(output, "{\"files\":1,\"unreadableFiles\":1,\"lines\":1,\"malformedLines\":" +
                        std::to_string(malformed.size()) + "}\n");
  EXPECT_THAT(error, Not(HasSubstr("secret")));
  std::istringstream errors(error);
  std::string told;
  std::getline(errors, told);
  EXPECT_EQ(told, "missing: No such file or directory");
  for (std::size_t i = 0; i < malformed.size(); ++i) {
    std::getline(errors, told);
    EXPECT_THAT(told, ::testing::StartsWith("bad:" + std::to_string(i + 1) + ": "));
    EXPECT_THAT(told, HasSubstr(malformed[i].second)) << malformed[i].first;
  }
  EXPECT_EQ(ask("scalar \"$S\" a --least 1 | wc -l"), "1\n");
}

TEST_P(FleetTest, RefusesWhatIsNoFleetStore) {
  EXPECT_EQ(run("keys \"$S\""), 1) << "nothing was loaded yet";
  EXPECT_THAT(error, ::testing::StartsWith("vespfleet: " + store + ": "));
  if (GetParam() == "SQLite") {
    folder.write("notes", "nothing of a store");
    folder.write("empty", "");
    EXPECT_EQ(
        std::system(("sqlite3 '" + folder.path("other") + "' 'CREATE TABLE line(x)'").c_str()), 0);
    const std::string other = folder.read("other");
    folder.write("lines", text({.scalars = R"("a":1)"}) + '\n');
    for (const char* const name : {"notes", "empty", "other", "."}) {
      EXPECT_EQ(run(std::string("load ") + name + " lines"), 1) << name;
      EXPECT_THAT(error, HasSubstr(std::string("vespfleet: ") + name + ": no fleet store\n"));
      EXPECT_EQ(run(std::string("keys ") + name), 1) << name;
    }
    EXPECT_EQ(folder.read("notes") + folder.read("empty"), "nothing of a store");
    EXPECT_EQ(folder.read("other"), other);
    EXPECT_EQ(run("load no/folder lines"), 1);
    load({text({})});
    struct stat status {};
    EXPECT_EQ(stat(store.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0600U);
  } else {
    system->post("CREATE TABLE" + dropDatabase.substr(dropDatabase.rfind(' ')) +
                 ".vespfleet_scalar(key String) ENGINE = Log");
    folder.write("lines", text({}) + '\n');
    EXPECT_EQ(run("load \"$S\" lines"), 1);
    EXPECT_THAT(error, HasSubstr("the table vespfleet_scalar has other columns"));
    EXPECT_EQ(run("keys http://127.0.0.1:1/fleet"), 1);
    for (const char* const address :
         {"http://127.0.0.1:1", "http://u:p@127.0.0.1:1/fleet", "http://127.0.0.1:1/a/b"}) {
      EXPECT_EQ(run(std::string("keys ") + address), 2) << address;
    }
  }
}

TEST_P(FleetTest, KeepsOnlyTheLastRevisionsWhereverALoadIsKilled) {
  std::vector<std::string> lines;
  for (int revision = 1; revision <= 40; ++revision) {
    for (int device = 0; device < 20; ++device) {
      const std::string value = std::to_string(revision * 1000 + device);
      lines.push_back(text({.device = "D" + std::to_string(device),
                            .revision = revision,
                            .scalars = "\"a\":" + value + ",\"b" + value + "\":1",
                            .distributions = "\"d\":[1,2,1.5,0.5," + value + "]",
                            .histograms = "\"d\":{\"x\":" + value + "}"}));
    }
  }
  write("all", lines);
  for (const useconds_t delay : {0U, 5000U, 20000U, 60000U}) {
    const pid_t child = fork();
    if (child == 0) {
      execl(VESPFLEET_PROGRAM, "vespfleet", "load", store.c_str(), folder.path("all").c_str(),
            nullptr);
      _exit(1);
    }
    usleep(delay);
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
  }
  load(lines);
  const std::string answered = answers();
  EXPECT_THAT(answered, HasSubstr("\"devices\":20,\"minimum\":40000,\"maximum\":40019"));
  EXPECT_THAT(answered, HasSubstr("\"histogram\":{\"x\":800190}"));
  EXPECT_EQ(std::count(answered.begin(), answered.end(), '\n'), 20 + 2 + 2);
  if (GetParam() == "SQLite") {
    EXPECT_EQ(std::system(("test \"$(sqlite3 '" + store +
                           "' 'SELECT sum(length(entries)) FROM chunk')\" -lt 2000")
                              .c_str()),
              0);
  }
}

}  // namespace
}  // namespace vesprun
