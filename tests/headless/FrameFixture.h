// A dialog on the headless host, built from a settings file of the test's own: the program
// path of the command line lies in a scratch directory, so the settings file beside it is
// the test's. The library directory is the simulator's (or the recording library's).
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"

namespace headless_test {

std::string SimulatorDirectory();
std::string RecordingLibraryDirectory();

// A scratch directory removed with its content.
class ScratchDirectory {
public:
    ScratchDirectory();
    ~ScratchDirectory();
    ScratchDirectory(const ScratchDirectory&) = delete;
    ScratchDirectory& operator=(const ScratchDirectory&) = delete;

    const std::filesystem::path& path() const { return path_; }
    std::string Write(const std::string& name, const std::string& bytes) const;

private:
    std::filesystem::path path_;
};

class FrameFixture : public ::testing::Test {
protected:
    void TearDown() override;

    // Writes harbor.ini (library directory, memory files, then extra lines) and the
    // simulator's scenario, then constructs the dialog; Create() is left to the test unless
    // create is set. fileArgument is the command line's file, "" for none.
    void Construct(const std::string& extraSettings, const std::string& fileArgument = "",
                   const std::string& libraryDirectory = SimulatorDirectory());
    void Start(const std::string& extraSettings, const std::string& fileArgument = "",
               const std::string& libraryDirectory = SimulatorDirectory());
    void Stop();
    // The simulator's scenario for the next Construct (default: kFastScenario).
    void SetScenario(const std::string& scenario) { scenario_ = scenario; }

    ui::TestClientDialog& dialog() { return *dialog_; }
    ui::HeadlessHost& host() { return *host_; }
    ui::WindowHandle window() { return dialog_->handle(); }
    ScratchDirectory& scratch() { return scratch_; }
    std::vector<ui::HeadlessEvent> EventsOf(ui::HeadlessEvent::Kind kind) const;
    void ClearEvents() { events_.clear(); }

private:
    ScratchDirectory scratch_;
    std::unique_ptr<ui::HeadlessHost> host_;
    std::unique_ptr<ui::TestClientDialog> dialog_;
    std::vector<ui::HeadlessEvent> events_;
    std::string scenario_;
};

// The simulator's default towers with no transmission time.
inline constexpr const char* kFastScenario =
    "link-time = 0\n[brick onyx2]\ntype = onyx2\n[port KIVOTOWER1]\nlong-range = yes\n"
    "[port COM1]\n";

} // namespace headless_test
