#!/usr/bin/env bash
# A long fuzzing run of every target (or of those named), one after the other
# on one core: RUNS executions each (default ten million). The corpus grows in
# build/fuzz/fuzz/corpus/<target>; a fault leaves its input in
# build/fuzz/fuzz/artifacts/<target>/ and the run of that target stops.
# Logs go to build/fuzz/fuzz/logs/<target>.log.
set -uo pipefail
cd "$(dirname "$0")/.."
runs=${RUNS:-10000000}
targets=("$@")
((${#targets[@]})) || targets=(unpack command registry)
declare -A dictionary=([unpack]=reply_grammar [command]=commands [registry]=registry)
# A registry file writes every key's whole path, so its cost grows with the
# square of the nesting; half a kilobyte nests deep enough for every rule.
declare -A limits=([unpack]=4096 [command]=4096 [registry]=512)
cmake --preset fuzz >/dev/null && cmake --build --preset fuzz || exit 1
out=build/fuzz/fuzz
mkdir -p "$out/logs"
status=0
for target in "${targets[@]}"; do
  mkdir -p "$out/corpus/$target" "$out/artifacts/$target"
  echo "=== $target: $runs executions"
  "$out/tav_fuzz_$target" -runs="$runs" -max_len="${limits[$target]}" -print_final_stats=1 \
    -dict="fuzz/dictionaries/${dictionary[$target]}.dict" -artifact_prefix="$out/artifacts/$target/" \
    "$out/corpus/$target" "fuzz/seeds/$target" "fuzz/regression/$target" >"$out/logs/$target.log" 2>&1 || status=1
  grep -E '^#[0-9]+.*(DONE|pulse)|stat::|Done [0-9]+ runs' "$out/logs/$target.log" | tail -12
done
exit $status
