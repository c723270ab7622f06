// The headless runner: commands by name, the transcript, and the exit status.
#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "FrameFixture.h"
#include "testlib/TestSupport.h"
#include "ui/headless/HeadlessRunner.h"

using namespace ui;
using headless_test::FrameFixture;

namespace {

class RunnerTest : public FrameFixture {
protected:
    // Runs script on a dialog built from settings; keeps the transcript and the messages.
    int Run(const std::string& script, const std::string& settings = "",
            HeadlessOptions options = {}, const std::string& fileArgument = "",
            const std::string& library = headless_test::SimulatorDirectory())
    {
        Construct(settings, fileArgument, library);
        std::istringstream in(script);
        options.fixedTicks = true;
        HeadlessRunner runner(host(), dialog(), in, out, err, options);
        const int status = runner.Run();
        failed = runner.commandsFailed();
        run = runner.commandsRun();
        return status;
    }
    std::ostringstream out;
    std::ostringstream err;
    int failed = 0;
    int run = 0;
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

TEST_F(RunnerTest, SucceedingCommandsGiveZero)
{
    EXPECT_EQ(Run("# a comment\n\nEditor task main\\r\\n{\\r\\n}\n"
                  "Expect Editor task main\\r\\n{\\r\\n}\nBrick Rover\nSource raw\n"
                  "Auto Run on\nPrint title\n"),
              HeadlessOk)
        << out.str() << err.str();
    EXPECT_EQ(run, 6);
    EXPECT_EQ(failed, 0);
    EXPECT_NE(out.str().find("> Editor task main"), std::string::npos);
    EXPECT_NE(out.str().find("title: Tessel Test Client\n"), std::string::npos);
    EXPECT_NE(out.str().find("done: 6 commands, 0 failed"), std::string::npos);
    EXPECT_TRUE(err.str().empty());
}

TEST_F(RunnerTest, FailureShownMakesTheRunFail)
{
    // Without a port the port commands answer "Port not open".
    EXPECT_EQ(Run("Statistics\nEditor x\n"), HeadlessFailed) << out.str();
    EXPECT_EQ(failed, 1);
    EXPECT_NE(out.str().find("status: Port not open"), std::string::npos);
}

TEST_F(RunnerTest, ExpectationsThatDoNotHoldFail)
{
    EXPECT_EQ(Run("Editor abc\nExpect Editor abd\nExpect Title Tessel Test Client\n"),
              HeadlessFailed);
    EXPECT_EQ(failed, 1);
    EXPECT_NE(out.str().find("expect: editor is \"abc\""), std::string::npos);
}

TEST_F(RunnerTest, DisabledButtonIsRefused)
{
    EXPECT_EQ(Run("Short\n"), HeadlessFailed);
    EXPECT_NE(out.str().find("refused: Short is disabled"), std::string::npos);
}

TEST_F(RunnerTest, UnknownCommandEndsTheRunWithTwo)
{
    EXPECT_EQ(Run("Editor x\nFrobnicate now\nEditor y\n"), HeadlessBadCommand);
    EXPECT_EQ(err.str(), "harbor: unknown command \"Frobnicate\" (line 2)\n");
    EXPECT_EQ(out.str().find("Editor y"), std::string::npos);
    // The window was closed all the same.
    EXPECT_TRUE(host().QuitRequested());
    EXPECT_EQ(dialog().session(), nullptr);
}

TEST_F(RunnerTest, BadArgumentEndsTheRunWithTwo)
{
    EXPECT_EQ(Run("Brick Helmsman\n"), HeadlessBadCommand);
    EXPECT_NE(err.str().find("Brick has no entry \"Helmsman\""), std::string::npos);
}

TEST_F(RunnerTest, NamesIgnoreCaseButNeedTheWholeWord)
{
    EXPECT_EQ(Run("editor x\nEXPECT EDITOR x\n"), HeadlessOk) << out.str() << err.str();
    EXPECT_EQ(Run("Editorx\n"), HeadlessBadCommand);
}

TEST_F(RunnerTest, ExitStopsReadingCommands)
{
    EXPECT_EQ(Run("Editor x\nExit\nFrobnicate\n"), HeadlessOk) << err.str();
    EXPECT_TRUE(err.str().empty());
}

TEST_F(RunnerTest, AnswersAreTakenInOrderAndPolicyDecidesTheRest)
{
    // Both of the simulator's towers are offered; the queued No then Yes picks the second.
    EXPECT_EQ(Run("Answer no yes\nOpen\n"), HeadlessOk) << out.str();
    EXPECT_NE(out.str().find("question: Select Port: KIVOTOWER1 -> no"), std::string::npos);
    EXPECT_NE(out.str().find("question: Select Port: COM1 -> yes"), std::string::npos);
}

TEST_F(RunnerTest, OpenChoosesThePortNamed)
{
    EXPECT_EQ(Run("Open COM1\n"), HeadlessOk) << out.str();
    EXPECT_NE(out.str().find("question: Select Port: KIVOTOWER1 -> no"), std::string::npos);
    EXPECT_NE(out.str().find("question: Select Port: COM1 -> yes"), std::string::npos);
}

TEST_F(RunnerTest, StartupIsPrintedBeforeTheFirstCommand)
{
    EXPECT_EQ(Run("Print status\n", "[PORTS]\nUSB=KIVOTOWER1\n"), HeadlessOk) << out.str();
    const std::string text = out.str();
    EXPECT_EQ(text.find("status: Opened \\\\.\\KIVOTOWER1, Onyx2 brick\n"), 0u) << text;
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

TEST_F(RunnerTest, HelpSessionTakesTheFollowingCommands)
{
    // No tower: the port search fails and the Trouble Shooter is offered.
    SetScenario("link-time = 0\n[brick onyx2]\n[port COM1]\ntower = no\n");
    HeadlessOptions options;
    options.helpDirectory = HARBOR_HELP_DIR;
    EXPECT_EQ(Run("Answer yes\nOpen\nHelp Topic Onyx_ok\nHelp 2000\nEditor after\n"
                  "Expect Editor after\n",
                  "", options),
              HeadlessFailed)
        << out.str();
    const std::string text = out.str();
    const auto offer = text.find("-> yes");
    const auto opened = text.find("[help] opened shooter.hlp");
    const auto topic = text.find("[help] topic Onyx_ok");
    const auto closed = text.find("[help] closed");
    const auto after = text.find("> Editor after");
    ASSERT_NE(offer, std::string::npos) << text;
    ASSERT_NE(closed, std::string::npos) << text;
    EXPECT_LT(offer, opened);
    EXPECT_LT(opened, topic);
    EXPECT_LT(topic, closed);
    EXPECT_LT(closed, after);
    EXPECT_EQ(failed, 1) << text;
}

TEST_F(RunnerTest, EndOfInputClosesAnOpenHelpSession)
{
    SetScenario("link-time = 0\n[brick onyx2]\n[port COM1]\ntower = no\n");
    HeadlessOptions options;
    options.helpDirectory = HARBOR_HELP_DIR;
    EXPECT_EQ(Run("Answer yes\nOpen\n", "", options), HeadlessFailed) << out.str();
    EXPECT_NE(out.str().find("[help] closed"), std::string::npos) << out.str();
    EXPECT_TRUE(host().QuitRequested());
}

TEST_F(RunnerTest, HelpWithoutASessionIsRefused)
{
    EXPECT_EQ(Run("Help 2002\n"), HeadlessFailed);
    EXPECT_NE(out.str().find("refused: no help is open"), std::string::npos);
}

TEST_F(RunnerTest, AnOperationGivenUpOnIsNotWaitedForAgain)
{
    if (headless_test::RecordingLibraryDirectory().empty())
        GTEST_SKIP() << "no testlib";
    // The recording library accepts the download and never reports back.
    testsupport::RecordingLibrary library(headless_test::RecordingLibraryDirectory() + "/");
    ASSERT_TRUE(library.loaded());
    library.state().results[tessel::SlotCreate] = 3;
    HeadlessOptions options;
    options.waitTimeoutMs = 50;
    EXPECT_EQ(Run("Editor a\nDownload\nEditor b\nEditor c\n", "[PORTS]\nUSB=T\n", options, "",
                  headless_test::RecordingLibraryDirectory()),
              HeadlessFailed);
    const std::string text = out.str();
    const auto first = text.find("wait: timed out");
    ASSERT_NE(first, std::string::npos) << text;
    EXPECT_EQ(text.find("wait: timed out", first + 1), std::string::npos) << text;
    EXPECT_LT(first, text.find("> Editor b"));
    Stop();
}
