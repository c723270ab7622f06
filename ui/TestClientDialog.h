// The test client's one window: its settings, the brick session and handle, the control and
// menu ids, the message routing and every command handler.
//
// The class is written once against the window layer (ui/Window.h); the Qt host and the
// headless host both drive this same object. Handlers are grouped by source file:
//   TestClientDialog.cpp    frame: settings, initialisation, teardown, routing, helpers
//   PortCommands.cpp        Open, Close, Test, Statistics, range
//   ScriptCommands.cpp      Validate, Execute, Execute Async, Download, Download File,
//                           Receive and the three custom messages of the callbacks
//   FirmwareCommands.cpp    Download Firmware and its closing steps
//   InfoCommands.cpp        Info
//   UploadCommands.cpp      Upload
//   StressCommands.cpp      Stress, About
//   FileCommands.cpp        New, Open..., Save, Save As...
//   ConversionCommands.cpp  Convert to CSV, Macro To CSV
//   TroubleShooterOffers.cpp  the Trouble Shooter offers and the quiet repair
//
// Threads: everything runs on the thread of the message loop, except the three callbacks,
// which the library may call from threads of its own; they only post a message.
#pragma once

#include <cstdarg>
#include <cstdint>
#include <memory>
#include <string>

#include "tessel/TesselApi.h"
#include "ui/DialogLayout.h"
#include "ui/Window.h"

class BrickSession;
class HelpViewer;
class IError;
class ReaderWriter;

#if defined(__GNUC__)
#define HARBOR_PRINTF_FORMAT(f, a) __attribute__((format(printf, f, a)))
#else
#define HARBOR_PRINTF_FORMAT(f, a)
#endif

namespace ui {

// Control ids of the dialog template; the routing and the handlers use them.
enum ControlId : int {
    IdDownload = 201,
    IdValidate = 202,
    IdExecute = 203,
    IdTest = 204,
    IdOpenPort = 205,
    IdStatistics = 206,
    IdNewFirmware = 207,
    IdBrickList = 208,
    IdSourceList = 209,
    IdAutoClear = 210,
    IdDownloadFile = 211,
    IdStress = 212,
    IdDownloadFileName = 213,
    IdStressCount = 214,
    IdClosePort = 215,
    IdInfo = 216,
    IdExecuteAsync = 217,
    IdRangeShort = 218,
    IdRangeMedium = 219,
    IdRangeLong = 220,
    IdUpload = 221,
    IdFirmwareFileName = 222,
    IdAutoRun = 223,
    IdReceive = 224,
    IdStatusBox = 1003,
    IdEditor = 1015,
};

// Menu-only command ids (menu 202). Port, Script and Special items share their buttons' ids.
enum MenuId : int {
    IdFileNew = 32768,
    IdFileSave = 32769,
    IdFileSaveAs = 32770,
    IdFileExit = 32771,
    IdAbout = 32773,
    IdFileOpen = 32774,
    IdConvertToCsv = 32775,
    IdMacroToCsv = 32777,
};

inline constexpr int kDialogTemplateId = 101;
inline constexpr int kMenuId = 202;

// Custom messages. +1 is posted by the dialog itself, +2 to +4 by the library callbacks.
inline constexpr Message kMsgStressNext = kMsgUser + 1;       // 0, 0
inline constexpr Message kMsgDownloadProgress = kMsgUser + 2; // status, commands so far
inline constexpr Message kMsgExecResult = kMsgUser + 3;       // status, ReaderWriter*
inline constexpr Message kMsgBrickMessage = kMsgUser + 4;     // status, message number
inline constexpr Message kMsgUserLast = kMsgUser + 10;        // +0, +5..+10: ignored

// Brick list entries and source list entries, in index order.
enum BrickListIndex : int { BrickListRover = 0, BrickListOnyx2 = 1 };
enum SourceListIndex : int {
    SourceListScript = 0,
    SourceListOpal = 1,
    SourceListRaw = 2,
    SourceListBin = 3
};

// The layout of dialog 101 with menu 202.
const DialogTemplate& TestClientDialogTemplate();

// Texts shown in the title and the About box.
inline constexpr const char* kDialogCaption = "Tessel Test Client";

// Fixed text sizes, terminator included.
inline constexpr std::uint32_t kPathSize = 260;
inline constexpr std::uint32_t kStatusSize = 80;
inline constexpr std::uint32_t kBrickNameSize = 256; // DetectBrick's name buffer

// What a callback receives as its context: where to post. It is filled before any library
// call can receive it and not changed while the library may call back, so the library's
// threads read it without a lock.
struct PostTarget {
    WindowHost* host = nullptr;
    WindowHandle window = kNoWindow;
};

class TestClientDialog final : public WindowObject {
public:
    // The settings reader: splits commandLine (the whole line, the program path in double
    // quotes first) into the settings path and the file to open, reads the dialog's
    // settings, creates the brick session and switches the library's trace on when asked.
    // The window does not exist yet; Create makes it.
    TestClientDialog(WindowHost& host, const char* commandLine);
    ~TestClientDialog() override;

    TestClientDialog(const TestClientDialog&) = delete;
    TestClientDialog& operator=(const TestClientDialog&) = delete;

    // Creates the dialog window (which runs the initialisation) and shows it. False when
    // the host could not make the window.
    bool Create();

    bool OnMessage(Message message, WParam wParam, LParam lParam, LResult& result) override;
    void OnUndelivered(Message message, WParam wParam, LParam lParam) override;

    // --- read access, for the hosts and the tests ---------------------------------------
    WindowHost& host() const { return host_; }
    BrickSession* session() const { return session_; }
    tessel::Long brickHandle() const { return brickHandle_; }
    const char* currentFile() const { return currentFile_; }
    const char* firmwareDir() const { return firmwareDir_; }
    const char* firmwareFile() const { return firmwareFile_; }
    const char* serialPort() const { return serialPort_; }
    const char* usbPort() const { return usbPort_; }
    const char* logFile() const { return logFile_; }
    bool autoRun() const { return autoRun_; }
    bool autoClear() const { return autoClear_; }
    bool autoDownload() const { return autoDownload_; }
    bool receiving() const { return receiving_; }
    bool firmwarePending() const { return firmwarePending_; }
    std::int32_t downloadTotal() const { return downloadTotal_; }
    std::int32_t stressIteration() const { return stressIteration_; }
    tessel::Short portType() const { return portType_; }
    tessel::Short traceOptions() const { return traceOptions_; }

    // The help viewer a Trouble Shooter run opens its topics in; the host gives it (null: the
    // help cannot open, and a run ends after its diagnosis). Not owned.
    void SetHelpViewer(HelpViewer* viewer) { helpViewer_ = viewer; }
    HelpViewer* helpViewer() const { return helpViewer_; }

    // Whether a handler showed a failure (ShowFailure, ShowError) since the last reset; the
    // headless host judges each command by it.
    bool failureShown() const { return failureShown_; }
    void ResetFailureShown() { failureShown_ = false; }
    // Downloads and asynchronous executions whose final report has not arrived yet.
    int operationsInFlight() const { return downloadsInFlight_ + execsInFlight_; }

    // --- frame (TestClientDialog.cpp) ----------------------------------------------------
    void OnInitDialog();
    void OnDestroy();
    // Cancel (Escape, close box) and File Exit: destroys the window and posts quit 0.
    void OnExit();
    // WM_USER+0 to +10.
    void OnCustomMessage(Message message, WParam wParam, LParam lParam);
    // Runs the handler of a command id; false for an id without one.
    bool RouteCommand(int id);

    // --- shared helpers (TestClientDialog.cpp) -------------------------------------------
    // The editor's whole text in a new buffer; never null (an empty editor gives "").
    std::unique_ptr<char[]> ReadEditorText();
    // 5 for "Rover", 6 for "Onyx2" or no selection.
    tessel::Short SelectedBrickType();
    // 1 Script, 2 Opal, 3 RAW, 4 BIN; no selection gives 1.
    std::int32_t SelectedSourceType();
    // "Tessel Test Client - " and the part of currentFile after its last '/' or '\'.
    void UpdateTitle();
    // Reads the file whole into the editor; false, changing nothing, when it cannot be
    // opened or read. currentFile is left alone.
    bool LoadScriptFile(const char* path);
    // Asks for a script file to open or to save into path (size bytes, holding the name to
    // offer); false when the user cancelled or the name does not fit a path.
    bool ChooseScriptFile(bool save, char* path, std::uint32_t size);
    // Translates text as a Script for brickType and executes it on brickHandle.
    tessel::Long RunCommand(const char* text, tessel::Short brickType);
    // The whole content of file as a terminated text; null for a null file, a failed open
    // or no content. The file is closed again; its reference stays the caller's.
    static std::unique_ptr<char[]> ReadFileText(ReaderWriter* file);
    // Starts the download of object with progress reports; true when it was started. The
    // object stays the caller's.
    bool DownloadObject(ReaderWriter* object);
    // Hands object to the library for execution with the execution callback; the result
    // number lives in the dialog, since the library may write it after this returns. Returns
    // the call's result. The object stays the caller's.
    tessel::Long StartAsyncExec(ReaderWriter* object);
    // False, showing "Port not open", when no port is open or no library is loaded.
    bool PortReady();
    // The same test told apart: no port shows "Port not open", no library the link failure.
    bool PortAndLibraryReady();
    // Clears the brick's tasks and subroutines when Auto Clear is checked; false, with the
    // failure shown and the Trouble Shooter offered, when clearing failed.
    bool AutoClear(tessel::Short brickType);
    // The editor's text translated for the open port, the caller's to release. Null when no
    // port is open, the editor is empty, translation failed (shown, the caret placed at the
    // error) or it produced no code ("No code").
    ReaderWriter* TranslateEditorForRun(bool offerTroubleShooter);

    // Status box (1003): one message at a time, each replacing the last.
    void ShowStatus(const char* text);
    void ShowStatusF(const char* format, ...) HARBOR_PRINTF_FORMAT(2, 3);
    // The same, for the texts of the failure tables; marks the command as failed.
    void ShowFailure(const char* text);
    void ShowFailureF(const char* format, ...) HARBOR_PRINTF_FORMAT(2, 3);
    // GetErrorText of code (with the sink's detail when given); marks the command as failed.
    void ShowError(std::int32_t code, IError* sink);
    void ClearStatus() { ShowStatus(""); }
    // Empty selection at position of the editor, as after a translation error.
    void PlaceEditorCaret(std::int32_t position);
    void FocusEditor();
    // The context handed to the library with a callback.
    void* CallbackContext() { return &postTarget_; }

    // Library callbacks: each only posts its message to the window in context (a
    // PostTarget) and returns 1; a null context posts nothing and returns 0.
    static int TSL_STDCALL DownloadCallback(tessel::Long status, void* context, tessel::Long count,
                                            ReaderWriter* result);
    static int TSL_STDCALL ExecCallback(tessel::Long status, void* context, tessel::Long count,
                                        ReaderWriter* result);
    static int TSL_STDCALL ReceiveCallback(tessel::Long status, void* context, tessel::Long count,
                                           ReaderWriter* result);

    // --- port commands (PortCommands.cpp) ------------------------------------------------
    void OnOpenPort();
    void OnClosePort();
    void OnTest();
    void OnStatistics();
    // range: 1 short, 2 medium, 3 long.
    void OnRange(tessel::Short range);
    // Reads the port's kind and range, collects statistics, detects the brick; true when a
    // brick answered. portName is the name as shown to the user.
    bool OnPortOpened(const char* portName);
    // Fills name (kBrickNameSize bytes) with the brick's name; returns its type, 0 when the
    // query fails.
    tessel::Short DetectBrick(char* name);

    // --- script commands (ScriptCommands.cpp) --------------------------------------------
    void OnValidate();
    void OnExecute();
    void OnExecuteAsync();
    void OnDownload();
    void OnDownloadFile();
    void OnReceive();
    // WM_USER+2, +3, +4.
    void OnDownloadProgress(std::int32_t status, std::int32_t count);
    // result is released by this handler.
    void OnExecResult(std::int32_t status, ReaderWriter* result);
    void OnBrickMessage(std::int32_t status, std::int32_t number);

    // --- firmware (FirmwareCommands.cpp) -------------------------------------------------
    void OnDownloadFirmware();
    // Run by OnDownloadProgress on the final report while firmwarePending is set.
    void FinishFirmwareDownload();

    // --- info and upload (InfoCommands.cpp, UploadCommands.cpp) --------------------------
    void OnInfo();
    void OnUpload();
    // Append "task,..." / "sub,..." and "\r\n" to lines; return the range read's code.
    tessel::Long AppendTaskLine(int task, std::int32_t start, std::int32_t size,
                                std::int32_t taskByte, std::string& lines);
    tessel::Long AppendSubLine(int sub, std::int32_t start, std::int32_t size, std::string& lines);

    // --- stress and about (StressCommands.cpp) -------------------------------------------
    void OnStress();
    // Run at the start of the test and on every WM_USER+1.
    void StressStep();
    void OnAbout();

    // --- files (FileCommands.cpp) --------------------------------------------------------
    void OnFileNew();
    void OnFileOpen();
    void OnFileSave();
    void OnFileSaveAs();
    // The write step: editor text to path, which becomes currentFile.
    void WriteEditorFile(const char* path);

    // --- conversion (ConversionCommands.cpp) ---------------------------------------------
    void OnConvertToCsv();
    void OnMacroToCsv();

    // --- Trouble Shooter (TroubleShooterOffers.cpp) --------------------------------------
    // "%s.\r\nUse Trouble Shooter?"; Yes runs the Trouble Shooter with value.
    bool OfferTroubleShooter(std::int32_t value);
    // "Status: %s.\r\nUse Trouble Shooter?"; Yes runs it with StatusToError(status).
    bool OfferTroubleShooterForStatus(std::int32_t status, const char* statusText);
    // RepairUsbTower with portType, no questions, no help.
    bool QuietRepair(std::int32_t status);

private:
    void ShowStatusV(const char* format, va_list args, bool failure);
    void SetCurrentFile(const char* path);

    WindowHost& host_;
    PostTarget postTarget_;

    // Owned; deleted when the window is destroyed. May be null.
    BrickSession* session_ = nullptr;
    tessel::Long brickHandle_ = 0; // 0: no port open
    std::int32_t downloadTotal_ = 0;
    char firmwareDir_[kPathSize] = {};
    char currentFile_[kPathSize] = {};
    char firmwareFile_[kPathSize] = {};
    bool receiving_ = false;
    bool firmwarePending_ = false;
    char serialPort_[kPathSize] = {};
    char usbPort_[kPathSize] = {};
    char logFile_[kPathSize] = {};
    bool autoRun_ = false;
    bool autoClear_ = false;
    bool autoDownload_ = false;
    std::uint32_t downloadStart_ = 0;
    tessel::Short portType_ = 0;
    std::int32_t stressIteration_ = 0;
    tessel::Short traceOptions_ = 0;

    // The result number of Execute Async: the library may write it until WM_USER+3 arrives.
    tessel::Long asyncResult_ = 0;
    int downloadsInFlight_ = 0;
    int execsInFlight_ = 0;
    bool failureShown_ = false;
    HelpViewer* helpViewer_ = nullptr;
};

} // namespace ui
