// The fault matrix: every row of the dialog's failure tables (port, script, firmware, info,
// upload and stress commands), reached through a scenario of the simulated library and a
// headless session, with the status text the row shows and whether the Trouble Shooter is
// offered. A row the simulator cannot bring about runs against the hostile library in a mode
// that does (named in the row).
#include <gtest/gtest.h>

#include <cctype>
#include <cstdlib>
#include <ostream>
#include <string>
#include <vector>

#include "HeadlessSession.h"
#include "workspace/LiveObjects.h"

#ifndef HARBOR_HOSTILE_DIR
#define HARBOR_HOSTILE_DIR ""
#endif

namespace reliability {
namespace {

// A USB tower with long range and a serial port, both in front of one Onyx2, no link time.
constexpr const char* kWorking = "link-time = 0\n[brick onyx2]\n[port KIVOTOWER1]\nlong-range = "
                                 "yes\n[port COM1]\n";
constexpr const char* kUsbOnly = "link-time = 0\n[brick onyx2]\n[port KIVOTOWER1]\n"
                                 "long-range = yes\n";

struct Row {
    const char* table;     // which failure table
    const char* situation; // the row
    std::string scenario;  // for the simulated library
    std::string script;    // commands; the last one is judged
    std::string status;    // the last status text the judged command shows
    bool offered;          // the Trouble Shooter is offered by the judged command
    std::string ports = "";
    const char* hostileMode = nullptr; // run against the hostile library in this mode
    // Judged from this command to the end instead of the last command alone (for a report
    // that may arrive while the command runs or while a later one waits for it).
    const char* judgeFrom = nullptr;
};

std::string Last(const std::string& script)
{
    std::string trimmed = script;
    while (!trimmed.empty() && trimmed.back() == '\n') {
        trimmed.pop_back();
    }
    const std::size_t at = trimmed.rfind('\n');
    return at == std::string::npos ? trimmed : trimmed.substr(at + 1);
}

std::string Scenario(const std::string& brick, const std::string& port)
{
    return "link-time = 0\n[brick onyx2]\n" + brick + "[port KIVOTOWER1]\nlong-range = yes\n" +
           port;
}

const std::string kUnplugged =
    "Error (0xe0050474) from Tessel driver: Kivo USB Tower has been unplugged from this port";
const std::string kBattery =
    "Error (0xe0050424) from Tessel driver: IDSTATUS_RESULT_BADPBRICKBATTERY";
const std::string kUndeclared = "Error (0xe0050810) from Tessel compiler: frobnicate";
// What the hostile library fails with (any packed error would do).
const std::string kHostileFailure =
    "Error (0xe0050c41) from Tessel tsl: failed to link to Tessel.dll";

std::vector<Row> Rows()
{
    const std::string bad = "Editor program p { main { frobnicate } }\n";
    const std::string program = "Editor program p { main { sound 4 } }\n";
    const std::string immediate = "Editor sound 4\n";
    const std::string noCommands = "Source BIN\nEditor tobj 1 6 program\\ntask 0\\nend\\n\n";
    const std::string lowBattery = Scenario("battery = 5900\n", "");
    const std::string brickOff = Scenario("alive = no\n", "");
    std::string longObject = "Source BIN\nEditor tobj 1 6 program\\ntask 0\\n";
    for (int i = 0; i < 100; ++i) {
        longObject += "cmd 20 04\\n";
    }
    longObject += "end\\n\n";
    return {
        // ---- port commands ----
        {"port", "no port found", "link-time = 0\n[brick onyx2]\n[port COM1]\ntower = no\n",
         "Open\n", "Error (0xe0050c52) from Tessel tsl: no more items found", true},
        {"port", "all ports declined", kWorking, "Answer no no\nOpen\n", "No port selected", false},
        {"port", "handle not created", "", "Open\n", "Create failed", false, "", "create-fails"},
        {"port", "statistics collection refused", Scenario("", "statistics = refused\n"), "Open\n",
         "Collect statistics failed", false},
        {"port", "no brick behind an open port", brickOff, "Open\n",
         "Opened KIVOTOWER1, no brick detected", false},
        {"port", "test sound failed", Scenario("", "unplug-after = 1\n"), "Test\n", kUnplugged,
         true},
        {"port", "brick status neither 1 nor 9, no quiet repair", lowBattery, "Test\n",
         "brick battery low", true},
        {"port", "range refused", Scenario("", "unplug-after = 2\n"), "Test\nShort\n", kUnplugged,
         true},
        {"port", "statistics unavailable", Scenario("", "statistics = refused\n"), "Statistics\n",
         "No statistics", false},
        // ---- script commands ----
        {"script", "no open port", kWorking, "Close\n" + program + "Download\n", "Port not open",
         false},
        {"script", "Opal selected for Validate", kWorking, "Source Opal\n" + program + "Validate\n",
         "Cannot validate Opal source (yet?)", false},
        {"script", "translation failed in Download", kWorking, bad + "Download\n", kUndeclared,
         true},
        {"script", "translation failed in Execute", kWorking, bad + "Execute\n", kUndeclared, true},
        {"script", "translation failed in Validate", kWorking, bad + "Validate\n", kUndeclared,
         false},
        {"script", "translation failed in Execute Async", kWorking, bad + "Execute Async\n",
         kUndeclared, false},
        {"script", "empty object in Execute", "", immediate + "Execute\n", "No code", false, "",
         "empty-object"},
        {"script", "empty object in Execute Async", "", immediate + "Execute Async\n", "No code",
         false, "", "empty-object"},
        {"script", "object without commands in Download", kWorking, noCommands + "Download\n",
         "No code", false},
        {"script", "clearing the brick failed", lowBattery,
         "Auto Clear on\n" + program + "Download\n", kBattery, true},
        {"script", "execution call failed", lowBattery, immediate + "Execute\n", kBattery, true},
        {"script", "download call failed", "", program + "Download\n", kHostileFailure, true, "",
         "download-refused"},
        {"script", "Async call itself failed", "", immediate + "Execute Async\n", kHostileFailure,
         false, "", "exec-refused"},
        {"script", "failure reported by the execution callback", lowBattery,
         immediate + "Execute Async\n", kBattery, true},
        {"script", "failure reported by the download callback", Scenario("", "unplug-after = 4\n"),
         longObject + "Download\n", kUnplugged, true},
        {"script", "failure reported by the reception callback", "",
         "Receive on\nWait Status Received bad PBMessage, error: 0xe0050c41\n",
         "Received bad PBMessage, error: 0xe0050c41", false, "", "reception-fails", "Receive on"},
        // ---- firmware download ----
        {"firmware", "no open port", kWorking, "Close\nDownload Firmware\n", "Port not open",
         false},
        {"firmware", "boot mode refused", brickOff, "Download Firmware\n",
         "Failed to enter boot mode", false},
        {"firmware", "firmware file not prepared", kWorking, "Download Firmware missing.kvo\n",
         "Error (0xe0050c93) from Tessel tsl: bad source (OpenRead failed)", true},
        {"firmware", "brick silent before the download", "", "Download Firmware\n", "No brick",
         false, "", "silent-after-boot"},
        {"firmware", "brick silent after the download", "", "Download Firmware\n", "No brick",
         false, "", "silent-after-download"},
        {"firmware", "object without commands", "", "Download Firmware\n", "No code", false, "",
         "empty-object"},
        {"firmware", "download not started", "", "Download Firmware\n", kHostileFailure, true, "",
         "download-refused"},
        {"firmware", "new firmware not started", Scenario("unlock = fails\n", ""),
         "Download Firmware\n", "Failed to unlock firmware", false},
        // ---- info report ----
        {"info", "no open port", kWorking, "Close\nInfo\n", "Port not open", false},
        {"info", "brick type not readable", "", "Info\n", "Failed to get brick type", false, "",
         "type-unreadable"},
        // ---- upload ----
        {"upload", "no open port", kWorking, "Close\nUpload\n", "Port not open", false},
        {"upload", "program slot not readable", Scenario("", "unplug-after = 1\n"), "Upload\n",
         "Failed to get program slot", true},
        {"upload", "memory map not readable", Scenario("", "unplug-after = 2\n"), "Upload\n",
         "Failed to get memory map", true},
        {"upload", "a location or range read fails", Scenario("", "unplug-after = 3\n"), "Upload\n",
         "Ok", false},
        // ---- stress ----
        {"stress", "no open port", kWorking, "Close\nStress 3\n", "Port not open", false},
        {"stress", "translation failed in iteration n", kWorking, bad + "Stress 3\n",
         "Stress Script2SplitByteCode() failed on iteration 1, 0xe0050801", false},
        {"stress", "all iterations done", kWorking,
         "Editor program Stress {\\n main {\\n sound 1\\n }\\n\nStress 3\n",
         "Stress test passed ok", false},
    };
}

// Rows print by name in failure messages.
void PrintTo(const Row& row, std::ostream* out)
{
    *out << row.table << ": " << row.situation;
}

class FaultMatrix : public ::testing::TestWithParam<Row> {};

TEST_P(FaultMatrix, ShowsTheRowsTextAndOfferAndLeaksNothing)
{
    const Row& row = GetParam();
    ScratchDir dir("faults");
    SessionSetup setup;
    setup.scenario = row.scenario;
    setup.ports = row.ports;
    if (row.hostileMode != nullptr) {
        ASSERT_STRNE(HARBOR_HOSTILE_DIR, "") << "the hostile library is not built";
        setup.libraryDir = HARBOR_HOSTILE_DIR;
        ::setenv("HARBOR_HOSTILE", row.hostileMode, 1);
    }
    const Transcript transcript = RunHeadless(dir, setup, row.script);
    ::unsetenv("HARBOR_HOSTILE");

    const std::vector<std::string> judged =
        row.judgeFrom != nullptr ? transcript.from(row.judgeFrom) : transcript.of(Last(row.script));
    ASSERT_FALSE(judged.empty()) << transcript.text();
    const std::vector<std::string> statuses = Transcript::Statuses(judged);
    ASSERT_FALSE(statuses.empty()) << transcript.text();
    EXPECT_EQ(statuses.back(), row.status) << transcript.text();
    EXPECT_EQ(Transcript::Offered(judged), row.offered) << transcript.text();
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

std::string RowName(const ::testing::TestParamInfo<Row>& info)
{
    std::string name = std::string(info.param.table) + "_" + info.param.situation;
    for (char& c : name) {
        if (!std::isalnum(static_cast<unsigned char>(c))) {
            c = '_';
        }
    }
    return name;
}

INSTANTIATE_TEST_SUITE_P(EveryFailureRow, FaultMatrix, ::testing::ValuesIn(Rows()), RowName);

} // namespace
} // namespace reliability
