#!/usr/bin/env bash
# End-to-end test of the lighting outputs against independent receivers.
#
# Plays testdata/fseq/v2_zstd.fseq (3 universes of 512 channels, 400 frames
# of 25 ms, written by Falcon Player's FSEQ writer, pattern in
# testdata/fseq/README.md) with `showctl sequence play` as E1.31 multicast
# from one network namespace over a veth pair into another, where
#   - tshark captures every packet and its ACN dissector decodes it, and
#   - OLA's daemon (olad, E1.31 plugin on the veth: OLA takes no E1.31 on
#     loopback) receives the universes and ola_recorder records them.
# The decoded values are checked against the file's pattern: every slot of
# every frame, every frame once in order, sequence numbers without a gap,
# the lights-off frame at the end and three stream-terminated packets per
# universe (tshark); every recorded frame on the pattern, in order, ending
# dark (OLA, which passes on only some frames).
#
# Needs root (namespaces), iproute2, python3 and tshark and/or ola (both
# installed by scripts/install-deps.sh), and a built showctl ($SHOWCTL, else
# build/release or build/dev). Without them it says "skipped: <why>" and
# exits 0. Runs in well under two minutes.
set -euo pipefail
cd "$(dirname "$0")/.."
ROOT=$(pwd)

skip() { echo "e2e-outputs: skipped: $*"; exit 0; }

[ "$(id -u)" -eq 0 ] || skip "needs root for private network namespaces"
command -v ip >/dev/null || skip "iproute2 (ip) is not installed"
command -v python3 >/dev/null || skip "python3 is not installed"
HAVE_TSHARK=0; command -v tshark >/dev/null && HAVE_TSHARK=1
HAVE_OLA=0; command -v olad >/dev/null && command -v ola_recorder >/dev/null && command -v setpriv >/dev/null && HAVE_OLA=1
[ $HAVE_TSHARK = 1 ] || [ $HAVE_OLA = 1 ] || skip "neither tshark nor OLA (olad) is installed (scripts/install-deps.sh)"
SHOWCTL=${SHOWCTL:-}
for candidate in build/release/apps/showctl/showctl build/dev/apps/showctl/showctl; do
  [ -n "$SHOWCTL" ] || { [ -x "$candidate" ] && SHOWCTL=$ROOT/$candidate; }
done
[ -n "$SHOWCTL" ] && [ -x "$SHOWCTL" ] || skip "showctl is not built (cmake --preset release && cmake --build build/release --target showctl)"
FSEQ=$ROOT/testdata/fseq/v2_zstd.fseq
SEED=99

TX=tav-e2e-tx-$$; RX=tav-e2e-rx-$$
WORK=$(mktemp -d /tmp/tav-e2e-outputs-XXXXXX)
chmod 755 "$WORK"
PIDS=()
cleanup() {
  for p in "${PIDS[@]:-}"; do [ -n "$p" ] && kill "$p" 2>/dev/null || true; done
  sleep 0.2
  for p in "${PIDS[@]:-}"; do [ -n "$p" ] && kill -9 "$p" 2>/dev/null || true; done
  ip netns del "$TX" 2>/dev/null || true
  ip netns del "$RX" 2>/dev/null || true
  rm -rf "$WORK"
}
trap cleanup EXIT
trap 'exit 130' INT TERM

ip netns add "$TX" 2>/dev/null || skip "cannot create network namespaces here"
ip netns add "$RX"
ip link add vtx netns "$TX" type veth peer name vrx netns "$RX" 2>/dev/null || skip "cannot create a veth pair here"
ip -n "$TX" addr add 10.231.0.1/24 dev vtx
ip -n "$RX" addr add 10.231.0.2/24 dev vrx
for ns in "$TX" "$RX"; do ip -n "$ns" link set lo up; done
ip -n "$TX" link set vtx up
ip -n "$RX" link set vrx up

# Waits up to 10 s for a line matching $2 in file $1.
wait_for() { for _ in $(seq 100); do grep -q "$2" "$1" 2>/dev/null && return 0; sleep 0.1; done; return 1; }

if [ $HAVE_TSHARK = 1 ]; then
  ip netns exec "$RX" timeout 40 tshark -i vrx -f "udp port 5568" -w "$WORK/capture.pcapng" \
    >"$WORK/tshark.log" 2>&1 &
  PIDS+=($!)
  wait_for "$WORK/tshark.log" "Capture started" || { cat "$WORK/tshark.log"; echo "e2e-outputs: FAILED: tshark did not start"; exit 1; }
fi

if [ $HAVE_OLA = 1 ]; then
  OLACONF=$WORK/ola; mkdir -p "$OLACONF"
  # Only the E1.31 plugin, on the veth, with an input port per universe.
  for p in artnet dummy espnet ftdidmx gpio karate kinet milinst opendmx openpixelcontrol osc \
           pathport renard sandnet shownet spi stageprofi uartdmx usbdmx usbserial; do
    echo "enabled = false" >"$OLACONF/ola-$p.conf"
  done
  printf 'enabled = true\nip = 10.231.0.2\ninput_ports = 3\noutput_ports = 0\nignore_preview = true\n' \
    >"$OLACONF/ola-e131.conf"
  chown -R nobody "$OLACONF"
  # olad refuses to run as root.
  OLA=(ip netns exec "$RX" setpriv --reuid=nobody --regid=nogroup --clear-groups env HOME="$OLACONF")
  "${OLA[@]}" timeout 40 olad -c "$OLACONF" --no-http -l 1 >"$WORK/olad.log" 2>&1 &
  PIDS+=($!)
  # The device shows before its ports do: patch until all three universes exist.
  patched=0
  for _ in $(seq 50); do
    if "${OLA[@]}" ola_dev_info 2>/dev/null | grep -q "port 2, IN"; then
      for u in 1 2 3; do "${OLA[@]}" ola_patch -d 1 -p $((u - 1)) -i -u $u >/dev/null 2>&1 || true; done
      info=$("${OLA[@]}" ola_uni_info 2>/dev/null || true)
      if echo "$info" | grep -q "Universe 1" && echo "$info" | grep -q "Universe 2" &&
         echo "$info" | grep -q "Universe 3"; then patched=1; break; fi
    fi
    sleep 0.2
  done
  [ $patched = 1 ] || { cat "$WORK/olad.log"; echo "e2e-outputs: FAILED: OLA's E1.31 ports could not be patched"; exit 1; }
  "${OLA[@]}" timeout 30 ola_recorder -r "$OLACONF/recorded.show" -u 1,2,3 >"$WORK/recorder.log" 2>&1 &
  PIDS+=($!)
  wait_for "$WORK/recorder.log" "Recording" || { cat "$WORK/olad.log" "$WORK/recorder.log"; echo "e2e-outputs: FAILED: OLA did not start"; exit 1; }
fi

cat >"$WORK/registry.reg" <<REG
Windows Registry Editor Version 5.00

[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\DMX\\1]
"Universe"=dword:00000001
"Interface"="vtx"

[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\DMX\\2]
"Universe"=dword:00000002
"Interface"="vtx"

[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\DMX\\3]
"Universe"=dword:00000003
"Interface"="vtx"
REG

echo "e2e-outputs: playing $(basename "$FSEQ") as E1.31 multicast (tshark: $HAVE_TSHARK, OLA: $HAVE_OLA)"
TAV_REGISTRY_FILE=$WORK/registry.reg XDG_RUNTIME_DIR=$WORK XDG_DATA_HOME=$WORK \
  ip netns exec "$TX" timeout 30 "$SHOWCTL" sequence play "$FSEQ" --quiet
sleep 1.5
for p in "${PIDS[@]}"; do kill -INT "$p" 2>/dev/null || true; done
sleep 1

status=0
if [ $HAVE_TSHARK = 1 ]; then
  tshark -r "$WORK/capture.pcapng" --enable-heuristic acn -o acn.dmx_enable:TRUE \
    -o acn.dmx_display_zeros:TRUE -o acn.dmx_display_leading_zeros:TRUE \
    -T fields -E separator=/t -e acn.dmx.universe -e acn.dmx.seq_number -e acn.dmx.options \
    -e acn.dmx.count -e acn.dmx.data 2>/dev/null >"$WORK/decoded.tsv"
  python3 - "$WORK/decoded.tsv" $SEED <<'PY' || status=1
import re, sys
from collections import defaultdict
path, seed = sys.argv[1], int(sys.argv[2])
INV13 = next(i for i in range(256) if i * 13 % 256 == 1)
FRAMES = 400
frames = defaultdict(list); seqs = defaultdict(list); terminated = defaultdict(int); bad = []
for line in open(path):
    fields = line.rstrip("\n").split("\t")
    if len(fields) < 5 or not fields[0]:
        continue
    u, seq, options, count = int(fields[0]), int(fields[1]), int(fields[2], 0), int(fields[3])
    # The dissector prints rows "001-020: B0 B7 ... | ..." behind a header row.
    data = [int(x, 16) for row in re.findall(r"\d+-\d+:([^,]*)", fields[4])
            for x in row.replace("|", " ").split()]
    seqs[u].append(seq)
    if options & 0x40:
        terminated[u] += 1
        continue
    if count != 513 or len(data) != 512:
        bad.append(f"universe {u}: {len(data)} slots (count {count})")
        continue
    if not any(data):
        frames[u].append("dark")
        continue
    c0 = (u - 1) * 512
    f = (data[0] - c0 * 7 - seed) * INV13 % 256
    if any(data[s] != ((c0 + s) * 7 + f * 13 + seed) % 256 for s in range(512)):
        bad.append(f"universe {u} sequence {seq}: slots off the pattern")
    frames[u].append(f)
for u in (1, 2, 3):
    got = frames[u]
    if got[-1:] != ["dark"]:
        bad.append(f"universe {u}: the last frame is not the lights-off frame")
    played = [f for f in got if f != "dark"]
    expected = [f % 256 for f in range(FRAMES)]
    if played != expected:
        bad.append(f"universe {u}: frames seen are not 0..{FRAMES - 1} once each in order "
                   f"({len(played)} seen, first {played[:3]}, last {played[-3:]})")
    gaps = sum(1 for a, b in zip(seqs[u], seqs[u][1:]) if (a + 1) % 256 != b)
    if gaps:
        bad.append(f"universe {u}: {gaps} sequence-number gaps")
    if terminated[u] != 3:
        bad.append(f"universe {u}: {terminated[u]} stream-terminated packets, not 3")
for b in bad[:20]:
    print("e2e-outputs: tshark:", b)
if bad:
    sys.exit(1)
print(f"e2e-outputs: tshark: universes 1-3: all {FRAMES} frames on the pattern in order, "
      "sequence numbers unbroken, lights off and 3 stream-terminated packets each")
PY
fi

if [ $HAVE_OLA = 1 ]; then
  python3 - "$OLACONF/recorded.show" $SEED <<'PY' || status=1
import sys
from collections import defaultdict
path, seed = sys.argv[1], int(sys.argv[2])
INV13 = next(i for i in range(256) if i * 13 % 256 == 1)
frames = defaultdict(list); bad = []
lines = open(path).read().split("\n")
if not lines or lines[0] != "OLA Show":
    print("e2e-outputs: OLA: no recording"); sys.exit(1)
for line in lines[1:]:
    parts = line.split(" ", 1)
    if len(parts) != 2 or "," not in parts[1]:
        continue  # the delay lines between records
    u, values = int(parts[0]), [int(v) for v in parts[1].split(",")]
    if not any(values):
        frames[u].append("dark"); continue
    c0 = (u - 1) * 512
    f = (values[0] - c0 * 7 - seed) * INV13 % 256
    if len(values) != 512 or any(values[s] != ((c0 + s) * 7 + f * 13 + seed) % 256 for s in range(512)):
        bad.append(f"universe {u}: a recorded frame is off the pattern")
    frames[u].append(f)
for u in (1, 2, 3):
    got = frames[u]
    played = [f for f in got if f != "dark"]
    # Unwrap the frame numbers (mod 256) and check they only move forward.
    absolute, base, last = [], 0, -1
    for f in played:
        if f < last: base += 256
        absolute.append(base + f); last = f
    if len(played) < 100:
        bad.append(f"universe {u}: OLA passed on only {len(played)} frames")
    if absolute and (absolute[0] > 20 or absolute[-1] != 399):
        bad.append(f"universe {u}: recorded frames run {absolute[0]}..{absolute[-1]}, not from the start to 399")
    if any(b <= a for a, b in zip(absolute, absolute[1:])):
        bad.append(f"universe {u}: recorded frames go back")
    if got[-1:] != ["dark"]:
        bad.append(f"universe {u}: OLA's last values are not the lights-off frame")
for b in bad[:20]:
    print("e2e-outputs: OLA:", b)
if bad:
    sys.exit(1)
print("e2e-outputs: OLA: universes 1-3: " +
      ", ".join(f"{len([f for f in frames[u] if f != 'dark'])} frames" for u in (1, 2, 3)) +
      " recorded, all on the pattern, in order, ending dark")
PY
fi

[ $status -eq 0 ] && echo "e2e-outputs: passed" || echo "e2e-outputs: FAILED"
exit $status
