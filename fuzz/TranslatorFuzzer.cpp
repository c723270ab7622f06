// The simulated library's translator on any source, of every source type and both targets:
// it ends, never throws, and either succeeds with output or fails with a packed negative code
// whose offset lies within the source.
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "FuzzInput.h"
#include "Translator.h"

namespace {

void Check(bool condition)
{
    if (!condition) {
        std::abort();
    }
}

// Includes resolve to the fuzzer's own text, so a self-including header is reachable too.
class EchoIncludes final : public tessel::lang::IncludeReader {
public:
    explicit EchoIncludes(std::string text) : text_(std::move(text)) {}
    bool readInclude(const std::string& name, std::string& text) override
    {
        if (name.empty() || name[0] == 'x') {
            return false;
        }
        text = text_;
        return true;
    }

private:
    std::string text_;
};

class CountingDiagnostics final : public tessel::lang::Diagnostics {
public:
    void report(std::int32_t code, std::int32_t, const char* detail) override
    {
        Check(code < 0 && detail != nullptr);
        ++reports;
    }
    int reports = 0;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    fuzz::Input input(data, size);
    const std::uint8_t kinds = input.byte();
    const std::string header = input.text(64);
    const std::string source = input.rest();

    // Smaller limits than the library's keep one run short; the checks are the same.
    tessel::lang::TranslateLimits limits;
    limits.maxMacroExpansions = 5000;
    limits.maxTokens = 1u << 16;
    tessel::lang::Translator translator(limits);
    EchoIncludes includes(header);
    CountingDiagnostics diagnostics;
    tessel::lang::TranslateRequest request;
    request.brickType = kinds % 8;
    request.sourceType = 1 + (kinds / 8) % 5;
    request.targetType =
        (kinds & 0x80) != 0 ? tessel::lang::TargetListing : tessel::lang::TargetObject;
    request.source = std::string_view(source);
    request.includes = &includes;
    request.diagnostics = &diagnostics;
    const tessel::lang::TranslateResult result = translator.translate(request);
    Check(diagnostics.reports <= 1);
    if (result.code < 0) {
        Check(result.output.empty());
        Check(diagnostics.reports == 1);
        Check(result.offset >= 0 && static_cast<std::size_t>(result.offset) <= source.size());
    } else {
        Check(result.code == 0);
        Check(diagnostics.reports == 0);
    }
    return 0;
}
