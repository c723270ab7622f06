// Exhausted memory, one allocation at a time: every workspace object is created with
// new (std::nothrow), so this suite replaces that operator with one that fails on request
// and sweeps the failure over every allocation of a construction or a runner operation.
// Whatever fails, the session must neither crash nor leak, and the runner must report the
// missing piece with its own code.
#include <functional>
#include <new>
#include <set>

#include "SessionFixture.h"

namespace {

// The allocation that fails, counted from 1 when set; 0: none fails.
int failCountdown = 0;

template <typename Allocate> void* AllocateUnlessFailing(Allocate allocate) noexcept
{
    if (failCountdown > 0 && --failCountdown == 0) {
        return nullptr;
    }
    try {
        return allocate();
    } catch (...) {
        return nullptr;
    }
}

} // namespace

void* operator new(std::size_t size, const std::nothrow_t&) noexcept
{
    return AllocateUnlessFailing([size] { return ::operator new(size); });
}

void* operator new[](std::size_t size, const std::nothrow_t&) noexcept
{
    return AllocateUnlessFailing([size] { return ::operator new[](size); });
}

namespace {

using tessel::Long;
constexpr Long Code(std::uint32_t packed)
{
    return static_cast<Long>(packed);
}

class AllocationFailure : public SessionTest, public ::testing::WithParamInterface<bool> {
protected:
    void TearDown() override
    {
        failCountdown = 0;
        SessionTest::TearDown();
    }

    std::string settingsFor()
    {
        return writeSettings(diskPaths(),
                             std::string("[HEADERS]\na=One.h\nb=two.h\n[DEBUG]\nMEMFILES=") +
                                 (GetParam() ? "TRUE" : "FALSE") + "\n");
    }

    // Each runner operation on a session whose set-up may have lost pieces: the first
    // missing piece it needs decides its code (kUnchecked: whatever the library says).
    void checkRunner(BrickSession& s, std::set<std::uint32_t>& seen)
    {
        constexpr Long kUnchecked = 1;
        ReaderWriter* out = nullptr;
        const auto check = [&](Long got, Long expected) {
            if (expected != kUnchecked) {
                EXPECT_EQ(got, expected);
            }
            if (got != 0) { // the library succeeds here: a failure is the runner's own
                EXPECT_EQ(out, nullptr);
            }
            seen.insert(static_cast<std::uint32_t>(got));
            BrickSession::ReleaseReaderWriter(&out);
        };
        const Long noObject = s.objectEntry() == nullptr ? Code(BrickSession::kNullTempPath) : 0;
        const std::string host = dir.write("host.onyx2", "host");
        check(s.TranslateText(6, 1, "sound 1", &out, nullptr, nullptr, nullptr),
              s.sourceEntry() == nullptr ? Code(BrickSession::kNullSourcePath) : noObject);
        check(s.CompileFile(6, 1, host.c_str(), &out, nullptr, nullptr, nullptr),
              s.root() == nullptr ? Code(BrickSession::kNullRoot)
                                  : (noObject != 0 ? noObject : kUnchecked));
        check(s.ExecCode(1, nullptr, nullptr, &out, nullptr, nullptr),
              s.resultEntry() == nullptr ? Code(BrickSession::kNullResultPath) : kUnchecked);
        check(s.CompileFirmware(host.c_str(), &out),
              s.firmwareEntry() == nullptr ? Code(BrickSession::kNullFirmwarePath) : kUnchecked);
    }
};

INSTANTIATE_TEST_SUITE_P(WorkingFiles, AllocationFailure, ::testing::Values(true, false),
                         [](const ::testing::TestParamInfo<bool>& mode) {
                             return mode.param ? "Memory" : "Disk";
                         });

TEST_P(AllocationFailure, ConstructionNeverFailsAndRunnerReportsWhatIsMissing)
{
    const std::string settings = settingsFor();
    std::set<std::uint32_t> seen;
    bool everyAllocationFailedOnce = false;
    for (int n = 1; n < 500 && !everyAllocationFailedOnce; ++n) {
        SCOPED_TRACE("failing allocation " + std::to_string(n));
        failCountdown = n;
        session = std::make_unique<BrickSession>(settings.c_str());
        everyAllocationFailedOnce = failCountdown > 0; // nothing failed: sweep done
        failCountdown = 0;
        checkRunner(*session, seen);
        session.reset();
        ASSERT_EQ(workspace::LiveObjectCount(), 0);
    }
    EXPECT_TRUE(everyAllocationFailedOnce);
    for (std::uint32_t expected :
         {BrickSession::kNullRoot, BrickSession::kNullSourcePath, BrickSession::kNullResultPath,
          BrickSession::kNullFirmwarePath, BrickSession::kNullTempPath}) {
        EXPECT_EQ(seen.count(expected), 1u) << std::hex << expected;
    }
}

TEST_P(AllocationFailure, RunnerOperationsReleaseEverythingWhenAnAllocationFails)
{
    session = std::make_unique<BrickSession>(settingsFor().c_str());
    BrickSession& s = *session;
    const std::string host = dir.write("host.onyx2", "host");
    std::set<std::uint32_t> seen;

    using Operation = std::function<Long(ReaderWriter**)>;
    const Operation operations[] = {
        [&](ReaderWriter** out) {
            return s.TranslateText(6, 1, "x", out, nullptr, nullptr, nullptr);
        },
        [&](ReaderWriter** out) {
            return s.TranslateText(6, 4, "x", out, nullptr, nullptr, nullptr);
        },
        [&](ReaderWriter** out) { return s.TranslateToCsv(6, "x", out, nullptr); },
        [&](ReaderWriter** out) {
            return s.CompileFile(6, 1, host.c_str(), out, nullptr, nullptr, nullptr);
        },
        [&](ReaderWriter** out) { return s.CompileFirmware(host.c_str(), out); },
        [&](ReaderWriter** out) { return s.ExecCode(1, nullptr, nullptr, out, nullptr, nullptr); },
        [&](ReaderWriter**) { return s.RunImmediate(1, "sound 4", nullptr); },
    };
    for (const Operation& operation : operations) {
        // A run that succeeds may leave its host file (and its directory) linked; that is
        // the most a failing run may leave behind.
        ReaderWriter* first = nullptr;
        operation(&first);
        BrickSession::ReleaseReaderWriter(&first);
        const std::int64_t live = workspace::LiveObjectCount();
        bool done = false;
        for (int n = 1; n < 50 && !done; ++n) {
            ReaderWriter* out = nullptr;
            failCountdown = n;
            const Long result = operation(&out);
            done = failCountdown > 0;
            failCountdown = 0;
            if (result != 0) {
                seen.insert(static_cast<std::uint32_t>(result));
                EXPECT_EQ(out, nullptr);
            }
            BrickSession::ReleaseReaderWriter(&out);
            EXPECT_LE(workspace::LiveObjectCount(), live);
        }
        EXPECT_TRUE(done);
    }
    EXPECT_EQ(seen.count(BrickSession::kCreateFailed), 1u);
    EXPECT_EQ(seen.count(BrickSession::kInsertFailed), 1u);
    for (std::uint32_t code : seen) {
        EXPECT_TRUE(code == BrickSession::kCreateFailed || code == BrickSession::kInsertFailed)
            << std::hex << code;
    }
}

} // namespace
