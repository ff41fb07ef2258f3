#!/usr/bin/env bash
# Plays the demo: installs what is missing, builds the release binaries,
# assembles the demo of examples/demo in build/demo and starts the player on
# it in the foreground, with the terminal view and the log. Ctrl-C lets the
# show play its shutdown section and ends the player; a second Ctrl-C ends
# it at once.
#
# The demo keeps its own settings file (build/demo/registry.reg), so your
# own settings are left alone. Another terminal can follow and steer it:
#   build/release/apps/showctl/showctl monitor
#   build/release/apps/showctl/showctl trigger 1 1 1
#   build/release/apps/showctl/showctl ondemand quiet.show
set -euo pipefail
cd "$(dirname "$0")/.."
repo=$(pwd)

bash scripts/install-deps.sh
cmake --preset release >/dev/null
cmake --build build/release --target showplayer showplayer-media showctl

demo="$repo/build/demo"
python3 examples/demo/make_demo.py "$demo/data"
export TAV_REGISTRY_FILE="$demo/registry.reg"
showctl="$repo/build/release/apps/showctl/showctl"
"$showctl" settings import examples/demo/settings.reg >/dev/null
"$showctl" settings set UserDataPath "$demo/data/" >/dev/null

# Sound: the system's default output when there is a sound device (or a
# sound server) to play to, else mpv's null output, so the show still runs.
runtime=${XDG_RUNTIME_DIR:-/run/user/$(id -u)}
if [ -e /dev/snd ] || [ -S "$runtime/pulse/native" ] || [ -S "$runtime/pipewire-0" ]; then
  "$showctl" settings set --section Media AudioOutput "" >/dev/null
else
  echo "demo: no sound device found; the music plays to mpv's null output (silently)"
  "$showctl" settings set --section Media AudioOutput null >/dev/null
fi
# The demo has no video; never open a window on a machine without a display.
if [ -z "${DISPLAY:-}${WAYLAND_DISPLAY:-}" ]; then
  "$showctl" settings set --section Media VideoOutput null >/dev/null
fi

echo "demo: starting the show player (Ctrl-C to wind the show down and end)"
exec "$repo/build/release/apps/showplayer/showplayer" --view
