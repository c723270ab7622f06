// The Info report: the active brick, the active port, the system and the capacities of the
// brick type, placed in the status box in one go.
#include <memory>
#include <new>

#include "session/BrickSession.h"
#include "tessel/ErrorValue.h"
#include "tools/BrickAccess.h"
#include "tools/BrickQueries.h"
#include "tools/InfoReport.h"
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnInfo()
{
    if (!PortAndLibraryReady())
        return;
    tools::SessionBrickAccess access(*session_);
    tools::BrickQueries queries(access);
    // The report's 8 KB buffer lives on the heap rather than the handler's stack.
    std::unique_ptr<tools::InfoReport> report(new (std::nothrow)
                                                  tools::InfoReport(access, queries));
    if (!report) {
        ShowError(static_cast<std::int32_t>(RwNoMemory.packedCode()), nullptr);
        return;
    }
    if (!report->Build(brickHandle_)) {
        ShowFailure("Failed to get brick type");
        return;
    }
    ShowStatus(report->text());
}

} // namespace ui
