#include "outbox/PtreeCommand.h"

#include <iostream>

#include "access/CommandDevice.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"

namespace vesprun {
namespace {

void printPtree(const std::string& file) {
  std::string error;
  const std::optional<PropertyValue> value = readPtree(readInput(file), error);
  if (!value) {
    throw CommandFailure(inputName(file) + ": " + error);
  }
  std::cout << jsonText(*value) << '\n';
}

}  // namespace

void addPtreeCommand(CLI::App& command) {
  const auto file = std::make_shared<std::string>();
  command.add_option("FILE", *file, "The document; - for standard input")->required();
  command.callback([file] { printPtree(*file); });
}

}  // namespace vesprun
