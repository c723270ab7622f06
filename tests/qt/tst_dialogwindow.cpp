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

#include <memory>

#include "ui/TestClientDialog.h"
#include "ui/qt/DialogWindow.h"
#include "ui/qt/HostStyle.h"

using ui::DialogWindow;

class tst_DialogWindow : public QObject {
    Q_OBJECT

private slots:
    void init();
    void windowAndControls();
    void menu();
    void checkBoxEscapeAndCloseBox();
    void hostStyleDrawsTheSameArrows();

private:
    // True if exactly one command went out since the last call, and it was id.
    bool sentOnly(int id)
    {
        const bool once = commands_->count() == 1 && commands_->at(0).at(0).toInt() == id;
        commands_->clear();
        return once;
    }

    const ui::DialogTemplate& layout_ = ui::TestClientDialogTemplate();
    std::unique_ptr<DialogWindow> window_;
    std::unique_ptr<QSignalSpy> commands_;
};

void tst_DialogWindow::init()
{
    window_ = std::make_unique<DialogWindow>(layout_);
    window_->show();
    QVERIFY(QTest::qWaitForWindowExposed(window_.get()));
    commands_ = std::make_unique<QSignalSpy>(window_.get(), &DialogWindow::commandIssued);
}

void tst_DialogWindow::windowAndControls()
{
    DialogWindow& window = *window_;
    QCOMPARE(window.windowTitle(), QStringLiteral("Tessel Test Client"));
    // 372 by 289 dialog units of the dialog font; minimise box only, fixed size.
    QCOMPARE(window.centralWidget()->size(), QSize(window.pixelsX(372), window.pixelsY(289)));
    QVERIFY(window.pixelsX(372) > 372 && window.pixelsY(289) > 289);
    QVERIFY(window.windowFlags() & Qt::WindowMinimizeButtonHint);
    QVERIFY(!(window.windowFlags() & Qt::WindowMaximizeButtonHint));
    QCOMPARE(window.minimumSize(), window.maximumSize());

    // Each control of the template as the widget of its kind, with its caption and state;
    // check boxes and radio buttons start unchecked, the dialog's start sets them. Every
    // button sends its id, hidden ones too.
    const char* const classes[] = {"QLabel",    "QGroupBox", "QLineEdit",    "QPlainTextEdit",
                                   "QComboBox", "QCheckBox", "QRadioButton", "QPushButton"};
    QList<int> ids;
    for (int i = 0; i < layout_.controlCount; ++i) {
        const ui::ControlSpec& spec = layout_.controls[i];
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
        if (auto* button = qobject_cast<QPushButton*>(widget)) {
            button->click();
            QVERIFY2(sentOnly(spec.id), row);
        }
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

// The menu bar holds the template's menus and items in order, each sending its id; a greyed
// item sends nothing, yet is wired for when the dialog enables it.
void tst_DialogWindow::menu()
{
    const QList<QAction*> menus = window_->menuBar()->actions();
    QCOMPARE(menus.size(), layout_.menuCount);
    for (int m = 0; m < layout_.menuCount; ++m) {
        const ui::MenuSpec& spec = layout_.menus[m];
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
            QCOMPARE(window_->menuAction(item.id), items[i]);
            QCOMPARE(items[i]->isEnabled(), !item.greyed);
            items[i]->trigger();
            QCOMPARE(commands_->count(), item.greyed ? 0 : 1);
            items[i]->setEnabled(true);
            commands_->clear();
            items[i]->trigger();
            QVERIFY(sentOnly(item.id));
        }
    }
}

void tst_DialogWindow::checkBoxEscapeAndCloseBox()
{
    // A check box is toggled before its command goes out.
    auto* autoRun = qobject_cast<QCheckBox*>(window_->control(223));
    bool checkedWhenSent = false;
    connect(window_.get(), &DialogWindow::commandIssued, this,
            [&](int id) { checkedWhenSent = id == 223 && autoRun->isChecked(); });
    QTest::mouseClick(autoRun, Qt::LeftButton, {}, QPoint(4, autoRun->height() / 2));
    QVERIFY(autoRun->isChecked() && checkedWhenSent && sentOnly(223));

    // Escape and the close box both send Cancel; the dialog decides, so the window stays.
    QTest::keyClick(window_->control(1015), Qt::Key_Escape);
    QVERIFY(sentOnly(ui::kIdCancel));
    QVERIFY(!window_->close());
    QVERIFY(window_->isVisible() && sentOnly(ui::kIdCancel));
    window_->allowClose();
    QVERIFY(window_->close());
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
