// Stress test and About.
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnStress()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::StressStep()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnAbout()
{
    // TODO: not written yet; shows nothing.
}

} // namespace ui
