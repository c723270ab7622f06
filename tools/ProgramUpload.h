// Upload of the program in the brick's current slot as listing lines, one per task and one
// per subroutine, each holding the code bytes as the brick reports them:
//   "task,<task - 1>,<size>,<task byte>,<bytes>"
//   "sub,<sub - 1>,<size - 1>,0,<bytes>"
// every line ended by "\r\n", tasks first.
#pragma once

#include <cstdint>
#include <string>

#include "tessel/TesselApi.h"

namespace tools {

class BrickQueries;

inline constexpr const char* kTaskLineFormat = "task,%d,%d,%d,";
inline constexpr const char* kSubLineFormat = "sub,%d,%d,0,";

enum class UploadStop {
    None,        // the walk finished or ended at a failed location or range read
    ProgramSlot, // "Failed to get program slot"
    MemoryMap,   // "Failed to get memory map"
};

struct UploadOutcome {
    UploadStop stop = UploadStop::None;
    tessel::Long code = 0; // the failed query's code when stop is not None
};

class ProgramUpload {
public:
    explicit ProgramUpload(BrickQueries& queries) : queries_(queries) {}

    // Appends the lines of the current slot to lines. A failed location or range read ends
    // the walk (a failed task walk also skips the subroutines) and keeps the lines made.
    UploadOutcome Run(tessel::Long hBrick, std::string& lines);

    // Read start..start+size and append the task line; returns the range read's code. No text
    // (failed read or empty answer) makes no line.
    tessel::Long AppendTaskLine(tessel::Long hBrick, int task, std::int32_t start,
                                std::int32_t size, std::int32_t taskByte, std::string& lines);
    // The same over size - 1 bytes, leaving out the subroutine's last byte.
    tessel::Long AppendSubLine(tessel::Long hBrick, int sub, std::int32_t start, std::int32_t size,
                               std::string& lines);

private:
    tessel::Long AppendLine(tessel::Long hBrick, std::int32_t start, std::int32_t length,
                            const std::string& head, std::string& lines);

    BrickQueries& queries_;
};

} // namespace tools
