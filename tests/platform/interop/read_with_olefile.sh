#!/usr/bin/env bash
# Reads the sample compound file with Python's olefile, strictly: any defect it notices fails.
# Exits 77 (skipped) when no Python with olefile is installed (Debian's python3-olefile).
set -euo pipefail
file=$1
for python in /usr/bin/python3 python3; do
    if "$python" -c 'import olefile' >/dev/null 2>&1; then
        exec "$python" "$(dirname "$0")/read_with_olefile.py" "$file"
    fi
done
echo "no Python with olefile is installed (python3-olefile)"
exit 77
