// Macro To CSV and Convert to CSV against the simulated library's translation.
#include <gtest/gtest.h>

#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "commands/DialogFixture.h"
#include "errors/ErrorSink.h"
#include "session/BrickSession.h"
#include "tessel/ReaderWriter.h"
#include "tools/FileText.h"
#include "tools/MacroToCsv.h"
#include "workspace/LiveObjects.h"

#ifndef HARBOR_SIM_DIR
#define HARBOR_SIM_DIR ""
#endif
#ifndef HARBOR_INCLUDE_DIR
#define HARBOR_INCLUDE_DIR ""
#endif

namespace tools_test {
namespace {

constexpr const char* kMacroCall = "bb_PlayNote(440,50,60)";

// A session of its own with the shipped header mounted as an include file.
class SimMacroToCsv : public ::testing::Test {
protected:
    void SetUp() override
    {
        dir_ =
            std::filesystem::temp_directory_path() / ("harbor-tools-" + std::to_string(getpid()));
        std::filesystem::create_directories(dir_);
        ::unsetenv("TESSEL_SIM");
    }

    void TearDown() override
    {
        session_.reset();
        EXPECT_EQ(workspace::LiveObjectCount(), 0);
        std::error_code ignored;
        std::filesystem::remove_all(dir_, ignored);
    }

    void Open(bool withHeader, bool memFiles = true)
    {
        const std::filesystem::path settings = dir_ / "harbor.ini";
        std::ofstream out(settings, std::ios::trunc);
        out << "[PATHS]\nDLL=" << HARBOR_SIM_DIR << "/\n";
        out << "HEADERS=" << HARBOR_INCLUDE_DIR << "/\n";
        out << "TEMP=" << dir_.string() << "/\n";
        out << "[DEBUG]\nMEMFILES=" << (memFiles ? "TRUE" : "FALSE") << "\n";
        if (withHeader)
            out << "[HEADERS]\nMLT=Onyx2MLT.h\n";
        out.close();
        session_ = std::make_unique<BrickSession>(settings.string().c_str());
        ASSERT_TRUE(session_->libraryLoaded());
    }

    std::filesystem::path dir_;
    std::unique_ptr<BrickSession> session_;
};

TEST_F(SimMacroToCsv, NoteMacroExpandsToVolumeToneAndHaltAndNeedsItsHeader)
{
    // The working files in memory and on disk, then without the header mounted.
    for (int run = 0; run < 3; ++run) {
        SCOPED_TRACE(run);
        ASSERT_NO_FATAL_FAILURE(Open(run < 2, run == 0));
        ErrorSink sink;
        ReaderWriter* result = nullptr;
        const std::int32_t code = tools::MacroToCsv(*session_, tessel::BrickOnyx2, kMacroCall,
                                                    "Onyx2MLT.h", &result, &sink);
        EXPECT_EQ(result != nullptr, run < 2) << "a listing only from a translation";
        std::string text;
        tools::AppendFileText(result, text);
        BrickSession::ReleaseReaderWriter(&result);
        if (run < 2) {
            EXPECT_EQ(code, 0);
            EXPECT_EQ(text, "231,2,60,volume\r\n233,2,440,2,50,tone\r\n23,halt\r\n");
        } else {
            EXPECT_LT(code, 0);
            EXPECT_NE(std::string(sink.GetText()), "");
        }
        session_.reset();
    }
}

class SimConvert : public commands_test::DialogFixture {};

TEST_F(SimConvert, ConvertToCsvShowsTheWholeListingOrPlacesTheCaretAtTheError)
{
    ASSERT_NO_FATAL_FAILURE(Start(commands_test::kFastLink));
    SetText(ui::IdEditor, "program Tune { main { sound 4 } }");
    ClearEvents();
    host().SendMessage(window(), ui::kMsgCommand, ui::MakeCommand(ui::IdConvertToCsv), 0);
    const std::string listing = Text(ui::IdEditor);
    EXPECT_EQ(listing.rfind("250,main,Tune\r\n", 0), 0u) << listing;
    EXPECT_NE(listing.find("\r\n303,main,task,0\r\n"), std::string::npos) << listing;
    EXPECT_EQ(Statuses(), std::vector<std::string>{""});
    EXPECT_EQ(host().FocusedControl(window()), ui::IdEditor);

    const std::string script = "program Tune { main { sound 4 nonsense } }";
    SetText(ui::IdEditor, script);
    host().SendMessage(window(), ui::kMsgCommand, ui::MakeCommand(ui::IdConvertToCsv), 0);
    EXPECT_EQ(LastStatus().rfind("Error (0x", 0), 0u) << LastStatus();
    EXPECT_EQ(Text(ui::IdEditor), script);
    std::int32_t start = -1;
    std::int32_t end = -1;
    host().GetEditSelection(window(), ui::IdEditor, &start, &end);
    EXPECT_EQ(start, end);
    EXPECT_GT(start, 0);
    EXPECT_TRUE(Offers().empty());
}

} // namespace
} // namespace tools_test
