#!/usr/bin/env bash
# Builds and runs every test gate: the whole suite in the default and the asan+ubsan presets,
# the suites whose code runs on several threads under tsan (no Qt: Debian's Qt is not built
# for it), and each fuzz target for a short fixed time. Any failure, sanitizer report or fuzzer
# finding fails the run. Each stage prints its start time.
set -euo pipefail
cd "$(dirname "$0")/.."

stage() {
    echo "=== $1 ($(date -u +%H:%M:%S))"
}

stage "default"
cmake --workflow --preset default

stage "asan-ubsan"
cmake --workflow --preset asan-ubsan

stage "tsan"
cmake --preset tsan
threaded=(headless_tests commands_tests sim_tests session_tests hostile_tests fault_matrix_tests
          troubleshooter_tests)
cmake --build --preset tsan --target "${threaded[@]}" tessel_sim harbor_hostile harbor_resources
for suite in "${threaded[@]}"; do
    echo "--- tsan: $suite"
    TSAN_OPTIONS="halt_on_error=1:second_deadlock_stack=1" build/tsan/bin/"$suite" --gtest_brief=1
done

stage "fuzz"
cmake --preset fuzz
fuzz/run-all.sh build/fuzz "${HARBOR_FUZZ_SECONDS:-10}"

stage "done"
