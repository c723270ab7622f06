#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "FakeBrickCalls.h"
#include "LogHelpers.h"
#include "platform/SystemInfoScripted.h"
#include "tessel/ErrorValue.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

using Calls = std::vector<std::string>;

constexpr char kInvalidHandleLine[] = "\t\tError (0xe0050401) from Tessel driver: invalid hBrick\n";
constexpr char kNoTowerLine[] =
    "\t\tError (0xe0050421) from Tessel driver: IDSTATUS_RESULT_NOTOWER\n";
constexpr char kNoMorePortsLine[] =
    "\t\tError (0xe0050444) from Tessel driver: no more ports found\n";
constexpr char kNoMoreItemsLine[] = "\t\tError (0xe0050c52) from Tessel tsl: no more items found\n";
constexpr char kSystemReport[] = "Computer: BENCH-PC\nUser name: tester\nProcessor Type: 586 (1)\n"
                                 "Linux version 6.1.0-test (x86_64)\n";

constexpr std::int32_t Packed(std::uint32_t value)
{
    return static_cast<std::int32_t>(value);
}

class Diagnosis : public testing::Test {
protected:
    TroubleShooter& Shooter()
    {
        if (shooter == nullptr) {
            shooter = std::make_unique<TroubleShooter>(&calls, &handle, log.path(), &system);
        }
        return *shooter;
    }
    // A USB tower that stopped answering: property 3 says USB, the port status says no tower
    // once, and the port search then names the tower.
    void LostUsbTower(std::int32_t firstPortStatus, const char* foundName)
    {
        calls.portKind = 3;
        calls.portName = "KIVOTOWER";
        calls.statusAnswers[2] = {firstPortStatus};
        calls.findPortAnswers = {{0, foundName}};
    }

    TempLog log;
    FakeBrickCalls calls;
    platform::ScriptedSystemInfo system;
    tessel::Long handle = 5;
    RecordingView view;
    std::unique_ptr<TroubleShooter> shooter;
};

TEST_F(Diagnosis, GetTowerTypeLogsThePort)
{
    EXPECT_EQ(Shooter().GetTowerType(), 0);
    EXPECT_EQ(Shooter().portType(), 1);
    EXPECT_EQ(log.body(), "\nGet Tower Type:\n\tGet port name ok\n\tPort 1 is COM1\n");
    EXPECT_EQ(calls.calls, Calls{"Get(5,3)"});
}

TEST_F(Diagnosis, GetTowerTypeFailureClearsThePortType)
{
    Shooter().setPortType(3);
    calls.getPortResult = Packed(0xE0050401u);
    EXPECT_EQ(Shooter().GetTowerType(), Packed(0xE0050401u));
    EXPECT_EQ(Shooter().portType(), 0);
    EXPECT_EQ(log.body(),
              std::string("\nGet Tower Type:\n\tGet port name failed:\n") + kInvalidHandleLine);
}

TEST_F(Diagnosis, FindTowerReopensTheFoundPort)
{
    calls.findPortAnswers = {{0, "COM1"}};
    EXPECT_EQ(Shooter().FindTower(), 0);
    EXPECT_EQ(log.body(),
              "\nFind Tower:\n\tFind port ok\n\tCreate port COM1 ok\n\tSet brick type ok\n"
              "\tPort status ok\n\nGet Tower Type:\n\tGet port name ok\n\tPort 1 is COM1\n"
              "\tFind tower ok\n");
    EXPECT_EQ(calls.calls, (Calls{"Get(5,1)", "Destroy(5)", "FindPort()", "Create(COM1)",
                                  "Set(77,1,6)", "Status(77,2)", "Get(77,3)"}));
    EXPECT_EQ(handle, 77);
}

TEST_F(Diagnosis, FindTowerKeepsTheBrickTypeOrAssumesOnyx2)
{
    calls.findPortAnswers = {{0, "COM1"}};
    calls.brickType = 5;
    Shooter().FindTower();
    EXPECT_EQ(calls.calls[4], "Set(77,1,5)");

    calls.calls.clear();
    calls.findPortAnswers = {{0, "COM1"}};
    calls.getBrickTypeResult = Packed(0xE0050402u);
    Shooter().FindTower();
    EXPECT_EQ(calls.calls[4], "Set(77,1,6)");
}

TEST_F(Diagnosis, FindTowerWithoutPortLeavesThePortClosed)
{
    EXPECT_EQ(Shooter().FindTower(), Packed(0xE0050444u));
    EXPECT_EQ(log.body(), std::string("\nFind Tower:\n\tFind port failed:\n") + kNoMorePortsLine +
                              "\tFind tower failed:\n" + kNoMorePortsLine);
    EXPECT_EQ(handle, 0);
}

TEST_F(Diagnosis, FailedCreateAndBrickTypeEndTheReopen)
{
    calls.findPortAnswers = {{0, "COM1"}};
    calls.createHandle = 0;
    EXPECT_EQ(Shooter().LocateTower(), Packed(0xE0050401u));
    EXPECT_EQ(log.body(),
              std::string("\tFind port ok\n\tCreate port COM1 failed:\n") + kInvalidHandleLine);
    EXPECT_EQ(handle, 0);

    TempLog second;
    TroubleShooter other(&calls, &handle, second.path(), &system);
    calls.findPortAnswers = {{0, "COM1"}};
    calls.createHandle = 8;
    calls.setResult = Packed(0xE0050402u);
    EXPECT_EQ(other.LocateTower(), Packed(0xE0050402u));
    EXPECT_EQ(second.body(), "\tFind port ok\n\tCreate port COM1 ok\n\tSet brick type failed:\n"
                             "\t\tError (0xe0050402) from Tessel driver: PBrick not alive\n");
}

TEST_F(Diagnosis, LocateUsbTowerRefusesAComPort)
{
    calls.findPortAnswers = {{0, "COM1"}};
    EXPECT_EQ(Shooter().LocateUsbTower(), Packed(0xE0050444u));
    EXPECT_EQ(log.body(), "\tFind port ok\n");
    EXPECT_EQ(handle, 0);
}

TEST_F(Diagnosis, LocateUsbTowerWantsTheNameInCapitals)
{
    calls.findPortAnswers = {{0, "kivotower"}};
    EXPECT_EQ(Shooter().LocateUsbTower(), Packed(0xE0050444u));
}

TEST_F(Diagnosis, FindUsbTowerUsesTheFirstUsbPort)
{
    calls.enumAnswers[4] = {{0, 1, "KIVOTOWER1"}, {0, 2, "KIVOTOWER2"}};
    EXPECT_EQ(Shooter().FindUsbTower(), 0);
    EXPECT_EQ(log.body(), "\nFind USB Tower:\n\tEnum USB ports ok\n\tCreate port KIVOTOWER1 ok\n"
                          "\tSet brick type ok\n\tPort status ok\n");
    EXPECT_EQ(calls.calls, (Calls{"Get(5,1)", "Destroy(5)", "FindFirst(4)", "Create(KIVOTOWER1)",
                                  "Set(77,1,6)", "Status(77,2)"}));
}

TEST_F(Diagnosis, FindUsbTowerWithoutUsbPorts)
{
    EXPECT_EQ(Shooter().FindUsbTower(), Packed(0xE0050C52u));
    EXPECT_EQ(log.body(),
              std::string("\nFind USB Tower:\n\tEnum USB ports failed:\n") + kNoMoreItemsLine);
    EXPECT_EQ(handle, 0);
}

TEST_F(Diagnosis, FindComPortSkipsAPortThatCannotBeUsed)
{
    calls.enumAnswers[3] = {{Packed(0xE0050450u), 1, "COM1"}, {0, 2, "COM2"}};
    EXPECT_EQ(Shooter().FindComPort(), 0);
    EXPECT_EQ(
        log.body(),
        "\nFind COM port:\n\tEnum COM ports ok\n\tCreate port COM2 ok\n\tSet brick type ok\n");
    EXPECT_EQ(calls.calls, (Calls{"Get(5,1)", "Destroy(5)", "FindFirst(3)", "FindNext(3)",
                                  "Create(COM2)", "Set(77,1,6)"}));
}

TEST_F(Diagnosis, FindComPortWhenNoneCanBeUsed)
{
    calls.enumAnswers[3] = {{Packed(0xE0050450u), 1, "COM1"}};
    EXPECT_EQ(Shooter().FindComPort(), Packed(0xE0050C52u));
    EXPECT_EQ(log.body(),
              std::string("\nFind COM port:\n\tEnum COM ports failed:\n") + kNoMoreItemsLine);
}

TEST_F(Diagnosis, FindComPortStopsAnEnumerationThatNeverEnds)
{
    for (int i = 0; i < 1000; ++i) {
        calls.enumAnswers[3].push_back({Packed(0xE0050450u), static_cast<tessel::Short>(i), "COM"});
    }
    EXPECT_EQ(Shooter().FindComPort(), Packed(0xE0050C52u));
    EXPECT_EQ(calls.calls.size(), 2u + TroubleShooter::kMaxEnumeratedItems);
}

TEST_F(Diagnosis, TestSerialPortFindsTheNumberedPort)
{
    calls.enumAnswers[3] = {{0, 1, "COM1"}, {0, 3, "COM3"}, {0, 4, "COM4"}};
    EXPECT_EQ(Shooter().TestSerialPort(3), 0);
    EXPECT_EQ(log.body(), "\nTest serial tower:\n\tTest COM port COM3: ok\n\tCreate port COM3 ok\n"
                          "\tSet brick type ok\n\tPort status ok\n");
    EXPECT_EQ(calls.calls, (Calls{"Get(5,1)", "Destroy(5)", "FindFirst(3)", "FindNext(3)",
                                  "Create(COM3)", "Set(77,1,6)", "Status(77,2)"}));
}

TEST_F(Diagnosis, TestSerialPortReportsTheReasonThePortCannotBeUsed)
{
    calls.enumAnswers[3] = {{Packed(0xE0050450u), 2, "COM2"}};
    EXPECT_EQ(Shooter().TestSerialPort(2), Packed(0xE0050450u));
    EXPECT_EQ(log.body(), "\nTest serial tower:\n\tTest COM port COM2: failed:\n"
                          "\t\tError (0xe0050450) from Tessel driver: COM port opened by another "
                          "application\n");
    EXPECT_EQ(handle, 0);
}

TEST_F(Diagnosis, TestSerialPortWithAnUnknownNumberNamesTheLastPortListed)
{
    calls.enumAnswers[3] = {{0, 1, "COM1"}, {Packed(0xE0050452u), 3, "COM3"}};
    EXPECT_EQ(Shooter().TestSerialPort(9), Packed(0xE0050C52u));
    EXPECT_EQ(log.body(), std::string("\nTest serial tower:\n\tTest COM port COM3: failed:\n") +
                              kNoMoreItemsLine);
}

TEST_F(Diagnosis, PortAndBrickStatusSteps)
{
    calls.lastStatus[2] = 4;
    calls.lastStatus[3] = 3;
    EXPECT_EQ(Shooter().PortStatus(), Packed(0xE0050421u));
    EXPECT_EQ(Shooter().BrickStatus(), Packed(0xE0050401u));
    EXPECT_EQ(log.body(), std::string("\tPort status failed:\n") + kNoTowerLine +
                              "\tGet brick status failed:\n" + kInvalidHandleLine);
    EXPECT_EQ(calls.calls, (Calls{"Status(5,2)", "Status(5,3)"}));
}

TEST_F(Diagnosis, TestTowerWithAnsweringTower)
{
    EXPECT_EQ(Shooter().TestTower(), 0);
    EXPECT_EQ(log.body(), "\nTest Tower:\n\tPort status ok\n\tTower ok\n");
}

TEST_F(Diagnosis, TestTowerWithoutTower)
{
    calls.lastStatus[2] = 4;
    EXPECT_EQ(Shooter().TestTower(), Packed(0xE0050421u));
    EXPECT_EQ(log.body(), std::string("\nTest Tower:\n\tPort status failed:\n") + kNoTowerLine +
                              "\tTower failed:\n" + kNoTowerLine);
    EXPECT_EQ(calls.calls, Calls{"Status(5,2)"});
}

TEST_F(Diagnosis, TestTowerLooksForTheTowerWhenTheHandleIsInvalid)
{
    calls.statusAnswers[2] = {3};
    calls.findPortAnswers = {{0, "COM1"}};
    EXPECT_EQ(Shooter().TestTower(), 0);
    EXPECT_EQ(log.body(), std::string("\nTest Tower:\n\tPort status failed:\n") +
                              kInvalidHandleLine +
                              "\tFind port ok\n\tCreate port COM1 ok\n\tSet brick type ok\n"
                              "\tPort status ok\n\nGet Tower Type:\n\tGet port name ok\n"
                              "\tPort 1 is COM1\n\tFound tower ok\n\tPort status ok\n\tTower ok\n");
}

TEST_F(Diagnosis, TestBrickSoundsTheBrick)
{
    EXPECT_EQ(Shooter().TestBrick(), 0);
    EXPECT_EQ(log.body(), "\nTest Onyx:\n\tGet brick status ok\n\tExecute ok\n\tOnyx ok\n");
    EXPECT_EQ(calls.calls, (Calls{"Status(5,3)", "RunImmediate(5,sound 4)"}));
}

TEST_F(Diagnosis, TestBrickStopsAtABadStatus)
{
    calls.lastStatus[3] = 4;
    EXPECT_EQ(Shooter().TestBrick(), Packed(0xE0050421u));
    EXPECT_EQ(log.body(), std::string("\nTest Onyx:\n\tGet brick status failed:\n") + kNoTowerLine +
                              "\tOnyx failed:\n" + kNoTowerLine);
    EXPECT_EQ(calls.calls, Calls{"Status(5,3)"});
}

TEST_F(Diagnosis, TestBrickReportsAFailedSound)
{
    calls.runResult = Packed(0xE0050402u);
    EXPECT_EQ(Shooter().TestBrick(), Packed(0xE0050402u));
    EXPECT_EQ(log.body(),
              "\nTest Onyx:\n\tGet brick status ok\n\tExecute failed:\n"
              "\t\tError (0xe0050402) from Tessel driver: PBrick not alive\n"
              "\tOnyx failed:\n\t\tError (0xe0050402) from Tessel driver: PBrick not alive\n");
}

TEST_F(Diagnosis, SetUsbRange)
{
    EXPECT_EQ(Shooter().SetUsbRange(3), 0);
    calls.setResult = Packed(0xE0050413u);
    EXPECT_EQ(Shooter().SetUsbRange(2), Packed(0xE0050413u));
    EXPECT_EQ(log.body(),
              "\nSet USB Range:\n\tSet range ok\n\nSet USB Range:\n\tSet range failed:\n"
              "\t\tError (0xe0050413) from Tessel driver: failed to set USB port to long range\n");
    EXPECT_EQ(calls.calls, (Calls{"Set(5,8,3)", "Set(5,8,2)"}));
}

TEST_F(Diagnosis, LostUsbTowerFoundAgainJumpsOnTheGivenValue)
{
    LostUsbTower(4, "\\\\.\\KIVOTOWER_1");
    EXPECT_TRUE(Shooter().Diagnose(Packed(0xE0050421u), &view));
    EXPECT_EQ(view.shown, std::vector<int>{1002});
    EXPECT_EQ(log.body(),
              std::string(kSystemReport) + "\tDiagnosing Error failed:\n" + kNoTowerLine +
                  "\nGet Tower Type:\n\tGet port name ok\n\tPort 3 is KIVOTOWER\n"
                  "\nFind USB Tower:\n\tFind port ok\n\tCreate port \\\\.\\KIVOTOWER_1 ok\n"
                  "\tSet brick type ok\n\tPort status ok\n"
                  "\nGet Tower Type:\n\tGet port name ok\n\tPort 3 is KIVOTOWER\n"
                  "\tFind USB tower ok\n");
    EXPECT_EQ(handle, 77);
}

TEST_F(Diagnosis, LostUsbTowerReplacedByAComPortJumpsOnThePortState)
{
    LostUsbTower(3, "COM1");
    Shooter().Diagnose(Packed(0xE005040Bu), &view);
    EXPECT_EQ(view.shown, std::vector<int>{1001});
    EXPECT_NE(log.body().find(std::string("\tFind port ok\n\tFind USB tower failed:\n") +
                              kNoMorePortsLine),
              std::string::npos);

    TempLog second;
    TroubleShooter other(&calls, &handle, second.path(), &system);
    RecordingView otherView;
    LostUsbTower(4, "COM1");
    other.Diagnose(Packed(0xE005040Bu), &otherView);
    EXPECT_EQ(otherView.shown, std::vector<int>{1002});
}

TEST_F(Diagnosis, SerialTowerIsNotSearchedForAgain)
{
    calls.statusAnswers[2] = {4};
    Shooter().Diagnose(Packed(0xE005040Bu), &view);
    EXPECT_EQ(view.shown, std::vector<int>{1003});
    EXPECT_EQ(log.body().find("Find USB Tower"), std::string::npos);
}

TEST_F(Diagnosis, NoMoreItemsDependsOnThePortType)
{
    calls.portKind = 3;
    Shooter().Diagnose(Packed(0xE0050C52u), &view);
    calls.portKind = 1;
    Shooter().Diagnose(Packed(0xE0050C52u), &view);
    EXPECT_EQ(view.shown, (std::vector<int>{1102, 1002}));
}

TEST_F(Diagnosis, OpalFacilityJumpsNowhere)
{
    EXPECT_FALSE(Shooter().Diagnose(Packed(0xE0030007u), &view));
    EXPECT_TRUE(view.shown.empty());
    const std::string body = log.body();
    const std::string tail =
        "\tJump facility failed:\n\t\tError (0xe0030007) from Opal: unknown opcode\n";
    ASSERT_GE(body.size(), tail.size());
    EXPECT_EQ(body.substr(body.size() - tail.size()), tail);
}

TEST_F(Diagnosis, DriverCodeWithoutTextStillHasAnOutcome)
{
    Shooter().Diagnose(ErrorValue(3, 5, 1, 118).asLong(), &view);
    EXPECT_EQ(view.shown, std::vector<int>{1103});
}

TEST_F(Diagnosis, ShownTopicKeepsPumpingUntilTheHelpCloses)
{
    view.pumpsLeft = 3;
    EXPECT_TRUE(Shooter().Diagnose(Packed(0xE0050421u), &view));
    EXPECT_EQ(view.pumps, 3);
}

TEST_F(Diagnosis, HelpThatNeverOpenedEndsTheRunAtOnce)
{
    EXPECT_TRUE(Shooter().Diagnose(Packed(0xE0050421u), &view));
    EXPECT_EQ(view.pumps, 0);
}

TEST_F(Diagnosis, WithoutViewNothingIsShown)
{
    EXPECT_FALSE(Shooter().Diagnose(Packed(0xE0050421u), nullptr));
    EXPECT_FALSE(Shooter().Jump(Packed(0xE0050421u)));
}

TEST_F(Diagnosis, RepairWithoutUsbTowerCallsNothing)
{
    calls.forbidCalls = true;
    EXPECT_FALSE(Shooter().RepairUsbTower(0));
    EXPECT_FALSE(Shooter().RepairUsbTower(1));
    EXPECT_EQ(log.body(), "");
}

TEST_F(Diagnosis, RepairFindsTheUsbTowerAgain)
{
    LostUsbTower(4, "KIVOTOWER");
    EXPECT_TRUE(Shooter().RepairUsbTower(3));
    EXPECT_EQ(handle, 77);
}

TEST_F(Diagnosis, RepairLeavesAnAnsweringTowerAlone)
{
    EXPECT_FALSE(Shooter().RepairUsbTower(3));
    EXPECT_EQ(calls.calls, Calls{"Status(5,2)"});
}

TEST_F(Diagnosis, RepairWithoutLogWritesNothing)
{
    TroubleShooter quiet(&calls, &handle, nullptr, &system);
    LostUsbTower(3, "COM1");
    EXPECT_FALSE(quiet.RepairUsbTower(3));
    quiet.CloseLog();
    EXPECT_FALSE(log.exists());
}

struct TableCase {
    std::uint32_t value;
    std::int16_t portType;
    int outcome;
    const char* label;
};

class OutcomeTables : public testing::TestWithParam<TableCase> {};

TEST_P(OutcomeTables, ValueGivesOutcome)
{
    const TableCase& c = GetParam();
    const char* label = nullptr;
    EXPECT_EQ(TroubleShooter::OutcomeOf(Packed(c.value), c.portType, &label), c.outcome);
    if (c.outcome == 0) {
        EXPECT_STREQ(label, c.label);
    }
}

TableCase Listed(std::uint32_t value, std::int16_t portType, int outcome)
{
    return TableCase{value, portType, outcome, nullptr};
}
TableCase Unlisted(std::uint32_t value, std::int16_t portType, const char* label)
{
    return TableCase{value, portType, 0, label};
}

constexpr std::uint32_t Driver(std::uint32_t code)
{
    return 0xE0050400u | code;
}
constexpr std::uint32_t Compiler(std::uint32_t code)
{
    return 0xE0050800u | code;
}
constexpr std::uint32_t Library(std::uint32_t code)
{
    return 0xE0050C00u | code;
}

INSTANTIATE_TEST_SUITE_P(Driver, OutcomeTables,
                         testing::Values(Listed(Driver(1), 0, 1001), Listed(Driver(2), 0, 1004),
                                         Listed(Driver(3), 0, 1007), Listed(Driver(11), 0, 1003),
                                         Listed(Driver(14), 0, 1009), Listed(Driver(15), 0, 1010),
                                         Listed(Driver(17), 0, 1011), Listed(Driver(19), 0, 1104),
                                         Listed(Driver(21), 0, 1012), Listed(Driver(33), 0, 1002),
                                         Listed(Driver(34), 0, 1006), Listed(Driver(35), 0, 1005),
                                         Listed(Driver(36), 0, 1008), Listed(Driver(64), 0, 1401),
                                         Listed(Driver(69), 0, 1402), Listed(Driver(80), 0, 1201),
                                         Listed(Driver(81), 0, 1202), Listed(Driver(82), 0, 1203),
                                         Listed(Driver(83), 0, 1204), Listed(Driver(113), 0, 1101),
                                         Listed(Driver(114), 0, 1101), Listed(Driver(115), 0, 1103),
                                         Listed(Driver(116), 0, 1105), Listed(Driver(117), 0, 1103),
                                         Listed(Driver(118), 0, 1103), Listed(Driver(119), 0, 1103),
                                         Unlisted(Driver(84), 0, "Jump Brick"),
                                         Unlisted(Driver(68), 3, "Jump Brick")));

INSTANTIATE_TEST_SUITE_P(
    Compiler, OutcomeTables,
    testing::Values(Listed(Compiler(2), 0, 1301), Listed(Compiler(24), 0, 1302),
                    Listed(Compiler(27), 0, 1303), Listed(Compiler(31), 0, 1304),
                    Listed(Compiler(26), 0, 1305), Listed(Compiler(33), 0, 1306),
                    Listed(Compiler(37), 0, 1307), Listed(Compiler(42), 0, 1308),
                    Listed(Compiler(47), 0, 1309), Unlisted(Compiler(1), 0, "Jump Script")));

INSTANTIATE_TEST_SUITE_P(Library, OutcomeTables,
                         testing::Values(Listed(Library(65), 0, 1403), Listed(Library(66), 0, 1404),
                                         Listed(Library(67), 0, 1405), Listed(Library(68), 0, 1406),
                                         Listed(Library(69), 0, 1407), Listed(Library(70), 0, 1408),
                                         Listed(Library(71), 0, 1409), Listed(Library(72), 0, 1410),
                                         Listed(Library(82), 3, 1102), Listed(Library(82), 1, 1002),
                                         Listed(Library(82), 0, 1002),
                                         Unlisted(Library(73), 0, "Jump Tessel"),
                                         Unlisted(Library(64), 0, "Jump Tessel")));

INSTANTIATE_TEST_SUITE_P(Others, OutcomeTables,
                         testing::Values(Listed(0xE1000104u, 0, 1002), Listed(0xE1000204u, 0, 1004),
                                         Unlisted(0xE1000304u, 0, "Jump Wisp"),
                                         Unlisted(0xE0051001u, 0, "Jump Tessel Module"),
                                         Unlisted(0xE0050001u, 0, "Jump Tessel Module"),
                                         Unlisted(0xE2000104u, 0, "Jump facility"),
                                         Unlisted(0xE0060001u, 0, "Jump facility")));

TEST_F(Diagnosis, JumpLogsUnlistedValuesUnderTheirLabel)
{
    // Jump needs the view, which a diagnosis stores.
    Shooter().Diagnose(Packed(0xE0050C52u), &view);
    const std::size_t before = log.body().size();
    EXPECT_FALSE(Shooter().Jump(Packed(0xE0051001u)));
    EXPECT_FALSE(Shooter().Jump(Packed(0xE1000304u)));
    EXPECT_EQ(log.body().substr(before),
              "\tJump Tessel Module failed:\n\t\tError (0xe0051001) from Tessel unknown module\n"
              "\tJump Wisp failed:\n\t\tError (0xe1000304) from Wisp: unknown\n");
    EXPECT_EQ(view.shown, std::vector<int>{1002});
}

} // namespace
