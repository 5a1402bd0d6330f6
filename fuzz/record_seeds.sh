#!/usr/bin/env bash
# Records the seeds of the decoder and command targets again from the virtual
# controller (run it when the controller answers more commands, or when a
# decoder row is added). The registry seeds are written by hand.
set -euo pipefail
cd "$(dirname "$0")/.."
preset=${1:-fuzz}
cmake --preset "$preset" >/dev/null
cmake --build --preset "$preset" --target tav_fuzz_record_seeds
"build/$preset/fuzz/tav_fuzz_record_seeds" fuzz/seeds
