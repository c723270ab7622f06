#include "ui/qt/FontWarmUp.h"

#if HARBOR_HAVE_FONTCONFIG
#include <fontconfig/fontconfig.h>
#endif

namespace ui {

FontWarmUp::FontWarmUp()
{
#if HARBOR_HAVE_FONTCONFIG
    // Qt asks for the current configuration, which is then the one loaded here.
    thread_ = std::thread([] { FcInit(); });
#endif
}

FontWarmUp::~FontWarmUp()
{
    if (thread_.joinable())
        thread_.join();
}

} // namespace ui
