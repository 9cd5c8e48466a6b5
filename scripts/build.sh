#!/usr/bin/env bash
# Configures and builds the project. BUILD_DIR (default build) names the build folder;
# LUMEK_SANITIZE=1 builds with AddressSanitizer and UndefinedBehaviorSanitizer.
set -euo pipefail
cd "$(dirname "$0")/.."

# A sanitizer build has a folder of its own, so that switching does not rebuild the other.
sanitize=OFF
build_dir=${BUILD_DIR:-build}
if [ "${LUMEK_SANITIZE:-0}" = "1" ]; then
  sanitize=ON
  build_dir=${BUILD_DIR:-build-sanitize}
fi
generator=()
command -v ninja >/dev/null && generator=(-G Ninja)

if [ ! -f "$build_dir/CMakeCache.txt" ]; then
  cmake -S . -B "$build_dir" "${generator[@]}" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DLUMEK_SANITIZE=$sanitize
else
  cmake -S . -B "$build_dir" -DLUMEK_SANITIZE=$sanitize >/dev/null
fi
cmake --build "$build_dir" -j "$(nproc)" "$@"
