// Against the simulated library, which each test loads by absolute path from the folder it
// was built into: the diagnosis through the dialog's session adapter, and the dialog's offers
// on the headless host with the headless help viewer following the help's links.
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <deque>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "Fakes.h"
#include "errors/ErrorText.h"
#include "platform/SystemInfoScripted.h"
#include "session/BrickSession.h"
#include "troubleshooter/HeadlessHelpViewer.h"
#include "troubleshooter/SessionBrickCalls.h"
#include "troubleshooter/TroubleShooter.h"
#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"
#include "workspace/LiveObjects.h"

#ifndef HARBOR_SIM_DIR
#define HARBOR_SIM_DIR ""
#endif

namespace {

// Each test writes its scenario and settings into a directory of its own; no workspace object
// may outlive a test.
class SimulatorFixture : public testing::Test {
protected:
    void SetUp() override
    {
        static int number = 0;
        dir_ = std::filesystem::temp_directory_path() /
               ("harbor-shooter-" + std::to_string(getpid()) + "-" + std::to_string(++number));
        std::filesystem::remove_all(dir_);
        std::filesystem::create_directories(dir_);
        ASSERT_NE(std::string(HARBOR_SIM_DIR), "") << "the simulated library is not built";
    }
    void TearDown() override
    {
        session_.reset();
        EXPECT_EQ(workspace::LiveObjectCount(), 0);
        std::error_code ignored;
        std::filesystem::remove_all(dir_, ignored);
    }

    // Writes the scenario (link time 0 is added) and the settings, with lines of the test's own.
    void WriteScenario(const std::string& scenario, const std::string& settings = "")
    {
        ::setenv("TESSEL_SIM", WriteFile("scenario.txt", "link-time = 0\n" + scenario).c_str(), 1);
        WriteFile("harbor.ini", "[PATHS]\nDLL=" + std::string(HARBOR_SIM_DIR) +
                                    "/\n[DEBUG]\nMEMFILES=TRUE\n" + settings);
    }
    void Start(const std::string& scenario)
    {
        WriteScenario(scenario);
        session_ = std::make_unique<BrickSession>((dir_ / "harbor.ini").string().c_str());
        ASSERT_TRUE(session_->libraryLoaded()) << "Tessel.dll not found in " HARBOR_SIM_DIR;
    }
    std::string LogPath() const { return (dir_ / "shooter.log").string(); }
    std::string Log() const { return ReadFile(LogPath()); }
    std::string WriteFile(const std::string& name, const std::string& bytes)
    {
        const std::string path = (dir_ / name).string();
        std::ofstream(path, std::ios::binary) << bytes;
        return path;
    }

    BrickSession& session() { return *session_; }
    BrickSession* sessionSlot_ = nullptr; // the dialog's pointer, as the adapter reads it
    std::filesystem::path dir_;
    std::unique_ptr<BrickSession> session_;
};

class SimulatedDiagnosis : public SimulatorFixture {
protected:
    void Open(const char* port)
    {
        sessionSlot_ = session_.get();
        handle = session().Create(port);
        ASSERT_NE(handle, 0) << port;
        calls = std::make_unique<SessionBrickCalls>(&sessionSlot_);
        shooter =
            std::make_unique<TroubleShooter>(calls.get(), &handle, LogPath().c_str(), &system);
    }
    std::string Body() const { return LogBody(Log()); }

    platform::ScriptedSystemInfo system;
    tessel::Long handle = 0;
    std::unique_ptr<SessionBrickCalls> calls;
    std::unique_ptr<TroubleShooter> shooter;
    RecordingView view;
};

TEST_F(SimulatedDiagnosis, UnpluggedUsbTowerIsFoundAgain)
{
    Start("[brick onyx2]\n[port KIVOTOWER1]\nunplug-after = 0\n");
    Open("KIVOTOWER1");
    const tessel::Long failed = session().RunImmediate(handle, "sound 4", nullptr);
    ASSERT_EQ(failed, Packed(0xE0050474u)) << "the tower should be unplugged now";
    const tessel::Long lost = handle;

    shooter->Diagnose(failed, &view);
    EXPECT_EQ(view.shown, std::vector<int>{1105});
    EXPECT_NE(handle, lost);
    EXPECT_EQ(session().Status(handle, tessel::StatusPort, nullptr, 0), 1);
    EXPECT_EQ(Body(),
              "Computer: BENCH-PC\nUser name: tester\nProcessor Type: 586 (1)\n"
              "Linux version 6.1.0-test (x86_64)\n"
              "\tDiagnosing Error failed:\n"
              "\t\tError (0xe0050474) from Tessel driver: Kivo USB Tower has been unplugged from "
              "this port\n"
              "\nGet Tower Type:\n\tGet port name ok\n\tPort 3 is KIVOTOWER1\n"
              "\nFind USB Tower:\n\tFind port ok\n\tCreate port KIVOTOWER1 ok\n"
              "\tSet brick type ok\n\tPort status ok\n"
              "\nGet Tower Type:\n\tGet port name ok\n\tPort 3 is KIVOTOWER1\n"
              "\tFind USB tower ok\n");
    session().Destroy(handle);
}

TEST_F(SimulatedDiagnosis, ComPortNamedInsteadOfTheUsbTower)
{
    Start("[brick onyx2]\n[port KIVOTOWER1]\ntower = no\n[port COM1]\n");
    Open("KIVOTOWER1");
    EXPECT_TRUE(shooter->Diagnose(Packed(0xE005040Bu), &view));
    // The port state (no tower) decides, not the given tower fault.
    EXPECT_EQ(view.shown, std::vector<int>{1002});
    EXPECT_NE(Body().find("\nFind USB Tower:\n\tFind port ok\n\tFind USB tower failed:\n"
                          "\t\tError (0xe0050444) from Tessel driver: no more ports found\n"),
              std::string::npos);
    EXPECT_EQ(handle, 0) << "the search closed the old port and opened none";
}

// Outcomes that depend on the port type or have no catalogue text, and a facility that has
// no outcome at all, which is logged under its jump label instead.
TEST_F(SimulatedDiagnosis, OutcomeEdgeCases)
{
    struct Case {
        const char* port;
        std::uint32_t error;
        std::vector<int> shown;
        const char* logged;
    };
    const Case cases[] = {
        {"KIVOTOWER1", 0xE0050C52u, {1102}, nullptr},
        {"COM1", 0xE0050C52u, {1002}, nullptr},
        {"KIVOTOWER1",
         0xE0050476u,
         {1103},
         "\tDiagnosing Error failed:\n\t\tError (0xe0050476) from Tessel driver: "},
        {"COM1",
         0xE0030010u,
         {},
         "\tJump facility failed:\n\t\tError (0xe0030010) from Opal: undefined label\n"}};
    Start("[brick onyx2]\n[port KIVOTOWER1]\n[port COM1]\n");
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.port) + " " + std::to_string(c.error));
        Open(c.port);
        view.shown.clear();
        EXPECT_EQ(shooter->Diagnose(Packed(c.error), &view), !c.shown.empty());
        EXPECT_EQ(view.shown, c.shown);
        EXPECT_EQ(Body().find("Find USB Tower"), std::string::npos) << "the tower answers";
        if (c.logged != nullptr) {
            EXPECT_NE(Body().find(c.logged), std::string::npos) << Body();
        }
        session().Destroy(handle);
    }
}

TEST_F(SimulatedDiagnosis, CallsAfterTheSessionIsGoneFailQuietly)
{
    Start("[brick onyx2]\n[port COM1]\n");
    Open("COM1");
    session().Destroy(handle);
    session_.reset();
    sessionSlot_ = nullptr;
    EXPECT_EQ(shooter->TestTower(), StatusToError(tessel::kStatusNoLibrary));
    EXPECT_EQ(shooter->FindTower(), Packed(tessel::kLinkFailed));
}

// A "link" that starts a second run with its argument as the error.
constexpr int kNestedRun = -1;

class TroubleShooterOffers : public SimulatorFixture {
protected:
    void TearDown() override
    {
        dialog_.reset();
        host_.reset();
        SimulatorFixture::TearDown();
    }

    // Starts the dialog on the scenario with ports (the [PORTS] lines) and a log file.
    void StartDialog(const std::string& scenario, const std::string& ports,
                     const std::string& helpDirectory = HelpDirectory())
    {
        WriteScenario(scenario, "LOGFILE=" + LogPath() + "\n[PORTS]\n" + ports + "\n");
        host_ = std::make_unique<ui::HeadlessHost>();
        host_->SetListener([this](const ui::HeadlessEvent& event) {
            if (event.kind == ui::HeadlessEvent::Kind::Question) {
                questions.push_back(event.caption + "|" + event.text);
            }
        });
        viewer_ = std::make_unique<HeadlessHelpViewer>(
            *host_,
            [this](const std::string& line) {
                printed.push_back(line);
                if (line.rfind("[help] topic ", 0) == 0) {
                    topics.push_back(line.substr(13));
                }
            },
            helpDirectory);
        // The help's links, in order; when they run out the viewer is closed, as at the end
        // of a headless run.
        host_->SetIdleHandler([this] {
            if (!viewer_->IsOpen()) {
                host_->PostQuit(0); // nothing can end the pump any more: a fault
                return true;
            }
            if (links.empty()) {
                viewer_->InputEnded();
                return true;
            }
            const auto link = links.front();
            links.pop_front();
            if (link.first == kNestedRun) {
                // The dialog stays usable: another failure offers another run meanwhile.
                host_->QueueAnswer(true);
                nestedResult = dialog_->OfferTroubleShooter(link.second);
                return true;
            }
            viewer_->Command(link.first, link.second);
            return true;
        });
        const std::string commandLine = "\"" + (dir_ / "harbor.exe").string() + "\"";
        dialog_ = std::make_unique<ui::TestClientDialog>(*host_, commandLine.c_str());
        dialog_->SetHelpViewer(viewer_.get());
        ASSERT_TRUE(dialog_->Create());
    }

    void ExpectRunEndedCleanly()
    {
        EXPECT_FALSE(host_->QuitRequested()) << "the help never closed";
        EXPECT_FALSE(viewer_->IsOpen());
        EXPECT_EQ(host_->FindWindowOfClass("trbl_wnd"), ui::kNoWindow);
        const std::string log = Log();
        EXPECT_EQ(log.rfind("Marl 2.0 Diagnostic Trouble Shooter\n", 0), 0u);
        EXPECT_NE(log.find("\nTrouble Shooter closed\n\tTime: \t"), std::string::npos);
    }

    ui::TestClientDialog& dialog() { return *dialog_; }

    std::unique_ptr<ui::HeadlessHost> host_;
    std::unique_ptr<HeadlessHelpViewer> viewer_;
    std::unique_ptr<ui::TestClientDialog> dialog_;
    std::deque<std::pair<int, std::int32_t>> links;
    Strings printed;
    Strings topics; // the topic ids among the printed lines
    Strings questions;
    bool nestedResult = false;
};

constexpr char kSerialBench[] = "[brick onyx2]\n[port COM1]\n[port COM3]\n";

// A yes to the offer: the topics the run showed as the help's links were followed, and a part
// of the log it left.
struct HelpRun {
    const char* name;
    const char* scenario;
    std::uint32_t error; // below 100: a status offered with its text
    std::deque<std::pair<int, std::int32_t>> links;
    Strings topics;
    const char* logged;
};

class TroubleShooterRuns : public TroubleShooterOffers,
                           public testing::WithParamInterface<HelpRun> {};

TEST_P(TroubleShooterRuns, ShowTheTopicsOfTheLinksFollowedAndEndCleanly)
{
    const HelpRun& run = GetParam();
    StartDialog(run.scenario, "Serial=COM1");
    links = run.links;
    host_->QueueAnswer(true);
    EXPECT_TRUE(run.error < 100
                    ? dialog().OfferTroubleShooterForStatus(static_cast<int>(run.error), "dead")
                    : dialog().OfferTroubleShooter(Packed(run.error)));
    EXPECT_EQ(topics, run.topics);
    EXPECT_NE(Log().find(run.logged), std::string::npos) << Log();
    EXPECT_EQ(printed.back(), "[help] closed");
    for (const auto& link : run.links) {
        EXPECT_TRUE(link.first != kNestedRun || nestedResult) << "the second run showed a topic";
    }
    ExpectRunEndedCleanly();
}

INSTANTIATE_TEST_SUITE_P(
    Offers, TroubleShooterRuns,
    testing::Values(
        HelpRun{
            "NoTowerOpensItsTopic",
            kSerialBench,
            0xE0050421u,
            {},
            {"IR_Transmitter_or_cable_not_connected"},
            "\tDiagnosing Error failed:\n\t\tError (0xe0050421) from Tessel driver: "
            "IDSTATUS_RESULT_NOTOWER\n\nGet Tower Type:\n\tGet port name ok\n\tPort 1 is COM1\n"},
        HelpRun{"StatusIsConvertedBeforeTheDiagnosis",
                "[brick onyx2]\nalive = no\n[port COM1]\n",
                6,
                {},
                {"Onyx_not_alive"},
                "\tDiagnosing Error failed:\n"},
        HelpRun{"TestComPortThreeFindsTheTower",
                kSerialBench,
                0xE0050421u,
                {{2004, 3}, {2000, 0}},
                {"IR_Transmitter_or_cable_not_connected", "Found_working_IR_Transmitter"},
                "\nTest serial tower:\n\tTest COM port COM3: ok\n\tCreate port COM3 ok\n"},
        HelpRun{"PortTypeCommandTurnsNoMoreItemsIntoAUsbFault",
                "[brick onyx2]\n[port COM1]\nstate = in-use\n",
                0xE0050421u,
                {{2007, 0}, {3001, 3}, {2007, 0}, {2000, 0}},
                {"IR_Transmitter_or_cable_not_connected", "IR_Transmitter_or_cable_not_connected",
                 "USB_Transmitter_not_installed"},
                "\tEnum COM ports failed:\n"},
        HelpRun{"EndOfTheHelpInputClosesTheHelp",
                kSerialBench,
                0xE0050402u,
                {{2002, 0}, {2003, 0}},
                {"Onyx_not_alive", "IR_Transmitter_ok", "Onyx_ok"},
                "\nTest Onyx:\n"},
        HelpRun{"ASecondRunTakesTheHelpOverAndBothEnd",
                kSerialBench,
                0xE0050421u,
                {{kNestedRun, Packed(0xE0050402u)}, {2003, 0}, {2000, 0}},
                {"IR_Transmitter_or_cable_not_connected", "Onyx_not_alive", "Onyx_ok"},
                "\tOnyx ok\n"}),
    [](const testing::TestParamInfo<HelpRun>& info) { return std::string(info.param.name); });

TEST_F(TroubleShooterOffers, NoToEitherQuestionLeavesTheLogUntouched)
{
    StartDialog(kSerialBench, "Serial=COM1");
    WriteFile("shooter.log", "an earlier run\n");
    host_->QueueAnswer(false);
    EXPECT_FALSE(dialog().OfferTroubleShooter(Packed(0xE0050421u)));
    host_->QueueAnswer(false);
    EXPECT_FALSE(dialog().OfferTroubleShooterForStatus(2, "brick does not answer"));
    EXPECT_EQ(Log(), "an earlier run\n");
    EXPECT_EQ(questions,
              (Strings{"Diagnostics|Error (0xe0050421) from Tessel driver: "
                       "IDSTATUS_RESULT_NOTOWER.\r\nUse Trouble Shooter?",
                       "Diagnostics|Status: brick does not answer.\r\nUse Trouble Shooter?"}));
    EXPECT_TRUE(printed.empty());
}

TEST_F(TroubleShooterOffers, MissingHelpFileEndsTheRunWithTheDiagnosisLogged)
{
    StartDialog(kSerialBench, "Serial=COM1", "/nonexistent/");
    host_->QueueAnswer(true);
    EXPECT_TRUE(dialog().OfferTroubleShooter(Packed(0xE0050421u)));
    EXPECT_TRUE(topics.empty());
    EXPECT_EQ(printed.front(), "[help] cannot open /nonexistent/shooter.hlp");
    ExpectRunEndedCleanly();
    EXPECT_NE(Log().find("\tDiagnosing Error failed:\n"), std::string::npos);
}

TEST_F(TroubleShooterOffers, QuietRepairFindsTheUsbTowerAndAsksNothing)
{
    StartDialog("[brick onyx2]\n[port KIVOTOWER1]\nunplug-after = 20\n", "USB=KIVOTOWER1");
    ASSERT_EQ(dialog().portType(), 3);
    tessel::Long result = 0;
    for (int i = 0; i < 40 && result == 0; ++i) {
        result = dialog().session()->RunImmediate(dialog().brickHandle(), "sound 4", nullptr);
    }
    ASSERT_EQ(result, Packed(0xE0050474u));
    EXPECT_TRUE(dialog().QuietRepair(4));
    EXPECT_EQ(dialog().session()->RunImmediate(dialog().brickHandle(), "sound 4", nullptr), 0);
    EXPECT_TRUE(questions.empty());
    EXPECT_TRUE(printed.empty());
    EXPECT_FALSE(std::filesystem::exists(LogPath()));
}

TEST_F(TroubleShooterOffers,
       SerialTowerIsNotRepairedQuietlyAndTheDialogGoesOnWithThePortATestOpened)
{
    StartDialog(kSerialBench, "Serial=COM1");
    const tessel::Long handle = dialog().brickHandle();
    EXPECT_FALSE(dialog().QuietRepair(4));
    EXPECT_EQ(dialog().brickHandle(), handle);
    EXPECT_FALSE(std::filesystem::exists(LogPath()));
    links = {{2004, 3}, {2000, 0}};
    host_->QueueAnswer(true);
    EXPECT_TRUE(dialog().OfferTroubleShooter(Packed(0xE0050421u)));
    EXPECT_EQ(dialog().session()->Status(dialog().brickHandle(), tessel::StatusPort, nullptr, 0),
              1);
}

} // namespace
