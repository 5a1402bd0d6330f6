#!/usr/bin/env bash
# The main job: install what is missing, build optimised, and run a short
# tavctl session against the embedded virtual controller.
set -euo pipefail
cd "$(dirname "$0")/.."
bash scripts/install-deps.sh main
cmake --preset release >/dev/null
cmake --build --preset release
exec bash scripts/demo.sh build/release
