#include "device/PreferenceCommands.h"

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "commandline/Completion.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/preferences/HostPreferences.h"
#include "platform/host/services/HostClock.h"

namespace vesprun {
namespace {

struct PreferenceArguments {
  std::string user = "mobile";
  std::string domain;
  std::string key;
  std::string json;
};

void printPreferences(const PreferenceArguments& arguments, bool wholeDomain) {
  const DeviceDirectory directory = openDirectory(Access::Reading).readOnly();
  Complaints complaints;
  HostClock clock(std::nullopt);
  HostPreferences preferences(directory, clock, complaints, arguments.user);
  const PropertyDict values = preferences.valuesOfDomain(arguments.domain);
  complaints.failIfAny();
  if (wholeDomain) {
    printResult(values, [&values] {
      Table table({{"Key"}, {"Value"}});
      for (const auto& [key, value] : values) {
        table.addRow({std::string(key), jsonText(value)});
      }
      table.printOr("No preferences.");
    });
    return;
  }
  const PropertyValue* value = values.find(arguments.key);
  if (value == nullptr) {
    throw CommandFailure("no key " + quotedText(arguments.key) + " in domain " +
                         quotedText(arguments.domain));
  }
  printResult(*value, [value] {
    printText(value->string() != nullptr ? *value->string() : jsonText(*value));
  });
}

void changePreference(const PreferenceArguments& arguments, std::optional<PropertyValue> value) {
  const DeviceDirectory directory = openDirectory(Access::Changing);
  Complaints complaints;
  HostClock clock(std::nullopt);
  HostPreferences preferences(directory, clock, complaints, arguments.user);
  preferences.LGSPreferencesSetValue(arguments.key, std::move(value), arguments.domain);
  complaints.failIfAny();
  if (!preferences.LGSPreferencesSynchronize(arguments.domain)) {
    complaints.failIfAny();
  }
  complaints.print();
}

void setPreference(const PreferenceArguments& arguments) {
  std::string error;
  std::optional<PropertyValue> value = valueFromJsonText(arguments.json, error);
  if (!value) {
    throw CLI::ValidationError("JSON", quotedText(arguments.json) + ": " + error);
  }
  changePreference(arguments, std::move(value));
}

/// Of all these commands: --user stands before or after their names.
PreferenceArguments& addUser(CLI::App& command) {
  static PreferenceArguments arguments;
  command.add_option("--user", arguments.user, "Whose preferences, instead of mobile's")
      ->type_name("NAME");
  return arguments;
}

PreferenceArguments& addDomain(CLI::App& command) {
  PreferenceArguments& arguments = addUser(command);
  completeWith(
      command.add_option("DOMAIN", arguments.domain, "The name of their document")->required(),
      [&arguments] {
        const DeviceDirectory directory = openDirectory(Access::Reading);
        const HostPath folder =
            directory.hostPath("var/" + arguments.user + "/Library/Preferences");
        std::vector<std::string> domains;
        std::string error;
        for (const std::string& name :
             namesInFolder(folder, error).value_or(std::vector<std::string>())) {
          constexpr std::string_view kEnd = ".ptree";
          if (name.ends_with(kEnd) && !name.starts_with('.')) {
            domains.push_back(name.substr(0, name.size() - kEnd.size()));
          }
        }
        return domains;
      });
  return arguments;
}

void addGet(CLI::App& command) {
  PreferenceArguments& arguments = addDomain(command);
  const CLI::Option* key = command.add_option("KEY", arguments.key, "The name of a preference");
  command.callback([&arguments, key] { printPreferences(arguments, key->count() == 0); });
}

void addSet(CLI::App& command) {
  PreferenceArguments& arguments = addDomain(command);
  command.add_option("KEY", arguments.key, "The name of a preference")->required();
  command.add_option("JSON", arguments.json, "The value in its JSON form")->required();
  command.callback([&arguments] { setPreference(arguments); });
}

void addRemove(CLI::App& command) {
  PreferenceArguments& arguments = addDomain(command);
  command.add_option("KEY", arguments.key, "The name of a preference")->required();
  command.callback([&arguments] { changePreference(arguments, std::nullopt); });
}

constexpr Command kPreferenceCommands[] = {
    {"get", "Shows a value, or all values of a domain", addGet},
    {"set", "Sets a value", addSet},
    {"remove", "Removes a key", addRemove},
};

}  // namespace

void addPreferenceCommands(CLI::App& command) {
  addUser(command);
  addCommands(command, kPreferenceCommands);
}

}  // namespace vesprun
