#!/usr/bin/env bash
# Runs a Windows executable under Wine in a throw-away prefix beside the build.
# The first run initialises the prefix; later runs reuse it.
set -euo pipefail
build_dir="${TAV_WINE_BUILD_DIR:-$(pwd)}"
while [[ ! -f "$build_dir/CMakeCache.txt" && "$build_dir" != "/" ]]; do build_dir="$(dirname "$build_dir")"; done
[[ -f "$build_dir/CMakeCache.txt" ]] || build_dir="$(pwd)"
export WINEPREFIX="$build_dir/wineprefix"
export WINEDEBUG="${WINEDEBUG:--all}"
export WINEDLLOVERRIDES="${WINEDLLOVERRIDES:-mscoree,mshtml=}"
export WINEARCH=win64
unset DISPLAY
# Debian's wine64 package keeps its programs out of PATH.
export PATH="$PATH:/usr/lib/wine"
wine="$(command -v wine64 || command -v wine)"
wineserver="$(command -v wineserver64 || command -v wineserver || true)"
if [[ ! -f "$WINEPREFIX/system.reg" ]]; then
  mkdir -p "$WINEPREFIX"
  (
    flock 9
    if [[ ! -f "$WINEPREFIX/system.reg" ]]; then
      "$wine" wineboot --init >/dev/null 2>&1 || true
      [[ -n "$wineserver" ]] && "$wineserver" -w || true
    fi
  ) 9>"$build_dir/wineprefix.lock"
fi
exec "$wine" "$@"
