# Compile options shared by every target of the project: strict warnings, no floating-point
# contraction (results must round the same on every path), no fast-math.
add_library(kelstat_options INTERFACE)
target_compile_options(kelstat_options INTERFACE
  -Wall -Wextra -Wpedantic
  -ffp-contract=off
  $<$<BOOL:${KELSTAT_WERROR}>:-Werror>)

# libFuzzer targets under tests/fuzz: clang only. The whole tree gets the fuzzer's coverage
# instrumentation, and AddressSanitizer with UndefinedBehaviorSanitizer unless other sanitizers
# were asked for.
option(KELSTAT_FUZZ "Build the libFuzzer targets (needs clang)" OFF)
if(KELSTAT_FUZZ)
  if(NOT CMAKE_CXX_COMPILER_ID MATCHES "Clang")
    message(FATAL_ERROR "KELSTAT_FUZZ needs clang (use the fuzz preset)")
  endif()
  if(NOT KELSTAT_SANITIZE)
    set(KELSTAT_SANITIZE "address;undefined")
  endif()
  target_compile_options(kelstat_options INTERFACE -fsanitize=fuzzer-no-link)
endif()

if(KELSTAT_SANITIZE)
  string(REPLACE ";" "," _kelstat_sanitizers "${KELSTAT_SANITIZE}")
  target_compile_options(kelstat_options INTERFACE
    -fsanitize=${_kelstat_sanitizers} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  target_link_options(kelstat_options INTERFACE -fsanitize=${_kelstat_sanitizers})
endif()
