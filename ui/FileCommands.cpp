// File commands: New, Open..., Save, Save As...
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnFileNew()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnFileOpen()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnFileSave()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnFileSaveAs()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::WriteEditorFile(const char* path)
{
    // TODO: not written yet; shows nothing.
}

} // namespace ui
