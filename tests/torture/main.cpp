#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>
#include <CLI/CLI.hpp>

#include <algorithm>
#include <atomic>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <map>
#include <span>
#include <stdexcept>
#include <thread>

#include "Scenarios.h"

namespace vesprun::torture {
namespace {

namespace fs = std::filesystem;

struct Options : Choice {
  std::size_t share = 1;
  unsigned workers = 2 * std::max(1U, std::thread::hardware_concurrency());  // they wait for disks
  std::string only;
  std::string scenario;
};

struct Counts {
  std::atomic<std::size_t> next;  ///< case of the list
  std::atomic<std::size_t> tried;
  std::atomic<std::size_t> failed;
};

void runCases(const std::vector<Case>& cases, const Options& options, const fs::path& folder,
              Counts& counts) {
  for (std::size_t index = 0; (index = counts.next++) < cases.size();) {
    const Case& one = cases[index];
    Faults faults;
    try {
      faults = one.run(folder);
    } catch (const std::exception& failure) {
      faults = {failure.what()};
    }
    ++counts.tried;
    if (!faults.empty()) {
      ++counts.failed;
      std::string text = "FAILED " + one.name + '\n';
      for (const std::string& fault : faults) {
        text += "  " + fault + '\n';
      }
      text += "  again: scripts/torture --seed " + std::to_string(options.seed) + " --only '" +
              one.name + "'\n";
      std::fputs(text.c_str(), stdout);
      std::fflush(stdout);
    }
  }
  if (options.only.empty()) {
    std::error_code ignored;
    fs::remove_all(folder, ignored);
  }
}

/// The number of a call with which a case's name ends, else 0, and what comes before it.
std::pair<std::string, long> placeOf(const std::string& name) {
  const std::size_t end = name.rfind(':') + 1;
  return {name.substr(0, end), std::strtol(name.c_str() + end, nullptr, 10)};
}

// Threads do not always take turns alike, so a call may have another number in this run.
std::vector<Case> nearest(std::vector<Case> cases, const std::string& name) {
  const auto [start, number] = placeOf(name);
  const auto distance = [&, start = start, number = number](const Case& one) {
    const auto [ownStart, ownNumber] = placeOf(one.name);
    return ownStart != start ? LONG_MAX : one.name == name ? -1 : std::labs(ownNumber - number);
  };
  const auto best = std::ranges::min_element(cases, {}, distance);
  const bool isNear = best != cases.end() && distance(*best) < (start.empty() ? 0 : 40);
  return isNear ? std::vector<Case>{*best} : std::vector<Case>();
}

std::vector<Case> chosen(std::vector<Case> cases, const Options& options) {
  if (!options.only.empty()) {
    return nearest(std::move(cases), options.only);
  }
  std::map<std::string, std::size_t> ofKind;
  std::vector<Case> result;
  for (Case& one : cases) {
    const std::size_t before = ofKind[one.kind]++;
    // Few are of one kind: of each the first is among them.
    const std::size_t first = one.kind.empty() ? options.seed % options.share : 0;
    if (before % options.share == first) {
      result.push_back(std::move(one));
    }
  }
  return result;
}

/// The cases of a list, under way in processes of their own; one case alone goes on beside the
/// lists that follow.
class Running {
 public:
  Running(std::string title, const std::vector<Case>& cases, const Options& options,
          const fs::path& folder, Counts& counts)
      : _title(std::move(title)), _cases(cases.size()), _counts(counts) {
    for (unsigned worker = 0; worker < std::min<std::size_t>(options.workers, _cases); ++worker) {
      const pid_t child = fork();
      if (child == 0) {
        runCases(cases, options, folder / ("device-" + std::to_string(worker)), counts);
        _exit(0);
      }
      _children.push_back(child);
    }
  }

  bool isAlone() const { return _cases == 1; }

  void finish() {
    for (const pid_t child : _children) {
      int status = 0;
      if (waitpid(child, &status, 0) != child || !WIFEXITED(status)) {
        throw std::runtime_error("a worker of \"" + _title + "\" did not come to its end");
      }
    }
    std::printf("%-44s %6zu cases, %zu failed\n", _title.c_str(), _cases, _counts.failed.load());
    std::fflush(stdout);
  }

 private:
  std::string _title;
  std::size_t _cases;
  Counts& _counts;
  std::vector<pid_t> _children;
};

int torture(const Options& options) {
  std::string name = (fs::temp_directory_path() / "vesprun-torture-XXXXXX").string();
  if (mkdtemp(name.data()) == nullptr) {
    throw std::runtime_error(name + ": " + std::strerror(errno));
  }
  const fs::path folder = name;
  const std::vector<CaseList> lists = caseLists();
  void* shared = mmap(nullptr, lists.size() * sizeof(Counts), PROT_READ | PROT_WRITE,
                      MAP_SHARED | MAP_ANONYMOUS, -1, 0);
  if (shared == MAP_FAILED) {
    throw std::runtime_error(std::string("mmap: ") + std::strerror(errno));
  }
  const std::span<Counts> counts(new (shared) Counts[lists.size()]{}, lists.size());
  std::vector<Running> running;
  for (std::size_t i = 0; i < lists.size(); ++i) {
    const auto& [title, casesOf] = lists[i];
    if (title.find(options.scenario) == std::string::npos) {
      continue;
    }
    // What the next list begins with is made while the one before is under way.
    const std::vector<Case> cases = chosen(casesOf(folder, options), options);
    if (cases.empty()) {
      continue;
    }
    if (!running.empty() && !running.back().isAlone()) {
      running.back().finish();
      running.pop_back();
    }
    running.emplace_back(title, cases, options, folder / std::to_string(i), counts[i]);
    if (!options.only.empty()) {
      break;
    }
  }
  std::size_t tried = 0;
  std::size_t failed = 0;
  for (; !running.empty(); running.pop_back()) {
    running.back().finish();
  }
  for (const Counts& ofList : counts) {
    tried += ofList.tried;
    failed += ofList.failed;
  }
  if (options.only.empty()) {
    fs::remove_all(folder);
  } else {
    std::printf("its devices are in %s\n", folder.c_str());
  }
  std::printf("torture: seed %u, %zu cases, %zu failed\n", options.seed, tried, failed);
  if (tried == 0) {
    throw std::runtime_error("there is no such case");
  }
  return failed == 0 ? 0 : 1;
}

int run(int argc, char** argv) {
  CLI::App app("Runs vesprun and vespctl under every fault that a system can show them.",
               "torture");
  Options options;
  app.add_option("--seed", options.seed, "Where the random choices begin");
  app.add_flag("--full", options.full, "Every error of every call and every byte of a full disk");
  app.add_option("--share", options.share, "Of each kind of case only every N-th")
      ->check(CLI::PositiveNumber);
  app.add_option("--scenario", options.scenario, "Only scenarios whose title holds this text");
  app.add_option("--only", options.only, "One case, by the name that a failure prints");
  std::string counted;
  app.add_option("--count-in", counted)->group("");
  CLI11_PARSE(app, argc, argv);
  if (!counted.empty()) {
    return countWithLibrary(counted.c_str());
  }
  return torture(options);
}

}  // namespace
}  // namespace vesprun::torture

int main(int argc, char** argv) {
  try {
    return vesprun::torture::run(argc, argv);
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "torture: %s\n", failure.what());
    return 2;
  }
}
