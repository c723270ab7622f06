// Test harness for the simulated brick library: loads Tessel.dll by absolute path as the client
// does, finds the sixteen entry points through its export table, builds a real workspace tree
// with the client's workspace classes, and records callbacks that arrive from library threads.
#pragma once

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <cstring>
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

struct Api {
    void* module = nullptr;
    const tessel::ExportEntry* table = nullptr;
    tessel::InitialiseFn initialise = nullptr;
    tessel::TerminateFn terminate = nullptr;
    tessel::FindPortFn findPort = nullptr;
    tessel::CreateFn create = nullptr;
    tessel::DestroyFn destroy = nullptr;
    tessel::FindBrickFn findBrick = nullptr;
    tessel::StatusFn status = nullptr;
    tessel::SetFn set = nullptr;
    tessel::GetFn get = nullptr;
    tessel::ValidateFn validate = nullptr;
    tessel::TranslateFn translate = nullptr;
    tessel::ExecFn exec = nullptr;
    tessel::DownloadFn download = nullptr;
    tessel::InfoFn info = nullptr;
    tessel::FindFirstFn findFirst = nullptr;
    tessel::FindNextFn findNext = nullptr;
};

inline void* Lookup(const tessel::ExportEntry* table, const char* name)
{
    for (const tessel::ExportEntry* entry = table; entry != nullptr && entry->name != nullptr;
         ++entry) {
        if (std::strcmp(entry->name, name) == 0) {
            return entry->address;
        }
    }
    return nullptr;
}

// Loaded once for the whole test program, never unloaded (library threads are joined by
// tslTerminate in every test's tear-down).
inline const Api& Library()
{
    static const Api api = [] {
        Api a;
        a.module = dlopen(TESSEL_SIM_MODULE, RTLD_NOW | RTLD_LOCAL);
        if (a.module == nullptr) {
            return a;
        }
        a.table =
            static_cast<const tessel::ExportEntry*>(dlsym(a.module, tessel::kExportTableSymbol));
        auto bind = [&](auto& slot, int index) {
            slot = reinterpret_cast<std::remove_reference_t<decltype(slot)>>(
                Lookup(a.table, tessel::kExportNames[index]));
        };
        bind(a.initialise, tessel::SlotInitialise);
        bind(a.terminate, tessel::SlotTerminate);
        bind(a.findPort, tessel::SlotFindPort);
        bind(a.create, tessel::SlotCreate);
        bind(a.destroy, tessel::SlotDestroy);
        bind(a.findBrick, tessel::SlotFindBrick);
        bind(a.status, tessel::SlotStatus);
        bind(a.set, tessel::SlotSet);
        bind(a.get, tessel::SlotGet);
        bind(a.validate, tessel::SlotValidate);
        bind(a.translate, tessel::SlotTranslate);
        bind(a.exec, tessel::SlotExec);
        bind(a.download, tessel::SlotDownload);
        bind(a.info, tessel::SlotInfo);
        bind(a.findFirst, tessel::SlotFindFirst);
        bind(a.findNext, tessel::SlotFindNext);
        return a;
    }();
    return api;
}

// One callback report as the library made it.
struct Report {
    tessel::Long status;
    tessel::Long count;
    ReaderWriter* result;
};

// Collects reports from library threads; the test thread waits for them. Result handles are
// left for the test thread to release: the workspace is not thread-safe.
class Recorder {
public:
    static int TSL_STDCALL Callback(tessel::Long status, void* context, tessel::Long count,
                                    ReaderWriter* result)
    {
        auto* recorder = static_cast<Recorder*>(context);
        std::lock_guard<std::mutex> lock(recorder->mutex_);
        recorder->reports_.push_back({status, count, result});
        recorder->changed_.notify_all();
        return 1;
    }

    // Waits until at least n reports arrived; the bound only keeps a broken library from
    // hanging the suite and is no statement about speed.
    bool waitFor(std::size_t n)
    {
        std::unique_lock<std::mutex> lock(mutex_);
        return changed_.wait_for(lock, std::chrono::seconds(60),
                                 [&] { return reports_.size() >= n; });
    }

    // Waits for a report that ends a download: a failure or the given total.
    bool waitForEnd(tessel::Long total)
    {
        std::unique_lock<std::mutex> lock(mutex_);
        return changed_.wait_for(lock, std::chrono::seconds(60), [&] {
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
    std::mutex mutex_;
    std::condition_variable changed_;
    std::vector<Report> reports_;
};

// The client's workspace as the session builds it in memory mode.
class Workspace {
public:
    Workspace()
    {
        root_ = new Directory();
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

    DirEnt* root() { return root_; }

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
        if (handle != nullptr) {
            handle->release();
        }
        return text;
    }

    static std::string ReadHandle(ReaderWriter* handle)
    {
        std::string text;
        if (handle == nullptr || !(handle->openRead() == RwOk)) {
            return text;
        }
        char buffer[512];
        std::int32_t got = 0;
        while ((got = handle->read(buffer, sizeof buffer)) > 0) {
            text.append(buffer, static_cast<std::size_t>(got));
        }
        handle->close();
        return text;
    }

    // Object text placed in object.txt, handed out as a code handle (type 4).
    ReaderWriter* code(const std::string& objectText)
    {
        write("/Script/Temp/object.txt", objectText, tessel::FileCode);
        return open("/Script/Temp/object.txt", tessel::FileCode);
    }

private:
    Directory* root_ = nullptr;
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
        delete workspace_;
        workspace_ = nullptr;
        EXPECT_EQ(workspace::LiveObjectCount(), liveBefore_);
    }

    static const Api& api() { return Library(); }

    // Restarts the library with a scenario file shipped in resources/scenarios.
    void useShipped(const char* name)
    {
        const std::string path = std::string(TESSEL_SCENARIO_DIR) + "/" + name;
        setenv("TESSEL_SIM", path.c_str(), 1);
        api().terminate();
        api().initialise();
    }

    // Restarts the library with scenario text of the test's own.
    void useScenario(const std::string& text)
    {
        if (scenarioFile_.empty()) {
            char name[] = "/tmp/simcore-scenario-XXXXXX";
            const int fd = mkstemp(name);
            ASSERT_GE(fd, 0);
            close(fd);
            scenarioFile_ = name;
        }
        std::FILE* file = std::fopen(scenarioFile_.c_str(), "wb");
        ASSERT_NE(file, nullptr);
        std::fwrite(text.data(), 1, text.size(), file);
        std::fclose(file);
        setenv("TESSEL_SIM", scenarioFile_.c_str(), 1);
        api().terminate();
        api().initialise();
    }

    Workspace& ws()
    {
        if (workspace_ == nullptr) {
            workspace_ = new Workspace();
        }
        return *workspace_;
    }

    tessel::Long open(const char* port) { return api().create(port); }

    // Runs object text on the brick; the answer text lands in result.
    tessel::Long run(tessel::Long handle, const std::string& objectText, tessel::Long* number,
                     std::string* text = nullptr)
    {
        ReaderWriter* code = ws().code(objectText);
        ReaderWriter* result = ws().open("/Script/Temp/result.txt", tessel::FileResult);
        const tessel::Long status = api().exec(handle, code, number, result, nullptr, nullptr);
        if (text != nullptr) {
            *text = Workspace::ReadHandle(result);
        }
        result->release();
        code->release();
        return status;
    }

    // Downloads object text with a recorder; waits for its end.
    tessel::Long downloadAndWait(tessel::Long handle, const std::string& objectText,
                                 Recorder& recorder, tessel::Long total)
    {
        ReaderWriter* code = ws().code(objectText);
        const tessel::Long status = api().download(handle, code, &Recorder::Callback, &recorder);
        code->release();
        if (status >= 0) {
            EXPECT_TRUE(recorder.waitForEnd(total));
        }
        return status;
    }

private:
    std::int64_t liveBefore_ = 0;
    std::string scenarioFile_;
    Workspace* workspace_ = nullptr;
};

inline constexpr tessel::Long Code(std::uint32_t packed)
{
    return static_cast<tessel::Long>(packed);
}

} // namespace simtest
