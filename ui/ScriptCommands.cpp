// Script commands: Validate, Execute, Execute Async, Download, Download File, Receive, and
// the reports that the library's callbacks post.
#include "ui/TestClientDialog.h"

#include "session/BrickSession.h"

namespace ui {

void TestClientDialog::OnValidate()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnExecute()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnExecuteAsync()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnDownload()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnDownloadFile()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnReceive()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnDownloadProgress(std::int32_t status, std::int32_t count)
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnExecResult(std::int32_t status, ReaderWriter* result)
{
    // TODO: not written yet; shows nothing. The posted file is ours to release.
    BrickSession::ReleaseReaderWriter(&result);
}

void TestClientDialog::OnBrickMessage(std::int32_t status, std::int32_t number)
{
    // TODO: not written yet; shows nothing.
}

} // namespace ui
