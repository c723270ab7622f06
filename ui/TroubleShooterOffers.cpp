// The dialog's ways into the Trouble Shooter: the two offers and the quiet repair.
#include "ui/TestClientDialog.h"

namespace ui {

bool TestClientDialog::OfferTroubleShooter(std::int32_t value)
{
    // TODO: not written yet; shows nothing.
    return false;
}

bool TestClientDialog::OfferTroubleShooterForStatus(std::int32_t status, const char* statusText)
{
    // TODO: not written yet; shows nothing.
    return false;
}

bool TestClientDialog::QuietRepair(std::int32_t status)
{
    // TODO: not written yet; shows nothing.
    return false;
}

} // namespace ui
