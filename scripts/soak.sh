#!/usr/bin/env bash
# Soak test: the real player on the demo for a long while, switching shows
# every 20 seconds (a week schedule of 20-second slots alternating between
# demo.show and quiet.show, so every minute holds three show changes). Run
# by hand, not by CI:
#
#   bash scripts/soak.sh [MINUTES]      (default 30 after the warm-up; BUILD_DIR=build/release)
#
# Reports the player's resident memory and open file descriptors (and its
# media process's resident memory) after three minutes of warm-up (the first
# music has then played: buffers are made on first use) and at the end, the number of shows started, and every
# error line of the log. Fails when memory grew by more than 2 MiB, when the
# most descriptors open at once in the last five samples exceed those of the
# first five (files are open only while a sequence or a song loads, so one
# sample alone may catch one), or when an error was logged.
set -euo pipefail
cd "$(dirname "$0")/.."
repo=$(pwd)
minutes=${1:-30}
build=${BUILD_DIR:-build/release}

if [ ! -x "$build/apps/showplayer/showplayer" ] || [ ! -x "$build/apps/showplayer/showplayer-media" ] ||
    [ ! -x "$build/apps/showctl/showctl" ]; then
  cmake --preset "$(basename "$build")" >/dev/null
  cmake --build "$build" --target showplayer showplayer-media showctl
fi
showplayer="$repo/$build/apps/showplayer/showplayer"
showctl="$repo/$build/apps/showctl/showctl"

work=$(mktemp -d /tmp/tav-soak-XXXXXX)
player_pid=""
cleanup() {
  [ -z "$player_pid" ] || kill "$player_pid" 2>/dev/null || true
  wait 2>/dev/null || true
  echo "soak: files in $work"
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

# A week schedule of 20-second slots from the next whole minute on, for the
# soak and five minutes more, alternating the two demo shows.
python3 - "$work/data/weeksched.tsc" "$((minutes + 8))" <<'EOF'
import sys, time
path, minutes = sys.argv[1], int(sys.argv[2])
now = time.localtime()
week_now = ((now.tm_wday + 1) % 7) * 86400 + now.tm_hour * 3600 + now.tm_min * 60 + now.tm_sec
start = week_now - week_now % 60 + 60
records = []
for k in range(minutes * 3):
    s = (start + 20 * k) % 604800
    e = (s + 20) % 604800
    show = "demo.show" if k % 2 == 0 else "quiet.show"
    records.append(f"({e},2,(, 0,{show}),{s})")
open(path, "wb").write(("(" + ",".join(records) + ")\r\n").encode())
EOF
"$showctl" schedule check "$work/data/weeksched.tsc" | tail -n 1

"$showplayer" >"$work/player.log" 2>&1 &
player_pid=$!

# The player's resident memory and descriptors, and its media process's
# resident memory (reported, not judged: it swings by some 30 MB with
# whether music plays at the moment of the sample, and is "-" when none runs:
# the media process starts with the first music and ends after a minute
# without any).
sample() {
  local rss fds child media=-
  rss=$(awk '/^VmRSS:/ {print $2}' "/proc/$player_pid/status")
  fds=$(ls "/proc/$player_pid/fd" | wc -l)
  for child in $(cat /proc/"$player_pid"/task/*/children 2>/dev/null); do
    if [ "$(cat "/proc/$child/comm" 2>/dev/null)" = showplayer-medi ]; then  # comm: 15 bytes
      media=$(awk '/^VmRSS:/ {print $2}' "/proc/$child/status" 2>/dev/null || echo -)
    fi
  done
  echo "$rss $fds $media"
}

sleep 180
read -r rss0 fds0 media0 < <(sample)
echo "soak: after 3 min warm-up: RSS ${rss0} KiB, ${fds0} open descriptors; media process RSS ${media0} KiB"
fd_samples=("$fds0")
end=$((SECONDS + minutes * 60))
while [ $SECONDS -lt $end ]; do
  kill -0 "$player_pid" 2>/dev/null || { echo "soak: FAILED: the player ended early"; tail -n 20 "$work/player.log"; exit 1; }
  sleep 30
  read -r rss fds media < <(sample)
  fd_samples+=("$fds")
  echo "soak: $(date +%T) RSS ${rss} KiB, ${fds} descriptors, media process RSS ${media} KiB, shows started: $(grep -c 'Starting show: ' "$work/player.log" || true)"
done
read -r rss1 fds1 media1 < <(sample)
fd_samples+=("$fds1")
# The most descriptors open in the first and in the last five samples (a
# short soak has fewer: then both look at all of them).
fds_first=$(printf '%s\n' "${fd_samples[@]}" | head -n 5 | sort -n | tail -n 1)
fds_last=$(printf '%s\n' "${fd_samples[@]}" | tail -n 5 | sort -n | tail -n 1)
kill -TERM "$player_pid"
set +e
wait "$player_pid"
status=$?
set -e
player_pid=""

errors=$(grep -E '^[0-9-]+ [0-9:]+ error ' "$work/player.log" || true)
shows=$(grep -c 'Starting show: ' "$work/player.log" || true)
echo "soak: ${minutes} min, ${shows} shows started"
echo "soak: RSS ${rss0} KiB -> ${rss1} KiB (media process ${media0} -> ${media1} KiB); descriptors at most ${fds_first} in the first samples, ${fds_last} in the last; exit status ${status}"
ok=1
if [ -n "$errors" ]; then echo "soak: error lines:"; echo "$errors"; ok=0; fi
if [ $((rss1 - rss0)) -gt 2048 ]; then echo "soak: resident memory grew by $((rss1 - rss0)) KiB"; ok=0; fi
if [ "$fds_last" -gt "$fds_first" ]; then echo "soak: descriptors grew from $fds_first to $fds_last"; ok=0; fi
if [ "$status" -ne 0 ]; then echo "soak: the player ended with status $status"; ok=0; fi
[ $ok -eq 1 ] && echo "soak: passed" || { echo "soak: FAILED"; exit 1; }
