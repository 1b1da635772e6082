#!/bin/bash
# Usage: consumer.sh CMAKE CXX PROJECT_BUILD WORK_FOLDER
# Installs the package into a folder of its own, moves it, and builds and runs
# the project in tests/consumer against it: through the CMake package, then
# through pkg-config.
set -euo pipefail
cmake=$1 cxx=$2 projectBuild=$3 work=$4
rm -rf "$work"
"$cmake" --install "$projectBuild" --prefix "$work/first" >/dev/null
mv "$work/first" "$work/prefix"

"$cmake" -G Ninja -S tests/consumer -B "$work/build" \
    -DCMAKE_CXX_COMPILER="$cxx" -DCMAKE_PREFIX_PATH="$work/prefix" >/dev/null
"$cmake" --build "$work/build"
"$work/build/consumer"
if [[ -x $work/build/load-plugin ]]; then
    "$work/build/load-plugin"
fi

pcFile=$(find "$work/prefix" -name qztessel.pc)
export PKG_CONFIG_PATH=${pcFile%/*}
# shellcheck disable=SC2046  # the flags are words
"$cxx" -std=c++20 tests/outside/main.cpp -o "$work/consumer" \
    $(pkg-config --cflags --libs qztessel)
"$work/consumer"
