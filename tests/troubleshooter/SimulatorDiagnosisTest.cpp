// The diagnosis against the simulated library, through the dialog's session adapter.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Fakes.h"
#include "SimulatorFixture.h"
#include "errors/ErrorText.h"
#include "platform/SystemInfoScripted.h"
#include "troubleshooter/SessionBrickCalls.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

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
    std::string Body() const
    {
        const std::string log = Log();
        return log.substr(log.find("\n\n") + 2);
    }

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
         "\tJump facility failed:\n\t\tError (0xe0030010) from Opal: undefined label\n"},
    };
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

} // namespace
