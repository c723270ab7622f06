// Every entry point of the simulated library through the module's export table: ports, handles,
// enumerations, properties, status requests, capacities and bad arguments.
#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <sstream>

#include "SimHarness.h"

namespace simtest {
namespace {

TEST(ExportTable, NamesTheSixteenEntryPointsInSlotOrder)
{
    const Api& a = Library();
    ASSERT_NE(a.table, nullptr);
    int count = 0;
    for (const tessel::ExportEntry* entry = a.table; entry->name != nullptr; ++entry, ++count) {
        ASSERT_LT(count, tessel::SlotCount);
        EXPECT_STREQ(entry->name, tessel::kExportNames[count]);
        EXPECT_NE(entry->address, nullptr);
    }
    EXPECT_EQ(count, tessel::SlotCount);
    // Nothing else of the module is visible by name.
    EXPECT_EQ(dlsym(a.module, "tslCreate"), nullptr);
    EXPECT_EQ(dlsym(a.module, tessel::kExportNames[tessel::SlotCreate]), nullptr);
}

class Ports : public SimTest {};

TEST_F(Ports, SearchesAndEnumerationsListTheirItemsWithinTheBuffer)
{
    char name[tessel::kPathSize] = "";
    ASSERT_EQ(api().findPort(name, sizeof name), 0);
    EXPECT_STREQ(name, "KIVOTOWER1");
    ASSERT_EQ(api().findPort(name, sizeof name), 0);
    EXPECT_STREQ(name, "COM1");
    EXPECT_EQ(api().findPort(name, sizeof name), kNoMoreItems);
    EXPECT_EQ(api().findPort(nullptr, 260), kNullParameter);
    char small[8];
    std::memset(small, 'x', sizeof small);
    EXPECT_LT(api().findPort(small, 4), 0); // "KIVOTOWER1" does not fit
    EXPECT_EQ(small[4], 'x');
    EXPECT_EQ(api().findFirst(tessel::EnumComPorts, nullptr, name, sizeof name), kNullParameter);
    Short item = 0;
    EXPECT_EQ(api().findFirst(tessel::EnumUsbPorts, &item, small, 4), 0);
    EXPECT_STREQ(small, "KIV");
    EXPECT_EQ(small[4], 'x');
    EXPECT_EQ(api().findNext(tessel::EnumUsbPorts, &item, name, sizeof name), kNoMoreItems);

    std::vector<std::string> names;
    for (Long r = api().findFirst(tessel::EnumBrickTypes, &item, name, sizeof name);
         r >= 0 && names.size() < 20;
         r = api().findNext(tessel::EnumBrickTypes, &item, name, sizeof name)) {
        names.push_back(name);
    }
    EXPECT_NE(std::find(names.begin(), names.end(), "Onyx2"), names.end());
    EXPECT_NE(std::find(names.begin(), names.end(), "Rover"), names.end());
    EXPECT_EQ(api().findFirst(tessel::EnumSourceTypes, &item, name, sizeof name), 0);
    EXPECT_EQ(api().findFirst(tessel::EnumTargetTypes, &item, name, sizeof name), 0);
    EXPECT_EQ(api().findFirst(9, &item, name, sizeof name), Code(0xE0050C53u));
    EXPECT_EQ(api().findNext(-1, &item, name, sizeof name), Code(0xE0050C53u));
    EXPECT_EQ(api().findNext(tessel::EnumComPorts, nullptr, name, sizeof name), Code(0xE0050C51u));
    EXPECT_EQ(api().findFirst(tessel::EnumComPorts, &item, nullptr, 260), kNullParameter);
}

TEST_F(Ports, CreateTakesOneHandlePerPortAndItIsReportedLive)
{
    const Long usb = open("\\\\.\\KIVOTOWER1");
    EXPECT_NE(usb, 0);
    EXPECT_EQ(open("COM7"), 0);
    EXPECT_EQ(open(nullptr), 0);
    EXPECT_EQ(api().destroy(usb), 0);
    EXPECT_EQ(api().destroy(usb), kBadHandle);
    Short item = 0;
    char name[tessel::kPathSize];
    EXPECT_EQ(api().findFirst(tessel::EnumComPorts, &item, name, sizeof name), 0);
    EXPECT_STREQ(name, "COM1");
    const Long serial = open("COM1");
    ASSERT_NE(serial, 0);
    EXPECT_NE(serial, usb);
    EXPECT_EQ(api().findFirst(tessel::EnumComPorts, &item, name, sizeof name), Code(0xE0050454u));
    EXPECT_EQ(open("COM1"), 0);
    api().destroy(serial);
    EXPECT_EQ(api().findFirst(tessel::EnumComPorts, &item, name, sizeof name), 0);
}

TEST_F(Ports, ComPortFaultsCarryTheirDriverCodesAndPortsNameTheirBricks)
{
    useScenario("link-time = 0\n[brick a]\ntype = rover\n[brick b]\ntype = onyx2\n"
                "[port COM1]\nstate = in-use\n[port COM2]\nstate = conflict\n"
                "[port COM3]\nstate = missing\n[port COM4]\nstate = serial-mouse\n"
                "[port COM5]\nbrick = b\n[port COM6]\nbrick = a\n[port COM7]\nbrick = none\n");
    Short item = 0;
    char name[tessel::kPathSize];
    std::vector<std::pair<std::string, Long>> seen;
    Long result = api().findFirst(tessel::EnumComPorts, &item, name, sizeof name);
    while (result != kNoMoreItems && seen.size() < 10) {
        seen.emplace_back(name, result);
        result = api().findNext(tessel::EnumComPorts, &item, name, sizeof name);
    }
    const std::vector<std::pair<std::string, Long>> expected = {{"COM1", Code(0xE0050450u)},
                                                                {"COM2", Code(0xE0050451u)},
                                                                {"COM3", Code(0xE0050452u)},
                                                                {"COM4", Code(0xE0050453u)},
                                                                {"COM5", 0},
                                                                {"COM6", 0},
                                                                {"COM7", 0}};
    EXPECT_EQ(seen, expected);
    EXPECT_EQ(item, 7);
    // A usable port with a tower is found; the unusable ones cannot be opened.
    name[0] = '\0'; // an empty name starts the search
    EXPECT_EQ(api().findPort(name, sizeof name), 0);
    EXPECT_STREQ(name, "COM5");
    EXPECT_EQ(open("COM1"), 0);
    Short type = -1;
    EXPECT_EQ(api().findBrick(open("COM5"), &type, nullptr), 0);
    EXPECT_EQ(type, tessel::BrickOnyx2);
    EXPECT_EQ(api().findBrick(open("COM6"), &type, nullptr), 0);
    EXPECT_EQ(type, tessel::BrickRover);
    EXPECT_EQ(api().findBrick(open("COM7"), &type, nullptr), Code(0xE0050402u));
    EXPECT_EQ(type, tessel::BrickNone);
}

class Properties : public SimTest {};

TEST_F(Properties, RangeBelongsToUsbTowersThatHaveIt)
{
    Long handle = open("KIVOTOWER1");
    Short value = 0;
    char text[tessel::kPathSize];
    ASSERT_EQ(api().get(handle, tessel::PropPort, &value, text, sizeof text), 0);
    EXPECT_EQ(value, tessel::PortUsb);
    EXPECT_STREQ(text, "KIVOTOWER1");
    ASSERT_EQ(api().get(handle, tessel::PropLongRange, &value, nullptr, 0), 0);
    EXPECT_EQ(value, tessel::kLongRangeAvailable);
    EXPECT_EQ(api().set(handle, tessel::PropRange, tessel::RangeLong), 0);
    ASSERT_EQ(api().get(handle, tessel::PropRange, &value, nullptr, 0), 0);
    EXPECT_EQ(value, tessel::RangeLong);
    EXPECT_EQ(api().set(handle, tessel::PropRange, 4), Code(0xE0050410u));

    const Long serial = open("COM1");
    ASSERT_EQ(api().get(serial, tessel::PropPort, &value, text, sizeof text), 0);
    EXPECT_EQ(value, tessel::PortSerialIr);
    EXPECT_LT(api().get(serial, tessel::PropRange, &value, nullptr, 0), 0);
    EXPECT_LT(api().set(serial, tessel::PropRange, tessel::RangeShort), 0);
    EXPECT_LT(api().get(serial, tessel::PropLongRange, &value, nullptr, 0), 0);

    // A tower without the long range, then one that claims it and fails to switch.
    for (bool claims : {false, true}) {
        if (claims) {
            useShipped("short-range.sim");
        } else {
            useScenario("[brick b]\n[port KIVOTOWER1]\nlong-range = no\n");
        }
        handle = open("KIVOTOWER1");
        ASSERT_EQ(api().get(handle, tessel::PropLongRange, &value, nullptr, 0), 0);
        EXPECT_EQ(value == tessel::kLongRangeAvailable, claims);
        EXPECT_EQ(api().set(handle, tessel::PropRange, tessel::RangeLong), Code(0xE0050413u));
        EXPECT_EQ(api().set(handle, tessel::PropRange, tessel::RangeShort), 0);
    }
}

TEST_F(Properties, StatisticsCountTheTrafficAfterCollectionStarts)
{
    const Long handle = open("KIVOTOWER1");
    char text[tessel::kStatusTextSize];
    EXPECT_EQ(api().get(handle, tessel::PropStatistics, nullptr, text, sizeof text),
              Code(0xE1000206u));
    ASSERT_EQ(api().set(handle, tessel::PropCollectStats, 1), 0);
    Short type = 0;
    ASSERT_EQ(api().findBrick(handle, &type, nullptr), 0);
    ASSERT_EQ(api().findBrick(handle, &type, nullptr), 0);
    ASSERT_EQ(api().get(handle, tessel::PropStatistics, nullptr, text, sizeof text), 0);
    EXPECT_NE(std::strstr(text, "2 packets"), nullptr) << text;
    EXPECT_NE(std::strstr(text, "sim"), nullptr) << text; // labelled as simulated
    char tiny[5];
    std::memset(tiny, 'x', sizeof tiny);
    ASSERT_EQ(api().get(handle, tessel::PropStatistics, nullptr, tiny, 4), 0);
    EXPECT_EQ(std::strlen(tiny), 3u);
    EXPECT_EQ(tiny[4], 'x');
    // A tower may refuse statistics altogether.
    useScenario("[brick b]\n[port COM1]\nstatistics = refused\n");
    EXPECT_EQ(api().set(open("COM1"), tessel::PropCollectStats, 1), Code(0xE1000206u));
}

TEST_F(Properties, EveryReadablePropertyAnswersAndUnknownOnesAreRefused)
{
    const Long handle = open("KIVOTOWER1");
    for (Short property : {1, 3, 4, 5, 6, 7, 8, 11, 12, 13, 14}) {
        Short value = -1;
        char text[tessel::kBrickNameSize] = "";
        EXPECT_EQ(api().get(handle, property, &value, text, sizeof text), 0) << property;
        EXPECT_GE(value, 0) << property;
    }
    Short value = 0;
    char name[tessel::kStatusTextSize];
    ASSERT_EQ(api().get(handle, tessel::PropBrickType, &value, name, sizeof name), 0);
    EXPECT_EQ(value, tessel::BrickOnyx2);
    EXPECT_NE(std::strstr(name, "Onyx2"), nullptr);
    EXPECT_EQ(api().get(handle, 2, &value, nullptr, 0), Code(0xE0050C61u));
    EXPECT_EQ(api().set(handle, 99, 1), Code(0xE0050C61u));
    EXPECT_EQ(api().get(handle, tessel::PropExecRetries, nullptr, nullptr, 0), kNullParameter);
    EXPECT_EQ(api().get(12345, tessel::PropPort, &value, nullptr, 0), kBadHandle);
    EXPECT_EQ(api().set(0, tessel::PropRange, 1), kBadHandle);
    EXPECT_EQ(api().findBrick(handle, nullptr, nullptr), kNullParameter);
    EXPECT_EQ(api().findBrick(999, &value, nullptr), kBadHandle);
    EXPECT_EQ(api().status(0, tessel::StatusPort, nullptr, 0), 3);
    EXPECT_EQ(api().status(handle, tessel::StatusDownloadProgress, nullptr, 0), 0);
    // A brick type property that differs from the brick makes the client detect it again.
    EXPECT_EQ(api().set(handle, tessel::PropBrickType, tessel::BrickRover), 0);
    ASSERT_EQ(api().get(handle, tessel::PropBrickType, &value, nullptr, 0), 0);
    EXPECT_EQ(value, tessel::BrickRover);
    EXPECT_EQ(api().status(handle, tessel::StatusBrick, name, sizeof name),
              tessel::kBrickTypeChanged);
}

TEST_F(Properties, TraceOptionsAppendLinesToTheTraceFile)
{
    char directory[] = "/tmp/simcore-trace-XXXXXX";
    ASSERT_NE(mkdtemp(directory), nullptr);
    char previous[4096];
    ASSERT_NE(getcwd(previous, sizeof previous), nullptr);
    ASSERT_EQ(chdir(directory), 0);
    std::ofstream("tsltrace.txt") << "Trace file \"tsltrace.txt\", options: 3\n\n";
    EXPECT_EQ(api().set(0, tessel::PropTrace, 3), 0);
    Short type = 0;
    api().findBrick(open("COM1"), &type, nullptr);
    api().set(0, tessel::PropTrace, 0);
    open("KIVOTOWER1"); // not traced any more
    std::stringstream content;
    content << std::ifstream("tsltrace.txt").rdbuf();
    const std::string text = content.str();
    std::remove("tsltrace.txt");
    ASSERT_EQ(chdir(previous), 0);
    rmdir(directory);
    EXPECT_EQ(text.rfind("Trace file", 0), 0u);
    EXPECT_NE(text.find("tslCreate(COM1)"), std::string::npos) << text;
    EXPECT_NE(text.find("packet"), std::string::npos) << text;
    EXPECT_EQ(text.find("KIVOTOWER1"), std::string::npos) << text;
}

TEST_F(Properties, InfoAnswersEveryIdOfTheBrickTypes)
{
    for (Short id : {1, 2, 3, 4, 5, 6, 7, 8, 11, 13, 14, 15, 18}) {
        Short value = -1;
        EXPECT_EQ(api().info(tessel::BrickOnyx2, id, &value), 0) << id;
        EXPECT_GE(value, 0) << id;
    }
    Short slots = 0;
    ASSERT_EQ(api().info(tessel::BrickOnyx2, tessel::InfoProgramSlots, &slots), 0);
    EXPECT_EQ(slots, 5);
    ASSERT_EQ(api().info(tessel::BrickRover, tessel::InfoProgramSlots, &slots), 0);
    EXPECT_EQ(slots, 1);
    EXPECT_EQ(api().info(tessel::BrickOnyx2, 9, &slots), Code(0xE0050C54u));
    EXPECT_EQ(api().info(tessel::BrickOnyx2, 1, nullptr), kNullParameter);
    EXPECT_LT(api().info(42, 1, &slots), 0);
}

} // namespace
} // namespace simtest
