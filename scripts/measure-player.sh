#!/usr/bin/env bash
# Measures the whole showplayer process (release build) on the demo's
# display:
#   1. idle: started with /noschedule, no show, for SECONDS;
#   2. playing: a show that keeps all 16 E1.31 universes at 40 frames a
#      second (the demo's chase on 1-12 looping, its bells with their music
#      on 13-16 one after the other, the yard twinkle as background), for
#      SECONDS from its start, with the music-to-lights probe on bells.fseq's
#      time code;
#   3. the same at real-time priority (--realtime), when this user may.
# Where a private network namespace can be made, the universes go out of a
# veth interface to a station that is not there (a fixed neighbour entry, so
# no ARP): sent as a network card would send them, and dropped on the far
# side unread, so the kernel's receive work that loopback would charge to
# the player is not counted; otherwise they go to 127.0.0.1.
# For each: CPU (% of one core, from /proc/PID/stat), resident memory
# (VmRSS and its peak VmHWM), threads, and context switches per second (how
# often the process wakes up), for the player and, on a line of its own, for
# its media process (showplayer-media, which plays the music), with the two
# together. With tshark it also counts the E1.31 packets per universe, so the
# frame rate that reached the wire is printed beside. The music plays to
# mpv's null output (a sound card would not change the process's own work; a
# sound server would add its own).
#
# Usage: scripts/measure-player.sh [SECONDS]      (default 60; BUILD_DIR=build/release)
set -euo pipefail
cd "$(dirname "$0")/.."
repo=$(pwd)
seconds=${1:-60}
build=${BUILD_DIR:-build/release}

if [ -z "${TAV_MEASURE_INSIDE:-}" ]; then
  if [ ! -x "$build/apps/showplayer/showplayer" ] || [ ! -x "$build/apps/showplayer/showplayer-media" ] ||
    [ ! -x "$build/apps/showctl/showctl" ]; then
    cmake --preset "$(basename "$build")" >/dev/null
    cmake --build "$build" --target showplayer showplayer-media showctl
  fi
  if [ "$(id -u)" -eq 0 ]; then netns=(unshare --net); else netns=(unshare --net --map-root-user); fi
  if command -v ip >/dev/null 2>&1 &&
    "${netns[@]}" sh -c 'ip link add veth0 type veth peer name veth1' 2>/dev/null; then
    exec "${netns[@]}" env TAV_MEASURE_INSIDE=veth bash "$0" "$@"
  fi
  echo "measure: no private network namespace here; the universes go to 127.0.0.1"
  export TAV_MEASURE_INSIDE=loopback
fi
interface=lo
destination=127.0.0.1
if [ "$TAV_MEASURE_INSIDE" = veth ]; then
  ip link set lo up
  ip link add veth0 type veth peer name veth1
  ip addr add 10.99.0.1/24 dev veth0
  ip link set veth0 up
  ip link set veth1 up
  ip neigh add 10.99.0.2 lladdr 02:00:00:00:00:02 dev veth0
  interface=veth0
  destination=10.99.0.2
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
sed "s/127.0.0.1/$destination/" examples/demo/settings.reg >"$work/settings.reg"
"$showctl" settings import "$work/settings.reg" >/dev/null
"$showctl" settings set UserDataPath "$work/data/" >/dev/null
"$showctl" settings set --section Media AudioOutput null >/dev/null
"$showctl" settings set --section Media VideoOutput null >/dev/null
# The compressed exports are written on the first run; measure playing, not that.
"$showctl" settings set UseCompressedSequences false >/dev/null
ticks=$(getconf CLK_TCK)
# The measured show: Main chase.fseq all at once and looping, Musical
# bells.fseq without pause, Background twinkle.tseq; every day, all day.
printf '%s' '((0,1,2,0,,,T,F,F),(0,1,2,0,,,T,F,F),(2,0,1,0,,(chase.fseq),T,F,F),(0,1,2,0,,(bells.fseq),T,F,F),,(2,0,1,0,,(twinkle.tseq),F,F,F),, 0,,F)' \
  >"$work/data/measure.show"
sed 's/demo.show/measure.show/g' "$work/data/weeksched.tsc" >"$work/data/weeksched.tmp"
mv "$work/data/weeksched.tmp" "$work/data/weeksched.tsc"

cpu_ticks() { awk '{print $14 + $15}' "/proc/$1/stat"; }
# The loop's own thread (the engine, the control, the host), apart from
# any other thread.
loop_ticks() { awk '{print $14 + $15}' "/proc/$1/task/$1/stat"; }
switches() {
  awk '/^voluntary_ctxt_switches|^nonvoluntary_ctxt_switches/ {s += $2} END {print s}' "/proc/$1/status"
}
status_kb() { awk -v key="$2:" '$1 == key {print $2}' "/proc/$1/status"; }
# The player's media process, if one runs.
media_pid() {
  local child
  for child in $(cat /proc/"$1"/task/*/children 2>/dev/null); do
    if [ "$(cat "/proc/$child/comm" 2>/dev/null)" = showplayer-medi ]; then  # comm: 15 bytes
      echo "$child"
      return
    fi
  done
}

# Samples the player and its media process over $seconds and prints one
# line of figures for each, and their memory together.
measure() {
  local pid=$1 label=$2
  local media c0 s0 l0 c1 s1 l1 mc0="" ms0="" mfig=()
  media=$(media_pid "$pid")
  c0=$(cpu_ticks "$pid")
  l0=$(loop_ticks "$pid")
  s0=$(switches "$pid")
  if [ -n "$media" ]; then
    mc0=$(cpu_ticks "$media")
    ms0=$(switches "$media")
  fi
  sleep "$seconds"
  c1=$(cpu_ticks "$pid")
  l1=$(loop_ticks "$pid")
  s1=$(switches "$pid")
  if [ -n "$media" ] && [ -e "/proc/$media/stat" ]; then
    mfig=("$mc0" "$(cpu_ticks "$media")" "$ms0" "$(switches "$media")"
      "$(status_kb "$media" VmRSS)" "$(status_kb "$media" VmHWM)"
      "$(status_kb "$media" RssAnon)" "$(status_kb "$media" Threads)")
  fi
  python3 - "$label" "$c0" "$c1" "$s0" "$s1" "$ticks" "$seconds" "$l0" "$l1" \
    "$(status_kb "$pid" VmRSS)" "$(status_kb "$pid" VmHWM)" "$(status_kb "$pid" RssAnon)" \
    "$(status_kb "$pid" Threads)" "${mfig[@]}" <<'EOF'
import sys
label, c0, c1, s0, s1, tck, secs, l0, l1, rss, hwm, anon, threads = sys.argv[1:14]
tck, secs = int(tck), float(secs)
def rate(a, b, per=1.0):
    return (int(b) - int(a)) / per / secs
print(f"{label}: CPU {rate(c0, c1, tck) * 100:.2f}% of one core over {secs:g} s "
      f"(the loop's thread {rate(l0, l1, tck) * 100:.2f}%); "
      f"RSS {int(rss)/1024:.1f} MiB (peak {int(hwm)/1024:.1f} MiB, of it private "
      f"{int(anon)/1024:.1f} MiB, the rest shared libraries); {threads} threads; "
      f"{rate(s0, s1):.0f} context switches/s")
if len(sys.argv) > 14:
    mc0, mc1, ms0, ms1, mrss, mhwm, manon, mthreads = sys.argv[14:22]
    print(f"{label}, media process: CPU {rate(mc0, mc1, tck) * 100:.2f}% of one core; "
          f"RSS {int(mrss)/1024:.1f} MiB (peak {int(mhwm)/1024:.1f} MiB, private "
          f"{int(manon)/1024:.1f} MiB); {mthreads} threads; {rate(ms0, ms1):.0f} context switches/s")
    print(f"{label}, together: RSS {(int(rss) + int(mrss))/1024:.1f} MiB, private "
          f"{(int(anon) + int(manon))/1024:.1f} MiB")
else:
    print(f"{label}: no media process ran through the measurement")
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

# 2. and 3. The show, at normal and at real-time priority.
play() {
  local label=$1
  shift
  local capture="" log="$work/show-$label.log"
  if command -v tshark >/dev/null 2>&1; then
    tshark -q -i "$interface" -f "udp dst port 5568" -w "$work/e131-$label.pcap" >/dev/null 2>&1 &
    capture=$!
    pids+=($capture)
    sleep 1
  fi
  TAV_SYNC_PROBE=13:511:25 "$showplayer" "$@" >"$log" 2>&1 &
  pids+=($!)
  local show=$!
  wait_for "Starting show: measure.show" 20 "$log"
  if grep -q "Real-time priority refused" "$log"; then
    echo "$label: skipped ($(grep -o 'Real-time priority refused.*' "$log"))"
    kill -TERM "$show"; kill -TERM "$show" 2>/dev/null || true; wait "$show" || true
    [ -z "$capture" ] || { kill -INT "$capture" 2>/dev/null || true; wait "$capture" 2>/dev/null || true; }
    return
  fi
  local start_epoch end_epoch
  start_epoch=$(date +%s.%N)
  measure "$show" "$label"
  end_epoch=$(date +%s.%N)
  kill -TERM "$show"
  kill -TERM "$show" 2>/dev/null || true  # at once: the measurement is over
  wait "$show" || true
  grep -F "sync probe:" "$log" | sed "s/^showplayer: /$label: /"
  if [ -n "$capture" ]; then
    kill -INT "$capture" 2>/dev/null || true
    wait "$capture" 2>/dev/null || true
    tshark -r "$work/e131-$label.pcap" --enable-heuristic acn -o acn.dmx_enable:TRUE \
      -Y "frame.time_epoch >= $start_epoch && frame.time_epoch <= $end_epoch" \
      -T fields -e acn.dmx.universe 2>/dev/null |
      python3 -c '
import sys, collections
label, secs = sys.argv[1], float(sys.argv[2])
counts = collections.Counter(int(l) for l in sys.stdin if l.strip())
rates = [counts[u] / secs for u in sorted(counts)]
if rates:
    print(f"{label}: {len(rates)} universes on the wire, {min(rates):.1f} to {max(rates):.1f} "
          f"E1.31 data packets per second each")
' "$label" "$(python3 -c "print($end_epoch - $start_epoch)")"
  fi
  if grep -E '^[0-9-]+ [0-9:]+ error ' "$log"; then echo "$label: the show logged errors (above)"; fi
}

play "playing (normal priority)"
play "playing (--realtime)" --realtime
