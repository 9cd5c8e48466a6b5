#!/usr/bin/env bash
# Installs what is missing, builds, and starts the viewer on FILE, or on the bundled sample
# recording when no file is given.
set -euo pipefail
cd "$(dirname "$0")/.."

./scripts/install-deps.sh
./scripts/build.sh

build_dir=${BUILD_DIR:-build}
file=${1:-$build_dir/samples/demo.lvid}
if [ -z "${DISPLAY:-}" ] && [ -z "${WAYLAND_DISPLAY:-}" ]; then
  echo "No display: showing what the viewer would show of $file." >&2
  exec "$build_dir/bin/lumekvideotool" info "$file"
fi
exec "$build_dir/bin/lumekvideoviewer" "$file"
