#!/usr/bin/env python3
"""Writes data/demo.frames.jsonl, the bundled demonstration frame recording.

A wired (USB) trackpad 10 x 5 (SurfaceDimensions in 16.16 fixed point). A client connects
and turns tap-to-click on; then one finger touches down, moves across the surface for
twenty frames 8 ms apart and lifts. Timestamps are nanoseconds (timebase 1/1).

Usage: make_demo_frames.py [OUTPUT]   (default: data/demo.frames.jsonl beside this repository)
"""

import json
import os
import sys

DIGITIZER = 11
FRAME_INTERVAL_NS = 8_000_000
START_NS = 1_000_000_000

# Digitizer event-mask bits: what changed in this contact since the last frame.
RANGE_CHANGED = 0x1
TOUCH_CHANGED = 0x2
POSITION_CHANGED = 0x4

FINGER = 1  # transducer type of a finger


def field(event_type, index):
    return "0x%x" % (event_type << 16 | index)


def contact(timestamp, x, y, touching, event_mask):
    fields = {
        field(DIGITIZER, 0): x,
        field(DIGITIZER, 1): y,
        field(DIGITIZER, 4): FINGER,
        field(DIGITIZER, 5): 0,  # contact index
        field(DIGITIZER, 7): event_mask,
        field(DIGITIZER, 8): 1 if touching else 0,  # range
        field(DIGITIZER, 9): 1 if touching else 0,  # touch
    }
    return {"type": DIGITIZER, "timestamp": timestamp, "fields": dict(sorted(fields.items(), key=lambda kv: int(kv[0], 16)))}


def frame(timestamp, contacts):
    # The parent carries the diving-button state (not pressed) and one child per contact.
    return {"type": DIGITIZER, "timestamp": timestamp, "fields": {field(DIGITIZER, 3): 0}, "children": contacts}


def records():
    yield {"client": {"id": 1, "added": True}}
    yield {"setProperty": {"key": "TapToClickEnabled", "value": True}}
    moves = 20
    t = START_NS
    x, y = 0.2, 0.5
    yield frame(t, [contact(t, x, y, True, RANGE_CHANGED | TOUCH_CHANGED | POSITION_CHANGED)])
    for i in range(1, moves + 1):
        t += FRAME_INTERVAL_NS
        x = round(0.2 + 0.02 * i, 4)
        y = round(0.5 + 0.005 * i, 4)
        yield frame(t, [contact(t, x, y, True, POSITION_CHANGED)])
    t += FRAME_INTERVAL_NS
    yield frame(t, [contact(t, x, y, False, RANGE_CHANGED | TOUCH_CHANGED)])


def main():
    here = os.path.dirname(os.path.abspath(__file__))
    output = sys.argv[1] if len(sys.argv) > 1 else os.path.join(here, "..", "..", "data", "demo.frames.jsonl")
    header = {
        "format": "orvane-frames",
        "version": 1,
        "service": {
            "usagePairs": [[13, 5], [13, 34], [1, 6]],
            "properties": {"SurfaceDimensions": {"Height": 327680, "Width": 655360}, "Transport": "USB"},
        },
        "timebase": [1, 1],
        "bundle": {"Acceleration": {}},
    }
    with open(output, "w", encoding="utf-8", newline="\n") as out:
        out.write("# One finger touches down on a 10 x 5 USB trackpad, moves right for 20 frames\n")
        out.write("# 8 ms apart and lifts. Written by tools/scripts/make_demo_frames.py.\n")
        out.write(json.dumps(header) + "\n")
        for record in records():
            out.write(json.dumps(record) + "\n")


if __name__ == "__main__":
    main()
