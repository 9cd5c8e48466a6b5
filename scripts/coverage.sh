#!/usr/bin/env bash
# Builds with gcc's --coverage in a folder of its own, runs the whole CTest suite, and prints line
# and branch coverage of the program's own code (not tests/, bench/ or fuzz/) by folder, with an
# HTML report in the build folder. BUILD_DIR (default build-coverage) names the folder;
# COVERAGE_TARGETS (e.g. "test_videointerface LumekVideoTests") builds and measures only those
# test programs, as ctest only knows the tests of programs that were built; extra arguments go
# to ctest (e.g. -R Lvid).
set -euo pipefail
cd "$(dirname "$0")/.."
root=$(pwd)

build_dir=${BUILD_DIR:-build-coverage}
generator=()
command -v ninja >/dev/null && generator=(-G Ninja)
command -v gcovr >/dev/null || { echo "gcovr is missing: run ./scripts/install-deps.sh" >&2; exit 1; }

# -O0 keeps one line of source to one block of code, so that a line counts as run only when it
# was; the benchmarks measure nothing here.
if [ ! -f "$build_dir/CMakeCache.txt" ]; then
  cmake -S . -B "$build_dir" "${generator[@]}" -DCMAKE_BUILD_TYPE=Debug -DLUMEK_BUILD_BENCH=OFF \
    -DCMAKE_C_COMPILER=gcc -DCMAKE_CXX_COMPILER=g++ \
    -DCMAKE_CXX_FLAGS="--coverage -O0" -DCMAKE_C_FLAGS="--coverage -O0" \
    -DCMAKE_EXE_LINKER_FLAGS=--coverage -DCMAKE_SHARED_LINKER_FLAGS=--coverage
fi
targets=()
for target in ${COVERAGE_TARGETS:-}; do targets+=(--target "$target"); done
cmake --build "$build_dir" -j "$(nproc)" "${targets[@]}"

# Counts from an earlier run would add to this one's.
find "$build_dir" -name '*.gcda' -delete

scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
mkdir -m 700 "$scratch/runtime"
mkdir -p "$scratch/config" "$scratch/cache"
export XDG_RUNTIME_DIR="$scratch/runtime" XDG_CONFIG_HOME="$scratch/config" XDG_CACHE_HOME="$scratch/cache"

ctest_args=(--test-dir "$build_dir" --output-on-failure -j "$(nproc)")
# The programs left out stand in ctest as placeholders that cannot run.
[ -n "${COVERAGE_TARGETS:-}" ] && ctest_args+=(--exclude-regex '_NOT_BUILT$')
ctest_args+=("$@")
status=0
if [ -n "${DISPLAY:-}" ]; then
  ctest "${ctest_args[@]}" || status=$?
else
  xvfb-run -a -s "-screen 0 1920x1080x24 -nolisten tcp -noreset" ctest "${ctest_args[@]}" || status=$?
fi

# Throw and unreachable branches are the compiler's, not decisions in our code. Counters that
# threads bumped at the same moment can come out negative (the build does not pay for atomic
# counters); gcov then writes a line gcovr cannot read, and that line is skipped.
areas='app|graphics|fileio|videointerface|utils|services|versioncheck|tools'
mkdir -p "$build_dir/coverage"
gcovr --root "$root" --object-directory "$build_dir" --filter "$root/($areas)/" \
  --exclude-directories "$build_dir/CMakeFiles" \
  --exclude-throw-branches --exclude-unreachable-branches --gcov-ignore-parse-errors -j "$(nproc)" \
  --json-summary "$build_dir/coverage/summary.json" \
  --html-details "$build_dir/coverage/index.html" --print-summary

# One line per folder (a library folder under fileio/, graphics/ and app/, the top folder
# elsewhere), then the whole.
python3 - "$build_dir/coverage/summary.json" <<'EOF'
import json, sys
from collections import defaultdict

files = json.load(open(sys.argv[1]))["files"]
sums = defaultdict(lambda: [0, 0, 0, 0])
for f in files:
    parts = f["filename"].split("/")
    key = "/".join(parts[:2]) if parts[0] in ("fileio", "graphics", "app") and len(parts) > 2 else parts[0]
    for total in (sums[key], sums["all"]):
        total[0] += f["line_covered"]
        total[1] += f["line_total"]
        total[2] += f["branch_covered"]
        total[3] += f["branch_total"]

def percent(covered, total):
    return f"{100.0 * covered / total:6.1f}%" if total else "     -"

print(f"{'folder':32} {'lines':>15} {'line%':>7} {'branches':>15} {'branch%':>7}")
for key in sorted(k for k in sums if k != "all") + ["all"]:
    lc, lt, bc, bt = sums[key]
    print(f"{key:32} {lc:7}/{lt:<7} {percent(lc, lt)} {bc:7}/{bt:<7} {percent(bc, bt)}")
EOF
echo "HTML report: $build_dir/coverage/index.html"
exit "$status"
