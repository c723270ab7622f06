// Convert to CSV and Macro To CSV.
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnConvertToCsv()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnMacroToCsv()
{
    // TODO: not written yet; shows nothing.
}

} // namespace ui
