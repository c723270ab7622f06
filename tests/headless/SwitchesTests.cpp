// The registration switches and Harbor's own options.
#include <gtest/gtest.h>

#include "app/Switches.h"

using app::FindRegistrationSwitch;
using app::SwitchAction;

TEST(RegistrationSwitch, CountsOnlyAsTheLastThingOnTheLine)
{
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/harbor/harbor\" /RegServer"), SwitchAction::Register);
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/harbor/harbor\" -RegServer"), SwitchAction::Register);
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/harbor/harbor\" /unregserver"),
              SwitchAction::Unregister);
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/harbor/harbor\" -UNREGSERVER"),
              SwitchAction::Unregister);
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/harbor/harbor\" /RegServer robot.onyx2"),
              SwitchAction::Run);
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/harbor/harbor\" /RegServer "), SwitchAction::Run);
}

TEST(RegistrationSwitch, SeparatorsInThePathDoNotTrigger)
{
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/my-harbor/harbor\""), SwitchAction::Run);
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/RegServer/harbor\" file"), SwitchAction::Run);
    EXPECT_EQ(FindRegistrationSwitch("\"/opt/harbor/RegServer\""), SwitchAction::Run);
    EXPECT_EQ(FindRegistrationSwitch(""), SwitchAction::Run);
    EXPECT_EQ(FindRegistrationSwitch(nullptr), SwitchAction::Run);
}

TEST(RegistrationSwitch, AnyLaterSeparatorMayStartTheSwitch)
{
    EXPECT_EQ(FindRegistrationSwitch("\"/h/harbor\" a-b /RegServer"), SwitchAction::Register);
    EXPECT_EQ(FindRegistrationSwitch("/RegServer"), SwitchAction::Register);
    EXPECT_EQ(FindRegistrationSwitch("\"/h/harbor\" --RegServer"), SwitchAction::Register);
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
