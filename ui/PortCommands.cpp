// Port commands: Open, Close, Test, Statistics and the infrared range.
#include "ui/TestClientDialog.h"

namespace ui {

void TestClientDialog::OnOpenPort()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnClosePort()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnTest()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnStatistics()
{
    // TODO: not written yet; shows nothing.
}

void TestClientDialog::OnRange(tessel::Short range)
{
    // TODO: not written yet; shows nothing.
}

bool TestClientDialog::OnPortOpened(const char* portName)
{
    // TODO: not written yet; shows nothing.
    return false;
}

tessel::Short TestClientDialog::DetectBrick(char* name)
{
    // TODO: not written yet; shows nothing.
    name[0] = '\0';
    return 0;
}

} // namespace ui
