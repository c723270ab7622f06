// tslValidate and tslTranslate: the workspace side of a translation. The translator itself is
// pure (sim/lang); here its input is read from the source handle, includes are looked up in
// the client's tree, and the output, the symbol table and the context go back into the tree.
#include <cctype>
#include <cstdio>

#include "Codes.h"
#include "Files.h"
#include "Library.h"
#include "lang/Translator.h"
#include "tessel/DirEnt.h"
#include "tessel/IError.h"
#include "tessel/ReaderWriter.h"

namespace sim {
namespace {

// Include files live in "/Script/Include/" under their lower-cased names.
class WorkspaceIncludes : public tessel::lang::IncludeReader {
public:
    explicit WorkspaceIncludes(ReaderWriter* source) : source_(source) {}
    virtual ~WorkspaceIncludes() = default;

    bool readInclude(const std::string& lowerCasedName, std::string& text) override
    {
        std::string path = "/Script/Include/";
        for (char c : lowerCasedName) {
            path += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        }
        DirEnt* entry = FindFrom(source_, path.c_str());
        if (entry == nullptr || entry->isDirectory()) {
            return false;
        }
        ReaderWriter* handle = entry->open(tessel::FileScript);
        if (handle == nullptr) {
            return false;
        }
        const bool ok = ReadAll(handle, text);
        handle->release();
        return ok;
    }

private:
    ReaderWriter* source_;
};

// Hands the translator's one failure report to the client's sink.
class SinkDiagnostics : public tessel::lang::Diagnostics {
public:
    explicit SinkDiagnostics(IError* sink) : sink_(sink) {}
    virtual ~SinkDiagnostics() = default;

    void report(std::int32_t code, std::int32_t offset, const char* detail) override
    {
        if (sink_ != nullptr) {
            sink_->SetError(code, offset, detail);
        }
    }

private:
    IError* sink_;
};

// Reads the source whole and translates it, includes coming from the client's tree and the
// failure report going to sink. Returns the code of a failed read, else kOk with the
// translator's outcome in result.
Long ReadAndTranslate(ReaderWriter* source, IError* sink, Short brickType, std::int32_t sourceType,
                      std::int32_t targetType, std::string& text,
                      tessel::lang::TranslateResult& result)
{
    const ReadResult read = Read(source, text);
    if (read != ReadResult::Ok) {
        // A source too large to hold is the compiler's "error while reading source file".
        return read == ReadResult::TooLarge ? Compiler(152) : kBadSource;
    }
    WorkspaceIncludes includes(source);
    SinkDiagnostics diagnostics(sink);
    tessel::lang::TranslateRequest request;
    request.brickType = brickType;
    request.sourceType = sourceType;
    request.targetType = targetType;
    request.source = text;
    request.includes = &includes;
    request.diagnostics = &diagnostics;
    result = tessel::lang::Translator().translate(request);
    return kOk;
}

} // namespace

Long Library::validate(Short brickType, ReaderWriter* source, IError* sink, ReaderWriter* extra1,
                       ReaderWriter* extra2)
{
    if (source == nullptr) {
        return kNullParameter;
    }
    const std::int32_t type = source->type();
    if (type < tessel::FileScript || type > tessel::FileFirmware) {
        return kBadSourceType;
    }
    std::string text;
    tessel::lang::TranslateResult result;
    const Long read =
        ReadAndTranslate(source, sink, brickType, type, tessel::lang::TargetObject, text, result);
    if (read != kOk) {
        return read;
    }
    trace_.line("tslValidate(%d, type %d) -> 0x%x", brickType, type,
                static_cast<unsigned>(result.code));
    return result.code;
}

Long Library::translate(Short brickType, ReaderWriter* source, ReaderWriter* target, IError* sink,
                        ReaderWriter* extra1, ReaderWriter* extra2)
{
    if (source == nullptr || target == nullptr) {
        return kNullParameter;
    }
    const std::int32_t sourceType = source->type();
    if (sourceType < tessel::FileScript || sourceType > tessel::FileFirmware) {
        return kBadSourceType;
    }
    const std::int32_t targetType = target->type();
    if (targetType != tessel::FileCode && targetType != tessel::FileCsvListing) {
        return kBadTargetType;
    }
    std::string text;
    tessel::lang::TranslateResult result;
    const Long read =
        ReadAndTranslate(source, sink, brickType, sourceType, targetType, text, result);
    if (read != kOk) {
        return read;
    }
    trace_.line("tslTranslate(%d, type %d -> %d, %zu bytes) -> 0x%x", brickType, sourceType,
                targetType, text.size(), static_cast<unsigned>(result.code));
    if (result.code < 0) {
        return result.code;
    }
    if (!WriteAll(target, result.output)) {
        return kBadTarget;
    }
    // Scratch files beside the working files, when the client provides them: the symbol table
    // and what the last translation was asked to do. Missing ones are simply not written.
    if (sourceType == tessel::FileScript) {
        WriteBeside(source, "symtab.txt", result.symbols);
    }
    char context[160];
    std::snprintf(context, sizeof context,
                  "brick type %d\nsource type %d, %zu bytes\ntarget type %d, %zu bytes\n",
                  brickType, sourceType, text.size(), targetType, result.output.size());
    WriteBeside(source, "context.txt", context);
    return kOk;
}

} // namespace sim
