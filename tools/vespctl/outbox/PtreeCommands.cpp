#include "Command.h"
#include "platform/host/documents/PtreeReader.h"

namespace vesprun {
namespace {

void printPtree(const std::string& file) {
  std::string error;
  const std::optional<PropertyValue> value = readPtree(readInput(file), error);
  if (!value) {
    throw CommandFailure(inputName(file) + ": " + error);
  }
  printJson(*value);
}

}  // namespace

void addPtreeCommands(CLI::App& vespctl) {
  CLI::App* ptree = vespctl.add_subcommand("ptree", "Prints the JSON form of a ptree document");
  const auto file = std::make_shared<std::string>();
  ptree->add_option("FILE", *file, "The document; - for standard input")->required();
  ptree->callback([file] { printPtree(*file); });
}

}  // namespace vesprun
