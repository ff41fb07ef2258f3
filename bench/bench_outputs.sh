#!/usr/bin/env bash
# Frame timing, CPU and memory of the outputs: `showctl sequence play`
# (the hardware-I/O control with its real adapters, release build) beside
# the floor sender, measured by the independent receiver in bench/e131 on
# the receiving side (kernel receive timestamps) in a loopback-only
# network namespace. Prints the instrument's table, one row per run.
#
# usage: bench/bench_outputs.sh [-n UNIVERSES] [-s SECONDS] [-w WARMUP] [-r RUNS] [--rt-only]
#   -n  universes of 512 channels (16); -s measurement window (60); -w warm-up (10)
#   -r  runs of each sender (1); --rt-only: only the SCHED_FIFO rows
# Needs root. Big sequences stay in /tmp/perf-data (1,000 universes for 85 s
# is 1.7 GB): delete them afterwards.
set -euo pipefail
cd "$(dirname "$0")/.."
ROOT=$(pwd)
N=16 S=60 W=10 R=1 RT_ONLY=0
while [ $# -gt 0 ]; do case $1 in
  -n) N=$2; shift 2;; -s) S=$2; shift 2;; -w) W=$2; shift 2;; -r) R=$2; shift 2;;
  --rt-only) RT_ONLY=1; shift;;
  -h|--help) sed -n '2,13p' "$0"; exit 0;;
  *) echo "unknown option $1" >&2; exit 2;; esac; done
[ "$(id -u)" -eq 0 ] || { echo "bench_outputs: needs root (network namespaces)"; exit 1; }
SHOWCTL=${SHOWCTL:-$ROOT/build/release/apps/showctl/showctl}
if [ ! -x "$SHOWCTL" ]; then
  cmake --preset release >/dev/null
  cmake --build build/release -j "$(nproc)" --target showctl
fi

WORK=$(mktemp -d /tmp/tav-bench-outputs-XXXXXX)
trap 'rm -rf "$WORK"' EXIT
chmod 755 "$WORK"
# N universes, unicast to the receiver, each on its 512 channels of the file.
{
  echo "Windows Registry Editor Version 5.00"
  for u in $(seq "$N"); do
    printf '\n[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\DMX\\%d]\n' "$u"
    printf '"Universe"=dword:%08x\n"Destination"="127.0.0.1"\n"StartChannel"=dword:%08x\n' \
      "$u" $(((u - 1) * 512 + 1))
  done
} >"$WORK/registry.reg"

# Wrappers named for the table's rows; each execs showctl, so the process
# measured is showctl itself.
for name in showctl showctl-rt; do
  rt=; [ $name = showctl-rt ] && rt="--realtime 10"
  cat >"$WORK/$name" <<WRAP
#!/bin/sh
export TAV_REGISTRY_FILE=$WORK/registry.reg XDG_RUNTIME_DIR=$WORK
exec $SHOWCTL sequence play "\$FSEQ" --loop --seconds "\$PLAY_SECONDS" --quiet $rt
WRAP
  chmod +x "$WORK/$name"
done
SENDERS=()
[ $RT_ONLY = 1 ] || SENDERS+=(limit "cmd:exec $WORK/showctl")
SENDERS+=(limit-rt "cmd:exec $WORK/showctl-rt")
bash bench/e131/side-by-side.sh -n "$N" -s "$S" -w "$W" -r "$R" "${SENDERS[@]}"
