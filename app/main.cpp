// The program entry: Harbor's own options, the registration switches, then the one dialog
// with its window, the message loop, and the teardown.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "app/CommandLine.h"
#include "app/GuiHost.h"
#include "app/Registration.h"
#include "app/Switches.h"
#include "platform/ExecutablePath.h"
#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"
#include "ui/headless/HeadlessRunner.h"

namespace {

// Other threads get this long to finish after the loop, before the dialog object goes.
constexpr std::chrono::milliseconds kShutdownPause(1000);

bool HaveDisplay()
{
    for (const char* name : {"DISPLAY", "WAYLAND_DISPLAY", "QT_QPA_PLATFORM"}) {
        const char* value = std::getenv(name);
        if (value != nullptr && value[0] != '\0')
            return true;
    }
    return false;
}

int RunHeadless(const app::HarborOptions& options, const std::string& commandLine)
{
    std::ifstream scriptFile;
    std::istream* in = &std::cin;
    if (!options.script.empty()) {
        scriptFile.open(options.script, std::ios::binary);
        if (!scriptFile) {
            std::fprintf(stderr, "harbor: cannot read the command file \"%s\"\n",
                         options.script.c_str());
            return ui::HeadlessBadCommand;
        }
        in = &scriptFile;
    }
    ui::HeadlessOptions runOptions;
    runOptions.defaultAnswer = options.answerYes;
    runOptions.waitTimeoutMs = options.timeoutMs;
    runOptions.fixedTicks = options.fixedTime;
    runOptions.echo = !options.quiet;
    // The build puts the help file into help/ beside the program.
    runOptions.helpDirectory = platform::ExecutableDirectory() + "help/";

    ui::HeadlessHost host;
    ui::TestClientDialog dialog(host, commandLine.c_str());
    // The runner lets go of the host before the dialog object is destroyed.
    ui::HeadlessRunner runner(host, dialog, *in, std::cout, std::cerr, runOptions);
    return runner.Run();
}

int RunWindowed(int argc, char** argv, const std::string& commandLine)
{
    if (!HaveDisplay()) {
        std::fprintf(stderr, "harbor: no display (DISPLAY, WAYLAND_DISPLAY and QT_QPA_PLATFORM are "
                             "unset); run \"harbor --headless\" to use Harbor without a window\n");
        return 1;
    }
    std::unique_ptr<ui::WindowHost> host = app::CreateGuiHost(argc, argv);
    if (!host) {
        std::fprintf(stderr, "harbor: this build has no window; run \"harbor --headless\" to "
                             "use Harbor without one\n");
        return 1;
    }
    {
        // Settings, brick session, workspace and the library's initialisation.
        ui::TestClientDialog dialog(*host, commandLine.c_str());
        if (!dialog.Create()) {
            std::fprintf(stderr, "harbor: the window could not be created\n");
            return 1;
        }
        host->RunMessageLoop();
        std::this_thread::sleep_for(kShutdownPause);
    }
    return 0;
}

} // namespace

int main(int argc, char** argv)
{
    app::HarborOptions options;
    std::string error;
    if (!app::ParseHarborOptions(argc, argv, options, error)) {
        std::fprintf(stderr, "harbor: %s (try \"harbor --help\")\n", error.c_str());
        return 2;
    }
    if (options.help) {
        std::fputs(app::HarborUsage(), stdout);
        return 0;
    }

    // The line the split and the switches see: the program path in quotes, then the
    // arguments left after Harbor's options.
    std::vector<const char*> arguments;
    for (const std::string& argument : options.arguments)
        arguments.push_back(argument.c_str());
    const std::string commandLine =
        app::ComposeCommandLine(static_cast<int>(arguments.size()), arguments.data());

    // There is no COM on this platform: no module, no class objects, and no shutdown
    // monitor, since nothing could ever signal it.
    switch (app::FindRegistrationSwitch(commandLine.c_str())) {
    case app::SwitchAction::Unregister:
        return app::UnregisterProgram();
    case app::SwitchAction::Register:
        return app::RegisterProgram();
    case app::SwitchAction::Run:
        break;
    }

    if (options.headless)
        return RunHeadless(options, commandLine);
    return RunWindowed(argc, argv, commandLine);
}
