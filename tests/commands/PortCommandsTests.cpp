// Open, Close, Test, Statistics and the range buttons against the simulated library. Status
// texts and offers of the failure table are the fault matrix's; these follow the dialog's state.
#include <string>

#include "DialogFixture.h"
#include "session/BrickSession.h"

namespace commands_test {
namespace {

std::string SerialPorts(int count, const std::string& brickLines = "type = onyx2\n")
{
    std::string text = std::string(kFastLink) + "[brick b1]\n" + brickLines;
    for (int i = 1; i <= count; ++i)
        text += "[port COM" + std::to_string(i) + "]\nbrick = b1\n";
    return text;
}

class PortCommands : public DialogFixture {
protected:
    void ExpectRanges(bool shortAndMedium, bool longRange)
    {
        EXPECT_EQ(host().IsControlEnabled(window(), ui::IdRangeShort), shortAndMedium);
        EXPECT_EQ(host().IsControlEnabled(window(), ui::IdRangeMedium), shortAndMedium);
        EXPECT_EQ(host().IsControlEnabled(window(), ui::IdRangeLong), longRange);
    }
};

TEST_F(PortCommands, ASerialPortFromUnopenedToClosedTwice)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(1)));
    // Before any port: Test lets the library answer, Statistics and Range refuse quietly.
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "invalid hBrick");
    EXPECT_EQ(Offers(),
              std::vector<std::string>{"Status: invalid hBrick.\r\nUse Trouble Shooter?"});
    Click(ui::IdStatistics);
    EXPECT_EQ(LastStatus(), "Port not open");
    ClearEvents();
    host().SendMessage(window(), ui::kMsgCommand, ui::MakeCommand(ui::IdRangeShort), 0);
    EXPECT_TRUE(Statuses().empty());

    Click(ui::IdOpenPort); // the one port found is opened without a question
    EXPECT_TRUE(Questions("Select Port").empty());
    EXPECT_EQ(LastStatus(), "Opened COM1, Onyx2 brick");
    EXPECT_EQ(dialog().portType(), tessel::PortSerialIr);
    ExpectRanges(false, false); // a serial tower has no range to set
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "Tested OK");
    Click(ui::IdStatistics);
    EXPECT_EQ(LastStatus().rfind("Statistics: sim ", 0), 0u) << LastStatus();

    ClearEvents();
    Click(ui::IdClosePort);
    Click(ui::IdClosePort);
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"Closed", "Not open"}));
    EXPECT_EQ(dialog().brickHandle(), 0);
    EXPECT_TRUE(Offers().empty());
}

TEST_F(PortCommands, PortsAreOfferedInOrderUntilTheFirstYes)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(3)));
    host().QueueAnswer(false);
    host().QueueAnswer(true);
    Click(ui::IdOpenPort);
    EXPECT_EQ(Questions("Select Port"), (std::vector<std::string>{"COM1", "COM2"}));
    EXPECT_EQ(LastStatus(), "Opened COM2, Onyx2 brick");
}

TEST_F(PortCommands, OnlyTenPortsAreOfferedAndTheOldHandleGoesEvenWhenNoneIsChosen)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(12), "Serial=COM1"));
    const tessel::Long old = dialog().brickHandle();
    ASSERT_NE(old, 0);
    Click(ui::IdOpenPort); // every question answered No

    const std::vector<std::string> asked = Questions("Select Port");
    ASSERT_EQ(asked.size(), 10u);
    EXPECT_EQ(asked[9], "COM10");
    EXPECT_EQ(LastStatus(), "No port selected");
    EXPECT_EQ(dialog().brickHandle(), 0);
    char text[tessel::kStatusTextSize] = {};
    EXPECT_NE(dialog().session()->Status(old, tessel::StatusBrick, text, sizeof text),
              tessel::kBrickAnswers);
}

TEST_F(PortCommands, AUsbTowerOpensFirstAndItsRangeButtonsFollowTheTower)
{
    // Without long range that button is disabled; the menu route still reaches the handler.
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port KIVOTOWER1]\n", "USB=KIVOTOWER1"));
    ExpectRanges(true, false);
    host().SendMessage(window(), ui::kMsgCommand, ui::MakeCommand(ui::IdRangeLong), 0);
    const std::string refused =
        "Error (0xe0050413) from Tessel driver: failed to set USB port to long range";
    EXPECT_EQ(LastStatus(), refused);
    EXPECT_EQ(Offers(), std::vector<std::string>{refused + ".\r\nUse Trouble Shooter?"});
    Stop();

    ASSERT_NO_FATAL_FAILURE(Start(
        std::string(kFastLink) + "[brick b1]\n[port COM1]\n[port KIVOTOWER1]\nlong-range = yes\n",
        "USB=KIVOTOWER1\nSerial=COM1"));
    EXPECT_EQ(LastStatus(), "Opened \\\\.\\KIVOTOWER1, Onyx2 brick");
    EXPECT_EQ(dialog().portType(), tessel::PortUsb);
    ExpectRanges(true, true);
    EXPECT_TRUE(host().IsChecked(window(), ui::IdRangeMedium)); // the simulator's start
    EXPECT_FALSE(host().IsChecked(window(), ui::IdRangeShort));

    ClearEvents();
    const std::pair<int, std::int16_t> steps[] = {{ui::IdRangeLong, tessel::RangeLong},
                                                  {ui::IdRangeShort, tessel::RangeShort},
                                                  {ui::IdRangeMedium, tessel::RangeMedium}};
    for (const auto& [id, range] : steps) {
        Click(id);
        EXPECT_EQ(Property(tessel::PropRange), range) << "button " << id;
    }
    EXPECT_EQ(Statuses(), (std::vector<std::string>{"Long range", "Short range", "Medium range"}));
}

struct BrickCase {
    const char* brickLines;
    const char* shown;
    int listBefore;
    int listAfter;
    std::int16_t typeAfter; // -1: not checked
};

TEST_F(PortCommands, TheDetectedBrickIsNamedAndOnlyTranslationTargetsMoveTheBrickList)
{
    const BrickCase cases[] = {
        {"type = unknown\n", "unknown brick", ui::BrickListRover, ui::BrickListRover, -1},
        {"type = helmsman\n", "Helmsman brick", ui::BrickListRover, ui::BrickListRover, -1},
        {"type = onyx-no-firmware\n", "Onyx brick, no firmware", ui::BrickListRover,
         ui::BrickListRover, -1},
        {"type = onyx\n", "Onyx brick", ui::BrickListRover, ui::BrickListRover, -1},
        {"type = minirover\n", "MiniRover brick", ui::BrickListRover, ui::BrickListRover, -1},
        {"type = rover\n", "Rover brick", ui::BrickListOnyx2, ui::BrickListRover,
         tessel::BrickRover},
    };
    for (const BrickCase& c : cases) {
        SCOPED_TRACE(c.brickLines);
        ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(1, c.brickLines)));
        SelectBrick(c.listBefore);
        Click(ui::IdOpenPort);
        EXPECT_EQ(LastStatus(), std::string("Opened COM1, ") + c.shown);
        EXPECT_EQ(host().ListSelection(window(), ui::IdBrickList), c.listAfter);
        if (c.typeAfter >= 0)
            EXPECT_EQ(Property(tessel::PropBrickType), c.typeAfter);
        Stop();
    }
    // With no brick at all the type follows the list.
    ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[port COM1]\nbrick = none\n"));
    SelectBrick(ui::BrickListRover);
    Click(ui::IdOpenPort);
    EXPECT_EQ(LastStatus(), "Opened COM1, no brick detected");
    EXPECT_EQ(Property(tessel::PropBrickType), tessel::BrickRover);
}

TEST_F(PortCommands, TestDetectsAChangedBrickTypeAgain)
{
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(1, "type = rover\n")));
    Click(ui::IdOpenPort);
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "Tested OK");
    // Translations now target an Onyx2, which is not what answers.
    dialog().session()->Set(dialog().brickHandle(), tessel::PropBrickType, tessel::BrickOnyx2);
    SelectBrick(ui::BrickListOnyx2);
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "Brick type changed to Rover brick");
    EXPECT_EQ(host().ListSelection(window(), ui::IdBrickList), ui::BrickListRover);
    EXPECT_EQ(Property(tessel::PropBrickType), tessel::BrickRover);
    Stop();

    // Something answering as another type that the search cannot name is no brick.
    ASSERT_NO_FATAL_FAILURE(Start(SerialPorts(1, "type = none\n")));
    Click(ui::IdOpenPort);
    dialog().session()->Set(dialog().brickHandle(), tessel::PropBrickType, tessel::BrickOnyx2);
    Click(ui::IdTest);
    EXPECT_EQ(LastStatus(), "No brick");
}

} // namespace
} // namespace commands_test
