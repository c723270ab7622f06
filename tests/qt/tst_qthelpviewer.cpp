// The help viewer of the window program: it opens the help file, shows the topic of the jump
// macro, sends command links to the Trouble Shooter's hidden window and counts its closing as
// the close command; and whole Trouble Shooter runs driven through the shown topics.
#include <QAction>
#include <QSignalSpy>
#include <QTest>
#include <QTextBlock>
#include <QTextBrowser>
#include <QTextDocument>
#include <QTimer>
#include <QUrl>

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

// The links of the shown topic, in order.
QList<QTextFragment> Links(const QTextBrowser* browser)
{
    QList<QTextFragment> links;
    for (QTextBlock block = browser->document()->begin(); block.isValid(); block = block.next()) {
        for (auto it = block.begin(); !it.atEnd(); ++it) {
            if (!it.fragment().charFormat().anchorHref().isEmpty())
                links << it.fragment();
        }
    }
    return links;
}

// Clicks the first link to href in the shown topic with the mouse, as a person would.
bool ClickLink(QTextBrowser* browser, const QString& href)
{
    for (const QTextFragment& link : Links(browser)) {
        if (link.charFormat().anchorHref() != href)
            continue;
        QTextCursor cursor(browser->document());
        cursor.setPosition(link.position() + link.length() / 2);
        QTest::mouseClick(browser->viewport(), Qt::LeftButton, {},
                          browser->cursorRect(cursor).center());
        return true;
    }
    return false;
}

// A dialog on the shipped scenario's USB tower, ready for a Trouble Shooter run.
struct Run {
    Run() { host.SetAnswerer(&answerer); }

    // No tower answered: the user says Yes to the offer; true once the run is over.
    bool offer()
    {
        answerer.QueueAnswer(true);
        return dialog.OfferTroubleShooter(static_cast<std::int32_t>(0xE0050421u));
    }

    qt_test::SimFolder folder{qt_test::ShippedTestScenario(), "USB=KIVOTOWER1\n"};
    qt_test::ScriptedAnswerer answerer;
    ui::QtHost host{kHelpDirectory};
    ui::TestClientDialog dialog{host, folder.commandLine().c_str()};
    QtHelpViewer& viewer = host.helpViewer();
};

} // namespace

class tst_QtHelpViewer : public QObject {
    Q_OBJECT

private slots:
    void topicsLinksAndClose();
    void troubleShooterRunFollowsLinks();
    void exitDuringARunWaitsForTheRunToEnd_data();
    void exitDuringARunWaitsForTheRunToEnd();
};

void tst_QtHelpViewer::topicsLinksAndClose()
{
    ui::QtHost host(kHelpDirectory);
    RecordingObject link;
    const ui::WindowHandle owner = host.CreatePlainWindow("trbl_wnd", &link);
    QtHelpViewer& viewer = host.helpViewer();
    QCOMPARE(viewer.OpenFile(owner, "missing.hlp"), 0);
    QCOMPARE(viewer.OpenFile(owner, ""), 0);
    QVERIFY(!viewer.IsOpen());
    QCOMPARE(viewer.OpenFile(owner, HARBOR_SOURCE_DIR "/resources/help/shooter.hlp"), 1);
    QCOMPARE(viewer.OpenFile(owner, "shooter.hlp"), 1); // beside the program
    QVERIFY(viewer.IsOpen());
    // Nothing is shown before a topic is asked for, nor for a macro that names none.
    QSignalSpy shown(&viewer, &QtHelpViewer::topicShown);
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","No_such"))"), 0);
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(CloseWindow("main"))"), 0);
    QCOMPARE(shown.count(), 0);
    QVERIFY(viewer.window() == nullptr || !viewer.window()->isVisible());

    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","Onyx_not_alive"))"), 1);
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_not_alive"));
    QCOMPARE(shown.count(), 1);
    QVERIFY(viewer.window()->isVisible());
    // The topic alone is shown, not the whole file.
    const QString text = viewer.browser()->toPlainText();
    QVERIFY2(text.contains(QStringLiteral("brick"), Qt::CaseInsensitive), qPrintable(text));
    QVERIFY(!text.contains(QStringLiteral("COM port is used by a serial mouse")));
    QVERIFY(!Links(viewer.browser()).isEmpty());

    // A topic link stays in the viewer; an unknown one changes nothing.
    viewer.FollowLink(QUrl(QStringLiteral("#Onyx_ok")));
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_ok"));
    viewer.FollowLink(QUrl(QStringLiteral("#No_such_topic")));
    QCOMPARE(viewer.currentTopic(), QStringLiteral("Onyx_ok"));
    // A command link goes to the owner as its command, with the argument after "?".
    for (const char* href : {"cmd:2002", "cmd:2004?3", "cmd:2006?-1"})
        viewer.FollowLink(QUrl(QString::fromLatin1(href)));
    // Closing the viewer is its close command, sent once; what still arrives from the
    // viewer's side goes nowhere, and the window stays closed.
    QVERIFY(viewer.window()->close());
    viewer.FollowLink(QUrl(QStringLiteral("cmd:2002")));
    QCOMPARE(viewer.RunMacro(owner, "shooter.hlp", R"(JI("shooter.hlp","Onyx_ok"))"), 0);
    QVERIFY(!viewer.window()->isVisible());
    QTRY_COMPARE(link.count(ui::kMsgCommand), 4);
    QTest::qWait(0);
    QList<QPair<int, int>> sent;
    for (const RecordingObject::Received& r : link.received) {
        if (r.message == ui::kMsgCommand)
            sent.append({ui::CommandId(r.wParam), int(r.lParam)});
    }
    QCOMPARE(sent, (QList<QPair<int, int>>{{2002, 0}, {2004, 3}, {2006, -1}, {2000, 0}}));
    QCOMPARE(viewer.Quit(owner, "shooter.hlp"), 1);
    QVERIFY(!viewer.IsOpen());
    host.DestroyWindow(owner);
}

void tst_QtHelpViewer::troubleShooterRunFollowsLinks()
{
    QStringList topics;
    {
        Run run;
        QVERIFY(run.dialog.Create());
        QVERIFY(run.dialog.brickHandle() != 0);
        // The person's part, run from inside the Trouble Shooter's nested loop: on each topic,
        // follow the next link of the plan that the topic offers, and close at the end.
        QStringList plan = {"cmd:2002", "cmd:2003"};
        connect(&run.viewer, &QtHelpViewer::topicShown, this, [&](const QString& id) {
            topics << id;
            QTimer::singleShot(0, this, [&] {
                if (plan.isEmpty()) {
                    run.viewer.window()->close();
                    return;
                }
                const QString href = plan.takeFirst();
                QVERIFY2(ClickLink(run.viewer.browser(), href),
                         qPrintable(run.viewer.currentTopic() + " offers no " + href));
            });
        });
        QVERIFY(run.offer());
        QVERIFY(!run.viewer.IsOpen());
        QCOMPARE(run.answerer.questions.size(), std::size_t(1));
        QCOMPARE(run.answerer.questions[0].caption, QStringLiteral("Diagnostics"));
        QCOMPARE(run.answerer.questions[0].owner,
                 static_cast<QWidget*>(run.host.dialogWindow(run.dialog.handle())));
        QCOMPARE(run.answerer.questions[0].text,
                 QStringLiteral("Error (0xe0050421) from Tessel driver: "
                                "IDSTATUS_RESULT_NOTOWER.\nUse Trouble Shooter?"));
        // The hidden window went with the run.
        QCOMPARE(run.host.FindWindowOfClass("trbl_wnd"), ui::kNoWindow);
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
    Run run;
    QVERIFY(run.dialog.Create());
    ui::DialogWindow* window = run.host.dialogWindow(run.dialog.handle());
    bool sessionDuringRun = true;
    // While the help waits, the user closes the program.
    connect(&run.viewer, &QtHelpViewer::topicShown, this, [&] {
        QTimer::singleShot(0, this, [&] {
            if (closeBox)
                window->close();
            else
                window->menuAction(ui::IdFileExit)->trigger();
            sessionDuringRun = run.dialog.session() != nullptr;
        });
    });
    QVERIFY(run.offer());
    // The help closed as by its close command and the run ended with the session intact.
    QVERIFY(sessionDuringRun);
    QVERIFY(!run.viewer.IsOpen());
    QVERIFY(run.dialog.session() != nullptr);
    QVERIFY(run.dialog.handle() != ui::kNoWindow);
    // The exit then goes ahead.
    QCOMPARE(run.host.RunMessageLoop(), 0);
    QCOMPARE(run.dialog.handle(), ui::kNoWindow);
    QVERIFY(run.dialog.session() == nullptr);
}

QTEST_MAIN(tst_QtHelpViewer)
#include "tst_qthelpviewer.moc"
