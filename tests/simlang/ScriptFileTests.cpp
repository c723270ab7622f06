// Runs every file under language/, limits/ and errors/ through the translator and checks the
// expectations in its comments (lines starting with //, ; or #):
//
//   expect: ok                            translates
//   expect error 16 at 42: count          fails with compiler code 16 at offset 42, detail
//   expect error 16 at "count +": count   ... where that text first stands; "driver 21" or
//                                         "library 148" give other codes; ": detail" is optional
//   expect object: <line>                 a line of the object text (also listing:, symbol:)
//   expect commands: 7                    "cmd" occurs 7 times in the object
//   expect var total = 10                 after running main to its end (or the immediate
//                                         object): a global's value; v3 is global 3 unnamed
//   expect sent: 1 2 3                    the messages sent; also sounds:, tones: (frequency,
//                                         duration) and requests: (Request numbers)
//   brick: 5                              translate for this brick type (default 6)
//
// The extension gives the source type: .onyx2 script, .opal, .raw, .bin object text, .kvo
// firmware image. Include files come from include/ here, then from resources/include.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <optional>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "FakeHost.h"
#include "Machine.h"
#include "Program.h"
#include "Status.h"
#include "Translator.h"

namespace fs = std::filesystem;
using namespace tessel::lang;

namespace {

std::string ReadFile(const fs::path& path)
{
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

class DirectoryIncludes : public IncludeReader {
public:
    bool readInclude(const std::string& name, std::string& text) override
    {
        for (const char* dir : {SIMLANG_TEST_DIR "/include", SIMLANG_RESOURCES_DIR "/include"}) {
            // Files are kept under their own spelling; the reader is asked in lower case.
            std::error_code error;
            for (const auto& entry : fs::directory_iterator(dir, error)) {
                std::string file = entry.path().filename().string();
                std::transform(file.begin(), file.end(), file.begin(),
                               [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
                if (file == name) {
                    text = ReadFile(entry.path());
                    return true;
                }
            }
        }
        return false;
    }
};

struct Expectations {
    bool ok = false;
    bool error = false;
    std::int32_t code = 0;
    std::string where; // a number or a quoted text
    std::optional<std::string> detail;
    std::map<std::string, std::vector<std::string>> lines; // object, listing, symbol
    std::map<std::string, std::vector<int>> numbers;       // commands, sent, sounds, tones, ...
    std::vector<std::pair<std::string, int>> vars;
    int brickType = 6;
};

// Reads the expectations and blanks the comments that hold them, so that a quoted position
// text is found in the code and not in its own expectation.
Expectations Parse(std::string& source)
{
    Expectations e;
    static const std::regex kLine(R"((//|;|#)\s*(expect|brick:)([^\r]*))");
    static const std::regex kError(
        R"(\s*error\s+(driver\s+|library\s+)?(\d+)\s+at\s+(\d+|"[^"]*")(:\s?(.*))?)");
    static const std::regex kText(R"( (object|listing|symbol): (.*))");
    static const std::regex kNumbers(R"(\s*(commands|sent|sounds|tones|requests):(.*))");
    static const std::regex kVar(R"(\s*var\s+(\w+)\s*=\s*(-?\d+)\s*)");
    for (std::size_t pos = 0, end = 0; pos < source.size(); pos = end + 1) {
        end = std::min(source.find('\n', pos), source.size());
        const std::string line = source.substr(pos, end - pos);
        std::smatch m;
        if (!std::regex_search(line, m, kLine)) {
            continue;
        }
        const std::string rest = m[3];
        std::smatch x;
        if (m[2] == "brick:") {
            e.brickType = std::stoi(rest);
        } else if (rest.rfind(": ok", 0) == 0) {
            e.ok = true;
        } else if (std::regex_match(rest, x, kError)) {
            e.error = true;
            const int code = std::stoi(x[2]);
            e.code = x[1].str().rfind("driver", 0) == 0    ? DriverError(code)
                     : x[1].str().rfind("library", 0) == 0 ? LibraryError(code)
                                                           : CompilerError(code);
            e.where = x[3];
            if (x[4].matched) {
                e.detail = x[5];
            }
        } else if (std::regex_match(rest, x, kText)) {
            e.lines[x[1]].push_back(x[2]);
        } else if (std::regex_match(rest, x, kNumbers)) {
            std::istringstream in(x[2]);
            e.numbers[x[1]] = {std::istream_iterator<int>(in), std::istream_iterator<int>()};
        } else if (std::regex_match(rest, x, kVar)) {
            e.vars.emplace_back(x[1], std::stoi(x[2]));
        } else {
            ADD_FAILURE() << "unreadable expectation: " << line;
        }
        std::fill(source.begin() + static_cast<long>(pos + static_cast<std::size_t>(m.position(0))),
                  source.begin() + static_cast<long>(end), ' ');
    }
    return e;
}

std::vector<std::string> Lines(const std::string& text)
{
    std::vector<std::string> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) {
        if (!line.empty() && line.back() == '\r') {
            line.pop_back();
        }
        lines.push_back(line);
    }
    return lines;
}

void ExpectLines(const std::string& what, const std::string& text,
                 const std::vector<std::string>& wanted)
{
    const std::vector<std::string> lines = Lines(text);
    for (const std::string& line : wanted) {
        EXPECT_NE(std::find(lines.begin(), lines.end(), line), lines.end())
            << what << " lacks the line \"" << line << "\"; it holds:\n"
            << text;
    }
}

int CountCmd(const std::string& text)
{
    int count = 0;
    for (std::size_t at = text.find("cmd"); at != std::string::npos;
         at = text.find("cmd", at + 3)) {
        ++count;
    }
    return count;
}

std::vector<fs::path> ScriptFiles()
{
    std::vector<fs::path> files;
    for (const char* folder : {"language", "limits", "errors"}) {
        std::error_code error;
        for (const auto& entry :
             fs::directory_iterator(fs::path(SIMLANG_TEST_DIR) / folder, error)) {
            if (entry.is_regular_file()) {
                files.push_back(entry.path());
            }
        }
    }
    std::sort(files.begin(), files.end());
    return files;
}

class ScriptFile : public testing::TestWithParam<fs::path> {};

TEST_P(ScriptFile, MeetsItsExpectations)
{
    const fs::path path = GetParam();
    std::string source = ReadFile(path);
    Expectations e = Parse(source);
    ASSERT_TRUE(e.ok || e.error) << path << " states neither 'expect: ok' nor an error";

    static const std::map<std::string, int> kTypes = {{".opal", SourceOpal},
                                                      {".raw", SourceRaw},
                                                      {".bin", SourceObject},
                                                      {".kvo", SourceFirmware}};
    const auto type = kTypes.find(path.extension().string());
    DirectoryIncludes includes;
    Translator translator;
    TranslateRequest request;
    request.brickType = e.brickType;
    request.sourceType = type == kTypes.end() ? SourceScript : type->second;
    request.source = source;
    request.includes = &includes;
    const TranslateResult result = translator.translate(request);

    if (e.error) {
        std::size_t where = 0;
        if (e.where[0] == '"') {
            where = source.find(e.where.substr(1, e.where.size() - 2));
            ASSERT_NE(where, std::string::npos) << "position text " << e.where << " not in source";
        } else {
            where = std::stoul(e.where);
        }
        EXPECT_EQ(result.code, e.code)
            << std::hex << "got 0x" << result.code << " want 0x" << e.code << std::dec
            << " (detail \"" << result.detail << "\")";
        EXPECT_EQ(result.offset, static_cast<std::int32_t>(where));
        if (e.detail) {
            EXPECT_EQ(result.detail, *e.detail);
        }
        EXPECT_TRUE(result.output.empty());
        return;
    }
    ASSERT_EQ(result.code, 0) << std::hex << "0x" << result.code << std::dec << " at "
                              << result.offset << ": " << result.detail;
    ExpectLines("object", result.output, e.lines["object"]);
    ExpectLines("symbol table", result.symbols, e.lines["symbol"]);
    if (auto commands = e.numbers.find("commands"); commands != e.numbers.end()) {
        EXPECT_EQ(CountCmd(result.output), commands->second.at(0)) << result.output;
    }
    // The object must read back, and count as many commands as "cmd" markers.
    Program program;
    const ParseResult parsed = ParseObject(result.output, program);
    ASSERT_EQ(parsed.code, 0) << parsed.detail << " at " << parsed.offset << " in\n"
                              << result.output;
    EXPECT_EQ(program.commandCount, CountCmd(result.output));
    if (!e.lines["listing"].empty()) {
        request.targetType = TargetListing;
        const TranslateResult listing = translator.translate(request);
        ASSERT_EQ(listing.code, 0);
        ExpectLines("listing", listing.output, e.lines["listing"]);
    }

    if (e.vars.empty() && e.numbers.size() == e.numbers.count("commands")) {
        return;
    }
    simlang_test::FakeHost host(&program);
    Machine machine(e.brickType, host);
    if (program.kind == ObjectKind::Immediate) {
        machine.execute(program);
    } else {
        ASSERT_EQ(machine.startTask(0), 0);
        for (int i = 0; i < 100000 && machine.anyTaskRunning(); ++i) {
            machine.advance(10, 100000);
        }
        EXPECT_FALSE(machine.anyTaskRunning()) << "main did not end";
        EXPECT_EQ(machine.lastFault(), 0);
    }
    for (const auto& [name, value] : e.vars) {
        int index = -1;
        for (const std::string& line : Lines(result.symbols)) {
            if (line.rfind("var,", 0) == 0 && line.substr(line.rfind(',') + 1) == name) {
                index = std::stoi(line.substr(4));
            }
        }
        if (index < 0 && std::regex_match(name, std::regex(R"(v\d+)"))) {
            index = std::stoi(name.substr(1)); // sources without names
        }
        ASSERT_GE(index, 0) << "no variable " << name;
        EXPECT_EQ(host.variables[index], value) << "variable " << name;
    }
    const std::map<std::string, std::vector<int>> seen = {{"sent", host.messages},
                                                          {"sounds", host.sounds},
                                                          {"tones", host.tones},
                                                          {"requests", host.requests}};
    for (const auto& [what, wanted] : e.numbers) {
        if (what != "commands") {
            EXPECT_EQ(seen.at(what), wanted) << what;
        }
    }
}

std::string TestName(const testing::TestParamInfo<fs::path>& info)
{
    std::string name = info.param.parent_path().filename().string() + "_" +
                       info.param.stem().string() + "_" + info.param.extension().string().substr(1);
    std::replace_if(
        name.begin(), name.end(), [](unsigned char c) { return !std::isalnum(c); }, '_');
    return name;
}

INSTANTIATE_TEST_SUITE_P(Sources, ScriptFile, testing::ValuesIn(ScriptFiles()), TestName);

} // namespace
