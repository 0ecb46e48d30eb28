#pragma once

#include <cstdint>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "FleetStore.h"
#include "HttpClient.h"

namespace vesprun {

/// A fleet in a ClickHouse database, one row a line: an insert that was cut in the middle leaves
/// whole lines, and a later revision replaces all values of the earlier one. Which line of a device
/// and day is current is decided when a question is asked: loads need not wait for one another, and
/// what is loaded twice is the same row.
class ClickHouseStore : public FleetStore {
 public:
  ClickHouseStore(const std::string& address, StoreUse use, std::optional<int> least);

  std::uint64_t least() override { return _least; }
  Outcome add(const ExportedLine& line) override;
  void finish() override;
  void visitKeys(const VisitKey& visit) override;
  bool hasKey(std::string_view key, KeyKind kind) override;
  bool hasMember(Member by, const std::string& value) override;
  void visitLastDays(Member by, const VisitDevices& visit) override;
  void visitScalars(std::string_view key, const DayRange& days, Member by,
                    const VisitScalar& visit) override;
  void visitDistributions(std::string_view key, const DayRange& days, Member by,
                          const VisitDistribution& visit) override;
  MemberText textOf(std::int64_t member) override {
    return _texts.at(static_cast<std::size_t>(member));
  }
  void visitMeans(const ComparedGroups& groups, const VisitMeans& visit) override;
  void visitLines(const DayRange& days, const std::string& prefix, const VisitLine& visit) override;
  Removal forget(std::span<const std::string> devices) override;
  Removal prune(std::int32_t days, std::int32_t latest) override;

 private:
  void readRules();
  void removeWhere(const std::string& condition);
  std::uint64_t count(const std::string& condition);
  std::int64_t numberOf(MemberText text);
  std::int64_t numberOfDevice(const std::string& device);
  template <typename Row>
  void readRows(const std::string& query, const Row& row);

  std::string _address;
  HttpClient _server;
  std::uint64_t _least = kUsualLeast;
  std::int32_t _firstDay = 0;        ///< earlier lines are refused
  std::set<std::string> _forgotten;  ///< digests of devices' names
  std::string _rows;                 ///< not sent yet
  std::set<std::int32_t> _partitions;
  std::vector<MemberText> _texts{std::nullopt};
  std::map<std::string, std::int64_t> _numbers;
  std::map<std::string, std::int64_t> _devices;
};

}  // namespace vesprun
