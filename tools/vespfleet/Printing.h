#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "store/Comparison.h"

namespace vesprun {

using JsonLine = nlohmann::ordered_json;

/// Prints results a line each: JSON for programs, a table for people.
class Results {
 public:
  Results(std::vector<std::string> titles, bool json) : _json(json), _rows{std::move(titles)} {}
  ~Results();
  Results(const Results&) = delete;
  Results& operator=(const Results&) = delete;

  bool isJson() const { return _json; }
  void print(const JsonLine& line);
  void addRow(std::vector<std::string> cells);

 private:
  bool _json;
  std::vector<std::vector<std::string>> _rows;
};

/// How the members of a question are called in options and in lines.
const char* nameOf(Member by);

void printScalars(FleetStore& store, const Question& question, bool json);
void printDistributions(FleetStore& store, const Question& question, bool json);
void printComparison(const std::vector<ComparedKey>& keys, bool json);

}  // namespace vesprun
