#pragma once

#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "Turn.h"
#include "common/KeyHash.h"
#include "platform/host/counters/SqliteConnection.h"
#include "store/FleetStore.h"
#include "store/Varint.h"

namespace vesprun {

/// A fleet in one SQLite file.
///
/// A row for each value would scatter one line over the whole file. So the values of one key and
/// day lie together in packed chunks, rows of some kilobytes, in the order of the lines' numbers; a
/// question about a key reads its chunks of the days it asks for. A line that is replaced loses its
/// row in `line`, and what the chunks have of it is passed over from then on. Once that is more
/// than what a day still has, its chunks are rewritten. Which keys a line has is its shape; devices
/// mostly share a few.
///
/// An entry of a chunk, all integers in groups of seven bits, low ones first: the line's number
/// less that of the entry before; then for a scalar its value, the sign in the lowest bit; for a
/// distribution four doubles, the count, the number of labels plus 1 (0: no histogram) and for each
/// the number of its text in `text` and its count.
class SqliteStore : public FleetStore {
 public:
  SqliteStore(const std::string& path, StoreUse use, std::optional<int> least);
  ~SqliteStore() override;

  std::uint64_t least() override { return _least; }
  void add(const ExportedLine& line) override;
  void finish() override;
  void visitKeys(const VisitKey& visit) override;
  bool hasKey(std::string_view key, KeyKind kind) override;
  bool hasMember(Member by, const std::string& value) override;
  void visitLastDays(Member by, const VisitDevices& visit) override;
  void visitSpreads(const ComparedGroups& groups, const VisitSpreads& visit) override;
  void visitLines(const DayRange& days, const std::string& prefix, const VisitLine& visit) override;
  Removal forget(std::span<const std::string> devices) override;
  Removal prune(std::int32_t days, std::int32_t latest) override;

 protected:
  void visitScalars(const Question& question, const VisitScalar& visit) override;
  void visitDistributions(const Question& question, const VisitDistribution& visit) override;

 private:
  static constexpr std::size_t kMaxPending = 50'000;

  /// What questions need of a current line.
  struct Line {
    std::int64_t number = 0;
    std::int64_t device = 0;
    std::int64_t member = 0;
  };
  using LinesOfDays = std::map<std::int32_t, std::vector<Line>>;  ///< lines by their numbers

  /// Entries that were not written yet, the first without its line's number.
  struct Pending {
    std::int64_t first = 0;
    std::int64_t last = 0;
    std::string entries;
  };
  /// Where a value comes from.
  struct Origin {
    std::int32_t day = 0;
    std::int64_t device = 0;
    std::int64_t member = 0;
  };
  template <typename Parts>
  class Gathering;
  /// A key and its number; without a name before the first one.
  struct LastKey {
    std::string name;
    KeyKind kind = KeyKind::Scalar;
    std::int64_t number = 0;
  };
  struct Statements;
  class Cursor;
  /// Texts by their numbers, each read once; empty for a number without one.
  class Texts {
   public:
    explicit Texts(SqliteStore& store) : _store(store) {}
    const std::string& operator()(std::int64_t number);

   private:
    SqliteStore& _store;
    std::unordered_map<std::int64_t, std::string> _known;
  };

  void open(StoreUse use, std::optional<int> least);
  void prepareChanges();
  void bringUpToDate();
  Outcome place(const ExportedLine& line);
  void append(std::int32_t day, std::int64_t key, std::int64_t line, std::string_view value);
  std::int64_t shapeOf(std::vector<std::int64_t> keys);
  std::int64_t insertedNumber() const;
  SqliteStatement& prepared(const std::string& sql);
  std::optional<std::int64_t> findNumber(const char* table, std::string_view text,
                                         std::optional<KeyKind> kind = {});
  std::int64_t numberOf(const char* table, std::string_view text, std::optional<KeyKind> kind = {});
  std::int64_t numberOfKey(std::size_t place, const std::string& key, KeyKind kind);
  void beginBatch();
  void writePending();
  void commitBatch();
  void rewriteDay(std::int32_t day, std::set<std::int64_t>* labels = nullptr);
  void removeUnused();
  void giveBackRoom();

  MemberText textOf(std::int64_t member);
  std::vector<Line> linesOf(std::int32_t day, Member by);
  LinesOfDays linesOf(const DayRange& days, Member by);
  std::set<std::int64_t> keysOfShape(std::int64_t shape);
  std::set<std::int64_t> keysInUse();
  template <typename Read>
  void visitEntries(std::int32_t day, std::int64_t key, const std::vector<Line>& lines,
                    const Read& read);
  template <typename Task>
  auto guarded(const Task& task);

  std::string _path;
  Turn _turn;
  std::unique_ptr<SqliteConnection> _database;
  std::uint64_t _least = kUsualLeast;
  std::int32_t _firstDay = 0;                                       ///< earlier lines are refused
  std::set<std::string> _forgotten;                                 ///< digests of devices' names
  std::unique_ptr<Statements> _statements;                          ///< of a store that is changed
  bool _inBatch = false;                                            ///< and so in a transaction
  std::unordered_map<std::string, SqliteStatement> _prepared;       ///< by their text
  std::unordered_map<std::string, std::int64_t, KeyHash> _numbers;  ///< of names met in this batch
  std::vector<LastKey> _lastKeys;  ///< of the line before in this batch
  std::unordered_map<std::int64_t, Pending> _pending;
  std::map<std::int32_t, std::int64_t> _replaced;  ///< lines replaced in this batch, by day
  std::size_t _batchSize = 0;                      ///< bytes of text
};

}  // namespace vesprun
