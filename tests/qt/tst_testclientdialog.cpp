// The Tessel Test Client dialog in its real window, driven as a user drives it, against the
// simulated library: the initial window, the port, script and range buttons, messages that
// the library's threads post, the file dialogs and the questions.
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

using qt_test::ScriptedAnswerer;
using qt_test::SimFolder;

namespace {

// The USB tower of the shipped scenarios, as the library's port search names it.
const QString kUsbPort = QStringLiteral("KIVOTOWER1");
const std::string kUsbPortSetting = "USB=KIVOTOWER1\n";

// Ample for any report of a simulated library with no link time, even under the sanitizers;
// reaching it means the report never came.
constexpr int kReportMs = 20000;

} // namespace

class tst_TestClientDialog : public QObject {
    Q_OBJECT

private slots:
    void cleanup();

    void initialWindow();
    void clickChangesStatus_data();
    void clickChangesStatus();
    void longDownloadKeepsTheWindowResponsive();
    void fileOpenAndSaveThroughTheAnswerer();
    void failureOffersTroubleShooterOwnedByTheDialog();

private:
    void start(const std::string& scenario, const std::string& ports,
               const std::string& options = "");
    ui::DialogWindow* window() const { return host_->dialogWindow(dialog_->handle()); }
    void click(int id);
    void trigger(int id);
    QString status() const;
    void setEditor(const QString& text);
    void selectSource(int index);

    std::unique_ptr<SimFolder> folder_;
    ScriptedAnswerer answerer_;
    std::unique_ptr<ui::QtHost> host_;
    std::unique_ptr<ui::TestClientDialog> dialog_;
};

void tst_TestClientDialog::start(const std::string& scenario, const std::string& ports,
                                 const std::string& options)
{
    folder_ = std::make_unique<SimFolder>(scenario, ports, options);
    QVERIFY(folder_->isValid());
    answerer_ = ScriptedAnswerer();
    host_ = std::make_unique<ui::QtHost>(HARBOR_SOURCE_DIR "/resources/help/");
    host_->SetAnswerer(&answerer_);
    dialog_ = std::make_unique<ui::TestClientDialog>(*host_, folder_->commandLine().c_str());
    QVERIFY(dialog_->session() != nullptr);
    QVERIFY2(dialog_->session()->libraryLoaded(), "Tessel.dll not found in " HARBOR_SIM_DIR);
    QVERIFY(dialog_->Create());
    QVERIFY(window() != nullptr);
    QVERIFY(window()->isVisible());
}

void tst_TestClientDialog::cleanup()
{
    if (dialog_ && dialog_->handle() != ui::kNoWindow) {
        // Reports on their way are handled first, as the running program would.
        QTRY_COMPARE_WITH_TIMEOUT(dialog_->operationsInFlight(), 0, kReportMs);
    }
    dialog_.reset();
    host_.reset();
    folder_.reset();
    // Every workspace object and result file was given back with the session.
    QCOMPARE(workspace::LiveObjectCount(), std::int64_t(0));
}

void tst_TestClientDialog::click(int id)
{
    auto* button = qobject_cast<QAbstractButton*>(window()->control(id));
    QVERIFY2(button != nullptr, qPrintable(QStringLiteral("no button %1").arg(id)));
    QVERIFY2(button->isEnabled(), qPrintable(QStringLiteral("button %1 is disabled").arg(id)));
    button->click();
}

void tst_TestClientDialog::trigger(int id)
{
    QAction* action = window()->menuAction(id);
    QVERIFY2(action != nullptr, qPrintable(QStringLiteral("no menu item %1").arg(id)));
    action->trigger();
}

QString tst_TestClientDialog::status() const
{
    return qobject_cast<QPlainTextEdit*>(window()->control(ui::IdStatusBox))->toPlainText();
}

void tst_TestClientDialog::setEditor(const QString& text)
{
    qobject_cast<QPlainTextEdit*>(window()->control(ui::IdEditor))->setPlainText(text);
}

void tst_TestClientDialog::selectSource(int index)
{
    qobject_cast<QComboBox*>(window()->control(ui::IdSourceList))->setCurrentIndex(index);
}

void tst_TestClientDialog::initialWindow()
{
    // No port configured: the window opens with no port and no status text.
    start(qt_test::kFastLink, "", "AUTOCLEAR=TRUE");
    QCOMPARE(window()->windowTitle(), QStringLiteral("Tessel Test Client"));
    QCOMPARE(status(), QString());
    QCOMPARE(dialog_->brickHandle(), 0);

    auto* brick = qobject_cast<QComboBox*>(window()->control(ui::IdBrickList));
    auto* source = qobject_cast<QComboBox*>(window()->control(ui::IdSourceList));
    QCOMPARE(brick->count(), 2);
    QCOMPARE(brick->itemText(0), QStringLiteral("Rover"));
    QCOMPARE(brick->itemText(1), QStringLiteral("Onyx2"));
    QCOMPARE(brick->currentIndex(), 1);
    QStringList sources;
    for (int i = 0; i < source->count(); ++i)
        sources << source->itemText(i);
    QCOMPARE(sources, QStringList({"Script", "Opal", "RAW", "BIN"}));
    QCOMPARE(source->currentIndex(), 0);

    QVERIFY(qobject_cast<QAbstractButton*>(window()->control(ui::IdAutoClear))->isChecked());
    QVERIFY(!qobject_cast<QAbstractButton*>(window()->control(ui::IdAutoRun))->isChecked());
    QCOMPARE(qobject_cast<QLineEdit*>(window()->control(ui::IdStressCount))->text(),
             QStringLiteral("100"));
    QVERIFY(window()->control(ui::IdStressCount)->isHidden());
    for (int id : {ui::IdRangeShort, ui::IdRangeMedium, ui::IdRangeLong})
        QVERIFY(!window()->control(id)->isEnabled());
    // The host hands its help viewer to the dialog it shows.
    QCOMPARE(static_cast<HelpViewer*>(&host_->helpViewer()), dialog_->helpViewer());
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
    QTest::newRow("Download") << usb << program << 3 << int(ui::IdDownload)
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
    setEditor(editor);
    selectSource(source);
    // Open finds two ports and asks about each; the first is taken. Any other question is
    // a Trouble Shooter offer, answered No.
    if (button == ui::IdOpenPort)
        answerer_.QueueAnswer(true);
    click(button);
    const QRegularExpression pattern(QRegularExpression::anchoredPattern(expected));
    QTRY_VERIFY2_WITH_TIMEOUT(pattern.match(status()).hasMatch(),
                              qPrintable("status box: \"" + status() + "\""), kReportMs);
    // After a script or download operation the focus is back in the editor.
    if (button == ui::IdDownload && dialog_->brickHandle() != 0)
        QCOMPARE(host_->FocusedControl(dialog_->handle()), int(ui::IdEditor));
    // Which port is asked without an owner window: the dialog is not yet tied to a port.
    for (const auto& question : answerer_.questions) {
        QCOMPARE(question.caption, button == ui::IdOpenPort ? QStringLiteral("Select Port")
                                                            : QStringLiteral("Diagnostics"));
        QCOMPARE(question.owner,
                 button == ui::IdOpenPort ? nullptr : static_cast<QWidget*>(window()));
    }
    if (button == ui::IdOpenPort)
        QCOMPARE(answerer_.questions.at(0).text, kUsbPort);
}

void tst_TestClientDialog::longDownloadKeepsTheWindowResponsive()
{
    // 20 milliseconds a command: 150 commands take three seconds.
    start("link-time = 20\n[brick onyx2]\ntype = onyx2\n[port KIVOTOWER1]\n", kUsbPortSetting);
    setEditor(QString::fromStdString(qt_test::SoundProgram(150)));
    selectSource(ui::SourceListBin);
    int ticks = 0;
    QTimer timer;
    connect(&timer, &QTimer::timeout, this, [&] { ++ticks; });
    timer.start(20);
    click(ui::IdDownload);
    // The button's command returned with the download under way, not done.
    QVERIFY2(!status().startsWith(QStringLiteral("Downloaded ok")), qPrintable(status()));
    const int ticksAtClick = ticks;
    auto* box = qobject_cast<QPlainTextEdit*>(window()->control(ui::IdStatusBox));
    QStringList seen;
    connect(box, &QPlainTextEdit::textChanged, this, [&] { seen << box->toPlainText(); });
    QTRY_VERIFY_WITH_TIMEOUT(status().startsWith(QStringLiteral("Downloaded ok")), kReportMs);
    // The library's thread reported progress on the way.
    QVERIFY2(seen.first().startsWith(QLatin1String("Downloading: ")), qPrintable(seen.join('|')));
    // The loop kept running meanwhile: timers fired, and so would paint and input events.
    QVERIFY(ticks > ticksAtClick);
}

void tst_TestClientDialog::fileOpenAndSaveThroughTheAnswerer()
{
    start(qt_test::kFastLink, "");
    const QByteArray bytes("task main\r\n{\r\n  sound 1\r\n}\r\n");
    const QString source = folder_->writeFile(QStringLiteral("tune.onyx2"), bytes);

    answerer_.QueueFile(source);
    trigger(ui::IdFileOpen);
    QCOMPARE(answerer_.fileDialogs.size(), std::size_t(1));
    const auto& open = answerer_.fileDialogs[0];
    QCOMPARE(open.kind, ui::Answerer::FileDialogKind::Open);
    QCOMPARE(open.initialName, QStringLiteral("*.onyx2"));
    QCOMPARE(open.owner, static_cast<QWidget*>(window()));
    QCOMPARE(open.filters,
             QStringList({"Onyx2 Files (*.onyx2)", "Text files (*.txt)", "All files (*)"}));
    QCOMPARE(window()->windowTitle(), QStringLiteral("Tessel Test Client - tune.onyx2"));

    // CR LF shows as lines and is written back as it was.
    const QString copy = folder_->filePath(QStringLiteral("copy"));
    answerer_.QueueFile(copy);
    trigger(ui::IdFileSaveAs);
    QCOMPARE(answerer_.fileDialogs[1].initialName, source);
    QCOMPARE(qt_test::ReadAll(copy), bytes);
    QCOMPARE(window()->windowTitle(), QStringLiteral("Tessel Test Client - copy"));

    // A cancelled dialog changes nothing.
    trigger(ui::IdFileOpen);
    QCOMPARE(window()->windowTitle(), QStringLiteral("Tessel Test Client - copy"));

    trigger(ui::IdFileNew);
    QCOMPARE(window()->windowTitle(), QStringLiteral("Tessel Test Client - "));
    QCOMPARE(qobject_cast<QPlainTextEdit*>(window()->control(ui::IdEditor))->toPlainText(),
             QString());
}

void tst_TestClientDialog::failureOffersTroubleShooterOwnedByTheDialog()
{
    // No tower anywhere: Open finds nothing, shows why, and offers the Trouble Shooter.
    start("link-time = 0\n[port COM1]\ntower = no\n", "");
    answerer_.QueueAnswer(false);
    click(ui::IdOpenPort);
    QCOMPARE(answerer_.questions.size(), std::size_t(1));
    const auto& offer = answerer_.questions[0];
    QCOMPARE(offer.caption, QStringLiteral("Diagnostics"));
    QCOMPARE(offer.owner, static_cast<QWidget*>(window()));
    QVERIFY2(offer.text.endsWith(QStringLiteral(".\nUse Trouble Shooter?")),
             qPrintable(offer.text));
    QCOMPARE(offer.text.section(QLatin1Char('\n'), 0, 0), status() + ".");
    QVERIFY(!host_->helpViewer().IsOpen());
}

QTEST_MAIN(tst_TestClientDialog)
#include "tst_testclientdialog.moc"
