// Download Firmware and its closing steps.
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnDownloadFirmware()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::FinishFirmwareDownload()
{
    // TODO: not written yet; shows nothing.
    firmwarePending_ = false;
}

} // namespace ui
