// The stress test chain and About.
#include <string>

#include "DialogFixture.h"
#include "session/BrickSession.h"
#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"

namespace commands_test {
namespace {

using ui::HeadlessEvent;
using Texts = std::vector<std::string>;

// A program written without its final closing brace, as the stress test expects it.
constexpr const char* kOpenProgram = "program S {\n    main {\n        sound 4\n    }\n";

class StressCommands : public DialogFixture {
protected:
    void Stress(const std::string& editor, const std::string& count)
    {
        SetText(ui::IdEditor, editor);
        SetText(ui::IdStressCount, count);
        ClearEvents();
        Click(ui::IdStress);
        Settle();
    }
};

// The source working file as the library last read it.
std::string SourceFileText(ui::TestClientDialog& dialog)
{
    std::string text;
    ReaderWriter* file = dialog.session()->sourceEntry()->open(tessel::FileScript);
    if (file == nullptr)
        return text;
    if (file->openRead().packedCode() == RwOk.packedCode()) {
        text.resize(static_cast<std::size_t>(file->size()));
        text.resize(static_cast<std::size_t>(file->read(text.data(), file->size())));
        file->close();
    }
    BrickSession::ReleaseReaderWriter(&file);
    return text;
}

TEST_F(StressCommands, ThreeIterationsCarryOneMoreSpaceEachAndThenPass)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    // When an iteration is announced, its text has just been translated.
    std::vector<std::string> sent;
    ui::TestClientDialog* target = &dialog();
    OnEvent([target, &sent](const HeadlessEvent& event) {
        if (event.kind == HeadlessEvent::Kind::Status && event.text.rfind("Stress test #", 0) == 0)
            sent.push_back(SourceFileText(*target));
    });
    Stress(kOpenProgram, "3");
    OnEvent(nullptr);

    ASSERT_EQ(sent.size(), 3u);
    for (std::size_t i = 0; i < sent.size(); ++i)
        EXPECT_EQ(sent[i], kOpenProgram + std::string(201 + i, ' ') + "}") << "iteration " << i + 1;
    EXPECT_EQ(Statuses(),
              (Texts{"", "Downloading", "Stress test #1", "Downloaded ok (0 mS)", "Downloading",
                     "Stress test #2", "Downloaded ok (0 mS)", "Downloading", "Stress test #3",
                     "Downloaded ok (0 mS)", "Stress test passed ok"}));
    EXPECT_EQ(dialog().stressIteration(), 0);
}

TEST_F(StressCommands, TheCountIsReadAgainAtEveryStepAndNonNumbersCountAsZero)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    SetText(ui::IdEditor, kOpenProgram);
    SetText(ui::IdStressCount, "100");
    Click(ui::IdStress); // iteration 1 is on its way
    SetText(ui::IdStressCount, "2");
    Settle();
    EXPECT_EQ(LastStatus(), "Stress test passed ok");
    std::size_t announced = 0;
    for (const std::string& text : Statuses())
        announced += text.rfind("Stress test #", 0) == 0 ? 1 : 0;
    EXPECT_EQ(announced, 2u);

    // Zero iterations pass at once, without even translating.
    for (const char* count : {"0", "", "abc", "12abc", "99999999999"}) {
        Stress("task main {", count);
        EXPECT_EQ(Statuses(), (Texts{"", "Stress test passed ok"})) << "count \"" << count << "\"";
        EXPECT_EQ(dialog().stressIteration(), 0);
    }
}

TEST_F(StressCommands, AStepThatCannotGoOnEndsOrKeepsTheIteration)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    Stress("this is } not { a script", "3");
    EXPECT_EQ(LastStatus().rfind("Stress Script2SplitByteCode() failed on iteration 1, 0xe005", 0),
              0u)
        << LastStatus();
    EXPECT_EQ(dialog().stressIteration(), 0);
    EXPECT_TRUE(Offers().empty());

    Stress("", "3"); // an empty editor stops the step but keeps the iteration
    EXPECT_EQ(Statuses(), Texts{""});
    EXPECT_EQ(dialog().stressIteration(), 1);
    Stop();

    // Program memory too small for any program: the download does not start.
    ASSERT_NO_FATAL_FAILURE(StartOnCom1("memory = 0\n"));
    Stress(kOpenProgram, "3");
    EXPECT_EQ(LastStatus(),
              "Error (0xe005040e) from Tessel driver: not enough memory for task/sub");
    EXPECT_EQ(Offers().size(), 1u);
    EXPECT_EQ(dialog().stressIteration(), 0);
}

TEST_F(StressCommands, ADownloadThatBreaksOffStallsTheTestUntilTheUserDownloads)
{
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port KIVOTOWER1]\nunplug-after = 3\n",
              "USB=KIVOTOWER1"));
    ASSERT_GE(dialog().session()->Set(dialog().brickHandle(), tessel::PropDownloadBlockSize, 2), 0);
    Stress("program S {\n    main {\n        sound 1\n        sound 2\n"
           "        sound 3\n        sound 4\n        sound 5\n    }\n",
           "100");
    EXPECT_EQ(
        LastStatus(),
        "Error (0xe0050474) from Tessel driver: Kivo USB Tower has been unplugged from this port");
    EXPECT_EQ(dialog().stressIteration(), 1);
    // A download of the user's own is no stress iteration: the stalled test ends.
    Click(ui::IdDownload);
    EXPECT_EQ(dialog().stressIteration(), 0);
    Settle();
}

TEST_F(StressCommands, AboutShowsTwoLinesAndChangesNothing)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    SetText(ui::IdEditor, "kept");
    Click(ui::IdAbout);

    const std::vector<HeadlessEvent> boxes = EventsOf(HeadlessEvent::Kind::MessageBox);
    ASSERT_EQ(boxes.size(), 1u);
    EXPECT_EQ(boxes[0].caption, "Tessel Test Client");
    const std::string first = "Test application for Kivo tessel system.\n";
    EXPECT_EQ(boxes[0].text.substr(0, first.size()), first);
    // A second line, and no third.
    EXPECT_GT(boxes[0].text.size(), first.size());
    EXPECT_EQ(boxes[0].text.find('\n', first.size()), std::string::npos);
    EXPECT_TRUE(Statuses().empty());
    EXPECT_EQ(Text(ui::IdEditor), "kept");
}

} // namespace
} // namespace commands_test
