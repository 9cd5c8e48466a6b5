#!/usr/bin/env bash
# Builds the libFuzzer targets with clang and runs each for a few seconds (default 10) on its
# seed corpus, under AddressSanitizer and UndefinedBehaviorSanitizer.
set -euo pipefail
cd "$(dirname "$0")/.."

seconds=${1:-10}
build_dir=${FUZZ_BUILD_DIR:-build-fuzz}
generator=()
command -v ninja >/dev/null && generator=(-G Ninja)
if [ ! -f "$build_dir/CMakeCache.txt" ]; then
  CC=clang CXX=clang++ cmake -S . -B "$build_dir" "${generator[@]}" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DLUMEK_FUZZ=ON >/dev/null
fi
# Quiet when it works; the compiler's words when it does not.
cmake --build "$build_dir" -j "$(nproc)" >"$build_dir/build.log" 2>&1 || { tail -60 "$build_dir/build.log"; exit 1; }

shopt -s nullglob
for fuzzer in "$build_dir"/fuzz/fuzz_*; do
  [ -x "$fuzzer" ] || continue
  name=$(basename "$fuzzer")
  corpus="$build_dir/corpus/$name"
  mkdir -p "$corpus"
  seeds="fuzz/seeds/${name#fuzz_}"
  echo "fuzz: $name for ${seconds}s"
  if [ -d "$seeds" ]; then
    "$fuzzer" -max_total_time="$seconds" -rss_limit_mb=2048 -print_final_stats=0 "$corpus" "$seeds" 2>"$corpus.log" \
      || { tail -40 "$corpus.log"; echo "fuzz: $name failed"; exit 1; }
  else
    "$fuzzer" -max_total_time="$seconds" -rss_limit_mb=2048 "$corpus" 2>"$corpus.log" \
      || { tail -40 "$corpus.log"; echo "fuzz: $name failed"; exit 1; }
  fi
done
