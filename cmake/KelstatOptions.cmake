# Compile options shared by every target of the project: strict warnings, no floating-point
# contraction (results must round the same on every path), no fast-math.
add_library(kelstat_options INTERFACE)
target_compile_options(kelstat_options INTERFACE
  -Wall -Wextra -Wpedantic
  -ffp-contract=off
  $<$<BOOL:${KELSTAT_WERROR}>:-Werror>)

if(KELSTAT_SANITIZE)
  string(REPLACE ";" "," _kelstat_sanitizers "${KELSTAT_SANITIZE}")
  target_compile_options(kelstat_options INTERFACE
    -fsanitize=${_kelstat_sanitizers} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  target_link_options(kelstat_options INTERFACE -fsanitize=${_kelstat_sanitizers})
endif()
