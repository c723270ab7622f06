// The Info report's text against the scripted brick; the simulator's run checks what a real
// session gives it.
#include <gtest/gtest.h>

#include <string>

#include "FakeBrick.h"
#include "tessel/ErrorValue.h"
#include "tools/BrickQueries.h"
#include "tools/InfoReport.h"
#include "workspace/LiveObjects.h"

using toolstest::FakeBrick;

namespace {

constexpr tessel::Long kHandle = 3;

tessel::Long Code(int reason, int severity = 3)
{
    return static_cast<tessel::Long>(ErrorValue(severity, 5, 1, reason).packedCode());
}

class InfoReportTest : public ::testing::Test {
protected:
    InfoReportTest()
    {
        brick.enums[tessel::EnumComPorts] = {{0, "COM1"}, {Code(82, 2), "COM2"}};
        brick.enums[tessel::EnumBrickTypes] = {{0, "Rover"}, {0, "Onyx2"}};
        brick.enums[tessel::EnumSourceTypes] = {{0, "Script"}};
    }

    void TearDown() override { EXPECT_EQ(workspace::LiveObjectCount(), before_); }

    std::string Build(bool expected = true)
    {
        tools::InfoReport report(brick, queries);
        EXPECT_EQ(report.Build(kHandle), expected);
        return report.text();
    }

    FakeBrick brick;
    tools::BrickQueries queries{brick};
    std::int64_t before_ = workspace::LiveObjectCount();
};

} // namespace

TEST_F(InfoReportTest, ProgramWithTasksOneAndThreeAndSubroutineTwo)
{
    brick.LoadProgram(1, {0, 12}, {12, 0, 20});
    EXPECT_EQ(Build(), "Active PBrick information:\r\n"
                       "\tVersion (ROM.firmware): 0301.0309\tTx power high"
                       "\tPower down time: 10 minute(s)\r\n"
                       "\tFree RAM: 8148 bytes\tProgram slot: 1 "
                       "tasks: 1, 3, subs: 2, size: 36 bytes\r\n"
                       "\r\nActive Port information:\r\n"
                       "\tPort COM1 is RS232 IR\r\n"
                       "\tExecute retries: 3\t\t\tDownload retries: 5\r\n"
                       "\tReceive timeout: 250 mS\t\tInter-character timeout: 50 mS\r\n"
                       "\tExecute block size: 20\t\tDownload block size: 40\r\n"
                       "\tFirmware block size: 64\r\n"
                       "\r\nSystem information:\r\n"
                       "\tCOM ports: COM1, COM2(-), \r\n"
                       "\tUSB ports:\t\r\n"
                       "\tRecognised PBrick types: Rover, Onyx2\r\n"
                       "\tTranslation source types: Script\r\n"
                       "\r\n"
                       "\r\nGeneral information for Onyx2:\r\n"
                       "\tProgram slots: 5\r\n"
                       "\tMaximum programmable memory: 6000\r\n"
                       "\tTasks: 10\r\n"
                       "\tUser subroutines: 8\r\n");
}

TEST_F(InfoReportTest, EmptySlotLowPowerUsbTowerAndPortMarkers)
{
    brick.LoadProgram(2, {}, {});
    brick.numbers[tools::kTxPowerAddress] = 0;
    brick.usb = true;
    brick.enums[tessel::EnumComPorts] = {{Code(80), "COM1"},
                                         {Code(81), "COM2"},
                                         {Code(83), "COM3"},
                                         {Code(84), "COM4"},
                                         {Code(99), "COM5"}};
    brick.enums[tessel::EnumUsbPorts] = {{0, "KIVOTOWER1"}, {0, "KIVOTOWER2"}};
    const std::string text = Build();
    for (const char* part : {"\tTx power low\tPower down", "\tProgram slot: 2 \r\n\r\nActive Port",
                             "\tPort KIVOTOWER1 is USB\r\n\tPort Tx Power: 2\r\n\tExecute retries",
                             "\tCOM ports: COM1(o), COM2(x), COM3(m), COM4(h), COM5(e0050463), \r\n"
                             "\tUSB ports:\tKIVOTOWER1\r\n\t\t\tKIVOTOWER2\r\n\t\t\t\r\n"})
        EXPECT_NE(text.find(part), std::string::npos) << part << "\nin\n" << text;
}

TEST_F(InfoReportTest, EndlessWalksAreCutAndTheReportStaysInItsBuffer)
{
    brick.brickTypeFails = true;
    Build(false);
    brick.brickTypeFails = false;
    brick.endlessEnum = tessel::EnumComPorts;
    brick.endlessPadding = std::string(200, 'p');
    EXPECT_EQ(Build().size(), tools::InfoReport::kSize - 1);

    brick.endlessEnum = tessel::EnumUsbPorts;
    brick.endlessPadding = "";
    brick.enums[tessel::EnumComPorts] = {};
    // 256 USB names of "\r\n\t\t\t"-separated items fit, so the walk's own limit ends it.
    const std::string text = Build();
    EXPECT_NE(text.find("COM256\r\n\t\t\t\r\n"), std::string::npos);
    EXPECT_EQ(text.find("COM257"), std::string::npos);
}
