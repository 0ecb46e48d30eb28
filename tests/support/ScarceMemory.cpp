#include "support/ScarceMemory.h"

#include <cstdint>
#include <cstdlib>
#include <new>

namespace vesprun {

std::size_t largestAllocation = SIZE_MAX;
thread_local std::size_t allocationsLeft = 0;

}  // namespace vesprun

void* operator new(std::size_t size, const std::nothrow_t& /*tag*/) noexcept {
  const bool fails = vesprun::allocationsLeft != 0 && --vesprun::allocationsLeft == 0;
  return fails || size > vesprun::largestAllocation ? nullptr : std::malloc(size);
}
void* operator new(std::size_t size) {
  void* const memory = operator new(size, std::nothrow);
  return memory != nullptr ? memory : throw std::bad_alloc();
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t /*size*/) noexcept { std::free(memory); }
void operator delete(void* memory, const std::nothrow_t& /*tag*/) noexcept { std::free(memory); }
