#include <gtest/gtest.h>

#include <string>

#include "FakeBrickCalls.h"
#include "LogHelpers.h"
#include "platform/SystemInfoScripted.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

constexpr char kBanner[] =
    "Marl 2.0 Diagnostic Trouble Shooter\n\tDate: \t12/06/2026\n\tTime: \t09:05:07\n\n";

class TroubleShooterLog : public testing::Test {
protected:
    TempLog log;
    FakeBrickCalls calls;
    platform::ScriptedSystemInfo system;
    tessel::Long handle = 5;
};

TEST_F(TroubleShooterLog, ConstructionEmptiesTheFileAndWritesTheBanner)
{
    {
        std::FILE* old = std::fopen(log.path(), "w");
        std::fputs("an older run\n", old);
        std::fclose(old);
    }
    system.now = {2007, 3, 4, 7, 8, 9};
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    EXPECT_EQ(log.contents(),
              "Marl 2.0 Diagnostic Trouble Shooter\n\tDate: \t03/04/2007\n\tTime: \t07:08:09\n\n");
    EXPECT_TRUE(calls.calls.empty());
}

TEST_F(TroubleShooterLog, StepsLogOkOrTheCatalogueText)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    EXPECT_EQ(shooter.LogStep("Find port", 0), 0);
    EXPECT_EQ(shooter.LogStep("Find port", static_cast<std::int32_t>(0xE0050444u)),
              static_cast<std::int32_t>(0xE0050444u));
    EXPECT_EQ(shooter.LogStep("Positive", 0x20020000), 0x20020000);
    EXPECT_EQ(
        log.body(),
        "\tFind port ok\n"
        "\tFind port failed:\n\t\tError (0xe0050444) from Tessel driver: no more ports found\n"
        "\tPositive ok\n");
}

TEST_F(TroubleShooterLog, EmptyOrMissingNameWritesNothingAndStepsKeepTheirValue)
{
    for (const char* name : {"", static_cast<const char*>(nullptr)}) {
        TroubleShooter shooter(&calls, &handle, name, &system);
        EXPECT_STREQ(shooter.logName(), "");
        EXPECT_EQ(shooter.LogStep("Step", -5), -5);
        EXPECT_EQ(shooter.LogStep("Step", 7), 7);
        shooter.LogText("text");
        shooter.WriteSystemReport();
        shooter.CloseLog();
    }
    EXPECT_FALSE(log.exists());
}

TEST_F(TroubleShooterLog, SecondRunKeepsOnlyItsOwnLines)
{
    {
        TroubleShooter first(&calls, &handle, log.path(), &system);
        first.LogStep("First run", 0);
        first.CloseLog();
    }
    system.now = {2026, 12, 6, 9, 5, 7};
    TroubleShooter second(&calls, &handle, log.path(), &system);
    second.LogStep("Second run", 0);
    EXPECT_EQ(log.contents(), std::string(kBanner) + "\tSecond run ok\n");
}

TEST_F(TroubleShooterLog, CloseLogAppendsTheClosingLines)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    system.now = {2026, 12, 6, 23, 0, 59};
    shooter.CloseLog();
    EXPECT_EQ(log.contents(),
              std::string(kBanner) + "\nTrouble Shooter closed\n\tTime: \t23:00:59\n");
}

TEST_F(TroubleShooterLog, UnopenableLogIsSkippedSilently)
{
    const std::string path = std::string(log.path()) + ".missing-dir/x.log";
    TroubleShooter shooter(&calls, &handle, path.c_str(), &system);
    EXPECT_STREQ(shooter.logName(), path.c_str());
    EXPECT_EQ(shooter.LogStep("Step", -1), -1);
    shooter.CloseLog();
}

TEST_F(TroubleShooterLog, BeginSectionWithoutSessionOrHandleSlotFails)
{
    TroubleShooter noSession(nullptr, &handle, log.path(), &system);
    EXPECT_EQ(static_cast<std::uint32_t>(noSession.BeginSection("\nFind Tower:\n")), 0xE0050401u);
    TroubleShooter noSlot(&calls, nullptr, log.path(), &system);
    EXPECT_EQ(static_cast<std::uint32_t>(noSlot.BeginSection("\nTest Tower:\n")), 0xE0050401u);
    EXPECT_EQ(log.body(), "\nTest Tower:\nFailed - NULL pPBrick\n");

    TroubleShooter whole(&calls, &handle, log.path(), &system);
    EXPECT_EQ(whole.BeginSection("\nTest Tower:\n"), 0);
    EXPECT_EQ(log.body(), "\nTest Tower:\n");
    // Every test stops at its section without touching the library.
    calls.forbidCalls = true;
    TroubleShooter broken(&calls, nullptr, log.path(), &system);
    EXPECT_LT(broken.FindTower(), 0);
    EXPECT_LT(broken.FindUsbTower(), 0);
    EXPECT_LT(broken.FindComPort(), 0);
    EXPECT_LT(broken.TestSerialPort(1), 0);
    EXPECT_LT(broken.TestTower(), 0);
    EXPECT_LT(broken.TestBrick(), 0);
    EXPECT_LT(broken.SetUsbRange(3), 0);
    EXPECT_LT(broken.GetTowerType(), 0);
}

TEST_F(TroubleShooterLog, CreatePortStoresTheHandle)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    calls.createHandle = 42;
    EXPECT_EQ(shooter.CreatePort("\\\\.\\COM2"), 0);
    EXPECT_EQ(handle, 42);
    EXPECT_EQ(log.body(), "\tCreate port \\\\.\\COM2 ok\n");
    EXPECT_EQ(calls.calls, std::vector<std::string>{"Create(\\\\.\\COM2)"});
}

TEST_F(TroubleShooterLog, CreatePortFailureKeepsTheOldHandle)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    calls.createHandle = 0;
    EXPECT_EQ(static_cast<std::uint32_t>(shooter.CreatePort("COM9")), 0xE0050401u);
    EXPECT_EQ(handle, 5);
    EXPECT_EQ(log.body(), "\tCreate port COM9 failed:\n"
                          "\t\tError (0xe0050401) from Tessel driver: invalid hBrick\n");
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

TEST_F(TroubleShooterLog, SystemReportLines)
{
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    shooter.WriteSystemReport();
    EXPECT_EQ(log.body(), "Computer: BENCH-PC\nUser name: tester\nProcessor Type: 586 (1)\n"
                          "Linux version 6.1.0-test (x86_64)\n");
}

TEST_F(TroubleShooterLog, SystemReportLeavesOutWhatCannotBeRead)
{
    system.computerName = nullptr;
    system.userName = nullptr;
    system.hasKernelRecord = false;
    system.processor = {8664, 12};
    TroubleShooter shooter(&calls, &handle, log.path(), &system);
    shooter.WriteSystemReport();
    EXPECT_EQ(log.body(), "Processor Type: 8664 (12)\n");
}

} // namespace
