#!/usr/bin/env bash
# Measures the whole showplayer process (release build) on the demo:
#   1. idle: started with /noschedule, no show, for SECONDS;
#   2. playing: the demo show (16 E1.31 universes at 40 frames a second:
#      the chase on 1-12, the music on 13-16) for SECONDS from its start,
#      with the music-to-lights probe on bells.fseq's time code.
# For each: CPU (% of one core, from /proc/PID/stat), resident memory
# (VmRSS and its peak VmHWM), threads, and context switches per second (how
# often the process wakes up). With tshark it also counts the E1.31 packets
# per universe, so the frame rate that reached the wire is printed beside.
# The music plays to mpv's null output (a sound card would not change the
# process's own work; a sound server would add its own).
#
# Usage: scripts/measure-player.sh [SECONDS]      (default 60; BUILD_DIR=build/release)
set -euo pipefail
cd "$(dirname "$0")/.."
repo=$(pwd)
seconds=${1:-60}
build=${BUILD_DIR:-build/release}

if [ ! -x "$build/apps/showplayer/showplayer" ] || [ ! -x "$build/apps/showctl/showctl" ]; then
  cmake --preset "$(basename "$build")" >/dev/null
  cmake --build "$build" --target showplayer showctl
fi
showplayer="$repo/$build/apps/showplayer/showplayer"
showctl="$repo/$build/apps/showctl/showctl"

work=$(mktemp -d /tmp/tav-measure-XXXXXX)
pids=()
cleanup() {
  for pid in "${pids[@]}"; do kill "$pid" 2>/dev/null || true; done
  wait 2>/dev/null || true
  rm -rf "$work"
}
trap cleanup EXIT
export TAV_REGISTRY_FILE="$work/registry.reg"
export TAV_TRAY_SOCKET="$work/run/showplayer.sock"
mkdir -p "$work/run" && chmod 700 "$work/run"
python3 examples/demo/make_demo.py "$work/data" >/dev/null
"$showctl" settings import examples/demo/settings.reg >/dev/null
"$showctl" settings set UserDataPath "$work/data/" >/dev/null
"$showctl" settings set --section Media AudioOutput null >/dev/null
"$showctl" settings set --section Media VideoOutput null >/dev/null
# The compressed exports are written on the first run; measure playing, not that.
"$showctl" settings set UseCompressedSequences false >/dev/null
ticks=$(getconf CLK_TCK)

cpu_ticks() { awk '{print $14 + $15}' "/proc/$1/stat"; }
switches() {
  awk '/^voluntary_ctxt_switches|^nonvoluntary_ctxt_switches/ {s += $2} END {print s}' "/proc/$1/status"
}
status_kb() { awk -v key="$2:" '$1 == key {print $2}' "/proc/$1/status"; }

# Samples the process over $seconds and prints one line of figures.
measure() {
  local pid=$1 label=$2
  local c0 s0 c1 s1
  c0=$(cpu_ticks "$pid")
  s0=$(switches "$pid")
  sleep "$seconds"
  c1=$(cpu_ticks "$pid")
  s1=$(switches "$pid")
  python3 - "$label" "$c0" "$c1" "$s0" "$s1" "$ticks" "$seconds" \
    "$(status_kb "$pid" VmRSS)" "$(status_kb "$pid" VmHWM)" "$(status_kb "$pid" Threads)" <<'EOF'
import sys
label, c0, c1, s0, s1, tck, secs, rss, hwm, threads = sys.argv[1:]
cpu = (int(c1) - int(c0)) / int(tck) / float(secs) * 100
wakes = (int(s1) - int(s0)) / float(secs)
print(f"{label}: CPU {cpu:.2f}% of one core over {secs} s; RSS {int(rss)/1024:.1f} MiB "
      f"(peak {int(hwm)/1024:.1f} MiB); {threads} threads; {wakes:.0f} context switches/s")
EOF
}

wait_for() {
  local deadline=$((SECONDS + $2))
  until grep -qF -- "$1" "$3" 2>/dev/null; do
    [ $SECONDS -lt $deadline ] || { echo "measure: no \"$1\" within $2 s"; tail "$3"; exit 1; }
    sleep 0.2
  done
}

echo "measure: $(nproc) cores, $(uname -r), build $build"

# 1. Idle.
"$showplayer" /noschedule >"$work/idle.log" 2>&1 &
pids+=($!)
idle=$!
wait_for "Show Player initialized" 20 "$work/idle.log"
measure "$idle" "idle (no show)"
kill -TERM "$idle"
wait "$idle" || true

# 2. The demo show.
capture=""
if command -v tshark >/dev/null 2>&1; then
  tshark -q -i lo -f "udp dst port 5568" -w "$work/e131.pcap" >/dev/null 2>&1 &
  capture=$!
  pids+=($capture)
  sleep 1
fi
TAV_SYNC_PROBE=13:511:25 "$showplayer" >"$work/show.log" 2>&1 &
pids+=($!)
show=$!
wait_for "Starting show: demo.show" 20 "$work/show.log"
start_epoch=$(date +%s.%N)
measure "$show" "playing the demo"
end_epoch=$(date +%s.%N)
kill -TERM "$show"
kill -TERM "$show" 2>/dev/null || true  # at once: the measurement is over
wait "$show" || true
grep -F "sync probe:" "$work/show.log" | sed 's/^showplayer: /playing the demo: /'
if [ -n "$capture" ]; then
  kill -INT "$capture" 2>/dev/null || true
  wait "$capture" 2>/dev/null || true
  tshark -r "$work/e131.pcap" --enable-heuristic acn -o acn.dmx_enable:TRUE \
    -Y "frame.time_epoch >= $start_epoch && frame.time_epoch <= $end_epoch" \
    -T fields -e acn.dmx.universe 2>/dev/null |
    python3 -c '
import sys, collections
secs = float(sys.argv[1])
counts = collections.Counter(int(l) for l in sys.stdin if l.strip())
rates = ", ".join(f"{u}: {counts[u]/secs:.1f}" for u in sorted(counts))
print(f"playing the demo: E1.31 data packets per second by universe: {rates}")
' "$(python3 -c "print($end_epoch - $start_epoch)")"
fi
if grep -E '^[0-9-]+ [0-9:]+ error ' "$work/show.log"; then echo "measure: the show logged errors (above)"; fi
