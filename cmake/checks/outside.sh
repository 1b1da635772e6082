#!/bin/bash
# Usage: outside.sh CXX BUILD_FOLDER
# Builds a program on the core with one plain compiler line, as a project without
# our build files would, and runs it. Two more take the core as that line compiled
# it: one on the store of paths, and one on pathtree/ and packing/ alone, since
# the tree and its stored form need no other room.
set -euo pipefail
mkdir -p "$2"
rm -f "$2"/main*
"$1" -std=c++20 -I. packing/*.cpp pathtree/*.cpp coder/*.cpp \
    tests/outside/main.cpp -o "$2/main" -lz -pthread -save-temps=obj
"$2/main"
rm "$2"/main*-main.o
"$1" -std=c++20 -I. "$2"/main*.o paths/*.cpp \
    tests/outside/store.cpp -o "$2/store" -lz -pthread
(cd "$2" && ./store)
tree=()
for source in packing/*.cpp pathtree/*.cpp; do
    tree+=("$2/main-$(basename "$source" .cpp).o")
done
"$1" -std=c++20 -I. "${tree[@]}" tests/pathtree/outside.cpp -o "$2/tree" \
    -lz -pthread
"$2/tree"
