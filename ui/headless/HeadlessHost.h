// The window layer without a window system: controls held in memory, questions answered by
// a policy, file dialogs answered by names given in advance, and a thread-safe message
// queue. It serves the batch mode and the tests, so every command handler runs without a
// display.
//
// Everything the user would see is reported as an Event to one listener: each change of a
// read-only edit (the status box), each title change, each question with its answer, each
// OK box, each file dialog with its outcome, each beep.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "ui/DialogLayout.h"
#include "ui/PostedMessage.h"
#include "ui/Window.h"

namespace ui {

struct HeadlessEvent {
    enum class Kind { Status, Title, Question, MessageBox, OpenFile, SaveFile, Beep };
    Kind kind;
    std::string caption; // question, message box; control id for Status
    std::string text;    // the status text, title, question text, chosen file
    bool answer = false; // Question: yes; OpenFile/SaveFile: a file was chosen
};

// Not final: a test may derive a host whose window system refuses to make windows.
class HeadlessHost : public WindowHost {
public:
    HeadlessHost();
    ~HeadlessHost() override;

    // --- how the host answers ----------------------------------------------------------
    // Answer of a question that nothing else decides (default: No).
    void SetDefaultAnswer(bool yes) { defaultAnswer_ = yes; }
    // Answers for the next questions, in order; they win over everything else.
    void QueueAnswer(bool yes) { answers_.push_back(yes); }
    // While set, a question whose text equals choice is answered Yes and every other one
    // No (queued answers still win); a file dialog returns choice. "" clears it.
    void SetChoice(const std::string& choice) { choice_ = choice; }
    // File names for the next file dialogs, in order; without one a dialog is cancelled.
    void QueueFileName(const std::string& name) { fileNames_.push_back(name); }
    void ClearPendingAnswers();
    // A fixed tick count makes elapsed times repeatable (every reading gives ticks).
    void FixTickCount(std::uint32_t ticks);

    void SetListener(std::function<void(const HeadlessEvent&)> listener)
    {
        listener_ = std::move(listener);
    }
    // Called by the loop and the nested pump when the queue is empty; returns false when it
    // had nothing to do, and the loop then waits for a posted message.
    void SetIdleHandler(std::function<bool()> idle) { idle_ = std::move(idle); }

    // --- for the driver and the tests --------------------------------------------------
    // Dispatches every message queued now; returns how many.
    int DispatchPending();
    // Waits until a message is queued or the quit request is made, at most timeoutMs;
    // true when there is something to do.
    bool WaitForMessage(int timeoutMs);
    bool QuitRequested();
    int ExitCode();
    std::size_t QueuedMessages();
    // The plain window of className, or kNoWindow.
    WindowHandle FindWindowOfClass(const char* className) const;
    std::string WindowTitle(WindowHandle window) const;
    bool WindowExists(WindowHandle window) const;
    bool WindowVisible(WindowHandle window) const;
    // A control's text as stored (no cut); "" for an unknown control.
    std::string ControlText(WindowHandle dialog, int id) const;
    // What a user does to a control: a push button or menu item sends its command; a check
    // box toggles first, a radio button checks itself and unchecks its group first. False
    // when the control is disabled (no command is sent). Menu ids are always enabled.
    bool Click(WindowHandle dialog, int id);
    int RepaintCount() const { return repaints_; }

    // --- WindowHost --------------------------------------------------------------------
    WindowHandle CreateDialogWindow(const DialogTemplate& layout, WindowObject* object) override;
    WindowHandle CreatePlainWindow(const char* className, WindowObject* object) override;
    void ShowWindow(WindowHandle window) override;
    void DestroyWindow(WindowHandle window) override;
    void SetWindowTitle(WindowHandle window, const char* title) override;
    void Repaint(WindowHandle window) override { ++repaints_; }

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
    // The text of a list entry; "" out of range.
    std::string ListEntry(WindowHandle dialog, int id, int index) const;
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
    struct Control {
        ControlKind kind = ControlKind::Label;
        std::uint32_t style = 0;
        std::string text;
        bool checked = false;
        bool enabled = true;
        bool visible = true;
        std::vector<std::string> entries;
        int selection = -1;
        std::int32_t selStart = 0;
        std::int32_t selEnd = 0;
    };
    struct Window {
        WindowObject* object = nullptr;
        bool dialog = false;
        bool visible = false;
        std::string className;
        std::string title;
        std::map<int, Control> controls;
        std::vector<int> radioOrder; // radio buttons in layout order, for groups
        std::map<int, bool> radioGroupStart;
        std::set<int> menuIds;
        int focus = 0;
    };
    using Posted = PostedMessage;

    Window* find(WindowHandle window);
    const Window* find(WindowHandle window) const;
    Control* control(WindowHandle dialog, int id);
    const Control* control(WindowHandle dialog, int id) const;
    void emit(HeadlessEvent event);
    bool answerQuestion(const char* text);
    bool chooseFile(const FileDialogRequest& request, HeadlessEvent::Kind kind);
    // Takes the next queued message; false when there is none.
    bool takeMessage(Posted& posted);
    void dispatch(const Posted& posted);

    // Guards the queue, the quit request and the set of live windows (posting threads
    // read it). Everything else belongs to the loop's thread.
    mutable std::mutex mutex_;
    std::condition_variable queued_;
    std::deque<Posted> queue_;
    std::set<WindowHandle> live_;
    bool quit_ = false;
    int exitCode_ = 0;

    std::map<WindowHandle, Window> windows_;
    WindowHandle nextHandle_ = 1;

    bool defaultAnswer_ = false;
    std::deque<bool> answers_;
    std::string choice_;
    std::deque<std::string> fileNames_;
    bool ticksFixed_ = false;
    std::uint32_t fixedTicks_ = 0;
    std::int64_t startTicks_ = 0;
    int repaints_ = 0;

    std::function<void(const HeadlessEvent&)> listener_;
    std::function<bool()> idle_;
};

} // namespace ui
