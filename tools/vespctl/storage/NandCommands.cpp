#include <unistd.h>

#include <cstdio>
#include <iostream>

#include "Command.h"
#include "NANDInfo/StructuredLogState.h"
#include "NANDInfo/controller/NandExporter.h"
#include "NANDInfo/lists/StructuredLog.h"
#include "NANDInfo/parsers/APIErrorMessage.h"
#include "NANDInfo/sets/HealthSets.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/FileDescriptor.h"
#include "platform/host/files/SystemError.h"
#include "telemetry/DiskInfo.h"
#include "telemetry/NVRAMStatistics.h"
#include "vesprun.h"

namespace vesprun {
namespace {

struct NandArguments {
  std::string device;
  bool statKeys = false;
  bool round = false;
  std::uint64_t hours = 0;
  bool raw = false;
  std::uint32_t mode = 2;
  std::uint32_t fromStep = 0;
  bool noMonthly = false;
  bool flag = false;
  bool force = false;
};

/// An exported entry point; its answer becomes "result", null when there is none.
struct NandVerb {
  const char* name;
  const char* help;
  void (*addOptions)(CLI::App& verb, NandArguments& arguments);  ///< null: it takes none
  std::optional<PropertyValue> (*call)(const NandArguments& arguments);
};

std::optional<PropertyValue> valueOf(std::optional<PropertyDict> dict) {
  return dict ? std::optional<PropertyValue>(*std::move(dict)) : std::nullopt;
}

void addRoundFlag(CLI::App& verb, NandArguments& arguments) {
  verb.add_flag("--round", arguments.round, "Rounds the numbers to their significant digits");
}

/// True when the controller opens.
bool connectsToController() {
  ORUConnection connection;
  const bool opened = openORUConnection(connection);
  closeORUConnection(connection);
  return opened;
}

constexpr NandVerb kVerbs[] = {
    {"info", "The legacy NAND info", nullptr,
     [](const NandArguments&) { return valueOf(CopyNANDInfo()); }},
    {"info-for-daily-log", "The legacy NAND info, on the days when the daily log has it", nullptr,
     [](const NandArguments&) { return valueOf(CopyNANDInfoWithOptions({})); }},
    {"dump", "The legacy NAND info without its version fields", nullptr,
     [](const NandArguments&) {
       PropertyDict info;
       DumpNANDInfo(info);
       return valueOf(std::move(info));
     }},
    {"ftl-raw", "The FTL fields, all of them",
     [](CLI::App& verb, NandArguments& arguments) {
       verb.add_flag("--stat-keys", arguments.statKeys, "Names the fields by their ids");
     },
     [](const NandArguments& arguments) {
       return valueOf(CopyNANDFTLInfo(arguments.statKeys, 1));
     }},
    {"ftl", "The FTL fields that may leave the device", addRoundFlag,
     [](const NandArguments& arguments) {
       return valueOf(CopyWhitelistedNANDFTLInfo(arguments.round));
     }},
    {"msp", "The fields of each MSP that may leave the device", addRoundFlag,
     [](const NandArguments& arguments) {
       return valueOf(CopyWhitelistedNANDMSPInfo(arguments.round));
     }},
    {"storage-stats", "The storage statistics that may leave the device", addRoundFlag,
     [](const NandArguments& arguments) {
       return valueOf(CopyWhitelistedStorageStats(arguments.round));
     }},
    {"vm-freezer", "What the kernel's swap-out thread has written", nullptr,
     [](const NandArguments&) { return valueOf(CopyVMFreezerNANDInfo()); }},
    {"magazine", "What happened since a snapshot of the stats magazine",
     [](CLI::App& verb, NandArguments& arguments) {
       verb.add_option("HOURS", arguments.hours, "How long ago the snapshot was taken")
           ->required()
           ->transform(decimal<std::uint64_t>());
       verb.add_flag("--raw", arguments.raw,
                     "The counters as the snapshot has them, not what they grew by");
       verb.add_option("--mode", arguments.mode,
                       "0: counters that accumulate, 1: instantaneous values, 2: both")
           ->transform(decimal<std::uint32_t>());
     },
     [](const NandArguments& arguments) {
       return valueOf(CopySMagNANDFTLInfo(arguments.hours, arguments.raw ? 0 : 1, arguments.mode));
     }},
    {"magazine-history", "The write amplification of the last six periods of four hours", nullptr,
     [](const NandArguments&) { return valueOf(CopySMagNANDFTLCustomHistoryInfo(0)); }},
    {"tendmark", "The storage's health, for service plans", nullptr,
     [](const NandArguments&) { return valueOf(CopyTendmarkNANDInfo()); }},
    {"ota", "The storage's health, for updates over the air", nullptr,
     [](const NandArguments&) { return valueOf(CopyOTANANDInfo()); }},
    {"lab", "The storage's health, for labs", nullptr,
     [](const NandArguments&) { return valueOf(CopyInternalLabNANDInfo()); }},
    {"recommends-deletion", "Does the controller recommend deleting content?", nullptr,
     [](const NandArguments&) {
       return std::optional<PropertyValue>(NandRecommendsContentDeletion());
     }},
    {"events", "Sends the storage statistics as analytics events, and shows what was sent",
     [](CLI::App& verb, NandArguments& arguments) {
       verb.add_option("--from-step", arguments.fromStep, "The step to begin with, 0 to 6")
           ->transform(decimal<std::uint32_t>());
       verb.add_flag("--no-monthly", arguments.noMonthly, "Leaves out the step of a month");
     },
     [](const NandArguments& arguments) {
       return valueOf(
           NandInfoExtractToEH_runAllSteps(0, !arguments.noMonthly, 1, arguments.fromStep));
     }},
    {"structured-log", "Logs the controller's lists: true when all could be handled",
     [](CLI::App& verb, NandArguments& arguments) {
       verb.add_flag("--flag", arguments.flag, "Passes the caller's flag on to the controller");
       verb.add_flag("--force", arguments.force, "Collects the validity list in any case");
     },
     [](const NandArguments& arguments) {
       gForceCollectionSet = arguments.force ? 1 : 0;
       return std::optional<PropertyValue>(DumpStorageStructuredLog(arguments.flag));
     }},
    {"disk", "Size and fullness of the user data volume", nullptr,
     [](const NandArguments&) { return valueOf(GetDiskInfo()); }},
    {"nvram", "The usage and write counters of the NVRAM", nullptr,
     [](const NandArguments&) { return valueOf(gatherNVRAMStats()); }},
    {"connect", "Opens the controller and closes it: true when it could be opened", nullptr,
     [](const NandArguments&) { return std::optional<PropertyValue>(connectsToController()); }},
};

/// Redirects standard output to standard error as long as it lives: entry points print there,
/// before the result.
class StandardOutputAside {
 public:
  StandardOutputAside() : _kept(dup(STDOUT_FILENO)) {
    if (!_kept.isOpen() || dup2(STDERR_FILENO, STDOUT_FILENO) < 0) {
      throw CommandFailure(systemError("standard output"));
    }
  }
  ~StandardOutputAside() {
    std::fflush(stdout);
    dup2(_kept.get(), STDOUT_FILENO);
  }
  StandardOutputAside(const StandardOutputAside&) = delete;
  StandardOutputAside& operator=(const StandardOutputAside&) = delete;

 private:
  FileDescriptor _kept;
};

std::optional<PropertyValue> callAside(const NandVerb& verb, const NandArguments& arguments) {
  const StandardOutputAside aside;
  return verb.call(arguments);
}

void callVerb(const NandVerb& verb, const NandArguments& arguments) {
  const std::unique_ptr<HostPlatform> device = openDevice(arguments.device);
  const InstalledPlatform installed(*device);
  const std::optional<PropertyValue> result = callAside(verb, arguments);
  std::cout << "{\"result\":" << (result ? jsonText(*result) : "null")
            << ",\"error\":" << jsonText(PropertyValue(GetAPIErrorMessage())) << "}\n";
}

}  // namespace

void addNandCommands(CLI::App& vespctl) {
  CLI::App* nand = vespctl.add_subcommand("nand", "Asks a device for its storage statistics");
  const auto arguments = std::make_shared<NandArguments>();
  nand->add_option("DIR", arguments->device, "The device directory")->required();
  for (const NandVerb& verb : kVerbs) {
    CLI::App* command = nand->add_subcommand(verb.name, verb.help);
    if (verb.addOptions != nullptr) {
      verb.addOptions(*command, *arguments);
    }
    command->callback([arguments, &verb] { callVerb(verb, *arguments); });
  }
  allowOneCommand(*nand);
}

}  // namespace vesprun
