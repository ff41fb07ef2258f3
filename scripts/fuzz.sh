#!/usr/bin/env bash
# Builds the libFuzzer targets with clang and runs each for a bounded time.
# FUZZ_SECONDS (default 60) per target. Fails on the first crash, sanitizer
# report or hang; the reproducer is left in build/fuzz/artifacts/.
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${FUZZ_SECONDS:-60}
cmake --preset fuzz >/dev/null
cmake --build build/fuzz -j "$(nproc)"
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
