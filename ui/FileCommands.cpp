// File commands: New, Open..., Save, Save As...
//
// Script files are plain bytes: the editor's text is written as it stands, with no line-end
// conversion and no terminator, and a file is loaded whole, so a file saved again comes out
// byte for byte as it was read.
#include "ui/TestClientDialog.h"

#include <cstdio>
#include <cstring>

namespace ui {

namespace {

// The first entry is preselected.
constexpr FileFilter kScriptFilters[] = {
    {"Onyx2 Files", "*.onyx2"},
    {"Text files", "*.txt"},
    {"All files", "*.*"},
};
constexpr int kScriptFilterCount = static_cast<int>(sizeof kScriptFilters / sizeof *kScriptFilters);

constexpr const char* kDefaultPattern = "*.onyx2";

// The file dialogs get more room than a current file name can hold, so that a longer
// choice is seen and refused instead of being cut to a different, shorter path that a later
// Save would then write.
constexpr std::uint32_t kChoiceSize = 4 * kPathSize;

} // namespace

void TestClientDialog::OnFileNew()
{
    host_.SetControlText(handle(), IdEditor, "");
    SetCurrentFile("");
    UpdateTitle();
}

bool TestClientDialog::ChooseScriptFile(bool save, char* path, std::uint32_t size)
{
    FileDialogRequest request;
    request.owner = handle();
    request.filters = kScriptFilters;
    request.filterCount = kScriptFilterCount;
    request.path = path;
    request.size = size;
    if (!(save ? host_.ChooseSaveFile(request) : host_.ChooseOpenFile(request)))
        return false;
    path[size - 1] = '\0';
    if (std::strlen(path) >= kPathSize) {
        ShowFailureF("File name too long: %s", path);
        return false;
    }
    return true;
}

void TestClientDialog::OnFileOpen()
{
    char path[kChoiceSize];
    std::snprintf(path, sizeof path, "%s", kDefaultPattern);
    if (!ChooseScriptFile(false, path, sizeof path))
        return;
    if (LoadScriptFile(path))
        SetCurrentFile(path);
    UpdateTitle();
}

void TestClientDialog::OnFileSave()
{
    if (currentFile_[0] == '\0') {
        OnFileSaveAs();
        return;
    }
    // A copy: the write step sets currentFile from its argument.
    char path[kPathSize];
    std::snprintf(path, sizeof path, "%s", currentFile_);
    WriteEditorFile(path);
}

void TestClientDialog::OnFileSaveAs()
{
    char path[kChoiceSize];
    std::snprintf(path, sizeof path, "%s",
                  currentFile_[0] != '\0' ? currentFile_ : kDefaultPattern);
    if (!ChooseScriptFile(true, path, sizeof path))
        return;
    // An existing file is overwritten without a question; the name is taken as typed.
    WriteEditorFile(path);
    UpdateTitle();
}

void TestClientDialog::WriteEditorFile(const char* path)
{
    // The argument may be currentFile itself, which SetCurrentFile overwrites.
    char target[kPathSize];
    std::snprintf(target, sizeof target, "%s", path != nullptr ? path : "");

    const std::unique_ptr<char[]> text = ReadEditorText();
    const std::size_t length = text ? std::strlen(text.get()) : 0;
    bool written = false;
    // An editor that holds text but could not be read (no memory for the copy) must not
    // truncate the file to nothing.
    const bool readable = length > 0 || host_.GetControlTextLength(handle(), IdEditor) == 0;
    if (readable && target[0] != '\0') {
        std::FILE* file = std::fopen(target, "wb");
        if (file != nullptr) {
            written = length == 0 || std::fwrite(text.get(), 1, length, file) == length;
            written = std::fclose(file) == 0 && written;
        }
    }
    SetCurrentFile(target);
    // The name is taken all the same, so a second Save tries the same place; but the user
    // is told, since the title alone would suggest the text is safe on disk.
    if (!written)
        ShowFailureF("Could not write %s", target);
}

} // namespace ui
