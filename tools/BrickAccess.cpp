#include "tools/BrickAccess.h"

#include "session/BrickSession.h"

namespace tools {

tessel::Long SessionBrickAccess::Get(tessel::Long hBrick, tessel::Short property,
                                     tessel::Short* value, char* text, tessel::Size size)
{
    return session_.Get(hBrick, property, value, text, size);
}

tessel::Long SessionBrickAccess::Info(tessel::Short brickType, tessel::Short infoId,
                                      tessel::Short* value)
{
    return session_.Info(brickType, infoId, value);
}

tessel::Long SessionBrickAccess::FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                                           tessel::Size size)
{
    return session_.FindFirst(enumType, item, name, size);
}

tessel::Long SessionBrickAccess::FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                                          tessel::Size size)
{
    return session_.FindNext(enumType, item, name, size);
}

tessel::Long SessionBrickAccess::TranslateText(tessel::Short brickType, std::int32_t type,
                                               const char* text, ReaderWriter** code, IError* sink,
                                               ReaderWriter* extra1, ReaderWriter* extra2)
{
    return session_.TranslateText(brickType, type, text, code, sink, extra1, extra2);
}

tessel::Long SessionBrickAccess::ExecCode(tessel::Long hBrick, ReaderWriter* code,
                                          tessel::Long* result, ReaderWriter** resultFile,
                                          tessel::Callback callback, void* context)
{
    return session_.ExecCode(hBrick, code, result, resultFile, callback, context);
}

tessel::Long SessionBrickAccess::RunImmediate(tessel::Long hBrick, const char* text,
                                              tessel::Long* result)
{
    return session_.RunImmediate(hBrick, text, result);
}

} // namespace tools
