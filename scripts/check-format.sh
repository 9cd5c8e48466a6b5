#!/usr/bin/env bash
# Fails when a tracked C++ source is not as the project's .clang-format writes it.
set -euo pipefail
cd "$(dirname "$0")/.."
git ls-files -z -- '*.cpp' '*.h' | xargs -0 -r clang-format --dry-run --Werror
