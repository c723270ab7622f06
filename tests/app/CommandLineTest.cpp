#include <gtest/gtest.h>

#include "app/CommandLine.h"
#include "platform/ExecutablePath.h"

using app::SplitCommandLine;

namespace {

TEST(CommandLineSplit, QuotedProgramPathAndFile)
{
    const auto parts = SplitCommandLine("\"C:\\App\\client.exe\" C:\\work\\robot.onyx2");
    EXPECT_EQ(parts.settingsPath, "C:\\App\\client.ini");
    EXPECT_EQ(parts.currentFile, "C:\\work\\robot.onyx2");
}

TEST(CommandLineSplit, OnlyQuotedProgramPathGivesSettingsBesideProgram)
{
    const auto parts = SplitCommandLine("\"/opt/harbor/harbor.bin\"");
    EXPECT_EQ(parts.settingsPath, "/opt/harbor/harbor.ini");
    EXPECT_EQ(parts.currentFile, "");
}

TEST(CommandLineSplit, ProgramWithoutExtensionGetsDotIniAppended)
{
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor\"").settingsPath, "/opt/harbor/harbor.ini");
}

TEST(CommandLineSplit, DotInDirectoryNameIsNoExtension)
{
    const auto parts = SplitCommandLine("\"/home/u/harbor.d/bin/harbor\" x.onyx2");
    EXPECT_EQ(parts.settingsPath, "/home/u/harbor.d/bin/harbor.ini");
    EXPECT_EQ(parts.currentFile, "x.onyx2");
    EXPECT_EQ(SplitCommandLine("\"C:\\my.app\\client\"").settingsPath, "C:\\my.app\\client.ini");
}

TEST(CommandLineSplit, HiddenFileNameHasNoExtension)
{
    EXPECT_EQ(SplitCommandLine("\"/opt/.harbor\"").settingsPath, "/opt/.harbor.ini");
}

TEST(CommandLineSplit, UnquotedProgramPathFallsBackToDefaultName)
{
    const auto parts = SplitCommandLine("/opt/harbor/harbor robot.onyx2");
    EXPECT_EQ(parts.settingsPath, "Harbor.ini");
    EXPECT_EQ(parts.currentFile, "");
}

TEST(CommandLineSplit, ShortOrUnclosedLineFallsBack)
{
    EXPECT_EQ(SplitCommandLine("\"a.b\"").settingsPath, "Harbor.ini"); // 5 characters
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor x").settingsPath, "Harbor.ini");
    EXPECT_EQ(SplitCommandLine("").settingsPath, "Harbor.ini");
    EXPECT_EQ(SplitCommandLine(nullptr).settingsPath, "Harbor.ini");
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor x").currentFile, "");
}

TEST(CommandLineSplit, QuotedFileArgumentEndsTheProgramPathAtTheLastQuote)
{
    const auto parts = SplitCommandLine("\"C:\\App\\client.exe\" \"C:\\work\\robot.onyx2\"");
    // Everything between the first and the last quote is taken for the program path.
    EXPECT_EQ(parts.settingsPath, "C:\\App\\client.exe\" \"C:\\work\\robot.ini");
    EXPECT_EQ(parts.currentFile, "");
}

TEST(CommandLineSplit, SwitchLikeArgumentsAreFileNames)
{
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor\" -RegServer").currentFile, "-RegServer");
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor\" /tmp/a-b/c.onyx2").currentFile,
              "/tmp/a-b/c.onyx2");
    EXPECT_EQ(SplitCommandLine("\"/opt/har-bor/harbor\" x").settingsPath,
              "/opt/har-bor/harbor.ini");
}

TEST(CommandLineSplit, OneSeparatorIsSkippedAfterTheClosingQuote)
{
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor\"  two").currentFile, " two");
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor\" ").currentFile, "");
    EXPECT_EQ(SplitCommandLine("\"/opt/harbor/harbor\" a b").currentFile, "a b");
}

TEST(CommandLineSplit, EmptyQuotedProgramPathFallsBackToDefaultName)
{
    const auto parts = SplitCommandLine("\"\" robot.onyx2");
    EXPECT_EQ(parts.settingsPath, "Harbor.ini");
    EXPECT_EQ(parts.currentFile, "robot.onyx2");
}

TEST(CommandLineCompose, QuotesExecutableAndJoinsArguments)
{
    const char* argv[] = {"harbor", "robot.onyx2", "more"};
    EXPECT_EQ(app::ComposeCommandLine("/opt/harbor/harbor", 3, argv),
              "\"/opt/harbor/harbor\" robot.onyx2 more");
    EXPECT_EQ(app::ComposeCommandLine("/opt/harbor/harbor", 1, argv), "\"/opt/harbor/harbor\"");
}

TEST(CommandLineCompose, RunningProgramRoundTripsThroughTheSplit)
{
    const char* argv[] = {"ignored", "/tmp/script.onyx2"};
    const auto parts = SplitCommandLine(app::ComposeCommandLine(2, argv).c_str());
    const std::string program = platform::ExecutablePath();
    ASSERT_FALSE(program.empty());
    EXPECT_EQ(parts.settingsPath, app::SettingsPathFor(program));
    EXPECT_EQ(parts.settingsPath.front(), '/');
    EXPECT_EQ(parts.currentFile, "/tmp/script.onyx2");
}

} // namespace
