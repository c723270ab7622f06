// Reading and writing the client's workspace files through the boundary interfaces only. The
// library never creates an entry: it reads and writes handles it was given and opens handles
// on entries it finds in the tree.
#pragma once

#include <cstddef>
#include <string>

class DirEnt;
class ReaderWriter;

namespace sim {

// Files larger than this are refused rather than read into memory whole.
constexpr std::size_t kMaxFileBytes = 8u << 20;

enum class ReadResult { Ok, NotReadable, TooLarge };

// openRead(), the whole content, close(). NotReadable when the handle does not open for
// reading or its size is unknown; TooLarge beyond kMaxFileBytes (nothing is read then).
ReadResult Read(ReaderWriter* file, std::string& text);
inline bool ReadAll(ReaderWriter* file, std::string& text)
{
    return Read(file, text) == ReadResult::Ok;
}

// openWrite(), the text, close(). False when the handle does not open for writing or takes
// fewer bytes than given.
bool WriteAll(ReaderWriter* file, const std::string& text);

// An entry found by path from the handle's entry: a bare name is resolved beside it.
DirEnt* FindFrom(ReaderWriter* file, const char* path);

// Opens an entry found by path with the given type and writes text into it; false when there
// is no such entry or it cannot be written. Used for the scratch files beside the working files.
bool WriteBeside(ReaderWriter* file, const char* name, const std::string& text);

} // namespace sim
