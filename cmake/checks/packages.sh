#!/bin/bash
# Usage: packages.sh CMAKE BUILD_FOLDER WORK_FOLDER
#
# Makes the Debian packages from a finished build and looks at them: all that
# cmake --install copies is in one of them, lintian has no error, every library
# that a program needs is of a package that it depends on, the list of parts
# (SBOM) names what it depends on, the command runs from where the packages put
# it, and, as root, dpkg installs them into an empty root and purges them without
# a trace.
set -euo pipefail
cmake=$1 build=$2 work=$(realpath -m "$3")
root=$work/root
rm -rf "$work"
mkdir -p "$root"

fail() {
    echo "packages: $1"
    exit 1
}

"${cmake%cmake}cpack" -G DEB --config "$build/CPackConfig.cmake" -B "$work" \
    >"$work/cpack.log" 2>&1 || {
    cat "$work/cpack.log"
    fail "cpack failed"
}
packages=("$work"/*.deb)
names=$(for package in "${packages[@]}"; do
    dpkg-deb -f "$package" Package
    dpkg-deb -x "$package" "$root"
done | sort | xargs)
[[ $names == "libqztessel-dev libqztessel1 python3-qztessel tessel" ]] ||
    fail "these were made: $names"

"$cmake" --install "$build" --prefix "$work/all/usr" >/dev/null
missing=$(comm -23 <(cd "$work/all" && find usr | sort) \
    <(cd "$root" && find usr | sort))
[[ ! $missing ]] || fail "these are installed and in no package: $missing"

lintian --allow-root --fail-on error --tag-display-limit 0 "${packages[@]}" ||
    fail "lintian finds errors"

# Each library that an ELF file of a package asks for must come from one of
# the packages that it names.
checkDependencies() {
    local package=$1 folder=$2 named library owner owned
    named=" $(dpkg-deb -f "$package" Depends | tr -d ',')"
    while read -r library; do
        owned=
        while read -r owner; do
            [[ "$named " != *" $owner "* ]] || owned=1
        done < <(dpkg-query -S "*/$library" | sed -n 's/:.*//p' | sort -u)
        [[ $owned ]] ||
            fail "${package##*/} needs $library and names only:$named"
    done < <(find "$folder/usr" -type f \( -path '*/bin/*' -o -name '*.so*' \) \
        -exec readelf -d {} + | sed -n 's/.*(NEEDED).*\[\(.*\)\]/\1/p' |
        grep -v '^ld-linux' | sort -u)
}

# The list of parts has our package, its version and what it depends on, each
# with a version.
checkSbom() {
    local package=$1 folder=$2 name depends
    name=$(dpkg-deb -f "$package" Package)
    depends=$(dpkg-deb -f "$package" Depends | sed 's/([^)]*)//g' | tr -d ,)
    # shellcheck disable=SC2086  # the names are words
    /usr/bin/python3 -c '
import json, sys
document = json.load(open(sys.argv[1]))
parts = {part["name"]: part["versionInfo"] for part in document["packages"]}
assert parts[sys.argv[2]] == sys.argv[3], parts
ours = {name for name in sys.argv[4:] if name.startswith("libqztessel")}
missing = set(sys.argv[4:]) - set(parts) - ours
assert not missing, f"not in the list of parts: {missing}"
assert "NOASSERTION" not in parts.values(), parts
assert len(document["relationships"]) == len(parts), document
' "$folder/usr/share/doc/$name/sbom.spdx.json" "$name" \
        "$(dpkg-deb -f "$package" Version)" $depends ||
        fail "the list of parts of ${package##*/} is wrong"
}
for package in "${packages[@]}"; do
    folder=$work/one
    rm -rf "$folder"
    dpkg-deb -x "$package" "$folder"
    checkDependencies "$package" "$folder"
    checkSbom "$package" "$folder"
done

# ---- The command, where it was put ----

command=$root/usr/bin/tessel
version=$(dpkg-deb -f "${packages[0]}" Version)
[[ $("$command" --version) == "tessel $version" ]] ||
    fail "tessel --version does not say $version"
find "$root/usr" -not -type d | sort >"$work/list"
"$command" pack -q "$work/list" -o "$work/list.tessel"
"$command" list "$work/list.tessel" | cmp - "$work/list" ||
    fail "the list that tessel packed comes out changed"
for file in man/man1/tessel{,-pack}.1.gz bash-completion/completions/tessel \
    zsh/vendor-completions/_tessel fish/vendor_completions.d/tessel.fish \
    qztessel/messages/VELOX/datastoreio/huffmanpaths.messages; do
    [[ -f $root/usr/share/$file ]] || fail "no package has $file"
done

# ---- The Python package, where it was put ----

PYTHONDONTWRITEBYTECODE=1 PYTHONPATH=$root/usr/lib/python3/dist-packages \
    /usr/bin/python3 -c '
import sys
from qztessel import PathList
with open(sys.argv[1]) as lines:
    assert list(PathList.open(sys.argv[2])) == lines.read().split("\n")[:-1]
' "$work/list" "$work/list.tessel" || fail "the Python package does not work"
plugin=$(find "$root/usr/lib" -name libqztessel.so.1)
PYTHONDONTWRITEBYTECODE=1 PYTHONPATH=$root/usr/lib/python3/dist-packages \
    LD_LIBRARY_PATH=${plugin%/*} /usr/bin/python3 -c '
import os, sys
from qztessel import HostError, HuffmanPaths, load_plugin
assert os.path.samefile(load_plugin(), sys.argv[1]), load_plugin()
paths = HuffmanPaths("files", ["/", ["a"]])
paths.add_paths([["/"]], [["a"]])
assert paths.get_paths([1], "/") == ["/a"]
try:
    paths.add_paths([], [["a"]])
except HostError as error:
    assert str(error).startswith("The number of folders "), error
' "$plugin" || fail "the Python package does not find the plug-in"

# ---- In and out again ----

inRoot() {
    dpkg --root="$work/installed" --force-depends --force-script-chrootless \
        "$@" >>"$work/dpkg.log" 2>&1 || {
        cat "$work/dpkg.log"
        fail "dpkg $1 failed"
    }
}
if ((EUID == 0)); then
    mkdir -p "$work/installed/var/lib/dpkg"
    touch "$work/installed/var/lib/dpkg/status"
    inRoot --install "${packages[@]}"
    diff <(cd "$root" && find usr | sort) \
        <(cd "$work/installed" && find usr | sort) ||
        fail "what is installed is not what the packages hold"
    # shellcheck disable=SC2086  # the names are words
    inRoot --purge $names
    left=$(find "$work/installed" -path '*/var/lib/dpkg' -prune -o \
        -not -type d -print)
    [[ ! $left && ! -e $work/installed/usr ]] ||
        fail "left after purging: $left"
fi
