#!/usr/bin/env bash
# Runs one headless session of harbor under valgrind and fails on any memory error or leak.
#
#   valgrind-session.sh HARBOR SCENARIO
#
# The session (SCENARIO: tests/soak/valgrind.sim) opens the port, tests the brick, validates,
# downloads and executes (waiting and in the background), switches reception on and off; then
# the tower is pulled out, Upload fails, the Trouble Shooter's offer is answered yes, its
# diagnosis runs and its help is shown and closed; the port is opened again for the info
# report.
set -euo pipefail
harbor="$(realpath "$1")"
scenario="$(realpath "$2")"
if ! command -v valgrind >/dev/null 2>&1; then
    echo "valgrind-session: valgrind is not installed" >&2
    exit 77
fi
work="$(mktemp -d)"
trap 'rm -rf "$work"' EXIT
cat >"$work/session.txt" <<'COMMANDS'
Test
Statistics
Editor program p { main { sound 4 } }
Validate
Download
Editor sound 4
Execute
Execute Async
Receive on
Receive off
Answer yes
Upload
Help 2000
Open
Info
Close
COMMANDS
cd "$work"
# Exit status 1 of harbor only says a command failed (the Upload, on purpose); valgrind's own
# status 99 says it found something.
status=0
TESSEL_SIM="$scenario" valgrind --error-exitcode=99 --leak-check=full --show-leak-kinds=definite,indirect,possible \
    --errors-for-leak-kinds=definite,indirect,possible --track-fds=no --num-callers=30 \
    "$harbor" --headless --fixed-time --timeout 600000 --script "$work/session.txt" \
    >"$work/transcript.txt" 2>"$work/valgrind.txt" || status=$?
cat "$work/transcript.txt"
if [[ $status -ne 0 && $status -ne 1 ]]; then
    cat "$work/valgrind.txt" >&2
    echo "valgrind-session: valgrind reported errors or leaks (status $status)" >&2
    exit 1
fi
grep -E "ERROR SUMMARY|definitely lost|indirectly lost|possibly lost" "$work/valgrind.txt" || true
# The session must have got through to the Trouble Shooter's help.
grep -q '^\[help\] topic' "$work/transcript.txt" || { echo "valgrind-session: no Trouble Shooter help shown" >&2; exit 1; }
grep -q '^done: 16 commands, 1 failed' "$work/transcript.txt" || { echo "valgrind-session: the session did not run as planned" >&2; exit 1; }
echo "valgrind-session: no errors, no leaks"
