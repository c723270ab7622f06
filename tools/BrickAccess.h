// What the brick tools need of the brick session: a few thin methods and the script runner.
// The tools talk to this seam rather than to BrickSession itself so that their logic can be
// exercised against a scripted brick; SessionBrickAccess forwards to the real session.
#pragma once

#include <cstdint>

#include "tessel/TesselApi.h"

class BrickSession;
class IError;
class ReaderWriter;

namespace tools {

class BrickAccess {
public:
    virtual ~BrickAccess() = default;

    virtual tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value,
                             char* text, tessel::Size size) = 0;
    virtual tessel::Long Info(tessel::Short brickType, tessel::Short infoId,
                              tessel::Short* value) = 0;
    virtual tessel::Long FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                                   tessel::Size size) = 0;
    virtual tessel::Long FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                                  tessel::Size size) = 0;
    virtual tessel::Long TranslateText(tessel::Short brickType, std::int32_t type, const char* text,
                                       ReaderWriter** code, IError* sink, ReaderWriter* extra1,
                                       ReaderWriter* extra2) = 0;
    virtual tessel::Long ExecCode(tessel::Long hBrick, ReaderWriter* code, tessel::Long* result,
                                  ReaderWriter** resultFile, tessel::Callback callback,
                                  void* context) = 0;
    virtual tessel::Long RunImmediate(tessel::Long hBrick, const char* text,
                                      tessel::Long* result) = 0;
};

// Forwards every call to a session that outlives it.
class SessionBrickAccess final : public BrickAccess {
public:
    explicit SessionBrickAccess(BrickSession& session) : session_(session) {}

    tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value, char* text,
                     tessel::Size size) override;
    tessel::Long Info(tessel::Short brickType, tessel::Short infoId, tessel::Short* value) override;
    tessel::Long FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                           tessel::Size size) override;
    tessel::Long FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                          tessel::Size size) override;
    tessel::Long TranslateText(tessel::Short brickType, std::int32_t type, const char* text,
                               ReaderWriter** code, IError* sink, ReaderWriter* extra1,
                               ReaderWriter* extra2) override;
    tessel::Long ExecCode(tessel::Long hBrick, ReaderWriter* code, tessel::Long* result,
                          ReaderWriter** resultFile, tessel::Callback callback,
                          void* context) override;
    tessel::Long RunImmediate(tessel::Long hBrick, const char* text, tessel::Long* result) override;

private:
    BrickSession& session_;
};

} // namespace tools
