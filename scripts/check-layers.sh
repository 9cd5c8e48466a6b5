#!/usr/bin/env bash
# Fails when a library includes a header of a library above it. The order is the README's:
# app -> graphics, fileio, versioncheck -> videointerface -> utils -> services (tools sit on
# top of app). Libraries of one level do not include each other, with one exception: the
# processor pixel conversion (graphics/CoreVideoUtils, no OpenGL) serves the decoders in fileio.
set -euo pipefail
cd "$(dirname "$0")/.."

declare -A level=(
  [services]=0 [utils]=1 [videointerface]=2
  [fileio]=3 [graphics]=3 [versioncheck]=3
  [app]=4 [tools]=5
)

status=0
while IFS= read -r line; do
  file=${line%%:*}
  included=$(sed -E 's/.*#include "([^/"]+)\/.*/\1/' <<<"${line#*:}")
  from=${file%%/*}
  [ -n "${level[$included]:-}" ] || continue
  if [ "$from" = fileio ] && grep -q '#include "graphics/CoreVideoUtils/' <<<"$line"; then
    continue
  fi
  if [ "$included" != "$from" ] && [ "${level[$included]}" -ge "${level[$from]}" ]; then
    echo "layers: $file includes $included, which is not below $from" >&2
    status=1
  fi
done < <(git ls-files -co --exclude-standard -- "${!level[@]}" | grep -E '\.(h|cpp)$' | xargs -r grep -HE '^\s*#\s*include "[^/"]+/' || true)
exit $status
