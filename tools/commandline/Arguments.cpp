#include "commandline/Arguments.h"

#include <algorithm>

#include "common/Calendar.h"

namespace vesprun {

std::optional<GivenDay> GivenDay::parse(std::string_view text) {
  GivenDay given;
  if (text == "today" || text == "yesterday") {
    given._isBack = true;
    given._day = text == "today" ? 0 : 1;
    return given;
  }
  if (std::int32_t number = 0; parseWholeText(text, number)) {
    given._day = number;
    return given;
  }
  const std::optional<Date> date = parseDateText(std::string(text) + "T00:00:00Z");
  if (!date || startOfDay(daysSince1970(*date)) != *date) {
    return std::nullopt;
  }
  given._day = daysSince1970(*date);
  return given;
}

std::int32_t GivenDay::on(std::int32_t today) const {
  return static_cast<std::int32_t>(std::max<std::int64_t>(std::numeric_limits<std::int32_t>::min(),
                                                          _isBack ? today - _day : _day));
}

CLI::Option* addDay(CLI::App& command, const std::string& name, std::optional<GivenDay>& day,
                    const std::string& help) {
  return command
      .add_option_function<std::string>(
          name,
          [&day, name](const std::string& text) {
            day = GivenDay::parse(text);
            if (!day) {
              throw CLI::ValidationError(name, quotedText(text) + kNoDay);
            }
          },
          help)
      ->type_name("DAY");
}

void addDays(CLI::App& command, GivenDays& days) {
  addDay(command, "--from", days.from, "The first day");
  addDay(command, "--to", days.to, "The last day");
}

std::string dateOfDay(std::int32_t day) {
  const std::string date = dateText(startOfDay(day));
  return date.substr(0, date.find('T'));
}

}  // namespace vesprun
