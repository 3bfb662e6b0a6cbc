#!/usr/bin/env bash
# A ".reg" export of the POSIX store imports into the system's registry under wine, and the
# system's registry editor exports the same key in a form that imports back into a POSIX store
# unchanged. Skipped (exit 77) where wine is not installed.
#
#   registry_wine_interop.sh REGISTRY_CHILD WINE_PREFIX
set -euo pipefail
child=$1
command -v wine >/dev/null 2>&1 || { echo "wine is not installed: skipped"; exit 77; }

# The run's own prefix, kept between runs like cmake/wine-ctest keeps it.
export WINEPREFIX=$2
export WINEDEBUG=-all
export WINEDLLOVERRIDES="winemenubuilder.exe=d;mscoree=d;mshtml=d"
work=$(mktemp -d)
key="Software\\ut-tests\\interop-$$-$RANDOM"
finish() {
    wine reg delete "HKEY_CURRENT_USER\\$key" /f </dev/null >/dev/null 2>&1 || true
    wineserver -k >/dev/null 2>&1 || true
    rm -rf "$work"
}
trap finish EXIT
mkdir -p "$WINEPREFIX"
wineserver -p </dev/null >/dev/null 2>&1
if [ -f "$WINEPREFIX/system.reg" ]; then
    wineboot </dev/null >/dev/null 2>&1
else
    wineboot -i </dev/null >/dev/null 2>&1
fi

cd "$work"
UT_REGISTRY=$work/first.db "$child" populate "$key"
UT_REGISTRY=$work/first.db "$child" export "$key" ours.reg
wine regedit /S ours.reg </dev/null
wine regedit /E system.reg "HKEY_CURRENT_USER\\$key" </dev/null
[ -s system.reg ] || { echo "the system's registry editor exported nothing"; exit 1; }
UT_REGISTRY=$work/second.db "$child" import system.reg
UT_REGISTRY=$work/second.db "$child" export "$key" back.reg
if ! cmp -s ours.reg back.reg; then
    echo "the key changed on its way through the system's registry:"
    diff <(iconv -f UTF-16LE -t UTF-8 ours.reg) <(iconv -f UTF-16LE -t UTF-8 back.reg) || true
    exit 1
fi
echo "round trip through wine's registry: unchanged ($(stat -c %s ours.reg) bytes)"
