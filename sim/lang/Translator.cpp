#include "Translator.h"

#include "Status.h"

namespace tessel::lang {

TranslateResult Translator::translate(const TranslateRequest& request)
{
    TranslateResult result;
    result.code = CompilerError(255);
    if (request.diagnostics != nullptr) {
        request.diagnostics->report(result.code, 0, "");
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
