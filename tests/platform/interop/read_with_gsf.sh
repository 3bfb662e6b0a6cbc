#!/usr/bin/env bash
# Reads the sample compound file with libgsf's gsf tool: its listing and two streams' bytes.
# Exits 77 (skipped) when the tool is not installed.
set -euo pipefail
file=$1
command -v gsf >/dev/null 2>&1 || { echo "gsf is not installed (libgsf-bin)"; exit 77; }
listing=$(gsf list "$file")
for entry in "f 100 Contents" "f 10000 Big" "f 0 Empty" "d 0 Sub" "f 5 Sub/Inner" "f 3 n299"; do
    grep -Eq "^${entry// / +}\$" <<<"$listing" || { echo "missing from the listing: $entry"; echo "$listing"; exit 1; }
done
[ "$(grep -c ' n[0-9]*$' <<<"$listing")" = 300 ] || { echo "not all 300 small streams are listed"; exit 1; }
[ "$(gsf cat "$file" n123)" = 123 ] || { echo "n123 reads wrong"; exit 1; }
# Contents holds the bytes i * 7 + 1.
expected=$(awk 'BEGIN { for (i = 0; i < 100; i++) printf "%02x", (i * 7 + 1) % 256 }')
actual=$(gsf cat "$file" Contents | od -An -v -tx1 | tr -d ' \n')
[ "$actual" = "$expected" ] || { echo "Contents reads wrong"; exit 1; }
echo "gsf reads the sample"
