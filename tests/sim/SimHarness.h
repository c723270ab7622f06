// Loads Tessel.dll by absolute path as the client does, takes the sixteen entry points from its
// export table, and gives each test the client's own workspace classes and a callback recorder.
// Object text is written by hand so that the brick tests do not depend on the translator.
#pragma once

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "errors/ErrorSink.h"
#include "tessel/TesselApi.h"
#include "workspace/Directory.h"
#include "workspace/LiveObjects.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace simtest {

using tessel::Long;
using tessel::Short;

inline constexpr Long Code(std::uint32_t packed)
{
    return static_cast<Long>(packed);
}
inline constexpr Long kNoMoreItems = Code(0xE0050C52u);
inline constexpr Long kNullParameter = Code(0xE0050C64u);
inline constexpr Long kBadHandle = Code(0xE0050401u);
inline const char* const kVersion309 = "0x00,0x03,0x00,0x01,0x00,0x03,0x00,0x09";

// Loaded once, never unloaded: every tear-down joins the library's threads with tslTerminate.
struct Api {
    void* module = dlopen(TESSEL_SIM_MODULE, RTLD_NOW | RTLD_LOCAL);
    const tessel::ExportEntry* table =
        module == nullptr
            ? nullptr
            : static_cast<const tessel::ExportEntry*>(dlsym(module, tessel::kExportTableSymbol));
    template <typename Fn> Fn at(int slot) const
    {
        return table == nullptr ? nullptr : reinterpret_cast<Fn>(table[slot].address);
    }
    tessel::InitialiseFn initialise = at<tessel::InitialiseFn>(tessel::SlotInitialise);
    tessel::TerminateFn terminate = at<tessel::TerminateFn>(tessel::SlotTerminate);
    tessel::FindPortFn findPort = at<tessel::FindPortFn>(tessel::SlotFindPort);
    tessel::CreateFn create = at<tessel::CreateFn>(tessel::SlotCreate);
    tessel::DestroyFn destroy = at<tessel::DestroyFn>(tessel::SlotDestroy);
    tessel::FindBrickFn findBrick = at<tessel::FindBrickFn>(tessel::SlotFindBrick);
    tessel::StatusFn status = at<tessel::StatusFn>(tessel::SlotStatus);
    tessel::SetFn set = at<tessel::SetFn>(tessel::SlotSet);
    tessel::GetFn get = at<tessel::GetFn>(tessel::SlotGet);
    tessel::ValidateFn validate = at<tessel::ValidateFn>(tessel::SlotValidate);
    tessel::TranslateFn translate = at<tessel::TranslateFn>(tessel::SlotTranslate);
    tessel::ExecFn exec = at<tessel::ExecFn>(tessel::SlotExec);
    tessel::DownloadFn download = at<tessel::DownloadFn>(tessel::SlotDownload);
    tessel::InfoFn info = at<tessel::InfoFn>(tessel::SlotInfo);
    tessel::FindFirstFn findFirst = at<tessel::FindFirstFn>(tessel::SlotFindFirst);
    tessel::FindNextFn findNext = at<tessel::FindNextFn>(tessel::SlotFindNext);
};

inline const Api& Library()
{
    static const Api api;
    return api;
}

struct Report {
    Long status;
    Long count;
    ReaderWriter* result;
};

// Collects reports from library threads; the test thread waits for them. Result handles are
// left for the test thread to release: the workspace is not thread-safe.
class Recorder {
public:
    static int TSL_STDCALL Callback(Long status, void* context, Long count, ReaderWriter* result)
    {
        auto* recorder = static_cast<Recorder*>(context);
        std::lock_guard<std::mutex> lock(recorder->mutex_);
        recorder->reports_.push_back({status, count, result});
        recorder->changed_.notify_all();
        return 1;
    }

    // The bound only keeps a broken library from hanging the suite; no statement about speed.
    bool waitFor(std::size_t n)
    {
        return waitUntil([&] { return reports_.size() >= n; });
    }

    // Waits for a report that ends a download: a failure or the given total.
    bool waitForEnd(Long total)
    {
        return waitUntil([&] {
            return !reports_.empty() &&
                   (reports_.back().status < 0 || reports_.back().count == total);
        });
    }

    std::vector<Report> reports()
    {
        std::lock_guard<std::mutex> lock(mutex_);
        return reports_;
    }

private:
    template <typename Done> bool waitUntil(Done done)
    {
        std::unique_lock<std::mutex> lock(mutex_);
        return changed_.wait_for(lock, std::chrono::seconds(60), done);
    }

    std::mutex mutex_;
    std::condition_variable changed_;
    std::vector<Report> reports_;
};

// The client's workspace as the session builds it in memory mode.
class Workspace {
public:
    Workspace() : root_(new Directory())
    {
        root_->addRef();
        for (const char* name : {"source.txt", "object.txt", "result.txt", "opal.txt", "temp.tmp",
                                 "context.txt", "symtab.txt", "firmware.txt"}) {
            add(std::string("/Script/Temp/") + name);
        }
    }
    ~Workspace() { root_->release(); }
    Workspace(const Workspace&) = delete;
    Workspace& operator=(const Workspace&) = delete;

    void add(const std::string& path)
    {
        root_->insert(path.c_str(), new TextMemoryEntry(new MemoryBlock()));
    }

    // A new handle (count 1) on a file of the tree; the caller releases it.
    ReaderWriter* open(const std::string& path, std::int32_t type)
    {
        DirEnt* entry = root_->find(path.c_str());
        return entry == nullptr ? nullptr : entry->open(type);
    }

    void write(const std::string& path, const std::string& text, std::int32_t type = 0)
    {
        ReaderWriter* handle = open(path, type);
        ASSERT_NE(handle, nullptr) << path;
        handle->openWrite();
        handle->write(text.data(), static_cast<std::int32_t>(text.size()));
        handle->close();
        handle->release();
    }

    std::string read(const std::string& path)
    {
        ReaderWriter* handle = open(path, 0);
        std::string text = ReadHandle(handle);
        handle->release();
        return text;
    }

    static std::string ReadHandle(ReaderWriter* handle)
    {
        std::string text;
        if (!(handle->openRead() == RwOk)) {
            return text;
        }
        char buffer[512];
        for (std::int32_t got; (got = handle->read(buffer, sizeof buffer)) > 0;) {
            text.append(buffer, static_cast<std::size_t>(got));
        }
        handle->close();
        return text;
    }

    // Object text placed in object.txt, handed out as a code handle.
    ReaderWriter* code(const std::string& objectText)
    {
        write("/Script/Temp/object.txt", objectText, tessel::FileCode);
        return open("/Script/Temp/object.txt", tessel::FileCode);
    }

private:
    Directory* root_;
};

// Every test starts from a scenario and ends with the library terminated, its threads joined
// and no workspace object left alive.
class SimTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_NE(api().module, nullptr) << dlerror();
        ASSERT_NE(api().table, nullptr);
        liveBefore_ = workspace::LiveObjectCount();
        useShipped("tests.sim");
    }

    void TearDown() override
    {
        api().terminate();
        unsetenv("TESSEL_SIM");
        if (!scenarioFile_.empty()) {
            std::remove(scenarioFile_.c_str());
        }
        workspace_.reset();
        EXPECT_EQ(workspace::LiveObjectCount(), liveBefore_);
    }

    static const Api& api() { return Library(); }

    // Restarts the library with a scenario file shipped in resources/scenarios.
    void useShipped(const char* name) { restart(std::string(TESSEL_SCENARIO_DIR) + "/" + name); }

    // Restarts the library with scenario text of the test's own.
    void useScenario(const std::string& text)
    {
        scenarioFile_ = testing::TempDir() + "sim-scenario-" + std::to_string(getpid());
        std::ofstream(scenarioFile_, std::ios::binary) << text;
        restart(scenarioFile_);
    }

    Workspace& ws()
    {
        if (!workspace_) {
            workspace_ = std::make_unique<Workspace>();
        }
        return *workspace_;
    }

    Long open(const char* port) { return api().create(port); }

    // Runs object text on the brick; the answer text lands in text.
    Long run(Long handle, const std::string& objectText, Long* number = nullptr,
             std::string* text = nullptr)
    {
        Long ignored = 0;
        ReaderWriter* code = ws().code(objectText);
        ReaderWriter* result = ws().open("/Script/Temp/result.txt", tessel::FileResult);
        const Long status =
            api().exec(handle, code, number ? number : &ignored, result, nullptr, nullptr);
        if (text != nullptr) {
            *text = Workspace::ReadHandle(result);
        }
        result->release();
        code->release();
        return status;
    }

    // Downloads object text with a recorder; waits for its end.
    Long downloadAndWait(Long handle, const std::string& objectText, Recorder& recorder, Long total)
    {
        ReaderWriter* code = ws().code(objectText);
        const Long status = api().download(handle, code, &Recorder::Callback, &recorder);
        code->release();
        if (status >= 0) {
            EXPECT_TRUE(recorder.waitForEnd(total));
        }
        return status;
    }

private:
    void restart(const std::string& scenario)
    {
        setenv("TESSEL_SIM", scenario.c_str(), 1);
        api().terminate();
        api().initialise();
    }

    std::int64_t liveBefore_ = 0;
    std::string scenarioFile_;
    std::unique_ptr<Workspace> workspace_;
};

// Object text: one "cmd" line per instruction, bytes in hexadecimal (see sim/lang/Program.h).
inline std::string Immediate(const std::string& commands, int brickType = 6)
{
    return "tobj 1 " + std::to_string(brickType) + " immediate\n" + commands;
}

inline std::string Cmd(const char* format, int a = 0, int b = 0, int c = 0, int d = 0)
{
    char line[64];
    std::snprintf(line, sizeof line, format, a, b, c, d);
    return line;
}

inline std::string Sound(int sound)
{
    return Cmd("cmd 20 %02x\n", sound & 0xFF);
}
inline std::string SelectSlot(int slot)
{
    return Cmd("cmd 39 %02x\n", slot);
}
inline std::string Get(int address, int count)
{
    return Cmd("cmd 33 %02x %02x %02x %02x\n", address & 0xFF, address >> 8, count & 0xFF,
               count >> 8);
}

inline const char* kGetMap = "cmd 34\n";
inline const char* kVersion = "cmd 32\n";
inline const char* kAlive = "cmd 35\n";
inline const char* kBootRom = "cmd 36\n";
inline const char* kBootFirmware = "cmd 37\n";
inline const char* kClearTasks = "cmd 30\n";
inline const char* kStartMain = "cmd 14 00\n";

// main sends message `message` and ends: 4 + 1 bytes, two commands.
inline std::string MessageProgram(int message, int brickType = 6)
{
    return Cmd("tobj 1 %d program\ntask 0\ncmd 27 02 %02x 00\ncmd 17\nend\n", brickType, message);
}

// A program of `commands` sound commands in main (2 bytes each) plus its end.
inline std::string SoundProgram(int commands)
{
    std::string text = "tobj 1 6 program\ntask 0\n";
    for (int i = 0; i < commands; ++i) {
        text += "cmd 20 01\n";
    }
    return text + "cmd 17\nend\n";
}

} // namespace simtest
