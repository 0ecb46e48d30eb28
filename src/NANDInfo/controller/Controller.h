#pragma once

#include "NANDInfo/controller/NandExporter.h"
#include "platform/RegistryObject.h"

namespace vesprun {

/// The storage controller as `findNandExporter` finds it, and one user client of it; both are given
/// back at its end. Failures are lines on the standard error stream.
class Controller {
 public:
  Controller() : _service(findNandExporter(_exporter)) {}
  ~Controller() { close(); }
  Controller(const Controller&) = delete;
  Controller& operator=(const Controller&) = delete;

  /// False when there is no controller, in a line that begins with `complainer`, or when it
  /// refuses.
  bool open(const char* complainer = "");
  /// Closes it, unless it is closed; false when that fails.
  bool close();

  /// The controller's table entry; the ending one without a controller.
  nand_exporter_t& exporter() const { return *_exporter; }
  RegistryHandle service() const { return _service.get(); }
  RegistryHandle connection() const { return _connection; }

 private:
  nand_exporter_t* _exporter = nullptr;
  RegistryObject _service;
  RegistryHandle _connection = 0;
};

}  // namespace vesprun
