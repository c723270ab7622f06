// The headless command runner.
#include "ui/headless/HeadlessRunner.h"

#include <algorithm>
#include <cctype>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <istream>
#include <ostream>

#include "troubleshooter/HeadlessHelpViewer.h"
#include "ui/TestClientDialog.h"

namespace ui {

namespace {

// Id of the help command that closes the help file, and the hidden help window's class.
constexpr int kHelpQuitCommand = 2000;
constexpr const char* kHelpWindowClass = "trbl_wnd";
// The caption of the Trouble Shooter offers: asking it means the command failed.
constexpr const char* kOfferCaption = "Diagnostics";

enum class Action {
    Exit,        // File Exit, after any help session has been closed
    Click,       // press the button or choose the menu item
    ClickChoice, // the same, the argument answering its question or file dialog
    ClickEdit,   // put the argument (if any) into an edit box first
    Receive,
    CheckBox,
    BrickList,
    SourceList,
    Editor,
    SetText,
    SetCheck,
    Answer,
    Expect,
    ExpectTitle,
    ExpectEditor,
    ExpectFile,
    Print,
    Wait,
    WaitStatus,
    Pump,
    Help,
};

struct CommandSpec {
    const char* name;
    Action action;
    int id;     // the command id, or the control the argument goes to
    int editId; // ClickEdit: the edit box
};

// Longer names first where one begins another ("Open..." before "Open").
constexpr CommandSpec kCommands[] = {
    // File menu
    {"New", Action::Click, IdFileNew, 0},
    {"Open...", Action::ClickChoice, IdFileOpen, 0},
    {"Open File", Action::ClickChoice, IdFileOpen, 0},
    {"Save As...", Action::ClickChoice, IdFileSaveAs, 0},
    {"Save As", Action::ClickChoice, IdFileSaveAs, 0},
    {"Save", Action::ClickChoice, IdFileSave, 0},
    {"Exit", Action::Exit, IdFileExit, 0},
    // Port
    {"Open", Action::ClickChoice, IdOpenPort, 0},
    {"Close", Action::Click, IdClosePort, 0},
    {"Test", Action::Click, IdTest, 0},
    {"Statistics", Action::Click, IdStatistics, 0},
    {"Short", Action::Click, IdRangeShort, 0},
    {"Medium", Action::Click, IdRangeMedium, 0},
    {"Long", Action::Click, IdRangeLong, 0},
    // Script
    {"Validate", Action::Click, IdValidate, 0},
    {"Execute Async", Action::Click, IdExecuteAsync, 0},
    {"Async", Action::Click, IdExecuteAsync, 0},
    {"Execute", Action::Click, IdExecute, 0},
    {"Download Firmware", Action::ClickEdit, IdNewFirmware, IdFirmwareFileName},
    {"Download File", Action::ClickEdit, IdDownloadFile, IdDownloadFileName},
    {"Download", Action::Click, IdDownload, 0},
    {"Receive", Action::Receive, IdReceive, 0},
    // Special
    {"Info", Action::Click, IdInfo, 0},
    {"Upload", Action::Click, IdUpload, 0},
    {"Stress", Action::ClickEdit, IdStress, IdStressCount},
    {"New Firmware", Action::ClickEdit, IdNewFirmware, IdFirmwareFileName},
    {"Convert to CSV", Action::Click, IdConvertToCsv, 0},
    {"Macro To CSV", Action::Click, IdMacroToCsv, 0},
    // Help
    {"About", Action::Click, IdAbout, 0},
    // What a person types or chooses
    {"Auto Clear", Action::CheckBox, IdAutoClear, 0},
    {"Auto Run", Action::CheckBox, IdAutoRun, 0},
    {"Brick", Action::BrickList, IdBrickList, 0},
    {"Source", Action::SourceList, IdSourceList, 0},
    {"Editor", Action::Editor, IdEditor, 0},
    {"Set", Action::SetText, 0, 0},
    {"Check", Action::SetCheck, 0, 0},
    {"Answer", Action::Answer, 0, 0},
    // Checks and pacing
    {"Expect Title", Action::ExpectTitle, 0, 0},
    {"Expect Editor", Action::ExpectEditor, 0, 0},
    {"Expect File", Action::ExpectFile, 0, 0},
    {"Expect", Action::Expect, 0, 0},
    {"Print", Action::Print, 0, 0},
    {"Wait Status", Action::WaitStatus, 0, 0},
    {"Wait", Action::Wait, 0, 0},
    {"Pump", Action::Pump, 0, 0},
    {"Help", Action::Help, 0, 0},
};

bool EqualNoCase(const std::string& a, const char* b)
{
    std::size_t i = 0;
    for (; i < a.size() && b[i] != '\0'; ++i) {
        if (std::tolower(static_cast<unsigned char>(a[i])) !=
            std::tolower(static_cast<unsigned char>(b[i])))
            return false;
    }
    return i == a.size() && b[i] == '\0';
}

// The command whose name starts the line (ignoring case), followed by the end or a blank.
const CommandSpec* MatchCommand(const std::string& line, std::string& argument)
{
    const CommandSpec* best = nullptr;
    std::size_t bestLength = 0;
    for (const CommandSpec& spec : kCommands) {
        const std::size_t n = std::char_traits<char>::length(spec.name);
        if (n <= bestLength || line.size() < n)
            continue;
        if (!EqualNoCase(line.substr(0, n), spec.name))
            continue;
        if (line.size() > n && line[n] != ' ' && line[n] != '\t')
            continue;
        best = &spec;
        bestLength = n;
    }
    if (best != nullptr) {
        std::size_t start = bestLength;
        while (start < line.size() && (line[start] == ' ' || line[start] == '\t'))
            ++start;
        argument = line.substr(start);
    }
    return best;
}

std::string Trim(const std::string& text)
{
    std::size_t begin = 0;
    std::size_t end = text.size();
    while (begin < end && (text[begin] == ' ' || text[begin] == '\t'))
        ++begin;
    while (end > begin && (text[end - 1] == ' ' || text[end - 1] == '\t' || text[end - 1] == '\r'))
        --end;
    return text.substr(begin, end - begin);
}

// "on"/"yes"/"1" and "off"/"no"/"0"; -1 for anything else.
int ParseSwitch(const std::string& text)
{
    if (EqualNoCase(text, "on") || EqualNoCase(text, "yes") || text == "1")
        return 1;
    if (EqualNoCase(text, "off") || EqualNoCase(text, "no") || text == "0")
        return 0;
    return -1;
}

bool ParseInt(const std::string& text, long& value)
{
    if (text.empty())
        return false;
    char* end = nullptr;
    value = std::strtol(text.c_str(), &end, 10);
    return end != nullptr && *end == '\0';
}

std::int64_t NowMs()
{
    using namespace std::chrono;
    return duration_cast<milliseconds>(steady_clock::now().time_since_epoch()).count();
}

} // namespace

HeadlessRunner::HeadlessRunner(HeadlessHost& host, TestClientDialog& dialog, std::istream& in,
                               std::ostream& out, std::ostream& err, const HeadlessOptions& options)
    : host_(host), dialog_(dialog), in_(in), out_(out), err_(err), options_(options)
{
    host_.SetDefaultAnswer(options_.defaultAnswer);
    if (options_.fixedTicks)
        host_.FixTickCount(0);
    host_.SetListener([this](const HeadlessEvent& event) { onEvent(event); });
    host_.SetIdleHandler([this] { return idle(); });
    helpViewer_ = std::make_unique<HeadlessHelpViewer>(
        host_, [this](const std::string& line) { print(line); }, options_.helpDirectory);
    dialog_.SetHelpViewer(helpViewer_.get());
}

HeadlessRunner::~HeadlessRunner()
{
    dialog_.SetHelpViewer(nullptr);
    host_.SetListener(nullptr);
    host_.SetIdleHandler(nullptr);
}

std::string HeadlessRunner::Escape(const std::string& text)
{
    std::string result;
    result.reserve(text.size());
    for (const char c : text) {
        switch (c) {
        case '\n':
            result += "\\n";
            break;
        case '\r':
            result += "\\r";
            break;
        case '\t':
            result += "\\t";
            break;
        default:
            if (static_cast<unsigned char>(c) < 0x20) {
                char hex[8];
                std::snprintf(hex, sizeof hex, "\\x%02x", static_cast<unsigned char>(c));
                result += hex;
            } else {
                result += c;
            }
        }
    }
    return result;
}

std::string HeadlessRunner::Unescape(const std::string& text)
{
    std::string result;
    result.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '\\' || i + 1 == text.size()) {
            result += text[i];
            continue;
        }
        const char next = text[++i];
        switch (next) {
        case 'n':
            result += '\n';
            break;
        case 'r':
            result += '\r';
            break;
        case 't':
            result += '\t';
            break;
        default:
            // Not an escape: both characters stand, so device names such as "\\.\COM1"
            // and Windows paths are written as they are.
            result += '\\';
            result += next;
        }
    }
    return result;
}

void HeadlessRunner::print(const std::string& line)
{
    out_ << line << '\n';
    out_.flush();
}

void HeadlessRunner::onEvent(const HeadlessEvent& event)
{
    switch (event.kind) {
    case HeadlessEvent::Kind::Status:
        print("status: " + Escape(event.text));
        break;
    case HeadlessEvent::Kind::Title:
        print("title: " + Escape(event.text));
        break;
    case HeadlessEvent::Kind::Question:
        print("question: " + Escape(event.caption) + ": " + Escape(event.text) + " -> " +
              (event.answer ? "yes" : "no"));
        if (event.caption == kOfferCaption)
            commandFailed_ = true;
        break;
    case HeadlessEvent::Kind::MessageBox:
        print("message: " + Escape(event.caption) + ": " + Escape(event.text));
        break;
    case HeadlessEvent::Kind::OpenFile:
        print("open file: " + (event.answer ? Escape(event.text) : std::string("cancelled")));
        break;
    case HeadlessEvent::Kind::SaveFile:
        print("save file: " + (event.answer ? Escape(event.text) : std::string("cancelled")));
        break;
    case HeadlessEvent::Kind::Beep:
        print("beep");
        break;
    }
}

int HeadlessRunner::Run()
{
    // What the start-up shows (port opened, file loaded, a download) is judged as a
    // command of its own.
    commandOpen_ = true;
    dialog_.ResetFailureShown();
    if (!dialog_.Create()) {
        err_ << "harbor: the dialog window could not be created\n";
        return HeadlessFailed;
    }
    host_.RunMessageLoop();
    judgeCommand();
    print("done: " + std::to_string(commandsRun_) + " commands, " +
          std::to_string(commandsFailed_) + " failed");
    if (status_ == HeadlessOk && commandsFailed_ > 0)
        status_ = HeadlessFailed;
    return status_;
}

void HeadlessRunner::waitForOperations(int timeoutMs)
{
    const std::int64_t deadline = NowMs() + timeoutMs;
    for (;;) {
        host_.DispatchPending();
        const int inFlight = dialog_.operationsInFlight();
        // A late report of an operation given up on lowers the count below the mark.
        if (abandoned_ > inFlight)
            abandoned_ = inFlight;
        if (inFlight <= abandoned_ || host_.QuitRequested())
            return;
        const std::int64_t left = deadline - NowMs();
        if (left <= 0) {
            // Given up: later commands do not wait for it again.
            print("wait: timed out");
            commandFailed_ = true;
            abandoned_ = inFlight;
            return;
        }
        host_.WaitForMessage(static_cast<int>(left));
    }
}

void HeadlessRunner::judgeCommand()
{
    if (!commandOpen_)
        return;
    commandOpen_ = false;
    if (commandFailed_ || dialog_.failureShown())
        ++commandsFailed_;
    commandFailed_ = false;
    dialog_.ResetFailureShown();
}

bool HeadlessRunner::idle()
{
    if (exitSent_ || host_.QuitRequested())
        return false;
    // A download or execution started by the last command reports back first, so that
    // scripted sessions are repeatable and its failure counts for that command.
    waitForOperations(options_.waitTimeoutMs);
    if (host_.QueuedMessages() != 0)
        return true;
    judgeCommand();
    if (inputEnded_) {
        finish();
        return true;
    }
    std::string line;
    if (!std::getline(in_, line)) {
        inputEnded_ = true;
        finish();
        return true;
    }
    ++lineNumber_;
    if (!execute(line))
        finish();
    return true;
}

void HeadlessRunner::finish()
{
    // A help session still open ends first, as when a person closes the help window: its
    // nested loop returns, and the handler that offered the Trouble Shooter finishes before
    // the dialog window goes.
    if (!helpCloseSent_ && helpViewer_->IsOpen()) {
        helpCloseSent_ = true;
        inputEnded_ = true;
        helpViewer_->InputEnded();
        return;
    }
    const WindowHandle help = host_.FindWindowOfClass(kHelpWindowClass);
    if (help != kNoWindow && !helpCloseSent_) {
        helpCloseSent_ = true;
        inputEnded_ = true;
        host_.PostMessage(help, kMsgCommand, MakeCommand(kHelpQuitCommand), 0);
        return;
    }
    exitSent_ = true;
    inputEnded_ = true;
    if (dialog_.handle() != kNoWindow) {
        host_.SendMessage(dialog_.handle(), kMsgCommand, MakeCommand(IdFileExit), 0);
    }
    if (!host_.QuitRequested())
        host_.PostQuit(0);
}

bool HeadlessRunner::badCommand(const std::string& message)
{
    err_ << "harbor: " << message << " (line " << lineNumber_ << ")\n";
    err_.flush();
    status_ = HeadlessBadCommand;
    commandOpen_ = false;
    return false;
}

bool HeadlessRunner::click(int id, const std::string& name)
{
    if (host_.Click(dialog_.handle(), id))
        return true;
    print("refused: " + name + " is disabled");
    commandFailed_ = true;
    return false;
}

bool HeadlessRunner::execute(const std::string& rawLine)
{
    const std::string line = Trim(rawLine);
    if (line.empty() || line[0] == '#')
        return true;
    std::string argument;
    const CommandSpec* spec = MatchCommand(line, argument);
    if (spec == nullptr) {
        std::string name = line.substr(0, line.find_first_of(" \t"));
        return badCommand("unknown command \"" + name + "\"");
    }
    if (options_.echo)
        print("> " + line);
    const WindowHandle window = dialog_.handle();
    const std::string name = spec->name;
    commandOpen_ = true;
    commandFailed_ = false;
    dialog_.ResetFailureShown();
    ++commandsRun_;

    switch (spec->action) {
    case Action::Exit:
        if (!argument.empty())
            return badCommand(name + " takes no argument");
        finish();
        break;
    case Action::Click:
        if (!argument.empty())
            return badCommand(name + " takes no argument");
        click(spec->id, name);
        break;
    case Action::ClickChoice:
        host_.SetChoice(argument);
        click(spec->id, name);
        host_.SetChoice("");
        break;
    case Action::ClickEdit:
        if (!argument.empty())
            host_.SetControlText(window, spec->editId, argument.c_str());
        click(spec->id, name);
        break;
    case Action::Receive: {
        const int state =
            argument.empty() ? !host_.IsChecked(window, spec->id) : ParseSwitch(argument);
        if (state < 0)
            return badCommand(name + " takes on or off");
        // The click toggles the box, so it starts from the other state.
        host_.SetCheck(window, spec->id, state == 0);
        click(spec->id, name);
        break;
    }
    case Action::CheckBox: {
        const int state = ParseSwitch(argument);
        if (state < 0)
            return badCommand(name + " takes on or off");
        host_.SetCheck(window, spec->id, state == 1);
        break;
    }
    case Action::BrickList:
    case Action::SourceList: {
        int index = -1;
        if (!EqualNoCase(argument, "none")) {
            for (int i = 0; i < host_.ListCount(window, spec->id); ++i) {
                if (EqualNoCase(argument, host_.ListEntry(window, spec->id, i).c_str()))
                    index = i;
            }
            if (index < 0)
                return badCommand(name + " has no entry \"" + argument + "\"");
        }
        host_.ListSelect(window, spec->id, index);
        break;
    }
    case Action::Editor:
        host_.SetControlText(window, IdEditor, Unescape(argument).c_str());
        break;
    case Action::SetText:
    case Action::SetCheck: {
        const std::size_t blank = argument.find_first_of(" \t");
        long id = 0;
        if (!ParseInt(argument.substr(0, blank), id))
            return badCommand(name + " takes a control id");
        const std::string value =
            blank == std::string::npos ? std::string() : Trim(argument.substr(blank));
        if (spec->action == Action::SetText) {
            host_.SetControlText(window, static_cast<int>(id), Unescape(value).c_str());
        } else {
            const int state = ParseSwitch(value);
            if (state < 0)
                return badCommand(name + " takes a control id and on or off");
            host_.SetCheck(window, static_cast<int>(id), state == 1);
        }
        break;
    }
    case Action::Answer: {
        std::size_t start = 0;
        int queued = 0;
        while (start < argument.size()) {
            std::size_t end = argument.find_first_of(" \t", start);
            if (end == std::string::npos)
                end = argument.size();
            const int state = ParseSwitch(argument.substr(start, end - start));
            if (state < 0)
                return badCommand(name + " takes yes or no");
            host_.QueueAnswer(state == 1);
            ++queued;
            start = argument.find_first_not_of(" \t", end);
            if (start == std::string::npos)
                break;
        }
        if (queued == 0)
            return badCommand(name + " takes yes or no");
        break;
    }
    case Action::Expect:
    case Action::ExpectTitle:
    case Action::ExpectEditor:
    case Action::ExpectFile: {
        std::string actual;
        const char* what = "status";
        if (spec->action == Action::Expect) {
            actual = host_.ControlText(window, IdStatusBox);
        } else if (spec->action == Action::ExpectTitle) {
            actual = host_.WindowTitle(window);
            what = "title";
        } else if (spec->action == Action::ExpectEditor) {
            actual = host_.ControlText(window, IdEditor);
            what = "editor";
        } else {
            actual = dialog_.currentFile();
            what = "file";
        }
        if (actual != Unescape(argument)) {
            print(std::string("expect: ") + what + " is \"" + Escape(actual) + "\"");
            commandFailed_ = true;
        }
        break;
    }
    case Action::Print:
        if (EqualNoCase(argument, "status")) {
            print("status: " + Escape(host_.ControlText(window, IdStatusBox)));
        } else if (EqualNoCase(argument, "editor")) {
            print("editor: " + Escape(host_.ControlText(window, IdEditor)));
        } else if (EqualNoCase(argument, "title")) {
            print("title: " + Escape(host_.WindowTitle(window)));
        } else if (EqualNoCase(argument, "file")) {
            print(std::string("file: ") + Escape(dialog_.currentFile()));
        } else {
            return badCommand(name + " takes status, editor, title or file");
        }
        break;
    case Action::Wait: {
        long ms = options_.waitTimeoutMs;
        if (!argument.empty() && (!ParseInt(argument, ms) || ms < 0))
            return badCommand(name + " takes milliseconds");
        waitForOperations(static_cast<int>(ms));
        break;
    }
    case Action::WaitStatus: {
        const std::string wanted = Unescape(argument);
        const std::int64_t deadline = NowMs() + options_.waitTimeoutMs;
        for (;;) {
            host_.DispatchPending();
            if (host_.ControlText(dialog_.handle(), IdStatusBox) == wanted)
                break;
            const std::int64_t left = deadline - NowMs();
            if (left <= 0 || host_.QuitRequested()) {
                print("wait: timed out");
                commandFailed_ = true;
                break;
            }
            host_.WaitForMessage(static_cast<int>(left));
        }
        break;
    }
    case Action::Pump: {
        long ms = 0;
        if (!ParseInt(argument, ms) || ms < 0)
            return badCommand(name + " takes milliseconds");
        const std::int64_t deadline = NowMs() + ms;
        for (;;) {
            host_.DispatchPending();
            const std::int64_t left = deadline - NowMs();
            if (left <= 0 || host_.QuitRequested())
                break;
            host_.WaitForMessage(static_cast<int>(left));
        }
        break;
    }
    case Action::Help: {
        // "Help ID [NUMBER]" follows a command link of the shown topic, "Help Topic NAME" a
        // plain link to another topic.
        const std::size_t blank = argument.find_first_of(" \t");
        const std::string first = argument.substr(0, blank);
        const std::string rest =
            blank == std::string::npos ? std::string() : Trim(argument.substr(blank));
        long id = 0;
        long value = 0;
        const bool topic = EqualNoCase(first, "topic");
        if (topic ? rest.empty()
                  : (!ParseInt(first, id) || (!rest.empty() && !ParseInt(rest, value))))
            return badCommand(name + " takes a command id and an optional number, or Topic NAME");
        if (!helpViewer_->IsOpen()) {
            print("refused: no help is open");
            commandFailed_ = true;
            break;
        }
        const bool done =
            topic ? helpViewer_->ShowTopic(rest)
                  : helpViewer_->Command(static_cast<int>(id), static_cast<std::int32_t>(value));
        if (!done)
            commandFailed_ = true;
        break;
    }
    }
    return true;
}

} // namespace ui
