// The dialog on the headless host against the simulated library, as a test fixture.
//
// Each test writes a scenario for the simulator and a settings file into a directory of its
// own, constructs the dialog with a command line whose program path lies in that directory
// (so the settings file is found beside it), and drives it as a user would: clicking controls,
// typing into edits, answering questions. Everything the user would see arrives as events.
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

// Scenario lines every test starts from: no simulated transmission time.
inline constexpr const char* kFastLink = "link-time = 0\n";

// A program object with count sound commands in task 0, as the library's translation would
// write it; downloaded as BIN source it is used without translation.
std::string SoundProgram(int count, int brickType = 6);

class DialogFixture : public ::testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;

    // Writes the scenario and the settings (the [PORTS] lines and the [OPTIONS] lines are
    // given; the library's directory and memory files are always set), then constructs and
    // creates the dialog. fileArgument is the command line's file, "" for none.
    void Start(const std::string& scenario, const std::string& ports = "",
               const std::string& options = "", const std::string& fileArgument = "");
    // Destroys the dialog (and with it the session); the library is terminated. With settle,
    // reports on their way are handled first, as the running program would.
    void Stop(bool settle = true);

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
    void SetChecked(int id, bool checked) { host_->SetCheck(window(), id, checked); }

    // Handles posted reports until no download or execution is in flight and nothing is
    // queued. Fails the test when a report does not arrive within a generous bound (a hang).
    void Settle();
    // Handles posted reports until count status texts satisfy accept, or fails as above.
    void WaitForStatuses(std::size_t count, bool (*accept)(const std::string&));

    // Status box texts shown since the last ClearEvents, in order.
    std::vector<std::string> Statuses() const;
    std::string LastStatus() const;
    std::vector<ui::HeadlessEvent> EventsOf(ui::HeadlessEvent::Kind kind) const;
    // Questions of the Trouble Shooter offers ("Diagnostics").
    std::vector<std::string> Offers() const;
    void ClearEvents() { events_.clear(); }
    // Also called with every event, after it is recorded; null removes it.
    void OnEvent(std::function<void(const ui::HeadlessEvent&)> extra) { extra_ = std::move(extra); }

    std::string WriteFile(const std::string& name, const std::string& bytes);
    static std::string ReadFile(const std::filesystem::path& path);

    // Property value read through the dialog's own session.
    std::int16_t Property(std::int16_t property);

private:
    // Handles posted reports until done; fails with hang when none arrives in a long while.
    void Pump(const std::function<bool()>& done, const char* hang);

    std::filesystem::path dir_;
    std::unique_ptr<ui::HeadlessHost> host_;
    std::unique_ptr<ui::TestClientDialog> dialog_;
    std::vector<ui::HeadlessEvent> events_;
    std::function<void(const ui::HeadlessEvent&)> extra_;
};

} // namespace commands_test
