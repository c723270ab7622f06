// The Info report: what the library and the open brick can tell, as one multi-line text
// (active brick, active port, system, the brick type's capacities). Each piece is added only
// when its query succeeds, so the report shows whatever could be read.
#pragma once

#include <cstddef>

#include "tessel/TesselApi.h"
#include "tools/BoundedText.h"
#include "tools/BrickMemoryMap.h"

namespace tools {

class BrickAccess;
class BrickQueries;

class InfoReport {
public:
    // The report's buffer, terminator included. A longer report is cut at its end.
    static constexpr std::size_t kSize = 8192;
    // The COM and USB walks end on "no more items"; a library that never says so is cut
    // off after this many items, as are the name lists of the other enumerations.
    static constexpr int kMaxItems = 256;
    static constexpr tessel::Size kPortNameSize = 20;

    InfoReport(BrickAccess& access, BrickQueries& queries) : access_(access), queries_(queries) {}

    // Builds the report for hBrick. False when the brick type cannot be read: the report is
    // then not to be shown ("Failed to get brick type").
    bool Build(tessel::Long hBrick);

    const char* text() const { return report_.text(); }

private:
    void AddActiveBrick(tessel::Long hBrick);
    void AddProgram(tessel::Long hBrick, int slot, const BrickMemoryMap& map);
    void AddActivePort(tessel::Long hBrick);
    void AddSystem();
    void AddPortWalk(tessel::EnumType type, bool withMarkers);
    void AddNameList(tessel::EnumType type, const char* heading);
    bool AddCapacities(tessel::Long hBrick);

    BrickAccess& access_;
    BrickQueries& queries_;
    BoundedText<kSize> report_;
};

} // namespace tools
