// Download Firmware and its closing steps.
//
// The brick is put into boot mode, the firmware image is downloaded through the same
// asynchronous path as programs, and when the last block has arrived the brick is checked,
// the new firmware started and the brick detected again. Firmware always travels as brick
// type 6.
#include <cstdio>

#include "session/BrickSession.h"
#include "ui/TestClientDialog.h"

namespace ui {

namespace {

constexpr const char* kEnterBootMode = "boot rom";
constexpr const char* kBrickAlive = "brick alive?";
constexpr const char* kStartFirmware = "boot firmware";

} // namespace

void TestClientDialog::OnDownloadFirmware()
{
    if (brickHandle_ == 0) {
        ShowFailure("Port not open");
        return;
    }
    ClearStatus();
    if (RunCommand(kEnterBootMode, tessel::BrickOnyx2) < 0) {
        ShowFailure("Failed to enter boot mode");
        return;
    }
    // Refreshed from the edit each time; the directory setting is joined as written, with no
    // separator added, so both halves need room of their own.
    firmwareFile_[0] = '\0';
    host_.GetControlText(handle(), IdFirmwareFileName, firmwareFile_, kPathSize);
    firmwareFile_[kPathSize - 1] = '\0';
    char path[2 * kPathSize];
    std::snprintf(path, sizeof path, "%s%s", firmwareDir_, firmwareFile_);

    ReaderWriter* object = nullptr;
    const tessel::Long code = session_ != nullptr ? session_->CompileFirmware(path, &object)
                                                  : static_cast<tessel::Long>(tessel::kLinkFailed);
    if (code < 0) {
        BrickSession::ReleaseReaderWriter(&object);
        ShowError(code, nullptr);
        OfferTroubleShooter(code);
        FocusEditor();
        return;
    }
    if (RunCommand(kBrickAlive, tessel::BrickOnyx2) < 0) {
        ShowFailure("No brick");
        BrickSession::ReleaseReaderWriter(&object);
        return;
    }
    downloadStart_ = host_.TickCount();
    const bool started = DownloadObject(object);
    BrickSession::ReleaseReaderWriter(&object);
    // Progress reports arrive as posted messages, handled after this returns, so the flag is
    // in place before the final report can be seen.
    if (started)
        firmwarePending_ = true;
    FocusEditor();
}

void TestClientDialog::FinishFirmwareDownload()
{
    firmwarePending_ = false;
    // The elapsed time ends here: the closing commands below are not part of the download.
    const std::uint32_t finished = host_.TickCount();
    if (RunCommand(kBrickAlive, tessel::BrickOnyx2) < 0) {
        ShowFailure("No brick");
        return;
    }
    if (RunCommand(kStartFirmware, tessel::BrickOnyx2) < 0) {
        ShowFailure("Failed to unlock firmware");
        return;
    }
    ShowStatusF("Downloaded firmware ok (%d ms)", static_cast<int>(finished - downloadStart_));
    // Selects the detected model in the Brick list and sets the brick type property; the
    // name is not shown.
    char name[kBrickNameSize];
    DetectBrick(name);
}

} // namespace ui
