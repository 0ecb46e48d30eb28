#include "page/PageCommand.h"

#include <unistd.h>

#include <limits>

#include "access/CommandDevice.h"
#include "access/ReadOnlyDevice.h"
#include "outbox/FirstReport.h"
#include "outbox/SubmittedLogs.h"
#include "page/Page.h"
#include "page/PageFile.h"
#include "platform/host/device/LiveSystem.h"

namespace vesprun {
namespace {

struct WantedPage {
  std::string file;
  std::string title;
  bool isShared = false;
};

PageAbout aboutOf(HostPlatform& device, const WantedPage& wanted) {
  const auto& system = device.description().system;
  PageAbout about;
  about.now = device.clock().now();
  about.isShared = wanted.isShared;
  about.title = wanted.title;
  if (about.title.empty()) {
    char host[256] = "";
    about.title = gethostname(host, sizeof host - 1) == 0 && host[0] != 0 ? host : "this device";
  }
  about.names = {describedOr(system.osVersion, live::osVersion),
                 "build " + describedOr(system.buildVersion, live::osBuild),
                 "model " + describedOr(system.hardwareModel, live::hardwareModel),
                 "device " + exportedName(device)};
  return about;
}

void makePage(const WantedPage& wanted) {
  using Days = std::numeric_limits<std::int32_t>;
  const ReadOnlyDevice opened(LogLevel::Error, OwnersRights::UntilFileIsWritten);
  const PageData data(opened.device->directory());
  PageAbout about = aboutOf(*opened.device, wanted);
  if (auto keptBack = keysKeptBack(Days::min(), Days::max())) {
    about.keptBack = std::move(*keptBack);
  } else {
    opened.complaints.fail(kUnreadableCounters);
  }
  opened.complaints.print();
  nameUnreadable(data.unreadable);
  about.findings = readStatus(*opened.device).findings;
  for (Finding& finding : about.findings) {
    if (wanted.isShared) {
      finding.detail.clear();  // it may name keys or tell of the system log
    }
  }
  if (data.days.empty()) {
    about.firstReport = whenFirstReport(*opened.device);
  }
  const std::string page = pageText(about, data);
  const RightsOfCaller rights;
  writePage(wanted.file, page);
}

}  // namespace

void addPageCommand(CLI::App& command) {
  const auto wanted = std::make_shared<WantedPage>();
  command.add_option("FILE", wanted->file, "Where to write it, instead of standard output");
  command.add_option("--title", wanted->title, "At the top, instead of the host's name")
      ->type_name("TEXT");
  command.add_flag("--share", wanted->isShared,
                   "Leaves out what is for the owner alone: the names of keys that are kept back, "
                   "and lines of the system log");
  command.callback([wanted] { makePage(*wanted); });
}

}  // namespace vesprun
