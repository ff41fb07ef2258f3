#!/usr/bin/env bash
# End-to-end test of the real player on the demo, in a private network
# namespace, with tshark (Wireshark's ACN dissector, an independent receiver)
# capturing the E1.31 it sends. Checks, in this order:
#   1. a second showplayer on the same socket ends at once (status 3);
#   2. the demo show starts; `showctl trigger 1 1 1` fires the doorbell group
#      and its sequence starts (seen by `showctl monitor`); the music plays
#      in a media process of its own, the only one with libmpv, and killing
#      it is logged while the show plays on;
#   3. `showctl ondemand quiet.show` switches the show;
#   4. `showctl shutdown` winds it down and the player exits 0;
#   5. the captured E1.31 holds all 16 universes, the FSEQ chase's comet
#      (255 then 244 one pixel behind) on universe 1, and the welcome fade's
#      full level on universe 16 slot 401.
# Bounded to about three minutes. Without tshark, ip, or the right to make a
# network namespace it prints "skipped: <why>" and exits 0: never a fake pass.
#
# Usage: scripts/e2e-player.sh [BUILD_DIR]   (default build/release; built if needed)
set -euo pipefail
cd "$(dirname "$0")/.."
repo=$(pwd)
build=${1:-build/release}

skip() {
  echo "skipped: $*"
  exit 0
}

command -v tshark >/dev/null 2>&1 || skip "tshark is not installed (apt-get install tshark)"
command -v ip >/dev/null 2>&1 || skip "ip (iproute2) is not installed"
command -v python3 >/dev/null 2>&1 || skip "python3 is not installed"
if [ "$(id -u)" -eq 0 ]; then
  netns=(unshare --net)
else
  netns=(unshare --net --map-root-user)
fi
"${netns[@]}" true 2>/dev/null || skip "cannot make a private network namespace here (${netns[*]} failed)"

if [ -z "${TAV_E2E_INSIDE:-}" ]; then
  if [ ! -x "$build/apps/showplayer/showplayer" ] || [ ! -x "$build/apps/showplayer/showplayer-media" ] ||
    [ ! -x "$build/apps/showctl/showctl" ]; then
    preset=$(basename "$build")
    cmake --preset "$preset" >/dev/null
    cmake --build "$build" --target showplayer showplayer-media showctl
  fi
  exec timeout --kill-after=10 200 "${netns[@]}" env TAV_E2E_INSIDE=1 bash "$0" "$build"
fi

# --- inside the namespace -----------------------------------------------------
ip link set lo up
work=$(mktemp -d /tmp/tav-e2e-player-XXXXXX)
player_pid=""
monitor_pid=""
capture_pid=""
cleanup() {
  for pid in $monitor_pid $capture_pid $player_pid; do kill "$pid" 2>/dev/null || true; done
  wait 2>/dev/null || true
  if [ -n "${TAV_E2E_KEEP:-}" ]; then echo "e2e-player: files kept in $work"; else rm -rf "$work"; fi
}
trap cleanup EXIT

showplayer="$repo/$build/apps/showplayer/showplayer"
showctl="$repo/$build/apps/showctl/showctl"
export TAV_REGISTRY_FILE="$work/registry.reg"
export TAV_TRAY_SOCKET="$work/run/showplayer.sock"
export XDG_RUNTIME_DIR="$work/run"
export XDG_DATA_HOME="$work/data-home"
mkdir -p "$work/run" && chmod 700 "$work/run"

fail() {
  echo "e2e-player: FAILED: $*"
  echo "--- player output (last 40 lines)"
  tail -n 40 "$work/player.log" 2>/dev/null || true
  echo "--- monitor (last 40 lines)"
  tail -n 40 "$work/monitor.log" 2>/dev/null || true
  exit 1
}

# Waits up to $2 seconds for the text $1 (an extended regular expression
# with WAIT_RE=1, else fixed) in file $3.
wait_for() {
  local deadline=$((SECONDS + $2)) mode=-qF
  [ -z "${WAIT_RE:-}" ] || mode=-qE
  until grep $mode -- "$1" "$3" 2>/dev/null; do
    [ $SECONDS -lt $deadline ] || fail "no \"$1\" within $2 s"
    [ -z "$player_pid" ] || kill -0 "$player_pid" 2>/dev/null || fail "the player ended early"
    sleep 0.2
  done
}

python3 examples/demo/make_demo.py "$work/data" >/dev/null
"$showctl" settings import examples/demo/settings.reg >/dev/null
"$showctl" settings set UserDataPath "$work/data/" >/dev/null
"$showctl" settings set --section Media AudioOutput null >/dev/null
"$showctl" settings set --section Media VideoOutput null >/dev/null

tshark -q -i lo -f "udp port 5568" -w "$work/e131.pcap" >/dev/null 2>&1 &
capture_pid=$!
sleep 1

"$showplayer" >"$work/player.log" 2>&1 &
player_pid=$!
wait_for "Show Player starting" 10 "$work/player.log"

# 1. A second player on the same socket ends at once with status 3.
set +e
timeout 5 "$showplayer" >"$work/second.log" 2>&1
second=$?
set -e
[ $second -eq 3 ] || fail "a second showplayer ended with status $second, not 3: $(cat "$work/second.log")"
grep -q "already running" "$work/second.log" || fail "the second showplayer did not say why it ended"
echo "e2e-player: a second showplayer ends at once: $(head -n 1 "$work/second.log")"

# 2. The demo show plays; the doorbell rings.
"$showctl" monitor >"$work/monitor.log" 2>&1 &
monitor_pid=$!
wait_for "Starting show: demo.show" 20 "$work/monitor.log"
wait_for "Registering interactive triggers" 20 "$work/monitor.log"
"$showctl" trigger 1 1 1
WAIT_RE=1 wait_for "Starting Interactive: (.*/)?doorbell.tseq" 5 "$work/monitor.log"
grep -qE "^start +(.*/)?doorbell.tseq" "$work/monitor.log" || fail "no sequence-start notice for doorbell.tseq"
echo "e2e-player: the demo show plays and showctl trigger rang the doorbell"

# The music plays in the media process, the one that maps libmpv; when it
# dies the player says so and the show plays on. It is started by the first
# music, so it may still be on its way.
media=""
deadline=$((SECONDS + 10))
while [ -z "$media" ] && [ $SECONDS -lt $deadline ]; do
  for child in $(cat /proc/"$player_pid"/task/*/children 2>/dev/null); do
    [ "$(cat "/proc/$child/comm" 2>/dev/null)" != showplayer-medi ] || media=$child  # comm: 15 bytes
  done
  [ -n "$media" ] || sleep 0.2
done
[ -n "$media" ] || fail "no media process (showplayer-media) beside the player"
grep -q libmpv "/proc/$media/maps" || fail "the media process has no libmpv loaded"
! grep -q libmpv "/proc/$player_pid/maps" || fail "the player itself has libmpv loaded"
kill -KILL "$media"
wait_for "Media: the media process ended unexpectedly (killed by signal 9" 5 "$work/monitor.log"
echo "e2e-player: the media process (pid $media) was killed; the player said so and plays on"

# 3. A show on demand replaces it (the musical piece may finish first).
"$showctl" ondemand quiet.show
wait_for "Request for show on demand received: quiet.show" 5 "$work/monitor.log"
wait_for "Finished show: demo.show" 60 "$work/monitor.log"
wait_for "Starting show: quiet.show" 5 "$work/monitor.log"
echo "e2e-player: showctl ondemand switched to quiet.show"
sleep 3

# 4. Graceful shutdown ends the player with status 0.
"$showctl" shutdown
wait_for "Graceful shutdown requested" 5 "$work/monitor.log"
deadline=$((SECONDS + 30))
while kill -0 "$player_pid" 2>/dev/null; do
  [ $SECONDS -lt $deadline ] || fail "the player did not end within 30 s of showctl shutdown"
  sleep 0.2
done
set +e
wait "$player_pid"
status=$?
set -e
player_pid=""
[ $status -eq 0 ] || fail "the player ended with status $status after a graceful shutdown"
grep -qF "Show Player shutting down" "$work/monitor.log" || fail "no \"Show Player shutting down\""
echo "e2e-player: showctl shutdown wound the show down; the player ended with status 0"

# 5. What the independent receiver saw.
sleep 1
kill -INT "$capture_pid" 2>/dev/null || true
wait "$capture_pid" 2>/dev/null || true
capture_pid=""
tshark -r "$work/e131.pcap" --enable-heuristic acn -o acn.dmx_enable:TRUE \
  -T fields -e acn.dmx.universe -e acn.dmx.seq_number -e udp.payload 2>/dev/null >"$work/e131.txt"
python3 - "$work/e131.txt" <<'EOF' || fail "the E1.31 the player sent is not what the demo plays"
import sys
universes, comet, yard = set(), False, 0
packets = 0
for line in open(sys.argv[1]):
    fields = line.rstrip("\n").split("\t")
    if len(fields) < 3 or not fields[0]:
        continue
    universe = int(fields[0])
    payload = bytes.fromhex(fields[2].replace(":", ""))
    slots = payload[126:]
    packets += 1
    universes.add(universe)
    if universe == 1 and not comet:
        # The chase's comet: its head at 255, the pixel behind it at 244.
        comet = any(slots[i] == 255 and slots[i - 3] == 244 for i in range(3, min(len(slots), 510)))
    if universe == 16 and len(slots) >= 401:
        yard = max(yard, slots[400])
missing = sorted(set(range(1, 17)) - universes)
print(f"e2e-player: {packets} E1.31 data packets; universes seen: {sorted(universes)}")
ok = True
if missing:
    print(f"e2e-player: no packets for universes {missing}"); ok = False
if not comet:
    print("e2e-player: the chase's comet (255, then 244 one pixel behind) never reached universe 1"); ok = False
if yard != 255:
    print(f"e2e-player: universe 16 slot 401 reached {yard}, not 255 (the welcome fade)"); ok = False
sys.exit(0 if ok else 1)
EOF
echo "e2e-player: passed"
