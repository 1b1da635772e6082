#!/bin/bash
# Usage: format.sh CLANG_FORMAT
# Fails with the places where a source of ours is not formatted.
set -euo pipefail
folders=()
for folder in packing pathtree coder paths archive binding hosts tests bench \
    fuzz examples; do
    [[ ! -d $folder ]] || folders+=("$folder")
done
find "${folders[@]}" \( -name '*.cpp' -o -name '*.hpp' \) -print0 |
    xargs -0 -r -n 16 -P 2 "$1" --dry-run --Werror
