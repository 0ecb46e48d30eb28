#pragma once

#include <chrono>
#include <cstdint>
#include <string>

namespace vesprun {

/// Shows how far long work has come: a line on standard error when that is a terminal, from the
/// second second on, which goes when the work is done or something else is printed there. One at a
/// time.
class Progress {
 public:
  /// Shown as "ACTIVITY: 1,234,567 of 10,000,000 UNIT"; without a total, as far as it has come.
  Progress(std::string activity, std::string unit, std::uint64_t total = 0);
  ~Progress();
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;

  /// Cheap: for every step, however small.
  void advance(std::uint64_t steps = 1) {
    _done += steps;
    if (_isShown) {
      show();
    }
  }

  /// Takes the line away until the next step.
  static void hide();

 private:
  using Clock = std::chrono::steady_clock;

  void show();

  std::string _activity;
  std::string _unit;
  std::uint64_t _total;
  std::uint64_t _done = 0;
  bool _isShown;
  Clock::time_point _next;
};

}  // namespace vesprun
