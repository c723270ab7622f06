#!/usr/bin/env bash
# Runs every fuzz target for a fixed short time against its seed corpus and fails when one
# finds a crash, a leak or a sanitizer report.
#
#   fuzz/run-all.sh [BUILD_DIR] [SECONDS]
#
# BUILD_DIR is a build configured with -DHARBOR_BUILD_FUZZERS=ON (default build/fuzz); the
# targets are built first. SECONDS is the time per target (default 25). New inputs found go to
# a scratch corpus, never into the checked-in seeds; a crashing input is kept in
# BUILD_DIR/fuzz/artifacts/ for reproduction (run the target with that file as argument).
set -euo pipefail
here="$(cd "$(dirname "$0")" && pwd)"
build="${1:-$here/../build/fuzz}"
seconds="${2:-25}"

cmake --build "$build" --target fuzzers -j"${FUZZ_JOBS:-2}"

bin="$build/fuzz"
artifacts="$bin/artifacts"
scratch="$(mktemp -d)"
trap 'rm -rf "$scratch"' EXIT
mkdir -p "$artifacts"

export ASAN_OPTIONS="${ASAN_OPTIONS:-detect_leaks=1:abort_on_error=1}"
export UBSAN_OPTIONS="${UBSAN_OPTIONS:-print_stacktrace=1:halt_on_error=1}"

failed=()
for seeds in "$here"/corpus/*/; do
    target="$(basename "$seeds")"
    if [[ ! -x "$bin/$target" ]]; then
        echo "fuzz: $target is not built" >&2
        failed+=("$target")
        continue
    fi
    mkdir -p "$scratch/$target"
    echo "fuzz: $target for ${seconds}s"
    # -timeout: one input taking longer than 10 s counts as a hang; -rss_limit_mb bounds memory.
    if ! "$bin/$target" "$scratch/$target" "$seeds" -max_total_time="$seconds" -timeout=10 \
        -rss_limit_mb=2048 -max_len=4096 -print_final_stats=1 \
        -artifact_prefix="$artifacts/$target-" >"$scratch/$target.log" 2>&1; then
        tail -n 60 "$scratch/$target.log" >&2
        failed+=("$target")
    else
        grep -E '^stat::number_of_executed_units|^Done ' "$scratch/$target.log" || true
    fi
done

if ((${#failed[@]} > 0)); then
    echo "fuzz: FAILED: ${failed[*]}" >&2
    exit 1
fi
echo "fuzz: all targets ran ${seconds}s without a finding"
