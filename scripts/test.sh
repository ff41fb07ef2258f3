#!/usr/bin/env bash
# The one command that installs what is needed, builds and runs every test:
# unit tests under AddressSanitizer and UndefinedBehaviorSanitizer, then every
# fuzz target for a bounded time. Safe to run again; it reuses the builds.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh
bash scripts/check-tree.sh
cmake --preset dev
cmake --build build/dev -j "$(nproc)"
ctest --preset dev -j "$(nproc)" | tee build/dev/ctest.log
# Outputs against independent receivers; says "skipped" where it cannot run.
SHOWCTL=build/dev/apps/showctl/showctl bash scripts/e2e-outputs.sh
bash scripts/e2e-player.sh build/dev
bash scripts/fuzz.sh
fuzzed=$(ls build/fuzz/fuzz/fuzz_* 2>/dev/null | grep -c . || true)
passed=$(sed -n 's/.* tests passed, 0 tests failed out of \([0-9]*\)$/\1/p' build/dev/ctest.log)
echo "fuzz targets run clean: $fuzzed"
echo "tests: ${passed:-0} passed, 0 failed"
