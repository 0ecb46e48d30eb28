#include "vesprun/vesprun.h"

#include <pthread.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <mutex>
#include <string>
#include <string_view>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "interface/EntryPoints.h"
#include "interface/OpenDevice.h"
#include "vesprun/StructuredLogState.h"

#define VESPRUN_TEXT_OF(number) #number
#define VESPRUN_DOTTED(major, minor, patch) \
  VESPRUN_TEXT_OF(major) "." VESPRUN_TEXT_OF(minor) "." VESPRUN_TEXT_OF(patch)
static_assert(std::string_view(VESPRUN_DOTTED(VESPRUN_VERSION_MAJOR, VESPRUN_VERSION_MINOR,
                                              VESPRUN_VERSION_PATCH)) == VESPRUN_VERSION,
              "the header states another version than the project");

struct vesprun_device {
  std::unique_ptr<vesprun::OpenDevice> device;
};

namespace {

using vesprun::CallFailure;

/// This thread's last failure. In a fixed buffer: reporting a failure needs no memory.
struct LastError {
  vesprun_error code = VESPRUN_ERROR_NONE;
  std::array<char, 1024> text{};

  void set(vesprun_error why, std::string_view what) {
    code = why;
    std::size_t length = std::min(what.size(), text.size() - 1);
    // Not in the middle of a character.
    while (length < what.size() && length > 0 && (what[length] & 0xC0) == 0x80) {
      --length;
    }
    *std::copy_n(what.begin(), length, text.begin()) = '\0';
  }
};

thread_local LastError gLastError;

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

/// What the body returns. When that is `failed`, or it throws, its failure becomes the last error.
template <typename Result, typename Body>
Result callFromC(Result failed, const Body& body) noexcept {
  const WithoutCancellation uncancelled;
  try {
    CallFailure failure;
    const Result result = body(failure);
    if (result == failed) {
      gLastError.set(failure.code, failure.text);
    }
    return result;
  } catch (const std::bad_alloc&) {
    gLastError.set(VESPRUN_ERROR_MEMORY, "out of memory");
  } catch (const std::exception& thrown) {
    gLastError.set(VESPRUN_ERROR_OTHER, thrown.what());
  }
  return failed;
}

/// False, with the failure, for a null pointer.
bool isGiven(const void* pointer, const char* what, CallFailure& failure) {
  return pointer != nullptr ||
         failure.set(VESPRUN_ERROR_ARGUMENT, std::string("no ") + what + " is given");
}

/// Changes the counter `key`. 0, or -1 on failure.
template <typename Value>
int changeCounter(vesprun_device* device, const char* key, Value value,
                  bool (vesprun::OpenDevice::*change)(std::string_view, Value,
                                                      CallFailure&)) noexcept {
  return callFromC(-1, [&](CallFailure& failure) {
    const bool done = isGiven(device, "device", failure) && isGiven(key, "key", failure) &&
                      (*device->device.*change)(key, value, failure);
    return done ? 0 : -1;
  });
}

}  // namespace

const char* vesprun_version(void) { return VESPRUN_VERSION; }

const char* vesprun_last_error(void) { return gLastError.text.data(); }

vesprun_error vesprun_last_error_code(void) { return gLastError.code; }

vesprun_device* vesprun_open(const char* directory) {
  return callFromC<vesprun_device*>(nullptr, [&](CallFailure& failure) -> vesprun_device* {
    if (!isGiven(directory, "directory", failure)) {
      return nullptr;
    }
    auto opened = std::make_unique<vesprun_device>();
    opened->device = vesprun::OpenDevice::open(directory, failure);
    return opened->device ? opened.release() : nullptr;
  });
}

void vesprun_close(vesprun_device* device) {
  const WithoutCancellation uncancelled;
  delete device;
}

int vesprun_set_scalar(vesprun_device* device, const char* key, int64_t value) {
  return changeCounter(device, key, value, &vesprun::OpenDevice::setScalar);
}

int vesprun_add_to_scalar(vesprun_device* device, const char* key, int64_t value) {
  return changeCounter(device, key, value, &vesprun::OpenDevice::addToScalar);
}

int vesprun_add_to_distribution(vesprun_device* device, const char* key, double value) {
  return changeCounter(device, key, value, &vesprun::OpenDevice::addToDistribution);
}

int vesprun_checkpoint(vesprun_device* device) {
  return callFromC(-1, [device](CallFailure& failure) {
    return isGiven(device, "device", failure) && device->device->checkpoint(failure) ? 0 : -1;
  });
}

char* vesprun_call(vesprun_device* device, const char* entry_point, const char* arguments) {
  return callFromC<char*>(nullptr, [&](CallFailure& failure) -> char* {
    if (!isGiven(device, "device", failure) || !isGiven(entry_point, "entry point", failure) ||
        !device->device->hasEntryPoints(failure)) {
      return nullptr;
    }
    const std::scoped_lock guard(gCallMutex);
    vesprun::ForgetAPIErrorMessage();
    failure.code = VESPRUN_ERROR_ARGUMENT;
    const std::optional<std::string> json =
        vesprun::callByName(entry_point, arguments != nullptr ? arguments : "", failure.text);
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

void vesprun_force_validity_list(int force) {
  const std::scoped_lock guard(gCallMutex);
  vesprun::SetForceCollection(force != 0);
}

void vesprun_free(char* text) { std::free(text); }
