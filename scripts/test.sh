#!/usr/bin/env bash
# The one command that installs what is needed, builds and runs every test:
# unit tests under AddressSanitizer and UndefinedBehaviorSanitizer, then every
# fuzz target for a bounded time. Safe to run again; it reuses the builds.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh
cmake --preset dev
cmake --build build/dev -j "$(nproc)"
ctest --preset dev -j "$(nproc)"
bash scripts/fuzz.sh
echo "test.sh: all tests passed"
