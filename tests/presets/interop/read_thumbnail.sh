#!/usr/bin/env bash
# Reads the thumbnail sample with a standard tool: "gsf" (libgsf's tool) lists the summary stream
# and shows its property set header; "olefile" (Python's) reads the properties. Exits 77
# (skipped) when the tool is not installed.
set -euo pipefail
tool=$1 file=$2
if [ "$tool" = olefile ]; then
    for python in /usr/bin/python3 python3; do
        if "$python" -c 'import olefile' >/dev/null 2>&1; then
            exec "$python" "$(dirname "$0")/read_thumbnail_with_olefile.py" "$file"
        fi
    done
    echo "no Python with olefile is installed (python3-olefile)"
    exit 77
fi
command -v gsf >/dev/null 2>&1 || { echo "gsf is not installed (libgsf-bin)"; exit 77; }
listing=$(gsf list "$file")
grep -Eq '^f +[0-9]+ +.SummaryInformation$' <<<"$listing" || { echo "no summary stream listed"; echo "$listing"; exit 1; }
bytes=$(gsf cat "$file" $'\005SummaryInformation' | od -An -v -tx1 | tr -d ' \n')
head=${bytes:0:96}
# Byte order mark, then at 28 the summary format identifier.
[ "${head:0:4}" = feff ] || { echo "not a property set: $head"; exit 1; }
[ "${head:56:32}" = e0859ff2f94f6810ab9108002b27b3d9 ] || { echo "not the summary set: $head"; exit 1; }
echo "gsf reads the thumbnail's summary stream"
