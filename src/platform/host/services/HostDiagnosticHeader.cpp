#include "platform/host/services/HostDiagnosticHeader.h"

#include "platform/host/device/LiveSystem.h"

namespace vesprun {

std::string HostDiagnosticHeader::GetSysIDWithDescription(bool withDescription) {
  const std::string identifier =
      _description.systemID ? *_description.systemID : live::machineIdentifier();
  return withDescription ? "machine " + identifier : identifier;
}

std::string HostDiagnosticHeader::GetHardwareModel() {
  return _description.hardwareModel ? *_description.hardwareModel : live::hardwareModel();
}

std::string HostDiagnosticHeader::GetSystemVersion() {
  return _description.systemVersion ? *_description.systemVersion : live::osVersion();
}

std::string HostDiagnosticHeader::GetIncidentID() {
  return _description.incidentID ? *_description.incidentID : live::newIdentifier();
}

}  // namespace vesprun
