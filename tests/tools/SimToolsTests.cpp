// The brick tools through the dialog on the headless host, against the simulated library
// (zero link time): Info, Upload and the firmware download. Status texts of the failure table
// are the fault matrix's.
#include <regex>
#include <string>
#include <vector>

#include "commands/DialogFixture.h"

#ifndef HARBOR_FIRMWARE_DIR
#define HARBOR_FIRMWARE_DIR ""
#endif

namespace tools_test {
namespace {

using commands_test::DialogFixture;
using commands_test::kFastLink;

// One sound command: 2 bytes of code.
constexpr const char* kSound = "cmd 20 04\n";
// Return from a subroutine: 1 byte.
constexpr const char* kReturn = "cmd 13\n";

std::string Repeat(const char* line, int count)
{
    std::string text;
    for (int i = 0; i < count; ++i)
        text += line;
    return text;
}

// Tasks 1 and 3 (object tasks 0 and 2) of 12 and taskThreeBytes bytes, subroutine 2 (object
// sub 1) of 11 code bytes, which the brick closes with one more.
std::string ProgramOneThreeTwo(int brickType = 6, int taskThreeBytes = 140)
{
    return "tobj 1 " + std::to_string(brickType) + " program\n" + "task 0\n" + Repeat(kSound, 6) +
           "end\n" + "task 2\n" + Repeat(kSound, taskThreeBytes / 2) + "end\n" + "sub 1\n" +
           Repeat(kSound, 5) + kReturn + "end\n";
}

// A comma and a two-digit hex value, count times.
std::string Values(int count)
{
    return "(,0x[0-9a-f]{2}){" + std::to_string(count) + "}";
}

bool Matches(const std::string& line, const std::string& pattern)
{
    return std::regex_match(line, std::regex(pattern));
}

class SimTools : public DialogFixture {
protected:
    void StartOpen(const std::string& brickLines = "")
    {
        ASSERT_NO_FATAL_FAILURE(Start(
            std::string(kFastLink) + "[brick b1]\n" + brickLines + "[port COM1]\n", "Serial=COM1"));
        ASSERT_NE(dialog().brickHandle(), 0);
        ClearEvents();
    }

    void DownloadObject(const std::string& objectText)
    {
        SetText(ui::IdEditor, objectText);
        SelectSource(ui::SourceListBin);
        Click(ui::IdDownload);
        Settle();
        ASSERT_EQ(LastStatus().rfind("Downloaded ok", 0), 0u) << LastStatus();
        ClearEvents();
    }

    std::string Info()
    {
        Click(ui::IdInfo);
        return LastStatus();
    }
};

TEST_F(SimTools, InfoAndUploadShowExactlyTheDownloadedTasksAndSubroutines)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    SetText(ui::IdEditor, "something");
    Click(ui::IdUpload); // an empty slot empties the editor
    EXPECT_EQ(LastStatus(), "Ok");
    EXPECT_EQ(Text(ui::IdEditor), "");

    ASSERT_NO_FATAL_FAILURE(DownloadObject(ProgramOneThreeTwo()));
    const std::string report = Info();
    EXPECT_EQ(report.rfind("Active PBrick information:\r\n\tVersion (ROM.firmware): 0301.0309", 0),
              0u)
        << report;
    // Code bytes of the slot: 12 + 140 + 11.
    for (const char* part : {"\tProgram slot: 1 tasks: 1, 3, subs: 2, size: 163 bytes\r\n",
                             "\tPort COM1 is RS232 IR\r\n", "\r\nGeneral information for "})
        EXPECT_NE(report.find(part), std::string::npos) << part << "\nin\n" << report;
    EXPECT_EQ(report.find("Port Tx Power"), std::string::npos) << report;

    Click(ui::IdUpload);
    EXPECT_EQ(LastStatus(), "Ok");
    // A task over 128 bytes is read in two commands and still gives one list.
    EXPECT_TRUE(Matches(Text(ui::IdEditor), "task,0,12,[0-9]+,0x20,0x04" + Values(10) +
                                                "\r\ntask,2,140,[0-9]+" + Values(140) +
                                                "\r\nsub,1,11,0" + Values(10) + ",0x13\r\n"))
        << Text(ui::IdEditor);
    EXPECT_TRUE(Offers().empty());
}

TEST_F(SimTools, SilentBrickLeavesItsSectionWithOnlyTheHeading)
{
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\nalive = no\n" +
                                      "[port COM1]\n[port COM2]\nstate = missing\n",
                                  "Serial=COM1"));
    const std::string report = Info();
    EXPECT_EQ(report.rfind("Active PBrick information:\r\n\r\nActive Port information:\r\n", 0), 0u)
        << report;
    // The port that does not exist is listed with its reason.
    EXPECT_NE(report.find("COM2(-), "), std::string::npos) << report;
    EXPECT_NE(report.find("\r\nGeneral information for "), std::string::npos) << report;
}

TEST_F(SimTools, RoverListsTheTasksOfSlotOneAndUploadsOnlyThem)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen("type = rover\n"));
    SelectBrick(ui::BrickListRover);
    ASSERT_NO_FATAL_FAILURE(DownloadObject(ProgramOneThreeTwo(5, 12)));
    const std::string report = Info();
    EXPECT_NE(report.find("\tProgram slot: 1 tasks: 1, 3, subs: 2, size: "), std::string::npos)
        << report;
    EXPECT_EQ(report.find("size: -"), std::string::npos) << report;

    Click(ui::IdUpload);
    EXPECT_EQ(LastStatus(), "Ok");
    // A Rover's addresses name 16-bit cells, so its sizes count cells; what matters here is
    // that only the tasks are listed.
    EXPECT_TRUE(Matches(Text(ui::IdEditor), "task,0,[^\r]*\r\ntask,2,[^\r]*\r\n"))
        << Text(ui::IdEditor);
}

class SimFirmware : public SimTools {
protected:
    void Download(const std::string& image)
    {
        SetText(ui::IdFirmwareFileName, std::string(HARBOR_FIRMWARE_DIR) + "/" + image);
        Click(ui::IdNewFirmware);
        Settle();
    }
};

TEST_F(SimFirmware, SampleImageDownloadsAndTheVersionChanges)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen("version = 0301.0200\n"));
    EXPECT_NE(Info().find("Version (ROM.firmware): 0301.0200"), std::string::npos);
    ClearEvents();
    SelectBrick(ui::BrickListRover);
    Download("Onyx2firm.kvo");
    EXPECT_EQ(LastStatus(), "Downloaded firmware ok (0 ms)");
    EXPECT_FALSE(dialog().firmwarePending());
    EXPECT_TRUE(Offers().empty());
    // The Brick list follows the detected model.
    EXPECT_EQ(host().ListSelection(window(), ui::IdBrickList), ui::BrickListOnyx2);
    EXPECT_NE(Info().find("Version (ROM.firmware): 0301.0309"), std::string::npos);
}

TEST_F(SimFirmware, CorruptedImageFailsWithItsCode)
{
    ASSERT_NO_FATAL_FAILURE(StartOpen());
    Download("corrupt.kvo");
    EXPECT_NE(LastStatus().find("Error (0xe0050415)"), std::string::npos) << LastStatus();
    EXPECT_EQ(Offers().size(), 1u);
    EXPECT_FALSE(dialog().firmwarePending());
    EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);
}

TEST_F(SimFirmware, ATowerPulledOutAnywhereLeavesNoClosingStepsPending)
{
    // Wherever the link breaks, a failed firmware download must not leave its closing steps
    // for the next ordinary download to run.
    for (int packet = 1; packet <= 24; ++packet) {
        SCOPED_TRACE(packet);
        ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port KIVOTOWER1]\n" +
                                          "unplug-after = " + std::to_string(packet) + "\n",
                                      "USB=KIVOTOWER1"));
        Download("Onyx2firm.kvo");
        EXPECT_FALSE(dialog().firmwarePending());
        Stop();
    }
}

} // namespace
} // namespace tools_test
