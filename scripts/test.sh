#!/usr/bin/env bash
# Install what is missing, build all three ways and run every test:
# native Linux with ASan/UBSan/LSan and with ThreadSanitizer, the Windows DLL
# under Wine, and 32-bit ARM under qemu-user; then the fuzz targets, each for
# TAV_FUZZ_SECONDS (default 20), and the replay of their kept inputs. The
# soak runs TAV_SOAK_SECONDS (default 20) in each sanitizer build.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh all
export TAV_SOAK_SECONDS="${TAV_SOAK_SECONDS:-20}"
presets=(${TAV_PRESETS:-linux linux-tsan arm mingw fuzz})
# ThreadSanitizer runs the suites whose objects are called from many threads,
# and the soak.
tsan_suites=(core module sim e2e enumerators ipc)
tsan_targets=($(printf 'tav_%s_tests ' "${tsan_suites[@]}") tav_soak_tests)
for preset in "${presets[@]}"; do
  echo "=== ${preset}: configure and build (at ${SECONDS} s)"
  cmake --preset "$preset" >/dev/null
  if [[ "$preset" == linux-tsan ]]; then
    cmake --build --preset "$preset" --target "${tsan_targets[@]}"
    echo "=== ${preset}: test (at ${SECONDS} s)"
    ctest --preset "$preset" -R "^($(IFS='|'; echo "${tsan_suites[*]}")|soak)\$"
  elif [[ "$preset" == fuzz ]]; then
    cmake -B build/fuzz -DTAV_FUZZ_SECONDS="${TAV_FUZZ_SECONDS:-20}" >/dev/null
    cmake --build --preset "$preset"
    echo "=== ${preset}: short runs and replay (at ${SECONDS} s)"
    ctest --preset "$preset"
  else
    cmake --build --preset "$preset"
    echo "=== ${preset}: test (at ${SECONDS} s)"
    ctest --preset "$preset"
  fi
done
echo "=== all presets passed: ${presets[*]} (${SECONDS} s)"
