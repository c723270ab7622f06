// Drives the dialog from a script of commands, one per line, named as the buttons and menu
// items a person would use ("Open", "Test", "Download", "Save As", ...). docs/headless.md
// lists them. Everything the person would see is printed as one line per event.
//
// A command fails when the dialog shows a failure in its status box (ShowFailure,
// ShowError) or asks whether to use the Trouble Shooter, while the command runs or until
// the download or execution it started has reported back. The run's exit status is 0 when
// every command succeeded, 1 when one failed, 2 for an unknown command or a bad argument,
// which also ends the run.
#pragma once

#include <cstdint>
#include <iosfwd>
#include <memory>
#include <string>

#include "ui/headless/HeadlessHost.h"

class HeadlessHelpViewer;

namespace ui {

class TestClientDialog;

struct HeadlessOptions {
    bool defaultAnswer = false; // how questions are answered that no command decides
    int waitTimeoutMs = 30000;  // how long to wait for a download or execution to report
    bool fixedTicks = false;    // elapsed times read 0, for repeatable transcripts
    bool echo = true;           // print each command as "> command"
    // Where the Trouble Shooter's help file is looked for, with a trailing "/"; "" for the
    // current directory.
    std::string helpDirectory;
};

enum HeadlessStatus : int { HeadlessOk = 0, HeadlessFailed = 1, HeadlessBadCommand = 2 };

class HeadlessRunner {
public:
    // The dialog must be constructed on host but not yet created: Run creates it, so that
    // what its initialisation shows is printed too.
    HeadlessRunner(HeadlessHost& host, TestClientDialog& dialog, std::istream& in,
                   std::ostream& out, std::ostream& err, const HeadlessOptions& options);
    ~HeadlessRunner();

    HeadlessRunner(const HeadlessRunner&) = delete;
    HeadlessRunner& operator=(const HeadlessRunner&) = delete;

    // Creates the window, runs the commands, closes the window at the end of the input
    // and returns the exit status.
    int Run();

    int commandsRun() const { return commandsRun_; }
    int commandsFailed() const { return commandsFailed_; }

    // Text with line feeds, carriage returns and tabs written as "\n", "\r", "\t", other
    // control characters as "\xNN", as the transcript shows it. Backslashes stand as they
    // are, so device names and Windows paths read naturally.
    static std::string Escape(const std::string& text);
    // The reverse for arguments: "\n", "\r", "\t" become the characters; any other
    // backslash stands for itself.
    static std::string Unescape(const std::string& text);

private:
    bool idle();
    void print(const std::string& line);
    void onEvent(const HeadlessEvent& event);
    void judgeCommand();
    // Runs one line; false when the run must stop (status 2 set).
    bool execute(const std::string& line);
    bool badCommand(const std::string& message);
    void waitForOperations(int timeoutMs);
    bool click(int id, const std::string& name);
    void finish();

    HeadlessHost& host_;
    TestClientDialog& dialog_;
    std::istream& in_;
    std::ostream& out_;
    std::ostream& err_;
    HeadlessOptions options_;

    int lineNumber_ = 0;
    bool commandOpen_ = false;   // a command ran and has not been judged yet
    bool commandFailed_ = false; // set by a Trouble Shooter question or a refused command
    int commandsRun_ = 0;
    int commandsFailed_ = 0;
    int status_ = HeadlessOk;
    bool inputEnded_ = false;
    bool helpCloseSent_ = false;
    bool exitSent_ = false;
    // Operations in flight that a timed-out wait gave up on.
    int abandoned_ = 0;
    // Shows the Trouble Shooter's help topics as lines and carries the Help commands.
    std::unique_ptr<HeadlessHelpViewer> helpViewer_;
};

} // namespace ui
