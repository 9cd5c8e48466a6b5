#!/usr/bin/env bash
# Frames a second of ffmpeg's swscale on one thread for the conversions PixelConversionBench
# measures, at 1920 x 1080: bayer_gbrg8 and uyvy422 to rgb24. The reference for the targets in
# docs/performance.md.
#
# The machine is shared, so the rate is counted in the processor time ffmpeg reports for
# itself (-benchmark: utime), as Google Benchmark's CPU time is; the wall-clock rate is shown
# beside it. Usage: swscale_reference.sh [frames (default 300)] [runs (default 3)]
set -euo pipefail

frames=${1:-300}
runs=${2:-3}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

head -c $((1920 * 1080 * 2)) /dev/urandom > "$work/noise"
for format in bayer_gbrg8 uyvy422; do
  bytes=$((1920 * 1080))
  [ "$format" = uyvy422 ] && bytes=$((1920 * 1080 * 2))
  head -c "$bytes" "$work/noise" > "$work/one.raw"
  # One frame of noise, repeated: the content does not change the cost of these conversions.
  : > "$work/in.raw"
  for _ in $(seq "$frames"); do cat "$work/one.raw" >> "$work/in.raw"; done

  best=0
  for _ in $(seq "$runs"); do
    report=$(ffmpeg -hide_banner -nostats -benchmark -threads 1 -filter_threads 1 -f rawvideo -pix_fmt "$format" \
      -s 1920x1080 -i "$work/in.raw" -f rawvideo -pix_fmt rgb24 -y /dev/null 2>&1 | grep 'bench: utime')
    utime=$(sed -E 's/.*utime=([0-9.]+)s.*/\1/' <<<"$report")
    rtime=$(sed -E 's/.*rtime=([0-9.]+)s.*/\1/' <<<"$report")
    fps=$(echo "$frames / $utime" | bc -l)
    printf '%s -> rgb24: %.1f fps by processor time, %.1f fps by wall clock\n' "$format" "$fps" \
      "$(echo "$frames / $rtime" | bc -l)"
    if [ "$(echo "$fps > $best" | bc -l)" = 1 ]; then best=$fps; fi
  done
  printf '%s -> rgb24: best of %d runs %.1f fps\n' "$format" "$runs" "$best"
done
