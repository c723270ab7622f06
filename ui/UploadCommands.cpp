// Upload of the current program slot as listing lines into the script editor.
#include <string>

#include "session/BrickSession.h"
#include "tools/BrickAccess.h"
#include "tools/BrickQueries.h"
#include "tools/ProgramUpload.h"
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnUpload()
{
    if (!PortAndLibraryReady())
        return;
    tools::SessionBrickAccess access(*session_);
    tools::BrickQueries queries(access);
    tools::ProgramUpload upload(queries);
    std::string lines;
    const tools::UploadOutcome outcome = upload.Run(brickHandle_, lines);
    switch (outcome.stop) {
    case tools::UploadStop::ProgramSlot:
        ShowFailure("Failed to get program slot");
        OfferTroubleShooter(outcome.code);
        return;
    case tools::UploadStop::MemoryMap:
        ShowFailure("Failed to get memory map");
        OfferTroubleShooter(outcome.code);
        return;
    case tools::UploadStop::None:
        break;
    }
    // A failed location or range read keeps the lines made before it. currentFile and the
    // title stay as they are: the text is not that file's.
    host_.SetControlText(handle(), IdEditor, lines.c_str());
    ShowStatus("Ok");
}

tessel::Long TestClientDialog::AppendTaskLine(int task, std::int32_t start, std::int32_t size,
                                              std::int32_t taskByte, std::string& lines)
{
    if (session_ == nullptr)
        return static_cast<tessel::Long>(tessel::kLinkFailed);
    tools::SessionBrickAccess access(*session_);
    tools::BrickQueries queries(access);
    return tools::ProgramUpload(queries).AppendTaskLine(brickHandle_, task, start, size, taskByte,
                                                        lines);
}

tessel::Long TestClientDialog::AppendSubLine(int sub, std::int32_t start, std::int32_t size,
                                             std::string& lines)
{
    if (session_ == nullptr)
        return static_cast<tessel::Long>(tessel::kLinkFailed);
    tools::SessionBrickAccess access(*session_);
    tools::BrickQueries queries(access);
    return tools::ProgramUpload(queries).AppendSubLine(brickHandle_, sub, start, size, lines);
}

} // namespace ui
