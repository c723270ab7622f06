// The headless host as a window layer (binding, queue, loop, controls, questions, files) and
// the library callbacks, which only post, from any thread, to the window in their context.
#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "tessel/ReaderWriter.h"
#include "ui/DialogLayout.h"
#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"
#include "workspace/LiveObjects.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

using namespace ui;

namespace {

struct Received {
    Message message;
    WParam wParam;
    LParam lParam;
};

// Records what reaches it; handles everything but the messages listed as unhandled.
class RecordingObject : public WindowObject {
public:
    bool OnMessage(Message message, WParam wParam, LParam lParam, LResult& result) override
    {
        handleAtMessage.push_back(handle());
        received.push_back({message, wParam, lParam});
        result = 42;
        if (onMessage)
            onMessage(message);
        return message != 0x9999;
    }
    void OnUndelivered(Message message, WParam wParam, LParam lParam) override
    {
        undelivered.push_back({message, wParam, lParam});
    }
    std::vector<Received> received;
    std::vector<Received> undelivered;
    std::vector<WindowHandle> handleAtMessage;
    std::function<void(Message)> onMessage;
};

constexpr ControlSpec kControls[] = {
    {10, ControlKind::MultiEdit, "", StyleNone, 0, 0, 10, 10},
    {11, ControlKind::MultiEdit, "", StyleReadOnly, 0, 0, 10, 10},
    {20, ControlKind::PushButton, "Go", StyleNone, 0, 0, 10, 10},
    {21, ControlKind::PushButton, "Off", StyleDisabled | StyleHidden, 0, 0, 10, 10},
    {30, ControlKind::CheckBox, "Box", StyleNone, 0, 0, 10, 10},
    {40, ControlKind::RadioButton, "A", StyleGroupStart, 0, 0, 10, 10},
    {41, ControlKind::RadioButton, "B", StyleNone, 0, 0, 10, 10},
    {42, ControlKind::RadioButton, "C", StyleGroupStart, 0, 0, 10, 10},
    {50, ControlKind::DropList, "", StyleNone, 0, 0, 10, 10},
    {kNoControlId, ControlKind::Label, "Label", StyleNone, 0, 0, 10, 10},
};
constexpr MenuItemSpec kItems[] = {{"&Item", 900, false}, {nullptr, 0, false}};
constexpr MenuSpec kMenus[] = {{"&Menu", kItems, 2}};
constexpr DialogTemplate kLayout = {1, "Caption", "Font", 8, 100, 100, kControls, 10, 2, kMenus, 1};

class HostTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        host.SetListener([this](const HeadlessEvent& event) { events.push_back(event); });
        window = host.CreateDialogWindow(kLayout, &object);
        ASSERT_NE(window, kNoWindow);
    }
    HeadlessHost host;
    RecordingObject object;
    WindowHandle window = kNoWindow;
    std::vector<HeadlessEvent> events;
};

} // namespace

TEST_F(HostTest, DialogIsBoundBeforeItsFirstMessageAndSendReturnsHandledResults)
{
    ASSERT_EQ(object.received.size(), 1u);
    EXPECT_EQ(object.received[0].message, kMsgInitDialog);
    EXPECT_EQ(object.handleAtMessage[0], window);
    EXPECT_EQ(host.WindowTitle(window), "Caption");
    EXPECT_FALSE(host.WindowVisible(window));
    host.ShowWindow(window);
    EXPECT_TRUE(host.WindowVisible(window));
    EXPECT_EQ(host.SendMessage(window, 0x1234, 1, 2), 42);
    EXPECT_EQ(host.SendMessage(window, 0x9999, 1, 2), 0);
    EXPECT_EQ(host.SendMessage(window + 100, 0x1234, 1, 2), 0);
}

TEST_F(HostTest, PostedMessagesArriveInOrderAndDestroyHandsTheRestBack)
{
    object.received.clear();
    for (int i = 0; i < 5; ++i)
        EXPECT_TRUE(host.PostMessage(window, kMsgUser + 2, i, -i));
    EXPECT_EQ(host.DispatchPending(), 5);
    ASSERT_EQ(object.received.size(), 5u);
    for (int i = 0; i < 5; ++i) {
        EXPECT_EQ(object.received[i].wParam, static_cast<WParam>(i));
        EXPECT_EQ(object.received[i].lParam, -i);
    }
    host.PostMessage(window, kMsgUser + 3, 7, 8);
    object.received.clear();
    host.DestroyWindow(window);
    ASSERT_EQ(object.received.size(), 1u);
    EXPECT_EQ(object.received[0].message, kMsgDestroy);
    ASSERT_EQ(object.undelivered.size(), 1u);
    EXPECT_EQ(object.undelivered[0].message, kMsgUser + 3);
    EXPECT_EQ(object.undelivered[0].lParam, 8);
    EXPECT_EQ(object.handle(), kNoWindow);
    EXPECT_FALSE(host.PostMessage(window, kMsgUser, 0, 0));
    EXPECT_EQ(host.DispatchPending(), 0);
    host.DestroyWindow(window); // a second time is ignored
    // Handles are not reused; a plain window gets no initialisation message.
    RecordingObject other;
    const WindowHandle next = host.CreatePlainWindow("trbl_wnd", &other);
    EXPECT_NE(next, window);
    EXPECT_EQ(host.FindWindowOfClass("trbl_wnd"), next);
    EXPECT_EQ(host.FindWindowOfClass("other"), kNoWindow);
    EXPECT_TRUE(other.received.empty());
}

TEST_F(HostTest, PumpDispatchesOneMessageAndLeavesQuitForTheOuterLoop)
{
    std::vector<Message> order;
    object.onMessage = [&](Message message) {
        order.push_back(message);
        if (message == kMsgUser + 1) { // a nested pump inside a handler
            host.PostMessage(window, kMsgUser + 2, 0, 0);
            EXPECT_TRUE(host.PumpMessage());
            order.push_back(0);
        }
    };
    host.PostMessage(window, kMsgUser + 1, 0, 0);
    EXPECT_TRUE(host.PumpMessage());
    EXPECT_EQ(order, (std::vector<Message>{kMsgUser + 1, kMsgUser + 2, 0}));
    host.PostMessage(window, kMsgUser + 5, 0, 0);
    host.PostMessage(window, kMsgUser + 6, 0, 0);
    host.PostQuit(3);
    EXPECT_TRUE(host.PumpMessage());
    EXPECT_EQ(order.size(), 4u);
    EXPECT_TRUE(host.PumpMessage());
    EXPECT_FALSE(host.PumpMessage());
    EXPECT_FALSE(host.PumpMessage());
    EXPECT_EQ(host.RunMessageLoop(), 3);
}

TEST_F(HostTest, IdleHandlerFeedsTheLoop)
{
    int calls = 0;
    host.SetIdleHandler([&] {
        if (++calls < 3) {
            host.PostMessage(window, kMsgUser + 4, calls, 0);
        } else {
            host.PostQuit(0);
        }
        return true;
    });
    object.received.clear();
    EXPECT_EQ(host.RunMessageLoop(), 0);
    EXPECT_EQ(calls, 3);
    EXPECT_EQ(object.received.size(), 2u);
}

TEST_F(HostTest, ControlTextIsCutToTheBufferAndOnlyTheStatusBoxReports)
{
    host.SetControlText(window, 10, "abcdef");
    char buffer[4] = {'x', 'x', 'x', 'x'};
    EXPECT_EQ(host.GetControlText(window, 10, buffer, sizeof buffer), 3u);
    EXPECT_STREQ(buffer, "abc");
    EXPECT_EQ(host.GetControlText(window, 10, buffer, 0), 0u);
    EXPECT_EQ(host.GetControlTextLength(window, 10), 6u);
    EXPECT_EQ(host.GetControlText(window, 999, buffer, sizeof buffer), 0u);
    EXPECT_STREQ(buffer, "");
    host.SetControlText(window, 11, "status");
    host.SetControlText(window, 11, "status");
    ASSERT_EQ(events.size(), 2u);
    EXPECT_EQ(events[0].kind, HeadlessEvent::Kind::Status);
    EXPECT_EQ(events[0].text, "status");
    // Selections are clamped to the text.
    std::int32_t start = -5;
    std::int32_t end = -5;
    host.SetEditSelection(window, 10, 50, -1);
    host.GetEditSelection(window, 10, &start, &end);
    EXPECT_EQ(start, 6);
    EXPECT_EQ(end, 6);
}

TEST_F(HostTest, ClicksAndListsActAsAUserWould)
{
    object.received.clear();
    EXPECT_TRUE(host.Click(window, 30));
    EXPECT_TRUE(host.IsChecked(window, 30));
    EXPECT_TRUE(host.Click(window, 40));
    EXPECT_TRUE(host.Click(window, 42));
    EXPECT_TRUE(host.IsChecked(window, 40)); // another group
    EXPECT_TRUE(host.Click(window, 41));
    EXPECT_FALSE(host.IsChecked(window, 40));
    EXPECT_TRUE(host.IsChecked(window, 41));
    EXPECT_TRUE(host.IsChecked(window, 42));
    EXPECT_FALSE(host.Click(window, 21)); // disabled
    EXPECT_TRUE(host.Click(window, 900)); // menu item
    EXPECT_FALSE(host.Click(window, 901));
    ASSERT_EQ(object.received.size(), 5u);
    EXPECT_EQ(CommandId(object.received[4].wParam), 900);

    EXPECT_EQ(host.ListAdd(window, 50, "z"), 0);
    EXPECT_EQ(host.ListAdd(window, 50, "a"), 1);
    EXPECT_EQ(host.ListSelection(window, 50), -1);
    host.ListSelect(window, 50, 1);
    EXPECT_EQ(host.ListSelection(window, 50), 1);
    host.ListSelect(window, 50, 5);
    EXPECT_EQ(host.ListSelection(window, 50), -1);
    EXPECT_EQ(host.ListEntry(window, 50, 0), "z");
}

TEST_F(HostTest, QuestionsFollowQueuedAnswersThenChoiceThenPolicy)
{
    EXPECT_FALSE(host.AskYesNo(kNoWindow, "q", "c"));
    host.SetDefaultAnswer(true);
    EXPECT_TRUE(host.AskYesNo(kNoWindow, "q", "c"));
    host.SetChoice("COM2");
    EXPECT_FALSE(host.AskYesNo(kNoWindow, "COM1", "Select Port"));
    EXPECT_TRUE(host.AskYesNo(kNoWindow, "COM2", "Select Port"));
    host.QueueAnswer(false);
    EXPECT_FALSE(host.AskYesNo(kNoWindow, "COM2", "Select Port"));
    host.SetChoice("");
    EXPECT_TRUE(host.AskYesNo(kNoWindow, "x", "y"));
    ASSERT_EQ(events.size(), 6u);
    EXPECT_EQ(events[3].caption, "Select Port");
    EXPECT_EQ(events[3].text, "COM2");
    EXPECT_TRUE(events[3].answer);
}

TEST_F(HostTest, FileDialogsTakeGivenNamesCutToTheBuffer)
{
    char path[8] = "*.onyx2";
    FileDialogRequest request;
    request.path = path;
    request.size = sizeof path;
    EXPECT_FALSE(host.ChooseOpenFile(request));
    EXPECT_STREQ(path, "*.onyx2");
    host.QueueFileName("/a/very/long/name.onyx2");
    EXPECT_TRUE(host.ChooseSaveFile(request));
    EXPECT_STREQ(path, "/a/very");
    ASSERT_EQ(events.size(), 2u);
    EXPECT_EQ(events[0].kind, HeadlessEvent::Kind::OpenFile);
    EXPECT_EQ(events[1].kind, HeadlessEvent::Kind::SaveFile);
}

namespace {

class CallbackTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        window = host.CreatePlainWindow("collector", &collector);
        target.host = &host;
        target.window = window;
    }
    HeadlessHost host;
    RecordingObject collector;
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
    ASSERT_EQ(collector.received.size(), 3u);
    EXPECT_EQ(collector.received[0].message, kMsgDownloadProgress);
    // The packed code keeps its sign through wParam.
    EXPECT_EQ(static_cast<std::int32_t>(static_cast<std::uint32_t>(collector.received[0].wParam)),
              failure);
    EXPECT_EQ(collector.received[0].lParam, 16);
    EXPECT_EQ(collector.received[1].message, kMsgBrickMessage);
    EXPECT_EQ(collector.received[1].lParam, 7);
    EXPECT_EQ(collector.received[2].message, kMsgExecResult);
    EXPECT_EQ(collector.received[2].lParam, reinterpret_cast<LParam>(file));
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
    ASSERT_EQ(collector.received.size(), static_cast<std::size_t>(kThreads * kPerThread));
    std::vector<LParam> last(kThreads, -1);
    for (const auto& item : collector.received) {
        const auto t = static_cast<int>(item.wParam);
        ASSERT_LT(t, kThreads);
        EXPECT_EQ(item.lParam, last[t] + 1);
        last[t] = item.lParam;
    }
}
