// A whole Trouble Shooter run as a person drives it in the headless mode: a failed Open, a
// yes to the offer, the help's links given as input lines, and the log the run leaves.
#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "SimulatorFixture.h"
#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"
#include "ui/headless/HeadlessRunner.h"

namespace {

class HeadlessTroubleShooter : public SimulatorFixture {
protected:
    int Run(const std::string& scenario, const std::string& script)
    {
        ::setenv("TESSEL_SIM", WriteFile("scenario.txt", "link-time = 0\n" + scenario).c_str(), 1);
        WriteFile("harbor.ini", SettingsText() + "LOGFILE=" + LogPath() + "\n");
        const std::string file = HARBOR_HELP_FILE;
        ui::HeadlessOptions options;
        options.helpDirectory = file.substr(0, file.rfind('/') + 1);
        options.fixedTicks = true;
        ui::HeadlessHost host;
        const std::string commandLine = "\"" + (dir_ / "harbor.exe").string() + "\"";
        int status = 0;
        {
            ui::TestClientDialog dialog(host, commandLine.c_str());
            std::istringstream in(script);
            ui::HeadlessRunner runner(host, dialog, in, out, err, options);
            status = runner.Run();
        }
        return status;
    }
    // Where text appears in the transcript, after position from; fails when it does not.
    std::size_t Find(const std::string& text, std::size_t from = 0)
    {
        const std::size_t at = out.str().find(text, from);
        EXPECT_NE(at, std::string::npos) << "missing: " << text << "\n" << out.str();
        return at == std::string::npos ? out.str().size() : at;
    }

    std::ostringstream out;
    std::ostringstream err;
};

constexpr char kNoTower[] = "[brick onyx2]\n[port COM1]\ntower = no\n";

TEST_F(HeadlessTroubleShooter, HelpLinksRunTestsAndTheLogKeepsThem)
{
    Run(kNoTower, "Answer yes\nOpen\nHelp 2004 3\nHelp 3001 3\nHelp 2004 3\nHelp 2000\n");
    std::size_t at = Find("[help] topic IR_Transmitter_or_cable_not_connected");
    at = Find("[help] topic IR_Transmitter_or_cable_not_connected", at + 1);
    at = Find("[help] topic USB_Transmitter_not_installed", at);
    Find("[help] closed", at);

    const std::string log = Log();
    const std::string failedTest = "\nTest serial tower:\n\tTest COM port COM1: failed:\n"
                                   "\t\tError (0xe0050c52) from Tessel tsl: no more items found\n";
    const std::size_t first = log.find(failedTest);
    ASSERT_NE(first, std::string::npos) << log;
    EXPECT_NE(log.find(failedTest, first + 1), std::string::npos) << log;
    EXPECT_NE(log.find("\tDiagnosing Error failed:\n\t\tError (0xe0050c52) from Tessel tsl: "
                       "no more items found\n"),
              std::string::npos)
        << log;
    EXPECT_NE(log.find("\nTrouble Shooter closed\n"), std::string::npos) << log;
}

} // namespace
