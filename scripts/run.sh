#!/usr/bin/env bash
# Installs what is missing, builds, and starts the viewer on FILE, or on the bundled sample
# recording when no file is given.
set -euo pipefail
cd "$(dirname "$0")/.."

./scripts/install-deps.sh
./scripts/build.sh

build_dir=${BUILD_DIR:-build}
file=${1:-$build_dir/samples/demo.lvid}
if [ -x "$build_dir/bin/lumekvideoviewer" ] && [ -n "$(find app -name VVideoWindow.cpp 2>/dev/null)" ]; then
  exec "$build_dir/bin/lumekvideoviewer" "$file"
fi
# Until the window lands, show what the viewer would show.
exec "$build_dir/bin/lumekvideotool" info "$file"
