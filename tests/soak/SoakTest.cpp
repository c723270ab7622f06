// Soak: a thousand iterations of the everyday commands in one headless session against the
// simulated library with no link time. Resident memory after the last iteration stays within
// 1 MiB of what it was after the tenth (the first ones fill caches and pools), and every
// workspace object made along the way is gone again at the end.
#include <gtest/gtest.h>

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <istream>
#include <streambuf>
#include <string>
#include <vector>

#include "HeadlessSession.h"
#include "workspace/LiveObjects.h"

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define HARBOR_SOAK_SANITIZED 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define HARBOR_SOAK_SANITIZED 1
#endif
#endif

namespace reliability {
namespace {

constexpr int kIterations = 1000;
constexpr int kSettledIteration = 10;
constexpr int kCommandsPerIteration = 12;
constexpr long kAllowedGrowth = 1024 * 1024;

long ResidentBytes()
{
    long pages = 0;
    long resident = 0;
    if (FILE* statm = std::fopen("/proc/self/statm", "r")) {
        if (std::fscanf(statm, "%ld %ld", &pages, &resident) != 2) {
            resident = 0;
        }
        std::fclose(statm);
    }
    return resident * sysconf(_SC_PAGESIZE);
}

// Hands the runner one iteration of commands at a time. The runner asks for the next line
// only once everything the previous command started has reported back, so the moment the
// next iteration is asked for is a quiet point between iterations.
class IterationSource : public std::streambuf {
public:
    IterationSource(std::string prologue, std::string iteration, int count,
                    std::function<void(int)> between)
        : prologue_(std::move(prologue)), iteration_(std::move(iteration)), count_(count),
          between_(std::move(between))
    {
        load(prologue_);
    }

protected:
    int_type underflow() override
    {
        if (gptr() < egptr()) {
            return traits_type::to_int_type(*gptr());
        }
        between_(done_);
        if (done_ == count_) {
            return traits_type::eof();
        }
        ++done_;
        load(iteration_);
        return traits_type::to_int_type(*gptr());
    }

private:
    void load(std::string& text) { setg(text.data(), text.data(), text.data() + text.size()); }

    std::string prologue_;
    std::string iteration_;
    int count_;
    int done_ = 0;
    std::function<void(int)> between_;
};

TEST(Soak, ThousandIterationsKeepMemoryAndWorkspaceFlat)
{
    const std::int64_t liveAtStart = workspace::LiveObjectCount();
    long settled = 0;
    long last = 0;
    std::int64_t liveAfterSettling = -1;
    // Upload puts the brick's listing into the editor, so each iteration sets its own text.
    IterationSource source("Auto Clear on\n",
                           "Editor program p { main { sound 4 } }\nValidate\nDownload\n"
                           "Editor sound 4\nExecute\nExecute Async\nTest\nStatistics\nUpload\n"
                           "Info\nReceive on\nReceive off\n",
                           kIterations, [&](int done) {
                               if (done == kSettledIteration) {
                                   settled = ResidentBytes();
                                   liveAfterSettling = workspace::LiveObjectCount();
                               }
                               if (done == kIterations) {
                                   last = ResidentBytes();
                                   // Between iterations the session holds what it held
                                   // after the tenth: its tree and working files, no more.
                                   EXPECT_EQ(workspace::LiveObjectCount(), liveAfterSettling);
                               }
                           });
    std::istream script(&source);
    ScratchDir dir("soak");
    SessionSetup setup;
    setup.keepLines = 20;
    setup.scenario = "link-time = 0\n[brick onyx2]\n[port KIVOTOWER1]\nlong-range = yes\n";
    const Transcript transcript = RunHeadless(dir, setup, script);

    ASSERT_FALSE(transcript.lines.empty());
    EXPECT_EQ(transcript.lines.back(),
              "done: " + std::to_string(1 + kIterations * kCommandsPerIteration) +
                  " commands, 0 failed")
        << transcript.text();
    EXPECT_EQ(transcript.exitStatus, 0);
    EXPECT_EQ(workspace::LiveObjectCount(), liveAtStart);
    std::printf("soak: resident %ld KiB after iteration %d, %ld KiB after iteration %d\n",
                settled / 1024, kSettledIteration, last / 1024, kIterations);
#if defined(HARBOR_SOAK_SANITIZED)
    // The sanitizers keep freed memory in quarantine and shadow it: resident size says
    // nothing about leaks there (their own leak check does).
#else
    EXPECT_LE(last - settled, kAllowedGrowth)
        << "resident memory grew from " << settled << " to " << last << " bytes";
#endif
}

} // namespace
} // namespace reliability
