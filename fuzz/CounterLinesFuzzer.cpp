#include <fcntl.h>
#include <unistd.h>

#include <limits>
#include <sstream>
#include <string>

#include "Require.h"
#include "platform/host/counters/CounterLines.h"

using namespace vesprun;

namespace {

/// An empty database that nothing is ever committed to.
const std::string& emptyDatabase() {
  static const std::string path = [] {
    std::string name = "/tmp/counter-lines-XXXXXX";
    const int file = mkstemp(name.data());
    const std::string content = CounterStore::emptyDatabase();
    require(file >= 0 &&
                write(file, content.data(), content.size()) == static_cast<ssize_t>(content.size()),
            "a database can be made");
    close(file);
    return name;
  }();
  return path;
}

/// The lines that the database gives after it took these, or nothing when it refuses them.
bool throughDatabase(const std::string& lines, std::string& exported, std::string& error) {
  CounterStore store(emptyDatabase(), std::chrono::milliseconds(0), CounterStore::Access::Writing);
  std::istringstream stream(lines);
  if (!importCounterLines(stream, store, error)) {
    return false;
  }
  return exportCounterLines(
      store, std::numeric_limits<std::int32_t>::min(), std::numeric_limits<std::int32_t>::max(),
      [&exported](std::string_view piece) {
        exported += piece;
        return true;
      },
      error);
}

}  // namespace

/// Bad lines are named by their number; what was taken is given back, and taken again.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  std::string error;
  std::string first;
  if (!throughDatabase({reinterpret_cast<const char*>(bytes), size}, first, error)) {
    require(error.starts_with("line "), "a refusal names the line", error.c_str());
    return 0;
  }
  std::string second;
  require(throughDatabase(first, second, error), "what was exported is taken", error.c_str());
  require(first == second, "and is the same", first.c_str());
  return 0;
}
