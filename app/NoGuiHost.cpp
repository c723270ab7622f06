// A build without the Qt host: there is no window to make.
#include "app/GuiHost.h"

namespace app {

std::unique_ptr<ui::WindowHost> CreateGuiHost(int& argc, char** argv)
{
    return nullptr;
}

} // namespace app
