#!/usr/bin/env bash
# Runs every benchmark of the bench preset's build and prints one table: each figure, the
# baseline measured in the same run, their ratio, the goal and whether it is met. Builds
# nothing: configure and build with `cmake --preset bench && cmake --build --preset bench`.
#
#   bench/run-all.sh [build-dir]      (default: build/bench)
#   REPETITIONS=9 bench/run-all.sh    (repetitions of each benchmark; medians are reported)
set -euo pipefail

root="$(cd "$(dirname "$0")/.." && pwd)"
build="${1:-$root/build/bench}"
bin="$build/bin"
repetitions="${REPETITIONS:-5}"
out="$(mktemp -d "${TMPDIR:-/tmp}/harbor-bench.XXXXXX")"
trap 'rm -rf "$out"' EXIT

for program in bench_core bench_qt bench_startup; do
    if [[ ! -x "$bin/$program" ]]; then
        echo "run-all.sh: $bin/$program is missing; build the bench preset first" >&2
        exit 2
    fi
done

export QT_QPA_PLATFORM=offscreen
echo "machine: $(nproc) cores, $(free -m | awk '/^Mem:/ {print $2}') MiB memory," \
     "load $(cut -d' ' -f1-3 /proc/loadavg), $(date -u '+%Y-%m-%d %H:%M UTC')"
for program in bench_core bench_qt bench_startup; do
    echo "running $program ($repetitions repetitions)..." >&2
    if ! "$bin/$program" --benchmark_repetitions="$repetitions" \
        --benchmark_report_aggregates_only=true \
        --benchmark_out="$out/$program.json" --benchmark_out_format=json \
        >"$out/$program.log" 2>&1; then
        cat "$out/$program.log" >&2
    fi
done

python3 - "$out" <<'PY'
import json, pathlib, sys

medians = {}
for path in pathlib.Path(sys.argv[1]).glob("*.json"):
    for run in json.loads(path.read_text())["benchmarks"]:
        if run.get("aggregate_name") == "median":
            medians[run["run_name"].split("/")[0]] = run

def seconds(name):
    run = medians[name]
    scale = {"ns": 1e-9, "us": 1e-6, "ms": 1e-3, "s": 1.0}[run["time_unit"]]
    return run["real_time"] * scale

def cpu(name):
    run = medians[name]
    scale = {"ns": 1e-9, "us": 1e-6, "ms": 1e-3, "s": 1.0}[run["time_unit"]]
    return run["cpu_time"] * scale

def counter(name, key):
    return medians[name][key]

def ms(value):
    if value >= 1e-3:
        return f"{value * 1e3:.2f} ms"
    return f"{value * 1e6:.1f} us" if value >= 1e-6 else f"{value * 1e9:.0f} ns"

rows = []
failed = False

def row(what, figure, baseline, ratio, goal, ok, cpu_ratio=None):
    global failed
    verdict = "report" if ok is None else ("pass" if ok else "FAIL")
    failed = failed or ok is False
    cpu_text = "-" if cpu_ratio is None else f"{cpu_ratio:.2f}x"
    rows.append((what, figure, baseline, f"{ratio:.2f}x", cpu_text, goal, verdict))

def guarded(what, make):
    try:
        make()
    except KeyError as missing:
        global failed
        failed = True
        rows.append((what, "no result", f"({missing} missing)", "-", "-", "-", "FAIL"))

def startup():
    # The baseline is launched in turn with harbor within the same benchmark.
    h, b = seconds("BM_StartupHarbor"), counter("BM_StartupHarbor", "baseline_ms") / 1e3
    hc = counter("BM_StartupHarbor", "cpu_ms_per_run")
    bc = counter("BM_StartupHarbor", "baseline_cpu_ms_per_run")
    row("start-up to shown window, immediate link", f"{ms(h)} (cpu {hc:.0f} ms a run)",
        f"{ms(b)} (cpu {bc:.0f} ms a run)", h / b, "<= 1.5x", h / b <= 1.5, hc / bc)
    d = seconds("BM_StartupHarborDefaultLink")
    db = counter("BM_StartupHarborDefaultLink", "baseline_ms") / 1e3
    row("start-up, default simulated link (15 ms an exchange)", ms(d), ms(db), d / db, "report",
        None)
    hm = counter("BM_StartupHarbor", "peak_rss_KiB")
    bm = counter("BM_StartupHarbor", "baseline_peak_rss_KiB")
    row("start-up peak RSS", f"{hm / 1024:.1f} MiB", f"{bm / 1024:.1f} MiB", hm / bm, "<= 1.5x",
        hm / bm <= 1.5)

def stress():
    h, b = seconds("BM_StressHeadless"), seconds("BM_StressBaselineDirect")
    row("stress test, 100 iterations, headless", ms(h), ms(b), h / b, "<= 1.10x", h / b <= 1.10)

def stall():
    s = seconds("BM_DownloadLongestStall")
    busy = counter("BM_DownloadLongestStall", "stall_cpu_ms")
    row("longest loop stall, 1,000-command download",
        f"{ms(s)} (loop's own cpu {busy:.1f} ms)", "16 ms frame", s / 0.016, "<= 1.0x",
        s <= 0.016)

def text():
    t, b = seconds("BM_TextMemoryWriteRead"), seconds("BM_TextMemoryBaselineMemcpy")
    rate = 16 * 1024 * 1024 / t / 1e6
    cpu_rate = 16 * 1024 * 1024 / cpu("BM_TextMemoryWriteRead") / 1e6
    row("text memory file write+read, 16 MiB",
        f"{ms(t)} ({rate:.0f} MB/s; cpu {cpu_rate:.0f} MB/s)", ms(b), t / b, ">= 250 MB/s",
        rate >= 250, cpu("BM_TextMemoryWriteRead") / cpu("BM_TextMemoryBaselineMemcpy"))

def find():
    t, b = seconds("BM_FindPath"), seconds("BM_FindPathBaselineMap")
    row("find, 4 components, 16x16x16 tree", ms(t), ms(b), t / b, "report", None,
        cpu("BM_FindPath") / cpu("BM_FindPathBaselineMap"))

def translate():
    t, b = seconds("BM_Translate10kLines"), seconds("BM_Translate10kLinesBaselineRead")
    row("translation of 10,000 lines", f"{ms(t)} (cpu {ms(cpu('BM_Translate10kLines'))})",
        ms(b), t / b, "<= 20 ms", t <= 0.020,
        cpu("BM_Translate10kLines") / cpu("BM_Translate10kLinesBaselineRead"))

def editor():
    t, b = seconds("BM_ReadEditorText"), seconds("BM_ReadEditorTextBaselineCopy")
    row("ReadEditorText, 1 MiB editor", ms(t), ms(b), t / b, "report", None,
        cpu("BM_ReadEditorText") / cpu("BM_ReadEditorTextBaselineCopy"))

for what, make in [("start-up", startup), ("stress test", stress), ("loop stall", stall),
                   ("text memory file", text), ("find", find), ("translation", translate),
                   ("ReadEditorText", editor)]:
    guarded(what, make)

header = ("what", "figure (median)", "baseline (same run)", "ratio", "cpu ratio", "goal",
          "result")
widths = [max(len(str(r[i])) for r in rows + [header]) for i in range(len(header))]
for line in [header, tuple("-" * w for w in widths)] + rows:
    print("| " + " | ".join(str(cell).ljust(width) for cell, width in zip(line, widths)) + " |")
sys.exit(1 if failed else 0)
PY
