#include "ScriptCompiler.h"

#include <cstdio>
#include <initializer_list>
#include <unordered_map>

#include "Code.h"
#include "Failure.h"

namespace tessel::lang {
namespace {

constexpr std::string_view kReserved[] = {
    "program",   "main",   "task",   "sub",   "var",     "const",   "timer",   "counter", "event",
    "semaphore", "repeat", "while",  "if",    "else",    "sound",   "tone",    "volume",  "wait",
    "on",        "off",    "float",  "fwd",   "rev",     "toggle",  "power",   "start",   "stop",
    "all",       "send",   "signal", "await", "acquire", "release", "return",  "input",   "random",
    "clear",     "boot",   "brick",  "get",   "set",     "poll",    "battery",
};

bool IsReserved(std::string_view word)
{
    for (std::string_view r : kReserved) {
        if (r == word) {
            return true;
        }
    }
    return false;
}

// Words that only make sense as immediate commands.
bool IsImmediateWord(std::string_view word)
{
    return word == "clear" || word == "boot" || word == "brick" || word == "get" || word == "set" ||
           word == "poll" || word == "battery";
}

enum class Sym : std::uint8_t { Var, Local, Const, Timer, Counter, Event, Semaphore, Task, Sub };

struct Symbol {
    Sym kind = Sym::Var;
    int index = 0;
};

// Expression tree of one statement; folded while it is built.
enum class NodeKind : std::uint8_t { Const, Value, Neg, Binary, Rel, And, Or, Not };

struct Node {
    NodeKind kind = NodeKind::Const;
    std::uint8_t op = 0; // Binary: the opcode byte; Rel: the Relation
    int a = -1;
    int b = -1;
    int value = 0;   // Const
    Operand operand; // Value
    std::int32_t offset = 0;
    int height = 1;
};

struct Arg {
    enum Kind : std::uint8_t { Value, Plain, Label } kind;
    Operand operand;
    int number = 0;
};
Arg V(Operand operand)
{
    return Arg{Arg::Value, operand, 0};
}
Arg B(int number)
{
    return Arg{Arg::Plain, {}, number};
}
Arg L(int label)
{
    return Arg{Arg::Label, {}, label};
}
Operand Constant(int value)
{
    return Operand{Source::Constant, static_cast<std::int16_t>(value)};
}

struct RoutineDecl {
    Sym kind = Sym::Task;
    std::string_view name;
    int number = 0;
    std::size_t body = 0; // token index of its '{'
    std::int32_t offset = 0;
};

struct CallSite {
    int from = 0; // sub numbers
    int to = 0;
    std::int32_t offset = 0;
    std::string_view name;
};

class Compiler {
public:
    Compiler(int brickType, const TranslateLimits& limits, const std::vector<Token>& tokens)
        : brickType_(brickType), caps_(CapacitiesOf(brickType)), limits_(limits), tokens_(tokens)
    {
    }

    CompiledScript run()
    {
        out_.program.brickType = brickType_;
        if (peek().isWord("program")) {
            compileProgram();
        } else {
            compileImmediate();
        }
        return std::move(out_);
    }

private:
    // --- tokens ---
    const Token& peek(std::size_t ahead = 0) const
    {
        const std::size_t at = pos_ + ahead;
        return at < tokens_.size() ? tokens_[at] : tokens_.back();
    }
    const Token& take()
    {
        const Token& t = tokens_[pos_];
        if (pos_ + 1 < tokens_.size()) {
            ++pos_;
        }
        return t;
    }
    static std::string_view Shown(const Token& t)
    {
        return t.kind() == Tok::End ? std::string_view("end of text") : t.text();
    }
    [[noreturn]] void syntax(const Token& t) { Fail(kSyntax, t.offset, Shown(t)); }
    bool accept(std::string_view punct)
    {
        if (peek().is(punct)) {
            take();
            return true;
        }
        return false;
    }
    void expect(std::string_view punct)
    {
        if (!accept(punct)) {
            syntax(peek());
        }
    }
    bool acceptWord(std::string_view word)
    {
        if (peek().isWord(word)) {
            take();
            return true;
        }
        return false;
    }
    void expectWord(std::string_view word)
    {
        if (!acceptWord(word)) {
            syntax(peek());
        }
    }
    const Token& expectName()
    {
        const Token& t = peek();
        if (t.kind() != Tok::Ident || IsReserved(t.text())) {
            Fail(kNameExpected, t.offset, Shown(t));
        }
        return take();
    }

    // --- symbols ---
    const Symbol* lookup(std::string_view name) const
    {
        auto local = locals_.find(name);
        if (local != locals_.end()) {
            return &local->second;
        }
        auto global = globals_.find(name);
        return global != globals_.end() ? &global->second : nullptr;
    }
    void checkFree(const Token& name)
    {
        if (lookup(name.text()) != nullptr) {
            Fail(kNameDeclared, name.offset, name.text());
        }
    }
    int addName(int kind, std::string_view name)
    {
        out_.listing.names.push_back({kind, std::string(name)});
        return static_cast<int>(out_.listing.names.size());
    }
    void addSymbolLine(const char* kind, int number, std::string_view name)
    {
        char buffer[32];
        std::snprintf(buffer, sizeof buffer, "%s,%d,", kind, number);
        out_.symbols += buffer;
        out_.symbols += name;
        out_.symbols += '\n';
    }
    static void SetAt(std::vector<int>& table, int index, int value)
    {
        if (table.size() <= static_cast<std::size_t>(index)) {
            table.resize(static_cast<std::size_t>(index) + 1, 0);
        }
        table[static_cast<std::size_t>(index)] = value;
    }

    // --- the program ---
    void compileProgram()
    {
        take(); // program
        const Token& name = expectName();
        out_.listing.programName = std::string(name.text());
        out_.program.kind = ObjectKind::Program;
        addSymbolLine("program", 0, name.text());
        const Token& open = peek();
        expect("{");
        std::vector<RoutineDecl> routines;
        bool haveMain = false;
        int taskCount = 0;
        int subCount = 0;
        for (;;) {
            const Token& t = peek();
            if (t.is("}")) {
                break;
            }
            if (t.kind() == Tok::End) { // the program's braces do not close
                Fail(kSyntax, open.offset, "{");
            }
            if (t.is(";")) {
                take();
            } else if (t.isWord("var") || t.isWord("const") || t.isWord("timer") ||
                       t.isWord("counter") || t.isWord("event") || t.isWord("semaphore")) {
                declaration(false);
            } else if (t.isWord("main")) {
                if (haveMain) {
                    Fail(kNameDeclared, t.offset, "main");
                }
                haveMain = true;
                take();
                routines.push_back({Sym::Task, "main", 0, pos_, t.offset});
                skipBlock();
            } else if (t.isWord("task") || t.isWord("sub")) {
                take();
                const bool isTask = t.isWord("task");
                const Token& routineName = expectName();
                checkFree(routineName);
                if (isTask) {
                    if (taskCount + 2 > caps_.tasks) { // main always takes one
                        Fail(kNoMoreTasks, routineName.offset, routineName.text());
                    }
                    ++taskCount;
                } else if (subCount + 1 > caps_.subroutines) {
                    Fail(kNoMoreSubs, routineName.offset, routineName.text());
                } else {
                    ++subCount;
                }
                const int number = isTask ? taskCount : subCount - 1;
                globals_[routineName.text()] = Symbol{isTask ? Sym::Task : Sym::Sub, number};
                addSymbolLine(isTask ? "task" : "sub", number, routineName.text());
                routines.push_back({isTask ? Sym::Task : Sym::Sub, routineName.text(), number, pos_,
                                    routineName.offset});
                skipBlock();
            } else {
                syntax(t);
            }
        }
        const Token& close = take();
        if (peek().kind() != Tok::End) {
            syntax(peek());
        }
        if (!haveMain) {
            Fail(kTaskUndefined, close.offset, "main");
        }
        // main first, then the tasks, then the subroutines, each in number order.
        for (int pass = 0; pass < 3; ++pass) {
            for (const RoutineDecl& r : routines) {
                const bool isMain = r.kind == Sym::Task && r.number == 0;
                if ((pass == 0 && isMain) || (pass == 1 && r.kind == Sym::Task && !isMain) ||
                    (pass == 2 && r.kind == Sym::Sub)) {
                    compileRoutine(r);
                }
            }
        }
        checkNesting();
    }

    // Skips a braced block in the declaration pass; the routine pass reads it.
    void skipBlock()
    {
        const Token& open = peek();
        if (!open.is("{")) {
            syntax(open);
        }
        int depth = 0;
        for (;;) {
            const Token& t = take();
            if (t.kind() == Tok::End) {
                Fail(kSyntax, open.offset, "{");
            }
            if (t.is("{")) {
                ++depth;
            } else if (t.is("}") && --depth == 0) {
                return;
            }
        }
    }

    // var / const / timer / counter / event / semaphore; local when inside a routine.
    void declaration(bool local)
    {
        const Token& keyword = take();
        const std::string_view kind = keyword.text();
        do {
            const Token& name = expectName();
            checkFree(name);
            if (kind == "const") {
                expect("=");
                const int value = constant();
                (local ? locals_ : globals_)[name.text()] = Symbol{Sym::Const, value};
                addSymbolLine("const", value, name.text());
                continue;
            }
            if (kind == "var" && local) {
                if (routineKind_ == Sym::Sub) {
                    Fail(kLocalOutsideTask, name.offset, name.text());
                }
                const int index = localCount_;
                if (index >= caps_.locals - liveTemps(true)) {
                    Fail(kTooManyVariables, name.offset, name.text());
                }
                ++localCount_;
                locals_[name.text()] = Symbol{Sym::Local, index};
                SetAt(block_->locals, index, addName(1, name.text()));
                addSymbolLine("local", index, name.text());
                if (accept("=")) {
                    assign(Operand{Source::Local, static_cast<std::int16_t>(index)}, name.offset);
                }
                continue;
            }
            if (local) { // timers, counters, events and semaphores belong to the program
                Fail(kNotALocal, name.offset, name.text());
            }
            if (kind == "var") {
                const int index = globalCount_;
                if (index >= caps_.globals) {
                    Fail(kTooManyVariables, name.offset, name.text());
                }
                ++globalCount_;
                globals_[name.text()] = Symbol{Sym::Var, index};
                SetAt(out_.listing.globals, index, addName(0, name.text()));
                addSymbolLine("var", index, name.text());
                if (accept("=")) {
                    inits_.push_back({index, constant(), name.offset});
                }
            } else if (kind == "timer") {
                if (timerCount_ >= caps_.timers) {
                    Fail(kNoMoreTimers, name.offset, name.text());
                }
                globals_[name.text()] = Symbol{Sym::Timer, timerCount_};
                SetAt(out_.listing.timers, timerCount_, addName(2, name.text()));
                addSymbolLine("timer", timerCount_++, name.text());
            } else if (kind == "counter") {
                if (counterCount_ >= caps_.counters) {
                    Fail(kTooManyCounters, name.offset, name.text());
                }
                globals_[name.text()] = Symbol{Sym::Counter, counterCount_};
                SetAt(out_.listing.counters, counterCount_, addName(3, name.text()));
                addSymbolLine("counter", counterCount_++, name.text());
            } else if (kind == "event") {
                if (eventCount_ >= caps_.events) {
                    Fail(kTooManyEvents, name.offset, name.text());
                }
                globals_[name.text()] = Symbol{Sym::Event, eventCount_};
                addSymbolLine("event", eventCount_++, name.text());
            } else {
                if (semaphoreCount_ >= caps_.semaphores) {
                    Fail(kTooManySemaphores, name.offset, name.text());
                }
                globals_[name.text()] = Symbol{Sym::Semaphore, semaphoreCount_};
                addSymbolLine("semaphore", semaphoreCount_++, name.text());
            }
        } while (accept(","));
        accept(";");
    }

    void compileRoutine(const RoutineDecl& r)
    {
        code_.clear();
        sourceOffsets_.clear();
        labels_.clear();
        fixups_.clear();
        locals_.clear();
        localCount_ = 0;
        globalTemps_ = 0;
        localTemps_ = 0;
        routineKind_ = r.kind;
        routineNumber_ = r.number;
        routineName_ = r.name;
        out_.listing.blocks.emplace_back();
        block_ = &out_.listing.blocks.back();
        block_->name = std::string(r.name);
        pos_ = r.body;
        if (r.kind == Sym::Task && r.number == 0) {
            for (const Init& init : inits_) {
                emit(Op::SetVar, init.offset,
                     {V(Operand{Source::Variable, static_cast<std::int16_t>(init.index)}),
                      V(Constant(init.value))});
            }
        }
        block(0);
        emit(r.kind == Sym::Sub ? Op::Return : Op::EndTask, tokens_[pos_ - 1].offset, {});
        finishCode(r.offset, r.name);
        Routine routine;
        routine.kind = r.kind == Sym::Sub ? RoutineKind::Sub : RoutineKind::Task;
        routine.number = r.number;
        routine.code = std::move(code_);
        routine.commands = static_cast<int>(sourceOffsets_.size());
        block_->sourceOffsets = std::move(sourceOffsets_);
        out_.program.commandCount += routine.commands;
        out_.program.routines.push_back(std::move(routine));
        code_.clear();
        sourceOffsets_.clear();
    }

    void finishCode(std::int32_t offset, std::string_view name)
    {
        if (code_.size() > 32767) { // jumps are 16-bit
            Fail(kParserStack, offset, name);
        }
        for (const Fixup& f : fixups_) {
            const int delta = labels_[static_cast<std::size_t>(f.label)] - f.end;
            code_[f.at] = static_cast<std::uint8_t>(delta & 0xFF);
            code_[f.at + 1] = static_cast<std::uint8_t>((delta >> 8) & 0xFF);
        }
    }

    void checkNesting()
    {
        if (caps_.nesting <= 1) {
            return; // calls from subroutines were refused where they stood
        }
        // Deepest chain of subroutine calls starting in each subroutine; a cycle is a
        // subroutine calling itself through others.
        const int subs = caps_.subroutines;
        std::vector<int> depth(static_cast<std::size_t>(subs), -1); // -2: being visited
        struct Walker {
            const std::vector<CallSite>& calls;
            std::vector<int>& depth;
            int limit;
            int visit(int sub, int level)
            {
                if (level > limit + 1) {
                    return level;
                }
                int& d = depth[static_cast<std::size_t>(sub)];
                if (d >= 0) {
                    return d;
                }
                d = -2;
                int best = 1;
                for (const CallSite& call : calls) {
                    if (call.from != sub) {
                        continue;
                    }
                    if (depth[static_cast<std::size_t>(call.to)] == -2) {
                        Fail(kSubCallsItself, call.offset, call.name);
                    }
                    const int below = visit(call.to, level + 1) + 1;
                    if (below > best) {
                        best = below;
                    }
                    if (best > limit) {
                        Fail(kSubCallsSub, call.offset, call.name);
                    }
                }
                d = best;
                return best;
            }
        } walker{calls_, depth, caps_.nesting};
        for (int s = 0; s < subs; ++s) {
            walker.visit(s, 1);
        }
    }

    // --- statements ---
    void block(int depth)
    {
        const Token& open = peek();
        expect("{");
        while (!peek().is("}")) {
            if (peek().kind() == Tok::End) {
                Fail(kSyntax, open.offset, "{");
            }
            statement(depth + 1);
        }
        take();
    }

    void statement(int depth)
    {
        const Token& t = peek();
        if (depth > limits_.maxNesting) {
            Fail(kParserStack, t.offset, Shown(t));
        }
        nodes_.clear();
        const int liveGlobal = globalTemps_;
        const int liveLocal = localTemps_;
        statementBody(depth, t);
        globalTemps_ = liveGlobal;
        localTemps_ = liveLocal;
    }

    void statementBody(int depth, const Token& t)
    {
        if (t.is("{")) {
            block(depth);
            return;
        }
        if (t.is(";")) {
            take();
            return;
        }
        if (t.kind() != Tok::Ident) {
            syntax(t);
        }
        const std::string_view w = t.text();
        if (IsImmediateWord(w)) {
            Fail(kImmediateOnly, t.offset, w);
        }
        if (w == "var" || w == "const" || w == "timer" || w == "counter" || w == "event" ||
            w == "semaphore") {
            declaration(true);
            return;
        }
        take();
        if (w == "repeat") {
            expect("(");
            const int count = expression();
            expect(")");
            const Operand counter = newTemp(true, t.offset);
            const int liveGlobal = globalTemps_;
            const int liveLocal = localTemps_;
            generateInto(counter, count);
            globalTemps_ = liveGlobal; // what computed the count is dead; the counter lives on
            localTemps_ = liveLocal;
            const int top = newLabel();
            const int done = newLabel();
            bind(top);
            emit(Op::JumpUnless, t.offset,
                 {V(counter), B(static_cast<int>(Relation::Greater)), V(Constant(0)), L(done)});
            emit(Op::SubVar, t.offset, {V(counter), V(Constant(1))});
            statement(depth + 1);
            emit(Op::Jump, t.offset, {L(top)});
            bind(done);
        } else if (w == "while") {
            expect("(");
            const int test = expression();
            expect(")");
            const int top = newLabel();
            const int done = newLabel();
            bind(top);
            condition(test, done);
            statement(depth + 1);
            emit(Op::Jump, t.offset, {L(top)});
            bind(done);
        } else if (w == "if") {
            // An else-if chain is walked here rather than nested, so a long chain of cases
            // does not count as deep nesting.
            const int done = newLabel();
            for (;;) {
                expect("(");
                const int test = expression();
                expect(")");
                const int otherwise = newLabel();
                condition(test, otherwise);
                statement(depth + 1);
                if (!acceptWord("else")) {
                    bind(otherwise);
                    break;
                }
                emit(Op::Jump, t.offset, {L(done)});
                bind(otherwise);
                if (!acceptWord("if")) {
                    statement(depth + 1);
                    break;
                }
                nodes_.clear();
            }
            bind(done);
        } else if (w == "sound") {
            const int sound = constantIn(0, 255);
            emit(Op::PlaySound, t.offset, {B(sound)});
        } else if (w == "tone") {
            const Operand frequency = operandOf(expression());
            expect(",");
            const Operand duration = operandOf(expression());
            if (accept(",")) {
                emit(Op::SetVolume, t.offset, {V(operandOf(expression()))});
            }
            emit(Op::PlayTone, t.offset, {V(frequency), V(duration)});
        } else if (w == "volume") {
            emit(Op::SetVolume, t.offset, {V(operandOf(expression()))});
        } else if (w == "wait") {
            emit(Op::Wait, t.offset, {V(operandOf(expression()))});
        } else if (w == "send") {
            emit(Op::SendMessage, t.offset, {V(operandOf(expression()))});
        } else if (outputWord(w, t)) {
        } else if (w == "power") {
            const int mask = outputList("=");
            expect("=");
            emit(Op::OutputPower, t.offset, {B(mask), V(operandOf(expression()))});
        } else if (w == "start" || w == "stop") {
            startStop(w == "start", t);
        } else if (w == "signal" || w == "await" || w == "acquire" || w == "release") {
            const bool isEvent = w == "signal" || w == "await";
            const Token& name = expectName();
            const Symbol* symbol = lookup(name.text());
            if (symbol == nullptr || symbol->kind != (isEvent ? Sym::Event : Sym::Semaphore)) {
                Fail(isEvent ? kEventNotDeclared : kSemaphoreNotDeclared, name.offset, name.text());
            }
            const Op op = w == "signal"    ? Op::Signal
                          : w == "await"   ? Op::Await
                          : w == "acquire" ? Op::Acquire
                                           : Op::Release;
            emit(op, t.offset, {B(symbol->index)});
        } else if (w == "return") {
            emit(routineKind_ == Sym::Sub ? Op::Return : Op::EndTask, t.offset, {});
        } else if (IsReserved(w)) {
            syntax(t);
        } else if (peek().is("(")) {
            take();
            expect(")");
            callSub(t);
        } else {
            assignment(t);
        }
        accept(";");
    }

    bool outputWord(std::string_view w, const Token& t)
    {
        static constexpr struct {
            std::string_view word;
            Op op;
            int value;
        } kWords[] = {{"on", Op::OutputMode, 2},    {"off", Op::OutputMode, 1},
                      {"float", Op::OutputMode, 0}, {"fwd", Op::OutputDir, 1},
                      {"rev", Op::OutputDir, 0},    {"toggle", Op::OutputDir, 2}};
        for (const auto& entry : kWords) {
            if (entry.word == w) {
                const int mask = outputList({});
                emit(entry.op, t.offset, {B(mask), B(entry.value)});
                return true;
            }
        }
        return false;
    }

    // Outputs 1, 2, 3 ... as constants separated by commas; a bit mask.
    int outputList(std::string_view stop)
    {
        int mask = 0;
        do {
            if (!stop.empty() && peek().is(stop)) {
                break;
            }
            const int output = constantIn(1, caps_.outputs);
            mask |= 1 << (output - 1);
        } while (accept(","));
        if (mask == 0) {
            syntax(peek());
        }
        return mask;
    }

    void startStop(bool start, const Token& t)
    {
        if (!start && acceptWord("all")) {
            emit(Op::StopAll, t.offset, {});
            return;
        }
        const Token& name = peek();
        int task = 0;
        if (acceptWord("main")) {
            task = 0;
        } else {
            if (name.kind() != Tok::Ident) {
                syntax(name);
            }
            take();
            const Symbol* symbol = lookup(name.text());
            if (symbol == nullptr) {
                Fail(kNameNotDeclared, name.offset, name.text());
            }
            if (symbol->kind != Sym::Task) {
                Fail(kTaskExpected, name.offset, name.text());
            }
            task = symbol->index;
        }
        emit(start ? Op::StartTask : Op::StopTask, t.offset, {B(task)});
    }

    void callSub(const Token& name)
    {
        const Symbol* symbol = lookup(name.text());
        if (symbol == nullptr) {
            Fail(kNameNotDeclared, name.offset, name.text());
        }
        if (symbol->kind != Sym::Sub) {
            Fail(kSyntax, name.offset, name.text());
        }
        if (routineKind_ == Sym::Sub) {
            if (symbol->index == routineNumber_) {
                Fail(kSubCallsItself, name.offset, name.text());
            }
            if (caps_.nesting <= 1) {
                Fail(kSubCallsSub, name.offset, name.text());
            }
            calls_.push_back({routineNumber_, symbol->index, name.offset, name.text()});
        }
        emit(Op::Call, name.offset, {B(symbol->index)});
    }

    void assignment(const Token& name)
    {
        const Symbol* symbol = lookup(name.text());
        if (symbol == nullptr) {
            Fail(kVariableNotDeclared, name.offset, name.text());
        }
        Operand dest;
        switch (symbol->kind) {
        case Sym::Var:
            dest = {Source::Variable, static_cast<std::int16_t>(symbol->index)};
            break;
        case Sym::Local:
            dest = {Source::Local, static_cast<std::int16_t>(symbol->index)};
            break;
        case Sym::Timer:
            dest = {Source::Timer, static_cast<std::int16_t>(symbol->index)};
            break;
        case Sym::Counter:
            dest = {Source::Counter, static_cast<std::int16_t>(symbol->index)};
            break;
        default:
            Fail(kWritableExpected, name.offset, name.text());
        }
        const Token& op = peek();
        static constexpr struct {
            std::string_view punct;
            Op op;
        } kCompound[] = {{"+=", Op::AddVar}, {"-=", Op::SubVar}, {"*=", Op::MulVar},
                         {"/=", Op::DivVar}, {"%=", Op::ModVar}, {"&=", Op::AndVar},
                         {"|=", Op::OrVar}};
        if (op.is("=")) {
            take();
            assign(dest, name.offset);
            return;
        }
        for (const auto& entry : kCompound) {
            if (op.is(entry.punct)) {
                take();
                const Operand value = operandOf(expression());
                emit(entry.op, name.offset, {V(dest), V(value)});
                return;
            }
        }
        syntax(op);
    }

    void assign(Operand dest, std::int32_t offset)
    {
        (void)offset;
        generateInto(dest, expression());
    }

    // --- expressions ---
    int node(Node n)
    {
        int height = 0;
        if (n.a >= 0) {
            height = nodes_[static_cast<std::size_t>(n.a)].height;
        }
        if (n.b >= 0 && nodes_[static_cast<std::size_t>(n.b)].height > height) {
            height = nodes_[static_cast<std::size_t>(n.b)].height;
        }
        n.height = height + 1;
        if (n.height > limits_.maxNesting * 4) {
            Fail(kParserStack, n.offset, "expression");
        }
        nodes_.push_back(n);
        return static_cast<int>(nodes_.size()) - 1;
    }
    const Node& at(int index) const { return nodes_[static_cast<std::size_t>(index)]; }

    int constant()
    {
        const Token& start = peek();
        const int n = expression();
        if (at(n).kind != NodeKind::Const) {
            Fail(kConstantExpected, start.offset, Shown(start));
        }
        return at(n).value;
    }

    int constantIn(int low, int high)
    {
        const Token& start = peek();
        const int value = constant();
        if (value < low || value > high) {
            char detail[16];
            std::snprintf(detail, sizeof detail, "%d", value);
            Fail(kOutOfRange, start.offset, detail);
        }
        return value;
    }

    struct Guard {
        int& depth;
        Guard(int& d, int limit, std::int32_t offset) : depth(d)
        {
            if (++depth > limit) {
                Fail(kParserStack, offset, "expression");
            }
        }
        ~Guard() { --depth; }
        Guard(const Guard&) = delete;
        Guard& operator=(const Guard&) = delete;
    };

    static int Precedence(const Token& t)
    {
        if (t.kind() != Tok::Punct) {
            return 0;
        }
        const std::string_view p = t.text();
        if (p == "||")
            return 1;
        if (p == "&&")
            return 2;
        if (p == "==" || p == "!=")
            return 3;
        if (p == "<" || p == ">" || p == "<=" || p == ">=")
            return 4;
        if (p == "|")
            return 5;
        if (p == "&")
            return 6;
        if (p == "+" || p == "-")
            return 7;
        if (p == "*" || p == "/" || p == "%")
            return 8;
        return 0;
    }

    int expression(int minPrecedence = 1)
    {
        Guard guard(exprDepth_, limits_.maxNesting * 4, peek().offset);
        int left = unary();
        for (;;) {
            const Token& op = peek();
            const int precedence = Precedence(op);
            if (precedence == 0 || precedence < minPrecedence) {
                return left;
            }
            take();
            const int right = expression(precedence + 1);
            left = combine(op, left, right);
        }
    }

    static std::int16_t Wrap(long value)
    {
        return static_cast<std::int16_t>(static_cast<std::uint16_t>(value));
    }

    int combine(const Token& op, int left, int right)
    {
        const std::string_view p = op.text();
        const bool constant = at(left).kind == NodeKind::Const && at(right).kind == NodeKind::Const;
        const long a = at(left).value;
        const long b = at(right).value;
        Node n;
        n.offset = op.offset;
        n.a = left;
        n.b = right;
        if (p == "||" || p == "&&") {
            if (constant) {
                n.kind = NodeKind::Const;
                n.value = p == "||" ? (a != 0 || b != 0) : (a != 0 && b != 0);
                n.a = n.b = -1;
            } else {
                n.kind = p == "||" ? NodeKind::Or : NodeKind::And;
            }
            return node(n);
        }
        static constexpr struct {
            std::string_view punct;
            Relation relation;
        } kRelations[] = {{"<", Relation::Less},       {">", Relation::Greater},
                          {"<=", Relation::LessEqual}, {">=", Relation::GreaterEqual},
                          {"==", Relation::Equal},     {"!=", Relation::NotEqual}};
        for (const auto& entry : kRelations) {
            if (entry.punct == p) {
                if (constant) {
                    const bool holds = entry.relation == Relation::Less           ? a < b
                                       : entry.relation == Relation::Greater      ? a > b
                                       : entry.relation == Relation::LessEqual    ? a <= b
                                       : entry.relation == Relation::GreaterEqual ? a >= b
                                       : entry.relation == Relation::Equal        ? a == b
                                                                                  : a != b;
                    Node c;
                    c.offset = op.offset;
                    c.value = holds ? 1 : 0;
                    return node(c);
                }
                n.kind = NodeKind::Rel;
                n.op = static_cast<std::uint8_t>(entry.relation);
                return node(n);
            }
        }
        static constexpr struct {
            std::string_view punct;
            Op op;
        } kArithmetic[] = {{"+", Op::AddVar}, {"-", Op::SubVar}, {"*", Op::MulVar},
                           {"/", Op::DivVar}, {"%", Op::ModVar}, {"&", Op::AndVar},
                           {"|", Op::OrVar}};
        for (const auto& entry : kArithmetic) {
            if (entry.punct != p) {
                continue;
            }
            if (constant) {
                long value = 0;
                switch (entry.op) {
                case Op::AddVar:
                    value = a + b;
                    break;
                case Op::SubVar:
                    value = a - b;
                    break;
                case Op::MulVar:
                    value = a * b;
                    break;
                case Op::DivVar:
                case Op::ModVar:
                    if (b == 0) {
                        Fail(kOutOfRange, op.offset, "division by zero");
                    }
                    value = entry.op == Op::DivVar ? a / b : a % b;
                    break;
                case Op::AndVar:
                    value = a & b;
                    break;
                default:
                    value = a | b;
                    break;
                }
                Node c;
                c.offset = op.offset;
                c.value = Wrap(value);
                return node(c);
            }
            n.kind = NodeKind::Binary;
            n.op = static_cast<std::uint8_t>(entry.op);
            return node(n);
        }
        syntax(op);
    }

    int unary()
    {
        const Token& t = peek();
        Guard guard(exprDepth_, limits_.maxNesting * 4, t.offset);
        if (t.is("-") || t.is("!")) {
            take();
            const int inner = unary();
            Node n;
            n.offset = t.offset;
            if (at(inner).kind == NodeKind::Const) {
                n.value =
                    t.is("-") ? Wrap(-static_cast<long>(at(inner).value)) : (at(inner).value == 0);
                return node(n);
            }
            n.kind = t.is("-") ? NodeKind::Neg : NodeKind::Not;
            n.a = inner;
            return node(n);
        }
        if (t.is("+")) {
            take();
            return unary();
        }
        if (t.is("(")) {
            take();
            const int inner = expression();
            expect(")");
            return inner;
        }
        if (t.kind() == Tok::Number) {
            take();
            Node n;
            n.offset = t.offset;
            n.value = Wrap(t.value());
            return node(n);
        }
        if (t.kind() != Tok::Ident) {
            Fail(kValueExpected, t.offset, Shown(t));
        }
        take();
        Node n;
        n.offset = t.offset;
        n.kind = NodeKind::Value;
        if (t.text() == "input" || t.text() == "random") {
            expect("(");
            const bool input = t.text() == "input";
            const int value = input ? constantIn(1, caps_.inputs) : constantIn(1, 32767);
            expect(")");
            n.operand = input ? Operand{Source::Input, static_cast<std::int16_t>(value - 1)}
                              : Operand{Source::Random, static_cast<std::int16_t>(value)};
            return node(n);
        }
        if (IsReserved(t.text())) {
            Fail(kValueExpected, t.offset, t.text());
        }
        const Symbol* symbol = lookup(t.text());
        if (symbol == nullptr) {
            Fail(kVariableNotDeclared, t.offset, t.text());
        }
        const auto index = static_cast<std::int16_t>(symbol->index);
        switch (symbol->kind) {
        case Sym::Const:
            n.kind = NodeKind::Const;
            n.value = Wrap(symbol->index);
            break;
        case Sym::Var:
            n.operand = {Source::Variable, index};
            break;
        case Sym::Local:
            n.operand = {Source::Local, index};
            break;
        case Sym::Timer:
            n.operand = {Source::Timer, index};
            break;
        case Sym::Counter:
            n.operand = {Source::Counter, index};
            break;
        default:
            Fail(kValueExpected, t.offset, t.text());
        }
        return node(n);
    }

    // --- code generation ---
    int liveTemps(bool local) const { return local ? localTemps_ : globalTemps_; }

    // Temporaries come from the top of the task's locals where the brick has them (so tasks
    // running side by side do not share them), else from the top of the global variables.
    Operand newTemp(bool forRepeat, std::int32_t offset)
    {
        const bool local = routineKind_ == Sym::Task && caps_.locals > 0;
        if (local) {
            const int index = caps_.locals - 1 - localTemps_;
            if (index < localCount_) {
                Fail(forRepeat ? kNoRepeatTemp : kNoExpressionTemp, offset);
            }
            ++localTemps_;
            return {Source::Local, static_cast<std::int16_t>(index)};
        }
        const int index = caps_.globals - 1 - globalTemps_;
        if (index < globalCount_) {
            Fail(forRepeat ? kNoRepeatTemp : kNoExpressionTemp, offset);
        }
        ++globalTemps_;
        return {Source::Variable, static_cast<std::int16_t>(index)};
    }

    bool refers(int n, const Operand& operand) const
    {
        const Node& x = at(n);
        if (x.kind == NodeKind::Value) {
            return x.operand.source == operand.source && x.operand.value == operand.value;
        }
        return (x.a >= 0 && refers(x.a, operand)) || (x.b >= 0 && refers(x.b, operand));
    }

    Operand operandOf(int n)
    {
        const Node& x = at(n);
        if (x.kind == NodeKind::Const) {
            return Constant(x.value);
        }
        if (x.kind == NodeKind::Value) {
            return x.operand;
        }
        const Operand temp = newTemp(false, x.offset);
        generateInto(temp, n);
        return temp;
    }

    void generateInto(const Operand& dest, int n)
    {
        const Node x = at(n);
        switch (x.kind) {
        case NodeKind::Const:
        case NodeKind::Value:
            emit(Op::SetVar, x.offset, {V(dest), V(operandOf(n))});
            return;
        case NodeKind::Neg:
            emit(Op::NegVar, x.offset, {V(dest), V(operandOf(x.a))});
            return;
        case NodeKind::Binary:
            if (!refers(x.b, dest)) {
                generateInto(dest, x.a);
                const Operand right = operandOf(x.b);
                emit(static_cast<Op>(x.op), x.offset, {V(dest), V(right)});
                return;
            }
            break;
        default:
            if (!refers(n, dest)) {
                const int skip = newLabel();
                emit(Op::SetVar, x.offset, {V(dest), V(Constant(0))});
                jumpUnless(n, skip);
                emit(Op::SetVar, x.offset, {V(dest), V(Constant(1))});
                bind(skip);
                return;
            }
            break;
        }
        const Operand temp = newTemp(false, x.offset);
        generateInto(temp, n);
        emit(Op::SetVar, x.offset, {V(dest), V(temp)});
    }

    void jumpUnless(int n, int target)
    {
        const Node x = at(n);
        switch (x.kind) {
        case NodeKind::Const:
            if (x.value == 0) {
                emit(Op::Jump, x.offset, {L(target)});
            }
            return;
        case NodeKind::Rel: {
            const Operand a = operandOf(x.a);
            const Operand b = operandOf(x.b);
            emit(Op::JumpUnless, x.offset, {V(a), B(x.op), V(b), L(target)});
            return;
        }
        case NodeKind::And:
            jumpUnless(x.a, target);
            jumpUnless(x.b, target);
            return;
        case NodeKind::Or: {
            const int second = newLabel();
            const int holds = newLabel();
            jumpUnless(x.a, second);
            emit(Op::Jump, x.offset, {L(holds)});
            bind(second);
            jumpUnless(x.b, target);
            bind(holds);
            return;
        }
        case NodeKind::Not: {
            const int skip = newLabel();
            jumpUnless(x.a, skip);
            emit(Op::Jump, x.offset, {L(target)});
            bind(skip);
            return;
        }
        default: {
            const Operand value = operandOf(n);
            emit(Op::JumpUnless, x.offset,
                 {V(value), B(static_cast<int>(Relation::NotEqual)), V(Constant(0)), L(target)});
            return;
        }
        }
    }

    // A condition's temporaries are dead once it has jumped, so the body may use them again.
    void condition(int n, int target)
    {
        const int liveGlobal = globalTemps_;
        const int liveLocal = localTemps_;
        jumpUnless(n, target);
        globalTemps_ = liveGlobal;
        localTemps_ = liveLocal;
    }

    int newLabel()
    {
        labels_.push_back(-1);
        return static_cast<int>(labels_.size()) - 1;
    }
    void bind(int label)
    {
        labels_[static_cast<std::size_t>(label)] = static_cast<int>(code_.size());
    }

    void emit(Op op, std::int32_t offset, std::initializer_list<Arg> args)
    {
        const OpInfo* info = FindOp(static_cast<std::uint8_t>(op));
        const bool immediate = out_.program.kind == ObjectKind::Immediate;
        if (immediate && info->mode == OpMode::P) {
            Fail(kProgramOnly, offset, info->mnemonic);
        }
        if (!immediate && info->mode == OpMode::I) {
            Fail(kImmediateOnly, offset, info->mnemonic);
        }
        if (code_.size() > (1u << 20)) { // far past any brick's memory and every jump
            Fail(kParserStack, offset, routineName_);
        }
        const std::size_t start = code_.size();
        code_.push_back(static_cast<std::uint8_t>(op));
        const Arg* arg = args.begin();
        for (const char* letter = info->operands; *letter != 0; ++letter, ++arg) {
            switch (*letter) {
            case 'v':
            case 'd':
                code_.push_back(static_cast<std::uint8_t>(arg->operand.source));
                code_.push_back(static_cast<std::uint8_t>(arg->operand.value & 0xFF));
                code_.push_back(static_cast<std::uint8_t>((arg->operand.value >> 8) & 0xFF));
                break;
            case 'w':
                code_.push_back(static_cast<std::uint8_t>(arg->number & 0xFF));
                code_.push_back(static_cast<std::uint8_t>((arg->number >> 8) & 0xFF));
                break;
            case 'j':
                fixups_.push_back({code_.size(), 0, arg->number});
                code_.push_back(0);
                code_.push_back(0);
                break;
            default:
                code_.push_back(static_cast<std::uint8_t>(arg->number));
                break;
            }
        }
        for (std::size_t f = fixups_.size(); f > 0 && fixups_[f - 1].at > start; --f) {
            fixups_[f - 1].end = static_cast<int>(code_.size());
        }
        sourceOffsets_.push_back(offset);
    }

    // --- immediate commands ---
    void compileImmediate()
    {
        out_.program.kind = ObjectKind::Immediate;
        out_.listing.blocks.emplace_back();
        block_ = &out_.listing.blocks.back();
        block_->name = "immediate";
        routineKind_ = Sym::Task;
        while (peek().kind() != Tok::End) {
            nodes_.clear();
            immediateCommand();
        }
        // Each instruction is one command.
        std::size_t at = 0;
        Instruction in;
        while (at < code_.size() && Decode(code_.data(), code_.size(), at, in)) {
            out_.program.immediate.emplace_back(code_.begin() + static_cast<long>(at),
                                                code_.begin() + static_cast<long>(at + in.size));
            at += in.size;
        }
        out_.program.commandCount = static_cast<int>(out_.program.immediate.size());
        block_->sourceOffsets = std::move(sourceOffsets_);
    }

    void immediateCommand()
    {
        const Token& t = peek();
        if (t.is(";")) {
            take();
            return;
        }
        if (t.kind() != Tok::Ident) {
            syntax(t);
        }
        const std::string_view w = t.text();
        take();
        if (w == "sound") {
            emit(Op::PlaySound, t.offset, {B(constantIn(0, 255))});
        } else if (w == "clear") {
            if (acceptWord("tasks")) {
                emit(Op::ClearTasks, t.offset, {});
            } else if (acceptWord("subs")) {
                emit(Op::ClearSubs, t.offset, {});
            } else {
                syntax(peek());
            }
        } else if (w == "start" || w == "stop") {
            if (w == "stop" && acceptWord("all")) {
                emit(Op::StopAll, t.offset, {});
            } else if (acceptWord("main")) {
                emit(w == "start" ? Op::StartTask : Op::StopTask, t.offset, {B(0)});
            } else {
                emit(w == "start" ? Op::StartTask : Op::StopTask, t.offset,
                     {B(constantIn(0, caps_.tasks - 1))});
            }
        } else if (w == "boot") {
            if (acceptWord("rom")) {
                emit(Op::BootRom, t.offset, {});
            } else if (acceptWord("firmware")) {
                emit(Op::BootFirmware, t.offset, {});
            } else {
                syntax(peek());
            }
        } else if (w == "brick") {
            if (acceptWord("alive")) {
                expect("?");
                emit(Op::Alive, t.offset, {});
            } else if (acceptWord("version")) {
                expect("?");
                emit(Op::Version, t.offset, {});
            } else {
                syntax(peek());
            }
        } else if (w == "battery") {
            expect("?");
            emit(Op::Battery, t.offset, {});
        } else if (w == "get") {
            getCommand(t);
        } else if (w == "set") {
            const Token& what = peek();
            if (acceptWord("slot")) {
                emit(Op::SelectSlot, t.offset, {B(constantIn(1, caps_.programSlots) - 1)});
            } else if (acceptWord("txpower")) {
                emit(Op::SetTxPower, t.offset, {B(constantIn(0, 255))});
            } else if (acceptWord("powerdown")) {
                emit(Op::SetPowerDown, t.offset, {B(constantIn(0, 255))});
            } else {
                syntax(what);
            }
        } else if (w == "poll") {
            pollCommand(t);
        } else if (outputWord(w, t)) {
        } else if (IsReserved(w)) {
            Fail(kProgramOnly, t.offset, w);
        } else {
            syntax(t);
        }
        accept(";");
    }

    void getCommand(const Token& t)
    {
        if (acceptWord("map")) {
            emit(Op::GetMap, t.offset, {});
        } else if (acceptWord("slot")) {
            emit(Op::GetSlot, t.offset, {});
        } else if (acceptWord("txpower")) {
            emit(Op::GetTxPower, t.offset, {});
        } else if (acceptWord("powerdown")) {
            emit(Op::GetPowerDown, t.offset, {});
        } else {
            // get <address>,<count>: a memory read of 1 to 256 bytes.
            const Token& address = peek();
            if (address.kind() != Tok::Number) {
                Fail(kBadGet, address.offset, Shown(address));
            }
            take();
            expect(",");
            const Token& count = peek();
            if (count.kind() != Tok::Number || count.value() < 1 || count.value() > 256 ||
                address.value() + count.value() > 0x10000) {
                Fail(kBadGet, count.offset, Shown(count));
            }
            take();
            emit(Op::GetMemory, t.offset, {B(address.value()), B(count.value())});
        }
    }

    void pollCommand(const Token& t)
    {
        static constexpr struct {
            std::string_view word;
            Source source;
        } kSources[] = {{"var", Source::Variable},
                        {"timer", Source::Timer},
                        {"counter", Source::Counter},
                        {"input", Source::Input}};
        for (const auto& entry : kSources) {
            if (acceptWord(entry.word)) {
                const int high = entry.source == Source::Variable  ? caps_.globals
                                 : entry.source == Source::Timer   ? caps_.timers
                                 : entry.source == Source::Counter ? caps_.counters
                                                                   : caps_.inputs;
                const int index = constantIn(entry.source == Source::Input ? 1 : 0,
                                             entry.source == Source::Input ? high : high - 1);
                const int value = entry.source == Source::Input ? index - 1 : index;
                emit(Op::Poll, t.offset,
                     {V(Operand{entry.source, static_cast<std::int16_t>(value)})});
                return;
            }
        }
        syntax(peek());
    }

    struct Fixup {
        std::size_t at;
        int end;
        int label;
    };
    struct Init {
        int index;
        int value;
        std::int32_t offset;
    };

    int brickType_;
    const Capacities& caps_;
    TranslateLimits limits_;
    const std::vector<Token>& tokens_;
    std::size_t pos_ = 0;
    CompiledScript out_;

    std::unordered_map<std::string_view, Symbol> globals_;
    std::unordered_map<std::string_view, Symbol> locals_;
    std::vector<Init> inits_;
    std::vector<CallSite> calls_;
    int globalCount_ = 0;
    int timerCount_ = 0;
    int counterCount_ = 0;
    int eventCount_ = 0;
    int semaphoreCount_ = 0;

    // The routine being compiled.
    Sym routineKind_ = Sym::Task;
    int routineNumber_ = 0;
    std::string_view routineName_;
    ListingInfo::Block* block_ = nullptr;
    std::vector<std::uint8_t> code_;
    std::vector<std::int32_t> sourceOffsets_;
    std::vector<int> labels_;
    std::vector<Fixup> fixups_;
    int localCount_ = 0;
    int globalTemps_ = 0;
    int localTemps_ = 0;

    std::vector<Node> nodes_;
    int exprDepth_ = 0;
};

} // namespace

CompiledScript CompileScript(int brickType, const TranslateLimits& limits,
                             const std::vector<Token>& tokens)
{
    Compiler compiler(brickType, limits, tokens);
    return compiler.run();
}

} // namespace tessel::lang
