// The diagnostic log and the routines against scripted brick calls: the exact log lines of each
// step, the calls each routine makes, and the outcome a packed code leads to.
#include <gtest/gtest.h>
#include <sys/utsname.h>

#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "Fakes.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

class TroubleShooterLog : public ShooterFixture {};

TEST_F(TroubleShooterLog, EachRunEmptiesTheFileWritesTheBannerAndClosesWithTheTime)
{
    std::fclose(std::fopen(log.path(), "w"));
    {
        TroubleShooter first(&calls, &handle, log.path(), &system);
        first.LogStep("First run", 0);
        first.CloseLog();
    }
    system.now = {2007, 3, 4, 7, 8, 9};
    TroubleShooter second(&calls, &handle, log.path(), &system);
    second.LogStep("Second run", 0);
    system.now = {2026, 12, 6, 23, 0, 59};
    second.CloseLog();
    EXPECT_EQ(log.contents(), "Marl 2.0 Diagnostic Trouble Shooter\n\tDate: \t03/04/2007\n"
                              "\tTime: \t07:08:09\n\n\tSecond run ok\n"
                              "\nTrouble Shooter closed\n\tTime: \t23:00:59\n");
    EXPECT_TRUE(calls.calls.empty());
}

TEST_F(TroubleShooterLog, EmptyMissingOrUnopenableNameWritesNothing)
{
    const std::string unopenable = std::string(log.path()) + ".missing-dir/x.log";
    for (const char* name : {"", static_cast<const char*>(nullptr), unopenable.c_str()}) {
        TroubleShooter shooter(&calls, &handle, name, &system);
        EXPECT_EQ(shooter.LogStep("Step", -5), -5);
        EXPECT_EQ(shooter.LogStep("Step", 7), 7);
        shooter.LogText("text");
        shooter.WriteSystemReport();
        shooter.CloseLog();
    }
    EXPECT_FALSE(log.exists());
}

TEST_F(TroubleShooterLog, SectionWithoutSessionOrHandleSlotFailsBeforeAnyCall)
{
    TroubleShooter noSession(nullptr, &handle, log.path(), &system);
    EXPECT_EQ(noSession.BeginSection("\nFind Tower:\n"), Packed(0xE0050401u));
    TroubleShooter whole(&calls, &handle, log.path(), &system);
    EXPECT_EQ(whole.BeginSection("\nTest Tower:\n"), 0);
    EXPECT_EQ(log.body(), "\nTest Tower:\n");
    calls.forbidCalls = true;
    TroubleShooter noSlot(&calls, nullptr, log.path(), &system);
    EXPECT_EQ(noSlot.BeginSection("\nTest Tower:\n"), Packed(0xE0050401u));
    EXPECT_EQ(log.body(), "\nTest Tower:\nFailed - NULL pPBrick\n");
    for (const std::int32_t result :
         {noSlot.FindTower(), noSlot.FindUsbTower(), noSlot.FindComPort(), noSlot.TestSerialPort(1),
          noSlot.TestTower(), noSlot.TestBrick(), noSlot.SetUsbRange(3), noSlot.GetTowerType()}) {
        EXPECT_LT(result, 0);
    }
}

TEST_F(TroubleShooterLog, StepsLogOkOrTheCatalogueTextAndCreatePortKeepsTheOldHandleOnFailure)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    EXPECT_EQ(shooter.LogStep("Find port", 0), 0);
    EXPECT_EQ(shooter.LogStep("Find port", Packed(0xE0050444u)), Packed(0xE0050444u));
    EXPECT_EQ(shooter.LogStep("Positive", 0x20020000), 0x20020000);
    calls.createHandle = 0;
    EXPECT_EQ(shooter.CreatePort("COM9"), Packed(0xE0050401u));
    EXPECT_EQ(handle, 5);
    calls.createHandle = 42;
    EXPECT_EQ(shooter.CreatePort("\\\\.\\COM2"), 0);
    EXPECT_EQ(handle, 42);
    EXPECT_EQ(log.body(), "\tFind port ok\n"
                          "\tFind port failed:\n\t\tError (0xe0050444) from Tessel driver: no more "
                          "ports found\n\tPositive ok\n"
                          "\tCreate port COM9 failed:\n"
                          "\t\tError (0xe0050401) from Tessel driver: invalid hBrick\n"
                          "\tCreate port \\\\.\\COM2 ok\n");
    EXPECT_EQ(calls.calls, (Strings{"Create(COM9)", "Create(\\\\.\\COM2)"}));
}

TEST_F(TroubleShooterLog, LongNamesAreCutAtTheLineBound)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    const std::string name(3000, 'P');
    calls.createHandle = 0;
    shooter.CreatePort(name.c_str());
    calls.createHandle = 9;
    shooter.CreatePort(name.c_str());
    shooter.LogStep(name.c_str(), -1);
    const std::string body = log.body();
    EXPECT_EQ(body.rfind("\tCreate port PPP", 0), 0u);
    EXPECT_LT(body.size(), 3000u);
}

TEST_F(TroubleShooterLog, SystemReportLeavesOutWhatCannotBeRead)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    shooter.WriteSystemReport();
    system.computerName = nullptr;
    system.userName = nullptr;
    system.hasKernelRecord = false;
    system.processor = {8664, 12};
    shooter.WriteSystemReport();
    EXPECT_EQ(log.body(), "Computer: BENCH-PC\nUser name: tester\nProcessor Type: 586 (1)\n"
                          "Linux version 6.1.0-test (x86_64)\nProcessor Type: 8664 (12)\n");
}

// The operating-system line from the extended record, else the basic one (with the edition from
// the product type text), else the kernel's own words.
TEST_F(TroubleShooterLog, OperatingSystemLine)
{
    struct Case {
        bool extended;
        std::uint32_t platform, major, minor, build;
        const char* servicePack;
        std::uint8_t productType;
        const char* productTypeText;
        const char* line;
    };
    const Case cases[] = {
        {true, 2, 5, 0, 2195, "Service Pack 4", 1, nullptr,
         "Windows 2000Professional version 5.0 Service Pack 4 (Build 2195)\n\n"},
        {true, 2, 5, 0, 2195, "", 2, nullptr, "Windows 2000 version 5.0  (Build 2195)\n\n"},
        {true, 2, 4, 0, 1381, "SP6", 3, nullptr,
         "Windows NTServer version 4.0 SP6 (Build 1381)\n\n"},
        {true, 2, 10, 0, 19045, "", 1, nullptr,
         "Windows 10Professional version 10.0  (Build 19045)\n\n"},
        {false, 2, 4, 0, 0x05650565, "SP3", 0, "winNT",
         "Windows NTWorkstation version 4.0 SP3 (Build 1381)\n\n"},
        {false, 2, 4, 0, 1381, "", 0, "SERVERNT", "Windows NTServer version 4.0  (Build 1381)\n\n"},
        {false, 2, 4, 0, 1381, "", 0, nullptr, "Windows NT version 4.0  (Build 1381)\n\n"},
        {false, 2, 5, 0, 2195, "", 0, "LANMANNT", "Windows 2000 version 5.0  (Build 2195)\n\n"},
        {false, 1, 4, 10, 0x040A08AE, " A ", 0, nullptr,
         "Windows 98 version 4.10  A  (Build 2222)\n"},
        {false, 1, 4, 0, 0x040003B6, "", 0, nullptr, "Windows 95 version 4.0  (Build 950)\n"},
        {false, 0, 1, 0, 0, "", 0, nullptr, "Win32s\n"},
        {false, 7, 1, 0, 0, "", 0, nullptr, "Unknown OS\n"}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.line);
        platform::ScriptedSystemInfo scripted;
        scripted.hasExtendedRecord = c.extended;
        scripted.hasBasicRecord = !c.extended;
        scripted.version.platformId = c.platform;
        scripted.version.majorVersion = c.major;
        scripted.version.minorVersion = c.minor;
        scripted.version.buildNumber = c.build;
        std::snprintf(scripted.version.csdVersion, sizeof scripted.version.csdVersion, "%s",
                      c.servicePack);
        scripted.version.productType = c.productType;
        scripted.productTypeText = c.productTypeText;
        TroubleShooter(nullptr, nullptr, log.path(), &scripted).WriteOsVersion();
        EXPECT_EQ(log.body(), c.line);
        EXPECT_EQ(scripted.versionQueries, c.extended ? 1 : 2);
    }
}

TEST_F(TroubleShooterLog, OperatingSystemLineEdgeCases)
{
    TroubleShooter shooter(nullptr, nullptr, log.path(), &system);
    shooter.WriteOsVersion(); // no record at all: the kernel speaks
    system.hasKernelRecord = false;
    shooter.WriteOsVersion(); // nothing known: nothing written
    EXPECT_EQ(log.body(), "Linux version 6.1.0-test (x86_64)\n");
    // A service-pack text without its terminator ends within its field.
    system.hasExtendedRecord = true;
    system.version.platformId = 2;
    system.version.majorVersion = 5;
    std::memset(system.version.csdVersion, 'S', sizeof system.version.csdVersion);
    shooter.WriteOsVersion();
    const std::string line = log.body().substr(34);
    EXPECT_EQ(line.rfind("Windows 2000 version 5.0 SSS", 0), 0u);
    EXPECT_LE(line.size(), 256u);
}

TEST(HostSystemInfo, ReportsTheRunningSystemTruthfully)
{
    TempLog log;
    platform::HostSystemInfo host;
    TroubleShooter(nullptr, nullptr, log.path(), &host).WriteOsVersion();
    utsname names{};
    ASSERT_EQ(uname(&names), 0);
    EXPECT_EQ(log.body(), std::string(names.sysname) + " version " + names.release + " (" +
                              names.machine + ")\n");
    char name[256];
    EXPECT_TRUE(host.ComputerName(name, sizeof name) && name[0] != '\0');
    EXPECT_TRUE(host.UserName(name, sizeof name) && name[0] != '\0');
    char tiny[2];
    EXPECT_TRUE(host.UserName(tiny, sizeof tiny));
    EXPECT_EQ(std::strlen(tiny), 1u) << "cut to the buffer";
    EXPECT_GE(host.Processor().count, 1u);
    const platform::LocalTime now = host.Now();
    EXPECT_TRUE(now.year >= 2000 && now.month >= 1 && now.month <= 12);
    platform::VersionRecord record;
    EXPECT_FALSE(host.VersionRecordOf(&record, true));
    EXPECT_EQ(platform::HostSystemInfo::ProcessorTypeOf("x86_64"), 8664u);
    EXPECT_EQ(platform::HostSystemInfo::ProcessorTypeOf("i686"), 586u);
    EXPECT_EQ(platform::HostSystemInfo::ProcessorTypeOf("riscv64"), 0u);
}

constexpr char kInvalidHandle[] = "\t\tError (0xe0050401) from Tessel driver: invalid hBrick\n";
constexpr char kNoTower[] = "\t\tError (0xe0050421) from Tessel driver: IDSTATUS_RESULT_NOTOWER\n";
constexpr char kNoMorePorts[] = "\t\tError (0xe0050444) from Tessel driver: no more ports found\n";
constexpr char kNoMoreItems[] = "\t\tError (0xe0050c52) from Tessel tsl: no more items found\n";
constexpr char kNotAlive[] = "\t\tError (0xe0050402) from Tessel driver: PBrick not alive\n";
const std::string kReopenedCom1 = "\tCreate port COM1 ok\n\tSet brick type ok\n\tPort status ok\n"
                                  "\nGet Tower Type:\n\tGet port name ok\n\tPort 1 is COM1\n";

class Diagnosis : public ShooterFixture {
protected:
    TroubleShooter& Shooter()
    {
        if (shooter == nullptr) {
            shooter = std::make_unique<TroubleShooter>(&calls, &handle, log.path(), &system);
        }
        return *shooter;
    }

    // A routine's result, the log lines it added, where it left the dialog's handle, and the
    // calls it made (when given); the handle is then put back to 5 for the next run.
    void ExpectRun(std::int32_t result, std::uint32_t expected, const std::string& lines,
                   tessel::Long handleAfter, const Strings& made = {})
    {
        EXPECT_EQ(static_cast<std::uint32_t>(result), expected);
        const std::string body = log.body();
        EXPECT_EQ(body.substr(seen_), lines);
        seen_ = body.size();
        EXPECT_EQ(handle, handleAfter);
        if (!made.empty()) {
            EXPECT_EQ(calls.calls, made);
        }
        calls.calls.clear();
        handle = 5;
    }

    std::size_t seen_ = 0;
    RecordingView view;
    std::unique_ptr<TroubleShooter> shooter;
};

TEST_F(Diagnosis, GetTowerTypeLogsThePortAndFailureClearsThePortType)
{
    calls.portKind = 3;
    ExpectRun(Shooter().GetTowerType(), 0,
              "\nGet Tower Type:\n\tGet port name ok\n\tPort 3 is COM1\n", 5, {"Get(5,3)"});
    EXPECT_EQ(Shooter().portType(), 3);
    calls.getPortResult = Packed(0xE0050401u);
    ExpectRun(Shooter().GetTowerType(), 0xE0050401u,
              std::string("\nGet Tower Type:\n\tGet port name failed:\n") + kInvalidHandle, 5);
    EXPECT_EQ(Shooter().portType(), 0);
}

TEST_F(Diagnosis, FindTowerReopensTheFoundPortWithTheBrickTypeKeptOrAssumed)
{
    calls.findPortAnswers = {{0, "COM1"}};
    ExpectRun(Shooter().FindTower(), 0,
              "\nFind Tower:\n\tFind port ok\n" + kReopenedCom1 + "\tFind tower ok\n", 77,
              {"Get(5,1)", "Destroy(5)", "FindPort()", "Create(COM1)", "Set(77,1,5)",
               "Status(77,2)", "Get(77,3)"});
    calls.findPortAnswers = {{0, "COM1"}};
    calls.getBrickTypeResult = Packed(0xE0050402u);
    ExpectRun(Shooter().FindTower(), 0,
              "\nFind Tower:\n\tFind port ok\n" + kReopenedCom1 + "\tFind tower ok\n", 77,
              {"Get(5,1)", "Destroy(5)", "FindPort()", "Create(COM1)", "Set(77,1,6)",
               "Status(77,2)", "Get(77,3)"});
    ExpectRun(Shooter().FindTower(), 0xE0050444u,
              std::string("\nFind Tower:\n\tFind port failed:\n") + kNoMorePorts +
                  "\tFind tower failed:\n" + kNoMorePorts,
              0);
}

TEST_F(Diagnosis, LocateEndsAtAFailedCreateBrickTypeOrTowerName)
{
    calls.findPortAnswers = {{0, "COM1"}};
    calls.createHandle = 0;
    ExpectRun(Shooter().LocateTower(), 0xE0050401u,
              std::string("\tFind port ok\n\tCreate port COM1 failed:\n") + kInvalidHandle, 0);
    calls.findPortAnswers = {{0, "COM1"}};
    calls.createHandle = 8;
    calls.setResult = Packed(0xE0050402u);
    ExpectRun(Shooter().LocateTower(), 0xE0050402u,
              std::string("\tFind port ok\n\tCreate port COM1 ok\n\tSet brick type failed:\n") +
                  kNotAlive,
              8);
    // The USB tower is known by its name in capitals.
    for (const char* name : {"COM1", "kivotower"}) {
        calls.findPortAnswers = {{0, name}};
        ExpectRun(Shooter().LocateUsbTower(), 0xE0050444u, "\tFind port ok\n", 0);
    }
}

TEST_F(Diagnosis, FindUsbTowerTakesTheFirstUsbPort)
{
    calls.enumAnswers[4] = {{0, 1, "KIVOTOWER1"}, {0, 2, "KIVOTOWER2"}};
    ExpectRun(Shooter().FindUsbTower(), 0,
              "\nFind USB Tower:\n\tEnum USB ports ok\n\tCreate port KIVOTOWER1 ok\n"
              "\tSet brick type ok\n\tPort status ok\n",
              77,
              {"Get(5,1)", "Destroy(5)", "FindFirst(4)", "Create(KIVOTOWER1)", "Set(77,1,5)",
               "Status(77,2)"});
    calls.enumAnswers[4].clear();
    ExpectRun(Shooter().FindUsbTower(), 0xE0050C52u,
              std::string("\nFind USB Tower:\n\tEnum USB ports failed:\n") + kNoMoreItems, 0);
}

TEST_F(Diagnosis, FindComPortSkipsPortsThatCannotBeUsedAndCutsAnEndlessList)
{
    calls.enumAnswers[3] = {{Packed(0xE0050450u), 1, "COM1"}, {0, 2, "COM2"}};
    ExpectRun(
        Shooter().FindComPort(), 0,
        "\nFind COM port:\n\tEnum COM ports ok\n\tCreate port COM2 ok\n\tSet brick type ok\n", 77,
        {"Get(5,1)", "Destroy(5)", "FindFirst(3)", "FindNext(3)", "Create(COM2)", "Set(77,1,5)"});
    calls.enumAnswers[3] = {{Packed(0xE0050450u), 1, "COM1"}};
    ExpectRun(Shooter().FindComPort(), 0xE0050C52u,
              std::string("\nFind COM port:\n\tEnum COM ports failed:\n") + kNoMoreItems, 0);
    // An enumeration that never ends is cut off.
    for (int i = 0; i < 1000; ++i) {
        calls.enumAnswers[3].push_back({Packed(0xE0050450u), static_cast<tessel::Short>(i), "COM"});
    }
    EXPECT_EQ(Shooter().FindComPort(), Packed(0xE0050C52u));
    EXPECT_EQ(calls.calls.size(), 2u + TroubleShooter::kMaxEnumeratedItems);
}

TEST_F(Diagnosis, TestSerialPortOpensTheNumberedPortOrNamesTheLastListed)
{
    calls.enumAnswers[3] = {{0, 1, "COM1"}, {0, 3, "COM3"}, {0, 4, "COM4"}};
    ExpectRun(Shooter().TestSerialPort(3), 0,
              "\nTest serial tower:\n\tTest COM port COM3: ok\n\tCreate port COM3 ok\n"
              "\tSet brick type ok\n\tPort status ok\n",
              77,
              {"Get(5,1)", "Destroy(5)", "FindFirst(3)", "FindNext(3)", "Create(COM3)",
               "Set(77,1,5)", "Status(77,2)"});
    calls.enumAnswers[3] = {{Packed(0xE0050450u), 2, "COM2"}};
    ExpectRun(Shooter().TestSerialPort(2), 0xE0050450u,
              "\nTest serial tower:\n\tTest COM port COM2: failed:\n\t\tError (0xe0050450) from "
              "Tessel driver: COM port opened by another application\n",
              0);
    calls.enumAnswers[3] = {{0, 1, "COM1"}, {Packed(0xE0050452u), 3, "COM3"}};
    ExpectRun(Shooter().TestSerialPort(9), 0xE0050C52u,
              std::string("\nTest serial tower:\n\tTest COM port COM3: failed:\n") + kNoMoreItems,
              0);
}

TEST_F(Diagnosis, TestTowerLooksForTheTowerOnlyWhenTheHandleIsInvalid)
{
    ExpectRun(Shooter().TestTower(), 0, "\nTest Tower:\n\tPort status ok\n\tTower ok\n", 5,
              {"Status(5,2)"});
    calls.statusAnswers[2] = {4};
    ExpectRun(Shooter().TestTower(), 0xE0050421u,
              std::string("\nTest Tower:\n\tPort status failed:\n") + kNoTower +
                  "\tTower failed:\n" + kNoTower,
              5, {"Status(5,2)"});
    calls.statusAnswers[2] = {3};
    calls.findPortAnswers = {{0, "COM1"}};
    ExpectRun(Shooter().TestTower(), 0,
              std::string("\nTest Tower:\n\tPort status failed:\n") + kInvalidHandle +
                  "\tFind port ok\n" + kReopenedCom1 +
                  "\tFound tower ok\n\tPort status ok\n\tTower ok\n",
              77);
}

TEST_F(Diagnosis, TestBrickSoundsTheBrickAfterItsStatus)
{
    ExpectRun(Shooter().TestBrick(), 0,
              "\nTest Onyx:\n\tGet brick status ok\n\tExecute ok\n\tOnyx ok\n", 5,
              {"Status(5,3)", "RunImmediate(5,sound 4)"});
    calls.statusAnswers[3] = {4};
    ExpectRun(Shooter().TestBrick(), 0xE0050421u,
              std::string("\nTest Onyx:\n\tGet brick status failed:\n") + kNoTower +
                  "\tOnyx failed:\n" + kNoTower,
              5, {"Status(5,3)"});
    calls.runResult = Packed(0xE0050402u);
    ExpectRun(Shooter().TestBrick(), 0xE0050402u,
              std::string("\nTest Onyx:\n\tGet brick status ok\n\tExecute failed:\n") + kNotAlive +
                  "\tOnyx failed:\n" + kNotAlive,
              5);
    calls.statusAnswers[3] = {3};
    ExpectRun(Shooter().BrickStatus(), 0xE0050401u,
              std::string("\tGet brick status failed:\n") + kInvalidHandle, 5, {"Status(5,3)"});
}

TEST_F(Diagnosis, SetUsbRange)
{
    ExpectRun(Shooter().SetUsbRange(3), 0, "\nSet USB Range:\n\tSet range ok\n", 5, {"Set(5,8,3)"});
    calls.setResult = Packed(0xE0050413u);
    ExpectRun(Shooter().SetUsbRange(2), 0xE0050413u,
              "\nSet USB Range:\n\tSet range failed:\n\t\tError (0xe0050413) from Tessel driver: "
              "failed to set USB port to long range\n",
              5, {"Set(5,8,2)"});
}

TEST_F(Diagnosis, SerialTowerIsNotSearchedForAgain)
{
    calls.statusAnswers[2] = {4};
    Shooter().Diagnose(Packed(0xE005040Bu), &view);
    EXPECT_EQ(view.shown, std::vector<int>{1003});
    EXPECT_EQ(log.body().find("Find USB Tower"), std::string::npos);
}

TEST_F(Diagnosis, ShownTopicPumpsUntilTheHelpCloses)
{
    view.pumpsLeft = 3;
    EXPECT_TRUE(Shooter().Diagnose(Packed(0xE0050421u), &view));
    EXPECT_EQ(view.pumps, 3);
    // A help that never opened ends the run at once; without a view nothing is shown.
    EXPECT_TRUE(Shooter().Diagnose(Packed(0xE0050421u), &view));
    EXPECT_EQ(view.pumps, 3);
    EXPECT_FALSE(Shooter().Diagnose(Packed(0xE0050421u), nullptr));
    EXPECT_FALSE(Shooter().Jump(Packed(0xE0050421u)));
}

TEST_F(Diagnosis, RepairLeavesSerialPortsAndAnsweringTowersAlone)
{
    calls.forbidCalls = true;
    EXPECT_FALSE(Shooter().RepairUsbTower(0));
    EXPECT_FALSE(Shooter().RepairUsbTower(1));
    calls.forbidCalls = false;
    EXPECT_FALSE(Shooter().RepairUsbTower(3));
    EXPECT_EQ(calls.calls, Strings{"Status(5,2)"});
    EXPECT_EQ(log.body(), "");
}

TEST_F(Diagnosis, JumpLogsUnlistedValuesUnderTheirLabel)
{
    Shooter().Diagnose(Packed(0xE0050C52u), &view); // Jump needs the view a diagnosis stores
    const std::size_t before = log.body().size();
    EXPECT_FALSE(Shooter().Jump(Packed(0xE0051001u)));
    EXPECT_FALSE(Shooter().Jump(Packed(0xE1000304u)));
    EXPECT_EQ(log.body().substr(before),
              "\tJump Tessel Module failed:\n\t\tError (0xe0051001) from Tessel unknown module\n"
              "\tJump Wisp failed:\n\t\tError (0xe1000304) from Wisp: unknown\n");
    EXPECT_EQ(view.shown, std::vector<int>{1002});
}

TEST(OutcomeTables, EveryListedCodeGivesItsOutcomeAndOthersTheirLabel)
{
    const std::pair<std::uint32_t, int> listed[] = {
        {0xE0050401u, 1001}, {0xE0050402u, 1004}, {0xE0050403u, 1007}, {0xE005040Bu, 1003},
        {0xE005040Eu, 1009}, {0xE005040Fu, 1010}, {0xE0050411u, 1011}, {0xE0050413u, 1104},
        {0xE0050415u, 1012}, {0xE0050421u, 1002}, {0xE0050422u, 1006}, {0xE0050423u, 1005},
        {0xE0050424u, 1008}, {0xE0050440u, 1401}, {0xE0050445u, 1402}, {0xE0050450u, 1201},
        {0xE0050451u, 1202}, {0xE0050452u, 1203}, {0xE0050453u, 1204}, {0xE0050471u, 1101},
        {0xE0050472u, 1101}, {0xE0050473u, 1103}, {0xE0050474u, 1105}, {0xE0050475u, 1103},
        {0xE0050476u, 1103}, {0xE0050477u, 1103}, {0xE0050802u, 1301}, {0xE0050818u, 1302},
        {0xE005081Bu, 1303}, {0xE005081Fu, 1304}, {0xE005081Au, 1305}, {0xE0050821u, 1306},
        {0xE0050825u, 1307}, {0xE005082Au, 1308}, {0xE005082Fu, 1309}, {0xE0050C41u, 1403},
        {0xE0050C42u, 1404}, {0xE0050C43u, 1405}, {0xE0050C44u, 1406}, {0xE0050C45u, 1407},
        {0xE0050C46u, 1408}, {0xE0050C47u, 1409}, {0xE0050C48u, 1410}, {0xE1000104u, 1002},
        {0xE1000204u, 1004}};
    for (const auto& [code, outcome] : listed) {
        EXPECT_EQ(TroubleShooter::OutcomeOf(Packed(code), 0, nullptr), outcome) << std::hex << code;
    }
    // Library code 82, no more items, depends on the port type.
    EXPECT_EQ(TroubleShooter::OutcomeOf(Packed(0xE0050C52u), 3, nullptr), 1102);
    EXPECT_EQ(TroubleShooter::OutcomeOf(Packed(0xE0050C52u), 1, nullptr), 1002);
    EXPECT_EQ(TroubleShooter::OutcomeOf(Packed(0xE0050C52u), 0, nullptr), 1002);
    // Unlisted values give no outcome but the label they are logged under.
    const std::pair<std::uint32_t, const char*> unlisted[] = {
        {0xE0050454u, "Jump Brick"},         {0xE0050444u, "Jump Brick"},
        {0xE0050801u, "Jump Script"},        {0xE0050C49u, "Jump Tessel"},
        {0xE0050C40u, "Jump Tessel"},        {0xE1000304u, "Jump Wisp"},
        {0xE0051001u, "Jump Tessel Module"}, {0xE0050001u, "Jump Tessel Module"},
        {0xE2000104u, "Jump facility"},      {0xE0060001u, "Jump facility"}};
    for (const auto& [value, expected] : unlisted) {
        const char* label = nullptr;
        EXPECT_EQ(TroubleShooter::OutcomeOf(Packed(value), 3, &label), 0) << std::hex << value;
        EXPECT_STREQ(label, expected) << std::hex << value;
    }
}

} // namespace
