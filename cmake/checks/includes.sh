#!/bin/bash
# Usage: includes.sh ROOT
#
# Checks which folder includes which, and that each of our own headers is
# named by its path from the root. Prints every line that breaks a rule.
#
#   packing/sixpacks*        packing/sixpacks*
#   packing/ (stored forms)  packing pathtree coder
#   pathtree/                pathtree
#   coder/                   packing pathtree coder
#   binding/                 packing pathtree coder binding
#   hosts/NAME/              hosts, and of binding only its host interface
#   bench/ fuzz/ tests/      anything
set -euo pipefail
cd "$1"

# Prints what the given file may include, as a regular expression.
allowedFor() {
    case $1 in
    packing/sixpacks*) echo 'packing/sixpacks' ;;
    packing/*) echo '(packing|pathtree|coder)/' ;;
    pathtree/*) echo 'pathtree/' ;;
    coder/*) echo '(packing|pathtree|coder)/' ;;
    binding/*) echo '(packing|pathtree|coder|binding)/' ;;
    hosts/*) echo '(hosts/|binding/HostInterface\.hpp$)' ;;
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
        if [[ $header =~ ^(packing|pathtree|coder|binding|hosts)/ ]]; then
            report "$file:$line: <$header> is ours: quote it"
        fi
    elif [[ ! -f $header ]]; then
        report "$file:$line: \"$header\" is no path from the root"
    elif [[ ! $header =~ ^$(allowedFor "$file") ]]; then
        report "$file:$line: may not include \"$header\""
    fi
done < <(grep -rEn --include='*.?pp' '^[[:space:]]*#[[:space:]]*include' \
    packing pathtree coder binding hosts bench fuzz tests 2>/dev/null || true)

((breaches == 0))
