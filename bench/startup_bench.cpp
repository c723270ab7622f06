// Start-up of harbor to its shown window, and its peak resident memory, against a bare Qt
// program that shows one empty dialog, both started the same way and in turn: offscreen,
// from a fork, timed from the fork to the "shown" line each prints once its window is up.
#include <benchmark/benchmark.h>

#include <fcntl.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace {

// A child that never says "shown" within this is killed; the run is then an error.
constexpr int kGiveUpSeconds = 30;

struct Launch {
    bool shown = false;
    double secondsToShown = 0;
    long peakKiB = 0;
    double cpuSeconds = 0; // user and system time of the whole run, teardown included
};

Launch Run(const std::vector<std::string>& command)
{
    Launch launch;
    int out[2];
    if (pipe(out) != 0)
        return launch;
    const auto start = std::chrono::steady_clock::now();
    const pid_t child = fork();
    if (child == 0) {
        dup2(out[1], STDOUT_FILENO);
        close(out[0]);
        close(out[1]);
        const int null = open("/dev/null", O_WRONLY);
        if (null >= 0)
            dup2(null, STDERR_FILENO);
        std::vector<char*> argv;
        for (const std::string& word : command)
            argv.push_back(const_cast<char*>(word.c_str()));
        argv.push_back(nullptr);
        execv(argv[0], argv.data());
        _exit(127);
    }
    close(out[1]);
    alarm(kGiveUpSeconds);
    std::string said;
    char buffer[256];
    for (;;) {
        const ssize_t got = read(out[0], buffer, sizeof buffer);
        if (got <= 0)
            break;
        said.append(buffer, static_cast<std::size_t>(got));
        if (!launch.shown && said.find("shown\n") != std::string::npos) {
            launch.shown = true;
            launch.secondsToShown =
                std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
        }
    }
    close(out[0]);
    int status = 0;
    rusage usage{};
    wait4(child, &status, 0, &usage);
    alarm(0);
    launch.peakKiB = usage.ru_maxrss;
    launch.cpuSeconds = static_cast<double>(usage.ru_utime.tv_sec + usage.ru_stime.tv_sec) +
                        static_cast<double>(usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e6;
    return launch;
}

// Totals of one program's launches within a benchmark.
struct Tally {
    double seconds = 0;
    double cpuSeconds = 0;
    long peakKiB = 0;

    bool Add(const Launch& launch)
    {
        seconds += launch.secondsToShown;
        cpuSeconds += launch.cpuSeconds;
        peakKiB = std::max(peakKiB, launch.peakKiB);
        return launch.shown;
    }
};

// Launches harbor and the baseline in turn, each iteration once each, the one going first
// alternating: both then see the same machine, even while its load drifts during the run.
// The benchmark's time is harbor's; the baseline's figures are counters beside it.
void Measure(benchmark::State& state, const std::vector<std::string>& command)
{
    const std::vector<std::string> baseline = {HARBOR_BIN_DIR "/bench_empty_dialog"};
    Tally figure;
    Tally base;
    bool baselineFirst = false;
    for (auto _ : state) {
        bool shown = true;
        if (baselineFirst)
            shown = base.Add(Run(baseline));
        const Launch launch = Run(command);
        shown = figure.Add(launch) && shown;
        if (!baselineFirst)
            shown = base.Add(Run(baseline)) && shown;
        baselineFirst = !baselineFirst;
        if (!shown) {
            state.SkipWithError("a program never said it was shown");
            return;
        }
        state.SetIterationTime(launch.secondsToShown);
    }
    const double runs = static_cast<double>(std::max<std::int64_t>(1, state.iterations()));
    state.counters["peak_rss_KiB"] = static_cast<double>(figure.peakKiB);
    // Unlike the time to the shown window, hardly touched by other processes on the machine.
    state.counters["cpu_ms_per_run"] = figure.cpuSeconds * 1e3 / runs;
    state.counters["baseline_ms"] = base.seconds * 1e3 / runs;
    state.counters["baseline_cpu_ms_per_run"] = base.cpuSeconds * 1e3 / runs;
    state.counters["baseline_peak_rss_KiB"] = static_cast<double>(base.peakKiB);
}

// The settings beside harbor in the build load the simulated library, whose default towers
// answer after 15 ms of simulated transmission per exchange; opening the tower and asking the
// brick at start-up is several exchanges. The client's own start-up is measured over an
// immediate link, the same one the stress test uses; the default link is reported beside it.
void BM_StartupHarbor(benchmark::State& state)
{
    const std::string scenario = "/tmp/harbor-bench-startup-" + std::to_string(getpid()) + ".sim";
    if (FILE* file = std::fopen(scenario.c_str(), "w")) {
        std::fputs("link-time = 0\n", file);
        std::fclose(file);
    }
    setenv("TESSEL_SIM", scenario.c_str(), 1);
    Measure(state, {HARBOR_BIN_DIR "/harbor"});
    unsetenv("TESSEL_SIM");
    std::remove(scenario.c_str());
}

void BM_StartupHarborDefaultLink(benchmark::State& state)
{
    unsetenv("TESSEL_SIM");
    Measure(state, {HARBOR_BIN_DIR "/harbor"});
}

} // namespace

BENCHMARK(BM_StartupHarbor)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(8);
BENCHMARK(BM_StartupHarborDefaultLink)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond)
    ->Iterations(8);

int main(int argc, char** argv)
{
    // Killed children must not take the driver with them; the alarm only ends a hung read.
    signal(SIGALRM, [](int) {});
    setenv("QT_QPA_PLATFORM", "offscreen", 1);
    setenv("HARBOR_EXIT_WHEN_SHOWN", "1", 1);
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
