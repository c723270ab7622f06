#include "ui/qt/QtHost.h"

#include <QAbstractButton>
#include <QApplication>
#include <QButtonGroup>
#include <QComboBox>
#include <QCoreApplication>
#include <QEvent>
#include <QEventLoop>
#include <QFile>
#include <QLabel>
#include <QLineEdit>
#include <QPlainTextEdit>
#include <QScreen>
#include <QTextBlock>
#include <QTextCursor>
#include <QTextDocument>
#include <QTimer>

#include <chrono>
#include <cstdio>
#include <cstring>

#include "troubleshooter/HelpLink.h"
#include "ui/TestClientDialog.h"
#include "ui/qt/Answerer.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/FontWarmUp.h"
#include "ui/qt/QtHelpViewer.h"

namespace ui {

namespace {

QEvent::Type WakeEventType()
{
    static const auto type = static_cast<QEvent::Type>(QEvent::registerEventType());
    return type;
}

QEvent::Type QuitEventType()
{
    static const auto type = static_cast<QEvent::Type>(QEvent::registerEventType());
    return type;
}

QString FromBytes(const char* text)
{
    EditEncoding ignored;
    return DecodeEditText(QByteArray(text ? text : ""), ignored);
}

// A filter of the file dialogs in Qt's form. "*.*" means every file, as it does on the
// system the patterns come from; here it would skip names without a dot.
QString QtNameFilter(const FileFilter& filter)
{
    QString patterns = QString::fromUtf8(filter.pattern ? filter.pattern : "");
    patterns.replace(QLatin1Char(';'), QLatin1Char(' '));
    QStringList list = patterns.split(QLatin1Char(' '), Qt::SkipEmptyParts);
    for (QString& pattern : list) {
        if (pattern == QLatin1String("*.*"))
            pattern = QStringLiteral("*");
    }
    return QStringLiteral("%1 (%2)").arg(
        QString::fromUtf8(filter.description ? filter.description : ""),
        list.join(QLatin1Char(' ')));
}

// The text of a multi-line edit, every character kept, line breaks as line feeds.
QString PlainEditText(const QPlainTextEdit* edit)
{
    return PlainLines(edit->document()->toRawText());
}

} // namespace

// Receives the wake-up and quit events on the loop's thread.
class QtHost::Receiver final : public QObject {
public:
    explicit Receiver(QtHost& host) : host_(host) {}

protected:
    void customEvent(QEvent* event) override
    {
        if (event->type() == WakeEventType())
            host_.dispatchNext();
        else if (event->type() == QuitEventType())
            host_.endLoops();
    }

private:
    QtHost& host_;
};

QtHost::QtHost(const std::string& helpDirectory)
    : receiver_(std::make_unique<Receiver>(*this)),
      systemAnswerer_(std::make_unique<SystemAnswerer>()), answerer_(systemAnswerer_.get()),
      helpViewer_(std::make_unique<QtHelpViewer>(*this, helpDirectory))
{
}

QtHost::~QtHost()
{
    // Dialog objects normally destroy their windows first; whatever is left goes now,
    // before the application.
    while (!windows_.empty())
        DestroyWindow(windows_.begin()->first);
    for (const QPointer<QObject>& object : doomed_)
        delete object.data();
    doomed_.clear();
    helpViewer_.reset();
    receiver_.reset();
    application_.reset();
}

void QtHost::AdoptApplication(std::unique_ptr<QApplication> application)
{
    application_ = std::move(application);
}

void QtHost::AdoptFontWarmUp(std::unique_ptr<FontWarmUp> warmUp)
{
    fontWarmUp_ = std::move(warmUp);
}

void QtHost::SetAnswerer(Answerer* answerer)
{
    answerer_ = answerer != nullptr ? answerer : systemAnswerer_.get();
}

QtHost::Window* QtHost::find(WindowHandle window)
{
    auto it = windows_.find(window);
    return it == windows_.end() ? nullptr : &it->second;
}

const QtHost::Window* QtHost::find(WindowHandle window) const
{
    auto it = windows_.find(window);
    return it == windows_.end() ? nullptr : &it->second;
}

QWidget* QtHost::control(WindowHandle dialog, int id) const
{
    const Window* w = find(dialog);
    if (w == nullptr || w->dialog.isNull())
        return nullptr;
    return w->dialog->control(id);
}

QWidget* QtHost::ownerWidget(WindowHandle owner) const
{
    const Window* w = find(owner);
    return w != nullptr ? w->dialog.data() : nullptr;
}

DialogWindow* QtHost::dialogWindow(WindowHandle window) const
{
    const Window* w = find(window);
    return w != nullptr ? w->dialog.data() : nullptr;
}

WindowHandle QtHost::FindWindowOfClass(const char* className) const
{
    const QString name = QString::fromUtf8(className ? className : "");
    for (const auto& [handle, window] : windows_) {
        if (!window.plain.isNull() && window.plain->objectName() == name)
            return handle;
    }
    return kNoWindow;
}

bool QtHost::WindowExists(WindowHandle window) const
{
    return find(window) != nullptr;
}

// --- windows ----------------------------------------------------------------------------

WindowHandle QtHost::CreateDialogWindow(const DialogTemplate& layout, WindowObject* object)
{
    if (object == nullptr)
        return kNoWindow;
    const WindowHandle handle = nextHandle_++;
    Window& window = windows_[handle];
    window.object = object;
    fontWarmUp_.reset(); // waits for the font configuration before any text is measured
    window.dialog = new DialogWindow(layout);
    QObject::connect(window.dialog.data(), &DialogWindow::commandIssued, receiver_.get(),
                     [this, handle](int id) { onDialogCommand(handle, id); });
    {
        std::lock_guard<std::mutex> lock(mutex_);
        live_.insert(handle);
    }
    object->AttachWindow(handle);
    // The window program has no other place to hand its help viewer over: the dialog this
    // host shows gets it before its initialisation can run a Trouble Shooter. A dialog that
    // was given a viewer keeps it.
    if (auto* dialog = dynamic_cast<TestClientDialog*>(object)) {
        if (dialog->helpViewer() == nullptr)
            dialog->SetHelpViewer(helpViewer_.get());
    }
    SendMessage(handle, kMsgInitDialog, 0, 0);
    return handle;
}

void QtHost::onDialogCommand(WindowHandle dialog, int id)
{
    // Closing the program while a Trouble Shooter run waits for its help would pull the
    // session from under the run. The help closes first, as its own close command; the
    // exit follows once the run is over and its window is gone.
    if ((id == kIdCancel || id == IdFileExit) &&
        FindWindowOfClass(HelpLink::kWindowClass) != kNoWindow && helpViewer_->IsOpen()) {
        pendingExit_ = {dialog, id};
        helpViewer_->CloseByUser();
        return;
    }
    SendMessage(dialog, kMsgCommand, MakeCommand(id), 0);
}

WindowHandle QtHost::CreatePlainWindow(const char* className, WindowObject* object)
{
    if (object == nullptr)
        return kNoWindow;
    const WindowHandle handle = nextHandle_++;
    Window& window = windows_[handle];
    window.object = object;
    // Never shown and never painted: an object stands for the window.
    window.plain = new QObject(receiver_.get());
    window.plain->setObjectName(QString::fromUtf8(className ? className : ""));
    {
        std::lock_guard<std::mutex> lock(mutex_);
        live_.insert(handle);
    }
    object->AttachWindow(handle);
    return handle;
}

void QtHost::ShowWindow(WindowHandle window)
{
    DialogWindow* dialog = dialogWindow(window);
    if (dialog == nullptr)
        return;
    // Centred on its screen, as the template asks.
    if (QScreen* screen = dialog->screen()) {
        const QRect available = screen->availableGeometry();
        dialog->move(available.center() - QPoint(dialog->width() / 2, dialog->height() / 2));
    }
    dialog->show();
    if (exitWhenShown_) {
        exitWhenShown_ = false;
        // Queued behind the show's expose and first paint.
        QTimer::singleShot(0, receiver_.get(), [this, window] {
            std::fputs("shown\n", stdout);
            std::fflush(stdout);
            onDialogCommand(window, kIdCancel);
        });
    }
}

void QtHost::DestroyWindow(WindowHandle window)
{
    Window* w = find(window);
    if (w == nullptr)
        return;
    RetireWindow(mutex_, live_, queue_, window, *w->object);

    w = find(window);
    if (w != nullptr) {
        if (DialogWindow* dialog = w->dialog.data()) {
            dialog->allowClose();
            dialog->hide();
            // The command that destroys the window may still be running in one of its
            // widgets' signals; the widgets go once control is back in the event loop.
            QObject::disconnect(dialog, nullptr, receiver_.get(), nullptr);
            dialog->deleteLater();
            doomed_.emplace_back(dialog);
        }
        const bool helpWindow =
            !w->plain.isNull() && w->plain->objectName() == QLatin1String(HelpLink::kWindowClass);
        delete w->plain.data();
        windows_.erase(window);
        if (helpWindow && pendingExit_.dialog != kNoWindow) {
            // The run is over: the exit the user asked for goes ahead from the event loop.
            PostMessage(pendingExit_.dialog, kMsgCommand, MakeCommand(pendingExit_.id), 0);
            pendingExit_ = {};
        }
    }
}

void QtHost::SetWindowTitle(WindowHandle window, const char* title)
{
    if (DialogWindow* dialog = dialogWindow(window))
        dialog->setWindowTitle(FromBytes(title));
}

void QtHost::Repaint(WindowHandle window)
{
    if (DialogWindow* dialog = dialogWindow(window)) {
        if (dialog->isVisible())
            dialog->repaint();
    }
}

// --- messages ---------------------------------------------------------------------------

bool QtHost::PostMessage(WindowHandle window, Message message, WParam wParam, LParam lParam)
{
    {
        std::lock_guard<std::mutex> lock(mutex_);
        if (live_.count(window) == 0)
            return false;
        queue_.push_back({window, message, wParam, lParam});
    }
    // Qt's queue is thread-safe and keeps the order of the wake-ups; each one takes the
    // oldest message of ours.
    QCoreApplication::postEvent(receiver_.get(), new QEvent(WakeEventType()));
    return true;
}

LResult QtHost::SendMessage(WindowHandle window, Message message, WParam wParam, LParam lParam)
{
    Window* w = find(window);
    if (w == nullptr)
        return 0;
    // The handler may create or destroy windows: only the object is used from here on.
    WindowObject* object = w->object;
    LResult result = 0;
    if (!object->OnMessage(message, wParam, lParam, result))
        return 0;
    return result;
}

void QtHost::dispatchNext()
{
    Posted posted{};
    {
        std::lock_guard<std::mutex> lock(mutex_);
        // A destroyed window's messages were taken out already; their wake-ups find less
        // to do, and one of them may find nothing.
        if (queue_.empty())
            return;
        posted = queue_.front();
        queue_.pop_front();
    }
    SendMessage(posted.window, posted.message, posted.wParam, posted.lParam);
}

void QtHost::PostQuit(int exitCode)
{
    {
        std::lock_guard<std::mutex> lock(mutex_);
        if (!quit_)
            exitCode_ = exitCode;
        quit_ = true;
    }
    QCoreApplication::postEvent(receiver_.get(), new QEvent(QuitEventType()));
}

void QtHost::endLoops()
{
    for (QEventLoop* loop : loops_)
        loop->exit(ExitCode());
}

bool QtHost::QuitRequested() const
{
    std::lock_guard<std::mutex> lock(mutex_);
    return quit_;
}

int QtHost::ExitCode() const
{
    std::lock_guard<std::mutex> lock(mutex_);
    return exitCode_;
}

std::size_t QtHost::QueuedMessages() const
{
    std::lock_guard<std::mutex> lock(mutex_);
    return queue_.size();
}

int QtHost::RunMessageLoop()
{
    // Something else than our quit request (a platform's session end, say) may end a loop;
    // only the quit request ends this one.
    while (!QuitRequested()) {
        QEventLoop loop;
        loops_.push_back(&loop);
        loop.exec();
        loops_.pop_back();
    }
    // Widgets of destroyed windows were waiting for the loop.
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    return ExitCode();
}

bool QtHost::PumpMessage()
{
    if (QuitRequested())
        return false;
    // Waits for the next event and handles what is there; window input, posted messages
    // and the help viewer's links all arrive this way.
    QCoreApplication::processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents);
    return !QuitRequested();
}

// --- controls ---------------------------------------------------------------------------

void QtHost::SetControlText(WindowHandle dialog, int id, const char* text)
{
    QWidget* widget = control(dialog, id);
    if (widget == nullptr)
        return;
    EditEncoding encoding;
    const QString value = DecodeEditText(QByteArray(text ? text : ""), encoding);
    find(dialog)->encodings.insert(id, encoding);
    // The same characters may now be written in another encoding, whether or not the
    // document sees a change.
    measured_.Drop();
    if (auto* edit = qobject_cast<QPlainTextEdit*>(widget)) {
        edit->setPlainText(value);
    } else if (auto* line = qobject_cast<QLineEdit*>(widget)) {
        line->setText(value);
    } else if (auto* button = qobject_cast<QAbstractButton*>(widget)) {
        button->setText(value);
    } else if (auto* label = qobject_cast<QLabel*>(widget)) {
        label->setText(value);
    }
}

QByteArray QtHost::controlBytes(WindowHandle dialog, int id)
{
    QWidget* widget = control(dialog, id);
    if (widget == nullptr)
        return {};
    const EditEncoding encoding = find(dialog)->encodings.value(id);
    // The document's raw text keeps every character; its breaks are written in the same pass.
    if (auto* edit = qobject_cast<QPlainTextEdit*>(widget)) {
        QByteArray bytes;
        if (!measured_.Take(edit->document(), bytes))
            bytes = EncodeEditText(edit->document()->toRawText(), encoding, true);
        return bytes;
    }
    QString value;
    if (auto* line = qobject_cast<QLineEdit*>(widget))
        value = line->text();
    else if (auto* button = qobject_cast<QAbstractButton*>(widget))
        value = button->text();
    else if (auto* list = qobject_cast<QComboBox*>(widget))
        value = list->currentText();
    else if (auto* label = qobject_cast<QLabel*>(widget))
        value = label->text();
    return EncodeEditText(value, encoding);
}

std::uint32_t QtHost::GetControlText(WindowHandle dialog, int id, char* buffer, std::uint32_t size)
{
    if (buffer == nullptr || size == 0)
        return 0;
    const QByteArray bytes = controlBytes(dialog, id);
    // Cut to the buffer, terminator included.
    const auto n = static_cast<std::uint32_t>(
        static_cast<std::uint64_t>(bytes.size()) < size - 1 ? bytes.size() : size - 1);
    std::memcpy(buffer, bytes.constData(), n);
    buffer[n] = '\0';
    return n;
}

std::uint32_t QtHost::GetControlTextLength(WindowHandle dialog, int id)
{
    QByteArray bytes = controlBytes(dialog, id);
    const auto length = static_cast<std::uint32_t>(bytes.size());
    if (auto* edit = qobject_cast<QPlainTextEdit*>(control(dialog, id)))
        measured_.Keep(edit->document(), std::move(bytes));
    return length;
}

void QtHost::SetCheck(WindowHandle dialog, int id, bool checked)
{
    auto* button = qobject_cast<QAbstractButton*>(control(dialog, id));
    if (button == nullptr || !button->isCheckable())
        return;
    QButtonGroup* group = button->group();
    // An exclusive group refuses to uncheck its checked button; the dialog may do it.
    const bool exclusive = group != nullptr && group->exclusive();
    if (exclusive && !checked)
        group->setExclusive(false);
    button->setChecked(checked);
    if (exclusive && !checked)
        group->setExclusive(true);
}

bool QtHost::IsChecked(WindowHandle dialog, int id)
{
    auto* button = qobject_cast<QAbstractButton*>(control(dialog, id));
    return button != nullptr && button->isChecked();
}

void QtHost::EnableControl(WindowHandle dialog, int id, bool enabled)
{
    if (QWidget* widget = control(dialog, id))
        widget->setEnabled(enabled);
}

bool QtHost::IsControlEnabled(WindowHandle dialog, int id)
{
    QWidget* widget = control(dialog, id);
    return widget != nullptr && widget->isEnabled();
}

void QtHost::ShowControl(WindowHandle dialog, int id, bool visible)
{
    if (QWidget* widget = control(dialog, id))
        widget->setHidden(!visible);
}

bool QtHost::IsControlVisible(WindowHandle dialog, int id)
{
    // The control's own visibility, as its visible style: a control of a window that is
    // not shown yet still counts as visible.
    QWidget* widget = control(dialog, id);
    return widget != nullptr && !widget->isHidden();
}

int QtHost::ListAdd(WindowHandle dialog, int id, const char* text)
{
    auto* list = qobject_cast<QComboBox*>(control(dialog, id));
    if (list == nullptr)
        return -1;
    const int wasSelected = list->currentIndex();
    list->addItem(FromBytes(text));
    // A drop-down list selects nothing by itself; Qt would select the first entry.
    if (wasSelected < 0)
        list->setCurrentIndex(-1);
    return list->count() - 1;
}

void QtHost::ListSelect(WindowHandle dialog, int id, int index)
{
    auto* list = qobject_cast<QComboBox*>(control(dialog, id));
    if (list == nullptr)
        return;
    list->setCurrentIndex(index >= 0 && index < list->count() ? index : -1);
}

int QtHost::ListSelection(WindowHandle dialog, int id)
{
    auto* list = qobject_cast<QComboBox*>(control(dialog, id));
    return list != nullptr ? list->currentIndex() : -1;
}

int QtHost::ListCount(WindowHandle dialog, int id)
{
    auto* list = qobject_cast<QComboBox*>(control(dialog, id));
    return list != nullptr ? list->count() : 0;
}

void QtHost::SetEditSelection(WindowHandle dialog, int id, std::int32_t start, std::int32_t end)
{
    QWidget* widget = control(dialog, id);
    if (widget == nullptr)
        return;
    const EditEncoding encoding = find(dialog)->encodings.value(id);
    // As EM_SETSEL: a negative offset means the end of the text.
    auto position = [&encoding](const QString& text, std::int32_t offset) {
        return offset < 0 ? int(text.size()) : PositionOfByteOffset(text, encoding, offset);
    };
    if (auto* edit = qobject_cast<QPlainTextEdit*>(widget)) {
        const QString text = PlainEditText(edit);
        QTextCursor cursor(edit->document());
        cursor.setPosition(position(text, start));
        cursor.setPosition(position(text, end), QTextCursor::KeepAnchor);
        edit->setTextCursor(cursor);
    } else if (auto* line = qobject_cast<QLineEdit*>(widget)) {
        const QString text = line->text();
        const int from = position(text, start);
        line->setSelection(from, position(text, end) - from);
    }
}

void QtHost::GetEditSelection(WindowHandle dialog, int id, std::int32_t* start, std::int32_t* end)
{
    QWidget* widget = control(dialog, id);
    qint64 from = 0;
    qint64 to = 0;
    if (widget != nullptr) {
        const EditEncoding encoding = find(dialog)->encodings.value(id);
        if (auto* edit = qobject_cast<QPlainTextEdit*>(widget)) {
            const QString text = PlainEditText(edit);
            const QTextCursor cursor = edit->textCursor();
            from = ByteOffsetOfPosition(text, encoding, cursor.selectionStart());
            to = ByteOffsetOfPosition(text, encoding, cursor.selectionEnd());
        } else if (auto* line = qobject_cast<QLineEdit*>(widget)) {
            const QString text = line->text();
            const int first =
                line->hasSelectedText() ? line->selectionStart() : line->cursorPosition();
            const int last =
                line->hasSelectedText() ? line->selectionEnd() : line->cursorPosition();
            from = ByteOffsetOfPosition(text, encoding, first);
            to = ByteOffsetOfPosition(text, encoding, last);
        }
    }
    if (start)
        *start = static_cast<std::int32_t>(from);
    if (end)
        *end = static_cast<std::int32_t>(to);
}

void QtHost::SetFocus(WindowHandle dialog, int id)
{
    if (QWidget* widget = control(dialog, id))
        widget->setFocus(Qt::OtherFocusReason);
}

int QtHost::FocusedControl(WindowHandle dialog)
{
    DialogWindow* window = dialogWindow(dialog);
    if (window == nullptr)
        return 0;
    // The last control given the focus, also while the window itself is not active.
    for (QWidget* widget = window->focusWidget(); widget != nullptr && widget != window;
         widget = widget->parentWidget()) {
        const QVariant id = widget->property("controlId");
        if (id.isValid())
            return id.toInt();
    }
    return 0;
}

// --- interaction ------------------------------------------------------------------------

bool QtHost::AskYesNo(WindowHandle owner, const char* text, const char* caption)
{
    return answerer_->AskYesNo(ownerWidget(owner), FromBytes(caption), FromBytes(text));
}

void QtHost::ShowMessage(WindowHandle owner, const char* text, const char* caption)
{
    answerer_->ShowMessage(ownerWidget(owner), FromBytes(caption), FromBytes(text));
}

bool QtHost::chooseFile(const FileDialogRequest& request, bool save)
{
    if (request.path == nullptr || request.size == 0)
        return false;
    QStringList filters;
    for (int i = 0; i < request.filterCount && request.filters != nullptr; ++i)
        filters << QtNameFilter(request.filters[i]);
    const QString initial = QFile::decodeName(QByteArray(request.path));
    const QString chosen = answerer_->ChooseFile(
        ownerWidget(request.owner),
        save ? Answerer::FileDialogKind::Save : Answerer::FileDialogKind::Open, initial, filters);
    if (chosen.isNull())
        return false;
    const QByteArray path = QFile::encodeName(chosen);
    // A name that does not fit is refused, as the system dialog refuses it: cut, it would
    // name another file.
    if (path.isEmpty() || static_cast<std::uint64_t>(path.size()) >= request.size)
        return false;
    std::memcpy(request.path, path.constData(), static_cast<std::size_t>(path.size()));
    request.path[path.size()] = '\0';
    return true;
}

bool QtHost::ChooseOpenFile(const FileDialogRequest& request)
{
    return chooseFile(request, false);
}

bool QtHost::ChooseSaveFile(const FileDialogRequest& request)
{
    return chooseFile(request, true);
}

void QtHost::Beep()
{
    QApplication::beep();
}

std::uint32_t QtHost::TickCount()
{
    using namespace std::chrono;
    // Milliseconds of the monotonic clock, wrapping as a 32-bit tick count does.
    return static_cast<std::uint32_t>(
        duration_cast<milliseconds>(steady_clock::now().time_since_epoch()).count());
}

} // namespace ui
