#include "vesprun.h"

#include <pthread.h>

#include <cstdlib>
#include <cstring>
#include <exception>
#include <mutex>
#include <string>

#include "Device.h"
#include "library/EntryPoints.h"

struct vesprun_device {
  std::unique_ptr<vesprun::Device> device;
};

namespace {

thread_local std::string gLastError;
thread_local bool gHasNoMemoryForError = false;

/// The entry points keep state of the process: one runs at a time.
std::mutex gCallMutex;

/// A thread that is cancelled in the middle of a call would unwind through code that must not
/// throw, and end the program.
class WithoutCancellation {
 public:
  WithoutCancellation() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &_before); }
  ~WithoutCancellation() { pthread_setcancelstate(_before, nullptr); }
  WithoutCancellation(const WithoutCancellation&) = delete;
  WithoutCancellation& operator=(const WithoutCancellation&) = delete;

 private:
  int _before = PTHREAD_CANCEL_ENABLE;
};

/// What the body returns. When that is `failed`, or it throws, its error becomes the last error.
template <typename Result, typename Body>
Result callFromC(Result failed, const Body& body) noexcept {
  const WithoutCancellation uncancelled;
  try {
    std::string error;
    try {
      const Result result = body(error);
      if (result != failed) {
        return result;
      }
    } catch (const std::exception& failure) {
      error = failure.what();
    }
    gLastError.swap(error);
    gHasNoMemoryForError = false;
  } catch (const std::exception&) {
    gHasNoMemoryForError = true;
  }
  return failed;
}

/// 0, or -1 on failure, of a change of the counter `key`.
template <typename Value>
int changeCounter(vesprun_device* device, const char* key, Value value,
                  bool (vesprun::Device::*change)(std::string_view, Value, std::string&)) noexcept {
  return callFromC(-1, [&](std::string& error) {
    if (device == nullptr || key == nullptr) {
      error = device == nullptr ? "no device is given" : "no key is given";
      return -1;
    }
    return (*device->device.*change)(key, value, error) ? 0 : -1;
  });
}

}  // namespace

const char* vesprun_version(void) { return VESPRUN_VERSION; }

const char* vesprun_last_error(void) {
  return gHasNoMemoryForError ? "out of memory" : gLastError.c_str();
}

vesprun_device* vesprun_open(const char* directory) {
  return callFromC<vesprun_device*>(nullptr, [&](std::string& error) -> vesprun_device* {
    if (directory == nullptr) {
      error = "no directory is given";
      return nullptr;
    }
    auto opened = std::make_unique<vesprun_device>();
    opened->device = vesprun::Device::open(directory, error);
    return opened->device ? opened.release() : nullptr;
  });
}

void vesprun_close(vesprun_device* device) {
  const WithoutCancellation uncancelled;
  delete device;
}

int vesprun_set_scalar(vesprun_device* device, const char* key, int64_t value) {
  return changeCounter(device, key, value, &vesprun::Device::setScalar);
}

int vesprun_add_to_scalar(vesprun_device* device, const char* key, int64_t value) {
  return changeCounter(device, key, value, &vesprun::Device::addToScalar);
}

int vesprun_add_to_distribution(vesprun_device* device, const char* key, double value) {
  return changeCounter(device, key, value, &vesprun::Device::addToDistribution);
}

int vesprun_checkpoint(vesprun_device* device) {
  return callFromC(-1, [device](std::string& error) {
    if (device == nullptr) {
      error = "no device is given";
      return -1;
    }
    return device->device->checkpoint(error) ? 0 : -1;
  });
}

char* vesprun_call(vesprun_device* device, const char* entry_point, const char* arguments) {
  return callFromC<char*>(nullptr, [&](std::string& error) -> char* {
    if (device == nullptr || entry_point == nullptr) {
      error = device == nullptr ? "no device is given" : "no entry point is given";
      return nullptr;
    }
    const std::scoped_lock guard(gCallMutex);
    const std::optional<std::string> json =
        vesprun::callByName(entry_point, arguments != nullptr ? arguments : "", error);
    if (!json) {
      return nullptr;
    }
    char* const text = strdup(json->c_str());
    if (text == nullptr) {
      throw std::bad_alloc();
    }
    return text;
  });
}

void vesprun_free(char* text) { std::free(text); }
