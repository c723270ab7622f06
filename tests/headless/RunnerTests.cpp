// The headless runner: commands by name, the transcript, and the exit status.
#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "DialogFixture.h"
#include "testlib/TestSupport.h"
#include "ui/headless/HeadlessRunner.h"

using namespace ui;
using commands_test::DialogFixture;

namespace {

class RunnerTest : public DialogFixture {
protected:
    // Runs script on a dialog built from settings; keeps the transcript and the messages.
    int Run(const std::string& script, const std::string& settings = "",
            HeadlessOptions options = {},
            const std::string& library = commands_test::SimulatorDirectory())
    {
        Construct(settings, "", library);
        std::istringstream in(script);
        options.fixedTicks = true;
        HeadlessRunner runner(host(), dialog(), in, out, err, options);
        const int status = runner.Run();
        failed = runner.commandsFailed();
        return status;
    }
    std::ostringstream out;
    std::ostringstream err;
    int failed = 0;
};

} // namespace

TEST(RunnerEscapes, ControlCharactersAreWrittenAsEscapes)
{
    EXPECT_EQ(HeadlessRunner::Escape("a\r\nb\tc\x01"), "a\\r\\nb\\tc\\x01");
    EXPECT_EQ(HeadlessRunner::Escape("\\\\.\\COM1"), "\\\\.\\COM1");
    EXPECT_EQ(HeadlessRunner::Unescape("a\\r\\nb\\tc"), "a\r\nb\tc");
    EXPECT_EQ(HeadlessRunner::Unescape("\\\\.\\COM1"), "\\\\.\\COM1");
    EXPECT_EQ(HeadlessRunner::Unescape("end\\"), "end\\");
}

TEST_F(RunnerTest, StatusAndTranscriptOfEachKindOfRun)
{
    const struct {
        const char* script;
        const char* settings;
        int status;
        int failed;
        const char* out; // expected in the transcript
        const char* err; // the whole error output
    } cases[] = {
        {"# a comment\n\nEditor task main\\r\\n{\\r\\n}\nExpect Editor task main\\r\\n{\\r\\n}\n"
         "Brick Rover\nSource raw\nAuto Run on\nPrint title\n",
         "", HeadlessOk, 0, "title: Tessel Test Client\ndone: 6 commands, 0 failed", ""},
        // Without a port the port commands answer "Port not open".
        {"Statistics\nEditor x\n", "", HeadlessFailed, 1, "status: Port not open", ""},
        {"Editor abc\nExpect Editor abd\nExpect Title Tessel Test Client\n", "", HeadlessFailed, 1,
         "expect: editor is \"abc\"", ""},
        {"Short\n", "", HeadlessFailed, 1, "refused: Short is disabled", ""},
        {"Help 2002\n", "", HeadlessFailed, 1, "refused: no help is open", ""},
        {"editor x\nEXPECT EDITOR x\n", "", HeadlessOk, 0, "> editor x", ""},
        {"Editor x\nExit\nFrobnicate\n", "", HeadlessOk, 0, "> Exit", ""},
        {"Editor x\nFrobnicate now\nEditor y\n", "", HeadlessBadCommand, 0, "> Editor x",
         "harbor: unknown command \"Frobnicate\" (line 2)\n"},
        {"Editorx\n", "", HeadlessBadCommand, 0, "",
         "harbor: unknown command \"Editorx\" (line 1)\n"},
        // Both towers are offered; queued answers or the port named pick the second.
        {"Answer no yes\nOpen\n", "", HeadlessOk, 0,
         "question: Select Port: KIVOTOWER1 -> no\nquestion: Select Port: COM1 -> yes", ""},
        {"Open COM1\n", "", HeadlessOk, 0,
         "question: Select Port: KIVOTOWER1 -> no\nquestion: Select Port: COM1 -> yes", ""},
        {"Print status\n", "[PORTS]\nUSB=KIVOTOWER1\n", HeadlessOk, 0,
         "status: Opened \\\\.\\KIVOTOWER1, Onyx2 brick\n> Print status", ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.script);
        out.str("");
        err.str("");
        EXPECT_EQ(Run(c.script, c.settings), c.status);
        EXPECT_EQ(failed, c.failed);
        EXPECT_NE(out.str().find(c.out), std::string::npos) << out.str();
        EXPECT_EQ(err.str(), c.err);
        // The window is closed however the run ends, and nothing after the end is run.
        EXPECT_TRUE(host().QuitRequested());
        EXPECT_EQ(dialog().session(), nullptr);
        EXPECT_EQ(out.str().find("Editor y"), std::string::npos);
        Stop();
    }
    // The start-up comes before the first command.
    out.str("");
    EXPECT_EQ(Run("Print status\n", "[PORTS]\nUSB=KIVOTOWER1\n"), HeadlessOk);
    EXPECT_EQ(out.str().find("status: Opened"), 0u) << out.str();
    Stop();
    EXPECT_EQ(Run("Brick Helmsman\n"), HeadlessBadCommand);
    EXPECT_NE(err.str().find("Brick has no entry \"Helmsman\""), std::string::npos);
}

TEST_F(RunnerTest, DownloadIsWaitedForBeforeTheNextCommand)
{
    // A translated object as the library writes it: as BIN source it is used untranslated.
    const std::string script = "Source BIN\nEditor tobj 1 6 program\\ntask 0\\ncmd 20 04\\n"
                               "cmd 20 04\\nend\\n\nDownload\nPrint status\n";
    EXPECT_EQ(Run(script, "[PORTS]\nUSB=KIVOTOWER1\n"), HeadlessOk) << out.str();
    const std::string text = out.str();
    const auto downloaded = text.find("status: Downloaded ok (0 mS)");
    ASSERT_NE(downloaded, std::string::npos) << text;
    EXPECT_LT(downloaded, text.find("> Print status"));
}

TEST_F(RunnerTest, HelpSessionTakesTheFollowingCommandsAndEndOfInputClosesIt)
{
    // No tower: the port search fails and the Trouble Shooter is offered.
    SetScenario("link-time = 0\n[brick onyx2]\n[port COM1]\ntower = no\n");
    HeadlessOptions options;
    options.helpDirectory = HARBOR_HELP_DIR;
    EXPECT_EQ(Run("Answer yes\nOpen\nHelp Topic Onyx_ok\nHelp 2000\nEditor after\n"
                  "Expect Editor after\n",
                  "", options),
              HeadlessFailed);
    std::string text = out.str();
    const auto offer = text.find("-> yes");
    const auto opened = text.find("[help] opened shooter.hlp");
    const auto topic = text.find("[help] topic Onyx_ok");
    const auto closed = text.find("[help] closed");
    ASSERT_NE(offer, std::string::npos) << text;
    ASSERT_NE(closed, std::string::npos) << text;
    EXPECT_LT(offer, opened);
    EXPECT_LT(opened, topic);
    EXPECT_LT(topic, closed);
    EXPECT_LT(closed, text.find("> Editor after"));
    EXPECT_EQ(failed, 1) << text;
    Stop();
    out.str("");
    EXPECT_EQ(Run("Answer yes\nOpen\n", "", options), HeadlessFailed);
    EXPECT_NE(out.str().find("[help] closed"), std::string::npos) << out.str();
    EXPECT_TRUE(host().QuitRequested());
}

TEST_F(RunnerTest, AnOperationGivenUpOnIsNotWaitedForAgain)
{
    if (commands_test::RecordingLibraryDirectory().empty())
        GTEST_SKIP() << "no testlib";
    // The recording library accepts the download and never reports back.
    testsupport::RecordingLibrary library(commands_test::RecordingLibraryDirectory() + "/");
    ASSERT_TRUE(library.loaded());
    library.state().results[tessel::SlotCreate] = 3;
    HeadlessOptions options;
    options.waitTimeoutMs = 50;
    EXPECT_EQ(Run("Editor a\nDownload\nEditor b\nEditor c\n", "[PORTS]\nUSB=T\n", options,
                  commands_test::RecordingLibraryDirectory()),
              HeadlessFailed);
    const std::string text = out.str();
    const auto first = text.find("wait: timed out");
    ASSERT_NE(first, std::string::npos) << text;
    EXPECT_EQ(text.find("wait: timed out", first + 1), std::string::npos) << text;
    EXPECT_LT(first, text.find("> Editor b"));
    Stop();
}
