#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

/// The file of a log under submission. It becomes visible, complete, when the writer has returned.
class LogFileHandle {
 public:
  virtual ~LogFileHandle() = default;

  /// Appends the bytes. False when they could not be written; the submission then fails.
  virtual bool write(std::string_view bytes) = 0;
};

/// The platform's diagnostics services.
class Logsmith {
 public:
  using LogWriter = std::function<void(LogFileHandle& file)>;

  virtual ~Logsmith() = default;

  /// True when the user allows diagnostic logs to be submitted.
  virtual bool DiagnosticLogSubmissionEnabled() = 0;

  /// Creates a log file, has `writer` fill it once, and hands it to submission. `header` may be
  /// null. False when the service refuses the log or its file could not be written: no log appears.
  virtual bool LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                        const PropertyDict* header, const LogWriter& writer) = 0;

  /// The text that names the running OS version.
  virtual std::string LGSOSVersion() = 0;

  /// Tells of the running OS; "ProductBuildVersion", a string, identifies its build.
  virtual PropertyDict CopySystemVersionDictionary() = 0;

  /// Records one structured-data log record under a type code. False when it could not be kept.
  virtual bool FLLogStructuredData(std::int32_t type, const PropertyDict& record) = 0;

  /// Housekeeping of old structured-data logs and of service-plan logs.
  virtual void FLDumpAllOldStructuredDataLogs() = 0;
  virtual void rollTendmarkLogs() = 0;
};

}  // namespace vesprun
