// What a person waits for in the core, each beside its baseline: the workspace's text memory
// file against memcpy, a path walk against nested std::map lookups, the translation of a
// 10,000-line script against reading its file, and the headless stress test against the same
// translations and downloads called straight on the simulated library.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <map>
#include <memory>
#include <mutex>
#include <sstream>
#include <string>
#include <vector>

#include "BenchFolder.h"
#include "session/BrickSession.h"
#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"
#include "tessel/TesselApi.h"
#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"
#include "workspace/Directory.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

// --- text memory file, 16 MiB ---------------------------------------------------------

constexpr std::int32_t kTextBytes = 16 << 20;

// Lines of 63 letters and a line feed: the file stores each feed as CR LF.
std::string SixteenMiBOfText()
{
    std::string text(kTextBytes, 'a');
    for (std::size_t i = 63; i < text.size(); i += 64)
        text[i] = '\n';
    return text;
}

void BM_TextMemoryWriteRead(benchmark::State& state)
{
    const std::string text = SixteenMiBOfText();
    std::vector<char> back(text.size());
    auto* block = new MemoryBlock();
    DirEnt* entry = (new TextMemoryEntry(block))->addRef();
    for (auto _ : state) {
        ReaderWriter* file = entry->open(tessel::FileScript);
        file->open("w");
        const std::int32_t written = file->write(text.data(), kTextBytes);
        file->open("r");
        const std::int32_t read = file->read(back.data(), kTextBytes);
        file->release();
        if (written != kTextBytes || read != kTextBytes) {
            state.SkipWithError("the text did not come back whole");
            break;
        }
        benchmark::DoNotOptimize(back.data());
    }
    // Checked once, outside the timed loop: the last round's bytes are those written.
    if (std::memcmp(back.data(), text.data(), text.size()) != 0)
        state.SkipWithError("the text came back changed");
    entry->release();
    state.SetBytesProcessed(state.iterations() * kTextBytes);
}

void BM_TextMemoryBaselineMemcpy(benchmark::State& state)
{
    const std::string text = SixteenMiBOfText();
    std::vector<char> stored(text.size());
    std::vector<char> back(text.size());
    for (auto _ : state) {
        // Written in, read back out: two copies, as the file's write and read are.
        std::memcpy(stored.data(), text.data(), text.size());
        benchmark::ClobberMemory();
        std::memcpy(back.data(), stored.data(), stored.size());
        benchmark::DoNotOptimize(back.data());
    }
    state.SetBytesProcessed(state.iterations() * kTextBytes);
}

// --- find of a four-component path in a 16 x 16 x 16 tree -----------------------------

std::string Name(int i)
{
    char name[8];
    std::snprintf(name, sizeof name, "d%02d", i);
    return name;
}

// Every leaf directory holds one program, so each path has four components.
std::vector<std::string> LeafPaths()
{
    std::vector<std::string> paths;
    for (int a = 0; a < 16; ++a)
        for (int b = 0; b < 16; ++b)
            for (int c = 0; c < 16; ++c)
                paths.push_back(Name(a) + "/" + Name(b) + "/" + Name(c) + "/prog.onyx2");
    // Visited in a scattered order, so neither side walks memory in insertion order.
    for (std::size_t i = 0; i < paths.size(); ++i)
        std::swap(paths[i], paths[(i * 2654435761u) % paths.size()]);
    return paths;
}

void BM_FindPath(benchmark::State& state)
{
    const std::vector<std::string> paths = LeafPaths();
    DirEnt* root = (new Directory())->addRef();
    for (const std::string& path : paths) {
        if (root->insert(path.c_str(), new TextMemoryEntry(new MemoryBlock())) == nullptr) {
            state.SkipWithError("the tree could not be built");
            root->release();
            return;
        }
    }
    std::size_t next = 0;
    for (auto _ : state) {
        DirEnt* found = root->find(paths[next].c_str());
        benchmark::DoNotOptimize(found);
        if (found == nullptr) {
            state.SkipWithError("a path was not found");
            break;
        }
        next = next + 1 == paths.size() ? 0 : next + 1;
    }
    root->release();
}

struct MapNode {
    std::map<std::string, MapNode> children;
};

void BM_FindPathBaselineMap(benchmark::State& state)
{
    const std::vector<std::string> paths = LeafPaths();
    std::vector<std::vector<std::string>> split;
    MapNode root;
    for (const std::string& path : paths) {
        std::vector<std::string> names;
        std::stringstream in(path);
        for (std::string name; std::getline(in, name, '/');)
            names.push_back(name);
        MapNode* node = &root;
        for (const std::string& name : names)
            node = &node->children[name];
        split.push_back(names);
    }
    std::size_t next = 0;
    for (auto _ : state) {
        const MapNode* node = &root;
        for (const std::string& name : split[next]) {
            auto it = node->children.find(name);
            node = it == node->children.end() ? nullptr : &it->second;
            if (node == nullptr)
                break;
        }
        benchmark::DoNotOptimize(node);
        next = next + 1 == split.size() ? 0 : next + 1;
    }
}

// --- translation of a 10,000-line script ------------------------------------------------

constexpr int kScriptLines = 10000;

void BM_Translate10kLines(benchmark::State& state)
{
    bench::BenchFolder folder(bench::kFastScenario, "");
    BrickSession session(folder.settingsPath().c_str());
    if (!session.libraryLoaded()) {
        state.SkipWithError("Tessel.dll not found in " HARBOR_BIN_DIR);
        return;
    }
    const std::string script = bench::LongScript(kScriptLines);
    for (auto _ : state) {
        ReaderWriter* code = nullptr;
        const tessel::Long result = session.TranslateText(6, tessel::FileScript, script.c_str(),
                                                          &code, nullptr, nullptr, nullptr);
        BrickSession::ReleaseReaderWriter(&code);
        if (result < 0) {
            state.SkipWithError("the script did not translate");
            break;
        }
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(script.size()));
}

void BM_Translate10kLinesBaselineRead(benchmark::State& state)
{
    bench::BenchFolder folder("", "");
    const std::string path = folder.write("long.onyx2", bench::LongScript(kScriptLines));
    for (auto _ : state) {
        std::ifstream in(path, std::ios::binary);
        std::string text((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
        benchmark::DoNotOptimize(text.data());
    }
}

// --- the stress test, 100 iterations -----------------------------------------------------

constexpr int kStressIterations = 100;

std::string StressScript()
{
    std::ifstream in(HARBOR_SOURCE_DIR "/resources/samples/stress.onyx2", std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

void BM_StressHeadless(benchmark::State& state)
{
    bench::BenchFolder folder(bench::kFastScenario, bench::kSerialPorts);
    const std::string script = StressScript();
    for (auto _ : state) {
        state.PauseTiming();
        ui::HeadlessHost host;
        bool passed = false;
        bool failed = false;
        host.SetListener([&](const ui::HeadlessEvent& event) {
            if (event.kind != ui::HeadlessEvent::Kind::Status)
                return;
            passed = passed || event.text == "Stress test passed ok";
            failed = failed || event.text.rfind("Stress Script", 0) == 0;
        });
        auto dialog = std::make_unique<ui::TestClientDialog>(host, folder.commandLine().c_str());
        if (!dialog->Create() || dialog->brickHandle() == 0) {
            state.SkipWithError("the dialog did not open its port");
            break;
        }
        host.SetControlText(dialog->handle(), ui::IdEditor, script.c_str());
        host.SetControlText(dialog->handle(), ui::IdStressCount,
                            std::to_string(kStressIterations).c_str());
        state.ResumeTiming();

        host.Click(dialog->handle(), ui::IdStress);
        while (!passed && !failed) {
            host.DispatchPending();
            if (passed || failed || dialog->stressIteration() == 0)
                break;
            if (!host.WaitForMessage(20000))
                break;
        }

        state.PauseTiming();
        if (!passed) {
            state.SkipWithError("the stress test did not pass");
            break;
        }
        while (dialog->operationsInFlight() > 0 && host.WaitForMessage(20000))
            host.DispatchPending();
        dialog.reset();
        state.ResumeTiming();
    }
}

// Waits for a download's final report, as the dialog's progress handler decides it.
struct DownloadWait {
    std::mutex mutex;
    std::condition_variable done;
    std::int32_t total = 0;
    bool finished = false;
    std::int32_t status = 0;

    static int TSL_STDCALL Report(tessel::Long status, void* context, tessel::Long count,
                                  ReaderWriter* result)
    {
        auto* wait = static_cast<DownloadWait*>(context);
        if (result != nullptr)
            result->release();
        std::lock_guard<std::mutex> lock(wait->mutex);
        if (status < 0 || count >= wait->total) {
            wait->status = static_cast<std::int32_t>(status);
            wait->finished = true;
            wait->done.notify_one();
        }
        return 1;
    }
};

void BM_StressBaselineDirect(benchmark::State& state)
{
    bench::BenchFolder folder(bench::kFastScenario, bench::kSerialPorts);
    const std::string script = StressScript();
    for (auto _ : state) {
        state.PauseTiming();
        auto session = std::make_unique<BrickSession>(folder.settingsPath().c_str());
        const tessel::Long brick =
            session->Create((std::string(tessel::kPortPrefix) + "COM1").c_str());
        if (brick == 0) {
            state.SkipWithError("the port did not open");
            break;
        }
        state.ResumeTiming();

        bool ok = true;
        for (int iteration = 1; iteration <= kStressIterations && ok; ++iteration) {
            // The same text the dialog sends: the script, its blanks and the closing brace.
            const std::string text = script + std::string(200 + iteration, ' ') + "}";
            ReaderWriter* code = nullptr;
            ok = session->TranslateText(6, tessel::FileScript, text.c_str(), &code, nullptr,
                                        nullptr, nullptr) >= 0;
            DownloadWait wait;
            wait.total = BrickSession::CountCommands(code);
            ok = ok && wait.total > 0 &&
                 session->Download(brick, code, &DownloadWait::Report, &wait) >= 0;
            BrickSession::ReleaseReaderWriter(&code);
            if (ok) {
                std::unique_lock<std::mutex> lock(wait.mutex);
                wait.done.wait(lock, [&] { return wait.finished; });
                ok = wait.status >= 0;
            }
        }

        state.PauseTiming();
        if (!ok) {
            state.SkipWithError("a translation or download failed");
            break;
        }
        session->Destroy(brick);
        session.reset();
        state.ResumeTiming();
    }
}

} // namespace

BENCHMARK(BM_TextMemoryBaselineMemcpy)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_TextMemoryWriteRead)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FindPathBaselineMap);
BENCHMARK(BM_FindPath);
BENCHMARK(BM_Translate10kLinesBaselineRead)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Translate10kLines)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_StressBaselineDirect)->Unit(benchmark::kMillisecond)->Iterations(20);
BENCHMARK(BM_StressHeadless)->Unit(benchmark::kMillisecond)->Iterations(20);

BENCHMARK_MAIN();
