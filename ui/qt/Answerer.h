// Who answers the questions and file dialogs of the Qt host. The window program uses the
// real message boxes and file dialogs (SystemAnswerer); tests inject an answerer of their own
// so that nothing ever waits for a person.
#pragma once

#include <QString>
#include <QStringList>

class QWidget;

namespace ui {

class Answerer {
public:
    enum class FileDialogKind { Open, Save };

    virtual ~Answerer() = default;

    // A question with Yes and No buttons; true for Yes. owner is null for a box that stands
    // on its own.
    virtual bool AskYesNo(QWidget* owner, const QString& caption, const QString& text) = 0;
    // A message with an OK button.
    virtual void ShowMessage(QWidget* owner, const QString& caption, const QString& text) = 0;
    // A file dialog. filters are Qt name filters ("Onyx2 Files (*.onyx2)"), the first one
    // preselected; initialName is the name the dialog starts with. Returns the chosen path,
    // or a null string when the dialog was cancelled.
    virtual QString ChooseFile(QWidget* owner, FileDialogKind kind, const QString& initialName,
                               const QStringList& filters) = 0;
};

// The real message boxes and the system's file dialogs, all modal.
class SystemAnswerer final : public Answerer {
public:
    bool AskYesNo(QWidget* owner, const QString& caption, const QString& text) override;
    void ShowMessage(QWidget* owner, const QString& caption, const QString& text) override;
    QString ChooseFile(QWidget* owner, FileDialogKind kind, const QString& initialName,
                       const QStringList& filters) override;
};

} // namespace ui
