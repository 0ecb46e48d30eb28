#pragma once

#include <cstdint>
#include <set>
#include <string>

#include "FleetStore.h"
#include "HttpClient.h"

namespace vesprun {

/// A fleet in three tables of a ClickHouse database, one row a value.
///
/// The server keeps the rows of an insert that was cut in the middle, so a line counts only with
/// its row in `vespfleet_line`, which is sent after its values. Which line holds is decided when a
/// question is asked: loads need not wait for one another, and what is loaded twice is the same
/// rows, of which one is read.
class ClickHouseStore : public FleetStore {
 public:
  ClickHouseStore(const std::string& address, bool toBeLoaded);

  void add(const ExportedLine& line) override;
  void finish() override;
  void visitKeys(const VisitKey& visit) override;
  void visitScalars(std::string_view key, const DayRange& days, const VisitScalar& visit) override;
  void visitDistributions(std::string_view key, const DayRange& days,
                          const VisitDistribution& visit) override;

 private:
  std::string _address;
  HttpClient _server;
  // Rows not sent yet.
  std::string _lines;
  std::string _scalars;
  std::string _distributions;
  std::set<std::int32_t> _partitions;
};

}  // namespace vesprun
