#!/bin/bash
# Usage: consumer.sh CMAKE CXX PROJECT_BUILD WORK_FOLDER
# Installs the package into a folder of its own, moves it, and builds and runs
# the project in tests/consumer against it: through the CMake package, then
# through pkg-config. Installing under DESTDIR must give the same files.
set -euo pipefail
cmake=$1 cxx=$2 projectBuild=$3 work=$4
rm -rf "$work"
"$cmake" --install "$projectBuild" --prefix "$work/first" >/dev/null
mv "$work/first" "$work/prefix"
DESTDIR=$work/stage "$cmake" --install "$projectBuild" --prefix /opt/qztessel \
    >/dev/null
diff <(cd "$work/prefix" && find . | sort) \
    <(cd "$work/stage/opt/qztessel" && find . | sort)

"$cmake" -G Ninja -S tests/consumer -B "$work/build" \
    -DCMAKE_CXX_COMPILER="$cxx" -DCMAKE_PREFIX_PATH="$work/prefix" >/dev/null
"$cmake" --build "$work/build"
"${cmake%cmake}ctest" --test-dir "$work/build" --output-on-failure

pcFile=$(find "$work/prefix" -name qztessel.pc)
export PKG_CONFIG_PATH=${pcFile%/*}
# Builds a program on pkg-config packages and runs it.
tryProgram() {
    local source=$1 packages=$2
    shift 2
    # shellcheck disable=SC2046,SC2086  # the flags and names are words
    "$cxx" -std=c++20 "$source" -o "$work/program" \
        $(pkg-config --cflags --libs $packages)
    (cd "$work" && ./program "$@")
}
tryProgram tests/outside/main.cpp qztessel
tryProgram examples/keep-a-list.cpp qztessel-paths
tryProgram examples/pack-and-fetch.cpp qztessel-archive
tryProgram examples/first-steps.cpp "qztessel-paths qztessel-archive"
tryProgram examples/embedded-host.cpp qztessel-embedded \
    "$(pkg-config --variable=plugin qztessel)" \
    "$(pkg-config --variable=messages qztessel)"
