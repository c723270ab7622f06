// The session against the simulated library the program ships (bin/Tessel.dll), found by
// its bare name beside the running executable, as the program finds it.
#include "SessionFixture.h"
#include "errors/ErrorSink.h"

namespace {

using SimulatedLibrary = SessionTest;

TEST_F(SimulatedLibrary, IsFoundBesideTheProgramAndTranslatesThroughTheWorkspace)
{
    ASSERT_TRUE(std::filesystem::exists(platform::ExecutableDirectory() + "Tessel.dll"))
        << "build the simulated library (target tessel_sim) beside the tests";
    BrickSession& s = open("", "[DEBUG]\nMEMFILES=TRUE\n", "");
    ASSERT_TRUE(s.libraryLoaded());
    ReaderWriter* code = nullptr;
    ErrorSink sink;
    EXPECT_GE(s.TranslateText(6, 1, "sound 4", &code, &sink, nullptr, nullptr), 0)
        << sink.GetText();
    EXPECT_GT(BrickSession::ContentSize(code), 0);
    BrickSession::ReleaseReaderWriter(&code);
}

} // namespace
