#pragma once

#include <utility>

namespace vesprun {

/// A static object next to each state that lives as long as the process, with the function that
/// resets it, so that tests and fuzzers can simulate several processes in one.
class ProcessState {
 public:
  using Reset = void (*)();

  explicit ProcessState(Reset reset) noexcept : _reset(reset), _next(std::exchange(first, this)) {}

  /// Makes every state what it is in a new process.
  static void startAfresh() {
    for (const ProcessState* state = first; state != nullptr; state = state->_next) {
      state->_reset();
    }
  }

 private:
  static inline constinit const ProcessState* first = nullptr;

  Reset _reset;
  const ProcessState* _next;
};

}  // namespace vesprun
