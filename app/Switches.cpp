// Registration switches and Harbor's own options.
#include "app/Switches.h"

#include <cctype>
#include <cstdlib>
#include <cstring>

namespace app {

namespace {

bool EqualNoCase(const char* a, const char* b)
{
    for (; *a != '\0' && *b != '\0'; ++a, ++b) {
        if (std::tolower(static_cast<unsigned char>(*a)) !=
            std::tolower(static_cast<unsigned char>(*b)))
            return false;
    }
    return *a == *b;
}

} // namespace

SwitchAction FindRegistrationSwitch(const char* commandLine)
{
    if (commandLine == nullptr)
        return SwitchAction::Run;
    for (const char* p = std::strpbrk(commandLine, "-/"); p != nullptr;
         p = std::strpbrk(p + 1, "-/")) {
        const char* token = p + 1;
        if (EqualNoCase(token, "UnregServer"))
            return SwitchAction::Unregister;
        if (EqualNoCase(token, "RegServer"))
            return SwitchAction::Register;
    }
    return SwitchAction::Run;
}

bool ParseHarborOptions(int argc, const char* const* argv, HarborOptions& options,
                        std::string& error)
{
    options = HarborOptions{};
    options.arguments.emplace_back(argc > 0 && argv[0] ? argv[0] : "harbor");
    int i = 1;
    for (; i < argc; ++i) {
        const std::string option = argv[i];
        if (option == "--") {
            ++i;
            break;
        }
        if (option.size() < 3 || option.compare(0, 2, "--") != 0)
            break;
        auto value = [&](std::string& into) {
            if (i + 1 >= argc) {
                error = "option " + option + " needs a value";
                return false;
            }
            into = argv[++i];
            return true;
        };
        std::string text;
        if (option == "--headless") {
            options.headless = true;
        } else if (option == "--script") {
            if (!value(options.script))
                return false;
        } else if (option == "--answer") {
            if (!value(text))
                return false;
            if (text == "yes") {
                options.answerYes = true;
            } else if (text == "no") {
                options.answerYes = false;
            } else {
                error = "option --answer takes yes or no, not \"" + text + "\"";
                return false;
            }
        } else if (option == "--timeout") {
            if (!value(text))
                return false;
            char* end = nullptr;
            const long ms = std::strtol(text.c_str(), &end, 10);
            if (text.empty() || *end != '\0' || ms < 0 || ms > 3600000) {
                error = "option --timeout takes milliseconds, not \"" + text + "\"";
                return false;
            }
            options.timeoutMs = static_cast<int>(ms);
        } else if (option == "--fixed-time") {
            options.fixedTime = true;
        } else if (option == "--quiet") {
            options.quiet = true;
        } else if (option == "--help") {
            options.help = true;
        } else {
            error = "unknown option " + option;
            return false;
        }
    }
    for (; i < argc; ++i)
        options.arguments.emplace_back(argv[i] ? argv[i] : "");
    if (!options.script.empty() && !options.headless) {
        error = "option --script needs --headless";
        return false;
    }
    return true;
}

const char* HarborUsage()
{
    return "usage: harbor [options] [script file]\n"
           "       harbor -RegServer | /RegServer | -UnregServer | /UnregServer\n"
           "options (before the file):\n"
           "  --headless         run without a window, commands one per line (docs/headless.md)\n"
           "  --script FILE      read the commands from FILE instead of standard input\n"
           "  --answer yes|no    answer to questions that no command decides (default no)\n"
           "  --timeout MS       wait this long for a download or execution (default 30000)\n"
           "  --fixed-time       elapsed times read 0, for repeatable transcripts\n"
           "  --quiet            do not echo the commands\n"
           "  --                 end of the options\n";
}

} // namespace app
