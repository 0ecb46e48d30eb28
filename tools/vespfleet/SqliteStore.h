#pragma once

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "FleetStore.h"
#include "platform/host/counters/SqliteConnection.h"

namespace vesprun {

/// A fleet in one SQLite file.
///
/// A row for each value would scatter one line over the whole file. So the values of one key lie
/// together in chunks, each a row of some kilobytes that grows at its end while lines come in, in
/// the order of the lines' numbers; a question about a key reads its chunks from end to end. A
/// line that is replaced loses its row in `line`, and what the chunks have of it is passed over
/// from then on. Once that is more than what holds, the chunks are written anew.
///
/// An entry of a chunk, all integers in groups of seven bits, low ones first: the line's number
/// less that of the entry before; then for a scalar its value, the sign in the lowest bit; for a
/// distribution four doubles, the count, the number of labels plus 1 (0: no histogram) and for each
/// the number of its text in `label` and its count.
class SqliteStore : public FleetStore {
 public:
  SqliteStore(const std::string& path, bool toBeLoaded);
  ~SqliteStore() override;

  void add(const ExportedLine& line) override;
  void finish() override;
  void visitKeys(const VisitKey& visit) override;
  void visitScalars(std::string_view key, const DayRange& days, const VisitScalar& visit) override;
  void visitDistributions(std::string_view key, const DayRange& days,
                          const VisitDistribution& visit) override;

 private:
  /// A line that holds.
  struct Line {
    std::int64_t number = 0;
    std::int32_t day = 0;
    std::int64_t device = 0;
  };
  /// The chunk at the end of a key, while lines are added.
  struct Tail {
    std::int64_t chunk = 0;  ///< row identifier in `chunk`
    std::int64_t last = 0;   ///< line number of its last entry, 0 when empty
    std::string entries;
  };
  struct Statements;

  bool replacesEarlier(const ExportedLine& line, std::int64_t device);
  void append(std::int64_t key, std::int64_t line, std::string_view value);
  void write(Tail& tail);
  Tail& tailOf(std::int64_t key);
  std::optional<std::int64_t> findNumber(const std::string& table, KeyKind kind,
                                         std::string_view text);
  std::int64_t numberOf(const std::string& table, KeyKind kind, std::string_view text);
  void beginBatch();
  void commitBatch();
  void writeAnew();
  std::vector<Line> linesThatHold(const DayRange& days);
  template <typename Read>
  void visitEntries(std::int64_t key, const std::vector<Line>& lines, const Read& read);
  template <typename Task>
  auto guarded(const Task& task);

  std::string _path;
  std::unique_ptr<SqliteConnection> _database;
  std::unique_ptr<Statements> _statements;       ///< of a store that is loaded
  bool _inBatch = false;                         ///< and so in a transaction
  std::map<std::string, std::int64_t> _numbers;  ///< of names met in this batch
  std::unordered_map<std::int64_t, Tail> _tails;
  std::size_t _batchSize = 0;  ///< bytes of text
};

}  // namespace vesprun
