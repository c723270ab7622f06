// The window layer: what the dialog and the Trouble Shooter's hidden help window need from a
// windowing system, and nothing more. Two hosts implement it: the Qt host (ui/qt) and the
// headless host (ui/headless). The core talks only to these interfaces and never sees a
// toolkit type.
//
// The model is message based, as the dialog's own code expects: a window is bound to one
// WindowObject and every message of the window reaches that object's OnMessage. Messages
// carry (message, wParam, lParam); a command carries its control or menu id in the low 16
// bits of wParam.
//
// Threads: everything here runs on the thread that runs the message loop, except
// WindowHost::PostMessage and WindowHost::PostQuit, which any thread may call.
#pragma once

#include <cstdint>

namespace ui {

using Message = std::uint32_t;
using WParam = std::uintptr_t;
using LParam = std::intptr_t;
using LResult = std::intptr_t;

// 0 is never a window. A handle stays unique for the life of the host, so a message posted
// to a window that is gone is dropped instead of reaching a newer one.
using WindowHandle = std::uintptr_t;
inline constexpr WindowHandle kNoWindow = 0;

// Message numbers. The values are the Win32 ones so that a Windows host can pass them
// through unchanged; the names avoid the Win32 macros.
inline constexpr Message kMsgDestroy = 0x0002;
inline constexpr Message kMsgInitDialog = 0x0110;
inline constexpr Message kMsgCommand = 0x0111;
inline constexpr Message kMsgUser = 0x0400;

// The command id of a command message (low 16 bits of wParam).
constexpr int CommandId(WParam wParam)
{
    return static_cast<int>(wParam & 0xFFFFu);
}
// The notification code of a command message (high 16 bits of wParam's low 32 bits).
constexpr int CommandCode(WParam wParam)
{
    return static_cast<int>((wParam >> 16) & 0xFFFFu);
}
constexpr WParam MakeCommand(int id, int code = 0)
{
    return (static_cast<WParam>(code & 0xFFFF) << 16) | static_cast<WParam>(id & 0xFFFF);
}

// Command ids a host sends on its own: the close box and Escape send kIdCancel.
inline constexpr int kIdCancel = 2;

// An object bound to a window. The host calls AttachWindow before the first message of the
// window and DetachWindow after its final destruction message, so handle() is the live
// window or kNoWindow.
class WindowObject {
public:
    virtual ~WindowObject() = default;

    WindowHandle handle() const { return handle_; }

    // Host side of the binding; nothing else calls these.
    void AttachWindow(WindowHandle handle) { handle_ = handle; }
    void DetachWindow() { handle_ = kNoWindow; }

    // Returns true when the object handled the message; result is then the message's
    // result. An unhandled message gets the host's default processing.
    virtual bool OnMessage(Message message, WParam wParam, LParam lParam, LResult& result) = 0;

    // A message posted to this object's window that will never be delivered, because the
    // window was destroyed while the message was queued. Called on the loop's thread, so
    // the object can free what the message carries (a result file, say).
    virtual void OnUndelivered(Message message, WParam wParam, LParam lParam) {}

private:
    WindowHandle handle_ = kNoWindow;
};

struct DialogTemplate;

// One entry of a file dialog's filter list, e.g. {"Onyx2 Files", "*.onyx2"}.
struct FileFilter {
    const char* description;
    const char* pattern;
};

// Arguments of the open and save file dialogs. The chosen path is written to path (size
// bytes, terminator included, cut at the bound); on entry path holds the initial name.
struct FileDialogRequest {
    WindowHandle owner = kNoWindow;
    const FileFilter* filters = nullptr;
    int filterCount = 0; // the first one is preselected
    char* path = nullptr;
    std::uint32_t size = 0;
};

// The window system as the dialog and the help link see it.
class WindowHost {
public:
    virtual ~WindowHost() = default;

    // --- windows -----------------------------------------------------------------------
    // Creates the modeless dialog described by layout, bound to object; sends
    // kMsgInitDialog before returning. kNoWindow when the window cannot be made.
    virtual WindowHandle CreateDialogWindow(const DialogTemplate& layout, WindowObject* object) = 0;
    // Creates a hidden plain window of the registered class className, bound to object
    // (the help link's "trbl_wnd"). It is never shown.
    virtual WindowHandle CreatePlainWindow(const char* className, WindowObject* object) = 0;
    virtual void ShowWindow(WindowHandle window) = 0;
    // Sends kMsgDestroy to the window's object, then hands every message still queued for
    // the window to the object's OnUndelivered, then detaches the object and forgets the
    // window. A window that does not exist is ignored.
    virtual void DestroyWindow(WindowHandle window) = 0;
    virtual void SetWindowTitle(WindowHandle window, const char* title) = 0;
    // Paints the window at once, so that a status text shows before a long call.
    virtual void Repaint(WindowHandle window) = 0;

    // --- messages ----------------------------------------------------------------------
    // Queues a message for window; any thread. False when the window does not exist.
    virtual bool PostMessage(WindowHandle window, Message message, WParam wParam,
                             LParam lParam) = 0;
    // Delivers a message to the window's object at once (on the loop's thread only) and
    // returns its result; 0 when the window does not exist or leaves it unhandled.
    virtual LResult SendMessage(WindowHandle window, Message message, WParam wParam,
                                LParam lParam) = 0;
    // Asks the message loop to end with exitCode; any thread.
    virtual void PostQuit(int exitCode) = 0;
    // Dispatches messages until the quit request; returns its exit code.
    virtual int RunMessageLoop() = 0;
    // The nested pump: waits for one message and dispatches it. Returns false, dispatching
    // nothing, once the quit request has been made; the request stays pending so that the
    // outer loop ends as well.
    virtual bool PumpMessage() = 0;

    // --- dialog controls, addressed by the numeric ids of the layout ---------------------
    virtual void SetControlText(WindowHandle dialog, int id, const char* text) = 0;
    // Copies at most size - 1 characters and a terminator into buffer; returns the number
    // of characters copied. size 0 copies nothing.
    virtual std::uint32_t GetControlText(WindowHandle dialog, int id, char* buffer,
                                         std::uint32_t size) = 0;
    // Length of the control's text, without terminator.
    virtual std::uint32_t GetControlTextLength(WindowHandle dialog, int id) = 0;
    virtual void SetCheck(WindowHandle dialog, int id, bool checked) = 0;
    virtual bool IsChecked(WindowHandle dialog, int id) = 0;
    virtual void EnableControl(WindowHandle dialog, int id, bool enabled) = 0;
    virtual bool IsControlEnabled(WindowHandle dialog, int id) = 0;
    virtual void ShowControl(WindowHandle dialog, int id, bool visible) = 0;
    virtual bool IsControlVisible(WindowHandle dialog, int id) = 0;
    // Drop-down lists. ListAdd returns the new entry's index (entries are not sorted).
    virtual int ListAdd(WindowHandle dialog, int id, const char* text) = 0;
    // index -1 clears the selection.
    virtual void ListSelect(WindowHandle dialog, int id, int index) = 0;
    // The selected index, -1 for none.
    virtual int ListSelection(WindowHandle dialog, int id) = 0;
    virtual int ListCount(WindowHandle dialog, int id) = 0;
    // Edit controls: selects characters [start, end), as EM_SETSEL; start == end places the
    // caret. Offsets beyond the text are clamped to its end.
    virtual void SetEditSelection(WindowHandle dialog, int id, std::int32_t start,
                                  std::int32_t end) = 0;
    virtual void GetEditSelection(WindowHandle dialog, int id, std::int32_t* start,
                                  std::int32_t* end) = 0;
    virtual void SetFocus(WindowHandle dialog, int id) = 0;
    // The control that has the keyboard focus, 0 for none.
    virtual int FocusedControl(WindowHandle dialog) = 0;

    // --- questions and other interaction ------------------------------------------------
    // A Yes/No message box; owner kNoWindow makes it free-standing. True for Yes.
    virtual bool AskYesNo(WindowHandle owner, const char* text, const char* caption) = 0;
    // A message box with an OK button.
    virtual void ShowMessage(WindowHandle owner, const char* text, const char* caption) = 0;
    // True when the user chose a file; false on cancel, leaving request.path unchanged.
    virtual bool ChooseOpenFile(const FileDialogRequest& request) = 0;
    virtual bool ChooseSaveFile(const FileDialogRequest& request) = 0;
    // The default system beep.
    virtual void Beep() = 0;
    // The system tick count in milliseconds (wraps); a host may fix it for repeatable runs.
    virtual std::uint32_t TickCount() = 0;
};

} // namespace ui
