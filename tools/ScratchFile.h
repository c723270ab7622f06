// A workspace file of the tools' own, outside the workspace tree: a binary memory file that
// lives exactly as long as the one handle returned for it.
#pragma once

#include <cstdint>

class ReaderWriter;

namespace tools {

// "ReaderWriter Create failed in tessel": the scratch file could not be made.
inline constexpr std::uint32_t kScratchFileFailed = 0xE0050C83u;

// A new empty file opened with type; the caller owns the handle and releases it, which frees
// the entry and its bytes too. Null when memory is exhausted.
ReaderWriter* NewScratchFile(std::int32_t type);

} // namespace tools
