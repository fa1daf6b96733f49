#!/bin/sh
# Writes data/demo.frames.jsonl, the bundled demonstration frame recording, from the
# gesture script data/demo.gestures.
#
# Usage: make_demo_frames.sh [ORVANE]   (default: build/release/bin/orvane of this checkout)
set -eu
top=$(cd "$(dirname "$0")/../.." && pwd)
orvane=${1:-"$top/build/release/bin/orvane"}
out="$top/data/demo.frames.jsonl"
tmp="$out.tmp"
{
    echo "# The bundled demonstration session, converted from data/demo.gestures (read that file"
    echo "# to follow it) by tools/scripts/make_demo_frames.sh. Do not edit: change the script."
    "$orvane" frames "$top/data/demo.gestures" --out -
} >"$tmp"
mv "$tmp" "$out"
