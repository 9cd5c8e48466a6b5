#!/usr/bin/env bash
# Configures and builds the project. BUILD_DIR (default build) names the build folder;
# LUMEK_SANITIZE=1 builds with AddressSanitizer and UndefinedBehaviorSanitizer.
set -euo pipefail
cd "$(dirname "$0")/.."

build_dir=${BUILD_DIR:-build}
sanitize=OFF
[ "${LUMEK_SANITIZE:-0}" = "1" ] && sanitize=ON
generator=()
command -v ninja >/dev/null && generator=(-G Ninja)

if [ ! -f "$build_dir/CMakeCache.txt" ]; then
  cmake -S . -B "$build_dir" "${generator[@]}" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DLUMEK_SANITIZE=$sanitize
else
  cmake -S . -B "$build_dir" -DLUMEK_SANITIZE=$sanitize >/dev/null
fi
cmake --build "$build_dir" -j "$(nproc)" "$@"
