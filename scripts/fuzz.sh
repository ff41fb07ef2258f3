#!/usr/bin/env bash
# Builds the libFuzzer targets with clang and runs each for a bounded time.
# The targets share a fixed budget, FUZZ_TOTAL_SECONDS (default 480), split
# evenly, so adding a target does not lengthen the test command;
# FUZZ_SECONDS sets the time per target instead. Fails on the first crash,
# sanitizer report or hang; the reproducer is left in build/fuzz/artifacts/.
set -euo pipefail
cd "$(dirname "$0")/.."
cmake --preset fuzz >/dev/null
cmake --build build/fuzz -j "$(nproc)"
targets=$(ls build/fuzz/fuzz/fuzz_* 2>/dev/null | wc -l)
if [ -n "${FUZZ_SECONDS:-}" ]; then
  seconds=$FUZZ_SECONDS
else
  total=${FUZZ_TOTAL_SECONDS:-480}
  seconds=$(( targets > 0 ? total / targets : total ))
  [ "$seconds" -ge 10 ] || seconds=10
fi
mkdir -p build/fuzz/artifacts
status=0
for target in build/fuzz/fuzz/fuzz_*; do
  [ -x "$target" ] || continue
  name=$(basename "$target"); short=${name#fuzz_}
  work=build/fuzz/corpus/$short; mkdir -p "$work"
  seeds=()
  [ -d "fuzz/corpus/$short" ] && seeds=("fuzz/corpus/$short")
  echo "fuzz: $name for ${seconds}s"
  if ! "$target" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 -print_final_stats=0 \
      -artifact_prefix=build/fuzz/artifacts/"$name"- "$work" "${seeds[@]}" >build/fuzz/"$name".log 2>&1; then
    echo "fuzz: $name FAILED"; tail -40 build/fuzz/"$name".log; status=1
  else
    grep -E '^Done [0-9]+ runs' build/fuzz/"$name".log | tail -1 || true
  fi
done
exit $status
