#!/bin/bash
# Usage: includes.sh ROOT
#
# Checks which folder includes which, that each of our own headers is named by
# its path from the root, and that a source includes the header of its name before
# all others, which shows that the header needs nothing before it. Prints every
# line that breaks a rule.
#
# Each room includes itself and those before it, in one straight order:
#
#   packing/       nothing else of ours
#   pathtree/      packing
#   coder/         packing pathtree
#   paths/         packing pathtree coder
#   archive/       packing
#   binding/       packing pathtree coder
#   qztessel/      paths, archive: the headers that users include first
#   hosts/         paths, archive, qztessel; of binding its host interface alone,
#                  of packing FunctionRef
#   bench/ fuzz/ tests/ examples/   anything
set -euo pipefail
cd "$1"

# Sets `allowed` to what the given file may include, as a regular expression.
findAllowed() {
    case $1 in
    packing/*) allowed='packing/' ;;
    pathtree/*) allowed='(packing|pathtree)/' ;;
    coder/*) allowed='(packing|pathtree|coder)/' ;;
    paths/*) allowed='(packing|pathtree|coder|paths)/' ;;
    archive/*) allowed='(packing|archive)/' ;;
    binding/*) allowed='(packing|pathtree|coder|binding)/' ;;
    qztessel/*) allowed='(paths|archive|qztessel)/' ;;
    hosts/*)
        allowed='paths/|archive/|qztessel/|hosts/'
        allowed="($allowed|binding/HostInterface\.hpp$|packing/FunctionRef\.hpp$)"
        ;;
    *) allowed='' ;;
    esac
}

breaches=0
report() {
    echo "$1"
    breaches=$((breaches + 1))
}

# The file of the line before.
previous=

# grep finds nothing in a folder without quoted includes: not a failure.
named='["<]([^">]*)[">]'
while IFS=: read -r file line text; do
    [[ $text =~ $named ]] || continue
    header=${BASH_REMATCH[1]}
    findAllowed "$file"
    if [[ $file != "$previous" && -f ${file%.cpp}.hpp && $file == *.cpp &&
        $header != "${file%.cpp}.hpp" ]]; then
        report "$file:$line: include \"${file%.cpp}.hpp\" first"
    fi
    previous=$file
    if [[ $text != *'"'* ]]; then
        if [[ $header =~ ^(packing|pathtree|coder|paths|archive|binding|hosts)/ ]]; then
            report "$file:$line: <$header> is ours: quote it"
        fi
    elif [[ ! -f $header ]]; then
        report "$file:$line: \"$header\" is no path from the root"
    elif [[ ! $header =~ ^$allowed ]]; then
        report "$file:$line: may not include \"$header\""
    fi
done < <(grep -rEn --include='*.?pp' '^[[:space:]]*#[[:space:]]*include' \
    packing pathtree coder paths archive binding hosts qztessel bench fuzz \
    tests examples 2>/dev/null || true)

((breaches == 0))
