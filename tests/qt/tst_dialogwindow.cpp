// The window of dialog 101: every control of the template with its id, kind, caption,
// initial state and visibility, the menu 202 with its ids and access keys, and the commands
// its controls send.
#include <QAction>
#include <QCheckBox>
#include <QComboBox>
#include <QFontInfo>
#include <QGroupBox>
#include <QLabel>
#include <QLineEdit>
#include <QMenuBar>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QScrollBar>
#include <QSignalSpy>
#include <QTest>

#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"

using ui::DialogWindow;

class tst_DialogWindow : public QObject {
    Q_OBJECT

private slots:
    void captionAndSize();
    void control_data();
    void control();
    void controlsDoNotOverlap();
    void editorAndStatusBox();
    void menu_data();
    void menu();
    void greyedItemIsWired();
    void buttonSendsItsCommand_data();
    void buttonSendsItsCommand();
    void checkBoxTogglesThenSends();
    void escapeAndCloseBoxSendCancel();

private:
    static QString Caption(QWidget* widget);
};

QString tst_DialogWindow::Caption(QWidget* widget)
{
    if (auto* button = qobject_cast<QAbstractButton*>(widget))
        return button->text();
    if (auto* line = qobject_cast<QLineEdit*>(widget))
        return line->text();
    if (auto* edit = qobject_cast<QPlainTextEdit*>(widget))
        return edit->toPlainText();
    return QString();
}

void tst_DialogWindow::captionAndSize()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    QCOMPARE(window.windowTitle(), QStringLiteral("Tessel Test Client"));
    // 372 by 289 dialog units of the dialog font.
    QCOMPARE(window.centralWidget()->width(), window.pixelsX(372));
    QCOMPARE(window.centralWidget()->height(), window.pixelsY(289));
    QVERIFY(window.pixelsX(372) > 372 && window.pixelsY(289) > 289);
    // Minimise box, no maximise box, and a size the user cannot change.
    QVERIFY(window.windowFlags() & Qt::WindowMinimizeButtonHint);
    QVERIFY(!(window.windowFlags() & Qt::WindowMaximizeButtonHint));
    QCOMPARE(window.minimumSize(), window.maximumSize());
}

void tst_DialogWindow::control_data()
{
    QTest::addColumn<int>("id");
    QTest::addColumn<QString>("className");
    QTest::addColumn<QString>("caption");
    QTest::addColumn<bool>("enabled");
    QTest::addColumn<bool>("visible");

    const QString button = QStringLiteral("QPushButton");
    const QString edit = QStringLiteral("QLineEdit");
    QTest::newRow("1015 editor") << 1015 << "QPlainTextEdit"
                                 << "" << true << true;
    QTest::newRow("208 brick") << 208 << "QComboBox"
                               << "" << true << true;
    QTest::newRow("209 source") << 209 << "QComboBox"
                                << "" << true << true;
    QTest::newRow("210 auto clear") << 210 << "QCheckBox"
                                    << "Auto Clear" << true << true;
    QTest::newRow("223 auto run") << 223 << "QCheckBox"
                                  << "Auto Run" << true << true;
    QTest::newRow("213 download file name") << 213 << edit << "" << true << true;
    QTest::newRow("222 firmware file") << 222 << edit << "" << true << true;
    QTest::newRow("218 short") << 218 << "QRadioButton"
                               << "Short" << false << true;
    QTest::newRow("219 medium") << 219 << "QRadioButton"
                                << "Medium" << false << true;
    QTest::newRow("220 long") << 220 << "QRadioButton"
                              << "Long" << false << true;
    QTest::newRow("205 open") << 205 << button << "Open" << true << true;
    QTest::newRow("215 close") << 215 << button << "Close" << true << true;
    QTest::newRow("204 test") << 204 << button << "Test" << true << true;
    QTest::newRow("202 validate") << 202 << button << "Validate" << true << true;
    QTest::newRow("203 execute") << 203 << button << "Execute" << true << true;
    QTest::newRow("201 download") << 201 << button << "Download" << true << true;
    QTest::newRow("211 download file") << 211 << button << "Download File" << true << true;
    QTest::newRow("207 new firmware") << 207 << button << "New Firmware" << true << true;
    QTest::newRow("206 statistics") << 206 << button << "Statistics" << true << true;
    QTest::newRow("216 info") << 216 << button << "Info" << true << true;
    QTest::newRow("217 async") << 217 << button << "Async" << true << false;
    QTest::newRow("212 stress") << 212 << button << "Stress" << true << false;
    QTest::newRow("214 stress count") << 214 << edit << "" << true << false;
    QTest::newRow("221 upload") << 221 << button << "Upload" << true << false;
    QTest::newRow("224 receive") << 224 << "QCheckBox"
                                 << "Receive" << true << false;
    QTest::newRow("1003 status") << 1003 << "QPlainTextEdit"
                                 << "" << true << true;
}

void tst_DialogWindow::control()
{
    QFETCH(int, id);
    QFETCH(QString, className);
    QFETCH(QString, caption);
    QFETCH(bool, enabled);
    QFETCH(bool, visible);

    DialogWindow window(ui::TestClientDialogTemplate());
    window.show();
    QWidget* widget = window.control(id);
    QVERIFY2(widget != nullptr, "no control with this id");
    QCOMPARE(QString::fromLatin1(widget->metaObject()->className()), className);
    QCOMPARE(widget->property("controlId").toInt(), id);
    QCOMPARE(Caption(widget), caption);
    QCOMPARE(widget->isEnabled(), enabled);
    QCOMPARE(widget->isVisible(), visible);
    QCOMPARE(!widget->isHidden(), visible);
    // Check boxes and radio buttons start unchecked; the dialog's initialisation sets them.
    if (auto* box = qobject_cast<QAbstractButton*>(widget))
        QVERIFY(!box->isChecked());
}

void tst_DialogWindow::controlsDoNotOverlap()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    const QRect client = window.centralWidget()->rect();
    const QList<int> ids = window.controlIds();
    QCOMPARE(ids.size(), 26);
    for (int a : ids) {
        const QRect area = window.control(a)->geometry();
        QVERIFY2(client.contains(area), qPrintable(QStringLiteral("control %1 sticks out").arg(a)));
        for (int b : ids) {
            if (a < b) {
                QVERIFY2(!area.intersects(window.control(b)->geometry()),
                         qPrintable(QStringLiteral("controls %1 and %2 overlap").arg(a).arg(b)));
            }
        }
    }
}

void tst_DialogWindow::editorAndStatusBox()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    auto* editor = qobject_cast<QPlainTextEdit*>(window.control(1015));
    auto* status = qobject_cast<QPlainTextEdit*>(window.control(1003));
    QVERIFY(editor && status);
    QVERIFY(!editor->isReadOnly());
    QVERIFY(status->isReadOnly());
    // A monospace script editor with both scroll bars; lines are not wrapped.
    QVERIFY(QFontInfo(editor->font()).fixedPitch());
    QCOMPARE(editor->lineWrapMode(), QPlainTextEdit::NoWrap);
    QCOMPARE(editor->horizontalScrollBarPolicy(), Qt::ScrollBarAlwaysOn);
    QCOMPARE(editor->verticalScrollBarPolicy(), Qt::ScrollBarAlwaysOn);
    // The status box scrolls vertically only.
    QCOMPARE(status->verticalScrollBarPolicy(), Qt::ScrollBarAlwaysOn);
    QCOMPARE(status->horizontalScrollBarPolicy(), Qt::ScrollBarAlwaysOff);
}

void tst_DialogWindow::menu_data()
{
    QTest::addColumn<QString>("menu");
    QTest::addColumn<QStringList>("captions");
    QTest::addColumn<QList<int>>("ids");
    QTest::addColumn<QList<int>>("greyed");

    QTest::newRow("File") << "File"
                          << QStringList{"&New", "&Open...", "&Save", "Save &As...", "", "E&xit"}
                          << QList<int>{32768, 32774, 32769, 32770, 0, 32771} << QList<int>{};
    QTest::newRow("Port") << "Port" << QStringList{"&Open", "&Test", "&Statistics", "&Close"}
                          << QList<int>{205, 204, 206, 215} << QList<int>{};
    QTest::newRow("Script") << "Script"
                            << QStringList{"&Validate", "&Execute", "Execute &Async", "&Download"}
                            << QList<int>{202, 203, 217, 201} << QList<int>{};
    QTest::newRow("Special") << "Special" << QStringList{"&Info",           "&Upload",
                                                         "&Stress",         "Download &Firmware",
                                                         "&Convert to CSV", "&Macro To CSV"}
                             << QList<int>{216, 221, 212, 207, 32775, 32777} << QList<int>{32775};
    QTest::newRow("Help") << "Help" << QStringList{"About"} << QList<int>{32773} << QList<int>{};
}

void tst_DialogWindow::menu()
{
    QFETCH(QString, menu);
    QFETCH(QStringList, captions);
    QFETCH(QList<int>, ids);
    QFETCH(QList<int>, greyed);

    DialogWindow window(ui::TestClientDialogTemplate());
    QMenu* found = nullptr;
    for (QAction* top : window.menuBar()->actions()) {
        if (QString(top->text()).remove(QLatin1Char('&')) == menu)
            found = top->menu();
    }
    QVERIFY2(found != nullptr, "no such menu");
    const QList<QAction*> items = found->actions();
    QCOMPARE(items.size(), captions.size());
    for (int i = 0; i < items.size(); ++i) {
        if (ids[i] == 0) {
            QVERIFY(items[i]->isSeparator());
            continue;
        }
        QCOMPARE(items[i]->text(), captions[i]);
        QCOMPARE(items[i]->property("commandId").toInt(), ids[i]);
        QCOMPARE(items[i]->isEnabled(), !greyed.contains(ids[i]));
    }
}

void tst_DialogWindow::greyedItemIsWired()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    QSignalSpy commands(&window, &DialogWindow::commandIssued);
    QAction* convert = window.menuAction(32775);
    QVERIFY(convert != nullptr);
    convert->trigger(); // greyed: nothing happens
    QCOMPARE(commands.count(), 0);
    convert->setEnabled(true);
    convert->trigger();
    QCOMPARE(commands.count(), 1);
    QCOMPARE(commands.at(0).at(0).toInt(), 32775);
}

void tst_DialogWindow::buttonSendsItsCommand_data()
{
    QTest::addColumn<int>("id");
    for (int id : {205, 215, 204, 202, 203, 201, 211, 207, 206, 216, 217, 212, 221})
        QTest::newRow(qPrintable(QString::number(id))) << id;
}

void tst_DialogWindow::buttonSendsItsCommand()
{
    QFETCH(int, id);
    DialogWindow window(ui::TestClientDialogTemplate());
    window.show();
    QSignalSpy commands(&window, &DialogWindow::commandIssued);
    auto* button = qobject_cast<QPushButton*>(window.control(id));
    QVERIFY(button != nullptr);
    // Hidden buttons are reached by their menu items; the button itself would send the same.
    button->click();
    QCOMPARE(commands.count(), 1);
    QCOMPARE(commands.at(0).at(0).toInt(), id);
    if (QAction* item = window.menuAction(id)) {
        item->trigger();
        QCOMPARE(commands.count(), 2);
        QCOMPARE(commands.at(1).at(0).toInt(), id);
    }
}

void tst_DialogWindow::checkBoxTogglesThenSends()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    window.show();
    auto* autoRun = qobject_cast<QCheckBox*>(window.control(223));
    QVERIFY(autoRun != nullptr);
    bool checkedWhenSent = false;
    connect(&window, &DialogWindow::commandIssued, this,
            [&](int id) { checkedWhenSent = id == 223 && autoRun->isChecked(); });
    QTest::mouseClick(autoRun, Qt::LeftButton, {}, QPoint(4, autoRun->height() / 2));
    QVERIFY(autoRun->isChecked());
    QVERIFY(checkedWhenSent);
}

void tst_DialogWindow::escapeAndCloseBoxSendCancel()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    window.show();
    QVERIFY(QTest::qWaitForWindowExposed(&window));
    QSignalSpy commands(&window, &DialogWindow::commandIssued);
    QTest::keyClick(window.control(1015), Qt::Key_Escape);
    QCOMPARE(commands.count(), 1);
    QCOMPARE(commands.at(0).at(0).toInt(), ui::kIdCancel);
    // The close box asks the dialog, which decides; the window stays until it is destroyed.
    QVERIFY(!window.close());
    QVERIFY(window.isVisible());
    QCOMPARE(commands.count(), 2);
    QCOMPARE(commands.at(1).at(0).toInt(), ui::kIdCancel);
    window.allowClose();
    QVERIFY(window.close());
}

QTEST_MAIN(tst_DialogWindow)
#include "tst_dialogwindow.moc"
