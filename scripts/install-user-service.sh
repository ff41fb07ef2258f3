#!/usr/bin/env bash
# Installs the show player for the current user: the release binaries (the
# player, its media process and showctl) to ~/.local/bin and the systemd user
# unit to ~/.config/systemd/user. Builds the release preset first when the
# binaries are missing. Safe to run again (an update replaces the binaries;
# restart the service to use them).
set -euo pipefail
cd "$(dirname "$0")/.."
repo=$(pwd)

if [ ! -x build/release/apps/showplayer/showplayer ] || [ ! -x build/release/apps/showplayer/showplayer-media ] ||
  [ ! -x build/release/apps/showctl/showctl ]; then
  bash scripts/install-deps.sh
  cmake --preset release >/dev/null
  cmake --build build/release --target showplayer showplayer-media showctl
fi

bin="${HOME}/.local/bin"
units="${XDG_CONFIG_HOME:-$HOME/.config}/systemd/user"
mkdir -p "$bin" "$units"
install -m 0755 build/release/apps/showplayer/showplayer "$bin/showplayer"
# The player starts the media process from its own folder.
install -m 0755 build/release/apps/showplayer/showplayer-media "$bin/showplayer-media"
install -m 0755 build/release/apps/showctl/showctl "$bin/showctl"
sed -e "s|@SHOWPLAYER@|$bin/showplayer|" -e "s|@DOCS@|$repo/docs|" \
  apps/showplayer/showplayer.service >"$units/showplayer.service.tmp"
mv "$units/showplayer.service.tmp" "$units/showplayer.service"

echo "installed $bin/showplayer, $bin/showplayer-media, $bin/showctl and $units/showplayer.service"
if systemctl --user daemon-reload 2>/dev/null; then
  echo "next: systemctl --user enable --now showplayer"
  echo "      loginctl enable-linger \"\$USER\"   # keep playing while nobody is logged in"
else
  echo "no systemd user manager is reachable from here; once logged in normally run:"
  echo "      systemctl --user daemon-reload && systemctl --user enable --now showplayer"
fi
