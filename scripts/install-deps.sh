#!/usr/bin/env bash
# Installs the Debian packages the build and the tests need, only those missing.
set -euo pipefail
packages=(
  cmake ninja-build g++ python3
  googletest libbenchmark-dev
  mingw-w64-tools wine64-tools
)
case "${1:-all}" in
  main) ;;
  all) packages+=(g++-mingw-w64-x86-64 wine64 qemu-user g++-arm-linux-gnueabihf libc6-dev-armhf-cross
                 clang-16 libclang-rt-16-dev) ;;
  *) echo "usage: $0 [main|all]" >&2; exit 2 ;;
esac
missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done
if ((${#missing[@]})); then
  echo "Installing: ${missing[*]}"
  sudo_cmd=()
  [[ $(id -u) -eq 0 ]] || sudo_cmd=(sudo)
  export DEBIAN_FRONTEND=noninteractive
  "${sudo_cmd[@]}" apt-get update -q
  "${sudo_cmd[@]}" apt-get install -y -q --no-install-recommends "${missing[@]}"
fi
