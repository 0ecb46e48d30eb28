#include "platform/host/StrictJson.h"

#include <nlohmann/json.hpp>
#include <set>
#include <vector>

namespace vesprun {
namespace {

using OrderedJson = nlohmann::ordered_json;

/// Reads a text for what a parsed document does not show any more.
class StrictReader final : public nlohmann::json_sax<OrderedJson> {
 public:
  explicit StrictReader(std::string& error) : _error(error) {}

  bool null() override { return true; }
  bool boolean(bool /*value*/) override { return true; }
  bool number_integer(number_integer_t /*value*/) override { return true; }
  bool number_unsigned(number_unsigned_t /*value*/) override { return true; }
  bool number_float(number_float_t /*value*/, const std::string& text) override {
    if (text.find_first_of(".eE") == std::string::npos) {
      _error = place() + "the integer " + text.substr(0, 40) + " does not fit 64 bits";
      return false;
    }
    return true;
  }
  bool string(std::string& /*value*/) override { return true; }
  bool binary(OrderedJson::binary_t& /*value*/) override { return true; }
  bool start_object(std::size_t /*count*/) override {
    _open.emplace_back();
    return true;
  }
  bool key(std::string& name) override {
    Object& object = _open.back();
    object.name = name;
    if (!object.names.insert(name).second) {
      _error = place() + "given twice";
      return false;
    }
    return true;
  }
  bool end_object() override {
    _open.pop_back();
    return true;
  }
  bool start_array(std::size_t /*count*/) override { return true; }
  bool end_array() override { return true; }
  bool parse_error(std::size_t /*position*/, const std::string& /*token*/,
                   const nlohmann::detail::exception& exception) override {
    _error = parseErrorText(exception);
    return false;
  }

 private:
  struct Object {
    std::string name;  ///< of the entry that is being read
    std::set<std::string, std::less<>> names;
  };

  std::string place() const {
    constexpr std::size_t kMostSteps = 8;
    std::string place;
    for (std::size_t step = 0; step < _open.size() && step < kMostSteps; ++step) {
      place += (step == 0 ? "" : ".") + _open[step].name;
    }
    place += _open.size() > kMostSteps ? ".…" : "";
    return place.empty() ? "" : place + ": ";
  }

  std::string& _error;
  std::vector<Object> _open;
};

}  // namespace

std::optional<OrderedJson> parseStrictJson(std::string_view text, std::string& error) {
  StrictReader reader(error);
  if (!OrderedJson::sax_parse(text.begin(), text.end(), &reader)) {
    return std::nullopt;
  }
  return OrderedJson::parse(text.begin(), text.end());
}

std::string parseErrorText(const std::exception& exception) {
  const std::string_view message = exception.what();
  const auto prefixEnd = message.find("] ");  // "[json.exception....] parse error at line ..."
  return std::string(message.substr(prefixEnd == std::string_view::npos ? 0 : prefixEnd + 2));
}

}  // namespace vesprun
