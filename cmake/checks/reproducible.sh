#!/bin/bash
# Usage: reproducible.sh CMAKE BUILD_FOLDER WORK_FOLDER [TARGET...]
#
# Builds targets a second time, from a copy of the sources in another folder, and
# compares every file that comes out with that of the finished build, bit by bit.
# Without targets: all that is installed, and the Debian packages, which takes
# some minutes.
set -euo pipefail
cmake=$1 build=$(realpath "$2") work=$(realpath -m "$3")
shift 3
again=$work/another-folder/of-another-length
rm -rf "$work"
mkdir -p "$again"

fail() {
    echo "reproducible: $1"
    exit 1
}

tar --exclude=./build --exclude=./.git -cf - . | tar -xf - -C "$again"
targets=()
(($# == 0)) || targets=(--target "$@")
second=$again/build/packages
{
    cd "$again" && "$cmake" --preset packages -DCMAKE_INSTALL_PREFIX=/usr/local &&
        "$cmake" --build "$second" --parallel 2 "${targets[@]}"
} >"$work/build.log" 2>&1 || {
    tail -n 20 "$work/build.log"
    fail "the second build failed"
}

compared=0
while IFS= read -r -d '' file; do
    cmp "$file" "$build/${file#"$second/"}" || fail "two builds differ"
    compared=$((compared + 1))
done < <(find "$second" -type f \( -name '*.so*' -o -name '*.a' -o -name tessel \
    -o -name '*.gz' \) -print0)
((compared > 0)) || fail "nothing was built"
echo "$compared files are equal"
(($# == 0)) || exit 0

export SOURCE_DATE_EPOCH=1000000000
for folder in "$build" "$second"; do
    "${cmake%cmake}cpack" -G DEB --config "$folder/CPackConfig.cmake" \
        -B "$work/${folder##*/}" >>"$work/build.log"
done
for package in "$work/packages"/*.deb; do
    cmp "$package" "$work/${build##*/}/${package##*/}" ||
        fail "two packages differ"
done
echo "the packages are equal"
