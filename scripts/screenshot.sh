#!/usr/bin/env bash
# Makes docs/screenshot.png: starts the viewer on a private X server with the bundled sample
# recording (or FILE), lets it play for a moment, and captures its window with ImageMagick.
#   ./scripts/screenshot.sh [FILE]
set -euo pipefail
cd "$(dirname "$0")/.."

build_dir=${BUILD_DIR:-build}
file=${1:-$build_dir/samples/demo.lvid}
viewer=$build_dir/bin/lumekvideoviewer
out=docs/screenshot.png

command -v import >/dev/null || ./scripts/install-deps.sh
[ -x "$viewer" ] || { echo "Build the viewer first: $viewer is missing." >&2; exit 1; }
[ -f "$file" ] || { echo "No recording at $file." >&2; exit 1; }

# The viewer's settings go to a scratch store, so the picture shows a first start.
if [ "${LUMEK_SCREENSHOT_INSIDE:-}" != "1" ]; then
  scratch=$(mktemp -d)
  trap 'rm -rf "$scratch"' EXIT
  mkdir -m 700 "$scratch/runtime"
  mkdir -p "$scratch/config" "$scratch/cache"
fi
export XDG_RUNTIME_DIR="$scratch/runtime" XDG_CONFIG_HOME="$scratch/config" XDG_CACHE_HOME="$scratch/cache"

# Runs inside the X server: this script calls itself through xvfb-run.
capture() {
  "$viewer" --version-server= "$file" &
  local pid=$!
  # Long enough to load, start playing and settle the measured frame rate.
  sleep "${LUMEK_SCREENSHOT_SECONDS:-4}"
  local title
  title="$(basename "$file") - Lumek Video Viewer"
  # The root window holds what the GL surface drew; a capture of the window alone comes out
  # black under Xvfb, so the screen is captured and cut to the window's geometry.
  local geometry
  geometry=$(xwininfo -root -tree | awk -v t="\"$title\":" 'index($0, t) { print $(NF-1); exit }')
  if [ -n "$geometry" ]; then
    import -window root -crop "$geometry" +repage "$scratch/shot.png"
  else
    import -window root "$scratch/shot.png"
  fi
  kill "$pid"
  wait "$pid" 2>/dev/null || true
}
if [ "${LUMEK_SCREENSHOT_INSIDE:-}" = "1" ]; then
  capture
  exit 0
fi

LUMEK_SCREENSHOT_INSIDE=1 scratch="$scratch" xvfb-run -a -s "-screen 0 1280x900x24 -nolisten tcp" "$0" "$file"
# A palette keeps the picture small; the interface is mostly flat greys.
convert "$scratch/shot.png" -strip -define png:compression-level=9 "$out"
echo "Wrote $out ($(stat -c %s "$out") bytes)"
