#include "Translator.h"

#include <new>

#include "Assembler.h"
#include "Capacities.h"
#include "Failure.h"
#include "Firmware.h"
#include "Lexer.h"
#include "Listing.h"
#include "Program.h"
#include "ScriptCompiler.h"

namespace tessel::lang {
namespace {

void Produce(const TranslateRequest& request, const TranslateLimits& limits,
             TranslateResult& result)
{
    if (request.targetType != TargetObject && request.targetType != TargetListing) {
        FailPacked(LibraryError(kBadTargetType), 0);
    }
    if (request.sourceType < SourceScript || request.sourceType > SourceFirmware) {
        FailPacked(LibraryError(kBadSourceType), 0);
    }
    if (!CapacitiesOf(request.brickType).supported) {
        Fail(kBadTarget, 0);
    }
    if (request.source.size() > limits.maxSourceBytes) {
        Fail(kSourceRead, 0, "source too large");
    }
    Program program;
    ListingInfo listing;
    bool assembled = false;
    switch (request.sourceType) {
    case SourceScript:
        break; // below: it needs the limits of the translator
    case SourceOpal:
        program = Assemble(request.brickType, request.source);
        assembled = true;
        break;
    case SourceRaw:
        program = AssembleRaw(request.brickType, request.source);
        assembled = true;
        break;
    case SourceObject: {
        const ParseResult parsed = ParseObject(request.source, program);
        if (parsed.code < 0) {
            FailPacked(parsed.code, parsed.offset, parsed.detail);
        }
        if (program.brickType != request.brickType) {
            Fail(kBadTarget, 0, "brick type");
        }
        break;
    }
    case SourceFirmware:
        if (request.targetType != TargetObject) {
            FailPacked(LibraryError(kBadTargetType), 0);
        }
        program = ReadFirmware(request.brickType, request.source);
        break;
    default:
        break;
    }
    if (assembled) {
        // The object reader checks what the assembler cannot see line by line: jumps of RAW
        // code landing between instructions.
        Program check;
        const ParseResult parsed = ParseObject(WriteObject(program), check);
        if (parsed.code < 0) {
            FailPacked(parsed.code, 0, parsed.detail);
        }
    }
    (void)listing;
    result.output =
        request.targetType == TargetObject ? WriteObject(program) : WriteListing(program, listing);
}

} // namespace

TranslateResult Translator::translate(const TranslateRequest& request)
{
    TranslateResult result;
    try {
        if (request.sourceType == SourceScript && request.targetType != TargetObject &&
            request.targetType != TargetListing) {
            FailPacked(LibraryError(kBadTargetType), 0);
        }
        if (request.sourceType == SourceScript) {
            if (!CapacitiesOf(request.brickType).supported) {
                Fail(kBadTarget, 0);
            }
            Lexer lexer(limits_, request.includes);
            const std::vector<Token> tokens = lexer.run(request.source);
            CompiledScript compiled = CompileScript(request.brickType, limits_, tokens);
            result.symbols = std::move(compiled.symbols);
            result.output = request.targetType == TargetObject
                                ? WriteObject(compiled.program)
                                : WriteListing(compiled.program, compiled.listing);
        } else {
            Produce(request, limits_, result);
        }
        return result;
    } catch (Failure& failure) {
        result = TranslateResult{};
        result.code = failure.code;
        result.offset = failure.offset;
        result.detail = std::move(failure.detail);
    } catch (const std::bad_alloc&) {
        result = TranslateResult{};
        result.code = CompilerError(255);
    }
    if (request.diagnostics != nullptr) {
        request.diagnostics->report(result.code, result.offset, result.detail.c_str());
    }
    return result;
}

const char* SourceTypeName(int index, int* type)
{
    static constexpr struct {
        int type;
        const char* name;
    } kNames[] = {{1, "Script"}, {2, "Opal"}, {3, "RAW"}, {4, "BIN"}, {5, "Firmware"}};
    if (index < 0 || index >= 5) {
        return nullptr;
    }
    if (type != nullptr) {
        *type = kNames[index].type;
    }
    return kNames[index].name;
}

const char* TargetTypeName(int index, int* type)
{
    static constexpr struct {
        int type;
        const char* name;
    } kNames[] = {{4, "BIN"}, {7, "CSV"}};
    if (index < 0 || index >= 2) {
        return nullptr;
    }
    if (type != nullptr) {
        *type = kNames[index].type;
    }
    return kNames[index].name;
}

} // namespace tessel::lang
