// The stress test chain and About.
#include <string>

#include "DialogFixture.h"

namespace commands_test {
namespace {

using ui::HeadlessEvent;

class StressCommands : public DialogFixture {
protected:
    void StartOpen()
    {
        ASSERT_NO_FATAL_FAILURE(
            Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n", "Serial=COM1"));
        ASSERT_NE(dialog().brickHandle(), 0);
        ClearEvents();
    }
};

TEST_F(StressCommands, WithoutAPortSaysPortNotOpen)
{
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n"));
    Click(ui::IdStress);
    EXPECT_EQ(LastStatus(), "Port not open");
    EXPECT_EQ(dialog().stressIteration(), 0);
}

TEST_F(StressCommands, StartsWithOneHundredIterations)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EXPECT_EQ(Text(ui::IdStressCount), "100");
}

TEST_F(StressCommands, ZeroIterationsPassAtOnceWithoutADownload)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "task main {");
    SetText(ui::IdStressCount, "0");
    Click(ui::IdStress);
    Settle();
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"", "Stress test passed ok"}));
    EXPECT_EQ(dialog().stressIteration(), 0);
}

TEST_F(StressCommands, ACountThatIsNotANumberCountsAsZero)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "task main {");
    for (const char* count : {"", "abc", "12abc", "99999999999"}) {
        ClearEvents();
        SetText(ui::IdStressCount, count);
        Click(ui::IdStress);
        Settle();
        EXPECT_EQ(LastStatus(), "Stress test passed ok") << "count \"" << count << "\"";
    }
}

TEST_F(StressCommands, AnIterationThatDoesNotTranslateEndsTheTest)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "this is } not { a script");
    SetText(ui::IdStressCount, "3");
    Click(ui::IdStress);
    Settle();

    const std::string shown = LastStatus();
    EXPECT_EQ(shown.rfind("Stress Script2SplitByteCode() failed on iteration 1, 0xe005", 0), 0u)
        << shown;
    EXPECT_EQ(dialog().stressIteration(), 0);
    EXPECT_TRUE(Offers().empty());
}

TEST_F(StressCommands, AnEmptyEditorStopsTheStepAndKeepsTheIteration)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "");
    Click(ui::IdStress);
    Settle();
    EXPECT_EQ(Statuses(), std::vector<std::string>{""});
    EXPECT_EQ(dialog().stressIteration(), 1);
}

TEST_F(StressCommands, AboutShowsTwoLinesAndChangesNothing)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "kept");
    Click(ui::IdAbout);

    const std::vector<HeadlessEvent> boxes = EventsOf(HeadlessEvent::Kind::MessageBox);
    ASSERT_EQ(boxes.size(), 1u);
    EXPECT_EQ(boxes[0].caption, "Tessel Test Client");
    const std::string& text = boxes[0].text;
    const std::size_t lineFeed = text.find('\n');
    ASSERT_NE(lineFeed, std::string::npos);
    EXPECT_EQ(text.substr(0, lineFeed), "Test application for Kivo tessel system.");
    EXPECT_FALSE(text.substr(lineFeed + 1).empty());
    EXPECT_EQ(text.find('\n', lineFeed + 1), std::string::npos);
    EXPECT_TRUE(Statuses().empty());
    EXPECT_EQ(Text(ui::IdEditor), "kept");
}

} // namespace
} // namespace commands_test
