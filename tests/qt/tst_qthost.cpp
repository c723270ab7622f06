// The Qt host as the window layer: posting from other threads, the message loop and the
// nested pump, window destruction with queued messages, the hidden plain window, controls
// addressed by id with their texts kept byte for byte, and the answerer.
#include <QApplication>
#include <QComboBox>
#include <QLineEdit>
#include <QMessageBox>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QTest>
#include <QTimer>

#include <atomic>
#include <cstring>
#include <thread>
#include <vector>

#include "Support.h"
#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/QtHost.h"

using qt_test::RecordingObject;
using qt_test::ScriptedAnswerer;
using ui::QtHost;

namespace {

constexpr ui::Message kTestMessage = ui::kMsgUser + 7;

std::string Text(QtHost& host, ui::WindowHandle window, int id, std::uint32_t size = 4096)
{
    std::vector<char> buffer(size);
    const std::uint32_t n = host.GetControlText(window, id, buffer.data(), size);
    return std::string(buffer.data(), n);
}

// Presses button of the next modal message box once it is up, and notes its text and owner.
void AnswerNextBox(QMessageBox::StandardButton button, QString* text, QWidget** owner)
{
    auto* timer = new QTimer;
    timer->setInterval(10);
    QObject::connect(timer, &QTimer::timeout, timer, [timer, button, text, owner] {
        auto* box = qobject_cast<QMessageBox*>(QApplication::activeModalWidget());
        if (box == nullptr)
            return;
        *text = box->text();
        *owner = box->parentWidget();
        timer->stop();
        timer->deleteLater();
        box->button(button)->click();
    });
    timer->start();
}

} // namespace

class tst_QtHost : public QObject {
    Q_OBJECT

private slots:
    void dialogGetsInitMessageWithItsHandle();
    void postFromOtherThreadsArrivesInOrder();
    void destroyHandsQueuedMessagesBack();
    void quitEndsNestedPumpAndLoop();
    void textRoundTrip_data();
    void textRoundTrip();
    void textIsCutToTheBuffer();
    void selectionInBytes_data();
    void selectionInBytes();
    void listsStartWithoutSelection();
    void checkAndUncheckRadioButton();
    void fileDialogRefusesPathThatDoesNotFit();
    void realQuestionAnsweredByTimer();
};

void tst_QtHost::dialogGetsInitMessageWithItsHandle()
{
    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window =
        host.CreateDialogWindow(ui::TestClientDialogTemplate(), &object);
    QVERIFY(window != ui::kNoWindow);
    QCOMPARE(object.handle(), window);
    QCOMPARE(object.count(ui::kMsgInitDialog), 1);
    QVERIFY(host.dialogWindow(window) != nullptr);
    host.ShowWindow(window);
    QVERIFY(host.dialogWindow(window)->isVisible());
    host.SetWindowTitle(window, "Tessel Test Client - demo.onyx2");
    QCOMPARE(host.dialogWindow(window)->windowTitle(),
             QStringLiteral("Tessel Test Client - demo.onyx2"));
    host.DestroyWindow(window);
    QCOMPARE(object.handle(), ui::kNoWindow);
    QCOMPARE(object.count(ui::kMsgDestroy), 1);
    QVERIFY(!host.WindowExists(window));
}

void tst_QtHost::postFromOtherThreadsArrivesInOrder()
{
    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window = host.CreatePlainWindow("test", &object);
    constexpr int kPerThread = 200;
    std::vector<std::thread> threads;
    for (int t = 0; t < 3; ++t) {
        threads.emplace_back([&host, window, t] {
            for (int i = 0; i < kPerThread; ++i)
                host.PostMessage(window, kTestMessage, static_cast<ui::WParam>(t),
                                 static_cast<ui::LParam>(i));
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    QTRY_COMPARE(object.count(kTestMessage), 3 * kPerThread);
    // Each thread's messages arrive in the order it posted them.
    int next[3] = {0, 0, 0};
    for (const RecordingObject::Received& r : object.received()) {
        if (r.message != kTestMessage)
            continue;
        QCOMPARE(r.lParam, static_cast<ui::LParam>(next[r.wParam]));
        ++next[r.wParam];
    }
    QCOMPARE(host.QueuedMessages(), std::size_t(0));
    host.DestroyWindow(window);
}

void tst_QtHost::destroyHandsQueuedMessagesBack()
{
    QtHost host("");
    RecordingObject first;
    RecordingObject second;
    const ui::WindowHandle a = host.CreatePlainWindow("a", &first);
    const ui::WindowHandle b = host.CreatePlainWindow("b", &second);
    QVERIFY(host.PostMessage(a, kTestMessage, 1, 11));
    QVERIFY(host.PostMessage(b, kTestMessage, 2, 22));
    QVERIFY(host.PostMessage(a, kTestMessage, 3, 33));
    host.DestroyWindow(a);
    // The destroyed window's messages come back to its object, never to a handler.
    QCOMPARE(first.undelivered().size(), std::size_t(2));
    QCOMPARE(first.undelivered()[0].lParam, ui::LParam(11));
    QCOMPARE(first.undelivered()[1].lParam, ui::LParam(33));
    QTRY_COMPARE(second.count(kTestMessage), 1);
    QTest::qWait(0);
    QCOMPARE(first.count(kTestMessage), 0);
    host.DestroyWindow(b);
}

void tst_QtHost::quitEndsNestedPumpAndLoop()
{
    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window = host.CreatePlainWindow("test", &object);
    std::thread poster([&host, window] { host.PostMessage(window, kTestMessage, 0, 5); });
    poster.join();
    while (object.count(kTestMessage) == 0)
        QVERIFY(host.PumpMessage());
    std::thread quitter([&host] { host.PostQuit(7); });
    quitter.join();
    // The nested pump sees the request and dispatches nothing; the request stays for the
    // outer loop, which ends at once with the first request's code.
    QVERIFY(!host.PumpMessage());
    host.PostQuit(3);
    QCOMPARE(host.RunMessageLoop(), 7);
    host.DestroyWindow(window);
}

void tst_QtHost::textRoundTrip_data()
{
    QTest::addColumn<int>("id");
    QTest::addColumn<QByteArray>("bytes");
    QTest::addColumn<int>("lines");

    QTest::newRow("editor LF") << 1015 << QByteArray("task main\n{\n}\n") << 4;
    QTest::newRow("editor CR LF") << 1015 << QByteArray("task main\r\n{\r\n}\r\n") << 4;
    QTest::newRow("editor UTF-8") << 1015
                                  << QByteArray("// Gr\xc3\xbc\xc3\x9f"
                                                "e\nx")
                                  << 2;
    QTest::newRow("editor Latin-1 bytes") << 1015
                                          << QByteArray("// Gr\xfc\xdf"
                                                        "e\r\nx")
                                          << 2;
    QTest::newRow("editor no-break space") << 1015
                                           << QByteArray("a\xc2\xa0"
                                                         "b")
                                           << 1;
    QTest::newRow("editor empty") << 1015 << QByteArray("") << 1;
    QTest::newRow("status CR LF") << 1003 << QByteArray("Brick: Onyx2\r\nPort: USB") << 2;
    QTest::newRow("edit 213") << 213 << QByteArray("/tmp/prog.onyx2") << 1;
    QTest::newRow("edit 222") << 222 << QByteArray("Onyx2firm.kvo") << 1;
}

void tst_QtHost::textRoundTrip()
{
    QFETCH(int, id);
    QFETCH(QByteArray, bytes);
    QFETCH(int, lines);

    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window =
        host.CreateDialogWindow(ui::TestClientDialogTemplate(), &object);
    host.SetControlText(window, id, bytes.constData());
    QCOMPARE(QByteArray::fromStdString(Text(host, window, id)), bytes);
    QCOMPARE(host.GetControlTextLength(window, id), std::uint32_t(bytes.size()));
    if (auto* edit = qobject_cast<QPlainTextEdit*>(host.dialogWindow(window)->control(id))) {
        // CR LF shows as line breaks, not as stray characters.
        QCOMPARE(edit->blockCount(), lines);
        QVERIFY(!edit->toPlainText().contains(QLatin1Char('\r')));
    }
    host.DestroyWindow(window);
}

void tst_QtHost::textIsCutToTheBuffer()
{
    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window =
        host.CreateDialogWindow(ui::TestClientDialogTemplate(), &object);
    host.SetControlText(window, 1015, "0123456789");
    char buffer[8];
    std::memset(buffer, 'x', sizeof buffer);
    QCOMPARE(host.GetControlText(window, 1015, buffer, 5), std::uint32_t(4));
    QCOMPARE(QByteArray(buffer), QByteArray("0123"));
    QCOMPARE(buffer[5], 'x');
    QCOMPARE(host.GetControlText(window, 1015, buffer, 0), std::uint32_t(0));
    QCOMPARE(host.GetControlText(window, 4711, buffer, sizeof buffer), std::uint32_t(0));
    QCOMPARE(buffer[0], '\0');
    host.DestroyWindow(window);
}

void tst_QtHost::selectionInBytes_data()
{
    QTest::addColumn<QByteArray>("bytes");
    QTest::addColumn<int>("offset");
    QTest::addColumn<QString>("before");

    // The offset counts bytes of the text as the dialog reads it, as a translation error's
    // position does.
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

    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window =
        host.CreateDialogWindow(ui::TestClientDialogTemplate(), &object);
    host.SetControlText(window, 1015, bytes.constData());
    host.SetEditSelection(window, 1015, offset, offset);
    auto* editor = qobject_cast<QPlainTextEdit*>(host.dialogWindow(window)->control(1015));
    QCOMPARE(editor->textCursor().position(), int(before.size()));
    QVERIFY(!editor->textCursor().hasSelection());
    std::int32_t start = -5;
    std::int32_t end = -5;
    host.GetEditSelection(window, 1015, &start, &end);
    const std::int32_t expected = offset < 0 || offset > bytes.size() ? bytes.size() : offset;
    QCOMPARE(start, expected);
    QCOMPARE(end, expected);
    host.DestroyWindow(window);
}

void tst_QtHost::listsStartWithoutSelection()
{
    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window =
        host.CreateDialogWindow(ui::TestClientDialogTemplate(), &object);
    QCOMPARE(host.ListAdd(window, 208, "Rover"), 0);
    QCOMPARE(host.ListAdd(window, 208, "Onyx2"), 1);
    QCOMPARE(host.ListCount(window, 208), 2);
    // Unlike a Qt combo box, a drop-down list selects nothing by itself.
    QCOMPARE(host.ListSelection(window, 208), -1);
    host.ListSelect(window, 208, 1);
    QCOMPARE(host.ListSelection(window, 208), 1);
    QCOMPARE(QByteArray::fromStdString(Text(host, window, 208)), QByteArray("Onyx2"));
    host.ListSelect(window, 208, 5);
    QCOMPARE(host.ListSelection(window, 208), -1);
    QCOMPARE(host.ListAdd(window, 4711, "x"), -1);
    host.DestroyWindow(window);
}

void tst_QtHost::checkAndUncheckRadioButton()
{
    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window =
        host.CreateDialogWindow(ui::TestClientDialogTemplate(), &object);
    host.SetCheck(window, 219, true);
    QVERIFY(host.IsChecked(window, 219));
    host.SetCheck(window, 220, true);
    QVERIFY(!host.IsChecked(window, 219));
    // The dialog may clear a group altogether, which a user cannot.
    host.SetCheck(window, 220, false);
    QVERIFY(!host.IsChecked(window, 218) && !host.IsChecked(window, 219) &&
            !host.IsChecked(window, 220));
    host.SetCheck(window, 210, true);
    QVERIFY(host.IsChecked(window, 210));
    host.DestroyWindow(window);
}

void tst_QtHost::fileDialogRefusesPathThatDoesNotFit()
{
    QtHost host("");
    ScriptedAnswerer answerer;
    host.SetAnswerer(&answerer);
    char path[16] = "keep";
    ui::FileDialogRequest request;
    request.path = path;
    request.size = sizeof path;
    answerer.QueueFile(QStringLiteral("/tmp/0123456789")); // 15 bytes and the terminator
    QVERIFY(host.ChooseOpenFile(request));
    QCOMPARE(QByteArray(path), QByteArray("/tmp/0123456789"));
    std::strcpy(path, "keep");
    answerer.QueueFile(QStringLiteral("/tmp/0123456789a"));
    // Cut, it would name another file.
    QVERIFY(!host.ChooseOpenFile(request));
    QCOMPARE(QByteArray(path), QByteArray("keep"));
}

void tst_QtHost::realQuestionAnsweredByTimer()
{
    QtHost host("");
    RecordingObject object;
    const ui::WindowHandle window =
        host.CreateDialogWindow(ui::TestClientDialogTemplate(), &object);
    host.ShowWindow(window);
    QString seenText;
    QWidget* seenParent = nullptr;
    // The real modal box: a timer finds it and presses No, as a person would.
    AnswerNextBox(QMessageBox::No, &seenText, &seenParent);
    QVERIFY(!host.AskYesNo(window, "Status: no tower.\r\nUse Trouble Shooter?", "Diagnostics"));
    QCOMPARE(seenText, QStringLiteral("Status: no tower.\nUse Trouble Shooter?"));
    QCOMPARE(seenParent, static_cast<QWidget*>(host.dialogWindow(window)));

    host.DestroyWindow(window);
}

QTEST_MAIN(tst_QtHost)
#include "tst_qthost.moc"
