#!/usr/bin/env bash
# Install what is missing, build all three ways and run every test:
# native Linux with ASan/UBSan/LSan and with ThreadSanitizer, the Windows DLL
# under Wine, and 32-bit ARM under qemu-user.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh all
presets=(${TAV_PRESETS:-linux linux-tsan arm mingw})
# ThreadSanitizer runs the suites whose objects are called from many threads.
tsan_suites=(core module sim e2e enumerators ipc)
for preset in "${presets[@]}"; do
  echo "=== ${preset}: configure and build (at ${SECONDS} s)"
  cmake --preset "$preset" >/dev/null
  if [[ "$preset" == linux-tsan ]]; then
    cmake --build --preset "$preset" --target $(printf 'tav_%s_tests ' "${tsan_suites[@]}")
    echo "=== ${preset}: test (at ${SECONDS} s)"
    ctest --preset "$preset" -R "^($(IFS='|'; echo "${tsan_suites[*]}"))\$"
  else
    cmake --build --preset "$preset"
    echo "=== ${preset}: test (at ${SECONDS} s)"
    ctest --preset "$preset"
  fi
done
echo "=== all presets passed: ${presets[*]} (${SECONDS} s)"
