// The Info report.
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnInfo()
{
    // TODO: not written yet; shows nothing.
}

} // namespace ui
