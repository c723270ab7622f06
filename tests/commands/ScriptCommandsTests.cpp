// Validate, Execute, Execute Async, Download, Download File, Receive and the reports posted by
// the library's callbacks. Object text with the Source list on BIN skips the translation.
#include <string>

#include "DialogFixture.h"
#include "session/BrickSession.h"

namespace commands_test {
namespace {

using ui::HeadlessEvent;
using Texts = std::vector<std::string>;

constexpr const char* kVersionRequest = "tobj 1 6 immediate\ncmd 32\n";
constexpr const char* kVersionAnswer = "0x00,0x03,0x00,0x01,0x00,0x03,0x00,0x09";
constexpr const char* kSoundRequest = "tobj 1 6 immediate\ncmd 20 04\n";
constexpr const char* kGoodProgram = "program P {\n    main {\n        sound 4\n    }\n}\n";
constexpr const char* kUndeclared = "Error (0xe0050810) from Tessel compiler: speed";

class ScriptCommands : public DialogFixture {
protected:
    void EditBinary(const std::string& objectText)
    {
        SetText(ui::IdEditor, objectText);
        SelectSource(ui::SourceListBin);
    }
    std::int32_t Caret()
    {
        std::int32_t start = -1, end = -1;
        host().GetEditSelection(window(), ui::IdEditor, &start, &end);
        EXPECT_EQ(start, end);
        return start;
    }
};

TEST_F(ScriptCommands, WithoutAPortOnlyValidateWorks)
{
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n"));
    EditBinary(kSoundRequest);
    for (int id : {ui::IdExecute, ui::IdExecuteAsync, ui::IdDownload, ui::IdDownloadFile,
                   ui::IdReceive, ui::IdStress}) {
        ClearEvents();
        Click(id);
        EXPECT_EQ(Statuses(), Texts{"Port not open"}) << "command " << id;
    }
    EXPECT_FALSE(dialog().receiving());
    EXPECT_FALSE(host().IsChecked(window(), ui::IdReceive));
    EXPECT_EQ(dialog().stressIteration(), 0);
    EXPECT_TRUE(Offers().empty());
    SetText(ui::IdEditor, kGoodProgram);
    SelectSource(ui::SourceListRaw); // validation reads a script whatever the list shows
    Click(ui::IdValidate);
    EXPECT_EQ(LastStatus(), "OK");
}

TEST_F(ScriptCommands, AnEmptyEditorOnlyClearsTheStatusBox)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    SetText(ui::IdEditor, "");
    for (int id : {ui::IdValidate, ui::IdExecute, ui::IdExecuteAsync, ui::IdDownload}) {
        ClearEvents();
        Click(id);
        Settle();
        EXPECT_EQ(Statuses(), Texts{""}) << "command " << id;
    }
}

struct RunCase {
    const char* text;
    bool binary;
    int command;
    const char* shown;
};

TEST_F(ScriptCommands, ResultsAreShownAsTheyArriveAndTheEditorKeepsTheFocus)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    const std::string answer = std::string("Exec result: 0 (") + kVersionAnswer + ")";
    const std::string asyncAnswer = std::string("Exec result: ") + kVersionAnswer;
    const RunCase runs[] = {
        {kVersionRequest, true, ui::IdExecute, answer.c_str()},
        {kSoundRequest, true, ui::IdExecute, "Exec ok"},
        {"brick version?", false, ui::IdExecute, answer.c_str()},
        {kVersionRequest, true, ui::IdExecuteAsync, asyncAnswer.c_str()},
        {kSoundRequest, true, ui::IdExecuteAsync, "Exec ok"},
        {kGoodProgram, false, ui::IdValidate, "OK"},
    };
    for (const RunCase& run : runs) {
        SCOPED_TRACE(run.text);
        SetText(ui::IdEditor, run.text);
        SelectSource(run.binary ? ui::SourceListBin : ui::SourceListScript);
        ClearEvents();
        Click(run.command);
        Settle();
        EXPECT_EQ(Statuses(), (Texts{"", run.shown}));
        EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
    }
}

TEST_F(ScriptCommands, AnAsyncCallRefusedOutrightLeavesTheFirstRunning)
{
    // A second execution while the first is still on the slow link: the library refuses it
    // at once and will never report on it.
    ASSERT_NO_FATAL_FAILURE(Start("link-time = 1000\n[brick b1]\n[port COM1]\n", "Serial=COM1"));
    ClearEvents();
    EditBinary(kSoundRequest);
    Click(ui::IdExecuteAsync);
    Click(ui::IdExecuteAsync);
    EXPECT_EQ(LastStatus(),
              "Error (0xe005040a) from Tessel driver: cannot execute request (driver busy)");
    EXPECT_TRUE(Offers().empty());
    EXPECT_EQ(dialog().operationsInFlight(), 1);
    Settle();
    EXPECT_EQ(LastStatus(), "Exec ok");
}

TEST_F(ScriptCommands, ClosingWithAResultOnItsWayAndReceptionOnComesDownCleanly)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    Click(ui::IdReceive);
    ASSERT_TRUE(dialog().receiving());
    EditBinary(kVersionRequest);
    Click(ui::IdExecuteAsync);
    // The fixture counts live workspace objects once the session is gone.
    Stop(false);
}

TEST_F(ScriptCommands, DownloadProgressIsShownInOrderAndEndsWithTheElapsedTime)
{
    const std::pair<std::int16_t, Texts> cases[] = {
        {32, // sixteen 2-byte commands a block
         {"", "Downloading", "Downloading: 40% done", "Downloading: 80% done",
          "Downloaded ok (0 mS)"}},
        {20,
         {"", "Downloading", "Downloading: 25% done", "Downloading: 50% done",
          "Downloading: 75% done", "Downloaded ok (0 mS)"}},
    };
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    EditBinary(SoundProgram(40));
    for (const auto& [block, shown] : cases) {
        SCOPED_TRACE(block);
        ASSERT_GE(
            dialog().session()->Set(dialog().brickHandle(), tessel::PropDownloadBlockSize, block),
            0);
        ClearEvents();
        Click(ui::IdDownload);
        Settle();
        EXPECT_EQ(Statuses(), shown);
        EXPECT_EQ(dialog().downloadTotal(), 40);
        EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
    }
}

TEST_F(ScriptCommands, ATranslationErrorPlacesTheCaretOnTheFaultyWord)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    const std::pair<std::string, int> cases[] = {
        {"program P {\n    main {\n        speed = 1\n    }\n}\n", ui::IdValidate},
        {"sound 4\nwait 10\n", ui::IdExecute},
        {"program P {\n    main {\n        sound 4\n        speed = 2\n    }\n}\n", ui::IdDownload},
    };
    for (const auto& [script, command] : cases) {
        SCOPED_TRACE(script);
        SetText(ui::IdEditor, script);
        Click(command);
        Settle();
        const std::size_t word = script.find(command == ui::IdExecute ? "wait" : "speed");
        EXPECT_EQ(Caret(), static_cast<std::int32_t>(word));
        EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
    }
    // Code 16 takes the compiler's detail, the undeclared name, in place of its table text.
    EXPECT_EQ(LastStatus(), kUndeclared);
}

TEST_F(ScriptCommands, AutoClearRunsFirstAndAFailureStopsBeforeTranslating)
{
    // Every packet to the brick is lost, so clearing it fails; the script is wrong too, but
    // its error must not appear: nothing is translated after the failed clear.
    ASSERT_NO_FATAL_FAILURE(StartOnCom1("", "loss = 100\n"));
    host().SetCheck(window(), ui::IdAutoClear, true);
    SetText(ui::IdEditor, "program P {\n    main {\n        speed = 2\n    }\n}\n");
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(), (Texts{"", "Error (0xe1000204) from Wisp: Retry count exceeded"}));

    // Without Auto Clear the same download reaches the translation.
    host().SetCheck(window(), ui::IdAutoClear, false);
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(LastStatus(), kUndeclared);
}

// main never ends, so the brick's task byte of its first slot and task (0xC8EE) holds the
// running bit (2) beside the defined bit (1) once main was started.
TEST_F(ScriptCommands, AutoRunStartsTheDownloadedProgramAndAutoClearKeepsTheDownload)
{
    for (const bool autoRun : {true, false}) {
        SCOPED_TRACE(autoRun);
        ASSERT_NO_FATAL_FAILURE(StartOnCom1("", "", autoRun ? "AUTORUN=TRUE\nAUTOCLEAR=TRUE" : ""));
        SetText(ui::IdEditor, "program P {\n    main {\n        while (1) {\n"
                              "            wait 100\n        }\n    }\n}\n");
        Click(ui::IdDownload);
        Settle();
        EXPECT_EQ(Statuses(), (Texts{"", "Downloading", "Downloaded ok (0 mS)"}));
        SetText(ui::IdEditor, "get 0xC8EE,1");
        Click(ui::IdExecute);
        EXPECT_EQ(LastStatus(), autoRun ? "Exec result: 3 (0x03)" : "Exec result: 1 (0x01)");
        Stop();
    }
}

TEST_F(ScriptCommands, DownloadFileTranslatesTheNamedFileAndLeavesTheEditorAlone)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1());
    SetText(ui::IdEditor, "not even looked at");
    host().SetEditSelection(window(), ui::IdEditor, 5, 5);
    SetText(ui::IdDownloadFileName, WriteFile("robot.onyx2", kGoodProgram));
    Click(ui::IdDownloadFile);
    Settle();
    EXPECT_EQ(Statuses(), (Texts{"Downloading", "Downloaded ok (0 mS)"}));

    SetText(ui::IdDownloadFileName,
            WriteFile("robot.opal", "task 0\n    sound 4\n    halt\nend\n"));
    SelectSource(ui::SourceListRaw);
    Click(ui::IdDownloadFile);
    Settle();
    EXPECT_EQ(LastStatus(), "Downloaded ok (0 mS)");

    // A broken or missing file: the status box is not cleared first; the caret stays.
    SelectSource(ui::SourceListScript);
    const std::string files[] = {
        WriteFile("broken.onyx2", "program P {\n    main {\n        speed = 1\n    }\n}\n"),
        (dir() / "missing.onyx2").string()};
    for (const std::string& file : files) {
        SCOPED_TRACE(file);
        ClearEvents();
        SetText(ui::IdDownloadFileName, file);
        Click(ui::IdDownloadFile);
        Settle();
        ASSERT_EQ(Statuses().size(), 1u);
        EXPECT_EQ(LastStatus().rfind("Error (0x", 0), 0u) << LastStatus();
        EXPECT_EQ(Offers().size(), 1u);
        EXPECT_EQ(Caret(), 5);
    }
    EXPECT_EQ(Text(ui::IdEditor), "not even looked at");
}

TEST_F(ScriptCommands, ReceptionShowsEachMessageInTurnUntilSwitchedOff)
{
    ASSERT_NO_FATAL_FAILURE(StartOnCom1("messages = 3, 7, 9\n"));
    ASSERT_FALSE(host().IsControlVisible(window(), ui::IdReceive)); // hidden, but clickable
    Click(ui::IdReceive);
    EXPECT_TRUE(dialog().receiving());
    PumpUntil([this] { return Statuses().size() >= 3; });
    EXPECT_EQ(Statuses(),
              (Texts{"Received PBMessage: 3", "Received PBMessage: 7", "Received PBMessage: 9"}));
    // A bad message is shown without a beep.
    host().PostMessage(window(), ui::kMsgBrickMessage, static_cast<ui::WParam>(0xE0050402u), 4);
    Settle();
    EXPECT_EQ(LastStatus(), "Received bad PBMessage, error: 0xe0050402");
    EXPECT_EQ(EventsOf(HeadlessEvent::Kind::Beep).size(), 3u);

    Click(ui::IdReceive);
    EXPECT_FALSE(dialog().receiving());
    EXPECT_FALSE(host().IsChecked(window(), ui::IdReceive));
}

} // namespace
} // namespace commands_test
