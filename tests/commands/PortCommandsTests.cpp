// Open, Close, Test, Statistics and the range buttons against the simulated library.
#include <ostream>
#include <string>

#include "DialogFixture.h"
#include "errors/ErrorText.h"
#include "session/BrickSession.h"

namespace commands_test {
namespace {

using ui::HeadlessEvent;

class PortCommands : public DialogFixture {
protected:
    // One serial port with an Onyx2 in front of it; nothing opened at start-up.
    void StartSerial(const std::string& brickLines = "type = onyx2\n")
    {
        Start(std::string(kFastLink) + "[brick b1]\n" + brickLines + "[port COM1]\nbrick = b1\n");
    }
    std::vector<HeadlessEvent> PortQuestions() const
    {
        std::vector<HeadlessEvent> found;
        for (const HeadlessEvent& event : EventsOf(HeadlessEvent::Kind::Question)) {
            if (event.caption == "Select Port")
                found.push_back(event);
        }
        return found;
    }
};

std::string SerialPorts(int count)
{
    std::string text = std::string(kFastLink) + "[brick b1]\ntype = onyx2\n";
    for (int i = 1; i <= count; ++i)
        text += "[port COM" + std::to_string(i) + "]\nbrick = b1\n";
    return text;
}

TEST_F(PortCommands, OnePortFoundIsOpenedWithoutAQuestion)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    Click(ui::IdOpenPort);

    EXPECT_TRUE(PortQuestions().empty());
    EXPECT_EQ(LastStatus(), "Opened COM1, Onyx2 brick");
    EXPECT_NE(dialog().brickHandle(), 0);
    EXPECT_EQ(dialog().portType(), tessel::PortSerialIr);
    // A serial tower has no range to set.
    EXPECT_FALSE(host().IsControlEnabled(window(), ui::IdRangeShort));
    EXPECT_FALSE(host().IsControlEnabled(window(), ui::IdRangeMedium));
    EXPECT_FALSE(host().IsControlEnabled(window(), ui::IdRangeLong));
}

TEST_F(PortCommands, SeveralPortsAreOfferedInOrderUntilTheFirstYes)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(3)));
    host().QueueAnswer(false);
    host().QueueAnswer(true);
    Click(ui::IdOpenPort);

    const std::vector<HeadlessEvent> asked = PortQuestions();
    ASSERT_EQ(asked.size(), 2u);
    EXPECT_EQ(asked[0].text, "COM1");
    EXPECT_EQ(asked[1].text, "COM2");
    EXPECT_EQ(LastStatus(), "Opened COM2, Onyx2 brick");
}

TEST_F(PortCommands, OnlyTheFirstTenPortsAreOffered)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(12)));
    Click(ui::IdOpenPort); // every question answered No

    const std::vector<HeadlessEvent> asked = PortQuestions();
    ASSERT_EQ(asked.size(), 10u);
    EXPECT_EQ(asked[9].text, "COM10");
    EXPECT_EQ(LastStatus(), "No port selected");
    EXPECT_EQ(dialog().brickHandle(), 0);
    EXPECT_TRUE(Offers().empty());
}

TEST_F(PortCommands, NoPortFoundShowsTheSearchErrorAndOffersHelp)
{
    // The only port is held by another application.
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\nstate = in-use\n"));
    Click(ui::IdOpenPort);

    EXPECT_EQ(LastStatus(),
              "Error (0xe0050450) from Tessel driver: COM port opened by another application");
    EXPECT_EQ(Offers(), std::vector<std::string>{"Error (0xe0050450) from Tessel driver: COM port "
                                                 "opened by another application.\r\nUse Trouble "
                                                 "Shooter?"});
    EXPECT_EQ(dialog().brickHandle(), 0);
}

TEST_F(PortCommands, APortTakenBetweenSearchAndOpenShowsCreateFailed)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(2)));
    // While the user is asked about COM1, another handle takes it.
    ui::TestClientDialog* target = &dialog();
    tessel::Long thief = 0;
    OnEvent([target, &thief](const HeadlessEvent& event) {
        if (event.kind == HeadlessEvent::Kind::Question && event.text == "COM1" && thief == 0)
            thief = target->session()->Create("COM1");
    });
    host().QueueAnswer(true);
    Click(ui::IdOpenPort);
    OnEvent(nullptr);

    ASSERT_NE(thief, 0);
    EXPECT_EQ(LastStatus(), "Create failed");
    EXPECT_EQ(dialog().brickHandle(), 0);
    dialog().session()->Destroy(thief);
}

TEST_F(PortCommands, OpenDestroysTheOldHandleAlsoWhenNothingIsChosen)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(2), "Serial=COM1"));
    ASSERT_NE(dialog().brickHandle(), 0);
    const tessel::Long old = dialog().brickHandle();
    Click(ui::IdOpenPort); // both ports declined

    EXPECT_EQ(LastStatus(), "No port selected");
    EXPECT_EQ(dialog().brickHandle(), 0);
    // The old handle is gone in the library too.
    char text[tessel::kStatusTextSize] = {};
    EXPECT_NE(dialog().session()->Status(old, tessel::StatusBrick, text, sizeof text),
              tessel::kBrickAnswers);
}

TEST_F(PortCommands, StartUpOpensTheUsbPortFirstAndReadsItsRange)
{
    ASSERT_NO_FATAL_FAILURE(Start(
        std::string(kFastLink) + "[brick b1]\n[port COM1]\n[port KIVOTOWER1]\nlong-range = yes\n",
        "USB=KIVOTOWER1\nSerial=COM1"));
    EXPECT_EQ(LastStatus(), "Opened \\\\.\\KIVOTOWER1, Onyx2 brick");
    EXPECT_EQ(dialog().portType(), tessel::PortUsb);
    EXPECT_TRUE(host().IsControlEnabled(window(), ui::IdRangeShort));
    EXPECT_TRUE(host().IsControlEnabled(window(), ui::IdRangeMedium));
    EXPECT_TRUE(host().IsControlEnabled(window(), ui::IdRangeLong));
    // The simulator's towers start at medium range.
    EXPECT_TRUE(host().IsChecked(window(), ui::IdRangeMedium));
    EXPECT_FALSE(host().IsChecked(window(), ui::IdRangeShort));
}

TEST_F(PortCommands, AUsbTowerWithoutLongRangeLeavesLongDisabled)
{
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port KIVOTOWER1]\n", "USB=KIVOTOWER1"));
    EXPECT_TRUE(host().IsControlEnabled(window(), ui::IdRangeShort));
    EXPECT_TRUE(host().IsControlEnabled(window(), ui::IdRangeMedium));
    EXPECT_FALSE(host().IsControlEnabled(window(), ui::IdRangeLong));
}

TEST_F(PortCommands, NoBrickBehindThePortFollowsTheBrickList)
{
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[port COM1]\nbrick = none\n"));
    SelectBrick(ui::BrickListRover);
    Click(ui::IdOpenPort);

    EXPECT_EQ(LastStatus(), "Opened COM1, no brick detected");
    EXPECT_NE(dialog().brickHandle(), 0);
    EXPECT_EQ(Property(tessel::PropBrickType), tessel::BrickRover);
    EXPECT_TRUE(Offers().empty());
}

TEST_F(PortCommands, ARoverSwitchesTheBrickListAndTheBrickType)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial("type = rover\n"));
    Click(ui::IdOpenPort);

    EXPECT_EQ(LastStatus(), "Opened COM1, Rover brick");
    EXPECT_EQ(host().ListSelection(window(), ui::IdBrickList), ui::BrickListRover);
    EXPECT_EQ(Property(tessel::PropBrickType), tessel::BrickRover);
}

struct BrickName {
    const char* scenarioType;
    const char* shown;
};

void PrintTo(const BrickName& name, std::ostream* out)
{
    *out << name.scenarioType;
}

std::string TestName(const ::testing::TestParamInfo<BrickName>& info)
{
    std::string name = info.param.scenarioType;
    for (char& c : name) {
        if (c == '-')
            c = '_';
    }
    return name;
}

class BrickNames : public PortCommands, public ::testing::WithParamInterface<BrickName> {};

TEST_P(BrickNames, TheDetectedTypeIsNamedFromTheTable)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial(std::string("type = ") + GetParam().scenarioType + "\n"));
    // The Brick list only follows the two translation targets.
    SelectBrick(ui::BrickListRover);
    Click(ui::IdOpenPort);

    EXPECT_EQ(LastStatus(), std::string("Opened COM1, ") + GetParam().shown);
    EXPECT_EQ(host().ListSelection(window(), ui::IdBrickList), ui::BrickListRover);
}

INSTANTIATE_TEST_SUITE_P(PortCommands, BrickNames,
                         ::testing::Values(BrickName{"unknown", "unknown brick"},
                                           BrickName{"helmsman", "Helmsman brick"},
                                           BrickName{"onyx-no-firmware", "Onyx brick, no firmware"},
                                           BrickName{"onyx", "Onyx brick"},
                                           BrickName{"minirover", "MiniRover brick"}),
                         TestName);

TEST_F(PortCommands, ATowerRefusingStatisticsStopsTheOpenedSteps)
{
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\nstatistics = refused\n"));
    Click(ui::IdOpenPort);

    EXPECT_EQ(LastStatus(), "Collect statistics failed");
    EXPECT_TRUE(Offers().empty());
    // The handle stays open; only the brick was not looked for.
    EXPECT_NE(dialog().brickHandle(), 0);
    Click(ui::IdStatistics);
    EXPECT_EQ(LastStatus(), "No statistics");
}

TEST_F(PortCommands, CloseTwiceSaysClosedThenNotOpen)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    Click(ui::IdOpenPort);
    ClearEvents();
    Click(ui::IdClosePort);
    Click(ui::IdClosePort);

    EXPECT_EQ(Statuses(), (std::vector<std::string>{"Closed", "Not open"}));
    EXPECT_EQ(dialog().brickHandle(), 0);
}

TEST_F(PortCommands, TestOnAHealthyBrickSoundsAndSaysTestedOk)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    Click(ui::IdOpenPort);
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "Tested OK");
    EXPECT_TRUE(Offers().empty());
}

TEST_F(PortCommands, TestOnARoverSoundsForTheRover)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial("type = rover\n"));
    Click(ui::IdOpenPort);
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "Tested OK");
}

TEST_F(PortCommands, ASoundLostOnTheLinkIsShownAndOffersHelp)
{
    // The brick answers the status query, but every packet to it is lost.
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\nloss = 100\n", "Serial=COM1"));
    ClearEvents();
    Click(ui::IdTest);

    EXPECT_EQ(LastStatus(), "Error (0xe1000204) from Wisp: Retry count exceeded");
    EXPECT_EQ(Offers(), std::vector<std::string>{
                            "Error (0xe1000204) from Wisp: Retry count exceeded.\r\nUse Trouble "
                            "Shooter?"});
}

TEST_F(PortCommands, TestAfterTheBrickTypeChangedDetectsItAgain)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial("type = rover\n"));
    Click(ui::IdOpenPort);
    // Translations now target an Onyx2, which is not what answers.
    dialog().session()->Set(dialog().brickHandle(), tessel::PropBrickType, tessel::BrickOnyx2);
    SelectBrick(ui::BrickListOnyx2);
    Click(ui::IdTest);

    EXPECT_EQ(LastStatus(), "Brick type changed to Rover brick");
    EXPECT_EQ(host().ListSelection(window(), ui::IdBrickList), ui::BrickListRover);
    EXPECT_EQ(Property(tessel::PropBrickType), tessel::BrickRover);
}

TEST_F(PortCommands, TestWithATypeChangeAndNoBrickFoundSaysNoBrick)
{
    // The thing in front of the tower answers the status query as some other type, but is no
    // brick the search can name.
    ASSERT_NO_FATAL_FAILURE(StartSerial("type = none\n"));
    Click(ui::IdOpenPort);
    dialog().session()->Set(dialog().brickHandle(), tessel::PropBrickType, tessel::BrickOnyx2);
    ClearEvents();
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "No brick");
}

TEST_F(PortCommands, ABrickFaultShowsTheStatusTextAndOffersHelpForTheStatus)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial("battery = 5000\n"));
    Click(ui::IdOpenPort);
    ClearEvents();
    Click(ui::IdTest);

    EXPECT_EQ(LastStatus(), "brick battery low");
    EXPECT_EQ(Offers(),
              std::vector<std::string>{"Status: brick battery low.\r\nUse Trouble Shooter?"});
}

TEST_F(PortCommands, TestWithoutAPortLetsTheLibraryAnswer)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "invalid hBrick");
    EXPECT_EQ(Offers(),
              std::vector<std::string>{"Status: invalid hBrick.\r\nUse Trouble Shooter?"});
}

TEST_F(PortCommands, StatisticsShowsTheTowersCounters)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    Click(ui::IdOpenPort);
    Click(ui::IdStatistics);
    EXPECT_EQ(LastStatus().rfind("Statistics: sim ", 0), 0u) << LastStatus();
}

TEST_F(PortCommands, StatisticsThatAreNotCollectedSayNoStatistics)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    Click(ui::IdOpenPort);
    dialog().session()->Set(dialog().brickHandle(), tessel::PropCollectStats, 0);
    Click(ui::IdStatistics);
    EXPECT_EQ(LastStatus(), "No statistics");
    EXPECT_TRUE(Offers().empty());
}

TEST_F(PortCommands, StatisticsWithoutAPortSayPortNotOpen)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    Click(ui::IdStatistics);
    EXPECT_EQ(LastStatus(), "Port not open");
}

TEST_F(PortCommands, RangeButtonsSetTheTowersRange)
{
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port KIVOTOWER1]\nlong-range = yes\n",
              "USB=KIVOTOWER1"));
    ClearEvents();
    Click(ui::IdRangeLong);
    EXPECT_EQ(Property(tessel::PropRange), tessel::RangeLong);
    Click(ui::IdRangeShort);
    EXPECT_EQ(Property(tessel::PropRange), tessel::RangeShort);
    Click(ui::IdRangeMedium);
    EXPECT_EQ(Property(tessel::PropRange), tessel::RangeMedium);
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"Long range", "Short range", "Medium range"}));
}

TEST_F(PortCommands, ARefusedRangeIsShownAndOffersHelp)
{
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port KIVOTOWER1]\n", "USB=KIVOTOWER1"));
    ClearEvents();
    // The button is disabled for this tower; the menu route still reaches the handler.
    host().SendMessage(window(), ui::kMsgCommand, ui::MakeCommand(ui::IdRangeLong), 0);

    const std::string text = GetErrorText(static_cast<std::int32_t>(0xE0050413u), nullptr);
    EXPECT_EQ(text, "Error (0xe0050413) from Tessel driver: failed to set USB port to long range");
    EXPECT_EQ(LastStatus(), text);
    EXPECT_EQ(Offers(), std::vector<std::string>{text + ".\r\nUse Trouble Shooter?"});
}

TEST_F(PortCommands, RangeWithoutAPortDoesNothingAtAll)
{
    ASSERT_NO_FATAL_FAILURE(StartSerial());
    ClearEvents();
    host().SendMessage(window(), ui::kMsgCommand, ui::MakeCommand(ui::IdRangeShort), 0);
    EXPECT_TRUE(Statuses().empty());
}

} // namespace
} // namespace commands_test
