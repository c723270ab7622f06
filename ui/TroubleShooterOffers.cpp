// The dialog's ways into the Trouble Shooter: the two offers and the quiet repair.
#include <cstdio>

#include "errors/ErrorText.h"
#include "troubleshooter/HelpLink.h"
#include "troubleshooter/SessionBrickCalls.h"
#include "troubleshooter/TroubleShooter.h"
#include "ui/TestClientDialog.h"

namespace ui {

namespace {

constexpr const char* kOfferCaption = "Diagnostics";
// An error text of up to 255 characters and the question's words.
constexpr int kQuestionSize = 320;

// What a run borrows from the dialog.
struct RunContext {
    WindowHost& host;
    // Null when the host gives none: the help then cannot open, and the run ends right
    // after the diagnosis, which the log still holds.
    HelpViewer* viewer;
    BrickSession* const* session;
    tessel::Long* brickHandle;
    const char* logFile;
};

// Runs the Trouble Shooter on value after a Yes: log, diagnosis, help session. True when a
// help topic was shown.
bool RunTroubleShooter(const RunContext& run, std::int32_t value)
{
    SessionBrickCalls calls(run.session);
    TroubleShooter shooter(&calls, run.brickHandle, run.logFile);
    bool shown = false;
    {
        // The link's window goes before the log closes: a help command arriving later is
        // lost rather than run against a finished run.
        HelpLink link(&shooter, run.host, run.viewer);
        shown = shooter.Diagnose(value, &link);
    }
    shooter.CloseLog();
    return shown;
}

} // namespace

bool TestClientDialog::OfferTroubleShooter(std::int32_t value)
{
    char question[kQuestionSize];
    std::snprintf(question, sizeof question, "%s.\r\nUse Trouble Shooter?",
                  GetErrorText(value, nullptr));
    if (!host_.AskYesNo(handle(), question, kOfferCaption)) {
        return false;
    }
    return RunTroubleShooter({host_, helpViewer_, &session_, &brickHandle_, logFile_}, value);
}

bool TestClientDialog::OfferTroubleShooterForStatus(std::int32_t status, const char* statusText)
{
    char question[kQuestionSize];
    std::snprintf(question, sizeof question, "Status: %s.\r\nUse Trouble Shooter?",
                  statusText != nullptr ? statusText : "");
    if (!host_.AskYesNo(handle(), question, kOfferCaption)) {
        return false;
    }
    return RunTroubleShooter({host_, helpViewer_, &session_, &brickHandle_, logFile_},
                             StatusToError(status));
}

bool TestClientDialog::QuietRepair(std::int32_t status)
{
    SessionBrickCalls calls(&session_);
    TroubleShooter shooter(&calls, &brickHandle_, nullptr);
    const bool repaired = shooter.RepairUsbTower(portType_);
    shooter.CloseLog();
    return repaired;
}

} // namespace ui
