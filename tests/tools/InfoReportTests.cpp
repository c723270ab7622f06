#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "FakeBrick.h"
#include "tessel/ErrorValue.h"
#include "tools/BrickQueries.h"
#include "tools/InfoReport.h"
#include "workspace/LiveObjects.h"

using toolstest::EnumItem;
using toolstest::FakeBrick;

namespace {

constexpr tessel::Long kHandle = 3;

class InfoReportTest : public ::testing::Test {
protected:
    InfoReportTest()
    {
        brick.enums[tessel::EnumComPorts] = {
            {0, "COM1"}, {static_cast<tessel::Long>(ErrorValue(2, 5, 1, 82).packedCode()), "COM2"}};
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

const std::string kPortSection = "\r\nActive Port information:\r\n"
                                 "\tPort COM1 is RS232 IR\r\n"
                                 "\tExecute retries: 3\t\t\tDownload retries: 5\r\n"
                                 "\tReceive timeout: 250 mS\t\tInter-character timeout: 50 mS\r\n"
                                 "\tExecute block size: 20\t\tDownload block size: 40\r\n"
                                 "\tFirmware block size: 64\r\n";

const std::string kSystemSection = "\r\nSystem information:\r\n"
                                   "\tCOM ports: COM1, COM2(-), \r\n"
                                   "\tUSB ports:\t\r\n"
                                   "\tRecognised PBrick types: Rover, Onyx2\r\n"
                                   "\tTranslation source types: Script\r\n"
                                   "\r\n";

const std::string kCapacitySection = "\r\nGeneral information for Onyx2:\r\n"
                                     "\tProgram slots: 5\r\n"
                                     "\tMaximum programmable memory: 6000\r\n"
                                     "\tTasks: 10\r\n"
                                     "\tUser subroutines: 8\r\n";

} // namespace

TEST_F(InfoReportTest, ProgramWithTasksOneAndThreeAndSubroutineTwo)
{
    brick.LoadProgram(1, {0, 12}, {12, 0, 20});
    EXPECT_EQ(Build(), "Active PBrick information:\r\n"
                       "\tVersion (ROM.firmware): 0301.0309\tTx power high"
                       "\tPower down time: 10 minute(s)\r\n"
                       "\tFree RAM: 8148 bytes\tProgram slot: 1 "
                       "tasks: 1, 3, subs: 2, size: 36 bytes\r\n" +
                           kPortSection + kSystemSection + kCapacitySection);
}

TEST_F(InfoReportTest, EmptySlotEndsTheLineAfterTheSlot)
{
    brick.LoadProgram(2, {}, {});
    brick.numbers[tools::kTxPowerAddress] = 0;
    std::string text = Build();
    EXPECT_NE(text.find("\tTx power low\tPower down"), std::string::npos) << text;
    EXPECT_NE(text.find("\tProgram slot: 2 \r\n\r\nActive Port"), std::string::npos) << text;
}

TEST_F(InfoReportTest, UsbPortShowsItsRange)
{
    brick.portKind = tessel::PortUsb;
    brick.portName = "KIVOTOWER1";
    std::string text = Build();
    EXPECT_NE(text.find("\tPort KIVOTOWER1 is USB\r\n\tPort Tx Power: 2\r\n\tExecute retries"),
              std::string::npos)
        << text;
}

TEST_F(InfoReportTest, ComPortMarkersByCode)
{
    brick.enums[tessel::EnumComPorts] = {
        {static_cast<tessel::Long>(ErrorValue(3, 5, 1, 80).packedCode()), "COM1"},
        {static_cast<tessel::Long>(ErrorValue(3, 5, 1, 81).packedCode()), "COM2"},
        {static_cast<tessel::Long>(ErrorValue(3, 5, 1, 83).packedCode()), "COM3"},
        {static_cast<tessel::Long>(ErrorValue(3, 5, 1, 84).packedCode()), "COM4"},
        {static_cast<tessel::Long>(ErrorValue(3, 5, 1, 99).packedCode()), "COM5"},
    };
    brick.enums[tessel::EnumUsbPorts] = {{0, "KIVOTOWER1"}, {0, "KIVOTOWER2"}};
    std::string text = Build();
    EXPECT_NE(text.find("\tCOM ports: COM1(o), COM2(x), COM3(m), COM4(h), COM5(e0050463), \r\n"
                        "\tUSB ports:\tKIVOTOWER1\r\n\t\t\tKIVOTOWER2\r\n\t\t\t\r\n"),
              std::string::npos)
        << text;
}

TEST_F(InfoReportTest, EndlessPortWalkIsCutAndTheReportStaysInItsBuffer)
{
    brick.brickTypeFails = true;
    Build(false);
    brick.brickTypeFails = false;
    brick.endlessEnum = tessel::EnumComPorts;
    brick.endlessPadding = std::string(200, 'p');
    std::string text = Build();
    EXPECT_EQ(text.size(), tools::InfoReport::kSize - 1);
}

TEST_F(InfoReportTest, EndlessNameListIsCut)
{
    brick.endlessEnum = tessel::EnumUsbPorts;
    brick.enums[tessel::EnumComPorts] = {};
    tools::InfoReport report(brick, queries);
    EXPECT_TRUE(report.Build(kHandle));
    // 256 USB names of "\r\n\t\t\t"-separated items fit, so the walk's own limit ends it.
    std::string text = report.text();
    EXPECT_NE(text.find("COM256\r\n\t\t\t\r\n"), std::string::npos);
    EXPECT_EQ(text.find("COM257"), std::string::npos);
}

TEST_F(InfoReportTest, RoverSizeIsWhatWasLocated)
{
    brick.brickType = tessel::BrickRover;
    brick.brickName = "Rover";
    // Task table from cell 0x239, subroutine table from cell 0x233: task 1 of 6, task 3 of 4,
    // subroutine 2 of 5 with its closing byte.
    const std::uint16_t taskStarts[] = {0x700, 0x706, 0x706, 0x70A, 0x70A, 0x70A, 0x70A};
    for (int i = 0; i < 7; ++i)
        brick.roverCells[static_cast<std::uint16_t>(0x239 + i)] = taskStarts[i];
    const std::uint16_t subStarts[] = {0x600, 0x601, 0x606, 0x607};
    for (int i = 0; i < 4; ++i)
        brick.roverCells[static_cast<std::uint16_t>(0x233 + i)] = subStarts[i];
    std::string text = Build();
    EXPECT_NE(text.find("\tProgram slot: 1 tasks: 1, 3, subs: 2, size: 14 bytes\r\n"),
              std::string::npos)
        << text;
}
