#include "ui/qt/DialogWindow.h"

#include <QAction>
#include <QApplication>
#include <QButtonGroup>
#include <QCheckBox>
#include <QCloseEvent>
#include <QComboBox>
#include <QFontDatabase>
#include <QGroupBox>
#include <QKeyEvent>
#include <QLabel>
#include <QLineEdit>
#include <QMenuBar>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QRadioButton>

#include "ui/Window.h"

namespace ui {

namespace {

// The dialog font's average character width, as the dialog base unit is measured.
int AverageCharWidth(const QFontMetrics& metrics)
{
    const QString alphabet = QStringLiteral("ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz");
    return (metrics.horizontalAdvance(alphabet) / 26 + 1) / 2;
}

} // namespace

DialogWindow::DialogWindow(const DialogTemplate& layout)
{
    setWindowFlags(Qt::Window | Qt::WindowTitleHint | Qt::WindowSystemMenuHint |
                   Qt::WindowMinimizeButtonHint | Qt::WindowCloseButtonHint);
    setWindowTitle(QString::fromUtf8(layout.caption ? layout.caption : ""));

    // The template's point size with the system's own family: the template's face is a
    // Windows one, and the dialog units follow whatever font is used.
    QFont dialogFont = QApplication::font();
    if (layout.fontPoints > 0)
        dialogFont.setPointSize(layout.fontPoints);
    setFont(dialogFont);
    const QFontMetrics metrics(dialogFont);
    baseX_ = qMax(1, AverageCharWidth(metrics));
    baseY_ = qMax(1, metrics.height());

    buildMenus(layout);

    auto* client = new QWidget(this);
    client->setFixedSize(pixelsX(layout.width), pixelsY(layout.height));
    setCentralWidget(client);
    for (int i = 0; i < layout.controlCount; ++i)
        makeControl(layout.controls[i], client);
    // Not resizable, as the dialog frame is not.
    setFixedSize(sizeHint());
}

int DialogWindow::pixelsX(int units) const
{
    return (units * baseX_ + 2) / 4;
}

int DialogWindow::pixelsY(int units) const
{
    return (units * baseY_ + 4) / 8;
}

QWidget* DialogWindow::makeControl(const ControlSpec& spec, QWidget* parent)
{
    const QString caption = QString::fromUtf8(spec.caption ? spec.caption : "");
    const int id = spec.id;
    QWidget* widget = nullptr;
    int height = pixelsY(spec.height);

    switch (spec.kind) {
    case ControlKind::Label:
        widget = new QLabel(caption, parent);
        break;
    case ControlKind::GroupBox: {
        auto* frame = new QGroupBox(caption, parent);
        // The controls are placed over the frame, not laid out in it; a flat frame keeps its
        // border from running through the first of them.
        frame->setFlat(true);
        widget = frame;
        break;
    }
    case ControlKind::Edit:
        widget = new QLineEdit(parent);
        break;
    case ControlKind::MultiEdit: {
        auto* edit = new QPlainTextEdit(parent);
        edit->setReadOnly((spec.style & StyleReadOnly) != 0);
        const bool horizontal = (spec.style & StyleHScroll) != 0;
        // Without a horizontal scroll bar the lines wrap at the edge, as a multi-line edit
        // control wraps them.
        edit->setLineWrapMode(horizontal ? QPlainTextEdit::NoWrap : QPlainTextEdit::WidgetWidth);
        edit->setHorizontalScrollBarPolicy(horizontal ? Qt::ScrollBarAlwaysOn
                                                      : Qt::ScrollBarAlwaysOff);
        edit->setVerticalScrollBarPolicy((spec.style & StyleVScroll) != 0 ? Qt::ScrollBarAlwaysOn
                                                                          : Qt::ScrollBarAlwaysOff);
        if (!edit->isReadOnly()) {
            // The script editor: a script lines up in columns.
            edit->setFont(QFontDatabase::systemFont(QFontDatabase::FixedFont));
            edit->setTabStopDistance(4 * QFontMetricsF(edit->font()).horizontalAdvance(' '));
        }
        widget = edit;
        break;
    }
    case ControlKind::DropList: {
        auto* list = new QComboBox(parent);
        list->setEditable(false);
        // The template's height is that of the dropped list; the closed box is one line.
        height = list->sizeHint().height();
        widget = list;
        break;
    }
    case ControlKind::CheckBox: {
        auto* box = new QCheckBox(caption, parent);
        connect(box, &QCheckBox::clicked, this, [this, id] { emit commandIssued(id); });
        widget = box;
        break;
    }
    case ControlKind::RadioButton: {
        auto* radio = new QRadioButton(caption, parent);
        // A group runs from a group start to the next one; a button in a group unchecks
        // the others of its group and no one else.
        if (radioGroup_ == nullptr || (spec.style & StyleGroupStart) != 0) {
            radioGroup_ = new QButtonGroup(this);
            radioGroup_->setExclusive(true);
        }
        radioGroup_->addButton(radio);
        connect(radio, &QRadioButton::clicked, this, [this, id] { emit commandIssued(id); });
        widget = radio;
        break;
    }
    case ControlKind::PushButton: {
        auto* button = new QPushButton(caption, parent);
        button->setAutoDefault(false);
        connect(button, &QPushButton::clicked, this, [this, id] { emit commandIssued(id); });
        widget = button;
        break;
    }
    }

    widget->setGeometry(pixelsX(spec.x), pixelsY(spec.y), pixelsX(spec.width), height);
    if ((spec.style & StyleDisabled) != 0)
        widget->setEnabled(false);
    if ((spec.style & StyleHidden) != 0)
        widget->hide();
    if (id != kNoControlId) {
        widget->setObjectName(QStringLiteral("control%1").arg(id));
        widget->setProperty("controlId", id);
        controls_.insert(id, widget);
        kinds_.insert(id, spec.kind);
    } else {
        // Labels and frames take no focus and stay behind the controls they frame.
        widget->setFocusPolicy(Qt::NoFocus);
        widget->lower();
    }
    return widget;
}

void DialogWindow::buildMenus(const DialogTemplate& layout)
{
    QMenuBar* bar = menuBar();
    for (int m = 0; m < layout.menuCount; ++m) {
        const MenuSpec& spec = layout.menus[m];
        QMenu* menu = bar->addMenu(QString::fromUtf8(spec.caption ? spec.caption : ""));
        for (int i = 0; i < spec.itemCount; ++i) {
            const MenuItemSpec& item = spec.items[i];
            if (item.caption == nullptr) {
                menu->addSeparator();
                continue;
            }
            QAction* action = menu->addAction(QString::fromUtf8(item.caption));
            const int id = item.id;
            action->setObjectName(QStringLiteral("menu%1").arg(id));
            action->setProperty("commandId", id);
            // A greyed item is still wired: enabled again, it sends its command.
            action->setEnabled(!item.greyed);
            connect(action, &QAction::triggered, this, [this, id] { emit commandIssued(id); });
            if (!actions_.contains(id))
                actions_.insert(id, action);
        }
    }
}

void DialogWindow::closeEvent(QCloseEvent* event)
{
    if (closeAllowed_) {
        event->accept();
        return;
    }
    event->ignore();
    emit commandIssued(kIdCancel);
}

void DialogWindow::keyPressEvent(QKeyEvent* event)
{
    if (event->key() == Qt::Key_Escape && event->modifiers() == Qt::NoModifier) {
        emit commandIssued(kIdCancel);
        return;
    }
    QMainWindow::keyPressEvent(event);
}

} // namespace ui
