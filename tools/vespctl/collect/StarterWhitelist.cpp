#include "collect/StarterWhitelist.h"

#include <set>

#include "access/CommandDevice.h"
#include "config/TBConfig.h"
#include "platform/host/figures/FigureTable.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

/// Two digits tell what goes on, and not which machine it is.
constexpr const char* kScalarOptions = "<dict><key>sig_fig</key><integer>2</integer></dict>";

std::string distributionOptions(const LinuxFigure& figure) {
  std::string options = "<dict><key>intervals</key><array>";
  for (const std::int32_t bound : figure.bounds) {
    options += "<integer>" + std::to_string(bound) + "</integer>";
  }
  return options + "</array></dict>";
}

/// One of the four lists of a group: keys or, when they go on with a device's name, prefixes.
std::string list(const char* name, bool ofDistributions, bool ofPrefixes) {
  std::string text = std::string("\t\t<key>") + name + "</key>\n\t\t<dict>\n";
  std::set<std::string_view> keys;
  for (const LinuxFigure& figure : linuxFigures) {
    if ((figure.kind == FigureKind::Gauge) == ofDistributions &&
        figure.key.ends_with('.') == ofPrefixes && keys.insert(figure.key).second) {
      text.append("\t\t\t<!-- ").append(figure.why).append(" -->\n\t\t\t<key>").append(figure.key);
      text += "</key>\n\t\t\t";
      text += (ofDistributions ? distributionOptions(figure) : kScalarOptions) + "\n";
    }
  }
  return text + "\t\t</dict>\n";
}

}  // namespace

std::string starterWhitelist() {
  return R"(<?xml version="1.0" encoding="UTF-8"?>
<!-- What may leave this device. These are the keys that "vespctl collect" writes, each below a word
     on what it is good for; take out what should stay. Scalars keep two digits, and distributions
     their statistics and a histogram. -->
<ptree version="1.0">
<dict>
	<!-- The group as a whole is switched off by a false "Linux" in the preferences com.quill.da. -->
	<key>Linux</key>
	<dict>
		<!-- Who wants these keys, and why; an entry can say otherwise. No report reads it. -->
		<key>About</key>
		<dict>
			<key>owner</key>
			<string>whoever set this device up</string>
			<key>reason</key>
			<string>to see whether the machine has enough memory, storage and time for its work</string>
		</dict>
)" + list("ScalarKeys", false, false) +
         list("ScalarKeyPrefixes", false, true) + list("DistributionKeys", true, false) +
         list("DistributionKeyPrefixes", true, true) + "\t</dict>\n</dict>\n</ptree>\n";
}

void writeWhitelist(const DeviceDirectory& directory, std::string_view document) {
  orFail([&](std::string& error) {
    const auto folder = directory.makeFolder(TBConfig::kFolder, error);
    return folder && replaceFile(directory.hostPath(TBConfig::path()), document, error);
  });
}

}  // namespace vesprun
