// The whole content of a workspace file as text.
#pragma once

#include <string>

class ReaderWriter;

namespace tools {

// Appends the content of file to text; false (text unchanged) for a null file, a file that
// does not open for reading with RwOk, or one without content. The file is closed again;
// its reference stays the caller's.
bool AppendFileText(ReaderWriter* file, std::string& text);

} // namespace tools
