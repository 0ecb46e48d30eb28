#include "Faults.h"

#include <sys/syscall.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <set>
#include <sstream>
#include <string_view>

namespace vesprun::torture {

namespace fs = std::filesystem;

Faults& operator+=(Faults& faults, const Faults& more) {
  faults.insert(faults.end(), more.begin(), more.end());
  return faults;
}

Faults missingFrom(const std::vector<std::string>& wanted, const std::vector<std::string>& there,
                   const std::string& what) {
  Faults faults;
  const std::set<std::string_view> known(there.begin(), there.end());
  for (const std::string& one : wanted) {
    if (!known.contains(one)) {
      faults.push_back(what + ": " + one.substr(0, 200));
    }
  }
  if (faults.size() > 3) {
    faults.resize(3);
  }
  return faults;
}

Faults judgeRun(const Outcome& outcome, bool killed, bool started, int worst) {
  Faults faults;
  if (outcome.late) {
    faults.push_back("took longer than " + std::to_string(kMaxRunSeconds) + " seconds");
  } else if (!killed && started && outcome.signal != 0) {
    faults.push_back(std::string("ended by a signal: ") + strsignal(outcome.signal) + "; " +
                     outcome.standardError);
  } else if (!killed && started && outcome.status > worst) {
    faults.push_back("exit status " + std::to_string(outcome.status) + "; " +
                     outcome.standardError);
  }
  std::istringstream lines(outcome.standardError);
  for (std::string line; std::getline(lines, line);) {
    if (lacksCause(line)) {
      faults.push_back("it does not say why: " + line);
    }
  }
  return faults;
}

std::size_t firstOwnCall(const std::vector<Call>& calls) {
  const auto last = std::ranges::find(calls, SYS_munmap, &Call::number);
  return static_cast<std::size_t>(last - calls.begin()) + 1;
}

std::vector<Case> faultsOfCalls(const std::string& name, const std::vector<Call>& calls,
                                std::uint32_t seed, bool full, bool alsoShort,
                                const RunWithFault& run) {
  const std::size_t own = firstOwnCall(calls);
  std::vector<Case> cases;
  std::mt19937 random(seed);
  for (std::size_t index = 0; index < calls.size(); ++index) {
    const int number = calls[index].number;
    const bool started = index >= own;
    const auto add = [&](const std::string& what, Fault fault) {
      fault.call = index + 1;
      const bool isError = started && fault.kind == Fault::Kind::Error;
      cases.push_back({name + what + ":" + nameOfCall(number) + ":" + std::to_string(index + 1),
                       [=](const fs::path& work) { return run(work, fault, started); },
                       isError ? nameOfCall(number) + ' ' + calls[index].path : std::string()});
    };
    const std::vector<int>& errors = fittingErrors(number);
    const std::size_t one = errors.empty() ? 0 : random() % errors.size();
    for (std::size_t each = 0; each < errors.size(); ++each) {
      if (full || each == one) {
        add(strerrorname_np(errors[each]),
            {.kind = Fault::Kind::Error, .number = number, .error = errors[each]});
      }
    }
    if (alsoShort && started && transfersBytes(number)) {
      add("short", {.kind = Fault::Kind::Short, .number = number});
    }
    add("kill", {.kind = Fault::Kind::Kill});
  }
  return cases;
}

}  // namespace vesprun::torture
