// The harbor program seen from outside: it shows its window and ends cleanly, or without a
// reachable display says so in one line; its RegServer and UnregServer switches install the
// desktop entry and the "*.onyx2" MIME type into a data folder and remove them again.
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QProcess>
#include <QStandardPaths>
#include <QTemporaryDir>
#include <QTest>

#include "Support.h"
#include "app/Registration.h"

using app::DesktopRegistration;

namespace {

QString ReadText(const QString& path)
{
    return QString::fromUtf8(qt_test::ReadAll(path));
}

QString LineStarting(const QString& text, const QString& key)
{
    for (const QString& line : text.split(QLatin1Char('\n'))) {
        if (line.startsWith(key))
            return line;
    }
    return QString();
}

// Sets name to value, or unsets it for a null value.
void SetEnv(const char* name, const QByteArray& value)
{
    if (value.isNull())
        qunsetenv(name);
    else
        qputenv(name, value);
}

struct Outcome {
    bool normalExit; // no crash, no abort, no hang
    int code;
    QByteArray out;
    QByteArray errors;
};

Outcome RunHarbor(const QProcessEnvironment& environment, const QStringList& arguments)
{
    QProcess harbor;
    harbor.setProcessEnvironment(environment);
    harbor.start(QStringLiteral(HARBOR_PROGRAM), arguments);
    const bool finished = harbor.waitForFinished(60000);
    return {finished && harbor.exitStatus() == QProcess::NormalExit, harbor.exitCode(),
            harbor.readAllStandardOutput(), harbor.readAllStandardError()};
}

} // namespace

class tst_HarborProgram : public QObject {
    Q_OBJECT

private slots:
    void start_data();
    void start();
    void registerThenUnregister();
    void execLine();
    void registerFailsWhereNothingCanBeWritten();
    void userDataHome_data();
    void userDataHome();
};

void tst_HarborProgram::start_data()
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

void tst_HarborProgram::start()
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

    const Outcome run = RunHarbor(environment, {});
    QVERIFY(run.normalExit);
    QCOMPARE(run.code, says.isEmpty() ? 0 : 1);
    QCOMPARE(run.out, says.isEmpty() ? QByteArray("shown\n") : QByteArray());
    if (!says.isEmpty()) {
        QVERIFY2(run.errors.count('\n') == 1 && run.errors.contains(says.toUtf8()) &&
                     run.errors.contains("harbor --headless"),
                 run.errors.constData());
    }
}

void tst_HarborProgram::registerThenUnregister()
{
    QTemporaryDir data;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    environment.insert(QStringLiteral("XDG_DATA_HOME"), data.path());
    // The switch's one line of output, or "failed".
    const auto run = [&](const QString& argument) {
        const Outcome run = RunHarbor(environment, {argument});
        const QByteArray output = run.out + run.errors;
        return run.normalExit && run.code == 0 && output.count('\n') == 1 ? output
                                                                          : "failed: " + output;
    };
    const QString entryPath = data.filePath("applications/harbor.desktop");
    const QString packagePath = data.filePath("mime/packages/harbor-onyx2.xml");
    const QString mimeType = data.filePath("mime/text/x-onyx2.xml");
    const bool mimeTool =
        !QStandardPaths::findExecutable(QStringLiteral("update-mime-database")).isEmpty();

    QByteArray output = run(QStringLiteral("/RegServer"));
    QVERIFY2(output.startsWith("harbor: registered ") && output.contains(entryPath.toUtf8()) &&
                 output.contains(packagePath.toUtf8()),
             output.constData());
    const QString entry = ReadText(entryPath);
    QVERIFY(entry.startsWith(QStringLiteral("[Desktop Entry]\n")));
    // The entry starts this very program, wherever it lies.
    const QString program = QFileInfo(QStringLiteral(HARBOR_PROGRAM)).canonicalFilePath();
    QCOMPARE(LineStarting(entry, "TryExec="), "TryExec=" + program);
    QVERIFY(LineStarting(entry, "Exec=").endsWith(QStringLiteral(" %f")));
    QCOMPARE(LineStarting(entry, "MimeType="), QStringLiteral("MimeType=text/x-onyx2;"));
    QCOMPARE(LineStarting(entry, "Type="), QStringLiteral("Type=Application"));
    QVERIFY(!entry.contains(QLatin1Char('@')));
    const QString package = ReadText(packagePath);
    QVERIFY(package.contains(QStringLiteral("<glob pattern=\"*.onyx2\"/>")));
    QCOMPARE(package, ReadText(HARBOR_SOURCE_DIR "/resources/desktop/harbor-onyx2.xml"));
    // Where the desktop's tool is installed, the MIME database knows the type afterwards.
    if (mimeTool)
        QVERIFY(QFileInfo::exists(mimeType) && output.contains("update-mime-database"));
    // No temporary file is left behind.
    const QDir applications(data.filePath("applications"));
    QCOMPARE(applications.entryList(QDir::Files),
             QStringList({"harbor.desktop"}) + applications.entryList({"*.cache"}, QDir::Files));

    output = run(QStringLiteral("-unregserver"));
    QVERIFY2(output.startsWith("harbor: unregistered: removed ") &&
                 output.contains(entryPath.toUtf8()),
             output.constData());
    QVERIFY(!QFileInfo::exists(entryPath) && !QFileInfo::exists(packagePath));
    QVERIFY(!mimeTool || !QFileInfo::exists(mimeType));
    // A second removal finds nothing and still succeeds.
    output = run(QStringLiteral("-unregserver"));
    QVERIFY2(output.contains("nothing to remove"), output.constData());
}

// The program's path as the Exec key needs it: quoted where it holds a blank or a character
// that quoting must escape (doubled once more for the key's own escapes), '%' doubled.
void tst_HarborProgram::execLine()
{
    const std::pair<const char*, const char*> cases[] = {
        {"/usr/lib/harbor/harbor", "Exec=/usr/lib/harbor/harbor %f"},
        {"/opt/my apps/harbor", "Exec=\"/opt/my apps/harbor\" %f"},
        {"/opt/a$b/harbor", "Exec=\"/opt/a\\\\$b/harbor\" %f"},
        {"/opt/a\"b/harbor", "Exec=\"/opt/a\\\\\"b/harbor\" %f"},
        {"/opt/a\\b/harbor", "Exec=\"/opt/a\\\\\\\\b/harbor\" %f"},
        {"/opt/100%/harbor", "Exec=/opt/100%%/harbor %f"}};
    for (const auto& [program, exec] : cases) {
        const std::string entry = DesktopRegistration::DesktopEntry(program);
        QCOMPARE(LineStarting(QString::fromStdString(entry), "Exec="), QString::fromLatin1(exec));
    }
}

void tst_HarborProgram::registerFailsWhereNothingCanBeWritten()
{
    QTemporaryDir data;
    // A file stands where the applications folder should go.
    QFile blocker(data.filePath("applications"));
    QVERIFY(blocker.open(QIODevice::WriteOnly));
    blocker.close();
    const DesktopRegistration registration(data.path().toStdString(), "/opt/harbor/harbor");
    std::string report;
    QCOMPARE(registration.Register(report), 1);
    QVERIFY2(report.rfind("RegServer failed: cannot make", 0) == 0, report.c_str());

    const DesktopRegistration nowhere("", "/opt/harbor/harbor");
    QCOMPARE(nowhere.Register(report), 1);
    QCOMPARE(nowhere.Unregister(report), 1);
}

void tst_HarborProgram::userDataHome_data()
{
    QTest::addColumn<QByteArray>("xdg");
    QTest::addColumn<QByteArray>("home");
    QTest::addColumn<QString>("expected");
    QTest::newRow("XDG_DATA_HOME") << QByteArray("/data") << QByteArray("/home/u") << "/data";
    QTest::newRow("relative XDG_DATA_HOME is ignored")
        << QByteArray("data") << QByteArray("/home/u") << "/home/u/.local/share";
    QTest::newRow("HOME only") << QByteArray() << QByteArray("/home/u") << "/home/u/.local/share";
    QTest::newRow("neither") << QByteArray() << QByteArray() << "";
}

void tst_HarborProgram::userDataHome()
{
    QFETCH(QByteArray, xdg);
    QFETCH(QByteArray, home);
    QFETCH(QString, expected);
    const QByteArray oldXdg = qgetenv("XDG_DATA_HOME"); // null when unset
    const QByteArray oldHome = qgetenv("HOME");
    SetEnv("XDG_DATA_HOME", xdg);
    SetEnv("HOME", home);
    const QString found = QString::fromStdString(DesktopRegistration::UserDataHome());
    SetEnv("XDG_DATA_HOME", oldXdg);
    SetEnv("HOME", oldHome);
    QCOMPARE(found, expected);
}

QTEST_MAIN(tst_HarborProgram)
#include "tst_harborprogram.moc"
