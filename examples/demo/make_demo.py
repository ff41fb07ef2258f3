#!/usr/bin/env python3
"""Assembles the demo's user data folder.

Copies the hand-written files of examples/demo/data (schedule, show files,
plain sequences) into OUT and generates what is better made than written:
the music (WAV files synthesised here, nothing taken from elsewhere), the
plain sequence whose lights follow the notes of one piece, and two FSEQ
files (zlib-compressed version 2, as the common free sequencers write them).

The display is 16 DMX universes (absolute FSEQ channels 1-8192):
  universes 1-12   the "tree": the Main section's chase, 40 frames a second
  universes 13-16  the "house": the Musical section (carol.tseq, bells.fseq)
  universe 16      slots 401-430 also hold the yard lamps (background,
                   startup, shutdown) and the doorbell lamps (interactive)

Usage: make_demo.py OUT    (OUT is created; files in it are replaced)
Standard library only; runs in a second or two.
"""

import array
import json
import math
import os
import shutil
import struct
import sys
import wave
import zlib

HERE = os.path.dirname(os.path.abspath(__file__))
RATE = 22050
FPS_STEP_MS = 25  # 40 frames a second
SLOTS = 512


# --- music -----------------------------------------------------------------

def note_hz(semitones_from_a4):
    return 440.0 * 2.0 ** (semitones_from_a4 / 12.0)


def render(notes, seconds):
    """notes: (start s, frequency Hz, length s, loudness 0-1). A plucked tone:
    two partials under an exponential decay, so nothing clicks."""
    total = int(seconds * RATE)
    mix = [0.0] * total
    for start, hz, length, loud in notes:
        first = int(start * RATE)
        count = min(int(length * RATE), total - first)
        for i in range(count):
            t = i / RATE
            env = math.exp(-4.0 * t / length) * min(1.0, i / 200.0)
            mix[first + i] += loud * env * (
                math.sin(2 * math.pi * hz * t) + 0.3 * math.sin(4 * math.pi * hz * t))
    peak = max(1e-9, max(abs(v) for v in mix))
    return array.array("h", (int(v / peak * 0.8 * 32767) for v in mix))


def write_wav(path, samples):
    with wave.open(path, "wb") as w:
        w.setnchannels(1)
        w.setsampwidth(2)
        w.setframerate(RATE)
        w.writeframes(samples.tobytes())


# Chords as semitones from A4: C major, G major, A minor, F major.
CHORDS = [(-9, -5, -2), (-14, -10, -7), (-12, -9, -5), (-16, -12, -9)]
CAROL_SECONDS = 20.0
EIGHTH = 0.25  # 120 beats a minute


def carol_notes():
    """Arpeggios over C G Am F, one chord per bar of eight eighths, with a
    bass note on each bar: (start, frequency, length, loudness, lamp)."""
    notes = []
    bars = int(CAROL_SECONDS / (8 * EIGHTH))
    for bar in range(bars):
        chord = CHORDS[bar % 4]
        bar_start = bar * 8 * EIGHTH
        notes.append((bar_start, note_hz(chord[0] - 12), 2.0, 0.6, None))
        for step in range(8):
            pitch = chord[[0, 1, 2, 1, 0, 1, 2, 0][step]] + (12 if step == 7 else 0)
            notes.append((bar_start + step * EIGHTH, note_hz(pitch), 0.6, 0.5, step % 4))
    return notes


BELLS_SECONDS = 16.0


def bell_strikes():
    """(time, lamp 0-3, semitones): a peal of four bells, rounds then changes."""
    strikes = []
    orders = [(0, 1, 2, 3), (1, 0, 3, 2), (1, 3, 0, 2), (3, 1, 2, 0)]
    pitches = [3, 0, -2, -5]
    t = 0.0
    row = 0
    while t < BELLS_SECONDS - 1.0:
        for lamp in orders[row % len(orders)]:
            strikes.append((t, lamp, pitches[lamp]))
            t += 0.4
        t += 0.4  # the handstroke gap
        row += 1
    return strikes


# --- sequences ---------------------------------------------------------------

def carol_sequence(notes):
    """The plain sequence of the carol: each arpeggio note flashes one of the
    four house outlines (slots 1-8 of universes 13-16) and fades out; the
    chord of the bar sets a colour wash on slots 9-11."""
    channels = {}

    def channel(universe, slot, name):
        key = (universe, slot)
        if key not in channels:
            channels[key] = {"name": name, "dmx": {"universe": universe, "slot": slot},
                             "effects": []}
        return channels[key]["effects"]

    for start, _hz, _length, _loud, lamp in notes:
        at = int(round(start * 1000))
        if lamp is None:
            bar = int(start / (8 * EIGHTH))
            for universe in range(13, 17):
                for k in range(3):
                    level = 40 if k == bar % 3 else 0
                    channel(universe, 9 + k, "House wash").append(
                        {"at": at, "type": "set", "level": level})
            continue
        for slot in range(1, 9):
            channel(13 + lamp, slot, "House outline").append(
                {"at": at, "type": "fade", "duration": 400, "from": 100, "to": 0})
    return {
        "tessavar_sequence": 1,
        "length_ms": int(CAROL_SECONDS * 1000),
        "media": "carol.wav",
        "channels": list(channels.values()),
    }


def write_fseq(path, frames, channel_count, sparse_start=None, media="", frames_per_block=40):
    """An FSEQ v2.0 file with zlib blocks (a short first block, as the common
    writers do), an optional single sparse range and an `mf` header."""
    blocks = []
    first = 0
    sizes = [10] + [frames_per_block] * len(frames)
    for size in sizes:
        if first >= len(frames):
            break
        chunk = b"".join(frames[first:first + size])
        blocks.append((first, zlib.compress(chunk, 6)))
        first += size
    ranges = [] if sparse_start is None else [(sparse_start, channel_count)]
    header_len = 32 + 8 * len(blocks) + 6 * len(ranges)
    variable = b""
    if media:
        payload = media.encode() + b"\0"
        variable += struct.pack("<H", 4 + len(payload)) + b"mf" + payload
    producer = b"Tessavar demo generator\0"
    variable += struct.pack("<H", 4 + len(producer)) + b"sp" + producer
    data_offset = header_len + len(variable)
    data_offset += (-data_offset) % 4
    out = bytearray()
    out += b"PSEQ"
    out += struct.pack("<HBBHIIBBBBBBQ", data_offset, 0, 2, header_len, channel_count,
                       len(frames), FPS_STEP_MS, 0, 0x02 | ((len(blocks) >> 8) << 4) & 0xF0,
                       len(blocks) & 0xFF, len(ranges), 0, 0)
    for first_frame, data in blocks:
        out += struct.pack("<II", first_frame, len(data))
    for start, count in ranges:
        out += struct.pack("<I", start)[:3] + struct.pack("<I", count)[:3]
    out += variable
    out += b"\0" * (data_offset - len(out))
    for _first, data in blocks:
        out += data
    with open(path, "wb") as f:
        f.write(out)


def chase_frames(seconds=20.0):
    """The tree: twelve universes of 170 RGB pixels, a comet running up each
    one, each universe a little behind the one before, colours turning."""
    pixels = 170
    count = int(seconds * 1000 / FPS_STEP_MS)
    frames = []
    for n in range(count):
        frame = bytearray(12 * SLOTS)
        for u in range(12):
            head = (n * 2 + u * 14) % pixels
            hue = (n // 40 + u) % 3
            for tail in range(24):
                level = 255 * (24 - tail) // 24
                pixel = (head - tail) % pixels
                frame[u * SLOTS + pixel * 3 + hue] = level
        frames.append(bytes(frame))
    return frames


def bells_frames(strikes):
    """The house during the peal: each bell lights its own universe (13-16),
    bright at the strike and dying away as the sound does. Slots 511 and 512
    of universe 13 carry the frame number (high byte, low byte): a time code
    by which a measurement can tell which frame of the music is on show."""
    count = int(BELLS_SECONDS * 1000 / FPS_STEP_MS)
    frames = []
    for n in range(count):
        t = n * FPS_STEP_MS / 1000.0
        levels = [0.0] * 4
        for when, lamp, _pitch in strikes:
            if when <= t:
                levels[lamp] = max(levels[lamp], math.exp(-3.0 * (t - when)))
        frame = bytearray(4 * SLOTS)
        for lamp in range(4):
            value = int(255 * levels[lamp])
            frame[lamp * SLOTS:lamp * SLOTS + 384] = bytes([value]) * 384
        frame[510] = n >> 8
        frame[511] = n & 0xFF
        frames.append(bytes(frame))
    return frames


def main():
    if len(sys.argv) != 2 or sys.argv[1] in ("-h", "--help"):
        print(__doc__.strip())
        return 0 if len(sys.argv) == 2 else 2
    out = sys.argv[1]
    sequences = os.path.join(out, "Sequences")
    media = os.path.join(out, "Media")
    os.makedirs(sequences, exist_ok=True)
    os.makedirs(media, exist_ok=True)

    source = os.path.join(HERE, "data")
    for root, _dirs, files in os.walk(source):
        target = os.path.join(out, os.path.relpath(root, source))
        os.makedirs(target, exist_ok=True)
        for name in files:
            shutil.copyfile(os.path.join(root, name), os.path.join(target, name))

    notes = carol_notes()
    write_wav(os.path.join(media, "carol.wav"),
              render([(s, hz, ln, ld) for s, hz, ln, ld, _ in notes], CAROL_SECONDS))
    with open(os.path.join(sequences, "carol.tseq"), "w") as f:
        json.dump(carol_sequence(notes), f, indent=1)
        f.write("\n")

    strikes = bell_strikes()
    write_wav(os.path.join(media, "bells.wav"),
              render([(t, note_hz(p), 1.5, 0.7) for t, _lamp, p in strikes], BELLS_SECONDS))
    write_fseq(os.path.join(sequences, "bells.fseq"), bells_frames(strikes), 4 * SLOTS,
               sparse_start=12 * SLOTS, media="bells.wav")

    write_fseq(os.path.join(sequences, "chase.fseq"), chase_frames(), 12 * SLOTS)
    print(f"make_demo: the demo's user data folder is ready in {out}")
    return 0


if __name__ == "__main__":
    sys.exit(main())
