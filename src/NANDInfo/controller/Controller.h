#pragma once

#include "NANDInfo/controller/NandExporter.h"
#include "platform/RegistryObject.h"
#include "vesprun/ORUConnection.h"

namespace vesprun {

/// The storage controller that `findNandExporter` finds, and one user client of it; both are
/// released at the end. Failures are lines on standard error.
class Controller {
 public:
  Controller() : _service(findNandExporter(_exporter)) {}
  ~Controller() { close(); }

  /// False when the controller refuses, or none is found; that line begins with `complainer`.
  bool open(const char* complainer = "");
  /// False when closing fails; true also without a connection.
  bool close();

  /// Its answer to the content-deletion method; false when it cannot be asked.
  bool recommendsContentDeletion();

  /// Its entry in `nand_exporters_tunnel`; the ending one without a controller.
  nand_exporter_t& exporter() const { return *_exporter; }
  RegistryHandle service() const { return _service.get(); }
  RegistryHandle connection() const { return _connection; }

 private:
  nand_exporter_t* _exporter = nullptr;
  RegistryObject _service;
  RegistryHandle _connection = 0;
};

/// The work of `openORUConnection`. A failure leaves `connection` as far as it came.
bool openConnection(ORUConnection& connection);

}  // namespace vesprun
