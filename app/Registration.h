// Registering the program with the desktop (RegServer) and removing it again (UnregServer).
#pragma once

namespace app {

// Returns the process exit code: 0 when it worked.
int RegisterProgram();
int UnregisterProgram();

} // namespace app
