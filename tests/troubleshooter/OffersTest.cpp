// The dialog's Trouble Shooter offers on the headless host against the simulated library,
// with the headless help viewer showing the topics and the help commands sent as its links
// would send them.
#include <gtest/gtest.h>

#include <deque>
#include <string>
#include <utility>
#include <vector>

#include "Fakes.h"
#include "SimulatorFixture.h"
#include "troubleshooter/HeadlessHelpViewer.h"
#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"

namespace {

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
            *host_, [this](const std::string& line) { printed.push_back(line); }, helpDirectory);
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

    Strings Topics() const
    {
        Strings topics;
        for (const std::string& line : printed) {
            if (line.rfind("[help] topic ", 0) == 0) {
                topics.push_back(line.substr(13));
            }
        }
        return topics;
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
    EXPECT_EQ(Topics(), run.topics);
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

TEST_F(TroubleShooterOffers, TheDialogGoesOnWithThePortATestOpened)
{
    StartDialog(kSerialBench, "Serial=COM1");
    links = {{2004, 3}, {2000, 0}};
    host_->QueueAnswer(true);
    EXPECT_TRUE(dialog().OfferTroubleShooter(Packed(0xE0050421u)));
    EXPECT_NE(dialog().brickHandle(), 0);
}

TEST_F(TroubleShooterOffers, MissingHelpFileEndsTheRunWithTheDiagnosisLogged)
{
    StartDialog(kSerialBench, "Serial=COM1", "/nonexistent/");
    host_->QueueAnswer(true);
    EXPECT_TRUE(dialog().OfferTroubleShooter(Packed(0xE0050421u)));
    EXPECT_TRUE(Topics().empty());
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

TEST_F(TroubleShooterOffers, QuietRepairOfASerialTowerDoesNothing)
{
    StartDialog(kSerialBench, "Serial=COM1");
    const tessel::Long handle = dialog().brickHandle();
    EXPECT_FALSE(dialog().QuietRepair(4));
    EXPECT_EQ(dialog().brickHandle(), handle);
    EXPECT_FALSE(std::filesystem::exists(LogPath()));
}

} // namespace
