// The library callbacks: they only post, from any thread, to the window in their context.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "tessel/ReaderWriter.h"
#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"
#include "workspace/LiveObjects.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

using namespace ui;

namespace {

class Collector : public WindowObject {
public:
    bool OnMessage(Message message, WParam wParam, LParam lParam, LResult& result) override
    {
        messages.push_back({message, wParam, lParam});
        return true;
    }
    struct Item {
        Message message;
        WParam wParam;
        LParam lParam;
    };
    std::vector<Item> messages;
};

class CallbackTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        window = host.CreatePlainWindow("collector", &collector);
        target.host = &host;
        target.window = window;
    }
    HeadlessHost host;
    Collector collector;
    WindowHandle window = kNoWindow;
    PostTarget target;
};

ReaderWriter* NewMemoryFile()
{
    auto* entry = new MemoryEntry(new MemoryBlock());
    return entry->open(tessel::FileResult);
}

} // namespace

TEST_F(CallbackTest, EachPostsItsMessageWithStatusCountAndResult)
{
    EXPECT_EQ(TestClientDialog::DownloadCallback(0, nullptr, 1, nullptr), 0);
    EXPECT_EQ(TestClientDialog::ExecCallback(0, nullptr, 0, nullptr), 0);
    EXPECT_EQ(TestClientDialog::ReceiveCallback(0, nullptr, 3, nullptr), 0);
    EXPECT_EQ(host.QueuedMessages(), 0u);

    const std::int64_t before = workspace::LiveObjectCount();
    const auto failure = static_cast<tessel::Long>(0xE0050C41u);
    ReaderWriter* file = NewMemoryFile();
    EXPECT_EQ(TestClientDialog::DownloadCallback(failure, &target, 16, nullptr), 1);
    EXPECT_EQ(TestClientDialog::ReceiveCallback(0, &target, 7, nullptr), 1);
    EXPECT_EQ(TestClientDialog::ExecCallback(0, &target, 0, file), 1);
    ASSERT_EQ(host.DispatchPending(), 3);
    ASSERT_EQ(collector.messages.size(), 3u);
    EXPECT_EQ(collector.messages[0].message, kMsgDownloadProgress);
    // The packed code keeps its sign through wParam.
    EXPECT_EQ(static_cast<std::int32_t>(static_cast<std::uint32_t>(collector.messages[0].wParam)),
              failure);
    EXPECT_EQ(collector.messages[0].lParam, 16);
    EXPECT_EQ(collector.messages[1].message, kMsgBrickMessage);
    EXPECT_EQ(collector.messages[1].lParam, 7);
    EXPECT_EQ(collector.messages[2].message, kMsgExecResult);
    EXPECT_EQ(collector.messages[2].lParam, reinterpret_cast<LParam>(file));
    file->release();

    // A result for a window that is gone is released.
    host.DestroyWindow(window);
    EXPECT_EQ(TestClientDialog::ExecCallback(0, &target, 0, NewMemoryFile()), 1);
    EXPECT_EQ(workspace::LiveObjectCount(), before);
}

TEST_F(CallbackTest, PostsFromManyThreadsArriveInEachThreadsOrder)
{
    constexpr int kThreads = 4;
    constexpr int kPerThread = 500;
    std::atomic<int> failures{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&, t] {
            for (int i = 0; i < kPerThread; ++i) {
                if (TestClientDialog::DownloadCallback(t, &target, i, nullptr) != 1)
                    ++failures;
            }
        });
    }
    // The loop's thread dispatches while the others post.
    int dispatched = 0;
    while (dispatched < kThreads * kPerThread) {
        if (host.WaitForMessage(1000))
            dispatched += host.DispatchPending();
    }
    for (auto& thread : threads)
        thread.join();
    EXPECT_EQ(failures.load(), 0);
    ASSERT_EQ(collector.messages.size(), static_cast<std::size_t>(kThreads * kPerThread));
    std::vector<LParam> last(kThreads, -1);
    for (const auto& item : collector.messages) {
        const auto t = static_cast<int>(item.wParam);
        ASSERT_LT(t, kThreads);
        EXPECT_EQ(item.lParam, last[t] + 1);
        last[t] = item.lParam;
    }
}
