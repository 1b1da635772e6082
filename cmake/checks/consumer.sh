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
# Builds a program on a pkg-config package.
build() {
    # shellcheck disable=SC2046  # the flags are words
    "$cxx" -std=c++20 "$1" -o "$work/$2" $(pkg-config --cflags --libs "$2")
}
build tests/outside/main.cpp qztessel
"$work/qztessel"
build examples/keep-a-list.cpp qztessel-paths
(cd "$work" && ./qztessel-paths)
build examples/embedded-host.cpp qztessel-embedded
"$work/qztessel-embedded" "$(pkg-config --variable=plugin qztessel)" \
    "$(pkg-config --variable=messages qztessel)"
