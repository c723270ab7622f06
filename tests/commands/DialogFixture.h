// The dialog on the headless host, built from a simulator scenario and a settings file of the
// test's own: the command line's program path lies in a scratch directory, so the settings file
// beside it is the test's. Everything the user would see arrives as events. Shared by the
// command, headless and tool tests.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"

namespace commands_test {

std::string SimulatorDirectory();
std::string RecordingLibraryDirectory();

inline constexpr const char* kFastLink = "link-time = 0\n";
// The simulator's default towers with no transmission time.
inline constexpr const char* kFastScenario =
    "link-time = 0\n[brick onyx2]\ntype = onyx2\n[port KIVOTOWER1]\nlong-range = yes\n"
    "[port COM1]\n";

// A program object with count sound commands in task 0, as the library's translation writes
// it; downloaded as BIN source it is used without translation.
std::string SoundProgram(int count);

class DialogFixture : public ::testing::Test {
protected:
    DialogFixture();
    ~DialogFixture() override;
    void TearDown() override;

    // Writes harbor.ini (library directory and memory files added to settings) and the
    // scenario, then constructs the dialog; Open creates it too. fileArgument is the command
    // line's file, "" for none.
    void Construct(const std::string& settings, const std::string& fileArgument = "",
                   const std::string& library = SimulatorDirectory());
    void Open(const std::string& settings, const std::string& fileArgument = "",
              const std::string& library = SimulatorDirectory());
    // Opens the dialog on the simulator with this scenario, [PORTS] and [OPTIONS] lines.
    void Start(const std::string& scenario, const std::string& ports = "",
               const std::string& options = "", const std::string& fileArgument = "")
    {
        scenario_ = scenario;
        Open("[PORTS]\n" + ports + "\n[OPTIONS]\n" + options + "\n", fileArgument);
    }
    // Starts with the serial tower COM1 opened, the brick's and port's lines added.
    void StartOnCom1(const std::string& brickLines = "", const std::string& portLines = "",
                     const std::string& options = "");
    // Closes the window as File/Exit does; with settle, reports on their way are handled first.
    void Stop(bool settle = true);
    void SetScenario(const std::string& scenario) { scenario_ = scenario; }

    ui::TestClientDialog& dialog() { return *dialog_; }
    ui::HeadlessHost& host() { return *host_; }
    ui::WindowHandle window() { return dialog_->handle(); }
    const std::filesystem::path& dir() const { return dir_; }

    // A click as the user makes it; fails the test when the control is disabled.
    void Click(int id)
    {
        ASSERT_TRUE(host_->Click(window(), id)) << "control " << id << " is disabled";
    }
    void SetText(int id, const std::string& text)
    {
        host_->SetControlText(window(), id, text.c_str());
    }
    std::string Text(int id) { return host_->ControlText(window(), id); }
    void SelectSource(int index) { host_->ListSelect(window(), ui::IdSourceList, index); }
    void SelectBrick(int index) { host_->ListSelect(window(), ui::IdBrickList, index); }

    // Handles posted reports until done; fails when none arrives for long (a hang).
    void PumpUntil(const std::function<bool()>& done);
    // Handles posted reports until nothing is in flight or queued.
    void Settle();

    std::vector<ui::HeadlessEvent> EventsOf(ui::HeadlessEvent::Kind kind) const;
    std::vector<std::string> Statuses() const;
    std::string LastStatus() const;
    // Texts of the questions with this caption; Offers are the Trouble Shooter's.
    std::vector<std::string> Questions(const std::string& caption) const;
    std::vector<std::string> Offers() const { return Questions("Diagnostics"); }
    void ClearEvents() { events_.clear(); }
    // Also called with every event, after it is recorded; null removes it.
    void OnEvent(std::function<void(const ui::HeadlessEvent&)> extra) { extra_ = std::move(extra); }

    std::string WriteFile(const std::string& name, const std::string& bytes) const;
    static std::string ReadFile(const std::filesystem::path& path);
    // Property value read through the dialog's own session.
    std::int16_t Property(std::int16_t property);

    // Recording-library tests leave operations that never report; they cannot settle.
    bool settleOnTearDown_ = true;

private:
    std::filesystem::path dir_;
    std::unique_ptr<ui::HeadlessHost> host_;
    std::unique_ptr<ui::TestClientDialog> dialog_;
    std::vector<ui::HeadlessEvent> events_;
    std::function<void(const ui::HeadlessEvent&)> extra_;
    std::string scenario_ = kFastScenario;
};

} // namespace commands_test
