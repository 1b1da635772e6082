#!/bin/bash
# Breaks each rule of includes.sh once, in a small tree of its own, and
# expects each breach, and nothing else, to be reported.
set -euo pipefail
checker=$PWD/cmake/checks/includes.sh
tree=$(mktemp -d)
trap 'rm -rf "$tree"' EXIT
cd "$tree"
mkdir -p packing pathtree coder paths archive binding hosts/small \
    qztessel

# Writes a file that includes each of the given headers.
including() {
    local file=$1
    shift
    printf '#include "%s"\n' "$@" >"$file"
}
for header in packing/sixpacks pathtree/BPathTree coder/HuffmanPathTree \
    paths/PathStore archive/PathArchive binding/HostInterface binding/Methods \
    hosts/small/Host qztessel/Version; do
    echo '#include <vector>' >"$header.hpp"
done

including pathtree/good.cpp packing/sixpacks.hpp pathtree/BPathTree.hpp
including coder/good.cpp packing/sixpacks.hpp pathtree/BPathTree.hpp
including binding/good.cpp binding/HostInterface.hpp coder/HuffmanPathTree.hpp
including paths/good.cpp coder/HuffmanPathTree.hpp packing/sixpacks.hpp
including archive/good.cpp packing/sixpacks.hpp archive/PathArchive.hpp
including hosts/small/good.cpp binding/HostInterface.hpp hosts/small/Host.hpp \
    paths/PathStore.hpp archive/PathArchive.hpp qztessel/Version.hpp
including qztessel/good.hpp paths/PathStore.hpp archive/PathArchive.hpp
"$checker" . || {
    echo "a tree without a breach is refused"
    exit 1
}

including packing/bad1.cpp pathtree/BPathTree.hpp
including pathtree/bad2.cpp coder/HuffmanPathTree.hpp
including coder/bad3.cpp binding/HostInterface.hpp
including binding/bad4.cpp hosts/small/Host.hpp
including hosts/small/bad5.cpp binding/Methods.hpp
including hosts/small/bad6.cpp coder/HuffmanPathTree.hpp
including pathtree/bad7.cpp BPathTree.hpp
echo '#  include <coder/HuffmanPathTree.hpp>' >pathtree/bad8.cpp
including archive/bad9.cpp pathtree/BPathTree.hpp
including paths/bad10.cpp archive/PathArchive.hpp
including binding/bad11.cpp paths/PathStore.hpp
including qztessel/bad12.cpp coder/HuffmanPathTree.hpp
echo '#include <vector>' >packing/bad13.hpp
including packing/bad13.cpp packing/sixpacks.hpp packing/bad13.hpp
if found=$("$checker" .); then
    echo "breaches are not refused"
    exit 1
fi
for number in {1..13}; do
    grep -q "/bad$number.cpp:1: " <<<"$found" || {
        echo "bad$number.cpp is not reported"
        exit 1
    }
done
(($(wc -l <<<"$found") == 13)) || {
    echo "more than the thirteen breaches are reported:"
    echo "$found"
    exit 1
}
