// Validate, Execute, Execute Async, Download, Download File, Receive and the reports that the
// library's callbacks post, against the simulated library.
//
// Where a test is about the dialog rather than the language, the editor holds object text
// with the Source list on BIN, which the library takes as code without translating it.
#include <string>

#include "DialogFixture.h"
#include "errors/ErrorText.h"
#include "session/BrickSession.h"

namespace commands_test {
namespace {

using ui::HeadlessEvent;

constexpr const char* kVersionRequest = "tobj 1 6 immediate\ncmd 32\n";
constexpr const char* kVersionAnswer = "0x00,0x03,0x00,0x01,0x00,0x03,0x00,0x09";
constexpr const char* kSoundRequest = "tobj 1 6 immediate\ncmd 20 04\n";

class ScriptCommands : public DialogFixture {
protected:
    // The default installation with its serial tower opened at start-up.
    void StartOpen(const std::string& extraPortLines = "", const std::string& options = "")
    {
        ASSERT_NO_FATAL_FAILURE(
            Start(std::string(kFastLink) + "[brick b1]\n" + "[port COM1]\n" + extraPortLines,
                  "Serial=COM1", options));
        ASSERT_NE(dialog().brickHandle(), 0);
        ClearEvents();
    }
    void EditBinary(const std::string& objectText)
    {
        SetText(ui::IdEditor, objectText);
        SelectSource(ui::SourceListBin);
    }
    void SetBlockSize(std::int16_t bytes)
    {
        ASSERT_GE(
            dialog().session()->Set(dialog().brickHandle(), tessel::PropDownloadBlockSize, bytes),
            0);
    }
};

bool IsReceived(const std::string& text)
{
    return text.rfind("Received PBMessage: ", 0) == 0;
}

TEST_F(ScriptCommands, EveryBrickCommandWithoutAPortSaysPortNotOpen)
{
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n"));
    EditBinary(kSoundRequest);
    for (int id : {ui::IdExecute, ui::IdExecuteAsync, ui::IdDownload, ui::IdDownloadFile}) {
        ClearEvents();
        Click(id);
        EXPECT_EQ(Statuses(), std::vector<std::string>{"Port not open"}) << "command " << id;
    }
    EXPECT_TRUE(Offers().empty());
}

TEST_F(ScriptCommands, ValidateRefusesOpalSource)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "anything");
    SelectSource(ui::SourceListOpal);
    Click(ui::IdValidate);
    EXPECT_EQ(Statuses(), std::vector<std::string>{"Cannot validate Opal source (yet?)"});
}

TEST_F(ScriptCommands, AnEmptyEditorOnlyClearsTheStatusBox)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "");
    for (int id : {ui::IdValidate, ui::IdExecute, ui::IdExecuteAsync, ui::IdDownload}) {
        ClearEvents();
        Click(id);
        Settle();
        EXPECT_EQ(Statuses(), std::vector<std::string>{""}) << "command " << id;
    }
}

TEST_F(ScriptCommands, ExecuteShowsTheResultNumberAndText)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary(kVersionRequest);
    Click(ui::IdExecute);
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"", std::string("Exec result: 0 (") +
                                                            kVersionAnswer + ")"}));
    EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
}

TEST_F(ScriptCommands, ExecuteWithoutAnAnswerSaysExecOk)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary(kSoundRequest);
    Click(ui::IdExecute);
    EXPECT_EQ(LastStatus(), "Exec ok");
}

TEST_F(ScriptCommands, AFailedExecutionIsShownAndOffersHelp)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen("loss = 100\n"));
    EditBinary(kSoundRequest);
    Click(ui::IdExecute);
    EXPECT_EQ(LastStatus(), "Error (0xe1000204) from Wisp: Retry count exceeded");
    EXPECT_EQ(Offers(), std::vector<std::string>{
                            "Error (0xe1000204) from Wisp: Retry count exceeded.\r\nUse Trouble "
                            "Shooter?"});
}

TEST_F(ScriptCommands, ExecuteAsyncShowsTheResultWhenItArrives)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary(kVersionRequest);
    Click(ui::IdExecuteAsync);
    Settle();
    EXPECT_EQ(Statuses(),
              (std::vector<std::string>{"", std::string("Exec result: ") + kVersionAnswer}));
}

TEST_F(ScriptCommands, ExecuteAsyncWithoutAnAnswerSaysExecOk)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary(kSoundRequest);
    Click(ui::IdExecuteAsync);
    Settle();
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"", "Exec ok"}));
}

TEST_F(ScriptCommands, AnAsyncFailureReportedLaterIsShownAndOffersHelp)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen("loss = 100\n"));
    EditBinary(kSoundRequest);
    Click(ui::IdExecuteAsync);
    EXPECT_TRUE(Offers().empty()); // the call itself went through
    Settle();
    EXPECT_EQ(LastStatus(), "Error (0xe1000204) from Wisp: Retry count exceeded");
    EXPECT_EQ(Offers().size(), 1u);
}

TEST_F(ScriptCommands, AnAsyncCallRefusedOutrightIsShownWithoutAnOffer)
{
    // A second execution while the first is still on the slow link: the library refuses it
    // at once and will never report on it.
    ASSERT_NO_FATAL_FAILURE(Start("link-time = 1000\n[brick b1]\n[port COM1]\n", "Serial=COM1"));
    ClearEvents();
    EditBinary(kSoundRequest);
    Click(ui::IdExecuteAsync);
    Click(ui::IdExecuteAsync);
    const std::string busy =
        "Error (0xe005040a) from Tessel driver: cannot execute request (driver busy)";
    EXPECT_EQ(LastStatus(), busy);
    EXPECT_TRUE(Offers().empty());
    EXPECT_EQ(dialog().operationsInFlight(), 1);
    Settle();
    EXPECT_EQ(LastStatus(), "Exec ok");
}

TEST_F(ScriptCommands, AnAsyncResultArrivingAfterTheWindowClosedIsReleased)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary(kVersionRequest);
    Click(ui::IdExecuteAsync);
    // The result file is on its way or queued; the fixture counts live workspace objects
    // after the session is gone.
    Stop(false);
}

TEST_F(ScriptCommands, DownloadProgressIsShownInOrderAndEndsWithTheElapsedTime)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary(SoundProgram(40));
    ASSERT_NO_FATAL_FAILURE(SetBlockSize(32)); // sixteen 2-byte commands a block
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(),
              (std::vector<std::string>{"", "Downloading", "Downloading: 40% done",
                                        "Downloading: 80% done", "Downloaded ok (0 mS)"}));
    EXPECT_EQ(dialog().downloadTotal(), 40);
    EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
}

TEST_F(ScriptCommands, TenOfFortyCommandsShowTwentyFivePercent)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary(SoundProgram(40));
    ASSERT_NO_FATAL_FAILURE(SetBlockSize(20));
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(), (std::vector<std::string>{
                              "", "Downloading", "Downloading: 25% done", "Downloading: 50% done",
                              "Downloading: 75% done", "Downloaded ok (0 mS)"}));
}

TEST_F(ScriptCommands, AnObjectWithoutCommandsSaysNoCodeAndSendsNothing)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    EditBinary("tobj 1 6 program\n");
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"", "No code"}));
    EXPECT_EQ(dialog().operationsInFlight(), 0);
    EXPECT_TRUE(Offers().empty());
}

TEST_F(ScriptCommands, ADownloadRefusedByTheLibraryIsShownAndOffersHelp)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    // Code for a Rover sent to an Onyx2.
    EditBinary(SoundProgram(4, 5));
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(), (std::vector<std::string>{
                              "", "Downloading",
                              "Error (0xe0050403) from Tessel driver: PBrick type mismatch"}));
    EXPECT_EQ(Offers(),
              std::vector<std::string>{"Error (0xe0050403) from Tessel driver: PBrick type "
                                       "mismatch.\r\nUse Trouble Shooter?"});
}

TEST_F(ScriptCommands, ADownloadThatBreaksOffReportsTheErrorOfTheCallback)
{
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port KIVOTOWER1]\nunplug-after = 12\n",
              "USB=KIVOTOWER1"));
    ASSERT_NE(dialog().brickHandle(), 0);
    EditBinary(SoundProgram(40));
    ASSERT_NO_FATAL_FAILURE(SetBlockSize(2)); // one command, one packet
    ClearEvents();
    Click(ui::IdDownload);
    Settle();

    const std::string unplugged =
        "Error (0xe0050474) from Tessel driver: Kivo USB Tower has been unplugged from this port";
    const std::vector<std::string> shown = Statuses();
    ASSERT_GE(shown.size(), 4u);
    EXPECT_EQ(shown[2].rfind("Downloading: ", 0), 0u) << shown[2];
    EXPECT_EQ(shown.back(), unplugged);
    EXPECT_EQ(Offers(), std::vector<std::string>{unplugged + ".\r\nUse Trouble Shooter?"});
}

TEST_F(ScriptCommands, DownloadFileOfAMissingFileShowsTheErrorAndLeavesTheCaret)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "some text in the editor");
    host().SetEditSelection(window(), ui::IdEditor, 5, 5);
    SetText(ui::IdDownloadFileName, (dir() / "missing.onyx2").string());
    Click(ui::IdDownloadFile);
    Settle();

    const std::vector<std::string> shown = Statuses();
    ASSERT_EQ(shown.size(), 1u); // the status box is not cleared first
    EXPECT_EQ(shown[0].rfind("Error (0x", 0), 0u) << shown[0];
    EXPECT_EQ(Offers().size(), 1u);
    std::int32_t start = -1, end = -1;
    host().GetEditSelection(window(), ui::IdEditor, &start, &end);
    EXPECT_EQ(start, 5);
    EXPECT_EQ(end, 5);
}

constexpr const char* kGoodProgram = "program P {\n    main {\n        sound 4\n    }\n}\n";

TEST_F(ScriptCommands, ValidateOfAGoodScriptSaysOk)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, kGoodProgram);
    SelectSource(ui::SourceListRaw); // validation reads a script whatever the list shows
    Click(ui::IdValidate);
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"", "OK"}));
    EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
}

TEST_F(ScriptCommands, ValidateNeedsNoPort)
{
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n"));
    SetText(ui::IdEditor, kGoodProgram);
    Click(ui::IdValidate);
    EXPECT_EQ(LastStatus(), "OK");
}

TEST_F(ScriptCommands, AValidationErrorPlacesTheCaretAndNamesTheErrorWithoutAnOffer)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    const std::string script = "program P {\n    main {\n        speed = 1\n    }\n}\n";
    SetText(ui::IdEditor, script);
    Click(ui::IdValidate);

    // Code 16 takes the compiler's detail, the undeclared name, in place of its table text.
    EXPECT_EQ(LastStatus(), "Error (0xe0050810) from Tessel compiler: speed");
    std::int32_t start = -1, end = -1;
    host().GetEditSelection(window(), ui::IdEditor, &start, &end);
    EXPECT_EQ(start, static_cast<std::int32_t>(script.find("speed")));
    EXPECT_EQ(end, start);
    EXPECT_TRUE(Offers().empty());
}

TEST_F(ScriptCommands, ExecuteOfAnImmediateScriptShowsTheAnswer)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "brick version?");
    Click(ui::IdExecute);
    EXPECT_EQ(LastStatus(), std::string("Exec result: 0 (") + kVersionAnswer + ")");
}

TEST_F(ScriptCommands, ATranslationErrorInExecutePlacesTheCaretAndOffersHelp)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    const std::string script = "sound 4\nwait 10\n";
    SetText(ui::IdEditor, script);
    Click(ui::IdExecute);

    const std::string text =
        "Error (0xe0050884) from Tessel compiler: primitive only available in download mode";
    EXPECT_EQ(LastStatus(), text);
    std::int32_t start = -1, end = -1;
    host().GetEditSelection(window(), ui::IdEditor, &start, &end);
    EXPECT_EQ(start, static_cast<std::int32_t>(script.find("wait")));
    EXPECT_EQ(Offers(), std::vector<std::string>{text + ".\r\nUse Trouble Shooter?"});
    EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
}

TEST_F(ScriptCommands, ATranslationErrorInExecuteAsyncMakesNoOffer)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "sound 4\nwait 10\n");
    Click(ui::IdExecuteAsync);
    Settle();
    EXPECT_EQ(LastStatus(),
              "Error (0xe0050884) from Tessel compiler: primitive only available in download mode");
    EXPECT_TRUE(Offers().empty());
    EXPECT_EQ(dialog().operationsInFlight(), 0);
}

TEST_F(ScriptCommands, ATranslationErrorInDownloadPlacesTheCaretAndOffersHelp)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    const std::string script = "program P {\n    main {\n        sound 4\n        speed = 2\n";
    SetText(ui::IdEditor, script + "    }\n}\n");
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(),
              (std::vector<std::string>{"", "Error (0xe0050810) from Tessel compiler: speed"}));
    std::int32_t start = -1, end = -1;
    host().GetEditSelection(window(), ui::IdEditor, &start, &end);
    EXPECT_EQ(start, static_cast<std::int32_t>(script.find("speed")));
    EXPECT_EQ(Offers().size(), 1u);
}

TEST_F(ScriptCommands, AutoClearRunsFirstAndAFailureStopsBeforeTranslating)
{
    // Every packet to the brick is lost, so clearing it fails; the script is wrong too, but
    // its error must not appear: nothing is translated after the failed clear.
    ASSERT_NO_FATAL_FAILURE(StartOpen("loss = 100\n"));
    SetChecked(ui::IdAutoClear, true);
    SetText(ui::IdEditor, "program P {\n    main {\n        speed = 2\n    }\n}\n");
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(),
              (std::vector<std::string>{"", "Error (0xe1000204) from Wisp: Retry count exceeded"}));
    EXPECT_EQ(Offers().size(), 1u);

    // Without Auto Clear the same download reaches the translation.
    ClearEvents();
    SetChecked(ui::IdAutoClear, false);
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(LastStatus(), "Error (0xe0050810) from Tessel compiler: speed");
}

TEST_F(ScriptCommands, AutoClearOnAHealthyBrickDownloadsAsUsual)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen("", "AUTOCLEAR=TRUE"));
    EXPECT_TRUE(host().IsChecked(window(), ui::IdAutoClear));
    SetText(ui::IdEditor, kGoodProgram);
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"", "Downloading", "Downloaded ok (0 mS)"}));
}

// main never ends, so the brick's task byte of its first slot and task (0xC8EE) holds the
// running bit (2) beside the defined bit (1) once main was started.
constexpr const char* kEndlessProgram =
    "program P {\n    main {\n        while (1) {\n            wait 100\n        }\n    }\n}\n";

TEST_F(ScriptCommands, AutoRunStartsTheDownloadedProgram)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen("", "AUTORUN=TRUE"));
    EXPECT_TRUE(host().IsChecked(window(), ui::IdAutoRun));
    SetText(ui::IdEditor, kEndlessProgram);
    Click(ui::IdDownload);
    Settle();
    EXPECT_EQ(LastStatus(), "Downloaded ok (0 mS)");
    SetText(ui::IdEditor, "get 0xC8EE,1");
    Click(ui::IdExecute);
    EXPECT_EQ(LastStatus(), "Exec result: 3 (0x03)");
}

TEST_F(ScriptCommands, WithoutAutoRunTheProgramStaysStopped)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, kEndlessProgram);
    Click(ui::IdDownload);
    Settle();
    SetText(ui::IdEditor, "get 0xC8EE,1");
    Click(ui::IdExecute);
    EXPECT_EQ(LastStatus(), "Exec result: 1 (0x01)");
}

TEST_F(ScriptCommands, DownloadFileTranslatesTheNamedScript)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdDownloadFileName, WriteFile("robot.onyx2", kGoodProgram));
    SetText(ui::IdEditor, "not even looked at");
    Click(ui::IdDownloadFile);
    Settle();
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"Downloading", "Downloaded ok (0 mS)"}));
}

TEST_F(ScriptCommands, DownloadFileWithTheSourceListOnRawTranslatesOpal)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdDownloadFileName,
            WriteFile("robot.opal", "task 0\n    sound 4\n    halt\nend\n"));
    SelectSource(ui::SourceListRaw);
    Click(ui::IdDownloadFile);
    Settle();
    EXPECT_EQ(LastStatus(), "Downloaded ok (0 mS)");
}

TEST_F(ScriptCommands, ABrokenScriptFileIsShownWithItsDetailAndLeavesTheCaret)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "some text in the editor");
    host().SetEditSelection(window(), ui::IdEditor, 7, 7);
    SetText(ui::IdDownloadFileName,
            WriteFile("broken.onyx2", "program P {\n    main {\n        speed = 1\n    }\n}\n"));
    Click(ui::IdDownloadFile);
    Settle();
    EXPECT_EQ(Statuses(),
              std::vector<std::string>{"Error (0xe0050810) from Tessel compiler: speed"});
    EXPECT_EQ(Offers().size(), 1u);
    std::int32_t start = -1, end = -1;
    host().GetEditSelection(window(), ui::IdEditor, &start, &end);
    EXPECT_EQ(start, 7);
}

TEST_F(ScriptCommands, ReceptionShowsEachMessageInTurnUntilSwitchedOff)
{
    ASSERT_NO_FATAL_FAILURE(Start(
        std::string(kFastLink) + "[brick b1]\nmessages = 3, 7, 9\n[port COM1]\n", "Serial=COM1"));
    ClearEvents();
    ASSERT_FALSE(host().IsControlVisible(window(), ui::IdReceive)); // hidden, but clickable
    Click(ui::IdReceive);
    EXPECT_TRUE(dialog().receiving());
    WaitForStatuses(3, IsReceived);

    EXPECT_EQ(Statuses(),
              (std::vector<std::string>{"Received PBMessage: 3", "Received PBMessage: 7",
                                        "Received PBMessage: 9"}));
    EXPECT_EQ(EventsOf(HeadlessEvent::Kind::Beep).size(), 3u);

    Click(ui::IdReceive);
    EXPECT_FALSE(dialog().receiving());
    EXPECT_FALSE(host().IsChecked(window(), ui::IdReceive));
}

TEST_F(ScriptCommands, ABadMessageShowsItsErrorWithoutABeep)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    host().PostMessage(window(), ui::kMsgBrickMessage, static_cast<ui::WParam>(0xE0050402u), 4);
    Settle();
    EXPECT_EQ(Statuses(), std::vector<std::string>{"Received bad PBMessage, error: 0xe0050402"});
    EXPECT_TRUE(EventsOf(HeadlessEvent::Kind::Beep).empty());
    EXPECT_TRUE(Offers().empty());
}

TEST_F(ScriptCommands, ReceiveWithoutAPortLeavesTheBoxUnchecked)
{
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n"));
    Click(ui::IdReceive);
    EXPECT_EQ(LastStatus(), "Port not open");
    EXPECT_FALSE(dialog().receiving());
    EXPECT_FALSE(host().IsChecked(window(), ui::IdReceive));
}

TEST_F(ScriptCommands, ClosingWhileReceivingSwitchesReceptionOff)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    Click(ui::IdReceive);
    ASSERT_TRUE(dialog().receiving());
    Stop(false); // the session must come down cleanly with the receiver running
}

} // namespace
} // namespace commands_test
