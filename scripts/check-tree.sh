#!/usr/bin/env bash
# Checks that the project stands on its own: nothing in the repository may
# reach outside it (a user's clone has only the repository), and no core
# folder includes an adapter. Run by the test command and by ctest.
set -euo pipefail
cd "$(dirname "$0")/.."

status=0

# 1. Nothing refers to a folder beside the checkout.
outside=$(git ls-files -z --cached --others --exclude-standard 2>/dev/null | xargs -0 grep -n -I -E '\.\./(shared|\.\./)' -- 2>/dev/null |
          grep -v '^scripts/check-tree.sh:' || true)
if [ -n "$outside" ]; then
  echo "check-tree: these lines reach outside the repository:"
  echo "$outside"
  status=1
fi

# 2. Core folders never include an adapter from platform/ (tests and test
#    doubles may: they stand in for the composition root).
core="src/support src/ports src/config src/schedule src/suite src/sequence src/show src/host"
adapters=$(grep -rn --include='*.h' --include='*.cpp' '#include "platform/' $core 2>/dev/null |
           grep -v -E '_test\.cpp:|/testing/' || true)
if [ -n "$adapters" ]; then
  echo "check-tree: core files include adapters:"
  echo "$adapters"
  status=1
fi

# 3. Test data the tests read is in the repository.
for f in testdata/fseq/v1_basic.fseq testdata/fseq/v2_zstd.fseq; do
  [ -f "$f" ] || { echo "check-tree: missing test data $f"; status=1; }
done

# 4. Sources are clang-format clean (.clang-format), when the tool is here.
if command -v clang-format >/dev/null 2>&1; then
  unformatted=$(git ls-files -z --cached --others --exclude-standard -- '*.h' '*.cpp' |
                xargs -0 clang-format --dry-run 2>&1 | grep -oE '^[^ :]+:[0-9]+:[0-9]+: warning' | cut -d: -f1 | sort -u || true)
  if [ -n "$unformatted" ]; then
    echo "check-tree: not clang-format clean (run clang-format -i on them):"
    echo "$unformatted"
    status=1
  fi
fi

[ $status -eq 0 ] && echo "check-tree: the tree stands on its own"
exit $status
