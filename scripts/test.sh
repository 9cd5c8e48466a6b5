#!/usr/bin/env bash
# Installs what is missing, builds, and runs every test: the fuzz targets for a short smoke
# time under AddressSanitizer, then the whole CTest suite under Xvfb (the display tests need
# an X server; one is started here when there is none).
set -euo pipefail
cd "$(dirname "$0")/.."

./scripts/install-deps.sh
# The shape of the code before its behaviour: formatting, and dependencies that point one way.
./scripts/check-format.sh
./scripts/check-layers.sh
./scripts/build.sh

# Tests write nothing into the home folder, and settings start empty.
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
mkdir -m 700 "$scratch/runtime"
mkdir -p "$scratch/config" "$scratch/cache"
export XDG_RUNTIME_DIR="$scratch/runtime" XDG_CONFIG_HOME="$scratch/config" XDG_CACHE_HOME="$scratch/cache"

./scripts/fuzz.sh "${LUMEK_FUZZ_SECONDS:-10}"

build_dir=${BUILD_DIR:-build}
if [ "${LUMEK_SANITIZE:-0}" = "1" ]; then
  build_dir=${BUILD_DIR:-build-sanitize}
  # Mesa and the X libraries keep a little memory to the end of the process; the display tests
  # would report it as leaks of ours.
  export ASAN_OPTIONS=${ASAN_OPTIONS:-detect_leaks=0}
fi
ctest_args=(--test-dir "$build_dir" --output-on-failure -j "$(nproc)")
if [ -n "${DISPLAY:-}" ]; then
  ctest "${ctest_args[@]}"
else
  # -noreset: the server must outlive each test's last window, or the next test that starts
  # while it resets cannot connect.
  xvfb-run -a -s "-screen 0 1920x1080x24 -nolisten tcp -noreset" ctest "${ctest_args[@]}"
fi
