#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "app/Settings.h"
#include "session/BrickSession.h"
#include "testlib/TestSupport.h"
#include "workspace/LiveObjects.h"

namespace {

// Each key reaching the dialog is checked with the dialog; here the defaults and the bounds.
TEST(DialogSettingsReading, MissingFileGivesDefaultsAndLongValuesAreCutToTheirBuffers)
{
    testsupport::TempDirectory dir;
    const auto absent = app::ReadDialogSettings((dir.path() + "absent.ini").c_str());
    for (const char* text : {absent.firmwareFile, absent.firmwareDir, absent.serialPort,
                             absent.usbPort, absent.logFile}) {
        EXPECT_STREQ(text, "");
    }
    EXPECT_FALSE(absent.autoRun || absent.autoClear || absent.autoDownload);

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
TEST(TraceOption, NonZeroOptionsWriteHeaderAndSetPropertyFifteenZeroDoesNothing)
{
    testsupport::RecordingLibrary library;
    ASSERT_TRUE(library.loaded());
    testsupport::TempDirectory dir;
    const RecordedCall& set = library.state().calls[tessel::SlotSet];
    const auto settings = [&](const std::string& trace) {
        return dir.write("h.ini", "[PATHS]\nDLL=" + testsupport::RecordingLibraryDirectory() +
                                      "\n[DEBUG]\nMEMFILES=TRUE\nTRACE=" + trace + "\n");
    };
    EXPECT_EQ(app::ReadTraceOptions((dir.path() + "absent.ini").c_str()), 0);
    {
        const std::string path = settings("");
        BrickSession session(path.c_str());
        EXPECT_EQ(app::ReadTraceOptions(path.c_str()), 0);
        app::ApplyTraceOptions(session, 0, (dir.path() + "tsltrace.txt").c_str());
        EXPECT_EQ(set.count, 0);
        EXPECT_FALSE(std::filesystem::exists(dir.path() + "tsltrace.txt"));
    }
    const std::string path = settings("70000");
    {
        BrickSession session(path.c_str());
        const std::int16_t options = app::ReadTraceOptions(path.c_str());
        EXPECT_EQ(options, 4464);
        app::ApplyTraceOptions(session, options, (dir.path() + "tsltrace.txt").c_str());
        ASSERT_EQ(set.count, 1);
        EXPECT_EQ(set.numbers[0], 0);
        EXPECT_EQ(set.numbers[1], 15);
        EXPECT_EQ(set.numbers[2], 4464);
    }
    EXPECT_EQ(dir.read("tsltrace.txt"), "Trace file \"tsltrace.txt\", options: 4464\n\n");
    EXPECT_EQ(workspace::LiveObjectCount(), 0);

    // A trace file that cannot be written still switches tracing on.
    BrickSession session(path.c_str());
    app::ApplyTraceOptions(session, -2, (dir.path() + "no/such/dir/tsltrace.txt").c_str());
    EXPECT_EQ(set.count, 2);
    EXPECT_EQ(set.numbers[2], -2);
}

} // namespace
