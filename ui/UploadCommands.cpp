// Upload of the current program slot as listing lines.
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnUpload()
{
    // TODO: not written yet; shows nothing.
}

tessel::Long TestClientDialog::AppendTaskLine(int task, std::int32_t start, std::int32_t size,
                                              std::int32_t taskByte, std::string& lines)
{
    // TODO: not written yet; shows nothing.
    return -1;
}

tessel::Long TestClientDialog::AppendSubLine(int sub, std::int32_t start, std::int32_t size,
                                             std::string& lines)
{
    // TODO: not written yet; shows nothing.
    return -1;
}

} // namespace ui
