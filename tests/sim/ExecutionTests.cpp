// Immediate commands and downloads on the simulated brick: answers in the formats the client
// parses, the memory map following downloads, firmware, the shipped scenarios and the failure
// codes each produces where the client first meets it.
#include <sstream>
#include <thread>

#include "SimHarness.h"

namespace simtest {
namespace {

// "0x%x" values separated by commas, as the client parses them.
std::vector<int> Bytes(const std::string& text)
{
    std::vector<int> values;
    std::istringstream in(text);
    for (std::string item; std::getline(in, item, ',');) {
        values.push_back(std::stoi(item, nullptr, 16));
    }
    return values;
}

class Exec : public SimTest {
protected:
    void SetUp() override
    {
        SimTest::SetUp();
        handle_ = open("KIVOTOWER1");
        ASSERT_NE(handle_, 0);
    }

    std::vector<unsigned> map()
    {
        std::string text;
        EXPECT_EQ(run(handle_, Immediate(kGetMap), nullptr, &text), 0);
        const std::vector<int> bytes = Bytes(text);
        std::vector<unsigned> words;
        for (std::size_t i = 0; i + 1 < bytes.size(); i += 2) {
            words.push_back(static_cast<unsigned>(bytes[i] * 256 + bytes[i + 1]));
        }
        EXPECT_EQ(words.size(), 94u);
        words.resize(94);
        return words;
    }

    Long handle_ = 0;
};

TEST_F(Exec, VersionAndGetAnswerTheCellsTheClientReads)
{
    Long number = -1;
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(kVersion), &number, &text), 0);
    EXPECT_EQ(text, kVersion309);
    ASSERT_EQ(run(handle_, Immediate(Get(0xC924, 1)), &number, &text), 0);
    EXPECT_EQ(number, 0); // slot 1
    EXPECT_EQ(text, "0x00");
    ASSERT_EQ(run(handle_, Immediate(Get(0xC8BE, 2)), &number), 0);
    EXPECT_EQ(number / 256, 15); // minutes
    ASSERT_EQ(run(handle_, Immediate(Get(0xC8B0, 1)), &number), 0);
    EXPECT_EQ(number, 1); // Tx power high
    ASSERT_EQ(run(handle_, Immediate(SelectSlot(2))), 0);
    ASSERT_EQ(run(handle_, Immediate(Get(0xC924, 1)), &number), 0);
    EXPECT_EQ(number, 2);
    EXPECT_LT(run(handle_, Immediate(SelectSlot(5))), 0);
    // In boot mode the firmware is stopped: ordinary commands wait for "boot firmware".
    ASSERT_EQ(run(handle_, Immediate(kBootRom)), 0);
    EXPECT_EQ(run(handle_, Immediate(Sound(4))), Code(0xE0050423u));
}

TEST_F(Exec, MapFollowsDownloadsAndClearTasks)
{
    std::vector<unsigned> words = map();
    for (int i = 0; i < 39; ++i) {
        EXPECT_EQ(words[i + 1] - words[i], 1u) << i; // every subroutine keeps its closing byte
    }
    for (int i = 40; i < 90; ++i) {
        EXPECT_EQ(words[i + 1] - words[i], 0u) << i;
    }
    Short memory = 0;
    ASSERT_EQ(api().info(tessel::BrickOnyx2, tessel::InfoProgramMemory, &memory), 0);
    EXPECT_EQ(static_cast<int>(words[93] - words[92]), memory - 40);

    Recorder first;
    ASSERT_EQ(downloadAndWait(handle_, SoundProgram(3), first, 4), 0);
    EXPECT_EQ(map()[41] - map()[40], 7u);
    ASSERT_EQ(run(handle_, Immediate(kClearTasks)), 0);
    EXPECT_EQ(map()[41] - map()[40], 0u);

    ASSERT_EQ(run(handle_, Immediate(SelectSlot(1))), 0);
    Recorder second;
    ASSERT_EQ(downloadAndWait(handle_, MessageProgram(9), second, 2), 0);
    EXPECT_EQ(second.reports().back().status, 0);
    // Slot 2, task 1 (main): word 50 starts it, word 51 closes it.
    words = map();
    EXPECT_EQ(words[51] - words[50], 5u);
    EXPECT_EQ(words[40 + 10 * 2] - words[40 + 10], 5u); // slot 2's task area
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(Get(static_cast<int>(words[50]), 5)), nullptr, &text), 0);
    EXPECT_EQ(text, "0x27,0x02,0x09,0x00,0x17");
    Long number = 0;
    ASSERT_EQ(run(handle_, Immediate(Get(0xC8E3 + 10 * 2 + 1, 1)), &number), 0);
    EXPECT_EQ(number & 1, 1); // the task byte says the task is defined
}

TEST_F(Exec, WrongObjectsAndNullsAreRefused)
{
    Long number = 0;
    EXPECT_LT(run(handle_, "sound 4"), 0);
    EXPECT_EQ(api().exec(handle_, nullptr, &number, nullptr, nullptr, nullptr), kNullParameter);
    EXPECT_EQ(api().download(handle_, nullptr, nullptr, nullptr), kNullParameter);
    EXPECT_EQ(run(4242, Immediate(Sound(4))), kBadHandle);
    // A program object is downloaded, not executed, and immediate commands are not downloaded.
    EXPECT_EQ(run(handle_, MessageProgram(1)), Code(0xE0050C94u));
    Recorder immediate;
    EXPECT_EQ(downloadAndWait(handle_, Immediate(Sound(4)), immediate, 1), Code(0xE0050C94u));
    Recorder rover;
    EXPECT_EQ(downloadAndWait(handle_, MessageProgram(1, tessel::BrickRover), rover, 2),
              Code(0xE0050403u));
}

TEST_F(Exec, PolledDownloadReportsThroughStatus)
{
    ReaderWriter* code = ws().code(SoundProgram(40));
    ASSERT_EQ(api().download(handle_, code, nullptr, nullptr), 0);
    code->release();
    char text[tessel::kStatusTextSize];
    Long state = tessel::kDownloadRunning;
    // Bounded by the harness's minute, not by a count of polls a busy machine may exhaust.
    for (int polls = 0; polls < 60000 && state == tessel::kDownloadRunning; ++polls) {
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
        state = api().status(handle_, tessel::StatusDownload, text, sizeof text);
    }
    EXPECT_EQ(state, tessel::kDownloadFinished) << text;
    EXPECT_EQ(api().status(handle_, tessel::StatusDownloadProgress, nullptr, 0), 41);
}

TEST_F(Exec, RoverTablesDescribeTheDownloadedTasks)
{
    useShipped("rover.sim");
    const Long handle = open("COM1");
    api().set(handle, tessel::PropBrickType, tessel::BrickRover);
    Recorder recorder;
    ASSERT_EQ(downloadAndWait(handle, MessageProgram(4, tessel::BrickRover), recorder, 2), 0);
    std::string text;
    // Task 1: two little-endian words from cell 0x239.
    ASSERT_EQ(run(handle, Immediate(Get(0x238 + 1, 4), 5), nullptr, &text), 0);
    std::vector<int> b = Bytes(text);
    ASSERT_EQ(b.size(), 4u);
    EXPECT_EQ((b[2] + 256 * b[3]) - (b[0] + 256 * b[1]), 3); // five code bytes in 16-bit cells
    // Free memory: second minus first plus 4.
    ASSERT_EQ(run(handle, Immediate(Get(0x245, 4), 5), nullptr, &text), 0);
    b = Bytes(text);
    ASSERT_EQ(b.size(), 4u);
    Short memory = 0;
    api().info(tessel::BrickRover, tessel::InfoProgramMemory, &memory);
    EXPECT_EQ((b[2] + 256 * b[3]) - (b[0] + 256 * b[1]) + 4, memory - 3 - 5);
    EXPECT_LT(run(handle, Immediate(SelectSlot(1), 5)), 0); // a single slot
}

// Each shipped scenario: the first port search, and where a handle is opened, port status,
// brick status, tslFindBrick and a sound command. Status -1 skips the check.
struct ScenarioCase {
    const char* scenario;
    Long search;
    const char* found;
    const char* port;
    Long portStatus;
    Long brickStatus;
    Long findBrick;
    Long sound;
};

class Scenarios : public SimTest, public ::testing::WithParamInterface<ScenarioCase> {};

TEST_P(Scenarios, ProduceTheirFault)
{
    const ScenarioCase& c = GetParam();
    useShipped(c.scenario);
    char name[tessel::kPathSize] = "";
    EXPECT_EQ(api().findPort(name, sizeof name), c.search);
    if (c.found != nullptr) {
        EXPECT_STREQ(name, c.found);
    }
    if (c.port == nullptr) {
        return;
    }
    const Long handle = open(c.port);
    ASSERT_NE(handle, 0);
    char text[tessel::kStatusTextSize] = "";
    EXPECT_EQ(api().status(handle, tessel::StatusPort, nullptr, 0), c.portStatus);
    EXPECT_EQ(api().status(handle, tessel::StatusBrick, text, sizeof text), c.brickStatus);
    EXPECT_GT(std::strlen(text), 0u);
    Short type = -1;
    EXPECT_EQ(api().findBrick(handle, &type, nullptr), c.findBrick);
    if (c.sound != -1) {
        EXPECT_EQ(run(handle, Immediate(Sound(4))), c.sound);
    }
}

constexpr Long kNoFirmware = Code(0xE0050422u);
constexpr Long kUnlock = Code(0xE0050423u);

INSTANTIATE_TEST_SUITE_P(
    Shipped, Scenarios,
    ::testing::Values(
        ScenarioCase{"default.sim", 0, "KIVOTOWER1", "KIVOTOWER1", 1, 1, 0, 0},
        ScenarioCase{"no-tower.sim", kNoMoreItems, nullptr, "COM1", 4, 4, Code(0xE0050421u), -1},
        ScenarioCase{"tower-dead.sim", 0, "COM1", "COM1", 5, 5, Code(0xE005040Bu), -1},
        ScenarioCase{"com-in-use.sim", Code(0xE0050450u), nullptr, nullptr, 0, 0, 0, 0},
        ScenarioCase{"com-conflict.sim", Code(0xE0050451u), nullptr, nullptr, 0, 0, 0, 0},
        ScenarioCase{"com-missing.sim", Code(0xE0050452u), nullptr, nullptr, 0, 0, 0, 0},
        ScenarioCase{"com-mouse.sim", Code(0xE0050453u), nullptr, nullptr, 0, 0, 0, 0},
        ScenarioCase{"flaky-link.sim", 0, "KIVOTOWER1", nullptr, 0, 0, 0, 0},
        ScenarioCase{"rover.sim", 0, "COM1", nullptr, 0, 0, 0, 0},
        ScenarioCase{"messages.sim", 0, "KIVOTOWER1", nullptr, 0, 0, 0, 0},
        ScenarioCase{"brick-off.sim", 0, "KIVOTOWER1", "KIVOTOWER1", 1, 6, Code(0xE0050402u),
                     Code(0xE0050402u)},
        ScenarioCase{"no-firmware.sim", 0, "KIVOTOWER1", "KIVOTOWER1", 1, 7, 0, kNoFirmware},
        ScenarioCase{"low-battery.sim", 0, "KIVOTOWER1", "KIVOTOWER1", 1, 8, 0, Code(0xE0050424u)},
        ScenarioCase{"unlock-failed.sim", 0, "KIVOTOWER1", "KIVOTOWER1", 1, 14, 0, kUnlock},
        ScenarioCase{"not-an-onyx.sim", 0, "KIVOTOWER1", "KIVOTOWER1", 1, 9, 0, -1}));

class Faults : public SimTest {};

TEST_F(Faults, WithoutFirmwareOrUnlockTheBrickAnswersFromRomOnly)
{
    useShipped("unlock-failed.sim");
    EXPECT_EQ(run(open("KIVOTOWER1"), Immediate(kBootFirmware)), kUnlock);
    useShipped("no-firmware.sim");
    const Long handle = open("KIVOTOWER1");
    std::string text;
    ASSERT_EQ(run(handle, Immediate(kVersion), nullptr, &text), 0);
    EXPECT_EQ(text, "0x00,0x03,0x00,0x01,0x00,0x00,0x00,0x00");
    EXPECT_EQ(run(handle, Immediate(kBootFirmware)), kNoFirmware);
    Recorder recorder;
    EXPECT_EQ(downloadAndWait(handle, SoundProgram(2), recorder, 3), kNoFirmware);
}

TEST_F(Faults, MemoryFullRefusesTheDownload)
{
    useShipped("memory-full.sim");
    const Long handle = open("KIVOTOWER1");
    Recorder recorder;
    EXPECT_EQ(downloadAndWait(handle, SoundProgram(60), recorder, 61), Code(0xE005040Eu));
    Recorder small;
    EXPECT_EQ(downloadAndWait(handle, SoundProgram(10), small, 11), 0);
}

TEST_F(Faults, ALossyLinkRunsOutOfRetries)
{
    useScenario("link-time = 0\n[brick b]\n[port KIVOTOWER1]\nloss = 100\n");
    const Long handle = open("KIVOTOWER1");
    api().set(handle, tessel::PropCollectStats, 1);
    EXPECT_EQ(run(handle, Immediate(Sound(4))), Code(0xE1000204u));
    char text[tessel::kStatusTextSize];
    ASSERT_EQ(api().get(handle, tessel::PropStatistics, nullptr, text, sizeof text), 0);
    EXPECT_NE(std::strstr(text, "4 packets, 3 retries, 1 errors"), nullptr) << text;
}

TEST_F(Faults, ADownloadBrokenPartWayReportsTheBlockCounter)
{
    // Half the packets lost and no retries: with this seed the first block gets through and a
    // later one does not.
    useScenario("link-time = 0\nseed = 3\n[brick b]\n[port KIVOTOWER1]\nloss = 50\n");
    const Long handle = open("KIVOTOWER1");
    api().set(handle, tessel::PropDownloadRetries, 0);
    Recorder recorder;
    ASSERT_EQ(downloadAndWait(handle, SoundProgram(200), recorder, 201), 0);
    const Report last = recorder.reports().back();
    EXPECT_TRUE(last.status == Code(0xE0050411u) || last.status == Code(0xE1000204u));
    EXPECT_LT(last.count, 201);
    EXPECT_NE(api().status(handle, tessel::StatusDownload, nullptr, 0), 1);
}

TEST_F(Faults, AnUnpluggedUsbTowerIsBackWhenReopened)
{
    useScenario("link-time = 0\n[brick b]\n[port KIVOTOWER1]\nunplug-after = 2\n");
    Long handle = open("KIVOTOWER1");
    EXPECT_EQ(run(handle, Immediate(Sound(1))), 0);
    EXPECT_EQ(run(handle, Immediate(Sound(2))), 0);
    EXPECT_EQ(run(handle, Immediate(Sound(3))), Code(0xE0050474u));
    EXPECT_EQ(api().status(handle, tessel::StatusPort, nullptr, 0), 4);
    api().destroy(handle);
    char name[tessel::kPathSize] = "";
    ASSERT_EQ(api().findPort(name, sizeof name), 0);
    EXPECT_STREQ(name, "KIVOTOWER1");
    handle = open(name);
    EXPECT_EQ(api().status(handle, tessel::StatusPort, nullptr, 0), 1);
    EXPECT_EQ(run(handle, Immediate(Sound(3))), 0);
    // The shipped file unplugs after its thirteenth packet.
    useShipped("usb-unplugged.sim");
    handle = open("KIVOTOWER1");
    Long result = 0;
    int sent = 0;
    for (; result == 0 && sent < 100; ++sent) {
        result = run(handle, Immediate(Sound(4)));
    }
    EXPECT_EQ(result, Code(0xE0050474u));
    EXPECT_EQ(sent, 13);
}

TEST_F(Faults, MalformedScenariosFallBackToTheBuiltInOne)
{
    std::string garbage;
    for (int i = 0; i < 4096; ++i) {
        garbage += static_cast<char>((i * 37) & 0xFF);
    }
    for (const std::string& text :
         {std::string("[port LPT1]\n"), std::string("[brick b]\nbattery = lots\n"), garbage}) {
        useScenario(text);
        char name[tessel::kPathSize] = "";
        ASSERT_EQ(api().findPort(name, sizeof name), 0);
        EXPECT_STREQ(name, "KIVOTOWER1");
    }
}

} // namespace
} // namespace simtest
