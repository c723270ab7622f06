#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "app/Settings.h"
#include "session/BrickSession.h"
#include "testlib/TestSupport.h"
#include "workspace/LiveObjects.h"

namespace {

TEST(DialogSettingsReading, EveryKeyOrItsDefaultWhenTheFileIsMissing)
{
    testsupport::TempDirectory dir;
    const auto absent = app::ReadDialogSettings((dir.path() + "absent.ini").c_str());
    for (const char* text : {absent.firmwareFile, absent.firmwareDir, absent.serialPort,
                             absent.usbPort, absent.logFile}) {
        EXPECT_STREQ(text, "");
    }
    EXPECT_FALSE(absent.autoRun || absent.autoClear || absent.autoDownload);

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
    EXPECT_TRUE(settings.autoRun && settings.autoClear && settings.autoDownload);
}

TEST(DialogSettingsReading, LongValuesAreCutToTheirBuffers)
{
    testsupport::TempDirectory dir;
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
    for (const char* text : {"true", "True", "TRUE"})
        EXPECT_TRUE(app::IsTrueOption(text)) << text;
    for (const char* text :
         {"1", "yes", "FALSE", "true1", "tru", "", static_cast<const char*>(nullptr)})
        EXPECT_FALSE(app::IsTrueOption(text)) << (text ? text : "null");
}

TEST(TraceOptions, LeadingDecimalNumberKeptToItsLowSixteenBitsAsSigned)
{
    // The last two lie beyond any integer type: still exactly the low 16 bits (10^20 mod 2^16
    // is 0).
    const std::pair<const char*, int> cases[] = {{"7", 7},
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
                                                 {"100000000000000000000", 0},
                                                 {"99999999999999999999", -1}};
    for (const auto& [text, options] : cases)
        EXPECT_EQ(app::ParseTraceOptions(text), options) << text;
    EXPECT_EQ(app::ParseTraceOptions(nullptr), 0);
}

// The trace option goes to the library through the session: the recording library shows
// whether and how Set was called.
class TraceOption : public ::testing::Test {
protected:
    std::string Settings(const std::string& trace)
    {
        return dir.write("h.ini", "[PATHS]\nDLL=" + testsupport::RecordingLibraryDirectory() +
                                      "\n[DEBUG]\nMEMFILES=TRUE\nTRACE=" + trace + "\n");
    }
    const RecordedCall& set() { return library.state().calls[tessel::SlotSet]; }

    testsupport::RecordingLibrary library;
    testsupport::TempDirectory dir;
};

TEST_F(TraceOption, NonZeroOptionsWriteHeaderAndSetPropertyFifteen)
{
    ASSERT_TRUE(library.loaded());
    const std::string settings = Settings("70000");
    {
        BrickSession session(settings.c_str());
        const std::int16_t options = app::ReadTraceOptions(settings.c_str());
        EXPECT_EQ(options, 4464);
        app::ApplyTraceOptions(session, options, (dir.path() + "tsltrace.txt").c_str());
        ASSERT_EQ(set().count, 1);
        EXPECT_EQ(set().numbers[0], 0);
        EXPECT_EQ(set().numbers[1], 15);
        EXPECT_EQ(set().numbers[2], 4464);
    }
    EXPECT_EQ(dir.read("tsltrace.txt"), "Trace file \"tsltrace.txt\", options: 4464\n\n");
    EXPECT_EQ(workspace::LiveObjectCount(), 0);

    // A trace file that cannot be written still switches tracing on.
    BrickSession session(settings.c_str());
    app::ApplyTraceOptions(session, -2, (dir.path() + "no/such/dir/tsltrace.txt").c_str());
    EXPECT_EQ(set().count, 2);
    EXPECT_EQ(set().numbers[2], -2);
}

TEST_F(TraceOption, ZeroOrMissingOptionsWriteNothingAndCallNothing)
{
    ASSERT_TRUE(library.loaded());
    EXPECT_EQ(app::ReadTraceOptions((dir.path() + "absent.ini").c_str()), 0);
    const std::string settings = Settings("");
    BrickSession session(settings.c_str());
    const std::int16_t options = app::ReadTraceOptions(settings.c_str());
    EXPECT_EQ(options, 0);
    app::ApplyTraceOptions(session, options, (dir.path() + "tsltrace.txt").c_str());
    EXPECT_EQ(set().count, 0);
    EXPECT_FALSE(std::filesystem::exists(dir.path() + "tsltrace.txt"));
}

} // namespace
