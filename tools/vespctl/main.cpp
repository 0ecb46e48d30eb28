#include "access/CommandDevice.h"
#include "collect/CollectCommand.h"
#include "commandline/Completion.h"
#include "days/CatchUpCommand.h"
#include "days/DaysCommand.h"
#include "days/PruneCommand.h"
#include "device/CounterCommands.h"
#include "device/DeviceCommands.h"
#include "device/MessageCommands.h"
#include "device/PreferenceCommands.h"
#include "export/ExportCommand.h"
#include "export/UploadCommand.h"
#include "listen/ListenCommand.h"
#include "outbox/PtreeCommand.h"
#include "outbox/ShowCommand.h"
#include "page/PageCommand.h"
#include "platform/host/files/StandardStreams.h"
#include "preview/PreviewCommands.h"
#include "status/StatusCommand.h"
#include "storage/DecodeCommand.h"
#include "storage/FieldsCommand.h"
#include "storage/NandCommands.h"
#include "whitelist/WhitelistCommands.h"

namespace vesprun {
namespace {

// Before the command-line library makes its own global objects.
[[gnu::constructor(101)]] void prepare() { exitWithoutMemory("vespctl", 1); }

/// Help, completion and the manual tell of them in this order.
constexpr Command kCommands[] = {
    {"init", "Makes a device directory", addInitCommand},
    {"run", "Does what vesprun does, on that device", addRunCommand},
    {"status", "Says whether all is well; exit status 1 when something is not", addStatusCommand},
    {"collect", "Counts what the running system's figures have grown since the last time",
     addCollectCommand},
    {"show", "Shows what the runs left in the outbox", addShowCommand},
    {"days", "Tells what is kept of the last days, and the names of their daily logs",
     addDaysCommand},
    {"catch-up", "Submits the reports of days without a daily log, and tells which",
     addCatchUpCommand},
    {"prune", "Removes what is old, and tells what went", addPruneCommand},
    {"preview", "Shows the daily log that a run would submit now", addPreviewCommand},
    {"explain", "Says why a key leaves the device or stays", addExplainCommand},
    {"whitelist", "Judges a whitelist before it is used", addWhitelistCommands},
    {"counters", "Shows and changes counters", addCounterCommands},
    {"listen", "Takes counters from other programs, as StatsD lines", addListenCommand},
    {"prefs", "Shows and changes preferences", addPreferenceCommands},
    {"send", "Sends messages to a running vesprun", addMessageCommands},
    {"export", "Prints the submitted daily logs for vespfleet and other programs", addExportCommand,
     Form::Own},
    {"upload", "Sends the daily logs that a server has not acknowledged yet", addUploadCommand},
    {"page", "Writes one HTML page of all that the device reported", addPageCommand, Form::Own},
    {"nand", "Asks a device for its storage statistics", addNandCommands},
    {"decode", "Decodes one saved buffer of the device", addDecodeCommand},
    {"fields", "Prints the rows of a constant table", addFieldsCommand, Form::Own},
    {"ptree", "Prints the JSON form of a ptree document", addPtreeCommand, Form::Own},
    {"completion", "Prints the completion script for a shell", addCompletionCommand, Form::Own},
};

}  // namespace
}  // namespace vesprun

int main(int argc, char** argv) {
  return vesprun::runProgram(
      {"vespctl", "Sets up a device directory, runs the daily job on it and shows what came out.",
       vesprun::kCommands, vesprun::addDeviceOption},
      argc, argv);
}
