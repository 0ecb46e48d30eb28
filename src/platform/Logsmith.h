#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// Writes to the log file being submitted. False when it failed; the submission then fails.
using LogFileHandle = std::function<bool(std::string_view bytes)>;

/// The platform's diagnostics services.
class Logsmith {
 public:
  using LogWriter = std::function<void(const LogFileHandle& write)>;

  virtual ~Logsmith() = default;

  /// True when the user allows diagnostic logs to be submitted.
  virtual bool DiagnosticLogSubmissionEnabled() = 0;

  /// Creates a log file, lets `writer` fill it, and submits it. `header` may be null. False, and no
  /// log appears, when the service refuses it or the file could not be written.
  virtual bool LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                        const PropertyDict* header, const LogWriter& writer) = 0;

  /// The name of the running OS version.
  virtual std::string LGSOSVersion() = 0;

  /// Describes the running OS; "ProductBuildVersion", a string, identifies its build.
  virtual PropertyDict CopySystemVersionDictionary() = 0;

  /// Records structured data under a type code. False when it could not be kept.
  virtual bool FLLogStructuredData(std::int32_t type, const PropertyDict& record) = 0;

  /// Clears up old structured-data logs and service-plan logs.
  virtual void FLDumpAllOldStructuredDataLogs() = 0;
  virtual void rollTendmarkLogs() = 0;
};

}  // namespace vesprun
