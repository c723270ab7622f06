#include <gtest/gtest.h>
#include <unistd.h>

#include <cstring>
#include <string>

#include "app/Settings.h"
#include "session/BrickSession.h"
#include "testlib/TestSupport.h"
#include "workspace/LiveObjects.h"

namespace {

class DialogSettingsReading : public ::testing::Test {
protected:
    testsupport::TempDirectory dir;
};

TEST_F(DialogSettingsReading, MissingFileGivesDefaults)
{
    const auto settings = app::ReadDialogSettings((dir.path() + "absent.ini").c_str());
    for (const char* text : {settings.firmwareFile, settings.firmwareDir, settings.serialPort,
                             settings.usbPort, settings.logFile}) {
        EXPECT_STREQ(text, "");
    }
    EXPECT_FALSE(settings.autoRun || settings.autoClear || settings.autoDownload);
}

TEST_F(DialogSettingsReading, ReadsEveryKey)
{
    const std::string path =
        dir.write("h.ini", "[FIRMWARE]\nSOURCE=fw.kvo\n[PATHS]\nFIRMWARE=/fw/\n"
                           "[PORTS]\nserial=COM1\nUSB=USB0\n[OPTIONS]\nAUTORUN=True\n"
                           "AUTOCLEAR=tRuE\nAUTODOWNLOAD=true\n[DEBUG]\nLOGFILE=log.txt\n");
    const auto settings = app::ReadDialogSettings(path.c_str());
    EXPECT_STREQ(settings.firmwareFile, "fw.kvo");
    EXPECT_STREQ(settings.firmwareDir, "/fw/");
    EXPECT_STREQ(settings.serialPort, "COM1");
    EXPECT_STREQ(settings.usbPort, "USB0");
    EXPECT_STREQ(settings.logFile, "log.txt");
    EXPECT_TRUE(settings.autoRun);
    EXPECT_TRUE(settings.autoClear);
    EXPECT_TRUE(settings.autoDownload);
}

TEST_F(DialogSettingsReading, LongValuesAreCutToTheirBuffers)
{
    const std::string longPort(400, 'p');
    const std::string path =
        dir.write("h.ini", "[PORTS]\nUSB=" + longPort + "\n[OPTIONS]\nAUTORUN=true" +
                               std::string(20, ' ') + "x\n");
    const auto settings = app::ReadDialogSettings(path.c_str());
    EXPECT_EQ(std::string(settings.usbPort), longPort.substr(0, 259));
    // "true" followed by more than the 12-character buffer holds is cut to "true" + blanks.
    EXPECT_FALSE(settings.autoRun);
}

TEST(BooleanOption, OnlyTrueInAnyLetterCaseIsTrue)
{
    for (const char* text : {"true", "True", "TRUE"}) {
        EXPECT_TRUE(app::IsTrueOption(text)) << text;
    }
    for (const char* text : {"1", "yes", "FALSE", "true1", "tru", ""}) {
        EXPECT_FALSE(app::IsTrueOption(text)) << text;
    }
    EXPECT_FALSE(app::IsTrueOption(nullptr));
}

TEST(TraceOptions, LeadingDecimalNumberKeptToItsLowSixteenBitsAsSigned)
{
    const struct {
        const char* text;
        int options;
    } cases[] = {
        {"7", 7},
        {"  +12abc", 12},
        {"-3", -3},
        {"", 0},
        {"abc", 0},
        {"-", 0},
        {"0x10", 0},
        {"65536", 0},
        {"65537", 1},
        {"32768", -32768},
        {"70000", 4464},
        {"-32769", 32767},
        // Far beyond any integer type: still exactly the low 16 bits (10^20 mod 2^16 = 0).
        {"100000000000000000000", 0},
        {"99999999999999999999", -1},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(app::ParseTraceOptions(c.text), c.options) << c.text;
    }
    EXPECT_EQ(app::ParseTraceOptions(nullptr), 0);
}

// The trace option goes to the library through the session: the recording library shows
// whether and how Set was called.
class TraceOption : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(library.loaded());
        settings = dir.write("h.ini", "[PATHS]\nDLL=" + testsupport::RecordingLibraryDirectory() +
                                          "\n[DEBUG]\nMEMFILES=TRUE\nTRACE=" + trace + "\n");
    }

    std::string trace = "70000";
    testsupport::RecordingLibrary library;
    testsupport::TempDirectory dir;
    std::string settings;
};

TEST_F(TraceOption, NonZeroOptionsWriteHeaderAndSetPropertyFifteen)
{
    {
        BrickSession session(settings.c_str());
        const std::int16_t options = app::ReadTraceOptions(settings.c_str());
        EXPECT_EQ(options, 4464);
        app::ApplyTraceOptions(session, options, (dir.path() + "tsltrace.txt").c_str());
        const RecordedCall& set = library.state().calls[tessel::SlotSet];
        ASSERT_EQ(set.count, 1);
        EXPECT_EQ(set.numbers[0], 0);
        EXPECT_EQ(set.numbers[1], 15);
        EXPECT_EQ(set.numbers[2], 4464);
    }
    EXPECT_EQ(dir.read("tsltrace.txt"), "Trace file \"tsltrace.txt\", options: 4464\n\n");
    EXPECT_EQ(workspace::LiveObjectCount(), 0);

    // A trace file that cannot be written still switches tracing on.
    BrickSession session(settings.c_str());
    app::ApplyTraceOptions(session, -2, (dir.path() + "no/such/dir/tsltrace.txt").c_str());
    EXPECT_EQ(library.state().calls[tessel::SlotSet].count, 2);
    EXPECT_EQ(library.state().calls[tessel::SlotSet].numbers[2], -2);
}

TEST_F(TraceOption, DefaultsToTheCurrentDirectory)
{
    BrickSession session(settings.c_str());
    const std::string previous = std::filesystem::current_path().string();
    std::filesystem::current_path(dir.path());
    app::ApplyTraceOptions(session, 3);
    std::filesystem::current_path(previous);
    EXPECT_EQ(dir.read("tsltrace.txt"), "Trace file \"tsltrace.txt\", options: 3\n\n");
}

TEST_F(TraceOption, ZeroOrMissingOptionsWriteNothingAndCallNothing)
{
    EXPECT_EQ(app::ReadTraceOptions((dir.path() + "absent.ini").c_str()), 0);
    settings = dir.write("h2.ini", "[PATHS]\nDLL=" + testsupport::RecordingLibraryDirectory() +
                                       "\n[DEBUG]\nMEMFILES=TRUE\nTRACE=\n");
    BrickSession session(settings.c_str());
    const std::int16_t options = app::ReadTraceOptions(settings.c_str());
    EXPECT_EQ(options, 0);
    app::ApplyTraceOptions(session, options, (dir.path() + "tsltrace.txt").c_str());
    EXPECT_EQ(library.state().calls[tessel::SlotSet].count, 0);
    EXPECT_FALSE(std::filesystem::exists(dir.path() + "tsltrace.txt"));
}

} // namespace
