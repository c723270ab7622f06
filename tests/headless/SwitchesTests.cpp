// The registration switches and Harbor's own options.
#include <gtest/gtest.h>

#include "app/Switches.h"

using app::FindRegistrationSwitch;
using app::SwitchAction;

TEST(RegistrationSwitch, CountsOnlyAsTheLastThingOnTheLineAfterASeparator)
{
    const std::pair<const char*, SwitchAction> cases[] = {
        {"\"/opt/harbor/harbor\" /RegServer", SwitchAction::Register},
        {"\"/opt/harbor/harbor\" -RegServer", SwitchAction::Register},
        {"\"/opt/harbor/harbor\" /unregserver", SwitchAction::Unregister},
        {"\"/opt/harbor/harbor\" -UNREGSERVER", SwitchAction::Unregister},
        {"\"/h/harbor\" a-b /RegServer", SwitchAction::Register},
        {"\"/h/harbor\" --RegServer", SwitchAction::Register},
        {"/RegServer", SwitchAction::Register},
        {"\"/opt/harbor/harbor\" /RegServer robot.onyx2", SwitchAction::Run},
        {"\"/opt/harbor/harbor\" /RegServer ", SwitchAction::Run},
        {"\"/opt/my-harbor/harbor\"", SwitchAction::Run},
        {"\"/opt/RegServer/harbor\" file", SwitchAction::Run},
        {"\"/opt/harbor/RegServer\"", SwitchAction::Run},
        {"", SwitchAction::Run},
        {nullptr, SwitchAction::Run},
    };
    for (const auto& [line, action] : cases) {
        EXPECT_EQ(FindRegistrationSwitch(line), action) << (line ? line : "(null)");
    }
}

namespace {

bool Parse(std::vector<const char*> argv, app::HarborOptions& options, std::string& error)
{
    return app::ParseHarborOptions(static_cast<int>(argv.size()), argv.data(), options, error);
}

} // namespace

TEST(HarborOptions, ComeFirstAndAreRemoved)
{
    app::HarborOptions options;
    std::string error;
    ASSERT_TRUE(Parse({"harbor", "--headless", "--script", "s.txt", "--answer", "yes", "--timeout",
                       "500", "--fixed-time", "--quiet", "robot.onyx2"},
                      options, error))
        << error;
    EXPECT_TRUE(options.headless);
    EXPECT_EQ(options.script, "s.txt");
    EXPECT_TRUE(options.answerYes);
    EXPECT_EQ(options.timeoutMs, 500);
    EXPECT_TRUE(options.fixedTime);
    EXPECT_TRUE(options.quiet);
    EXPECT_EQ(options.arguments, (std::vector<std::string>{"harbor", "robot.onyx2"}));
}

TEST(HarborOptions, AfterTheFileNothingIsAnOption)
{
    app::HarborOptions options;
    std::string error;
    ASSERT_TRUE(Parse({"harbor", "robot.onyx2", "--headless"}, options, error));
    EXPECT_FALSE(options.headless);
    EXPECT_EQ(options.arguments, (std::vector<std::string>{"harbor", "robot.onyx2", "--headless"}));
    ASSERT_TRUE(Parse({"harbor", "--", "--odd-name"}, options, error));
    EXPECT_EQ(options.arguments, (std::vector<std::string>{"harbor", "--odd-name"}));
    ASSERT_TRUE(Parse({"harbor", "/RegServer"}, options, error));
    EXPECT_EQ(options.arguments, (std::vector<std::string>{"harbor", "/RegServer"}));
}

TEST(HarborOptions, BadOptionsAreNamed)
{
    app::HarborOptions options;
    std::string error;
    EXPECT_FALSE(Parse({"harbor", "--frob"}, options, error));
    EXPECT_EQ(error, "unknown option --frob");
    EXPECT_FALSE(Parse({"harbor", "--answer", "maybe"}, options, error));
    EXPECT_FALSE(Parse({"harbor", "--headless", "--script"}, options, error));
    EXPECT_EQ(error, "option --script needs a value");
    EXPECT_FALSE(Parse({"harbor", "--timeout", "-1"}, options, error));
    EXPECT_FALSE(Parse({"harbor", "--script", "x"}, options, error));
    EXPECT_EQ(error, "option --script needs --headless");
}
