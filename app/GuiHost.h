// The windowed host, when this build has one.
#pragma once

#include <memory>

#include "ui/Window.h"

namespace app {

// Makes the toolkit's application object (which may take its own options out of argv) and
// the host around it; null when this build has no window.
std::unique_ptr<ui::WindowHost> CreateGuiHost(int& argc, char** argv);

} // namespace app
