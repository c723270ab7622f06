// The Tessel Test Client dialog in its real window against the simulated library, driven as
// a user drives it: its start, buttons whose reports come from the library's threads, the
// file dialogs and the questions.
#include <QAbstractButton>
#include <QAction>
#include <QComboBox>
#include <QLineEdit>
#include <QPlainTextEdit>
#include <QTest>
#include <QTimer>

#include <memory>

#include "Support.h"
#include "session/BrickSession.h"
#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/QtHelpViewer.h"
#include "ui/qt/QtHost.h"
#include "workspace/LiveObjects.h"

namespace {

// The USB tower of the shipped scenarios, as the library's port search names it.
const QString kUsbPort = QStringLiteral("KIVOTOWER1");
const std::string kUsbPortSetting = "USB=KIVOTOWER1\n";

// Ample for any report of the simulated library, even under the sanitizers; reaching it means
// the report never came.
constexpr int kReportMs = 20000;

} // namespace

class tst_TestClientDialog : public QObject {
    Q_OBJECT

private slots:
    void cleanup();
    void startedWindowAndFileOpen();
    void clickChangesStatus_data();
    void clickChangesStatus();
    void longDownloadKeepsTheWindowResponsive();

private:
    void start(const std::string& scenario, const std::string& ports,
               const std::string& options = "");
    ui::DialogWindow* window() const { return host_->dialogWindow(dialog_->handle()); }
    template <class Widget> Widget* control(int id) const
    {
        return qobject_cast<Widget*>(window()->control(id));
    }
    QString status() const { return control<QPlainTextEdit>(ui::IdStatusBox)->toPlainText(); }
    void setScript(const QString& text, int source)
    {
        control<QPlainTextEdit>(ui::IdEditor)->setPlainText(text);
        control<QComboBox>(ui::IdSourceList)->setCurrentIndex(source);
    }
    void click(int id);

    std::unique_ptr<qt_test::SimFolder> folder_;
    qt_test::ScriptedAnswerer answerer_;
    std::unique_ptr<ui::QtHost> host_;
    std::unique_ptr<ui::TestClientDialog> dialog_;
};

void tst_TestClientDialog::start(const std::string& scenario, const std::string& ports,
                                 const std::string& options)
{
    folder_ = std::make_unique<qt_test::SimFolder>(scenario, ports, options);
    QVERIFY(folder_->isValid());
    answerer_ = qt_test::ScriptedAnswerer();
    host_ = std::make_unique<ui::QtHost>(HARBOR_SOURCE_DIR "/resources/help/");
    host_->SetAnswerer(&answerer_);
    dialog_ = std::make_unique<ui::TestClientDialog>(*host_, folder_->commandLine().c_str());
    QVERIFY2(dialog_->session()->libraryLoaded(), "Tessel.dll not found in " HARBOR_SIM_DIR);
    QVERIFY(dialog_->Create());
    QVERIFY(window() != nullptr && window()->isVisible());
}

void tst_TestClientDialog::cleanup()
{
    // Reports on their way are handled first, as the running program would.
    if (dialog_ && dialog_->handle() != ui::kNoWindow)
        QTRY_COMPARE_WITH_TIMEOUT(dialog_->operationsInFlight(), 0, kReportMs);
    dialog_.reset();
    host_.reset();
    folder_.reset();
    // Every workspace object and result file was given back with the session.
    QCOMPARE(workspace::LiveObjectCount(), std::int64_t(0));
}

void tst_TestClientDialog::click(int id)
{
    auto* button = control<QAbstractButton>(id);
    QVERIFY2(button != nullptr && button->isEnabled(),
             qPrintable(QStringLiteral("button %1 missing or disabled").arg(id)));
    button->click();
}

void tst_TestClientDialog::startedWindowAndFileOpen()
{
    // The dialog's start as the widgets show it; with no port configured, no status text.
    start(qt_test::kFastLink, "", "AUTOCLEAR=TRUE");
    QCOMPARE(status(), QString());
    QCOMPARE(control<QComboBox>(ui::IdBrickList)->count(), 2);
    QCOMPARE(control<QComboBox>(ui::IdBrickList)->currentText(), QStringLiteral("Onyx2"));
    QCOMPARE(control<QComboBox>(ui::IdSourceList)->count(), 4);
    QCOMPARE(control<QComboBox>(ui::IdSourceList)->currentText(), QStringLiteral("Script"));
    QVERIFY(control<QAbstractButton>(ui::IdAutoClear)->isChecked());
    QVERIFY(!control<QAbstractButton>(ui::IdAutoRun)->isChecked());
    QCOMPARE(control<QLineEdit>(ui::IdStressCount)->text(), QStringLiteral("100"));
    QVERIFY(!control<QWidget>(ui::IdRangeShort)->isEnabled());
    // The host hands its help viewer to the dialog it shows.
    QCOMPARE(static_cast<HelpViewer*>(&host_->helpViewer()), dialog_->helpViewer());

    // File Open asks the answerer with the dialog's filters, in Qt's form.
    answerer_.QueueFile(folder_->writeFile(QStringLiteral("tune.onyx2"), "task main\r\n"));
    window()->menuAction(ui::IdFileOpen)->trigger();
    QCOMPARE(answerer_.fileDialogs.size(), std::size_t(1));
    const auto& open = answerer_.fileDialogs[0];
    QCOMPARE(open.kind, ui::Answerer::FileDialogKind::Open);
    QCOMPARE(open.initialName, QStringLiteral("*.onyx2"));
    QCOMPARE(open.owner, static_cast<QWidget*>(window()));
    QCOMPARE(open.filters,
             QStringList({"Onyx2 Files (*.onyx2)", "Text files (*.txt)", "All files (*)"}));
    QCOMPARE(window()->windowTitle(), QStringLiteral("Tessel Test Client - tune.onyx2"));
}

void tst_TestClientDialog::clickChangesStatus_data()
{
    QTest::addColumn<QString>("ports");
    QTest::addColumn<QString>("editor");
    QTest::addColumn<int>("source");
    QTest::addColumn<int>("button");
    QTest::addColumn<QString>("expected");

    const QString usb = QString::fromStdString(kUsbPortSetting);
    const QString program = QString::fromStdString(qt_test::SoundProgram(3));
    QTest::newRow("Open without a port")
        << ""
        << "" << 0 << int(ui::IdOpenPort) << "Opened " + kUsbPort + ", Onyx2 brick";
    QTest::newRow("Test") << usb << "" << 0 << int(ui::IdTest) << "Tested OK";
    QTest::newRow("Test without a port") << ""
                                         << "" << 0 << int(ui::IdTest) << "invalid hBrick";
    QTest::newRow("Download") << usb << program << int(ui::SourceListBin) << int(ui::IdDownload)
                              << "Downloaded ok \\(\\d+ mS\\)";
    QTest::newRow("Short") << usb << "" << 0 << int(ui::IdRangeShort) << "Short range";
}

void tst_TestClientDialog::clickChangesStatus()
{
    QFETCH(QString, ports);
    QFETCH(QString, editor);
    QFETCH(int, source);
    QFETCH(int, button);
    QFETCH(QString, expected);

    start(qt_test::ShippedTestScenario(), ports.toStdString());
    setScript(editor, source);
    // Open finds two ports and asks about each; the first is taken. Any other question is
    // a Trouble Shooter offer, answered No.
    if (button == ui::IdOpenPort)
        answerer_.QueueAnswer(true);
    click(button);
    const QRegularExpression pattern(QRegularExpression::anchoredPattern(expected));
    QTRY_VERIFY2_WITH_TIMEOUT(pattern.match(status()).hasMatch(),
                              qPrintable("status box: \"" + status() + "\""), kReportMs);
    // After a script or download operation the focus is back in the editor.
    if (button == ui::IdDownload)
        QCOMPARE(host_->FocusedControl(dialog_->handle()), int(ui::IdEditor));
    // The port is asked without an owner window: the dialog is not yet tied to a port.
    const bool open = button == ui::IdOpenPort;
    for (const auto& question : answerer_.questions) {
        QCOMPARE(question.caption, open ? QStringLiteral("Select Port") : "Diagnostics");
        QCOMPARE(question.owner, open ? nullptr : static_cast<QWidget*>(window()));
    }
    if (open)
        QCOMPARE(answerer_.questions.at(0).text, kUsbPort);
}

void tst_TestClientDialog::longDownloadKeepsTheWindowResponsive()
{
    // 20 milliseconds a command: 150 commands take three seconds.
    start("link-time = 20\n[brick onyx2]\ntype = onyx2\n[port KIVOTOWER1]\n", kUsbPortSetting);
    setScript(QString::fromStdString(qt_test::SoundProgram(150)), ui::SourceListBin);
    int ticks = 0;
    QTimer timer;
    connect(&timer, &QTimer::timeout, this, [&] { ++ticks; });
    timer.start(20);
    click(ui::IdDownload);
    // The button's command returned with the download under way, not done.
    QVERIFY2(!status().startsWith(QStringLiteral("Downloaded ok")), qPrintable(status()));
    const int ticksAtClick = ticks;
    auto* box = control<QPlainTextEdit>(ui::IdStatusBox);
    QStringList seen;
    connect(box, &QPlainTextEdit::textChanged, this, [&] { seen << box->toPlainText(); });
    QTRY_VERIFY_WITH_TIMEOUT(status().startsWith(QStringLiteral("Downloaded ok")), kReportMs);
    // The library's thread reported progress on the way, and the loop kept running meanwhile:
    // timers fired, and so would paint and input events.
    QVERIFY2(seen.first().startsWith(QLatin1String("Downloading: ")), qPrintable(seen.join('|')));
    QVERIFY(ticks > ticksAtClick);
}

QTEST_MAIN(tst_TestClientDialog)
#include "tst_testclientdialog.moc"
