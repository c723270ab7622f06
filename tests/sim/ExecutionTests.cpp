// Immediate commands and downloads on the simulated brick: answers in the formats the client
// parses, the memory map following downloads, firmware, and the failure codes.
#include <cstdio>
#include <cstring>

#include "Objects.h"
#include "SimHarness.h"

namespace simtest {
namespace {

using tessel::Long;
using tessel::Short;

// "0x%x" values separated by commas, as the client parses them.
std::vector<int> Bytes(const std::string& text)
{
    std::vector<int> values;
    std::size_t at = 0;
    while (at < text.size()) {
        unsigned value = 0;
        if (std::sscanf(text.c_str() + at, "0x%x", &value) != 1) {
            break;
        }
        values.push_back(static_cast<int>(value));
        const std::size_t comma = text.find(',', at);
        if (comma == std::string::npos) {
            break;
        }
        at = comma + 1;
    }
    return values;
}

std::vector<unsigned> MapWords(const std::string& text)
{
    const std::vector<int> bytes = Bytes(text);
    std::vector<unsigned> words;
    for (std::size_t i = 0; i + 1 < bytes.size(); i += 2) {
        words.push_back(static_cast<unsigned>(bytes[i] * 256 + bytes[i + 1]));
    }
    return words;
}

class Exec : public SimTest {
protected:
    void SetUp() override
    {
        SimTest::SetUp();
        handle_ = open("KIVOTOWER1");
        ASSERT_NE(handle_, 0);
    }
    Long handle_ = 0;
};

TEST_F(Exec, VersionAnswersEightDecimalDigits)
{
    Long number = -1;
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(kVersion), &number, &text), 0);
    EXPECT_EQ(text, "0x00,0x03,0x00,0x01,0x00,0x03,0x00,0x09");
}

TEST_F(Exec, GetAnswersTheCellsTheClientReads)
{
    Long number = -1;
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(Get(0xC924, 1)), &number, &text), 0);
    EXPECT_EQ(number, 0); // slot 1
    EXPECT_EQ(text, "0x00");
    ASSERT_EQ(run(handle_, Immediate(Get(0xC8BE, 2)), &number, &text), 0);
    EXPECT_EQ(number / 256, 15); // minutes
    ASSERT_EQ(run(handle_, Immediate(Get(0xC8B0, 1)), &number, &text), 0);
    EXPECT_EQ(number, 1); // Tx power high
    ASSERT_EQ(run(handle_, Immediate(SelectSlot(2)), &number), 0);
    ASSERT_EQ(run(handle_, Immediate(Get(0xC924, 1)), &number, &text), 0);
    EXPECT_EQ(number, 2);
    EXPECT_LT(run(handle_, Immediate(SelectSlot(5)), &number), 0);
}

TEST_F(Exec, MapOfAnEmptyBrickHasOnlySubroutineEnds)
{
    Long number = 0;
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(kGetMap), &number, &text), 0);
    const std::vector<unsigned> map = MapWords(text);
    ASSERT_EQ(map.size(), 94u);
    for (int i = 0; i < 39; ++i) {
        EXPECT_EQ(map[i + 1] - map[i], 1u) << i; // every subroutine keeps its closing byte
    }
    for (int i = 40; i < 90; ++i) {
        EXPECT_EQ(map[i + 1] - map[i], 0u) << i;
    }
    Short memory = 0;
    ASSERT_EQ(api().info(tessel::BrickOnyx2, tessel::InfoProgramMemory, &memory), 0);
    EXPECT_EQ(static_cast<int>(map[93] - map[92]), memory - 40);
}

TEST_F(Exec, DownloadedProgramShowsInMapAndMemory)
{
    Recorder recorder;
    ASSERT_EQ(run(handle_, Immediate(SelectSlot(1)), nullptr), 0);
    ASSERT_EQ(downloadAndWait(handle_, MessageProgram(9), recorder, 2), 0);
    const std::vector<Report> reports = recorder.reports();
    ASSERT_FALSE(reports.empty());
    EXPECT_EQ(reports.back().status, 0);
    EXPECT_EQ(reports.back().count, 2);
    Long number = 0;
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(kGetMap), &number, &text), 0);
    const std::vector<unsigned> map = MapWords(text);
    ASSERT_EQ(map.size(), 94u);
    // Slot 2, task 1 (main): word 50 starts it, word 51 closes it.
    const unsigned start = map[50];
    EXPECT_EQ(map[51] - start, 5u);
    EXPECT_EQ(map[40 + 10 * 2] - map[40 + 10], 5u); // slot 2's task area
    ASSERT_EQ(run(handle_, Immediate(Get(static_cast<std::uint16_t>(start), 5)), &number, &text),
              0);
    EXPECT_EQ(text, "0x27,0x02,0x09,0x00,0x17");
    // The task byte says the task is defined.
    ASSERT_EQ(run(handle_, Immediate(Get(0xC8E3 + 10 * 2 + 1, 1)), &number), 0);
    EXPECT_EQ(number & 1, 1);
}

TEST_F(Exec, ClearTasksEmptiesTheCurrentSlot)
{
    Recorder recorder;
    ASSERT_EQ(downloadAndWait(handle_, SoundProgram(3), recorder, 4), 0);
    Long number = 0;
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(kGetMap), &number, &text), 0);
    EXPECT_EQ(MapWords(text)[41] - MapWords(text)[40], 7u);
    ASSERT_EQ(run(handle_, Immediate(kClearTasks), &number), 0);
    ASSERT_EQ(run(handle_, Immediate(kGetMap), &number, &text), 0);
    EXPECT_EQ(MapWords(text)[41] - MapWords(text)[40], 0u);
}

TEST_F(Exec, NonObjectCodeAndNullsAreRefused)
{
    Long number = 0;
    EXPECT_LT(run(handle_, "sound 4", &number), 0);
    EXPECT_EQ(api().exec(handle_, nullptr, &number, nullptr, nullptr, nullptr), Code(0xE0050C64u));
    EXPECT_EQ(api().download(handle_, nullptr, nullptr, nullptr), Code(0xE0050C64u));
    EXPECT_EQ(run(4242, Immediate(Sound(4)), &number), Code(0xE0050401u));
    // A program object is downloaded, not executed, and immediate commands are not downloaded.
    EXPECT_EQ(run(handle_, MessageProgram(1), &number), Code(0xE0050C94u));
    Recorder recorder;
    EXPECT_EQ(downloadAndWait(handle_, Immediate(Sound(4)), recorder, 1), Code(0xE0050C94u));
}

TEST_F(Exec, FirmwareDownloadNeedsBootModeAndChangesTheVersion)
{
    Recorder refused;
    EXPECT_EQ(downloadAndWait(handle_, Firmware(312, 5), refused, 5), Code(0xE005040Fu));
    Long number = 0;
    ASSERT_EQ(run(handle_, Immediate(kBootRom), &number), 0);
    // In boot mode the firmware is stopped: ordinary commands wait for "boot firmware".
    EXPECT_EQ(run(handle_, Immediate(Sound(4)), &number), Code(0xE0050423u));
    Recorder recorder;
    ASSERT_EQ(downloadAndWait(handle_, Firmware(312, 5), recorder, 5), 0);
    EXPECT_EQ(recorder.reports().back().count, 5);
    ASSERT_EQ(run(handle_, Immediate(kAlive), &number), 0);
    ASSERT_EQ(run(handle_, Immediate(kBootFirmware), &number), 0);
    std::string text;
    ASSERT_EQ(run(handle_, Immediate(kVersion), &number, &text), 0);
    EXPECT_EQ(text, "0x00,0x03,0x00,0x01,0x00,0x03,0x01,0x02");
    EXPECT_EQ(run(handle_, Immediate(Sound(4)), &number), 0);
}

TEST_F(Exec, ADownloadForAnotherBrickTypeIsRefused)
{
    Recorder recorder;
    EXPECT_EQ(downloadAndWait(handle_, MessageProgram(1, tessel::BrickRover), recorder, 2),
              Code(0xE0050403u));
}

TEST_F(Exec, PolledDownloadReportsThroughStatus)
{
    ReaderWriter* code = ws().code(SoundProgram(40));
    ASSERT_EQ(api().download(handle_, code, nullptr, nullptr), 0);
    code->release();
    char text[tessel::kStatusTextSize];
    Long state = tessel::kDownloadRunning;
    for (int polls = 0; polls < 100000 && state == tessel::kDownloadRunning; ++polls) {
        state = api().status(handle_, tessel::StatusDownload, text, sizeof text);
    }
    EXPECT_EQ(state, tessel::kDownloadFinished) << text;
    EXPECT_EQ(api().status(handle_, tessel::StatusDownloadProgress, nullptr, 0), 41);
}

class Faults : public SimTest {};

TEST_F(Faults, MemoryFullRefusesTheDownload)
{
    useShipped("memory-full.sim");
    const Long handle = open("KIVOTOWER1");
    Recorder recorder;
    EXPECT_EQ(downloadAndWait(handle, SoundProgram(60), recorder, 61), Code(0xE005040Eu));
    Recorder small;
    EXPECT_EQ(downloadAndWait(handle, SoundProgram(10), small, 11), 0);
}

TEST_F(Faults, NoFirmwareAnswersFromRomOnly)
{
    useShipped("no-firmware.sim");
    const Long handle = open("KIVOTOWER1");
    Long number = 0;
    std::string text;
    EXPECT_EQ(run(handle, Immediate(Sound(4)), &number), Code(0xE0050422u));
    ASSERT_EQ(run(handle, Immediate(kVersion), &number, &text), 0);
    EXPECT_EQ(text, "0x00,0x03,0x00,0x01,0x00,0x00,0x00,0x00");
    EXPECT_EQ(run(handle, Immediate(kBootFirmware), &number), Code(0xE0050422u));
    Recorder recorder;
    EXPECT_EQ(downloadAndWait(handle, SoundProgram(2), recorder, 3), Code(0xE0050422u));
}

TEST_F(Faults, BrickBatteryAndUnlock)
{
    Long number = 0;
    useShipped("low-battery.sim");
    EXPECT_EQ(run(open("KIVOTOWER1"), Immediate(Sound(4)), &number), Code(0xE0050424u));
    useShipped("unlock-failed.sim");
    const Long handle = open("KIVOTOWER1");
    EXPECT_EQ(run(handle, Immediate(Sound(4)), &number), Code(0xE0050423u));
    EXPECT_EQ(run(handle, Immediate(kBootFirmware), &number), Code(0xE0050423u));
    useShipped("brick-off.sim");
    EXPECT_EQ(run(open("KIVOTOWER1"), Immediate(Sound(4)), &number), Code(0xE0050402u));
}

TEST_F(Faults, ALossyLinkRunsOutOfRetries)
{
    useScenario("link-time = 0\n[brick b]\n[port KIVOTOWER1]\nloss = 100\n");
    const Long handle = open("KIVOTOWER1");
    api().set(handle, tessel::PropCollectStats, 1);
    Long number = 0;
    EXPECT_EQ(run(handle, Immediate(Sound(4)), &number), Code(0xE1000204u));
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
    Long number = 0;
    EXPECT_EQ(run(handle, Immediate(Sound(1)), &number), 0);
    EXPECT_EQ(run(handle, Immediate(Sound(2)), &number), 0);
    EXPECT_EQ(run(handle, Immediate(Sound(3)), &number), Code(0xE0050474u));
    EXPECT_EQ(api().status(handle, tessel::StatusPort, nullptr, 0), 4);
    api().destroy(handle);
    char name[tessel::kPathSize] = "";
    ASSERT_EQ(api().findPort(name, sizeof name), 0);
    EXPECT_STREQ(name, "KIVOTOWER1");
    handle = open(name);
    EXPECT_EQ(api().status(handle, tessel::StatusPort, nullptr, 0), 1);
    EXPECT_EQ(run(handle, Immediate(Sound(3)), &number), 0);
}

class Rover : public SimTest {};

TEST_F(Rover, TablesDescribeTheDownloadedTasks)
{
    useShipped("rover.sim");
    const Long handle = open("COM1");
    api().set(handle, tessel::PropBrickType, tessel::BrickRover);
    Recorder recorder;
    ASSERT_EQ(downloadAndWait(handle, MessageProgram(4, tessel::BrickRover), recorder, 2), 0);
    Long number = 0;
    std::string text;
    // Task 1: two little-endian words from cell 0x239.
    ASSERT_EQ(run(handle, Immediate(Get(0x238 + 1, 4), 5), &number, &text), 0);
    std::vector<int> b = Bytes(text);
    ASSERT_EQ(b.size(), 4u);
    const int start = b[0] + 256 * b[1];
    const int end = b[2] + 256 * b[3];
    EXPECT_EQ(end - start, 3); // five code bytes in 16-bit cells
    // Free memory: second minus first plus 4.
    ASSERT_EQ(run(handle, Immediate(Get(0x245, 4), 5), &number, &text), 0);
    b = Bytes(text);
    ASSERT_EQ(b.size(), 4u);
    Short memory = 0;
    api().info(tessel::BrickRover, tessel::InfoProgramMemory, &memory);
    EXPECT_EQ((b[2] + 256 * b[3]) - (b[0] + 256 * b[1]) + 4, memory - 3 - 5);
    // Slots other than the first do not exist.
    EXPECT_LT(run(handle, Immediate(SelectSlot(1), 5), &number), 0);
}

} // namespace
} // namespace simtest
