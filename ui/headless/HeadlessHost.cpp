// The headless window host.
#include "ui/headless/HeadlessHost.h"

#include <chrono>
#include <cstring>

namespace ui {

namespace {

std::int64_t SteadyMilliseconds()
{
    using namespace std::chrono;
    return duration_cast<milliseconds>(steady_clock::now().time_since_epoch()).count();
}

} // namespace

HeadlessHost::HeadlessHost() : startTicks_(SteadyMilliseconds()) {}

HeadlessHost::~HeadlessHost() = default;

void HeadlessHost::ClearPendingAnswers()
{
    answers_.clear();
    fileNames_.clear();
    choice_.clear();
}

void HeadlessHost::FixTickCount(std::uint32_t ticks)
{
    ticksFixed_ = true;
    fixedTicks_ = ticks;
}

HeadlessHost::Window* HeadlessHost::find(WindowHandle window)
{
    auto it = windows_.find(window);
    return it == windows_.end() ? nullptr : &it->second;
}

const HeadlessHost::Window* HeadlessHost::find(WindowHandle window) const
{
    auto it = windows_.find(window);
    return it == windows_.end() ? nullptr : &it->second;
}

HeadlessHost::Control* HeadlessHost::control(WindowHandle dialog, int id)
{
    Window* window = find(dialog);
    if (window == nullptr)
        return nullptr;
    auto it = window->controls.find(id);
    return it == window->controls.end() ? nullptr : &it->second;
}

const HeadlessHost::Control* HeadlessHost::control(WindowHandle dialog, int id) const
{
    const Window* window = find(dialog);
    if (window == nullptr)
        return nullptr;
    auto it = window->controls.find(id);
    return it == window->controls.end() ? nullptr : &it->second;
}

void HeadlessHost::emit(HeadlessEvent event)
{
    if (listener_)
        listener_(event);
}

// --- windows ----------------------------------------------------------------------------

WindowHandle HeadlessHost::CreateDialogWindow(const DialogTemplate& layout, WindowObject* object)
{
    if (object == nullptr)
        return kNoWindow;
    const WindowHandle handle = nextHandle_++;
    Window& window = windows_[handle];
    window.object = object;
    window.dialog = true;
    window.title = layout.caption ? layout.caption : "";
    for (int i = 0; i < layout.controlCount; ++i) {
        const ControlSpec& spec = layout.controls[i];
        if (spec.id == kNoControlId)
            continue;
        Control& item = window.controls[spec.id];
        item.kind = spec.kind;
        item.style = spec.style;
        item.text = spec.kind == ControlKind::Edit || spec.kind == ControlKind::MultiEdit
                        ? ""
                        : (spec.caption ? spec.caption : "");
        item.enabled = (spec.style & StyleDisabled) == 0;
        item.visible = (spec.style & StyleHidden) == 0;
        if (spec.kind == ControlKind::RadioButton) {
            window.radioOrder.push_back(spec.id);
            window.radioGroupStart[spec.id] = (spec.style & StyleGroupStart) != 0;
        }
    }
    for (int m = 0; m < layout.menuCount; ++m) {
        for (int i = 0; i < layout.menus[m].itemCount; ++i) {
            const MenuItemSpec& item = layout.menus[m].items[i];
            if (item.caption != nullptr)
                window.menuIds.insert(item.id);
        }
    }
    {
        std::lock_guard<std::mutex> lock(mutex_);
        live_.insert(handle);
    }
    object->AttachWindow(handle);
    SendMessage(handle, kMsgInitDialog, 0, 0);
    return handle;
}

WindowHandle HeadlessHost::CreatePlainWindow(const char* className, WindowObject* object)
{
    if (object == nullptr)
        return kNoWindow;
    const WindowHandle handle = nextHandle_++;
    Window& window = windows_[handle];
    window.object = object;
    window.className = className ? className : "";
    {
        std::lock_guard<std::mutex> lock(mutex_);
        live_.insert(handle);
    }
    object->AttachWindow(handle);
    return handle;
}

void HeadlessHost::ShowWindow(WindowHandle window)
{
    if (Window* w = find(window))
        w->visible = true;
}

void HeadlessHost::DestroyWindow(WindowHandle window)
{
    Window* w = find(window);
    if (w == nullptr)
        return;
    RetireWindow(mutex_, live_, queue_, window, *w->object);
    windows_.erase(window);
}

void HeadlessHost::SetWindowTitle(WindowHandle window, const char* title)
{
    Window* w = find(window);
    if (w == nullptr)
        return;
    w->title = title ? title : "";
    emit({HeadlessEvent::Kind::Title, "", w->title});
}

WindowHandle HeadlessHost::FindWindowOfClass(const char* className) const
{
    for (const auto& [handle, window] : windows_) {
        if (!window.dialog && window.className == className)
            return handle;
    }
    return kNoWindow;
}

std::string HeadlessHost::WindowTitle(WindowHandle window) const
{
    const Window* w = find(window);
    return w ? w->title : std::string();
}

bool HeadlessHost::WindowExists(WindowHandle window) const
{
    return find(window) != nullptr;
}

bool HeadlessHost::WindowVisible(WindowHandle window) const
{
    const Window* w = find(window);
    return w != nullptr && w->visible;
}

// --- messages ---------------------------------------------------------------------------

bool HeadlessHost::PostMessage(WindowHandle window, Message message, WParam wParam, LParam lParam)
{
    {
        std::lock_guard<std::mutex> lock(mutex_);
        if (live_.count(window) == 0)
            return false;
        queue_.push_back({window, message, wParam, lParam});
    }
    queued_.notify_all();
    return true;
}

LResult HeadlessHost::SendMessage(WindowHandle window, Message message, WParam wParam,
                                  LParam lParam)
{
    Window* w = find(window);
    if (w == nullptr)
        return 0;
    LResult result = 0;
    if (!w->object->OnMessage(message, wParam, lParam, result))
        return 0;
    return result;
}

void HeadlessHost::PostQuit(int exitCode)
{
    {
        std::lock_guard<std::mutex> lock(mutex_);
        if (!quit_)
            exitCode_ = exitCode;
        quit_ = true;
    }
    queued_.notify_all();
}

bool HeadlessHost::QuitRequested()
{
    std::lock_guard<std::mutex> lock(mutex_);
    return quit_;
}

int HeadlessHost::ExitCode()
{
    std::lock_guard<std::mutex> lock(mutex_);
    return exitCode_;
}

std::size_t HeadlessHost::QueuedMessages()
{
    std::lock_guard<std::mutex> lock(mutex_);
    return queue_.size();
}

bool HeadlessHost::takeMessage(Posted& posted)
{
    std::lock_guard<std::mutex> lock(mutex_);
    if (queue_.empty())
        return false;
    posted = queue_.front();
    queue_.pop_front();
    return true;
}

void HeadlessHost::dispatch(const Posted& posted)
{
    // A window destroyed meanwhile had its messages handed back already; this guards only
    // against a handle that never existed.
    SendMessage(posted.window, posted.message, posted.wParam, posted.lParam);
}

int HeadlessHost::DispatchPending()
{
    int count = 0;
    Posted posted{};
    while (takeMessage(posted)) {
        dispatch(posted);
        ++count;
    }
    return count;
}

bool HeadlessHost::WaitForMessage(int timeoutMs)
{
    std::unique_lock<std::mutex> lock(mutex_);
    return queued_.wait_for(lock, std::chrono::milliseconds(timeoutMs < 0 ? 0 : timeoutMs),
                            [this] { return !queue_.empty() || quit_; });
}

bool HeadlessHost::PumpMessage()
{
    for (;;) {
        Posted posted{};
        if (takeMessage(posted)) {
            dispatch(posted);
            return true;
        }
        // As with a real queue, the quit request is seen once the posted messages are gone,
        // and it stays pending for the outer loop.
        if (QuitRequested())
            return false;
        if (idle_ && idle_())
            return true;
        std::unique_lock<std::mutex> lock(mutex_);
        queued_.wait(lock, [this] { return !queue_.empty() || quit_; });
    }
}

int HeadlessHost::RunMessageLoop()
{
    while (PumpMessage()) {
    }
    return ExitCode();
}

// --- controls ---------------------------------------------------------------------------

void HeadlessHost::SetControlText(WindowHandle dialog, int id, const char* text)
{
    Control* c = control(dialog, id);
    if (c == nullptr)
        return;
    c->text = text ? text : "";
    c->selStart = c->selEnd = 0;
    if (c->style & StyleReadOnly) {
        emit({HeadlessEvent::Kind::Status, std::to_string(id), c->text});
    }
}

std::uint32_t HeadlessHost::GetControlText(WindowHandle dialog, int id, char* buffer,
                                           std::uint32_t size)
{
    if (buffer == nullptr || size == 0)
        return 0;
    const Control* c = control(dialog, id);
    std::uint32_t n = 0;
    if (c != nullptr) {
        // Cut to the buffer, terminator included.
        n = static_cast<std::uint32_t>(c->text.size() < size - 1 ? c->text.size() : size - 1);
        std::memcpy(buffer, c->text.data(), n);
    }
    buffer[n] = '\0';
    return n;
}

std::uint32_t HeadlessHost::GetControlTextLength(WindowHandle dialog, int id)
{
    const Control* c = control(dialog, id);
    return c ? static_cast<std::uint32_t>(c->text.size()) : 0;
}

std::string HeadlessHost::ControlText(WindowHandle dialog, int id) const
{
    const Control* c = control(dialog, id);
    return c ? c->text : std::string();
}

void HeadlessHost::SetCheck(WindowHandle dialog, int id, bool checked)
{
    if (Control* c = control(dialog, id))
        c->checked = checked;
}

bool HeadlessHost::IsChecked(WindowHandle dialog, int id)
{
    const Control* c = control(dialog, id);
    return c != nullptr && c->checked;
}

void HeadlessHost::EnableControl(WindowHandle dialog, int id, bool enabled)
{
    if (Control* c = control(dialog, id))
        c->enabled = enabled;
}

bool HeadlessHost::IsControlEnabled(WindowHandle dialog, int id)
{
    const Control* c = control(dialog, id);
    return c != nullptr && c->enabled;
}

void HeadlessHost::ShowControl(WindowHandle dialog, int id, bool visible)
{
    if (Control* c = control(dialog, id))
        c->visible = visible;
}

bool HeadlessHost::IsControlVisible(WindowHandle dialog, int id)
{
    const Control* c = control(dialog, id);
    return c != nullptr && c->visible;
}

int HeadlessHost::ListAdd(WindowHandle dialog, int id, const char* text)
{
    Control* c = control(dialog, id);
    if (c == nullptr)
        return -1;
    c->entries.emplace_back(text ? text : "");
    return static_cast<int>(c->entries.size()) - 1;
}

void HeadlessHost::ListSelect(WindowHandle dialog, int id, int index)
{
    Control* c = control(dialog, id);
    if (c == nullptr)
        return;
    c->selection = index >= 0 && index < static_cast<int>(c->entries.size()) ? index : -1;
}

int HeadlessHost::ListSelection(WindowHandle dialog, int id)
{
    const Control* c = control(dialog, id);
    return c ? c->selection : -1;
}

int HeadlessHost::ListCount(WindowHandle dialog, int id)
{
    const Control* c = control(dialog, id);
    return c ? static_cast<int>(c->entries.size()) : 0;
}

std::string HeadlessHost::ListEntry(WindowHandle dialog, int id, int index) const
{
    const Control* c = control(dialog, id);
    if (c == nullptr || index < 0 || index >= static_cast<int>(c->entries.size()))
        return {};
    return c->entries[index];
}

void HeadlessHost::SetEditSelection(WindowHandle dialog, int id, std::int32_t start,
                                    std::int32_t end)
{
    Control* c = control(dialog, id);
    if (c == nullptr)
        return;
    const auto length = static_cast<std::int64_t>(c->text.size());
    auto clamp = [length](std::int32_t v) {
        // As EM_SETSEL: -1 (or any offset past the end) means the end.
        return static_cast<std::int32_t>(v < 0 || v > length ? length : v);
    };
    c->selStart = clamp(start);
    c->selEnd = clamp(end);
}

void HeadlessHost::GetEditSelection(WindowHandle dialog, int id, std::int32_t* start,
                                    std::int32_t* end)
{
    const Control* c = control(dialog, id);
    if (start)
        *start = c ? c->selStart : 0;
    if (end)
        *end = c ? c->selEnd : 0;
}

void HeadlessHost::SetFocus(WindowHandle dialog, int id)
{
    Window* w = find(dialog);
    if (w != nullptr && w->controls.count(id) != 0)
        w->focus = id;
}

int HeadlessHost::FocusedControl(WindowHandle dialog)
{
    const Window* w = find(dialog);
    return w ? w->focus : 0;
}

bool HeadlessHost::Click(WindowHandle dialog, int id)
{
    Window* w = find(dialog);
    if (w == nullptr)
        return false;
    auto it = w->controls.find(id);
    if (it == w->controls.end()) {
        if (w->menuIds.count(id) == 0)
            return false;
    } else {
        Control& c = it->second;
        if (!c.enabled)
            return false;
        if (c.kind == ControlKind::CheckBox) {
            c.checked = !c.checked;
        } else if (c.kind == ControlKind::RadioButton) {
            // An automatic radio button unchecks the others of its group: the run of radio
            // buttons from a group start up to the next one.
            std::size_t first = 0;
            for (std::size_t i = 0; i < w->radioOrder.size(); ++i) {
                if (w->radioGroupStart[w->radioOrder[i]])
                    first = i;
                if (w->radioOrder[i] == id)
                    break;
            }
            for (std::size_t i = first; i < w->radioOrder.size(); ++i) {
                if (i > first && w->radioGroupStart[w->radioOrder[i]])
                    break;
                w->controls[w->radioOrder[i]].checked = false;
            }
            c.checked = true;
        }
    }
    SendMessage(dialog, kMsgCommand, MakeCommand(id), 0);
    return true;
}

// --- interaction ------------------------------------------------------------------------

bool HeadlessHost::answerQuestion(const char* text)
{
    if (!answers_.empty()) {
        const bool yes = answers_.front();
        answers_.pop_front();
        return yes;
    }
    if (!choice_.empty())
        return choice_ == (text ? text : "");
    return defaultAnswer_;
}

bool HeadlessHost::AskYesNo(WindowHandle owner, const char* text, const char* caption)
{
    const bool yes = answerQuestion(text);
    emit({HeadlessEvent::Kind::Question, caption ? caption : "", text ? text : "", yes});
    return yes;
}

void HeadlessHost::ShowMessage(WindowHandle owner, const char* text, const char* caption)
{
    emit({HeadlessEvent::Kind::MessageBox, caption ? caption : "", text ? text : ""});
}

bool HeadlessHost::chooseFile(const FileDialogRequest& request, HeadlessEvent::Kind kind)
{
    std::string name;
    bool chosen = false;
    if (!fileNames_.empty()) {
        name = fileNames_.front();
        fileNames_.pop_front();
        chosen = true;
    } else if (!choice_.empty()) {
        name = choice_;
        chosen = true;
    }
    if (chosen && request.path != nullptr && request.size > 0) {
        // Cut to the caller's buffer, terminator included, as the system dialog would.
        const std::size_t n = name.size() < request.size - 1 ? name.size() : request.size - 1;
        std::memcpy(request.path, name.data(), n);
        request.path[n] = '\0';
    } else {
        chosen = false;
    }
    emit({kind, "", chosen ? name : std::string(), chosen});
    return chosen;
}

bool HeadlessHost::ChooseOpenFile(const FileDialogRequest& request)
{
    return chooseFile(request, HeadlessEvent::Kind::OpenFile);
}

bool HeadlessHost::ChooseSaveFile(const FileDialogRequest& request)
{
    return chooseFile(request, HeadlessEvent::Kind::SaveFile);
}

void HeadlessHost::Beep()
{
    emit({HeadlessEvent::Kind::Beep, "", ""});
}

std::uint32_t HeadlessHost::TickCount()
{
    if (ticksFixed_)
        return fixedTicks_;
    return static_cast<std::uint32_t>(SteadyMilliseconds() - startTicks_);
}

} // namespace ui
