// The help viewer of the headless host: it prints each topic it is asked to show, and the
// host hands it the help commands given as input lines ("help 2004 3"), which it sends to
// the Trouble Shooter's window as the help file's links would. At the end of the input the
// viewer closes, which counts as the help file's close command.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "troubleshooter/HelpDocument.h"
#include "troubleshooter/HelpViewer.h"

class HeadlessHelpViewer final : public HelpViewer {
public:
    // Receives each printed line, without line end.
    using Printer = std::function<void(const std::string& line)>;

    // helpDirectory: where a file name without directory is looked for, with a trailing
    // "/" ("" for the current directory).
    HeadlessHelpViewer(ui::WindowHost& host, Printer print, std::string helpDirectory);

    int OpenFile(ui::WindowHandle owner, const char* file) override;
    int RunMacro(ui::WindowHandle owner, const char* file, const char* macro) override;
    int Quit(ui::WindowHandle owner, const char* file) override;

    // A help command as a link of the shown topic would send it; false when no help is
    // open (the command goes nowhere).
    bool Command(int id, std::int32_t argument);
    // Follows a plain link to another topic of the open file; false for an unknown topic.
    bool ShowTopic(const std::string& id);
    // The input has ended: the viewer closes as a person would close its window.
    void InputEnded();

    bool IsOpen() const { return open_; }
    const std::string& currentTopic() const { return currentTopic_; }
    ui::WindowHandle owner() const { return owner_; }

    static constexpr int kCloseCommand = 2000;

private:
    void Print(const std::string& line) const;

    ui::WindowHost& host_;
    Printer print_;
    std::string helpDirectory_;
    HelpDocument document_;
    bool open_ = false;
    // Closing was sent to the client; further closes send nothing.
    bool closeSent_ = false;
    ui::WindowHandle owner_ = ui::kNoWindow;
    std::string currentTopic_;
};
