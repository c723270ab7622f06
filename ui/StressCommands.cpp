// Stress test and About.
//
// The stress test downloads the editor's script again and again, each time a little longer:
// every iteration appends one more space than the last before the closing brace, which the
// script in the editor leaves out. An iteration starts when the previous download has
// completed (the progress handler posts WM_USER+1), so the chain runs on the message queue.
#include "ui/TestClientDialog.h"

#include <cctype>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>

#include "session/BrickSession.h"
#include "tessel/ErrorValue.h"

namespace ui {

namespace {

// Every iteration carries at least this many spaces before its closing brace.
constexpr std::size_t kBaseSpaces = 200;

// The iteration count typed into edit 214, read as a signed decimal number. Text that is
// not wholly a number (blanks around it aside), or that does not fit, counts as 0.
std::int32_t ParseIterationCount(const char* text)
{
    while (std::isspace(static_cast<unsigned char>(*text)))
        ++text;
    const char* digits = *text == '-' || *text == '+' ? text + 1 : text;
    if (!std::isdigit(static_cast<unsigned char>(*digits)))
        return 0;
    char* end = nullptr;
    const long long value = std::strtoll(text, &end, 10);
    while (std::isspace(static_cast<unsigned char>(*end)))
        ++end;
    if (*end != '\0' || value < INT32_MIN || value > INT32_MAX)
        return 0;
    return static_cast<std::int32_t>(value);
}

const tessel::Long kNoLibrary = static_cast<tessel::Long>(tessel::kLinkFailed);

} // namespace

void TestClientDialog::OnStress()
{
    if (!PortReady())
        return;
    ClearStatus();
    stressIteration_ = 1;
    StressStep();
}

void TestClientDialog::StressStep()
{
    const tessel::Short brickType = SelectedBrickType();
    // Read at every step, so the count can be changed while the test runs.
    char countText[32] = {};
    host_.GetControlText(handle(), IdStressCount, countText, sizeof countText);
    const std::int32_t iterations = ParseIterationCount(countText);

    if (stressIteration_ > iterations) {
        ShowStatus("Stress test passed ok");
        stressIteration_ = 0;
        return;
    }

    std::unique_ptr<char[]> text = ReadEditorText();
    if (!text || text[0] == '\0')
        return;

    const std::size_t length = std::strlen(text.get());
    const std::size_t spaces = static_cast<std::size_t>(stressIteration_) + kBaseSpaces;
    // Text, spaces, the closing brace and the terminator.
    std::unique_ptr<char[]> script(new (std::nothrow) char[length + spaces + 2]);
    tessel::Long code = kNoLibrary;
    ReaderWriter* object = nullptr;
    if (!script) {
        code = static_cast<tessel::Long>(RwNoMemory.packedCode());
    } else {
        std::memcpy(script.get(), text.get(), length);
        std::memset(script.get() + length, ' ', spaces);
        script[length + spaces] = '}';
        script[length + spaces + 1] = '\0';
        text.reset();
        if (session_ != nullptr) {
            code = session_->TranslateText(brickType, tessel::FileScript, script.get(), &object,
                                           nullptr, nullptr, nullptr);
        }
        script.reset();
    }

    if (code < 0) {
        BrickSession::ReleaseReaderWriter(&object);
        ShowFailureF("Stress Script2SplitByteCode() failed on iteration %d, 0x%x",
                     static_cast<int>(stressIteration_), static_cast<unsigned>(code));
        stressIteration_ = 0;
        return;
    }

    const bool started = DownloadObject(object);
    BrickSession::ReleaseReaderWriter(&object);
    if (!started) {
        // The download never started, so no completion will continue the chain. The reason
        // ("No code", or the library's error) stays in the status box instead of being
        // replaced by an iteration number that suggests the test goes on.
        stressIteration_ = 0;
        return;
    }
    ShowStatusF("Stress test #%d", static_cast<int>(stressIteration_));
    host_.Repaint(handle());
}

void TestClientDialog::OnAbout()
{
    host_.ShowMessage(handle(),
                      "Test application for Kivo tessel system.\n"
                      "Harbor, a test client for the Tessel brick library.",
                      kDialogCaption);
}

} // namespace ui
