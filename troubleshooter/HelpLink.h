// The connection of one Trouble Shooter run to its help: a hidden window of class
// "trbl_wnd" that receives the help file's commands, the outcome -> topic table, and the
// help-open flag. Lives on the stack of the dialog operation that runs the Trouble Shooter.
#pragma once

#include <cstdint>
#include <memory>

#include "troubleshooter/OutcomeView.h"
#include "ui/Window.h"

class HelpViewer;
class TroubleShooter;

class HelpLink final : public OutcomeView {
public:
    static constexpr const char* kWindowClass = "trbl_wnd";
    static constexpr const char* kHelpFile = "shooter.hlp";
    // The macro that shows a topic, filled with its id.
    static constexpr const char* kJumpMacro = "JI(\"shooter.hlp\",\"%s\")";
    static constexpr int kMacroSize = 256;

    // WinHelp commands and what each call of the viewer stands for.
    static constexpr unsigned kHelpQuit = 2;
    static constexpr unsigned kHelpForceFile = 9;
    static constexpr unsigned kHelpCommand = 0x102;

    // Help command ids sent by the help file.
    enum Command : int {
        CmdClose = 2000,
        CmdFindTower = 2001,
        CmdTestTower = 2002,
        CmdTestBrick = 2003,
        CmdTestComPort = 2004,
        CmdSetRange = 2006,
        CmdFindComPort = 2007,
        CmdFindUsbTower = 2008,
        CmdSetPortType = 3001,
    };

    // Topics opened after a successful help command.
    static constexpr const char* kFoundTower = "Found_working_IR_Transmitter";
    static constexpr const char* kTowerOk = "IR_Transmitter_ok";
    static constexpr const char* kBrickOk = "Onyx_ok";
    static constexpr const char* kRangeSet = "IR_Transmitter_range_set_ok";
    static constexpr const char* kFoundComPort = "Found_working_COM_port";

    // Creates the hidden window. viewer may be null: the help then never opens.
    HelpLink(TroubleShooter* shooter, ui::WindowHost& host, HelpViewer* viewer);
    // Closes a help that is still open, so that its links do not reach a window that is
    // gone, then destroys the window.
    ~HelpLink() override;

    HelpLink(const HelpLink&) = delete;
    HelpLink& operator=(const HelpLink&) = delete;

    // Opens the help file when it is not open yet, then shows the outcome's topic; false
    // when the outcome has none.
    bool ShowOutcome(int outcome) override;
    // One message of the thread; a quit request closes the help, so that the run ends and
    // the outer loop can end too. Returns the help-open flag.
    bool PumpMessage() override;
    bool HelpOpen() const override { return helpOpen_; }

    // Every command message of the window: runs the command's test and shows the topic of
    // its result. Always handled, with result 0.
    ui::LResult HandleHelpCommand(int id, ui::LParam argument);

    // The topic of an outcome number; null when it has none.
    static const char* TopicOf(int outcome);

    ui::WindowHandle window() const;

private:
    class HelpWindow;

    // Calls the viewer for a WinHelp command; the viewer's answer, 0 without a viewer.
    int WinHelp(unsigned command, const char* data);
    // Shows a topic with the jump macro; the viewer's answer.
    int ShowTopic(const char* topic);
    void CloseHelp();

    TroubleShooter* shooter_;
    std::unique_ptr<HelpWindow> window_;
    bool helpOpen_ = false;
    ui::WindowHost& host_;
    HelpViewer* viewer_;
};
