#!/usr/bin/env python3
"""Writes the seed corpus of fuzz_filter_frames: byte strings that FrameDecoder.cpp decodes
into ordinary touchpad sessions (a moving finger, a tap, a scroll, a pinch, a click, a
wireless device) and into a few hostile ones. Run from the repository's top:
    python3 fuzz/make_filter_seeds.py fuzz/corpus/filter_frames
"""
import os
import struct
import sys

USB, BLUETOOTH = 0, 1


def setup(transport=USB, debug=False):
    return bytes([transport | (4 if debug else 0)])


def coordinate(v):
    """An ordinary fraction of the surface (0..1)."""
    return bytes([0]) + struct.pack("<H", round(max(0.0, min(1.0, v)) * 65535))


def special(n):
    """0.0, 1.0, NaN, +inf, -inf, -0.0, 1e300, -1e300, the smallest denormal."""
    return bytes([160 + n])


def contact(index, x, y, touch=1, kind=1, mask=0):
    xs = x if isinstance(x, bytes) else coordinate(x)
    ys = y if isinstance(y, bytes) else coordinate(y)
    idx = bytes([index + 1]) if -1 <= index <= 14 else bytes([{-2: 224, 15: 225}[index]])
    return bytes([0]) + bytes([0]) + idx + bytes([touch, kind]) + xs + ys + bytes([1, mask])


def frame(contacts, step_ms=8, button=0, scan_time=None):
    out = bytes([0, 0, step_ms - 1])  # a frame, the clock moves on by step_ms
    out += bytes([0])  # the usual sender
    fields = 0x01 | 0x04 | (0x20 if scan_time is not None else 0)
    out += bytes([fields, button & 7, 1 if contacts else 0])
    if scan_time is not None:
        out += bytes([0, 2]) + struct.pack("<H", scan_time & 0xFFFF) + bytes([0])
    out += bytes([len(contacts)]) + b"".join(contacts)
    return out


def set_property(key_index, on):
    return bytes([11, 0, key_index, 2, 1 if on else 0])


def lift(indexes, positions):
    return frame([contact(i, x, y, touch=0) for i, (x, y) in zip(indexes, positions)])


def sessions():
    s = {}
    # One finger moves right and lifts.
    b = setup()
    for k in range(12):
        b += frame([contact(0, 0.3 + 0.02 * k, 0.5)])
    b += lift([0], [(0.54, 0.5)]) + frame([])
    s["pointer"] = b
    # A one-finger tap with tap-to-click on.
    b = setup() + set_property(0, True)
    b += frame([contact(0, 0.5, 0.5)]) + frame([contact(0, 0.5, 0.5)])
    b += lift([0], [(0.5, 0.5)]) + frame([]) + frame([], step_ms=200)
    s["tap"] = b
    # Two fingers move down together: a scroll.
    b = setup()
    for k in range(15):
        b += frame([contact(0, 0.4, 0.3 + 0.02 * k), contact(1, 0.55, 0.3 + 0.02 * k)])
    b += lift([0, 1], [(0.4, 0.58), (0.55, 0.58)]) + frame([])
    s["scroll"] = b
    # Two fingers move apart: a pinch.
    b = setup()
    for k in range(15):
        b += frame([contact(0, 0.45 - 0.015 * k, 0.5), contact(1, 0.55 + 0.015 * k, 0.5)])
    b += frame([])
    s["pinch"] = b
    # A thumb rests low while a finger moves, then the click is pressed and released.
    b = setup() + set_property(1, True)
    for k in range(10):
        b += frame([contact(0, 0.3, 0.1), contact(2, 0.5 + 0.02 * k, 0.6)], button=1 if 4 <= k < 7 else 0)
    b += lift([0, 2], [(0.3, 0.1), (0.68, 0.6)]) + frame([])
    s["click-with-thumb"] = b
    # A wireless device: the relative scan time advances 80 units a frame and wraps.
    b = setup(BLUETOOTH)
    for k in range(10):
        b += frame([contact(0, 0.3 + 0.03 * k, 0.4)], scan_time=65300 + 80 * k)
    b += frame([])
    s["wireless"] = b
    # Hostile: NaN and infinite coordinates, indexes outside 0..13, a palm, several buttons,
    # with the diagnostics on.
    b = setup(debug=True)
    b += frame([contact(0, special(2), special(3)), contact(-1, 0.5, 0.5), contact(14, 0.5, 0.5)], button=7)
    b += frame([contact(0, special(4), special(6)), contact(5, 0.5, 0.5, kind=3), contact(-2, 0.1, 0.1), contact(15, 0.3, 0.3)])
    b += frame([contact(13, special(5), special(8)), contact(0, 0.2, 0.2)], step_ms=1)
    b += frame([])
    s["hostile"] = b
    return s


def main():
    folder = sys.argv[1]
    os.makedirs(folder, exist_ok=True)
    for name, data in sessions().items():
        with open(os.path.join(folder, name + ".bin"), "wb") as f:
            f.write(data)


if __name__ == "__main__":
    main()
