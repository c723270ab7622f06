// The help viewer of the window program: it opens the help file, shows the topic of the jump
// macro, sends command links to the Trouble Shooter's hidden window and counts its closing
// as the close command; and a whole Trouble Shooter run in which following a command link
// of the shown topic opens the next topic.
#include <QAction>
#include <QSignalSpy>
#include <QTest>
#include <QTextBlock>
#include <QTextBrowser>
#include <QTextDocument>
#include <QTimer>
#include <QUrl>

#include <memory>

#include "Support.h"
#include "session/BrickSession.h"
#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/QtHelpViewer.h"
#include "ui/qt/QtHost.h"
#include "workspace/LiveObjects.h"

using qt_test::RecordingObject;
using ui::QtHelpViewer;

namespace {

const char* const kHelpDirectory = HARBOR_SOURCE_DIR "/resources/help/";

// The link targets of the shown topic, in order.
QStringList Links(const QTextBrowser* browser)
{
    QStringList links;
    for (QTextBlock block = browser->document()->begin(); block.isValid(); block = block.next()) {
        for (auto it = block.begin(); !it.atEnd(); ++it) {
            const QString href = it.fragment().charFormat().anchorHref();
            if (!href.isEmpty())
                links << href;
        }
    }
    return links;
}

// Clicks the first link to href in the shown topic with the mouse, as a person would.
bool ClickLink(QTextBrowser* browser, const QString& href)
{
    for (QTextBlock block = browser->document()->begin(); block.isValid(); block = block.next()) {
        for (auto it = block.begin(); !it.atEnd(); ++it) {
            const QTextFragment fragment = it.fragment();
            if (fragment.charFormat().anchorHref() != href)
                continue;
            QTextCursor cursor(browser->document());
            cursor.setPosition(fragment.position() + fragment.length() / 2);
            const QPoint point = browser->cursorRect(cursor).center();
            QTest::mouseClick(browser->viewport(), Qt::LeftButton, {}, point);
            return true;
        }
    }
    return false;
}

} // namespace

class tst_QtHelpViewer : public QObject {
    Q_OBJECT

private slots:
    void openFile_data();
    void openFile();
    void jumpMacroShowsTopic_data();
    void jumpMacroShowsTopic();
    void commandLinkGoesToTheOwner_data();
    void commandLinkGoesToTheOwner();
    void topicLinkStaysInTheViewer();
    void closingTheWindowSendsCloseOnce();
    void troubleShooterRunFollowsLinks();
    void exitDuringARunWaitsForTheRunToEnd_data();
    void exitDuringARunWaitsForTheRunToEnd();
};

void tst_QtHelpViewer::openFile_data()
{
    QTest::addColumn<QString>("file");
    QTest::addColumn<int>("result");
    QTest::newRow("beside the program") << "shooter.hlp" << 1;
    QTest::newRow("with a directory") << HARBOR_SOURCE_DIR "/resources/help/shooter.hlp" << 1;
    QTest::newRow("missing") << "missing.hlp" << 0;
    QTest::newRow("empty name") << "" << 0;
}

void tst_QtHelpViewer::openFile()
{
    QFETCH(QString, file);
    QFETCH(int, result);
    ui::QtHost host(kHelpDirectory);
    QtHelpViewer& viewer = host.helpViewer();
    QCOMPARE(viewer.OpenFile(ui::kNoWindow, file.toUtf8().constData()), result);
    QCOMPARE(viewer.IsOpen(), result == 1);
    // Nothing is shown before a topic is asked for.
    QVERIFY(viewer.window() == nullptr || !viewer.window()->isVisible());
}

void tst_QtHelpViewer::jumpMacroShowsTopic_data()
{
    QTest::addColumn<QString>("macro");
    QTest::addColumn<int>("result");
    QTest::addColumn<QString>("topic");
    QTest::addColumn<QString>("heading");

    QTest::newRow("outcome topic")
        << R"(JI("shooter.hlp","Onyx_not_alive"))" << 1 << "Onyx_not_alive"
        << "brick";
    QTest::newRow("success topic")
        << R"(JI("shooter.hlp","IR_Transmitter_ok"))" << 1 << "IR_Transmitter_ok"
        << "tower";
    QTest::newRow("unknown topic") << R"(JI("shooter.hlp","No_such_topic"))" << 0 << ""
                                   << "";
    QTest::newRow("other macro") << R"(CloseWindow("main"))" << 0 << ""
                                 << "";
}

void tst_QtHelpViewer::jumpMacroShowsTopic()
{
    QFETCH(QString, macro);
    QFETCH(int, result);
    QFETCH(QString, topic);
    QFETCH(QString, heading);

    ui::QtHost host(kHelpDirectory);
    QtHelpViewer& viewer = host.helpViewer();
    QSignalSpy shown(&viewer, &QtHelpViewer::topicShown);
    QCOMPARE(viewer.OpenFile(ui::kNoWindow, "shooter.hlp"), 1);
    QCOMPARE(viewer.RunMacro(ui::kNoWindow, "shooter.hlp", macro.toUtf8().constData()), result);
    QCOMPARE(viewer.currentTopic(), topic);
    QCOMPARE(shown.count(), result);
    if (result == 1) {
        QVERIFY(viewer.window()->isVisible());
        // The topic alone is shown, not the whole file.
        const QString text = viewer.browser()->toPlainText();
        QVERIFY2(text.contains(heading, Qt::CaseInsensitive), qPrintable(text));
        QVERIFY(!text.contains(QStringLiteral("COM port is used by a serial mouse")) ||
                topic.startsWith(QLatin1String("COM_port_used")));
        QVERIFY(!Links(viewer.browser()).isEmpty());
    }
}

void tst_QtHelpViewer::commandLinkGoesToTheOwner_data()
{
    QTest::addColumn<QString>("href");
    QTest::addColumn<int>("id");
    QTest::addColumn<int>("argument");
    QTest::newRow("without argument") << "cmd:2002" << 2002 << 0;
    QTest::newRow("COM port 3") << "cmd:2004?3" << 2004 << 3;
    QTest::newRow("port type") << "cmd:3001?3" << 3001 << 3;
    QTest::newRow("negative") << "cmd:2006?-1" << 2006 << -1;
}

void tst_QtHelpViewer::commandLinkGoesToTheOwner()
{
    QFETCH(QString, href);
    QFETCH(int, id);
    QFETCH(int, argument);

    ui::QtHost host(kHelpDirectory);
    RecordingObject link;
    const ui::WindowHandle owner = host.CreatePlainWindow("trbl_wnd", &link);
    QtHelpViewer& viewer = host.helpViewer();
    QCOMPARE(viewer.OpenFile(owner, "shooter.hlp"), 1);
    QCOMPARE(
        viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","IR_Transmitter_not_found"))"),
        1);
    viewer.FollowLink(QUrl(href));
    QTRY_COMPARE(link.count(ui::kMsgCommand), 1);
    const RecordingObject::Received command = link.received().back();
    QCOMPARE(ui::CommandId(command.wParam), id);
    QCOMPARE(static_cast<int>(command.lParam), argument);
    host.DestroyWindow(owner);
}

void tst_QtHelpViewer::topicLinkStaysInTheViewer()
{
    ui::QtHost host(kHelpDirectory);
    RecordingObject link;
    const ui::WindowHandle owner = host.CreatePlainWindow("trbl_wnd", &link);
    QtHelpViewer& viewer = host.helpViewer();
    QCOMPARE(viewer.OpenFile(owner, "shooter.hlp"), 1);
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","Onyx_not_alive"))"), 1);
    viewer.FollowLink(QUrl(QStringLiteral("#Onyx_ok")));
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_ok"));
    viewer.FollowLink(QUrl(QStringLiteral("#No_such_topic")));
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_ok"));
    QTest::qWait(0);
    QCOMPARE(link.count(ui::kMsgCommand), 0);
    host.DestroyWindow(owner);
}

void tst_QtHelpViewer::closingTheWindowSendsCloseOnce()
{
    ui::QtHost host(kHelpDirectory);
    RecordingObject link;
    const ui::WindowHandle owner = host.CreatePlainWindow("trbl_wnd", &link);
    QtHelpViewer& viewer = host.helpViewer();
    QCOMPARE(viewer.OpenFile(owner, "shooter.hlp"), 1);
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","Onyx_ok"))"), 1);
    QVERIFY(viewer.window()->close());
    QTRY_COMPARE(link.count(ui::kMsgCommand), 1);
    QCOMPARE(ui::CommandId(link.received().back().wParam), 2000);
    // What still arrives from the viewer's side goes nowhere, and the window stays closed.
    viewer.FollowLink(QUrl(QStringLiteral("cmd:2002")));
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","Onyx_ok"))"), 0);
    QVERIFY(!viewer.window()->isVisible());
    QTest::qWait(0);
    QCOMPARE(link.count(ui::kMsgCommand), 1);
    QCOMPARE(viewer.Quit(owner, "shooter.hlp"), 1);
    QVERIFY(!viewer.IsOpen());
    host.DestroyWindow(owner);
}

void tst_QtHelpViewer::troubleShooterRunFollowsLinks()
{
    qt_test::SimFolder folder(qt_test::ShippedTestScenario(), "USB=KIVOTOWER1\n");
    qt_test::ScriptedAnswerer answerer;
    QStringList topics;
    {
        ui::QtHost host(kHelpDirectory);
        host.SetAnswerer(&answerer);
        ui::TestClientDialog dialog(host, folder.commandLine().c_str());
        QVERIFY(dialog.Create());
        QVERIFY(dialog.brickHandle() != 0);
        QtHelpViewer& viewer = host.helpViewer();

        // The person's part, run from inside the Trouble Shooter's nested loop: on each topic,
        // follow the next link of the plan that the topic offers, and close the viewer at the
        // end.
        QStringList plan = {"cmd:2002", "cmd:2003"};
        connect(&viewer, &QtHelpViewer::topicShown, this, [&](const QString& id) {
            topics << id;
            QTimer::singleShot(0, this, [&] {
                if (plan.isEmpty()) {
                    viewer.window()->close();
                    return;
                }
                const QString href = plan.takeFirst();
                QVERIFY2(Links(viewer.browser()).contains(href),
                         qPrintable(viewer.currentTopic() + " offers no " + href));
                QVERIFY(ClickLink(viewer.browser(), href));
            });
        });

        // No tower answered: the user says Yes to the offer.
        answerer.QueueAnswer(true);
        QVERIFY(dialog.OfferTroubleShooter(static_cast<std::int32_t>(0xE0050421u)));
        QVERIFY(!viewer.IsOpen());
        QCOMPARE(answerer.questions.size(), std::size_t(1));
        QCOMPARE(answerer.questions[0].text,
                 QStringLiteral("Error (0xe0050421) from Tessel driver: "
                                "IDSTATUS_RESULT_NOTOWER.\nUse Trouble Shooter?"));
        // The hidden window went with the run.
        QCOMPARE(host.FindWindowOfClass("trbl_wnd"), ui::kNoWindow);
    }
    // The tower and the brick answer, so each test opens its success topic.
    QCOMPARE(topics.size(), 3);
    QCOMPARE(topics[1], QStringLiteral("IR_Transmitter_ok"));
    QCOMPARE(topics[2], QStringLiteral("Onyx_ok"));
    QCOMPARE(workspace::LiveObjectCount(), std::int64_t(0));
}

void tst_QtHelpViewer::exitDuringARunWaitsForTheRunToEnd_data()
{
    QTest::addColumn<bool>("closeBox");
    QTest::newRow("close box") << true;
    QTest::newRow("File Exit") << false;
}

void tst_QtHelpViewer::exitDuringARunWaitsForTheRunToEnd()
{
    QFETCH(bool, closeBox);
    qt_test::SimFolder folder(qt_test::ShippedTestScenario(), "USB=KIVOTOWER1\n");
    qt_test::ScriptedAnswerer answerer;
    ui::QtHost host(kHelpDirectory);
    host.SetAnswerer(&answerer);
    ui::TestClientDialog dialog(host, folder.commandLine().c_str());
    QVERIFY(dialog.Create());
    ui::DialogWindow* window = host.dialogWindow(dialog.handle());
    QtHelpViewer& viewer = host.helpViewer();
    bool sessionDuringRun = true;
    // While the help waits, the user closes the program.
    connect(&viewer, &QtHelpViewer::topicShown, this, [&] {
        QTimer::singleShot(0, this, [&] {
            if (closeBox)
                window->close();
            else
                window->menuAction(ui::IdFileExit)->trigger();
            sessionDuringRun = dialog.session() != nullptr;
        });
    });
    answerer.QueueAnswer(true);
    QVERIFY(dialog.OfferTroubleShooter(static_cast<std::int32_t>(0xE0050421u)));
    // The help closed as by its close command and the run ended with the session intact.
    QVERIFY(sessionDuringRun);
    QVERIFY(!viewer.IsOpen());
    QVERIFY(dialog.session() != nullptr);
    QVERIFY(dialog.handle() != ui::kNoWindow);
    // The exit then goes ahead.
    QCOMPARE(host.RunMessageLoop(), 0);
    QCOMPARE(dialog.handle(), ui::kNoWindow);
    QVERIFY(dialog.session() == nullptr);
}

QTEST_MAIN(tst_QtHelpViewer)
#include "tst_qthelpviewer.moc"
