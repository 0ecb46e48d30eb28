#pragma once

#include <cstdint>
#include <functional>
#include <future>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <tuple>
#include <unordered_map>
#include <vector>

#include "ClickHouseServer.h"
#include "common/KeyHash.h"
#include "store/FleetStore.h"

namespace vesprun {

/// A fleet in a ClickHouse database, one row a line: an insert that was cut in the middle leaves
/// whole lines, and a later revision replaces all values of the earlier one.
///
/// The engine keeps the row of the highest rank for each device and day. A rank has no room for
/// nanoseconds and digest; a load looks up what is stored and sends only what comes after it, and
/// of equal ranks the engine keeps the row that came last. A load that another one came between
/// looks again.
///
/// Keys are spread over a few columns by their bytes: a question about one reads a part of a line.
/// Rows are sent sorted, and many at once, which costs the server least.
/// A week that has no line twice is read as it lies: one that is merged into one part, or whose
/// lines a load has counted. Else the engine merges while it reads.
class ClickHouseStore : public FleetStore {
 public:
  ClickHouseStore(const std::string& address, StoreUse use, std::optional<int> least);

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
  /// Revision, seconds, nanoseconds, digest.
  using Rank = std::tuple<std::int64_t, std::int64_t, std::int64_t, LineDigest>;
  /// Lines as rows of their table, one behind the other.
  struct Batch {
    struct Line {
      std::size_t begin = 0;  ///< of its row
      std::size_t size = 0;
      std::size_t deviceSize = 0;
      std::size_t placeSize = 0;  ///< day and device, as the row begins with them
      std::int32_t day = 0;
      Rank rank;
    };
    std::string_view row(const Line& line) const {
      return std::string_view(rows).substr(line.begin, line.size);
    }
    std::string_view place(const Line& line) const { return row(line).substr(0, line.placeSize); }
    std::string_view device(const Line& line) const {
      return place(line).substr(line.placeSize - line.deviceSize);
    }

    std::string rows;
    std::vector<Line> lines;
  };
  using Ranks = std::unordered_map<std::string, Rank, KeyHash, std::equal_to<>>;  ///< by place
  /// A partition of the table of lines. While the last block and the number of rows stay the same,
  /// the rows are the same, too, however the engine merges them.
  struct Week {
    std::int32_t number = 0;  ///< since 1970
    std::uint64_t lastBlock = 0;
    std::uint64_t rows = 0;
    bool operator==(const Week&) const = default;
  };
  struct WeekState {
    Week week;
    std::uint64_t bytes = 0;
    std::uint64_t mostOfPart = 0;  ///< rows of the largest part
    bool isUnique = false;         ///< has no line twice
  };
  using GroupKey = std::pair<std::int32_t, MemberText>;  ///< the day is 0 for all together
  using LabelCounts = std::map<GroupKey, Histogram>;

  void open(StoreUse use, std::optional<int> least);
  void bringUpToDate();
  void readRules();
  void sendBatch();
  void waitForBatch();
  static void sort(Batch& batch);
  void send(Batch batch);
  static SentTable placesOf(const Batch& batch);
  static std::string isAmong(const Batch& batch);
  Ranks ranksOf(const Batch& batch, const SentTable& places);
  std::uint64_t blocks();
  void settleRivals(const Batch& batch, const SentTable& places);
  void settleWeeks();
  void settle(std::span<const WeekState> states);
  std::vector<WeekState> weeks(const DayRange& days = {});
  void whileUnchanged(const DayRange& days, const std::function<void()>& ask);
  bool isAnywhere(const std::string& columns, const std::string& condition);
  void removeWhere(const std::string& condition);
  std::uint64_t countRows(const std::string& query);
  std::map<GroupKey, std::pair<std::int64_t, std::int64_t>> edgesOf(const Question& question);
  LabelCounts labelsOf(const Question& question);

  std::string _address;
  ClickHouseServer _server;
  std::uint64_t _least = kUsualLeast;
  std::int32_t _firstDay = 0;        ///< earlier lines are refused
  std::set<std::string> _forgotten;  ///< digests of devices' names
  Batch _batch;                      ///< not sent yet
  std::set<std::int32_t> _batchPartitions;
  std::set<std::int32_t> _weeks;  ///< that were loaded
  std::string _source;            ///< of current lines, in a query
  std::future<void> _sent;        ///< the batch under way
};

}  // namespace vesprun
