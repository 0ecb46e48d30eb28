#include "access/Complaints.h"

#include "access/CommandDevice.h"

namespace vesprun {

bool Complaints::keeps(LogLevel level) const {
  return level <= _least || (_also != nullptr && _also->keeps(level));
}

void Complaints::write(LogLevel level, std::string_view message) {
  if (level <= _least && (_messages.empty() || _messages.back() != message)) {
    _messages.emplace_back(message);
  }
  if (_also != nullptr) {
    _also->write(level, message);
  }
}

void Complaints::failIfAny() const {
  if (!_messages.empty()) {
    throw CommandFailure(_messages.front());
  }
}

void Complaints::fail(const std::string& error) const {
  std::string text;
  for (const std::string& message : _messages) {
    text += message + "; ";
  }
  if (!_messages.empty() && _messages.back().starts_with(error)) {
    text.resize(text.size() - 2);
  } else {
    text += error;
  }
  throw CommandFailure(text);
}

void Complaints::print() const {
  for (const std::string& message : _messages) {
    complain(message);
  }
}

}  // namespace vesprun
