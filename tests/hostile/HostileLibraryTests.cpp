// The client against a library that breaks every promise (see HostileLibrary.cpp): every
// command comes back, what the status box shows fits it, an error text is shown where the
// library failed, and nothing of the workspace is left alive afterwards.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "HeadlessSession.h"
#include "ui/headless/HeadlessRunner.h"
#include "workspace/LiveObjects.h"

namespace reliability {
namespace {

// The longest text the dialog composes for its status box is the info report (8 KiB with its
// terminator); a library's unterminated text must not make any status longer. A transcript
// line escapes control characters, so it is compared unescaped.
constexpr std::size_t kLongestText = 8191;
// Names and texts the library hands back are cut to the client's buffers, terminator included.
constexpr std::size_t kPathSize = 260;

std::size_t LongestRun(const std::string& text, char letter)
{
    std::size_t longest = 0;
    std::size_t run = 0;
    for (char c : text) {
        run = c == letter ? run + 1 : 0;
        longest = std::max(longest, run);
    }
    return longest;
}

class HostileLibrary : public ::testing::Test {
protected:
    void SetUp() override { ::unsetenv("HARBOR_HOSTILE"); }

    Transcript Run(const std::string& script, bool answerYes = false)
    {
        SessionSetup setup;
        setup.libraryDir = HARBOR_HOSTILE_DIR;
        setup.answerYes = answerYes;
        setup.timeoutMs = 5000;
        return RunHeadless(dir_, setup, script);
    }

    static void ExpectBounded(const Transcript& transcript)
    {
        for (const std::string& status : Transcript::Statuses(transcript.lines)) {
            EXPECT_LE(ui::HeadlessRunner::Unescape(status).size(), kLongestText) << status;
        }
        // The run ended by itself: the closing line is there, no command was cut off.
        ASSERT_FALSE(transcript.lines.empty());
        EXPECT_EQ(transcript.lines.back().rfind("done: ", 0), 0u) << transcript.text();
        EXPECT_NE(transcript.exitStatus, ui::HeadlessBadCommand) << transcript.text();
    }

    ScratchDir dir_{"hostile"};
};

TEST_F(HostileLibrary, EndlessPortWalkAndUnterminatedTextsStayBounded)
{
    const Transcript transcript = Run("Open\nAnswer yes\nOpen\nTest\nStatistics\nShort\nMedium\n"
                                      "Long\nClose\n");
    ExpectBounded(transcript);
    // The port name (all 'P', never terminated) is cut to a path buffer; the status texts
    // (all 'S') and statistics (all 'G') to theirs.
    for (const std::string& status : Transcript::Statuses(transcript.lines)) {
        EXPECT_LT(LongestRun(status, 'P'), kPathSize) << status;
        EXPECT_LT(LongestRun(status, 'S'), kPathSize) << status;
        EXPECT_LT(LongestRun(status, 'G'), kPathSize) << status;
    }
    // A brick status the client does not know, with an unterminated text: the text is shown
    // and the Trouble Shooter offered.
    EXPECT_TRUE(Transcript::Offered(transcript.of("Test"))) << transcript.text();
    // The endless walk offered at most ten ports.
    std::size_t questions = 0;
    for (const std::string& line : transcript.of("Open")) {
        questions += line.rfind("question: Select Port", 0) == 0 ? 1 : 0;
    }
    EXPECT_LE(questions, 10u) << transcript.text();
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

TEST_F(HostileLibrary, CallbacksFromManyThreadsAndAfterTheEndAreSurvived)
{
    const Transcript transcript =
        Run("Editor program p { main { sound 4 } }\nDownload\nExecute\nExecute Async\n"
            "Receive on\nPump 100\nReceive off\nDownload\nWait\n");
    ExpectBounded(transcript);
    // The failure one of the threads reports is shown and offers the Trouble Shooter; which
    // command is running when it arrives depends on the threads, so the whole run is searched.
    EXPECT_TRUE(Transcript::Offered(transcript.lines)) << transcript.text();
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

TEST_F(HostileLibrary, EndlessTranslationDetailIsCutToTheErrorText)
{
    const Transcript transcript = Run("Editor frobnicate\nValidate\nDownload\nExecute\nStress 3\n");
    ExpectBounded(transcript);
    const std::vector<std::string> statuses = Transcript::Statuses(transcript.of("Validate"));
    ASSERT_FALSE(statuses.empty()) << transcript.text();
    // The 64 KiB detail is cut into the catalogue's 256-byte text.
    EXPECT_EQ(statuses.back().rfind("Error (0xe0050c41) from Tessel tsl: ", 0), 0u)
        << transcript.text();
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

TEST_F(HostileLibrary, InfoUploadAndConversionsEndWithEndlessEnumerations)
{
    const Transcript transcript = Run("Info\nUpload\nConvert to CSV\nMacro To CSV\n"
                                      "Download Firmware\nWait\n");
    ExpectBounded(transcript);
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

TEST_F(HostileLibrary, TroubleShooterRunEnds)
{
    const Transcript transcript = Run("Test\nHelp 2000\n", true);
    ExpectBounded(transcript);
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

} // namespace
} // namespace reliability
