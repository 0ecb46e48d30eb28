#include "page/PageCommand.h"

#include <filesystem>
#include <iostream>
#include <limits>
#include <system_error>

#include "Command.h"
#include "ReadOnlyDevice.h"
#include "page/Page.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

/// Writes the file whole or not at all. What a link leads to is replaced, not the link.
void writePage(const std::string& file, const std::string& page) {
  std::error_code failure;
  std::filesystem::path path(file);
  if (std::filesystem::exists(path, failure)) {
    if (!std::filesystem::is_regular_file(path, failure)) {
      throw CommandFailure(file + ": not a regular file");
    }
    path = std::filesystem::canonical(path, failure);
  }
  if (failure) {
    throw CommandFailure(file + ": " + failure.message());
  }
  orFail([&](std::string& error) { return replaceFile(path.string(), page, error); });
}

void makePage(const std::string& file) {
  using Days = std::numeric_limits<std::int32_t>;
  const ReadOnlyDevice opened(LogLevel::Error, OwnersRights::UntilFileIsWritten);
  const PageData data(opened.device->directory());
  const auto keptBack = keysKeptBack(Days::min(), Days::max());
  if (!keptBack) {
    opened.complaints.fail(kUnreadableCounters);
  }
  opened.complaints.print();
  nameUnreadable(data.unreadable);
  std::error_code ignored;
  const auto absolute = std::filesystem::canonical(opened.device->directory().path(), ignored);
  const std::string page =
      pageText(absolute.filename().string(), platform().clock().now(), data, *keptBack);
  if (file.empty() || file == "-") {
    std::cout << page;
  } else {
    const RightsOfCaller rights;
    writePage(file, page);
  }
}

}  // namespace

void addPageCommand(CLI::App& command) {
  const auto file = std::make_shared<std::string>();
  command.add_option("FILE", *file, "Where to write it, instead of standard output");
  command.callback([file] { makePage(*file); });
}

}  // namespace vesprun
