#include <gtest/gtest.h>

#include "app/CommandLine.h"
#include "platform/ExecutablePath.h"

using app::SplitCommandLine;

namespace {

TEST(CommandLineSplit, SettingsBesideTheQuotedProgramAndTheFileAfterIt)
{
    const struct {
        const char* line;
        const char* settings;
        const char* file;
    } cases[] = {
        {"\"C:\\App\\client.exe\" C:\\work\\robot.onyx2", "C:\\App\\client.ini",
         "C:\\work\\robot.onyx2"},
        {"\"/opt/harbor/harbor.bin\"", "/opt/harbor/harbor.ini", ""},
        {"\"/opt/harbor/harbor\"", "/opt/harbor/harbor.ini", ""},
        {"\"/home/u/harbor.d/bin/harbor\" x.onyx2", "/home/u/harbor.d/bin/harbor.ini", "x.onyx2"},
        {"\"C:\\my.app\\client\"", "C:\\my.app\\client.ini", ""},
        {"\"/opt/.harbor\"", "/opt/.harbor.ini", ""},
        // Everything between the first and the last quote is taken for the program path.
        {"\"C:\\App\\client.exe\" \"C:\\work\\robot.onyx2\"",
         "C:\\App\\client.exe\" \"C:\\work\\robot.ini", ""},
        {"\"/opt/har-bor/harbor\" -RegServer", "/opt/har-bor/harbor.ini", "-RegServer"},
        {"\"/opt/harbor/harbor\" /tmp/a-b/c.onyx2", "/opt/harbor/harbor.ini", "/tmp/a-b/c.onyx2"},
        // One separator is skipped after the closing quote, no more.
        {"\"/opt/harbor/harbor\"  two", "/opt/harbor/harbor.ini", " two"},
        {"\"/opt/harbor/harbor\" ", "/opt/harbor/harbor.ini", ""},
        {"\"/opt/harbor/harbor\" a b", "/opt/harbor/harbor.ini", "a b"},
        // Without a usable quoted program path the default name stands.
        {"/opt/harbor/harbor robot.onyx2", "Harbor.ini", ""},
        {"\"a.b\"", "Harbor.ini", ""},
        {"\"/opt/harbor/harbor x", "Harbor.ini", ""},
        {"", "Harbor.ini", ""},
        {"\"\" robot.onyx2", "Harbor.ini", "robot.onyx2"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.line);
        const auto parts = SplitCommandLine(c.line);
        EXPECT_EQ(parts.settingsPath, c.settings);
        EXPECT_EQ(parts.currentFile, c.file);
    }
    EXPECT_EQ(SplitCommandLine(nullptr).settingsPath, "Harbor.ini");
}

TEST(CommandLineCompose, QuotesTheRunningProgramAndJoinsArgumentsForTheSplit)
{
    const char* argv[] = {"harbor", "robot.onyx2", "more"};
    EXPECT_EQ(app::ComposeCommandLine("/opt/harbor/harbor", 3, argv),
              "\"/opt/harbor/harbor\" robot.onyx2 more");
    EXPECT_EQ(app::ComposeCommandLine("/opt/harbor/harbor", 1, argv), "\"/opt/harbor/harbor\"");
    const auto parts = SplitCommandLine(app::ComposeCommandLine(2, argv).c_str());
    const std::string program = platform::ExecutablePath();
    ASSERT_FALSE(program.empty());
    EXPECT_EQ(parts.settingsPath, app::SettingsPathFor(program));
    EXPECT_EQ(parts.settingsPath.front(), '/');
    EXPECT_EQ(parts.currentFile, "robot.onyx2");
}

} // namespace
