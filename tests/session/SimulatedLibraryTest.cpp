// The session against the simulated library the program ships (bin/Tessel.dll), found by
// its bare name beside the running executable, as the program finds it.
#include "SessionFixture.h"
#include "errors/ErrorSink.h"

namespace {

using tessel::Long;

class SimulatedLibrary : public SessionTest {
protected:
    void SetUp() override
    {
        SessionTest::SetUp();
        ASSERT_TRUE(std::filesystem::exists(platform::ExecutableDirectory() + "Tessel.dll"))
            << "build the simulated library (target tessel_sim) beside the tests";
    }

    BrickSession& openSimulator() { return open("", "[DEBUG]\nMEMFILES=TRUE\n", ""); }
};

TEST_F(SimulatedLibrary, IsFoundBesideTheProgramAndTranslatesThroughTheWorkspace)
{
    BrickSession& s = openSimulator();
    ASSERT_TRUE(s.libraryLoaded());
    char name[tessel::kPathSize] = {};
    tessel::Short item = -1;
    EXPECT_GE(s.FindFirst(tessel::EnumBrickTypes, &item, name, sizeof name), 0);
    EXPECT_STRNE(name, "");
    EXPECT_NE(s.Create("\\\\.\\no-such-port"), static_cast<Long>(tessel::kLinkFailed));
    EXPECT_NE(s.Status(0, tessel::StatusPort, nullptr, 0), tessel::kStatusNoLibrary);

    ReaderWriter* code = nullptr;
    ErrorSink sink;
    EXPECT_GE(s.TranslateText(6, 1, "sound 4", &code, &sink, nullptr, nullptr), 0)
        << sink.GetText();
    EXPECT_GT(BrickSession::ContentSize(code), 0);
    BrickSession::ReleaseReaderWriter(&code);
}

} // namespace
