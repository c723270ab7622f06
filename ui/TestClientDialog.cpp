// The dialog frame: settings, the layout of dialog 101 and menu 202, initialisation and
// teardown, the message routing and the helpers every command group shares.
#include "ui/TestClientDialog.h"

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <new>
#include <system_error>

#include "app/CommandLine.h"
#include "app/Settings.h"
#include "errors/ErrorText.h"
#include "session/BrickSession.h"
#include "tessel/ReaderWriter.h"

namespace ui {

namespace {

// The controls of dialog 101, in tab order. Geometry in dialog units of a 372 by 289 frame.
constexpr ControlSpec kControls[] = {
    {IdEditor, ControlKind::MultiEdit, "", StyleHScroll | StyleVScroll, 7, 7, 262, 150},

    {kNoControlId, ControlKind::Label, "Brick:", StyleNone, 277, 9, 28, 8},
    {IdBrickList, ControlKind::DropList, "", StyleNone, 307, 7, 58, 60},
    {kNoControlId, ControlKind::Label, "Source:", StyleNone, 277, 26, 28, 8},
    {IdSourceList, ControlKind::DropList, "", StyleNone, 307, 24, 58, 60},

    {kNoControlId, ControlKind::GroupBox, "Download", StyleNone, 277, 42, 88, 36},
    {IdAutoClear, ControlKind::CheckBox, "Auto Clear", StyleNone, 283, 52, 76, 10},
    {IdAutoRun, ControlKind::CheckBox, "Auto Run", StyleNone, 283, 64, 76, 10},

    {kNoControlId, ControlKind::GroupBox, "Range", StyleNone, 277, 82, 88, 48},
    {IdRangeShort, ControlKind::RadioButton, "Short", StyleDisabled | StyleGroupStart, 283, 92, 76,
     10},
    {IdRangeMedium, ControlKind::RadioButton, "Medium", StyleDisabled, 283, 104, 76, 10},
    {IdRangeLong, ControlKind::RadioButton, "Long", StyleDisabled, 283, 116, 76, 10},

    {IdReceive, ControlKind::CheckBox, "Receive", StyleHidden, 283, 136, 76, 10},

    {IdOpenPort, ControlKind::PushButton, "Open", StyleNone, 7, 164, 50, 14},
    {IdClosePort, ControlKind::PushButton, "Close", StyleNone, 60, 164, 50, 14},
    {IdTest, ControlKind::PushButton, "Test", StyleNone, 113, 164, 50, 14},
    {IdStatistics, ControlKind::PushButton, "Statistics", StyleNone, 166, 164, 50, 14},
    {IdInfo, ControlKind::PushButton, "Info", StyleNone, 219, 164, 50, 14},

    {IdValidate, ControlKind::PushButton, "Validate", StyleNone, 7, 182, 50, 14},
    {IdExecute, ControlKind::PushButton, "Execute", StyleNone, 60, 182, 50, 14},
    {IdDownload, ControlKind::PushButton, "Download", StyleNone, 113, 182, 50, 14},
    {IdExecuteAsync, ControlKind::PushButton, "Async", StyleHidden, 166, 182, 50, 14},
    {IdUpload, ControlKind::PushButton, "Upload", StyleHidden, 219, 182, 50, 14},

    {IdDownloadFile, ControlKind::PushButton, "Download File", StyleNone, 7, 200, 50, 14},
    {IdDownloadFileName, ControlKind::Edit, "", StyleNone, 60, 200, 209, 14},
    {IdNewFirmware, ControlKind::PushButton, "New Firmware", StyleNone, 7, 218, 50, 14},
    {IdFirmwareFileName, ControlKind::Edit, "", StyleNone, 60, 218, 209, 14},

    {IdStress, ControlKind::PushButton, "Stress", StyleHidden, 277, 200, 40, 14},
    {IdStressCount, ControlKind::Edit, "", StyleHidden, 320, 200, 45, 14},

    {IdStatusBox, ControlKind::MultiEdit, "", StyleReadOnly | StyleVScroll, 7, 238, 358, 44},
};

constexpr MenuItemSpec kFileMenu[] = {
    {"&New", IdFileNew, false},   {"&Open...", IdFileOpen, false},
    {"&Save", IdFileSave, false}, {"Save &As...", IdFileSaveAs, false},
    {nullptr, 0, false},          {"E&xit", IdFileExit, false},
};
constexpr MenuItemSpec kPortMenu[] = {
    {"&Open", IdOpenPort, false},
    {"&Test", IdTest, false},
    {"&Statistics", IdStatistics, false},
    {"&Close", IdClosePort, false},
};
constexpr MenuItemSpec kScriptMenu[] = {
    {"&Validate", IdValidate, false},
    {"&Execute", IdExecute, false},
    {"Execute &Async", IdExecuteAsync, false},
    {"&Download", IdDownload, false},
};
constexpr MenuItemSpec kSpecialMenu[] = {
    {"&Info", IdInfo, false},
    {"&Upload", IdUpload, false},
    {"&Stress", IdStress, false},
    {"Download &Firmware", IdNewFirmware, false},
    // Greyed in the menu only: the command itself is routed like any other.
    {"&Convert to CSV", IdConvertToCsv, true},
    {"&Macro To CSV", IdMacroToCsv, false},
};
constexpr MenuItemSpec kHelpMenu[] = {
    {"About", IdAbout, false},
};

template <typename T, int N> constexpr int CountOf(const T (&)[N])
{
    return N;
}

constexpr MenuSpec kMenus[] = {
    {"&File", kFileMenu, CountOf(kFileMenu)},
    {"&Port", kPortMenu, CountOf(kPortMenu)},
    {"&Script", kScriptMenu, CountOf(kScriptMenu)},
    {"S&pecial", kSpecialMenu, CountOf(kSpecialMenu)},
    {"&Help", kHelpMenu, CountOf(kHelpMenu)},
};

constexpr DialogTemplate kTemplate = {
    kDialogTemplateId, kDialogCaption, "MS Sans Serif", 8, 372, 289, kControls, CountOf(kControls),
    kMenuId,           kMenus,         CountOf(kMenus),
};

// Status texts formatted from a port name and a brick name fit easily; longer ones are cut.
constexpr int kFormattedStatusSize = 1024;

// A script larger than this is not a script; the editor refuses it rather than the memory.
constexpr long kMaxScriptFileSize = 16L * 1024 * 1024;

// The text of a window title: caption, " - " and a 260-character file name.
constexpr int kTitleSize = 300;

void CopyText(char* target, std::uint32_t size, const char* text)
{
    // Cut to the buffer, terminator included.
    std::snprintf(target, size, "%s", text ? text : "");
}

} // namespace

const DialogTemplate& TestClientDialogTemplate()
{
    return kTemplate;
}

TestClientDialog::TestClientDialog(WindowHost& host, const char* commandLine) : host_(host)
{
    postTarget_.host = &host_;

    const app::CommandLineParts parts = app::SplitCommandLine(commandLine ? commandLine : "");
    SetCurrentFile(parts.currentFile.c_str());

    const app::DialogSettings settings = app::ReadDialogSettings(parts.settingsPath.c_str());
    CopyText(firmwareFile_, sizeof firmwareFile_, settings.firmwareFile);
    CopyText(firmwareDir_, sizeof firmwareDir_, settings.firmwareDir);
    CopyText(serialPort_, sizeof serialPort_, settings.serialPort);
    CopyText(usbPort_, sizeof usbPort_, settings.usbPort);
    autoRun_ = settings.autoRun;
    autoClear_ = settings.autoClear;
    autoDownload_ = settings.autoDownload;
    CopyText(logFile_, sizeof logFile_, settings.logFile);

    session_ = new (std::nothrow) BrickSession(parts.settingsPath.c_str());

    traceOptions_ = app::ReadTraceOptions(parts.settingsPath.c_str());
    if (session_ != nullptr)
        app::ApplyTraceOptions(*session_, traceOptions_);
}

TestClientDialog::~TestClientDialog()
{
    if (handle() != kNoWindow) {
        host_.DestroyWindow(handle());
    }
    // A window that was never made leaves the session to us.
    delete session_;
    session_ = nullptr;
}

bool TestClientDialog::Create()
{
    const WindowHandle window = host_.CreateDialogWindow(TestClientDialogTemplate(), this);
    if (window == kNoWindow)
        return false;
    host_.ShowWindow(window);
    return true;
}

bool TestClientDialog::OnMessage(Message message, WParam wParam, LParam lParam, LResult& result)
{
    result = 0;
    if (message == kMsgInitDialog) {
        OnInitDialog();
        return true;
    }
    if (message == kMsgDestroy) {
        OnDestroy();
        return true;
    }
    if (message >= kMsgUser && message <= kMsgUserLast) {
        OnCustomMessage(message, wParam, lParam);
        return true;
    }
    if (message == kMsgCommand) {
        // Routed by the id alone, whatever the notification code.
        return RouteCommand(CommandId(wParam));
    }
    return false;
}

void TestClientDialog::OnUndelivered(Message message, WParam wParam, LParam lParam)
{
    // A result file travels with its message; nobody else will release it.
    if (message == kMsgExecResult) {
        auto* file = reinterpret_cast<ReaderWriter*>(lParam);
        BrickSession::ReleaseReaderWriter(&file);
    }
}

bool TestClientDialog::RouteCommand(int id)
{
    switch (id) {
    case kIdCancel:
    case IdFileExit:
        OnExit();
        break;
    case IdFileNew:
        OnFileNew();
        break;
    case IdFileOpen:
        OnFileOpen();
        break;
    case IdFileSave:
        OnFileSave();
        break;
    case IdFileSaveAs:
        OnFileSaveAs();
        break;
    case IdAbout:
        OnAbout();
        break;
    case IdOpenPort:
        OnOpenPort();
        break;
    case IdClosePort:
        OnClosePort();
        break;
    case IdTest:
        OnTest();
        break;
    case IdStatistics:
        OnStatistics();
        break;
    case IdRangeShort:
        OnRange(tessel::RangeShort);
        break;
    case IdRangeMedium:
        OnRange(tessel::RangeMedium);
        break;
    case IdRangeLong:
        OnRange(tessel::RangeLong);
        break;
    case IdValidate:
        OnValidate();
        break;
    case IdExecute:
        OnExecute();
        break;
    case IdExecuteAsync:
        OnExecuteAsync();
        break;
    case IdDownload:
        OnDownload();
        break;
    case IdDownloadFile:
        OnDownloadFile();
        break;
    case IdReceive:
        OnReceive();
        break;
    case IdNewFirmware:
        OnDownloadFirmware();
        break;
    case IdInfo:
        OnInfo();
        break;
    case IdUpload:
        OnUpload();
        break;
    case IdStress:
        OnStress();
        break;
    case IdConvertToCsv:
        OnConvertToCsv();
        break;
    case IdMacroToCsv:
        OnMacroToCsv();
        break;
    default:
        return false;
    }
    return true;
}

void TestClientDialog::OnCustomMessage(Message message, WParam wParam, LParam lParam)
{
    // wParam carries a packed code: its low 32 bits are the signed value.
    const auto status = static_cast<std::int32_t>(static_cast<std::uint32_t>(wParam));
    switch (message) {
    case kMsgStressNext:
        ++stressIteration_;
        StressStep();
        break;
    case kMsgDownloadProgress: {
        const auto count = static_cast<std::int32_t>(lParam);
        // Decided before the handler runs: its closing steps may start new work.
        const bool finalReport = status < 0 || count >= downloadTotal_;
        OnDownloadProgress(status, count);
        if (finalReport && downloadsInFlight_ > 0)
            --downloadsInFlight_;
        break;
    }
    case kMsgExecResult:
        if (execsInFlight_ > 0)
            --execsInFlight_;
        OnExecResult(status, reinterpret_cast<ReaderWriter*>(lParam));
        break;
    case kMsgBrickMessage:
        OnBrickMessage(status, static_cast<std::int32_t>(lParam));
        break;
    default:
        // WM_USER+0 and +5 to +10 are accepted and ignored.
        break;
    }
}

void TestClientDialog::OnInitDialog()
{
    postTarget_.window = handle();
    const WindowHandle window = handle();

    host_.ListAdd(window, IdBrickList, "Rover");
    host_.ListAdd(window, IdBrickList, "Onyx2");
    host_.ListSelect(window, IdBrickList, BrickListOnyx2);

    host_.ListAdd(window, IdSourceList, "Script");
    host_.ListAdd(window, IdSourceList, "Opal");
    host_.ListAdd(window, IdSourceList, "RAW");
    host_.ListAdd(window, IdSourceList, "BIN");
    host_.ListSelect(window, IdSourceList, SourceListScript);

    host_.SetCheck(window, IdAutoClear, autoClear_);
    host_.SetCheck(window, IdAutoRun, autoRun_);
    host_.SetControlText(window, IdStressCount, "100");
    host_.SetControlText(window, IdFirmwareFileName, firmwareFile_);

    // Room for the device prefix on top of a whole 260-character port setting.
    char port[kPathSize + 4] = {};
    if (session_ != nullptr && usbPort_[0] != '\0') {
        std::snprintf(port, sizeof port, "%s%s", tessel::kPortPrefix, usbPort_);
        brickHandle_ = session_->Create(port);
    }
    if (session_ != nullptr && brickHandle_ == 0 && serialPort_[0] != '\0') {
        std::snprintf(port, sizeof port, "%s%s", tessel::kPortPrefix, serialPort_);
        brickHandle_ = session_->Create(port);
    }
    if (brickHandle_ != 0) {
        OnPortOpened(port);
    }

    if (currentFile_[0] != '\0') {
        if (LoadScriptFile(currentFile_)) {
            UpdateTitle();
            if (autoDownload_)
                OnDownload();
        } else {
            currentFile_[0] = '\0';
        }
    }
}

void TestClientDialog::OnDestroy()
{
    if (brickHandle_ != 0 && session_ != nullptr) {
        if (receiving_) {
            session_->Exec(brickHandle_, nullptr, nullptr, nullptr, nullptr, nullptr);
            receiving_ = false;
        }
        session_->Destroy(brickHandle_);
    }
    brickHandle_ = 0;
    // Terminates the library, whose threads then call back no more.
    delete session_;
    session_ = nullptr;
}

void TestClientDialog::OnExit()
{
    if (handle() != kNoWindow)
        host_.DestroyWindow(handle());
    host_.PostQuit(0);
}

std::unique_ptr<char[]> TestClientDialog::ReadEditorText()
{
    // Sized from the editor's length, so a large text takes one read; the loop still
    // catches a text that grew in between, since a full buffer means there may be more.
    std::uint32_t n = 1024;
    const std::uint32_t length = host_.GetControlTextLength(handle(), IdEditor);
    while (n < length + 2 && n < 0x40000000u)
        n *= 2;
    for (;;) {
        std::unique_ptr<char[]> text(new (std::nothrow) char[n + 1]);
        if (!text) {
            std::unique_ptr<char[]> empty(new char[1]);
            empty[0] = '\0';
            return empty;
        }
        const std::uint32_t got = host_.GetControlText(handle(), IdEditor, text.get(), n);
        text[got < n ? got : n] = '\0';
        if (got + 1 < n || n >= 0x40000000u)
            return text;
        n *= 2;
    }
}

tessel::Short TestClientDialog::SelectedBrickType()
{
    return host_.ListSelection(handle(), IdBrickList) == BrickListRover ? tessel::BrickRover
                                                                        : tessel::BrickOnyx2;
}

std::int32_t TestClientDialog::SelectedSourceType()
{
    switch (host_.ListSelection(handle(), IdSourceList)) {
    case SourceListOpal:
        return tessel::FileOpal;
    case SourceListRaw:
        return tessel::FileRaw;
    case SourceListBin:
        return tessel::FileCode;
    default:
        return tessel::FileScript;
    }
}

void TestClientDialog::UpdateTitle()
{
    // A Linux path separates with '/', a Windows one with '\'; either ends a directory.
    const char* name = currentFile_;
    for (const char* p = currentFile_; *p != '\0'; ++p) {
        if (*p == '/' || *p == '\\')
            name = p + 1;
    }
    char title[kTitleSize];
    std::snprintf(title, sizeof title, "%s - %s", kDialogCaption, name);
    host_.SetWindowTitle(handle(), title);
}

bool TestClientDialog::LoadScriptFile(const char* path)
{
    if (path == nullptr || path[0] == '\0')
        return false;
    std::error_code error;
    // A directory opens for reading on some systems but has no bytes to show.
    if (std::filesystem::is_directory(path, error))
        return false;
    std::FILE* file = std::fopen(path, "rb");
    if (file == nullptr)
        return false;
    bool loaded = false;
    if (std::fseek(file, 0, SEEK_END) == 0) {
        const long size = std::ftell(file);
        if (size >= 0 && size <= kMaxScriptFileSize && std::fseek(file, 0, SEEK_SET) == 0) {
            std::unique_ptr<char[]> text(new (std::nothrow) char[size + 1]);
            if (text) {
                const std::size_t got = std::fread(text.get(), 1, size, file);
                if (got == static_cast<std::size_t>(size)) {
                    text[size] = '\0';
                    host_.SetControlText(handle(), IdEditor, text.get());
                    loaded = true;
                }
            }
        }
    }
    std::fclose(file);
    return loaded;
}

tessel::Long TestClientDialog::RunCommand(const char* text, tessel::Short brickType)
{
    if (session_ == nullptr)
        return static_cast<tessel::Long>(tessel::kLinkFailed);
    ReaderWriter* object = nullptr;
    tessel::Long code = session_->TranslateText(brickType, tessel::FileScript, text, &object,
                                                nullptr, nullptr, nullptr);
    if (code >= 0) {
        code = session_->ExecCode(brickHandle_, object, nullptr, nullptr, nullptr, nullptr);
    }
    BrickSession::ReleaseReaderWriter(&object);
    return code;
}

std::unique_ptr<char[]> TestClientDialog::ReadFileText(ReaderWriter* file)
{
    if (file == nullptr)
        return nullptr;
    if (file->openRead().packedCode() != RwOk.packedCode())
        return nullptr;
    std::unique_ptr<char[]> text;
    const std::int32_t size = file->size();
    if (size > 0) {
        text.reset(new (std::nothrow) char[static_cast<std::size_t>(size) + 1]);
        if (text) {
            const std::int32_t got = file->read(text.get(), size);
            text[got > 0 && got <= size ? got : 0] = '\0';
        }
    }
    file->close();
    return text;
}

bool TestClientDialog::DownloadObject(ReaderWriter* object)
{
    downloadTotal_ = BrickSession::CountCommands(object);
    if (downloadTotal_ <= 0) {
        ShowFailure("No code");
        return false;
    }
    ShowStatus("Downloading");
    host_.Repaint(handle());
    downloadStart_ = host_.TickCount();
    const tessel::Long code =
        session_ != nullptr
            ? session_->Download(brickHandle_, object, DownloadCallback, CallbackContext())
            : static_cast<tessel::Long>(tessel::kLinkFailed);
    if (code < 0) {
        ShowError(code, nullptr);
        OfferTroubleShooter(code);
        return false;
    }
    ++downloadsInFlight_;
    return true;
}

tessel::Long TestClientDialog::StartAsyncExec(ReaderWriter* object)
{
    if (session_ == nullptr)
        return static_cast<tessel::Long>(tessel::kLinkFailed);
    const tessel::Long code = session_->ExecCode(brickHandle_, object, &asyncResult_, nullptr,
                                                 ExecCallback, CallbackContext());
    if (code >= 0)
        ++execsInFlight_;
    return code;
}

void TestClientDialog::ShowStatus(const char* text)
{
    host_.SetControlText(handle(), IdStatusBox, text ? text : "");
}

void TestClientDialog::ShowStatusV(const char* format, va_list args, bool failure)
{
    char text[kFormattedStatusSize];
    std::vsnprintf(text, sizeof text, format, args);
    if (failure)
        failureShown_ = true;
    ShowStatus(text);
}

void TestClientDialog::ShowStatusF(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    ShowStatusV(format, args, false);
    va_end(args);
}

void TestClientDialog::ShowFailure(const char* text)
{
    failureShown_ = true;
    ShowStatus(text);
}

void TestClientDialog::ShowFailureF(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    ShowStatusV(format, args, true);
    va_end(args);
}

void TestClientDialog::ShowError(std::int32_t code, IError* sink)
{
    ShowFailure(GetErrorText(code, sink));
}

void TestClientDialog::PlaceEditorCaret(std::int32_t position)
{
    host_.SetEditSelection(handle(), IdEditor, position, position);
}

void TestClientDialog::FocusEditor()
{
    host_.SetFocus(handle(), IdEditor);
}

void TestClientDialog::SetCurrentFile(const char* path)
{
    CopyText(currentFile_, sizeof currentFile_, path);
}

namespace {

// Posts for a callback; any thread. False when there is nowhere to post.
bool PostFromCallback(void* context, Message message, tessel::Long status, LParam lParam)
{
    const auto* target = static_cast<const PostTarget*>(context);
    if (target == nullptr || target->host == nullptr)
        return false;
    return target->host->PostMessage(
        target->window, message, static_cast<WParam>(static_cast<std::uint32_t>(status)), lParam);
}

} // namespace

int TSL_STDCALL TestClientDialog::DownloadCallback(tessel::Long status, void* context,
                                                   tessel::Long count, ReaderWriter* result)
{
    if (context == nullptr)
        return 0;
    PostFromCallback(context, kMsgDownloadProgress, status, count);
    return 1;
}

int TSL_STDCALL TestClientDialog::ExecCallback(tessel::Long status, void* context,
                                               tessel::Long count, ReaderWriter* result)
{
    if (context == nullptr)
        return 0;
    if (!PostFromCallback(context, kMsgExecResult, status, reinterpret_cast<LParam>(result))) {
        // The window is gone: the file was handed to us and nobody else will release it.
        BrickSession::ReleaseReaderWriter(&result);
    }
    return 1;
}

int TSL_STDCALL TestClientDialog::ReceiveCallback(tessel::Long status, void* context,
                                                  tessel::Long count, ReaderWriter* result)
{
    if (context == nullptr)
        return 0;
    PostFromCallback(context, kMsgBrickMessage, status, count);
    return 1;
}

} // namespace ui
