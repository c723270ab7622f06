// The window layer on Qt Widgets: the dialog as a real window built from its template, the
// hidden plain windows of the help link, Qt's event loop carrying the messages that any
// thread posts, the nested pump of a help session, message boxes, the system's file dialogs
// and the beep.
//
// Posted messages wait in the host's own queue, and each post wakes the loop with a Qt
// event; keeping the queue here (and not only in Qt's) is what lets DestroyWindow hand the
// messages of a destroyed window back to its object, so a result file never leaks.
#pragma once

#include <QHash>
#include <QPointer>
#include <QString>

#include <cstddef>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <vector>

#include "ui/PostedMessage.h"
#include "ui/Window.h"
#include "ui/qt/EditText.h"
#include "ui/qt/MeasuredText.h"

class QApplication;
class QEventLoop;
class QObject;
class QWidget;

namespace ui {

class Answerer;
class DialogWindow;
class FontWarmUp;
class QtHelpViewer;

class QtHost final : public WindowHost {
public:
    // helpDirectory: where the help viewer looks for a help file named without directory,
    // with a trailing "/". The application object must exist already.
    explicit QtHost(const std::string& helpDirectory);
    ~QtHost() override;

    QtHost(const QtHost&) = delete;
    QtHost& operator=(const QtHost&) = delete;

    // The host owns the application from now on and destroys it last, after every window.
    void AdoptApplication(std::unique_ptr<QApplication> application);
    // The font configuration still loading beside the start-up; the first dialog window
    // lets it finish before it measures its text.
    void AdoptFontWarmUp(std::unique_ptr<FontWarmUp> warmUp);

    // Who answers questions and file dialogs; null restores the real boxes. Not owned.
    void SetAnswerer(Answerer* answerer);
    // The help viewer the host hands to the dialog it shows.
    QtHelpViewer& helpViewer() { return *helpViewer_; }
    // Once the next dialog has been shown, say "shown" on the standard output and close it
    // as its close box would: for timing the program's start-up from outside.
    void ExitWhenShown() { exitWhenShown_ = true; }

    // --- for the program and the tests -------------------------------------------------
    // The window of a dialog, or null.
    DialogWindow* dialogWindow(WindowHandle window) const;
    // The plain window of className, or kNoWindow.
    WindowHandle FindWindowOfClass(const char* className) const;
    bool WindowExists(WindowHandle window) const;
    bool QuitRequested() const;
    int ExitCode() const;
    std::size_t QueuedMessages() const;

    // --- WindowHost --------------------------------------------------------------------
    WindowHandle CreateDialogWindow(const DialogTemplate& layout, WindowObject* object) override;
    WindowHandle CreatePlainWindow(const char* className, WindowObject* object) override;
    void ShowWindow(WindowHandle window) override;
    void DestroyWindow(WindowHandle window) override;
    void SetWindowTitle(WindowHandle window, const char* title) override;
    void Repaint(WindowHandle window) override;

    bool PostMessage(WindowHandle window, Message message, WParam wParam, LParam lParam) override;
    LResult SendMessage(WindowHandle window, Message message, WParam wParam,
                        LParam lParam) override;
    void PostQuit(int exitCode) override;
    int RunMessageLoop() override;
    bool PumpMessage() override;

    void SetControlText(WindowHandle dialog, int id, const char* text) override;
    std::uint32_t GetControlText(WindowHandle dialog, int id, char* buffer,
                                 std::uint32_t size) override;
    std::uint32_t GetControlTextLength(WindowHandle dialog, int id) override;
    void SetCheck(WindowHandle dialog, int id, bool checked) override;
    bool IsChecked(WindowHandle dialog, int id) override;
    void EnableControl(WindowHandle dialog, int id, bool enabled) override;
    bool IsControlEnabled(WindowHandle dialog, int id) override;
    void ShowControl(WindowHandle dialog, int id, bool visible) override;
    bool IsControlVisible(WindowHandle dialog, int id) override;
    int ListAdd(WindowHandle dialog, int id, const char* text) override;
    void ListSelect(WindowHandle dialog, int id, int index) override;
    int ListSelection(WindowHandle dialog, int id) override;
    int ListCount(WindowHandle dialog, int id) override;
    void SetEditSelection(WindowHandle dialog, int id, std::int32_t start,
                          std::int32_t end) override;
    void GetEditSelection(WindowHandle dialog, int id, std::int32_t* start,
                          std::int32_t* end) override;
    void SetFocus(WindowHandle dialog, int id) override;
    int FocusedControl(WindowHandle dialog) override;

    bool AskYesNo(WindowHandle owner, const char* text, const char* caption) override;
    void ShowMessage(WindowHandle owner, const char* text, const char* caption) override;
    bool ChooseOpenFile(const FileDialogRequest& request) override;
    bool ChooseSaveFile(const FileDialogRequest& request) override;
    void Beep() override;
    std::uint32_t TickCount() override;

private:
    class Receiver;
    friend class Receiver;

    struct Window {
        WindowObject* object = nullptr;
        QPointer<DialogWindow> dialog; // null for a plain window
        QPointer<QObject> plain;       // the plain window's stand-in object
        QHash<int, EditEncoding> encodings;
    };
    using Posted = PostedMessage;

    Window* find(WindowHandle window);
    const Window* find(WindowHandle window) const;
    QWidget* control(WindowHandle dialog, int id) const;
    // The control's text as the dialog reads it: bytes, written as they were set. A
    // multi-line edit's bytes that measured keeps are taken instead of converted again.
    QByteArray controlBytes(WindowHandle dialog, int id);
    QWidget* ownerWidget(WindowHandle owner) const;
    bool chooseFile(const FileDialogRequest& request, bool save);

    // A command of a dialog's control or menu.
    void onDialogCommand(WindowHandle dialog, int id);
    // On the loop's thread, for each wake-up event and for the quit event.
    void dispatchNext();
    void endLoops();

    // Declared first, destroyed last: every widget goes before the application does.
    std::unique_ptr<QApplication> application_;
    std::unique_ptr<FontWarmUp> fontWarmUp_;

    std::unique_ptr<Receiver> receiver_;
    std::unique_ptr<Answerer> systemAnswerer_;
    Answerer* answerer_ = nullptr;
    std::unique_ptr<QtHelpViewer> helpViewer_;

    // Guards the queue, the quit request and the set of live windows (posting threads
    // read it). Everything else belongs to the loop's thread.
    mutable std::mutex mutex_;
    std::deque<Posted> queue_;
    std::set<WindowHandle> live_;
    bool quit_ = false;
    int exitCode_ = 0;

    std::map<WindowHandle, Window> windows_;
    WindowHandle nextHandle_ = 1;
    // The loops RunMessageLoop is running, innermost last.
    std::vector<QEventLoop*> loops_;
    // An exit asked for while a Trouble Shooter run waited for its help: sent when the run's
    // window goes.
    struct PendingExit {
        WindowHandle dialog = kNoWindow;
        int id = 0;
    } pendingExit_;
    // Windows whose widgets wait for deletion until control is back in the event loop.
    std::vector<QPointer<QObject>> doomed_;
    bool exitWhenShown_ = false;
    // What GetControlTextLength converted, for the GetControlText after it.
    MeasuredText measured_;
};

} // namespace ui
