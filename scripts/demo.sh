#!/usr/bin/env bash
# A short tavctl session against the embedded virtual controller: identity,
# the name, the clock, the motors state and the operation mode with its auto
# conditions, events as they arrive, two clients contending for mastership,
# messages through the echo slot, the wire trace, one asynchronous call and
# one failure.
# Usage: scripts/demo.sh BUILD_FOLDER
set -euo pipefail
build="${1:?usage: demo.sh BUILD_FOLDER}"
tavctl="$build/tools/tavctl"
if [[ ! -x "$tavctl" ]]; then
  echo "demo.sh: $tavctl is not built" >&2
  exit 1
fi
# tavctl reads no registry entry for the embedded controller; a private
# registry file keeps the user's own out of reach all the same.
registry_dir="$(mktemp -d)"
trap 'rm -rf "$registry_dir"' EXIT
export TAV_REGISTRY_FILE="$registry_dir/registry"

section() { printf '\n== %s\n' "$*"; }
status=0

section "Which controller: tavctl version; tavctl version name; tavctl guid"
"$tavctl" version || status=1
"$tavctl" version name || status=1
"$tavctl" guid || status=1

section "One session (tavctl --echo batch): name, clock, state and mode, with events"
"$tavctl" --echo --keep-going batch <<'COMMANDS' || status=1
name get
name set "Cell 7 welding"
name get
clock set 2026-11-21T02:30:00Z
clock get
# Events are printed, time-stamped, as they arrive from the controller.
watch start --type state,mode
state set MotorsOn
watch wait --count 1 --timeout 5
state get
# A change to automatic stops the motors and waits for the pending auto
# conditions to be answered, by their IDs.
mode set Auto
watch wait --count 3 --timeout 5
mode get
autocond ack 3 reset
autocond ack 2 keep
autocond ack 1 reset
watch wait --count 6 --timeout 5
mode get
watch stop
COMMANDS

section "Two clients contend for mastership (--client N in a batch), as JSON"
"$tavctl" --echo --keep-going --json batch <<'COMMANDS' || true
user logon
--client 2 user logon
master request cfg
--client 2 master request cfg
--client 2 master get cfg
COMMANDS

section "Messages through the echo slot: tavctl ipc ping --count 1000"
"$tavctl" ipc ping --count 1000 || status=1

section "What went over the wire: tavctl --trace name get"
"$tavctl" --trace name get || status=1

section "An asynchronous call: tavctl --async clock get"
"$tavctl" --async clock get || status=1

section "A refused request: tavctl state set GuardStop"
if "$tavctl" state set GuardStop; then
  status=1
else
  echo "(tavctl exited with $?)"
fi

exit "$status"
