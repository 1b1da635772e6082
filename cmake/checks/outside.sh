#!/bin/bash
# Usage: outside.sh CXX BUILD_FOLDER
# Builds one program on the core and one on the store of paths, each with one
# plain compiler line, as a project without our build files would, and runs
# them.
set -euo pipefail
mkdir -p "$2"
"$1" -std=c++20 -I. packing/*.cpp pathtree/*.cpp coder/*.cpp \
    tests/outside/main.cpp -o "$2/main" -lz -pthread
"$2/main"
"$1" -std=c++20 -I. packing/*.cpp pathtree/*.cpp coder/*.cpp paths/*.cpp \
    tests/outside/store.cpp -o "$2/store" -lz -pthread
cd "$2" && ./store
