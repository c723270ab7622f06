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
    void openFileAndJumpMacro();
    void linksGoToTheViewerOrTheOwnerAndCloseSendsCloseOnce();
    void troubleShooterRunFollowsLinks();
    void exitDuringARunWaitsForTheRunToEnd_data();
    void exitDuringARunWaitsForTheRunToEnd();
};

void tst_QtHelpViewer::openFileAndJumpMacro()
{
    ui::QtHost host(kHelpDirectory);
    QtHelpViewer& viewer = host.helpViewer();
    QCOMPARE(viewer.OpenFile(ui::kNoWindow, "missing.hlp"), 0);
    QCOMPARE(viewer.OpenFile(ui::kNoWindow, ""), 0);
    QVERIFY(!viewer.IsOpen());
    QCOMPARE(viewer.OpenFile(ui::kNoWindow, HARBOR_SOURCE_DIR "/resources/help/shooter.hlp"), 1);
    QCOMPARE(viewer.OpenFile(ui::kNoWindow, "shooter.hlp"), 1); // beside the program
    QVERIFY(viewer.IsOpen());
    // Nothing is shown before a topic is asked for, nor for a macro that names none.
    QVERIFY(viewer.window() == nullptr || !viewer.window()->isVisible());
    QSignalSpy shown(&viewer, &QtHelpViewer::topicShown);
    QCOMPARE(viewer.RunMacro(ui::kNoWindow, "shooter.hlp", R"(JI("shooter.hlp","No_such"))"), 0);
    QCOMPARE(viewer.RunMacro(ui::kNoWindow, "shooter.hlp", R"(CloseWindow("main"))"), 0);
    QCOMPARE(shown.count(), 0);
    QVERIFY(viewer.window() == nullptr || !viewer.window()->isVisible());

    QCOMPARE(viewer.RunMacro(ui::kNoWindow, "shooter.hlp", R"(JI("shooter.hlp","Onyx_not_alive"))"),
             1);
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_not_alive"));
    QCOMPARE(shown.count(), 1);
    QVERIFY(viewer.window()->isVisible());
    // The topic alone is shown, not the whole file.
    const QString text = viewer.browser()->toPlainText();
    QVERIFY2(text.contains(QStringLiteral("brick"), Qt::CaseInsensitive), qPrintable(text));
    QVERIFY(!text.contains(QStringLiteral("COM port is used by a serial mouse")));
    QVERIFY(!Links(viewer.browser()).isEmpty());
}

void tst_QtHelpViewer::linksGoToTheViewerOrTheOwnerAndCloseSendsCloseOnce()
{
    ui::QtHost host(kHelpDirectory);
    RecordingObject link;
    const ui::WindowHandle owner = host.CreatePlainWindow("trbl_wnd", &link);
    QtHelpViewer& viewer = host.helpViewer();
    QCOMPARE(viewer.OpenFile(owner, "shooter.hlp"), 1);
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","Onyx_not_alive"))"), 1);
    // A topic link stays in the viewer; an unknown one changes nothing.
    viewer.FollowLink(QUrl(QStringLiteral("#Onyx_ok")));
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_ok"));
    viewer.FollowLink(QUrl(QStringLiteral("#No_such_topic")));
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_ok"));
    QTest::qWait(0);
    QCOMPARE(link.count(ui::kMsgCommand), 0);
    // A command link goes to the owner as its command, with the argument after "?".
    const struct {
        const char* href;
        int id;
        int argument;
    } commands[] = {{"cmd:2002", 2002, 0}, {"cmd:2004?3", 2004, 3}, {"cmd:2006?-1", 2006, -1}};
    for (const auto& command : commands)
        viewer.FollowLink(QUrl(QString::fromLatin1(command.href)));
    QTRY_COMPARE(link.count(ui::kMsgCommand), 3);
    std::vector<RecordingObject::Received> sent;
    for (const RecordingObject::Received& r : link.received) {
        if (r.message == ui::kMsgCommand)
            sent.push_back(r);
    }
    for (int i = 0; i < 3; ++i) {
        QCOMPARE(ui::CommandId(sent[i].wParam), commands[i].id);
        QCOMPARE(static_cast<int>(sent[i].lParam), commands[i].argument);
    }

    QVERIFY(viewer.window()->close());
    QTRY_COMPARE(link.count(ui::kMsgCommand), 4);
    QCOMPARE(ui::CommandId(link.received.back().wParam), 2000);
    // What still arrives from the viewer's side goes nowhere, and the window stays closed.
    viewer.FollowLink(QUrl(QStringLiteral("cmd:2002")));
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","Onyx_ok"))"), 0);
    QVERIFY(!viewer.window()->isVisible());
    QTest::qWait(0);
    QCOMPARE(link.count(ui::kMsgCommand), 4);
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
