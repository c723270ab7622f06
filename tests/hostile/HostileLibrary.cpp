// A brick library that breaks every promise a library can break, loaded by the client by name
// like Tessel.dll. It includes only the library boundary.
//
// What it does wrong (all of it unless HARBOR_HOSTILE names one narrower mode):
// - every text it hands back fills the whole buffer with no terminator (port names, status
//   and property texts, enumeration names, the translation's detail is 64 KiB long);
// - the port search and the enumerations never end;
// - counts and values are negative or huge (brick type, property and info values, the
//   synchronous execution result, download progress counts);
// - an asynchronous execution reports with a null result file, several times;
// - download progress, execution results and received messages arrive from several threads at
//   once, and go on after the download reported its end;
// - the brick status is one the client does not know, every time.
// Threads it starts are joined by tslDestroy and tslTerminate, so nothing reaches the client
// once its session has let go of the library.
//
// HARBOR_HOSTILE names a single fault instead, for the rows of the fault matrix the simulated
// library cannot bring about; the library then behaves well (one port "HOSTILE1", an Onyx2
// that answers, objects of three commands, downloads that report their end) except for:
//   create-fails       tslCreate answers 0
//   silent-after-boot  "boot rom" runs, "brick alive?" fails
//   silent-after-download  "brick alive?" fails once a download has run
//   reception-fails    reception reports one failure instead of a message
//   exec-refused       tslExec of code fails at once (waiting or in the background)
//   type-unreadable    reading property 1 (brick type) fails
//   empty-object       translation succeeds and writes nothing
//   download-refused   tslDownload fails at once
#include <algorithm>
#include <atomic>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "tessel/IError.h"
#include "tessel/ReaderWriter.h"
#include "tessel/TesselApi.h"

using tessel::Callback;
using tessel::Long;
using tessel::Short;
using tessel::Size;

namespace {

constexpr Long kFailure = static_cast<Long>(0xE0050C41u); // any packed error will do
constexpr int kThreads = 4;
constexpr int kReportsPerThread = 25;

std::string Mode()
{
    const char* mode = std::getenv("HARBOR_HOSTILE");
    return mode != nullptr ? mode : "";
}

bool Is(const char* mode)
{
    return Mode() == mode;
}

// Every promise broken at once; otherwise one fault in a library that behaves.
bool Hostile()
{
    return Mode().empty() || Mode() == "all";
}

void CopyText(char* buffer, Size size, const char* text)
{
    if (buffer != nullptr && size > 0) {
        std::strncpy(buffer, text, size - 1);
        buffer[size - 1] = '\0';
    }
}

constexpr int kSaneCommands = 3;

// Fills all of buffer, terminator nowhere.
void FillUnterminated(char* buffer, Size size, char letter)
{
    if (buffer != nullptr && size > 0) {
        std::memset(buffer, letter, size);
    }
}

class Threads {
public:
    // Starts count threads that wait for each other and then run body(index) together.
    template <typename Body> void startTogether(int count, Body body)
    {
        std::lock_guard<std::mutex> lock(mutex_);
        auto gate = std::make_shared<std::atomic<int>>(count);
        for (int i = 0; i < count; ++i) {
            threads_.emplace_back([gate, body, i] {
                gate->fetch_sub(1);
                while (gate->load() > 0) {
                    std::this_thread::yield();
                }
                body(i);
            });
        }
    }
    void joinAll()
    {
        std::vector<std::thread> running;
        {
            std::lock_guard<std::mutex> lock(mutex_);
            running.swap(threads_);
        }
        for (std::thread& thread : running) {
            thread.join();
        }
    }

private:
    std::mutex mutex_;
    std::vector<std::thread> threads_;
};

Threads& Workers()
{
    static Threads threads;
    return threads;
}

std::atomic<bool> g_receiving{false};
std::atomic<bool> g_downloaded{false};
std::mutex g_sourceMutex;
std::string g_lastSource;

std::string ReadAll(ReaderWriter* file)
{
    std::string text;
    if (file == nullptr || file->open("rb").failed()) {
        return text;
    }
    char chunk[512];
    for (int rounds = 0; rounds < 1024; ++rounds) {
        const Long got = file->read(chunk, sizeof chunk);
        if (got <= 0) {
            break;
        }
        text.append(chunk, static_cast<std::size_t>(got));
    }
    file->close();
    return text;
}

void WriteAll(ReaderWriter* file, const std::string& text)
{
    if (file == nullptr || file->open("wb").failed()) {
        return;
    }
    file->write(text.data(), static_cast<Long>(text.size()));
    file->close();
}

// ---- entry points ----

Long tslInitialise()
{
    g_downloaded = false;
    return 0;
}

Long tslTerminate()
{
    g_receiving = false;
    Workers().joinAll();
    return 0;
}

Long tslFindPort(char* name, Size size)
{
    if (!Hostile()) {
        // One well-formed port, then the end.
        if (name == nullptr || size < 9 || std::strncmp(name, "HOSTILE1", size) == 0) {
            return kFailure;
        }
        std::memcpy(name, "HOSTILE1", 9);
        return 0;
    }
    FillUnterminated(name, size, 'P');
    return 0;
}

Long tslCreate(const char*)
{
    return Is("create-fails") ? 0 : 7;
}

int tslDestroy(Long)
{
    g_receiving = false;
    Workers().joinAll();
    return 1;
}

Long tslFindBrick(Long, Short* type, Long* extra)
{
    if (type != nullptr) {
        *type = Hostile() ? SHRT_MIN : 6;
    }
    if (extra != nullptr) {
        *extra = Hostile() ? INT_MIN : 0;
    }
    return 0;
}

Long tslStatus(Long, Short, char* text, Size size)
{
    if (!Hostile()) {
        CopyText(text, size, "ok");
        return 1;
    }
    FillUnterminated(text, size, 'S');
    return 77;
}

Long tslSet(Long, Short, Short)
{
    return 0;
}

Long tslGet(Long, Short property, Short* value, char* text, Size size)
{
    if (!Hostile()) {
        if (property == 1 && Is("type-unreadable")) {
            return kFailure;
        }
        if (value != nullptr) {
            *value = property == 1 ? 6 : 1;
        }
        CopyText(text, size, "ok");
        return 0;
    }
    if (value != nullptr) {
        *value = (property & 1) != 0 ? SHRT_MIN : SHRT_MAX;
    }
    FillUnterminated(text, size, 'G');
    return 0;
}

Long tslValidate(Short, ReaderWriter* source, IError* sink, ReaderWriter*, ReaderWriter*)
{
    ReadAll(source);
    if (sink != nullptr) {
        const std::string detail(64 * 1024, 'D');
        sink->SetError(kFailure, INT_MIN, detail.c_str());
    }
    return kFailure;
}

Long tslTranslate(Short, ReaderWriter* source, ReaderWriter* target, IError* sink, ReaderWriter*,
                  ReaderWriter*)
{
    const std::string text = ReadAll(source);
    {
        std::lock_guard<std::mutex> lock(g_sourceMutex);
        g_lastSource = text;
    }
    if (text.find("frobnicate") != std::string::npos) {
        return tslValidate(0, nullptr, sink, nullptr, nullptr);
    }
    if (!Hostile()) {
        std::string object = "tobj 1 6 program\ntask 0\n";
        for (int i = 0; i < kSaneCommands; ++i) {
            object += "cmd 20 04\n";
        }
        WriteAll(target, Is("empty-object") ? std::string() : object + "end\n");
        return 0;
    }
    // An object with many commands and one endless line.
    std::string object = "tobj 1 6 program\ntask 0\n";
    for (int i = 0; i < 50; ++i) {
        object += "cmd 20 04\n";
    }
    object += std::string(8192, 'c') + "end";
    WriteAll(target, object);
    return 0;
}

Long tslExec(Long, ReaderWriter* code, Long* result, ReaderWriter* resultFile, Callback callback,
             void* context)
{
    if (code == nullptr) {
        // Reception on or off. Messages come from several threads, with odd numbers.
        g_receiving = callback != nullptr;
        if (callback != nullptr && Is("reception-fails")) {
            Workers().startTogether(
                1, [callback, context](int) { callback(kFailure, context, 0, nullptr); });
        } else if (callback != nullptr) {
            Workers().startTogether(kThreads, [callback, context](int index) {
                for (int i = 0; i < kReportsPerThread && g_receiving; ++i) {
                    callback(i % 3 == 0 ? kFailure : 0, context, index % 2 ? INT_MIN : INT_MAX,
                             nullptr);
                }
            });
        }
        return 0;
    }
    if (Is("silent-after-boot") || (Is("silent-after-download") && g_downloaded)) {
        std::lock_guard<std::mutex> lock(g_sourceMutex);
        if (g_lastSource.find("alive") != std::string::npos) {
            return kFailure;
        }
    }
    if (Is("exec-refused")) {
        return kFailure;
    }
    if (!Hostile()) {
        if (result != nullptr) {
            *result = 0;
        }
        if (callback != nullptr) {
            Workers().startTogether(1,
                                    [callback, context](int) { callback(0, context, 0, nullptr); });
        }
        return 0;
    }
    if (callback == nullptr) {
        if (result != nullptr) {
            *result = INT_MIN;
        }
        WriteAll(resultFile, std::string(70000, 'R'));
        return 0;
    }
    // Asynchronous: results without a file, from several threads, more than one each.
    Workers().startTogether(kThreads, [callback, context](int index) {
        for (int i = 0; i < 3; ++i) {
            callback(index == 0 && i == 0 ? kFailure : 0, context, INT_MAX, nullptr);
        }
    });
    return 0;
}

Long tslDownload(Long, ReaderWriter* code, Callback callback, void* context)
{
    ReadAll(code);
    if (callback == nullptr) {
        return 0;
    }
    if (!Hostile()) {
        if (Is("download-refused")) {
            return kFailure;
        }
        g_downloaded = true;
        // Progress up to the end, from one thread, as a library should.
        Workers().startTogether(1, [callback, context](int) {
            for (int count = 1; count <= kSaneCommands; ++count) {
                callback(0, context, count, nullptr);
            }
        });
        return 0;
    }
    // Progress with counts out of every range from several threads; one of them reports the
    // end (a failure), and the others go on reporting after it.
    Workers().startTogether(kThreads, [callback, context](int index) {
        for (int i = 0; i < kReportsPerThread; ++i) {
            const Long count = i % 3 == 0 ? -5 : i % 3 == 1 ? INT_MAX : i;
            callback(index == 0 && i == kReportsPerThread / 2 ? kFailure : 0, context, count,
                     nullptr);
        }
    });
    return 0;
}

Long tslInfo(Short, Short id, Short* value)
{
    if (!Hostile()) {
        if (value != nullptr) {
            *value = 1;
        }
        return 0;
    }
    if (value != nullptr) {
        *value = (id & 1) != 0 ? -1 : SHRT_MAX;
    }
    return 0;
}

Long tslFindFirst(Short, Short* item, char* name, Size size)
{
    if (!Hostile()) {
        return static_cast<Long>(0xE0050C52u); // no more items
    }
    if (item != nullptr) {
        *item = -1;
    }
    FillUnterminated(name, size, 'F');
    return 0;
}

Long tslFindNext(Short, Short* item, char* name, Size size)
{
    if (!Hostile()) {
        return static_cast<Long>(0xE0050C52u);
    }
    if (item != nullptr) {
        *item = SHRT_MAX;
    }
    FillUnterminated(name, size, 'N');
    return 0;
}

} // namespace

extern "C" {

__attribute__((visibility("default"))) tessel::ExportEntry export_table[tessel::SlotCount + 1] = {
    {tessel::kExportNames[0], reinterpret_cast<void*>(&tslInitialise)},
    {tessel::kExportNames[1], reinterpret_cast<void*>(&tslTerminate)},
    {tessel::kExportNames[2], reinterpret_cast<void*>(&tslFindPort)},
    {tessel::kExportNames[3], reinterpret_cast<void*>(&tslCreate)},
    {tessel::kExportNames[4], reinterpret_cast<void*>(&tslDestroy)},
    {tessel::kExportNames[5], reinterpret_cast<void*>(&tslFindBrick)},
    {tessel::kExportNames[6], reinterpret_cast<void*>(&tslStatus)},
    {tessel::kExportNames[7], reinterpret_cast<void*>(&tslSet)},
    {tessel::kExportNames[8], reinterpret_cast<void*>(&tslGet)},
    {tessel::kExportNames[9], reinterpret_cast<void*>(&tslValidate)},
    {tessel::kExportNames[10], reinterpret_cast<void*>(&tslTranslate)},
    {tessel::kExportNames[11], reinterpret_cast<void*>(&tslExec)},
    {tessel::kExportNames[12], reinterpret_cast<void*>(&tslDownload)},
    {tessel::kExportNames[13], reinterpret_cast<void*>(&tslInfo)},
    {tessel::kExportNames[14], reinterpret_cast<void*>(&tslFindFirst)},
    {tessel::kExportNames[15], reinterpret_cast<void*>(&tslFindNext)},
    {nullptr, nullptr},
};

} // extern "C"
