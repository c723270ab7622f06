// Script commands: Validate, Execute, Execute Async, Download, Download File, Receive, and
// the reports that the library's callbacks post.
#include "ui/TestClientDialog.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>

#include "errors/ErrorSink.h"
#include "errors/ErrorText.h"
#include "session/BrickSession.h"

namespace ui {

namespace {

const tessel::Long kNoLibrary = static_cast<tessel::Long>(tessel::kLinkFailed);

constexpr const char* kClearCommand = "clear tasks clear subs";
constexpr const char* kStartCommand = "start main";

} // namespace

bool TestClientDialog::PortReady()
{
    if (brickHandle_ == 0 || session_ == nullptr) {
        ShowFailure("Port not open");
        return false;
    }
    return true;
}

bool TestClientDialog::PortAndLibraryReady()
{
    if (brickHandle_ == 0) {
        ShowFailure("Port not open");
        return false;
    }
    if (session_ == nullptr) {
        ShowError(static_cast<std::int32_t>(tessel::kLinkFailed), nullptr);
        return false;
    }
    return true;
}

bool TestClientDialog::AutoClear(tessel::Short brickType)
{
    if (!host_.IsChecked(handle(), IdAutoClear))
        return true;
    const tessel::Long cleared = RunCommand(kClearCommand, brickType);
    if (cleared < 0) {
        ShowError(cleared, nullptr);
        OfferTroubleShooter(cleared);
        return false;
    }
    return true;
}

ReaderWriter* TestClientDialog::TranslateEditorForRun(bool offerTroubleShooter)
{
    if (!PortReady())
        return nullptr;
    ClearStatus();
    const tessel::Short brickType = SelectedBrickType();
    const std::unique_ptr<char[]> text = ReadEditorText();
    if (!text || text[0] == '\0')
        return nullptr;
    const std::int32_t sourceType = SelectedSourceType();

    ErrorSink sink;
    ReaderWriter* object = nullptr;
    const tessel::Long code = session_->TranslateText(brickType, sourceType, text.get(), &object,
                                                      &sink, nullptr, nullptr);
    if (code < 0) {
        BrickSession::ReleaseReaderWriter(&object);
        PlaceEditorCaret(sink.GetPosition());
        ShowError(code, &sink);
        if (offerTroubleShooter)
            OfferTroubleShooter(code);
        FocusEditor();
        return nullptr;
    }
    if (BrickSession::ContentSize(object) == 0) {
        BrickSession::ReleaseReaderWriter(&object);
        ShowFailure("No code");
        return nullptr;
    }
    return object;
}

void TestClientDialog::OnValidate()
{
    if (host_.ListSelection(handle(), IdSourceList) == SourceListOpal) {
        ShowFailure("Cannot validate Opal source (yet?)");
        return;
    }
    ClearStatus();
    const std::unique_ptr<char[]> text = ReadEditorText();
    if (!text || text[0] == '\0')
        return;

    // Whatever the Source list shows, validation checks the text as a script.
    ErrorSink sink;
    const tessel::Long code =
        session_ != nullptr ? session_->TranslateText(SelectedBrickType(), tessel::FileScript,
                                                      text.get(), nullptr, &sink, nullptr, nullptr)
                            : kNoLibrary;
    if (code >= 0) {
        ShowStatus("OK");
    } else {
        PlaceEditorCaret(sink.GetPosition());
        ShowError(code, &sink);
    }
    FocusEditor();
}

void TestClientDialog::OnExecute()
{
    ReaderWriter* object = TranslateEditorForRun(true);
    if (object == nullptr)
        return;

    tessel::Long result = 0;
    ReaderWriter* resultFile = nullptr;
    const tessel::Long code =
        session_->ExecCode(brickHandle_, object, &result, &resultFile, nullptr, nullptr);
    BrickSession::ReleaseReaderWriter(&object);

    // Both files go back before the offer: a Trouble Shooter run pumps messages, and the
    // window (with the session) may be gone by the time it returns.
    if (code >= 0) {
        const std::unique_ptr<char[]> output = ReadFileText(resultFile);
        BrickSession::ReleaseReaderWriter(&resultFile);
        if (output)
            ShowStatusF("Exec result: %d (%s)", static_cast<int>(result), output.get());
        else
            ShowStatus("Exec ok");
    } else {
        BrickSession::ReleaseReaderWriter(&resultFile);
        ShowError(code, nullptr);
        OfferTroubleShooter(code);
    }
    FocusEditor();
}

void TestClientDialog::OnExecuteAsync()
{
    ReaderWriter* object = TranslateEditorForRun(false);
    if (object == nullptr)
        return;

    // The result arrives as WM_USER+3. A call refused outright never reports back, so its
    // refusal is shown here; otherwise the user would be left with an empty status box.
    const tessel::Long code = StartAsyncExec(object);
    BrickSession::ReleaseReaderWriter(&object);
    if (code < 0)
        ShowError(code, nullptr);
    FocusEditor();
}

void TestClientDialog::OnDownload()
{
    if (!PortReady())
        return;
    ClearStatus();
    const std::unique_ptr<char[]> text = ReadEditorText();
    if (!text || text[0] == '\0')
        return;
    const std::int32_t sourceType = SelectedSourceType();
    const tessel::Short brickType = SelectedBrickType();

    // A download the user starts ends a stress test that stalled: its completion must not
    // start the next stress iteration.
    stressIteration_ = 0;

    if (!AutoClear(brickType))
        return;

    ErrorSink sink;
    ReaderWriter* object = nullptr;
    const tessel::Long code = session_->TranslateText(brickType, sourceType, text.get(), &object,
                                                      &sink, nullptr, nullptr);
    if (code >= 0) {
        DownloadObject(object);
        BrickSession::ReleaseReaderWriter(&object);
    } else {
        BrickSession::ReleaseReaderWriter(&object);
        PlaceEditorCaret(sink.GetPosition());
        ShowError(code, &sink);
        OfferTroubleShooter(code);
    }
    FocusEditor();
}

void TestClientDialog::OnDownloadFile()
{
    if (!PortReady())
        return;
    char fileName[kPathSize] = {};
    host_.GetControlText(handle(), IdDownloadFileName, fileName, sizeof fileName);
    const tessel::Short brickType = SelectedBrickType();

    stressIteration_ = 0;

    if (!AutoClear(brickType))
        return;

    // A file is either a script or assembler source; no selection counts as Script.
    const int selected = host_.ListSelection(handle(), IdSourceList);
    const std::int32_t sourceType =
        selected == SourceListScript || selected < 0 ? tessel::FileScript : tessel::FileOpal;

    ErrorSink sink;
    ReaderWriter* object = nullptr;
    const tessel::Long code =
        session_->CompileFile(brickType, sourceType, fileName, &object, &sink, nullptr, nullptr);
    if (code >= 0) {
        DownloadObject(object);
        BrickSession::ReleaseReaderWriter(&object);
    } else {
        // The error lies in the file, not in the editor: the caret stays where it is.
        BrickSession::ReleaseReaderWriter(&object);
        ShowError(code, &sink);
        OfferTroubleShooter(code);
    }
    FocusEditor();
}

void TestClientDialog::OnReceive()
{
    if (brickHandle_ == 0 || session_ == nullptr) {
        // The box follows what is really switched on, not the click that was refused.
        host_.SetCheck(handle(), IdReceive, receiving_);
        ShowFailure("Port not open");
        return;
    }
    receiving_ = host_.IsChecked(handle(), IdReceive);
    if (receiving_)
        session_->Exec(brickHandle_, nullptr, nullptr, nullptr, ReceiveCallback, CallbackContext());
    else
        session_->Exec(brickHandle_, nullptr, nullptr, nullptr, nullptr, nullptr);
}

void TestClientDialog::OnDownloadProgress(std::int32_t status, std::int32_t count)
{
    if (status < 0) {
        // A failed firmware download has no closing steps: left set, the flag would make the
        // next ordinary download run them and report itself as firmware.
        firmwarePending_ = false;
        ShowError(status, nullptr);
        OfferTroubleShooter(status);
        return;
    }
    // A count at or beyond the total is the last report, as the routing takes it too: a
    // library that over-reports still ends the download with its closing steps.
    if (count < downloadTotal_) {
        // 64 bits, so that a large count cannot overflow; a total of 0 (a later download
        // found no code while this one ran) must not divide; a negative count shows 0.
        const std::int64_t percent =
            downloadTotal_ > 0
                ? std::max<std::int64_t>(0, std::int64_t{count} * 100 / downloadTotal_)
                : 0;
        ShowStatusF("Downloading: %d%% done", static_cast<int>(percent));
        return;
    }
    if (firmwarePending_) {
        FinishFirmwareDownload();
        return;
    }
    const std::uint32_t elapsed = host_.TickCount() - downloadStart_;
    ShowStatusF("Downloaded ok (%d mS)", static_cast<int>(elapsed));
    if (host_.IsChecked(handle(), IdAutoRun))
        RunCommand(kStartCommand, tessel::BrickOnyx2);
    if (stressIteration_ > 0)
        host_.PostMessage(handle(), kMsgStressNext, 0, 0);
}

void TestClientDialog::OnExecResult(std::int32_t status, ReaderWriter* result)
{
    // The posted file is ours on every path; it goes back before a Trouble Shooter run
    // pumps messages.
    if (status < 0) {
        BrickSession::ReleaseReaderWriter(&result);
        ShowError(status, nullptr);
        OfferTroubleShooter(status);
        return;
    }
    const std::unique_ptr<char[]> text = ReadFileText(result);
    BrickSession::ReleaseReaderWriter(&result);
    if (text)
        ShowStatusF("Exec result: %s", text.get());
    else
        ShowStatus("Exec ok");
}

void TestClientDialog::OnBrickMessage(std::int32_t status, std::int32_t number)
{
    if (status >= 0) {
        ShowStatusF("Received PBMessage: %d", static_cast<int>(number));
        host_.Beep();
    } else {
        ShowFailureF("Received bad PBMessage, error: 0x%x", static_cast<unsigned>(status));
    }
}

} // namespace ui
