// Convert to CSV and Macro To CSV: the library's CSV listing of the editor's script, or the
// filtered listing of one macro call, replaces the editor's text.
#include "errors/ErrorSink.h"
#include "session/BrickSession.h"
#include "tools/MacroToCsv.h"
#include "ui/TestClientDialog.h"

namespace ui {

namespace {

constexpr const char* kMacroCall = "bb_PlayNote(440,50,60)";
constexpr const char* kMacroHeader = "Onyx2MLT.h";

// Puts a listing into the editor, or shows why there is none; the listing is released.
void ShowListing(TestClientDialog& dialog, std::int32_t code, ReaderWriter** listing,
                 ErrorSink& sink)
{
    if (code >= 0) {
        // An empty listing empties the editor.
        std::unique_ptr<char[]> text = TestClientDialog::ReadFileText(*listing);
        dialog.host().SetControlText(dialog.handle(), IdEditor, text ? text.get() : "");
        BrickSession::ReleaseReaderWriter(listing);
    } else {
        BrickSession::ReleaseReaderWriter(listing);
        dialog.PlaceEditorCaret(sink.GetPosition());
        dialog.ShowError(code, &sink);
    }
    dialog.FocusEditor();
}

} // namespace

void TestClientDialog::OnConvertToCsv()
{
    ClearStatus();
    const tessel::Short brickType = SelectedBrickType();
    std::unique_ptr<char[]> text = ReadEditorText();
    if (!text || text[0] == '\0')
        return;
    ErrorSink sink;
    ReaderWriter* listing = nullptr;
    const tessel::Long code = session_ != nullptr
                                  ? session_->TranslateToCsv(brickType, text.get(), &listing, &sink)
                                  : static_cast<tessel::Long>(tessel::kLinkFailed);
    text.reset();
    ShowListing(*this, code, &listing, sink);
}

void TestClientDialog::OnMacroToCsv()
{
    ClearStatus();
    const tessel::Short brickType = SelectedBrickType();
    ErrorSink sink;
    ReaderWriter* result = nullptr;
    const std::int32_t code =
        session_ != nullptr
            ? tools::MacroToCsv(*session_, brickType, kMacroCall, kMacroHeader, &result, &sink)
            : static_cast<std::int32_t>(tessel::kLinkFailed);
    ShowListing(*this, code, &result, sink);
}

} // namespace ui
