#pragma once

#include "NANDInfo/controller/NandExporter.h"
#include "platform/RegistryObject.h"

namespace vesprun {

/// The storage controller as `findNandExporter` finds it and one user client of it, both returned
/// at the end. Failures are lines on standard error.
class Controller {
 public:
  Controller() : _service(findNandExporter(_exporter)) {}
  ~Controller() { close(); }

  /// False when it refuses, or, with a line that begins with `complainer`, when there is no
  /// controller.
  bool open(const char* complainer = "");
  /// False when closing fails; nothing to close is fine.
  bool close();

  /// Its table entry; the ending one without a controller.
  nand_exporter_t& exporter() const { return *_exporter; }
  RegistryHandle service() const { return _service.get(); }
  RegistryHandle connection() const { return _connection; }

 private:
  nand_exporter_t* _exporter = nullptr;
  RegistryObject _service;
  RegistryHandle _connection = 0;
};

}  // namespace vesprun
