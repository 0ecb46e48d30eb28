#include <sys/file.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <limits>
#include <sstream>

#include "platform/host/preferences/HostPreferences.h"
#include "platform/host/services/HostClock.h"
#include "support/HostServiceTest.h"

namespace vesprun {
namespace {

using namespace std::string_literals;
using ::testing::Contains, ::testing::ElementsAre, ::testing::HasSubstr, ::testing::IsEmpty,
    ::testing::MatchesRegex, ::testing::SizeIs, ::testing::StartsWith;

constexpr const char* kFolder = "var/mobile/Library/Tallybook";
constexpr const char* kFile = "var/mobile/Library/Tallybook/TBDataStore.sqlitedb";
constexpr const char* kAggregated = "com.quill.aggregated";
constexpr const char* kCorruptionCount = "DatabaseCorruptionCount";
constexpr std::int32_t kToday = 19787;
constexpr std::int64_t kMax = std::numeric_limits<std::int64_t>::max();
constexpr std::chrono::milliseconds kShortWait{50};

class TallybookTest : public HostServiceTest {
 protected:
  std::string dump(std::int32_t from = 0, std::int32_t to = 99'999) {
    HostTallybook tallybook(device, clock, preferences, log);
    return linesOf(tallybook, from, to);
  }

  /// Reads every counter up to today as the report does; the number of samples.
  static int readAll(HostTallybook& tallybook) {
    const std::unique_ptr<TBHistory> history = tallybook.initWithDefaultPath();
    history->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
        "", 0, kToday, [](std::string_view, std::int32_t, std::int64_t, bool&) {});
    int samples = 0;
    history->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
        "", 0, kToday,
        [&](std::string_view, std::int32_t, TBHistoryDistributionEnumerator& values, bool&) {
          double value = 0;
          if (values.getNextValueSecondsInDayOffset(value, nullptr)) {
            ++samples;
          }
          std::array<double, 1000> block;
          while (const std::size_t count = values.getNextValues(block)) {
            samples += static_cast<int>(count);
          }
        });
    return samples;
  }

  bool import(const std::string& text) {
    HostTallybook tallybook(device, clock, preferences, log);
    std::istringstream lines(text);
    return tallybook.write(
        [&](CounterStore& store) { return importCounterLines(lines, store, error); }, error);
  }

  void add(std::string_view key, std::int64_t value) {
    HostTallybook(device, clock, preferences, log).TBClientAddValueForScalarKey(key, value);
  }

  std::int64_t corruptions() {
    return HostPreferences(device, clock, log)
        .LGSPreferencesGetIntegerValue(kCorruptionCount, kAggregated);
  }

  HostClock clock{Date{1709630102, 500}};  // 2024-03-05 09:15:02
  HostPreferences preferences{device, clock, log};
};

/// The lines of two counters of today.
std::string scalars(std::int64_t first, std::int64_t second) {
  return "scalar\t19787\tfirst\t" + std::to_string(first) + "\nscalar\t19787\tsecond\t" +
         std::to_string(second) + '\n';
}
std::string scalar(std::int64_t value) {
  return "scalar\t19787\tk\t" + std::to_string(value) + '\n';
}

TEST_F(TallybookTest, CollectsUntilTheCheckpointAndMakesNothingWithoutNeed) {
  {
    HostTallybook tallybook(device, clock, preferences, log);
    EXPECT_EQ(tallybook.TBDaysSince1970(), kToday);
    EXPECT_EQ(tallybook.dateForDaysSince1970(kToday), (Date{1709596800, 0}));
    tallybook.TBClientCheckpoint();
    EXPECT_EQ(dump(), "");
    tallybook.TBClientSetValueForScalarKey("second", 5);
    tallybook.TBClientAddValueForScalarKey("second", 2);
    tallybook.TBClientAddValueForScalarKey("first", kMax);
    EXPECT_THAT(folder.names(), IsEmpty());
    tallybook.TBClientCheckpoint();
    EXPECT_EQ(dump(), scalars(kMax, 7));
    tallybook.TBClientAddValueForScalarKey("first", 1);
    tallybook.TBClientSetValueForScalarKey("second", -1);
  }
  EXPECT_EQ(dump(), scalars(-kMax - 1, -1));
  EXPECT_THAT(folder.names(kFolder), ElementsAre("TBDataStore.sqlitedb"));
  EXPECT_EQ(modeOf(kFile), mode_t{S_IFREG | 0600});
  EXPECT_EQ(modeOf(kFolder), mode_t{S_IFDIR | 0700});
  EXPECT_THAT(log.messages, IsEmpty());
}

TEST_F(TallybookTest, DeliversDaysInclusivelyByDayThenKeyBytes) {
  ASSERT_TRUE(
      import("scalar\t3\tb\t1\nscalar\t1\tz\t2\nscalar\t2\t\xC3\xA9\t3\nscalar\t2\tZ\t4\n"
             "scalar\t2\ta\t5\nscalar\t4\ta\t6\nscalar\t-1\ta\t7\n"
             "sample\t3\td\t1\t0\nsample\t2\te\t2\t7\nsample\t2\te\t3\t-7\n"));
  HostTallybook tallybook(device, clock, preferences, log);
  const std::unique_ptr<TBHistory> history = tallybook.initWithDefaultPath();
  std::vector<std::string> rows;
  const auto found = [&](std::string_view prefix, std::int32_t from, std::int32_t to,
                         std::size_t most = 99) {
    rows.clear();
    history->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
        prefix, from, to,
        [&](std::string_view key, std::int32_t day, std::int64_t value, bool& stop) {
          rows.push_back(std::to_string(day) + std::string(key) + std::to_string(value));
          stop = rows.size() == most;
        });
    return rows;
  };
  EXPECT_THAT(found("", 1, 3), ElementsAre("1z2", "2Z4", "2a5", "2\u00E93", "3b1"));
  EXPECT_THAT(found("a", std::numeric_limits<std::int32_t>::min(), kToday),
              ElementsAre("-1a7", "2a5", "4a6"));
  EXPECT_THAT(found("", 2, 3, 2), ElementsAre("2Z4", "2a5"));
  EXPECT_THAT(found("", 3, 2), IsEmpty());
  rows.clear();
  history->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      "", 2, 3,
      [&](std::string_view key, std::int32_t day, TBHistoryDistributionEnumerator& values, bool&) {
        double value = 0;
        std::int32_t offset = 0;
        while (values.getNextValueSecondsInDayOffset(value, &offset)) {
          rows.push_back(std::to_string(day) + std::string(key) + std::to_string(offset));
        }
        EXPECT_FALSE(values.getNextValueSecondsInDayOffset(value, nullptr));
      });
  EXPECT_THAT(rows, ElementsAre("2e7", "2e-7", "3d0"));
}

TEST_F(TallybookTest, ReadsBackWhatItDumps) {
  std::string text =
      "scalar\t19786\t\t-9223372036854775808\n"
      "scalar\t19786\ta\tb\r\"\xF0\x9F\x98\x80\t9223372036854775807\n"
      "sample\t19786\ta\tb\t-inf\t0\nsample\t19786\ta\tb\tnan\t86399\nsample\t19786\ta\tb\tinf\t1\n"
      "sample\t19786\tc\t-0\t2147483647\nsample\t19786\tc\t5e-324\t-2147483648\n"
      "scalar\t19787\ta\t0\n";
  std::string interleaved = text;
  // Two full chunks, and two with a part of a third; the keys in turn.
  std::string first;
  std::string second;
  for (std::size_t i = 0; i < 2 * CounterStore::kSamplesPerChunk + 5; ++i) {
    const std::string value = std::to_string(i) + ".1\t" + std::to_string(i) + '\n';
    second += "sample\t19787\tsecond\t" + value;
    interleaved += "sample\t19787\tsecond\t" + value;
    if (i < 2 * CounterStore::kSamplesPerChunk) {
      first += "sample\t19787\tfirst\t" + value;
      interleaved += "sample\t19787\tfirst\t" + value;
    }
  }
  text += first + second;
  interleaved.pop_back();
  ASSERT_TRUE(import(interleaved)) << error;
  EXPECT_EQ(dump(), text);
  const std::string more = "sample\t19787\tfirst\t-1\t3\n";
  const std::string most = "sample\t19787\tsecond\t-2\t4\n";
  ASSERT_TRUE(import(more + most));
  EXPECT_EQ(dump(), text.substr(0, text.size() - second.size()) + more + second + most);
  EXPECT_EQ(dump(19788), "");
}

TEST_F(TallybookTest, GivesTheRoomOfRemovedDaysBack) {
  std::string lines;
  for (int i = 0; i < 40'000; ++i) {
    lines += "sample\t" + std::to_string(i % 20) + "\td\t0.5\t" + std::to_string(i) + '\n';
  }
  lines += "scalar\t20\tk\t1\nsample\t21\td\t1\t1\n";
  const auto removeBefore = [](CounterStore& store, std::int32_t day) {
    CounterStore::Rows rows = store.rowsBefore(day);
    std::ranges::for_each(rows.days, [&](std::int32_t old) { store.removeDay(old); });
    return rows;
  };
  for (const char* const form : {"", "PRAGMA auto_vacuum = NONE; VACUUM"}) {
    EXPECT_TRUE(import(lines)) << error;
    SqliteConnection(folder.path(kFile), kShortWait).execute(form);
    const auto before = std::filesystem::file_size(folder.path(kFile));
    HostTallybook tallybook(device, clock, preferences, log);
    const auto remove = [&](CounterStore& store) {
      store.appendSamples(0, "added and removed at once", {});
      const CounterStore::Rows removed = removeBefore(store, 20);
      EXPECT_THAT(removed.days, SizeIs(20));
      EXPECT_EQ(removed.distributions, 21);
      store.returnFreeSpace();
      store.setScalar(19, "later", 2);
      EXPECT_EQ(removeBefore(store, 20).scalars, 1);
      return true;
    };
    EXPECT_TRUE(tallybook.write(remove, error)) << error;
    EXPECT_EQ(dump(), "scalar\t20\tk\t1\nsample\t21\td\t1\t1\n");
    EXPECT_LT(std::filesystem::file_size(folder.path(kFile)), before / 3) << form;
    const auto removeAll = [&](CounterStore& store) {
      return removeBefore(store, 30).scalars == 1;
    };
    EXPECT_TRUE(tallybook.write(removeAll, error)) << error;
  }
}

TEST_F(TallybookTest, KeepsNothingOfAnImportWithABadLine) {
  const std::string good = "scalar\t19787\tk\t1\nsample\t19787\tk\t1\t1\n";
  ASSERT_TRUE(import(good));
  for (const std::string bad :
       {"", "scalar", "scalar\t1\tk", "other\t1\tk\t1", "scalar\t\tk\t1",
        "scalar\t2147483648\tk\t1", "scalar\t1\tk\t9223372036854775808", "scalar\t1\tk\t1.5",
        "scalar\t1\tk\t1\r", "scalar\t1\tk\t+1", "scalar\t1\tk\xFF\t1", "sample\t1\tk\t1",
        "sample\t1\tk\tx\t1", "sample\t1\tk\t1e999\t1", "sample\t1\tk\t1\t1.0",
        "sample\t1\t\xEF\xBF\xBF\t1\t1"}) {
    EXPECT_FALSE(import("scalar\t19787\tk\t2\nsample\t19787\tk\t2\t2\n" + bad + "\nrest"));
    EXPECT_THAT(error, StartsWith("line 3: ")) << bad;
    EXPECT_EQ(dump(), good);
  }
  EXPECT_FALSE(import(std::string(3 << 20, 'x')));
  EXPECT_EQ(error, "line 1: longer than 2 MiB");
}

TEST_F(TallybookTest, RefusesKeysThatNoDocumentCarries) {
  const std::string longest(1024 * 1024, 'k');
  for (const std::string& key : {"a\xFF"s, "a\0b"s, longest + 'k'}) {
    add(key, 1);
    HostTallybook(device, clock, preferences, log).TBClientSetValueForScalarKey(key, 1);
    EXPECT_THAT(log.messages.back(), StartsWith("a counter is refused: the key \""));
  }
  EXPECT_THAT(log.messages, SizeIs(6));
  EXPECT_THAT(folder.names(), IsEmpty());
  add(longest, 1);
  EXPECT_EQ(dump(), "scalar\t19787\t" + longest + "\t1\n");
}

TEST_F(TallybookTest, MovesForeignFilesAsideWithTheirJournals) {
  const auto database = [&](const char* sql) {
    const std::string path = folder.path("other");
    folder.write("other", "");
    SqliteConnection(path, kShortWait).execute(sql);
    return folder.read("other");
  };
  add("k", 1);
  std::string future = folder.read(kFile);
  future[18] = 3;  // a format that SQLite would read and never write
  const std::string foreign[] = {
      future,
      "",
      "text, not a database",
      std::string(5000, '\0'),
      database("CREATE TABLE scalar (day)"),
      database("PRAGMA application_id = 0x56455350; PRAGMA user_version = 1; CREATE TABLE t (x)")};
  std::int64_t count = 0;
  for (const std::string& content : foreign) {
    folder.write(kFile, content);
    folder.write(std::string(kFile) + "-shm", "left");
    log.messages.clear();
    add("k", 1);
    EXPECT_EQ(corruptions(), ++count);
    ASSERT_THAT(log.messages, SizeIs(1));
    EXPECT_THAT(folder.names(kFolder), SizeIs(1 + 2 * static_cast<std::size_t>(count)));
    const std::string name = "TBDataStore.sqlitedb.corrupt-20240305T091502Z" +
                             (count == 1 ? "" : '-' + std::to_string(count));
    EXPECT_EQ(folder.read(std::string(kFolder) + '/' + name), content);
    EXPECT_EQ(folder.read(std::string(kFolder) + '/' + name + "-shm"), "left");
    EXPECT_EQ(dump(), scalar(1));
  }
  SqliteConnection ours(folder.path(kFile), kShortWait);
  EXPECT_EQ(ours.queryInteger("PRAGMA cell_size_check"), 1);
  EXPECT_EQ(ours.queryInteger("PRAGMA trusted_schema"), 0);
  EXPECT_THROW(ours.execute("PRAGMA writable_schema = ON; DELETE FROM sqlite_schema"),
               SqliteFailure);
  // The journal of a file that is gone must not reach the new one.
  unlink(folder.path(kFile).c_str());
  folder.write(std::string(kFile) + "-journal", "left");
  add("k", 1);
  EXPECT_THAT(folder.names(kFolder), Contains(MatchesRegex(".*\\.corrupt-.*-journal")));
  EXPECT_EQ(dump(), scalar(1));
  EXPECT_EQ(corruptions(), count);
}

// Some of them would let a statement run for ever, or do something else than it says.
TEST_F(TallybookTest, MovesAsideWhatHasOtherTablesOrRowsThanOurs) {
  const std::string endless =
      "DROP TABLE scalar; CREATE VIEW scalar AS WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL SELECT "
      "i FROM n) SELECT i AS day, '' AS key, i AS value FROM n WHERE i = 0";
  const std::string manyTables = [] {
    std::string statements = "BEGIN;";
    for (int i = 0; i < 2000; ++i) {
      statements += "CREATE TABLE t" + std::to_string(i) + " (x);";
    }
    return statements + "COMMIT";
  }();
  const std::string otherRows =
      "CREATE TEMP TABLE ours AS SELECT sql FROM sqlite_schema WHERE name = 'scalar'; DROP TABLE "
      "scalar; CREATE TABLE scalar (day, key, value, PRIMARY KEY (day, key)) WITHOUT ROWID; INSERT "
      "INTO scalar VALUES (19787, 'k', 'text'); PRAGMA writable_schema = ON; UPDATE sqlite_schema "
      "SET sql = (SELECT sql FROM ours) WHERE name = 'scalar'";
  constexpr const char* kOther = "its tables are not those of a counter database";
  const std::pair<std::string, const char*> cases[] = {
      {"INSERT INTO scalar VALUES (7, 'a' || char(1), 1)", "a key is no text"},
      {"INSERT INTO scalar VALUES (7, hex(zeroblob(9000000)), 1)", "string or blob too big"},
      {"INSERT INTO scalar VALUES (2147483648, 'k', 1)", "a day is out of range"},
      {endless, kOther},
      {"CREATE TRIGGER t AFTER INSERT ON scalar BEGIN DELETE FROM scalar; END", kOther},
      {"ALTER TABLE scalar ADD COLUMN other INTEGER", kOther},
      {"CREATE TABLE mark (place)", kOther},
      {"PRAGMA user_version = 0", "not a counter database of this version"},
      {manyTables, "takes more work than its size explains"},
      {otherRows, "a cell is not of its column's type"},
  };
  for (const auto& [change, cause] : cases) {
    unlink(folder.path(kFile).c_str());
    add("k", 1);
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open(folder.path(kFile).c_str(), &database), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database, change.c_str(), nullptr, nullptr, nullptr), SQLITE_OK);
    sqlite3_close(database);
    log.messages.clear();
    HostTallybook tallybook(device, clock, preferences, log);
    const auto read = [&](CounterStore& store) {
      const auto ignore = [](std::string_view) { return true; };
      exportCounterLines(store, 0, std::numeric_limits<std::int32_t>::max(), ignore, error);
    };
    EXPECT_FALSE(tallybook.read(read, error)) << change.substr(0, 200);
    EXPECT_THAT(log.messages, ElementsAre(HasSubstr(cause)));
  }
  add("k", 1);
  SqliteConnection(folder.path(kFile), kShortWait).execute(endless.c_str());
  preferences.LGSPreferencesGetIntegerValue(kCorruptionCount, kAggregated);  // and remembers it
  HostPreferences others(device, clock, log);
  others.LGSPreferencesSetValue(kCorruptionCount, 70, kAggregated);
  others.LGSPreferencesSynchronize(kAggregated);
  add("k", 2);
  EXPECT_EQ(corruptions(), 71) << "others count, too";
  EXPECT_EQ(dump(), scalar(2)) << "what cannot be added to";
  ASSERT_TRUE(import("sample\t19787\tk\t1\t1\n"));
  SqliteConnection(folder.path(kFile), kShortWait).execute("UPDATE chunk SET samples = x'00'");
  EXPECT_TRUE(HostTallybook(device, clock, preferences, log).addSample("k", 2, error));
  EXPECT_EQ(dump(), "sample\t19787\tk\t2\t33302\n") << "what nothing can be added behind";
}

/// Lets the calls of `pread` by SQLite that `which` picks, by their number from 1 and their place
/// in the file, give `result`, with EIO.
class FailingReads {
 public:
  using Which = std::function<bool(int number, off_t place)>;

  explicit FailingReads(Which which, ssize_t result = -1) {
    _which = std::move(which);
    _result = result;
    _number = 0;
    _fileSystem->xSetSystemCall(_fileSystem, "pread64",
                                reinterpret_cast<sqlite3_syscall_ptr>(&FailingReads::read));
  }
  ~FailingReads() { _fileSystem->xSetSystemCall(_fileSystem, "pread64", nullptr); }

  static int count() { return _number; }

 private:
  static ssize_t read(int file, void* bytes, std::size_t length, off_t place) {
    errno = EIO;
    return _which(++_number, place) ? _result : pread(file, bytes, length, place);
  }

  sqlite3_vfs* _fileSystem = sqlite3_vfs_find("unix");
  static inline Which _which;
  static inline ssize_t _result;
  static inline int _number;
};

TEST_F(TallybookTest, NeverTakesAnErrorOfReadingForDamage) {
  std::string text;
  for (int i = 0; i < 12'000; ++i) {
    text += (i < 2000 ? "scalar\t19786\tkey" + std::to_string(i)
                      : "sample\t19786\tkey" + std::to_string(i / 5000) + "\t1") +
            "\t1\n";
  }
  ASSERT_TRUE(import(text));
  text = dump();
  int count = 1;
  for (int number = 1; number <= count; ++number) {
    const auto once = [number](int read, off_t) { return read == number; };
    {
      const FailingReads failing(once);
      EXPECT_EQ(dump(), text) << number;  // since it is read again
      count = FailingReads::count();
    }
    const FailingReads failing(once, 0);  // as if the file had ended there
    HostTallybook tallybook(device, clock, preferences, log);
    const auto appendNothing = [](CounterStore& store) {
      store.appendSamples(19786, "key2", {});
      return true;
    };
    EXPECT_TRUE(tallybook.write(appendNothing, error)) << error;
  }
  constexpr off_t kPage = 16384;
  const auto size = static_cast<off_t>(folder.read(kFile).size());
  for (off_t bad = 0; bad < size; bad += kPage) {
    {
      const FailingReads failing([bad](int, off_t place) { return place / kPage == bad / kPage; });
      HostTallybook tallybook(device, clock, preferences, log);
      readAll(tallybook);
      const auto ignore = [](std::string_view) { return true; };
      const auto exportAll = [&](CounterStore& store) {
        exportCounterLines(store, 0, kToday, ignore, error);
      };
      if (!tallybook.read(exportAll, error)) {  // not every page is needed
        EXPECT_THAT(error, HasSubstr("disk I/O error"));
      }
    }
    EXPECT_EQ(dump(), text) << bad;
  }
  EXPECT_THAT(log.messages, Contains(MatchesRegex("counters cannot be read: .*: disk I/O error, "
                                                  "after [0-9]+ scalars up to \"key[0-9]*\" of "
                                                  "day 19786")));
  EXPECT_EQ(corruptions(), 0);
}

TEST_F(TallybookTest, TakesACommitWhoseJournalIsGoneForDone) {
  sqlite3_vfs* const fileSystem = sqlite3_vfs_find("unix");
  const auto openWhatCannotBeFlushed = [](const char* /*folder*/, int* descriptor) {
    *descriptor = open("/dev/null", O_RDONLY);
    return SQLITE_OK;
  };
  add("k", 1);
  fileSystem->xSetSystemCall(fileSystem, "openDirectory",
                             reinterpret_cast<sqlite3_syscall_ptr>(+openWhatCannotBeFlushed));
  add("k", 1);
  fileSystem->xSetSystemCall(fileSystem, "openDirectory", nullptr);
  EXPECT_EQ(dump(), scalar(2));
  EXPECT_THAT(log.messages, IsEmpty());
}

TEST_F(TallybookTest, NoticesAChunkThatIsCutShort) {
  std::string text;
  for (int i = 0; i < 10'000; ++i) {
    text += "sample\t19786\tk\t1\t1\n";
  }
  for (const auto& [change, cause] : std::vector<std::pair<const char*, const char*>>{
           {"UPDATE chunk SET samples = substr(samples, 1, 100)", "has a wrong length"},
           {"UPDATE chunk SET samples = substr(samples, 1, 800) WHERE sequence = 2",
            "has a wrong length, after 8192 values of the last of 1 distributions up to \"k\""},
           {"UPDATE chunk SET samples = x'', offsets = x'' WHERE sequence = 2",
            "has a wrong length"},
           {"UPDATE chunk SET samples = substr(samples, 1, 800), offsets = substr(offsets, 1, 400) "
            "WHERE sequence = 0",
            "is too short, after 100 values"},
           {"DELETE FROM chunk WHERE sequence = 1", "is missing, after 4096 values"}}) {
    unlink(folder.path(kFile).c_str());
    ASSERT_TRUE(import(text));
    SqliteConnection(folder.path(kFile), kShortWait).execute(change);
    log.messages.clear();
    HostTallybook tallybook(device, clock, preferences, log);
    EXPECT_LT(readAll(tallybook), 10'000);
    ASSERT_THAT(log.messages, SizeIs(2)) << change;
    EXPECT_THAT(log.messages[1], HasSubstr(std::string("a chunk of samples ") + cause));
  }
}

TEST_F(TallybookTest, RefusesForeignFilesBesideItsOwn) {
  add("k", 1);
  const std::string journal = folder.path(kFile) + "-journal";
  folder.write(std::string(kFile) + "-journal", "");
  if (chown(journal.c_str(), 12345, 12345) == 0) {  // as root
    add("k", 1);
    EXPECT_THAT(log.messages, ElementsAre(HasSubstr(journal + ": belongs to another user")));
  }
  unlink(journal.c_str());
  for (const char* end : {"-journal", "-wal", "-shm", ""}) {
    const std::string path = folder.path(kFile) + end;
    unlink(path.c_str());
    ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    log.messages.clear();
    add("k", 1);
    EXPECT_THAT(log.messages, ElementsAre(HasSubstr(path + ": not a regular file")));
    unlink(path.c_str());
    EXPECT_EQ(dump(), *end != '\0' ? scalar(1) : "");
  }
}

TEST_F(TallybookTest, KeepsWhatItCollectedWhenMemoryRunsOut) {
  class FailingPreferences final : public Preferences {
    std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view /*key*/,
                                                        std::string_view /*domain*/) override {
      if (onRead) {
        onRead();
      }
      throw std::bad_alloc();
    }
    void LGSPreferencesSetValue(std::optional<std::string_view> /*key*/,
                                std::optional<PropertyValue> /*value*/,
                                std::string_view /*domain*/) override {}
    bool LGSPreferencesSynchronize(std::string_view /*domain*/) override { return true; }

   public:
    std::function<void()> onRead;
  } failing;
  HostTallybook tallybook(device, clock, failing, log);
  const auto change = [&](int value) {
    tallybook.TBClientAddValueForScalarKey("k", value);
    EXPECT_TRUE(tallybook.addSample("v", value, error));
  };
  change(1);
  failing.onRead = [&] { change(2); };  // in the middle of the checkpoint
  folder.write(kFile, "damaged");
  EXPECT_THROW(tallybook.TBClientCheckpoint(), std::bad_alloc);
  failing.onRead = nullptr;
  change(4);
  tallybook.TBClientCheckpoint();
  EXPECT_EQ(dump(), scalar(7) +
                        "sample\t19787\tv\t1\t33302\nsample\t19787\tv\t2\t33302\n"
                        "sample\t19787\tv\t4\t33302\n");
  folder.write(kFile, "damaged");
  HostTallybook(device, clock, failing, log).TBClientAddValueForScalarKey("k", 1);
}

TEST_F(TallybookTest, NeverTakesALockForDamage) {
  add("k", 1);
  HostTallybook tallybook(device, clock, preferences, log, kShortWait);
  tallybook.TBClientAddValueForScalarKey("k", 1);
  HostTallybook other(device, clock, preferences, log);
  EXPECT_FALSE(other.write(
      [&](CounterStore& store) {
        store.setScalar(kToday, "k", 99);
        tallybook.TBClientCheckpoint();
        return false;
      },
      error));
  EXPECT_THAT(log.messages, ElementsAre("counters wait for the next checkpoint: " +
                                        folder.path(kFile) + ": another process keeps it locked"));
  EXPECT_EQ(dump(), scalar(1));
  tallybook.TBClientAddValueForScalarKey("k", 1);
  tallybook.TBClientCheckpoint();
  EXPECT_EQ(dump(), scalar(3));
}

TEST_F(TallybookTest, ReplacesOnlyTheFileThatWasDamagedAndNobodyUses) {
  folder.write(kFile, "damaged");
  CounterFile file(device, clock, kShortWait);
  std::optional<CounterFile::Damage> damage;
  EXPECT_FALSE(file.write([](CounterStore&) { return true; }, error, damage));
  ASSERT_TRUE(damage) << error;
  add("k", 1);
  struct stat status {};
  stat(folder.path(kFile).c_str(), &status);
  const auto replace = [&](CounterStore&) {
    EXPECT_FALSE(file.replace({status.st_dev, status.st_ino, ""}, error));
    EXPECT_THAT(error, HasSubstr("another process keeps it locked"));
  };
  EXPECT_TRUE(file.read(replace, error, damage)) << error;
  folder.write(std::string(kFile) + "-journal", "");
  EXPECT_EQ(file.replace(*damage, error), "");
  EXPECT_EQ(file.replace({status.st_dev + 1, status.st_ino, ""}, error), "") << "on another disk";
  EXPECT_THAT(folder.names(kFolder), Contains("TBDataStore.sqlitedb-journal"));
  EXPECT_EQ(dump(), scalar(1));
}

TEST_F(TallybookTest, NeverTakesPermissionsOrAFullDiskForDamage) {
  add("k", 1);
  const auto waits = [&](HostTallybook& tallybook) {
    EXPECT_THAT(log.messages, IsEmpty());
    tallybook.TBClientAddValueForScalarKey("k", 1);
    tallybook.TBClientCheckpoint();
    EXPECT_THAT(log.messages, ElementsAre(StartsWith("counters wait for the next checkpoint: ")));
  };
  for (std::string path = folder.path(kFolder); path.size() >= folder.path().size();) {
    chmod(path.c_str(), 0755);
    path.resize(path.rfind('/'));
  }
  const std::pair<mode_t, mode_t> modes[] = {{0444, 0555}, {0666, 0555}, {0, 0755}, {0, 0444}};
  for (const auto& [fileMode, folderMode] : modes) {
    chmod(folder.path(kFile).c_str(), fileMode);
    chmod(folder.path(kFolder).c_str(), folderMode);
    EXPECT_TRUE(hasSucceeded(startProcess([&, isReadable = fileMode != 0] {
      EXPECT_TRUE(geteuid() != 0 || setuid(65534) == 0);  // root may write everywhere
      HostTallybook tallybook(device, clock, preferences, log, kShortWait);
      if (isReadable) {
        EXPECT_EQ(dump(), scalar(1));
      }
      waits(tallybook);
    })));
  }
  chmod(folder.path(kFile).c_str(), 0600);
  EXPECT_TRUE(hasSucceeded(startProcess([&] {
    HostTallybook tallybook(device, clock, preferences, log);
    {
      const FileSizeLimit limit(4096);
      waits(tallybook);
      EXPECT_EQ(dump(), scalar(1));
    }
    tallybook.TBClientCheckpoint();
    EXPECT_EQ(dump(), scalar(2));
  })));
  EXPECT_THAT(folder.names(kFolder), ElementsAre("TBDataStore.sqlitedb"));
  EXPECT_EQ(corruptions(), 0);
}

}  // namespace
}  // namespace vesprun
