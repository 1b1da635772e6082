#!/bin/bash
# Usage: outside-tree.sh CXX BUILD_FOLDER
# Builds a program on pathtree/ and packing/ alone with one plain compiler
# line, and runs it: the tree and its stored form need no other room.
set -euo pipefail
mkdir -p "$2"
"$1" -std=c++20 -I. packing/*.cpp pathtree/*.cpp tests/pathtree/outside.cpp \
    -o "$2/tree" -lz
"$2/tree"
