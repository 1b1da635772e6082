#!/bin/bash
# Usage: outside.sh CXX BUILD_FOLDER
# Builds a program on the core with one plain compiler line, as a project
# without our build files would, and runs it.
set -euo pipefail
mkdir -p "$2"
"$1" -std=c++20 -I. packing/*.cpp pathtree/*.cpp coder/*.cpp \
    tests/outside/main.cpp -o "$2/main" -lz -pthread
"$2/main"
