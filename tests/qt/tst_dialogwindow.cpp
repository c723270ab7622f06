// The window of dialog 101: every control of the template with its id, kind, caption,
// initial state and visibility, the menu 202 with its ids, and the commands its controls send.
#include <QAction>
#include <QCheckBox>
#include <QFontInfo>
#include <QLineEdit>
#include <QMenuBar>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QSignalSpy>
#include <QTest>

#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/HostStyle.h"

using ui::DialogWindow;

class tst_DialogWindow : public QObject {
    Q_OBJECT

private slots:
    void windowAndLayout();
    void controls();
    void menu_data();
    void menu();
    void controlsSendTheirCommands();
    void escapeAndCloseBoxSendCancel();
    void hostStyleDrawsTheSameArrows();
};

void tst_DialogWindow::windowAndLayout()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    QCOMPARE(window.windowTitle(), QStringLiteral("Tessel Test Client"));
    // 372 by 289 dialog units of the dialog font; minimise box only, fixed size.
    QCOMPARE(window.centralWidget()->size(), QSize(window.pixelsX(372), window.pixelsY(289)));
    QVERIFY(window.pixelsX(372) > 372 && window.pixelsY(289) > 289);
    QVERIFY(window.windowFlags() & Qt::WindowMinimizeButtonHint);
    QVERIFY(!(window.windowFlags() & Qt::WindowMaximizeButtonHint));
    QCOMPARE(window.minimumSize(), window.maximumSize());

    const QRect client = window.centralWidget()->rect();
    const QList<int> ids = window.controlIds();
    QCOMPARE(ids.size(), 26);
    for (int a : ids) {
        const QRect area = window.control(a)->geometry();
        QVERIFY2(client.contains(area), qPrintable(QStringLiteral("control %1 sticks out").arg(a)));
        for (int b : ids) {
            QVERIFY2(a >= b || !area.intersects(window.control(b)->geometry()),
                     qPrintable(QStringLiteral("controls %1 and %2 overlap").arg(a).arg(b)));
        }
    }

    // A monospace, unwrapped script editor with both scroll bars; a read-only status box
    // that scrolls vertically only.
    auto* editor = qobject_cast<QPlainTextEdit*>(window.control(1015));
    auto* status = qobject_cast<QPlainTextEdit*>(window.control(1003));
    QVERIFY(!editor->isReadOnly() && status->isReadOnly());
    QVERIFY(QFontInfo(editor->font()).fixedPitch());
    QCOMPARE(editor->lineWrapMode(), QPlainTextEdit::NoWrap);
    QCOMPARE(editor->horizontalScrollBarPolicy(), Qt::ScrollBarAlwaysOn);
    QCOMPARE(editor->verticalScrollBarPolicy(), Qt::ScrollBarAlwaysOn);
    QCOMPARE(status->verticalScrollBarPolicy(), Qt::ScrollBarAlwaysOn);
    QCOMPARE(status->horizontalScrollBarPolicy(), Qt::ScrollBarAlwaysOff);
}

void tst_DialogWindow::controls()
{
    struct Expected {
        int id;
        const char* className;
        const char* caption;
    };
    // clang-format off
    const Expected table[] = {
        {1015, "QPlainTextEdit", ""}, {1003, "QPlainTextEdit", ""}, {208, "QComboBox", ""},
        {209, "QComboBox", ""}, {210, "QCheckBox", "Auto Clear"}, {223, "QCheckBox", "Auto Run"},
        {224, "QCheckBox", "Receive"}, {213, "QLineEdit", ""}, {222, "QLineEdit", ""},
        {214, "QLineEdit", ""}, {218, "QRadioButton", "Short"}, {219, "QRadioButton", "Medium"},
        {220, "QRadioButton", "Long"}, {205, "QPushButton", "Open"}, {215, "QPushButton", "Close"},
        {204, "QPushButton", "Test"}, {202, "QPushButton", "Validate"},
        {203, "QPushButton", "Execute"}, {201, "QPushButton", "Download"},
        {211, "QPushButton", "Download File"}, {207, "QPushButton", "New Firmware"},
        {206, "QPushButton", "Statistics"}, {216, "QPushButton", "Info"},
        {217, "QPushButton", "Async"}, {212, "QPushButton", "Stress"}, {221, "QPushButton", "Upload"},
    };
    // clang-format on
    const QList<int> disabled = {218, 219, 220};
    const QList<int> hidden = {217, 212, 214, 221, 224};
    DialogWindow window(ui::TestClientDialogTemplate());
    window.show();
    for (const Expected& e : table) {
        const QByteArray row = QByteArray::number(e.id);
        QWidget* widget = window.control(e.id);
        QVERIFY2(widget != nullptr, row);
        QVERIFY2(QByteArray(widget->metaObject()->className()) == e.className, row);
        QCOMPARE(widget->property("controlId").toInt(), e.id);
        QString caption;
        if (auto* button = qobject_cast<QAbstractButton*>(widget)) {
            caption = button->text();
            // Check boxes and radio buttons start unchecked; the dialog's start sets them.
            QVERIFY2(!button->isChecked(), row);
        } else if (auto* line = qobject_cast<QLineEdit*>(widget)) {
            caption = line->text();
        } else if (auto* edit = qobject_cast<QPlainTextEdit*>(widget)) {
            caption = edit->toPlainText();
        }
        QCOMPARE(caption, QString::fromLatin1(e.caption));
        QVERIFY2(widget->isEnabled() != disabled.contains(e.id), row);
        const bool visible = !hidden.contains(e.id);
        QVERIFY2(widget->isVisible() == visible && widget->isHidden() != visible, row);
    }
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
        QCOMPARE(items[i]->isSeparator(), ids[i] == 0);
        if (ids[i] == 0)
            continue;
        QCOMPARE(items[i]->text(), captions[i]);
        QCOMPARE(items[i]->property("commandId").toInt(), ids[i]);
        QCOMPARE(items[i]->isEnabled(), !greyed.contains(ids[i]));
    }
}

void tst_DialogWindow::controlsSendTheirCommands()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    window.show();
    QSignalSpy commands(&window, &DialogWindow::commandIssued);
    // Hidden buttons are reached by their menu items; the button itself sends the same.
    for (int id : {205, 215, 204, 202, 203, 201, 211, 207, 206, 216, 217, 212, 221}) {
        commands.clear();
        qobject_cast<QPushButton*>(window.control(id))->click();
        if (QAction* item = window.menuAction(id))
            item->trigger();
        QCOMPARE(commands.count(), window.menuAction(id) ? 2 : 1);
        for (const QList<QVariant>& sent : commands)
            QCOMPARE(sent.at(0).toInt(), id);
    }

    // A greyed item sends nothing, yet is wired for when the dialog enables it.
    commands.clear();
    QAction* convert = window.menuAction(32775);
    convert->trigger();
    QCOMPARE(commands.count(), 0);
    convert->setEnabled(true);
    convert->trigger();
    QCOMPARE(commands.count(), 1);
    QCOMPARE(commands.at(0).at(0).toInt(), 32775);

    // A check box is toggled before its command goes out.
    auto* autoRun = qobject_cast<QCheckBox*>(window.control(223));
    bool checkedWhenSent = false;
    connect(&window, &DialogWindow::commandIssued, this,
            [&](int id) { checkedWhenSent = id == 223 && autoRun->isChecked(); });
    QTest::mouseClick(autoRun, Qt::LeftButton, {}, QPoint(4, autoRun->height() / 2));
    QVERIFY(autoRun->isChecked() && checkedWhenSent);
}

void tst_DialogWindow::escapeAndCloseBoxSendCancel()
{
    DialogWindow window(ui::TestClientDialogTemplate());
    window.show();
    QVERIFY(QTest::qWaitForWindowExposed(&window));
    QSignalSpy commands(&window, &DialogWindow::commandIssued);
    QTest::keyClick(window.control(1015), Qt::Key_Escape);
    // The close box asks the dialog, which decides; the window stays until it is destroyed.
    QVERIFY(!window.close());
    QVERIFY(window.isVisible());
    QCOMPARE(commands.count(), 2);
    QCOMPARE(commands.at(0).at(0).toInt(), ui::kIdCancel);
    QCOMPARE(commands.at(1).at(0).toInt(), ui::kIdCancel);
    window.allowClose();
    QVERIFY(window.close());
}

// The host style only puts off loading the menu bar's overflow arrows: once painted, they are
// the base style's own, pixel for pixel; every other icon is the base style's at once.
void tst_DialogWindow::hostStyleDrawsTheSameArrows()
{
    ui::HostStyle host(QStringLiteral("fusion"));
    const QStyle* base = host.baseStyle();
    for (QStyle::StandardPixmap which :
         {QStyle::SP_ToolBarHorizontalExtensionButton, QStyle::SP_ToolBarVerticalExtensionButton,
          QStyle::SP_DialogOkButton}) {
        const QIcon deferred = host.standardIcon(which);
        QVERIFY(!deferred.isNull());
        const QImage drawn = deferred.pixmap(QSize(16, 16)).toImage();
        QVERIFY(!drawn.isNull());
        QCOMPARE(drawn, base->standardIcon(which).pixmap(QSize(16, 16)).toImage());
    }
}

QTEST_MAIN(tst_DialogWindow)
#include "tst_dialogwindow.moc"
