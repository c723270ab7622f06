#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <sys/utsname.h>

#include "LogHelpers.h"
#include "platform/SystemInfoScripted.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

class OsVersionLine : public testing::Test {
protected:
    std::string Line()
    {
        TroubleShooter shooter(nullptr, nullptr, log.path(), &system);
        shooter.WriteOsVersion();
        return log.body();
    }
    void Record(std::uint32_t platformId, std::uint32_t major, std::uint32_t minor,
                std::uint32_t build, const char* csd)
    {
        system.version.platformId = platformId;
        system.version.majorVersion = major;
        system.version.minorVersion = minor;
        system.version.buildNumber = build;
        std::snprintf(system.version.csdVersion, sizeof system.version.csdVersion, "%s", csd);
    }

    TempLog log;
    platform::ScriptedSystemInfo system;
};

TEST_F(OsVersionLine, NtFiveProfessionalHasTheEditionWithoutBlank)
{
    system.hasExtendedRecord = true;
    Record(2, 5, 0, 2195, "Service Pack 4");
    system.version.productType = 1;
    EXPECT_EQ(Line(), "Windows 2000Professional version 5.0 Service Pack 4 (Build 2195)\n\n");
}

TEST_F(OsVersionLine, NtFiveDomainControllerHasNoEditionWord)
{
    system.hasExtendedRecord = true;
    Record(2, 5, 0, 2195, "");
    system.version.productType = 2;
    EXPECT_EQ(Line(), "Windows 2000 version 5.0  (Build 2195)\n\n");
}

TEST_F(OsVersionLine, NtServerFromTheExtendedRecord)
{
    system.hasExtendedRecord = true;
    Record(2, 4, 0, 1381, "Service Pack 6");
    system.version.productType = 3;
    EXPECT_EQ(Line(), "Windows NTServer version 4.0 Service Pack 6 (Build 1381)\n\n");
}

TEST_F(OsVersionLine, BasicRecordReadsTheEditionFromTheProductType)
{
    system.hasBasicRecord = true;
    Record(2, 4, 0, 0x05650565, "Service Pack 3");
    system.productTypeText = "winNT";
    EXPECT_EQ(Line(), "Windows NTWorkstation version 4.0 Service Pack 3 (Build 1381)\n\n");
    EXPECT_EQ(system.versionQueries, 2);
}

TEST_F(OsVersionLine, BasicRecordServerAndUnreadableProductType)
{
    system.hasBasicRecord = true;
    Record(2, 4, 0, 1381, "");
    system.productTypeText = "SERVERNT";
    EXPECT_EQ(Line(), "Windows NTServer version 4.0  (Build 1381)\n\n");

    TempLog other;
    system.productTypeText = nullptr;
    TroubleShooter shooter(nullptr, nullptr, other.path(), &system);
    shooter.WriteOsVersion();
    EXPECT_EQ(other.body(), "Windows NT version 4.0  (Build 1381)\n\n");
}

TEST_F(OsVersionLine, BasicRecordIgnoresAProductTypeItDoesNotKnow)
{
    system.hasBasicRecord = true;
    Record(2, 5, 0, 2195, "");
    system.productTypeText = "LANMANNT";
    EXPECT_EQ(Line(), "Windows 2000 version 5.0  (Build 2195)\n\n");
}

TEST_F(OsVersionLine, LaterNtSystemsAreNamed)
{
    system.hasExtendedRecord = true;
    Record(2, 10, 0, 19045, "");
    system.version.productType = 1;
    EXPECT_EQ(Line(), "Windows 10Professional version 10.0  (Build 19045)\n\n");
}

TEST_F(OsVersionLine, NinetyFiveFamilyTakesItsMinorFromTheBuildNumber)
{
    system.hasBasicRecord = true;
    Record(1, 4, 10, 0x040A08AE, " A ");
    EXPECT_EQ(Line(), "Windows 98 version 4.10  A  (Build 2222)\n");
}

TEST_F(OsVersionLine, NinetyFiveItself)
{
    system.hasBasicRecord = true;
    Record(1, 4, 0, 0x040003B6, "");
    EXPECT_EQ(Line(), "Windows 95 version 4.0  (Build 950)\n");
}

TEST_F(OsVersionLine, Win32sAndUnknownPlatforms)
{
    system.hasBasicRecord = true;
    Record(0, 1, 0, 0, "");
    EXPECT_EQ(Line(), "Win32s\n");
    TempLog other;
    Record(7, 1, 0, 0, "");
    TroubleShooter shooter(nullptr, nullptr, other.path(), &system);
    shooter.WriteOsVersion();
    EXPECT_EQ(other.body(), "Unknown OS\n");
}

TEST_F(OsVersionLine, UnterminatedServicePackTextStaysInItsField)
{
    system.hasExtendedRecord = true;
    Record(2, 5, 0, 2195, "");
    std::memset(system.version.csdVersion, 'S', sizeof system.version.csdVersion);
    const std::string line = Line();
    EXPECT_EQ(line.rfind("Windows 2000 version 5.0 SSS", 0), 0u);
    EXPECT_LE(line.size(), 256u);
}

TEST_F(OsVersionLine, WithoutAnyRecordTheKernelSpeaks)
{
    EXPECT_EQ(Line(), "Linux version 6.1.0-test (x86_64)\n");
}

TEST_F(OsVersionLine, NothingKnownWritesNothing)
{
    system.hasKernelRecord = false;
    EXPECT_EQ(Line(), "");
}

TEST(HostSystemInfo, ReportsTheRunningKernelTruthfully)
{
    TempLog log;
    platform::HostSystemInfo host;
    TroubleShooter shooter(nullptr, nullptr, log.path(), &host);
    shooter.WriteOsVersion();
    utsname names{};
    ASSERT_EQ(uname(&names), 0);
    EXPECT_EQ(log.body(), std::string(names.sysname) + " version " + names.release + " (" +
                              names.machine + ")\n");
}

TEST(HostSystemInfo, AnswersEveryQuery)
{
    platform::HostSystemInfo host;
    char name[256];
    EXPECT_TRUE(host.ComputerName(name, sizeof name));
    EXPECT_GT(std::strlen(name), 0u);
    EXPECT_TRUE(host.UserName(name, sizeof name));
    EXPECT_GT(std::strlen(name), 0u);
    char tiny[2];
    EXPECT_TRUE(host.UserName(tiny, sizeof tiny));
    EXPECT_EQ(std::strlen(tiny), 1u);
    EXPECT_GE(host.Processor().count, 1u);
    const platform::LocalTime now = host.Now();
    EXPECT_GE(now.year, 2000);
    EXPECT_GE(now.month, 1);
    EXPECT_LE(now.month, 12);
    platform::VersionRecord record;
    EXPECT_FALSE(host.VersionRecordOf(&record, true));
    EXPECT_EQ(platform::HostSystemInfo::ProcessorTypeOf("x86_64"), 8664u);
    EXPECT_EQ(platform::HostSystemInfo::ProcessorTypeOf("i686"), 586u);
    EXPECT_EQ(platform::HostSystemInfo::ProcessorTypeOf("riscv64"), 0u);
}

} // namespace
