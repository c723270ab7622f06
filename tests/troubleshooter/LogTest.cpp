// The diagnostic log: banner, step lines, sections, port creation and the system report.
#include <gtest/gtest.h>
#include <sys/utsname.h>

#include <cstring>
#include <string>

#include "Fakes.h"
#include "platform/SystemInfoScripted.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

class TroubleShooterLog : public testing::Test {
protected:
    TempLog log;
    FakeBrickCalls calls;
    platform::ScriptedSystemInfo system;
    tessel::Long handle = 5;
};

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

TEST_F(TroubleShooterLog, StepsLogOkOrTheCatalogueTextAndKeepTheirValue)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    EXPECT_EQ(shooter.LogStep("Find port", 0), 0);
    EXPECT_EQ(shooter.LogStep("Find port", Packed(0xE0050444u)), Packed(0xE0050444u));
    EXPECT_EQ(shooter.LogStep("Positive", 0x20020000), 0x20020000);
    EXPECT_EQ(
        log.body(),
        "\tFind port ok\n"
        "\tFind port failed:\n\t\tError (0xe0050444) from Tessel driver: no more ports found\n"
        "\tPositive ok\n");
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

TEST_F(TroubleShooterLog, CreatePortStoresTheHandleOrKeepsTheOldOne)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    calls.createHandle = 0;
    EXPECT_EQ(shooter.CreatePort("COM9"), Packed(0xE0050401u));
    EXPECT_EQ(handle, 5);
    calls.createHandle = 42;
    EXPECT_EQ(shooter.CreatePort("\\\\.\\COM2"), 0);
    EXPECT_EQ(handle, 42);
    EXPECT_EQ(log.body(), "\tCreate port COM9 failed:\n"
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
        {false, 7, 1, 0, 0, "", 0, nullptr, "Unknown OS\n"},
    };
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

} // namespace
