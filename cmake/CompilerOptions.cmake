# Every target of the project is built with these options.
add_library(vesprun_options INTERFACE)
target_compile_features(vesprun_options INTERFACE cxx_std_20)
target_compile_options(vesprun_options INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wsign-conversion -Wold-style-cast -Wcast-qual
  -Wnon-virtual-dtor -Woverloaded-virtual -Wformat=2 -Wimplicit-fallthrough -Wundef
  $<$<BOOL:${VESPRUN_WARNINGS_AS_ERRORS}>:-Werror>
  -ffp-contract=off)  # statistics are the same to the last bit on every processor
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  # g++ 12 reports overruns and uninitialized members inside std::string, std::vector and
  # std::variant that cannot happen; the sanitizers watch for real ones.
  target_compile_options(vesprun_options INTERFACE
    -Wno-array-bounds -Wno-stringop-overflow -Wno-stringop-overread -Wno-restrict
    -Wno-maybe-uninitialized)
endif()

if(CMAKE_CXX_COMPILER_ID MATCHES Clang)
  # The tables of field names are laid out at compile time.
  target_compile_options(vesprun_options INTERFACE -fconstexpr-steps=100000000)
endif()

if(VESPRUN_SANITIZERS)
  # Without vptr: clang's check opens a file descriptor, and fails in tests that leave none.
  target_compile_options(vesprun_options INTERFACE
    -fsanitize=${VESPRUN_SANITIZERS} -fno-sanitize=vptr -fno-sanitize-recover=all
    -fno-omit-frame-pointer)
  target_link_options(vesprun_options INTERFACE -fsanitize=${VESPRUN_SANITIZERS})
endif()

# What is fuzzed: the fuzzer sees which branches an input reaches.
add_library(vesprun_fuzzed_options INTERFACE)
target_link_libraries(vesprun_fuzzed_options INTERFACE vesprun_options)
if(VESPRUN_FUZZERS)
  if(NOT CMAKE_CXX_COMPILER_ID MATCHES Clang)
    message(FATAL_ERROR "The fuzz targets need clang++: configure with --preset fuzz")
  endif()
  target_compile_options(vesprun_fuzzed_options INTERFACE -fsanitize=fuzzer-no-link)
endif()
