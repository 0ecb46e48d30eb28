#pragma once

#include "platform/DiagnosticHeader.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// The header values of the device description, and those of Linux where it is silent. An incident
/// identifier that is described is the same for every log.
class HostDiagnosticHeader : public DiagnosticHeader {
 public:
  explicit HostDiagnosticHeader(const SystemDescription& description) : _description(description) {}

  std::string GetSysIDWithDescription(bool withDescription) override;
  std::string GetHardwareModel() override;
  std::string GetSystemVersion() override;
  std::string GetIncidentID() override;

 private:
  const SystemDescription& _description;
};

}  // namespace vesprun
