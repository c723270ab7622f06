// The shipped scenarios parse and each produces the fault it documents at the first place the
// client meets it; malformed scenario files fall back to the built-in one.
#include <cstring>

#include "Objects.h"
#include "SimHarness.h"

namespace simtest {
namespace {

using tessel::Long;

struct SearchCase {
    const char* scenario;
    Long search;      // first tslFindPort result
    const char* port; // name found, if any
};

class PortSearch : public SimTest, public ::testing::WithParamInterface<SearchCase> {};

TEST_P(PortSearch, FirstResult)
{
    useShipped(GetParam().scenario);
    char name[tessel::kPathSize] = "";
    EXPECT_EQ(api().findPort(name, sizeof name), GetParam().search);
    if (GetParam().port != nullptr) {
        EXPECT_STREQ(name, GetParam().port);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Shipped, PortSearch,
    ::testing::Values(SearchCase{"default.sim", 0, "KIVOTOWER1"},
                      SearchCase{"no-tower.sim", Code(0xE0050C52u), nullptr},
                      SearchCase{"tower-dead.sim", 0, "COM1"},
                      SearchCase{"com-in-use.sim", Code(0xE0050450u), nullptr},
                      SearchCase{"com-conflict.sim", Code(0xE0050451u), nullptr},
                      SearchCase{"com-missing.sim", Code(0xE0050452u), nullptr},
                      SearchCase{"com-mouse.sim", Code(0xE0050453u), nullptr},
                      SearchCase{"usb-unplugged.sim", 0, "KIVOTOWER1"},
                      SearchCase{"flaky-link.sim", 0, "KIVOTOWER1"},
                      SearchCase{"memory-full.sim", 0, "KIVOTOWER1"},
                      SearchCase{"rover.sim", 0, "COM1"},
                      SearchCase{"short-range.sim", 0, "KIVOTOWER1"},
                      SearchCase{"not-an-onyx.sim", 0, "KIVOTOWER1"},
                      SearchCase{"messages.sim", 0, "KIVOTOWER1"},
                      SearchCase{"brick-off.sim", 0, "KIVOTOWER1"},
                      SearchCase{"no-firmware.sim", 0, "KIVOTOWER1"},
                      SearchCase{"low-battery.sim", 0, "KIVOTOWER1"},
                      SearchCase{"unlock-failed.sim", 0, "KIVOTOWER1"}));

class ScenarioFiles : public SimTest {};

TEST_F(ScenarioFiles, TheUnpluggedTowerFailsAfterItsPackets)
{
    useShipped("usb-unplugged.sim");
    const Long handle = open("KIVOTOWER1");
    Long number = 0;
    Long result = 0;
    int sent = 0;
    while (result == 0 && sent < 100) {
        result = run(handle, Immediate(Sound(4)), &number);
        ++sent;
    }
    EXPECT_EQ(result, Code(0xE0050474u));
    EXPECT_EQ(sent, 13);
}

TEST_F(ScenarioFiles, AMalformedFileFallsBackToTheBuiltInScenario)
{
    useScenario("[port LPT1]\n");
    char name[tessel::kPathSize] = "";
    ASSERT_EQ(api().findPort(name, sizeof name), 0);
    EXPECT_STREQ(name, "KIVOTOWER1");
    useScenario("[brick b]\nbattery = lots\n");
    name[0] = '\0';
    ASSERT_EQ(api().findPort(name, sizeof name), 0);
    EXPECT_STREQ(name, "KIVOTOWER1");
}

TEST_F(ScenarioFiles, BinaryGarbageIsNoScenario)
{
    std::string garbage;
    for (int i = 0; i < 4096; ++i) {
        garbage += static_cast<char>((i * 37) & 0xFF);
    }
    useScenario(garbage);
    char name[tessel::kPathSize] = "";
    EXPECT_EQ(api().findPort(name, sizeof name), 0);
}

TEST_F(ScenarioFiles, PortsNameTheirBricks)
{
    useScenario("link-time = 0\n[brick a]\ntype = rover\n[brick b]\ntype = onyx2\n"
                "[port COM1]\nbrick = b\n[port COM2]\nbrick = a\n[port COM3]\nbrick = none\n");
    tessel::Short type = -1;
    EXPECT_EQ(api().findBrick(open("COM1"), &type, nullptr), 0);
    EXPECT_EQ(type, tessel::BrickOnyx2);
    EXPECT_EQ(api().findBrick(open("COM2"), &type, nullptr), 0);
    EXPECT_EQ(type, tessel::BrickRover);
    EXPECT_EQ(api().findBrick(open("COM3"), &type, nullptr), Code(0xE0050402u));
    EXPECT_EQ(type, tessel::BrickNone);
}

} // namespace
} // namespace simtest
