#include "Load.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <future>
#include <thread>

#include "LineSource.h"
#include "StoreAddress.h"
#include "commandline/Progress.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/LineReader.h"
#include "store/FleetStore.h"

namespace vesprun {
namespace {

constexpr const char* kRejected = "rejected";
constexpr std::size_t kFilesOfBatch = 1000;

struct InputFile {
  std::string path;
  std::optional<std::string> device;  ///< the only one whose lines the file may have
  bool found = false;                 ///< in a folder: a regular file, no link
};

/// Lines that are parsed together, and what became of each.
struct ParsedLines {
  struct Parsed {
    std::size_t length = 0;  ///< of its text
    bool isTooLong = false;
    std::optional<ExportedLine> line;
    std::string why;  ///< it is malformed
  };

  void parse(std::size_t from, std::size_t to, const char* text) {
    for (; from < to; text += lines[from++].length) {
      Parsed& parsed = lines[from];
      parsed.why = "longer than 16 MiB";
      if (!parsed.isTooLong) {
        parsed.line = parseExportedLine({text, parsed.length}, parsed.why);
      }
    }
  }

  std::string texts;
  std::vector<Parsed> lines;
  std::uint64_t first = 1;  ///< number of the first in its file
};

/// A file of a spool whose lines are on their way into the store.
struct ReadFile {
  std::string path;
  struct stat status {};
  bool isRejected = false;
};

void complainOf(const std::string& path, const std::string& why) {
  Progress::hide();
  std::fprintf(stderr, "%s: %s\n", printableText(path).c_str(), why.c_str());
}

class Loading {
 public:
  Loading(FleetStore& store, bool spools) : _store(store), _spools(spools) {}

  void load(const std::string& path) {
    std::error_code error;
    if (path != "-" && std::filesystem::is_directory(path, error)) {
      for (const InputFile& file : filesIn(path)) {
        read(file);
      }
    } else {
      read({path, std::nullopt, false});
    }
  }

  void finish() {
    _store.finish();
    for (const ReadFile& file : _read) {
      leave(file);
    }
    _read.clear();
  }

  const LoadCounts& counts() const { return _counts; }

 private:
  std::vector<InputFile> filesIn(const std::string& folder) {
    namespace fs = std::filesystem;
    std::vector<InputFile> files;
    std::error_code error;
    fs::recursive_directory_iterator entry(folder, error);
    for (; !error && entry != fs::recursive_directory_iterator(); entry.increment(error)) {
      const std::string name = entry->path().filename().string();
      std::error_code ignored;
      if (name == kRejected && entry->is_directory(ignored)) {
        entry.disable_recursion_pending();
      } else if ((name.ends_with(".jsonl") || name.ends_with(".jsonl.gz")) &&
                 entry->symlink_status(ignored).type() == fs::file_type::regular) {
        InputFile file{entry->path().string(), std::nullopt, true};
        if (_spools && entry.depth() > 0) {
          file.device = entry->path().lexically_relative(folder).begin()->string();
        }
        files.push_back(std::move(file));
      }
    }
    if (error) {
      complainOf(folder, error.message());
      _counts.failed = true;
    }
    std::sort(files.begin(), files.end(),
              [](const InputFile& left, const InputFile& right) { return left.path < right.path; });
    return files;
  }

  static ParsedLines readSome(LineReader& lines, LineReader::Result& result) {
    constexpr std::size_t kMaxTexts = std::size_t{1} << 20;
    constexpr std::size_t kMaxLines = 4096;
    ParsedLines some;
    some.first = lines.number() + 1;
    std::string_view text;
    while (some.texts.size() < kMaxTexts && some.lines.size() < kMaxLines) {
      result = lines.next(text);
      const bool isTooLong = result == LineReader::Result::TooLong;
      if (result != LineReader::Result::Line && !isTooLong) {
        break;
      }
      text = isTooLong ? std::string_view() : text;
      some.texts.append(text);
      some.lines.push_back({text.size(), isTooLong, std::nullopt, {}});
    }
    return some;
  }

  /// Parses by several threads what takes longer than to start them.
  static std::vector<std::future<void>> startParsing(ParsedLines& some) {
    constexpr std::size_t kMaxOfOne = std::size_t{64} << 10;
    const std::size_t threads =
        some.texts.size() <= kMaxOfOne
            ? 1
            : std::clamp<std::size_t>(std::thread::hardware_concurrency(), 2, 4);
    std::vector<std::future<void>> parsing;
    std::size_t from = 0;
    const char* text = some.texts.data();
    for (std::size_t thread = 1; thread <= threads; ++thread) {
      const std::size_t to = some.lines.size() * thread / threads;
      parsing.push_back(std::async(threads == 1 ? std::launch::deferred : std::launch::async,
                                   [&some, from, to, text] { some.parse(from, to, text); }));
      for (; from < to; ++from) {
        text += some.lines[from].length;
      }
    }
    return parsing;
  }

  /// Stores what was parsed, and names what is malformed.
  void add(const InputFile& file, const std::string& name, ParsedLines& parsed) {
    for (auto& [length, isTooLong, line, why] : parsed.lines) {
      if (line && file.device && line->device != *file.device) {
        line.reset();
        why = "the device is not that of the folder";
      }
      ++_counts.lines;
      if (line) {
        _store.add(*line);
      } else {
        ++_counts.malformed;
        complainOf(name + ':' + std::to_string(parsed.first), why);
      }
      ++parsed.first;
      _progress.advance();
    }
  }

  void read(const InputFile& file) {
    const bool isStandardInput = file.path == "-";
    const std::string name = isStandardInput ? "standard input" : file.path;
    const int descriptor =
        isStandardInput ? fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 3)
                        : open(file.path.c_str(),
                               O_RDONLY | O_CLOEXEC | (file.found ? O_NOFOLLOW | O_NONBLOCK : 0));
    ReadFile done{file.path, {}, false};
    if (descriptor >= 0) {
      fstat(descriptor, &done.status);
    }
    LineSource source(descriptor);
    LineReader lines(source, kMaxExportedLine);
    const std::uint64_t malformed = _counts.malformed;
    auto result = LineReader::Result::Line;
    ParsedLines parsed;
    while (result == LineReader::Result::Line || result == LineReader::Result::TooLong) {
      // These are parsed while those before are stored.
      ParsedLines next = readSome(lines, result);
      auto parsing = startParsing(next);
      add(file, name, parsed);
      for (std::future<void>& part : parsing) {
        part.get();
      }
      parsed = std::move(next);
    }
    add(file, name, parsed);
    const bool failed = result == LineReader::Result::Failed;
    if (failed) {
      _counts.failed = true;
      complainOf(name, source.failure());
    }
    const bool wasRead = descriptor >= 0 && (!failed || source.isPacked());
    if (_spools && !isStandardInput && wasRead && S_ISREG(done.status.st_mode)) {
      done.isRejected = failed || _counts.malformed != malformed;
      _read.push_back(std::move(done));
      if (_read.size() >= kFilesOfBatch) {
        finish();
      }
    }
  }

  /// Removes a file, or moves it aside, unless another has taken its place since.
  void leave(const ReadFile& file) {
    struct stat now {};
    if (lstat(file.path.c_str(), &now) != 0 || now.st_ino != file.status.st_ino ||
        now.st_dev != file.status.st_dev || now.st_size != file.status.st_size ||
        now.st_mtim.tv_sec != file.status.st_mtim.tv_sec ||
        now.st_mtim.tv_nsec != file.status.st_mtim.tv_nsec) {
      return;
    }
    if (!(file.isRejected ? moveAside(file.path) : unlink(file.path.c_str()) == 0)) {
      complainOf(file.path, std::strerror(errno));
      _counts.failed = true;
    }
  }

  static bool moveAside(const std::string& path) {
    const std::filesystem::path folder = std::filesystem::path(path).parent_path() / kRejected;
    if (mkdir(folder.c_str(), 0700) != 0 && errno != EEXIST) {
      return false;
    }
    const std::string target = (folder / std::filesystem::path(path).filename()).string();
    constexpr int kTries = 100'000;
    for (int number = 0; number < kTries; ++number) {
      const std::string name = number == 0 ? target : target + '.' + std::to_string(number);
      if (renameat2(AT_FDCWD, path.c_str(), AT_FDCWD, name.c_str(), RENAME_NOREPLACE) == 0) {
        return true;
      }
      if (errno != EEXIST) {
        return false;
      }
    }
    return false;
  }

  FleetStore& _store;
  bool _spools;
  LoadCounts _counts;
  std::vector<ReadFile> _read;
  Progress _progress{"load", "lines"};
};

}  // namespace

LoadCounts loadFiles(const std::string& address, std::optional<int> least,
                     const std::vector<std::string>& paths, bool spools) {
  const auto store = openFleetStore(address, StoreUse::Load, least);
  Loading loading(*store, spools);
  for (const std::string& path : paths) {
    loading.load(path);
  }
  loading.finish();
  LoadCounts counts = loading.counts();
  counts.outcomes = store->outcomes();
  return counts;
}

}  // namespace vesprun
