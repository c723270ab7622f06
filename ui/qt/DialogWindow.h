// The window of a dialog template: a top-level window with the template's menu bar and its
// controls placed as the template says, dialog units turned into pixels with the dialog
// font. It knows nothing of the dialog object behind it: every command — a button, a check
// box, a radio button, a menu item, Escape or the close box — leaves as commandIssued(id).
#pragma once

#include <QHash>
#include <QMainWindow>

#include "ui/DialogLayout.h"

class QAction;
class QButtonGroup;

namespace ui {

class DialogWindow final : public QMainWindow {
    Q_OBJECT

public:
    explicit DialogWindow(const DialogTemplate& layout);

    // The control with the id, or null.
    QWidget* control(int id) const { return controls_.value(id, nullptr); }
    // The menu item with the id, or null.
    QAction* menuAction(int id) const { return actions_.value(id, nullptr); }
    QList<int> controlIds() const { return controls_.keys(); }
    QList<int> menuIds() const { return actions_.keys(); }
    // The template's kind of a control.
    ControlKind controlKind(int id) const { return kinds_.value(id, ControlKind::Label); }
    // Pixels of a horizontal and a vertical length in dialog units.
    int pixelsX(int units) const;
    int pixelsY(int units) const;

    // Lets the next close through: the host calls it when the dialog destroys its window.
    void allowClose() { closeAllowed_ = true; }

signals:
    // A control or menu item with this id was used, as a command message carries it.
    void commandIssued(int id);

protected:
    // The close box is the cancel command; the dialog decides what happens.
    void closeEvent(QCloseEvent* event) override;
    // Escape is the cancel command too.
    void keyPressEvent(QKeyEvent* event) override;

private:
    QWidget* makeControl(const ControlSpec& spec, QWidget* parent);
    void buildMenus(const DialogTemplate& layout);

    QHash<int, QWidget*> controls_;
    QHash<int, ControlKind> kinds_;
    QHash<int, QAction*> actions_;
    QButtonGroup* radioGroup_ = nullptr;
    int baseX_ = 6;
    int baseY_ = 13;
    bool closeAllowed_ = false;
};

} // namespace ui
