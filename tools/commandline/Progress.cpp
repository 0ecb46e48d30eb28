#include "commandline/Progress.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <utility>

#include "commandline/Results.h"

namespace vesprun {
namespace {

std::size_t shownWidth = 0;

}  // namespace

Progress::Progress(std::string activity, std::string unit, std::uint64_t total)
    : _activity(std::move(activity)),
      _unit(std::move(unit)),
      _total(total),
      _isShown(isatty(STDERR_FILENO) != 0),
      _next(Clock::now() + std::chrono::seconds(1)) {}

Progress::~Progress() { hide(); }

void Progress::hide() {
  if (const std::size_t width = std::exchange(shownWidth, 0)) {
    std::fprintf(stderr, "\r%*s\r", static_cast<int>(width), "");
  }
}

void Progress::show() {
  const Clock::time_point now = Clock::now();
  winsize size{};
  if (now < _next || ioctl(STDERR_FILENO, TIOCGWINSZ, &size) != 0) {
    return;
  }
  _next = now + std::chrono::milliseconds(250);
  std::string text = _activity + ": " + groupedDigits(_done) +
                     (_total != 0 ? " of " + groupedDigits(_total) : "") + ' ' + _unit;
  // The last column would begin another line.
  constexpr std::size_t kUsualWidth = 80;
  const std::size_t width = size.ws_col == 0 ? kUsualWidth : size.ws_col;
  text.resize(std::min(text.size(), width - 1));
  hide();
  shownWidth = text.size();
  std::fprintf(stderr, "\r%s", text.c_str());
}

}  // namespace vesprun
