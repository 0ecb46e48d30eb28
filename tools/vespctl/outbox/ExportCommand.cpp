#include "outbox/ExportCommand.h"

#include <sha2.h>

#include <array>
#include <cstdint>
#include <iostream>
#include <limits>

#include "Command.h"
#include "Complaints.h"
#include "commandline/Arguments.h"
#include "common/Calendar.h"
#include "common/TextForm.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/XmlText.h"
#include "vespfleet/ExportedLine.h"

namespace vesprun {
namespace {

using Digest = std::array<std::uint8_t, SHA256_DIGEST_LENGTH>;

Digest sha256(std::string_view bytes) {
  SHA2_CTX context;
  SHA256Init(&context);
  SHA256Update(&context, reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
  Digest digest{};
  SHA256Final(digest.data(), &context);
  return digest;
}

std::string text(const Digest& digest) {
  return {reinterpret_cast<const char*>(digest.data()), digest.size()};
}

/// HMAC-SHA-256 (RFC 2104).
Digest authenticationCode(std::string_view key, std::string_view message) {
  std::string block = key.size() > SHA256_BLOCK_LENGTH ? text(sha256(key)) : std::string(key);
  block.resize(SHA256_BLOCK_LENGTH, '\0');
  std::string inner = block;
  for (std::size_t i = 0; i < block.size(); ++i) {
    inner[i] = static_cast<char>(inner[i] ^ 0x36);
    block[i] = static_cast<char>(block[i] ^ 0x5C);
  }
  return sha256(block + text(sha256(inner.append(message))));
}

/// A constant name for the device that does not reveal its identifier.
std::string pseudonymOf(const std::string& systemIdentifier) {
  constexpr std::size_t kBytes = 16;
  const Digest code = authenticationCode(systemIdentifier, "vesprun exported device");
  return hexadecimalText(std::span(code).first(kBytes));
}

struct Export {
  std::string device;
  std::optional<GivenDay> from;
  std::optional<GivenDay> to;
};

void run(const Export& wanted) {
  Complaints complaints;
  const auto platform = openDeviceReadOnly(complaints);
  const std::int32_t today = platform->tallybook().TBDaysSince1970();
  const std::int32_t from =
      wanted.from ? wanted.from->on(today) : std::numeric_limits<std::int32_t>::min();
  const std::int32_t to =
      wanted.to ? wanted.to->on(today) : std::numeric_limits<std::int32_t>::max();
  const std::string device =
      !wanted.device.empty()
          ? wanted.device
          : pseudonymOf(platform->deviceInformation().GetSysIDWithDescription(false));
  std::vector<UnreadableLog> refused;
  const auto print = [&](SubmittedLog&& log) {
    if (log.day < from || log.day > to) {
      return;
    }
    const auto entry = [&log](std::string_view key) { return *log.document.find(key); };
    // Until the outbox notes what a log was submitted on, nothing says build and model.
    const std::string line = jsonText({{"version", 2},
                                       {"device", device},
                                       {"day", log.day},
                                       {"revision", log.revision},
                                       {"created", entry("TBLogCreationDate")},
                                       {"build", nullptr},
                                       {"model", nullptr},
                                       {"whitelist", entry("TBWhitelistDigest")},
                                       {"scalars", entry("TBScalars")},
                                       {"distributions", entry("TBDistributions")},
                                       {"histograms", entry("TBDistributionsHistogram")}});
    std::string why;
    if (parseExportedLine(line, why)) {
      std::cout << line << '\n';
    } else {
      refused.push_back({log.name, "no store would take it: " + why, true});
    }
  };
  std::vector<UnreadableLog> unreadable = forEachSubmittedLog(platform->directory(), print);
  unreadable.insert(unreadable.end(), refused.begin(), refused.end());
  if (!unreadable.empty()) {
    nameUnreadable(std::span(unreadable).first(unreadable.size() - 1));
    throw CommandFailure(unreadable.back().name + ": " + unreadable.back().why);
  }
}

}  // namespace

void addExportCommand(CLI::App& command) {
  const auto wanted = std::make_shared<Export>();
  command.add_option("--device", wanted->device, "A name instead of the device's pseudonym")
      ->type_name("NAME")
      ->check([](const std::string& name) -> std::string {
        constexpr std::size_t kLongest = 255;
        return !name.empty() && name.size() <= kLongest && isXmlText(name)
                   ? ""
                   : "a device's name has 1 to 255 bytes of text";
      });
  addDay(command, "--from", wanted->from, "The first day");
  addDay(command, "--to", wanted->to, "The last day");
  command.callback([wanted] { run(*wanted); });
}

}  // namespace vesprun
