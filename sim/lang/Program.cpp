#include "Program.h"

namespace tessel::lang {

const Routine* Program::find(RoutineKind routineKind, int number) const
{
    for (const Routine& routine : routines) {
        if (routine.kind == routineKind && routine.number == number) {
            return &routine;
        }
    }
    return nullptr;
}

ParseResult ParseObject(std::string_view text, Program& out)
{
    (void)text;
    out = Program{};
    return ParseResult{};
}

std::string WriteObject(const Program& program)
{
    (void)program;
    return "tobj 1 6 immediate\n";
}

} // namespace tessel::lang
