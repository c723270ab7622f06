// The help viewer, in place of WinHelp: it opens the help file, shows a topic when asked with
// the jump macro, and closes. Each call answers as WinHelp does: exactly 1 is success.
//
// While a file is open, the viewer sends the help file's commands back as command messages
// (ui::kMsgCommand, wParam = the command id, lParam = its argument) to the owner window of
// the calls, the hidden "trbl_wnd" window of the run's HelpLink; closing the viewer sends
// command 2000. The Qt host implements it with a viewer window; HeadlessHelpViewer prints.
//
// One viewer serves every run, and a run may start while another waits for its help (the
// dialog stays usable meanwhile). Opening for a new owner therefore takes the viewer over:
// the old owner is sent 2000, so that its run ends once the new one has, and a later Quit
// or macro of the old owner changes nothing.
#pragma once

#include "ui/Window.h"

class HelpViewer {
public:
    virtual ~HelpViewer() = default;

    // HELP_FORCEFILE: opens file (a name without directory is looked for beside the
    // program). A missing or unreadable file fails.
    virtual int OpenFile(ui::WindowHandle owner, const char* file) = 0;
    // HELP_COMMAND: runs a help macro; the one the client sends is
    // JI("shooter.hlp","<topic id>"), which shows that topic.
    virtual int RunMacro(ui::WindowHandle owner, const char* file, const char* macro) = 0;
    // HELP_QUIT: closes the viewer; it sends nothing afterwards.
    virtual int Quit(ui::WindowHandle owner, const char* file) = 0;
};
