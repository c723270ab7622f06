#include "ui/qt/Answerer.h"

#include <QFileDialog>
#include <QMessageBox>

namespace ui {

bool SystemAnswerer::AskYesNo(QWidget* owner, const QString& caption, const QString& text)
{
    QMessageBox box(QMessageBox::Question, caption, text, QMessageBox::Yes | QMessageBox::No,
                    owner);
    box.setDefaultButton(QMessageBox::Yes);
    return box.exec() == QMessageBox::Yes;
}

void SystemAnswerer::ShowMessage(QWidget* owner, const QString& caption, const QString& text)
{
    QMessageBox box(QMessageBox::NoIcon, caption, text, QMessageBox::Ok, owner);
    box.exec();
}

QString SystemAnswerer::ChooseFile(QWidget* owner, FileDialogKind kind, const QString& initialName,
                                   const QStringList& filters)
{
    QFileDialog dialog(owner);
    dialog.setNameFilters(filters);
    if (!filters.isEmpty())
        dialog.selectNameFilter(filters.first());
    // A wildcard as the initial name is only a filter, which the name filters already
    // apply; put into the name box it would be taken for a file name.
    if (!initialName.isEmpty() && !initialName.contains(QLatin1Char('*')) &&
        !initialName.contains(QLatin1Char('?')))
        dialog.selectFile(initialName);
    if (kind == FileDialogKind::Save) {
        dialog.setAcceptMode(QFileDialog::AcceptSave);
        dialog.setFileMode(QFileDialog::AnyFile);
        // Saving over an existing script asks nothing, and a name typed without an
        // extension is written as typed.
        dialog.setOption(QFileDialog::DontConfirmOverwrite, true);
    } else {
        dialog.setAcceptMode(QFileDialog::AcceptOpen);
        dialog.setFileMode(QFileDialog::ExistingFile);
    }
    if (dialog.exec() != QDialog::Accepted || dialog.selectedFiles().isEmpty())
        return QString();
    return dialog.selectedFiles().first();
}

} // namespace ui
