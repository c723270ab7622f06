// What a person waits for in the window, offscreen: the longest stall of the event loop while
// a 1,000-command download reports its progress (against a 16 ms frame), and ReadEditorText
// of a 1 MiB editor against copying the same bytes.
#include <benchmark/benchmark.h>

#include <QAbstractButton>
#include <QApplication>
#include <QComboBox>
#include <QElapsedTimer>
#include <QEventLoop>
#include <QPlainTextEdit>
#include <QTimer>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <memory>
#include <string>

#include "BenchFolder.h"
#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/QtHost.h"

namespace {

// CPU time of the calling thread: how much of a stall the loop's own work filled.
qint64 ThreadCpuNs()
{
    timespec now{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return static_cast<qint64>(now.tv_sec) * 1000000000 + now.tv_nsec;
}

constexpr int kDownloadCommands = 1000;
constexpr std::size_t kEditorBytes = 1 << 20;

// A program object with count sound commands, downloaded as BIN source (no translation).
std::string SoundProgram(int count)
{
    std::string text = "tobj 1 6 program\ntask 0\n";
    for (int i = 0; i < count; ++i)
        text += "cmd 20 04\n";
    text += "end\n";
    return text;
}

// One megabyte of script-like lines of 63 characters and a line feed.
std::string OneMiBOfText()
{
    std::string text(kEditorBytes, 'x');
    for (std::size_t i = 63; i < text.size(); i += 64)
        text[i] = '\n';
    return text;
}

// The dialog in its window against the simulated library, as harbor starts it.
struct Window {
    bench::BenchFolder folder{bench::kFastScenario, bench::kSerialPorts};
    ui::QtHost host{HARBOR_SOURCE_DIR "/resources/help/"};
    ui::TestClientDialog dialog{host, folder.commandLine().c_str()};

    bool create() { return dialog.Create() && dialog.brickHandle() != 0; }
    ui::DialogWindow* window() { return host.dialogWindow(dialog.handle()); }
    QWidget* control(int id) { return window()->control(id); }
    QString status()
    {
        return qobject_cast<QPlainTextEdit*>(control(ui::IdStatusBox))->toPlainText();
    }
    // Lets the loop hand over what is still on its way, so the dialog closes idle.
    void settle()
    {
        QElapsedTimer waited;
        waited.start();
        while (dialog.operationsInFlight() > 0 && waited.elapsed() < 20000)
            QCoreApplication::processEvents(QEventLoop::AllEvents, 50);
    }
};

void BM_DownloadLongestStall(benchmark::State& state)
{
    double longestMs = 0;
    double busyMs = 0;
    for (auto _ : state) {
        Window w;
        if (!w.create()) {
            state.SkipWithError("the window did not open its port");
            return;
        }
        qobject_cast<QPlainTextEdit*>(w.control(ui::IdEditor))
            ->setPlainText(QString::fromStdString(SoundProgram(kDownloadCommands)));
        qobject_cast<QComboBox*>(w.control(ui::IdSourceList))->setCurrentIndex(ui::SourceListBin);
        QCoreApplication::processEvents();

        // A zero timer runs once per pass of the loop: the longest gap between two of its
        // runs is the longest time the window could not paint or take input.
        QEventLoop loop;
        QElapsedTimer clock;
        qint64 last = 0;
        qint64 longest = 0;
        qint64 lastCpu = ThreadCpuNs();
        qint64 longestCpu = 0;
        bool done = false;
        QTimer tick;
        tick.setInterval(0);
        QObject::connect(&tick, &QTimer::timeout, [&] {
            const qint64 now = clock.nsecsElapsed();
            const qint64 cpu = ThreadCpuNs();
            if (now - last > longest) {
                longest = now - last;
                longestCpu = cpu - lastCpu;
            }
            last = now;
            lastCpu = cpu;
            const QString status = w.status();
            if (status.startsWith(QStringLiteral("Downloaded ok")) ||
                status.startsWith(QStringLiteral("Download failed")) || clock.elapsed() > 20000) {
                done = status.startsWith(QStringLiteral("Downloaded ok"));
                loop.quit();
            }
        });
        // The click itself runs inside the loop, as a person's click does.
        QTimer::singleShot(
            0, [&] { qobject_cast<QAbstractButton*>(w.control(ui::IdDownload))->click(); });
        clock.start();
        lastCpu = ThreadCpuNs();
        tick.start();
        loop.exec();
        tick.stop();
        if (!done) {
            state.SkipWithError(
                qPrintable(QStringLiteral("the download did not finish: ") + w.status()));
            return;
        }
        const double ms = static_cast<double>(longest) / 1e6;
        longestMs = std::max(longestMs, ms);
        busyMs = std::max(busyMs, static_cast<double>(longestCpu) / 1e6);
        state.SetIterationTime(ms / 1e3);
        w.settle();
    }
    state.counters["worst_stall_ms"] = longestMs;
    // The loop thread's own CPU time within its longest stall; the rest of the stall is
    // time the thread waited for a core.
    state.counters["stall_cpu_ms"] = busyMs;
}

void BM_ReadEditorText(benchmark::State& state)
{
    Window w;
    if (!w.create()) {
        state.SkipWithError("the window did not open its port");
        return;
    }
    const std::string text = OneMiBOfText();
    qobject_cast<QPlainTextEdit*>(w.control(ui::IdEditor))
        ->setPlainText(QString::fromStdString(text));
    for (auto _ : state) {
        std::unique_ptr<char[]> read = w.dialog.ReadEditorText();
        benchmark::DoNotOptimize(read.get());
        if (std::strlen(read.get()) != text.size()) {
            state.SkipWithError("the editor's text did not come back whole");
            break;
        }
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(text.size()));
    w.settle();
}

void BM_ReadEditorTextBaselineCopy(benchmark::State& state)
{
    const std::string text = OneMiBOfText();
    for (auto _ : state) {
        // A new buffer with the terminator, as ReadEditorText hands out.
        std::unique_ptr<char[]> copy(new char[text.size() + 1]);
        std::memcpy(copy.get(), text.c_str(), text.size() + 1);
        benchmark::DoNotOptimize(copy.get());
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(text.size()));
}

} // namespace

BENCHMARK(BM_DownloadLongestStall)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(5);
BENCHMARK(BM_ReadEditorTextBaselineCopy)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_ReadEditorText)->Unit(benchmark::kMicrosecond);

int main(int argc, char** argv)
{
    setenv("QT_QPA_PLATFORM", "offscreen", 0);
    QApplication application(argc, argv);
    QApplication::setQuitOnLastWindowClosed(false);
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
