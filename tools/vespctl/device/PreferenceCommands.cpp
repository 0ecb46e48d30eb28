#include "Command.h"
#include "Complaints.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/preferences/HostPreferences.h"
#include "platform/host/services/HostClock.h"

namespace vesprun {
namespace {

struct PreferenceArguments {
  std::string device;
  std::string user = "mobile";
  std::string domain;
  std::string key;
  std::string json;
};

void printPreferences(const PreferenceArguments& arguments, bool wholeDomain) {
  const DeviceDirectory directory = openDirectory(arguments.device);
  Complaints complaints;
  HostClock clock(std::nullopt);
  HostPreferences preferences(directory, clock, complaints, arguments.user);
  const PropertyDict values = preferences.valuesOfDomain(arguments.domain);
  complaints.failIfAny();
  if (wholeDomain) {
    printJson(values);
    return;
  }
  const PropertyValue* value = values.find(arguments.key);
  if (value == nullptr) {
    throw CommandFailure("no key " + quotedText(arguments.key) + " in domain " +
                         quotedText(arguments.domain));
  }
  printJson(*value);
}

void changePreference(const PreferenceArguments& arguments, std::optional<PropertyValue> value) {
  const DeviceDirectory directory = openDirectory(arguments.device);
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

}  // namespace

void addPreferenceCommands(CLI::App& vespctl) {
  const auto arguments = std::make_shared<PreferenceArguments>();
  CLI::App* prefs =
      addDeviceCommand(vespctl, "prefs", "Shows and changes preferences", arguments->device);
  prefs->add_option("--user", arguments->user, "Whose preferences, instead of mobile's");

  CLI::App* get = prefs->add_subcommand("get", "Prints a value, or all values of a domain");
  get->add_option("DOMAIN", arguments->domain)->required();
  const CLI::Option* key = get->add_option("KEY", arguments->key);
  get->callback([arguments, key] { printPreferences(*arguments, key->count() == 0); });

  CLI::App* set = prefs->add_subcommand("set", "Sets a value");
  set->add_option("DOMAIN", arguments->domain)->required();
  set->add_option("KEY", arguments->key)->required();
  set->add_option("JSON", arguments->json, "The value in its JSON form")->required();
  set->callback([arguments] { setPreference(*arguments); });

  CLI::App* remove = prefs->add_subcommand("remove", "Removes a key");
  remove->add_option("DOMAIN", arguments->domain)->required();
  remove->add_option("KEY", arguments->key)->required();
  remove->callback([arguments] { changePreference(*arguments, std::nullopt); });

  for (CLI::App* command : {get, set, remove}) {
    command->fallthrough();  // --user may follow the command
  }
  allowOneCommand(*prefs);
}

}  // namespace vesprun
