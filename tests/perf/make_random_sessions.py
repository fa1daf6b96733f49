#!/usr/bin/env python3
"""Writes random but reproducible frame recordings: sessions of hands that point, tap,
scroll, pinch, rotate, swipe with three to five fingers, rest a thumb, press the diving
button, lay a palm down, hold still and pause, on wired and wireless trackpads of several
sizes and under two tick timebases.

The same seed always gives the same file (Python's random.Random with an integer seed, and
positions rounded to four decimals), but the recordings the tests use are committed, so a
change of this script changes nothing until they are written again.

Usage: make_random_sessions.py OUTPUT_DIR [--count N] [--frames N] [--first-seed S]
Writes OUTPUT_DIR/random-SEED.frames.jsonl for each seed.
"""

import argparse
import json
import math
import os
import random

DIGITIZER = 11
VENDOR = 1

RANGE_CHANGED = 0x1
TOUCH_CHANGED = 0x2
POSITION_CHANGED = 0x4

FINGER = 1
PALM = 3

# (width, height) in 16.16 fixed point, as "SurfaceDimensions" gives them.
SURFACES = [(655360, 327680), (786432, 458752), (1048576, 524288), (491520, 393216)]


def key(event_type, index):
    return "0x%x" % (event_type << 16 | index)


def q(v):
    """A digitizer coordinate: clamped to the surface and rounded to four decimals."""
    return round(min(1.0, max(0.0, v)), 4)


class Finger:
    def __init__(self, index, x, y, palm=False):
        self.index = index
        self.x = x
        self.y = y
        self.palm = palm
        self.new = True
        self.lifting = False


class Session:
    def __init__(self, seed, frames):
        self.rng = random.Random(seed)
        self.seed = seed
        self.target_frames = frames
        rng = self.rng
        self.surface = SURFACES[seed % len(SURFACES)]
        self.wireless = seed % 3 == 1
        self.timebase = [125, 3] if seed % 4 == 3 else [1, 1]
        self.t_ns = 1_000_000_000 + rng.randrange(0, 1_000_000)
        self.scan = rng.randrange(0, 65536)  # relative scan time, 100 us units
        self.button = 0
        self.fingers = []
        self.records = []
        self.frames = 0

    # -- frames -------------------------------------------------------------------------

    def ticks(self, ns):
        numer, denom = self.timebase
        return ns * denom // numer

    def free_index(self):
        rng = self.rng
        if rng.random() < 0.01:
            return rng.choice([-1, 14, 15])  # outside the table: skipped or slot 0
        used = {f.index for f in self.fingers}
        choices = [i for i in range(14) if i not in used]
        return rng.choice(choices) if choices else 0

    def add(self, x, y, palm=False):
        f = Finger(self.free_index(), x, y, palm)
        self.fingers.append(f)
        return f

    def lift(self, f, abrupt=False):
        if abrupt:
            self.fingers.remove(f)
        else:
            f.lifting = True

    def contact(self, ts, f):
        rng = self.rng
        if f.lifting:
            touch, rng_in, mask = 0, (1 if rng.random() < 0.2 else 0), RANGE_CHANGED | TOUCH_CHANGED
        elif f.new:
            touch, rng_in, mask = 1, 1, RANGE_CHANGED | TOUCH_CHANGED | POSITION_CHANGED
        else:
            touch, rng_in, mask = 1, 1, POSITION_CHANGED if rng.random() < 0.9 else 0
        fields = {
            key(DIGITIZER, 0): q(f.x),
            key(DIGITIZER, 1): q(f.y),
            key(DIGITIZER, 4): PALM if f.palm else FINGER,
            key(DIGITIZER, 5): f.index,
            key(DIGITIZER, 7): mask,
            key(DIGITIZER, 8): rng_in,
            key(DIGITIZER, 9): touch,
        }
        return {"type": DIGITIZER, "timestamp": ts, "fields": fields}, touch, rng_in, mask

    def scan_child(self, ts, interval_ns):
        rng = self.rng
        self.scan = (self.scan + interval_ns // 100_000 + rng.choice([0, 0, 0, 1, -1])) % 65536
        length = 3 if rng.random() < 0.01 else 2
        data = bytes([self.scan & 0xFF, self.scan >> 8] + ([0] if length == 3 else []))
        fields = {key(VENDOR, 0): 13, key(VENDOR, 1): 86, key(VENDOR, 3): length, key(VENDOR, 4): data.hex()}
        return {"type": VENDOR, "timestamp": ts, "fields": fields}

    def frame(self, interval_ms=8.0):
        rng = self.rng
        interval_ns = int(interval_ms * 1_000_000) + rng.randrange(-300_000, 300_001)
        self.t_ns += interval_ns
        ts = self.ticks(self.t_ns)
        children = []
        touch = rng_any = mask = 0
        for f in self.fingers:
            child, t, r, m = self.contact(ts, f)
            children.append(child)
            touch |= t
            rng_any |= r
            mask |= m
        if rng.random() < 0.05 and len(children) > 1:
            rng.shuffle(children)
        if self.wireless and rng.random() > 0.01:
            scan = self.scan_child(ts, interval_ns)
            if rng.random() < 0.02:
                children.insert(0, scan)
            else:
                children.append(scan)
        parent = {key(DIGITIZER, 3): self.button, key(DIGITIZER, 7): mask, key(DIGITIZER, 8): rng_any,
                  key(DIGITIZER, 9): touch}
        event = {"type": DIGITIZER, "timestamp": ts, "fields": parent}
        if children:
            event["children"] = children
        self.records.append(event)
        self.frames += 1
        for f in list(self.fingers):
            f.new = False
            if f.lifting:
                self.fingers.remove(f)

    def pause(self, ms):
        self.t_ns += int(ms * 1_000_000)

    # -- motion -------------------------------------------------------------------------

    def jitter(self, amount):
        for f in self.fingers:
            if not f.lifting:
                f.x += self.rng.uniform(-amount, amount)
                f.y += self.rng.uniform(-amount, amount)

    def move(self, fingers, dx, dy):
        for f in fingers:
            f.x += dx
            f.y += dy

    def lift_all(self, stagger=False):
        for f in list(self.fingers):
            self.lift(f, abrupt=self.rng.random() < 0.03)
            if stagger and self.rng.random() < 0.5:
                self.frame()
        self.frame()

    # -- episodes -----------------------------------------------------------------------

    def pointer(self):
        rng = self.rng
        f = self.add(rng.uniform(0.15, 0.85), rng.uniform(0.3, 0.9))
        dx, dy = rng.uniform(-0.012, 0.012), rng.uniform(-0.012, 0.012)
        for _ in range(rng.randrange(3, 70)):
            self.frame()
            if rng.random() < 0.1:
                dx, dy = rng.uniform(-0.012, 0.012), rng.uniform(-0.012, 0.012)
            self.move([f], dx, dy)
            self.jitter(0.0004)

    def tap(self, fingers):
        rng = self.rng
        x, y = rng.uniform(0.2, 0.8), rng.uniform(0.3, 0.85)
        for i in range(fingers):
            self.add(x + 0.12 * i, y + rng.uniform(-0.03, 0.03))
            if rng.random() < 0.3:
                self.frame()
        for _ in range(rng.randrange(1, 12)):
            self.frame()
            self.jitter(0.0003)
        self.lift_all(stagger=rng.random() < 0.3)

    def two_finger(self, kind):
        rng = self.rng
        cx, cy = rng.uniform(0.3, 0.7), rng.uniform(0.35, 0.75)
        sep = rng.uniform(0.08, 0.3)
        angle = rng.uniform(0, math.pi)
        a = self.add(cx - sep / 2 * math.cos(angle), cy - sep / 2 * math.sin(angle))
        if rng.random() < 0.4:
            self.frame()
        b = self.add(cx + sep / 2 * math.cos(angle), cy + sep / 2 * math.sin(angle))
        vx, vy = rng.uniform(-0.015, 0.015), rng.uniform(-0.02, 0.02)
        grow = rng.choice([-1, 1]) * rng.uniform(0.002, 0.015)
        turn = rng.choice([-1, 1]) * rng.uniform(0.01, 0.08)
        for _ in range(rng.randrange(4, 80)):
            self.frame()
            if kind == "scroll":
                self.move([a, b], vx, vy)
            elif kind == "pinch":
                sep = max(0.02, sep + grow)
            elif kind == "rotate":
                angle += turn
            if kind in ("pinch", "rotate"):
                a.x, a.y = cx - sep / 2 * math.cos(angle), cy - sep / 2 * math.sin(angle)
                b.x, b.y = cx + sep / 2 * math.cos(angle), cy + sep / 2 * math.sin(angle)
            self.jitter(0.0005 if kind != "still" else 0.00005)
            if rng.random() < 0.02:
                self.lift(rng.choice([a, b]))
                self.frame()
                break
        self.lift_all(stagger=rng.random() < 0.4)

    def many(self):
        rng = self.rng
        n = rng.randrange(3, 6)
        x, y = rng.uniform(0.15, 0.4), rng.uniform(0.4, 0.7)
        group = [self.add(x + 0.11 * i, y + rng.uniform(-0.05, 0.05)) for i in range(n)]
        dx, dy = rng.uniform(-0.015, 0.015), rng.uniform(-0.015, 0.015)
        for _ in range(rng.randrange(5, 50)):
            self.frame()
            self.move(group, dx, dy)
            self.jitter(0.0005)
        self.lift_all(stagger=True)

    def thumb(self):
        rng = self.rng
        self.add(rng.uniform(0.3, 0.7), rng.uniform(0.03, 0.2))
        for _ in range(rng.randrange(0, 5)):
            self.frame()
            self.jitter(0.0002)
        f = self.add(rng.uniform(0.2, 0.8), rng.uniform(0.5, 0.9))
        dx, dy = rng.uniform(-0.012, 0.012), rng.uniform(-0.012, 0.012)
        press_at = rng.randrange(0, 40) if rng.random() < 0.5 else -1
        for i in range(rng.randrange(5, 60)):
            if i == press_at:
                self.button = 1
            if press_at >= 0 and i == press_at + 8:
                self.button = 0
            self.frame()
            self.move([f], dx, dy)
            self.jitter(0.0002)
        self.button = 0
        self.lift_all(stagger=True)

    def click(self):
        rng = self.rng
        n = rng.choice([1, 1, 2])
        x = rng.uniform(0.3, 0.6)
        for i in range(n):
            self.add(x + 0.1 * i, rng.uniform(0.05, 0.4))
        for _ in range(rng.randrange(1, 5)):
            self.frame()
        self.button = 1
        for _ in range(rng.randrange(2, 20)):
            self.frame()
            self.jitter(0.0006)
        self.button = 0
        for _ in range(rng.randrange(1, 6)):
            self.frame()
        self.lift_all()

    def palm(self):
        rng = self.rng
        self.add(rng.uniform(0.05, 0.95), rng.uniform(0.0, 0.3), palm=True)
        if rng.random() < 0.6:
            self.add(rng.uniform(0.3, 0.7), rng.uniform(0.4, 0.8))
        for _ in range(rng.randrange(3, 30)):
            self.frame()
            self.jitter(0.002)
            if rng.random() < 0.05 and self.fingers:
                self.fingers[0].palm = not self.fingers[0].palm
        self.lift_all()

    def idle(self):
        rng = self.rng
        choice = rng.random()
        if choice < 0.5:
            self.pause(rng.uniform(20, 600))
        else:
            for _ in range(rng.randrange(1, 4)):
                self.frame(rng.choice([8.0, 16.0]))

    def property_change(self):
        rng = self.rng
        name = rng.choice(["TapToClickEnabled", "TwoFingersSecondaryClickEnabled"])
        self.records.append({"setProperty": {"key": name, "value": rng.random() < 0.7}})

    def run(self):
        rng = self.rng
        self.records.append({"client": {"id": 1, "added": True}})
        self.records.append({"setProperty": {"key": "TapToClickEnabled", "value": rng.random() < 0.8}})
        self.records.append({"setProperty": {"key": "TwoFingersSecondaryClickEnabled", "value": rng.random() < 0.8}})
        episodes = [
            (self.pointer, 14), (lambda: self.tap(1), 10), (lambda: self.tap(2), 8),
            (lambda: self.two_finger("scroll"), 14), (lambda: self.two_finger("pinch"), 7),
            (lambda: self.two_finger("rotate"), 7), (lambda: self.two_finger("still"), 5),
            (self.many, 6), (self.thumb, 7), (self.click, 6), (self.palm, 4), (self.idle, 8),
            (self.property_change, 2),
        ]
        actions = [a for a, _ in episodes]
        weights = [w for _, w in episodes]
        while self.frames < self.target_frames:
            rng.choices(actions, weights)[0]()
            self.pause(rng.uniform(0, 120))

    def header(self):
        width, height = self.surface
        return {
            "format": "orvane-frames",
            "version": 1,
            "service": {
                "usagePairs": [[13, 5], [13, 34], [1, 6]],
                "properties": {"SurfaceDimensions": {"Height": height, "Width": width},
                               "Transport": "Bluetooth" if self.wireless else "USB"},
            },
            "timebase": self.timebase,
            "bundle": {"Acceleration": {}},
        }


def dumps(obj):
    return json.dumps(obj, separators=(", ", ": "))


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("output_dir")
    parser.add_argument("--count", type=int, default=8)
    parser.add_argument("--frames", type=int, default=1200)
    parser.add_argument("--first-seed", type=int, default=1)
    args = parser.parse_args()
    os.makedirs(args.output_dir, exist_ok=True)
    for seed in range(args.first_seed, args.first_seed + args.count):
        session = Session(seed, args.frames)
        session.run()
        path = os.path.join(args.output_dir, "random-%d.frames.jsonl" % seed)
        with open(path, "w", encoding="utf-8", newline="\n") as out:
            out.write("# Random session %d (%d frames), written by tests/perf/make_random_sessions.py.\n"
                      % (seed, session.frames))
            out.write(dumps(session.header()) + "\n")
            for record in session.records:
                out.write(dumps(record) + "\n")


if __name__ == "__main__":
    main()
