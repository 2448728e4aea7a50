#!/usr/bin/env bash
# Builds the libFuzzer targets (clang, fuzz preset) and runs each for the given number of seconds
# (default 60), one after another, starting from the committed corpus; 0 seconds runs each target
# over the corpus alone, once (the CI smoke). New inputs go to a working
# corpus under the build directory; crashes, hangs (a call over one second) and leaks leave their
# input there too, and make the script fail. Usage: scripts/fuzz.sh [seconds] [target...]
# FUZZ_BUILD_DIR picks another build directory for the fuzz preset.
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${1:-60}
shift || true
targets=("$@")
((${#targets[@]})) || targets=(stemleaf parametric nonparametric)
build=${FUZZ_BUILD_DIR:-build/fuzz}

./scripts/setup-deps.sh fuzz
cmake --preset fuzz -B "$build" >/dev/null
cmake --build "$build" -j 2 --target "${targets[@]/#/fuzz_}"

status=0
for target in "${targets[@]}"; do
  work="$build/fuzz-work/$target"
  artifacts="$build/fuzz-artifacts/$target/"
  mkdir -p "$work" "$artifacts"
  # A call over one second is a hang. libFuzzer measures wall-clock time, so the corpus-only pass
  # (a regression check that must not depend on the machine's load) only catches real hangs;
  # the replay tests judge the corpus's speed on processor time.
  length=(-max_total_time="$seconds" -timeout=1)
  ((seconds > 0)) || length=(-runs=0 -timeout=60)
  echo "== fuzz_$target for ${seconds} s"
  if ! "$build/tests/fuzz/fuzz_$target" "$work" "tests/fuzz/corpus/$target" \
      "${length[@]}" -rss_limit_mb=2048 -print_final_stats=1 \
      -artifact_prefix="$artifacts" 2>"$build/fuzz-work/$target.log"; then
    echo "fuzz_$target failed; input in $artifacts, log in $build/fuzz-work/$target.log"
    status=1
  fi
  grep -E '^stat::number_of_executed_units|^Done' "$build/fuzz-work/$target.log" || true
done
exit $status
