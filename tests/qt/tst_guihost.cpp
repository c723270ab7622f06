// The window program's start seen from outside through harbor itself: it shows its window and
// ends cleanly; without a reachable display it says so in one line, names the headless mode,
// and ends without a crash.
#include <QProcess>
#include <QTest>

class tst_GuiHost : public QObject {
    Q_OBJECT

private slots:
    void start_data();
    void start();
};

void tst_GuiHost::start_data()
{
    QTest::addColumn<QString>("platform");
    QTest::addColumn<QString>("display");
    QTest::addColumn<QString>("says");

    // Settings, session, the window shown, then its own Exit through the message loop (the
    // start-up benchmark's hook) and the teardown.
    QTest::newRow("shown then exit") << "offscreen"
                                     << ""
                                     << "";
    // Nothing names a display: the program does not even try.
    QTest::newRow("no display set") << ""
                                    << ""
                                    << "no display";
    // A display is named but cannot be reached: the window system refuses.
    QTest::newRow("display unreachable") << "xcb"
                                         << ":4711"
                                         << "cannot be reached";
}

void tst_GuiHost::start()
{
    QFETCH(QString, platform);
    QFETCH(QString, display);
    QFETCH(QString, says);

    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    for (const char* name : {"DISPLAY", "WAYLAND_DISPLAY", "QT_QPA_PLATFORM"})
        environment.remove(QString::fromLatin1(name));
    if (!platform.isEmpty())
        environment.insert(QStringLiteral("QT_QPA_PLATFORM"), platform);
    if (!display.isEmpty())
        environment.insert(QStringLiteral("DISPLAY"), display);
    environment.insert(QStringLiteral("HARBOR_EXIT_WHEN_SHOWN"), QStringLiteral("1"));

    QProcess harbor;
    harbor.setProcessEnvironment(environment);
    harbor.start(QStringLiteral(HARBOR_PROGRAM), {});
    QVERIFY(harbor.waitForFinished(60000));
    QCOMPARE(harbor.exitStatus(), QProcess::NormalExit); // no crash, no abort
    if (says.isEmpty()) {
        QCOMPARE(harbor.exitCode(), 0);
        QCOMPARE(harbor.readAllStandardOutput(), QByteArray("shown\n"));
        return;
    }
    QCOMPARE(harbor.exitCode(), 1);
    const QByteArray errors = harbor.readAllStandardError();
    QVERIFY2(errors.count('\n') == 1, errors.constData());
    QVERIFY2(errors.contains(says.toUtf8()), errors.constData());
    QVERIFY2(errors.contains("harbor --headless"), errors.constData());
    QCOMPARE(harbor.readAllStandardOutput(), QByteArray());
}

QTEST_GUILESS_MAIN(tst_GuiHost)
#include "tst_guihost.moc"
