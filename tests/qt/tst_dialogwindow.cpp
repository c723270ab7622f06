// The window of dialog 101 built from its template: the size, every control with its kind,
// caption and initial state, the menu, and the commands the controls and items send.
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

namespace {

const ui::DialogTemplate& Layout()
{
    return ui::TestClientDialogTemplate();
}

} // namespace

class tst_DialogWindow : public QObject {
    Q_OBJECT

private slots:
    void windowAndControls();
    void menu();
    void controlsSendTheirCommands();
    void hostStyleDrawsTheSameArrows();
};

void tst_DialogWindow::windowAndControls()
{
    DialogWindow window(Layout());
    window.show();
    QCOMPARE(window.windowTitle(), QStringLiteral("Tessel Test Client"));
    // 372 by 289 dialog units of the dialog font; minimise box only, fixed size.
    QCOMPARE(window.centralWidget()->size(), QSize(window.pixelsX(372), window.pixelsY(289)));
    QVERIFY(window.pixelsX(372) > 372 && window.pixelsY(289) > 289);
    QVERIFY(window.windowFlags() & Qt::WindowMinimizeButtonHint);
    QVERIFY(!(window.windowFlags() & Qt::WindowMaximizeButtonHint));
    QCOMPARE(window.minimumSize(), window.maximumSize());

    // Each control of the template as the widget of its kind, with its caption and state;
    // check boxes and radio buttons start unchecked, the dialog's start sets them.
    const char* const classes[] = {"QLabel",    "QGroupBox", "QLineEdit",    "QPlainTextEdit",
                                   "QComboBox", "QCheckBox", "QRadioButton", "QPushButton"};
    QList<int> ids;
    for (int i = 0; i < Layout().controlCount; ++i) {
        const ui::ControlSpec& spec = Layout().controls[i];
        if (spec.id == ui::kNoControlId)
            continue;
        ids << spec.id;
        const QByteArray row = QByteArray::number(spec.id);
        QWidget* widget = window.control(spec.id);
        QVERIFY2(widget != nullptr, row);
        QCOMPARE(widget->metaObject()->className(), classes[int(spec.kind)]);
        QCOMPARE(widget->property("controlId").toInt(), spec.id);
        QString caption;
        if (auto* button = qobject_cast<QAbstractButton*>(widget)) {
            caption = button->text();
            QVERIFY2(!button->isChecked(), row);
        } else if (auto* line = qobject_cast<QLineEdit*>(widget)) {
            caption = line->text();
        } else if (auto* edit = qobject_cast<QPlainTextEdit*>(widget)) {
            caption = edit->toPlainText();
        }
        QCOMPARE(caption, QString::fromLatin1(spec.caption));
        QVERIFY2(widget->isEnabled() != bool(spec.style & ui::StyleDisabled), row);
        const bool visible = !(spec.style & ui::StyleHidden);
        QVERIFY2(widget->isVisible() == visible && widget->isHidden() != visible, row);
    }
    QCOMPARE(ids.size(), 26);
    const QRect client = window.centralWidget()->rect();
    for (int a : ids) {
        const QRect area = window.control(a)->geometry();
        QVERIFY2(client.contains(area), qPrintable(QStringLiteral("control %1 sticks out").arg(a)));
        for (int b : ids) {
            QVERIFY2(a == b || !area.intersects(window.control(b)->geometry()),
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

// The menu bar holds the template's menus and items in order, greyed where it says.
void tst_DialogWindow::menu()
{
    DialogWindow window(Layout());
    const QList<QAction*> menus = window.menuBar()->actions();
    QCOMPARE(menus.size(), Layout().menuCount);
    for (int m = 0; m < Layout().menuCount; ++m) {
        const ui::MenuSpec& spec = Layout().menus[m];
        QCOMPARE(menus[m]->text(), QString::fromLatin1(spec.caption));
        const QList<QAction*> items = menus[m]->menu()->actions();
        QCOMPARE(items.size(), spec.itemCount);
        for (int i = 0; i < spec.itemCount; ++i) {
            const ui::MenuItemSpec& item = spec.items[i];
            QCOMPARE(items[i]->isSeparator(), item.caption == nullptr);
            if (item.caption == nullptr)
                continue;
            QCOMPARE(items[i]->text(), QString::fromLatin1(item.caption));
            QCOMPARE(items[i]->property("commandId").toInt(), item.id);
            QCOMPARE(items[i]->isEnabled(), !item.greyed);
            QCOMPARE(window.menuAction(item.id), items[i]);
        }
    }
}

void tst_DialogWindow::controlsSendTheirCommands()
{
    DialogWindow window(Layout());
    window.show();
    QVERIFY(QTest::qWaitForWindowExposed(&window));
    QSignalSpy commands(&window, &DialogWindow::commandIssued);
    const auto sentOnly = [&](int id) {
        const bool once = commands.count() == 1 && commands.at(0).at(0).toInt() == id;
        commands.clear();
        return once;
    };
    // Every button sends its id, hidden ones too.
    for (int id : window.controlIds()) {
        if (auto* button = qobject_cast<QPushButton*>(window.control(id))) {
            button->click();
            QVERIFY2(sentOnly(id), qPrintable(QString::number(id)));
        }
    }
    // So does every menu item; a greyed one sends nothing, yet is wired for when the dialog
    // enables it.
    for (int m = 0; m < Layout().menuCount; ++m) {
        for (int i = 0; i < Layout().menus[m].itemCount; ++i) {
            const ui::MenuItemSpec& spec = Layout().menus[m].items[i];
            QAction* item = window.menuAction(spec.id);
            if (item == nullptr)
                continue;
            item->trigger();
            QCOMPARE(commands.count(), spec.greyed ? 0 : 1);
            item->setEnabled(true);
            commands.clear();
            item->trigger();
            QVERIFY2(sentOnly(spec.id), qPrintable(QString::number(spec.id)));
        }
    }

    // A check box is toggled before its command goes out.
    auto* autoRun = qobject_cast<QCheckBox*>(window.control(223));
    bool checkedWhenSent = false;
    connect(&window, &DialogWindow::commandIssued, this,
            [&](int id) { checkedWhenSent = id == 223 && autoRun->isChecked(); });
    QTest::mouseClick(autoRun, Qt::LeftButton, {}, QPoint(4, autoRun->height() / 2));
    QVERIFY(autoRun->isChecked() && checkedWhenSent && sentOnly(223));

    // Escape and the close box both send Cancel; the dialog decides, so the window stays.
    QTest::keyClick(window.control(1015), Qt::Key_Escape);
    QVERIFY(sentOnly(ui::kIdCancel));
    QVERIFY(!window.close());
    QVERIFY(window.isVisible() && sentOnly(ui::kIdCancel));
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
