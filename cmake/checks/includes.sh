#!/bin/bash
# Usage: includes.sh ROOT
#
# Checks which folder includes which, and that each of our own headers is
# named by its path from the root. Prints every line that breaks a rule.
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
#   hosts/         paths, archive, qztessel, of binding its host interface alone
#   bench/ fuzz/ tests/ examples/   anything
set -euo pipefail
cd "$1"

# Prints what the given file may include, as a regular expression.
allowedFor() {
    case $1 in
    packing/*) echo 'packing/' ;;
    pathtree/*) echo '(packing|pathtree)/' ;;
    coder/*) echo '(packing|pathtree|coder)/' ;;
    paths/*) echo '(packing|pathtree|coder|paths)/' ;;
    archive/*) echo '(packing|archive)/' ;;
    binding/*) echo '(packing|pathtree|coder|binding)/' ;;
    qztessel/*) echo '(paths|archive|qztessel)/' ;;
    hosts/*)
        echo '(paths/|archive/|qztessel/|hosts/|binding/HostInterface\.hpp$)'
        ;;
    *) echo '' ;;
    esac
}

breaches=0
report() {
    echo "$1"
    breaches=$((breaches + 1))
}

# grep finds nothing in a folder without quoted includes: not a failure.
while IFS=: read -r file line text; do
    header=$(sed -E 's/^[^"<]*["<]([^">]*)[">].*/\1/' <<<"$text")
    if [[ $text != *'"'* ]]; then
        if [[ $header =~ ^(packing|pathtree|coder|paths|archive|binding|hosts)/ ]]; then
            report "$file:$line: <$header> is ours: quote it"
        fi
    elif [[ ! -f $header ]]; then
        report "$file:$line: \"$header\" is no path from the root"
    elif [[ ! $header =~ ^$(allowedFor "$file") ]]; then
        report "$file:$line: may not include \"$header\""
    fi
done < <(grep -rEn --include='*.?pp' '^[[:space:]]*#[[:space:]]*include' \
    packing pathtree coder paths archive binding hosts qztessel bench fuzz \
    tests examples 2>/dev/null || true)

((breaches == 0))
