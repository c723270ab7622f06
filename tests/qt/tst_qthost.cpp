// The Qt host as the window layer: posting from other threads, the loop and the nested pump,
// destruction with messages queued, and controls addressed by id with their texts kept byte
// for byte.
#include <QAbstractButton>
#include <QApplication>
#include <QMessageBox>
#include <QPlainTextEdit>
#include <QTest>
#include <QTimer>

#include <cstring>
#include <memory>
#include <thread>
#include <vector>

#include "Support.h"
#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/QtHost.h"

using qt_test::RecordingObject;

namespace {

constexpr ui::Message kTestMessage = ui::kMsgUser + 7;

std::string Text(ui::QtHost& host, ui::WindowHandle window, int id, std::uint32_t size = 4096)
{
    std::vector<char> buffer(size);
    return std::string(buffer.data(), host.GetControlText(window, id, buffer.data(), size));
}

} // namespace

class tst_QtHost : public QObject {
    Q_OBJECT

private slots:
    void init();
    void cleanup();
    void postFromOtherThreadsArrivesInOrder();
    void destroyHandsQueuedMessagesBack();
    void quitEndsNestedPumpAndLoop();
    void textRoundTrip_data();
    void textRoundTrip();
    void typedTextAsBytes();
    void selectionInBytes_data();
    void selectionInBytes();
    void listsAndChecks();
    void answerer();

private:
    QPlainTextEdit* editor() const
    {
        return qobject_cast<QPlainTextEdit*>(host_->dialogWindow(dialog_)->control(1015));
    }

    std::unique_ptr<ui::QtHost> host_;
    std::unique_ptr<RecordingObject> object_;
    ui::WindowHandle dialog_ = ui::kNoWindow; // the test client's window, made for each test
};

void tst_QtHost::init()
{
    host_ = std::make_unique<ui::QtHost>("");
    object_ = std::make_unique<RecordingObject>();
    dialog_ = host_->CreateDialogWindow(ui::TestClientDialogTemplate(), object_.get());
    QVERIFY(dialog_ != ui::kNoWindow);
    QCOMPARE(object_->handle(), dialog_);
    QCOMPARE(object_->count(ui::kMsgInitDialog), 1);
}

// Every test ends by destroying the dialog window, which its object hears of once.
void tst_QtHost::cleanup()
{
    host_->DestroyWindow(dialog_);
    QCOMPARE(object_->handle(), ui::kNoWindow);
    QCOMPARE(object_->count(ui::kMsgDestroy), 1);
    QVERIFY(!host_->WindowExists(dialog_));
    host_.reset();
}

void tst_QtHost::postFromOtherThreadsArrivesInOrder()
{
    RecordingObject object;
    const ui::WindowHandle window = host_->CreatePlainWindow("test", &object);
    constexpr int kPerThread = 200;
    std::vector<std::thread> threads;
    for (int t = 0; t < 3; ++t) {
        threads.emplace_back([this, window, t] {
            for (int i = 0; i < kPerThread; ++i)
                host_->PostMessage(window, kTestMessage, ui::WParam(t), ui::LParam(i));
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    QTRY_COMPARE(object.count(kTestMessage), 3 * kPerThread);
    int next[3] = {0, 0, 0};
    for (const RecordingObject::Received& r : object.received) {
        if (r.message == kTestMessage)
            QCOMPARE(r.lParam, ui::LParam(next[r.wParam]++));
    }
    QCOMPARE(host_->QueuedMessages(), std::size_t(0));
    host_->DestroyWindow(window);
}

void tst_QtHost::destroyHandsQueuedMessagesBack()
{
    RecordingObject first;
    RecordingObject second;
    const ui::WindowHandle a = host_->CreatePlainWindow("a", &first);
    const ui::WindowHandle b = host_->CreatePlainWindow("b", &second);
    QVERIFY(host_->PostMessage(a, kTestMessage, 1, 11));
    QVERIFY(host_->PostMessage(b, kTestMessage, 2, 22));
    QVERIFY(host_->PostMessage(a, kTestMessage, 3, 33));
    host_->DestroyWindow(a);
    // The destroyed window's messages come back to its object, never to a handler.
    QCOMPARE(first.undelivered.size(), std::size_t(2));
    QCOMPARE(first.undelivered[0].lParam, ui::LParam(11));
    QCOMPARE(first.undelivered[1].lParam, ui::LParam(33));
    QTRY_COMPARE(second.count(kTestMessage), 1);
    QTest::qWait(0);
    QCOMPARE(first.count(kTestMessage), 0);
    host_->DestroyWindow(b);
}

void tst_QtHost::quitEndsNestedPumpAndLoop()
{
    std::thread([this] { host_->PostMessage(dialog_, kTestMessage, 0, 5); }).join();
    while (object_->count(kTestMessage) == 0)
        QVERIFY(host_->PumpMessage());
    std::thread([this] { host_->PostQuit(7); }).join();
    // The nested pump dispatches nothing and leaves the request to the outer loop, which
    // ends at once with the first request's code.
    QVERIFY(!host_->PumpMessage());
    host_->PostQuit(3);
    QCOMPARE(host_->RunMessageLoop(), 7);
}

void tst_QtHost::textRoundTrip_data()
{
    QTest::addColumn<int>("id");
    QTest::addColumn<QByteArray>("bytes");
    QTest::addColumn<int>("lines");

    QTest::newRow("editor LF") << 1015 << QByteArray("task main\n{\n}\n") << 4;
    QTest::newRow("editor CR LF") << 1015 << QByteArray("task main\r\n{\r\n}\r\n") << 4;
    QTest::newRow("editor UTF-8") << 1015 << QByteArray("// Gr\xc3\xbc\xc3\x9f\nx") << 2;
    QTest::newRow("editor Latin-1") << 1015 << QByteArray("// Gr\xfc\xdf\r\nx") << 2;
    QTest::newRow("editor no-break space") << 1015 << QByteArray("a\xc2\xa0z") << 1;
    QTest::newRow("editor empty") << 1015 << QByteArray("") << 1;
    QTest::newRow("status CR LF") << 1003 << QByteArray("Brick: Onyx2\r\nPort: USB") << 2;
    QTest::newRow("edit 213") << 213 << QByteArray("/tmp/prog.onyx2") << 1;
}

void tst_QtHost::textRoundTrip()
{
    QFETCH(int, id);
    QFETCH(QByteArray, bytes);
    QFETCH(int, lines);

    host_->SetControlText(dialog_, id, bytes.constData());
    QCOMPARE(QByteArray::fromStdString(Text(*host_, dialog_, id)), bytes);
    QCOMPARE(host_->GetControlTextLength(dialog_, id), std::uint32_t(bytes.size()));
    if (auto* edit = qobject_cast<QPlainTextEdit*>(host_->dialogWindow(dialog_)->control(id))) {
        // CR LF shows as line breaks, not as stray characters.
        QCOMPARE(edit->blockCount(), lines);
        QVERIFY(!edit->toPlainText().contains(QLatin1Char('\r')));
    }
    // A short buffer gets the text cut, terminated, and nothing past it written.
    host_->SetControlText(dialog_, id, "0123456789");
    char buffer[8];
    std::memset(buffer, 'x', sizeof buffer);
    QCOMPARE(host_->GetControlText(dialog_, id, buffer, 5), std::uint32_t(4));
    QCOMPARE(QByteArray(buffer), QByteArray("0123"));
    QCOMPARE(buffer[5], 'x');
    QCOMPARE(host_->GetControlText(dialog_, id, buffer, 0), std::uint32_t(0));
    QCOMPARE(host_->GetControlText(dialog_, 4711, buffer, sizeof buffer), std::uint32_t(0));
    QCOMPARE(buffer[0], '\0');
}

// What the editor holds after typing, as the dialog reads it: document breaks as the text's
// own line ends, long lines and short ones alike; a character the text's encoding cannot
// hold as '?'. A length query followed by an edit never hands out the text it measured.
void tst_QtHost::typedTextAsBytes()
{
    const auto read = [this] {
        const std::uint32_t length = host_->GetControlTextLength(dialog_, 1015);
        const QByteArray bytes = QByteArray::fromStdString(Text(*host_, dialog_, 1015, 1 << 16));
        return length == std::uint32_t(bytes.size()) ? bytes : QByteArray("length differs");
    };

    host_->SetControlText(dialog_, 1015, "task main\r\n");
    editor()->moveCursor(QTextCursor::End);
    const QString line = QStringLiteral("a long line of script text, well past a few characters");
    editor()->insertPlainText(line + QChar(QChar::LineSeparator) + QStringLiteral("x\ny") +
                              QChar(QChar::ParagraphSeparator) +
                              QStringLiteral("\u00e9\U0001F600"));
    QCOMPARE(read(), "task main\r\n" + line.toUtf8() + "\r\nx\r\ny\r\n\xc3\xa9\xf0\x9f\x98\x80");

    host_->SetControlText(dialog_, 1015, "Gr\xfc\xdf\n"); // not UTF-8: one byte a character
    editor()->moveCursor(QTextCursor::End);
    editor()->insertPlainText(QStringLiteral("\u00e9\u20ac"));
    QCOMPARE(read(), QByteArray("Gr\xfc\xdf\n\xe9?"));

    host_->SetControlText(dialog_, 1015, "measured");
    QCOMPARE(host_->GetControlTextLength(dialog_, 1015), std::uint32_t(8));
    editor()->moveCursor(QTextCursor::End);
    editor()->insertPlainText(QStringLiteral(" then typed"));
    QCOMPARE(QByteArray::fromStdString(Text(*host_, dialog_, 1015)),
             QByteArray("measured then typed"));
    QCOMPARE(host_->GetControlTextLength(dialog_, 1015), std::uint32_t(19));
    host_->SetControlText(dialog_, 1015, "set anew");
    QCOMPARE(QByteArray::fromStdString(Text(*host_, dialog_, 1015)), QByteArray("set anew"));
}

void tst_QtHost::selectionInBytes_data()
{
    QTest::addColumn<QByteArray>("bytes");
    QTest::addColumn<int>("offset");
    QTest::addColumn<QString>("before");

    // Offsets count bytes of the text as the dialog reads it, as a translation error's do.
    QTest::newRow("LF") << QByteArray("ab\ncd") << 4 << "ab\nc";
    QTest::newRow("CR LF") << QByteArray("ab\r\ncd") << 5 << "ab\nc";
    QTest::newRow("UTF-8") << QByteArray("\xc3\xa4\xc3\xb6x") << 4
                           << QString::fromUtf8("\xc3\xa4\xc3\xb6");
    QTest::newRow("Latin-1") << QByteArray("\xe4\xf6x") << 2 << QString::fromLatin1("\xe4\xf6");
    QTest::newRow("past the end") << QByteArray("abc") << 99 << "abc";
    QTest::newRow("minus one is the end") << QByteArray("abc") << -1 << "abc";
}

void tst_QtHost::selectionInBytes()
{
    QFETCH(QByteArray, bytes);
    QFETCH(int, offset);
    QFETCH(QString, before);

    host_->SetControlText(dialog_, 1015, bytes.constData());
    host_->SetEditSelection(dialog_, 1015, offset, offset);
    QCOMPARE(editor()->textCursor().position(), int(before.size()));
    QVERIFY(!editor()->textCursor().hasSelection());
    std::int32_t start = -5;
    std::int32_t end = -5;
    host_->GetEditSelection(dialog_, 1015, &start, &end);
    const std::int32_t expected = offset < 0 || offset > bytes.size() ? bytes.size() : offset;
    QCOMPARE(start, expected);
    QCOMPARE(end, expected);
}

void tst_QtHost::listsAndChecks()
{
    QCOMPARE(host_->ListAdd(dialog_, 208, "Rover"), 0);
    QCOMPARE(host_->ListAdd(dialog_, 208, "Onyx2"), 1);
    QCOMPARE(host_->ListCount(dialog_, 208), 2);
    // Unlike a Qt combo box, a drop-down list selects nothing by itself.
    QCOMPARE(host_->ListSelection(dialog_, 208), -1);
    host_->ListSelect(dialog_, 208, 1);
    QCOMPARE(QByteArray::fromStdString(Text(*host_, dialog_, 208)), QByteArray("Onyx2"));
    host_->ListSelect(dialog_, 208, 5);
    QCOMPARE(host_->ListSelection(dialog_, 208), -1);
    QCOMPARE(host_->ListAdd(dialog_, 4711, "x"), -1);

    host_->SetCheck(dialog_, 219, true);
    host_->SetCheck(dialog_, 220, true);
    QVERIFY(!host_->IsChecked(dialog_, 219) && host_->IsChecked(dialog_, 220));
    // The dialog may clear a group altogether, which a user cannot.
    host_->SetCheck(dialog_, 220, false);
    for (int id : {218, 219, 220})
        QVERIFY(!host_->IsChecked(dialog_, id));
    host_->SetCheck(dialog_, 210, true);
    QVERIFY(host_->IsChecked(dialog_, 210));
}

void tst_QtHost::answerer()
{
    qt_test::ScriptedAnswerer answerer;
    host_->SetAnswerer(&answerer);
    char path[16] = "keep";
    ui::FileDialogRequest request;
    request.path = path;
    request.size = sizeof path;
    answerer.QueueFile(QStringLiteral("/tmp/0123456789")); // 15 bytes and the terminator
    QVERIFY(host_->ChooseOpenFile(request));
    QCOMPARE(QByteArray(path), QByteArray("/tmp/0123456789"));
    std::strcpy(path, "keep");
    // Cut, it would name another file; cancelled, there is none.
    answerer.QueueFile(QStringLiteral("/tmp/0123456789a"));
    QVERIFY(!host_->ChooseOpenFile(request));
    QVERIFY(!host_->ChooseSaveFile(request));
    QCOMPARE(QByteArray(path), QByteArray("keep"));
    QCOMPARE(answerer.fileDialogs.back().kind, ui::Answerer::FileDialogKind::Save);
    QCOMPARE(answerer.fileDialogs.back().initialName, QStringLiteral("keep"));

    // Without an injected answerer the real modal box asks; a timer presses No.
    host_->SetAnswerer(nullptr);
    host_->ShowWindow(dialog_);
    QString text;
    QWidget* owner = nullptr;
    QTimer timer;
    connect(&timer, &QTimer::timeout, this, [&] {
        if (auto* box = qobject_cast<QMessageBox*>(QApplication::activeModalWidget())) {
            text = box->text();
            owner = box->parentWidget();
            box->button(QMessageBox::No)->click();
        }
    });
    timer.start(10);
    QVERIFY(!host_->AskYesNo(dialog_, "Status: no tower.\r\nUse Trouble Shooter?", "Diagnostics"));
    QCOMPARE(text, QStringLiteral("Status: no tower.\nUse Trouble Shooter?"));
    QCOMPARE(owner, static_cast<QWidget*>(host_->dialogWindow(dialog_)));
}

QTEST_MAIN(tst_QtHost)
#include "tst_qthost.moc"
