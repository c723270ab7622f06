// Callbacks from the library's own threads: asynchronous execution, download progress, brick
// messages, and tslDestroy/tslTerminate stopping them. Run under ThreadSanitizer too.
#include <atomic>
#include <thread>

#include "SimHarness.h"

namespace simtest {
namespace {

class Callbacks : public SimTest {
protected:
    // Starts an asynchronous exec of object text.
    Long execAsync(Long handle, const std::string& objectText, tessel::Callback callback,
                   void* context)
    {
        Long number = 0;
        ReaderWriter* code = ws().code(objectText);
        const Long status = api().exec(handle, code, &number, nullptr, callback, context);
        code->release();
        return status;
    }
};

TEST_F(Callbacks, AsyncExecHandsTheResultOrTheFailureToTheCallback)
{
    Recorder recorder;
    ASSERT_EQ(execAsync(open("KIVOTOWER1"), Immediate(kVersion), &Recorder::Callback, &recorder),
              0);
    ASSERT_TRUE(recorder.waitFor(1));
    const Report report = recorder.reports().front();
    EXPECT_EQ(report.status, 0);
    ASSERT_NE(report.result, nullptr);
    EXPECT_EQ(Workspace::ReadHandle(report.result), kVersion309);
    report.result->release();

    useShipped("brick-off.sim");
    Recorder failed;
    ASSERT_EQ(execAsync(open("KIVOTOWER1"), Immediate(Sound(4)), &Recorder::Callback, &failed), 0);
    ASSERT_TRUE(failed.waitFor(1));
    EXPECT_EQ(failed.reports().front().status, Code(0xE0050402u));
    EXPECT_EQ(failed.reports().front().result, nullptr);
}

TEST_F(Callbacks, DownloadProgressCountsUpToTheTotal)
{
    Recorder recorder;
    ASSERT_EQ(downloadAndWait(open("KIVOTOWER1"), SoundProgram(99), recorder, 100), 0);
    const std::vector<Report> reports = recorder.reports();
    ASSERT_GE(reports.size(), 2u);
    Long previous = 0;
    for (const Report& report : reports) {
        EXPECT_EQ(report.status, 0);
        EXPECT_GT(report.count, previous);
        previous = report.count;
    }
    EXPECT_EQ(reports.back().count, 100);
}

TEST_F(Callbacks, ReceptionDeliversScenarioAndProgramMessages)
{
    useShipped("messages.sim");
    const Long handle = open("KIVOTOWER1");
    Recorder downloaded;
    ASSERT_EQ(downloadAndWait(handle, MessageProgram(42), downloaded, 2), 0);
    Recorder recorder;
    ASSERT_EQ(api().exec(handle, nullptr, nullptr, nullptr, &Recorder::Callback, &recorder), 0);
    ASSERT_TRUE(recorder.waitFor(3));
    ASSERT_EQ(run(handle, Immediate(kStartMain)), 0);
    ASSERT_TRUE(recorder.waitFor(4));
    EXPECT_EQ(api().exec(handle, nullptr, nullptr, nullptr, nullptr, nullptr), 0);
    std::vector<Long> numbers;
    for (const Report& report : recorder.reports()) {
        EXPECT_EQ(report.status, 0);
        numbers.push_back(report.count);
    }
    EXPECT_EQ(numbers, (std::vector<Long>{3, 7, 12, 42}));
    // Stopped: a program's message now stays with the brick.
    ASSERT_EQ(run(handle, Immediate(kStartMain)), 0);
    EXPECT_EQ(recorder.reports().size(), 4u);
}

TEST_F(Callbacks, ASecondJobIsRefusedAndDestroyStopsTheFirstForGood)
{
    useScenario("link-time = 50\n[brick b]\n[port KIVOTOWER1]\n");
    const Long handle = open("KIVOTOWER1");
    Recorder recorder;
    ReaderWriter* code = ws().code(SoundProgram(400));
    ASSERT_EQ(api().download(handle, code, &Recorder::Callback, &recorder), 0);
    EXPECT_EQ(api().download(handle, code, &Recorder::Callback, &recorder), Code(0xE005040Au));
    code->release();
    char text[tessel::kStatusTextSize];
    EXPECT_EQ(api().status(handle, tessel::StatusBrick, text, sizeof text), 12);
    ASSERT_EQ(api().destroy(handle), 0);
    const std::size_t seen = recorder.reports().size();
    EXPECT_LT(seen, 10u);
    // After destroy returned the library holds no thread that could still call back.
    EXPECT_EQ(recorder.reports().size(), seen);
    EXPECT_EQ(api().status(handle, tessel::StatusDownload, nullptr, 0), 3);
}

TEST_F(Callbacks, TerminateStopsReceptionAndAsyncWork)
{
    useScenario("link-time = 50\n[brick b]\nmessages = 1\n[port KIVOTOWER1]\n[port COM1]\n");
    Recorder messages;
    Recorder exec;
    const Long usb = open("KIVOTOWER1");
    ASSERT_EQ(api().exec(usb, nullptr, nullptr, nullptr, &Recorder::Callback, &messages), 0);
    ASSERT_EQ(execAsync(open("COM1"), Immediate(Sound(4) + Sound(5) + Sound(6)),
                        &Recorder::Callback, &exec),
              0);
    api().terminate();
    const std::size_t seenMessages = messages.reports().size();
    const std::size_t seenExec = exec.reports().size();
    EXPECT_LE(seenMessages, 1u);
    EXPECT_EQ(api().status(usb, tessel::StatusPort, nullptr, 0), 3);
    EXPECT_EQ(messages.reports().size(), seenMessages);
    EXPECT_EQ(exec.reports().size(), seenExec);
}

// A callback that calls back into the library from the library's thread.
struct Reentrant {
    std::atomic<int> calls{0};
    std::atomic<Long> destroyResult{0};
    Long handle = 0;
    const Api* a = nullptr;
};

int TSL_STDCALL DestroyFromCallback(Long, void* context, Long, ReaderWriter*)
{
    auto* r = static_cast<Reentrant*>(context);
    Short type = 0;
    r->a->findBrick(r->handle, &type, nullptr); // the library's lock is not held here
    r->destroyResult = r->a->destroy(r->handle);
    ++r->calls;
    return 1;
}

TEST_F(Callbacks, ACallbackMayCallTheLibraryButNotDestroyItsOwnHandle)
{
    Reentrant r;
    r.handle = open("KIVOTOWER1");
    r.a = &api();
    ASSERT_EQ(execAsync(r.handle, Immediate(Sound(1)), &DestroyFromCallback, &r), 0);
    for (int waited = 0; r.calls == 0 && waited < 60000; ++waited) {
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    api().destroy(r.handle);
    EXPECT_EQ(r.calls, 1);
    EXPECT_EQ(r.destroyResult, Code(0xE005040Au));
}

} // namespace
} // namespace simtest
